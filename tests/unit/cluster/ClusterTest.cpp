#include <cctype>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <string>
#include <vector>

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

using namespace Kalmor::MetaObj;
using namespace MeskTest;
using Kalmor::CallSpec::Input;
using ::testing::_;
using ::testing::DoAll;
using ::testing::ElementsAre;
using ::testing::Invoke;
using ::testing::IsEmpty;
using ::testing::Return;
using ::testing::SetArgReferee;

const char kUuid[] = "52a1c3e4-1b2c-4d3e-8f90-a1b2c3d4e5f6";
const char kInCluster[] =
    "The host is in a Mesk cluster and enabled for Mesk. You need to remove it from the cluster "
    "or disable Mesk.";

std::string Repeat(const std::string& piece, size_t count) {
    std::string text;
    while (count-- > 0) text += piece;
    return text;
}

// A boolean answer: true or false, with the output complete and no error.
void ExpectAnswered(const Kalmor::CallSpec::Output& output, bool result) {
    EXPECT_THAT(Errors(output), IsEmpty());
    EXPECT_TRUE(BoolResult(output) == result && output.IsComplete());
}

class ClusterTest : public HostTest {
  protected:
    // Checks and drops the expectations so far; the default answers stay.
    void Settle() {
        ::testing::Mock::VerifyAndClearExpectations(&host);
        ::testing::Mock::VerifyAndClearExpectations(&info);
    }
};

// Every field of a cluster report as text, in order; an empty value shows as "-".
std::vector<std::string> Shown(const std::shared_ptr<MetaObject>& root) {
    std::vector<std::string> shown;
    for (const auto& field : std::dynamic_pointer_cast<MetaStruct>(root)->GetFields()) {
        std::string text;
        if (auto s = std::dynamic_pointer_cast<MetaString>(field.value); s && s->HasValue()) {
            text = s->GetValue();
        } else if (auto i = std::dynamic_pointer_cast<MetaInt>(field.value); i && i->HasValue()) {
            text = std::to_string(i->GetValue());
        } else if (auto b = std::dynamic_pointer_cast<MetaBool>(field.value); b && b->HasValue()) {
            text = b->GetValue() ? "true" : "false";
        } else if (auto l = std::dynamic_pointer_cast<MetaList>(field.value)) {
            for (const auto& element : l->GetElements()) {
                text += (text.empty() ? "" : ",") +
                        std::dynamic_pointer_cast<MetaString>(element)->GetValue();
            }
        }
        shown.push_back(field.name + "=" + (text.empty() ? "-" : text));
    }
    return shown;
}

class ClusterGetTest : public ClusterTest {
  protected:
    ClusterGetTest() {
        setenv("TZ", "UTC", 1);
        tzset();
        SetEnabled(true, kUuid);
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
        ON_CALL(info, GetConfigGeneration()).WillByDefault(Return(Generation("g", 9, 0)));
    }
    ~ClusterGetTest() override { unsetenv("TZ"); }

    static MeskConfigGeneration Generation(const std::string& uuid, uint64_t number,
                                           uint64_t timestamp) {
        MeskConfigGeneration generation;
        generation.uuid = uuid, generation.generation = number, generation.timestamp = timestamp;
        return generation;
    }
};

TEST_F(ClusterGetTest, MemberHostReportsEachFieldFromItsSourceInTemplateOrder) {
    ON_CALL(info, IsWitness()).WillByDefault(Return(true));
    auto output = Run(*ClusterGet::New());
    EXPECT_TRUE(Errors(*output).empty() && output->IsComplete());
    EXPECT_THAT(
        Shown(output->GetRootObject()),
        ElementsAre("Enabled=true", "Current Local Time=now", "Local Node UUID=local",
                    "Local Node Type=WITNESS", "Local Node State=AGENT",
                    "Local Node Health State=Healthy", "Sub-Cluster Master UUID=master",
                    "Sub-Cluster Backup UUID=backup", std::string("Sub-Cluster UUID=") + kUuid,
                    "Sub-Cluster Membership Entry Revision=42", "Sub-Cluster Member Count=2",
                    "Sub-Cluster Member UUIDs=member-a,member-b", "Sub-Cluster Membership UUID=ms",
                    "Unicast Mode Enabled=true", "Maintenance Mode State=OFF",
                    "Config Generation=g 9 0.000"));
}

