#include "CommandTree.h"

#include <gtest/gtest.h>

#include <stdexcept>

#include "unit/framework/TestCommand.h"

namespace FrameworkTest {
namespace {

using Kalmor::AutoCli::Namespace;
using Kalmor::AutoCli::NamespaceNode;
using Kalmor::AutoCli::NodeType;
using Kalmor::AutoCli::App::ListCommands;
using Kalmor::AutoCli::App::ResolvePath;

// root
//   mesk
//     cluster: get, unicastagent: add, list
//     network: list
std::shared_ptr<Namespace> MakeRoot() {
    auto root = Namespace::New();
    auto mesk = root->SubNamespace("mesk");
    auto cluster = mesk->SubNamespace("cluster");
    cluster->RegisterNamespaceNode(TestCommand::New("get"), "get");
    auto agents = cluster->SubNamespace("unicastagent");
    agents->RegisterNamespaceNode(TestCommand::New("add"), "add");
    agents->RegisterNamespaceNode(TestCommand::New("list"), "list");
    mesk->SubNamespace("network")->RegisterNamespaceNode(TestCommand::New("list"), "list");
    return root;
}

TEST(CommandTree, RegistrationKeepsOrderParentsAndRefusesBadEntries) {
    auto root = MakeRoot();
    auto mesk = root->GetNamespaceNode("mesk");
    EXPECT_EQ(mesk->GetNamespaceNodeNames(), (std::vector<std::string>{"cluster", "network"}));
    EXPECT_EQ(mesk->SubNamespace("cluster"), mesk->GetNamespaceNode("cluster"));

    auto add = root->ResolveNode({"mesk", "cluster", "unicastagent", "add"});
    ASSERT_NE(add, nullptr);
    EXPECT_EQ(add->GetType(), NodeType::Command);
    EXPECT_EQ(add->GetPath(), (std::vector<std::string>{"mesk", "cluster", "unicastagent", "add"}));
    EXPECT_EQ(add->GetPathString(' '), "mesk cluster unicastagent add");
    EXPECT_EQ(add->GetName(), "add");
    EXPECT_EQ(add->GetThis(), add);
    EXPECT_EQ(add->GetDispatcher().get(), dynamic_cast<Kalmor::CallSpec::CallTarget*>(add.get()));
    EXPECT_EQ(mesk->GetDispatcher(), nullptr);
    EXPECT_EQ(root->GetPathString(' '), "");
    EXPECT_EQ(root->ResolveNode({}), root);
    EXPECT_EQ(root->ResolveNode({"mesk", "nope"}), nullptr);
    EXPECT_EQ(root->ResolveNode({"mesk", "network", "list", "more"}), nullptr);

    EXPECT_THROW(mesk->RegisterNamespaceNode(nullptr, "x"), std::invalid_argument);
    EXPECT_THROW(mesk->RegisterNamespaceNode(Namespace::New(), ""), std::invalid_argument);
    EXPECT_THROW(mesk->RegisterNamespaceNode(Namespace::New(), "cluster"), std::invalid_argument);
    EXPECT_THROW(add->RegisterNamespaceNode(Namespace::New(), "x"), std::logic_error);
    EXPECT_EQ(mesk->GetNamespaceNodeNames().size(), 2u);
}

TEST(CommandTree, ResolvePathStopsAtCommandsAndOptionsAndNamesTheChoices) {
    struct Case {
        std::vector<std::string> words;
        std::string node;  // path of the node reached
        size_t next;
        std::string error;
    };
    const std::vector<Case> cases = {
        {{"mesk", "cluster", "get", "--x"}, "mesk cluster get", 3, ""},
        {{"mesk", "cluster", "get", "extra"}, "mesk cluster get", 3, ""},
        {{"mesk", "cluster", "--help"}, "mesk cluster", 2, ""},
        {{}, "", 0, ""},
        {{"mesk", "clustr"},
         "",
         0,
         "'clustr' is not a namespace or command in 'mesk'; valid choices: cluster, network"},
        {{"foo"}, "", 0, "'foo' is not a namespace or command; valid choices: mesk"},
        {{"mesk", "cluster", "unicastagent", "remove"},
         "",
         0,
         "'remove' is not a namespace or command in 'mesk cluster unicastagent'; valid choices: "
         "add, list"},
    };
    auto root = MakeRoot();
    for (const auto& entry : cases) {
        auto resolution = ResolvePath(root, entry.words, 0);
        EXPECT_EQ(resolution.error, entry.error);
        if (entry.error.empty()) {
            EXPECT_EQ(resolution.node->GetPathString(' '), entry.node);
            EXPECT_EQ(resolution.next, entry.next);
        }
    }
    auto empty = Namespace::New();
    EXPECT_EQ(ResolvePath(empty, {"mesk"}, 0).error,
              "'mesk' is not a namespace or command; no commands are registered");
}

TEST(CommandTree, ListCommandsGivesEveryPathInRegistrationOrder) {
    auto root = MakeRoot();
    EXPECT_EQ(ListCommands(*root),
              "mesk cluster get\n"
              "mesk cluster unicastagent add\n"
              "mesk cluster unicastagent list\n"
              "mesk network list\n");
    EXPECT_EQ(ListCommands(*root->ResolveNode({"mesk", "network"})), "mesk network list\n");
}

}  // namespace
}  // namespace FrameworkTest
