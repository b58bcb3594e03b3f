// The "xml" formatter: a small, stable document that any XML parser reads.
//
//   <?xml version="1.0" encoding="UTF-8"?>
//   <output>
//     <structure name="MeskClusterGet">
//       <field name="Enabled"><boolean>true</boolean></field>
//       <field name="Sub-Cluster Member UUIDs">
//         <list type="string">
//           <string>52f1c2a0-...</string>
//         </list>
//       </field>
//     </structure>
//   </output>
//
// Scalars without a value are empty elements (<string/>). Every field is shown, in declared
// order, as in the JSON output; --fields keeps those named of a top-level structure (the
// result, or an element of a result that is a list), in the order given.
#include "Formatter.h"
#include "Text.h"

namespace Kalmor {
namespace AutoCli {
namespace App {

using MetaObj::MetaObject;

namespace {

constexpr size_t kIndentStep = 2;

// Escapes markup characters and leaves out what XML 1.0 cannot carry at all, so that the
// document stays well-formed whatever the host reported.
std::string Escape(const std::string& raw) {
    std::string text;
    for (char c : ValidUtf8(raw, true)) {
        switch (c) {
            case '&':
                text += "&amp;";
                break;
            case '<':
                text += "&lt;";
                break;
            case '>':
                text += "&gt;";
                break;
            case '"':
                text += "&quot;";
                break;
            case '\r':
                text += "&#13;";
                break;
            default:
                text += c;
        }
    }
    return text;
}

// An attribute value: parsers turn a literal tab or line break there into a blank, so those
// are written as character references to read back unchanged.
std::string EscapeAttribute(const std::string& raw) {
    std::string text;
    for (char c : Escape(raw)) {
        if (c == '\t') {
            text += "&#9;";
        } else if (c == '\n') {
            text += "&#10;";
        } else {
            text += c;
        }
    }
    return text;
}

const char* ElementName(MetaObj::MetaType type) {
    switch (type) {
        case MetaObj::META_BOOL:
            return "boolean";
        case MetaObj::META_INT:
            return "integer";
        case MetaObj::META_STRING:
            return "string";
        case MetaObj::META_STRUCT:
            return "structure";
        case MetaObj::META_LIST:
            return "list";
    }
    return "value";
}

bool IsScalar(const MetaObject* value) {
    return value == nullptr ||
           (value->GetType() != MetaObj::META_STRUCT && value->GetType() != MetaObj::META_LIST);
}

// A scalar on one line: <integer>42</integer>, or <string/> without a value. A missing value
// (a null field) is written as an empty string.
std::string Scalar(const MetaObject* value) {
    const char* name = value ? ElementName(value->GetType()) : "string";
    std::string text = ValueText(value);
    bool hasValue = value != nullptr && !text.empty();
    if (value && value->GetType() == MetaObj::META_STRING) {
        hasValue = static_cast<const MetaObj::MetaString*>(value)->HasValue();
    }
    if (!hasValue) {
        return std::string("<") + name + "/>";
    }
    return std::string("<") + name + ">" + Escape(text) + "</" + name + ">";
}

void AppendLine(std::string& text, size_t indent, const std::string& line) {
    text.append(indent, ' ');
    text += line;
    text += '\n';
}

// `fields`, when given, are the fields to show of a top-level structure.
void AppendValue(std::string& text, const MetaObject* value, size_t indent,
                 const std::vector<std::string>* fields = nullptr) {
    if (IsScalar(value)) {
        AppendLine(text, indent, Scalar(value));
        return;
    }
    if (value->GetType() == MetaObj::META_STRUCT) {
        const auto& structure = static_cast<const MetaObj::MetaStruct&>(*value);
        AppendLine(text, indent,
                   "<structure name=\"" + EscapeAttribute(structure.GetName()) + "\">");
        std::vector<size_t> shown;
        if (fields == nullptr) {
            for (size_t i = 0; i < structure.FieldCount(); ++i) {
                shown.push_back(i);
            }
        } else {
            for (const auto& name : *fields) {
                const size_t index = structure.FindField(name);
                if (index < structure.FieldCount()) {
                    shown.push_back(index);
                }
            }
        }
        for (size_t index : shown) {
            const auto field = structure.FieldAt(index);
            std::string open = "<field name=\"" + EscapeAttribute(field.name) + "\">";
            if (IsScalar(field.value.get())) {
                AppendLine(text, indent + kIndentStep,
                           open + Scalar(field.value.get()) + "</field>");
            } else {
                AppendLine(text, indent + kIndentStep, open);
                AppendValue(text, field.value.get(), indent + 2 * kIndentStep);
                AppendLine(text, indent + kIndentStep, "</field>");
            }
        }
        AppendLine(text, indent, "</structure>");
        return;
    }
    const auto& list = static_cast<const MetaObj::MetaList&>(*value);
    std::string open = std::string("<list type=\"") + ElementName(list.GetElementType()) + "\"";
    if (list.GetElements().empty()) {
        AppendLine(text, indent, open + "/>");
        return;
    }
    AppendLine(text, indent, open + ">");
    for (const auto& element : list.GetElements()) {
        AppendValue(text, element.get(), indent + kIndentStep, fields);
    }
    AppendLine(text, indent, "</list>");
}

}  // namespace

std::string FormatXml(const MetaObject& root, const FormatOptions& options) {
    std::string text = "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<output>\n";
    AppendValue(text, &root, kIndentStep, options.fieldsGiven ? &options.fields : nullptr);
    text += "</output>\n";
    return text;
}

}  // namespace App
}  // namespace AutoCli
}  // namespace Kalmor
