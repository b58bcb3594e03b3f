#include <cctype>
#include <cstdlib>
#include <cstring>
#include <ctime>

#include "MockHost.h"
#include "commands/cluster/ClusterGet.h"
#include "commands/cluster/ClusterJoin.h"
#include "commands/cluster/ClusterLeave.h"
#include "commands/cluster/ClusterNew.h"
#include "commands/cluster/ClusterPreferredFaultDomainGet.h"
#include "commands/cluster/ClusterPreferredFaultDomainSet.h"
#include "commands/cluster/ClusterRestore.h"
#include "platform/autocli/ShellCmdHook.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using namespace MeskTest;
using ::testing::_;
using ::testing::DoAll;
using ::testing::Invoke;
using ::testing::Return;
using ::testing::SetArgReferee;
using ClusterTest = HostTest;

const char kUuid[] = "52a1c3e4-1b2c-4d3e-8f90-a1b2c3d4e5f6";
const std::string kNone = "; no result, incomplete";
const std::string kInCluster =
    "The host is in a Mesk cluster and enabled for Mesk. You need to remove it from the cluster "
    "or disable Mesk." +
    kNone;

std::string Repeat(const std::string& piece, size_t count) {
    std::string text;
    while (count-- > 0) text += piece;
    return text;
}

// A witness host in the cluster kUuid; each field of the report has a source of its own.
class ClusterGetTest : public HostTest {
  protected:
    ClusterGetTest() {
        setenv("TZ", "UTC", 1);
        tzset();
        SetEnabled(true, kUuid);
        ON_CALL(info, IsWitness()).WillByDefault(Return(true));
        ON_CALL(host, GetInfoFromKOVRA(_, _, _, _, _, _, _, _, _))
            .WillByDefault(Invoke([](std::vector<MeskMemberInfo>& members, std::string& state,
                                     std::string& uuid, std::string& health, uint64_t& revision,
                                     std::string& membership, std::string& master,
                                     std::string& backup, std::string& maintenance) {
                members = {{"member-a", "a"}, {"member-b", "b"}};
                state = "AGENT", uuid = "local", health = "Healthy", revision = 42;
                membership = "ms", master = "master", backup = "backup", maintenance = "OFF";
            }));
        ON_CALL(host, GetUnicastMode(_)).WillByDefault(SetArgReferee<0>(true));
        ON_CALL(host, GetFormattedSystemDateTime()).WillByDefault(Return("now"));
        ON_CALL(info, GetConfigGeneration()).WillByDefault(Return(MeskConfigGeneration{"g", 9, 0}));
    }
    ~ClusterGetTest() override { unsetenv("TZ"); }
};

// Unlike most commands, a failure still gives the report, complete, with the fields set
// before it and the message unprefixed.
TEST_F(ClusterGetTest, ReportsEachFieldFromItsSourceOrTheFieldsSoFar) {
    EXPECT_EQ(Outcome(*Run(*ClusterGet::New())),
              std::string("{Enabled=true, Current Local Time=now, Local Node UUID=local, "
                          "Local Node Type=WITNESS, Local Node State=AGENT, "
                          "Local Node Health State=Healthy, Sub-Cluster Master UUID=master, "
                          "Sub-Cluster Backup UUID=backup, Sub-Cluster UUID=") +
                  kUuid +
                  ", Sub-Cluster Membership Entry Revision=42, Sub-Cluster Member Count=2, "
                  "Sub-Cluster Member UUIDs=[member-a, member-b], "
                  "Sub-Cluster Membership UUID=ms, Unicast Mode Enabled=true, "
                  "Maintenance Mode State=OFF, Config Generation=g 9 0.000}, complete");
    // The clock is read while the fields are set, after Enabled; the rest stay as declared.
    std::string afterClock = Shown(ClusterGet::New()->GetOutputStructure()) + ", complete";
    afterClock.replace(afterClock.find("Enabled=null"), 12, "Enabled=true");
    EXPECT_CALL(host, GetFormattedSystemDateTime()).WillOnce(Fail("boom"));
    EXPECT_EQ(Outcome(*Run(*ClusterGet::New())), "boom; " + afterClock);
}

// The generation's UUID ("None" when empty), number and timestamp in local time; below one
// second no date at all.
TEST_F(ClusterGetTest, ConfigGenerationShowsUuidNumberAndLocalTimestamp) {
    const struct {
        const char* zone;
        MeskConfigGeneration generation;
        std::string expected;
    } cases[] = {
        {"UTC", {"", 0, 0}, "None 0 0.000"},
        {"UTC", {"u", UINT64_MAX, 1500000000007}, "u 18446744073709551615 2017-07-14T02:40:00.007"},
        {"XYZ-2", {"u", 1, 1500000000120}, "u 1 2017-07-14T04:40:00.120"},
        {"XYZ-2", {"u", 1, 5}, "u 1 0.005"},
    };
    for (const auto& c : cases) {
        setenv("TZ", c.zone, 1);
        tzset();
        EXPECT_CALL(info, GetConfigGeneration()).WillOnce(Return(c.generation));
        EXPECT_THAT(Outcome(*Run(*ClusterGet::New())),
                    ::testing::HasSubstr("Config Generation=" + c.expected + "}"));
    }
}

