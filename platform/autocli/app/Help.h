// Help texts of namespaces and commands.
#pragma once

#include <string>

#include "autocli/AutoCli.h"

namespace Kalmor {
namespace AutoCli {
namespace App {

// The description of a parameter with "%ENUM%" replaced by its allowed values: "a, b" for an
// enumeration, "0-512" for an integer range.
std::string ExpandEnum(const CallSpec::ParameterSpec& parameter);

// A namespace's help: usage, description and its children in registration order with their
// descriptions. The root's help also lists autocli's own options.
std::string RenderNamespaceHelp(const NamespaceNode& node);

// A command's help: usage, description and every parameter with its short and long name,
// kind, whether it is required and its description; then the fields of its result, which
// --fields may name.
std::string RenderCommandHelp(CommandSpec& command, const CallSpec::InputSpec& spec);

}  // namespace App
}  // namespace AutoCli
}  // namespace Kalmor
