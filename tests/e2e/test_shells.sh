#!/bin/bash
# Completion as a person meets it: each shell's adaptor (`autocli completion SHELL`) loaded in
# a real interactive shell on a pseudo-terminal, a line typed and Tab pressed. bash always;
# zsh and fish where they are installed. `__complete` itself over two plug-ins, one of them
# unloadable. Help is wrapped to a terminal's width, and only there.
. "$(dirname "$0")/lib.sh"

BIN="$E2E_DIR/bin"
mkdir -p "$BIN" "$E2E_DIR/cwd"
ln -s "$AUTOCLI" "$BIN/autocli"
touch "$E2E_DIR/cwd/zzfile"
cd "$E2E_DIR/cwd"

# The typed line | what the line must read after Tab ("!" before it: must not read)
CASES='autocli mesk sto|autocli mesk storage
autocli mesk storage list --formatter x|--formatter xml
autocli --formatter=x|--formatter=xml
autocli mesk storage list --fields Dev|--fields Device
autocli mesk storage list --fields Device,Disp|--fields Device,Display\ Name
autocli mesk storage list -d zz|!zzfile
autocli mesk trace set -p zz|-p zzfile'

# A root without pseudo-terminals (a chroot without /dev/pts) cannot run an interactive shell.
if ! python3 -c 'import os; os.openpty()' 2>/dev/null; then
    echo "skipped: no pseudo-terminal can be opened here" >&2
    SHELLS=""
else
    SHELLS="bash zsh fish"
fi
for shell in $SHELLS; do
    if ! command -v "$shell" >/dev/null; then
        echo "skipped: $shell is not installed" >&2
        continue
    fi
    ok completion "$shell"
    printf '%s\n' "$OUT" >"$E2E_DIR/completion.$shell"
    lines=()
    while IFS='|' read -r line expected; do lines+=("$line"); done <<<"$CASES"
    _capture env PATH="$BIN:$PATH" timeout 120 python3 "$MESK_SOURCE_DIR/tests/e2e/type_in_shell.py" \
        "$shell" "source $E2E_DIR/completion.$shell" "${lines[@]}"
    SHOWN=$OUT
    while IFS='|' read -r line expected; do
        case_ "$shell: $line"
        OUT=$(grep -F "$line"$'\t' <<<"$SHOWN" | cut -f2-)
        if [[ $expected == !* ]]; then
            expect_out_lacks "${expected#!}"
        else
            expect_out_has "$expected"
        fi
    done <<<"$CASES"
done

case_ "__complete over both plug-ins; one that cannot be loaded stays silent"
mkdir -p "$E2E_DIR/broken"
echo "not a library" >"$E2E_DIR/broken/broken.so"
PLUGINS="$E2E_DIR/broken:${MESK_TEST_PLUGIN_DIR:?}"
AUTOCLI_PLUGIN_PATH="$PLUGINS" run __complete mesk o
expect_rc 0
expect_out "other
:4"
expect_err ""

case_ "help is wrapped to the terminal's width, and whole in a pipe"
if [ -n "$SHELLS" ]; then
    _capture script -qec "stty cols 80; $AUTOCLI mesk policy setdefault --help" /dev/null
    expect_rc 0
    expect_eq "$(tr -d '\r' <<<"$OUT" | awk 'length > 79' | head -3)" "" "lines wider than the terminal"
fi
run mesk policy setdefault --help
expect_eq "$(awk 'length > 300 { print "long" }' <<<"$OUT" | head -1)" long "a help line left whole"

finish
