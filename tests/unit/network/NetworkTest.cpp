#include "MockHost.h"
#include "commands/network/NetworkClear.h"
#include "commands/network/NetworkIpAdd.h"
#include "commands/network/NetworkIpRemove.h"
#include "commands/network/NetworkIpSet.h"
#include "commands/network/NetworkList.h"
#include "commands/network/NetworkRemove.h"
#include "commands/network/NetworkRestore.h"
#include "hostctl/NetworkAddress.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using HostCtl::Network::Ipv4Address;
using HostCtl::Network::Ipv6Address;
using Kalmor::AutoCli::Command;
using namespace MeskTest;
using ::testing::_;
using ::testing::Return;

const std::string kDefaults =
    "224.2.3.4 FF19:0:0:0:0:2:3:4 224.1.2.3 FF19:0:0:0:0:1:2:3 23451 12345 12321 5";
const std::string kCurrent = "239.1.1.1 ff05::1 239.2.2.2 ff05::2 1000 2000 3000 9";

// A record of the interface with the groups and numbers of kCurrent.
std::unique_ptr<MeskZuvNicConfig2> Nic(const std::string& name, bool mesk, bool witness) {
    return std::make_unique<MeskZuvNicConfig2>(
        name, MeskIpAddress(Ipv4Address("239.1.1.1")), MeskIpAddress(Ipv6Address("ff05::1")),
        MeskIpAddress(Ipv4Address("239.2.2.2")), MeskIpAddress(Ipv6Address("ff05::2")), 1000, 2000,
        3000, 9, mesk, witness, "opts");
}

// A host whose interface records are, afresh on each call, near misses of "zuvnic1" first,
// then two records of that name: the first carries witness traffic only. The in-use queries
// (answered as InUse sets), writes and removals are recorded.
class NetworkTest : public HostTest {
  protected:
    NetworkTest() {
        ON_CALL(info, GetZuvNicConfigs()).WillByDefault([] {
            NicList list;
            list.push_back(Nic("ZUVNIC1", true, true));
            list.push_back(Nic("zuvnic10", true, true));
            list.push_back(Nic("zuvnic1", false, true));
            list.push_back(Nic("zuvnic1", true, true));
            return list;
        });
        ON_CALL(info, SetZuvNicConfig(_)).WillByDefault(Record("SetZuvNicConfig", true));
        ON_CALL(info, RemoveZuvNic(_, _, _)).WillByDefault(Record("RemoveZuvNic", true));
    }
    void InUse(bool mesk, bool witness) {
        ON_CALL(info, IsZuvNicInUse(_, "mesk")).WillByDefault(Record("InUse", mesk));
        ON_CALL(info, IsZuvNicInUse(_, "witness")).WillByDefault(Record("InUse", witness));
    }
};

// Add starts from the defaults, set from the first record of exactly that name; given values
// override either, given traffic types replace the current ones. Only the low 32 bits of the
// framework's integers reach the record, and no options.
TEST_F(NetworkTest, AddAndSetWriteTheDefaultsOrTheCurrentRecordWithTheGivenValues) {
    const std::string given =
        "agent-mc-addr=224.9.9.1 agent-v6-mc-addr=ff02::9 master-mc-addr=224.9.9.2 "
        "master-v6-mc-addr=ff02::a agent-mc-port=4294969296 master-mc-port=4294967295 "
        "host-uc-port=-7 multicast-ttl=0 traffic-type=witness";
    const std::string givenWritten = "224.9.9.1 ff02::9 224.9.9.2 ff02::a 2000 -1 -7 0 witness";
    const struct {
        bool isSet;
        std::string options, written;
    } cases[] = {
        {false, given, givenWritten},
        {true, given, givenWritten},
        {true, "agent-mc-port=2001",
         "239.1.1.1 ff05::1 239.2.2.2 ff05::2 2001 2000 3000 9 witness"},
        {true, "traffic-type=mesk", kCurrent + " mesk"},
        {true, "traffic-type=witness traffic-type=mesk", kCurrent + " mesk witness"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.options);
        InUse(c.isSet, false);
        calls.clear();
        const std::shared_ptr<Command> command =
            c.isSet ? std::shared_ptr<Command>(NetworkIpSet::New()) : NetworkIpAdd::New();
        EXPECT_EQ(Outcome(*Run(*command, "interface-name=zuvnic1 " + c.options)), "true, complete");
        EXPECT_THAT(calls, ::testing::EndsWith(" SetZuvNicConfig(zuvnic1 " + c.written + ")"));
    }
}

