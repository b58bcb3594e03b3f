#!/usr/bin/env bash
# Trace configuration through autocli against the simulated host: trace get and trace set,
# their file on the host and the restart of the tracing service.
source "$(dirname "${BASH_SOURCE[0]}")/lib.sh"

CONF="$MESK_HOST_ROOT/etc/orvane/mesk/mesktraced.conf"

case_ "get reports the settings of the host's file"
ok mesk trace get
expect_err ""
expect_out "MESK Traces Directory: /scratch/mesktrace
Number Of Files To Rotate: 8
Maximum Trace File Size: 45 MB
Log Urgent Traces To Syslog: true"

case_ "set rewrites the file and restarts the service; get reads the service's own key"
ok mesk trace set -p /vol/traces -f 3 -s 100 -l false --debug
expect_out ""
expect_err_has "output complete: yes"
expect_eq "$(tail -n +2 "$CONF")" 'MESKTRACED_LAST_SELECTED_VOLUME="/scratch/mesktrace"
MESKTRACED_VOLUME="/vol/traces"
MESKTRACED_ROTATE_MAX_FILES=3
MESKTRACED_LOG_URGENT_TO_SYSLOG=0
MESKTRACED_ROTATE_FILE_SIZE=100' "rewritten file"
sim calls
expect_out_has '{"op":"/etc/init.d/mesktraced","args":["restart"],"exit":0}'
ok mesk trace get
expect_out "MESK Traces Directory: /scratch/mesktrace
Number Of Files To Rotate: 3
Maximum Trace File Size: 100 MB
Log Urgent Traces To Syslog: false"

case_ "after a restart the service reports the configured volume when it exists on the host"
mkdir -p "$MESK_HOST_ROOT/vol/traces"
ok mesk trace set -f 3
ok mesk trace get --fields "MESK Traces Directory"
expect_out "MESK Traces Directory: /vol/traces"

case_ "set started with SIGCHLD ignored still reads the service script's status"
_capture perl -e '$SIG{CHLD} = "IGNORE"; exec @ARGV' "$AUTOCLI" mesk trace set -f 5
expect_rc 0
expect_err ""

case_ "reset keeps only the comments, so get shows the defaults"
COMMENT=$(head -n 1 "$CONF")
ok mesk trace set --reset true
expect_eq "$(cat "$CONF")" "$COMMENT" "file after reset"
ok mesk trace get
expect_out "MESK Traces Directory: No volume selected.
Number Of Files To Rotate: 8
Maximum Trace File Size: 45 MB
Log Urgent Traces To Syslog: true"

finish
