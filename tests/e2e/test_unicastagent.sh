#!/usr/bin/env bash
# mesk cluster unicastagent add, list, remove and clear against the simulated host.
source "$(dirname "$0")/lib.sh"

NODE=5c0a9e11-0000-4000-8000-000000000001
ZERO=00000000-0000-0000-0000-000000000000

# Replaces the host's agent entries by the arguments, leaving the rest of the host as it is.
load_agents() {
    sim load --merge - <<<"$(jq -n '{unicastAgents: $ARGS.positional}' --args "$@")"
    expect_rc 0
}
host_agents() { "$HOSTSIM" show | jq -c .unicastAgents; }

case_ "outside a cluster, list refuses"
run mesk cluster unicastagent list
expect_rc 1
expect_err "Mesk isn't enabled on the host"

case_ "a node and a witness are added and listed"
run mesk cluster new
run mesk cluster unicastagent list --formatter=json
expect_rc 0
expect_out "[]"
run mesk cluster unicastagent add -t node -u $NODE -U true -a 10.0.0.1 -i zuvnic1
expect_rc 0
expect_out ""
run mesk cluster unicastagent add -a fe80::9 -p 4000
expect_rc 0
expect_eq "$(host_agents)" "[\"$NODE;0;1;10.0.0.1;12321;zuvnic1\",\"$ZERO;1;0;fe80::9;4000;\"]" \
    "agents on the host"
run mesk cluster unicastagent list
expect_rc 0
expect_out "Unicast Agent
NodeUuid                              IsWitness  Supports Unicast  IP Address  Port   Iface Name
------------------------------------  ---------  ----------------  ----------  -----  ----------
$NODE  0          true              10.0.0.1    12321  zuvnic1
$ZERO  1          false             fe80::9     4000"

case_ "a second witness is refused"
run mesk cluster unicastagent add -a 10.0.0.99 -p 4000
expect_rc 1
expect_err_has "Mesk does not support connecting to more than one unicast witness, and there is \
already a unicast witness configured: "

case_ "the node and the witness are removed"
run mesk cluster unicastagent remove -u $NODE -a 10.0.0.1
expect_rc 0
run mesk cluster unicastagent remove -a fe80::9 -p 4000
expect_rc 0
expect_eq "$(host_agents)" "[]" "agents after removal"

case_ "clear removes every agent and never completes its output"
load_agents "n1;0;1;10.0.0.1;12321;" "w1;1;1;10.0.0.9;12321;" "n2;0;0;fe80::2;777;a;b"
run --debug mesk cluster unicastagent clear
expect_rc 0
expect_err "output complete: no"
expect_eq "$(host_agents)" "[]" "agents after clear"

case_ "a malformed entry: list refuses, clear stops there with the earlier agents removed"
load_agents "n1;0;1;10.0.0.1;12321;" "u3;0;1" "n5;0;1;10.0.0.5;12321;"
run mesk cluster unicastagent list
expect_rc 1
expect_out ""
expect_err "Invalid unicastAgent entry for ucast support u3;0;1"
run mesk cluster unicastagent clear
expect_rc 1
expect_err "Invalid unicastAgent entries"
expect_eq "$(host_agents)" '["u3;0;1","n5;0;1;10.0.0.5;12321;"]' "agents left"

case_ "a witness node refuses to list"
sim load --merge - <<<'{"cluster": {"witness": true}}'
run mesk cluster unicastagent list
expect_rc 1
expect_err "Unable to list unicast agent, this host is a witness node which doesn't support \
listing unicast agent."

finish
