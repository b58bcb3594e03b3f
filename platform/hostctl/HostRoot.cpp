#include "HostRoot.h"

#include <sys/stat.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <sstream>
#include <stdexcept>

namespace HostCtlSim {

const char* const kTraceConfigPath = "/etc/orvane/mesk/mesktraced.conf";
const char* const kTraceScriptPath = "/etc/init.d/mesktraced";
const char* const kNotifyScriptPath = "/usr/lib/orvane/tavord/bin/notifyDatastore.py";
const char* const kServiceStatePath = "/var/lib/hostsim/mesktraced.state";
const char* const kScriptLogPath = "/var/log/hostsim/scripts.jsonl";

namespace {

const char* const kTraceConfig =
    "# Configuration of mesktraced, the Mesk tracing service.\n"
    "MESKTRACED_LAST_SELECTED_VOLUME=\"/scratch/mesktrace\"\n"
    "MESKTRACED_ROTATE_MAX_FILES=8\n"
    "MESKTRACED_ROTATE_FILE_SIZE=45\n"
    "MESKTRACED_LOG_URGENT_TO_SYSLOG=1\n";

// Shared by both scripts: finds the root from the script's own path (falling back to
// MESK_HOST_ROOT) and appends one JSON line per run to the script log.
const char* const kScriptCommon = R"sh(
case "$0" in
*"$SELF") root=${0%"$SELF"} ;;
*) root=${MESK_HOST_ROOT:-} ;;
esac
log_file="$root/var/log/hostsim/scripts.jsonl"
started=$(date +%s%N)
json_text() {
    printf '"%s"' "$(printf '%s' "$1" | tr '\n\t' '  ' | sed -e 's/\\/\\\\/g' -e 's/"/\\"/g')"
}
json_args=""
for arg in "$@"; do json_args="${json_args:+$json_args,}$(json_text "$arg")"; done
# record OUTCOME: appends {"time":..., "op":..., "args":[...], OUTCOME} to the log.
record() {
    mkdir -p "${log_file%/*}"
    printf '{"time":%s,"op":"%s","args":[%s],%s}\n' "$started" "$SELF" "$json_args" "$1" \
        >>"$log_file"
}
)sh";

const char* const kTraceScript = R"sh(#!/bin/sh
# Control script of the simulated tracing service: status | restart.
# Exit status 0: running; 3: stopped. `hostsim service mesktraced` sets its behaviour in the
# state file: state (running|stopped), status_fails (1: the status check dies by a signal),
# restart_failures (how many restarts fail with exit status 1 from now on; -1: all of them).
SELF=/etc/init.d/mesktraced
@COMMON@
state_file="$root/var/lib/hostsim/mesktraced.state"
state=running
status_fails=0
restart_failures=0
if [ -r "$state_file" ]; then . "$state_file"; fi
save() {
    mkdir -p "${state_file%/*}"
    printf 'state=%s\nstatus_fails=%s\nrestart_failures=%s\n' \
        "$state" "$status_fails" "$restart_failures" >"$state_file.$$" &&
        mv "$state_file.$$" "$state_file"
}
case "$1" in
status)
    if [ "$status_fails" = 1 ]; then
        record '"signal":"KILL"'
        kill -KILL $$
    fi
    if [ "$state" = running ]; then
        record '"exit":0'
        echo "mesktraced is running"
        exit 0
    fi
    record '"exit":3'
    echo "mesktraced is not running"
    exit 3
    ;;
restart)
    if [ "$restart_failures" = -1 ]; then
        record '"exit":1'
        exit 1
    fi
    if [ "$restart_failures" -gt 0 ]; then
        restart_failures=$((restart_failures - 1))
        save
        record '"exit":1'
        exit 1
    fi
    state=running
    save
    record '"exit":0'
    exit 0
    ;;
*)
    echo "Usage: $SELF {status|restart}" >&2
    record '"exit":2'
    exit 2
    ;;
esac
)sh";

const char* const kNotifyScript = R"sh(#!/bin/sh
# Datastore notification script of the simulated host: -t EVENT -d DATASTORE.
# It only records the notification.
SELF=/usr/lib/orvane/tavord/bin/notifyDatastore.py
@COMMON@
record '"exit":0'
exit 0
)sh";

