// AutoCli_ShellCmd: runs a command line through /bin/sh, and its test seam.
#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

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

// Feeds `input` to the child's standard input while collecting its standard output, so that
// neither side blocks on a full pipe.
void Exchange(int toChild, int fromChild, const std::string& input, std::string& output) {
    size_t written = 0;
    if (input.empty()) {
        CloseIfOpen(toChild);
    } else {
        // Partial writes instead of blocking while the child waits for us to read.
        fcntl(toChild, F_SETFL, fcntl(toChild, F_GETFL) | O_NONBLOCK);
    }
    char buffer[4096];
    while (fromChild >= 0) {
        pollfd fds[2];
        nfds_t count = 0;
        fds[count++] = pollfd{fromChild, POLLIN, 0};
        if (toChild >= 0) {
            fds[count++] = pollfd{toChild, POLLOUT, 0};
        }
        if (poll(fds, count, -1) < 0) {
            if (errno == EINTR) {
                continue;
            }
            break;
        }
        if (toChild >= 0 && (fds[1].revents & (POLLOUT | POLLERR | POLLHUP))) {
            ssize_t n = write(toChild, input.data() + written, input.size() - written);
            if (n > 0) {
                written += static_cast<size_t>(n);
            }
            // The child may stop reading early (EPIPE); what it did not take is dropped.
            if ((n < 0 && errno != EINTR && errno != EAGAIN) || written == input.size()) {
                CloseIfOpen(toChild);
            }
        }
        if (fds[0].revents & (POLLIN | POLLERR | POLLHUP)) {
            ssize_t n = read(fromChild, buffer, sizeof buffer);
            if (n > 0) {
                output.append(buffer, static_cast<size_t>(n));
            } else if (n == 0 || (errno != EINTR && errno != EAGAIN)) {
                CloseIfOpen(fromChild);
            }
        }
    }
    CloseIfOpen(toChild);
    CloseIfOpen(fromChild);
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
        Exchange(toChild[1], fromChild[0], input, output);
        int status = 0;
        pid_t waited;
        do {
            waited = waitpid(pid, &status, 0);
        } while (waited < 0 && errno == EINTR);
        if (waited == pid && WIFEXITED(status)) {
            result = WEXITSTATUS(status);
        }
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
