#!/usr/bin/env bash
# hostsim end to end: the host document, injected failures, the call log, the tracing service's
# control script, and (when autocli has the mesk plug-in) commands against the host.
. "$(dirname "$0")/lib.sh"

json() { jq -c "$1" <<<"$OUT"; }

case_ "show | load round-trips exactly; a bad document is refused and changes nothing"
"$HOSTSIM" populate --luns 20 --agents 3 --nics 2
before=$("$HOSTSIM" show)
"$HOSTSIM" show | "$HOSTSIM" load -
expect_eq "$("$HOSTSIM" show)" "$before" "document after show | load"
while IFS='|' read -r spoil message; do
    sim load - <<<"$(jq "$spoil" <<<"$before")"
    expect_rc 1
    expect_err_has "hostsim load: invalid host document: $message"
done <<'TABLE'
.storage.disks[0].uuid = "x"|storage.disks[0].uuid: expected a UUID
del(.resync.throttle)|resync.throttle: missing
TABLE
echo '{ not json' | "$HOSTSIM" load - 2>/dev/null && _fail "accepted text that is not JSON" || _pass
expect_eq "$("$HOSTSIM" show)" "$before" "document after refused loads"

case_ "200,000 levels deep is refused untouched; the fuzz seeds load as their names say"
deep="{\"policies\":$(yes '{"x":' | head -n 200000 | tr -d '\n')0$(printf '%200000s' | tr ' ' '}')}"
for mode in "" --merge; do
    sim load $mode - <<<"$deep"
    expect_rc 1
    expect_err "hostsim load: invalid host document: nested deeper than 64 levels of arrays and objects"
done
expect_eq "$("$HOSTSIM" show)" "$before" "document after deep loads"
for seed in "$(dirname "$0")"/../../fuzz/corpus/fuzz_host_document/*; do
    mode=$([ "$(head -c 1 "$seed")" = 1 ] && echo --merge)
    [[ "${seed##*/}" =~ ^(merge_bad_.*|too_deep)$ ]] && want=1 || want=0
    tail -c +2 "$seed" | "$HOSTSIM" load $mode - 2>/dev/null
    expect_eq "$?" "$want" "load $mode ${seed##*/} (fuzz/corpus/regen remakes the seeds)"
done

case_ "populate claims disks into groups of one SSD and up to seven HDDs"
"$HOSTSIM" populate --luns 10
sim show
expect_eq "$(json '[.storage.disks[] | select(.isSsd) | .name]')" \
    '["mpx.pthba2:C0:T0:L0","mpx.pthba2:C0:T8:L0"]' "fronting SSDs"
expect_eq "$(json '[.storage.disks[] | .diskGroupUuid] | group_by(.) | map(length)')" '[8,2]' "groups"

case_ "usage errors exit 1"
while IFS='|' read -r args message; do
    sim $args
    expect_rc 1
    expect_err_has "$message"
done <<'TABLE'
|
frobnicate|unknown command 'frobnicate'
fail NoSuchOperation boom|unknown operation 'NoSuchOperation'
fail GetDiskInfo boom --call 0|
fail JoinCluster --clear|hostsim fail --clear JoinCluster
load /nonexistent|cannot read /nonexistent: No such file or directory
service mesktraced sleepy|
TABLE
sim --help
expect_rc 0
expect_out_has "hostsim COMMAND"

case_ "injected failures are listed and cleared"
"$HOSTSIM" fail GetDiskInfo "disk on fire"
"$HOSTSIM" fail JoinCluster "no quorum" --call 2
sim fail --list
expect_out "$(printf '%s\n%s' '{"op":"GetDiskInfo","call":0,"message":"disk on fire"}' \
    '{"op":"JoinCluster","call":2,"message":"no quorum"}')"
"$HOSTSIM" fail GetDiskInfo -- "-dash first"
"$HOSTSIM" fail --clear GetDiskInfo
sim fail --list
expect_out '{"op":"JoinCluster","call":2,"message":"no quorum"}'
"$HOSTSIM" fail --clear
sim fail --list
expect_out ""

case_ "the tracing service's control script follows hostsim service"
script="$MESK_HOST_ROOT/etc/init.d/mesktraced"
status_of() { "$script" "$@" >/dev/null 2>&1; echo $?; }
"$HOSTSIM" service mesktraced stopped
expect_eq "$(status_of status)" 3 "stopped"
"$HOSTSIM" service mesktraced restart-fails 2
expect_eq "$(status_of restart) $(status_of restart) $(status_of restart) $(status_of status)" \
    "1 1 0 0" "two failed restarts, then running"
"$HOSTSIM" service mesktraced restart-fails
"$HOSTSIM" service mesktraced status-fails
expect_eq "$(status_of restart) $(status_of restart) $(status_of status)" "1 1 137" "all fail"
"$HOSTSIM" service mesktraced running

