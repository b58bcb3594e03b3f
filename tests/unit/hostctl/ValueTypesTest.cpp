// The host-control library's value types and conversions, which every command relies on.
#include <cstdlib>
#include <cstring>

#include "SimFixture.h"
#include "hostctl/HostUuid.h"
#include "hostctl/MeskUtil.h"
#include "hostctl/NetworkAddress.h"

namespace SimTest {
namespace {

using HostCtl::Network::Ipv4Address;
using HostCtl::Network::Ipv6Address;
using ZuvCtl::Mesk::MeskUtil;

using ValueTypes = SimFixture;

TEST_F(ValueTypes, Ipv4AddressAcceptsDottedQuadsOnly) {
    struct Case {
        const char* text;
        bool valid;
        uint32_t value;
    };
    const Case cases[] = {
        {"10.1.2.3", true, 0x0A010203}, {"255.255.255.255", true, ~0u}, {"10.0.0.300", false, 0},
        {"10.0.0", false, 0},           {"fe80::1", false, 0},          {"", false, 0},
        {" 10.0.0.1", false, 0},        {"10.0.0.1 ", false, 0},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.text);
        EXPECT_EQ(Ipv4Address::IsValidAddress(c.text), c.valid);
        if (c.valid) {
            EXPECT_EQ(Ipv4Address(c.text).GetValue(), c.value);
        } else {
            try {
                Ipv4Address address(c.text);
                ADD_FAILURE() << "accepted";
            } catch (const MeskCtlException& e) {
                EXPECT_EQ(e.GetMessage(), std::string("Invalid IPv4 address: '") + c.text + "'");
            }
        }
    }
}

TEST_F(ValueTypes, Ipv6AddressKeepsTheTextItWasMadeFrom) {
    for (const char* text : {"fe80::1", "FF19:0:0:0:0:1:2:3", "::", "::ffff:10.0.0.1"}) {
        EXPECT_EQ(Ipv6Address(text).GetStringAddress(), text);
    }
    for (const char* text : {"10.0.0.1", "fe80::1::2", "", "fe80::1%zuvnic0x"}) {
        EXPECT_FALSE(Ipv6Address::IsValidAddress(text)) << text;
        EXPECT_THROW(Ipv6Address{text}, MeskCtlException) << text;
    }
}

TEST_F(ValueTypes, UuidTextConvertsBothWaysAndPacks) {
    struct Case {
        const char* text;
        const char* canonical;  // nullptr: not a UUID
    };
    const Case cases[] = {
        {"52AFA1DE-4240-D5D6-17F9-8AF1EC8509E5", "52afa1de-4240-d5d6-17f9-8af1ec8509e5"},
        {"00000000-0000-0000-0000-000000000000", "00000000-0000-0000-0000-000000000000"},
        {"52f1c2a0-7b3e-4d01-9a6e-00a1b2c3d4e", nullptr},
        {"52f1c2a0-7b3e-4d01-9a6e-00a1b2c3d4e5f", nullptr},
        {"52f1c2a07b3e-4d01-9a6e-00a1b2c3d4e5-", nullptr},
        {"52f1c2a0-7b3e-4d01-9a6e-00a1b2c3d4eg", nullptr},
        {"52f1c2a0-7b3e-4d01-9a6e-00a1b2c3d4:@", nullptr},
        {"`2f1c2a0-7b3e-4d01-9a6e-00a1b2c3d4e5", nullptr},
        {"", nullptr},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.text);
        std::string buffer(c.text);
        buffer.push_back('\0');  // room for the packed text's terminator
        char* packed = UUID_PackText(buffer.c_str(), &buffer[0], std::strlen(c.text));
        if (c.canonical != nullptr) {
            EXPECT_EQ(MeskUtil::MeskUuidToString(MeskUtil::StringToMeskUuid(c.text)), c.canonical);
            EXPECT_STREQ(packed, c.canonical);
        } else {
            EXPECT_THROW(MeskUtil::StringToMeskUuid(c.text), MeskCtlException);
            EXPECT_EQ(packed, nullptr);
        }
    }
    HostCtl::Mesk::Uuid uuid = MeskUtil::StringToMeskUuid("01020304-0506-0708-090a-0b0c0d0e0f10");
    for (int i = 0; i < 16; ++i) EXPECT_EQ(uuid.bytes[i], i + 1);
    // Random ones: version 4, the RFC variant, in the canonical form.
    char* random = UUID_CreateRandom();
    ASSERT_NE(random, nullptr);
    EXPECT_EQ(MeskUtil::MeskUuidToString(MeskUtil::StringToMeskUuid(random)), random);
    EXPECT_EQ(random[14], '4');
    EXPECT_NE(std::strchr("89ab", random[19]), nullptr);
    std::free(random);
}

}  // namespace
}  // namespace SimTest
