#!/usr/bin/env bash
# Storage commands through autocli against the simulated host: claiming an SSD and two HDDs,
# listing them, the capacity-flash tag, unmounting and mounting, removal with each evacuation
# mode, and auto-claim mode.
source "$(dirname "${BASH_SOURCE[0]}")/lib.sh"

SSD=mpx.pthba2:C0:T0:L0
HDD1=mpx.pthba2:C0:T1:L0
HDD2=mpx.pthba2:C0:T2:L0
HDD3=mpx.pthba2:C0:T3:L0
SSD_UUID=52a0e7c4-1b2d-4e3f-8a90-0b1c2d3e4f01
HDD1_UUID=52a0e7c4-1b2d-4e3f-8a90-0b1c2d3e4f02
HDD2_UUID=52a0e7c4-1b2d-4e3f-8a90-0b1c2d3e4f03

# FIELD of every disk of the host, in inventory order (SSD, HDD1, HDD2, HDD3), as JSON.
host_disks() { "$HOSTSIM" show | jq -c "[.storage.disks[].$1]"; }

case_ "the capacity-flash tag goes on an unclaimed SSD and comes off again"
ok mesk storage tag add -t capacityFlash -d "$SSD"
expect_eq "$(host_disks capacityFlashTag)" "[true,false,false,false]" "tags after add"
ok mesk storage tag remove -t capacityFlash -d "$SSD"
expect_eq "$(host_disks capacityFlashTag)" "[false,false,false,false]" "tags after remove"

case_ "add claims the SSD and two HDDs into one disk group, which list shows"
ok mesk storage add -s "$SSD" -d "$HDD1" -d "$HDD2"
expect_eq "$(host_disks diskGroupUuid)" "[\"$SSD_UUID\",\"$SSD_UUID\",\"$SSD_UUID\",\"\"]" "groups"
ok --formatter=json mesk storage list -d "$HDD2"
expect_eq "$(jq -c '[.[] | [.Device, ."MESK Disk Group UUID", ."Used by this host"]]' <<<"$OUT")" \
    "[[\"$HDD2\",\"$SSD_UUID\",true]]" "HDD2 listed by name"
ok --formatter=json mesk storage list -u "$HDD1_UUID"
expect_eq "$(jq -c '[.[].Device]' <<<"$OUT")" "[\"$HDD1\"]" "HDD1 listed by UUID"

case_ "unmount and mount by group, disk and UUID"
while IFS='|' read -r command mounted; do
    ok mesk storage diskgroup $command
    expect_eq "$(host_disks mounted)" "$mounted" "mounted after $command"
done <<TABLE
unmount -s $SSD|[false,false,false,false]
mount -d $HDD1|[false,true,false,false]
mount -u $SSD_UUID|[true,true,true,false]
unmount -d $HDD2|[true,true,false,false]
mount -s $SSD|[true,true,true,false]
TABLE

case_ "remove by name, by UUID and the whole group, with each evacuation mode"
while IFS='|' read -r command groups; do
    ok mesk storage $command
    expect_eq "$(host_disks diskGroupUuid)" "$groups" "groups after $command"
done <<TABLE
remove -d $HDD2 -m evacuateAllData|["$SSD_UUID","$SSD_UUID","",""]
add -s $SSD -d $HDD3|["$SSD_UUID","$SSD_UUID","","$SSD_UUID"]
remove -u $HDD1_UUID -m ensureObjectAccessibility|["$SSD_UUID","","","$SSD_UUID"]
remove -s $SSD -m NoAction|["","","",""]
add -s $SSD -d $HDD2|["$SSD_UUID","","$SSD_UUID",""]
remove -u $HDD2_UUID|["$SSD_UUID","","",""]
TABLE
expect_eq "$(host_disks usedByThisHost)" "[true,false,false,false]" "disks in use"

case_ "auto-claim mode: get, set, and get again"
ok mesk storage automode get
expect_out "Enabled: false"
ok mesk storage automode set --enabled true
ok --formatter=json mesk storage automode get
expect_out '{"Enabled":true}'
expect_eq "$("$HOSTSIM" show | jq .storage.autoClaimMode)" true "auto-claim mode on the host"

finish
