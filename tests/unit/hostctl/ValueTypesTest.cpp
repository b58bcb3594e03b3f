// The host-control library's value types and conversions, which every command relies on.
#include <gtest/gtest.h>

#include <cstdlib>
#include <cstring>
#include <string>

#include "HostBackend.h"
#include "hostctl/HostUuid.h"
#include "hostctl/MeskCtlException.h"
#include "hostctl/MeskTypes.h"
#include "hostctl/MeskUtil.h"
#include "hostctl/Misc.h"
#include "hostctl/NetworkAddress.h"

namespace {

using HostCtl::Lib::Mesk::MeskCtlException;
using HostCtl::Mesk::MeskIpAddress;
using HostCtl::Network::Ipv4Address;
using HostCtl::Network::Ipv6Address;

// The pure conversions, without a simulated host behind them.
class Conversions : public HostCtlSim::HostBackend {
  public:
    std::unique_ptr<HostCtl::MeskPlugin> GetMeskPlugin() override { return nullptr; }
    void GetMeskDisks(std::vector<std::shared_ptr<HostCtl::Mesk::MeskDiskLun>>&) override {}
    void GetInfoFromKOVRA(std::vector<HostCtl::Mesk::MeskMemberInfo>&, std::string&, std::string&,
                          std::string&, uint64_t&, std::string&, std::string&, std::string&,
                          std::string&) override {}
    void GetUnicastMode(bool&) override {}
    bool IsInStretchedCluster() override { return false; }
    void GetPreferredFaultDomainInfo(std::string&, std::string&) override {}
    bool IsWitnessNode() override { return false; }
    std::string GetFaultDomainId() override { return ""; }
    void DecomCancel() override {}
    int32_t MeskExec(const std::string&, const std::string&, bool, bool, bool) override {
        return 0;
    }
};

class ValueTypes : public ::testing::Test {
  protected:
    ValueTypes() { HostCtlSim::SetBackend(&conversions_); }
    ~ValueTypes() override { HostCtlSim::SetBackend(nullptr); }

  private:
    Conversions conversions_;
};

TEST_F(ValueTypes, Ipv4AddressAcceptsDottedQuadsOnly) {
    struct Case {
        const char* text;
        bool valid;
        uint32_t value;
    };
    const Case cases[] = {
        {"10.1.2.3", true, 0x0A010203}, {"0.0.0.0", true, 0}, {"255.255.255.255", true, ~0u},
        {"10.0.0.300", false, 0},       {"10.0.0", false, 0}, {"fe80::1", false, 0},
        {"example", false, 0},          {"", false, 0},       {" 10.0.0.1", false, 0},
        {"10.0.0.1 ", false, 0},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.text);
        EXPECT_EQ(Ipv4Address::IsValidAddress(c.text), c.valid);
        if (c.valid) {
            Ipv4Address address(c.text);
            EXPECT_EQ(address.GetValue(), c.value);
            EXPECT_EQ(address.GetStringAddress(), c.text);
        } else {
            try {
                Ipv4Address address(c.text);
                ADD_FAILURE() << "accepted";
            } catch (const MeskCtlException& e) {
                EXPECT_EQ(e.GetMessage(), std::string("Invalid IPv4 address: '") + c.text + "'");
            }
        }
    }
    EXPECT_EQ(Ipv4Address().GetStringAddress(), "0.0.0.0");
}

TEST_F(ValueTypes, Ipv6AddressKeepsTheTextItWasMadeFrom) {
    for (const char* text : {"fe80::1", "FF19:0:0:0:0:1:2:3", "::", "::ffff:10.0.0.1"}) {
        SCOPED_TRACE(text);
        EXPECT_TRUE(Ipv6Address::IsValidAddress(text));
        EXPECT_EQ(Ipv6Address(text).GetStringAddress(), text);
    }
    for (const char* text : {"10.0.0.1", "fe80::1::2", "example", "", "fe80::1%eth0x"}) {
        SCOPED_TRACE(text);
        EXPECT_FALSE(Ipv6Address::IsValidAddress(text));
        EXPECT_THROW(Ipv6Address{text}, MeskCtlException);
    }
    EXPECT_EQ(Ipv6Address().GetStringAddress(), "");
}

TEST_F(ValueTypes, MeskIpAddressCopiesTheActiveAddressAndAssignsBoth) {
    MeskIpAddress v4(Ipv4Address("192.168.10.21"));
    MeskIpAddress v6(Ipv6Address("fe80::1"));

    MeskIpAddress copy4(v4);
    EXPECT_FALSE(copy4.IsIpv6());
    EXPECT_EQ(copy4.GetStringAddress(), "192.168.10.21");
    EXPECT_EQ(copy4.GetIpv6().GetStringAddress(), "");
    MeskIpAddress copy6(v6);
    EXPECT_TRUE(copy6.IsIpv6());
    EXPECT_EQ(copy6.GetStringAddress(), "fe80::1");
    EXPECT_EQ(copy6.GetIpv4().GetValue(), 0u);

    // Assignment replaces the kind and both addresses of the target.
    MeskIpAddress target(v6);
    target = v4;
    EXPECT_FALSE(target.IsIpv6());
    EXPECT_EQ(target.GetStringAddress(), "192.168.10.21");
    EXPECT_EQ(target.GetIpv6().GetStringAddress(), "");
    target = v6;
    EXPECT_TRUE(target.IsIpv6());
    EXPECT_EQ(target.GetStringAddress(), "fe80::1");
    EXPECT_EQ(target.GetIpv4().GetValue(), 0u);
}

