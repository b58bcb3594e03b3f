// IP addresses of the host-control library.
#pragma once

#include <cstdint>
#include <string>

#include "Visibility.h"

namespace HostCtl {
namespace Network {

// An IPv4 address, held as a 32-bit number in host byte order.
class HOSTCTL_API Ipv4Address {
  public:
    Ipv4Address();  // 0.0.0.0
    // Throws MeskCtlException when the text is not a dotted-quad IPv4 address.
    explicit Ipv4Address(const std::string& text);
    // True iff the text is a dotted-quad IPv4 address.
    static bool IsValidAddress(std::string text);
    // The dotted-quad text of the address.
    std::string GetStringAddress() const;
    uint32_t GetValue() const { return value_; }

  private:
    uint32_t value_ = 0;
};

// An IPv6 address, held as the text it was made from.
class HOSTCTL_API Ipv6Address {
  public:
    Ipv6Address();  // the empty text
    // Throws MeskCtlException when the text is not an IPv6 address.
    explicit Ipv6Address(const std::string& text);
    // True iff the text is an IPv6 address.
    static bool IsValidAddress(std::string text);
    // The text the address was made from.
    std::string GetStringAddress() const { return text_; }

  private:
    std::string text_;
};

}  // namespace Network
}  // namespace HostCtl
