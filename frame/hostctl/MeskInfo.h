// The info object: the host-control library's view of the host's Mesk configuration.
// Every operation may throw HostCtl::Lib::Mesk::MeskCtlException.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "Visibility.h"
#include "hostctl/MeskTypes.h"

namespace HostCtl {
namespace Mesk {

// One disk device of the host.
class HOSTCTL_API MeskDiskLun {
  public:
    virtual ~MeskDiskLun();
    // The disk's Mesk UUID.
    virtual Uuid GetUuid() const = 0;
    // The disk's device name, e.g. "mpx.pthba2:C0:T1:L0".
    virtual std::string GetName() const = 0;
};

class HOSTCTL_API MeskInfo {
  public:
    virtual ~MeskInfo();

    // Fills `luns` with the host's disk devices.
    static void GetMeskDisks(std::vector<std::shared_ptr<MeskDiskLun>>& luns);

    // Cluster membership.
    // The host's cluster configuration; owned by this object.
    virtual const MeskClusterConfig& GetClusterConfig() = 0;
    // True iff this host is a witness node.
    virtual bool IsWitness() = 0;
    virtual MeskConfigGeneration GetConfigGeneration() = 0;
    virtual void JoinCluster(const Uuid& clusterUuid, bool witnessNode,
                             const std::string& preferredFaultDomain, bool wait, int32_t flags) = 0;
    virtual void CreateCluster(const std::string& clusterUuid, bool join, bool wait) = 0;
    virtual void LeaveCluster(bool force) = 0;
    virtual void RestoreClusterConfig(bool boot) = 0;
    virtual void SetPreferredFaultDomain(const std::string& name) = 0;

    // Unicast agents.
    // Fills `witnesses` with one text per unicast witness configured on this host.
    virtual void GetUnicastWitnesses(std::vector<std::string>& witnesses) = 0;
    virtual void AddUnicastAgent(const std::string& nodeUuid, bool isWitness, bool supportsUnicast,
                                 const MeskIpAddress& address, int32_t port, bool hasInterface,
                                 const std::string& interfaceName) = 0;
    virtual void RefreshUnicastAgents() = 0;
    // Fills `agents` with one entry per agent: "uuid;isWitness;supportsUnicast;ip;port;iface".
    virtual void GetUnicastAgents(std::vector<std::string>& agents) = 0;
    // Removes the agent; returns true iff the removed agent was a witness.
    virtual bool RemoveUnicastAgent(const std::string& nodeUuid, const MeskIpAddress& address,
                                    int32_t port) = 0;

    // Network interfaces.
    // True iff the interface is configured for that traffic type ("mesk" or "witness").
    virtual bool IsZuvNicInUse(const std::string& interfaceName,
                               const std::string& trafficType) = 0;
    virtual bool RemoveZuvNic(const std::string& interfaceName, bool force,
                              const std::string& trafficType) = 0;
    virtual void ClearNetworkConfig() = 0;
    virtual void RestoreNetworkConfig() = 0;

    // Storage.
    // Fills `uuids` with the disks that the cluster service holds for this host.
    virtual void GetMeskDiskUuids(std::vector<Uuid>& uuids) = 0;
    // Fills `info` for the disk with that UUID; `luns` is the host's disk list.
    virtual void GetDiskInfo(const Uuid& uuid,
                             const std::vector<std::shared_ptr<MeskDiskLun>>& luns,
                             MeskDiskInfo& info) = 0;
    virtual void AddDisks(const std::string& ssd, const std::vector<std::string>& disks) = 0;
    virtual void RemoveDisk(const std::string& disk, const std::string& evacuationMode) = 0;
    virtual void RemoveDiskGroup(const std::string& ssd, const std::string& evacuationMode) = 0;
    virtual void RemoveDiskByUuid(const std::string& uuid, const std::string& evacuationMode) = 0;
    virtual void MountDiskGroup(const std::string& ssd, bool flag) = 0;
    virtual void MountByUuid(const std::string& uuid) = 0;
    virtual void MountDisk(const std::string& disk) = 0;
    virtual void UnmountDiskGroup(const std::string& ssd, bool flag) = 0;
    virtual void UnmountDisk(const std::string& disk, bool flag) = 0;
    virtual void AddCapacityFlashTag(const std::string& disk) = 0;
    virtual void RemoveCapacityFlashTag(const std::string& disk) = 0;
    virtual bool GetAutoClaimMode() = 0;
    virtual void SetAutoClaimMode(bool enabled) = 0;

    // Host settings.
    virtual std::string GetDatastoreName() = 0;
    virtual void SetDatastoreName(const std::string& name) = 0;
    virtual std::string GetFaultDomainName() = 0;
    virtual void SetFaultDomainName(const std::string& name) = 0;
    virtual void ResetFaultDomainName() = 0;

    // Default policies, by policy class name.
    virtual std::string GetDefaultPolicy(const std::string& policyClass) = 0;
    virtual void SetDefaultPolicy(const std::string& policyClass, const std::string& policy) = 0;
    virtual void ClearDefaultPolicies() = 0;

    // Resync, in Mbps.
    virtual int64_t GetResyncBandwidth() = 0;
    virtual int64_t GetResyncThrottle() = 0;
    virtual void SetResyncThrottle(int64_t level) = 0;
};

// The extended info object, with the interfaces' full records.
class HOSTCTL_API MeskInfo2 : public virtual MeskInfo {
  public:
    ~MeskInfo2() override;
    // One record per configured interface, in the library's order.
    virtual std::vector<std::unique_ptr<MeskZuvNicConfig2>> GetZuvNicConfigs() = 0;
    // Writes the interface's configuration (adds it or replaces it).
    virtual bool SetZuvNicConfig(const MeskZuvNicConfig2& config) = 0;
};

}  // namespace Mesk
}  // namespace HostCtl
