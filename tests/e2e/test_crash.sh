#!/usr/bin/env bash
# Changing commands killed with SIGKILL at random moments: the simulated host's state still
# opens, passes SQLite's integrity check, and shows each change whole or not at all.
#
# Each round restores a host, starts one changing command, kills it after a random delay
# between nothing and a little more than the command's own run time, and checks the state.
# MESK_CRASH_ROUNDS (default 100) and MESK_CRASH_SEED repeat or reproduce a run.
source "$(dirname "$0")/lib.sh"

ROUNDS="${MESK_CRASH_ROUNDS:-100}"
SEED="${MESK_CRASH_SEED:-$$}"
RANDOM=$SEED
echo "seed $SEED"

SSD=mpx.pthba2:C0:T0:L0
HDD1=mpx.pthba2:C0:T1:L0
HDD2=mpx.pthba2:C0:T2:L0

# The scenarios: how the host is set up, the command, and what a whole change and no change
# look like (a jq expression over `hostsim show` that must be true either way).
SETUP=(reset reset populate populate)
COMMANDS=(
    "mesk storage add -s $SSD -d $HDD1 -d $HDD2"
    "mesk cluster new"
    "mesk cluster leave"
    "mesk network ip add -i zuvnic9 -T witness"
)
# storage add: the SSD and both HDDs in one disk group, or none of them in any.
# cluster new and leave: the cluster record and the membership agree, and the configuration
# generation moved by one exactly when the membership did.
# interface add: the interface is both live and persisted, or neither.
CHECKS=(
    "[.storage.disks[] | select(.name == \"$SSD\" or .name == \"$HDD1\" or .name == \"$HDD2\")
      | .diskGroupUuid] as \$groups
     | (\$groups | all(. == \"\")) or
       ((\$groups | unique | length) == 1 and \$groups[0] != \"\" and
        ([.storage.disks[] | select(.diskGroupUuid != \"\")] | length) == 3)"
    "(.cluster.enabled == (.membership.localNodeState == \"MASTER\")) and
     (.cluster.configGeneration.generation == (if .cluster.enabled then 1 else 0 end))"
    "(.cluster.enabled == (.membership.localNodeState == \"MASTER\")) and
     (.cluster.configGeneration.generation == (if .cluster.enabled then 1 else 2 end))"
    "([.network.interfaces[].name] | index(\"zuvnic9\") != null) ==
     ([.network.persisted[].name] | index(\"zuvnic9\") != null)"
)

setup() {
    case "$1" in
        reset) "$HOSTSIM" reset >/dev/null ;;
        populate) "$HOSTSIM" populate --luns 8 --agents 2 --nics 2 >/dev/null ;;
    esac
}

# Waits without starting a process (so that short delays stay short): a read with a timeout
# on a pipe that nobody writes to.
exec {NEVER}<> <(:)
pause_us() { read -r -t "$(printf '%d.%06d' $(($1 / 1000000)) $(($1 % 1000000)))" -u "$NEVER" || true; }

# How long each command takes when nobody kills it (the median of three runs, in
# microseconds), and a check that its whole change passes the scenario's check.
declare -a DURATION
for s in "${!COMMANDS[@]}"; do
    case_ "${COMMANDS[s]} uninterrupted"
    read -r -a words <<<"${COMMANDS[s]}"
    took=()
    for _ in 1 2 3; do
        setup "${SETUP[s]}"
        start=${EPOCHREALTIME/./}
        "$AUTOCLI" "${words[@]}" >/dev/null 2>&1
        RC=$?
        end=${EPOCHREALTIME/./}
        took+=($((end - start)))
    done
    DURATION[s]=$(printf '%s\n' "${took[@]}" | sort -n | sed -n 2p)
    expect_rc 0
    sim show
    expect_eq "$(jq "${CHECKS[s]}" <<<"$OUT")" true "check after the whole change"
done

killed=0
for ((round = 0; round < ROUNDS; round++)); do
    s=$((round % ${#COMMANDS[@]}))
    case_ "round $round: ${COMMANDS[s]}"
    setup "${SETUP[s]}"
    read -r -a words <<<"${COMMANDS[s]}"
    # Up to 1.2 times the command's run time, so that a few rounds let it finish.
    delay_us=$((RANDOM * 32768 + RANDOM))
    delay_us=$((delay_us % (DURATION[s] * 6 / 5 + 1)))
    "$AUTOCLI" "${words[@]}" >/dev/null 2>&1 &
    pid=$!
    pause_us "$delay_us"
    kill -KILL "$pid" 2>/dev/null
    status=0
    wait "$pid" 2>/dev/null || status=$?
    if [ "$status" -eq 137 ]; then killed=$((killed + 1)); fi

    sim show
    expect_rc 0
    integrity=$(sqlite3 "$HOSTSIM_STATE" "PRAGMA integrity_check" 2>&1)
    expect_eq "$integrity" ok "integrity check"
    expect_eq "$(jq "${CHECKS[s]}" <<<"$OUT" 2>&1)" true "whole or nothing (killed after ${delay_us}us, status $status)"
done

echo "$ROUNDS rounds, $killed killed before they finished"
finish
