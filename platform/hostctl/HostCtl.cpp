// The host-control library's own value types and the static entry points, which forward to
// the current backend.
#include <arpa/inet.h>
#include <sys/random.h>

#include <cctype>
#include <cerrno>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ctime>

#include "HostBackend.h"
#include "SimHost.h"
#include "SimInfo.h"
#include "UuidText.h"
#include "hostctl/HostUuid.h"
#include "hostctl/MeskCtlException.h"
#include "hostctl/MeskInfo.h"
#include "hostctl/MeskPlugin.h"
#include "hostctl/MeskTypes.h"
#include "hostctl/MeskUtil.h"
#include "hostctl/Misc.h"
#include "hostctl/NetworkAddress.h"

using HostCtl::Lib::Mesk::MeskCtlException;
using HostCtl::Mesk::MeskPolicyClass;
using HostCtl::Mesk::Uuid;

namespace HostCtl {
namespace Lib {
namespace Mesk {

MeskCtlException::MeskCtlException(std::string message) : message_(std::move(message)) {}
MeskCtlException::~MeskCtlException() = default;
const char* MeskCtlException::what() const noexcept {
    return message_.c_str();
}

}  // namespace Mesk
}  // namespace Lib

namespace Network {

Ipv4Address::Ipv4Address() = default;

Ipv4Address::Ipv4Address(const std::string& text) {
    in_addr address{};
    if (inet_pton(AF_INET, text.c_str(), &address) != 1) {
        throw MeskCtlException("Invalid IPv4 address: '" + text + "'");
    }
    value_ = ntohl(address.s_addr);
}

bool Ipv4Address::IsValidAddress(std::string text) {
    in_addr address{};
    return inet_pton(AF_INET, text.c_str(), &address) == 1;
}

std::string Ipv4Address::GetStringAddress() const {
    in_addr address{};
    address.s_addr = htonl(value_);
    char text[INET_ADDRSTRLEN];
    inet_ntop(AF_INET, &address, text, sizeof text);
    return text;
}

Ipv6Address::Ipv6Address() = default;

Ipv6Address::Ipv6Address(const std::string& text) : text_(text) {
    if (!IsValidAddress(text)) throw MeskCtlException("Invalid IPv6 address: '" + text + "'");
}

bool Ipv6Address::IsValidAddress(std::string text) {
    in6_addr address{};
    return inet_pton(AF_INET6, text.c_str(), &address) == 1;
}

}  // namespace Network

namespace Mesk {

MeskIpAddress::MeskIpAddress() = default;
MeskIpAddress::MeskIpAddress(const Network::Ipv4Address& address)
    : isIpv6_(false), ipv4_(address) {}
MeskIpAddress::MeskIpAddress(const Network::Ipv6Address& address) : isIpv6_(true), ipv6_(address) {}

MeskIpAddress::MeskIpAddress(const MeskIpAddress& other) : isIpv6_(other.isIpv6_) {
    if (isIpv6_) {
        ipv6_ = other.ipv6_;
    } else {
        ipv4_ = other.ipv4_;
    }
}

MeskIpAddress& MeskIpAddress::operator=(const MeskIpAddress& other) {
    isIpv6_ = other.isIpv6_;
    ipv4_ = other.ipv4_;
    ipv6_ = other.ipv6_;
    return *this;
}

std::string MeskIpAddress::GetStringAddress() const {
    return isIpv6_ ? ipv6_.GetStringAddress() : ipv4_.GetStringAddress();
}

MeskDiskLun::~MeskDiskLun() = default;
MeskInfo::~MeskInfo() = default;
MeskInfo2::~MeskInfo2() = default;

void MeskInfo::GetMeskDisks(std::vector<std::shared_ptr<MeskDiskLun>>& luns) {
    HostCtlSim::CurrentBackend().GetMeskDisks(luns);
}

}  // namespace Mesk

MeskPlugin::~MeskPlugin() = default;

std::unique_ptr<MeskPlugin> MeskPluginFactory::GetMeskPlugin() {
    return HostCtlSim::CurrentBackend().GetMeskPlugin();
}

namespace Misc {

std::string StrPrintf(const char* format, ...) {
    va_list args;
    va_start(args, format);
    va_list again;
    va_copy(again, args);
    char small[256];
    int length = std::vsnprintf(small, sizeof small, format, args);
    va_end(args);
    std::string text;
    if (length < 0) {
        va_end(again);
        return text;
    }
    if (static_cast<size_t>(length) < sizeof small) {
        text.assign(small, static_cast<size_t>(length));
    } else {
        text.resize(static_cast<size_t>(length) + 1);
        std::vsnprintf(&text[0], text.size(), format, again);
        text.resize(static_cast<size_t>(length));
    }
    va_end(again);
    return text;
}

}  // namespace Misc
}  // namespace HostCtl

