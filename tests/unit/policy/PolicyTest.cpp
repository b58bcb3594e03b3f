#include <cctype>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "MockHost.h"
#include "commands/policy/PolicyClearDefault.h"
#include "commands/policy/PolicyGetDefault.h"
#include "commands/policy/PolicySetDefault.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using Kalmor::CallSpec::Input;
using Kalmor::CallSpec::Output;
using namespace MeskTest;
using ::testing::_;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using ::testing::Return;
using Rows = std::vector<std::pair<std::string, std::string>>;

class PolicyTest : public HostTest {
  protected:
    // Runs getdefault, with `policy-class` set to *policyClass unless it is null.
    std::shared_ptr<Output> GetDefault(const char* policyClass) {
        auto input = Input::New();
        if (policyClass) input->SetParameter("policy-class", policyClass);
        return Run(*PolicyGetDefault::New(), input);
    }

    // The (class, value) rows of a getdefault result.
    static Rows RowsOf(const Output& output) {
        Rows rows;
        for (const auto& row : ListElements(output.GetRootObject())) {
            rows.emplace_back(TextField(row, "Policy Class"), TextField(row, "Policy Value"));
        }
        return rows;
    }
};

TEST_F(PolicyTest, GetDefaultListsTheLibrarysClassesInItsOrderLeavingOutFailingOnes) {
    ON_CALL(host, GetMeskPolicyClasses())
        .WillByDefault(Return(std::vector<MeskPolicyClass>{
            HostCtl::Mesk::MESK_POLICY_CLASS_VMEM, HostCtl::Mesk::MESK_POLICY_CLASS_CLUSTER,
            HostCtl::Mesk::MESK_POLICY_CLASS_VDISK}));
    ON_CALL(info, GetDefaultPolicy("vmem")).WillByDefault(Return("(a)"));
    ON_CALL(info, GetDefaultPolicy("cluster")).WillByDefault(Fail("no default"));
    // Without the option and with an empty value alike.
    for (const char* policyClass : {static_cast<const char*>(nullptr), ""}) {
        auto output = GetDefault(policyClass);
        EXPECT_THAT(Errors(*output), IsEmpty());
        EXPECT_TRUE(output->IsComplete());
        EXPECT_EQ(RowsOf(*output), (Rows{{"vmem", "(a)"}, {"vdisk", ""}}));
    }
}

TEST_F(PolicyTest, GetDefaultOfOneClassShowsTheLibrarysNameOfIt) {
    EXPECT_CALL(host, GetMeskPolicyClasses()).Times(0);
    ON_CALL(host, MeskPolicyClassToString(HostCtl::Mesk::MESK_POLICY_CLASS_VDISK))
        .WillByDefault(Return("virtual-disk"));
    EXPECT_CALL(info, GetDefaultPolicy("virtual-disk"))
        .WillOnce(Return("(b)"))
        .WillOnce(Fail("unreadable"));
    EXPECT_EQ(RowsOf(*GetDefault("vdisk")), (Rows{{"virtual-disk", "(b)"}}));
    // The only class failing leaves an empty table, still without a message.
    auto output = GetDefault("vdisk");
    EXPECT_THAT(Errors(*output), IsEmpty());
    EXPECT_TRUE(output->IsComplete());
    EXPECT_THAT(RowsOf(*output), IsEmpty());
}

TEST_F(PolicyTest, SetDefaultPassesTheClassNameAndPolicyUnchangedAndClearNamesNoClass) {
    auto input = Input::New();
    input->SetParameter("policy-class", "vmswap");
    input->SetParameter("policy", "((\"stripeWidth\" i2))");
    EXPECT_CALL(info, SetDefaultPolicy("vmswap", "((\"stripeWidth\" i2))"));
    EXPECT_CALL(host, StringToMeskPolicyClass(_)).Times(0);
    EXPECT_CALL(info, ClearDefaultPolicies());
    for (const auto& output :
         {Run(*PolicySetDefault::New(), input), Run(*PolicyClearDefault::New())}) {
        EXPECT_TRUE(Errors(*output).empty() && BoolResult(*output) && output->IsComplete());
    }
}

// The library's bare text; getdefault then has no result (a failing class conversion is not a
// per-class failure), while set and clear answer false and still complete.
TEST_F(PolicyTest, ResultAndCompletionAfterALibraryFailure) {
    EXPECT_CALL(host, MeskPolicyClassToString(_)).WillOnce(Fail("x"));
    EXPECT_CALL(info, SetDefaultPolicy(_, _)).WillOnce(Fail("x"));
    EXPECT_CALL(info, ClearDefaultPolicies()).WillOnce(Fail("x"));
    auto get = GetDefault(nullptr);
    EXPECT_THAT(Errors(*get), ElementsAre("x"));
    EXPECT_TRUE(get->GetRootObject() == nullptr && !get->IsComplete());
    for (const auto& output : {Run(*PolicySetDefault::New()), Run(*PolicyClearDefault::New())}) {
        EXPECT_THAT(Errors(*output), ElementsAre("x"));
        EXPECT_TRUE(!BoolResult(*output) && output->IsComplete());
    }
}

// The command reference shows newlines as blanks, so the help's lines are checked here: the
// sentence (M), then each option's explanation, which begins with its number (O), and its
// default (D), with a note (N) between the two for the third option. Each option opens with
// "N)name - " and a sentence of its own.
TEST(PolicyCommands, PolicyHelpPutsEachOptionAndDefaultOnALineOfItsOwn) {
    const std::string help =
        PolicySetDefault::New()->GetInputSpecInternal()->FindParameter("policy")->GetDescription();
    const std::string sentence = "Mesk policy to set as default, in the form of a string.";
    const std::vector<std::string> openings = {
        "1)cacheReservation - Flash capacity reserved as read cache for the storage object. ",
        "2)forceProvisioning - ",
        "3)hostFailuresToTolerate - ",
        "4)stripeWidth - ",
        "5)proportionalCapacity - ",
        "6)iopsLimit - ",
        "7)replicaPreference - "};
    std::string kinds;
    size_t start = 0;
    size_t option = 0;
    for (size_t end; (end = help.find('\n', start)) != std::string::npos; start = end + 1) {
        const std::string line = help.substr(start, end - start);
        if (!std::isdigit(static_cast<unsigned char>(line[0]))) {
            kinds += line[0];
            continue;
        }
        kinds += 'O';
        ASSERT_LT(option, openings.size());
        EXPECT_EQ(line.rfind(openings[option], 0), 0u) << line;
        EXPECT_NE(line.find(". "), std::string::npos) << line;  // a sentence, then more
        ++option;
    }
    EXPECT_EQ(kinds, "MODODONDODODODOD");
    EXPECT_EQ(help.substr(0, help.find('\n')), sentence + " Options are: ");
    EXPECT_EQ(help.size() - sentence.size(), 2656u);
    EXPECT_EQ(start, help.size());  // the last line ends in a newline
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
