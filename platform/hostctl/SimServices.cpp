// The simulated host's programs: MeskExec runs them below the host root.
#include <fcntl.h>
#include <spawn.h>
#include <sys/wait.h>

#include <cerrno>
#include <stdexcept>

#include "SimInfo.h"

extern char** environ;

namespace HostCtlSim {

int32_t SimHost::MeskExec(const std::string& command, const std::string& argument, bool flag1,
                          bool flag2, bool flag3) {
    return Serve(*this, Operation::MeskExec, {command, argument, flag1, flag2, flag3}, [&] {
        std::string path = command;
        if (!options_.execRoot.empty()) {
            HostRoot root(options_.execRoot);
            std::string hostPath = command.empty() || command[0] != '/' ? "/" + command : command;
            // A program that another user could have replaced is not run.
            try {
                root.CheckTrusted(hostPath);
            } catch (const std::runtime_error&) {
                return int32_t{-1};
            }
            path = root.PathOf(hostPath);
        }
        // The program's output would mix with the command's own; it goes nowhere.
        posix_spawn_file_actions_t actions;
        posix_spawn_file_actions_init(&actions);
        posix_spawn_file_actions_addopen(&actions, 0, "/dev/null", O_RDONLY, 0);
        posix_spawn_file_actions_addopen(&actions, 1, "/dev/null", O_WRONLY, 0);
        posix_spawn_file_actions_addopen(&actions, 2, "/dev/null", O_WRONLY, 0);
        char* argv[] = {const_cast<char*>(path.c_str()), const_cast<char*>(argument.c_str()),
                        nullptr};
        pid_t child = 0;
        int error = posix_spawn(&child, path.c_str(), &actions, nullptr, argv, environ);
        posix_spawn_file_actions_destroy(&actions);
        if (error != 0) return int32_t{-1};
        int status = 0;
        while (waitpid(child, &status, 0) < 0) {
            if (errno != EINTR) return int32_t{-1};
        }
        if (WIFEXITED(status)) return int32_t(WEXITSTATUS(status));
        return WIFSIGNALED(status) ? int32_t(-WTERMSIG(status)) : int32_t{-1};
    });
}

}  // namespace HostCtlSim