"$AUTOCLI" --list-commands 2>/dev/null | grep -qx "mesk cluster get" ||
    { echo "autocli without the mesk plug-in: skipping the command cases"; finish; exit $?; }

case_ "state that is not a simulated host is refused and left as it is"
printf 'not a database\n' >"$E2E_DIR/text"
sqlite3 "$E2E_DIR/other.db" "PRAGMA journal_mode=WAL; CREATE TABLE t(x); INSERT INTO t VALUES(1);" >/dev/null
sqlite3 "$E2E_DIR/older.db" "PRAGMA user_version=1; CREATE TABLE section(name TEXT PRIMARY KEY);"
while IFS='|' read -r state message; do
    before=$(sha256sum "$state" "$state"-* 2>/dev/null)
    for command in "$AUTOCLI mesk datastore name get" "$HOSTSIM show" "$HOSTSIM reset"; do
        [[ "$state" == *older.db && "$command" == *reset ]] && continue
        _capture env HOSTSIM_STATE="$state" $command
        expect_rc 1
        expect_err_has "Simulated host state $state $message"
    done
    expect_eq "$(sha256sum "$state" "$state"-* 2>/dev/null)" "$before" "$state afterwards"
done <<TABLE
$E2E_DIR/text|is not an SQLite database
$E2E_DIR/other.db|is another program's SQLite database, not a simulated host
:memory:|is an in-memory database
$E2E_DIR|is not a file
$E2E_DIR/older.db|was made by an older hostsim; run 'hostsim reset'
TABLE
HOSTSIM_STATE="$E2E_DIR/older.db" "$HOSTSIM" reset
_capture env HOSTSIM_STATE="$E2E_DIR/older.db" "$AUTOCLI" mesk datastore name get
expect_out "Name: meskDatastore"

case_ "a state of an older build gets the keys added since, or is refused with one message"
older="INSERT OR REPLACE INTO section VALUES('documentVersion', '0')"
while IFS='|' read -r sql rc message; do
    rm "$HOSTSIM_STATE" && "$HOSTSIM" reset
    sqlite3 "$HOSTSIM_STATE" "$sql"
    run mesk datastore name get
    expect_rc "$rc"
    expect_err_has "Simulated host state $HOSTSIM_STATE $message"
done <<TABLE
$older; INSERT OR REPLACE INTO section VALUES('documentVersion', '99')|1|was made by a newer hostsim
$older; UPDATE section SET value = json_set(value, '\$.witness', 1) WHERE name = 'cluster'|1|was written by an older build that this one cannot read: cluster.witness: expected true or false; run 'hostsim reset'
$older; UPDATE section SET value = json_remove(value, '\$.witness') WHERE name = 'cluster'; UPDATE section SET value = json_remove(value, '\$.datastoreName') WHERE name = 'settings'|0|was written by an older build; added with their defaults: cluster.witness, settings.datastoreName
TABLE
run mesk datastore name get
expect_eq "$OUT|$ERR" "Name: meskDatastore|" "the second invocation"
"$HOSTSIM" show | "$HOSTSIM" load -
expect_eq "$?" 0 "show | load"

case_ "the call log shows the last invocation's calls and scripts in order"
"$HOSTSIM" reset
run mesk cluster new
run mesk cluster leave
expect_rc 0
sim calls
expect_out "$(cat <<'LOG'
{"op":"GetMeskPlugin","args":[]}
{"op":"GetMeskInfo","args":[]}
{"op":"GetClusterConfig","args":[]}
{"op":"/usr/lib/orvane/tavord/bin/notifyDatastore.py","args":["-t","PreUnmount","-d","meskDatastore"],"exit":0}
{"op":"LeaveCluster","args":[false]}
LOG
)"
# Without HOSTSIM_CALLS (or with 0) an invocation keeps no calls and leaves the log alone.
for keep in "" 0; do
    HOSTSIM_CALLS=$keep run mesk datastore name get
    expect_rc 0
    sim calls
    expect_out_has '{"op":"LeaveCluster","args":[false]}'
done

case_ "an injected failure reaches the command; --call picks one call"
"$HOSTSIM" populate --luns 5
"$HOSTSIM" fail GetDiskInfo "sector not found" --call 3
run mesk storage list
expect_rc 1
expect_err "Unable to list devices: sector not found"
expect_eq "$(grep -c '^   Device: ' <<<"$OUT")" 2 "disks listed before the failure"
"$HOSTSIM" fail --clear

case_ "storage list over 4096 disks, named past target 255"
"$HOSTSIM" populate --luns 4096
run mesk storage list
expect_eq "$RC $(grep -c '^   Device: ' <<<"$OUT")" "0 4096" "status and disks listed"
expect_out_has "mpx.pthba2:C15:T255:L0"

