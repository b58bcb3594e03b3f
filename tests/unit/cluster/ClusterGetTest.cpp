#include <cstdlib>
#include <ctime>
#include <functional>
#include <string>
#include <vector>

#include "MockHost.h"
#include "commands/cluster/ClusterGet.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using namespace Kalmor::MetaObj;
using namespace MeskTest;
using ::testing::_;
using ::testing::ElementsAre;
using ::testing::Invoke;
using ::testing::Return;

// Every field of the report as text, in order; an empty value shows as "-".
std::vector<std::string> Shown(const std::shared_ptr<MetaObject>& root) {
    std::vector<std::string> shown;
    for (const auto& field : std::dynamic_pointer_cast<MetaStruct>(root)->GetFields()) {
        std::string text = "-";
        if (auto s = std::dynamic_pointer_cast<MetaString>(field.value)) {
            if (s->HasValue()) text = s->GetValue();
        } else if (auto i = std::dynamic_pointer_cast<MetaInt>(field.value)) {
            if (i->HasValue()) text = std::to_string(i->GetValue());
        } else if (auto b = std::dynamic_pointer_cast<MetaBool>(field.value)) {
            if (b->HasValue()) text = b->GetValue() ? "true" : "false";
        } else if (auto l = std::dynamic_pointer_cast<MetaList>(field.value)) {
            for (size_t i = 0; i < l->Size(); ++i) {
                auto element = std::dynamic_pointer_cast<MetaString>(l->GetElements()[i]);
                text = (i == 0 ? "" : text + ",") + element->GetValue();
            }
        }
        shown.push_back(field.name + "=" + text);
    }
    return shown;
}

class ClusterGetTest : public HostTest {
  protected:
    ClusterGetTest() {
        setenv("TZ", "UTC", 1);
        tzset();
        SetEnabled(true, "52a1c3e4-1b2c-4d3e-8f90-a1b2c3d4e5f6");
        ON_CALL(host, GetInfoFromKOVRA(_, _, _, _, _, _, _, _, _))
            .WillByDefault(Invoke([](std::vector<MeskMemberInfo>& members, std::string& state,
                                     std::string& uuid, std::string& health, uint64_t& revision,
                                     std::string& membership, std::string& master,
                                     std::string& backup, std::string& maintenance) {
                members = {{"member-a", "a"}, {"member-b", "b"}};
                state = "AGENT", uuid = "local", health = "Healthy", revision = 42;
                membership = "ms", master = "master", backup = "backup", maintenance = "OFF";
            }));
        ON_CALL(host, GetUnicastMode(_)).WillByDefault(::testing::SetArgReferee<0>(true));
        ON_CALL(host, GetFormattedSystemDateTime()).WillByDefault(Return("now"));
        ON_CALL(info, GetConfigGeneration()).WillByDefault(Return(Generation("g", 9, 0)));
    }
    ~ClusterGetTest() override { unsetenv("TZ"); }

    // Checks and drops the expectations so far; the default answers stay.
    void Settle() {
        ::testing::Mock::VerifyAndClearExpectations(&host);
        ::testing::Mock::VerifyAndClearExpectations(&info);
    }

    static MeskConfigGeneration Generation(const std::string& uuid, uint64_t number,
                                           uint64_t timestamp) {
        MeskConfigGeneration generation;
        generation.uuid = uuid, generation.generation = number, generation.timestamp = timestamp;
        return generation;
    }
};

TEST_F(ClusterGetTest, MemberHostReportsEachFieldFromItsSourceInTemplateOrder) {
    ON_CALL(info, IsWitness()).WillByDefault(Return(true));
    {
        // The local time is asked for only after every other query.
        ::testing::InSequence order;
        EXPECT_CALL(info, GetConfigGeneration());
        EXPECT_CALL(host, GetFormattedSystemDateTime());
    }
    auto command = ClusterGet::New();
    auto output = Run(*command);
    EXPECT_TRUE(Errors(*output).empty() && output->IsComplete());
    EXPECT_EQ(FieldNames(output->GetRootObject()),
              FieldNames(command->GetOutputSpecInternal()->GetRootObject()));
    EXPECT_THAT(
        Shown(output->GetRootObject()),
        ElementsAre("Enabled=true", "Current Local Time=now", "Local Node UUID=local",
                    "Local Node Type=WITNESS", "Local Node State=AGENT",
                    "Local Node Health State=Healthy", "Sub-Cluster Master UUID=master",
                    "Sub-Cluster Backup UUID=backup",
                    "Sub-Cluster UUID=52a1c3e4-1b2c-4d3e-8f90-a1b2c3d4e5f6",
                    "Sub-Cluster Membership Entry Revision=42", "Sub-Cluster Member Count=2",
                    "Sub-Cluster Member UUIDs=member-a,member-b", "Sub-Cluster Membership UUID=ms",
                    "Unicast Mode Enabled=true", "Maintenance Mode State=OFF",
                    "Config Generation=g 9 0.000"));

    Settle();
    ON_CALL(info, IsWitness()).WillByDefault(Return(false));
    EXPECT_EQ(TextField(Run(*command)->GetRootObject(), "Local Node Type"), "NORMAL");
}

TEST_F(ClusterGetTest, ConfigGenerationShowsUuidNumberAndLocalTimestamp) {
    struct Case {
        const char* zone;
        MeskConfigGeneration generation;
        std::string expected;
    };
    const Case cases[] = {
        {"UTC", Generation("", 0, 0), "None 0 0.000"},
        {"UTC", Generation("", 3, 999), "None 3 0.999"},
        {"UTC", Generation("u", 1, 1000), "u 1 1970-01-01T00:00:01.000"},
        {"UTC", Generation("u", UINT64_MAX, 1500000000007),
         "u 18446744073709551615 2017-07-14T02:40:00.007"},
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

TEST_F(ClusterGetTest, RefusalOrFailureStillGivesACompleteReportWithTheFieldsSoFar) {
    struct Case {
        std::function<void()> script;
        std::string message, enabled;
    };
    const Case cases[] = {
        {[this] {
             SetEnabled(false);  // nothing more is asked
             EXPECT_CALL(info, IsWitness()).Times(0);
             EXPECT_CALL(host, GetInfoFromKOVRA(_, _, _, _, _, _, _, _, _)).Times(0);
         },
         "Mesk Clustering is not enabled on this host", "-"},
        {[this] { EXPECT_CALL(host, GetMeskPlugin()).WillOnce(Fail("boom")); }, "boom", "-"},
        {[this] {
             EXPECT_CALL(host, GetInfoFromKOVRA(_, _, _, _, _, _, _, _, _)).WillOnce(Fail("boom"));
         },
         "boom", "-"},
        {[this] { EXPECT_CALL(info, GetConfigGeneration()).WillOnce(Fail("boom")); }, "boom", "-"},
        {[this] { EXPECT_CALL(host, GetFormattedSystemDateTime()).WillOnce(Fail("boom")); }, "boom",
         "true"},
    };
    for (const auto& c : cases) {
        SetEnabled(true);
        c.script();
        auto output = Run(*ClusterGet::New());
        EXPECT_THAT(Errors(*output), ElementsAre(c.message));
        EXPECT_TRUE(output->IsComplete());
        auto shown = Shown(output->GetRootObject());
        ASSERT_EQ(shown.size(), 16u);
        EXPECT_EQ(shown[0], "Enabled=" + c.enabled);
        for (size_t i = 1; i < shown.size(); ++i) EXPECT_EQ(shown[i].back(), '-') << shown[i];
        Settle();
    }
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