TEST_F(ValueTypes, UuidTextConvertsBothWaysAndPacks) {
    using ZuvCtl::Mesk::MeskUtil;
    struct Case {
        const char* text;
        const char* canonical;  // nullptr: not a UUID
    };
    const Case cases[] = {
        {"52f1c2a0-7b3e-4d01-9a6e-00a1b2c3d4e5", "52f1c2a0-7b3e-4d01-9a6e-00a1b2c3d4e5"},
        {"52AFA1DE-4240-D5D6-17F9-8AF1EC8509E5", "52afa1de-4240-d5d6-17f9-8af1ec8509e5"},
        {"00000000-0000-0000-0000-000000000000", "00000000-0000-0000-0000-000000000000"},
        {"52f1c2a0-7b3e-4d01-9a6e-00a1b2c3d4e", nullptr},
        {"52f1c2a0-7b3e-4d01-9a6e-00a1b2c3d4e5f", nullptr},
        {"52f1c2a07b3e-4d01-9a6e-00a1b2c3d4e5-", nullptr},
        {"52f1c2a0-7b3e-4d01-9a6e-00a1b2c3d4eg", nullptr},
        {"52f1c2a0 7b3e-4d01-9a6e-00a1b2c3d4e5", nullptr},
        {"", nullptr},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.text);
        std::string buffer(c.text);
        buffer.push_back('\0');
        char* packed = UUID_PackText(buffer.data(), &buffer[0], std::strlen(c.text));
        if (c.canonical != nullptr) {
            EXPECT_EQ(MeskUtil::MeskUuidToString(MeskUtil::StringToMeskUuid(c.text)), c.canonical);
            ASSERT_NE(packed, nullptr);
            EXPECT_STREQ(packed, c.canonical);
        } else {
            EXPECT_THROW(MeskUtil::StringToMeskUuid(c.text), MeskCtlException);
            EXPECT_EQ(packed, nullptr);
        }
    }
    HostCtl::Mesk::Uuid uuid = MeskUtil::StringToMeskUuid("01020304-0506-0708-090a-0b0c0d0e0f10");
    for (int i = 0; i < 16; ++i) EXPECT_EQ(uuid.bytes[i], i + 1);
}

TEST_F(ValueTypes, RandomUuidsAreDistinctUuidTexts) {
    char* first = UUID_CreateRandom();
    char* second = UUID_CreateRandom();
    ASSERT_NE(first, nullptr);
    ASSERT_NE(second, nullptr);
    EXPECT_STRNE(first, second);
    EXPECT_NO_THROW(ZuvCtl::Mesk::MeskUtil::StringToMeskUuid(first));
    std::free(first);
    std::free(second);
}

TEST_F(ValueTypes, Utf8LengthCountsCharacters) {
    struct Case {
        std::string text;
        size_t characters;
    };
    const Case cases[] = {
        {"", 0},
        {"fault-domain", 12},
        {"\xC3\xA9t\xC3\xA9", 3},         // two-byte characters
        {"\xE2\x82\xAC\xE2\x82\xAC", 2},  // three-byte characters
        {"\xF0\x9F\x98\x80x", 2},         // a four-byte character
        {std::string(200, 'a') + "\xC3\xA9", 201},
    };
    for (const Case& c : cases) {
        EXPECT_EQ(ZuvCtl::Mesk::MeskUtil::UTF8StringCharLength(c.text), c.characters) << c.text;
    }
}

TEST_F(ValueTypes, StrPrintfFormatsAnyLength) {
    EXPECT_EQ(HostCtl::Misc::StrPrintf("%s %lu %s", "None", 0ul, "0.000"), "None 0 0.000");
    std::string longText(1000, 'x');
    EXPECT_EQ(HostCtl::Misc::StrPrintf("<%s>%d", longText.c_str(), 7), "<" + longText + ">7");
    EXPECT_EQ(HostCtl::Misc::StrPrintf("%s", ""), "");
}

TEST_F(ValueTypes, PolicyClassesConvertInTheirFixedOrder) {
    using ZuvCtl::Mesk::MeskUtil;
    const char* names[] = {"cluster", "vdisk", "vmnamespace", "vmswap", "vmem"};
    auto classes = MeskUtil::GetMeskPolicyClasses();
    ASSERT_EQ(classes.size(), 5u);
    for (size_t i = 0; i < classes.size(); ++i) {
        EXPECT_EQ(MeskUtil::MeskPolicyClassToString(classes[i]), names[i]);
        EXPECT_EQ(MeskUtil::StringToMeskPolicyClass(names[i]), classes[i]);
    }
    EXPECT_THROW(MeskUtil::StringToMeskPolicyClass("VDISK"), MeskCtlException);
    EXPECT_THROW(MeskUtil::MeskPolicyClassToString(HostCtl::Mesk::MeskPolicyClass(7)),
                 MeskCtlException);
}

}  // namespace
