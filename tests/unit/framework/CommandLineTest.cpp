#include "CommandLine.h"

#include <gtest/gtest.h>

#include <stdexcept>

#include "unit/framework/TestCommand.h"

namespace FrameworkTest {
namespace {

using Kalmor::AutoCli::Namespace;
namespace App = Kalmor::AutoCli::App;
using Kalmor::AutoCli::App::RunResult;
using namespace Kalmor::MetaObj;
using namespace Kalmor::CallSpec;

std::shared_ptr<MetaStruct> NameResult(const std::string& name) {
    auto result = MetaStruct::New("Demo");
    result->SetField("Name", MetaString::New(name), MetaStruct::_docEmpty);
    return result;
}

struct Demo {
    std::shared_ptr<Namespace> root = Namespace::New();
    std::vector<std::shared_ptr<TestCommand>> commands;
};

// mesk demo: get, fail, throw, set --value N, false
Demo MakeDemo() {
    Demo demo;
    auto ns = demo.root->SubNamespace("mesk")->SubNamespace("demo");
    auto add = [&](const char* name, TestCommand::Body body) {
        auto command = TestCommand::New(std::string("The ") + name + " command.", body);
        command->template_ = NameResult("");
        ns->RegisterNamespaceNode(command, name);
        demo.commands.push_back(command);
        return command;
    };
    add("get", [](Input&, Output& out) {
        out.SetRootObject(NameResult("x"));
        out.SetComplete();
    });
    add("fail", [](Input&, Output& out) {
        out.SetRootObject(NameResult("partial"));
        out.AddErrorMessage("first problem");
        out.AddErrorMessage("second problem");
    });
    add("throw", [](Input&, Output&) { throw std::runtime_error("boom"); });
    auto set = add("set", [](Input&, Output& out) {
        out.SetRootObject(MetaBool::New(true));
        out.SetComplete();
    });
    set->inputSpec_->AddParameter(Param("value", PARAM_INT, "v", true, "The value."));
    add("false", [](Input&, Output& out) {
        out.SetRootObject(MetaBool::New(false));
        out.SetComplete();
    });
    return demo;
}

struct RunCase {
    std::vector<std::string> words;
    int status;
    std::string out;  // exact, or the beginning when it ends in "..."
    std::string err;
    bool runs;
};

TEST(CommandLine, StatusStreamsAndWhetherTheCommandRuns) {
    const std::string formatters = "simple, table, json, json-pretty, xml, csv";
    const std::vector<RunCase> cases = {
        {{"mesk", "demo", "get"}, 0, "Name: x\n", "", true},
        {{"--formatter=json", "mesk", "demo", "get"}, 0, "{\"Name\":\"x\"}\n", "", true},
        {{"mesk", "demo", "get", "--formatter", "json"}, 0, "{\"Name\":\"x\"}\n", "", true},
        {{"mesk", "demo", "get", "--debug"}, 0, "Name: x\n", "output complete: yes\n", true},
        {{"mesk", "demo", "fail", "--debug"},
         1,
         "Name: partial\n",
         "first problem\nsecond problem\noutput complete: no\n",
         true},
        {{"mesk", "demo", "throw"},
         1,
         "",
         "autocli: mesk demo throw: the command failed: boom\n",
         true},
        {{"mesk", "demo", "set", "-v", "1"}, 0, "", "", true},
        {{"mesk", "demo", "set", "-v", "1", "--formatter", "json"}, 0, "true\n", "", true},
        {{"mesk", "demo", "false"}, 0, "false\n", "", true},
        {{"mesk", "demo", "set"},
         2,
         "",
         "autocli: mesk demo set: missing required option '--value'\n",
         false},
        {{"mesk", "demo", "get", "extra"},
         2,
         "",
         "autocli: mesk demo get: unexpected argument 'extra'\n",
         false},
        {{"mesk", "demo", "get", "--formatter", "yaml"},
         2,
         "",
         "autocli: unknown formatter 'yaml'; valid choices: " + formatters + "\n",
         false},
        {{"mesk", "demo", "get", "--fields", "Nope"},
         2,
         "",
         "autocli: mesk demo get: unknown field 'Nope' for --fields; valid choices: Name\n",
         false},
        {{"mesk", "demo", "set", "-h"},
         0,
         "Usage: autocli [options] mesk demo set [command...",
         "",
         false},
        {{"--help", "mesk", "demo", "set", "-v", "x"},
         0,
         "Usage: autocli [options] mesk demo set [command...",
         "",
         false},
        {{"mesk", "demo", "--help"},
         0,
         "Usage: autocli [options] mesk demo <command>...",
         "",
         false},
        {{"mesk", "demo"},
         2,
         "Usage: autocli [options] mesk demo <command>...",
         "autocli: mesk demo: missing command; valid choices: get, fail, throw, set, false\n",
         false},
        {{},
         2,
         "Usage: autocli [options] <namespace>...",
         "autocli: missing command; valid choices: mesk\n",
         false},
        {{"mesk", "demo", "--bogus"},
         2,
         "",
         "autocli: mesk demo: unknown option '--bogus'\n",
         false},
        {{"--bogus", "mesk"}, 2, "", "autocli: unknown option '--bogus'\n", false},
        {{"mesk", "--formatter", "json", "demo", "--debug", "get"},
         0,
         "{\"Name\":\"x\"}\n",
         "output complete: yes\n",
         true},
        {{"mesk", "nope"},
         2,
         "",
         "autocli: 'nope' is not a namespace or command in 'mesk'; valid choices: demo\n",
         false},
        {{"--list-commands"},
         0,
         "mesk demo get\nmesk demo fail\nmesk demo throw\nmesk demo set\nmesk demo false\n",
         "",
         false},
    };
    for (const auto& entry : cases) {
        std::string shown;
        for (const auto& word : entry.words) {
            shown += "[" + word + "]";
        }
        Demo demo = MakeDemo();
        RunResult result = App::Run(entry.words, demo.root);
        EXPECT_EQ(result.status, entry.status) << shown;
        if (entry.out.size() > 3 && entry.out.compare(entry.out.size() - 3, 3, "...") == 0) {
            std::string prefix = entry.out.substr(0, entry.out.size() - 3);
            EXPECT_EQ(result.out.substr(0, prefix.size()), prefix) << shown;
        } else {
            EXPECT_EQ(result.out, entry.out) << shown;
        }
        EXPECT_EQ(result.err, entry.err) << shown;
        int runs = 0;
        for (const auto& command : demo.commands) {
            runs += command->runs;
        }
        EXPECT_EQ(runs, entry.runs ? 1 : 0) << shown;
    }
}

TEST(CommandLine, CommandReceivesTheParsedInput) {
    Demo demo = MakeDemo();
    RunResult result = App::Run({"mesk", "demo", "set", "--value=-42"}, demo.root);
    ASSERT_EQ(result.status, 0) << result.err;
    auto set = demo.commands[3];
    ASSERT_NE(set->lastInput, nullptr);
    EXPECT_EQ(set->lastInput->GetParameterInt("value"), -42);
}

}  // namespace
}  // namespace FrameworkTest
