#include "MockHost.h"
#include "commands/cluster/ClusterUnicastAgentAdd.h"
#include "commands/cluster/ClusterUnicastAgentClear.h"
#include "commands/cluster/ClusterUnicastAgentList.h"
#include "commands/cluster/ClusterUnicastAgentRemove.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using HostCtl::Lib::Mesk::MeskCtlException;
using Kalmor::AutoCli::Command;
using namespace MeskTest;
using ::testing::_;
using ::testing::Return;
using ::testing::StartsWith;
using Texts = std::vector<std::string>;

const std::string kNone = "; no result, incomplete";

// A host in a cluster whose configured agents are `entries` and witnesses `witnesses`. Adding,
// removing and refreshing agents is recorded; an agent whose UUID starts with "w" is reported
// removed as a witness. While `failure` is set, the library's agent operations throw.
class UnicastAgentTest : public HostTest {
  protected:
    UnicastAgentTest() {
        SetEnabled(true);
        ON_CALL(info, AddUnicastAgent(_, _, _, _, _, _, _)).WillByDefault(Record("Add"));
        ON_CALL(info, RemoveUnicastAgent(_, _, _)).WillByDefault(Record("Remove", false));
        ON_CALL(info, RemoveUnicastAgent(StartsWith("w"), _, _))
            .WillByDefault(Record("Remove", true));
        ON_CALL(info, RefreshUnicastAgents()).WillByDefault(Record("Refresh"));
        ON_CALL(info, GetUnicastAgents(_)).WillByDefault([this](Texts& out) {
            if (!failure.empty()) throw MeskCtlException(failure);
            out = entries;
        });
        ON_CALL(info, GetUnicastWitnesses(_)).WillByDefault([this](Texts& out) {
            out = witnesses;
        });
    }

    Texts entries, witnesses;
};

// Neither add nor remove asks whether the host is in a cluster. Only a node is refreshed;
// a configured witness does not stop a node from being added. The port keeps its low 32 bits.
TEST_F(UnicastAgentTest, AddAndRemoveFillDefaultsAndRefreshOnlyForANode) {
    const std::string none = "00000000-0000-0000-0000-000000000000";
    const struct {
        std::shared_ptr<Command> command;
        std::string options;
        Texts witnesses;
        std::string calls;
    } cases[] = {
        {ClusterUnicastAgentAdd::New(),
         "addr=10.1.2.3",
         {},
         "Add(" + none + ", true, false, v4:10.1.2.3, 12321, false, )"},
        {ClusterUnicastAgentAdd::New(),
         "type=node uuid=n1 supports-unicast=true addr=fe80::1 port=4294967301 "
         "bound-interface-name=zuvnic1",
         {"W1"},
         "Add(n1, false, true, v6:fe80::1, 5, true, zuvnic1) Refresh()"},
        {ClusterUnicastAgentRemove::New(),
         "addr=10.0.0.5",
         {},
         "Remove(" + none + ", v4:10.0.0.5, 12321) Refresh()"},
        {ClusterUnicastAgentRemove::New(),
         "uuid=w1 addr=fe80::1 port=9000",
         {},
         "Remove(w1, v6:fe80::1, 9000)"},
    };
    SetEnabled(false);
    for (const auto& c : cases) {
        calls.clear();
        witnesses = c.witnesses;
        EXPECT_EQ(Outcome(*Run(*c.command, c.options)), "true, complete");
        EXPECT_EQ(calls, c.calls);
    }
}

// One unicast witness at most: any configured witness refuses a new one.
TEST_F(UnicastAgentTest, AddRefusalsSendNothing) {
    const std::string already =
        "Mesk does not support connecting to more than one unicast witness, and there ";
    const struct {
        std::string options;
        Texts witnesses;
        std::string message;
    } cases[] = {
        {"type=node addr=10.0.0.1", {}, "Can not add unicastagent without specifying node-uuid"},
        {"type=node uuid=n1 addr=10.0.0.1",
         {},
         "Can not add unicastagent without specifying unicast support"},
        {"addr=example", {}, "Invalid IP address example"},
        {"addr=10.0.0.1", {"W1"}, already + "is already a unicast witness configured: W1."},
        {"addr=10.0.0.1",
         {"W1", "W2"},
         already + "are already multiple unicast witnesses configured: W1,W2."},
    };
    for (const auto& c : cases) {
        witnesses = c.witnesses;
        EXPECT_EQ(Outcome(*Run(*ClusterUnicastAgentAdd::New(), c.options)), c.message + kNone);
    }
    EXPECT_EQ(calls, "");
}

// Numbers read as atoi reads them; the address is not checked; the interface name keeps ";".
TEST_F(UnicastAgentTest, ListConvertsEachFieldOfWellFormedEntries) {
    entries = {"u1;0;1;10.0.0.5;12321;", "u3;yes;2;not-an-ip;80x;a;b;"};
    EXPECT_EQ(Outcome(*Run(*ClusterUnicastAgentList::New())),
              "[{NodeUuid=u1, IsWitness=0, Supports Unicast=true, IP Address=10.0.0.5, "
              "Port=12321, Iface Name=}, {NodeUuid=u3, IsWitness=0, Supports Unicast=true, "
              "IP Address=not-an-ip, Port=80, Iface Name=a;b;}], complete");
}

