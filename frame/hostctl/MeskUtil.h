// Static operations of the host-control library's core. Each may throw
// HostCtl::Lib::Mesk::MeskCtlException.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "Visibility.h"
#include "hostctl/MeskTypes.h"

namespace ZuvCtl {
namespace Mesk {

class HOSTCTL_API MeskUtil {
  public:
    // Fills the host's membership view from the cluster directory service: the members, this
    // node's state, UUID and health, the membership entry's revision and UUID, the master's
    // and the backup's UUIDs and the maintenance mode state. Pass empty values.
    static void GetInfoFromKOVRA(std::vector<HostCtl::Mesk::MeskMemberInfo>& members,
                                 std::string& localNodeState, std::string& localNodeUuid,
                                 std::string& localNodeHealthState,
                                 uint64_t& membershipEntryRevision, std::string& membershipUuid,
                                 std::string& masterUuid, std::string& backupUuid,
                                 std::string& maintenanceModeState);
    // Sets `unicast` to true iff the cluster runs in unicast mode.
    static void GetUnicastMode(bool& unicast);
    // Returns the host's current local date and time as text.
    static std::string GetFormattedSystemDateTime();

    // Converts UUID text ("nnnnnnnn-nnnn-nnnn-nnnn-nnnnnnnnnnnn", hexadecimal digits in either
    // case) to the record; throws MeskCtlException for any other text.
    static HostCtl::Mesk::Uuid StringToMeskUuid(const std::string& text);
    // Returns the record's text form, in lower case.
    static std::string MeskUuidToString(const HostCtl::Mesk::Uuid& uuid);
    // Returns the number of characters (not bytes) of UTF-8 text.
    static size_t UTF8StringCharLength(const std::string& text);

    // Returns true iff the host's cluster is a stretched cluster.
    static bool IsInStretchedCluster();
    // Sets `id` and `name` to the stretched cluster's preferred fault domain; throws
    // MeskCtlException outside a stretched cluster.
    static void GetPreferredFaultDomainInfo(std::string& id, std::string& name);
    // Returns true iff this host is a witness node.
    static bool IsWitnessNode();
    // Returns the identifier of the host's fault domain.
    static std::string GetFaultDomainId();
    // Cancels the maintenance mode operation in progress.
    static void DecomCancel();

    // Returns the policy class of that name (exact, case-sensitive); throws MeskCtlException
    // for any other text.
    static HostCtl::Mesk::MeskPolicyClass StringToMeskPolicyClass(const std::string& name);
    // Returns the policy class's name; throws MeskCtlException for a value that is no class.
    static std::string MeskPolicyClassToString(HostCtl::Mesk::MeskPolicyClass policyClass);
    // Returns every policy class, in the library's order.
    static std::vector<HostCtl::Mesk::MeskPolicyClass> GetMeskPolicyClasses();

    // Runs a host program with one argument and waits for it. Returns its exit status, or a
    // negative value when it could not be run or was killed by a signal. The three flags
    // mean what the library makes of them; callers pass false, true, false.
    static int32_t MeskExec(const std::string& command, const std::string& argument,
                            bool libraryFlag1, bool libraryFlag2, bool libraryFlag3);
};

}  // namespace Mesk
}  // namespace ZuvCtl
