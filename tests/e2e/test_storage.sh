#!/usr/bin/env bash
# Storage commands through autocli against the simulated host: claiming an SSD and two HDDs,
# listing them in each formatter, the capacity-flash tag, unmounting and mounting the disk
# group, removal with each evacuation mode, auto-claim mode, and the refusals.
source "$(dirname "${BASH_SOURCE[0]}")/lib.sh"

SSD=mpx.pthba2:C0:T0:L0
HDD1=mpx.pthba2:C0:T1:L0
HDD2=mpx.pthba2:C0:T2:L0
HDD3=mpx.pthba2:C0:T3:L0
SSD_UUID=52a0e7c4-1b2d-4e3f-8a90-0b1c2d3e4f01
HDD1_UUID=52a0e7c4-1b2d-4e3f-8a90-0b1c2d3e4f02
HDD2_UUID=52a0e7c4-1b2d-4e3f-8a90-0b1c2d3e4f03
MODES="Expected a single value from the set [noAction, ensureObjectAccessibility, evacuateAllData] got"

# The value of FIELD in the simple listing's block of DEVICE (after the last `run`).
list_field() {
    printf '%s\n' "$OUT" | awk -v device="$1" -v field="   $2:" '
        $0 == device { inside = 1; next }
        inside && index($0, field) == 1 { value = substr($0, length(field) + 1); sub(/^ /, "", value); print value; exit }
        inside && $0 == "" { inside = 0 }'
}

# The value of FIELD of disk NAME in `hostsim show` (after the last `sim show`).
host_field() {
    printf '%s\n' "$OUT" | awk -v name="\"name\": \"$1\"," -v field="\"$2\": " '
        index($0, name) { inside = 1 }
        inside && index($0, field) { sub(/.*": /, ""); sub(/,$/, ""); gsub(/"/, ""); print; exit }
        inside && /^ *}/ { inside = 0 }'
}

case_ "a fresh host lists its four devices, none in use"
run mesk storage list
expect_rc 0
expect_err ""
expect_eq "$(printf '%s\n' "$OUT" | grep -c '^mpx\.')" 4 "devices listed"
expect_eq "$(list_field "$HDD1" "Used by this host")" false "HDD1 in use"
expect_eq "$(list_field "$HDD1" "Display Name")" "$HDD1" "HDD1 display name"

case_ "the capacity-flash tag goes on an unclaimed SSD and comes off again"
run mesk storage tag add -t capacityFlash -d "$SSD"
expect_rc 0
expect_out ""
sim show
expect_eq "$(host_field "$SSD" capacityFlashTag)" true "tag after add"
run mesk storage tag remove -t capacityFlash -d "$SSD"
expect_rc 0
sim show
expect_eq "$(host_field "$SSD" capacityFlashTag)" false "tag after remove"

case_ "a tag other than capacityFlash is refused by the framework"
run mesk storage tag add -t hybrid -d "$SSD"
expect_rc 2
expect_err_has "capacityFlash"

case_ "add claims the SSD and two HDDs into one disk group"
run mesk storage add -s "$SSD" -d "$HDD1" -d "$HDD2"
expect_rc 0
expect_out ""
expect_err ""
sim calls
expect_out_has "\"op\":\"AddDisks\",\"args\":[\"$SSD\",[\"$HDD1\",\"$HDD2\"]]"
sim show
expect_eq "$(host_field "$HDD1" diskGroupUuid)" "$SSD_UUID" "HDD1 disk group"
expect_eq "$(host_field "$HDD2" diskGroupUuid)" "$SSD_UUID" "HDD2 disk group"
expect_eq "$(host_field "$HDD3" diskGroupUuid)" "" "HDD3 disk group"

