#!/usr/bin/env bash
# Bad input for every registered command and every one of its parameters, table-driven: the
# commands come from `autocli --list-commands`, their parameters (kind, required, short name)
# from each command's help, enumerations and integer ranges from how autocli refuses a value
# outside them.
#
# What autocli refuses must exit 2 with one line on stderr that names the option, and must
# not have run the command: `hostsim show` (and the tracing service's file) byte-identical,
# no host-control call logged. What it accepts must exit 0 or 1, never die by a signal or
# hang, and no shell ever runs a value (that every formatter stays readable whatever the
# values, the formatter fuzzing shows). A text with a line break or another control character
# is refused for every text parameter.
source "$(dirname "$0")/lib.sh"

MARK="$E2E_DIR/shell-ran"
TRACE_CONF="$MESK_HOST_ROOT/etc/orvane/mesk/mesktraced.conf"
LONG_TEXT=$(head -c 65536 /dev/zero | tr '\0' 'x')
LONG_DIGITS=$(head -c 65536 /dev/zero | tr '\0' '9')  # also out of the 64-bit range
CASES=0
PARAMETERS=0

# A host in a cluster with disk groups, agents and interfaces, so that commands get past their
# first checks, and an empty call log. It is the same host every time, so its snapshot (the
# state and the tracing service's file) is taken once.
populate() {
    "$HOSTSIM" populate --luns 8 --agents 2 --nics 2 >/dev/null || { echo "populate failed"; exit 1; }
}
snapshot() {
    "$HOSTSIM" show
    printf '%s' "$(<"$TRACE_CONF")"
}

populate
SNAPSHOT=$(snapshot)
"$HOSTSIM" calls --clear
SSD=$("$HOSTSIM" show | jq -r '[.storage.disks[] | select(.isSsd)][0].name')
HDD=$("$HOSTSIM" show | jq -r '[.storage.disks[] | select(.isSsd | not)][0].name')

# A value that a parameter's command can work with, by parameter name; the rest get a
# plain name. Only required parameters are given one, so that each case changes one thing.
valid_text() {
    case "$1" in
        cluster-uuid | uuid) echo "52b0c0de-0000-4000-8000-0000000000c1" ;;
        addr) echo "10.0.0.99" ;;
        ssd) echo "$SSD" ;;
        disk | disks | device) echo "$HDD" ;;
        interface-name) echo "zuvnic0" ;;
        tag) echo "capacityFlash" ;;
        policy-class) echo "vdisk" ;;
        policy) echo '(("hostFailuresToTolerate" i1))' ;;
        *) echo "e2e-name" ;;
    esac
}

# The commands and their parameters, from autocli's command reference (one run for all):
# PATHS in registration order; per path PARAMS (its parameter names); per "path|name" KIND
# (text, integer, boolean, flag, list), SHORT and REQUIRED (yes/no).
declare -A PARAMS KIND SHORT REQUIRED
read_reference() {
    PATHS=()
    local line path="" row='^\| `--([a-z0-9-]+)` \| (`-([[:alnum:]])`)? *\| ([a-z, ]+) \| (yes|no) \|'
    while IFS= read -r line; do
        if [[ "$line" =~ ^##\ \`(.*)\`$ ]]; then
            path="${BASH_REMATCH[1]}"
        elif [[ "$line" =~ ^Type:\  ]]; then
            PATHS+=("$path")
            PARAMS[$path]=""
        elif [[ "$line" =~ $row ]]; then
            local key="$path|${BASH_REMATCH[1]}"
            PARAMS[$path]+=" ${BASH_REMATCH[1]}"
            SHORT[$key]="${BASH_REMATCH[3]}"
            REQUIRED[$key]="${BASH_REMATCH[5]}"
            case "${BASH_REMATCH[4]}" in
                "text, repeatable") KIND[$key]=list ;;
                *) KIND[$key]="${BASH_REMATCH[4]}" ;;
            esac
        fi
    done < <("$AUTOCLI" --reference)
}

