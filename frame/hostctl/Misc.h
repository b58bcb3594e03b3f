// Text helpers of the host-control library.
#pragma once

#include <string>

#include "Visibility.h"

namespace HostCtl {
namespace Misc {

// Formats like printf and returns the text.
HOSTCTL_API std::string StrPrintf(const char* format, ...) __attribute__((format(printf, 1, 2)));

}  // namespace Misc
}  // namespace HostCtl
