#!/bin/bash
# docs/commands.md and docs/reference.json are what `autocli --reference` prints, as Markdown
# and as JSON, for the commands as built, so a command whose description, parameters or result
# changed without the reference fails here.
# README's layout table names every folder of the tree.
. "$(dirname "$0")/lib.sh"

for doc in commands.md reference.json; do
    case_ "docs/$doc matches the code"
    FORMAT=()
    [[ $doc == *.json ]] && FORMAT=(--formatter json-pretty)
    GENERATED="$E2E_DIR/$doc"
    RC=0
    "$AUTOCLI" --reference "${FORMAT[@]}" >"$GENERATED" 2>"$E2E_DIR/reference.err" || RC=$?
    ERR=$(cat "$E2E_DIR/reference.err")
    expect_rc 0
    expect_err ""
    if diff -u "$MESK_SOURCE_DIR/docs/$doc" "$GENERATED" >"$E2E_DIR/reference.diff"; then
        _pass
    else
        _fail "docs/$doc is stale; regenerate it with: scripts/gen-docs ${MESK_BUILD_DIR:-}"
        head -n 80 "$E2E_DIR/reference.diff" >&2
    fi
done

case_ "the manual pages match the tools and render without warnings"
RC=0
"$MESK_SOURCE_DIR/scripts/gen-man" "$MESK_BUILD_DIR" "$E2E_DIR/man" 2>"$E2E_DIR/man.err" || RC=$?
ERR=$(cat "$E2E_DIR/man.err")
expect_rc 0
for page in autocli hostsim autocli-mesk; do
    if diff -u "$MESK_SOURCE_DIR/docs/man/$page.1" "$E2E_DIR/man/$page.1" >"$E2E_DIR/man.diff"; then
        _pass
    else
        _fail "docs/man/$page.1 is stale; regenerate it with: scripts/gen-docs $MESK_BUILD_DIR"
        head -n 40 "$E2E_DIR/man.diff" >&2
    fi
    expect_eq "$(LC_ALL=C.UTF-8 groff -ww -z -man -Tutf8 "$E2E_DIR/man/$page.1" 2>&1)" "" "groff on $page.1"
done

case_ "README's layout table names every folder"
cd "$MESK_SOURCE_DIR"
TABLE=$(grep '^| `' README.md)
# Top-level folders, the stand-ins, the test kinds, and the one folder of commands that is no area.
for dir in $(git ls-files 2>/dev/null |
        sed -n 's#^\(platform/[^/]*\|tests/[^/]*\|commands/common\)/.*#\1#p; s#^\([^/]*\)/.*#\1#p' |
        sort -u); do
    if grep -qF "\`$dir/" <<<"$TABLE"; then _pass; else _fail "README.md's layout table lacks $dir/"; fi
done
cd - >/dev/null

finish
