# Shared helpers of the end-to-end tests. Each test script sources this file; it gets a
# simulated host of its own in a temporary directory, reset to the default host.
#
#   run ARGS...        runs autocli; sets OUT, ERR and RC
#   ok ARGS...         runs autocli and expects exit status 0
#   sim ARGS...        runs hostsim; sets OUT, ERR and RC
#   expect_rc N        the last run exited with N
#   expect_out TEXT    stdout is exactly TEXT (a trailing newline is ignored)
#   expect_out_has T   stdout contains T;  expect_err_has T: stderr contains T
#   expect_err TEXT    stderr is exactly TEXT
#   expect_eq A B WHAT A equals B
#   finish             prints the summary and exits non-zero on any failure
set -u

: "${AUTOCLI:?AUTOCLI must name the autocli executable}"
: "${HOSTSIM:?HOSTSIM must name the hostsim executable}"

E2E_DIR=$(mktemp -d "${TMPDIR:-/tmp}/mesk-e2e.XXXXXX")
trap 'rm -rf "$E2E_DIR"' EXIT
export HOSTSIM_STATE="$E2E_DIR/state.db"
export MESK_HOST_ROOT="$E2E_DIR/root"
export HOSTSIM_CALLS=1
mkdir -p "$MESK_HOST_ROOT"

PASSED=0
FAILED=0
CURRENT_TEST="${0##*/}"

OUT=""
ERR=""
RC=0

_capture() {
    local out_file="$E2E_DIR/.out" err_file="$E2E_DIR/.err"
    RC=0
    "$@" >"$out_file" 2>"$err_file" || RC=$?
    OUT=$(cat "$out_file")
    ERR=$(cat "$err_file")
}

run() { _capture "$AUTOCLI" "$@"; }
ok() {
    run "$@"
    expect_rc 0
}
sim() { _capture "$HOSTSIM" "$@"; }

# Names the case that the following expectations belong to.
case_() { CURRENT_TEST="$1"; }

_pass() { PASSED=$((PASSED + 1)); }
_fail() {
    FAILED=$((FAILED + 1))
    printf 'FAIL [%s]: %s\n' "$CURRENT_TEST" "$1" >&2
    printf '  stdout: %s\n  stderr: %s\n  status: %s\n' "$OUT" "$ERR" "$RC" >&2
}

expect_rc() { if [ "$RC" -eq "$1" ]; then _pass; else _fail "exit status $RC, expected $1"; fi; }
expect_out() { if [ "$OUT" == "$1" ]; then _pass; else _fail "stdout differs from: $1"; fi; }
expect_err() { if [ "$ERR" == "$1" ]; then _pass; else _fail "stderr differs from: $1"; fi; }
expect_out_has() {
    if [[ "$OUT" == *"$1"* ]]; then _pass; else _fail "stdout lacks: $1"; fi
}
expect_err_has() {
    if [[ "$ERR" == *"$1"* ]]; then _pass; else _fail "stderr lacks: $1"; fi
}
expect_out_lacks() {
    if [[ "$OUT" != *"$1"* ]]; then _pass; else _fail "stdout has: $1"; fi
}
expect_eq() {
    if [ "$1" == "$2" ]; then _pass; else _fail "${3:-values}: got '$1', expected '$2'"; fi
}

finish() {
    echo "$PASSED passed, $FAILED failed"
    [ "$FAILED" -eq 0 ]
}

"$HOSTSIM" reset >/dev/null || { echo "hostsim reset failed" >&2; exit 1; }
