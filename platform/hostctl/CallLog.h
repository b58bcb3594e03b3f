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
#include <initializer_list>
#include <memory>
#include <string>
#include <string_view>
#include <type_traits>
#include <vector>

#include "HostRoot.h"
#include "Operations.h"
#include "StateDocument.h"

namespace HostCtlSim {

extern const char* const kCallLogPath;  // /var/log/hostsim/calls.jsonl

// One argument of a call, as the log shows it: a reference to the caller's value, written
// straight into the log's text, so that recording a call builds nothing. The values must
// outlive the call's recording, as the temporaries of the calling expression do.
class CallArg {
  public:
    CallArg(const std::string& text) : kind_(Kind::kText), text_(&text) {}
    CallArg(const char* text) = delete;  // would be taken for a flag
    CallArg(bool flag) : kind_(Kind::kFlag), number_(flag) {}
    template <
        class Number,
        std::enable_if_t<std::is_integral_v<Number> && !std::is_same_v<Number, bool>, int> = 0>
    CallArg(Number number)
        : kind_(std::is_signed_v<Number> ? Kind::kSigned : Kind::kUnsigned),
          number_(static_cast<uint64_t>(number)) {}
    CallArg(const std::vector<std::string>& texts) : kind_(Kind::kTexts), texts_(&texts) {}
    CallArg(const Json& value) : kind_(Kind::kJson), json_(&value) {}
    // A text that is its own JSON string's content (a UUID's text form, say): printable ASCII
    // without a quote or a backslash, written without looking at it.
    static CallArg Plain(std::string_view text) {
        CallArg arg(false);
        arg.kind_ = Kind::kPlain;
        arg.plain_ = {text.data(), text.size()};
        return arg;
    }

  private:
    friend class CallLog;
    enum class Kind { kText, kPlain, kFlag, kSigned, kUnsigned, kTexts, kJson };
    Kind kind_;
    union {
        const std::string* text_;
        struct {
            const char* data;
            size_t size;
        } plain_;
        uint64_t number_;
        const std::vector<std::string>* texts_;
        const Json* json_;
    };
};
using CallArgs = std::initializer_list<CallArg>;

class CallLog {
  public:
    CallLog();
    ~CallLog();
    CallLog(const CallLog&) = delete;
    CallLog& operator=(const CallLog&) = delete;

    // Records a call of `op` with its arguments.
    void Record(Operation op, CallArgs args);
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
    // Room for `bytes` more at the end of the text, whose first byte it returns.
    char* Room(size_t bytes);
    void Wrote(size_t bytes);  // `bytes` written where Room() pointed
    void Put(const char* data, size_t size);
    char* AppendTime(char* out);  // writes the time at `out`; returns the end
    void Append(const CallArg& arg);
    void Append(const std::string& text);
    void Append(const Json& value);
    const std::string& Serialized(const Json& value);  // the JSON text of what is not plain

    // The log's text as it will be written, in blocks_ (length_ bytes in all), but for the
    // closing brace of the last call, which an error may still extend. A listing of thousands
    // of disks records calls by the thousand, so a call costs no more than copying its text.
    struct Block {
        std::unique_ptr<char[]> data;
        size_t size;
        size_t capacity;
    };
    static constexpr size_t kBlockSize = 64 * 1024;
    std::vector<Block> blocks_;
    size_t length_ = 0;
    int64_t second_ = -1;             // the second of the last call's time
    char secondText_[24] = {};        // its text,
    size_t secondLength_ = 0;         // of this length
    std::unique_ptr<Writer> writer_;  // made for the first text that is not plain
};

}  // namespace HostCtlSim
