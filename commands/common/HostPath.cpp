#include "commands/common/HostPath.h"

#include <cstdlib>

namespace OrvaneCli {
namespace MeskNamespace {

namespace {

// The directory that stands for the host's root, without trailing slashes; empty on the
// real host (and for a root of "/").
std::string HostRoot() {
    const char* root = std::getenv("MESK_HOST_ROOT");
    std::string prefix(root == nullptr ? "" : root);
    while (!prefix.empty() && prefix.back() == '/') prefix.pop_back();
    return prefix;
}

}  // namespace

std::string HostPath(const std::string& absolutePath) {
    return HostRoot() + absolutePath;
}

std::string HostShellPath(const std::string& absolutePath) {
    const std::string root = HostRoot();
    return root.empty() ? absolutePath : ShellQuote(root) + absolutePath;
}

std::string ShellQuote(const std::string& text) {
    std::string quoted = "'";
    for (char c : text) quoted += c == '\'' ? std::string("'\\''") : std::string(1, c);
    return quoted + "'";
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