# The parameters of the command in COMMAND: NAMES, P (the key prefix of its parameters in
# KIND, SHORT and REQUIRED), and per name CHOICES (its enumeration, ", "-separated) and RANGE
# ("low high"). autocli names the allowed values when it refuses one outside them; a trailing
# unknown option keeps the command from running when the value is accepted.
declare -A CHOICES RANGE
read_parameters() {
    local name err
    P="${COMMAND[*]}|"
    read -r -a NAMES <<<"${PARAMS[${COMMAND[*]}]}"
    CHOICES=() RANGE=()
    for name in "${NAMES[@]}"; do
        case "${KIND[$P$name]}" in
            text | list) err=$("$AUTOCLI" "${COMMAND[@]}" "--$name" "not-a-choice" --zz-stop 2>&1 >/dev/null) ;;
            integer) err=$("$AUTOCLI" "${COMMAND[@]}" "--$name" 9223372036854775807 --zz-stop 2>&1 >/dev/null) ;;
            *) continue ;;
        esac
        if [[ "$err" =~ must\ be\ one\ of\ (.*)\ \(got ]]; then
            CHOICES[$name]="${BASH_REMATCH[1]}"
        elif [[ "$err" =~ must\ be\ between\ (-?[0-9]+)\ and\ (-?[0-9]+) ]]; then
            RANGE[$name]="${BASH_REMATCH[1]} ${BASH_REMATCH[2]}"
        fi
    done
}

# A valid value of a parameter of the current command.
valid_value() {
    local name="$1"
    if [ -n "${CHOICES[$name]:-}" ]; then echo "${CHOICES[$name]%%, *}"; return; fi
    if [ -n "${RANGE[$name]:-}" ]; then echo "${RANGE[$name]%% *}"; return; fi
    case "${KIND[$P$name]}" in
        integer) echo 1 ;;
        boolean) echo true ;;
        *) valid_text "$name" ;;
    esac
}

# BASE: the required options of the current command with valid values; `base_without NAME`
# leaves one out.
base_without() {
    BASE=()
    local name
    for name in "${NAMES[@]}"; do
        [ "${REQUIRED[$P$name]}" = yes ] && [ "$name" != "${1:-}" ] || continue
        if [ "${KIND[$P$name]}" = flag ]; then BASE+=("--$name"); else BASE+=("--$name" "$(valid_value "$name")"); fi
    done
}

# A refused command leaves the host as it was and calls nothing, so the host is compared with
# its snapshot and the call log read once for a run of refused cases (before a case that may
# run its command, and after each parameter) rather than after each one.
REFUSED_CASES=0
check_untouched() {
    [ "$REFUSED_CASES" -gt 0 ] || return 0
    local calls
    calls=$("$HOSTSIM" calls)
    if [ "$(snapshot)" != "$SNAPSHOT" ]; then
        _fail "one of the last $REFUSED_CASES refused commands changed the host"
        populate
    elif [ -n "$calls" ]; then
        _fail "one of the last $REFUSED_CASES refused commands called the host: $calls"
        populate
    else
        _pass
    fi
    REFUSED_CASES=0
}

# try EXPECT OPTION ARGS...: runs autocli with ARGS. EXPECT "refused": it must exit 2 naming
# OPTION and leave the host as it was. EXPECT "any": it may also exit 0 or 1 (the command
# ran); a refusal must still name OPTION and leave the host as it was.
try() {
    local expect="$1" option="$2"
    shift 2
    CASES=$((CASES + 1))
    if [ "$expect" = any ]; then check_untouched; fi
    _capture timeout 20 "$AUTOCLI" "$@"
    if [ -e "$MARK" ]; then
        _fail "a shell ran part of a value"
        rm -f "$MARK"
    fi
    case "$RC" in
        0 | 1)
            if [ "$expect" = refused ]; then _fail "accepted, expected exit 2"; else _pass; fi
            populate
            ;;
        2)
            if [ -z "$ERR" ] || [[ "$ERR" == *$'\n'* ]]; then
                _fail "expected one line on stderr"
            elif [[ "$ERR" != *"'$option'"* ]]; then
                _fail "the message does not name $option"
            else
                _pass
            fi
            REFUSED_CASES=$((REFUSED_CASES + 1))
            ;;
        124) _fail "hung" ;;
        *) _fail "died with status $RC" ;;
    esac
}

# A value that reaches no shell, whatever a command does with it: a shell that ran any part
# of it would make the marker file.
SHELL_VALUE="x\$(touch $MARK);touch $MARK|touch $MARK&&touch $MARK\`touch $MARK\`"

# Every registered command, and the reference describes each.
read_reference
mapfile -t LISTED < <("$AUTOCLI" --list-commands)
case_ "the reference describes every registered command"
expect_eq "$(printf '%s\n' "${PATHS[@]}")" "$(printf '%s\n' "${LISTED[@]}")" "commands in the reference"
if [ "${#PATHS[@]}" -lt 40 ]; then
    echo "only ${#PATHS[@]} commands are registered" >&2
    exit 1
