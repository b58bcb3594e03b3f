#!/usr/bin/env bash
# Trace configuration through autocli against the simulated host: trace get and trace set,
# their file on the host and the tracing service's status and restarts.
source "$(dirname "${BASH_SOURCE[0]}")/lib.sh"

CONF="$MESK_HOST_ROOT/etc/orvane/mesk/mesktraced.conf"
SYSLOG_HINT="Refer to /var/log/syslog.log for details."

write_conf() { printf '%s' "$1" >"$CONF"; }

case_ "get reports the file's settings"
write_conf '# mesktraced settings
MESKTRACED_LAST_SELECTED_VOLUME="/scratch/mesktrace"
MESKTRACED_ROTATE_MAX_FILES=8
MESKTRACED_ROTATE_FILE_SIZE=45
MESKTRACED_LOG_URGENT_TO_SYSLOG=1
'
run mesk trace get
expect_rc 0
expect_err ""
expect_out "MESK Traces Directory: /scratch/mesktrace
Number Of Files To Rotate: 8
Maximum Trace File Size: 45 MB
Log Urgent Traces To Syslog: true"

case_ "set rewrites the file and restarts the service"
run mesk trace set -p /vol/traces -f 3 -s 100 -l false --debug
expect_rc 0
expect_out ""
expect_err_has "output complete: yes"
expect_eq "$(cat "$CONF")" '# mesktraced settings
MESKTRACED_LAST_SELECTED_VOLUME="/scratch/mesktrace"
MESKTRACED_VOLUME="/vol/traces"
MESKTRACED_ROTATE_MAX_FILES=3
MESKTRACED_LOG_URGENT_TO_SYSLOG=0
MESKTRACED_ROTATE_FILE_SIZE=100' "rewritten file"
sim calls
expect_out_has "restart"

case_ "get reads the new values back; the directory comes from the service's own key"
run mesk trace get
expect_rc 0
expect_out "MESK Traces Directory: /scratch/mesktrace
Number Of Files To Rotate: 3
Maximum Trace File Size: 100 MB
Log Urgent Traces To Syslog: false"
run mesk trace get --formatter=json
expect_rc 0
expect_out '{"MESK Traces Directory":"/scratch/mesktrace","Number Of Files To Rotate":3,"Maximum Trace File Size":100,"Log Urgent Traces To Syslog":false}'

case_ "reset keeps only the comments, so get shows the defaults"
run mesk trace set --reset true
expect_rc 0
expect_out ""
expect_eq "$(cat "$CONF")" "# mesktraced settings" "file after reset"
run mesk trace get
expect_rc 0
expect_out "MESK Traces Directory: No volume selected.
Number Of Files To Rotate: 8
Maximum Trace File Size: 45 MB
Log Urgent Traces To Syslog: true"

case_ "bad options are refused without touching the file"
run mesk trace set
expect_rc 1
expect_err "No options provided."
run mesk trace set -s 4096
expect_rc 1
expect_err "File size should be < 4096 MB."
run mesk trace set -r false -f 3
expect_rc 1
expect_err "reset cannot be used with other options."
expect_eq "$(cat "$CONF")" "# mesktraced settings" "file after refusals"

case_ "a stopped service: get refuses, set changes the file without a restart"
sim service mesktraced stopped
expect_rc 0
run mesk trace get --debug
expect_rc 1
expect_err "Mesk is not enabled on this host.
output complete: no"
expect_out ""
run mesk trace set -f 5
expect_rc 0
expect_eq "$(cat "$CONF")" "# mesktraced settings
MESKTRACED_ROTATE_MAX_FILES=5" "file with a stopped service"
sim calls
expect_out_lacks "restart"
sim service mesktraced running

case_ "a failing status check: get reports it, set keeps the new file"
sim service mesktraced status-fails
run mesk trace get
expect_rc 1
expect_err "Checking mesktraced status failed.$SYSLOG_HINT"
run mesk trace set -f 6
expect_rc 1
expect_err "Failed to check mesktraced status. Refer /var/log/syslog.log for details."
expect_eq "$(cat "$CONF")" "# mesktraced settings
MESKTRACED_ROTATE_MAX_FILES=6" "file after a failed status check"
sim service mesktraced running

case_ "restarts that fail twice: set waits and succeeds on the third"
sim service mesktraced restart-fails 2
expect_rc 0
started=$SECONDS
run mesk trace set -s 10
expect_rc 0
expect_err ""
if [ $((SECONDS - started)) -ge 10 ]; then _pass; else _fail "set returned before two waits"; fi
sim calls
expect_eq "$(grep -c '"args":\["restart"\],"exit":1' <<<"$OUT")" 2 "failed restarts"
expect_eq "$(grep -c '"args":\["restart"\],"exit":0' <<<"$OUT")" 1 "successful restarts"
sim service mesktraced running

case_ "a missing configuration file"
rm -f "$CONF"
run mesk trace get
expect_rc 1
expect_err "Error opening Mesk trace config file for reading."
run mesk trace set -f 3
expect_rc 1
expect_err "Error opening Mesk Trace Config File for reading."
if [ -e "$CONF" ]; then _fail "set created the file"; else _pass; fi

finish
