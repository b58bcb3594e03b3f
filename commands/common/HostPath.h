// Where the plug-in finds the host's own files and scripts.
#pragma once

#include <string>

namespace OrvaneCli {
namespace MeskNamespace {

// The path of a host file given by its absolute path: below the directory that MESK_HOST_ROOT
// names when that variable is set and not empty, else the path itself.
std::string HostPath(const std::string& absolutePath);

}  // namespace MeskNamespace
}  // namespace OrvaneCli
