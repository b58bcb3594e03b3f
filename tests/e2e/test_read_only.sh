#!/usr/bin/env bash
# Reading the simulated host writes nothing: every command that only reads (each "fetcher" of
# docs/commands.md, and hostsim show and fail --list) leaves the state's directory byte for
# byte as it was (but for the WAL index, which SQLite readers write by design), and works for
# a user who may only read the state and on a read-only file system, where a changing command
# is refused with one message and changes nothing.
source "$(dirname "$0")/lib.sh"

# The state in a directory of its own: the host root, where the call log goes, is elsewhere.
STATE_DIR="$E2E_DIR/state"
export HOSTSIM_STATE="$STATE_DIR/state.db"
"$HOSTSIM" populate --luns 16 --agents 2 --nics 2 >/dev/null

mapfile -t FETCHERS < <(awk '/^## `mesk /{c=$0; gsub(/^## `|`$/, "", c)} /^Type: fetcher/{print c}' \
    "$MESK_SOURCE_DIR/docs/commands.md")
[ "${#FETCHERS[@]}" -ge 10 ] && _pass || _fail "only ${#FETCHERS[@]} fetchers in docs/commands.md"

# Every file of the state's directory but the WAL index, with its bytes' digest.
state_files() {
    (cd "$STATE_DIR" && for f in *; do [ "$f" = state.db-shm ] || echo "$f $(sha256sum <"$f")"; done)
}
# Runs each read as `$@` (a prefix such as a user switch); each must leave the state as it
# was and exit as it did for the owner ($OWNER_RC).
declare -A OWNER_RC
check_reads() {
    local before words
    before=$(state_files)
    for words in "${FETCHERS[@]}"; do
        case_ "$words, $1"
        _capture "${@:2}" "$AUTOCLI" $words
        if [ -z "${OWNER_RC[$words]:-}" ]; then OWNER_RC[$words]=$RC; fi
        expect_rc "${OWNER_RC[$words]}"
        expect_eq "$(state_files)" "$before" "the state's files"
    done
    for words in show "fail --list"; do
        case_ "hostsim $words, $1"
        _capture "${@:2}" "$HOSTSIM" $words
        expect_rc 0
        expect_eq "$(state_files)" "$before" "the state's files"
    done
}
# Runs a changing command as `$@`: refused, with the one message, and nothing changed.
check_refused_change() {
    local before
    before=$("$HOSTSIM" show)
    for words in "$AUTOCLI mesk cluster leave" "$HOSTSIM reset"; do
        case_ "${words##*/}, $1"
        _capture "${@:2}" $words
        expect_rc 1
        expect_err_has "cannot change the simulated host: $HOSTSIM_STATE is read-only for this user"
        expect_eq "$("$HOSTSIM" show)" "$before" "the host"
    done
}

check_reads "by the owner" env

if [ "$(id -u)" -eq 0 ]; then
    # Root may write anything: the reader is the unprivileged user nobody.
    chmod -R a+rX "$E2E_DIR"
    reader=(setpriv --reuid=65534 --regid=65534 --clear-groups)
else
    chmod a-w "$STATE_DIR" "$STATE_DIR"/*
    reader=(env)
fi
check_reads "by a user who may only read the state" "${reader[@]}"
check_refused_change "by a user who may only read the state" "${reader[@]}"
chmod u+w "$STATE_DIR" "$STATE_DIR"/* 2>/dev/null

# A read-only file system: the state copied onto a small file system mounted read-only.
if [ "$(id -u)" -eq 0 ] && mkdir -p "$E2E_DIR/ro" &&
    mount -t tmpfs -o size=8m none "$E2E_DIR/ro" 2>/dev/null; then
    trap 'umount "$E2E_DIR/ro"; rm -rf "$E2E_DIR"' EXIT
    cp -a "$STATE_DIR" "$E2E_DIR/ro/"
    mount -o remount,ro "$E2E_DIR/ro"
    STATE_DIR="$E2E_DIR/ro/state"
    export HOSTSIM_STATE="$STATE_DIR/state.db"
    check_reads "on a read-only file system" env
    check_refused_change "on a read-only file system" env
else
    echo "skipped the read-only file system: mounting one needs root and a tmpfs"
fi

finish
