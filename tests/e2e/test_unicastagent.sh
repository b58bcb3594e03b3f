#!/usr/bin/env bash
# mesk cluster unicastagent add, list, remove and clear against the simulated host.
source "$(dirname "$0")/lib.sh"

NODE=5c0a9e11-0000-4000-8000-000000000001
ZERO=00000000-0000-0000-0000-000000000000

host_agents() { "$HOSTSIM" show | jq -c .unicastAgents; }

case_ "a node and a witness are added and listed"
ok mesk cluster new
ok mesk cluster unicastagent add -t node -u $NODE -U true -a 10.0.0.1 -i zuvnic1
ok mesk cluster unicastagent add -a fe80::9 -p 4000
expect_eq "$(host_agents)" "[\"$NODE;0;1;10.0.0.1;12321;zuvnic1\",\"$ZERO;1;0;fe80::9;4000;\"]" \
    "agents on the host"
ok mesk cluster unicastagent list
expect_out "Unicast Agent
NodeUuid                              IsWitness  Supports Unicast  IP Address  Port   Iface Name
------------------------------------  ---------  ----------------  ----------  -----  ----------
$NODE  0          true              10.0.0.1    12321  zuvnic1
$ZERO  1          false             fe80::9     4000"

case_ "the node is removed; clear removes the rest and never completes its output"
ok mesk cluster unicastagent remove -u $NODE -a 10.0.0.1
expect_eq "$(host_agents)" "[\"$ZERO;1;0;fe80::9;4000;\"]" "agents after removal"
ok --debug mesk cluster unicastagent clear
expect_err "output complete: no"
expect_eq "$(host_agents)" "[]" "agents after clear"

finish
