#include <string>
#include <utility>
#include <vector>

#include "MockHost.h"
#include "commands/cluster/ClusterUnicastAgentClear.h"
#include "commands/cluster/ClusterUnicastAgentRemove.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using HostCtl::Lib::Mesk::MeskCtlException;
using Kalmor::CallSpec::Input;
using MeskTest::BoolResult;
using MeskTest::Errors;
using MeskTest::Fail;
using MeskTest::MeskIpAddress;
using ::testing::_;
using ::testing::ElementsAre;
using ::testing::ElementsAreArray;
using ::testing::Invoke;
using ::testing::IsEmpty;
using ::testing::Return;
using ::testing::SetArgReferee;
using Entries = std::vector<std::string>;

class UnicastAgentRemoveClearTest : public MeskTest::HostTest {
  protected:
    // Records each removal as "uuid v4:addr port"; an agent whose UUID starts with "w" is
    // reported removed as a witness.
    UnicastAgentRemoveClearTest() {
        ON_CALL(info, RemoveUnicastAgent(_, _, _))
            .WillByDefault(Invoke([this](const std::string& u, const MeskIpAddress& a, int32_t p) {
                removals.push_back(u + (a.IsIpv6() ? " v6:" : " v4:") + a.GetStringAddress() + " " +
                                   std::to_string(p));
                return u.rfind('w', 0) == 0;
            }));
    }
    std::vector<std::string> removals;
};

TEST_F(UnicastAgentRemoveClearTest, RemoveFillsDefaultsAndRefreshesOnlyAfterANode) {
    const struct {
        std::vector<std::pair<std::string, std::string>> args;
        std::string removal;
        int refreshes;
    } cases[] = {
        // The host is not in a cluster here: remove does not ask.
        {{{"addr", "10.0.0.5"}}, "00000000-0000-0000-0000-000000000000 v4:10.0.0.5 12321", 1},
        {{{"uuid", "w1"}, {"addr", "fe80::1"}, {"port", "9000"}}, "w1 v6:fe80::1 9000", 0},
    };
    for (const auto& c : cases) {
        removals.clear();
        EXPECT_CALL(info, RefreshUnicastAgents()).Times(c.refreshes);
        auto input = Input::New();
        for (const auto& [name, value] : c.args) input->SetParameter(name, value);
        auto output = Run(*ClusterUnicastAgentRemove::New(), input);
        EXPECT_THAT(removals, ElementsAre(c.removal));
        EXPECT_THAT(Errors(*output), IsEmpty());
        EXPECT_TRUE(BoolResult(*output) && output->IsComplete());
        ::testing::Mock::VerifyAndClearExpectations(&info);
    }
}

TEST_F(UnicastAgentRemoveClearTest, RemoveRefusalsAndFailuresLeaveNoResult) {
    auto input = Input::New();
    input->SetParameter("addr", "bogus");
    auto output = Run(*ClusterUnicastAgentRemove::New(), input);
    EXPECT_THAT(Errors(*output), ElementsAre("Invalid IP address bogus"));
    EXPECT_TRUE(output->GetRootObject() == nullptr && !output->IsComplete());

    input->SetParameter("addr", "10.0.0.5");
    EXPECT_CALL(info, RemoveUnicastAgent(_, _, _)).WillOnce(Fail("no such agent"));
    EXPECT_CALL(info, RefreshUnicastAgents()).Times(0);
    output = Run(*ClusterUnicastAgentRemove::New(), input);
    EXPECT_THAT(Errors(*output), ElementsAre("Unable to remove the unicast agent: no such agent"));
    EXPECT_TRUE(output->GetRootObject() == nullptr && !output->IsComplete());

    EXPECT_CALL(host, IsWitnessNode()).WillOnce(Return(true));
    const int pluginsBefore = host.pluginsMade;
    output = Run(*ClusterUnicastAgentRemove::New(), input);
    EXPECT_THAT(Errors(*output), ElementsAre("This host is a witness node which doesn't support "
                                             "removing unicast agent."));
    EXPECT_EQ(host.pluginsMade, pluginsBefore);
    EXPECT_THAT(removals, IsEmpty());
}

