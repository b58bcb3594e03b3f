// How a command reaches the host-control library: a fresh plug-in object per invocation,
// and from it a fresh info object.
#pragma once

#include <memory>

#include "Visibility.h"
#include "hostctl/MeskInfo.h"

namespace HostCtl {

class HOSTCTL_API MeskPlugin {
  public:
    // Returns a new info object, owned by the caller. May throw MeskCtlException.
    virtual std::unique_ptr<Mesk::MeskInfo> GetMeskInfo() = 0;
    virtual ~MeskPlugin();
};

class HOSTCTL_API MeskPluginFactory {
  public:
    // Returns a new plug-in object, owned by the caller. May throw MeskCtlException.
    static std::unique_ptr<MeskPlugin> GetMeskPlugin();
};

}  // namespace HostCtl
