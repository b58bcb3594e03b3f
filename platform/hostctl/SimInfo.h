// The simulated host's info object and what the files answering its operations share.
//
// SimInfo declares every operation of the info object from its row in Operations.h; each area's
// file (SimCluster.cpp, SimNetwork.cpp, SimStorage.cpp, SimSettings.cpp) defines its own, and
// the static entry points of SimHost.h of the same area sit beside them.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "SimHost.h"
#include "hostctl/MeskCtlException.h"
#include "hostctl/MeskInfo.h"

namespace HostCtlSim {

using HostCtl::Lib::Mesk::MeskCtlException;
using HostCtl::Mesk::MeskClusterConfig;
using HostCtl::Mesk::MeskConfigGeneration;
using HostCtl::Mesk::MeskDiskInfo;
using HostCtl::Mesk::MeskDiskLun;
using HostCtl::Mesk::MeskIpAddress;
using HostCtl::Mesk::MeskMemberInfo;
using HostCtl::Mesk::MeskPolicyClass;
using HostCtl::Mesk::MeskZuvNicConfig2;
using HostCtl::Mesk::Uuid;

// Throws MeskCtlException with `message`: the host refuses the operation.
[[noreturn]] void Refuse(const std::string& message);
// `text` in single quotes, as refusals quote names.
std::string Quoted(const std::string& text);
// A new random UUID text, in lower case.
std::string NewUuid();
int64_t NowNanoseconds();  // since the epoch
// Refuses a port outside 1..65535; `what` names it in the message.
void CheckPort(const char* what, int32_t port);

#define HOSTCTL_SIM_INFO_OPERATION_(result, name, parameters, arguments) \
    result name parameters override;
class SimInfo : public HostCtl::Mesk::MeskInfo2 {
  public:
    explicit SimInfo(SimHost& host) : host_(host) {}

    // Each answered by the file of its area (Operations.h).
    HOSTCTL_INFO_OPERATIONS(HOSTCTL_SIM_INFO_OPERATION_)
    HOSTCTL_INFO2_OPERATIONS(HOSTCTL_SIM_INFO_OPERATION_)

  private:
    StateStore& Store() { return host_.Store(); }
    // Sets one key of a section, in one transaction.
    void SetValue(const char* section, const char* key, const Json& value);

    SimHost& host_;
    MeskClusterConfig config_;
};
#undef HOSTCTL_SIM_INFO_OPERATION_

}  // namespace HostCtlSim
