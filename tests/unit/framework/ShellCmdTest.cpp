#include <gtest/gtest.h>
#include <sys/resource.h>

#include <chrono>

#include "autocli/AutoCli.h"

namespace FrameworkTest {
namespace {

using Kalmor::AutoCli::AutoCli_ShellCmd;

// Every case returns within seconds, once the shell has exited.
TEST(ShellCmd, RunsThroughTheShellWithInputAndExitStatus) {
    struct Case {
        std::string command, input;
        int status;
        std::string output;
    };
    const std::string big(1 << 20, 'x');
    const std::vector<Case> cases = {
        {"echo hello; exit 3", "", 3, "hello\n"},
        {"cat", big, 0, big},                             // both pipes fill up: no deadlock
        {"exit 0", big, 0, ""},                           // input never read: no SIGPIPE death
        {"kill -TERM $$", "", -1, ""},                    // killed by a signal
        {"echo out; echo err >&2", "", 0, "out\nerr\n"},  // standard error is captured too
        {"echo a; sleep 30 & exit 0", "", 0, "a\n"},      // a background child holds the pipe
        {"head -c 100000000 /dev/zero | tr '\\0' x", "", 0, big},  // only the first 1 MiB kept
    };
    for (const auto& entry : cases) {
        std::string output = "stale";
        rusage before{}, after{};
        getrusage(RUSAGE_SELF, &before);
        const auto start = std::chrono::steady_clock::now();
        EXPECT_EQ(AutoCli_ShellCmd(entry.command, output, entry.input), entry.status)
            << entry.command;
        EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(10));
        EXPECT_TRUE(output == entry.output) << entry.command << ": " << output.substr(0, 80);
        getrusage(RUSAGE_SELF, &after);
        EXPECT_LT(after.ru_maxrss - before.ru_maxrss, 32 * 1024) << entry.command;  // KiB
    }
}

}  // namespace
}  // namespace FrameworkTest
