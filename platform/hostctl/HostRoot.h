// The simulated host's files: below one root directory, at the absolute paths the host uses,
// the tracing service's configuration file, its control script, the datastore notification
// script, the service's simulated state and the log in which both scripts record their runs.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "StateDocument.h"

namespace HostCtlSim {

// One line of a log of calls: the call log's or the scripts' runs.
struct CallRecord {
    int64_t time = 0;   // nanoseconds since the epoch
    std::string entry;  // the line without its time: {"op": name, "args": [...], ...}
};

// The lines of such a log, each {"time": ..., ...}, in their order; lines that are not JSON
// are skipped.
std::vector<CallRecord> ParseTimedLog(const std::string& text);

// Absolute paths on the host.
extern const char* const kTraceConfigPath;   // /etc/orvane/mesk/mesktraced.conf
extern const char* const kTraceScriptPath;   // /etc/init.d/mesktraced
extern const char* const kNotifyScriptPath;  // /usr/lib/orvane/tavord/bin/notifyDatastore.py
extern const char* const kServiceStatePath;  // /var/lib/hostsim/mesktraced.state
extern const char* const kScriptLogPath;     // /var/log/hostsim/scripts.jsonl

class HostRoot {
  public:
    explicit HostRoot(std::string directory);
    const std::string& Directory() const { return directory_; }
    // The path below the root of a host path.
    std::string PathOf(const std::string& hostPath) const;

    // Writes the configuration file and both scripts as on a fresh host, the service state
    // of `services` (the document's "services") and an empty script log.
    // Throws std::runtime_error when a file cannot be written.
    void Create(const Json& services) const;

    // The document's "services": from the state file, or the fresh host's when it is missing.
    Json ReadServices() const;
    void WriteServices(const Json& services) const;

    // What the scripts recorded, in the order they ran; lines that are not JSON are skipped.
    std::vector<CallRecord> ReadScriptLog() const;
    void ClearScriptLog() const;

  private:
    void WriteFile(const std::string& hostPath, const std::string& content, bool executable) const;

    std::string directory_;
};

}  // namespace HostCtlSim
