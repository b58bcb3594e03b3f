#include "HostRoot.h"

#include <fcntl.h>
#include <sys/random.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <stdexcept>
#include <utility>

namespace HostCtlSim {

const char* const kTraceConfigPath = "/etc/orvane/mesk/mesktraced.conf";
const char* const kTraceScriptPath = "/etc/init.d/mesktraced";
const char* const kNotifyScriptPath = "/usr/lib/orvane/tavord/bin/notifyDatastore.py";
const char* const kServiceStatePath = "/var/lib/hostsim/mesktraced.state";
const char* const kScriptLogPath = "/var/log/hostsim/scripts.jsonl";

namespace {

// Reads the file at `path` whole into `text`; false, with `text` empty, when it cannot. (No
// streams: the library would pay for their symbols at every load, for the sake of hostsim.)
bool ReadFile(const std::string& path, std::string& text) {
    text.clear();
    int fd = open(path.c_str(), O_RDONLY | O_CLOEXEC);
    if (fd < 0) return false;
    char buffer[65536];
    ssize_t got;
    while ((got = read(fd, buffer, sizeof buffer)) > 0 || (got < 0 && errno == EINTR)) {
        if (got > 0) text.append(buffer, static_cast<size_t>(got));
    }
    close(fd);
    return got == 0;
}

// The line of `text` that starts at `at`, without its newline, as std::getline takes it;
// moves `at` past it. False at the end of the text.
bool NextLine(const std::string& text, size_t& at, std::string& line) {
    if (at >= text.size()) return false;
    size_t end = text.find('\n', at);
    if (end == std::string::npos) end = text.size();
    line.assign(text, at, end - at);
    at = end + 1;
    return true;
}

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
umask 022
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
# The state file is data: only the known keys with values of their kind are taken from it.
if [ -r "$state_file" ]; then
    while IFS='=' read -r key value; do
        case "$key=$value" in
        state=running | state=stopped) state=$value ;;
        status_fails=[01]) status_fails=$value ;;
        restart_failures=-1) restart_failures=-1 ;;
        restart_failures= | restart_failures=*[!0-9]*) ;;
        restart_failures=*) restart_failures=$value ;;
        esac
    done <"$state_file"
fi
# As the real service reports the directory it uses, a restart takes the configured volume
# (MESKTRACED_VOLUME) as the last selected one when it is a directory below the host's root;
# otherwise the last selection stays.
select_volume() {
    config="$root@CONFIG@"
    [ -r "$config" ] || return 0
    volume=$(sed -n 's/^MESKTRACED_VOLUME=//p' "$config" | tail -n 1 | tr -d '"')
    [ -n "$volume" ] && [ -d "$root$volume" ] || return 0
    new_config=$(mktemp "$config.XXXXXX") || return 0
    VOLUME=$volume awk '
        /^MESKTRACED_LAST_SELECTED_VOLUME=/ { if (!done) print "MESKTRACED_LAST_SELECTED_VOLUME=\"" ENVIRON["VOLUME"] "\""; done = 1; next }
        { print }
        END { if (!done) print "MESKTRACED_LAST_SELECTED_VOLUME=\"" ENVIRON["VOLUME"] "\"" }' \
        "$config" >"$new_config" && chmod 644 "$new_config" && mv "$new_config" "$config" ||
        rm -f "$new_config"
}
save() {
    new_state=$(mktemp "$state_file.XXXXXX") &&
        printf 'state=%s\nstatus_fails=%s\nrestart_failures=%s\n' \
            "$state" "$status_fails" "$restart_failures" >"$new_state" &&
        chmod 644 "$new_state" && mv "$new_state" "$state_file"
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
    select_volume
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
    const size_t config = text.find("@CONFIG@");
    if (config != std::string::npos) text.replace(config, 8, kTraceConfigPath);
    return text;
}

// The descriptor of an open file, closed at the end of the scope.
class Descriptor {
  public:
    explicit Descriptor(int fd = -1) : fd_(fd) {}
    ~Descriptor() {
        if (fd_ >= 0) close(fd_);
    }
    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(const Descriptor&) = delete;
    int get() const { return fd_; }
    int release() { return std::exchange(fd_, -1); }
    void reset(int fd) {
        if (fd_ >= 0) close(fd_);
        fd_ = fd;
    }

  private:
    int fd_;
};

[[noreturn]] void Refuse(const std::string& path, const std::string& why) {
    throw std::runtime_error(path + ": " + why);
}

// Why another user could change the file or directory, or "" when none can.
std::string Untrusted(const struct stat& file) {
    if (file.st_uid != geteuid() && file.st_uid != 0) {
        return "belongs to another user (uid " + std::to_string(file.st_uid) + ")";
    }
    if (file.st_mode & S_IWOTH) return "is writable by every user";
    if ((file.st_mode & S_IWGRP) && file.st_gid != getegid()) {
        return "is writable by another group (gid " + std::to_string(file.st_gid) + ")";
    }
    return "";
}

