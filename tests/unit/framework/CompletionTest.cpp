#include "Completion.h"

#include <gtest/gtest.h>

#include <stdexcept>

#include "CommandLine.h"
#include "unit/framework/TestCommand.h"

namespace FrameworkTest {
namespace {

using Kalmor::AutoCli::Namespace;
namespace App = Kalmor::AutoCli::App;
using namespace Kalmor::CallSpec;

// A command whose declaration fails, as a broken plug-in's might.
class BrokenCommand : public TestCommand {
  public:
    std::shared_ptr<InputSpec> GetInputSpecInternal() override {
        throw std::runtime_error("declaration failed");
    }
};

// mesk other hello (a parameter of every kind), mesk shadow (its own --fields and -h),
// mesk broken.
std::shared_ptr<Namespace> Tree() {
    auto root = Namespace::New();
    auto mesk = root->SubNamespace("mesk");
    auto hello = TestCommand::New("Hello.");
    hello->inputSpec_ = EveryKind();
    mesk->SubNamespace("other")->RegisterNamespaceNode(hello, "hello");
    auto shadow = TestCommand::New("Shadow.");
    shadow->inputSpec_->AddParameter(Param("fields", PARAM_STRING, "h"));
    mesk->RegisterNamespaceNode(shadow, "shadow");
    mesk->RegisterNamespaceNode(std::make_shared<BrokenCommand>(), "broken");
    return root;
}

// Directives: 4 no file names, 1 nothing to offer (an error), 0 file names welcome (only for an
// option whose name says it is a path).
TEST(Completion, CandidatesAndDirectiveAtEachLevel) {
    const std::string globals = "--formatter --fields --no-header --debug --help";
    const std::string hello = "mesk other hello ";
    struct Case {
        std::string line;  // the words typed, the last one being completed
        std::string candidates;
        unsigned directive;
    };
    const std::vector<Case> cases = {
        // Namespaces and commands in registration order, after global options too.
        {"", "mesk", 4},
        {"mesk ", "other shadow broken", 4},
        {"--formatter json mesk --debug other h", "hello", 4},
        {"mesk nope ", "", 1},
        // Global options and their values.
        {"-", globals + " --list-commands --reference --version -h", 4},
        {"--formatter js", "json json-pretty", 4},
        // A command's options: long names, short ones once "-" is typed, given ones left out
        // unless repeatable.
        {hello, "--name --count --big --loud --wave --item --role " + globals, 4},
        {hello + "-n bob --wave -i a -",
         "--count --big --loud --item --role " + globals + " -c -l -i -r -h", 4},
        {hello + "--name=bob --n", "--no-header", 4},
        // Values: enumerations, booleans, none for integers or free text that is no path.
        {hello + "--role ", "witness node", 4},
        {hello + "--role=w", "--role=witness", 4},
        {hello + "-l ", "true false", 4},
        {hello + "--count ", "", 4},
        {hello + "--name ", "", 4},
        // A value already taken leaves the next word to options again.
        {hello + "--role node --r", "", 4},
        // A command's own --fields and -h hide autocli's.
        {"mesk shadow -", "--fields --formatter --no-header --debug --help -h", 4},
        {"mesk broken -", "", 1},
        {"completion ", "bash zsh fish", 4},
    };
    auto root = Tree();
    for (const auto& entry : cases) {
        App::Completion completion = App::Complete(Words(entry.line), root);
        std::string candidates;
        for (const auto& word : completion.candidates) {
            candidates += (candidates.empty() ? "" : " ") + word;
        }
        EXPECT_EQ(candidates, entry.candidates) << entry.line;
        EXPECT_EQ(completion.directive, entry.directive) << entry.line;
    }
}

TEST(Completion, BuiltinWordsOfTheCommandLine) {
    App::RunResult result = App::Run({"completion", "tcsh"}, Tree());
    EXPECT_EQ(result.status, 2);
    EXPECT_EQ(result.err, "autocli: completion: name the shell; valid choices: bash, zsh, fish\n");

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
