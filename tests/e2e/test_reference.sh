#!/bin/bash
# docs/commands.md is what `autocli --reference` prints for the commands as built, so a
# command whose description, parameters or result changed without the reference fails here.
. "$(dirname "$0")/lib.sh"

case_ "docs/commands.md matches the code"
GENERATED="$E2E_DIR/commands.md"
RC=0
"$AUTOCLI" --reference >"$GENERATED" 2>"$E2E_DIR/reference.err" || RC=$?
ERR=$(cat "$E2E_DIR/reference.err")
expect_rc 0
expect_err ""
if diff -u "$MESK_SOURCE_DIR/docs/commands.md" "$GENERATED" >"$E2E_DIR/reference.diff"; then
    _pass
else
    _fail "docs/commands.md is stale; regenerate it with: scripts/gen-docs ${MESK_BUILD_DIR:-}"
    head -n 80 "$E2E_DIR/reference.diff" >&2
fi

finish
