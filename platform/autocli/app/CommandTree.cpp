// Finding commands in the tree by the words of a command line.
#include "CommandTree.h"

#include "Text.h"

namespace Kalmor {
namespace AutoCli {
namespace App {

namespace {

void AppendCommands(const NamespaceNode& node, std::string& text) {
    if (node.GetType() == NodeType::Command) {
        text += node.GetPathString(' ') + "\n";
        return;
    }
    for (const auto& child : node.GetNamespaceNodes()) {
        AppendCommands(*child, text);
    }
}

}  // namespace

PathResolution ResolvePath(const std::shared_ptr<NamespaceNode>& root,
                           const std::vector<std::string>& words, size_t start) {
    PathResolution resolution;
    resolution.node = root;
    resolution.next = start;
    while (resolution.next < words.size() && resolution.node->GetType() == NodeType::Namespace) {
        const std::string& word = words[resolution.next];
        if (!word.empty() && word[0] == '-') {
            break;
        }
        std::shared_ptr<NamespaceNode> child = resolution.node->GetNamespaceNode(word);
        if (!child) {
            const std::string where = resolution.node->GetPathString(' ');
            const auto choices = resolution.node->GetNamespaceNodeNames();
            resolution.error = "'" + MessageText(word) + "' is not a namespace or command" +
                               (where.empty() ? std::string() : " in '" + where + "'") +
                               DidYouMean(word, choices) +
                               (choices.empty() ? "; no commands are registered"
                                                : "; valid choices: " + Join(choices, ", "));
            return resolution;
        }
        resolution.node = child;
        ++resolution.next;
    }
    return resolution;
}

std::string ListCommands(const NamespaceNode& node) {
    std::string text;
    AppendCommands(node, text);
    return text;
}

}  // namespace App
}  // namespace AutoCli
}  // namespace Kalmor
