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
// document stays well-formed whatever the host reported. In an attribute value, parsers turn
// a literal tab or line break into a blank, so those are written as character references to
// read back unchanged.
void AppendEscaped(std::string& out, const std::string& raw, bool attribute) {
    std::string clean;
    const std::string& text = ValidUtf8(raw, clean, true);
    size_t start = 0;
    for (size_t i = 0; i < text.size(); ++i) {
        const char* entity = nullptr;
        switch (text[i]) {
            case '&':
                entity = "&amp;";
                break;
            case '<':
                entity = "&lt;";
                break;
            case '>':
                entity = "&gt;";
                break;
            case '"':
                entity = "&quot;";
                break;
            case '\r':
                entity = "&#13;";
                break;
            case '\t':
                entity = attribute ? "&#9;" : nullptr;
                break;
            case '\n':
                entity = attribute ? "&#10;" : nullptr;
                break;
            default:
                break;
        }
        if (entity != nullptr) {
            out.append(text, start, i - start);
            out += entity;
            start = i + 1;
        }
    }
    out.append(text, start, std::string::npos);
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

class XmlWriter {
  public:
    XmlWriter(std::string& out, const FormatOptions& options) : out_(out), options_(options) {}

    // `fields`, when given, are the fields to show of a top-level structure. A listing at the
    // top is handed to the options' flush as it grows.
    void Value(const MetaObject* value, size_t indent,
               const std::vector<std::string>* fields = nullptr, bool top = false) {
        if (IsScalar(value)) {
            out_.append(indent, ' ');
            Scalar(value);
            out_ += '\n';
        } else if (value->GetType() == MetaObj::META_STRUCT) {
            Struct(static_cast<const MetaObj::MetaStruct&>(*value), indent, fields);
        } else {
            List(static_cast<const MetaObj::MetaList&>(*value), indent, fields, top);
        }
    }

  private:
    // A scalar on one line: <integer>42</integer>, or <string/> without a value. A missing
    // value (a null field) is written as an empty string.
    void Scalar(const MetaObject* value) {
        const char* name = value ? ElementName(value->GetType()) : "string";
        bool hasValue = false;
        const std::string* text = &scratch_;
        if (value && value->GetType() == MetaObj::META_STRING) {
            const auto& scalar = static_cast<const MetaObj::MetaString&>(*value);
            hasValue = scalar.HasValue();
            text = &scalar.GetValue();
        } else {
            scratch_.clear();
            AppendValueText(scratch_, value);
            hasValue = !scratch_.empty();
        }
        out_ += '<';
        out_ += name;
        if (!hasValue) {
            out_ += "/>";
            return;
        }
        out_ += '>';
        AppendEscaped(out_, *text, false);
        out_ += "</";
        out_ += name;
        out_ += '>';
    }

    void Struct(const MetaObj::MetaStruct& structure, size_t indent,
                const std::vector<std::string>* fields) {
        out_.append(indent, ' ');
        out_ += "<structure name=\"";
        AppendEscaped(out_, structure.GetName(), true);
        out_ += "\">\n";
        const size_t count = fields ? fields->size() : structure.FieldCount();
        for (size_t i = 0; i < count; ++i) {
            const size_t index = fields ? structure.FindField((*fields)[i]) : i;
            if (index >= structure.FieldCount()) {
                continue;
            }
            const auto field = structure.FieldAt(index);
            out_.append(indent + kIndentStep, ' ');
            out_ += "<field name=\"";
            AppendEscaped(out_, field.name, true);
            out_ += "\">";
            if (IsScalar(field.value.get())) {
                Scalar(field.value.get());
            } else {
                out_ += '\n';
                Value(field.value.get(), indent + 2 * kIndentStep);
                out_.append(indent + kIndentStep, ' ');
            }
            out_ += "</field>\n";
        }
        out_.append(indent, ' ');
        out_ += "</structure>\n";
    }

    void List(const MetaObj::MetaList& list, size_t indent, const std::vector<std::string>* fields,
              bool top) {
        out_.append(indent, ' ');
        out_ += "<list type=\"";
        out_ += ElementName(list.GetElementType());
        const auto& elements = list.GetElements();
        if (elements.empty()) {
            out_ += "\"/>\n";
            return;
        }
        out_ += "\">\n";
        bool first = true;
        for (const auto& element : elements) {
            Value(element.get(), indent + kIndentStep, fields);
            if (top && first) {
                // A listing's elements are alike: room made for them, judged by the first.
                ReserveForListing(out_, elements.size(), options_);
                first = false;
            } else if (top) {
                FlushIfLarge(out_, options_);
            }
        }
        out_.append(indent, ' ');
        out_ += "</list>\n";
    }

    std::string& out_;
    const FormatOptions& options_;
    std::string scratch_;  // the text of a scalar that is not a string
};

}  // namespace

std::string FormatXml(const MetaObject& root, const FormatOptions& options) {
    std::string text = "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<output>\n";
    XmlWriter(text, options)
        .Value(&root, kIndentStep, options.fieldsGiven ? &options.fields : nullptr, true);
    text += "</output>\n";
    return text;
}

}  // namespace App
}  // namespace AutoCli
}  // namespace Kalmor
