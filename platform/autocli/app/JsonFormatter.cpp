// The "json" and "json-pretty" formatters.
#include <algorithm>
#include <cstring>

#include <nlohmann/json.hpp>

#include "Formatter.h"
#include "Text.h"

namespace Kalmor {
namespace AutoCli {
namespace App {

using MetaObj::MetaObject;

nlohmann::ordered_json ToJson(const MetaObject* value, const std::vector<std::string>* fields) {
    if (value == nullptr) {
        return nullptr;
    }
    switch (value->GetType()) {
        case MetaObj::META_STRING: {
            const auto& scalar = static_cast<const MetaObj::MetaString&>(*value);
            return scalar.HasValue() ? nlohmann::ordered_json(scalar.GetValue()) : nullptr;
        }
        case MetaObj::META_INT: {
            const auto& scalar = static_cast<const MetaObj::MetaInt&>(*value);
            return scalar.HasValue() ? nlohmann::ordered_json(scalar.GetValue()) : nullptr;
        }
        case MetaObj::META_BOOL: {
            const auto& scalar = static_cast<const MetaObj::MetaBool&>(*value);
            return scalar.HasValue() ? nlohmann::ordered_json(scalar.GetValue()) : nullptr;
        }
        case MetaObj::META_STRUCT: {
            // A structure's field names are unique, so members are appended without the
            // lookup that operator[] makes for every one of them.
            const auto& structure = static_cast<const MetaObj::MetaStruct&>(*value);
            nlohmann::ordered_json object = nlohmann::ordered_json::object();
            auto& members = object.get_ref<nlohmann::ordered_json::object_t&>();
            if (fields != nullptr) {
                // Selected fields, in the order asked; a name the structure lacks is left out.
                for (const auto& name : *fields) {
                    for (const auto& field : structure.GetFields()) {
                        if (field.name == name && object.find(name) == object.end()) {
                            members.emplace_back(field.name, ToJson(field.value.get()));
                            break;
                        }
                    }
                }
                return object;
            }
            members.reserve(structure.GetFields().size());
            for (const auto& field : structure.GetFields()) {
                members.emplace_back(field.name, ToJson(field.value.get()));
            }
            return object;
        }
        case MetaObj::META_LIST: {
            const auto& elements = static_cast<const MetaObj::MetaList&>(*value).GetElements();
            nlohmann::ordered_json array = nlohmann::ordered_json::array();
            array.get_ref<nlohmann::ordered_json::array_t&>().reserve(elements.size());
            // The elements of a list are top-level structures as well.
            for (const auto& element : elements) {
                const bool isStruct = element && element->GetType() == MetaObj::META_STRUCT;
                array.push_back(ToJson(element.get(), isStruct ? fields : nullptr));
            }
            return array;
        }
    }
    return nullptr;
}

namespace {

// Printable ASCII without quotation marks or backslashes: a JSON string's text as it is.
bool IsPlainJsonText(const std::string& text) {
    return IsPlainText(text) && std::memchr(text.data(), '"', text.size()) == nullptr &&
           std::memchr(text.data(), '\\', text.size()) == nullptr;
}

// Writes a result as JSON straight into the output, byte for byte as ToJson(...).dump() with
// the same indentation would, without building the document first: a listing of thousands of
// structures would otherwise make a JSON value for every field. Texts from the host are not
// guaranteed to be UTF-8; a bad byte becomes U+FFFD instead of an exception.
class JsonWriter {
  public:
    JsonWriter(std::string& out, bool pretty, const FormatOptions* options = nullptr)
        : out_(out), pretty_(pretty), options_(options) {}