// "witness" is asked only when "mesk" says no. A refusal or a failure gives the bare message
// and no result, and writes nothing.
TEST_F(NetworkTest, InUseDecidesBetweenAddAndSet) {
    const std::string already =
        "This Zuvola network interface is already in use. Can't add again. If you want to "
        "reconfigure, use 'set' command.";
    const std::string notInUse =
        "This Zuvola network interface is not in use. Can't set/reconfigure. If you want to "
        "add, use 'add' command.";
    const std::string none = "; no result, incomplete";
    const std::string asked = "InUse(zuvnic1, mesk) InUse(zuvnic1, witness)";
    const struct {
        bool isSet, mesk, witness;
        std::string options, calls, outcome;
    } cases[] = {
        {false, false, false, "", asked + " SetZuvNicConfig(zuvnic1 " + kDefaults + " mesk)",
         "true, complete"},
        {false, false, true, "", asked, already + none},
        {true, false, false, "", asked, notInUse + none},
        {true, true, false, "",
         "InUse(zuvnic1, mesk) SetZuvNicConfig(zuvnic1 " + kCurrent + " witness)",
         "true, complete"},
        {true, true, false, "traffic-type=witness traffic-type=Mesk", "InUse(zuvnic1, mesk)",
         "Unknown traffic type" + none},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.calls);
        InUse(c.mesk, c.witness);
        calls.clear();
        const std::shared_ptr<Command> command =
            c.isSet ? std::shared_ptr<Command>(NetworkIpSet::New()) : NetworkIpAdd::New();
        EXPECT_EQ(Outcome(*Run(*command, "interface-name=zuvnic1 " + c.options)), c.outcome);
        EXPECT_EQ(calls, c.calls);
    }
    // In use, but without a record of its name.
    InUse(true, false);
    calls.clear();
    EXPECT_EQ(Outcome(*Run(*NetworkIpSet::New(), "interface-name=zuvnic7")),
              "This Zuvola network interface not found." + none);
    EXPECT_EQ(calls, "InUse(zuvnic7, mesk)");
    ON_CALL(info, SetZuvNicConfig(_)).WillByDefault(Fail("busy"));
    EXPECT_EQ(Outcome(*Run(*NetworkIpSet::New(), "interface-name=zuvnic1")), "busy" + none);
}

TEST_F(NetworkTest, CommandsNeedingMeskInfo2RefuseAPlainOrMissingInfoObject) {
    EXPECT_CALL(info, IsZuvNicInUse(_, _)).Times(0);
    EXPECT_CALL(info, GetZuvNicConfigs()).Times(0);
    for (auto kind : {InfoKind::Basic, InfoKind::Null}) {
        host.infoKind = kind;
        for (const std::shared_ptr<Command>& command :
             {std::shared_ptr<Command>(NetworkIpAdd::New()),
              std::shared_ptr<Command>(NetworkIpSet::New()),
              std::shared_ptr<Command>(NetworkList::New())}) {
            EXPECT_EQ(Outcome(*Run(*command, "interface-name=zuvnic1")),
                      "Could not get MeskInfo2. Plugin version mismatch?; no result, incomplete");
        }
    }
    // The plain info object is released like any other.
    EXPECT_EQ(host.infosMade, host.infosReleased);
}

