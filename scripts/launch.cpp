// The fast path of the ./autocli and ./hostsim wrappers: `wrapper-launch ROOT TOOL [ARG...]`.
// When no source listed in build/.tools-watch changed since build/.tools-built was taken, it
// runs the tool at once (a stat per source, no shell, no build system); otherwise it has
// scripts/ensure-built bring build/ up to date first. Either way the tool runs on the
// checkout's simulated host, .hostsim/, unless HOSTSIM_STATE and MESK_HOST_ROOT say otherwise.
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

bool NotOlder(const timespec& a, const timespec& b) {
    return a.tv_sec > b.tv_sec || (a.tv_sec == b.tv_sec && a.tv_nsec >= b.tv_nsec);
}

// True when the stamp exists and every watched path (relative to the checkout, one a line)
// exists and is older than it. The stamp is taken when a build starts, so a source saved
// during the build counts as changed.
bool UpToDate(const std::string& root) {
    const int top = open(root.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
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
int EnsureBuilt(const std::string& root) {
    const std::string script = root + "/scripts/ensure-built";
    pid_t child = fork();
    if (child < 0) return 1;
    if (child == 0) {
        execl(script.c_str(), script.c_str(), static_cast<char*>(nullptr));
        std::fprintf(stderr, "%s: %s\n", script.c_str(), std::strerror(errno));
        _exit(127);
    }
    int status = 0;
    while (waitpid(child, &status, 0) < 0) {
        if (errno != EINTR) return 1;
    }
    return WIFEXITED(status) ? WEXITSTATUS(status) : 1;
}

// `name` as it is when set and not empty, else `fallback`; exported either way.
std::string Default(const char* name, const std::string& fallback) {
    const char* value = std::getenv(name);
    if (value == nullptr || *value == '\0') {
        setenv(name, fallback.c_str(), 1);
        return fallback;
    }
    return value;
}

void MakeDirectories(const std::string& path) {
    for (size_t slash = path.find('/', 1);; slash = path.find('/', slash + 1)) {
        mkdir(path.substr(0, slash).c_str(), 0777);
        if (slash == std::string::npos) return;
    }
}

}  // namespace

int main(int argc, char** argv) {
    if (argc < 3) {
        std::fprintf(stderr, "usage: wrapper-launch ROOT autocli|hostsim [ARG...]\n");
        return 2;
    }
    char resolved[PATH_MAX];
    if (realpath(argv[1], resolved) == nullptr) {
        std::fprintf(stderr, "wrapper-launch: %s: %s\n", argv[1], std::strerror(errno));
        return 1;
    }
    const std::string root = resolved;
    const std::string tool = argv[2];
    const std::string build = root + "/build";
    std::string program;
    if (tool == "autocli") {
        program = build + "/platform/autocli/autocli";
    } else if (tool == "hostsim") {
        program = build + "/platform/hostctl/hostsim";
    } else {
        std::fprintf(stderr, "wrapper-launch: unknown tool %s\n", argv[2]);
        return 2;
    }

    if (!UpToDate(root)) {
        const int status = EnsureBuilt(root);
        if (status != 0) return status;
    }

    const std::string state = Default("HOSTSIM_STATE", root + "/.hostsim/state.db");
    const std::string hostRoot = Default("MESK_HOST_ROOT", root + "/.hostsim/root");
    const size_t slash = state.rfind('/');
    if (slash != std::string::npos && slash > 0) MakeDirectories(state.substr(0, slash));
    MakeDirectories(hostRoot);

    argv[2] = const_cast<char*>(program.c_str());
    execv(program.c_str(), argv + 2);
    std::fprintf(stderr, "wrapper-launch: %s: %s\n", program.c_str(), std::strerror(errno));
    return 127;
}
