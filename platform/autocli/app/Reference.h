// The command reference: the registered tree rendered as one Markdown document.
#pragma once

#include <memory>
#include <string>

#include "autocli/AutoCli.h"

namespace Kalmor {
namespace AutoCli {
namespace App {

// Every namespace and command at or below `node`, in registration order: a contents list,
// then one section per namespace (description and children) and per command (description,
// metadata, parameters with names, short names, kinds, whether required and help with
// "%ENUM%" expanded, and the fields of its result as its output description declares them).
// The text depends only on the tree, so a checked-in copy can be compared with it.
std::string RenderReference(const std::shared_ptr<NamespaceNode>& node);

// The same commands as JSON, `{"commands": [...]}`, one object per command: its path (words
// joined by blanks), description, metadata type, default formatter, parameters (name, short
// name, kind, list, required, default when the framework knows one, enum or range, help) and
// `output`, a JSON Schema (draft 2020-12) of what the json formatter prints for it, or null
// when it prints nothing. Indented by two blanks when `pretty`.
std::string RenderReferenceJson(const std::shared_ptr<NamespaceNode>& node, bool pretty);

}  // namespace App
}  // namespace AutoCli
}  // namespace Kalmor