std::string WithCommon(const char* script) {
    std::string text(script);
    text.replace(text.find("@COMMON@"), 8, kScriptCommon + 1);
    return text;
}

void MakeParents(const std::string& path) {
    for (size_t slash = path.find('/', 1); slash != std::string::npos;
         slash = path.find('/', slash + 1)) {
        mkdir(path.substr(0, slash).c_str(), 0755);
    }
}

}  // namespace

HostRoot::HostRoot(std::string directory) : directory_(std::move(directory)) {
    while (directory_.size() > 1 && directory_.back() == '/') directory_.pop_back();
}

std::string HostRoot::PathOf(const std::string& hostPath) const {
    if (directory_ == "/") return hostPath;
    return directory_ + hostPath;
}

void HostRoot::WriteFile(const std::string& hostPath, const std::string& content,
                         bool executable) const {
    std::string path = PathOf(hostPath);
    MakeParents(path);
    // Written aside and renamed, so that a script that is running keeps its old text.
    std::string temporary = path + ".new";
    {
        std::ofstream out(temporary, std::ios::binary | std::ios::trunc);
        out << content;
        out.close();
        if (!out) throw std::runtime_error("cannot write " + temporary);
    }
    if (executable) chmod(temporary.c_str(), 0755);
    if (std::rename(temporary.c_str(), path.c_str()) != 0) {
        throw std::runtime_error("cannot write " + path + ": " + std::strerror(errno));
    }
}

void HostRoot::Create(const Json& services) const {
    WriteFile(kTraceConfigPath, kTraceConfig, false);
    WriteFile(kTraceScriptPath, WithCommon(kTraceScript), true);
    WriteFile(kNotifyScriptPath, WithCommon(kNotifyScript), true);
    WriteServices(services);
    WriteFile(kScriptLogPath, "", false);
}

Json HostRoot::ReadServices() const {
    Json services = DefaultHost()["services"];
    Json& trace = services["mesktraced"];
    std::ifstream in(PathOf(kServiceStatePath));
    std::string line;
    while (std::getline(in, line)) {
        size_t equals = line.find('=');
        if (equals == std::string::npos) continue;
        std::string key = line.substr(0, equals);
        std::string value = line.substr(equals + 1);
        if (key == "state") {
            trace["state"] = value;
        } else if (key == "status_fails") {
            trace["statusFails"] = value == "1";
        } else if (key == "restart_failures") {
            trace["restartFailures"] = std::atoi(value.c_str());
        }
    }
    return services;
}

void HostRoot::WriteServices(const Json& services) const {
    const Json& trace = services.at("mesktraced");
    std::ostringstream text;
    text << "state=" << trace.at("state").get<std::string>() << "\n"
         << "status_fails=" << (trace.at("statusFails").get<bool>() ? 1 : 0) << "\n"
         << "restart_failures=" << trace.at("restartFailures").get<int64_t>() << "\n";
    WriteFile(kServiceStatePath, text.str(), false);
}

std::vector<CallRecord> ParseTimedLog(const std::string& text) {
    std::vector<CallRecord> records;
    std::istringstream in(text);
    std::string line;
    while (std::getline(in, line)) {
        Json entry = Json::parse(line, nullptr, false);
        if (entry.is_discarded() || !entry.is_object() || !entry.contains("time") ||
            !entry["time"].is_number_integer()) {
            continue;
        }
        CallRecord record;
        record.time = entry["time"].get<int64_t>();
        entry.erase("time");
        record.entry = entry.dump();
        records.push_back(std::move(record));
    }
    return records;
}

std::vector<CallRecord> HostRoot::ReadScriptLog() const {
    std::ifstream in(PathOf(kScriptLogPath));
    std::ostringstream text;
    text << in.rdbuf();
    return ParseTimedLog(text.str());
}

void HostRoot::ClearScriptLog() const {
    std::string path = PathOf(kScriptLogPath);
    std::ofstream out(path, std::ios::trunc);
}

}  // namespace HostCtlSim
