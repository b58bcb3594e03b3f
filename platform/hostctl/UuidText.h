// The 36-character text form of a UUID ("52a0e7c4-1b2d-4e3f-8a90-0b1c2d3e4f01"), read and
// written by table: a listing converts each disk's UUID several times.
#pragma once

#include <cstddef>

#include "hostctl/MeskTypes.h"

namespace HostCtlSim {

// Parses `length` bytes of text (hexadecimal digits in either case); false for anything that
// is not the text form, leaving `uuid` undefined.
bool ParseUuid(const char* text, size_t length, HostCtl::Mesk::Uuid& uuid);

// Writes the text form in lower case and a NUL after it: 37 bytes at `out`.
void FormatUuid(const HostCtl::Mesk::Uuid& uuid, char* out);

}  // namespace HostCtlSim
