#include "commands/trace/TraceRestartWait.h"

#include <unistd.h>

#include <utility>

namespace OrvaneCli {
namespace MeskNamespace {

namespace {

std::function<void(unsigned)>& InstalledWait() {
    static std::function<void(unsigned)> wait;
    return wait;
}

}  // namespace

void RestartWait(unsigned seconds) {
    const auto& wait = InstalledWait();
    if (wait) {
        wait(seconds);
    } else {
        sleep(seconds);
    }
}

void SetRestartWait(std::function<void(unsigned seconds)> wait) {
    InstalledWait() = std::move(wait);
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
