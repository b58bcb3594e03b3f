#!/usr/bin/env bash
# Host storage settings, default policies and resync through autocli against the simulated
# host: fault domain, maintenance mode cancel, policy defaults, resync.
source "$(dirname "${BASH_SOURCE[0]}")/lib.sh"

POLICY='(("hostFailuresToTolerate" i1) ("stripeWidth" i2))'

case_ "set a fault domain; in a cluster its id shows too"
ok mesk faultdomain set -n rack-1
ok mesk cluster new
ok mesk faultdomain get
expect_out_has "faultDomainName: rack-1"
FD_ID=$(printf '%s\n' "$OUT" | sed -n 's/^faultDomainId: //p')
[[ "$FD_ID" =~ ^[0-9a-f]{8}(-[0-9a-f]{4}){3}-[0-9a-f]{12}$ ]] && _pass || _fail "no id: '$FD_ID'"

case_ "reset goes back to no fault domain"
ok mesk faultdomain reset
ok mesk faultdomain get
expect_out_has $'faultDomainName:\n'

case_ "cancel ends the maintenance operation in progress"
sim load --merge - <<<'{"settings": {"maintenanceOperation": "ensureAccessibility"}}'
ok mesk maintenancemode cancel
expect_eq "$("$HOSTSIM" show | jq -r .settings.maintenanceOperation)" "" "operation after cancel"

case_ "set default policies, list them as a table, and clear them"
ok mesk policy setdefault -c vdisk -p "$POLICY"
ok mesk policy getdefault
expect_eq "$(grep -E '^(cluster|vdisk|vmnamespace|vmswap|vmem)( |$)' <<<"$OUT")" "cluster
vdisk         $POLICY
vmnamespace
vmswap
vmem" "rows of the table"
ok mesk policy cleardefault
ok mesk policy getdefault --formatter=json
expect_out_lacks "stripeWidth"

case_ "set the resync throttle (output never complete), read it and the bandwidth with their unit"
ok mesk resync throttle set --level 120 --debug
expect_err "output complete: no"
ok mesk resync throttle get
expect_out "Level: 120 Mbps"
sim load --merge - <<<'{"resync": {"bandwidth": 250}}'
ok mesk resync bandwidth get
expect_out "Rate: 250 Mbps"

finish