// Opens the directory `name` below `at` (a path when `at` is AT_FDCWD) without following a
// symlink, making it (0755, whatever the umask) when missing and `create`, and checks it.
int OpenTrusted(int at, const std::string& name, const std::string& shown, bool create) {
    const int flags = O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC;
    Descriptor fd(openat(at, name.c_str(), flags));
    if (fd.get() < 0 && errno == ENOENT && create) {
        if (mkdirat(at, name.c_str(), 0755) != 0 && errno != EEXIST) {
            Refuse(shown, std::string("cannot create: ") + std::strerror(errno));
        }
        fd.reset(openat(at, name.c_str(), flags));
        struct stat made {};
        if (fd.get() >= 0 && fstat(fd.get(), &made) == 0 && made.st_uid == geteuid()) {
            fchmod(fd.get(), 0755);
        }
    }
    if (fd.get() < 0) {
        struct stat link {};
        int error = errno;
        if (error == ELOOP ||
            (error == ENOTDIR && fstatat(at, name.c_str(), &link, AT_SYMLINK_NOFOLLOW) == 0 &&
             S_ISLNK(link.st_mode))) {
            Refuse(shown, "is a symlink");
        }
        errno = error;
        Refuse(shown, std::strerror(errno));
    }
    struct stat directory {};
    if (fstat(fd.get(), &directory) != 0) Refuse(shown, std::strerror(errno));
    std::string why = Untrusted(directory);
    if (!why.empty()) Refuse(shown, why);
    return fd.release();
}

// Splits a host path into its directory and its name: "/etc/init.d/x" -> "/etc/init.d", "x".
std::pair<std::string, std::string> Split(const std::string& hostPath) {
    size_t slash = hostPath.rfind('/');
    return {hostPath.substr(0, slash), hostPath.substr(slash + 1)};
}

// A name of its own in a directory for a file written aside: ".NAME.XXXXXX".
std::string StagedName(const std::string& name) {
    static const char kLetters[] = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789";
    unsigned char random[8] = {};
    if (getrandom(random, sizeof random, 0) != sizeof random) {
        // Only an unlikely name: O_EXCL keeps it from meeting another's.
        for (auto& byte : random) byte = static_cast<unsigned char>(std::rand());
    }
    std::string staged = "." + name + ".";
    for (unsigned char byte : random) staged += kLetters[byte % (sizeof kLetters - 1)];
    return staged;
}

}  // namespace

HostRoot::HostRoot(std::string directory) : directory_(std::move(directory)) {
    while (directory_.size() > 1 && directory_.back() == '/') directory_.pop_back();
}

std::string HostRoot::PathOf(const std::string& hostPath) const {
    if (directory_ == "/") return hostPath;
    return directory_ + hostPath;
}

int HostRoot::OpenDirectory(const std::string& hostDirectory, bool create) const {
    // The directories above the root are the system's: made when missing, not checked.
    struct stat existing {};
    if (create && lstat(directory_.c_str(), &existing) != 0) {
        for (size_t slash = directory_.find('/', 1); slash != std::string::npos;
             slash = directory_.find('/', slash + 1)) {
            std::string parent = directory_.substr(0, slash);
            if (mkdir(parent.c_str(), 0755) != 0 && errno != EEXIST) {
                Refuse(parent, std::string("cannot create: ") + std::strerror(errno));
            }
        }
    }
    Descriptor fd(OpenTrusted(AT_FDCWD, directory_, "host root " + directory_, create));
    std::string shown = directory_ == "/" ? "" : directory_;
    for (size_t begin = 1; begin < hostDirectory.size();) {
        size_t end = hostDirectory.find('/', begin);
        if (end == std::string::npos) end = hostDirectory.size();
        std::string name = hostDirectory.substr(begin, end - begin);
        shown += "/" + name;
        fd.reset(OpenTrusted(fd.get(), name, shown, create));
        begin = end + 1;
    }
    return fd.release();
}

void HostRoot::CheckTrusted(const std::string& hostPath) const {
    auto [directory, name] = Split(hostPath);
    Descriptor fd(OpenDirectory(directory, false));
    struct stat file {};
    if (fstatat(fd.get(), name.c_str(), &file, AT_SYMLINK_NOFOLLOW) != 0) {
        Refuse(PathOf(hostPath), std::strerror(errno));
    }
    if (S_ISLNK(file.st_mode)) Refuse(PathOf(hostPath), "is a symlink");
    std::string why = Untrusted(file);
    if (!why.empty()) Refuse(PathOf(hostPath), why);
}

HostRoot::Files::~Files() {
    for (const Staged& file : staged_) {
        unlinkat(file.directory, file.staged.c_str(), 0);
        close(file.directory);
    }
}

