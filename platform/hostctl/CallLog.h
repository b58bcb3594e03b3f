// The call log: what the last invocation asked of the simulated host.
//
// An invocation keeps its calls in memory and, when it ends, writes them over the log of the
// invocation before: one JSON line per call, in a file below the host root beside the scripts'
// log (/var/log/hostsim/calls.jsonl). The state database never sees it, so that a command that
// only reads writes nothing there, and no sync waits for it. The file is written under an
// exclusive lock, so that of invocations that end together the last leaves its log whole. A
// process killed before it ends leaves no log.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "HostRoot.h"
#include "Operations.h"
#include "StateDocument.h"

namespace HostCtlSim {

extern const char* const kCallLogPath;  // /var/log/hostsim/calls.jsonl

class CallLog {
  public:
    CallLog();
    ~CallLog();
    CallLog(const CallLog&) = delete;
    CallLog& operator=(const CallLog&) = delete;

    // Records a call of `op` with its arguments.
    void Record(Operation op, const Json& args);
    // Notes on the call recorded last that it threw `message`.
    void NoteError(const std::string& message);
    // Replaces the log below `root` by the calls recorded, if there are any; the last thing
    // done with the log. A log that cannot be written (a read-only root, say) is left as it
    // was: it serves the tests, not the host.
    void Write(const HostRoot& root);

    // The log below `root`, in the order of the calls.
    static std::vector<CallRecord> Read(const HostRoot& root);
    // Empties the log; false when it cannot.
    static bool Clear(const HostRoot& root);

  private:
    class Writer;
    // The log's text as it will be written, but for the closing brace of the last call, which
    // an error may still extend. A listing of thousands of disks records a call for each, so a
    // call costs no more than its text.
    std::string text_;
    std::unique_ptr<Writer> writer_;
};

}  // namespace HostCtlSim
