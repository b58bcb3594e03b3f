#!/usr/bin/env bash
# Many autocli processes changing the simulated host at once: every change lands, none is
# lost to another. The host runs each change in one BEGIN IMMEDIATE transaction, so that
# concurrent writers queue up instead of overwriting what another read before.
source "$(dirname "$0")/lib.sh"

PROCESSES=50

# Starts autocli "$@" (hostsim "$@" after -h) in the background, with its exit status in
# $E2E_DIR/status.N.
spawn() {
    local n=$1 program=$AUTOCLI
    shift
    [ "$1" = -h ] && program=$HOSTSIM && shift
    ("$program" "$@" >"$E2E_DIR/out.$n" 2>&1; echo $? >"$E2E_DIR/status.$n") &
}
# How many of the first N processes exited 0; prints the output of the others.
succeeded() {
    local n ok=0
    for ((n = 0; n < $1; n++)); do
        if [ "$(cat "$E2E_DIR/status.$n" 2>/dev/null)" = 0 ]; then
            ok=$((ok + 1))
        else
            echo "process $n: $(cat "$E2E_DIR/out.$n" 2>/dev/null)" >&2
        fi
    done
    echo "$ok"
}

case_ "$PROCESSES autocli and hostsim writers on a host that does not exist yet"
# The first of them makes the host, its files included; the others wait for it instead of
# failing or finding the host without its files. Every third one is a hostsim merge.
export HOSTSIM_STATE="$E2E_DIR/fresh/state.db" MESK_HOST_ROOT="$E2E_DIR/fresh/root"
rm -f "$E2E_DIR"/status.*
for ((n = 0; n < PROCESSES; n++)); do
    printf '{"policies": {"class%d": "policy %d"}}' "$n" "$n" >"$E2E_DIR/merge.$n.json"
    ((n % 3 == 0)) && spawn "$n" -h load --merge "$E2E_DIR/merge.$n.json" && continue
    spawn "$n" mesk cluster unicastagent add -t node -U true -a "10.1.0.$n" -p $((20000 + n)) \
        -u "$(printf '5c0a9e11-0000-4000-8000-%012d' "$n")"
done
wait
expect_eq "$(succeeded $PROCESSES)" "$PROCESSES" "processes that succeeded"
sim show
expect_eq "$(jq '[.unicastAgents[] | split(";")[3]] | unique | length' <<<"$OUT")" \
    "$((PROCESSES - (PROCESSES + 2) / 3))" "distinct agents configured"
expect_eq "$(jq '[.policies | keys[] | select(startswith("class"))] | length' <<<"$OUT")" \
    "$(((PROCESSES + 2) / 3))" "policies merged"

export HOSTSIM_STATE="$E2E_DIR/state.db" MESK_HOST_ROOT="$E2E_DIR/root"

case_ "$PROCESSES processes tag distinct SSDs"
# A fresh host with that many unclaimed SSDs, each of a device and UUID of its own.
"$HOSTSIM" reset >/dev/null
sim show
jq --argjson count "$PROCESSES" '.storage.disks = [range($count) as $n | .storage.disks[0]
    | .name = "mpx.pthba3:C0:T\($n):L0"
    | .uuid = "52a0e7c4-0000-4000-8000-\($n + 1000000000000 | tostring | .[1:])"]' \
    <<<"$OUT" >"$E2E_DIR/ssds.json"
sim load "$E2E_DIR/ssds.json"
expect_rc 0
rm -f "$E2E_DIR"/status.*
for ((n = 0; n < PROCESSES; n++)); do
    spawn "$n" mesk storage tag add -t capacityFlash -d "mpx.pthba3:C0:T$n:L0"
done
wait
expect_eq "$(succeeded $PROCESSES)" "$PROCESSES" "processes that succeeded"
sim show
expect_eq "$(jq '[.storage.disks[] | select(.capacityFlashTag)] | length' <<<"$OUT")" \
    "$PROCESSES" "tagged SSDs"

