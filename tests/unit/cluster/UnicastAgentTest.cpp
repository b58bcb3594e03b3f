#include <memory>
#include <sstream>
#include <string>
#include <vector>

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
using Kalmor::CallSpec::Input;
using Kalmor::CallSpec::Output;
using namespace MeskTest;
using ::testing::_;
using ::testing::ElementsAre;
using ::testing::ElementsAreArray;
using ::testing::IsEmpty;
using ::testing::Return;
using Texts = std::vector<std::string>;

// A listed agent as "NodeUuid|IsWitness|Supports Unicast|IP Address|Port|Iface Name".
std::string Row(const std::shared_ptr<Kalmor::MetaObj::MetaObject>& row) {
    return TextField(row, "NodeUuid") + "|" + std::to_string(IntField(row, "IsWitness")) + "|" +
           (BoolField(row, "Supports Unicast") ? "true" : "false") + "|" +
           TextField(row, "IP Address") + "|" + std::to_string(IntField(row, "Port")) + "|" +
           TextField(row, "Iface Name");
}

// A host in a cluster whose configured agents are `entries` and witnesses `witnesses`. Each
// added or removed agent is recorded as a line of `calls`; an agent whose UUID starts with
// "w" is reported removed as a witness. While `failing` is set, the library's agent
// operations throw.
class UnicastAgentTest : public HostTest {
  protected:
    UnicastAgentTest() {
        SetEnabled(true);
        ON_CALL(info, AddUnicastAgent(_, _, _, _, _, _, _))
            .WillByDefault([this](const std::string& uuid, bool witness, bool unicast,
                                  const MeskIpAddress& a, int32_t port, bool hasIface,
                                  const std::string& iface) {
                Record(uuid + (witness ? " witness" : " node") + (unicast ? " unicast " : " - ") +
                       Text(a) + " " + std::to_string(port) + (hasIface ? " " + iface : " -"));
            });
        ON_CALL(info, RemoveUnicastAgent(_, _, _))
            .WillByDefault([this](const std::string& uuid, const MeskIpAddress& a, int32_t port) {
                Record(uuid + " " + Text(a) + " " + std::to_string(port));
                return uuid.rfind('w', 0) == 0;
            });
        ON_CALL(info, GetUnicastAgents(_)).WillByDefault([this](Texts& out) {
            if (failing) throw MeskCtlException("lib says no");
            out = entries;
        });
        ON_CALL(info, GetUnicastWitnesses(_)).WillByDefault([this](Texts& out) {
            out = witnesses;
        });
        ON_CALL(info, RefreshUnicastAgents()).WillByDefault([this] { ++refreshes; });
    }
    static std::string Text(const MeskIpAddress& a) {
        return (a.IsIpv6() ? "v6:" : "v4:") + a.GetStringAddress();
    }
    void Record(const std::string& call) {
        calls.push_back(call);
        if (failing) throw MeskCtlException("lib says no");
    }
    void Reset() {
        calls.clear();
        refreshes = 0;
        host.pluginsMade = 0;
    }

    Texts entries, witnesses, calls;
    int refreshes = 0;
    bool failing = false;
};

// Neither add nor remove asks whether the host is in a cluster.
TEST_F(UnicastAgentTest, AddAndRemoveFillDefaultsAndRefreshOnlyForANode) {
    const std::shared_ptr<Command> add = ClusterUnicastAgentAdd::New(),
                                   remove = ClusterUnicastAgentRemove::New();
    const std::string none = "00000000-0000-0000-0000-000000000000";
    const struct {
        Command* command;
        std::string options, call;
        int refreshes;
    } cases[] = {
        {add.get(), "addr=10.1.2.3", none + " witness - v4:10.1.2.3 12321 -", 0},
        {add.get(), "type=witness uuid=w9 addr=10.0.0.9", "w9 witness - v4:10.0.0.9 12321 -", 0},
        // The port keeps its low 32 bits.
        {add.get(),
         "type=node uuid=n1 supports-unicast=true addr=fe80::1 port=4294967301 "
         "bound-interface-name=zuvnic1",
         "n1 node unicast v6:fe80::1 5 zuvnic1", 1},
        {remove.get(), "addr=10.0.0.5", none + " v4:10.0.0.5 12321", 1},
        {remove.get(), "uuid=w1 addr=fe80::1 port=9000", "w1 v6:fe80::1 9000", 0},
    };
    SetEnabled(false);
    for (const auto& c : cases) {
        Reset();
        // A witness is configured where a node is added or removed: that stops neither.
        witnesses = c.refreshes ? Texts{"W1"} : Texts{};
        auto output = Run(*c.command, InputOf(c.options));
        EXPECT_THAT(calls, ElementsAre(c.call));
        EXPECT_EQ(refreshes, c.refreshes);
        EXPECT_TRUE(Errors(*output).empty() && BoolResult(*output) && output->IsComplete());
    }
}

