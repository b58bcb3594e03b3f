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

case_ "leave, then get shows clustering disabled"
ok mesk cluster leave
expect_out ""
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

finish