namespace ZuvCtl {
namespace Mesk {

// Each MeskUtil static forwards to the backend's operation of the same name.
#define HOSTCTL_FORWARD_(result, name, parameters, arguments) \
    result MeskUtil::name parameters {                        \
        return HostCtlSim::CurrentBackend().name arguments;   \
    }
HOSTCTL_UTIL_OPERATIONS(HOSTCTL_FORWARD_)
HOSTCTL_UTIL_CONVERSIONS(HOSTCTL_FORWARD_)
#undef HOSTCTL_FORWARD_

}  // namespace Mesk
}  // namespace ZuvCtl

extern "C" {

char* UUID_CreateRandom(void) {
    return HostCtlSim::CurrentBackend().UUID_CreateRandom();
}

char* UUID_PackText(const char* text, char* buffer, size_t length) {
    return HostCtlSim::CurrentBackend().UUID_PackText(text, buffer, length);
}
}

namespace HostCtlSim {

namespace {

// The policy classes by name, in the order GetMeskPolicyClasses lists them.
struct PolicyClassName {
    MeskPolicyClass value;
    const char* name;
};
const PolicyClassName kPolicyClasses[] = {
    {HostCtl::Mesk::MESK_POLICY_CLASS_CLUSTER, "cluster"},
    {HostCtl::Mesk::MESK_POLICY_CLASS_VDISK, "vdisk"},
    {HostCtl::Mesk::MESK_POLICY_CLASS_VMNAMESPACE, "vmnamespace"},
    {HostCtl::Mesk::MESK_POLICY_CLASS_VMSWAP, "vmswap"},
    {HostCtl::Mesk::MESK_POLICY_CLASS_VMEM, "vmem"},
};

// A random (version 4) UUID, from the kernel's random source.
bool RandomUuid(Uuid& uuid) {
    size_t got = 0;
    while (got < sizeof uuid.bytes) {
        ssize_t read = getrandom(uuid.bytes + got, sizeof uuid.bytes - got, 0);
        if (read < 0 && errno == EINTR) continue;
        if (read <= 0) return false;
        got += static_cast<size_t>(read);
    }
    uuid.bytes[6] = static_cast<uint8_t>((uuid.bytes[6] & 0x0f) | 0x40);
    uuid.bytes[8] = static_cast<uint8_t>((uuid.bytes[8] & 0x3f) | 0x80);
    return true;
}

HostBackend* installed = nullptr;

}  // namespace

HostBackend::~HostBackend() = default;

std::string HostBackend::GetFormattedSystemDateTime() {
    time_t now = time(nullptr);
    struct tm local {};
    localtime_r(&now, &local);
    char text[64];
    size_t length = strftime(text, sizeof text, "%Y-%m-%d %H:%M:%S", &local);
    return std::string(text, length);
}

Uuid HostBackend::StringToMeskUuid(const std::string& text) {
    Uuid uuid;
    if (!ParseUuid(text.data(), text.size(), uuid)) {
        throw MeskCtlException("Invalid UUID: '" + text + "'");
    }
    return uuid;
}

std::string HostBackend::MeskUuidToString(const Uuid& uuid) {
    char text[37];
    FormatUuid(uuid, text);
    return std::string(text, 36);
}

size_t HostBackend::UTF8StringCharLength(const std::string& text) {
    // Every character starts with exactly one byte that is not a continuation byte.
    size_t count = 0;
    for (unsigned char c : text) {
        if ((c & 0xC0) != 0x80) ++count;
    }
    return count;
}

MeskPolicyClass HostBackend::StringToMeskPolicyClass(const std::string& name) {
    for (const auto& entry : kPolicyClasses) {
        if (name == entry.name) return entry.value;
    }
    throw MeskCtlException("Unknown policy class: '" + name + "'");
}

std::string HostBackend::MeskPolicyClassToString(MeskPolicyClass policyClass) {
    for (const auto& entry : kPolicyClasses) {
        if (policyClass == entry.value) return entry.name;
    }
    throw MeskCtlException("Unknown policy class value: " +
                           std::to_string(static_cast<int32_t>(policyClass)));
}

std::vector<MeskPolicyClass> HostBackend::GetMeskPolicyClasses() {
    std::vector<MeskPolicyClass> classes;
    for (const auto& entry : kPolicyClasses) classes.push_back(entry.value);
    return classes;
}

char* HostBackend::UUID_CreateRandom() {
    Uuid uuid;
    if (!RandomUuid(uuid)) return nullptr;
    char* text = static_cast<char*>(std::malloc(37));
    if (text != nullptr) FormatUuid(uuid, text);
    return text;
}

char* HostBackend::UUID_PackText(const char* text, char* buffer, size_t length) {
    Uuid uuid;
    if (text == nullptr || buffer == nullptr || !ParseUuid(text, length, uuid)) return nullptr;
    FormatUuid(uuid, buffer);
    return buffer;
}

std::string NewUuid() {
    Uuid uuid;
    if (!RandomUuid(uuid)) {
        throw MeskCtlException(std::string("Cannot make a random UUID: ") + std::strerror(errno));
    }
    char text[37];
    FormatUuid(uuid, text);
    return text;
}

HostBackend& CurrentBackend() {
    if (installed != nullptr) return *installed;
    return SimHost::Default();
}

void SetBackend(HostBackend* backend) {
    installed = backend;
}

}  // namespace HostCtlSim