// One unicast witness at most: any configured witness refuses a new one.
TEST_F(UnicastAgentTest, AddRefusalsSendNothing) {
    const struct {
        std::string options, message;
    } cases[] = {
        {"type=node addr=10.0.0.1", "Can not add unicastagent without specifying node-uuid"},
        {"type=node uuid=n1 addr=10.0.0.1",
         "Can not add unicastagent without specifying unicast support"},
        {"addr=example", "Invalid IP address example"},
    };
    for (const auto& c : cases) {
        ExpectRefused(*Run(*ClusterUnicastAgentAdd::New(), InputOf(c.options)), c.message);
    }
    const std::string already =
        "Mesk does not support connecting to more than one unicast witness, and there ";
    witnesses = {"W1"};
    ExpectRefused(*Run(*ClusterUnicastAgentAdd::New(), InputOf("addr=10.0.0.1")),
                  already + "is already a unicast witness configured: W1.");
    witnesses = {"W1", "W2"};
    ExpectRefused(*Run(*ClusterUnicastAgentAdd::New(), InputOf("addr=10.0.0.1")),
                  already + "are already multiple unicast witnesses configured: W1,W2.");
    EXPECT_THAT(calls, IsEmpty());
}

TEST_F(UnicastAgentTest, ListConvertsEachFieldOfWellFormedEntries) {
    entries = {"u1;0;1;10.0.0.5;12321;", "u2;1;0;fe80::1;8000;zuvnic1",
               // Numbers read as atoi reads them; the address is not checked; the name keeps ";".
               "u3;yes;2;not-an-ip;80x;a;b;"};
    auto output = Run(*ClusterUnicastAgentList::New());
    EXPECT_TRUE(Errors(*output).empty() && output->IsComplete());
    Texts rows;
    for (const auto& row : ListElements(output->GetRootObject())) rows.push_back(Row(row));
    EXPECT_THAT(rows, ElementsAre("u1|0|true|10.0.0.5|12321|", "u2|1|false|fe80::1|8000|zuvnic1",
                                  "u3|0|true|not-an-ip|80|a;b;"));
}

TEST_F(UnicastAgentTest, ListRefusesTheWholeListForOneMalformedEntry) {
    const struct {
        std::string entry, message;
    } cases[] = {
        {"u1", "Invalid unicastAgent entry for nodeuuid u1"},
        {"u1;0", "Invalid unicastAgent entry for isWitness u1;0"},
        {"u1;0;1", "Invalid unicastAgent entry for ucast support u1;0;1"},
        {"u1;1;0;10.0.0.5", "Invalid unicastAgent entry for ip u1;1;0;10.0.0.5"},
        {"u1;0;1;10.0.0.5;12321", "Invalid unicastAgent entry for port u1;0;1;10.0.0.5;12321"},
    };
    for (const auto& c : cases) {
        entries = {"ok;0;1;10.0.0.1;12321;", c.entry};
        ExpectRefused(*Run(*ClusterUnicastAgentList::New()), c.message);
    }
}