// The witness options are checked in this order, the domain's length in characters; a library
// failure is reported bare, with a false result that is complete.
TEST_F(ClusterTest, JoinChecksTheWitnessOptionsThenJoins) {
    ON_CALL(info, JoinCluster(_, _, _, _, _)).WillByDefault(Record("JoinCluster"));
    const std::string empty =
        "Preferred fault domain name cannot be empty or exceed 256 characters.";
    const std::string accents256 = Repeat("\xc3\xa9", 256), accents257 = accents256 + "x";
    const std::string joined = std::string("JoinCluster(") + kUuid;
    const struct {
        std::string options, calls, outcome;
    } cases[] = {
        {"wait", joined + ", false, , true, 0)", "true, complete"},
        {"witness-node witness-preferred-fault-domain=" + accents256,
         joined + ", true, " + accents256 + ", false, 0)", "true, complete"},
        {"witness-node", "",
         "If --witness-node is specified, --witness-preferred-fault-domain must also be "
         "specified." +
             kNone},
        {"witness-node witness-preferred-fault-domain=", "", empty + kNone},
        {"witness-node witness-preferred-fault-domain=" + accents257, "", empty + kNone},
        {"witness-preferred-fault-domain=", "",
         "--witness-preferred-fault-domain is valid only when --witness-node is specified." +
             kNone},
    };
    for (const auto& c : cases) {
        calls.clear();
        EXPECT_EQ(Outcome(*Run(*ClusterJoin::New(),
                               std::string("cluster-uuid=") + kUuid + " " + c.options)),
                  c.outcome);
        EXPECT_EQ(calls, c.calls);
    }
    failure = "bad uuid";
    EXPECT_EQ(Outcome(*Run(*ClusterJoin::New(), std::string("cluster-uuid=") + kUuid)),
              "bad uuid; false, complete");
    // An enabled host is refused before its options are looked at.
    SetEnabled(true);
    EXPECT_EQ(Outcome(*Run(*ClusterJoin::New(), "cluster-uuid=x witness-node")), kInCluster);
}

// The cluster is named by the random UUID packed in place; a failed creation says what it was
// doing, with a false result that is complete.
TEST_F(ClusterTest, NewCreatesTheClusterNamedByThePackedUuid) {
    ON_CALL(host, UUID_CreateRandom()).WillByDefault(Invoke([] {
        return strdup("6F9619FF-8B86-D011-B42D-00C04FC964FF");
    }));
    ON_CALL(host, UUID_PackText(_, _, 36))
        .WillByDefault(Invoke([](const char* text, char* buffer, size_t length) {
            EXPECT_EQ(text, buffer);
            for (size_t i = 0; i < length; ++i) buffer[i] = std::tolower(buffer[i]);
            return buffer;
        }));
    ON_CALL(info, CreateCluster(_, _, _)).WillByDefault(Record("CreateCluster"));
    EXPECT_EQ(Outcome(*Run(*ClusterNew::New())), "true, complete");
    EXPECT_EQ(calls, "CreateCluster(6f9619ff-8b86-d011-b42d-00c04fc964ff, true, false)");
    failure = "boom";
    EXPECT_EQ(Outcome(*Run(*ClusterNew::New())),
              "Unable to create the new Mesk cluster: boom; false, complete");

    calls.clear();
    EXPECT_CALL(host, UUID_CreateRandom()).WillOnce(Return(nullptr));
    EXPECT_EQ(Outcome(*Run(*ClusterNew::New())), "Unable to generate a UUID" + kNone);
    SetEnabled(true);
    EXPECT_EQ(Outcome(*Run(*ClusterNew::New())), kInCluster);
    EXPECT_EQ(calls, "");
}

const std::string kScript = "/usr/lib/orvane/tavord/bin/notifyDatastore.py";
const std::string kPreUnmount = kScript + " -t PreUnmount -d meskDatastore";
const std::string kFailedUnmount = kScript + " -t FailedUnmount -d meskDatastore";