case_ "a change that meets a file it cannot write, a symlink or another user's directory changes nothing"
# Each row plants an obstacle below the root of a host that differs from the one the command
# makes; the command fails and leaves `show` and every file as they were, or (status 0) gets
# round a planted symlink without writing through it.
elsewhere="$E2E_DIR/elsewhere"
snapshot() {
    "$HOSTSIM" show
    find "$MESK_HOST_ROOT" "$elsewhere" -printf '%P %y %m %u %l\n' | sort
    find "$MESK_HOST_ROOT" "$elsewhere" -type f -exec sha256sum {} + | sort
}
echo '{"settings": {"datastoreName": "merged"}, "services": {"mesktraced": {"state": "stopped"}}}' >"$E2E_DIR/patch.json"
nobody_row=""
if [ "$(id -u)" = 0 ]; then nobody_row="chown nobody etc/init.d|reset|etc/init.d: belongs to another user"; fi
while IFS='|' read -r plant command message; do
    [ -n "$plant" ] || continue
    "$HOSTSIM" populate --luns 4
    "$HOSTSIM" show | jq '.settings.datastoreName = "loaded" | .services.mesktraced.state = "stopped"' >"$E2E_DIR/doc.json"
    rm -rf "$elsewhere" && mkdir "$elsewhere" && printf 'secret\n' >"$elsewhere/secret" && chmod 600 "$elsewhere/secret"
    (cd "$MESK_HOST_ROOT" && set -- $plant && case $1 in
        dir) rm -f "$2" && mkdir "$2" ;;
        link) mv "$2" "$elsewhere/" && ln -s "$elsewhere/${2##*/}" "$2" ;;
        *) "$@" ;;
    esac)
    before=$(snapshot)
    case_ "$command after $plant"
    _capture "$HOSTSIM" $command
    expect_rc $([ -n "$message" ] && echo 1 || echo 0)
    expect_err_has "$message"
    if [ -n "$message" ]; then expect_eq "$(snapshot)" "$before" "host and files"; fi
    expect_eq "$(cat "$elsewhere/secret"; stat -c %a "$elsewhere/secret")" "secret
600" "file behind a symlink"
    chmod -R go-w "$MESK_HOST_ROOT" && chown -R "$(id -u)" "$MESK_HOST_ROOT" && rm -rf "$MESK_HOST_ROOT"/*
done <<TABLE
dir var/lib/hostsim/mesktraced.state|reset|cannot write $MESK_HOST_ROOT/var/lib/hostsim/mesktraced.state: Is a directory
dir var/lib/hostsim/mesktraced.state|populate --luns 8|: Is a directory
dir var/lib/hostsim/mesktraced.state|load $E2E_DIR/doc.json|: Is a directory
dir var/lib/hostsim/mesktraced.state|load --merge $E2E_DIR/patch.json|: Is a directory
dir var/lib/hostsim/mesktraced.state|service mesktraced running|: Is a directory
dir etc/init.d/mesktraced|reset|: Is a directory
link etc|reset|$MESK_HOST_ROOT/etc: is a symlink
chmod o+w var/lib/hostsim|service mesktraced running|var/lib/hostsim: is writable by every user
ln -s $elsewhere/secret etc/init.d/mesktraced.new|reset|
$nobody_row
TABLE

case_ "every file has its mode whatever the umask; the service state is data, not shell code"
(umask 000 && "$HOSTSIM" reset)
expect_eq "$(cd "$MESK_HOST_ROOT" && find . -printf '%m %p\n' | sort -k2 | tr '\n' ' ')" \
    "755 . 755 ./etc 755 ./etc/init.d 755 ./etc/init.d/mesktraced 755 ./etc/orvane 755 ./etc/orvane/mesk 644 ./etc/orvane/mesk/mesktraced.conf 755 ./usr 755 ./usr/lib 755 ./usr/lib/orvane 755 ./usr/lib/orvane/tavord 755 ./usr/lib/orvane/tavord/bin 755 ./usr/lib/orvane/tavord/bin/notifyDatastore.py 755 ./var 755 ./var/lib 755 ./var/lib/hostsim 644 ./var/lib/hostsim/mesktraced.state 755 ./var/log 755 ./var/log/hostsim 644 ./var/log/hostsim/calls.jsonl 644 ./var/log/hostsim/scripts.jsonl " "modes"
echo "id >$E2E_DIR/ran" >>"$MESK_HOST_ROOT/var/lib/hostsim/mesktraced.state"
run mesk trace get
expect_eq "$RC $(cat "$E2E_DIR/ran" 2>/dev/null)" "0 " "trace get, and what the state file ran"
chmod o+w "$MESK_HOST_ROOT/etc/init.d"
printf '#!/bin/sh\nid >%s\n' "$E2E_DIR/ran" >"$MESK_HOST_ROOT/etc/init.d/mesktraced"
run mesk trace get
expect_eq "$RC $(cat "$E2E_DIR/ran" 2>/dev/null)" "1 " "trace get of a script every user may replace"
chmod o-w "$MESK_HOST_ROOT/etc/init.d"

finish
