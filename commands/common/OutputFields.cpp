#include "commands/common/OutputFields.h"

#include <stdexcept>

namespace OrvaneCli {
namespace MeskNamespace {

using Kalmor::MetaObj::MetaBool;
using Kalmor::MetaObj::MetaInt;
using Kalmor::MetaObj::MetaList;
using Kalmor::MetaObj::MetaString;
using Kalmor::MetaObj::MetaStruct;

const std::string& OutputField::Text() const {
    const std::string* text = text_.load(std::memory_order_acquire);
    if (text == nullptr) {
        // Whoever comes first keeps theirs; a text made at the same time by another is dropped.
        auto made = std::make_unique<const std::string>(name);
        if (text_.compare_exchange_strong(text, made.get(), std::memory_order_acq_rel)) {
            text = made.release();
        }
    }
    return *text;
}

std::string JoinFieldNames(OutputFieldList fields, size_t count) {
    std::string joined;
    for (size_t i = 0; i < count; ++i) {
        if (i != 0) joined += ',';
        joined += fields[i]->name;
    }
    return joined;
}

void AddEmptyFields(MetaStruct& structure, OutputFieldList fields, size_t count) {
    const std::string& doc = MetaStruct::_docEmpty;
    for (size_t i = 0; i < count; ++i) {
        const OutputField& field = *fields[i];
        switch (field.type) {
            case Kalmor::MetaObj::META_BOOL:
                structure.SetField(field.Text(), MetaBool::New(), doc);
                break;
            case Kalmor::MetaObj::META_INT:
                structure.SetField(field.Text(), MetaInt::New(), doc);
                break;
            case Kalmor::MetaObj::META_STRING:
                structure.SetField(field.Text(), MetaString::New(), doc);
                break;
            case Kalmor::MetaObj::META_LIST:
                structure.SetField(field.Text(), MetaList::New(Kalmor::MetaObj::META_STRING), doc);
                break;
            default:
                throw std::logic_error(std::string("no empty value for output field ") +
                                       field.name);
        }
    }
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
