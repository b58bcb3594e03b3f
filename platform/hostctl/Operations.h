// Every operation that the simulated host serves, listed once.
//
// The list gives the operations their identifiers (the serving code passes one to Serve, so an
// operation missing here does not compile) and their names, which the call log writes and
// `hostsim fail` accepts. docs/hostsim.md lists the same names; a unit test compares the two.
#pragma once

#include <cstddef>
#include <string>

// X(name) for each operation, grouped by the file that serves it.
#define HOSTCTL_OPERATIONS(X)                                                            \
    /* SimHost.cpp: the plug-in, the info object, the conversions and UUID functions. */ \
    X(GetMeskPlugin)                                                                     \
    X(GetMeskInfo)                                                                       \
    X(GetFormattedSystemDateTime)                                                        \
    X(StringToMeskUuid)                                                                  \
    X(MeskUuidToString)                                                                  \
    X(UTF8StringCharLength)                                                              \
    X(UUID_CreateRandom)                                                                 \
    X(UUID_PackText)                                                                     \
    /* SimCluster.cpp: membership and unicast agents. */                                 \
    X(GetClusterConfig)                                                                  \
    X(IsWitness)                                                                         \
    X(GetConfigGeneration)                                                               \
    X(JoinCluster)                                                                       \
    X(CreateCluster)                                                                     \
    X(LeaveCluster)                                                                      \
    X(RestoreClusterConfig)                                                              \
    X(SetPreferredFaultDomain)                                                           \
    X(GetInfoFromKOVRA)                                                                  \
    X(GetUnicastMode)                                                                    \
    X(IsInStretchedCluster)                                                              \
    X(GetPreferredFaultDomainInfo)                                                       \
    X(IsWitnessNode)                                                                     \
    X(GetUnicastWitnesses)                                                               \
    X(AddUnicastAgent)                                                                   \
    X(RefreshUnicastAgents)                                                              \
    X(GetUnicastAgents)                                                                  \
    X(RemoveUnicastAgent)                                                                \
    /* SimNetwork.cpp: interfaces. */                                                    \
    X(IsZuvNicInUse)                                                                     \
    X(RemoveZuvNic)                                                                      \
    X(ClearNetworkConfig)                                                                \
    X(RestoreNetworkConfig)                                                              \
    X(GetZuvNicConfigs)                                                                  \
    X(SetZuvNicConfig)                                                                   \
    /* SimStorage.cpp: disks and disk groups. */                                         \
    X(GetMeskDisks)                                                                      \
    X(GetMeskDiskUuids)                                                                  \
    X(GetDiskInfo)                                                                       \
    X(AddDisks)                                                                          \
    X(RemoveDisk)                                                                        \
    X(RemoveDiskGroup)                                                                   \
    X(RemoveDiskByUuid)                                                                  \
    X(MountDiskGroup)                                                                    \
    X(MountByUuid)                                                                       \
    X(MountDisk)                                                                         \
    X(UnmountDiskGroup)                                                                  \
    X(UnmountDisk)                                                                       \
    X(AddCapacityFlashTag)                                                               \
    X(RemoveCapacityFlashTag)                                                            \
    X(GetAutoClaimMode)                                                                  \
    X(SetAutoClaimMode)                                                                  \
    /* SimSettings.cpp: datastore, fault domain, maintenance, policies, resync. */       \
    X(GetDatastoreName)                                                                  \
    X(SetDatastoreName)                                                                  \
    X(GetFaultDomainName)                                                                \
    X(SetFaultDomainName)                                                                \
    X(ResetFaultDomainName)                                                              \
    X(GetFaultDomainId)                                                                  \
    X(DecomCancel)                                                                       \
    X(GetDefaultPolicy)                                                                  \
    X(SetDefaultPolicy)                                                                  \
    X(ClearDefaultPolicies)                                                              \
    X(StringToMeskPolicyClass)                                                           \
    X(MeskPolicyClassToString)                                                           \
    X(GetMeskPolicyClasses)                                                              \
    X(GetResyncBandwidth)                                                                \
    X(GetResyncThrottle)                                                                 \
    X(SetResyncThrottle)                                                                 \
    /* SimServices.cpp: the host's programs. */                                          \
    X(MeskExec)

namespace HostCtlSim {

enum class Operation {
#define HOSTCTL_OPERATION_IDENTIFIER(name) name,
    HOSTCTL_OPERATIONS(HOSTCTL_OPERATION_IDENTIFIER)
#undef HOSTCTL_OPERATION_IDENTIFIER
};

inline constexpr const char* kOperationNames[] = {
#define HOSTCTL_OPERATION_NAME(name) #name,
    HOSTCTL_OPERATIONS(HOSTCTL_OPERATION_NAME)
#undef HOSTCTL_OPERATION_NAME
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