void HostRoot::Files::Write(const HostFile& file) {
    std::string path = root_.PathOf(file.path);
    auto fail = [&](const std::string& why) {
        throw std::runtime_error("cannot write " + path + ": " + why);
    };
    auto [directory, name] = Split(file.path);
    Descriptor at;
    try {
        at.reset(root_.OpenDirectory(directory, true));
    } catch (const std::runtime_error& error) {
        fail(error.what());
    }
    // What stands in the way of the rename is found now, before anything changes.
    struct stat target {};
    if (fstatat(at.get(), name.c_str(), &target, AT_SYMLINK_NOFOLLOW) == 0 &&
        S_ISDIR(target.st_mode)) {
        fail(std::strerror(EISDIR));
    }
    Descriptor out;
    std::string staged;
    for (int attempt = 0; out.get() < 0 && attempt < 100; ++attempt) {
        staged = StagedName(name);
        out.reset(openat(at.get(), staged.c_str(),
                         O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0600));
        if (out.get() < 0 && errno != EEXIST) break;
    }
    if (out.get() < 0) fail(std::strerror(errno));
    staged_.push_back({file.path, name, staged, at.release()});
    if (fchmod(out.get(), file.mode) != 0) fail(std::strerror(errno));
    for (size_t done = 0; done < file.content.size();) {
        ssize_t written = write(out.get(), file.content.data() + done, file.content.size() - done);
        if (written < 0 && errno == EINTR) continue;
        if (written < 0) fail(std::strerror(errno));
        done += static_cast<size_t>(written);
    }
    if (close(out.release()) != 0) fail(std::strerror(errno));
}

Json HostRoot::Files::Pending() const {
    Json pending = Json::array();
    for (const Staged& file : staged_) {
        pending.push_back({{"path", file.path}, {"staged", file.staged}});
    }
    return pending;
}

void HostRoot::Files::Apply() {
    std::string failed;
    for (const Staged& file : staged_) {
        if (renameat(file.directory, file.staged.c_str(), file.directory, file.name.c_str()) != 0) {
            if (failed.empty()) {
                failed = "cannot write " + root_.PathOf(file.path) + ": " + std::strerror(errno);
            }
            unlinkat(file.directory, file.staged.c_str(), 0);
        }
        close(file.directory);
    }
    staged_.clear();
    if (!failed.empty()) throw std::runtime_error(failed);
}

void HostRoot::Complete(const Json& pending) const {
    if (!pending.is_array()) return;
    for (const Json& file : pending) {
        if (!file.is_object() || !file.value("path", Json()).is_string() ||
            !file.value("staged", Json()).is_string()) {
            continue;
        }
        auto [directory, name] = Split(file["path"].get<std::string>());
        std::string staged = file["staged"].get<std::string>();
        if (staged.find('/') != std::string::npos) continue;
        try {
            Descriptor at(OpenDirectory(directory, false));
            renameat(at.get(), staged.c_str(), at.get(), name.c_str());
        } catch (const std::runtime_error&) {
            // Its directory is gone or no longer trusted: the file stays as it is.
        }
    }
}

std::vector<HostFile> HostRoot::FreshFiles(const Json& services) {
    return {{kTraceConfigPath, kTraceConfig, 0644},
            {kTraceScriptPath, WithCommon(kTraceScript), 0755},
            {kNotifyScriptPath, WithCommon(kNotifyScript), 0755},
            ServicesFile(services),
            {kScriptLogPath, "", 0644}};
}

void HostRoot::Create(const Json& services) const {
    Files files(*this);
    for (const HostFile& file : FreshFiles(services)) files.Write(file);
    files.Apply();
}

Json HostRoot::ReadServices(const Json& pending) const {
    Json services = DefaultHost()["services"];
    Json& trace = services["mesktraced"];
    std::string text;
    bool read = false;
    for (const Json& file : pending.is_array() ? pending : Json::array()) {
        if (file.is_object() && file.value("path", "") == kServiceStatePath &&
            file.value("staged", "").find('/') == std::string::npos) {
            read = ReadFile(PathOf(Split(kServiceStatePath).first) + "/" + file.value("staged", ""),
                            text);
        }
    }
    if (!read) ReadFile(PathOf(kServiceStatePath), text);
    std::string line;
    for (size_t at = 0; NextLine(text, at, line);) {
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

HostFile HostRoot::ServicesFile(const Json& services) {
    const Json& trace = services.at("mesktraced");
    std::string text =
        "state=" + trace.at("state").get<std::string>() + "\n" +
        "status_fails=" + (trace.at("statusFails").get<bool>() ? "1" : "0") + "\n" +
        "restart_failures=" + std::to_string(trace.at("restartFailures").get<int64_t>()) + "\n";
    return {kServiceStatePath, text, 0644};
}

std::vector<CallRecord> ParseTimedLog(const std::string& text) {
    std::vector<CallRecord> records;
    std::string line;
    for (size_t at = 0; NextLine(text, at, line);) {
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
    std::string text;
    ReadFile(PathOf(kScriptLogPath), text);
    return ParseTimedLog(text);
}

}  // namespace HostCtlSim
