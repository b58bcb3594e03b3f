#!/usr/bin/env bash
# Trace configuration through autocli against the simulated host: trace get and trace set,
# their file on the host and the tracing service's status and restarts.
source "$(dirname "${BASH_SOURCE[0]}")/lib.sh"

CONF="$MESK_HOST_ROOT/etc/orvane/mesk/mesktraced.conf"

case_ "get reports the settings of the host's file"
run mesk trace get
expect_rc 0
expect_err ""
expect_out "MESK Traces Directory: /scratch/mesktrace
Number Of Files To Rotate: 8
Maximum Trace File Size: 45 MB
Log Urgent Traces To Syslog: true"

case_ "set rewrites the file and restarts the service; get reads the service's own key"
run mesk trace set -p /vol/traces -f 3 -s 100 -l false --debug
expect_rc 0
expect_out ""
expect_err_has "output complete: yes"
expect_eq "$(tail -n +2 "$CONF")" 'MESKTRACED_LAST_SELECTED_VOLUME="/scratch/mesktrace"
MESKTRACED_VOLUME="/vol/traces"
MESKTRACED_ROTATE_MAX_FILES=3
MESKTRACED_LOG_URGENT_TO_SYSLOG=0
MESKTRACED_ROTATE_FILE_SIZE=100' "rewritten file"
sim calls
expect_out_has '{"op":"/etc/init.d/mesktraced","args":["restart"],"exit":0}'
run mesk trace get
expect_rc 0
expect_out "MESK Traces Directory: /scratch/mesktrace
Number Of Files To Rotate: 3
Maximum Trace File Size: 100 MB
Log Urgent Traces To Syslog: false"

case_ "reset keeps only the comments, so get shows the defaults"
COMMENT=$(head -n 1 "$CONF")
run mesk trace set --reset true
expect_rc 0
expect_eq "$(cat "$CONF")" "$COMMENT" "file after reset"
run mesk trace get
expect_out "MESK Traces Directory: No volume selected.
Number Of Files To Rotate: 8
Maximum Trace File Size: 45 MB
Log Urgent Traces To Syslog: true"

case_ "a stopped service: get refuses, set changes the file without a restart"
sim service mesktraced stopped
run mesk trace get --debug
expect_rc 1
expect_out ""
expect_err "Mesk is not enabled on this host.
output complete: no"
run mesk trace set -f 5
expect_rc 0
expect_eq "$(cat "$CONF")" "$COMMENT
MESKTRACED_ROTATE_MAX_FILES=5" "file with a stopped service"
sim calls
expect_out_lacks "restart"

case_ "a failing status check: get reports it, set keeps the new file"
sim service mesktraced status-fails
run mesk trace get
expect_rc 1
expect_err "Checking mesktraced status failed.Refer to /var/log/syslog.log for details."
run mesk trace set -f 6
expect_rc 1
expect_err "Failed to check mesktraced status. Refer /var/log/syslog.log for details."
expect_eq "$(cat "$CONF")" "$COMMENT
MESKTRACED_ROTATE_MAX_FILES=6" "file after a failed status check"

case_ "restarts that fail twice: set waits and succeeds on the third"
sim service mesktraced running
sim service mesktraced restart-fails 2
started=$SECONDS
run mesk trace set -s 10
expect_rc 0
expect_err ""
[ $((SECONDS - started)) -ge 10 ] && _pass || _fail "set returned before two waits"
sim calls
expect_eq "$(grep -o '"args":\["restart"\],"exit":[0-9]*' <<<"$OUT" | cut -d: -f3 | tr '\n' ' ')" \
    "1 1 0 " "restart exits"

case_ "a missing configuration file"
rm -f "$CONF"
run mesk trace get
expect_rc 1
expect_err "Error opening Mesk trace config file for reading."
run mesk trace set -f 3
expect_rc 1
expect_err "Error opening Mesk Trace Config File for reading."
[ -e "$CONF" ] && _fail "set created the file" || _pass

finish
