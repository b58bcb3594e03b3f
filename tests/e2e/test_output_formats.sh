#!/bin/bash
# Every fetcher's result on a populated host: json-pretty has the same fields as json, and csv
# a header row of the json field names (that each format parses, test_bad_input.sh checks).
. "$(dirname "$0")/lib.sh"

# A stretched cluster, so that the preferred fault domain can be read too.
sim populate --luns 3 --agents 2 --nics 2
expect_rc 0
sim load --merge - <<<'{"cluster":{"stretched":true}}'
expect_rc 0

# The fetchers, as the reference lists them: new ones are covered without editing this file.
mapfile -t FETCHERS < <("$AUTOCLI" --reference |
    awk '/^## `/ { path = substr($0, 5, length($0) - 5) } /^Type: fetcher/ { print path }')
expect_eq "$([ "${#FETCHERS[@]}" -ge 10 ] && echo many)" many "fetchers found in the reference"

for command in "${FETCHERS[@]}"; do
    case_ "$command in json, json-pretty and csv"
    # shellcheck disable=SC2086
    ok $command --formatter json
    json="$OUT"
    # shellcheck disable=SC2086
    run $command --formatter json-pretty
    # The same fields in the same order (values may move on: cluster get tells the time).
    expect_eq "$(jq -c '[paths]' <<<"$OUT")" "$(jq -c '[paths]' <<<"$json" || echo unreadable)" \
        "json-pretty against json"
    # shellcheck disable=SC2086
    ok $command --formatter csv
    header=$(jq -r 'if type == "array" then .[0] else . end
                    | if type == "object" then keys_unsorted | join(",") else "value" end' <<<"$json")
    if [ "$json" != "[]" ]; then
        expect_eq "${OUT%%$'\n'*}" "$header" "csv header"
    fi
done

# A result reaches stdout whole, or the run fails: a full device (every path that prints), a
# non-blocking pipe read slowly, a reader that stops early (SIGPIPE as inherited, or ignored).
"$AUTOCLI" mesk cluster get >/dev/null
while read -r tool words; do
    case_ "$tool $words > /dev/full"
    # shellcheck disable=SC2086
    RC=0 && ERR=$("${!tool}" $words 2>&1 >/dev/full) || RC=$?
    expect_rc 1
    expect_err "${tool,,}: write error: No space left on device"
done <<'ROWS'
AUTOCLI mesk storage list
AUTOCLI mesk --help
AUTOCLI --reference
AUTOCLI completion bash
AUTOCLI __complete mesk st
AUTOCLI --version
HOSTSIM show
HOSTSIM calls
HOSTSIM --help
HOSTSIM --version
ROWS
sim populate --luns 4096
for program in "$AUTOCLI mesk storage list --formatter=json" "$HOSTSIM show"; do
    case_ "$program: a non-blocking stdout read slowly"
    # shellcheck disable=SC2086
    SIZE=$($program | wc -c)
    # shellcheck disable=SC2086
    expect_eq "$(python3 -c 'import os, subprocess, sys, time
r, w = os.pipe(); os.set_blocking(w, False)
child = subprocess.Popen(sys.argv[1:], stdout=w); os.close(w); size = 0
while chunk := os.read(r, 4096): size += len(chunk); time.sleep(0.0005)
print(child.wait(), size)' $program)" "0 $SIZE" "status and bytes read"
    for pipe in "" PIPE; do
        case_ "$program | head -c 10, SIGPIPE ${pipe:-as inherited}${pipe:+ ignored}"
        # shellcheck disable=SC2086
        RC=$([ -z "$pipe" ] || trap '' PIPE
            $program 2>"$E2E_DIR/err" | head -c 10 >/dev/null
            echo "${PIPESTATUS[0]}")
        expect_eq "$RC" "$([ -n "$pipe" ] && echo 1 || echo 141)" "status"
        expect_eq "$(cat "$E2E_DIR/err")" "" "stderr"
    done
done

finish
