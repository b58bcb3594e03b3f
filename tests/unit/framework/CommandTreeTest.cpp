#include "CommandTree.h"

#include <gtest/gtest.h>

#include <stdexcept>

#include "unit/framework/TestCommand.h"

namespace FrameworkTest {
namespace {

using Kalmor::AutoCli::Namespace;

TEST(CommandTree, RegistrationRefusesBadEntriesAndResolvingStopsAtCommands) {
    auto root = Namespace::New();
    auto mesk = root->SubNamespace("mesk");
    auto get = TestCommand::New("Get.");
    mesk->RegisterNamespaceNode(get, "get");
    EXPECT_EQ(mesk->SubNamespace("cluster"), mesk->SubNamespace("cluster"));
    EXPECT_EQ(root->ResolveNode({"mesk", "get"}), get);
    EXPECT_EQ(root->ResolveNode({"mesk", "get", "more"}), nullptr);

    EXPECT_THROW(mesk->RegisterNamespaceNode(nullptr, "x"), std::invalid_argument);
    EXPECT_THROW(mesk->RegisterNamespaceNode(Namespace::New(), ""), std::invalid_argument);
    EXPECT_THROW(mesk->RegisterNamespaceNode(Namespace::New(), "get"), std::invalid_argument);
    EXPECT_THROW(get->RegisterNamespaceNode(Namespace::New(), "x"), std::logic_error);
    EXPECT_EQ(mesk->GetNamespaceNodeNames(), (std::vector<std::string>{"get", "cluster"}));
}

}  // namespace
}  // namespace FrameworkTest
