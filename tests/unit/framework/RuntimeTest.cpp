#include <gtest/gtest.h>

#include <stdexcept>

#include "ShellCmdHook.h"
#include "autocli/AutoCli.h"

namespace FrameworkTest {
namespace {

using namespace Kalmor::CallSpec;
using namespace Kalmor::MetaObj;
using Kalmor::AutoCli::AutoCli_ShellCmd;
using Kalmor::AutoCli::SetShellCmdHook;

TEST(Input, AbsentParametersReadAsEmptyAndFlagsAsPresentWithoutValue) {
    auto input = Input::New();
    std::vector<std::string> list{"stale"};
    input->GetParameterList("x", list);
    EXPECT_TRUE(list.empty());
    EXPECT_EQ(input->GetParameterInt("x"), 0);
    EXPECT_FALSE(input->GetParameterBool("x") || input->HasParameter("x") || input->IsFlagSet("x"));

    input->SetFlag("f");
    input->SetParameterInt("n", -9223372036854775807LL - 1);
    EXPECT_TRUE(input->IsFlagSet("f"));
    EXPECT_EQ(input->GetParameter("f"), "");
    EXPECT_EQ(input->GetParameterInt("n"), -9223372036854775807LL - 1);
}

TEST(MetaObjects, FieldsKeepTheirPlaceAndListsCheckTheirElements) {
    auto structure = MetaStruct::New("S");
    structure->SetField("A", MetaInt::New(1), MetaStruct::_docEmpty);
    structure->SetField("B", MetaString::New(), MetaStruct::_docEmpty);
    structure->SetField("A", MetaString::New("again"), MetaStruct::_docEmpty);
    ASSERT_EQ(structure->GetFields().size(), 2u);
    EXPECT_EQ(structure->GetFields()[0].name, "A");
    EXPECT_EQ(structure->GetField("A")->GetType(), META_STRING);
    EXPECT_EQ(structure->GetField("C"), nullptr);
    EXPECT_FALSE(std::static_pointer_cast<MetaString>(structure->GetField("B"))->HasValue());

    auto texts = MetaList::New(META_STRING);
    texts->Add("x");
    EXPECT_THROW(texts->Add(structure), std::logic_error);
    auto structures = MetaList::New(META_STRUCT, MetaStruct::New("S"));
    structures->Add(structure);
    EXPECT_THROW(structures->Add("x"), std::logic_error);
    EXPECT_THROW(structures->Add(std::shared_ptr<MetaStruct>()), std::logic_error);
    EXPECT_EQ(structures->Size(), 1u);
}

TEST(ShellCmd, RunsThroughTheShellWithInputAndExitStatus) {
    struct Case {
        std::string command;
        std::string input;
        int status;
        std::string output;
    };
    const std::string big(1 << 20, 'x');
    const std::vector<Case> cases = {
        {"echo hello; exit 3", "", 3, "hello\n"},
        {"tr a-z A-Z", "quiet\n", 0, "QUIET\n"},
        {"cat", big, 0, big},                        // both pipes fill up: no deadlock
        {"exit 0", big, 0, ""},                      // input never read: no SIGPIPE death
        {"kill -TERM $$", "", -1, ""},               // killed by a signal
        {"echo out; echo err >&2", "", 0, "out\n"},  // only standard output is captured
    };
    for (const auto& entry : cases) {
        std::string output = "stale";
        EXPECT_EQ(AutoCli_ShellCmd(entry.command, output, entry.input), entry.status)
            << entry.command;
        EXPECT_EQ(output, entry.output) << entry.command;
    }
}

TEST(ShellCmd, HookReplacesTheShellUntilCleared) {
    std::vector<std::string> seen;
    SetShellCmdHook(
        [&seen](const std::string& command, std::string& output, const std::string& input) {
            seen.push_back(command + "|" + input);
            output = "hooked";
            return 7;
        });
    std::string output;
    EXPECT_EQ(AutoCli_ShellCmd("rm -rf /nothing", output, "in"), 7);
    EXPECT_EQ(output, "hooked");
    EXPECT_EQ(seen, std::vector<std::string>{"rm -rf /nothing|in"});

    SetShellCmdHook(nullptr);
    EXPECT_EQ(AutoCli_ShellCmd("printf real", output, ""), 0);
    EXPECT_EQ(output, "real");
}

}  // namespace
}  // namespace FrameworkTest
