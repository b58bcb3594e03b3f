// The "simple" formatter: titled blocks of "Field: value" lines. Every text is shown through
// ScreenText: host data never reaches the terminal raw.
#include "Formatter.h"
#include "Text.h"

namespace Kalmor {
namespace AutoCli {
namespace App {

using MetaObj::MetaObject;
using MetaObj::MetaStruct;

namespace {

constexpr size_t kIndentStep = 3;

void AppendLine(std::string& text, size_t indent, const std::string& line) {
    text.append(indent, ' ');
    text += line;
    text += '\n';
}

bool IsStructured(const MetaObject* value) {
    if (value == nullptr) {
        return false;
    }
    if (value->GetType() == MetaObj::META_STRUCT) {
        return true;
    }
    return value->GetType() == MetaObj::META_LIST &&
           static_cast<const MetaObj::MetaList*>(value)->GetElementType() == MetaObj::META_STRUCT;
}

void AppendStruct(std::string& text, const MetaStruct& structure, size_t indent,
                  const OutputLayout& layout, bool topLevel);

// A structure or list of structures held in a field: its blocks, one level further in.
void AppendNested(std::string& text, const MetaObject& value, size_t indent,
                  const OutputLayout& layout) {
    if (value.GetType() == MetaObj::META_STRUCT) {
        AppendStruct(text, static_cast<const MetaStruct&>(value), indent, layout, false);
        return;
    }
    for (const auto& element : static_cast<const MetaObj::MetaList&>(value).GetElements()) {
        if (element && element->GetType() == MetaObj::META_STRUCT) {
            AppendStruct(text, static_cast<const MetaStruct&>(*element), indent, layout, false);
        }
    }
}

// A structure with a title: the title, then its fields indented under it. Without a title
// the fields stand at the block's own indentation.
void AppendStruct(std::string& text, const MetaStruct& structure, size_t indent,
                  const OutputLayout& layout, bool topLevel) {
    size_t fieldIndent = indent;
    if (layout.HasTitle(structure.GetName())) {
        AppendLine(text, indent, ScreenText(layout.Title(structure)));
        fieldIndent += kIndentStep;
    }
    for (const auto* field : layout.Fields(structure, topLevel)) {
        const MetaObject* value = field->value.get();
        if (IsStructured(value)) {
            AppendLine(text, fieldIndent, ScreenText(field->name) + ":");
            AppendNested(text, *value, fieldIndent + kIndentStep, layout);
            continue;
        }
        // Appended piece by piece: a long listing has tens of thousands of these lines.
        const std::string shown =
            ScreenText(ValueText(value, layout.Unit(structure.GetName(), field->name)));
        text.append(fieldIndent, ' ');
        text += ScreenText(field->name);
        text += shown.empty() ? ":" : ": ";
        text += shown;
        text += '\n';
    }
}

}  // namespace

std::string PlainText(const MetaObject& root) {
    std::string text;
    switch (root.GetType()) {
        case MetaObj::META_BOOL: {
            const auto& flag = static_cast<const MetaObj::MetaBool&>(root);
            if (flag.HasValue() && !flag.GetValue()) {
                text = "false\n";
            }
            break;
        }
        case MetaObj::META_STRING:
            if (static_cast<const MetaObj::MetaString&>(root).HasValue()) {
                text = ScreenText(ValueText(&root)) + "\n";
            }
            break;
        case MetaObj::META_INT:
            if (static_cast<const MetaObj::MetaInt&>(root).HasValue()) {
                text = ScreenText(ValueText(&root)) + "\n";
            }
            break;
        case MetaObj::META_LIST:
            for (const auto& element : static_cast<const MetaObj::MetaList&>(root).GetElements()) {
                text += ScreenText(ValueText(element.get())) + "\n";
            }
            break;
        case MetaObj::META_STRUCT:
            break;
    }
    return text;
}

std::string FormatSimple(const MetaObject& root, const FormatOptions& options) {
    if (!IsStructured(&root)) {
        return PlainText(root);
    }
    OutputLayout layout(options);
    std::string text;
    if (root.GetType() == MetaObj::META_STRUCT) {
        AppendStruct(text, static_cast<const MetaStruct&>(root), 0, layout, true);
        return text;
    }
    bool first = true;
    for (const auto& element : static_cast<const MetaObj::MetaList&>(root).GetElements()) {
        if (!element || element->GetType() != MetaObj::META_STRUCT) {
            continue;
        }
        if (!first) {
            text += '\n';
        }
        first = false;
        AppendStruct(text, static_cast<const MetaStruct&>(*element), 0, layout, true);
    }
    return text;
}

}  // namespace App
}  // namespace AutoCli
}  // namespace Kalmor