    // `fields`, when given, are the fields to write of a top-level structure.
    void Value(const MetaObject* value, const std::vector<std::string>* fields, size_t depth) {
        if (value == nullptr) {
            out_ += "null";
            return;
        }
        switch (value->GetType()) {
            case MetaObj::META_STRING: {
                const auto& scalar = static_cast<const MetaObj::MetaString&>(*value);
                if (scalar.HasValue()) {
                    String(scalar.GetValue());
                } else {
                    out_ += "null";
                }
                return;
            }
            case MetaObj::META_INT:
            case MetaObj::META_BOOL: {
                const size_t start = out_.size();
                AppendValueText(out_, value);
                if (out_.size() == start) {
                    out_ += "null";
                }
                return;
            }
            case MetaObj::META_STRUCT:
                Struct(static_cast<const MetaObj::MetaStruct&>(*value), fields, depth);
                return;
            case MetaObj::META_LIST:
                List(static_cast<const MetaObj::MetaList&>(*value), fields, depth);
                return;
        }
    }

  private:
    void Struct(const MetaObj::MetaStruct& structure, const std::vector<std::string>* fields,
                size_t depth) {
        std::vector<size_t> shown;
        if (fields != nullptr) {
            // Selected fields, in the order asked, each once; a name the structure lacks is
            // left out.
            for (auto name = fields->begin(); name != fields->end(); ++name) {
                const size_t index = structure.FindField(*name);
                if (index < structure.FieldCount() &&
                    std::find(fields->begin(), name, *name) == name) {
                    shown.push_back(index);
                }
            }
        }
        const size_t count = fields != nullptr ? shown.size() : structure.FieldCount();
        if (count == 0) {
            out_ += "{}";
            return;
        }
        if (PlainStruct(structure, fields != nullptr ? &shown : nullptr, depth)) {
            return;
        }
        out_ += '{';
        for (size_t i = 0; i < count; ++i) {
            if (i != 0) {
                out_ += ',';
            }
            Indent(depth + 1);
            const auto field = structure.FieldAt(fields != nullptr ? shown[i] : i);
            String(field.name);
            out_ += pretty_ ? ": " : ":";
            Value(field.value.get(), nullptr, depth + 1);
        }
        Indent(depth);
        out_ += '}';
    }

    // Struct() for the common structure whose values are all texts of printable ASCII without
    // quotation marks or backslashes, integers, booleans and empty values: the room for it is
    // made at once and it is copied in, each name as written for the last structure with the
    // same fields. Returns false, having written nothing, for any other structure.
    bool PlainStruct(const MetaObj::MetaStruct& structure, const std::vector<size_t>* shown,
                     size_t depth) {
        const size_t count = shown != nullptr ? shown->size() : structure.FieldCount();
        const auto indexOf = [&](size_t i) { return shown != nullptr ? (*shown)[i] : i; };
        if (keys_.model == nullptr || keys_.depth != depth ||
            keys_.selected != (shown != nullptr) || (shown != nullptr && keys_.shown != *shown) ||
            !structure.HasFieldsOf(*keys_.model)) {
            keys_.model = &structure;
            keys_.depth = depth;
            keys_.selected = shown != nullptr;
            keys_.shown = shown != nullptr ? *shown : std::vector<size_t>();
            keys_.texts.clear();
            for (size_t i = 0; i < count; ++i) {
                std::string key = i != 0 ? "," : "";
                JsonWriter(key, pretty_).Indent(depth + 1);
                JsonWriter(key, pretty_).String(structure.FieldAt(indexOf(i)).name);
                key += pretty_ ? ": " : ":";
                keys_.texts.push_back(std::move(key));
            }
        }
        size_t bytes = 2 + 2 * depth + 1;
        for (size_t i = 0; i < count; ++i) {
            const MetaObject* value = structure.FieldAt(indexOf(i)).value.get();
            bytes += keys_.texts[i].size() + 22;
            if (value == nullptr || value->GetType() != MetaObj::META_STRING) {
                if (value != nullptr && value->GetType() != MetaObj::META_BOOL &&
                    value->GetType() != MetaObj::META_INT) {
                    return false;
                }
                continue;
            }
            const std::string& text = static_cast<const MetaObj::MetaString&>(*value).GetValue();
            if (!IsPlainJsonText(text)) {
                return false;
            }
            bytes += text.size();
        }
        TextRoom out(out_, bytes);
        out.Put('{');
        for (size_t i = 0; i < count; ++i) {
            out.Put(keys_.texts[i]);
            const MetaObject* value = structure.FieldAt(indexOf(i)).value.get();
            if (value == nullptr) {
                out.Put("null", 4);
            } else if (value->GetType() == MetaObj::META_STRING) {
                const auto& scalar = static_cast<const MetaObj::MetaString&>(*value);
                if (scalar.HasValue()) {
                    out.Put('"');
                    out.Put(scalar.GetValue());
                    out.Put('"');
                } else {
                    out.Put("null", 4);
                }
            } else if (value->GetType() == MetaObj::META_BOOL) {
                const auto& scalar = static_cast<const MetaObj::MetaBool&>(*value);
                if (!scalar.HasValue()) {
                    out.Put("null", 4);
                } else if (scalar.GetValue()) {
                    out.Put("true", 4);
                } else {
                    out.Put("false", 5);
                }
            } else {
                const auto& scalar = static_cast<const MetaObj::MetaInt&>(*value);
                if (scalar.HasValue()) {
                    out.Put(scalar.GetValue());
                } else {
                    out.Put("null", 4);
                }
            }
        }
        if (pretty_) {
            out.Put('\n');
            for (size_t i = 0; i < 2 * depth; ++i) out.Put(' ');
        }
        out.Put('}');
        out.Done();
        return true;
    }