case_ "simple listing shows the disk group"
run mesk storage list
expect_rc 0
expect_eq "$(list_field "$HDD2" "MESK Disk Group UUID")" "$SSD_UUID" "HDD2 group"
expect_eq "$(list_field "$HDD2" "Used by this host")" true "HDD2 in use"
expect_eq "$(list_field "$SSD" "Is SSD")" true "SSD is SSD"
expect_eq "$(list_field "$HDD3" "Used by this host")" false "HDD3 in use"

case_ "table listing: one header and one row per device, in UUID order"
run --formatter=table mesk storage list
expect_rc 0
expect_out_has "Device"
expect_out_has "DiskKeyLoaded"
expect_eq "$(printf '%s\n' "$OUT" | grep -o '^mpx\.[^ ]*' | tr '\n' ' ')" \
    "$SSD $HDD1 $HDD2 $HDD3 " "row order"

case_ "json listing filtered by device and by uuid"
run --formatter=json mesk storage list -d "$HDD1"
expect_rc 0
expect_out_has "\"Device\":\"$HDD1\""
expect_out_has "\"MESK Disk Group UUID\":\"$SSD_UUID\""
expect_out_lacks "$HDD2"
run --formatter=json mesk storage list -u "$HDD2_UUID"
expect_rc 0
expect_out_has "\"Device\":\"$HDD2\""
expect_out_lacks "$HDD1"

case_ "filters that match nothing, and both filters at once"
run --formatter=json --debug mesk storage list -d "MPX.PTHBA2:C0:T1:L0"
expect_rc 1
expect_out "[]"
expect_err_has "Unable to find device with name: MPX.PTHBA2:C0:T1:L0"
expect_err_has "output complete: yes"
run --debug mesk storage list -d "$HDD1" -u "$HDD1_UUID"
expect_rc 1
expect_out ""
expect_err $'Only one of --device or --uuid can be specified.\noutput complete: no'

case_ "a failing disk query keeps the disks listed before it"
sim fail GetDiskInfo "disk gone" --call 3
run --formatter=json --debug mesk storage list
expect_rc 1
expect_out_has "\"Device\":\"$HDD1\""
expect_out_lacks "$HDD2"
expect_err $'Unable to list devices: disk gone\noutput complete: yes'
sim fail --clear

case_ "a claimed disk cannot be tagged"
run mesk storage tag add -t capacityFlash -d "$SSD"
expect_rc 1
expect_err_has "Unable to add tag to disk: "

case_ "unmount and mount the disk group"
run mesk storage diskgroup unmount -s "$SSD"
expect_rc 0
expect_out ""
sim show
expect_eq "$(host_field "$HDD1" mounted)" false "HDD1 mounted after unmount"
expect_eq "$(host_field "$SSD" mounted)" false "SSD mounted after unmount"
run mesk storage diskgroup mount -d "$HDD1"
expect_rc 0
sim show
expect_eq "$(host_field "$HDD1" mounted)" true "HDD1 mounted after mount -d"
expect_eq "$(host_field "$HDD2" mounted)" false "HDD2 mounted after mount -d"
run mesk storage diskgroup mount -u "$SSD_UUID"
expect_rc 0
sim calls
expect_out_has "\"op\":\"MountByUuid\",\"args\":[\"$SSD_UUID\"]"
run mesk storage diskgroup unmount -d "$HDD2"
expect_rc 0
run mesk storage diskgroup mount -s "$SSD"
expect_rc 0
sim calls
expect_out_has "\"op\":\"MountDiskGroup\",\"args\":[\"$SSD\",false]"
sim show
expect_eq "$(host_field "$HDD2" mounted)" true "HDD2 mounted after mount -s"

case_ "mount and unmount refuse conflicting or missing targets"
run --debug mesk storage diskgroup mount -s "$SSD" -d "$HDD1"
expect_rc 1
expect_err $'Specify only one of --ssd, --disk or --uuid.\noutput complete: no'
run --formatter=json --debug mesk storage diskgroup mount
expect_rc 1
expect_out "false"
expect_err $'Either --ssd, --disk or --uuid is required\noutput complete: no'
run mesk storage diskgroup unmount -s "$SSD" -d "$HDD1"
expect_rc 1
expect_err "Can't specify both --disk and --ssd."
run --formatter=json mesk storage diskgroup unmount
expect_rc 1
expect_out ""
expect_err "Need one of --disk or --ssd."