TEST_F(UnicastAgentRemoveClearTest, ClearRemovesEveryAgentAndRefreshesOnceForNodes) {
    SetEnabled(true);
    const struct {
        Entries entries, removals;
        int refreshes;
    } cases[] = {
        {{"n1;0;1;10.0.0.1;12321;", "w1;1;1;10.0.0.9;12321;", "n2;0;0;fe80::2;777x;a;b"},
         {"n1 v4:10.0.0.1 12321", "w1 v4:10.0.0.9 12321", "n2 v6:fe80::2 777"},
         1},
        {{"w1;1;1;10.0.0.9;;"}, {"w1 v4:10.0.0.9 0"}, 0},
        {{}, {}, 0},
    };
    for (const auto& c : cases) {
        removals.clear();
        EXPECT_CALL(info, GetUnicastAgents(_)).WillOnce(SetArgReferee<0>(c.entries));
        EXPECT_CALL(info, RefreshUnicastAgents()).Times(c.refreshes);
        auto output = Run(*ClusterUnicastAgentClear::New());
        EXPECT_THAT(removals, ElementsAreArray(c.removals));
        EXPECT_THAT(Errors(*output), IsEmpty());
        // True, but never marked complete, not even on success.
        EXPECT_TRUE(BoolResult(*output) && !output->IsComplete());
        ::testing::Mock::VerifyAndClearExpectations(&info);
    }
}

TEST_F(UnicastAgentRemoveClearTest, ClearStopsAtABadEntryWithoutRefreshingEarlierRemovals) {
    SetEnabled(true);
    const struct {
        std::string entry, message;
    } cases[] = {
        {"n3", "Invalid unicastAgent entry for nodeuuid n3"},
        {"n3;0;1", "Invalid unicastAgent entries"},
        {"n3;1;0;10.0.0.5", "Invalid unicastAgent entries"},
        {"n3;0;1;10.0.0.5;12321", "Invalid unicastAgent entry for port n3;0;1;10.0.0.5;12321"},
        {"n3;0;1;10.0.0.300;12321;", "Invalid IP address 10.0.0.300"},
    };
    for (const auto& c : cases) {
        removals.clear();
        EXPECT_CALL(info, GetUnicastAgents(_))
            .WillOnce(SetArgReferee<0>(
                Entries{"n1;0;1;10.0.0.1;12321;", "n2;0;1;10.0.0.2;12321;", c.entry}));
        EXPECT_CALL(info, RefreshUnicastAgents()).Times(0);
        auto output = Run(*ClusterUnicastAgentClear::New());
        EXPECT_THAT(removals, ElementsAre("n1 v4:10.0.0.1 12321", "n2 v4:10.0.0.2 12321"));
        EXPECT_THAT(Errors(*output), ElementsAre(c.message));
        EXPECT_TRUE(output->GetRootObject() == nullptr && !output->IsComplete()) << c.entry;
        ::testing::Mock::VerifyAndClearExpectations(&info);
    }
}

TEST_F(UnicastAgentRemoveClearTest, ClearRefusalsAndFailures) {
    EXPECT_CALL(info, GetUnicastAgents(_)).Times(0);
    auto output = Run(*ClusterUnicastAgentClear::New());
    EXPECT_THAT(Errors(*output), ElementsAre("Mesk isn't enabled on the host"));
    EXPECT_EQ(output->GetRootObject(), nullptr);

    SetEnabled(true);
    EXPECT_CALL(host, IsWitnessNode()).WillOnce(Return(true));
    output = Run(*ClusterUnicastAgentClear::New());
    EXPECT_THAT(Errors(*output), ElementsAre("Unable to remove unicast agent(s), this host is a "
                                             "witness node which doesn't support removing "
                                             "unicast agent."));
    EXPECT_EQ(output->GetRootObject(), nullptr);
    ::testing::Mock::VerifyAndClearExpectations(&info);
    ::testing::Mock::VerifyAndClearExpectations(&host);

    EXPECT_CALL(info, GetUnicastAgents(_))
        .WillOnce(SetArgReferee<0>(Entries{"n1;0;1;10.0.0.1;12321;"}));
    EXPECT_CALL(info, RemoveUnicastAgent(_, _, _)).WillOnce(Fail("busy"));
    EXPECT_CALL(info, RefreshUnicastAgents()).Times(0);
    output = Run(*ClusterUnicastAgentClear::New());
    EXPECT_THAT(Errors(*output), ElementsAre("Unable to remove unicast agents: busy"));
    EXPECT_TRUE(output->GetRootObject() == nullptr && !output->IsComplete());

    // Reading the cluster state is outside the command's failure handling.
    EXPECT_CALL(info, GetClusterConfig()).WillOnce(Fail("no config"));
    EXPECT_THROW(Run(*ClusterUnicastAgentClear::New()), MeskCtlException);
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
