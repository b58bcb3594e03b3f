#include "Completion.h"

#include <gtest/gtest.h>

#include <stdexcept>

#include "ArgumentParser.h"
#include "CommandLine.h"
#include "unit/framework/TestCommand.h"

namespace FrameworkTest {
namespace {

using Kalmor::AutoCli::Namespace;
using Kalmor::AutoCli::NamespaceNode;
namespace App = Kalmor::AutoCli::App;
using namespace Kalmor::CallSpec;

// A command whose declaration fails, as a broken plug-in's might.
class BrokenCommand : public TestCommand {
  public:
    std::shared_ptr<InputSpec> GetInputSpecInternal() override {
        throw std::runtime_error("declaration failed");
    }
};

// mesk storage {list, tag add}, mesk other hello (one parameter of every kind), mesk shadow
// (its own --fields and -h), mesk broken.
std::shared_ptr<Namespace> Tree() {
    auto root = Namespace::New();
    auto mesk = root->SubNamespace("mesk");
    auto storage = mesk->SubNamespace("storage");
    auto list = TestCommand::New("List.");
    list->inputSpec_->AddParameter(Param("device", PARAM_STRING, "d"));
    list->inputSpec_->AddParameter(Param("uuid", PARAM_STRING, "u"));
    storage->RegisterNamespaceNode(list, "list");
    storage->SubNamespace("tag")->RegisterNamespaceNode(TestCommand::New("Add."), "add");

    auto hello = TestCommand::New("Hello.");
    hello->inputSpec_->AddParameter(Param("name", PARAM_STRING, "n", true));
    auto count = Param("count", PARAM_INT, "c");
    count->SetConstraint(Range(0, 512));
    hello->inputSpec_->AddParameter(count);
    hello->inputSpec_->AddParameter(Param("loud", PARAM_BOOL, "l"));
    hello->inputSpec_->AddParameter(Param("wave", PARAM_FLAG, "w"));
    hello->inputSpec_->AddParameter(Param("item", PARAM_STRING_LIST, "i"));
    auto role = Param("role", PARAM_STRING, "r");
    role->SetConstraint(Enum({"witness", "node"}));
    hello->inputSpec_->AddParameter(role);
    mesk->SubNamespace("other")->RegisterNamespaceNode(hello, "hello");

    auto shadow = TestCommand::New("Shadow.");
    shadow->inputSpec_->AddParameter(Param("fields", PARAM_STRING, "h"));
    mesk->RegisterNamespaceNode(shadow, "shadow");
    mesk->RegisterNamespaceNode(std::make_shared<BrokenCommand>(), "broken");
    return root;
}

struct CompleteCase {
    std::vector<std::string> words;
    std::vector<std::string> candidates;
    unsigned directive;
};

TEST(Completion, CandidatesAndDirectiveAtEachLevel) {
    const std::vector<std::string> afterCommand = {"--formatter", "--fields", "--no-header",
                                                   "--debug", "--help"};
    const auto with = [](std::vector<std::string> list, const std::vector<std::string>& more) {
        list.insert(list.end(), more.begin(), more.end());
        return list;
    };
    const std::vector<CompleteCase> cases = {
        // Namespaces and commands, after global options too.
        {{""}, {"mesk"}, 4},
        {{"m"}, {"mesk"}, 4},
        {{"mesk", ""}, {"storage", "other", "shadow", "broken"}, 4},
        {{"mesk", "st"}, {"storage"}, 4},
        {{"mesk", "storage", "tag", ""}, {"add"}, 4},
        {{"--formatter", "json", "mesk", "--debug", "storage", "l"}, {"list"}, 4},
        {{"mesk", "nope", ""}, {}, 1},
        {{"mesk", "x"}, {}, 4},
        // Global options and their values.
        {{"-"},
         {"--formatter", "--fields", "--no-header", "--debug", "--help", "--list-commands",
          "--reference", "-h"},
         4},
        {{"--f"}, {"--formatter", "--fields"}, 4},
        {{"--formatter", "js"}, {"json", "json-pretty"}, 4},
        {{"--formatter=x"}, {"--formatter=xml"}, 4},
        {{"--fields", ""}, {}, 4},
        // A command's options: long names, short ones once "-" is typed, given ones left out
        // unless repeatable.
        {{"mesk", "other", "hello", ""},
         with({"--name", "--count", "--loud", "--wave", "--item", "--role"}, afterCommand),
         4},
        {{"mesk", "other", "hello", "-n", "bob", "--wave", "-i", "a", "-"},
         with(with({"--count", "--loud", "--item", "--role"}, afterCommand),
              {"-c", "-l", "-i", "-r", "-h"}),
         4},
        {{"mesk", "other", "hello", "--name=bob", "--n"}, {"--no-header"}, 4},
        {{"mesk", "other", "hello", "-r"}, {"-r"}, 4},
        // Values: enumerations, booleans, none for integers, files possible for free text.
        {{"mesk", "other", "hello", "--role", ""}, {"witness", "node"}, 4},
        {{"mesk", "other", "hello", "-r", "n"}, {"node"}, 4},
        {{"mesk", "other", "hello", "--role=w"}, {"--role=witness"}, 4},
        {{"mesk", "other", "hello", "--loud", ""}, {"true", "false"}, 4},
        {{"mesk", "other", "hello", "-l", "f"}, {"false"}, 4},
        {{"mesk", "other", "hello", "--count", ""}, {}, 4},
        {{"mesk", "other", "hello", "--name", ""}, {}, 0},
        {{"mesk", "other", "hello", "--wave="}, {}, 4},
        // A value already taken leaves the next word to options again.
        {{"mesk", "other", "hello", "--role", "node", "--r"}, {}, 4},
        // A command's own --fields and -h hide autocli's.
        {{"mesk", "shadow", "-"},
         {"--fields", "--formatter", "--no-header", "--debug", "--help", "-h"},
         4},
        {{"mesk", "broken", "-"}, {}, 1},
        {{"completion", ""}, {"bash"}, 4},
    };
    auto root = Tree();
    for (const auto& entry : cases) {
        std::string words;
        for (const auto& word : entry.words) {
            words += "[" + word + "]";
        }
        App::Completion completion = App::Complete(entry.words, root);
        EXPECT_EQ(completion.candidates, entry.candidates) << words;
        EXPECT_EQ(completion.directive, entry.directive) << words;
    }
}

TEST(Completion, OffersOnlyGlobalOptionsThatTheParserTakes) {
    for (const auto& option : App::Complete({"-"}, Tree()).candidates) {
        App::GlobalOptions globals;
        std::vector<std::string> words = {option, "value"};
        size_t index = 0;
        std::string error;
        EXPECT_TRUE(App::TakeGlobalOption(words, index, globals, error)) << option;
    }
}

TEST(Completion, BuiltinWordsOfTheCommandLine) {
    struct Case {
        std::vector<std::string> words;
        int status;
        std::string out;  // exact, or the beginning when it ends in "..."
        std::string err;
    };
    const std::vector<Case> cases = {
        {{"__complete", "mesk", "st"}, 0, "storage\n:4\n", ""},
        {{"__complete", "mesk", "nope", ""}, 0, ":1\n", ""},
        {{"__complete"}, 0, "mesk\n:4\n", ""},
        {{"completion", "bash"}, 0, "# bash completion for autocli...", ""},
        {{"completion"}, 2, "", "autocli: completion: name the shell; valid choices: bash\n"},
        {{"completion", "zsh"},
         2,
         "",
         "autocli: completion: name the shell; valid choices: bash\n"},
    };
    auto root = Tree();
    for (const auto& entry : cases) {
        App::RunResult result = App::Run(entry.words, root);
        const std::string& first = entry.words.front();
        EXPECT_EQ(result.status, entry.status) << first;
        if (entry.out.size() > 3 && entry.out.compare(entry.out.size() - 3, 3, "...") == 0) {
            EXPECT_EQ(result.out.substr(0, entry.out.size() - 3),
                      entry.out.substr(0, entry.out.size() - 3));
        } else {
            EXPECT_EQ(result.out, entry.out) << first;
        }
        EXPECT_EQ(result.err, entry.err) << first;
    }

    // A plug-in that registers "completion" at the root keeps it.
    auto command = TestCommand::New("Mine.", [](Input&, Output& out) {
        out.SetRootObject(Kalmor::MetaObj::MetaString::New("mine"));
    });
    auto taken = Namespace::New();
    taken->SubNamespace("completion")->RegisterNamespaceNode(command, "bash");
    EXPECT_EQ(App::Run({"completion", "bash"}, taken).out, "mine\n");
    EXPECT_EQ(App::Complete({"completion", ""}, taken).candidates,
              std::vector<std::string>{"bash"});
}

}  // namespace
}  // namespace FrameworkTest
