#!/usr/bin/env bash
# Changing commands of autocli and hostsim killed with SIGKILL at random moments: the simulated
# host's state still opens, passes SQLite's integrity check, and shows each change whole or
# not at all, the files below the host root included.
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
SETUP=(reset reset populate populate stopped reset reset)
jq '.settings.datastoreName = "loaded" | .services.mesktraced.state = "stopped"' \
    <<<"$("$HOSTSIM" show)" >"$E2E_DIR/load.json"
COMMANDS=(
    "autocli mesk storage add -s $SSD -d $HDD1 -d $HDD2"
    "autocli mesk cluster new"
    "autocli mesk cluster leave"
    "autocli mesk network ip add -i zuvnic9 -T witness"
    "hostsim reset"
    "hostsim load $E2E_DIR/load.json"
    "autocli mesk trace set -p /scratch/crash"
)
# storage add: the SSD and both HDDs in one disk group, or none of them in any.
# cluster new and leave: the cluster record and the membership agree, and the configuration
# generation moved by one exactly when the membership did.
# interface add: the interface is both live and persisted, or neither.
# reset: the populated host with its service stopped, or the fresh one with it running.
# load: the document's datastore name and service state, or neither.
# trace set: the configuration file ($conf) holds its five lines, or those and the new one;
# the command empties it before it writes it whole, so a kill in between leaves it empty.
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
    "[.cluster.enabled, (.storage.disks | length), .services.mesktraced.state] |
     . == [false, 4, \"running\"] or . == [true, 8, \"stopped\"]"
    "(.settings.datastoreName == \"loaded\") == (.services.mesktraced.state == \"stopped\")"
    "\$conf == \"\" or (\$conf | endswith(\"\\n\") and ([6, 7] | index(\$conf | split(\"\\n\") | length) != null))"
)

setup() {
    case "$1" in
        reset) "$HOSTSIM" reset >/dev/null ;;
        populate) "$HOSTSIM" populate --luns 8 --agents 2 --nics 2 >/dev/null ;;
        stopped) setup populate && "$HOSTSIM" service mesktraced stopped ;;
    esac
}
# A scenario's command line as words, its first the program (so that $! is the program's
# own process, not a shell's).
declare -A PROGRAMS=([autocli]="$AUTOCLI" [hostsim]="$HOSTSIM")
words_of() {
    read -r -a words <<<"$1"
    words[0]=${PROGRAMS[${words[0]}]}
}
check() {
    jq --rawfile conf "$MESK_HOST_ROOT/etc/orvane/mesk/mesktraced.conf" "${CHECKS[$1]}" <<<"$OUT" 2>&1
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
    words_of "${COMMANDS[s]}"
    took=()
    for _ in 1 2 3; do
        setup "${SETUP[s]}"
        start=${EPOCHREALTIME/./}
        "${words[@]}" >/dev/null 2>&1
        RC=$?
        end=${EPOCHREALTIME/./}
        took+=($((end - start)))
    done
    DURATION[s]=$(printf '%s\n' "${took[@]}" | sort -n | sed -n 2p)
    expect_rc 0
    sim show
    expect_eq "$(check "$s")" true "check after the whole change"
done

killed=0
for ((round = 0; round < ROUNDS; round++)); do
    s=$((round % ${#COMMANDS[@]}))
    case_ "round $round: ${COMMANDS[s]}"
    setup "${SETUP[s]}"
    words_of "${COMMANDS[s]}"
    # Up to 1.2 times the command's run time, so that a few rounds let it finish.
    delay_us=$((RANDOM * 32768 + RANDOM))
    delay_us=$((delay_us % (DURATION[s] * 6 / 5 + 1)))
    "${words[@]}" >/dev/null 2>&1 &
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
    expect_eq "$(check "$s")" true "whole or nothing (killed after ${delay_us}us, status $status)"
done

echo "$ROUNDS rounds, $killed killed before they finished"
finish
