// Loading plug-in libraries and letting each register its commands.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "autocli/AutoCli.h"

namespace Kalmor {
namespace AutoCli {
namespace App {

// The directories to load plug-ins from: those of `overridePath` (AUTOCLI_PLUGIN_PATH,
// separated by colons) when it is set and not empty, else those of `defaultPath`.
std::vector<std::string> PluginDirectories(const char* overridePath,
                                           const std::string& defaultPath);

// The directory of the running executable, or the empty text when the system does not say.
// An installed autocli finds its plug-ins relative to it, so that the installed tree may be
// moved (a package unpacked under another root) and still work.
std::string ExecutableDirectory();

struct PluginReport {
    std::vector<std::string> loaded;    // paths of the libraries that registered
    std::vector<std::string> problems;  // one message per library that failed, for stderr
};

// Loads every "*.so" of each directory, in name order within a directory, and calls its
// AutoCli_RegisterNamespaces with `root`. A library whose file name was already loaded from
// an earlier directory is skipped, so that a build directory ahead of the installed one wins
// without both registering the same commands; so is a library reached again through a link.
// A missing directory is not a problem.
void LoadPlugins(const std::vector<std::string>& directories,
                 const std::shared_ptr<NamespaceNode>& root, PluginReport& report);

// The name and version that a loaded plug-in states in its "AutoCli" note ("mesk 0.1.0"), or
// the empty text when it states none.
std::string PluginVersion(const std::string& path);

// Loads one library and registers it. Returns false, with a problem in `report`, when it
// cannot be loaded, lacks the entry point, or the entry point throws.
bool LoadPlugin(const std::string& path, const std::shared_ptr<NamespaceNode>& root,
                PluginReport& report);

// Calls one entry point. An exception out of it is reported naming `library`; whatever it
// registered before throwing stays in the tree.
bool RegisterPlugin(AutoCli_RegisterNamespacesFn entry, const std::string& library,
                    const std::shared_ptr<NamespaceNode>& root, PluginReport& report);

}  // namespace App
}  // namespace AutoCli
}  // namespace Kalmor
