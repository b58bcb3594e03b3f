// Every operation that the simulated host serves, listed once.
//
// Each operation is one row of one of the tables below, by the kind of entry point it is. The
// rows give the operations their identifiers (the serving code passes one to Serve, so an
// operation missing here does not compile) and their names, which the call log writes and
// `hostsim fail` accepts; docs/hostsim.md lists the same names, and a unit test compares the
// two. The tables with signatures also make the declarations that the backend, the simulated
// host, the library's forwarders and the test double would otherwise each restate: a new
// operation of the info object or of MeskUtil is its declaration in frame/hostctl/, one row
// here and its answer in the file of its area.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "hostctl/MeskInfo.h"
#include "hostctl/MeskTypes.h"

// X(name): the entry points of other classes, declared by hand where they are forwarded
// (HostCtl.cpp, HostBackend.h): the plug-in factory, the plug-in's GetMeskInfo, the info
// object's static disk list and the host UUID functions.
#define HOSTCTL_ENTRY_OPERATIONS(X) \
    X(GetMeskPlugin)                \
    X(GetMeskInfo)                  \
    X(GetMeskDisks)                 \
    X(UUID_CreateRandom)            \
    X(UUID_PackText)

// X(result, name, (parameters), (arguments)) for the statics of ZuvCtl::Mesk::MeskUtil that
// the backend serves; each forwards to the backend's operation of the same name.
#define HOSTCTL_UTIL_OPERATIONS(X)                                                                 \
    X(void, GetInfoFromKOVRA,                                                                      \
      (std::vector<HostCtl::Mesk::MeskMemberInfo> & members, std::string & localNodeState,         \
       std::string & localNodeUuid, std::string & localNodeHealthState,                            \
       uint64_t & membershipEntryRevision, std::string & membershipUuid, std::string & masterUuid, \
       std::string & backupUuid, std::string & maintenanceModeState),                              \
      (members, localNodeState, localNodeUuid, localNodeHealthState, membershipEntryRevision,      \
       membershipUuid, masterUuid, backupUuid, maintenanceModeState))                              \
    X(void, GetUnicastMode, (bool& unicast), (unicast))                                            \
    X(bool, IsInStretchedCluster, (), ())                                                          \
    X(void, GetPreferredFaultDomainInfo, (std::string & id, std::string & name), (id, name))       \
    X(bool, IsWitnessNode, (), ())                                                                 \
    X(std::string, GetFaultDomainId, (), ())                                                       \
    X(void, DecomCancel, (), ())                                                                   \
    X(int32_t, MeskExec,                                                                           \
      (const std::string& command, const std::string& argument, bool libraryFlag1,                 \
       bool libraryFlag2, bool libraryFlag3),                                                      \
      (command, argument, libraryFlag1, libraryFlag2, libraryFlag3))

// The same for the MeskUtil statics that only convert: the backend answers them as the
// library does (HostCtl.cpp), so a test double need not.
#define HOSTCTL_UTIL_CONVERSIONS(X)                                                               \
    X(std::string, GetFormattedSystemDateTime, (), ())                                            \
    X(HostCtl::Mesk::Uuid, StringToMeskUuid, (const std::string& text), (text))                   \
    X(std::string, MeskUuidToString, (const HostCtl::Mesk::Uuid& uuid), (uuid))                   \
    X(size_t, UTF8StringCharLength, (const std::string& text), (text))                            \
    X(HostCtl::Mesk::MeskPolicyClass, StringToMeskPolicyClass, (const std::string& name), (name)) \
    X(std::string, MeskPolicyClassToString, (HostCtl::Mesk::MeskPolicyClass policyClass),         \
      (policyClass))                                                                              \
    X(std::vector<HostCtl::Mesk::MeskPolicyClass>, GetMeskPolicyClasses, (), ())

