// The simulated host's info object and what the files answering its operations share.
//
// SimInfo declares every operation of the info object; each area's file (SimCluster.cpp,
// SimNetwork.cpp, SimStorage.cpp, SimSettings.cpp) defines its own, and the static entry points
// of SimHost.h of the same area sit beside them. Operations.h lists them all.
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

class SimInfo : public HostCtl::Mesk::MeskInfo2 {
  public:
    explicit SimInfo(SimHost& host) : host_(host) {}

    // Cluster membership and unicast agents (SimCluster.cpp).
    const MeskClusterConfig& GetClusterConfig() override;
    bool IsWitness() override;
    MeskConfigGeneration GetConfigGeneration() override;
    void JoinCluster(const Uuid& clusterUuid, bool witnessNode,
                     const std::string& preferredFaultDomain, bool wait, int32_t flags) override;
    void CreateCluster(const std::string& clusterUuid, bool join, bool wait) override;
    void LeaveCluster(bool force) override;
    void RestoreClusterConfig(bool boot) override;
    void SetPreferredFaultDomain(const std::string& name) override;
    void GetUnicastWitnesses(std::vector<std::string>& witnesses) override;
    void AddUnicastAgent(const std::string& nodeUuid, bool isWitness, bool supportsUnicast,
                         const MeskIpAddress& address, int32_t port, bool hasInterface,
                         const std::string& interfaceName) override;
    void RefreshUnicastAgents() override;
    void GetUnicastAgents(std::vector<std::string>& agents) override;
    bool RemoveUnicastAgent(const std::string& nodeUuid, const MeskIpAddress& address,
                            int32_t port) override;

    // Network interfaces (SimNetwork.cpp).
    bool IsZuvNicInUse(const std::string& interfaceName, const std::string& trafficType) override;
    bool RemoveZuvNic(const std::string& interfaceName, bool force,
                      const std::string& trafficType) override;
    void ClearNetworkConfig() override;
    void RestoreNetworkConfig() override;
    std::vector<std::unique_ptr<MeskZuvNicConfig2>> GetZuvNicConfigs() override;
    bool SetZuvNicConfig(const MeskZuvNicConfig2& config) override;

    // Disks (SimStorage.cpp).
    void GetMeskDiskUuids(std::vector<Uuid>& uuids) override;
    void GetDiskInfo(const Uuid& uuid, const std::vector<std::shared_ptr<MeskDiskLun>>& luns,
                     MeskDiskInfo& info) override;
    void AddDisks(const std::string& ssd, const std::vector<std::string>& disks) override;
    void RemoveDisk(const std::string& disk, const std::string& evacuationMode) override;
    void RemoveDiskGroup(const std::string& ssd, const std::string& evacuationMode) override;
    void RemoveDiskByUuid(const std::string& uuid, const std::string& evacuationMode) override;
    void MountDiskGroup(const std::string& ssd, bool flag) override;
    void MountByUuid(const std::string& uuid) override;
    void MountDisk(const std::string& disk) override;
    void UnmountDiskGroup(const std::string& ssd, bool flag) override;
    void UnmountDisk(const std::string& disk, bool flag) override;
    void AddCapacityFlashTag(const std::string& disk) override;
    void RemoveCapacityFlashTag(const std::string& disk) override;
    bool GetAutoClaimMode() override;
    void SetAutoClaimMode(bool enabled) override;

    // Settings, policies and resync (SimSettings.cpp).
    std::string GetDatastoreName() override;
    void SetDatastoreName(const std::string& name) override;
    std::string GetFaultDomainName() override;
    void SetFaultDomainName(const std::string& name) override;
    void ResetFaultDomainName() override;
    std::string GetDefaultPolicy(const std::string& policyClass) override;
    void SetDefaultPolicy(const std::string& policyClass, const std::string& policy) override;
    void ClearDefaultPolicies() override;
    int64_t GetResyncBandwidth() override;
    int64_t GetResyncThrottle() override;
    void SetResyncThrottle(int64_t level) override;

  private:
    StateStore& Store() { return host_.Store(); }
    // Sets one key of a section, in one transaction.
    void SetValue(const char* section, const char* key, const Json& value);

    SimHost& host_;
    MeskClusterConfig config_;
};

}  // namespace HostCtlSim