// Clear removes every agent, then refreshes once if it removed a node; its output is never
// marked complete, not even on success.
TEST_F(UnicastAgentTest, ClearRemovesEveryAgentAndRefreshesOnceForNodes) {
    const struct {
        Texts entries;
        std::string calls;
    } cases[] = {
        {{"n1;0;1;10.0.0.1;12321;", "w1;1;0;10.0.0.9;12321;", "n2;0;0;fe80::2;777x;a;b"},
         "Remove(n1, v4:10.0.0.1, 12321) Remove(w1, v4:10.0.0.9, 12321) "
         "Remove(n2, v6:fe80::2, 777) Refresh()"},
        {{"w1;1;1;10.0.0.9;;"}, "Remove(w1, v4:10.0.0.9, 0)"},
    };
    for (const auto& c : cases) {
        calls.clear();
        entries = c.entries;
        EXPECT_EQ(Outcome(*Run(*ClusterUnicastAgentClear::New())), "true, incomplete");
        EXPECT_EQ(calls, c.calls);
    }
}

// One malformed entry refuses the whole list, even after good ones; clear stops there, with
// the agents before it removed and not refreshed.
TEST_F(UnicastAgentTest, AMalformedEntryStopsListAndClear) {
    const struct {
        std::string entry, list, clear;  // list empty: list shows the entry
    } cases[] = {
        {"n3", "Invalid unicastAgent entry for nodeuuid n3",
         "Invalid unicastAgent entry for nodeuuid n3"},
        {"n3;0", "Invalid unicastAgent entry for isWitness n3;0", "Invalid unicastAgent entries"},
        {"n3;0;1", "Invalid unicastAgent entry for ucast support n3;0;1",
         "Invalid unicastAgent entries"},
        {"n3;1;0;10.0.0.5", "Invalid unicastAgent entry for ip n3;1;0;10.0.0.5",
         "Invalid unicastAgent entries"},
        {"n3;0;1;10.0.0.5;12321", "Invalid unicastAgent entry for port n3;0;1;10.0.0.5;12321",
         "Invalid unicastAgent entry for port n3;0;1;10.0.0.5;12321"},
        {"n3;0;1;10.0.0.300;12321;", "", "Invalid IP address 10.0.0.300"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.entry);
        entries = {"n1;0;1;10.0.0.1;12321;", c.entry};
        if (!c.list.empty()) {
            EXPECT_EQ(Outcome(*Run(*ClusterUnicastAgentList::New())), c.list + kNone);
        }
        calls.clear();
        EXPECT_EQ(Outcome(*Run(*ClusterUnicastAgentClear::New())), c.clear + kNone);
        EXPECT_EQ(calls, "Remove(n1, v4:10.0.0.1, 12321)");
    }
}

// A refusal for the host's role or state changes nothing; add and remove ask whether the host
// is a witness before the plug-in is obtained. A library failure is reported bare by add and
// named by the others. List answers with the table so far (here empty), complete, except when
// the host is not in a cluster.
TEST_F(UnicastAgentTest, RefusalsAndLibraryFailures) {
    enum State { kWitnessNode, kNotEnabled, kFailing };
    const std::string witness = "this host is a witness node which doesn't support ";
    const std::shared_ptr<Command> add = ClusterUnicastAgentAdd::New(),
                                   remove = ClusterUnicastAgentRemove::New(),
                                   list = ClusterUnicastAgentList::New(),
                                   clear = ClusterUnicastAgentClear::New();
    const struct {
        Command* command;
        State state;
        std::string outcome;
        int plugins;
    } cases[] = {
        {add.get(), kWitnessNode,
         "This host is a witness node which doesn't support adding unicast agent." + kNone, 0},
        {remove.get(), kWitnessNode,
         "This host is a witness node which doesn't support removing unicast agent." + kNone, 0},
        {list.get(), kWitnessNode,
         "Unable to list unicast agent, " + witness + "listing unicast agent.; [], complete", 1},
        {clear.get(), kWitnessNode,
         "Unable to remove unicast agent(s), " + witness + "removing unicast agent." + kNone, 1},
        {list.get(), kNotEnabled, "Mesk isn't enabled on the host" + kNone, 1},
        {clear.get(), kNotEnabled, "Mesk isn't enabled on the host" + kNone, 1},
        {add.get(), kFailing, "lib says no" + kNone, 1},
        {remove.get(), kFailing, "Unable to remove the unicast agent: lib says no" + kNone, 1},
        {list.get(), kFailing, "Unable to list unicast agent: lib says no; [], complete", 1},
        {clear.get(), kFailing, "Unable to remove unicast agents: lib says no" + kNone, 1},
    };
    entries = {"n1;0;1;10.0.0.1;12321;"};
    for (const auto& c : cases) {
        SCOPED_TRACE(c.outcome);
        calls.clear(), host.pluginsMade = 0;
        ON_CALL(host, IsWitnessNode()).WillByDefault(Return(c.state == kWitnessNode));
        SetEnabled(c.state != kNotEnabled);
        failure = c.state == kFailing ? "lib says no" : "";
        EXPECT_EQ(
            Outcome(*Run(*c.command, "addr=10.0.0.1 type=node uuid=n1 supports-unicast=true")),
            c.outcome);
        EXPECT_EQ(calls.find("Refresh"), std::string::npos);
        EXPECT_TRUE(c.state == kFailing || calls.empty()) << calls;
        EXPECT_EQ(host.pluginsMade, c.plugins);
    }
    // Failures of the role and state questions are not the commands' to report.
    EXPECT_CALL(host, IsWitnessNode()).WillOnce(Fail("no answer"));
    EXPECT_THROW(Run(*add, "addr=10.0.0.1"), MeskCtlException);
    EXPECT_CALL(info, GetClusterConfig()).WillOnce(Fail("no config"));
    EXPECT_THROW(Run(*list), MeskCtlException);
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
