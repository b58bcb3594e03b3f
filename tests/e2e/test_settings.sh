#!/usr/bin/env bash
# Host storage settings, default policies and resync through autocli against the simulated
# host: datastore name, fault domain, maintenance mode cancel, policy defaults, resync.
source "$(dirname "${BASH_SOURCE[0]}")/lib.sh"

UUID_RE='^[0-9a-f]{8}-[0-9a-f]{4}-[0-9a-f]{4}-[0-9a-f]{4}-[0-9a-f]{12}$'
POLICY='(("hostFailuresToTolerate" i1) ("stripeWidth" i2))'

case_ "rename the datastore and read the new name back"
run mesk datastore name get
expect_rc 0
expect_out "Name: meskDatastore"
run mesk datastore name set --newname "site A store"
expect_rc 0
expect_out ""
expect_err ""
run mesk datastore name get
expect_out "Name: site A store"

case_ "a failed rename reports the error; its result stays true and prints nothing"
sim fail SetDatastoreName "Datastore is busy"
run mesk datastore name set --newname other --debug
expect_rc 1
expect_out ""
expect_err $'Unable to set Mesk datastore name: Datastore is busy\noutput complete: yes'
sim fail --clear

case_ "set a fault domain; its id shows only once the host is in a cluster"
run mesk faultdomain set -n rack-1
expect_rc 0
expect_out ""
expect_err ""
run mesk faultdomain get
expect_rc 0
expect_out $'faultDomainName: rack-1\nfaultDomainId:'
run mesk cluster new
expect_rc 0
run mesk faultdomain get
expect_out_has "faultDomainName: rack-1"
FD_ID=$(printf '%s\n' "$OUT" | sed -n 's/^faultDomainId: //p')
if [[ "$FD_ID" =~ $UUID_RE ]]; then _pass; else _fail "no fault domain id: '$FD_ID'"; fi

case_ "a name is limited to 256 bytes, not characters"
ACCENTS=$(printf 'é%.0s' $(seq 128))
run mesk faultdomain set -n "${ACCENTS}"
expect_rc 0
run mesk faultdomain get
expect_out_has "faultDomainName: ${ACCENTS}"
run mesk faultdomain set -n "${ACCENTS}a" --debug
expect_rc 1
expect_out ""
expect_err $'Fault domain name cannot exceed 256 characters.\noutput complete: yes'
run mesk faultdomain get
expect_out_has "faultDomainName: ${ACCENTS}"$'\n'

case_ "reset, and an empty name, go back to no fault domain"
run mesk faultdomain reset
expect_rc 0
expect_out ""
run mesk faultdomain get
expect_out_has $'faultDomainName:\n'
run mesk faultdomain set -n rack-2
run mesk faultdomain set -n ""
expect_rc 0
run mesk faultdomain get
expect_out_has $'faultDomainName:\n'

case_ "a failed reset gives a fixed message without the library's text"
sim fail ResetFaultDomainName "Internal error 17"
run mesk faultdomain reset
expect_rc 1
expect_out ""
expect_err "Unable to reset fault domain name"
sim fail --clear

case_ "cancel maintenance mode: success, then an injected failure"
run mesk maintenancemode cancel --debug
expect_rc 0
expect_out ""
expect_err "output complete: yes"
sim fail DecomCancel "No maintenance mode operation in progress"
run mesk maintenancemode cancel --debug
expect_rc 1
expect_out "false"
expect_err $'No maintenance mode operation in progress\noutput complete: yes'
run mesk maintenancemode cancel --formatter=json
expect_out "false"
sim fail --clear

case_ "set default policies and list them as a table and as json"
run mesk policy setdefault -c vdisk -p "$POLICY"
expect_rc 0
expect_out ""
expect_err ""
run mesk policy setdefault --policy-class vmswap --policy '(("proportionalCapacity" i100))'
expect_rc 0
run mesk policy getdefault
expect_rc 0
expect_out_has "Policy Class"
expect_out_has "Policy Value"
expect_eq "$(printf '%s\n' "$OUT" | grep '^vdisk ')" "vdisk         $POLICY" "the vdisk row"
expect_eq "$(printf '%s\n' "$OUT" | grep '^vmswap ')" \
    "vmswap        ((\"proportionalCapacity\" i100))" "the vmswap row"
expect_eq "$(printf '%s\n' "$OUT" | grep -c -E '^(cluster|vdisk|vmnamespace|vmswap|vmem)( |$)')" 5 \
    "rows of the table"
run mesk policy getdefault -c vdisk --formatter=json
expect_rc 0
expect_out "[{\"Policy Class\":\"vdisk\",\"Policy Value\":\"((\\\"hostFailuresToTolerate\\\" i1) (\\\"stripeWidth\\\" i2))\"}]"

case_ "a class the framework does not know is a usage error"
run mesk policy setdefault -c disk -p "$POLICY"
expect_rc 2

case_ "a class that fails to read is left out without a message"
sim fail GetDefaultPolicy "unreadable" --call 2
run mesk policy getdefault --formatter=json --debug
expect_rc 0
expect_out_lacks '"vdisk"'
expect_out_has '"vmswap"'
expect_err "output complete: yes"
sim fail --clear

case_ "clear the default policies"
sim fail SetDefaultPolicy "Invalid policy"
run mesk policy setdefault -c cluster -p "junk"
expect_rc 1
expect_out "false"
expect_err "Invalid policy"
sim fail --clear
run mesk policy cleardefault
expect_rc 0
expect_out ""
run mesk policy getdefault --formatter=json
expect_out_lacks "stripeWidth"
expect_out_lacks "proportionalCapacity"

case_ "set the resync throttle and read it with its unit; output never complete"
run mesk resync throttle set --level 120 --debug
expect_rc 0
expect_out ""
expect_err "output complete: no"
run mesk resync throttle get --debug
expect_rc 0
expect_out "Level: 120 Mbps"
expect_err "output complete: no"

case_ "levels outside 0 to 512 are refused by the framework"
for level in 513 -1; do
    run mesk resync throttle set --level "$level"
    expect_rc 2
done
run mesk resync throttle get
expect_out "Level: 120 Mbps"
run mesk resync throttle set --level 0
expect_rc 0
run mesk resync throttle get
expect_out "Level: 0 Mbps"

case_ "bandwidth get, and a failure with the bare message"
sim load --merge - <<<'{"resync": {"bandwidth": 250}}'
run mesk resync bandwidth get --debug
expect_rc 0
expect_out "Rate: 250 Mbps"
expect_err "output complete: no"
sim fail GetResyncBandwidth "Resync statistics unavailable"
run mesk resync bandwidth get
expect_rc 1
expect_out ""
expect_err "Resync statistics unavailable"
sim fail --clear

finish
