#!/bin/bash
# Every fetcher's result on a populated simulated host, read back by standard tools: json and
# json-pretty by jq (the same document), xml by xmllint, csv with a header row of the json
# field names. Then a host text full of markup, separators and control characters, read back
# unchanged from each format.
. "$(dirname "$0")/lib.sh"

sim populate --luns 3 --agents 2 --nics 2
expect_rc 0
# A stretched cluster, so that the preferred fault domain can be read too.
sim load --merge - <<<'{"cluster":{"stretched":true}}'
expect_rc 0

# The fetchers, as the reference lists them: new ones are covered without editing this file.
mapfile -t FETCHERS < <("$AUTOCLI" --reference |
    awk '/^## `/ { path = substr($0, 5, length($0) - 5) } /^Type: fetcher/ { print path }')
expect_eq "$([ "${#FETCHERS[@]}" -ge 10 ] && echo many)" many "fetchers found in the reference"

for command in "${FETCHERS[@]}"; do
    case_ "$command in every machine format"
    # shellcheck disable=SC2086
    run $command --formatter json
    expect_rc 0
    json="$OUT"
    if jq -e . >/dev/null <<<"$json"; then _pass; else _fail "jq cannot read the json"; fi
    # shellcheck disable=SC2086
    run $command --formatter json-pretty
    expect_eq "$(jq -cS . <<<"$OUT")" "$(jq -cS . <<<"$json")" "json-pretty against json"
    # shellcheck disable=SC2086
    run $command --formatter xml
    expect_rc 0
    if xmllint --noout - <<<"$OUT" 2>/dev/null; then _pass; else _fail "xmllint refused the xml"; fi
    # shellcheck disable=SC2086
    run $command --formatter csv
    expect_rc 0
    header=$(jq -r 'if type == "array" then .[0] else . end
                    | if type == "object" then keys_unsorted | join(",") else "value" end' <<<"$json")
    if [ "$json" != "[]" ]; then
        expect_eq "${OUT%%$'\n'*}" "$header" "csv header"
    fi
done

case_ "a hostile datastore name reads back unchanged from json, xml and csv"
# Markup, separators, a quotation mark, a tab, a line break, a carriage return, U+00E9, and
# U+0001, which XML 1.0 cannot carry at all.
sim load --merge - <<<'{"settings":{"datastoreName":"a,b \"q\"\n<x>&amp; \u00e9\ttab\r\u0001"}}'
expect_rc 0
NAME=$(printf 'a,b "q"\n<x>&amp; \xc3\xa9\ttab\r\x01.')
NAME=${NAME%.}
run mesk datastore name get --formatter json
expect_eq "$(jq -r .Name <<<"$OUT"; echo .)" "$NAME"$'\n.' "json Name"
run mesk datastore name get --formatter xml
xml_name=$(xmllint --xpath 'string(/output/structure/field[@name="Name"]/string)' - <<<"$OUT"; echo .)
expect_eq "${xml_name%$'\n.'}" "${NAME%$'\x01'}" "xml Name, without U+0001"
run mesk datastore name get --formatter csv
# One column: the quoted cell after the header line, quotation marks undoubled.
cell=${OUT#Name$'\n'}
cell=${cell#\"}
cell=${cell%\"}
expect_eq "${cell//\"\"/\"}" "$NAME" "csv Name"

finish