    void List(const MetaObj::MetaList& list, const std::vector<std::string>* fields, size_t depth) {
        const auto& elements = list.GetElements();
        if (elements.empty()) {
            out_ += "[]";
            return;
        }
        out_ += '[';
        for (size_t i = 0; i < elements.size(); ++i) {
            if (i != 0) {
                out_ += ',';
            }
            Indent(depth + 1);
            // The elements of a list are top-level structures as well.
            const MetaObject* element = elements[i].get();
            const bool isStruct = element != nullptr && element->GetType() == MetaObj::META_STRUCT;
            Value(element, isStruct ? fields : nullptr, depth + 1);
            if (depth == 0 && options_ != nullptr) {
                if (i == 0) {
                    // A listing's elements are alike: room made for them, judged by the first.
                    ReserveForListing(out_, elements.size(), *options_);
                } else {
                    FlushIfLarge(out_, *options_);
                }
            }
        }
        Indent(depth);
        out_ += ']';
    }

    void String(const std::string& text) {
        // Printable ASCII without quotation marks or backslashes, most texts, is written as
        // it is; anything else is escaped by the JSON library.
        if (!IsPlainJsonText(text)) {
            out_ += nlohmann::ordered_json(text).dump(-1, ' ', false,
                                                      nlohmann::json::error_handler_t::replace);
            return;
        }
        out_ += '"';
        out_ += text;
        out_ += '"';
    }

    void Indent(size_t depth) {
        if (pretty_) {
            out_ += '\n';
            out_.append(2 * depth, ' ');
        }
    }

    std::string& out_;
    bool pretty_;
    const FormatOptions* options_;  // of the whole result; nullptr for a piece of it
    // The members' names as PlainStruct writes them, with what stands before each, and the
    // structure, depth and selection they were made for.
    struct Keys {
        const MetaObj::MetaStruct* model = nullptr;
        size_t depth = 0;
        bool selected = false;
        std::vector<size_t> shown;
        std::vector<std::string> texts;
    } keys_;
};

std::string Dump(const MetaObject& root, const FormatOptions& options, bool pretty) {
    std::string text;
    JsonWriter(text, pretty, &options)
        .Value(&root, options.fieldsGiven ? &options.fields : nullptr, 0);
    text += '\n';
    return text;
}

}  // namespace

std::string FormatJson(const MetaObject& root, const FormatOptions& options) {
    return Dump(root, options, false);
}

std::string FormatJsonPretty(const MetaObject& root, const FormatOptions& options) {
    return Dump(root, options, true);
}

}  // namespace App
}  // namespace AutoCli
}  // namespace Kalmor
