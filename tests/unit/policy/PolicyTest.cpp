#include <cctype>

#include "MockHost.h"
#include "commands/policy/PolicyClearDefault.h"
#include "commands/policy/PolicyGetDefault.h"
#include "commands/policy/PolicySetDefault.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using namespace MeskTest;
using ::testing::_;
using ::testing::Return;
using PolicyTest = HostTest;

const std::string kRow = "{Policy Class=vmem, Policy Value=(a)}";

// A class whose default cannot be read is left out without a message. An empty class, given
// or not, asks for every class the library knows, in its order; a named one shows under the
// library's name of it.
TEST_F(PolicyTest, GetDefaultListsEachReadableClassUnderTheLibrarysName) {
    ON_CALL(host, GetMeskPolicyClasses())
        .WillByDefault(Return(std::vector<MeskPolicyClass>{
            HostCtl::Mesk::MESK_POLICY_CLASS_VMEM, HostCtl::Mesk::MESK_POLICY_CLASS_CLUSTER,
            HostCtl::Mesk::MESK_POLICY_CLASS_VDISK}));
    ON_CALL(host, MeskPolicyClassToString(HostCtl::Mesk::MESK_POLICY_CLASS_VDISK))
        .WillByDefault(Return("virtual-disk"));
    ON_CALL(info, GetDefaultPolicy("vmem")).WillByDefault(Return("(a)"));
    ON_CALL(info, GetDefaultPolicy("cluster")).WillByDefault(Fail("no default"));
    const std::string all = "[" + kRow + ", {Policy Class=virtual-disk, Policy Value=}], complete";
    EXPECT_EQ(Outcome(*Run(*PolicyGetDefault::New())), all);
    EXPECT_EQ(Outcome(*Run(*PolicyGetDefault::New(), "policy-class=")), all);
    EXPECT_EQ(Outcome(*Run(*PolicyGetDefault::New(), "policy-class=vmem")),
              "[" + kRow + "], complete");
    EXPECT_EQ(Outcome(*Run(*PolicyGetDefault::New(), "policy-class=cluster")), "[], complete");
    // A failing class conversion is no per-class failure: the bare message and no result.
    EXPECT_CALL(host, MeskPolicyClassToString(_)).WillOnce(Fail("x"));
    EXPECT_EQ(Outcome(*Run(*PolicyGetDefault::New())), "x; no result, incomplete");
}

// The class name and the policy go to the library unchanged; clear names no class. A failure
// gives the bare message and a false result that is still complete.
TEST_F(PolicyTest, SetAndClearPassOnWhatTheyAreGiven) {
    ON_CALL(info, SetDefaultPolicy(_, _)).WillByDefault(Record("SetDefaultPolicy"));
    ON_CALL(info, ClearDefaultPolicies()).WillByDefault(Record("ClearDefaultPolicies"));
    for (const bool fails : {false, true}) {
        calls.clear(), failure = fails ? "x" : "";
        const std::string outcome = fails ? "x; false, complete" : "true, complete";
        auto set =
            Run(*PolicySetDefault::New(), "policy-class=vmswap policy=((\"stripeWidth\"i2))");
        EXPECT_EQ(Outcome(*set), outcome);
        EXPECT_EQ(Outcome(*Run(*PolicyClearDefault::New())), outcome);
        EXPECT_EQ(calls, "SetDefaultPolicy(vmswap, ((\"stripeWidth\"i2))) ClearDefaultPolicies()");
    }
}

// The command reference pins the help's text but shows its newlines as blanks, so its lines
// are checked here: the sentence (M), then each option's explanation, which begins with its
// number (O), and its default (D), with a note (N) between the two for the third option; the
// last line ends in a newline.
TEST(PolicySetDefaultHelp, PutsEachOptionAndDefaultOnALineOfItsOwn) {
    const std::string help =
        PolicySetDefault::New()->GetInputSpecInternal()->FindParameter("policy")->GetDescription();
    std::string kinds;
    size_t start = 0;
    for (size_t end; (end = help.find('\n', start)) != std::string::npos; start = end + 1) {
        kinds += std::isdigit(static_cast<unsigned char>(help[start])) ? 'O' : help[start];
    }
    EXPECT_EQ(kinds, "MODODONDODODODOD");
    EXPECT_EQ(help.substr(0, help.find('\n')),
              "Mesk policy to set as default, in the form of a string. Options are: ");
    EXPECT_EQ(start, help.size());
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
