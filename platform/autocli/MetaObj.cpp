// Result values: scalars, structures and lists.
#include "autocli/MetaObj.h"

#include <stdexcept>

namespace Kalmor {
namespace MetaObj {

MetaObject::~MetaObject() = default;

std::shared_ptr<MetaString> MetaString::New() {
    return std::make_shared<MetaString>();
}

std::shared_ptr<MetaString> MetaString::New(const std::string& value) {
    auto object = std::make_shared<MetaString>();
    object->hasValue_ = true;
    object->value_ = value;
    return object;
}

MetaType MetaString::GetType() const {
    return META_STRING;
}

std::shared_ptr<MetaInt> MetaInt::New() {
    return std::make_shared<MetaInt>();
}

std::shared_ptr<MetaInt> MetaInt::New(int64_t value) {
    auto object = std::make_shared<MetaInt>();
    object->hasValue_ = true;
    object->value_ = value;
    return object;
}

MetaType MetaInt::GetType() const {
    return META_INT;
}

std::shared_ptr<MetaBool> MetaBool::New() {
    return std::make_shared<MetaBool>();
}

std::shared_ptr<MetaBool> MetaBool::New(bool value) {
    auto object = std::make_shared<MetaBool>();
    object->hasValue_ = true;
    object->value_ = value;
    return object;
}

MetaType MetaBool::GetType() const {
    return META_BOOL;
}

const std::string MetaStruct::_docEmpty;

std::shared_ptr<MetaStruct> MetaStruct::New(const std::string& name) {
    auto object = std::make_shared<MetaStruct>();
    object->name_ = name;
    return object;
}

MetaType MetaStruct::GetType() const {
    return META_STRUCT;
}

void MetaStruct::SetField(const std::string& field, const std::shared_ptr<MetaString>& value,
                          const std::string& documentation) {
    SetAny(field, value, documentation);
}

void MetaStruct::SetField(const std::string& field, const std::shared_ptr<MetaInt>& value,
                          const std::string& documentation) {
    SetAny(field, value, documentation);
}

void MetaStruct::SetField(const std::string& field, const std::shared_ptr<MetaBool>& value,
                          const std::string& documentation) {
    SetAny(field, value, documentation);
}

void MetaStruct::SetField(const std::string& field, const std::shared_ptr<MetaList>& value,
                          const std::string& documentation) {
    SetAny(field, value, documentation);
}

std::shared_ptr<MetaObject> MetaStruct::GetField(const std::string& field) const {
    for (const auto& entry : fields_) {
        if (entry.name == field) {
            return entry.value;
        }
    }
    return nullptr;
}

void MetaStruct::SetAny(const std::string& field, std::shared_ptr<MetaObject> value,
                        const std::string& documentation) {
    for (auto& entry : fields_) {
        if (entry.name == field) {
            entry.value = std::move(value);
            entry.documentation = documentation;
            return;
        }
    }
    fields_.push_back(Field{field, std::move(value), documentation});
}

std::shared_ptr<MetaList> MetaList::New(MetaType elementType) {
    return New(elementType, nullptr);
}

std::shared_ptr<MetaList> MetaList::New(MetaType elementType,
                                        std::shared_ptr<MetaObject> elementTemplate) {
    auto object = std::make_shared<MetaList>();
    object->elementType_ = elementType;
    object->template_ = std::move(elementTemplate);
    return object;
}

MetaType MetaList::GetType() const {
    return META_LIST;
}

void MetaList::Reserve(size_t count) {
    elements_.reserve(count);
}

void MetaList::Add(const std::string& value) {
    if (elementType_ != META_STRING) {
        throw std::logic_error("MetaList::Add: a text added to a list of other elements");
    }
    elements_.push_back(MetaString::New(value));
}

void MetaList::Add(const std::shared_ptr<MetaStruct>& value) {
    if (elementType_ != META_STRUCT) {
        throw std::logic_error("MetaList::Add: a structure added to a list of other elements");
    }
    if (!value) {
        throw std::invalid_argument("MetaList::Add: null structure");
    }
    elements_.push_back(value);
}

}  // namespace MetaObj
}  // namespace Kalmor
