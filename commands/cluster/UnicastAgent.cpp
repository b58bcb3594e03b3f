#include "commands/cluster/UnicastAgent.h"

#include "hostctl/NetworkAddress.h"

namespace OrvaneCli {
namespace MeskNamespace {

using HostCtl::Mesk::MeskIpAddress;
using HostCtl::Network::Ipv4Address;
using HostCtl::Network::Ipv6Address;

const char kNoNodeUuid[] = "00000000-0000-0000-0000-000000000000";

bool ToMeskIpAddress(const std::string& text, MeskIpAddress& address) {
    // IPv4 first: a text that both would accept is an IPv4 address.
    if (Ipv4Address::IsValidAddress(text)) {
        address = MeskIpAddress(Ipv4Address(text));
        return true;
    }
    if (Ipv6Address::IsValidAddress(text)) {
        address = MeskIpAddress(Ipv6Address(text));
        return true;
    }
    return false;
}

UnicastAgentEntry::UnicastAgentEntry(const std::string& entry) : entry_(entry) {
    size_t from = 0;
    while (separators_.size() < kIfaceName) {
        const size_t at = entry.find(';', from);
        if (at == std::string::npos) break;
        separators_.push_back(at);
        from = at + 1;
    }
}

std::string UnicastAgentEntry::Text(Field field) const {
    const size_t start = Start(field);
    if (field == kIfaceName) return entry_.substr(start);
    return entry_.substr(start, separators_[field] - start);
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
