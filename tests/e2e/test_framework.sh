#!/bin/bash
# autocli itself, driven over the second test plug-in (`mesk other hello`): exit statuses,
# what goes to stdout and stderr, help, the command list, the formatters, and plug-in
# directories holding libraries that cannot be used.
. "$(dirname "$0")/lib.sh"

PLUGINS="${MESK_TEST_PLUGIN_DIR:-$(dirname "$AUTOCLI")/../../test-plugins}"
export AUTOCLI_PLUGIN_PATH="$PLUGINS"

case_ "help of the root, a namespace and a command"
run --help
expect_rc 0
expect_out_has "mesk  Other mesk"
expect_out_has "--formatter NAME"
expect_err ""
run mesk other --help
expect_rc 0
expect_out_has "hello  Greet someone from the second plug-in."
run mesk other hello -h
expect_rc 0
expect_out_has "  -c, --count <integer>  How many times to greet (0-512)."
expect_out_has "Role of the greeted node (One of witness, node, default is witness)."
expect_out_has "Who to greet. (required)"
expect_err ""

case_ "a path that stops at a namespace prints its help and fails"
run mesk other
expect_rc 2
expect_out_has "hello  Greet someone"
expect_err "autocli: mesk other: missing command; valid choices: hello"

case_ "an unknown word names the valid choices"
run mesk othr hello
expect_rc 2
expect_out ""
expect_err_has "'othr' is not a namespace or command in 'mesk'; valid choices: other"

case_ "--list-commands"
run --list-commands
expect_rc 0
expect_out "mesk other hello"

case_ "simple output: title from a field, display order, units, joined lists"
run mesk other hello -n bob -c 3 -i apple -i pear --loud true -w --role node
expect_rc 0
expect_out "Hello, bob! (waving) the node
   Greeting: Hello, bob! (waving) the node
   Items: apple, pear
   Count: 3 times"
expect_err ""

case_ "the other formatters, chosen before or after the command"
run --formatter=json mesk other hello -n bob -i a
expect_out '{"Greeting":"Hello, bob","Count":1,"Items":["a"],"Ok":true}'
run mesk other hello --name=bob --formatter table
expect_out "Greeting    Items  Count
----------  -----  -------
Hello, bob         1 times"
run mesk other hello -n 'a "b", c' -i x -i y --formatter csv --fields Count,Greeting
expect_out 'Count,Greeting
1,"Hello, a ""b"", c"'
run mesk other hello -n bob --formatter table --no-header --fields Ok
expect_out "true"
run mesk other hello -n '<&>' --formatter xml
expect_rc 0
if printf '%s\n' "$OUT" | xmllint --noout - 2>/dev/null; then _pass; else _fail "xmllint refused the xml output"; fi

case_ "usage errors: one message on stderr, status 2, nothing on stdout"
while IFS='|' read -r message args; do
    # shellcheck disable=SC2086
    run mesk other hello $args
    expect_rc 2
    expect_out ""
    expect_err "autocli: mesk other hello: $message"
done <<'CASES'
missing required option '--name'|-c 1
unknown option '--bogus'|-n a --bogus
option '--count' must be between 0 and 512 (got '513')|-n a --count=513
option '--loud' needs a value: true or false|-n a --loud
unknown field 'Nope' for --fields; valid choices: Greeting, Count, Items, Ok|-n a --fields Nope
CASES
run mesk other hello -n "$(printf 'two\nlines')"
expect_rc 2
expect_err "autocli: mesk other hello: option '--name' contains a control character; values must be a single line of text"
run mesk other hello -n a --formatter yaml
expect_rc 2
expect_err_has "unknown formatter 'yaml'"

case_ "errors the command reports: the result still printed, status 1"
run mesk other hello -n fail --debug
expect_rc 1
expect_out_has "Greeting: Hello, fail"
expect_err "Unable to greet fail: refused by the test plug-in
output complete: no"
run mesk other hello -n bob --debug
expect_rc 0
expect_err "output complete: yes"

case_ "an exception out of a command is reported, not a crash"
run mesk other hello -n throw
expect_rc 1
expect_out ""
expect_err "autocli: mesk other hello: the command failed: hello refused to greet 'throw'"

case_ "unusable libraries in a plug-in directory are reported and skipped"
BROKEN="$E2E_DIR/plugins"
mkdir -p "$BROKEN"
echo "not a library" >"$BROKEN/broken.so"
cp "$PLUGINS/libother_mesk_plugin.so" "$BROKEN/"
AUTOCLI_PLUGIN_PATH="$BROKEN" run mesk other hello -n bob --formatter json
expect_rc 0
expect_out_has '"Greeting":"Hello, bob"'
expect_err_has "autocli: cannot load plug-in $BROKEN/broken.so: "
expect_err_has "; skipped"

case_ "no plug-ins at all"
AUTOCLI_PLUGIN_PATH="$E2E_DIR/empty" run mesk
expect_rc 2
expect_err "autocli: 'mesk' is not a namespace or command; no commands are registered"

finish
