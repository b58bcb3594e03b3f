#include <string>
#include <utility>
#include <vector>

#include "MockHost.h"
#include "commands/cluster/ClusterUnicastAgentAdd.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using Kalmor::CallSpec::Input;
using MeskTest::BoolResult;
using MeskTest::Errors;
using MeskTest::Fail;
using MeskTest::MeskIpAddress;
using ::testing::_;
using ::testing::ElementsAre;
using ::testing::Invoke;
using ::testing::IsEmpty;
using ::testing::Return;
using ::testing::SetArgReferee;
using Args = std::vector<std::pair<std::string, std::string>>;

std::shared_ptr<Input> InputOf(const Args& args) {
    auto input = Input::New();
    for (const auto& [name, value] : args) input->SetParameter(name, value);
    return input;
}

class UnicastAgentAddTest : public MeskTest::HostTest {
  protected:
    // Records each AddUnicastAgent call as one line of text.
    void RecordAdds() {
        ON_CALL(info, AddUnicastAgent(_, _, _, _, _, _, _))
            .WillByDefault(Invoke([this](const std::string& uuid, bool witness, bool unicast,
                                         const MeskIpAddress& a, int32_t port, bool hasIface,
                                         const std::string& iface) {
                added.push_back(uuid + (witness ? " witness" : " node") +
                                (unicast ? " unicast " : " - ") + (a.IsIpv6() ? "v6:" : "v4:") +
                                a.GetStringAddress() + " " + std::to_string(port) +
                                (hasIface ? " " + iface : " -"));
            }));
    }
    std::vector<std::string> added;
};

TEST_F(UnicastAgentAddTest, FillsDefaultsAndRefreshesOnlyAfterANode) {
    RecordAdds();
    const struct {
        Args args;
        std::vector<std::string> witnesses;
        std::string added;
        int refreshes;
    } cases[] = {
        {{{"addr", "10.1.2.3"}},
         {},
         "00000000-0000-0000-0000-000000000000 witness - v4:10.1.2.3 12321 -",
         0},
        {{{"type", "witness"}, {"uuid", "w9"}, {"addr", "10.0.0.9"}},
         {},
         "w9 witness - v4:10.0.0.9 12321 -",
         0},
        // A node is added even while a witness is configured; the port keeps its low 32 bits.
        {{{"type", "node"},
          {"uuid", "n1"},
          {"supports-unicast", "false"},
          {"addr", "fe80::1"},
          {"port", "4294967301"},
          {"bound-interface-name", "zuvnic1"}},
         {"W1"},
         "n1 node - v6:fe80::1 5 zuvnic1",
         1},
        {{{"type", "node"}, {"uuid", "n2"}, {"supports-unicast", "true"}, {"addr", "10.0.0.2"}},
         {"W1"},
         "n2 node unicast v4:10.0.0.2 12321 -",
         1},
    };
    for (const auto& c : cases) {
        added.clear();
        ON_CALL(info, GetUnicastWitnesses(_)).WillByDefault(SetArgReferee<0>(c.witnesses));
        EXPECT_CALL(info, RefreshUnicastAgents()).Times(c.refreshes);
        auto output = Run(*ClusterUnicastAgentAdd::New(), InputOf(c.args));
        EXPECT_THAT(added, ElementsAre(c.added));
        EXPECT_THAT(Errors(*output), IsEmpty());
        EXPECT_TRUE(BoolResult(*output) && output->IsComplete());
        ::testing::Mock::VerifyAndClearExpectations(&info);
    }
}

TEST_F(UnicastAgentAddTest, RefusalsAndLibraryFailuresLeaveNoResult) {
    const std::string one =
        "Mesk does not support connecting to more than one unicast witness, and there is already "
        "a unicast witness configured: ";
    const std::string many =
        "Mesk does not support connecting to more than one unicast witness, and there are "
        "already multiple unicast witnesses configured: ";
    const Args node{{"type", "node"}, {"uuid", "n1"}, {"supports-unicast", "1"}, {"addr", "::1"}};
    const struct {
        Args args;
        std::vector<std::string> witnesses;
        bool addFails, refreshFails;
        std::string message;
    } cases[] = {
        {{{"type", "node"}, {"addr", "10.0.0.1"}},
         {},
         false,
         false,
         "Can not add unicastagent without specifying node-uuid"},
        {{{"type", "node"}, {"uuid", "n1"}, {"addr", "10.0.0.1"}},
         {},
         false,
         false,
         "Can not add unicastagent without specifying unicast support"},
        {{{"addr", "example"}}, {}, false, false, "Invalid IP address example"},
        {{{"addr", "10.0.0.300"}}, {}, false, false, "Invalid IP address 10.0.0.300"},
        {{{"addr", "10.0.0.1"}}, {"W1"}, false, false, one + "W1."},
        {{{"addr", "10.0.0.1"}}, {"W1", "W2"}, false, false, many + "W1,W2."},
        // Library failures are reported bare.
        {{{"addr", "10.0.0.1"}}, {}, true, false, "lib says no"},
        {node, {}, false, true, "lib says no"},
    };
    for (const auto& c : cases) {
        ON_CALL(info, GetUnicastWitnesses(_)).WillByDefault(SetArgReferee<0>(c.witnesses));
        auto& add = EXPECT_CALL(info, AddUnicastAgent(_, _, _, _, _, _, _));
        if (c.addFails) add.WillOnce(Fail("lib says no"));
        if (!c.addFails && !c.refreshFails) add.Times(0);
        auto& refresh = EXPECT_CALL(info, RefreshUnicastAgents());
        if (c.refreshFails) refresh.WillOnce(Fail("lib says no"));
        if (!c.refreshFails) refresh.Times(0);

        auto output = Run(*ClusterUnicastAgentAdd::New(), InputOf(c.args));
        EXPECT_THAT(Errors(*output), ElementsAre(c.message));
        EXPECT_TRUE(output->GetRootObject() == nullptr && !output->IsComplete()) << c.message;
        ::testing::Mock::VerifyAndClearExpectations(&info);
    }
}

TEST_F(UnicastAgentAddTest, WitnessNodeRefusesBeforeTheLibraryIsTouched) {
    EXPECT_CALL(host, IsWitnessNode()).WillRepeatedly(Return(true));
    for (const Args& args : {Args{{"addr", "10.0.0.1"}}, Args{{"type", "node"}, {"addr", "x"}}}) {
        auto output = Run(*ClusterUnicastAgentAdd::New(), InputOf(args));
        EXPECT_THAT(Errors(*output), ElementsAre("This host is a witness node which doesn't "
                                                 "support adding unicast agent."));
        EXPECT_TRUE(output->GetRootObject() == nullptr && !output->IsComplete());
    }
    EXPECT_EQ(host.pluginsMade, 0);

    // A failure of the question itself is not the command's to report.
    EXPECT_CALL(host, IsWitnessNode()).WillOnce(Fail("no answer"));
    EXPECT_THROW(Run(*ClusterUnicastAgentAdd::New(), InputOf({{"addr", "10.0.0.1"}})),
                 HostCtl::Lib::Mesk::MeskCtlException);
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
