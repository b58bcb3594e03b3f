// Linked into the checkout's own builds of autocli and hostsim (autocli-checkout and
// hostsim-checkout, beside the programs in build/platform/), which the ./autocli and ./hostsim
// wrappers run; never into the installed programs. Before main, it makes sure that the build
// is current: when a source listed in build/.tools-watch changed since build/.tools-built was
// taken, scripts/ensure-built brings build/ up to date and the new build of the program starts
// in this process's place. Then it makes the directories of the simulated host that the
// wrapper named (HOSTSIM_STATE and MESK_HOST_ROOT: the wrapper sets them, since the
// host-control library's constructor, which runs before this one, sets a default of its own).
#include <fcntl.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <climits>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

namespace {

// Set across the exec that follows a rebuild, so that the new build runs without checking
// again: a source dated in the future would otherwise rebuild it for ever.
constexpr char kRebuilt[] = "MESK_CHECKOUT_REBUILT";

bool NotOlder(const timespec& a, const timespec& b) {
    return a.tv_sec > b.tv_sec || (a.tv_sec == b.tv_sec && a.tv_nsec >= b.tv_nsec);
}

// True when the stamp exists and every watched path (relative to the checkout, one a line)
// exists and is older than it. The stamp is taken when a build starts, so a source saved
// during the build counts as changed.
bool UpToDate() {
    const int top = open(MESK_CHECKOUT_ROOT, O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    if (top < 0) return false;
    struct stat stamp;
    bool fresh = fstatat(top, "build/.tools-built", &stamp, 0) == 0;
    const int list = fresh ? openat(top, "build/.tools-watch", O_RDONLY | O_CLOEXEC) : -1;
    std::string paths;
    char chunk[16384];
    ssize_t n = 0;
    while (list >= 0 && (n = read(list, chunk, sizeof chunk)) > 0) paths.append(chunk, n);
    fresh = fresh && list >= 0 && n == 0 && !paths.empty();
    if (list >= 0) close(list);
    for (size_t start = 0; fresh && start < paths.size();) {
        size_t end = paths.find('\n', start);
        if (end == std::string::npos) end = paths.size();
        paths[end] = '\0';
        struct stat source;
        fresh = fstatat(top, paths.c_str() + start, &source, 0) == 0 &&
                !NotOlder(source.st_mtim, stamp.st_mtim);
        start = end + 1;
    }
    close(top);
    return fresh;
}

// Runs scripts/ensure-built and returns its exit status.
int EnsureBuilt() {
    const char* script = MESK_CHECKOUT_ROOT "/scripts/ensure-built";
    const pid_t child = fork();
    if (child < 0) return 1;
    if (child == 0) {
        execl(script, script, static_cast<char*>(nullptr));
        std::fprintf(stderr, "%s: %s\n", script, std::strerror(errno));
        _exit(127);
    }
    int status = 0;
    while (waitpid(child, &status, 0) < 0) {
        if (errno != EINTR) return 1;
    }
    return WIFEXITED(status) ? WEXITSTATUS(status) : 1;
}

// Makes the directory and whatever it lacks of its parents; failures show when the host is
// opened.
void MakeDirectories(const std::string& path) {
    if (mkdir(path.c_str(), 0777) == 0 || errno != ENOENT) return;
    const size_t slash = path.rfind('/');
    if (slash == std::string::npos || slash == 0) return;
    MakeDirectories(path.substr(0, slash));
    mkdir(path.c_str(), 0777);
}

// glibc hands the program's arguments and environment to the executable's constructors as to
// main; priority 101, the first of those available, runs this before any other of them.
__attribute__((constructor(101))) void RunCurrentBuild(int, char** argv, char**) {
    if (std::getenv(kRebuilt) != nullptr) {
        unsetenv(kRebuilt);
    } else if (!UpToDate()) {
        // The path names the new build once this file has been replaced.
        char self[PATH_MAX];
        const ssize_t length = readlink("/proc/self/exe", self, sizeof self - 1);
        if (length <= 0) {
            std::fprintf(stderr, "%s: /proc/self/exe: %s\n", argv[0], std::strerror(errno));
            _exit(127);
        }
        self[length] = '\0';
        const int status = EnsureBuilt();
        if (status != 0) _exit(status);
        setenv(kRebuilt, "1", 1);
        execv(self, argv);
        std::fprintf(stderr, "%s: %s: %s\n", argv[0], self, std::strerror(errno));
        _exit(127);
    }

    const char* state = std::getenv("HOSTSIM_STATE");
    const char* hostRoot = std::getenv("MESK_HOST_ROOT");
    if (state != nullptr && *state != '\0') {
        const std::string path = state;
        const size_t slash = path.rfind('/');
        if (slash != std::string::npos && slash > 0) MakeDirectories(path.substr(0, slash));
    }
    if (hostRoot != nullptr && *hostRoot != '\0') MakeDirectories(hostRoot);
}

}  // namespace
