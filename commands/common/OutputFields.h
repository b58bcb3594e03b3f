// A command's output fields, declared once in the command's source and fed from there to its
// "fields:" default output parameter, its result structure and the rows it fills.
#pragma once

#include <cstddef>
#include <memory>
#include <string>

#include "autocli/MetaObj.h"

namespace OrvaneCli {
namespace MeskNamespace {

// One field of a result structure: the name it is shown under and the kind of value it holds
// (META_BOOL, META_INT, META_STRING, or META_LIST for a list of texts).
struct OutputField {
    const char* name;
    Kalmor::MetaObj::MetaType type;
};

// Returns the fields' names joined by commas: the value of a "fields:" output parameter.
std::string JoinFieldNames(const OutputField* fields, size_t count);
template <size_t N>
std::string JoinFieldNames(const OutputField (&fields)[N]) {
    return JoinFieldNames(fields, N);
}

// Adds each field to the structure, in order, with an empty value of its kind.
void AddEmptyFields(Kalmor::MetaObj::MetaStruct& structure, const OutputField* fields,
                    size_t count);
template <size_t N>
void AddEmptyFields(Kalmor::MetaObj::MetaStruct& structure, const OutputField (&fields)[N]) {
    AddEmptyFields(structure, fields, N);
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
