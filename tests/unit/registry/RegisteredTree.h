// The tree that the plug-in registers into an empty root, and a walk over it.
#pragma once

#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "autocli/AutoCli.h"

extern "C" void AutoCli_RegisterNamespaces(std::shared_ptr<Kalmor::AutoCli::NamespaceNode>* root);

namespace RegistryTest {

using Node = std::shared_ptr<Kalmor::AutoCli::NamespaceNode>;

inline Node RegisteredRoot() {
    Node root = Kalmor::AutoCli::Namespace::New();
    AutoCli_RegisterNamespaces(&root);
    return root;
}

// Every node below `node` with its path, depth first in registration order.
inline void Walk(const Node& node, const std::string& path,
                 std::vector<std::pair<std::string, Node>>& nodes) {
    for (const auto& name : node->GetNamespaceNodeNames()) {
        auto child = node->GetNamespaceNode(name);
        const std::string childPath = path.empty() ? name : path + " " + name;
        nodes.emplace_back(childPath, child);
        Walk(child, childPath, nodes);
    }
}

// Every command below `root`; the caller keeps `root` alive, since nodes know their parents
// only through it.
inline std::vector<std::pair<std::string, Node>> Commands(const Node& root) {
    std::vector<std::pair<std::string, Node>> nodes, commands;
    Walk(root, "", nodes);
    for (const auto& entry : nodes) {
        if (entry.second->GetType() == Kalmor::AutoCli::NodeType::Command)
            commands.push_back(entry);
    }
    return commands;
}

}  // namespace RegistryTest
