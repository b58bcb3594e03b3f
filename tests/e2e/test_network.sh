#!/usr/bin/env bash
# End to end: `mesk network` (interfaces add, set, list, remove, clear, restore) through
# autocli against the simulated host. That `network ipv4` holds the same commands, the
# registry's unit test shows.
source "$(dirname "$0")/lib.sh"

# The JSON text of one interface entry from the agent group on: the agent group, master group,
# unicast port, TTL and traffic types.
entry_tail() {
    printf '"Agent Group Multicast Address":"%s","Agent Group IPv6 Multicast Address":"%s","Agent Group Multicast Port":%s,' "$1" "$2" "$3"
    printf '"Master Group Multicast Address":"%s","Master Group IPv6 Multicast Address":"%s","Master Group Multicast Port":%s,' "$4" "$5" "$6"
    printf '"Host Unicast Channel Bound Port":%s,"Multicast TTL":%s,"Traffic Type":"%s"}' "$7" "$8" "$9"
}
DEFAULT_GROUPS="224.2.3.4 FF19:0:0:0:0:2:3:4 23451 224.1.2.3 FF19:0:0:0:0:1:2:3 12345"
# The names and interface UUIDs of the configured interfaces, one "name uuid" a line.
interfaces() {
    run mesk network list --formatter=json
    jq -r '.[] | "\(."ZuvNic Name") \(."Interface UUID")"' <<<"$OUT"
}

case_ "add without options writes the defaults; set of one port keeps the rest and the UUID"
ok mesk network list --formatter=json
expect_out '[]'
ok mesk network ip add -i zuvnic1
ok mesk network list --formatter=json
expect_out_has '[{"ZuvNic Name":"zuvnic1","IP Protocol":"IP","Interface UUID":"'
# shellcheck disable=SC2086
expect_out_has "$(entry_tail $DEFAULT_GROUPS 12321 5 mesk)"
before=$(interfaces)
ok mesk network ip set -i zuvnic1 -p 2000 -T witness -T mesk
ok mesk network list --formatter=json
expect_out_has "$(entry_tail 224.2.3.4 FF19:0:0:0:0:2:3:4 2000 224.1.2.3 FF19:0:0:0:0:1:2:3 12345 12321 5 "mesk, witness")"
expect_eq "$(interfaces)" "$before" "interface UUID after set"

case_ "clear empties the configuration and restore brings it back"
ok mesk network ip add -i zuvnic2 -u 239.1.1.1
before=$(interfaces)
ok mesk network clear
expect_eq "$(interfaces)" "" "interfaces after clear"
ok mesk network restore
expect_eq "$(interfaces)" "$before" "interfaces after restore"

case_ "remove takes both traffic types; an ordinary interface needs no --force"
ok mesk network ip remove -i zuvnic1
ok mesk network remove -i zuvnic2
expect_eq "$(interfaces)" "" "interfaces after removal"

finish
