// The seam behind the host-control library's static entry points.
//
// The plug-in calls static operations (MeskPluginFactory::GetMeskPlugin, MeskInfo::GetMeskDisks,
// the MeskUtil statics, the host UUID functions). Each forwards to the installed backend: the
// simulated host by default, or a test double that a unit test installs, which is why the
// statics are virtual operations here. The MeskUtil statics are declared from their rows in
// Operations.h; the pure conversions have working default implementations (HostCtl.cpp), so a
// backend overrides only what it simulates.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "Operations.h"
#include "Visibility.h"
#include "hostctl/MeskInfo.h"
#include "hostctl/MeskPlugin.h"
#include "hostctl/MeskTypes.h"

namespace HostCtlSim {

#define HOSTCTL_BACKEND_OPERATION_(result, name, parameters, arguments) \
    virtual result name parameters = 0;
#define HOSTCTL_BACKEND_CONVERSION_(result, name, parameters, arguments) \
    virtual result name parameters;
class HOSTCTL_API HostBackend {
  public:
    virtual ~HostBackend();

    virtual std::unique_ptr<HostCtl::MeskPlugin> GetMeskPlugin() = 0;
    virtual void GetMeskDisks(std::vector<std::shared_ptr<HostCtl::Mesk::MeskDiskLun>>& luns) = 0;
    HOSTCTL_UTIL_OPERATIONS(HOSTCTL_BACKEND_OPERATION_)

    // Working defaults: local time, UUID and policy class conversions, UTF-8 counting,
    // random UUIDs from the kernel's random source.
    HOSTCTL_UTIL_CONVERSIONS(HOSTCTL_BACKEND_CONVERSION_)
    virtual char* UUID_CreateRandom();
    virtual char* UUID_PackText(const char* text, char* buffer, size_t length);
};
#undef HOSTCTL_BACKEND_OPERATION_
#undef HOSTCTL_BACKEND_CONVERSION_

// The backend the static entry points forward to. Without an installed one, the simulated
// host (made on first use) serves.
HOSTCTL_API HostBackend& CurrentBackend();
// Installs `backend` (not owned) for every later call; nullptr restores the simulated host.
HOSTCTL_API void SetBackend(HostBackend* backend);

}  // namespace HostCtlSim
