#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <typeinfo>
#include <vector>

#include "autocli/AutoCli.h"

extern "C" void AutoCli_RegisterNamespaces(std::shared_ptr<Kalmor::AutoCli::NamespaceNode>* root);

namespace {

using Kalmor::AutoCli::Namespace;
using Kalmor::AutoCli::NamespaceNode;
using Kalmor::AutoCli::NodeType;

std::shared_ptr<NamespaceNode> RegisteredRoot() {
    std::shared_ptr<NamespaceNode> root = Namespace::New();
    AutoCli_RegisterNamespaces(&root);
    return root;
}

// Every node below `node`, depth first in registration order, as "kind path" lines.
void Walk(const std::shared_ptr<NamespaceNode>& node, const std::string& path,
          std::vector<std::string>& lines) {
    for (const auto& name : node->GetNamespaceNodeNames()) {
        auto child = node->GetNamespaceNode(name);
        const std::string childPath = path.empty() ? name : path + " " + name;
        const bool isCommand = child->GetType() == NodeType::Command;
        lines.push_back((isCommand ? "command " : "namespace ") + childPath);
        Walk(child, childPath, lines);
    }
}

TEST(Registry, BuildsTheWholeTreeInRegistrationOrder) {
    std::vector<std::string> lines;
    Walk(RegisteredRoot(), "", lines);
    const std::vector<std::string> expected = {
        "namespace mesk",
        "namespace mesk policy",
        "command mesk policy getdefault",
        "command mesk policy setdefault",
        "command mesk policy cleardefault",
        "namespace mesk datastore",
        "namespace mesk datastore name",
        "command mesk datastore name get",
        "command mesk datastore name set",
        "namespace mesk storage",
        "command mesk storage add",
        "command mesk storage remove",
        "command mesk storage list",
        "namespace mesk storage automode",
        "command mesk storage automode get",
        "command mesk storage automode set",
        "namespace mesk storage diskgroup",
        "command mesk storage diskgroup mount",
        "command mesk storage diskgroup unmount",
        "namespace mesk storage tag",
        "command mesk storage tag add",
        "command mesk storage tag remove",
        "namespace mesk network",
        "command mesk network remove",
        "command mesk network restore",
        "command mesk network clear",
        "command mesk network list",
        "namespace mesk network ip",
        "command mesk network ip add",
        "command mesk network ip remove",
        "command mesk network ip set",
        "namespace mesk network ipv4",
        "command mesk network ipv4 add",
        "command mesk network ipv4 remove",
        "command mesk network ipv4 set",
        "namespace mesk cluster",
        "command mesk cluster join",
        "command mesk cluster leave",
        "command mesk cluster get",
        "command mesk cluster restore",
        "command mesk cluster new",
        "namespace mesk cluster unicastagent",
        "command mesk cluster unicastagent add",
        "command mesk cluster unicastagent remove",
        "command mesk cluster unicastagent list",
        "command mesk cluster unicastagent clear",
        "namespace mesk cluster preferredfaultdomain",
        "command mesk cluster preferredfaultdomain get",
        "command mesk cluster preferredfaultdomain set",
        "namespace mesk trace",
        "command mesk trace set",
        "command mesk trace get",
        "namespace mesk maintenancemode",
        "command mesk maintenancemode cancel",
        "namespace mesk faultdomain",
        "command mesk faultdomain set",
        "command mesk faultdomain get",
        "command mesk faultdomain reset",
        "namespace mesk resync",
        "namespace mesk resync throttle",
        "command mesk resync throttle set",
        "command mesk resync throttle get",
        "namespace mesk resync bandwidth",
        "command mesk resync bandwidth get",
    };
    EXPECT_EQ(lines, expected);
}

TEST(Registry, NamespaceDescriptions) {
    auto root = RegisteredRoot();
    const std::vector<std::pair<std::vector<std::string>, std::string>> table = {
        {{"mesk"}, "Orvane Mesk commands"},
        {{"mesk", "policy"}, "Commands for Mesk storage policy configuration"},
        {{"mesk", "datastore"}, "Commands for Mesk datastore configuration"},
        {{"mesk", "datastore", "name"}, "Commands for configuring Mesk datastore name."},
        {{"mesk", "storage"}, "Commands for Mesk physical storage configuration"},
        {{"mesk", "storage", "automode"}, "Commands for configuring Mesk storage auto claim mode."},
        {{"mesk", "storage", "diskgroup"}, "Commands for configuring Mesk diskgroups"},
        {{"mesk", "storage", "tag"}, "Commands to add/remove tags for Mesk storage"},
        {{"mesk", "network"}, "Commands for Mesk host network configuration"},
        {{"mesk", "network", "ip"}, "Commands for configuring IP network for Mesk."},
        {{"mesk", "network", "ipv4"}, "Compatibility alias for \"ip\""},
        {{"mesk", "cluster"}, "Commands for Mesk host cluster configuration"},
        {{"mesk", "cluster", "unicastagent"}, "Commands for configuring unicast agents for Mesk."},
        {{"mesk", "cluster", "preferredfaultdomain"},
         "Commands for configuring a preferred fault domain for Mesk."},
        {{"mesk", "trace"}, "Commands for Mesk trace configuration"},
        {{"mesk", "maintenancemode"}, "Commands for Mesk maintenance mode operation"},
        {{"mesk", "faultdomain"}, "Commands for Mesk fault domain configuration"},
        {{"mesk", "resync"}, "Commands for Mesk resync configuration"},
        {{"mesk", "resync", "throttle"}, "Commands for Mesk resync throttling"},
        {{"mesk", "resync", "bandwidth"}, "Commands for Mesk resync bandwidth"},
    };
    for (const auto& [path, description] : table) {
        auto node = root->ResolveNode(path);
        ASSERT_TRUE(node) << path.back();
        EXPECT_EQ(node->GetType(), NodeType::Namespace) << path.back();
        EXPECT_EQ(node->GetDescription(), description) << path.back();
    }
}

TEST(Registry, AddsExactlyOneMeskToAnEmptyRoot) {
    auto root = RegisteredRoot();
    EXPECT_EQ(root->GetNamespaceNodeNames(), std::vector<std::string>{"mesk"});
}

TEST(Registry, ReusesAnExistingMeskNamespaceAndReplacesItsDescription) {
    std::shared_ptr<NamespaceNode> root = Namespace::New();
    auto existing = Namespace::New();
    existing->SetDescription("made by another plug-in");
    auto other = Namespace::New();
    existing->RegisterNamespaceNode(other, "other");
    root->RegisterNamespaceNode(existing, "mesk");

    AutoCli_RegisterNamespaces(&root);

    EXPECT_EQ(root->GetNamespaceNodeNames(), std::vector<std::string>{"mesk"});
    auto mesk = root->GetNamespaceNode("mesk");
    EXPECT_EQ(mesk, existing);
    EXPECT_EQ(mesk->GetDescription(), "Orvane Mesk commands");
    const std::vector<std::string> children = {
        "other",   "policy", "datastore",       "storage",     "network",
        "cluster", "trace",  "maintenancemode", "faultdomain", "resync"};
    EXPECT_EQ(mesk->GetNamespaceNodeNames(), children);
}

TEST(Registry, RefusesAMeskNodeThatIsNotANamespace) {
    // A command registered as "mesk" by someone else: the plug-in must not treat it as an
    // empty namespace.
    std::shared_ptr<NamespaceNode> scratch = Namespace::New();
    AutoCli_RegisterNamespaces(&scratch);
    auto command = scratch->ResolveNode({"mesk", "cluster", "get"});
    ASSERT_TRUE(command);

    std::shared_ptr<NamespaceNode> root = Namespace::New();
    root->RegisterNamespaceNode(command, "mesk");
    EXPECT_THROW(AutoCli_RegisterNamespaces(&root), std::runtime_error);
    EXPECT_FALSE(root->GetNamespaceNode("mesk")->HasNamespaceNode("policy"));
}

TEST(Registry, IpAndIpv4HoldDistinctObjectsOfTheSameClasses) {
    auto root = RegisteredRoot();
    for (const std::string name : {"add", "remove", "set"}) {
        auto ip = root->ResolveNode({"mesk", "network", "ip", name});
        auto ipv4 = root->ResolveNode({"mesk", "network", "ipv4", name});
        ASSERT_TRUE(ip && ipv4) << name;
        EXPECT_NE(ip, ipv4) << name;
        EXPECT_EQ(typeid(*ip), typeid(*ipv4)) << name;
        EXPECT_EQ(ip->GetDescription(), ipv4->GetDescription()) << name;
    }
}

TEST(Registry, EveryCommandIsItsOwnObjectAndKnowsItsPlace) {
    auto root = RegisteredRoot();
    std::vector<std::string> lines;
    Walk(root, "", lines);
    std::vector<const NamespaceNode*> seen;
    for (const auto& line : lines) {
        if (line.rfind("command ", 0) != 0) continue;
        const std::string path = line.substr(8);
        std::vector<std::string> words;
        for (size_t start = 0, end; start <= path.size(); start = end + 1) {
            end = path.find(' ', start);
            if (end == std::string::npos) end = path.size();
            words.push_back(path.substr(start, end - start));
        }
        auto node = root->ResolveNode(words);
        ASSERT_TRUE(node);
        EXPECT_EQ(node->GetThis(), node) << path;
        EXPECT_EQ(node->GetPathString(' '), path);
        EXPECT_TRUE(node->GetDispatcher()) << path;
        for (const auto* other : seen) EXPECT_NE(other, node.get()) << path;
        seen.push_back(node.get());
    }
    EXPECT_EQ(seen.size(), 44u);
}

}  // namespace
