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

// One file of the host: its host path, its whole content and its mode.
struct HostFile {
    const char* path;
    std::string content;
    unsigned mode;  // 0644, or 0755 for a script
};

// The files below the root are only ever written by whoever owns them or by root: the root
// and every directory below it on the way to a file must be a real directory (no symlink)
// that belongs to this user or to root and that no other user may write (its group may only
// when it is this user's own group). A process run by root trusts root alone. Anything else
// is refused, with the path and why.
class HostRoot {
  public:
    explicit HostRoot(std::string directory);
    const std::string& Directory() const { return directory_; }
    // The path below the root of a host path.
    std::string PathOf(const std::string& hostPath) const;

    // The directory of that host path (e.g. "/etc/init.d"), open (O_DIRECTORY); with `create`,
    // made (0755) where missing. Throws std::runtime_error when it cannot be had or is not
    // trusted (above).
    int OpenDirectory(const std::string& hostDirectory, bool create) const;
    // Throws std::runtime_error unless the file at that host path, and every directory on the
    // way to it, is trusted: what MeskExec checks before it runs a program.
    void CheckTrusted(const std::string& hostPath) const;

    // Files written together, whole or not at all: each is written under a name of its own
    // (O_EXCL, never through a symlink) in its directory, with its mode whatever the umask,
    // and renamed into place by Apply(). Whatever was not applied is removed at the end.
    class Files {
      public:
        explicit Files(const HostRoot& root) : root_(root) {}
        ~Files();
        Files(const Files&) = delete;
        Files& operator=(const Files&) = delete;
        // Throws std::runtime_error ("cannot write PATH: ...") and writes nothing in place.
        void Write(const HostFile& file);
        // [{"path": host path, "staged": name in its directory}, ...] of the files not applied.
        Json Pending() const;
        // Throws std::runtime_error when a file cannot be renamed into place.
        void Apply();

      private:
        struct Staged {
            std::string path, name, staged;
            int directory;
        };
        const HostRoot& root_;
        std::vector<Staged> staged_;
    };

    // The files of a fresh host: the configuration file, both scripts, the service state of
    // `services` (the document's "services") and an empty script log.
    static std::vector<HostFile> FreshFiles(const Json& services);
    static HostFile ServicesFile(const Json& services);
    // Writes the fresh host's files. Throws std::runtime_error when one cannot be written.
    void Create(const Json& services) const;
    // Puts in place the files that Files::Pending() listed and a killed process left staged.
    void Complete(const Json& pending) const;

    // The document's "services": from the state file (its staged copy when `pending` lists
    // one), or the fresh host's when it is missing.
    Json ReadServices(const Json& pending = Json()) const;

    // What the scripts recorded, in the order they ran; lines that are not JSON are skipped.
    std::vector<CallRecord> ReadScriptLog() const;

  private:
    std::string directory_;
};

}  // namespace HostCtlSim
