// Test seam of AutoCli_ShellCmd: a unit test installs a hook that receives every command line
// instead of a shell running it.
#pragma once

#include <functional>
#include <string>

#include "Visibility.h"

namespace Kalmor {
namespace AutoCli {

using ShellCmdHook =
    std::function<int(const std::string& command, std::string& output, const std::string& input)>;

// Installs the hook for every later AutoCli_ShellCmd call; an empty hook restores the shell.
KALMOR_API void SetShellCmdHook(ShellCmdHook hook);

}  // namespace AutoCli
}  // namespace Kalmor
