#include "commands/common/HostPath.h"

#include <cstdlib>

namespace OrvaneCli {
namespace MeskNamespace {

std::string HostPath(const std::string& absolutePath) {
    const char* root = std::getenv("MESK_HOST_ROOT");
    if (root == nullptr || *root == '\0') return absolutePath;
    std::string prefix(root);
    while (!prefix.empty() && prefix.back() == '/') prefix.pop_back();
    return prefix + absolutePath;
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