TEST_F(ClusterGetTest, ConfigGenerationShowsUuidNumberAndLocalTimestamp) {
    const struct {
        const char* zone;
        MeskConfigGeneration generation;
        std::string expected;
    } cases[] = {
        {"UTC", Generation("", 0, 0), "None 0 0.000"},
        {"UTC", Generation("u", UINT64_MAX, 1500000000007),
         "u 18446744073709551615 2017-07-14T02:40:00.007"},
        // Local time; below one second no date at all.
        {"XYZ-2", Generation("u", 1, 1500000000120), "u 1 2017-07-14T04:40:00.120"},
        {"XYZ-2", Generation("u", 1, 5), "u 1 0.005"},
    };
    for (const auto& c : cases) {
        setenv("TZ", c.zone, 1);
        tzset();
        EXPECT_CALL(info, GetConfigGeneration()).WillOnce(Return(c.generation));
        auto output = Run(*ClusterGet::New());
        EXPECT_EQ(TextField(output->GetRootObject(), "Config Generation"), c.expected);
    }
}

// Unlike most commands, a failure still gives the report, complete, with the fields set
// before it (all are set together, after the queries) and the message unprefixed.
TEST_F(ClusterGetTest, FailureStillGivesACompleteReportWithTheFieldsSoFar) {
    EXPECT_CALL(host, GetFormattedSystemDateTime()).WillOnce(Fail("boom"));
    auto output = Run(*ClusterGet::New());
    EXPECT_THAT(Errors(*output), ElementsAre("boom"));
    EXPECT_TRUE(output->IsComplete());
    auto shown = Shown(output->GetRootObject());
    ASSERT_EQ(shown.size(), 16u);
    EXPECT_EQ(shown[0], "Enabled=true");
    for (size_t i = 1; i < shown.size(); ++i) EXPECT_EQ(shown[i].back(), '-') << shown[i];
}

// A join's options as the framework parses them; `domain` nullptr: option not given.
std::shared_ptr<Input> JoinInput(bool witness, const char* domain, bool wait = false) {
    auto input = Input::New();
    input->SetParameter("cluster-uuid", kUuid);
    if (witness) input->SetFlag("witness-node");
    if (domain) input->SetParameter("witness-preferred-fault-domain", domain);
    if (wait) input->SetFlag("wait");
    return input;
}

TEST_F(ClusterTest, JoinRefusalsComeInOrderAndNeverJoin) {
    const std::string tooLong = Repeat("\xc3\xa9", 257);
    const struct {
        bool witness;
        const char* domain;
        std::string message;
    } cases[] = {
        {true, nullptr,
         "If --witness-node is specified, --witness-preferred-fault-domain must also be "
         "specified."},
        {true, "", "Preferred fault domain name cannot be empty or exceed 256 characters."},
        {true, tooLong.c_str(),
         "Preferred fault domain name cannot be empty or exceed 256 characters."},
        {false, "",
         "--witness-preferred-fault-domain is valid only when --witness-node is specified."},
    };
    EXPECT_CALL(info, JoinCluster(_, _, _, _, _)).Times(0);
    for (const auto& c : cases) {
        ExpectRefused(*Run(*ClusterJoin::New(), JoinInput(c.witness, c.domain)), c.message);
    }
}

