// What the formatters share: output parameters, value texts, and the formatters by name.
#include "Formatter.h"

#include <algorithm>
#include <charconv>

#include <nlohmann/json.hpp>

#include "Text.h"

namespace Kalmor {
namespace AutoCli {
namespace App {

using MetaObj::MetaObject;
using MetaObj::MetaStruct;

namespace {

constexpr char kHeaderPrefix[] = "header:";
constexpr char kFieldsPrefix[] = "fields:";
constexpr char kUnitsPrefix[] = "units:";

// The rest of `key` after `prefix` in `rest`, when the key starts with it.
bool AfterPrefix(const std::string& key, const char* prefix, std::string& rest) {
    size_t length = std::char_traits<char>::length(prefix);
    if (key.compare(0, length, prefix) != 0) {
        return false;
    }
    rest = key.substr(length);
    return true;
}

// A list of texts in a CSV cell: a JSON array, which any JSON parser splits back.
std::string MachineCell(const MetaObject* value) {
    if (value != nullptr && value->GetType() == MetaObj::META_LIST) {
        return ToJson(value).dump(-1, ' ', false, nlohmann::json::error_handler_t::replace);
    }
    return ValueText(value);
}

}  // namespace

OutputLayout::OutputLayout(const FormatOptions& options) : options_(options) {
    for (const auto& parameter : options.outputParameters) {
        std::string name;
        if (AfterPrefix(parameter.first, kHeaderPrefix, name)) {
            titles_[name] = parameter.second;
        } else if (AfterPrefix(parameter.first, kFieldsPrefix, name)) {
            fields_[name] = SplitNames(parameter.second);
        } else if (AfterPrefix(parameter.first, kUnitsPrefix, name)) {
            units_[name] = parameter.second;
        }
    }
}

std::string OutputLayout::Title(const MetaStruct& structure) const {
    auto found = titles_.find(structure.GetName());
    if (found == titles_.end()) {
        return std::string();
    }
    const std::string& pattern = found->second;
    std::string title;
    size_t pos = 0;
    while (pos < pattern.size()) {
        size_t open = pattern.find('%', pos);
        size_t close = open == std::string::npos ? open : pattern.find('%', open + 1);
        if (close == std::string::npos) {
            title.append(pattern, pos, std::string::npos);
            break;
        }
        title.append(pattern, pos, open - pos);
        const std::string name = pattern.substr(open + 1, close - open - 1);
        const size_t field = structure.FindField(name);
        if (field < structure.FieldCount()) {
            AppendValueText(title, structure.FieldAt(field).value.get());
            pos = close + 1;
            continue;
        }
        // Not a field: keep the first percent sign and look again from the second.
        title += '%';
        pos = open + 1;
    }
    return title;
}

bool OutputLayout::HasTitle(const std::string& structName) const {
    return titles_.count(structName) != 0;
}

std::string OutputLayout::RawTitle(const std::string& structName) const {
    auto found = titles_.find(structName);
    return found == titles_.end() ? std::string() : found->second;
}

bool OutputLayout::TitleNamesFields(const std::string& structName) const {
    auto found = titles_.find(structName);
    return found != titles_.end() && found->second.find('%') != std::string::npos;
}

const OutputLayout::Selection& OutputLayout::Select(const MetaStruct& structure,
                                                    bool topLevel) const {
    Selection& selection = selections_[topLevel ? 1 : 0];
    const MetaStruct*& model = selectedFor_[topLevel ? 1 : 0];
    // The rows of a listing have the same fields: chosen once for all of them.
    if (model != nullptr && model->GetName() == structure.GetName() &&
        structure.HasFieldsOf(*model)) {
        return selection;
    }
    model = &structure;
    selection.fields.clear();
    selection.units.clear();
    selection.serial = ++serials_;
    const std::vector<std::string>* names = nullptr;
    if (topLevel && options_.fieldsGiven) {
        names = &options_.fields;
    } else {
        auto found = fields_.find(structure.GetName());
        if (found != fields_.end()) {
            names = &found->second;
        }
    }
    if (names == nullptr) {
        for (size_t i = 0; i < structure.FieldCount(); ++i) {
            selection.fields.push_back(i);
        }
    } else {
        for (const auto& name : *names) {
            const size_t index = structure.FindField(name);
            if (index < structure.FieldCount()) {
                selection.fields.push_back(index);
            }
        }
    }
    for (size_t index : selection.fields) {
        selection.units.push_back(Unit(structure.GetName(), structure.FieldAt(index).name));
    }
    return selection;
}

std::string OutputLayout::Unit(const std::string& structName, const std::string& field) const {
    // Asked for every field of every element: most commands have no units at all.
    if (units_.empty()) {
        return std::string();
    }
    auto found = units_.find(structName + "." + field);
    return found == units_.end() ? std::string() : found->second;
}

void AppendValueText(std::string& out, const MetaObject* value) {
    if (value == nullptr) {
        return;
    }
    switch (value->GetType()) {
        case MetaObj::META_STRING: {
            const auto& scalar = static_cast<const MetaObj::MetaString&>(*value);
            out += scalar.GetValue();
            return;
        }
        case MetaObj::META_INT: {
            const auto& scalar = static_cast<const MetaObj::MetaInt&>(*value);
            if (scalar.HasValue()) {
                char digits[24];
                const auto end = std::to_chars(digits, digits + sizeof digits, scalar.GetValue());
                out.append(digits, end.ptr);
            }
            return;
        }
        case MetaObj::META_BOOL: {
            const auto& scalar = static_cast<const MetaObj::MetaBool&>(*value);
            if (scalar.HasValue()) {
                out += scalar.GetValue() ? "true" : "false";
            }
            return;
        }
        case MetaObj::META_LIST: {
            const auto& list = static_cast<const MetaObj::MetaList&>(*value);
            if (list.GetElementType() != MetaObj::META_STRUCT) {
                bool first = true;
                for (const auto& element : list.GetElements()) {
                    if (!first) {
                        out += ", ";
                    }
                    first = false;
                    AppendValueText(out, element.get());
                }
                return;
            }
            break;
        }
        case MetaObj::META_STRUCT:
            break;
    }
    out += ToJson(value).dump(-1, ' ', false, nlohmann::json::error_handler_t::replace);
}

std::string ValueText(const MetaObject* value, const std::string& unit) {
    std::string text;
    AppendValueText(text, value);
    if (!text.empty() && !unit.empty()) {
        text += " " + unit;
    }
    return text;
}

void FlushIfLarge(std::string& text, const FormatOptions& options) {
    if (options.flush && text.size() >= kFlushSize) {
        options.flush(text);
        text.clear();
    }
}

void ReserveForListing(std::string& text, size_t count, const FormatOptions& options) {
    size_t room = text.size() * count * 9 / 8;
    if (options.flush) {
        room = std::min(room, kFlushSize + 2 * text.size());
    }
    text.reserve(room);
}

const MetaStruct* ResultStructure(const MetaObject* root) {
    if (root == nullptr) {
        return nullptr;
    }
    if (root->GetType() == MetaObj::META_STRUCT) {
        return static_cast<const MetaStruct*>(root);
    }
    if (root->GetType() == MetaObj::META_LIST) {
        const auto& element = static_cast<const MetaObj::MetaList*>(root)->GetTemplate();
        if (element && element->GetType() == MetaObj::META_STRUCT) {
            return static_cast<const MetaStruct*>(element.get());
        }
    }
    return nullptr;
}

std::vector<std::string> FieldNames(const MetaObject* root) {
    std::vector<std::string> names;
    if (const MetaStruct* structure = ResultStructure(root)) {
        for (const auto& field : structure->GetFields()) {
            names.push_back(field.name);
        }
    }
    return names;
}

bool BuildGrid(const MetaObject& root, const OutputLayout& layout, CellStyle style, Grid& grid) {
    std::vector<const MetaStruct*> elements;
    const MetaStruct* model = nullptr;
    if (root.GetType() == MetaObj::META_STRUCT) {
        model = static_cast<const MetaStruct*>(&root);
        elements.push_back(model);
    } else if (root.GetType() == MetaObj::META_LIST &&
               static_cast<const MetaObj::MetaList&>(root).GetElementType() ==
                   MetaObj::META_STRUCT) {
        const auto& list = static_cast<const MetaObj::MetaList&>(root);
        for (const auto& element : list.GetElements()) {
            if (element && element->GetType() == MetaObj::META_STRUCT) {
                elements.push_back(static_cast<const MetaStruct*>(element.get()));
            }
        }
        if (!elements.empty()) {
            model = elements.front();
        } else if (list.GetTemplate() && list.GetTemplate()->GetType() == MetaObj::META_STRUCT) {
            model = static_cast<const MetaStruct*>(list.GetTemplate().get());
        }
    } else {
        return false;
    }

    grid = Grid();
    if (model == nullptr) {
        return true;
    }
    grid.structName = model->GetName();
    const OutputLayout::Selection& selection = layout.Select(*model, true);
    for (size_t index : selection.fields) {
        grid.columns.push_back(model->FieldAt(index).name);
    }
    grid.rows.reserve(elements.size());
    for (const auto* element : elements) {
        // Elements made like the first are read by position, the others by name.
        const bool alike = element->GetName() == model->GetName() && element->HasFieldsOf(*model);
        std::vector<std::string> row;
        row.reserve(grid.columns.size());
        for (size_t column = 0; column < grid.columns.size(); ++column) {
            const MetaObject* value = alike ? element->FieldAt(selection.fields[column]).value.get()
                                            : element->GetField(grid.columns[column]).get();
            if (style == CellStyle::kMachine) {
                row.push_back(MachineCell(value));
                continue;
            }
            const std::string unit = alike ? selection.units[column]
                                           : layout.Unit(element->GetName(), grid.columns[column]);
            std::string cell = ValueText(value, unit);
            row.push_back(IsPlainText(cell) ? std::move(cell) : ScreenText(cell));
        }
        grid.rows.push_back(std::move(row));
    }
    if (style == CellStyle::kScreen) {
        for (auto& column : grid.columns) {
            column = ScreenText(column);
        }
    }
    return true;
}

const std::vector<FormatterRow>& Formatters() {
    // clang-format off
    static const std::vector<FormatterRow> kFormatters = {
        // name         function          --fields  --no-header  read back
        {"simple",      FormatSimple,     true,     false,       ReadBack::kNone},
        {"table",       FormatTable,      true,     true,        ReadBack::kNone},
        {"json",        FormatJson,       true,     false,       ReadBack::kJson},
        {"json-pretty", FormatJsonPretty, true,     false,       ReadBack::kJson},
        {"xml",         FormatXml,        true,     false,       ReadBack::kXml},
        {"csv",         FormatCsv,        true,     true,        ReadBack::kCsv},
    };
    // clang-format on
    return kFormatters;
}

FormatterFunction FindFormatter(const std::string& name) {
    for (const auto& formatter : Formatters()) {
        if (name == formatter.name) {
            return formatter.function;
        }
    }
    return nullptr;
}

const std::vector<std::string>& FormatterNames() {
    static const std::vector<std::string> names = [] {
        std::vector<std::string> list;
        for (const auto& formatter : Formatters()) {
            list.push_back(formatter.name);
        }
        return list;
    }();
    return names;
}

}  // namespace App
}  // namespace AutoCli
}  // namespace Kalmor
