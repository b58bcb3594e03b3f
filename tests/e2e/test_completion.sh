#!/bin/bash
# Shell completion end to end: `autocli __complete` over the mesk and the second test plug-in
# together, and the bash adaptor of `autocli completion bash` driven through COMP_WORDS.
. "$(dirname "$0")/lib.sh"

PLUGINS="${MESK_TEST_PLUGIN_DIR:-$(dirname "$AUTOCLI")/../../test-plugins}"
export AUTOCLI_PLUGIN_PATH="$AUTOCLI_PLUGIN_PATH:$PLUGINS"

case_ "__complete over both plug-ins"
ok __complete mesk o
expect_out "other
:4"
expect_err ""

case_ "a plug-in that cannot be loaded stays silent during completion"
BROKEN="$E2E_DIR/plugins"
mkdir -p "$BROKEN"
echo "not a library" >"$BROKEN/broken.so"
AUTOCLI_PLUGIN_PATH="$BROKEN:$AUTOCLI_PLUGIN_PATH" run __complete mesk st
expect_rc 0
expect_out "storage
:4"
expect_err ""

case_ "the bash adaptor fills COMPREPLY from autocli"
ok completion bash
SCRIPT="$E2E_DIR/autocli.bash"
printf '%s\n' "$OUT" >"$SCRIPT"
# shellcheck disable=SC2016
complete_in_bash() {
    PATH="$(dirname "$AUTOCLI"):$PATH" bash -c '
        source "$1"; shift
        COMP_WORDS=("$@"); COMP_CWORD=$(($# - 1))
        _autocli
        printf "%s\n" "${COMPREPLY[@]}"' bash "$SCRIPT" "$@"
}
_capture complete_in_bash autocli mesk storage list --d
expect_out "--device
--debug"
# bash splits "--formatter=js" at "="; the candidates replace only what follows it.
_capture complete_in_bash autocli --formatter = js
expect_out "json
json-pretty"
_capture complete_in_bash autocli mesk nope ""
expect_out ""
expect_err ""

finish
