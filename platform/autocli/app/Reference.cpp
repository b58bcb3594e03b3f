// The command reference: the registered tree rendered as one Markdown document, or as JSON
// with a JSON Schema of each command's json output.
#include "Reference.h"

#include <map>
#include <vector>

#include <nlohmann/json.hpp>

#include "Help.h"
#include "Text.h"

namespace Kalmor {
namespace AutoCli {
namespace App {

using CallSpec::ParameterSpec;
using MetaObj::MetaObject;
using MetaObj::MetaStruct;

namespace {

// Text in running Markdown and in table cells: characters that would start markup or end a
// cell are escaped, and line breaks become blanks so that a cell stays on its row.
std::string Escape(const std::string& raw) {
    std::string text;
    for (char c : ValidUtf8(raw)) {
        switch (c) {
            case '\\':
            case '|':
            case '<':
            case '>':
            case '*':
            case '`':
            case '[':
            case ']':
                text += '\\';
                text += c;
                break;
            case '\n':
            case '\r':
                text += ' ';
                break;
            default:
                text += c;
        }
    }
    return text;
}

// A description as one paragraph or cell: escaped, without the blanks around it (two
// trailing blanks would be a line break).
std::string Prose(const std::string& raw) {
    return Trim(Escape(raw));
}

std::string Code(const std::string& text) {
    return "`" + ValidUtf8(text) + "`";
}

// GitHub's anchor of a heading made of a code span: lower case, blanks as hyphens, other
// punctuation dropped.
std::string Anchor(const std::string& path) {
    std::string anchor;
    for (char c : path) {
        if (c >= 'A' && c <= 'Z') {
            anchor += static_cast<char>(c - 'A' + 'a');
        } else if ((c >= 'a' && c <= 'z') || (c >= '0' && c <= '9') || c == '-' || c == '_') {
            anchor += c;
        } else if (c == ' ') {
            anchor += '-';
        }
    }
    return anchor;
}

std::string ParameterKind(const ParameterSpec& parameter) {
    switch (parameter.GetType()) {
        case CallSpec::PARAM_STRING:
            return "text";
        case CallSpec::PARAM_INT:
            return "integer";
        case CallSpec::PARAM_BOOL:
            return "boolean";
        case CallSpec::PARAM_FLAG:
            return "flag";
        case CallSpec::PARAM_STRING_LIST:
            return "text, repeatable";
    }
    return "unknown";
}

// The help text with "%ENUM%" expanded; an enumeration or range that the text does not
// mention is appended, so the reference always lists what is allowed.
std::string ParameterHelp(const ParameterSpec& parameter) {
    std::string help = ExpandEnum(parameter);
    const auto& constraint = parameter.GetConstraint();
    if (!constraint || parameter.GetDescription().find("%ENUM%") != std::string::npos) {
        return help;
    }
    std::string allowed;
    if (constraint->GetType() == CallSpec::CONSTRAINT_STRING_ENUM) {
        std::vector<std::string> values;
        for (const auto& entry : constraint->GetStringEnum()) {
            values.push_back(entry.value);
        }
        allowed = "Allowed values: " + Join(values, ", ") + ".";
    } else if (constraint->GetType() == CallSpec::CONSTRAINT_INT_RANGE) {
        allowed = "From " + std::to_string(constraint->GetIntMinimum()) + " to " +
                  std::to_string(constraint->GetIntMaximum()) + ".";
    }
    if (allowed.empty()) {
        return help;
    }
    return help.empty() ? allowed : help + " " + allowed;
}

const MetaStruct* AsStruct(const MetaObject* value) {
    return value && value->GetType() == MetaObj::META_STRUCT ? static_cast<const MetaStruct*>(value)
                                                             : nullptr;
}

// The element structure of a list of structures, when its template declares one.
const MetaStruct* ElementStruct(const MetaObject* value) {
    if (!value || value->GetType() != MetaObj::META_LIST) {
        return nullptr;
    }
    return AsStruct(static_cast<const MetaObj::MetaList*>(value)->GetTemplate().get());
}

std::string ValueKind(const MetaObject* value) {
    if (value == nullptr) {
        return "nothing";
    }
    switch (value->GetType()) {
        case MetaObj::META_STRING:
            return "text";
        case MetaObj::META_INT:
            return "integer";
        case MetaObj::META_BOOL:
            return "boolean";
        case MetaObj::META_STRUCT:
            return "structure " + Code(static_cast<const MetaStruct*>(value)->GetName());
        case MetaObj::META_LIST: {
            const auto* list = static_cast<const MetaObj::MetaList*>(value);
            if (list->GetElementType() != MetaObj::META_STRUCT) {
                return "list of texts";
            }
            const MetaStruct* element = ElementStruct(value);
            return element ? "list of " + Code(element->GetName()) + " structures"
                           : "list of structures";
        }
    }
    return "unknown";
}

class ReferenceWriter {
  public:
    std::string Render(const std::shared_ptr<NamespaceNode>& top) {
        const std::string path = top->GetPathString(' ');
        text_ =
            path.empty() ? "# Command reference\n" : "# Command reference: " + Code(path) + "\n";
        text_ +=
            "\nGenerated by `autocli --reference` from the commands that the plug-ins register."
            "\nEvery command also takes autocli's own options (`autocli --help`).\n";
        text_ += "\n## Contents\n\n";
        Contents(*top, 0);
        Sections(top);
        return text_;
    }

