// The registered tree: how the plug-in hangs it into the framework's root, and the rules that
// every registered command follows (well-formed parameters, a result shape that matches its
// formatter, an object of its own). The tree itself and what each command declares (its
// description, type and parameters) are pinned by the checked-in command reference.
#include <gtest/gtest.h>

#include <cctype>
#include <set>
#include <stdexcept>
#include <typeinfo>

#include "autocli/AutoCli.h"

extern "C" void AutoCli_RegisterNamespaces(std::shared_ptr<Kalmor::AutoCli::NamespaceNode>* root);

namespace {

using Kalmor::AutoCli::CommandSpec;
using Kalmor::AutoCli::Namespace;
using Kalmor::MetaObj::MetaType;
using Node = std::shared_ptr<Kalmor::AutoCli::NamespaceNode>;

Node RegisteredRoot() {
    Node root = Namespace::New();
    AutoCli_RegisterNamespaces(&root);
    return root;
}

// Every command below `node` with its path, depth first in registration order. The caller
// keeps the root alive, since nodes know their parents only through it.
std::vector<std::pair<std::string, Node>> Commands(const Node& node, const std::string& path = "") {
    std::vector<std::pair<std::string, Node>> commands;
    for (const auto& name : node->GetNamespaceNodeNames()) {
        auto child = node->GetNamespaceNode(name);
        const std::string childPath = path.empty() ? name : path + " " + name;
        if (child->GetType() == Kalmor::AutoCli::NodeType::Command) {
            commands.emplace_back(childPath, child);
        }
        for (auto& entry : Commands(child, childPath)) commands.push_back(std::move(entry));
    }
    return commands;
}

TEST(Registry, ReusesAnExistingMeskNamespaceAndReplacesItsDescription) {
    Node root = Namespace::New();
    auto existing = Namespace::New();
    existing->SetDescription("made by another plug-in");
    existing->RegisterNamespaceNode(Namespace::New(), "other");
    root->RegisterNamespaceNode(existing, "mesk");

    AutoCli_RegisterNamespaces(&root);

    EXPECT_EQ(root->GetNamespaceNodeNames(), std::vector<std::string>{"mesk"});
    EXPECT_EQ(root->GetNamespaceNode("mesk"), existing);
    auto fresh = RegisteredRoot()->GetNamespaceNode("mesk");
    EXPECT_EQ(existing->GetDescription(), fresh->GetDescription());
    auto children = fresh->GetNamespaceNodeNames();
    children.insert(children.begin(), "other");
    EXPECT_EQ(existing->GetNamespaceNodeNames(), children);
}

TEST(Registry, RefusesAMeskNodeThatIsNotANamespace) {
    // A command registered as "mesk" by someone else: the plug-in must not treat it as an
    // empty namespace.
    auto command = RegisteredRoot()->ResolveNode({"mesk", "cluster", "get"});
    ASSERT_TRUE(command);
    Node root = Namespace::New();
    root->RegisterNamespaceNode(command, "mesk");
    EXPECT_THROW(AutoCli_RegisterNamespaces(&root), std::runtime_error);
    EXPECT_FALSE(root->GetNamespaceNode("mesk")->HasNamespaceNode("policy"));
}

TEST(CommandConformance, EveryCommandIsItsOwnObjectShapedForItsFormatter) {
    std::set<const Kalmor::AutoCli::NamespaceNode*> seen;
    auto root = RegisteredRoot();
    for (const auto& [path, node] : Commands(root)) {
        auto command = std::dynamic_pointer_cast<CommandSpec>(node);
        ASSERT_TRUE(command) << path;
        EXPECT_EQ(node->GetThis(), node) << path;
        EXPECT_TRUE(node->GetDispatcher()) << path;
        EXPECT_TRUE(seen.insert(node.get()).second) << path << " shares its object";

        auto output = command->GetOutputSpec();
        ASSERT_TRUE(output && output->GetRootObject()) << path;
        // Commands with a structured result choose a formatter; success flags do not. (Which
        // type each command has, the command reference pins.)
        const bool isFlag = output->GetRootObject()->GetType() == MetaType::META_BOOL;
        EXPECT_EQ(isFlag, command->GetDefaultOutputFormatter().empty()) << path;

        // Each call builds its declarations afresh, so that no caller can change another's
        // (scalars cannot be changed: the framework may hand out one object for all).
        EXPECT_NE(command->GetInputSpec(), command->GetInputSpec()) << path;
        if (!isFlag) {
            EXPECT_NE(output->GetRootObject(), command->GetOutputSpec()->GetRootObject()) << path;
        }
    }
    EXPECT_FALSE(seen.empty());

    // The ipv4 alias holds objects of its own, of the same classes as ip's.
    for (const std::string name : {"add", "remove", "set"}) {
        auto ip = root->ResolveNode({"mesk", "network", "ip", name});
        auto ipv4 = root->ResolveNode({"mesk", "network", "ipv4", name});
        ASSERT_TRUE(ip && ipv4) << name;
        EXPECT_EQ(typeid(*ip), typeid(*ipv4)) << name;
    }
}

TEST(CommandConformance, EveryParameterIsWellFormed) {
    auto root = RegisteredRoot();
    for (const auto& [path, node] : Commands(root)) {
        auto spec = std::dynamic_pointer_cast<CommandSpec>(node)->GetInputSpec();
        ASSERT_TRUE(spec) << path << ": a command without parameters has an empty declaration";
        std::set<std::string> shortNames;
        for (const auto& parameter : spec->GetParameters()) {
            const std::string where = path + " --" + parameter->GetName();
            for (char c : parameter->GetName()) {
                EXPECT_TRUE(std::islower(static_cast<unsigned char>(c)) || std::isdigit(c) ||
                            c == '-')
                    << where;
            }
            const std::string& shortName = parameter->GetShortName();
            if (!shortName.empty()) {
                EXPECT_EQ(shortName.size(), 1u) << where;
                EXPECT_TRUE(shortNames.insert(shortName).second) << where;
            }
            const bool hasEnum = parameter->GetDescription().find("%ENUM%") != std::string::npos;
            EXPECT_EQ(hasEnum, parameter->GetConstraint() != nullptr) << where;
        }
    }
}

}  // namespace
