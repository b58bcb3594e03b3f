#include "CallLog.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <charconv>
#include <cstring>
#include <ctime>
#include <iterator>
#include <stdexcept>

namespace HostCtlSim {

const char* const kCallLogPath = "/var/log/hostsim/calls.jsonl";

namespace {

// The log file, open and locked (exclusively to write it); -1 when it cannot be had.
int OpenLocked(const HostRoot& root, bool writing) {
    std::string hostPath = kCallLogPath;
    size_t slash = hostPath.rfind('/');
    int directory = -1;
    try {
        directory = root.OpenDirectory(hostPath.substr(0, slash), writing);
    } catch (const std::runtime_error&) {
        return -1;  // missing, or another user's
    }
    int flags = (writing ? O_WRONLY | O_CREAT : O_RDONLY) | O_CLOEXEC | O_NOFOLLOW;
    int fd = openat(directory, hostPath.c_str() + slash + 1, flags, 0644);
    close(directory);
    if (fd < 0) return -1;
    // Made with the mode the log has whatever the umask.
    struct stat file {};
    if (writing && fstat(fd, &file) == 0 && file.st_uid == geteuid() &&
        (file.st_mode & 07777) != 0644) {
        fchmod(fd, 0644);
    }
    while (flock(fd, writing ? LOCK_EX : LOCK_SH) != 0) {
        if (errno != EINTR) {
            close(fd);
            return -1;
        }
    }
    return fd;
}

// Whether `text` is its own JSON text: printable ASCII without a quote or a backslash. Looked
// at eight bytes at a time, as most texts logged are UUIDs and names.
bool IsPlain(const std::string& text) {
    const uint64_t ones = 0x0101010101010101, highs = ones * 0x80;
    auto hasZero = [&](uint64_t word) { return (word - ones) & ~word & highs; };
    auto hasSpecial = [&](uint64_t word) {
        return ((word - ones * 0x20) & ~word & highs) | (word & highs) |
               hasZero(word ^ (ones * 0x7f)) | hasZero(word ^ (ones * '"')) |
               hasZero(word ^ (ones * '\\'));
    };
    size_t i = 0;
    for (; i + 8 <= text.size(); i += 8) {
        uint64_t word;
        std::memcpy(&word, text.data() + i, 8);
        if (hasSpecial(word)) return false;
    }
    uint64_t word = ones * 'a';  // the rest, padded with a plain character
    std::memcpy(&word, text.data() + i, text.size() - i);
    return !hasSpecial(word);
}

template <size_t N>
char* Copy(char* out, const char (&text)[N]) {
    std::memcpy(out, text, N - 1);
    return out + N - 1;
}

// Writes `text`, which needs no escaping, as a JSON string; returns the end.
char* Quote(char* out, const char* text, size_t size) {
    out[0] = '"';
    std::memcpy(out + 1, text, size);
    out[size + 1] = '"';
    return out + size + 2;
}

}  // namespace

// The JSON text of what is not plain, made by nlohmann's own serializer (the one that dump()
// makes anew for each value), made once for the whole log.
class CallLog::Writer {
  public:
    Writer()
        : serializer_(nlohmann::detail::output_adapter<char, std::string>(text_), ' ',
                      Json::error_handler_t::replace) {}

    const std::string& Text(const Json& value) {
        text_.clear();
        serializer_.dump(value, false, false, 0);
        return text_;
    }

