// A command's output fields, declared once in the command's source and fed from there to its
// "fields:" default output parameter, its result structure and the rows it fills.
#pragma once

#include <atomic>
#include <cstddef>
#include <memory>
#include <string>

#include "autocli/MetaObj.h"

namespace OrvaneCli {
namespace MeskNamespace {

// One field of a result structure: the name it is shown under and the kind of value it holds
// (META_BOOL, META_INT, META_STRING, or META_LIST for a list of texts). Declared as a constant
// of the command's source; nothing of it is built when the library is loaded.
class OutputField {
  public:
    constexpr OutputField(const char* name, Kalmor::MetaObj::MetaType type)
        : name(name), type(type) {}
    OutputField(const OutputField&) = delete;
    OutputField& operator=(const OutputField&) = delete;

    // The name as the text that SetField takes, made on first use and kept: a listing sets
    // each field of thousands of rows, and a text made from `name` for each would cost an
    // allocation.
    const std::string& Text() const;

    const char* const name;
    const Kalmor::MetaObj::MetaType type;

  private:
    mutable std::atomic<const std::string*> text_{nullptr};
};

// A command's fields in display order.
using OutputFieldList = const OutputField* const*;

// Returns the fields' names joined by commas: the value of a "fields:" output parameter.
std::string JoinFieldNames(OutputFieldList fields, size_t count);
template <size_t N>
std::string JoinFieldNames(const OutputField* const (&fields)[N]) {
    return JoinFieldNames(fields, N);
}

// Adds each field to the structure, in order, with an empty value of its kind.
void AddEmptyFields(Kalmor::MetaObj::MetaStruct& structure, OutputFieldList fields, size_t count);
template <size_t N>
void AddEmptyFields(Kalmor::MetaObj::MetaStruct& structure, const OutputField* const (&fields)[N]) {
    AddEmptyFields(structure, fields, N);
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