fi

for path in "${LISTED[@]}"; do
    check_untouched
    read -r -a COMMAND <<<"$path"
    case_ "$path"
    read_parameters
    PARAMETERS=$((PARAMETERS + ${#NAMES[@]}))

    # The command as a whole: an unknown option, each required option left out.
    base_without ""
    try refused --no-such-option "${COMMAND[@]}" "${BASE[@]}" --no-such-option x
    for name in "${NAMES[@]}"; do
        if [ "${REQUIRED[$P$name]}" = yes ]; then
            base_without "$name"
            try refused "--$name" "${COMMAND[@]}" "${BASE[@]}"
        fi
    done

    check_untouched
    for name in "${NAMES[@]}"; do
        check_untouched
        case_ "$path --$name"
        base_without "$name"
        opt="--$name"
        args=("${COMMAND[@]}" "${BASE[@]}")
        value=$(valid_value "$name")
        short_opt=""
        if [ -n "${SHORT[$P$name]}" ]; then short_opt="-${SHORT[$P$name]}"; fi

        # Refused values first, so that the host is checked once for all of them before a
        # value that runs the command. Given twice (only a list takes that); no value at the
        # end of the line.
        if [ "${KIND[$P$name]}" = flag ]; then
            try refused "$opt" "${args[@]}" "$opt" "$opt"
            try refused "$opt" "${args[@]}" "$opt=1"
            continue
        fi
        if [ "${KIND[$P$name]}" != list ]; then
            try refused "$opt" "${args[@]}" "$opt" "$value" "$opt" "$value"
        fi
        try refused "$opt" "${args[@]}" "$opt"

        # The values below use each spelling of an option in turn ("--name value",
        # "--name=value", "-x value" where there is a short name).
        case "${KIND[$P$name]}" in
            integer)
                try refused "$opt" "${args[@]}" "${short_opt:-$opt}" "twelve"
                try refused "$opt" "${args[@]}" "$opt" ""
                try refused "$opt" "${args[@]}" "$opt" "$LONG_DIGITS"
                try refused "$opt" "${args[@]}" "$opt=-9223372036854775809"
                try refused "$opt" "${args[@]}" "$opt" $'\xff\n1'
                if [ -n "${RANGE[$name]:-}" ]; then
                    read -r low high <<<"${RANGE[$name]}"
                    try refused "$opt" "${args[@]}" "$opt" "$((low - 1))"
                    try refused "$opt" "${args[@]}" "$opt=$((high + 1))"
                fi
                ;;
            boolean)
                try refused "$opt" "${args[@]}" "${short_opt:-$opt}" "maybe"
                try refused "$opt" "${args[@]}" "$opt="
                try refused "$opt" "${args[@]}" "$opt" $'\xff\ntrue'
                ;;
            text | list)
                if [ -n "${CHOICES[$name]:-}" ]; then
                    try refused "$opt" "${args[@]}" "${short_opt:-$opt}" "not-a-choice"
                fi
                try refused "$opt" "${args[@]}" "$opt="$'a\nb'
                try refused "$opt" "${args[@]}" "${short_opt:-$opt}" $'\x1b[31mred\r\x7f\x01'
                ;;
        esac
        check_untouched

        # Values that the command may get.
        case "${KIND[$P$name]}" in
            integer)
                if [ -n "${RANGE[$name]:-}" ]; then
                    try any "$opt" "${args[@]}" "$opt" "${RANGE[$name]#* }"
                fi
                ;;
            boolean)
                try any "$opt" "${args[@]}" "$opt=FALSE"
                ;;
            text | list)
                if [ "${KIND[$P$name]}" = list ]; then
                    try any "$opt" "${args[@]}" "$opt" "$value" "$opt" "$value"
                fi
                # An empty value, an over-long one that is not UTF-8 either, and one that a
                # shell would run.
                try any "$opt" "${args[@]}" "$opt="
                try any "$opt" "${args[@]}" "$opt" "$LONG_TEXT"$'\xff\xfe\xc3('
                try any "$opt" "${args[@]}" "${short_opt:-$opt}" "$SHELL_VALUE"
                ;;
        esac
    done
done
check_untouched

echo "$CASES cases over ${#LISTED[@]} commands and $PARAMETERS parameters"
finish
