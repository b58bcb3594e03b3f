// The seam behind the host-control library's static entry points.
//
// The plug-in calls static operations (MeskPluginFactory::GetMeskPlugin, MeskInfo::GetMeskDisks,
// the MeskUtil statics, the host UUID functions). Each forwards to the installed backend: the
// simulated host by default, or a test double that a unit test installs. The pure conversions
// have working default implementations here, so a backend overrides only what it simulates.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "Visibility.h"
#include "hostctl/MeskInfo.h"
#include "hostctl/MeskPlugin.h"
#include "hostctl/MeskTypes.h"

namespace HostCtlSim {

class HOSTCTL_API HostBackend {
  public:
    virtual ~HostBackend();

    virtual std::unique_ptr<HostCtl::MeskPlugin> GetMeskPlugin() = 0;
    virtual void GetMeskDisks(std::vector<std::shared_ptr<HostCtl::Mesk::MeskDiskLun>>& luns) = 0;

    virtual void GetInfoFromKOVRA(std::vector<HostCtl::Mesk::MeskMemberInfo>& members,
                                  std::string& localNodeState, std::string& localNodeUuid,
                                  std::string& localNodeHealthState,
                                  uint64_t& membershipEntryRevision, std::string& membershipUuid,
                                  std::string& masterUuid, std::string& backupUuid,
                                  std::string& maintenanceModeState) = 0;
    virtual void GetUnicastMode(bool& unicast) = 0;
    virtual bool IsInStretchedCluster() = 0;
    virtual void GetPreferredFaultDomainInfo(std::string& id, std::string& name) = 0;
    virtual bool IsWitnessNode() = 0;
    virtual std::string GetFaultDomainId() = 0;
    virtual void DecomCancel() = 0;
    virtual int32_t MeskExec(const std::string& command, const std::string& argument, bool flag1,
                             bool flag2, bool flag3) = 0;

    // Working defaults: local time, UUID and policy class conversions, UTF-8 counting,
    // random UUIDs through libuuid.
    virtual std::string GetFormattedSystemDateTime();
    virtual HostCtl::Mesk::Uuid StringToMeskUuid(const std::string& text);
    virtual std::string MeskUuidToString(const HostCtl::Mesk::Uuid& uuid);
    virtual size_t UTF8StringCharLength(const std::string& text);
    virtual HostCtl::Mesk::MeskPolicyClass StringToMeskPolicyClass(const std::string& name);
    virtual std::string MeskPolicyClassToString(HostCtl::Mesk::MeskPolicyClass policyClass);
    virtual std::vector<HostCtl::Mesk::MeskPolicyClass> GetMeskPolicyClasses();
    virtual char* UUID_CreateRandom();
    virtual char* UUID_PackText(const char* text, char* buffer, size_t length);
};

// The backend the static entry points forward to. Without an installed one, the simulated
// host (made on first use) serves.
HOSTCTL_API HostBackend& CurrentBackend();
// Installs `backend` (not owned) for every later call; nullptr restores the simulated host.
HOSTCTL_API void SetBackend(HostBackend* backend);

}  // namespace HostCtlSim
