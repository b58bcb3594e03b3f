#include <string>
#include <vector>

#include "MockHost.h"
#include "commands/cluster/ClusterPreferredFaultDomainGet.h"
#include "commands/cluster/ClusterPreferredFaultDomainSet.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using namespace MeskTest;
using ::testing::_;
using ::testing::DoAll;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using ::testing::Return;
using ::testing::SetArgReferee;

std::string Repeat(const std::string& piece, size_t count) {
    std::string text;
    while (count-- > 0) text += piece;
    return text;
}

class PreferredFaultDomainTest : public HostTest {
  protected:
    void Settle() {
        ::testing::Mock::VerifyAndClearExpectations(&host);
        ::testing::Mock::VerifyAndClearExpectations(&info);
    }
};

TEST_F(PreferredFaultDomainTest, GetAnswersOnlyInAStretchedClusterWithTheLibrarysTexts) {
    const std::string notStretched =
        "Cannot get preferred fault domain if host is not in a stretched cluster.";
    struct Case {
        bool enabled, stretched, fails;
        std::string message;  // empty: reported
    };
    const Case cases[] = {
        {false, true, false, notStretched},  // stretching is not even asked
        {true, false, false, notStretched},
        {true, true, true, "Unable to get preferred fault domain name: boom"},
        {true, true, false, ""},
    };
    for (const auto& c : cases) {
        SetEnabled(c.enabled);
        ON_CALL(host, IsInStretchedCluster()).WillByDefault(Return(c.stretched));
        EXPECT_CALL(host, IsInStretchedCluster()).Times(c.enabled ? 1 : 0);
        if (c.fails) {
            ON_CALL(host, GetPreferredFaultDomainInfo(_, _)).WillByDefault(Fail("boom"));
        } else {
            // The library fills the id first, then the name.
            ON_CALL(host, GetPreferredFaultDomainInfo(_, _))
                .WillByDefault(DoAll(SetArgReferee<0>("id-1"), SetArgReferee<1>(" Site A ")));
        }
        EXPECT_CALL(host, GetPreferredFaultDomainInfo(_, _)).Times(c.enabled && c.stretched);
        auto output = Run(*ClusterPreferredFaultDomainGet::New());
        if (c.message.empty()) {
            EXPECT_THAT(Errors(*output), IsEmpty());
            EXPECT_TRUE(output->IsComplete());
            EXPECT_EQ(FieldNames(output->GetRootObject()),
                      (std::vector<std::string>{"Preferred Fault Domain Name",
                                                "Preferred Fault Domain Id"}));
            EXPECT_EQ(TextField(output->GetRootObject(), "Preferred Fault Domain Name"),
                      " Site A ");
            EXPECT_EQ(TextField(output->GetRootObject(), "Preferred Fault Domain Id"), "id-1");
        } else {
            EXPECT_THAT(Errors(*output), ElementsAre(c.message));
            EXPECT_TRUE(output->GetRootObject() == nullptr && !output->IsComplete());
        }
        Settle();
    }
}

TEST_F(PreferredFaultDomainTest, SetChecksTheNameBeforeTheWitnessRoleAndCountsCharacters) {
    const std::string tooLong = "Preferred Fault domain name cannot exceed 256 characters.";
    const std::string notWitness =
        "Cannot set preferred fault domain if the host is not a witness node.";
    struct Case {
        std::string name;
        bool witnessAsked, witness, fails;
        std::string message;  // empty: set
    };
    const Case cases[] = {
        {"", false, false, false, "Cannot set preferred fault domain name as empty."},
        {Repeat("x", 257), false, false, false, tooLong},
        {Repeat("\xe2\x82\xac", 257), false, true, false, tooLong},
        {Repeat("\xe2\x82\xac", 256), true, false, false, notWitness},  // 768 bytes pass
        {Repeat("x", 256), true, true, false, ""},
        {Repeat("\xe2\x82\xac", 150), true, true, false, ""},
        {"site-a", true, true, true, "Unable to set preferred fault domain name: boom"},
    };
    for (const auto& c : cases) {
        ON_CALL(host, IsWitnessNode()).WillByDefault(Return(c.witness));
        EXPECT_CALL(host, IsWitnessNode()).Times(c.witnessAsked);
        auto& set = EXPECT_CALL(info, SetPreferredFaultDomain(c.name))
                        .Times(c.witnessAsked && c.witness ? 1 : 0);
        if (c.fails) set.WillOnce(Fail("boom"));
        auto output = Run(*ClusterPreferredFaultDomainSet::New(), [&] {
            auto input = Kalmor::CallSpec::Input::New();
            input->SetParameter("preferred-fault-domain-name", c.name);
            return input;
        }());
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

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
