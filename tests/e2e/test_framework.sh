#!/bin/bash
# The real autocli executable and its loading of plug-ins, over the second test plug-in
# (`mesk other hello`): exports, versions, help, unusable libraries. How a command line runs
# (statuses, streams, messages, output) is the framework unit tests' concern.
. "$(dirname "$0")/lib.sh"

case_ "the mesk plug-in exports its entry point and nothing else"
MESK_PLUGINS="${AUTOCLI_PLUGIN_PATH:-$(dirname "$AUTOCLI")/../../plugins}"
EXPORTS=$(nm -D --defined-only "${MESK_PLUGINS%%:*}/libmesk.so" | awk '{ print $NF }')
expect_eq "$EXPORTS" "AutoCli_RegisterNamespaces" "symbols that libmesk.so defines"

PLUGINS="${MESK_TEST_PLUGIN_DIR:-$(dirname "$AUTOCLI")/../../test-plugins}"
export AUTOCLI_PLUGIN_PATH="$PLUGINS"

case_ "--version names autocli's version and each plug-in's, from the plug-in's own note"
MESK_DIR="${MESK_PLUGINS%%:*}"
AUTOCLI_PLUGIN_PATH="$MESK_DIR:$PLUGINS" run --version
expect_rc 0
VERSION=$(sed -n 's/^autocli \([0-9][0-9.]*\)$/\1/p' <<<"$OUT")
expect_eq "$(grep -c . <<<"$VERSION")" 1 "autocli's version line"
expect_out_has "plug-in mesk $VERSION: $MESK_DIR/libmesk.so"
expect_out_has "plug-in without a version: $PLUGINS/libother_mesk_plugin.so"
sim --version
expect_out "hostsim $VERSION"

case_ "a command's help"
ok mesk other hello -h
expect_out_has "  -c, --count <integer>  How many times to greet (0-512)."

case_ "an exception from a plug-in's tree or declarations, wherever autocli reaches them"
while read -r status words; do
    # shellcheck disable=SC2086
    OTHER_PLUGIN_THROW=1 run $words
    expect_rc "$status"
    if [ "$status" -eq 0 ]; then expect_err ""; else expect_err_has "failed: broken "; fi
done <<'ROWS'
1 --reference
1 mesk other --help
1 mesk --list-commands
1 mesk other hello -n bob
1 mesk other hello --reference
0 __complete mesk other hello --
ROWS

case_ "unusable libraries in a plug-in directory are reported and skipped"
BROKEN="$E2E_DIR/plugins"
mkdir -p "$BROKEN"
echo "not a library" >"$BROKEN/broken.so"
cp "$PLUGINS/libother_mesk_plugin.so" "$BROKEN/"
AUTOCLI_PLUGIN_PATH="$BROKEN" run mesk other hello -n bob --formatter json
expect_rc 0
expect_err_has "autocli: cannot load plug-in $BROKEN/broken.so: "

case_ "no plug-ins at all"
AUTOCLI_PLUGIN_PATH="$E2E_DIR/empty:$E2E_DIR/none" run mesk
expect_rc 2
expect_err "autocli: no plug-in was found in $E2E_DIR/empty, $E2E_DIR/none (AUTOCLI_PLUGIN_PATH, directories separated by colons, changes where)
autocli: 'mesk' is not a namespace or command; no commands are registered"

finish