  private:
    void Contents(const NamespaceNode& node, size_t depth) {
        const std::string path = node.GetPathString(' ');
        if (!path.empty()) {
            text_ += std::string(2 * depth, ' ') + "- [" + Code(path) + "](#" + Anchor(path) + ")" +
                     (Prose(node.GetDescription()).empty() ? "" : ": ") +
                     Prose(node.GetDescription()) + "\n";
            ++depth;
        }
        for (const auto& child : node.GetNamespaceNodes()) {
            Contents(*child, depth);
        }
    }

    void Sections(const std::shared_ptr<NamespaceNode>& node) {
        if (node->GetType() == NodeType::Command) {
            CommandSection(*node);
            return;
        }
        if (!node->GetPathString(' ').empty()) {
            NamespaceSection(*node);
        }
        for (const auto& child : node->GetNamespaceNodes()) {
            Sections(child);
        }
    }

    void Heading(const NamespaceNode& node) {
        text_ += "\n## " + Code(node.GetPathString(' ')) + "\n";
        if (!Prose(node.GetDescription()).empty()) {
            text_ += "\n" + Prose(node.GetDescription()) + "\n";
        }
    }

    void NamespaceSection(const NamespaceNode& node) {
        Heading(node);
        text_ += "\nHolds:\n\n";
        for (const auto& child : node.GetNamespaceNodes()) {
            const std::string path = child->GetPathString(' ');
            text_ += "- [" + Code(child->GetName()) + "](#" + Anchor(path) + ")" +
                     (child->GetType() == NodeType::Namespace ? " (namespace)" : "") + "\n";
        }
    }

    void CommandSection(NamespaceNode& node) {
        Heading(node);
        auto* command = dynamic_cast<CommandSpec*>(&node);
        if (command == nullptr) {
            text_ += "\nThis command cannot be run.\n";
            return;
        }
        std::string facts;
        const std::string type = command->GetMetaDataField("type");
        if (!type.empty()) {
            facts += "Type: " + Escape(type) + ".";
        }
        if (!command->GetDefaultOutputFormatter().empty()) {
            facts += std::string(facts.empty() ? "" : " ") +
                     "Default formatter: " + Escape(command->GetDefaultOutputFormatter()) + ".";
        }
        if (!facts.empty()) {
            text_ += "\n" + facts + "\n";
        }
        Parameters(*command);
        Output(*command);
    }

    void Parameters(CommandSpec& command) {
        auto spec = command.GetInputSpec();
        if (!spec || spec->GetParameters().empty()) {
            text_ += "\nParameters: none.\n";
            return;
        }
        text_ +=
            "\nParameters:\n\n| Option | Short | Kind | Required | Description |\n"
            "|---|---|---|---|---|\n";
        for (const auto& parameter : spec->GetParameters()) {
            if (!parameter) {
                continue;
            }
            text_ +=
                "| " + Code("--" + parameter->GetName()) + " | " +
                (parameter->GetShortName().empty() ? "" : Code("-" + parameter->GetShortName())) +
                " | " + ParameterKind(*parameter) + " | " +
                (parameter->IsRequired() ? "yes" : "no") + " | " +
                Prose(ParameterHelp(*parameter)) + " |\n";
        }
    }

