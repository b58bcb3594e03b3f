#!/usr/bin/env bash
# Cluster membership through autocli against the simulated host: status, new, join, leave,
# restore and the preferred fault domain of a stretched cluster.
source "$(dirname "${BASH_SOURCE[0]}")/lib.sh"

IN_CLUSTER="The host is in a Mesk cluster and enabled for Mesk. You need to remove it from the cluster or disable Mesk."
NOT_STRETCHED="Cannot get preferred fault domain if host is not in a stretched cluster."
JOIN_UUID="52a1c3e4-1b2c-4d3e-8f90-a1b2c3d4e5f6"
NOTIFY=/usr/lib/orvane/tavord/bin/notifyDatastore.py

# The leave and the notifications among the last invocation's calls, as "op args" lines.
leave_calls() {
    sim calls
    printf '%s\n' "$OUT" | grep -E "LeaveCluster|notifyDatastore" |
        sed -E 's/^\{"op":"([^"]*)","args":(\[[^]]*\]).*/\1 \2/'
}

case_ "get on a host outside any cluster: the empty report, the message, complete"
run mesk cluster get --debug
expect_rc 1
expect_err "Mesk Clustering is not enabled on this host
output complete: yes"
expect_out_has "Cluster Information
   Enabled:
   Current Local Time:"

case_ "new makes a cluster that get shows enabled with its UUID"
run mesk cluster new
expect_rc 0
expect_out ""
run mesk cluster get
expect_rc 0
expect_out_has "   Enabled: true"
expect_out_has "   Local Node Type: NORMAL"
CLUSTER_UUID=$(printf '%s\n' "$OUT" | sed -n 's/^ *Sub-Cluster UUID: //p')
[[ "$CLUSTER_UUID" =~ ^[0-9a-f]{8}(-[0-9a-f]{4}){3}-[0-9a-f]{12}$ ]] && _pass ||
    _fail "no cluster UUID: '$CLUSTER_UUID'"
sim show
expect_out_has "\"$CLUSTER_UUID\""

case_ "join and new are refused while enabled, whatever the options"
run mesk cluster join -u "$JOIN_UUID" -p site-a
expect_rc 1
expect_err "$IN_CLUSTER"
run mesk cluster new
expect_rc 1
expect_err "$IN_CLUSTER"

case_ "preferred fault domain get in a cluster that is not stretched"
run mesk cluster preferredfaultdomain get
expect_rc 1
expect_err "$NOT_STRETCHED"

case_ "a leave that the library refuses is retracted with a second notification"
sim fail LeaveCluster "Failed to leave: datastore busy"
run mesk cluster leave --debug
expect_rc 1
expect_out ""
expect_err "Failed to leave: datastore busy
output complete: no"
expect_eq "$(leave_calls)" "$NOTIFY [\"-t\",\"PreUnmount\",\"-d\",\"meskDatastore\"]
LeaveCluster [false]
$NOTIFY [\"-t\",\"FailedUnmount\",\"-d\",\"meskDatastore\"]" "leave calls"
sim fail --clear

case_ "leave, then get shows clustering disabled and leave is refused"
run mesk cluster leave
expect_rc 0
expect_out ""
expect_eq "$(leave_calls)" "$NOTIFY [\"-t\",\"PreUnmount\",\"-d\",\"meskDatastore\"]
LeaveCluster [false]" "leave calls"
run mesk cluster get
expect_rc 1
expect_err "Mesk Clustering is not enabled on this host"
run mesk cluster leave
expect_rc 1
expect_err "The host is not in a Mesk cluster."
expect_eq "$(leave_calls)" "" "calls of a refused leave"
run mesk cluster preferredfaultdomain get
expect_rc 1
expect_err "$NOT_STRETCHED"

case_ "join checks its witness options and reports the library's refusal bare"
run mesk cluster join -u "$JOIN_UUID" --witness-node
expect_err "If --witness-node is specified, --witness-preferred-fault-domain must also be specified."
run mesk cluster join -u "$JOIN_UUID" -p ""
expect_err "--witness-preferred-fault-domain is valid only when --witness-node is specified."
run mesk cluster join -u "$JOIN_UUID" -t -p "$(printf 'é%.0s' $(seq 257))"
expect_rc 1
expect_err "Preferred fault domain name cannot be empty or exceed 256 characters."
run mesk cluster join
expect_rc 2
sim fail JoinCluster "Join refused"
run mesk cluster join -u "$JOIN_UUID"
expect_rc 1
expect_out "false"
expect_err "Join refused"
sim fail --clear

case_ "a witness joins, then reads and changes the preferred fault domain"
run mesk cluster join -u "$JOIN_UUID" --witness-node --witness-preferred-fault-domain "Site A"
expect_rc 0
run mesk cluster get
expect_out_has "   Local Node Type: WITNESS"
expect_out_has "   Sub-Cluster UUID: $JOIN_UUID"
run mesk cluster preferredfaultdomain get
expect_rc 0
expect_out_has "Preferred Fault Domain Name: Site A
Preferred Fault Domain Id: "
NAME256=$(printf 'é%.0s' $(seq 256))
run mesk cluster preferredfaultdomain set -n "$NAME256"
expect_rc 0
run mesk cluster preferredfaultdomain get
expect_out_has "Preferred Fault Domain Name: $NAME256"
run mesk cluster preferredfaultdomain set -n "${NAME256}x"
expect_err "Preferred Fault domain name cannot exceed 256 characters."
run mesk cluster preferredfaultdomain set -n ""
expect_err "Cannot set preferred fault domain name as empty."

case_ "restore passes the boot flag on"
run mesk cluster restore --boot
expect_rc 0
sim calls
expect_out_has '{"op":"RestoreClusterConfig","args":[true]'

finish