TEST_F(ClusterTest, JoinPassesOptionsOnAndCountsCharactersNotBytes) {
    const std::string ascii256 = Repeat("x", 256), twoByte200 = Repeat("\xc3\xa9", 200);
    for (const char* domain : {"", "site-a", ascii256.c_str(), twoByte200.c_str()}) {
        const bool witness = *domain != '\0', wait = !witness;
        EXPECT_CALL(info, JoinCluster(UuidOf(kUuid), witness, domain, wait, 0));
        ExpectAnswered(
            *Run(*ClusterJoin::New(), JoinInput(witness, witness ? domain : nullptr, wait)), true);
        Settle();
    }
    // A library failure is reported bare, with a false result that is complete.
    EXPECT_CALL(info, JoinCluster(_, _, _, _, _)).WillOnce(Fail("bad uuid"));
    auto output = Run(*ClusterJoin::New(), JoinInput(false, nullptr));
    EXPECT_THAT(Errors(*output), ElementsAre("bad uuid"));
    EXPECT_TRUE(!BoolResult(*output) && output->IsComplete());
}

TEST_F(ClusterTest, NewCreatesTheClusterNamedByThePackedUuid) {
    EXPECT_CALL(host, UUID_CreateRandom()).WillOnce(Invoke([] {
        return strdup("6F9619FF-8B86-D011-B42D-00C04FC964FF");
    }));
    EXPECT_CALL(host, UUID_PackText(_, _, 36))
        .WillOnce(Invoke([](const char* text, char* buffer, size_t length) {
            EXPECT_EQ(text, buffer);  // packed in place
            for (size_t i = 0; i < length; ++i) buffer[i] = std::tolower(buffer[i]);
            return buffer;
        }));
    EXPECT_CALL(info, CreateCluster("6f9619ff-8b86-d011-b42d-00c04fc964ff", true, false));
    ExpectAnswered(*Run(*ClusterNew::New()), true);
}

TEST_F(ClusterTest, NewRefusalsCreateNothingAndFailuresArePrefixedAndFalse) {
    // Only the last run gets as far as creating.
    EXPECT_CALL(info, CreateCluster(_, _, _)).WillOnce(Fail("boom"));
    SetEnabled(true);
    ExpectRefused(*Run(*ClusterNew::New()), kInCluster);
    SetEnabled(false);
    EXPECT_CALL(host, UUID_CreateRandom())
        .WillOnce(Return(nullptr))
        .WillOnce(::testing::DoDefault());
    ExpectRefused(*Run(*ClusterNew::New()), "Unable to generate a UUID");
    auto output = Run(*ClusterNew::New());
    EXPECT_THAT(Errors(*output), ElementsAre("Unable to create the new Mesk cluster: boom"));
    EXPECT_TRUE(!BoolResult(*output) && output->IsComplete());
}

const std::string kScript = "/usr/lib/orvane/tavord/bin/notifyDatastore.py";
const std::string kPreUnmount = kScript + " -t PreUnmount -d meskDatastore";
const std::string kFailedUnmount = kScript + " -t FailedUnmount -d meskDatastore";

// Records each shell command line instead of running it; the script always fails.
class ClusterLeaveTest : public ClusterTest {
  protected:
    ClusterLeaveTest() {
        unsetenv("MESK_HOST_ROOT");
        Kalmor::AutoCli::SetShellCmdHook(
            [this](const std::string& command, std::string& output, const std::string&) {
                commands.push_back(command);
                output = "Traceback";
                return 1;
            });
    }
    ~ClusterLeaveTest() override { Kalmor::AutoCli::SetShellCmdHook(nullptr); }

    std::vector<std::string> commands;
};

TEST_F(ClusterLeaveTest, LeaveNotifiesAroundTheLeaveAndIgnoresTheScriptsFailure) {
    const struct {
        bool enabled, leaveFails;
        std::string message;  // empty: success
        std::vector<std::string> notifications;
    } cases[] = {
        {true, false, "", {kPreUnmount}},
        {false, false, "The host is not in a Mesk cluster.", {}},
        {true, true, "boom", {kPreUnmount, kFailedUnmount}},
    };
    for (const auto& c : cases) {
        SetEnabled(c.enabled);
        commands.clear();
        // The unmount is announced before the host leaves.
        EXPECT_CALL(info, LeaveCluster(false))
            .Times(c.enabled ? 1 : 0)
            .WillRepeatedly(Invoke([this, &c](bool) {
                EXPECT_THAT(commands, ElementsAre(kPreUnmount));
                if (c.leaveFails) throw HostCtl::Lib::Mesk::MeskCtlException("boom");
            }));
        auto output = Run(*ClusterLeave::New());
        EXPECT_EQ(commands, c.notifications);
        if (c.message.empty()) {
            ExpectAnswered(*output, true);
        } else {
            ExpectRefused(*output, c.message);
        }
        Settle();
    }
}

