#!/usr/bin/env bash
# Cluster membership through autocli against the simulated host: status, new, join, leave,
# restore and the preferred fault domain of a stretched cluster.
source "$(dirname "${BASH_SOURCE[0]}")/lib.sh"

JOIN_UUID="52a1c3e4-1b2c-4d3e-8f90-a1b2c3d4e5f6"

case_ "get on a host outside any cluster: the empty report, the message, complete"
run mesk cluster get --debug
expect_rc 1
expect_err "Mesk Clustering is not enabled on this host
output complete: yes"
expect_out_has "Cluster Information
   Enabled:
   Current Local Time:"

case_ "new makes a cluster that get shows enabled with its UUID"
ok mesk cluster new
expect_out ""
ok mesk cluster get
expect_out_has "   Enabled: true"
expect_out_has "   Local Node Type: NORMAL"
CLUSTER_UUID=$(printf '%s\n' "$OUT" | sed -n 's/^ *Sub-Cluster UUID: //p')
sim show
expect_eq "$(jq -r .cluster.uuid <<<"$OUT")" "$CLUSTER_UUID" "cluster UUID on the host"
[[ "$CLUSTER_UUID" =~ ^[0-9a-f]{8}(-[0-9a-f]{4}){3}-[0-9a-f]{12}$ ]] && _pass ||
    _fail "no cluster UUID: '$CLUSTER_UUID'"

case_ "leave, then get shows clustering disabled; a missing notification script is not seen"
rm "$MESK_HOST_ROOT/usr/lib/orvane/tavord/bin/notifyDatastore.py"
ok mesk cluster leave
expect_out ""
expect_err ""
run mesk cluster get
expect_rc 1
expect_err "Mesk Clustering is not enabled on this host"

case_ "a witness joins, then reads and changes the preferred fault domain"
ok mesk cluster join -u "$JOIN_UUID" --witness-node --witness-preferred-fault-domain "Site A"
ok mesk cluster get
expect_out_has "   Local Node Type: WITNESS"
expect_out_has "   Sub-Cluster UUID: $JOIN_UUID"
ok mesk cluster preferredfaultdomain set -n "Site B"
ok mesk cluster preferredfaultdomain get
expect_out_has "Preferred Fault Domain Name: Site B
Preferred Fault Domain Id: "

case_ "restore passes the boot flag on"
ok mesk cluster restore --boot
sim calls
expect_out_has '{"op":"RestoreClusterConfig","args":[true]'

# The notification script's path lies below the host root, which may hold anything: the shell
# must see the root as one literal word, run nothing of it, and run the script.
MARK="$E2E_DIR/shell-ran"
NOTIFY='"op":"/usr/lib/orvane/tavord/bin/notifyDatastore.py","args":["-t","%s","-d","meskDatastore"]'
for prefix in "\$(touch $MARK)" "\`touch $MARK\`" "a;touch $MARK;" "a&touch $MARK&" \
    "a|touch $MARK|" "my host/ root" "it's 'quoted'" 'say "a" \"' $'two\nlines\n'; do
    case_ "leave below the host root '$prefix': the notifications run, nothing else does"
    MESK_HOST_ROOT="$E2E_DIR/roots/$prefix"
    mkdir -p "$MESK_HOST_ROOT" && rm -f "$MARK"
    "$HOSTSIM" reset >/dev/null && "$HOSTSIM" fail LeaveCluster boom && ok mesk cluster new
    run mesk cluster leave
    expect_rc 1
    expect_err "boom"
    sim calls
    expect_out_has "$(printf "$NOTIFY" PreUnmount)"
    expect_out_has "$(printf "$NOTIFY" FailedUnmount)"
    [ ! -e "$MARK" ] && _pass || _fail "the shell ran a command of the host root"
done

finish
