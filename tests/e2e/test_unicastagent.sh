#!/usr/bin/env bash
# mesk cluster unicastagent add, list, remove and clear against the simulated host.
source "$(dirname "$0")/lib.sh"

NODE=5c0a9e11-0000-4000-8000-000000000001
ZERO=00000000-0000-0000-0000-000000000000
ONE_WITNESS="Mesk does not support connecting to more than one unicast witness, and there is \
already a unicast witness configured:"

# Replaces the host's agent entries by the arguments, leaving the rest of the host as it is.
load_agents() {
    jq -n '{unicastAgents: $ARGS.positional}' --args "$@" >"$E2E_DIR/agents.json"
    sim load --merge "$E2E_DIR/agents.json"
    expect_rc 0
}

case_ "outside a cluster, list and clear refuse"
for verb in list clear; do
    run mesk cluster unicastagent $verb
    expect_rc 1
    expect_err "Mesk isn't enabled on the host"
    expect_out ""
done

case_ "a new cluster has no agents"
run mesk cluster new
expect_rc 0
run mesk cluster unicastagent list --formatter=json
expect_rc 0
expect_out "[]"

case_ "a node and a witness are added"
run mesk cluster unicastagent add -t node -u $NODE -U true -a 10.0.0.1 -i zuvnic1
expect_rc 0
expect_out ""
sim calls
expect_out_has '"op":"RefreshUnicastAgents"'
run mesk cluster unicastagent add -a fe80::9 -p 4000
expect_rc 0
sim calls
expect_out_lacks '"op":"RefreshUnicastAgents"'

case_ "listed as a table"
run mesk cluster unicastagent list
expect_rc 0
expect_out "Unicast Agent
NodeUuid                              IsWitness  Supports Unicast  IP Address  Port   Iface Name
------------------------------------  ---------  ----------------  ----------  -----  ----------
$NODE  0          true              10.0.0.1    12321  zuvnic1
$ZERO  1          false             fe80::9     4000"

case_ "listed as json"
run mesk cluster unicastagent list --formatter=json
expect_rc 0
expect_eq "$(jq -c . <<<"$OUT")" "[{\"NodeUuid\":\"$NODE\",\"IsWitness\":0,\"Supports Unicast\":true,\
\"IP Address\":\"10.0.0.1\",\"Port\":12321,\"Iface Name\":\"zuvnic1\"},{\"NodeUuid\":\"$ZERO\",\
\"IsWitness\":1,\"Supports Unicast\":false,\"IP Address\":\"fe80::9\",\"Port\":4000,\
\"Iface Name\":\"\"}]" "json rows"

case_ "a second witness is refused, the same one too"
for addr in 10.0.0.99 fe80::9; do
    run mesk cluster unicastagent add -a $addr -p 4000
    expect_rc 1
    expect_err_has "$ONE_WITNESS "
done
sim calls
expect_out_lacks '"op":"AddUnicastAgent"'

case_ "bad options: the command's own messages, the framework's usage errors"
run mesk cluster unicastagent add -t node -a 10.0.0.2
expect_rc 1
expect_err "Can not add unicastagent without specifying node-uuid"
run mesk cluster unicastagent add -t node -u $NODE -a 10.0.0.2
expect_rc 1
expect_err "Can not add unicastagent without specifying unicast support"
run mesk cluster unicastagent add -t node -u $NODE -U false -a 10.0.0.300
expect_rc 1
expect_err "Invalid IP address 10.0.0.300"
run mesk cluster unicastagent add -t peer -a 10.0.0.2
expect_rc 2
run mesk cluster unicastagent remove -u $NODE
expect_rc 2

case_ "removing the node refreshes, removing the witness does not"
run mesk cluster unicastagent remove -u $NODE -a 10.0.0.1
expect_rc 0
sim calls
expect_out_has '"op":"RefreshUnicastAgents"'
run mesk cluster unicastagent remove -a fe80::9 -p 4000
expect_rc 0
sim calls
expect_out_lacks '"op":"RefreshUnicastAgents"'
run mesk cluster unicastagent list --formatter=json
expect_out "[]"

