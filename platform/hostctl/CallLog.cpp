#include "CallLog.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <ctime>
#include <stdexcept>

namespace HostCtlSim {

const char* const kCallLogPath = "/var/log/hostsim/calls.jsonl";

namespace {

int64_t Now() {
    timespec now{};
    clock_gettime(CLOCK_REALTIME, &now);
    return int64_t(now.tv_sec) * 1000000000 + now.tv_nsec;
}

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

}  // namespace

// Appends JSON text to the log. Most arguments are UUIDs and names, texts that JSON takes as
// they are: those are copied; everything else goes through nlohmann's own serializer (the one
// that dump() makes anew for each value), made once for the whole log.
class CallLog::Writer {
  public:
    explicit Writer(std::string& text)
        : text_(text),
          serializer_(nlohmann::detail::output_adapter<char, std::string>(text), ' ',
                      Json::error_handler_t::replace) {}

    void Append(const Json& value) {
        if (value.is_array()) {
            text_ += '[';
            for (size_t i = 0; i < value.size(); ++i) {
                if (i > 0) text_ += ',';
                Append(value[i]);
            }
            text_ += ']';
        } else if (value.is_string() && IsPlain(value.get_ref<const std::string&>())) {
            text_ += '"';
            text_ += value.get_ref<const std::string&>();
            text_ += '"';
        } else {
            serializer_.dump(value, false, false, 0);
        }
    }

  private:
    // Printable ASCII without a quote or backslash: its JSON text is itself.
    static bool IsPlain(const std::string& text) {
        for (char c : text) {
            if (c < 0x20 || c > 0x7e || c == '"' || c == '\\') return false;
        }
        return true;
    }

    std::string& text_;
    nlohmann::detail::serializer<Json> serializer_;
};

CallLog::CallLog() : writer_(std::make_unique<Writer>(text_)) {}
CallLog::~CallLog() = default;

void CallLog::Record(Operation op, const Json& args) {
    // {"time":..., "op":..., "args":[...], "error":...}, the form of the scripts' log. Operation
    // names are plain identifiers and need no escaping.
    if (!text_.empty()) text_ += "}\n";
    text_ += "{\"time\":";
    text_ += std::to_string(Now());
    text_ += ",\"op\":\"";
    text_ += OperationName(op);
    text_ += "\",\"args\":";
    writer_->Append(args);
}

void CallLog::NoteError(const std::string& message) {
    if (text_.empty()) return;
    text_ += ",\"error\":";
    writer_->Append(message);
}

void CallLog::Write(const HostRoot& root) {
    if (text_.empty()) return;
    text_ += "}\n";
    int fd = OpenLocked(root, true);
    if (fd < 0) return;
    // Written over the last log and then cut to its length, never emptied first: ext4 takes
    // a file cut to nothing and written again for a replaced file and starts writing it to the
    // disk at close, which each invocation would wait for.
    size_t done = 0;
    while (done < text_.size()) {
        ssize_t written = pwrite(fd, text_.data() + done, text_.size() - done, off_t(done));
        if (written < 0 && errno == EINTR) continue;
        if (written <= 0) break;
        done += static_cast<size_t>(written);
    }
    // A log that could not be written whole is emptied rather than left mixed with the last.
    bool whole = done == text_.size() && ftruncate(fd, off_t(done)) == 0;
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
