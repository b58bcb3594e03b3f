#!/usr/bin/env bash
# End to end: `mesk network` (interfaces add, set, list, remove, clear, restore) through
# autocli against the simulated host, and the same interface commands under `network ipv4`.
source "$(dirname "$0")/lib.sh"

ALREADY="This Zuvola network interface is already in use. Can't add again. If you want to reconfigure, use 'set' command."
NOT_IN_USE="This Zuvola network interface is not in use. Can't set/reconfigure. If you want to add, use 'add' command."

# The JSON text of one interface entry from its name on, without the interface UUID, which the
# host assigns: name, then the agent group, master group, unicast port, TTL and traffic types.
entry_head() { printf '{"ZuvNic Name":"%s","IP Protocol":"IP","Interface UUID":' "$1"; }
entry_tail() {
    printf '"Agent Group Multicast Address":"%s","Agent Group IPv6 Multicast Address":"%s","Agent Group Multicast Port":%s,' "$1" "$2" "$3"
    printf '"Master Group Multicast Address":"%s","Master Group IPv6 Multicast Address":"%s","Master Group Multicast Port":%s,' "$4" "$5" "$6"
    printf '"Host Unicast Channel Bound Port":%s,"Multicast TTL":%s,"Traffic Type":"%s"}' "$7" "$8" "$9"
}
DEFAULT_GROUPS=("224.2.3.4" "FF19:0:0:0:0:2:3:4" 23451 "224.1.2.3" "FF19:0:0:0:0:1:2:3" 12345 12321 5)

# Sets OUT to the remove calls of the last invocation, one "name,force,type" per line, in
# order.
remove_calls() {
    sim calls
    OUT=$(grep '"op":"RemoveZuvNic"' <<<"$OUT" | sed -e 's/.*"args":\[//' -e 's/\].*//' -e 's/"//g')
}

case_ "an empty configuration lists as an empty list"
run mesk network list --formatter=json
expect_rc 0
expect_out '[]'

case_ "add without options writes the defaults"
run mesk network ip add -i vmk1
expect_rc 0
expect_out ''
expect_err ''
run mesk network list --formatter=json
expect_rc 0
expect_out_has "$(entry_head vmk1)"
expect_out_has "$(entry_tail "${DEFAULT_GROUPS[@]}" mesk)"

case_ "simple list shows every field under the entry's title"
run mesk network list
expect_rc 0
for line in "Interface" "ZuvNic Name: vmk1" "IP Protocol: IP" "Interface UUID: " \
    "Agent Group Multicast Address: 224.2.3.4" \
    "Agent Group IPv6 Multicast Address: FF19:0:0:0:0:2:3:4" \
    "Agent Group Multicast Port: 23451" "Master Group Multicast Address: 224.1.2.3" \
    "Master Group IPv6 Multicast Address: FF19:0:0:0:0:1:2:3" \
    "Master Group Multicast Port: 12345" "Host Unicast Channel Bound Port: 12321" \
    "Multicast TTL: 5" "Traffic Type: mesk"; do
    expect_out_has "$line"
done

case_ "set of one port keeps every other value"
run mesk network ip set -i vmk1 -p 2000
expect_rc 0
run mesk network list --formatter=json
expect_out_has "$(entry_tail 224.2.3.4 FF19:0:0:0:0:2:3:4 2000 224.1.2.3 FF19:0:0:0:0:1:2:3 12345 12321 5 mesk)"

case_ "add of an interface in use is refused and changes nothing"
run mesk network ip add -i vmk1 -p 9
expect_rc 1
expect_err "$ALREADY"
run mesk network list --formatter=json
expect_out_has '"Agent Group Multicast Port":2000,'

case_ "set of an unknown interface is refused"
run mesk network ip set -i vmk9 -p 9
expect_rc 1
expect_err "$NOT_IN_USE"
run mesk network list --formatter=json
expect_out_lacks vmk9