case_ "$PROCESSES processes set the default policies of five classes"
# Ten processes per class, each with a policy of its own: every class ends with one of the
# policies written for it, whole.
"$HOSTSIM" reset >/dev/null
CLASSES=(cluster vdisk vmnamespace vmswap vmem)
rm -f "$E2E_DIR"/status.*
for ((n = 0; n < PROCESSES; n++)); do
    spawn "$n" mesk policy setdefault -c "${CLASSES[n % 5]}" \
        -p "((\"hostFailuresToTolerate\" i1) (\"stripeWidth\" i$((n / 5 + 1))))"
done
wait
expect_eq "$(succeeded $PROCESSES)" "$PROCESSES" "processes that succeeded"
sim show
for class in "${CLASSES[@]}"; do
    policy=$(jq -r --arg class "$class" '.policies[$class]' <<<"$OUT")
    if [[ "$policy" =~ ^\(\(\"hostFailuresToTolerate\"\ i1\)\ \(\"stripeWidth\"\ i([0-9]+)\)\)$ ]] &&
        [ "${BASH_REMATCH[1]}" -ge 1 ] && [ "${BASH_REMATCH[1]}" -le 10 ]; then
        _pass
    else
        _fail "the policy of $class is '$policy'"
    fi
done

case_ "8 processes joining and leaving: the configuration generation counts every change"
# Each successful `cluster new` or `cluster leave` reads the configuration generation and
# writes it back one higher; the processes race for the same record, and some of them are
# refused because another got there first. A lost update would leave the counter short of
# the number of successful changes.
"$HOSTSIM" reset >/dev/null
sim show
initial=$(jq '.cluster.configGeneration.generation' <<<"$OUT")
ROUNDS=6
rm -f "$E2E_DIR"/status.*
for ((p = 0; p < 8; p++)); do
    (
        ok=0
        for ((r = 0; r < ROUNDS; r++)); do
            if (((p + r) % 2 == 0)); then verb=new; else verb=leave; fi
            if "$AUTOCLI" mesk cluster "$verb" >/dev/null 2>&1; then ok=$((ok + 1)); fi
        done
        echo "$ok" >"$E2E_DIR/count.$p"
    ) &
done
wait
changes=0
for ((p = 0; p < 8; p++)); do changes=$((changes + $(cat "$E2E_DIR/count.$p"))); done
sim show
final=$(jq '.cluster.configGeneration.generation' <<<"$OUT")
expect_eq "$final" "$((initial + changes))" "generation after $changes successful changes"
echo "$changes of $((8 * ROUNDS)) joins and leaves changed the cluster"
if [ "$changes" -gt 0 ]; then _pass; else _fail "no process changed the cluster"; fi

case_ "hostsim merges and services race autocli writers: every change lands"
# A merge reads the host and writes it back whole, services included, and `hostsim service`
# rewrites the services; without one transaction around each, one overwrote what another had
# written in between.
"$HOSTSIM" reset >/dev/null
rm -f "$E2E_DIR"/status.*
for ((n = 0; n < 8; n++)); do
    printf '{"policies": {"class%d": "policy %d"}}' "$n" "$n" >"$E2E_DIR/merge.$n.json"
    "$HOSTSIM" load --merge "$E2E_DIR/merge.$n.json" &
    spawn "$n" mesk cluster unicastagent add -t node -U true -a "10.2.0.$n" -p 20000 \
        -u "$(printf '5c0a9e11-0000-4000-8000-%012d' "$n")"
    if ((n % 2)); then "$HOSTSIM" service mesktraced status-fails & else
        "$HOSTSIM" service mesktraced restart-fails 5 &
    fi
done
wait
expect_eq "$(succeeded 8)" 8 "autocli writers that succeeded"
sim show
expect_eq "$(jq -c '[([.policies | to_entries[] | select(.key | startswith("class"))] | length),
    (.unicastAgents | length), .services.mesktraced]' <<<"$OUT")" \
    '[8,8,{"state":"running","statusFails":true,"restartFailures":5}]' "merged policies, agents, service"

finish
