#include "commands/common/OutputFields.h"

#include <stdexcept>

namespace OrvaneCli {
namespace MeskNamespace {

using Kalmor::MetaObj::MetaBool;
using Kalmor::MetaObj::MetaInt;
using Kalmor::MetaObj::MetaList;
using Kalmor::MetaObj::MetaString;
using Kalmor::MetaObj::MetaStruct;

std::string JoinFieldNames(const OutputField* fields, size_t count) {
    std::string joined;
    for (size_t i = 0; i < count; ++i) {
        if (i != 0) joined += ',';
        joined += fields[i].name;
    }
    return joined;
}

void AddEmptyFields(MetaStruct& structure, const OutputField* fields, size_t count) {
    const std::string& doc = MetaStruct::_docEmpty;
    for (size_t i = 0; i < count; ++i) {
        const OutputField& field = fields[i];
        switch (field.type) {
            case Kalmor::MetaObj::META_BOOL:
                structure.SetField(field.name, MetaBool::New(), doc);
                break;
            case Kalmor::MetaObj::META_INT:
                structure.SetField(field.name, MetaInt::New(), doc);
                break;
            case Kalmor::MetaObj::META_STRING:
                structure.SetField(field.name, MetaString::New(), doc);
                break;
            case Kalmor::MetaObj::META_LIST:
                structure.SetField(field.name, MetaList::New(Kalmor::MetaObj::META_STRING), doc);
                break;
            default:
                throw std::logic_error(std::string("no empty value for output field ") +
                                       field.name);
        }
    }
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
