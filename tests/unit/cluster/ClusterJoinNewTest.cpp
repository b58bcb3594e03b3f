#include <cctype>
#include <cstring>
#include <functional>
#include <string>
#include <vector>

#include "MockHost.h"
#include "commands/cluster/ClusterJoin.h"
#include "commands/cluster/ClusterNew.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using namespace MeskTest;
using ::testing::_;
using ::testing::ElementsAre;
using ::testing::Invoke;
using ::testing::IsEmpty;
using ::testing::Return;

const char kUuid[] = "52a1c3e4-1b2c-4d3e-8f90-a1b2c3d4e5f6";
const char kInCluster[] =
    "The host is in a Mesk cluster and enabled for Mesk. You need to remove it from the cluster "
    "or disable Mesk.";

std::string Repeat(const std::string& piece, size_t count) {
    std::string text;
    while (count-- > 0) text += piece;
    return text;
}

// A join's options as the framework parses them; `domain` nullptr: option not given.
std::shared_ptr<Kalmor::CallSpec::Input> JoinInput(bool witness, const char* domain,
                                                   bool wait = false) {
    auto input = Kalmor::CallSpec::Input::New();
    input->SetParameter("cluster-uuid", kUuid);
    if (witness) input->SetFlag("witness-node");
    if (domain) input->SetParameter("witness-preferred-fault-domain", domain);
    if (wait) input->SetFlag("wait");
    return input;
}

class ClusterJoinNewTest : public HostTest {
  protected:
    void Settle() {
        ::testing::Mock::VerifyAndClearExpectations(&host);
        ::testing::Mock::VerifyAndClearExpectations(&info);
    }
};

TEST_F(ClusterJoinNewTest, JoinRefusalsComeInOrderAndNeverJoin) {
    const std::string tooLong = Repeat("\xc3\xa9", 257);
    struct Case {
        bool enabled;
        bool witness;
        const char* domain;
        std::string message;
    };
    const Case cases[] = {
        // An enabled host is refused whatever its options.
        {true, false, "", kInCluster},
        {true, true, nullptr, kInCluster},
        {true, true, "site-a", kInCluster},
        {false, true, nullptr,
         "If --witness-node is specified, --witness-preferred-fault-domain must also be "
         "specified."},
        {false, true, "", "Preferred fault domain name cannot be empty or exceed 256 characters."},
        {false, true, tooLong.c_str(),
         "Preferred fault domain name cannot be empty or exceed 256 characters."},
        {false, false, "",
         "--witness-preferred-fault-domain is valid only when --witness-node is specified."},
    };
    EXPECT_CALL(info, JoinCluster(_, _, _, _, _)).Times(0);
    for (const auto& c : cases) {
        SetEnabled(c.enabled);
        auto output = Run(*ClusterJoin::New(), JoinInput(c.witness, c.domain));
        EXPECT_THAT(Errors(*output), ElementsAre(c.message));
        EXPECT_TRUE(output->GetRootObject() == nullptr && !output->IsComplete());
    }
}

TEST_F(ClusterJoinNewTest, JoinPassesOptionsOnAndCountsCharactersNotBytes) {
    const std::string ascii256 = Repeat("x", 256), twoByte200 = Repeat("\xc3\xa9", 200);
    for (const char* domain : {"", "site-a", ascii256.c_str(), twoByte200.c_str()}) {
        const bool witness = *domain != '\0', wait = !witness;
        EXPECT_CALL(info, JoinCluster(UuidOf(kUuid), witness, domain, wait, 0));
        auto output =
            Run(*ClusterJoin::New(), JoinInput(witness, witness ? domain : nullptr, wait));
        EXPECT_THAT(Errors(*output), IsEmpty());
        EXPECT_TRUE(BoolResult(*output) && output->IsComplete());
        Settle();
    }
}

TEST_F(ClusterJoinNewTest, JoinFailureIsBareWithAFalseCompleteResult) {
    for (bool inConversion : {true, false}) {
        if (inConversion) {
            EXPECT_CALL(host, StringToMeskUuid(_)).WillOnce(Fail("bad uuid"));
        } else {
            EXPECT_CALL(info, JoinCluster(_, _, _, _, _)).WillOnce(Fail("bad uuid"));
        }
        auto output = Run(*ClusterJoin::New(), JoinInput(false, nullptr));
        EXPECT_THAT(Errors(*output), ElementsAre("bad uuid"));
        EXPECT_FALSE(BoolResult(*output));
        EXPECT_TRUE(output->IsComplete());
        Settle();
    }
}

TEST_F(ClusterJoinNewTest, NewCreatesTheClusterNamedByThePackedUuid) {
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
    auto output = Run(*ClusterNew::New());
    EXPECT_THAT(Errors(*output), IsEmpty());
    EXPECT_TRUE(BoolResult(*output) && output->IsComplete());
}

TEST_F(ClusterJoinNewTest, NewRefusalsCreateNothingAndFailuresArePrefixedAndFalse) {
    struct Case {
        std::function<void()> script;
        std::string message;
        bool result;  // false and complete; else no result, incomplete
    };
    const Case cases[] = {
        {[this] {
             SetEnabled(true);
             EXPECT_CALL(host, UUID_CreateRandom()).Times(0);
         },
         kInCluster, false},
        {[this] { EXPECT_CALL(host, UUID_CreateRandom()).WillOnce(Return(nullptr)); },
         "Unable to generate a UUID", false},
        {[this] {
             EXPECT_CALL(host, UUID_CreateRandom()).WillOnce(Invoke([] { return strdup("x"); }));
             EXPECT_CALL(host, UUID_PackText(_, _, 1)).WillOnce(Return(nullptr));
         },
         "Unable to generate a UUID", false},
        {[this] { EXPECT_CALL(info, GetClusterConfig()).WillOnce(Fail("boom")); },
         "Unable to create the new Mesk cluster: boom", true},
        {[this] { EXPECT_CALL(info, CreateCluster(_, _, _)).WillOnce(Fail("boom")); },
         "Unable to create the new Mesk cluster: boom", true},
    };
    for (const auto& c : cases) {
        SetEnabled(false);
        c.script();
        if (!c.result) EXPECT_CALL(info, CreateCluster(_, _, _)).Times(0);
        auto output = Run(*ClusterNew::New());
        EXPECT_THAT(Errors(*output), ElementsAre(c.message));
        EXPECT_EQ(output->IsComplete(), c.result);
        EXPECT_EQ(output->GetRootObject() != nullptr, c.result);
        if (c.result) {
            EXPECT_FALSE(BoolResult(*output));
        }
        Settle();
    }
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
