#!/bin/bash
# Every fetcher's result on a populated host whose every text ends in control characters:
# json-pretty has the same fields as json, csv a header row of the json field names (that
# each format parses, test_bad_input.sh checks), and simple and table show no control
# character raw (C0 but their own line feeds, DEL, C1). Their json, and that of a few
# changes, matches the schema that the JSON reference gives.
. "$(dirname "$0")/lib.sh"

# A stretched cluster, so that the preferred fault domain can be read too.
sim populate --luns 3 --agents 2 --nics 2
expect_rc 0
sim load --merge - <<<'{"cluster":{"stretched":true}}'
expect_rc 0
# Every text but UUIDs, addresses and the service state: a window title, a screen clear, a C1
# control sequence introducer and a tab.
EVIL=$'\e]0;owned\a\e[2J\xc2\x9b1m\t'
sim show
sim load - <<<"$(jq --arg evil "$EVIL" 'walk(if type == "string" and
    (test("^([0-9a-fA-F.:-]*|running|stopped)$") | not) then . + $evil else . end)' <<<"$OUT")"
expect_rc 0
ok mesk storage list --formatter table
expect_out_has '\x1b]0;owned\x07\x1b[2J\u009b1m\t'

# The fetchers, as the reference lists them: new ones are covered without editing this file.
mapfile -t FETCHERS < <("$AUTOCLI" --reference |
    awk '/^## `/ { path = substr($0, 5, length($0) - 5) } /^Type: fetcher/ { print path }')
expect_eq "$([ "${#FETCHERS[@]}" -ge 10 ] && echo many)" many "fetchers found in the reference"

RESULTS="$E2E_DIR/results"
mkdir -p "$RESULTS"
for command in "${FETCHERS[@]}"; do
    case_ "$command in json, json-pretty and csv"
    # shellcheck disable=SC2086
    ok $command --formatter json
    json="$OUT"
    printf '%s\n' "$json" >"$RESULTS/$command.json"
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
        expect_eq "${OUT%%$'\r\n'*}" "$header" "csv header"
    fi
    for format in simple table; do
        # shellcheck disable=SC2086
        raw=$("$AUTOCLI" $command --formatter $format |
            LC_ALL=C grep -caP '[\x00-\x09\x0b-\x1f\x7f]|\xc2[\x80-\x9f]')
        expect_eq "$raw" 0 "lines with a raw control character in $format"
    done
done

case_ "changes, and a read not marked fetcher, in json"
for words in "mesk datastore name set --newname scripted" "mesk storage automode set --enabled true" \
    "mesk cluster unicastagent add -a 10.9.9.9 -p 12321" "mesk cluster unicastagent list" \
    "mesk cluster leave" "mesk cluster new"; do
    # shellcheck disable=SC2086
    ok $words --formatter json
    printf '%s\n' "$OUT" >"$RESULTS/${words%% -*}.json"
done

case_ "each json result matches its schema, fields in order; a wrong type or extra field fails"
"$AUTOCLI" --reference --formatter json >"$E2E_DIR/reference.json"
_capture python3 - "$E2E_DIR/reference.json" "$RESULTS"/*.json <<'EOF'
import json, os, sys
import jsonschema

schemas = {c["path"]: c["output"] for c in json.load(open(sys.argv[1]))["commands"]}

def in_order(doc, schema):  # JSON Schema has no order: "required" lists the fields in order
    if isinstance(doc, dict):
        assert list(doc) == schema["required"], f"order {list(doc)}"
        for key, value in doc.items():
            in_order(value, schema["properties"][key])
    elif isinstance(doc, list):
        for value in doc:
            in_order(value, schema["items"])

def wrong_type(doc):  # doc with its first scalar of another type, or None
    if isinstance(doc, (dict, list)):
        for key, value in (doc.items() if isinstance(doc, dict) else enumerate(doc)):
            changed = wrong_type(value)
            if changed is not None:
                copy = doc.copy()
                copy[key] = changed
                return copy
        return None
    return None if doc is None else 0 if isinstance(doc, str) else "text"

def extra_field(doc):  # doc with one more field in its first object, or None
    if isinstance(doc, dict):
        return {**doc, "Extra": None}
    return [extra_field(doc[0])] + doc[1:] if isinstance(doc, list) and doc else None

for name in sys.argv[2:]:
    path = os.path.basename(name)[: -len(".json")]
    schema = schemas[path]
    validator = jsonschema.validators.validator_for(schema)
    assert validator is jsonschema.Draft202012Validator, path
    validator.check_schema(schema)
    doc = json.load(open(name))
    try:
        validator(schema).validate(doc)
        in_order(doc, schema)
        for bad in (wrong_type(doc), extra_field(doc)):
            if bad is not None and validator(schema).is_valid(bad):
                print(f"{path}: accepted {json.dumps(bad)[:200]}")
    except (jsonschema.ValidationError, AssertionError) as error:
        print(f"{path}: {str(error)[:400]}")
print(len(sys.argv) - 2, "results")
EOF
expect_rc 0
expect_out "$(ls "$RESULTS" | wc -l) results"

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
