#!/usr/bin/env bash
# hostsim end to end: the host document, injected failures, the call log, the tracing
# service's behaviours, and (when autocli with the mesk plug-in is there) commands against it.
. "$(dirname "$0")/lib.sh"

json() { jq -c "$1" <<<"$OUT"; }

case_ "a reset host is the default host"
sim show
expect_rc 0
expect_eq "$(json '[.cluster.enabled, .storage.disks[].isSsd, (.storage.disks | map(.diskGroupUuid) | unique)]')" \
    '[false,true,false,false,false,[""]]' "disks"
expect_eq "$(json '[.settings.datastoreName, (.policies | keys_unsorted), .resync, .unicastAgents, .network.interfaces]')" \
    '["meskDatastore",["cluster","vdisk","vmnamespace","vmswap","vmem"],{"bandwidth":0,"throttle":0},[],[]]' "settings"
expect_eq "$(json '.services.mesktraced')" '{"state":"running","statusFails":false,"restartFailures":0}' "service"
for file in /etc/orvane/mesk/mesktraced.conf /etc/init.d/mesktraced \
    /usr/lib/orvane/tavord/bin/notifyDatastore.py; do
    [ -f "$MESK_HOST_ROOT$file" ] && _pass || _fail "no $file below the host root"
done
expect_eq "$(grep -c '^MESKTRACED_' "$MESK_HOST_ROOT/etc/orvane/mesk/mesktraced.conf")" 4 "settings lines"

case_ "show | load round-trips exactly"
"$HOSTSIM" populate --luns 20 --agents 3 --nics 2
before=$("$HOSTSIM" show)
"$HOSTSIM" show | "$HOSTSIM" load -
expect_eq "$("$HOSTSIM" show)" "$before" "document after show | load"

case_ "a bad document is refused and the state stays"
for spoil in '.cluster.enabled = "yes"' '.storage.disks[0].uuid = "x"' 'del(.resync.throttle)' \
    '.unicastAgents = [1]' '.extra = 1'; do
    jq "$spoil" <<<"$before" >"$E2E_DIR/bad.json"
    sim load "$E2E_DIR/bad.json"
    expect_rc 1
    expect_err_has "hostsim load: invalid host document: "
done
sim load "$E2E_DIR/missing.json"
expect_rc 1
echo '{ not json' | "$HOSTSIM" load - 2>/dev/null && _fail "accepted text that is not JSON" || _pass
expect_eq "$("$HOSTSIM" show)" "$before" "document after refused loads"

case_ "load --merge changes only the keys given"
echo '{"cluster":{"stretched":true},"unicastAgents":["u1;1;0;10.0.0.5"]}' | "$HOSTSIM" load --merge -
sim show
expect_eq "$(json '[.cluster.stretched, .cluster.enabled, .unicastAgents, (.storage.disks | length)]')" \
    '[true,true,["u1;1;0;10.0.0.5"],20]' "merged host"

case_ "populate claims disks into groups of one SSD and up to seven HDDs"
"$HOSTSIM" populate --luns 10
sim show
expect_eq "$(json '[.storage.disks[] | select(.isSsd) | .name]')" \
    '["mpx.pthba2:C0:T0:L0","mpx.pthba2:C0:T8:L0"]' "fronting SSDs"
expect_eq "$(json '[.storage.disks[] | .diskGroupUuid] | group_by(.) | map(length)')" '[8,2]' "groups"

case_ "usage errors"
sim
expect_rc 1
sim frobnicate
expect_rc 1
expect_err_has "unknown command 'frobnicate'"
sim fail NoSuchOperation boom
expect_rc 1
expect_err_has "unknown operation 'NoSuchOperation'"
sim fail GetDiskInfo boom --call 0
expect_rc 1
sim populate --luns many
expect_rc 1
sim service mesktraced sleepy
expect_rc 1
sim --help
expect_rc 0
expect_out_has "hostsim COMMAND"

case_ "injected failures are listed and cleared"
"$HOSTSIM" fail GetDiskInfo "disk on fire"
"$HOSTSIM" fail JoinCluster "no quorum" --call 2
sim fail --list
expect_out "$(printf '%s\n%s' '{"op":"GetDiskInfo","call":0,"message":"disk on fire"}' \
    '{"op":"JoinCluster","call":2,"message":"no quorum"}')"
"$HOSTSIM" fail --clear
sim fail --list
expect_out ""