// X(result, name, (parameters), (arguments)) for the operations of the info object
// (HostCtl::Mesk::MeskInfo), by the file of the simulated host that answers them.
#define HOSTCTL_INFO_OPERATIONS(X)                                                              \
    /* SimCluster.cpp: membership and unicast agents. */                                        \
    X(const HostCtl::Mesk::MeskClusterConfig&, GetClusterConfig, (), ())                        \
    X(bool, IsWitness, (), ())                                                                  \
    X(HostCtl::Mesk::MeskConfigGeneration, GetConfigGeneration, (), ())                         \
    X(void, JoinCluster,                                                                        \
      (const HostCtl::Mesk::Uuid& clusterUuid, bool witnessNode,                                \
       const std::string& preferredFaultDomain, bool wait, int32_t flags),                      \
      (clusterUuid, witnessNode, preferredFaultDomain, wait, flags))                            \
    X(void, CreateCluster, (const std::string& clusterUuid, bool join, bool wait),              \
      (clusterUuid, join, wait))                                                                \
    X(void, LeaveCluster, (bool force), (force))                                                \
    X(void, RestoreClusterConfig, (bool boot), (boot))                                          \
    X(void, SetPreferredFaultDomain, (const std::string& name), (name))                         \
    X(void, GetUnicastWitnesses, (std::vector<std::string> & witnesses), (witnesses))           \
    X(void, AddUnicastAgent,                                                                    \
      (const std::string& nodeUuid, bool isWitness, bool supportsUnicast,                       \
       const HostCtl::Mesk::MeskIpAddress& address, int32_t port, bool hasInterface,            \
       const std::string& interfaceName),                                                       \
      (nodeUuid, isWitness, supportsUnicast, address, port, hasInterface, interfaceName))       \
    X(void, RefreshUnicastAgents, (), ())                                                       \
    X(void, GetUnicastAgents, (std::vector<std::string> & agents), (agents))                    \
    X(bool, RemoveUnicastAgent,                                                                 \
      (const std::string& nodeUuid, const HostCtl::Mesk::MeskIpAddress& address, int32_t port), \
      (nodeUuid, address, port))                                                                \
    /* SimNetwork.cpp: interfaces. */                                                           \
    X(bool, IsZuvNicInUse, (const std::string& interfaceName, const std::string& trafficType),  \
      (interfaceName, trafficType))                                                             \
    X(bool, RemoveZuvNic,                                                                       \
      (const std::string& interfaceName, bool force, const std::string& trafficType),           \
      (interfaceName, force, trafficType))                                                      \
    X(void, ClearNetworkConfig, (), ())                                                         \
    X(void, RestoreNetworkConfig, (), ())                                                       \
    /* SimStorage.cpp: disks and disk groups. */                                                \
    X(void, GetMeskDiskUuids, (std::vector<HostCtl::Mesk::Uuid> & uuids), (uuids))              \
    X(void, GetDiskInfo,                                                                        \
      (const HostCtl::Mesk::Uuid& uuid,                                                         \
       const std::vector<std::shared_ptr<HostCtl::Mesk::MeskDiskLun>>& luns,                    \
       HostCtl::Mesk::MeskDiskInfo& info),                                                      \
      (uuid, luns, info))                                                                       \
    X(void, AddDisks, (const std::string& ssd, const std::vector<std::string>& disks),          \
      (ssd, disks))                                                                             \
    X(void, RemoveDisk, (const std::string& disk, const std::string& evacuationMode),           \
      (disk, evacuationMode))                                                                   \
    X(void, RemoveDiskGroup, (const std::string& ssd, const std::string& evacuationMode),       \
      (ssd, evacuationMode))                                                                    \
    X(void, RemoveDiskByUuid, (const std::string& uuid, const std::string& evacuationMode),     \
      (uuid, evacuationMode))                                                                   \
    X(void, MountDiskGroup, (const std::string& ssd, bool serviceFlag), (ssd, serviceFlag))     \
    X(void, MountByUuid, (const std::string& uuid), (uuid))                                     \
    X(void, MountDisk, (const std::string& disk), (disk))                                       \
    X(void, UnmountDiskGroup, (const std::string& ssd, bool serviceFlag), (ssd, serviceFlag))   \
    X(void, UnmountDisk, (const std::string& disk, bool serviceFlag), (disk, serviceFlag))      \
    X(void, AddCapacityFlashTag, (const std::string& disk), (disk))                             \
    X(void, RemoveCapacityFlashTag, (const std::string& disk), (disk))                          \
    X(bool, GetAutoClaimMode, (), ())                                                           \
    X(void, SetAutoClaimMode, (bool enabled), (enabled))                                        \
    /* SimSettings.cpp: datastore, fault domain, policies, resync. */                           \
    X(std::string, GetDatastoreName, (), ())                                                    \
    X(void, SetDatastoreName, (const std::string& name), (name))                                \
    X(std::string, GetFaultDomainName, (), ())                                                  \
    X(void, SetFaultDomainName, (const std::string& name), (name))                              \
    X(void, ResetFaultDomainName, (), ())                                                       \
    X(std::string, GetDefaultPolicy, (const std::string& policyClass), (policyClass))           \
    X(void, SetDefaultPolicy, (const std::string& policyClass, const std::string& policy),      \
      (policyClass, policy))                                                                    \
    X(void, ClearDefaultPolicies, (), ())                                                       \
    X(int64_t, GetResyncBandwidth, (), ())                                                      \
    X(int64_t, GetResyncThrottle, (), ())                                                       \
    X(void, SetResyncThrottle, (int64_t level), (level))

