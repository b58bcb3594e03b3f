// AutoCli_ShellCmd: runs a command line through /bin/sh, and its test seam.
#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <spawn.h>
#include <sys/ioctl.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>

#include "ShellCmdHook.h"
#include "autocli/AutoCli.h"

extern char** environ;

namespace Kalmor {
namespace AutoCli {

namespace {

ShellCmdHook& InstalledHook() {
    static ShellCmdHook hook;
    return hook;
}

// Moves a descriptor above the standard ones, so that dup2 onto 0 or 1 in the child never
// meets a descriptor that already has that number (dup2 onto itself would keep close-on-exec).
int AboveStandardDescriptors(int fd) {
    if (fd > STDERR_FILENO) {
        return fd;
    }
    int moved = fcntl(fd, F_DUPFD_CLOEXEC, STDERR_FILENO + 1);
    close(fd);
    return moved;
}

bool MakePipe(int fds[2]) {
    if (pipe2(fds, O_CLOEXEC) != 0) {
        return false;
    }
    fds[0] = AboveStandardDescriptors(fds[0]);
    fds[1] = AboveStandardDescriptors(fds[1]);
    if (fds[0] < 0 || fds[1] < 0) {
        if (fds[0] >= 0) close(fds[0]);
        if (fds[1] >= 0) close(fds[1]);
        return false;
    }
    return true;
}

void CloseIfOpen(int& fd) {
    if (fd >= 0) {
        close(fd);
        fd = -1;
    }
}

// What is kept of the command's output: 1 MiB. The rest is read and dropped, so that a command
// that prints without end neither fills our memory nor blocks on a full pipe.
constexpr size_t kKeptOutputLimit = size_t{1} << 20;

void Keep(std::string& output, const char* data, size_t size) {
    if (output.size() < kKeptOutputLimit) {
        output.append(data, std::min(size, kKeptOutputLimit - output.size()));
    }
}

// Reads from the non-blocking pipe what is there now: with `all`, up to what it holds at this
// moment (a writer that goes on cannot keep us reading); else one buffer. Closes it at end
// of file or on an error.
void ReadAvailable(int& fromChild, std::string& output, bool all) {
    int pending = 0;
    if (all && ioctl(fromChild, FIONREAD, &pending) != 0) {
        pending = 0;
    }
    char buffer[65536];
    do {
        ssize_t n = read(fromChild, buffer, sizeof buffer);
        if (n > 0) {
            Keep(output, buffer, static_cast<size_t>(n));
            pending -= static_cast<int>(n);
        } else if (n == 0 || (errno != EINTR && errno != EAGAIN)) {
            CloseIfOpen(fromChild);
        } else if (errno == EAGAIN) {
            return;
        }
    } while (fromChild >= 0 && pending > 0);
}

// Feeds `input` to the child's standard input while collecting what it prints, so that
// neither side blocks on a full pipe, until the child itself exits: a process it left behind
// that still holds the pipe does not hold us. Then takes what is left in the pipe. Returns the
// child's exit status, or -1 when it was killed by a signal or could not be waited for.
int Exchange(pid_t pid, int toChild, int fromChild, const std::string& input, std::string& output) {
    size_t written = 0;
    if (input.empty()) {
        CloseIfOpen(toChild);
    } else {
        // Partial writes instead of blocking while the child waits for us to read.
        fcntl(toChild, F_SETFL, fcntl(toChild, F_GETFL) | O_NONBLOCK);
    }
    fcntl(fromChild, F_SETFL, fcntl(fromChild, F_GETFL) | O_NONBLOCK);
    // Readable once the child has exited; without it (an old kernel), the wait is polled.
    int exited = static_cast<int>(syscall(SYS_pidfd_open, pid, 0));
    int status = 0;
    pid_t waited = 0;
    while (waited == 0) {
        pollfd fds[3];
        nfds_t count = 0;
        const int readAt = fromChild >= 0 ? static_cast<int>(count) : -1;
        if (fromChild >= 0) fds[count++] = pollfd{fromChild, POLLIN, 0};
        const int writeAt = toChild >= 0 ? static_cast<int>(count) : -1;
        if (toChild >= 0) fds[count++] = pollfd{toChild, POLLOUT, 0};
        if (exited >= 0) fds[count++] = pollfd{exited, POLLIN, 0};
        if (poll(fds, count, exited >= 0 ? -1 : 10) < 0 && errno != EINTR) {
            // Cannot watch the pipes: closing them lets a blocked child go on to its end.
            CloseIfOpen(toChild);
            CloseIfOpen(fromChild);
            do {
                waited = waitpid(pid, &status, 0);
            } while (waited < 0 && errno == EINTR);
            break;
        }
        if (writeAt >= 0 && (fds[writeAt].revents & (POLLOUT | POLLERR | POLLHUP))) {
            ssize_t n = write(toChild, input.data() + written, input.size() - written);
            if (n > 0) {
                written += static_cast<size_t>(n);
            }
            // The child may stop reading early (EPIPE); what it did not take is dropped.
            if ((n < 0 && errno != EINTR && errno != EAGAIN) || written == input.size()) {
                CloseIfOpen(toChild);
            }
        }
        if (readAt >= 0 && (fds[readAt].revents & (POLLIN | POLLERR | POLLHUP))) {
            ReadAvailable(fromChild, output, false);
        }
        do {
            waited = waitpid(pid, &status, WNOHANG);
        } while (waited < 0 && errno == EINTR);
    }
    if (fromChild >= 0) {
        ReadAvailable(fromChild, output, true);
    }
    CloseIfOpen(exited);
    CloseIfOpen(toChild);
    CloseIfOpen(fromChild);
    return waited == pid && WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

int RunShell(const std::string& command, std::string& output, const std::string& input) {
    output.clear();
    int toChild[2];
    int fromChild[2];
    if (!MakePipe(toChild)) {
        return -1;
    }
    if (!MakePipe(fromChild)) {
        close(toChild[0]);
        close(toChild[1]);
        return -1;
    }

    // A child that exits without reading all its input must not kill us with SIGPIPE: block
    // the signal around the exchange and drop it if it arrived. The child gets the old mask.
    sigset_t pipeSignal;
    sigset_t oldMask;
    sigemptyset(&pipeSignal);
    sigaddset(&pipeSignal, SIGPIPE);
    pthread_sigmask(SIG_BLOCK, &pipeSignal, &oldMask);

    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_adddup2(&actions, toChild[0], STDIN_FILENO);
    posix_spawn_file_actions_adddup2(&actions, fromChild[1], STDOUT_FILENO);
    posix_spawn_file_actions_adddup2(&actions, fromChild[1], STDERR_FILENO);
    posix_spawnattr_t attributes;
    posix_spawnattr_init(&attributes);
    posix_spawnattr_setsigmask(&attributes, &oldMask);
    posix_spawnattr_setflags(&attributes, POSIX_SPAWN_SETSIGMASK);

    const char* argv[] = {"sh", "-c", command.c_str(), nullptr};
    pid_t pid = -1;
    int spawned = posix_spawn(&pid, "/bin/sh", &actions, &attributes,
                              const_cast<char* const*>(argv), environ);
    posix_spawn_file_actions_destroy(&actions);
    posix_spawnattr_destroy(&attributes);
    close(toChild[0]);
    close(fromChild[1]);

    int result = -1;
    if (spawned == 0) {
        result = Exchange(pid, toChild[1], fromChild[0], input, output);
    } else {
        close(toChild[1]);
        close(fromChild[0]);
    }

    sigset_t pending;
    sigpending(&pending);
    if (sigismember(&pending, SIGPIPE) == 1) {
        const timespec noWait{0, 0};
        sigtimedwait(&pipeSignal, nullptr, &noWait);
    }
    pthread_sigmask(SIG_SETMASK, &oldMask, nullptr);
    return result;
}

}  // namespace

void SetShellCmdHook(ShellCmdHook hook) {
    InstalledHook() = std::move(hook);
}

int AutoCli_ShellCmd(const std::string& command, std::string& output, const std::string& input) {
    const ShellCmdHook& hook = InstalledHook();
    if (hook) {
        return hook(command, output, input);
    }
    return RunShell(command, output, input);
}

}  // namespace AutoCli
}  // namespace Kalmor
