#include <cstdlib>
#include <string>
#include <vector>

#include "MockHost.h"
#include "commands/cluster/ClusterLeave.h"
#include "commands/cluster/ClusterRestore.h"
#include "platform/autocli/ShellCmdHook.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using namespace MeskTest;
using ::testing::_;
using ::testing::ElementsAre;
using ::testing::IsEmpty;

const std::string kScript = "/usr/lib/orvane/tavord/bin/notifyDatastore.py";
const std::string kPreUnmount = kScript + " -t PreUnmount -d meskDatastore";
const std::string kFailedUnmount = kScript + " -t FailedUnmount -d meskDatastore";

// Records each shell command line instead of running it; the script always fails.
class ClusterLeaveRestoreTest : public HostTest {
  protected:
    ClusterLeaveRestoreTest() {
        unsetenv("MESK_HOST_ROOT");
        Kalmor::AutoCli::SetShellCmdHook(
            [this](const std::string& command, std::string& output, const std::string& input) {
                commands.push_back(command + (input.empty() ? "" : " <" + input));
                output = "Traceback";
                return 1;
            });
    }
    ~ClusterLeaveRestoreTest() override { Kalmor::AutoCli::SetShellCmdHook(nullptr); }
    void Settle() {
        ::testing::Mock::VerifyAndClearExpectations(&host);
        ::testing::Mock::VerifyAndClearExpectations(&info);
        commands.clear();
    }

    std::vector<std::string> commands;
};

TEST_F(ClusterLeaveRestoreTest, NotifyDatastoreRunsTheScriptBelowTheHostRoot) {
    setenv("MESK_HOST_ROOT", "/sim/", 1);
    NotifyDatastore("PreUnmount", "a b");
    unsetenv("MESK_HOST_ROOT");
    EXPECT_THAT(commands, ElementsAre("/sim" + kScript + " -t PreUnmount -d a b"));
}

TEST_F(ClusterLeaveRestoreTest, LeaveNotifiesAroundTheLeaveAndIgnoresTheScriptsFailure) {
    struct Case {
        bool enabled;
        const char* failing;  // the operation that throws "boom", or nullptr
        std::string message;  // empty: success
        std::vector<std::string> notifications;
    };
    const Case cases[] = {
        {true, nullptr, "", {kPreUnmount}},
        {false, nullptr, "The host is not in a Mesk cluster.", {}},
        {true, "GetClusterConfig", "boom", {}},
        {true, "LeaveCluster", "boom", {kPreUnmount, kFailedUnmount}},
    };
    for (const auto& c : cases) {
        SetEnabled(c.enabled);
        const std::string failing = c.failing ? c.failing : "";
        if (failing == "GetClusterConfig") {
            EXPECT_CALL(info, GetClusterConfig()).WillOnce(Fail("boom"));
        }
        // The unmount is announced before the host leaves.
        ON_CALL(info, LeaveCluster(false)).WillByDefault(::testing::Invoke([this, failing](bool) {
            EXPECT_THAT(commands, ElementsAre(kPreUnmount));
            if (failing == "LeaveCluster") throw HostCtl::Lib::Mesk::MeskCtlException("boom");
        }));
        EXPECT_CALL(info, LeaveCluster(false)).Times(c.notifications.empty() ? 0 : 1);
        auto output = Run(*ClusterLeave::New());
        EXPECT_EQ(commands, c.notifications);
        if (c.message.empty()) {
            EXPECT_THAT(Errors(*output), IsEmpty());
            EXPECT_TRUE(BoolResult(*output) && output->IsComplete());
        } else {
            EXPECT_THAT(Errors(*output), ElementsAre(c.message));
            EXPECT_TRUE(output->GetRootObject() == nullptr && !output->IsComplete());
        }
        Settle();
    }
}

TEST_F(ClusterLeaveRestoreTest, RestorePassesTheBootFlagAndIsFalseAfterAFailure) {
    EXPECT_CALL(info, GetClusterConfig()).Times(0);
    for (bool boot : {false, true}) {
        auto input = Kalmor::CallSpec::Input::New();
        if (boot) input->SetFlag("boot");
        EXPECT_CALL(info, RestoreClusterConfig(boot));
        auto output = Run(*ClusterRestore::New(), input);
        EXPECT_TRUE(Errors(*output).empty() && BoolResult(*output) && output->IsComplete());
    }
    EXPECT_CALL(info, RestoreClusterConfig(_)).WillOnce(Fail("no config"));
    auto output = Run(*ClusterRestore::New());
    EXPECT_THAT(Errors(*output), ElementsAre("no config"));
    EXPECT_FALSE(BoolResult(*output));
    EXPECT_TRUE(output->IsComplete());
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