case_ "traffic types replace the current ones; an unknown one writes nothing"
run mesk network ip set -i vmk1 -T witness -T mesk
expect_rc 0
run mesk network list --formatter=json
expect_out_has '"Traffic Type":"mesk, witness"}'
run mesk network ip set -i vmk1 -T witness -T Mesk -p 7
expect_rc 1
expect_err "Unknown traffic type"
run mesk network list --formatter=json
expect_out_has '"Agent Group Multicast Port":2000,'
expect_out_has '"Traffic Type":"mesk, witness"}'

case_ "remove asks for mesk, then witness"
run mesk network ip remove -i vmk1
expect_rc 0
expect_out ''
remove_calls
expect_out $'vmk1,false,mesk\nvmk1,false,witness'
run mesk network list --formatter=json
expect_out '[]'

case_ "an ordinary interface is removed without --force; an unknown one is refused"
run mesk network ip add -i vmk2
run mesk network remove -i vmk2
expect_rc 0
expect_out ''
run mesk network remove -i vmk2
expect_rc 1
expect_err_has 'is not configured'

case_ "a failed mesk removal is false and stops the witness removal"
run mesk network ip add -i vmk1 -T mesk -T witness
expect_rc 0
sim fail RemoveZuvNic "injected removal failure" --call 1
run mesk network remove -i vmk1 --force
expect_rc 1
expect_out 'false'
expect_err 'injected removal failure'
remove_calls
expect_out 'vmk1,true,mesk'
sim fail --clear
run mesk network remove -i vmk1 --force
expect_rc 0
remove_calls
expect_out $'vmk1,true,mesk\nvmk1,true,witness'

case_ "a list failure still prints the list so far and completes"
run mesk network ip add -i vmk1
sim fail GetZuvNicConfigs "configuration store busy"
run mesk network list --formatter=json --debug
expect_rc 1
expect_out '[]'
expect_err_has 'configuration store busy'
expect_err_has 'output complete: yes'
sim fail --clear

case_ "clear empties the configuration and restore brings it back"
run mesk network ip add -i vmk2 -u 239.1.1.1
expect_rc 0
run mesk network clear
expect_rc 0
expect_out ''
run mesk network list --formatter=json
expect_out '[]'
run mesk network restore
expect_rc 0
expect_out ''
run mesk network list --formatter=json
expect_out_has "$(entry_head vmk1)"
expect_out_has "$(entry_head vmk2)"
expect_out_has '"Master Group Multicast Address":"239.1.1.1"'

case_ "clear and restore failures are false and complete"
for op in clear restore; do
    fn=ClearNetworkConfig
    [ "$op" = restore ] && fn=RestoreNetworkConfig
    sim fail "$fn" "injected $op failure"
    run mesk network "$op" --debug
    expect_rc 1
    expect_out 'false'
    expect_err $'injected '"$op"$' failure\noutput complete: yes'
    run mesk network "$op" --formatter=json
    expect_out 'false'
    sim fail --clear
done

case_ "the ipv4 alias adds, sets and removes alike"
run mesk network clear
run mesk network ipv4 add -i vmk3 -t 16
expect_rc 0
run mesk network ipv4 add -i vmk3
expect_rc 1
expect_err "$ALREADY"
run mesk network ipv4 set -i vmk3 -c 4000
expect_rc 0
run mesk network list --formatter=json
expect_out_has "$(entry_head vmk3)"
expect_out_has "$(entry_tail 224.2.3.4 FF19:0:0:0:0:2:3:4 23451 224.1.2.3 FF19:0:0:0:0:1:2:3 12345 4000 16 mesk)"
run mesk network ipv4 set -i vmk9
expect_rc 1
expect_err "$NOT_IN_USE"
run mesk network ipv4 remove -i vmk3 --force
expect_rc 0
remove_calls
expect_out $'vmk3,true,mesk\nvmk3,true,witness'
run mesk network list --formatter=json
expect_out '[]'

finish
