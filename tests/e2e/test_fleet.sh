#!/usr/bin/env bash
# The Ansible examples (examples/ansible/) against a fleet of simulated hosts on this
# machine, each a local connection with a state of its own: forming a cluster with one
# failing join, forming it again, taking a host out, the report, and a refused command line.
source "$(dirname "${BASH_SOURCE[0]}")/lib.sh"

if ! command -v ansible-playbook >/dev/null; then
    echo "SKIP: ansible-playbook is not installed (scripts/install-deps installs ansible-core)"
    exit 77
fi

HOSTS=${MESK_FLEET_HOSTS:-32} # fewer under the sanitizers (tests/CMakeLists.txt)
EXAMPLES="$MESK_SOURCE_DIR/examples/ansible"
INVENTORY="$E2E_DIR/inventory.yml"
export ANSIBLE_CONFIG="$EXAMPLES/ansible.cfg" ANSIBLE_HOME="$E2E_DIR/ansible"
export ANSIBLE_CALLBACK_RESULT_FORMAT=json ANSIBLE_NOCOLOR=1 ANSIBLE_FORKS=8
FAILING=fleet07 LEAVING=fleet05

HOST_NAMES=$(seq -f 'fleet%02g' "$HOSTS")
on() { # on HOST CMD...: runs CMD against HOST's simulated host
    local dir="$E2E_DIR/$1"
    shift
    HOSTSIM_STATE="$dir/state.db" MESK_HOST_ROOT="$dir/root" "$@"
}

{
    printf 'mesk_cluster:\n  vars:\n    ansible_connection: local\n'
    printf '    ansible_python_interpreter: "{{ ansible_playbook_python }}"\n'
    printf '    mesk_autocli: %s\n  hosts:\n' "$AUTOCLI"
    for host in $HOST_NAMES; do
        mkdir -p "$E2E_DIR/$host/root"
        on "$host" "$HOSTSIM" reset >/dev/null
        printf '{"host":{"nodeUuid":"5e1f0c2d-6a7b-4c8d-9e0f-0000000000%s","hostname":"%s"}}' \
            "${host#fleet}" "$host" | on "$host" "$HOSTSIM" load --merge -
        printf '    %s:\n      mesk_environment: {HOSTSIM_STATE: %s, MESK_HOST_ROOT: %s, %s}\n' \
            "$host" "$E2E_DIR/$host/state.db" "$E2E_DIR/$host/root" \
            "AUTOCLI_PLUGIN_PATH: $AUTOCLI_PLUGIN_PATH"
    done
} >"$INVENTORY"

playbook() { _capture ansible-playbook -i "$INVENTORY" "$EXAMPLES/$1" "${@:2}"; }

# The hosts of the last run's recap whose "failed changed" counts are not $1, then the
# number of hosts in the recap.
recap_except() {
    awk -v usual="$1" '/^PLAY RECAP/ { on = 1; next }
        on && NF { n++; sub("changed=", "", $4); sub("failed=", "", $6)
                   if ($6 " " $4 != usual) print $1, $6, $4 }
        END { print n " hosts" }' <<<"$OUT"
}
# "task: fatal line" for each failure of the last run; fatal HOST MESSAGE is such a line.
failures() {
    awk '/^TASK \[/ { task = $0; sub(/^TASK \[/, "", task); sub(/\] \**$/, "", task) }
         /^fatal:/ { print task ": " $0 }' <<<"$OUT"
}
fatal() { printf 'fatal: [%s]: FAILED! => {"changed": false, "msg": "%s"}' "$1" "$2"; }
# The hosts that are not in cluster $1, by their simulated host's own account.
outside() {
    for host in $HOST_NAMES; do
        [ "$(on "$host" "$HOSTSIM" show | jq -r .cluster.uuid)" == "$1" ] || echo "$host"
    done
}

case_ "forming the cluster: one failing join fails that host's join and nothing else"
on "$FAILING" "$HOSTSIM" fail JoinCluster "Failed to join: datastore busy"
playbook form-cluster.yml
expect_rc 2
UUID=$(on fleet01 "$HOSTSIM" show | jq -r .cluster.uuid)
expect_eq "$(failures)" "autocli mesk cluster join -u $UUID | fail the host on error: $(
    fatal "$FAILING" "Failed to join: datastore busy")" "failures"
expect_eq "$(recap_except "0 1")" "$FAILING 1 0
$HOSTS hosts" "recap"
expect_eq "$(outside "$UUID")" "$FAILING" "hosts outside the cluster"

case_ "forming it again once the host is fixed joins that host only"
on "$FAILING" "$HOSTSIM" fail --clear
playbook form-cluster.yml
expect_rc 0
expect_eq "$(recap_except "0 0")" "$FAILING 0 1
$HOSTS hosts" "recap"
expect_eq "$(outside "$UUID")" "" "hosts outside the cluster"

case_ "a host leaves; the others are checked and still in the cluster"
playbook leave-cluster.yml -e "mesk_leaving=$LEAVING"
expect_rc 0
expect_eq "$(recap_except "0 0")" "$LEAVING 0 1
$HOSTS hosts" "recap"
expect_eq "$(outside "$UUID")" "$LEAVING" "hosts outside the cluster"

case_ "the report: every host's results by host name, and the table"
playbook report.yml -e "mesk_report=$E2E_DIR/report.json"
expect_rc 0
expect_eq "$(jq -r --arg uuid "$UUID" 'to_entries[]
    | select(.value.cluster["Sub-Cluster UUID"] != $uuid) | "\(.key) \(.value.cluster)"' \
    "$E2E_DIR/report.json")" "$LEAVING null" "hosts outside the cluster in the report"
expect_eq "$(jq -c '[length, ([.[] | [(.storage | length), .network]] | unique)]' \
    "$E2E_DIR/report.json")" "[$HOSTS,[[4,[]]]]" "hosts, disks and interfaces in the report"
expect_out_has "fleet01          $UUID MASTER      4       0     0"
expect_out_has "$LEAVING          -                                    -           4       0     0"

case_ "a command line that autocli refuses on one host ends the play for all"
printf '#!/bin/sh\nexec "%s" "$@" --no-such-option\n' "$AUTOCLI" >"$E2E_DIR/old-autocli"
chmod +x "$E2E_DIR/old-autocli"
printf 'fleet02 mesk_autocli=%s\n' "$E2E_DIR/old-autocli" >"$E2E_DIR/old.ini"
rm "$E2E_DIR/report.json"
_capture ansible-playbook -i "$INVENTORY" -i "$E2E_DIR/old.ini" --limit '~fleet0[1-4]' \
    "$EXAMPLES/report.yml" -e "mesk_report=$E2E_DIR/report.json"
expect_rc 2
expect_eq "$(failures)" "autocli mesk cluster get | stop the play if refused: $(
    fatal fleet02 "autocli: mesk cluster get: unknown option '--no-such-option'")" "failures"
expect_out_lacks "TASK [Keep the cluster state]"
[ ! -e "$E2E_DIR/report.json" ] && _pass || _fail "the report was written"

finish
