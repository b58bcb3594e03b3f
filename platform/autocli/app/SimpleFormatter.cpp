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

// What SimpleWriter writes before and after each value of a selection: the indented name
// with its colon, and the unit, all as ScreenText; made again only when the selection
// changes, since a listing's rows share one.
struct Lines {
    unsigned serial = 0;  // of the selection they were made for
    size_t indent = 0;
    std::vector<std::string> heads;  // "   Name:"
    std::vector<std::string> units;  // " unit", or empty
};

class SimpleWriter {
  public:
    SimpleWriter(std::string& text, const OutputLayout& layout) : text_(text), layout_(layout) {}

    // A structure with a title: the title, then its fields indented under it. Without a
    // title the fields stand at the block's own indentation.
    void Struct(const MetaStruct& structure, size_t indent, bool topLevel) {
        size_t fieldIndent = indent;
        if (layout_.HasTitle(structure.GetName())) {
            text_.append(indent, ' ');
            AppendScreenText(text_, layout_.Title(structure));
            text_ += '\n';
            fieldIndent += kIndentStep;
        }
        if (topLevel) {
            // Nested structures use the other selection and lines: these stay as they are.
            const OutputLayout::Selection& selection = layout_.Select(structure, true);
            Fields(structure, selection, LinesFor(selection, structure, fieldIndent, true),
                   fieldIndent);
            return;
        }
        const OutputLayout::Selection selection = layout_.Select(structure, false);
        const Lines lines = LinesFor(selection, structure, fieldIndent, false);
        Fields(structure, selection, lines, fieldIndent);
    }

  private:
    void Fields(const MetaStruct& structure, const OutputLayout::Selection& selection,
                const Lines& lines, size_t fieldIndent) {
        if (PlainFields(structure, selection, lines)) {
            return;
        }
        for (size_t shown = 0; shown < selection.fields.size(); ++shown) {
            const MetaObject* value = structure.FieldAt(selection.fields[shown]).value.get();
            text_ += lines.heads[shown];
            if (IsStructured(value)) {
                text_ += '\n';
                Nested(*value, fieldIndent + kIndentStep);
                continue;
            }
            const size_t colon = text_.size();
            text_ += ' ';
            const size_t start = text_.size();
            if (value != nullptr && value->GetType() == MetaObj::META_STRING) {
                AppendScreenText(text_, static_cast<const MetaObj::MetaString&>(*value).GetValue());
            } else {
                AppendScreenText(text_, ValueText(value));
            }
            if (text_.size() == start) {
                text_.resize(colon);  // no value: "Name:" alone, and no unit
            } else {
                text_ += lines.units[shown];
            }
            text_ += '\n';
        }
    }

    // Fields() for the common structure whose shown values are all printable ASCII texts and
    // booleans, which need no escape: the room for all its lines is made at once and they
    // are copied in. Returns false, having written nothing, for any other structure.
    bool PlainFields(const MetaStruct& structure, const OutputLayout::Selection& selection,
                     const Lines& lines) {
        const size_t count = selection.fields.size();
        values_.clear();
        size_t bytes = 0;
        for (size_t shown = 0; shown < count; ++shown) {
            const MetaObject* value = structure.FieldAt(selection.fields[shown]).value.get();
            if (value == nullptr) {
                return false;
            }
            const MetaObj::MetaType type = value->GetType();
            if (type == MetaObj::META_STRING) {
                const std::string& text =
                    static_cast<const MetaObj::MetaString&>(*value).GetValue();
                if (!IsPlainText(text)) {
                    return false;
                }
                bytes += text.size();
            } else if (type != MetaObj::META_BOOL) {
                return false;
            }
            values_.push_back(value);
            bytes += lines.heads[shown].size() + lines.units[shown].size() + 7;
        }
        TextRoom out(text_, bytes);
        for (size_t shown = 0; shown < count; ++shown) {
            out.Put(lines.heads[shown]);
            const MetaObject* value = values_[shown];
            const char* data = "";
            size_t size = 0;
            if (value->GetType() == MetaObj::META_STRING) {
                const std::string& text =
                    static_cast<const MetaObj::MetaString&>(*value).GetValue();
                data = text.data();
                size = text.size();
            } else if (static_cast<const MetaObj::MetaBool&>(*value).HasValue()) {
                const bool flag = static_cast<const MetaObj::MetaBool&>(*value).GetValue();
                data = flag ? "true" : "false";
                size = flag ? 4 : 5;
            }
            // No value: "Name:" alone, and no unit.
            if (size != 0) {
                out.Put(' ');
                out.Put(data, size);
                out.Put(lines.units[shown]);
            }
            out.Put('\n');
        }
        out.Done();
        return true;
    }

    // A structure or list of structures held in a field: its blocks, one level further in.
    void Nested(const MetaObject& value, size_t indent) {
        if (value.GetType() == MetaObj::META_STRUCT) {
            Struct(static_cast<const MetaStruct&>(value), indent, false);
            return;
        }
        for (const auto& element : static_cast<const MetaObj::MetaList&>(value).GetElements()) {
            if (element && element->GetType() == MetaObj::META_STRUCT) {
                Struct(static_cast<const MetaStruct&>(*element), indent, false);
            }
        }
    }

    const Lines& LinesFor(const OutputLayout::Selection& selection, const MetaStruct& structure,
                          size_t indent, bool topLevel) {
        Lines& lines = lines_[topLevel ? 1 : 0];
        if (lines.serial == selection.serial && lines.indent == indent) {
            return lines;
        }
        lines.serial = selection.serial;
        lines.indent = indent;
        lines.heads.clear();
        lines.units.clear();
        for (size_t shown = 0; shown < selection.fields.size(); ++shown) {
            std::string head(indent, ' ');
            AppendScreenText(head, structure.FieldAt(selection.fields[shown]).name);
            head += ':';
            lines.heads.push_back(std::move(head));
            const std::string& unit = selection.units[shown];
            lines.units.push_back(unit.empty() ? std::string() : " " + ScreenText(unit));
        }
        return lines;
    }

    std::string& text_;
    const OutputLayout& layout_;
    Lines lines_[2];
    std::vector<const MetaObject*> values_;  // PlainFields' values, in display order
};

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
    SimpleWriter writer(text, layout);
    if (root.GetType() == MetaObj::META_STRUCT) {
        writer.Struct(static_cast<const MetaStruct&>(root), 0, true);
        return text;
    }
    const auto& elements = static_cast<const MetaObj::MetaList&>(root).GetElements();
    bool first = true;
    for (const auto& element : elements) {
        if (!element || element->GetType() != MetaObj::META_STRUCT) {
            continue;
        }
        if (first) {
            // A listing's rows are alike: room made for them, judged by the first.
            writer.Struct(static_cast<const MetaStruct&>(*element), 0, true);
            ReserveForListing(text, elements.size(), options);
            first = false;
            continue;
        }
        text += '\n';
        writer.Struct(static_cast<const MetaStruct&>(*element), 0, true);
        FlushIfLarge(text, options);
    }
    return text;
}

}  // namespace App
}  // namespace AutoCli
}  // namespace Kalmor