case_ "clear removes every agent and never completes its output"
load_agents "n1;0;1;10.0.0.1;12321;" "w1;1;1;10.0.0.9;12321;" "n2;0;0;fe80::2;777;a;b"
run --debug mesk cluster unicastagent clear
expect_rc 0
expect_err "output complete: no"
sim show
expect_eq "$(jq -c .unicastAgents <<<"$OUT")" "[]" "agents after clear"

case_ "malformed entries: list's messages"
while IFS='|' read -r entry message; do
    load_agents "n1;0;1;10.0.0.1;12321;" "$entry"
    run mesk cluster unicastagent list
    expect_rc 1
    expect_err "$message"
    expect_out ""
done <<'TABLE'
u3|Invalid unicastAgent entry for nodeuuid u3
u3;0|Invalid unicastAgent entry for isWitness u3;0
u3;0;1|Invalid unicastAgent entry for ucast support u3;0;1
u3;1;0;10.0.0.5|Invalid unicastAgent entry for ip u3;1;0;10.0.0.5
u3;0;1;10.0.0.5;12321|Invalid unicastAgent entry for port u3;0;1;10.0.0.5;12321
TABLE

case_ "a sixth field with ';' and non-numeric fields still list"
load_agents "u4;yes;1;10.0.0.4;80x;a;b"
run mesk cluster unicastagent list --formatter=json
expect_rc 0
expect_eq "$(jq -c '.[0] | [.IsWitness, .Port, ."Iface Name"]' <<<"$OUT")" '[0,80,"a;b"]' "row"

case_ "malformed entries: clear's messages, earlier agents stay removed"
while IFS='|' read -r entry message; do
    load_agents "n1;0;1;10.0.0.1;12321;" "$entry" "n5;0;1;10.0.0.5;12321;"
    run mesk cluster unicastagent clear
    expect_rc 1
    expect_err "$message"
    sim show
    expect_eq "$(jq -c .unicastAgents <<<"$OUT")" "[\"$entry\",\"n5;0;1;10.0.0.5;12321;\"]" \
        "agents left by: $message"
done <<'TABLE'
u3|Invalid unicastAgent entry for nodeuuid u3
u3;0;1|Invalid unicastAgent entries
u3;0;1;10.0.0.5;12321|Invalid unicastAgent entry for port u3;0;1;10.0.0.5;12321
u3;0;1;10.0.0.300;12321;|Invalid IP address 10.0.0.300
TABLE

case_ "a library failure while listing or clearing"
load_agents "n1;0;1;10.0.0.1;12321;"
sim fail GetUnicastAgents "agent table locked"
run mesk cluster unicastagent list
expect_rc 1
expect_err "Unable to list unicast agent: agent table locked"
run mesk cluster unicastagent clear
expect_rc 1
expect_err "Unable to remove unicast agents: agent table locked"
sim fail --clear

case_ "a witness node refuses all four"
echo '{"cluster": {"witness": true}}' >"$E2E_DIR/witness.json"
sim load --merge "$E2E_DIR/witness.json"
run mesk cluster unicastagent list
expect_rc 1
expect_err "Unable to list unicast agent, this host is a witness node which doesn't support \
listing unicast agent."
run mesk cluster unicastagent add -a 10.0.0.7
expect_err "This host is a witness node which doesn't support adding unicast agent."
run mesk cluster unicastagent remove -a 10.0.0.1
expect_err "This host is a witness node which doesn't support removing unicast agent."
run mesk cluster unicastagent clear
expect_err "Unable to remove unicast agent(s), this host is a witness node which doesn't \
support removing unicast agent."
sim show
expect_eq "$(jq -c .unicastAgents <<<"$OUT")" '["n1;0;1;10.0.0.1;12321;"]' "agents kept"

finish
