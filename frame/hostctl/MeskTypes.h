// Records and value types that the host-control library exchanges with its callers.
#pragma once

#include <cstdint>
#include <cstring>
#include <string>
#include <utility>
#include <vector>

#include "Visibility.h"
#include "hostctl/NetworkAddress.h"

namespace HostCtl {
namespace Mesk {

// A 16-byte UUID; its text form is "nnnnnnnn-nnnn-nnnn-nnnn-nnnnnnnnnnnn".
struct Uuid {
    uint8_t bytes[16] = {};
    bool operator==(const Uuid& other) const {
        return std::memcmp(bytes, other.bytes, sizeof bytes) == 0;
    }
    bool operator!=(const Uuid& other) const { return !(*this == other); }
};

// A tagged IPv4 or IPv6 address: the kind flag selects which of the two is meaningful.
class HOSTCTL_API MeskIpAddress {
  public:
    MeskIpAddress();  // kind unset; assign before reading
    explicit MeskIpAddress(const Network::Ipv4Address& address);
    explicit MeskIpAddress(const Network::Ipv6Address& address);
    // Copies the kind flag and the active address only.
    MeskIpAddress(const MeskIpAddress& other);
    // Copies the kind flag and both addresses.
    MeskIpAddress& operator=(const MeskIpAddress& other);

    // The active address's text.
    std::string GetStringAddress() const;
    bool IsIpv6() const { return isIpv6_; }
    const Network::Ipv4Address& GetIpv4() const { return ipv4_; }
    const Network::Ipv6Address& GetIpv6() const { return ipv6_; }

  private:
    bool isIpv6_ = false;
    Network::Ipv4Address ipv4_;
    Network::Ipv6Address ipv6_;
};

// The host's cluster configuration.
struct MeskClusterConfig {
    bool enabled = false;     // the host is enabled in a Mesk cluster
    std::string clusterUuid;  // text form; empty when not in a cluster
};

struct MeskConfigGeneration {
    std::string uuid;  // may be empty
    uint64_t generation = 0;
    uint64_t timestamp = 0;  // milliseconds since the epoch
};

// One member of the cluster as the directory service reports it.
struct MeskMemberInfo {
    std::string uuid;
    std::string hostname;
};

// What the library knows of one disk.
struct MeskDiskInfo {
    std::string name;  // device name, e.g. "mpx.pthba2:C0:T1:L0"
    bool isSsd = false;
    std::string meskUuid;
    std::string diskGroupUuid;
    std::string diskGroupName;
    bool usedByThisHost = false;
    bool inKovra = false;
    int32_t formatVersion = 0;  // on-disk format version code
    bool deduplication = false;
    std::string checksum;
    bool checksumOk = false;
    bool isCapacityTier = false;
    bool encryption = false;
    bool diskKeyLoaded = false;
    // Further fields that the storage list does not show.
    uint64_t capacityBytes = 0;
    bool isMounted = false;
    bool capacityFlashTag = false;
};

// Default policy classes.
enum MeskPolicyClass : int32_t {
    MESK_POLICY_CLASS_CLUSTER = 0,
    MESK_POLICY_CLASS_VDISK = 1,
    MESK_POLICY_CLASS_VMNAMESPACE = 2,
    MESK_POLICY_CLASS_VMSWAP = 3,
    MESK_POLICY_CLASS_VMEM = 4,
};

// The network configuration of one interface.
class HOSTCTL_API MeskZuvNicConfig {
  public:
    const std::string& GetZuvnicName() const { return name_; }
    const std::string& GetIfaceUuid() const { return ifaceUuid_; }
    const MeskIpAddress& GetAgentMulticastGroup() const { return agentGroup_; }
    const MeskIpAddress& GetMasterMulticastGroup() const { return masterGroup_; }
    int32_t GetAgentMulticastPort() const { return agentPort_; }
    int32_t GetMasterMulticastPort() const { return masterPort_; }
    int32_t GetHostUnicastPort() const { return unicastPort_; }
    int32_t GetMulticastTTL() const { return ttl_; }
    // Set by the library when it stores the record.
    void SetIfaceUuid(const std::string& uuid) { ifaceUuid_ = uuid; }

  protected:
    MeskZuvNicConfig(std::string name, MeskIpAddress agentGroup, MeskIpAddress masterGroup,
                     int32_t agentPort, int32_t masterPort, int32_t unicastPort, int32_t ttl)
        : name_(std::move(name)),
          agentGroup_(agentGroup),
          masterGroup_(masterGroup),
          agentPort_(agentPort),
          masterPort_(masterPort),
          unicastPort_(unicastPort),
          ttl_(ttl) {}

  private:
    std::string name_;
    std::string ifaceUuid_;
    MeskIpAddress agentGroup_;
    MeskIpAddress masterGroup_;
    int32_t agentPort_;
    int32_t masterPort_;
    int32_t unicastPort_;
    int32_t ttl_;
};

// The interface configuration with IPv6 groups and traffic types.
class HOSTCTL_API MeskZuvNicConfig2 : public MeskZuvNicConfig {
  public:
    MeskZuvNicConfig2(std::string name, MeskIpAddress agentGroup, MeskIpAddress agentV6Group,
                      MeskIpAddress masterGroup, MeskIpAddress masterV6Group, int32_t agentPort,
                      int32_t masterPort, int32_t unicastPort, int32_t ttl, bool meskTraffic,
                      bool witnessTraffic, std::string options)
        : MeskZuvNicConfig(std::move(name), agentGroup, masterGroup, agentPort, masterPort,
                           unicastPort, ttl),
          meskTraffic(meskTraffic),
          witnessTraffic(witnessTraffic),
          agentV6Group_(agentV6Group),
          masterV6Group_(masterV6Group),
          options_(std::move(options)) {}

    const MeskIpAddress& GetAgentV6MulticastGroup() const { return agentV6Group_; }
    const MeskIpAddress& GetMasterV6MulticastGroup() const { return masterV6Group_; }
    // Fills the names of the traffic types the interface carries: "mesk", then "witness".
    void GetTrafficTypes(std::vector<std::string>& types) const {
        types.clear();
        if (meskTraffic) types.emplace_back("mesk");
        if (witnessTraffic) types.emplace_back("witness");
    }
    const std::string& GetOptions() const { return options_; }

    bool meskTraffic;     // carries general Mesk traffic
    bool witnessTraffic;  // carries witness traffic

  private:
    MeskIpAddress agentV6Group_;
    MeskIpAddress masterV6Group_;
    std::string options_;
};

}  // namespace Mesk
}  // namespace HostCtl