case_ "remove refuses a bad mode as typed and conflicting options"
run mesk storage remove -d "$HDD2" -m evacuateall
expect_rc 1
expect_err "$MODES 'evacuateall'"
run mesk storage remove -d "$HDD2" -m ""
expect_rc 1
expect_err "$MODES ''"
run mesk storage remove -d "$HDD2" -s "$SSD" -m bad
expect_rc 1
expect_err "At most one of --disk or --ssd or --uuid can be specified."
run mesk storage remove -m noAction
expect_rc 1
expect_err "No option provided"
sim show
expect_eq "$(host_field "$HDD2" diskGroupUuid)" "$SSD_UUID" "HDD2 still claimed"

case_ "remove a disk by name with evacuateAllData"
run mesk storage remove -d "$HDD2" -m evacuateAllData
expect_rc 0
expect_out ""
sim calls
expect_out_has "\"op\":\"RemoveDisk\",\"args\":[\"$HDD2\",\"EvacuateAllData\"]"
sim show
expect_eq "$(host_field "$HDD2" diskGroupUuid)" "" "HDD2 group after removal"
run mesk storage list -d "$HDD2"
expect_eq "$(list_field "$HDD2" "Used by this host")" false "HDD2 in use after removal"

case_ "remove a disk by UUID with ensureObjectAccessibility"
run mesk storage add -s "$SSD" -d "$HDD3"
expect_rc 0
run mesk storage remove -u "$HDD1_UUID" -m ensureObjectAccessibility
expect_rc 0
sim calls
expect_out_has "\"op\":\"RemoveDiskByUuid\",\"args\":[\"$HDD1_UUID\",\"EnsureObjectAccessibility\"]"
sim show
expect_eq "$(host_field "$HDD1" usedByThisHost)" false "HDD1 in use after removal"
expect_eq "$(host_field "$HDD3" diskGroupUuid)" "$SSD_UUID" "HDD3 joined the group"

case_ "remove the whole disk group with NoAction"
run mesk storage remove -s "$SSD" -m NoAction
expect_rc 0
sim calls
expect_out_has "\"op\":\"RemoveDiskGroup\",\"args\":[\"$SSD\",\"NoAction\"]"
sim show
expect_eq "$(host_field "$SSD" usedByThisHost)" false "SSD in use after group removal"
expect_eq "$(host_field "$HDD3" diskGroupUuid)" "" "HDD3 group after group removal"
run mesk storage list
expect_eq "$(printf '%s\n' "$OUT" | grep -c 'Used by this host: true')" 0 "disks in use"

case_ "remove without a mode passes the default"
run mesk storage add -s "$SSD" -d "$HDD1"
run mesk storage remove -d "$HDD1"
expect_rc 0
sim calls
expect_out_has "\"op\":\"RemoveDisk\",\"args\":[\"$HDD1\",\"\"]"

case_ "auto-claim mode: get, set, and a failed set that still answers true"
run mesk storage automode get
expect_rc 0
expect_out "Enabled: false"
run mesk storage automode set --enabled true
expect_rc 0
sim show
expect_out_has '"autoClaimMode": true'
run --formatter=json mesk storage automode get
expect_out_has '"Enabled":true'
sim fail SetAutoClaimMode "service busy"
run --formatter=json --debug mesk storage automode set --enabled false
expect_rc 1
expect_out "true"
expect_err $'Unable to set storage auto claim mode: service busy\noutput complete: yes'
sim fail --clear
sim show
expect_out_has '"autoClaimMode": true'

finish
