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

finish