    void Output(CommandSpec& command) {
        units_.clear();
        for (const auto& parameter : command.GetDefaultOutputParameters()) {
            if (parameter.first.compare(0, 6, "units:") == 0) {
                units_[parameter.first.substr(6)] = parameter.second;
            }
        }
        auto spec = command.GetOutputSpec();
        const MetaObject* root = spec ? spec->GetRootObject().get() : nullptr;
        text_ += "\nOutput: ";
        if (root == nullptr) {
            text_ += "nothing.\n";
            return;
        }
        if (root->GetType() == MetaObj::META_BOOL) {
            text_ += "a success flag.\n";
            return;
        }
        const MetaStruct* structure = AsStruct(root);
        const MetaStruct* element = ElementStruct(root);
        if (structure == nullptr && element == nullptr) {
            text_ += ValueKind(root) + ".\n";
            return;
        }
        if (structure != nullptr) {
            text_ += "one " + ValueKind(root) + ".\n";
        } else {
            text_ += "a " + ValueKind(root) + ", one per row.\n";
        }
        Fields(structure ? *structure : *element);
    }

    // A structure's fields; structures nested in a field follow with tables of their own.
    void Fields(const MetaStruct& structure) {
        text_ += "\n| Field | Kind |\n|---|---|\n";
        std::vector<const MetaStruct*> nested;
        for (const auto& field : structure.GetFields()) {
            std::string kind = ValueKind(field.value.get());
            auto unit = units_.find(structure.GetName() + "." + field.name);
            if (unit != units_.end()) {
                kind += ", shown in " + Escape(unit->second);
            }
            text_ += "| " + Escape(field.name) + " | " + kind + " |\n";
            if (const MetaStruct* inner = AsStruct(field.value.get())) {
                nested.push_back(inner);
            } else if (const MetaStruct* inner = ElementStruct(field.value.get())) {
                nested.push_back(inner);
            }
        }
        for (const MetaStruct* inner : nested) {
            text_ += "\nFields of " + Code(inner->GetName()) + ":\n";
            Fields(*inner);
        }
    }

