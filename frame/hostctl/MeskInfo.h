// The info object: the host-control library's view of the host's Mesk configuration.
// Every operation may throw HostCtl::Lib::Mesk::MeskCtlException, whose message is meant for
// the user; a refused operation changes nothing. Out-arguments (`std::vector&`,
// records) are filled by the operation and should be passed empty.
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

    // Appends the host's disk devices to `luns`, in the host's inventory order.
    static void GetMeskDisks(std::vector<std::shared_ptr<MeskDiskLun>>& luns);

    // Cluster membership.
    // Returns the host's cluster configuration, owned by this object and valid while it lives.
    virtual const MeskClusterConfig& GetClusterConfig() = 0;
    // Returns true iff this host is a witness node.
    virtual bool IsWitness() = 0;
    // Returns the identity of the cluster configuration's current generation.
    virtual MeskConfigGeneration GetConfigGeneration() = 0;
    // Joins the host to the cluster `clusterUuid`. `witnessNode`: join as the cluster's
    // witness, whose preferred fault domain is then `preferredFaultDomain` (ignored otherwise).
    // `wait`: return only once the join has finished. `flags` are the service's own; callers
    // pass 0. Throws MeskCtlException when the host is already in a cluster.
    virtual void JoinCluster(const Uuid& clusterUuid, bool witnessNode,
                             const std::string& preferredFaultDomain, bool wait, int32_t flags) = 0;
    // Makes the host the first member of a new cluster whose UUID is the text `clusterUuid`.
    // `join` and `wait` are passed on to the service (callers pass true and false). Throws
    // MeskCtlException when the text is not a UUID or the host is already in a cluster.
    virtual void CreateCluster(const std::string& clusterUuid, bool join, bool wait) = 0;
    // Takes the host out of its cluster. `force` is passed on to the service (callers pass
    // false). Throws MeskCtlException when the host is in no cluster.
    virtual void LeaveCluster(bool force) = 0;
    // Applies the persisted cluster configuration again. `boot`: the host is starting up.
    virtual void RestoreClusterConfig(bool boot) = 0;
    // Names the stretched cluster's preferred fault domain; only the witness node may.
    virtual void SetPreferredFaultDomain(const std::string& name) = 0;

    // Unicast agents.
    // Fills `witnesses` with one text per unicast witness configured on this host.
    virtual void GetUnicastWitnesses(std::vector<std::string>& witnesses) = 0;
    // Adds a unicast agent: the node `nodeUuid`, reached at `address` and `port`. `isWitness`:
    // the node is the cluster's witness. `supportsUnicast`: the node speaks unicast itself.
    // `hasInterface`: the agent is reached through the interface `interfaceName` (ignored
    // otherwise). Throws MeskCtlException when the same agent is already configured.
    virtual void AddUnicastAgent(const std::string& nodeUuid, bool isWitness, bool supportsUnicast,
                                 const MeskIpAddress& address, int32_t port, bool hasInterface,
                                 const std::string& interfaceName) = 0;
    // Makes the cluster service take up the current list of unicast agents.
    virtual void RefreshUnicastAgents() = 0;
    // Fills `agents` with one entry per agent: "uuid;isWitness;supportsUnicast;ip;port;iface".
    virtual void GetUnicastAgents(std::vector<std::string>& agents) = 0;
    // Removes the agent with that node UUID, address and port; returns true iff it was a
    // witness. Throws MeskCtlException when there is no such agent.
    virtual bool RemoveUnicastAgent(const std::string& nodeUuid, const MeskIpAddress& address,
                                    int32_t port) = 0;

    // Network interfaces.
    // Returns true iff the interface is configured for that traffic type ("mesk" or
    // "witness").
    virtual bool IsZuvNicInUse(const std::string& interfaceName,
                               const std::string& trafficType) = 0;
    // Stops the interface carrying that traffic type; returns true iff it carried it. `force`:
    // tell the cluster service of the removal even when the interface is not configured,
    // which is otherwise refused with MeskCtlException.
    virtual bool RemoveZuvNic(const std::string& interfaceName, bool force,
                              const std::string& trafficType) = 0;
    // Removes every interface from the configuration in use; the persisted copy stays.
    virtual void ClearNetworkConfig() = 0;
    // Applies the persisted network configuration again.
    virtual void RestoreNetworkConfig() = 0;

    // Storage.
    // Fills `uuids` with the disks that the cluster service holds for this host.
    virtual void GetMeskDiskUuids(std::vector<Uuid>& uuids) = 0;
    // Fills `info` for the disk with that UUID; `luns` is the host's disk list as GetMeskDisks
    // gave it. Throws MeskCtlException when the service knows no disk with that UUID.
    virtual void GetDiskInfo(const Uuid& uuid,
                             const std::vector<std::shared_ptr<MeskDiskLun>>& luns,
                             MeskDiskInfo& info) = 0;
    // Claims `disks` (device names) as capacity disks of the disk group that the SSD `ssd`
    // fronts, making the group when the SSD fronts none.
    virtual void AddDisks(const std::string& ssd, const std::vector<std::string>& disks) = 0;
    // Releases a capacity disk. `evacuationMode` says what becomes of its data: "" (the
    // service's default), "EnsureObjectAccessibility", "EvacuateAllData" or "NoAction".
    virtual void RemoveDisk(const std::string& disk, const std::string& evacuationMode) = 0;
    // Releases the SSD `ssd` and every disk of the group it fronts; `evacuationMode` as above.
    virtual void RemoveDiskGroup(const std::string& ssd, const std::string& evacuationMode) = 0;
    // RemoveDisk or RemoveDiskGroup of the disk whose Mesk UUID is the text `uuid`.
    virtual void RemoveDiskByUuid(const std::string& uuid, const std::string& evacuationMode) = 0;
    // Mounts the SSD `ssd` and every disk of its group. `serviceFlag` goes to the
    // cluster service, which alone gives it a meaning; callers pass false.
    virtual void MountDiskGroup(const std::string& ssd, bool serviceFlag) = 0;
    // Mounts the disk, or the whole group of the fronting SSD, whose Mesk UUID is `uuid`.
    virtual void MountByUuid(const std::string& uuid) = 0;
    // Mounts one claimed disk.
    virtual void MountDisk(const std::string& disk) = 0;
    // Unmounts the SSD `ssd` and every disk of its group. `serviceFlag` goes to the
    // cluster service, which alone gives it a meaning; callers pass true.
    virtual void UnmountDiskGroup(const std::string& ssd, bool serviceFlag) = 0;
    // Unmounts one claimed disk; `serviceFlag` as for UnmountDiskGroup (callers pass true).
    virtual void UnmountDisk(const std::string& disk, bool serviceFlag) = 0;
    // Tags an unclaimed SSD so that it may be claimed as a capacity disk.
    virtual void AddCapacityFlashTag(const std::string& disk) = 0;
    // Removes that tag from an unclaimed SSD.
    virtual void RemoveCapacityFlashTag(const std::string& disk) = 0;
    // Returns true iff the service claims the host's empty disks by itself.
    virtual bool GetAutoClaimMode() = 0;
    // Turns that automatic claiming on or off.
    virtual void SetAutoClaimMode(bool enabled) = 0;

    // Host settings.
    // Returns the name of the cluster's datastore.
    virtual std::string GetDatastoreName() = 0;
    // Renames the cluster's datastore; throws MeskCtlException for an empty name.
    virtual void SetDatastoreName(const std::string& name) = 0;
    // Returns the name of the host's fault domain, "" when it has none of its own.
    virtual std::string GetFaultDomainName() = 0;
    // Puts the host in the fault domain `name`; throws MeskCtlException for an empty name.
    virtual void SetFaultDomainName(const std::string& name) = 0;
    // Takes the host back to the default fault domain.
    virtual void ResetFaultDomainName() = 0;

    // Default policies, by policy class name. Each operation that takes a class throws
    // MeskCtlException for a name that is no policy class.
    // Returns the class's default policy.
    virtual std::string GetDefaultPolicy(const std::string& policyClass) = 0;
    // Makes `policy` the class's default; throws MeskCtlException for an empty policy.
    virtual void SetDefaultPolicy(const std::string& policyClass, const std::string& policy) = 0;
    // Clears the default policy of every class.
    virtual void ClearDefaultPolicies() = 0;

    // Resync, in Mbps.
    // Returns the bandwidth that resynchronisation uses now.
    virtual int64_t GetResyncBandwidth() = 0;
    // Returns the level at which resynchronisation is throttled.
    virtual int64_t GetResyncThrottle() = 0;
    // Sets that level; throws MeskCtlException for a negative level.
    virtual void SetResyncThrottle(int64_t level) = 0;
};

// The extended info object, with the interfaces' full records.
class HOSTCTL_API MeskInfo2 : public virtual MeskInfo {
  public:
    ~MeskInfo2() override;
    // Returns one record per configured interface, in the library's order.
    virtual std::vector<std::unique_ptr<MeskZuvNicConfig2>> GetZuvNicConfigs() = 0;
    // Writes the interface's configuration: adds it, or replaces the interface of that name.
    // Returns true iff it was written; throws MeskCtlException for an invalid record.
    virtual bool SetZuvNicConfig(const MeskZuvNicConfig2& config) = 0;
};

}  // namespace Mesk
}  // namespace HostCtl
