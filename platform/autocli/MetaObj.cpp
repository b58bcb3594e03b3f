// Result values: scalars, structures and lists.
#include "autocli/MetaObj.h"

#include <stdexcept>

namespace Kalmor {
namespace MetaObj {

// Field names and documentation texts in order. A layout is changed only by a structure
// that holds the only reference to it; once shared it stays as it is, so that a structure
// sharing it reads the same names for as long as it lives.
struct MetaStruct::Layout {
    std::string structName;
    std::vector<std::string> names;
    std::vector<std::string> documentation;
};

namespace {

// The layout that the next structure made with the same name on this thread starts from.
thread_local std::shared_ptr<MetaStruct::Layout> recentLayout;

template <class Scalar>
std::shared_ptr<Scalar> Empty() {
    static const std::shared_ptr<Scalar> empty = std::make_shared<Scalar>();
    return empty;
}

}  // namespace

MetaObject::~MetaObject() = default;

std::shared_ptr<MetaString> MetaString::New() {
    return Empty<MetaString>();
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
    return Empty<MetaInt>();
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
    return Empty<MetaBool>();
}

std::shared_ptr<MetaBool> MetaBool::New(bool value) {
    static const std::shared_ptr<MetaBool> values[2] = {
        [] {
            auto object = std::make_shared<MetaBool>();
            object->hasValue_ = true;
            return object;
        }(),
        [] {
            auto object = std::make_shared<MetaBool>();
            object->hasValue_ = true;
            object->value_ = true;
            return object;
        }(),
    };
    return values[value ? 1 : 0];
}

MetaType MetaBool::GetType() const {
    return META_BOOL;
}

const std::string MetaStruct::_docEmpty;

std::shared_ptr<MetaStruct> MetaStruct::New(const std::string& name) {
    auto object = std::make_shared<MetaStruct>();
    object->name_ = name;
    const std::shared_ptr<Layout>& recent = recentLayout;
    if (recent && recent->structName == name) {
        object->layout_ = recent;
        object->values_.reserve(recent->names.size());
    }
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

MetaStruct::Field MetaStruct::FieldAt(size_t index) const {
    return Field{layout_->names[index], values_[index], layout_->documentation[index]};
}

size_t MetaStruct::FindField(const std::string& field) const {
    const size_t count = values_.size();
    // Fields are mostly set again and read in their order: look after the last one first.
    for (size_t i = next_; i < count; ++i) {
        if (layout_->names[i] == field) return i;
    }
    for (size_t i = 0; i < next_ && i < count; ++i) {
        if (layout_->names[i] == field) return i;
    }
    return count;
}

std::shared_ptr<MetaObject> MetaStruct::GetField(const std::string& field) const {
    const size_t index = FindField(field);
    return index < values_.size() ? values_[index] : nullptr;
}

bool MetaStruct::HasFieldsOf(const MetaStruct& other) const {
    if (values_.size() != other.values_.size()) return false;
    if (layout_ == other.layout_) return true;
    for (size_t i = 0; i < values_.size(); ++i) {
        if (layout_->names[i] != other.layout_->names[i]) return false;
    }
    return true;
}

void MetaStruct::ShareLayout() const {
    if (layout_ && !values_.empty()) recentLayout = layout_;
}

void MetaStruct::SetAny(const std::string& field, std::shared_ptr<MetaObject> value,
                        const std::string& documentation) {
    const size_t count = values_.size();
    // A field that the shared names hold next is new: a layout never names a field twice.
    if (layout_ && layout_->names.size() > count && layout_->names[count] == field &&
        layout_->documentation[count] == documentation) {
        values_.push_back(std::move(value));
        next_ = count + 1;
        return;
    }
    const size_t found = FindField(field);
    if (found < count) {
        values_[found] = std::move(value);
        if (layout_->documentation[found] != documentation) {
            // Another text for a field keeps the field's place: the names are copied first
            // when they are shared.
            if (layout_.use_count() > 1) layout_ = std::make_shared<Layout>(*layout_);
            layout_->documentation[found] = documentation;
        }
        next_ = found + 1;
        return;
    }
    if (!layout_ || layout_.use_count() > 1 || layout_->names.size() > count) {
        auto own = std::make_shared<Layout>();
        own->structName = name_;
        if (layout_) {
            own->names.assign(layout_->names.begin(), layout_->names.begin() + count);
            own->documentation.assign(layout_->documentation.begin(),
                                      layout_->documentation.begin() + count);
        }
        layout_ = std::move(own);
    }
    layout_->names.push_back(field);
    layout_->documentation.push_back(documentation);
    values_.push_back(std::move(value));
    next_ = count + 1;
}

std::shared_ptr<MetaList> MetaList::New(MetaType elementType) {
    return New(elementType, nullptr);
}

std::shared_ptr<MetaList> MetaList::New(MetaType elementType,
                                        std::shared_ptr<MetaObject> elementTemplate) {
    auto object = std::make_shared<MetaList>();
    object->elementType_ = elementType;
    object->template_ = std::move(elementTemplate);
    // The elements to come are most likely made like the template.
    if (object->template_ && object->template_->GetType() == META_STRUCT) {
        static_cast<const MetaStruct&>(*object->template_).ShareLayout();
    }
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
    value->ShareLayout();
    elements_.push_back(value);
}

}  // namespace MetaObj
}  // namespace Kalmor
