// The "json" and "json-pretty" formatters.
#include <nlohmann/json.hpp>

#include "Formatter.h"

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

// Texts from the host are not guaranteed to be UTF-8; a bad byte becomes U+FFFD instead of
// an exception.
std::string Dump(const MetaObject& root, const FormatOptions& options, int indent) {
    return ToJson(&root, options.fieldsGiven ? &options.fields : nullptr)
               .dump(indent, ' ', false, nlohmann::json::error_handler_t::replace) +
           "\n";
}

}  // namespace

std::string FormatJson(const MetaObject& root, const FormatOptions& options) {
    return Dump(root, options, -1);
}

std::string FormatJsonPretty(const MetaObject& root, const FormatOptions& options) {
    return Dump(root, options, 2);
}

}  // namespace App
}  // namespace AutoCli
}  // namespace Kalmor
