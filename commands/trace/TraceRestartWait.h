// The pause between two attempts to restart the tracing service.
//
// trace set waits between failed restarts; tests put a recording function in place of the
// real sleep so that they need not wait.
#pragma once

#include <functional>

namespace OrvaneCli {
namespace MeskNamespace {

// Waits that many seconds, through the function installed last (sleep by default).
void RestartWait(unsigned seconds);

// Installs the function that RestartWait calls; an empty function restores sleep.
void SetRestartWait(std::function<void(unsigned seconds)> wait);

}  // namespace MeskNamespace
}  // namespace OrvaneCli
