#include <gtest/gtest.h>

#include <set>
#include <stdexcept>
#include <typeinfo>

#include "unit/registry/RegisteredTree.h"

namespace RegistryTest {
namespace {

using Kalmor::AutoCli::Namespace;
using Kalmor::AutoCli::NodeType;

TEST(Registry, BuildsTheWholeTreeInRegistrationOrder) {
    auto root = RegisteredRoot();
    EXPECT_EQ(root->GetNamespaceNodeNames(), std::vector<std::string>{"mesk"});
    // One line per namespace, depth first: its children in order, namespaces marked with "/".
    auto mesk = root->GetNamespaceNode("mesk");
    std::vector<std::pair<std::string, Node>> nodes = {{"mesk", mesk}};
    Walk(mesk, "mesk", nodes);
    std::vector<std::string> lines;
    for (const auto& [path, node] : nodes) {
        if (node->GetType() != NodeType::Namespace) continue;
        std::string line = path + ":";
        for (const auto& name : node->GetNamespaceNodeNames()) {
            const bool isNamespace = node->GetNamespaceNode(name)->GetType() == NodeType::Namespace;
            line += " " + name + (isNamespace ? "/" : "");
        }
        lines.push_back(line);
    }
    const std::vector<std::string> expected = {
        "mesk: policy/ datastore/ storage/ network/ cluster/ trace/ maintenancemode/ faultdomain/ "
        "resync/",
        "mesk policy: getdefault setdefault cleardefault",
        "mesk datastore: name/",
        "mesk datastore name: get set",
        "mesk storage: add remove list automode/ diskgroup/ tag/",
        "mesk storage automode: get set",
        "mesk storage diskgroup: mount unmount",
        "mesk storage tag: add remove",
        "mesk network: remove restore clear list ip/ ipv4/",
        "mesk network ip: add remove set",
        "mesk network ipv4: add remove set",
        "mesk cluster: join leave get restore new unicastagent/ preferredfaultdomain/",
        "mesk cluster unicastagent: add remove list clear",
        "mesk cluster preferredfaultdomain: get set",
        "mesk trace: set get",
        "mesk maintenancemode: cancel",
        "mesk faultdomain: set get reset",
        "mesk resync: throttle/ bandwidth/",
        "mesk resync throttle: set get",
        "mesk resync bandwidth: get",
    };
    EXPECT_EQ(lines, expected);
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
    EXPECT_EQ(existing->GetDescription(), "Orvane Mesk commands");
    const std::vector<std::string> children = {
        "other",   "policy", "datastore",       "storage",     "network",
        "cluster", "trace",  "maintenancemode", "faultdomain", "resync"};
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

TEST(Registry, EveryCommandIsItsOwnObjectAndKnowsItsPlace) {
    std::set<const Kalmor::AutoCli::NamespaceNode*> seen;
    auto root = RegisteredRoot();
    for (const auto& [path, node] : Commands(root)) {
        EXPECT_EQ(node->GetThis(), node) << path;
        EXPECT_EQ(node->GetPathString(' '), path);
        EXPECT_TRUE(node->GetDispatcher()) << path;
        EXPECT_TRUE(seen.insert(node.get()).second) << path << " shares its object";
    }
    EXPECT_EQ(seen.size(), 44u);

    // The ipv4 alias holds objects of its own, of the same classes as ip's.
    for (const std::string name : {"add", "remove", "set"}) {
        auto ip = root->ResolveNode({"mesk", "network", "ip", name});
        auto ipv4 = root->ResolveNode({"mesk", "network", "ipv4", name});
        ASSERT_TRUE(ip && ipv4) << name;
        EXPECT_EQ(typeid(*ip), typeid(*ipv4)) << name;
    }
}

}  // namespace
}  // namespace RegistryTest