  private:
    std::string text_;
    nlohmann::detail::serializer<Json> serializer_;
};

CallLog::CallLog() = default;
CallLog::~CallLog() = default;

char* CallLog::Room(size_t bytes) {
    if (blocks_.empty() || blocks_.back().capacity - blocks_.back().size < bytes) {
        // What is written stays where it is: a block that is full is followed by another.
        size_t capacity = std::max(bytes, kBlockSize);
        blocks_.push_back({std::unique_ptr<char[]>(new char[capacity]), 0, capacity});
    }
    return blocks_.back().data.get() + blocks_.back().size;
}

void CallLog::Wrote(size_t bytes) {
    blocks_.back().size += bytes;
    length_ += bytes;
}

void CallLog::Put(const char* data, size_t size) {
    std::memcpy(Room(size), data, size);
    Wrote(size);
}

char* CallLog::AppendTime(char* out) {
    // The time in nanoseconds since the epoch: the seconds, which seldom change from one call
    // to the next and whose text is kept, then the nanoseconds in nine digits.
    timespec now{};
    clock_gettime(CLOCK_REALTIME, &now);
    if (now.tv_sec != second_) {
        second_ = now.tv_sec;
        secondLength_ =
            size_t(std::to_chars(secondText_, std::end(secondText_), second_).ptr - secondText_);
    }
    std::memcpy(out, secondText_, secondLength_);
    out += secondLength_;
    static const char kPairs[] =
        "00010203040506070809101112131415161718192021222324252627282930313233343536373839"
        "40414243444546474849505152535455565758596061626364656667686970717273747576777879"
        "8081828384858687888990919293949596979899";
    auto nanoseconds = static_cast<uint32_t>(now.tv_nsec);
    for (int i = 7; i >= 1; i -= 2) {
        std::memcpy(out + i, kPairs + 2 * (nanoseconds % 100), 2);
        nanoseconds /= 100;
    }
    out[0] = char('0' + nanoseconds);
    return out + 9;
}

void CallLog::Record(Operation op, CallArgs args) {
    // {"time":..., "op":..., "args":[...], "error":...}, the form of the scripts' log. Operation
    // names are plain identifiers and need no escaping.
    const char* name = OperationName(op);
    size_t nameLength = std::strlen(name);
    // The calls made by the thousand have plain texts, flags and numbers for arguments: room
    // for their whole line is made at once, and they are written straight into it.
    size_t bound = 64 + nameLength + 1;
    bool simple = true;
    for (const CallArg& arg : args) {
        switch (arg.kind_) {
            case CallArg::Kind::kText:
                simple = simple && IsPlain(*arg.text_);
                bound += arg.text_->size() + 3;
                break;
            case CallArg::Kind::kPlain:
                bound += arg.plain_.size + 3;
                break;
            case CallArg::Kind::kFlag:
            case CallArg::Kind::kSigned:
            case CallArg::Kind::kUnsigned:
                bound += 25;
                break;
            case CallArg::Kind::kTexts:
            case CallArg::Kind::kJson:
                simple = false;
                break;
        }
    }
    bool first = length_ == 0;
    char* start = Room(simple ? bound : 64 + nameLength);
    char* out = start;
    if (!first) out = Copy(out, "}\n");
    out = Copy(out, "{\"time\":");
    out = AppendTime(out);
    out = Copy(out, ",\"op\":\"");
    std::memcpy(out, name, nameLength);
    out = Copy(out + nameLength, "\",\"args\":[");
    if (!simple) {
        Wrote(size_t(out - start));
        first = true;
        for (const CallArg& arg : args) {
            if (!first) Put(",", 1);
            first = false;
            Append(arg);
        }
        Put("]", 1);
        return;
    }
    first = true;
    for (const CallArg& arg : args) {
        if (!first) *out++ = ',';
        first = false;
        switch (arg.kind_) {
            case CallArg::Kind::kText:
                out = Quote(out, arg.text_->data(), arg.text_->size());
                break;
            case CallArg::Kind::kPlain:
                out = Quote(out, arg.plain_.data, arg.plain_.size);
                break;
            case CallArg::Kind::kFlag:
                out = arg.number_ != 0 ? Copy(out, "true") : Copy(out, "false");
                break;
            case CallArg::Kind::kSigned:
                out = std::to_chars(out, out + 24, int64_t(arg.number_)).ptr;
                break;
            case CallArg::Kind::kUnsigned:
                out = std::to_chars(out, out + 24, arg.number_).ptr;
                break;
            case CallArg::Kind::kTexts:
            case CallArg::Kind::kJson:
                break;
        }
    }
    *out++ = ']';
    Wrote(size_t(out - start));
}

void CallLog::Append(const CallArg& arg) {
    switch (arg.kind_) {
        case CallArg::Kind::kText:
            Append(*arg.text_);
            break;
        case CallArg::Kind::kPlain: {
            char* start = Room(arg.plain_.size + 2);
            Wrote(size_t(Quote(start, arg.plain_.data, arg.plain_.size) - start));
            break;
        }
        case CallArg::Kind::kFlag:
            if (arg.number_ != 0) {
                Put("true", 4);
            } else {
                Put("false", 5);
            }
            break;
        case CallArg::Kind::kSigned:
        case CallArg::Kind::kUnsigned: {
            char* start = Room(24);
            char* end = arg.kind_ == CallArg::Kind::kSigned
                            ? std::to_chars(start, start + 24, int64_t(arg.number_)).ptr
                            : std::to_chars(start, start + 24, arg.number_).ptr;
            Wrote(size_t(end - start));
            break;
        }
        case CallArg::Kind::kTexts:
            Put("[", 1);
            for (size_t i = 0; i < arg.texts_->size(); ++i) {
                if (i > 0) Put(",", 1);
                Append((*arg.texts_)[i]);
            }
            Put("]", 1);
            break;
        case CallArg::Kind::kJson:
            Append(*arg.json_);
            break;
    }
}

void CallLog::Append(const std::string& text) {
    if (!IsPlain(text)) {
        const std::string& json = Serialized(text);
        Put(json.data(), json.size());
        return;
    }
    char* start = Room(text.size() + 2);
    Wrote(size_t(Quote(start, text.data(), text.size()) - start));
}

void CallLog::Append(const Json& value) {
    if (value.is_array()) {
        Put("[", 1);
        for (size_t i = 0; i < value.size(); ++i) {
            if (i > 0) Put(",", 1);
            Append(value[i]);
        }
        Put("]", 1);
    } else if (value.is_string()) {
        Append(value.get_ref<const std::string&>());
    } else {
        const std::string& json = Serialized(value);
        Put(json.data(), json.size());
    }
}

const std::string& CallLog::Serialized(const Json& value) {
    if (!writer_) writer_ = std::make_unique<Writer>();
    return writer_->Text(value);
}

void CallLog::NoteError(const std::string& message) {
    if (length_ == 0) return;
    Put(",\"error\":", 9);
    Append(message);
}

void CallLog::Write(const HostRoot& root) {
    if (length_ == 0) return;
    Put("}\n", 2);
    int fd = OpenLocked(root, true);
    if (fd < 0) return;
    // Written over the last log and then cut to its length, never emptied first: ext4 takes
    // a file cut to nothing and written again for a replaced file and starts writing it to the
    // disk at close, which each invocation would wait for.
    size_t done = 0;
    for (const Block& block : blocks_) {
        size_t written = 0;
        while (written < block.size) {
            ssize_t got =
                pwrite(fd, block.data.get() + written, block.size - written, off_t(done + written));
            if (got < 0 && errno == EINTR) continue;
            if (got <= 0) break;
            written += static_cast<size_t>(got);
        }
        done += written;
        if (written < block.size) break;
    }
    // A log that could not be written whole is emptied rather than left mixed with the last.
    bool whole = done == length_ && ftruncate(fd, off_t(done)) == 0;
    if (!whole) whole = ftruncate(fd, 0) == 0;
    close(fd);
}

std::vector<CallRecord> CallLog::Read(const HostRoot& root) {
    std::string text;
    int fd = OpenLocked(root, false);
    if (fd >= 0) {
        char buffer[65536];
        ssize_t got;
        while ((got = read(fd, buffer, sizeof buffer)) > 0 || (got < 0 && errno == EINTR)) {
            if (got > 0) text.append(buffer, static_cast<size_t>(got));
        }
        close(fd);
    }
    return ParseTimedLog(text);
}

bool CallLog::Clear(const HostRoot& root) {
    int fd = OpenLocked(root, true);
    if (fd < 0) return false;
    bool cleared = ftruncate(fd, 0) == 0;
    close(fd);
    return cleared;
}

}  // namespace HostCtlSim
