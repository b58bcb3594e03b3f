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
    // Fills the host's membership view from the cluster directory service.
    static void GetInfoFromKOVRA(std::vector<HostCtl::Mesk::MeskMemberInfo>& members,
                                 std::string& localNodeState, std::string& localNodeUuid,
                                 std::string& localNodeHealthState,
                                 uint64_t& membershipEntryRevision, std::string& membershipUuid,
                                 std::string& masterUuid, std::string& backupUuid,
                                 std::string& maintenanceModeState);
    static void GetUnicastMode(bool& unicast);
    // The host's current local date and time.
    static std::string GetFormattedSystemDateTime();

    // Converts UUID text ("nnnnnnnn-nnnn-nnnn-nnnn-nnnnnnnnnnnn", hexadecimal digits in either
    // case) to the record; throws MeskCtlException for any other text.
    static HostCtl::Mesk::Uuid StringToMeskUuid(const std::string& text);
    // The record's text form, in lower case.
    static std::string MeskUuidToString(const HostCtl::Mesk::Uuid& uuid);
    // The number of characters (not bytes) of UTF-8 text.
    static size_t UTF8StringCharLength(const std::string& text);

    static bool IsInStretchedCluster();
    // The stretched cluster's preferred fault domain.
    static void GetPreferredFaultDomainInfo(std::string& id, std::string& name);
    // True iff this host is a witness node.
    static bool IsWitnessNode();
    // The identifier of the host's fault domain.
    static std::string GetFaultDomainId();
    // Cancels the maintenance mode operation in progress.
    static void DecomCancel();

    static HostCtl::Mesk::MeskPolicyClass StringToMeskPolicyClass(const std::string& name);
    static std::string MeskPolicyClassToString(HostCtl::Mesk::MeskPolicyClass policyClass);
    // Every policy class, in the library's order.
    static std::vector<HostCtl::Mesk::MeskPolicyClass> GetMeskPolicyClasses();

    // Runs a host program with one argument and waits for it. Returns its exit status, or a
    // negative value when it could not be run or was killed by a signal.
    static int32_t MeskExec(const std::string& command, const std::string& argument, bool flag1,
                            bool flag2, bool flag3);
};

}  // namespace Mesk
}  // namespace ZuvCtl
