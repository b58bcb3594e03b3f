#include <algorithm>
#include <functional>
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
using MeskTest::BoolResult;
using MeskTest::Errors;
using MeskTest::Fail;
using MeskTest::HostTest;
using MeskTest::MeskPolicyClass;
using MeskTest::TextField;
using ::testing::_;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using ::testing::Mock;
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
        for (const auto& row : MeskTest::ListElements(output.GetRootObject())) {
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
    auto output = GetDefault("vdisk");
    EXPECT_TRUE(output->IsComplete());
    EXPECT_EQ(RowsOf(*output), (Rows{{"virtual-disk", "(b)"}}));
    // The only class failing leaves an empty table, still without a message.
    output = GetDefault("vdisk");
    EXPECT_THAT(Errors(*output), IsEmpty());
    EXPECT_TRUE(output->IsComplete());
    EXPECT_THAT(RowsOf(*output), IsEmpty());
}

TEST_F(PolicyTest, SetDefaultPassesTheClassNameAndPolicyUnchanged) {
    auto input = Input::New();
    input->SetParameter("policy-class", "vmswap");
    input->SetParameter("policy", "((\"stripeWidth\" i2))");
    EXPECT_CALL(info, SetDefaultPolicy("vmswap", "((\"stripeWidth\" i2))"));
    EXPECT_CALL(host, StringToMeskPolicyClass(_)).Times(0);
    auto output = Run(*PolicySetDefault::New(), input);
    EXPECT_THAT(Errors(*output), IsEmpty());
    EXPECT_TRUE(BoolResult(*output));
    EXPECT_TRUE(output->IsComplete());
}

// Failures outside the reading of one class: the library's bare text, and for set and clear a
// false result that is still complete.
TEST_F(PolicyTest, ResultAndCompletionAfterALibraryFailure) {
    auto get = [] { return PolicyGetDefault::New(); };
    const struct {
        std::function<void()> breakHost;
        std::function<std::shared_ptr<Kalmor::AutoCli::Command>()> make;
        bool falseResult;
    } cases[] = {
        {[&] { EXPECT_CALL(host, GetMeskPolicyClasses()).WillOnce(Fail("x")); }, get, false},
        {[&] { EXPECT_CALL(host, MeskPolicyClassToString(_)).WillOnce(Fail("x")); }, get, false},
        {[&] { EXPECT_CALL(host, GetMeskPlugin()).WillOnce(Fail("x")); }, get, false},
        {[&] { EXPECT_CALL(info, SetDefaultPolicy(_, _)).WillOnce(Fail("x")); },
         [] { return PolicySetDefault::New(); }, true},
        {[&] { EXPECT_CALL(info, ClearDefaultPolicies()).WillOnce(Fail("x")); },
         [] { return PolicyClearDefault::New(); }, true},
    };
    for (const auto& c : cases) {
        c.breakHost();
        auto output = Run(*c.make());
        EXPECT_THAT(Errors(*output), ElementsAre("x"));
        EXPECT_EQ(output->IsComplete(), c.falseResult);
        if (c.falseResult) {
            EXPECT_FALSE(BoolResult(*output));
        } else {
            EXPECT_EQ(output->GetRootObject(), nullptr);
        }
        Mock::VerifyAndClearExpectations(&info);
        Mock::VerifyAndClearExpectations(&host);
    }
}

// After its first sentence the help of `policy` lists seven options, one line each, each
// followed by a line with its default; the third has a note line between the two.
TEST(PolicyCommands, PolicyHelpListsTheSevenOptionsWithTheirDefaults) {
    const std::string help =
        PolicySetDefault::New()->GetInputSpecInternal()->FindParameter("policy")->GetDescription();
    const std::string sentence = "Mesk policy to set as default, in the form of a string.";
    ASSERT_EQ(help.substr(0, sentence.size()), sentence);
    const std::string options = help.substr(sentence.size());
    EXPECT_EQ(options.size(), 2656u);
    EXPECT_EQ(std::count(options.begin(), options.end(), '\n'), 16);

    std::vector<std::string> lines;
    for (size_t start = 0, end; (end = options.find('\n', start)) != std::string::npos;
         start = end + 1) {
        lines.push_back(options.substr(start, end - start));
    }
    ASSERT_EQ(lines.size(), 16u);
    EXPECT_EQ(lines[0], " Options are: ");
    EXPECT_EQ(lines.back(), "Default value: RAID-1.");
    size_t line = 1;
    int number = 0;
    for (const char* name :
         {"cacheReservation", "forceProvisioning", "hostFailuresToTolerate", "stripeWidth",
          "proportionalCapacity", "iopsLimit", "replicaPreference"}) {
        const std::string head = std::to_string(++number) + ")" + name + " - ";
        EXPECT_EQ(lines[line++].rfind(head, 0), 0u) << head;
        if (std::string(name) == "hostFailuresToTolerate") {
            EXPECT_EQ(lines[line++].rfind("Note: A host which is not part of a fault domain is "
                                          "counted as its own single-host fault domain.",
                                          0),
                      0u);
        }
        EXPECT_EQ(lines[line++].rfind("Default value: ", 0), 0u) << name;
    }
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