TEST_F(UnicastAgentTest, ClearRemovesEveryAgentAndRefreshesOnceForNodes) {
    const struct {
        Texts entries, removals;
        int refreshes;
    } cases[] = {
        {{"n1;0;1;10.0.0.1;12321;", "w1;1;1;10.0.0.9;12321;", "n2;0;0;fe80::2;777x;a;b"},
         {"n1 v4:10.0.0.1 12321", "w1 v4:10.0.0.9 12321", "n2 v6:fe80::2 777"},
         1},
        {{"w1;1;1;10.0.0.9;;"}, {"w1 v4:10.0.0.9 0"}, 0},
    };
    for (const auto& c : cases) {
        Reset();
        entries = c.entries;
        auto output = Run(*ClusterUnicastAgentClear::New());
        EXPECT_THAT(calls, ElementsAreArray(c.removals));
        EXPECT_EQ(refreshes, c.refreshes);
        // True, but never marked complete, not even on success.
        EXPECT_TRUE(Errors(*output).empty() && BoolResult(*output) && !output->IsComplete());
    }
}

TEST_F(UnicastAgentTest, ClearStopsAtABadEntryWithoutRefreshingEarlierRemovals) {
    const struct {
        std::string entry, message;
    } cases[] = {
        {"n3", "Invalid unicastAgent entry for nodeuuid n3"},
        {"n3;1;0;10.0.0.5", "Invalid unicastAgent entries"},
        {"n3;0;1;10.0.0.5;12321", "Invalid unicastAgent entry for port n3;0;1;10.0.0.5;12321"},
        {"n3;0;1;10.0.0.300;12321;", "Invalid IP address 10.0.0.300"},
    };
    for (const auto& c : cases) {
        Reset();
        entries = {"n1;0;1;10.0.0.1;12321;", "n2;0;1;10.0.0.2;12321;", c.entry};
        ExpectRefused(*Run(*ClusterUnicastAgentClear::New()), c.message);
        EXPECT_THAT(calls, ElementsAre("n1 v4:10.0.0.1 12321", "n2 v4:10.0.0.2 12321"));
        EXPECT_EQ(refreshes, 0);
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
        std::string message;
        bool table;
        int plugins;
    } cases[] = {
        {add.get(), kWitnessNode,
         "This host is a witness node which doesn't support adding unicast agent.", false, 0},
        {remove.get(), kWitnessNode,
         "This host is a witness node which doesn't support removing unicast agent.", false, 0},
        {list.get(), kWitnessNode,
         "Unable to list unicast agent, " + witness + "listing unicast agent.", true, 1},
        {clear.get(), kWitnessNode,
         "Unable to remove unicast agent(s), " + witness + "removing unicast agent.", false, 1},
        {list.get(), kNotEnabled, "Mesk isn't enabled on the host", false, 1},
        {clear.get(), kNotEnabled, "Mesk isn't enabled on the host", false, 1},
        {add.get(), kFailing, "lib says no", false, 1},
        {remove.get(), kFailing, "Unable to remove the unicast agent: lib says no", false, 1},
        {list.get(), kFailing, "Unable to list unicast agent: lib says no", true, 1},
        {clear.get(), kFailing, "Unable to remove unicast agents: lib says no", false, 1},
    };
    entries = {"n1;0;1;10.0.0.1;12321;"};
    for (const auto& c : cases) {
        SCOPED_TRACE(c.message);
        Reset();
        ON_CALL(host, IsWitnessNode()).WillByDefault(Return(c.state == kWitnessNode));
        SetEnabled(c.state != kNotEnabled);
        failing = c.state == kFailing;
        auto output =
            Run(*c.command, InputOf("addr=10.0.0.1 type=node uuid=n1 supports-unicast=true"));
        EXPECT_THAT(Errors(*output), ElementsAre(c.message));
        if (c.table) {
            EXPECT_THAT(ListElements(output->GetRootObject()), IsEmpty());
            EXPECT_TRUE(output->IsComplete());
        } else {
            EXPECT_TRUE(output->GetRootObject() == nullptr && !output->IsComplete());
        }
        EXPECT_TRUE(failing || calls.empty());
        EXPECT_EQ(refreshes, 0);
        EXPECT_EQ(host.pluginsMade, c.plugins);
    }
    // Failures of the role and state questions are not the commands' to report.
    EXPECT_CALL(host, IsWitnessNode()).WillOnce(Fail("no answer"));
    EXPECT_THROW(Run(*add, InputOf("addr=10.0.0.1")), MeskCtlException);
    EXPECT_CALL(info, GetClusterConfig()).WillOnce(Fail("no config"));
    EXPECT_THROW(Run(*list), MeskCtlException);
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