    std::string text_;
    std::map<std::string, std::string> units_;  // "<StructName>.<Field>" -> unit label
};

using Json = nlohmann::ordered_json;

const char kSchemaDialect[] = "https://json-schema.org/draft/2020-12/schema";

// The schema of a value as the json formatter prints it (ToJson). A scalar the command left
// empty is null; a list is an array, empty when there is nothing, and its texts are never
// null. A structure is an object with exactly its fields: `properties` lists them in the
// order they are printed, and so does `required`, since every field is always printed.
Json ValueSchema(const MetaObject* value);

Json ScalarSchema(MetaObj::MetaType type, bool nullable) {
    const char* name = type == MetaObj::META_INT    ? "integer"
                       : type == MetaObj::META_BOOL ? "boolean"
                                                    : "string";
    return nullable ? Json{{"type", {name, "null"}}} : Json{{"type", name}};
}

Json StructSchema(const MetaStruct& structure) {
    Json properties = Json::object();
    Json required = Json::array();
    for (const auto& field : structure.GetFields()) {
        Json schema = ValueSchema(field.value.get());
        if (!field.documentation.empty()) {
            schema["description"] = field.documentation;
        }
        properties[field.name] = std::move(schema);
        required.push_back(field.name);
    }
    return Json{{"title", structure.GetName()},
                {"type", "object"},
                {"properties", std::move(properties)},
                {"required", std::move(required)},
                {"additionalProperties", false}};
}

Json ValueSchema(const MetaObject* value) {
    if (value == nullptr) {
        return Json{{"type", "null"}};
    }
    switch (value->GetType()) {
        case MetaObj::META_STRUCT:
            return StructSchema(static_cast<const MetaStruct&>(*value));
        case MetaObj::META_LIST: {
            const auto& list = static_cast<const MetaObj::MetaList&>(*value);
            Json items;
            if (list.GetElementType() != MetaObj::META_STRUCT) {
                items = ScalarSchema(list.GetElementType(), false);
            } else if (const MetaStruct* element = ElementStruct(value)) {
                items = StructSchema(*element);
            } else {
                items = Json{{"type", "object"}};
            }
            return Json{{"type", "array"}, {"items", std::move(items)}};
        }
        default:
            return ScalarSchema(value->GetType(), true);
    }
}

Json ParameterJson(const ParameterSpec& parameter) {
    static const char* const kKinds[] = {"text", "integer", "boolean", "flag", "text"};
    const auto type = parameter.GetType();
    Json object{{"name", parameter.GetName()},
                {"short",
                 parameter.GetShortName().empty() ? Json(nullptr) : Json(parameter.GetShortName())},
                {"kind", kKinds[type <= CallSpec::PARAM_STRING_LIST ? type : 0]},
                {"list", type == CallSpec::PARAM_STRING_LIST},
                {"required", parameter.IsRequired()}};
    // The only default the framework itself knows: an absent flag is not set.
    if (type == CallSpec::PARAM_FLAG) {
        object["default"] = false;
    }
    if (const auto& constraint = parameter.GetConstraint()) {
        if (constraint->GetType() == CallSpec::CONSTRAINT_STRING_ENUM) {
            Json values = Json::array();
            for (const auto& entry : constraint->GetStringEnum()) {
                values.push_back(entry.value);
            }
            object["enum"] = std::move(values);
        } else if (constraint->GetType() == CallSpec::CONSTRAINT_INT_RANGE) {
            object["range"] = Json{{"minimum", constraint->GetIntMinimum()},
                                   {"maximum", constraint->GetIntMaximum()}};
        }
    }
    object["help"] = ExpandEnum(parameter);
    return object;
}

Json CommandJson(NamespaceNode& node) {
    Json object{{"path", node.GetPathString(' ')}, {"description", node.GetDescription()}};
    auto* command = dynamic_cast<CommandSpec*>(&node);
    const std::string type = command ? command->GetMetaDataField("type") : std::string();
    object["type"] = type.empty() ? Json(nullptr) : Json(type);
    object["defaultFormatter"] = !command || command->GetDefaultOutputFormatter().empty()
                                     ? Json(nullptr)
                                     : Json(command->GetDefaultOutputFormatter());
    Json parameters = Json::array();
    if (auto input = command ? command->GetInputSpec() : nullptr) {
        for (const auto& parameter : input->GetParameters()) {
            if (parameter) {
                parameters.push_back(ParameterJson(*parameter));
            }
        }
    }
    object["parameters"] = std::move(parameters);
    auto output = command ? command->GetOutputSpec() : nullptr;
    const MetaObject* root = output ? output->GetRootObject().get() : nullptr;
    if (root == nullptr) {
        object["output"] = nullptr;  // the command prints nothing
    } else {
        Json body = ValueSchema(root);
        Json schema{{"$schema", kSchemaDialect}};
        for (auto& member : body.items()) {
            schema[member.key()] = std::move(member.value());
        }
        object["output"] = std::move(schema);
    }
    return object;
}

void CollectCommands(const std::shared_ptr<NamespaceNode>& node, Json& commands) {
    if (node->GetType() == NodeType::Command) {
        commands.push_back(CommandJson(*node));
        return;
    }
    for (const auto& child : node->GetNamespaceNodes()) {
        CollectCommands(child, commands);
    }
}

}  // namespace

std::string RenderReferenceJson(const std::shared_ptr<NamespaceNode>& node, bool pretty) {
    Json commands = Json::array();
    CollectCommands(node, commands);
    return Json{{"commands", std::move(commands)}}.dump(pretty ? 2 : -1, ' ', false,
                                                        nlohmann::json::error_handler_t::replace) +
           "\n";
}

std::string RenderReference(const std::shared_ptr<NamespaceNode>& node) {
    return ReferenceWriter().Render(node);
}

}  // namespace App
}  // namespace AutoCli
}  // namespace Kalmor