// The unmount is announced before the host leaves, and taken back when the leave fails; the
// script's own failure (here always) changes nothing. A failed leave leaves no result.
TEST_F(ClusterTest, LeaveNotifiesAroundTheLeave) {
    unsetenv("MESK_HOST_ROOT");
    Kalmor::AutoCli::SetShellCmdHook(
        [this](const std::string& command, std::string& output, const std::string&) {
            calls += (calls.empty() ? "" : " ") + command;
            output = "Traceback";
            return 1;
        });
    ON_CALL(info, LeaveCluster(_)).WillByDefault(Record("LeaveCluster"));
    const struct {
        bool enabled;
        std::string failure, calls, outcome;
    } cases[] = {
        {true, "", kPreUnmount + " LeaveCluster(false)", "true, complete"},
        {true, "boom", kPreUnmount + " LeaveCluster(false) " + kFailedUnmount, "boom" + kNone},
        {false, "", "", "The host is not in a Mesk cluster." + kNone},
    };
    for (const auto& c : cases) {
        SetEnabled(c.enabled);
        calls.clear(), failure = c.failure;
        EXPECT_EQ(Outcome(*Run(*ClusterLeave::New())), c.outcome);
        EXPECT_EQ(calls, c.calls);
    }
    Kalmor::AutoCli::SetShellCmdHook(nullptr);
}

// Restore passes the boot flag on without asking whether the host is in a cluster; a failure
// is reported bare, with a false result that is complete.
TEST_F(ClusterTest, RestorePassesTheBootFlagOn) {
    ON_CALL(info, RestoreClusterConfig(_)).WillByDefault(Record("RestoreClusterConfig"));
    EXPECT_CALL(info, GetClusterConfig()).Times(0);
    EXPECT_EQ(Outcome(*Run(*ClusterRestore::New())), "true, complete");
    failure = "no config";
    EXPECT_EQ(Outcome(*Run(*ClusterRestore::New(), "boot")), "no config; false, complete");
    EXPECT_EQ(calls, "RestoreClusterConfig(false) RestoreClusterConfig(true)");
}

// Only in a stretched cluster; outside any cluster stretching is not even asked. The library
// fills the id first, then the name; both are shown as given.
TEST_F(ClusterTest, PreferredFaultDomainGetAnswersOnlyInAStretchedCluster) {
    SetEnabled(true);
    ON_CALL(host, IsInStretchedCluster()).WillByDefault(Return(true));
    ON_CALL(host, GetPreferredFaultDomainInfo(_, _))
        .WillByDefault(DoAll(SetArgReferee<0>("id-1"), SetArgReferee<1>(" Site A ")));
    EXPECT_EQ(Outcome(*Run(*ClusterPreferredFaultDomainGet::New())),
              "{Preferred Fault Domain Name= Site A , Preferred Fault Domain Id=id-1}, complete");

    EXPECT_CALL(host, GetPreferredFaultDomainInfo(_, _)).WillOnce(Fail("boom"));
    EXPECT_EQ(Outcome(*Run(*ClusterPreferredFaultDomainGet::New())),
              "Unable to get preferred fault domain name: boom" + kNone);
    const std::string notStretched =
        "Cannot get preferred fault domain if host is not in a stretched cluster." + kNone;
    EXPECT_CALL(host, IsInStretchedCluster()).WillOnce(Return(false));
    EXPECT_EQ(Outcome(*Run(*ClusterPreferredFaultDomainGet::New())), notStretched);
    SetEnabled(false);
    EXPECT_EQ(Outcome(*Run(*ClusterPreferredFaultDomainGet::New())), notStretched);
}

// The name is checked before the host's role, its length in characters.
TEST_F(ClusterTest, PreferredFaultDomainSetChecksTheNameBeforeTheRole) {
    ON_CALL(info, SetPreferredFaultDomain(_)).WillByDefault(Record("SetPreferredFaultDomain"));
    const std::string euros256 = Repeat("\xe2\x82\xac", 256), euros257 = euros256 + "x";
    const struct {
        std::string name;
        bool witness;
        std::string failure;
        bool sets;
        std::string outcome;
    } cases[] = {
        {"", true, "", false, "Cannot set preferred fault domain name as empty." + kNone},
        {euros257, true, "", false,
         "Preferred Fault domain name cannot exceed 256 characters." + kNone},
        {euros256, false, "", false,
         "Cannot set preferred fault domain if the host is not a witness node." + kNone},
        {euros256, true, "", true, "true, complete"},
        {"site-a", true, "boom", true, "Unable to set preferred fault domain name: boom" + kNone},
    };
    for (const auto& c : cases) {
        ON_CALL(host, IsWitnessNode()).WillByDefault(Return(c.witness));
        calls.clear(), failure = c.failure;
        EXPECT_EQ(Outcome(*Run(*ClusterPreferredFaultDomainSet::New(),
                               "preferred-fault-domain-name=" + c.name)),
                  c.outcome);
        EXPECT_EQ(calls, c.sets ? "SetPreferredFaultDomain(" + c.name + ")" : "");
    }
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
