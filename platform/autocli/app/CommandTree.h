// Finding commands in the tree by the words of a command line.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "autocli/AutoCli.h"

namespace Kalmor {
namespace AutoCli {
namespace App {

struct PathResolution {
    // The deepest node reached: a command, or the namespace where the path stopped.
    std::shared_ptr<NamespaceNode> node;
    // Index of the first word after the path.
    size_t next = 0;
    // Set when a word names no child: one message naming the valid choices.
    std::string error;
};

// Follows words[start...] down from `root` until a command, an option (a word starting with
// '-') or the end of the words.
PathResolution ResolvePath(const std::shared_ptr<NamespaceNode>& root,
                           const std::vector<std::string>& words, size_t start);

// Every command path at or below `node`, one per line, in registration order, words
// separated by single blanks ("mesk cluster get").
std::string ListCommands(const NamespaceNode& node);

}  // namespace App
}  // namespace AutoCli
}  // namespace Kalmor
