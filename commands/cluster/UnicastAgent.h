// What the unicast agent commands share: the agent defaults, the address rule, and the
// splitting of the entries in which the library reports the configured agents.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "hostctl/MeskTypes.h"

namespace OrvaneCli {
namespace MeskNamespace {

// The port of an agent given without one.
constexpr int32_t kDefaultUnicastAgentPort = 12321;
// The node UUID of an agent that has none (a witness, or a removal given without a UUID).
extern const char kNoNodeUuid[];

// Fills `address` from user text: IPv4 when Ipv4Address accepts the text, else IPv6 when
// Ipv6Address accepts it. Returns false, leaving `address` untouched, when neither does.
bool ToMeskIpAddress(const std::string& text, HostCtl::Mesk::MeskIpAddress& address);

// A unicast agent entry, "nodeUuid;isWitness;supportsUnicast;ip;port;ifaceName", split at
// its first five ";". The interface name runs to the end of the entry, so it may itself
// contain ";". Entries are not escaped; a malformed one simply has fewer separators, and
// each command decides what it reports for that.
class UnicastAgentEntry {
  public:
    // Fields in entry order.
    enum Field : size_t { kNodeUuid, kIsWitness, kSupportsUnicast, kIp, kPort, kIfaceName };

    explicit UnicastAgentEntry(const std::string& entry);

    // How many of the five separators were found, counting from the start.
    size_t Separators() const { return separators_.size(); }
    // The text of a field; valid when the separator after it was found (for the interface
    // name: when all five were found).
    std::string Text(Field field) const;
    // Where a field starts in the entry; valid when the separator before it was found.
    size_t Start(Field field) const { return field == kNodeUuid ? 0 : separators_[field - 1] + 1; }

  private:
    std::string entry_;
    std::vector<size_t> separators_;
};

}  // namespace MeskNamespace
}  // namespace OrvaneCli
