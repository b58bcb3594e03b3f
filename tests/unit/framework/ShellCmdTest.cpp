#include <gtest/gtest.h>

#include "autocli/AutoCli.h"

namespace FrameworkTest {
namespace {

using Kalmor::AutoCli::AutoCli_ShellCmd;

TEST(ShellCmd, RunsThroughTheShellWithInputAndExitStatus) {
    struct Case {
        std::string command, input;
        int status;
        std::string output;
    };
    const std::string big(1 << 20, 'x');
    const std::vector<Case> cases = {
        {"echo hello; exit 3", "", 3, "hello\n"},
        {"cat", big, 0, big},                        // both pipes fill up: no deadlock
        {"exit 0", big, 0, ""},                      // input never read: no SIGPIPE death
        {"kill -TERM $$", "", -1, ""},               // killed by a signal
        {"echo out; echo err >&2", "", 0, "out\n"},  // only standard output is captured
    };
    for (const auto& entry : cases) {
        std::string output = "stale";
        EXPECT_EQ(AutoCli_ShellCmd(entry.command, output, entry.input), entry.status)
            << entry.command;
        EXPECT_EQ(output, entry.output) << entry.command;
    }
}

}  // namespace
}  // namespace FrameworkTest