// The same for the operations that only the extended info object (MeskInfo2) has
// (SimNetwork.cpp).
#define HOSTCTL_INFO2_OPERATIONS(X)                                                             \
    X(std::vector<std::unique_ptr<HostCtl::Mesk::MeskZuvNicConfig2>>, GetZuvNicConfigs, (), ()) \
    X(bool, SetZuvNicConfig, (const HostCtl::Mesk::MeskZuvNicConfig2& config), (config))

// Every operation of every table: NAME(name) for a row without a signature, SIGNATURE(result,
// name, (parameters), (arguments)) for the others.
#define HOSTCTL_ALL_OPERATIONS(NAME, SIGNATURE) \
    HOSTCTL_ENTRY_OPERATIONS(NAME)              \
    HOSTCTL_UTIL_OPERATIONS(SIGNATURE)          \
    HOSTCTL_UTIL_CONVERSIONS(SIGNATURE)         \
    HOSTCTL_INFO_OPERATIONS(SIGNATURE)          \
    HOSTCTL_INFO2_OPERATIONS(SIGNATURE)

namespace HostCtlSim {

enum class Operation {
#define HOSTCTL_IDENTIFIER_(name) name,
#define HOSTCTL_SIGNATURE_IDENTIFIER_(result, name, parameters, arguments) name,
    HOSTCTL_ALL_OPERATIONS(HOSTCTL_IDENTIFIER_, HOSTCTL_SIGNATURE_IDENTIFIER_)
#undef HOSTCTL_IDENTIFIER_
#undef HOSTCTL_SIGNATURE_IDENTIFIER_
};

inline constexpr const char* kOperationNames[] = {
#define HOSTCTL_NAME_(name) #name,
#define HOSTCTL_SIGNATURE_NAME_(result, name, parameters, arguments) #name,
    HOSTCTL_ALL_OPERATIONS(HOSTCTL_NAME_, HOSTCTL_SIGNATURE_NAME_)
#undef HOSTCTL_NAME_
#undef HOSTCTL_SIGNATURE_NAME_
};
inline constexpr size_t kOperationCount = sizeof kOperationNames / sizeof kOperationNames[0];

// The operation's name, as the call log writes it.
inline const char* OperationName(Operation operation) {
    return kOperationNames[static_cast<size_t>(operation)];
}

// Stores the operation called `name` in *operation; returns false when there is none.
inline bool FindOperation(const std::string& name, Operation* operation) {
    for (size_t i = 0; i < kOperationCount; ++i) {
        if (name == kOperationNames[i]) {
            *operation = static_cast<Operation>(i);
            return true;
        }
    }
    return false;
}

}  // namespace HostCtlSim