TEST_F(ClusterTest, RestorePassesTheBootFlagAndIsFalseAfterAFailure) {
    EXPECT_CALL(info, GetClusterConfig()).Times(0);
    EXPECT_CALL(info, RestoreClusterConfig(false));
    ExpectAnswered(*Run(*ClusterRestore::New()), true);
    EXPECT_CALL(info, RestoreClusterConfig(true)).WillOnce(Fail("no config"));
    auto input = Input::New();
    input->SetFlag("boot");
    auto output = Run(*ClusterRestore::New(), input);
    EXPECT_THAT(Errors(*output), ElementsAre("no config"));
    EXPECT_TRUE(!BoolResult(*output) && output->IsComplete());
}

TEST_F(ClusterTest, PreferredFaultDomainGetAnswersOnlyInAStretchedCluster) {
    SetEnabled(true);
    ON_CALL(host, IsInStretchedCluster()).WillByDefault(Return(true));
    // The library fills the id first, then the name; both are shown as given.
    ON_CALL(host, GetPreferredFaultDomainInfo(_, _))
        .WillByDefault(DoAll(SetArgReferee<0>("id-1"), SetArgReferee<1>(" Site A ")));
    auto output = Run(*ClusterPreferredFaultDomainGet::New());
    EXPECT_TRUE(Errors(*output).empty() && output->IsComplete());
    EXPECT_EQ(TextField(output->GetRootObject(), "Preferred Fault Domain Name"), " Site A ");
    EXPECT_EQ(TextField(output->GetRootObject(), "Preferred Fault Domain Id"), "id-1");

    EXPECT_CALL(host, GetPreferredFaultDomainInfo(_, _)).WillOnce(Fail("boom"));
    ExpectRefused(*Run(*ClusterPreferredFaultDomainGet::New()),
                  "Unable to get preferred fault domain name: boom");
    // Not stretched, or not in a cluster at all (then stretching is not even asked).
    const std::string notStretched =
        "Cannot get preferred fault domain if host is not in a stretched cluster.";
    EXPECT_CALL(host, IsInStretchedCluster()).WillOnce(Return(false));
    ExpectRefused(*Run(*ClusterPreferredFaultDomainGet::New()), notStretched);
    SetEnabled(false);
    ExpectRefused(*Run(*ClusterPreferredFaultDomainGet::New()), notStretched);
}

TEST_F(ClusterTest, PreferredFaultDomainSetChecksTheNameBeforeTheRoleAndCountsCharacters) {
    const std::string notWitness =
        "Cannot set preferred fault domain if the host is not a witness node.";
    const struct {
        std::string name;
        bool witness;
        std::string message;  // empty: set
    } cases[] = {
        {"", false, "Cannot set preferred fault domain name as empty."},
        {Repeat("\xe2\x82\xac", 256), false, notWitness},  // 768 bytes pass
        {Repeat("x", 256), true, ""},
        {"site-a", true, "Unable to set preferred fault domain name: boom"},
    };
    for (const auto& c : cases) {
        ON_CALL(host, IsWitnessNode()).WillByDefault(Return(c.witness));
        const bool sets = c.witness && c.name.size() <= 256;
        auto& set = EXPECT_CALL(info, SetPreferredFaultDomain(c.name)).Times(sets ? 1 : 0);
        if (c.name == "site-a") set.WillOnce(Fail("boom"));
        auto input = Input::New();
        input->SetParameter("preferred-fault-domain-name", c.name);
        auto output = Run(*ClusterPreferredFaultDomainSet::New(), input);
        if (c.message.empty()) {
            ExpectAnswered(*output, true);
        } else {
            ExpectRefused(*output, c.message);
        }
        Settle();
    }
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