// Every field of each record in the library's order; 32-bit values are widened with their
// sign; "IP Protocol" is "IP" whatever the groups are, here IPv6 in every slot. A record's
// accessors cannot fail, so the library can fail only before the first entry: the empty list is
// then still the result, complete, beside the bare message.
TEST_F(NetworkTest, ListShowsEveryRecordFieldByField) {
    EXPECT_CALL(info, GetZuvNicConfigs())
        .WillOnce([] {
            NicList list;
            list.push_back(std::make_unique<MeskZuvNicConfig2>(
                "zuvnic0", MeskIpAddress(Ipv6Address("ff05::1")),
                MeskIpAddress(Ipv6Address("ff05::2")), MeskIpAddress(Ipv6Address("ff05::3")),
                MeskIpAddress(Ipv6Address("ff05::4")), -1, -2147483647 - 1, 0, -5, true, true, ""));
            list.back()->SetIfaceUuid("5e1c0d3a-0000-0000-0000-000000000002");
            return list;
        })
        .WillOnce(Fail("locked"));
    EXPECT_EQ(
        Outcome(*Run(*NetworkList::New())),
        "[{ZuvNic Name=zuvnic0, IP Protocol=IP, "
        "Interface UUID=5e1c0d3a-0000-0000-0000-000000000002, "
        "Agent Group Multicast Address=ff05::1, Agent Group IPv6 Multicast Address=ff05::2, "
        "Agent Group Multicast Port=-1, Master Group Multicast Address=ff05::3, "
        "Master Group IPv6 Multicast Address=ff05::4, Master Group Multicast Port=-2147483648, "
        "Host Unicast Channel Bound Port=0, Multicast TTL=-5, Traffic Type=mesk, witness}], "
        "complete");
    EXPECT_EQ(Outcome(*Run(*NetworkList::New())), "locked; [], complete");
}

// Both remove commands ask for "mesk" then "witness" and stop at a failure. Remove, clear
// and restore give the bare message after a failure, with a false result that is complete.
TEST_F(NetworkTest, RemoveClearAndRestoreAnswerTrueOrFalseAndComplete) {
    ON_CALL(info, ClearNetworkConfig()).WillByDefault(Record("ClearNetworkConfig"));
    ON_CALL(info, RestoreNetworkConfig()).WillByDefault(Record("RestoreNetworkConfig"));
    const std::string both =
        "RemoveZuvNic(zuvnic1, true, mesk) RemoveZuvNic(zuvnic1, true, witness)";
    const struct {
        std::shared_ptr<Command> command;
        std::string options, calls, failedCalls;
    } cases[] = {
        {NetworkIpRemove::New(), "interface-name=zuvnic1 force", both,
         "RemoveZuvNic(zuvnic1, true, mesk)"},
        {NetworkRemove::New(), "interface-name=zuvnic1 force", both,
         "RemoveZuvNic(zuvnic1, true, mesk)"},
        {NetworkIpRemove::New(), "interface-name=zuvnic1",
         "RemoveZuvNic(zuvnic1, false, mesk) RemoveZuvNic(zuvnic1, false, witness)", ""},
        {NetworkClear::New(), "", "ClearNetworkConfig()", "ClearNetworkConfig()"},
        {NetworkRestore::New(), "", "RestoreNetworkConfig()", "RestoreNetworkConfig()"},
    };
    for (const auto& c : cases) {
        for (const bool fails : {false, true}) {
            if (fails && c.failedCalls.empty()) continue;
            SCOPED_TRACE(c.calls + (fails ? " failing" : ""));
            calls.clear(), failure = fails ? "busy" : "";
            EXPECT_EQ(Outcome(*Run(*c.command, c.options)),
                      fails ? "busy; false, complete" : "true, complete");
            EXPECT_EQ(calls, fails ? c.failedCalls : c.calls);
        }
    }
    // A failure of the second removal.
    ON_CALL(info, RemoveZuvNic(_, _, "witness")).WillByDefault(Fail("busy"));
    failure.clear();
    EXPECT_EQ(Outcome(*Run(*NetworkRemove::New(), "interface-name=zuvnic1")),
              "busy; false, complete");
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