case_ "the tracing service's control script follows hostsim service"
"$HOSTSIM" reset
script="$MESK_HOST_ROOT/etc/init.d/mesktraced"
status_of() { "$script" "$@" >/dev/null 2>&1; echo $?; }
expect_eq "$(status_of status)" 0 "running"
"$HOSTSIM" service mesktraced stopped
expect_eq "$(status_of status)" 3 "stopped"
"$HOSTSIM" service mesktraced restart-fails 2
expect_eq "$(status_of restart) $(status_of restart) $(status_of restart)" "1 1 0" "two failed restarts"
"$HOSTSIM" service mesktraced restart-fails
expect_eq "$(status_of restart) $(status_of restart)" "1 1" "every restart fails"
"$HOSTSIM" service mesktraced status-fails
expect_eq "$(status_of status)" 137 "status killed"
sim show
expect_eq "$(json '.services.mesktraced')" '{"state":"running","statusFails":true,"restartFailures":-1}' "service state"
"$HOSTSIM" service mesktraced running
"$HOSTSIM" calls --clear
sh -c "$MESK_HOST_ROOT/usr/lib/orvane/tavord/bin/notifyDatastore.py -t PreUnmount -d meskDatastore"
sim calls
expect_out '{"op":"/usr/lib/orvane/tavord/bin/notifyDatastore.py","args":["-t","PreUnmount","-d","meskDatastore"],"exit":0}'

# The rest drives the real plug-in; it needs autocli with the mesk commands.
if ! "$AUTOCLI" --list-commands 2>/dev/null | grep -qx "mesk cluster get"; then
    echo "autocli with the mesk plug-in not available: skipping the command cases"
    finish
    exit $?
fi

case_ "the call log shows the last invocation's calls and scripts in order"
"$HOSTSIM" reset
run mesk cluster new
expect_rc 0
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

case_ "an injected failure reaches the command; --call picks one call"
"$HOSTSIM" fail GetDatastoreName "datastore is busy"
run mesk datastore name get
expect_rc 1
expect_err "Unable to get Mesk datastore name: datastore is busy"
sim calls
expect_out_has '{"op":"GetDatastoreName","args":[],"error":"datastore is busy"}'
"$HOSTSIM" fail --clear
"$HOSTSIM" populate --luns 5
"$HOSTSIM" fail GetDiskInfo "sector not found" --call 3
run mesk storage list
expect_rc 1
expect_err "Unable to list devices: sector not found"
expect_eq "$(grep -c '^   Device: ' <<<"$OUT")" 2 "disks listed before the failure"
"$HOSTSIM" fail --clear

case_ "a refusal of the host changes nothing"
"$HOSTSIM" reset
before=$("$HOSTSIM" show)
run mesk storage add -s mpx.pthba2:C0:T1:L0 -d mpx.pthba2:C0:T2:L0
expect_rc 1
expect_err "Unable to add device: Disk 'mpx.pthba2:C0:T1:L0' is not an SSD"
expect_eq "$("$HOSTSIM" show)" "$before" "host after a refused add"

case_ "the tracing service's behaviours reach trace get"
"$HOSTSIM" service mesktraced stopped
run mesk trace get
expect_err "Mesk is not enabled on this host."
"$HOSTSIM" service mesktraced status-fails
run mesk trace get
expect_err "Checking mesktraced status failed.Refer to /var/log/syslog.log for details."
"$HOSTSIM" service mesktraced running
run mesk trace get
expect_rc 0
expect_out_has "MESK Traces Directory: /scratch/mesktrace"

case_ "concurrent invocations lose no change"
"$HOSTSIM" reset
run mesk cluster new
for i in $(seq 1 20); do
    "$AUTOCLI" mesk cluster unicastagent add -t node -u 52f1c2a0-7b3e-4d01-9a6e-00a1b2c3d4e5 \
        -U true -a "10.0.2.$i" >/dev/null 2>&1 &
done
wait
sim show
expect_eq "$(json '.unicastAgents | length')" 20 "agents after 20 concurrent adds"

case_ "storage list over 4096 disks"
"$HOSTSIM" populate --luns 4096
start=$(date +%s%N)
run mesk storage list
elapsed_ms=$((($(date +%s%N) - start) / 1000000))
expect_rc 0
expect_eq "$(grep -c '^   Device: ' <<<"$OUT")" 4096 "disks listed"
[ "$elapsed_ms" -lt 20000 ] && _pass || _fail "storage list over 4096 disks took ${elapsed_ms} ms"

finish
