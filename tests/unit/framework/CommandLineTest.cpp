#include "CommandLine.h"

#include <gtest/gtest.h>

#include <stdexcept>

#include "unit/framework/TestCommand.h"

namespace FrameworkTest {
namespace {

using Kalmor::AutoCli::Namespace;
namespace App = Kalmor::AutoCli::App;
using namespace Kalmor::MetaObj;
using namespace Kalmor::CallSpec;

std::shared_ptr<MetaStruct> NameResult(const std::string& name) {
    auto result = MetaStruct::New("Demo");
    result->SetField("Name", MetaString::New(name), MetaStruct::_docEmpty);
    return result;
}

// mesk demo: get, fail (two errors after a partial result), throw, set --value N (a bare
// true), false (a bare false).
std::shared_ptr<Namespace> MakeDemo(std::vector<std::shared_ptr<TestCommand>>& commands) {
    auto root = Namespace::New();
    auto ns = root->SubNamespace("mesk")->SubNamespace("demo");
    auto add = [&](const char* name, std::shared_ptr<MetaObject> result,
                   std::vector<std::string> errors) {
        auto command = TestCommand::New(name, [=](Input&, Output& out) {
            if (!result) throw std::runtime_error("boom");
            out.SetRootObject(result);
            for (const auto& error : errors) out.AddErrorMessage(error);
            if (errors.empty()) out.SetComplete();
        });
        command->template_ = NameResult("");
        ns->RegisterNamespaceNode(command, name);
        commands.push_back(command);
        return command;
    };
    add("get", NameResult("x"), {});
    add("fail", NameResult("partial"), {"first problem", "second problem"});
    add("throw", nullptr, {});
    add("set", MetaBool::New(true), {})
        ->inputSpec_->AddParameter(Param("value", PARAM_INT, "v", true, "The value."));
    add("false", MetaBool::New(false), {});
    return root;
}

TEST(CommandLine, StatusStreamsAndWhetherTheCommandRuns) {
    struct Case {
        std::string line;
        int status;
        bool runs;
        std::string out;  // exact, or the beginning when it ends in "..."
        std::string err;
    };
    const std::string usage = "Usage: autocli [options] mesk demo ";
    const std::vector<Case> cases = {
        {"mesk demo get", 0, true, "Name: x\n", ""},
        {"mesk --formatter json demo --debug get", 0, true, "{\"Name\":\"x\"}\n",
         "output complete: yes\n"},
        // Errors the command reports follow its partial result; the status is 1.
        {"mesk demo fail --debug", 1, true, "Name: partial\n",
         "first problem\nsecond problem\noutput complete: no\n"},
        {"mesk demo throw", 1, true, "", "autocli: mesk demo throw: the command failed: boom\n"},
        // A bare true says nothing; a bare false is printed but is not a failure.
        {"mesk demo set -v 1", 0, true, "", ""},
        {"mesk demo false", 0, true, "false\n", ""},
        {"mesk demo get --formatter yaml", 2, false, "",
         "autocli: unknown formatter 'yaml'; valid choices: simple, table, json, json-pretty, xml, "
         "csv\n"},
        {"mesk demo get --fields Nope", 2, false, "",
         "autocli: mesk demo get: unknown field 'Nope' for --fields; valid choices: Name\n"},
        // Help wins over everything else on the line and runs nothing.
        {"--help mesk demo set -v x", 0, false, usage + "set [command...", ""},
        // A path that stops at a namespace prints its help and fails.
        {"mesk demo", 2, false, usage + "<command>...",
         "autocli: mesk demo: missing command; valid choices: get, fail, throw, set, false\n"},
        {"", 2, false, "Usage: autocli [options] <namespace>...",
         "autocli: missing command; valid choices: mesk\n"},
        {"mesk demo nope", 2, false, "",
         "autocli: 'nope' is not a namespace or command in 'mesk demo'; valid choices: get, fail, "
         "throw, set, false\n"},
        {"mesk --reference demo", 0, false, "# Command reference: `mesk demo`\n...", ""},
        {"mesk demo get --reference", 0, false, "# Command reference: `mesk demo get`\n...", ""},
        {"mesk demo set --reference --formatter json", 0, false,
         R"({"commands":[{"path":"mesk demo set","description":"set","type":null,)"
         R"("defaultFormatter":null,"parameters":[{"name":"value","short":"v","kind":"integer",)"
         R"("list":false,"required":true,"help":"The value."}],"output":{"$schema":)"
         R"("https://json-schema.org/draft/2020-12/schema","title":"Demo","type":"object",)"
         R"("properties":{"Name":{"type":["string","null"]}},"required":["Name"],)"
         R"("additionalProperties":false}}]})"
         "\n",
         ""},
        {"--reference --formatter csv", 2, false, "",
         "autocli: --reference is Markdown, or JSON with --formatter json or json-pretty; not "
         "'csv'\n"},
        {"--list-commands", 0, false,
         "mesk demo get\nmesk demo fail\nmesk demo throw\nmesk demo set\nmesk demo false\n", ""},
    };
    for (const auto& entry : cases) {
        SCOPED_TRACE(entry.line);
        std::vector<std::shared_ptr<TestCommand>> commands;
        auto words = entry.line.empty() ? std::vector<std::string>() : Words(entry.line);
        App::RunResult result = App::Run(words, MakeDemo(commands));
        EXPECT_EQ(result.status, entry.status);
        const size_t dots = entry.out.rfind("...");
        if (dots != std::string::npos && dots + 3 == entry.out.size()) {
            EXPECT_EQ(result.out.substr(0, dots), entry.out.substr(0, dots));
        } else {
            EXPECT_EQ(result.out, entry.out);
        }
        EXPECT_EQ(result.err, entry.err);
        int runs = 0;
        for (const auto& command : commands) runs += command->runs;
        EXPECT_EQ(runs, entry.runs ? 1 : 0);
    }
}

}  // namespace
}  // namespace FrameworkTest
