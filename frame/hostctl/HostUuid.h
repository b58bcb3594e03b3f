// UUID helpers of the host utility library.
#pragma once

#include <cstddef>

#include "Visibility.h"

extern "C" {

// Returns a newly allocated, NUL-terminated text of a random UUID, or NULL. The caller
// releases it with free().
HOSTCTL_API char* UUID_CreateRandom(void);

// Checks the UUID text of `length` bytes and writes its canonical text form, NUL-terminated,
// to `buffer` (which may be `text` itself and must hold length + 1 bytes). Returns `buffer`,
// or NULL when the text is not a UUID.
HOSTCTL_API char* UUID_PackText(const char* text, char* buffer, size_t length);
}
