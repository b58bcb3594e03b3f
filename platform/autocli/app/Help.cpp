// Help texts of namespaces and commands.
#include "Help.h"

#include <sys/ioctl.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <vector>

#include "Formatter.h"
#include "Text.h"

namespace Kalmor {
namespace AutoCli {
namespace App {

using CallSpec::ParameterSpec;

namespace {

struct Row {
    std::string left;
    std::string right;
};

// The width to wrap help to: the terminal's, when stdout is one; 0 (no wrapping) otherwise, so
// that scripts and tests read every text whole.
size_t WrapWidth() {
    static const size_t width = [] {
        if (!isatty(STDOUT_FILENO)) {
            return size_t{0};
        }
        winsize size{};
        if (ioctl(STDOUT_FILENO, TIOCGWINSZ, &size) == 0 && size.ws_col > 0) {
            return static_cast<size_t>(size.ws_col);
        }
        const char* columns = std::getenv("COLUMNS");
        const long parsed = columns ? std::strtol(columns, nullptr, 10) : 0;
        return parsed > 0 ? static_cast<size_t>(parsed) : size_t{80};
    }();
    return width;
}

// Breaks each line of `text` at blanks so that, after `indent` columns, none is wider than
// `width`; a word longer than the room is left whole. Lines after the first are indented.
std::string Wrap(const std::string& text, size_t indent, size_t width) {
    const size_t room = width > indent + 20 ? width - indent - 1 : 20;
    const std::string margin(indent, ' ');
    std::string wrapped;
    size_t start = 0;
    while (start <= text.size()) {
        size_t end = text.find('\n', start);
        std::string line = text.substr(start, end == std::string::npos ? end : end - start);
        while (DisplayWidth(line) > room) {
            size_t cut = line.rfind(' ', room);
            if (cut == std::string::npos || cut == 0) {
                cut = line.find(' ', room);
                if (cut == std::string::npos) break;
            }
            wrapped += line.substr(0, line.find_last_not_of(' ', cut) + 1) + "\n" + margin;
            line = line.substr(line.find_first_not_of(' ', cut) == std::string::npos
                                   ? line.size()
                                   : line.find_first_not_of(' ', cut));
        }
        if (end == std::string::npos) {
            wrapped += line;
            break;
        }
        wrapped += line.substr(0, line.find_last_not_of(' ') + 1);
        wrapped += "\n" + margin;
        start = end + 1;
    }
    return wrapped;
}

// Rows as two aligned columns, indented by two blanks.
std::string RenderRows(const std::vector<Row>& rows) {
    size_t width = 0;
    for (const auto& row : rows) {
        width = std::max(width, DisplayWidth(row.left));
    }
    const size_t wrapWidth = WrapWidth();
    std::string text;
    for (const auto& row : rows) {
        const std::string right = wrapWidth ? Wrap(row.right, width + 4, wrapWidth) : row.right;
        std::string line = "  " + PadRight(row.left, width + 2) + right;
        text += line.substr(0, line.find_last_not_of(' ') + 1) + "\n";
    }
    return text;
}

std::string ValuePlaceholder(const ParameterSpec& parameter) {
    switch (parameter.GetType()) {
        case CallSpec::PARAM_STRING:
            return " <text>";
        case CallSpec::PARAM_INT:
            return " <integer>";
        case CallSpec::PARAM_BOOL:
            return " <boolean>";
        case CallSpec::PARAM_FLAG:
            return std::string();
        case CallSpec::PARAM_STRING_LIST:
            return " <text>...";
    }
    return " <value>";
}

std::string RangeText(int64_t minimum, int64_t maximum) {
    // "0-512" reads well; with a negative bound the dash would be ambiguous.
    const char* separator = minimum < 0 || maximum < 0 ? " to " : "-";
    return std::to_string(minimum) + separator + std::to_string(maximum);
}

// The names of the formatters whose row has `property` set: "table and csv"; empty when every
// formatter has it.
std::string FormattersWith(bool FormatterRow::*property) {
    std::vector<std::string> names;
    for (const auto& formatter : Formatters()) {
        if (formatter.*property) {
            names.push_back(formatter.name);
        }
    }
    if (names.size() == Formatters().size()) {
        return std::string();
    }
    const std::string last = names.empty() ? std::string() : names.back();
    if (!names.empty()) {
        names.pop_back();
    }
    return names.empty() ? last : Join(names, ", ") + " and " + last;
}

void AppendParagraph(std::string& text, const std::string& paragraph) {
    if (!paragraph.empty()) {
        const size_t wrapWidth = WrapWidth();
        text += "\n" + (wrapWidth ? Wrap(paragraph, 0, wrapWidth) : paragraph) + "\n";
    }
}

}  // namespace

std::string ExpandEnum(const ParameterSpec& parameter) {
    static const std::string kPlaceholder = "%ENUM%";
    std::string text = parameter.GetDescription();
    const auto& constraint = parameter.GetConstraint();
    if (!constraint) {
        return text;
    }
    std::string allowed;
    if (constraint->GetType() == CallSpec::CONSTRAINT_STRING_ENUM) {
        std::vector<std::string> values;
        for (const auto& entry : constraint->GetStringEnum()) {
            values.push_back(entry.value);
        }
        allowed = Join(values, ", ");
    } else if (constraint->GetType() == CallSpec::CONSTRAINT_INT_RANGE) {
        allowed = RangeText(constraint->GetIntMinimum(), constraint->GetIntMaximum());
    } else {
        return text;
    }
    for (size_t pos = text.find(kPlaceholder); pos != std::string::npos;
         pos = text.find(kPlaceholder, pos + allowed.size())) {
        text.replace(pos, kPlaceholder.size(), allowed);
    }
    return text;
}

std::string RenderNamespaceHelp(const NamespaceNode& node) {
    const std::string path = node.GetPathString(' ');
    const bool isRoot = path.empty();
    bool hasNamespaces = false;
    for (const auto& child : node.GetNamespaceNodes()) {
        hasNamespaces = hasNamespaces || child->GetType() == NodeType::Namespace;
    }
    std::string text = "Usage: autocli [options] " + (isRoot ? std::string() : path + " ") +
                       (hasNamespaces ? "<namespace>... <command>" : "<command>") +
                       " [command options]\n";
    AppendParagraph(text, node.GetDescription());

    std::vector<Row> children;
    for (const auto& child : node.GetNamespaceNodes()) {
        children.push_back(Row{child->GetName(), child->GetDescription()});
    }
    if (children.empty()) {
        text += "\nNo namespaces or commands are registered here.\n";
    } else {
        text += "\nAvailable namespaces and commands:\n" + RenderRows(children);
    }

    if (isRoot) {
        const std::string fieldsIn = FormattersWith(&FormatterRow::honoursFields);
        const std::string headerIn = FormattersWith(&FormatterRow::honoursNoHeader);
        text += "\nOptions:\n" +
                RenderRows({
                    {"--formatter NAME", "Output format: " + Join(FormatterNames(), ", ")},
                    {"--fields A,B", "Show only these fields, in this order" +
                                         (fieldsIn.empty() ? "" : " (" + fieldsIn + ")")},
                    {"--no-header", "Leave out the header row" +
                                        (headerIn.empty() ? "" : " of " + headerIn + " output")},
                    {"--list-commands", "Print every command path, one per line"},
                    {"--reference", "Print the command reference as Markdown"},
                    {"--version", "Print the versions of autocli and of each plug-in"},
                    {"--debug", "Report on stderr whether the command completed its output"},
                    {"-h, --help", "Show the help of a namespace or command"},
                });
        text +=
            "\nThe options other than --help and --list-commands may also follow a command\n"
            "that has no option of the same name. Set AUTOCLI_PLUGIN_PATH (directories\n"
            "separated by colons) to load plug-ins from other directories.\n"
            "`autocli completion bash|zsh|fish` prints the script that completes commands in\n"
            "that shell.\n";
    }
    return text;
}

std::string RenderCommandHelp(CommandSpec& command, const CallSpec::InputSpec& spec) {
    std::vector<Row> rows;
    for (const auto& parameter : spec.GetParameters()) {
        if (!parameter) {
            continue;
        }
        std::string left =
            parameter->GetShortName().empty() ? "    " : "-" + parameter->GetShortName() + ", ";
        left += "--" + parameter->GetName() + ValuePlaceholder(*parameter);
        std::string right = ExpandEnum(*parameter);
        if (parameter->IsRequired()) {
            right += right.empty() ? "(required)" : " (required)";
        }
        rows.push_back(Row{left, right});
    }

    std::string text = "Usage: autocli [options] " + command.GetPathString(' ') +
                       (rows.empty() ? "\n" : " [command options]\n");
    AppendParagraph(text, command.GetDescription());
    if (!rows.empty()) {
        text += "\nCommand options:\n" + RenderRows(rows);
    }
    // What --fields may name: the fields of the structure the command returns.
    auto outputSpec = command.GetOutputSpec();
    const std::vector<std::string> names =
        FieldNames(outputSpec ? outputSpec->GetRootObject().get() : nullptr);
    if (!names.empty()) {
        text += "\nOutput fields: " + Join(names, ", ") + "\n";
    }
    return text;
}

}  // namespace App
}  // namespace AutoCli
}  // namespace Kalmor
