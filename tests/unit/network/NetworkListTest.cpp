#include <string>
#include <vector>

#include "MockHost.h"
#include "autocli/MetaObj.h"
#include "commands/network/NetworkList.h"
#include "hostctl/NetworkAddress.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using HostCtl::Mesk::MeskIpAddress;
using HostCtl::Mesk::MeskZuvNicConfig2;
using HostCtl::Network::Ipv4Address;
using HostCtl::Network::Ipv6Address;
using Kalmor::MetaObj::MetaList;
using MeskTest::Errors;
using MeskTest::Fail;
using MeskTest::FieldNames;
using MeskTest::HostTest;
using MeskTest::IntField;
using MeskTest::ListElements;
using MeskTest::NicList;
using MeskTest::TextField;
using ::testing::ElementsAre;
using ::testing::Invoke;
using ::testing::IsEmpty;

class NetworkListTest : public HostTest {};

TEST_F(NetworkListTest, ShowsEveryRecordFieldByFieldInTheLibrarysOrder) {
    EXPECT_CALL(info, GetZuvNicConfigs()).WillOnce(Invoke([] {
        NicList list;
        list.push_back(
            std::make_unique<MeskZuvNicConfig2>("vmk2", MeskIpAddress(Ipv4Address("224.2.3.4")),
                                                MeskIpAddress(Ipv6Address("FF19:0:0:0:0:2:3:4")),
                                                MeskIpAddress(Ipv4Address("224.1.2.3")),
                                                MeskIpAddress(Ipv6Address("FF19:0:0:0:0:1:2:3")),
                                                23451, 12345, 12321, 5, true, true, ""));
        list.back()->SetIfaceUuid("5e1c0d3a-0000-0000-0000-000000000002");
        // IPv6 groups in every slot, negative numbers, no traffic type.
        list.push_back(std::make_unique<MeskZuvNicConfig2>(
            "vmk0", MeskIpAddress(Ipv6Address("ff05::1")), MeskIpAddress(Ipv6Address("ff05::2")),
            MeskIpAddress(Ipv6Address("ff05::3")), MeskIpAddress(Ipv6Address("ff05::4")), -1,
            -2147483647 - 1, 0, -5, false, false, ""));
        list.push_back(std::make_unique<MeskZuvNicConfig2>(
            "vmk1", MeskIpAddress(Ipv4Address("239.0.0.1")), MeskIpAddress(),
            MeskIpAddress(Ipv4Address("239.0.0.2")), MeskIpAddress(), 1, 2, 3, 4, false, true, ""));
        return list;
    }));
    auto output = Run(*NetworkList::New());
    EXPECT_THAT(Errors(*output), IsEmpty());
    EXPECT_TRUE(output->IsComplete());
    auto entries = ListElements(output->GetRootObject());
    ASSERT_EQ(entries.size(), 3u);

    // Every entry has the template's fields in the template's order.
    auto spec = NetworkList::New()->GetOutputSpecInternal();
    auto list = std::dynamic_pointer_cast<MetaList>(spec->GetRootObject());
    ASSERT_TRUE(list);
    for (const auto& entry : entries) {
        EXPECT_EQ(FieldNames(entry), FieldNames(list->GetTemplate()));
        EXPECT_EQ(TextField(entry, "IP Protocol"), "IP");
    }

    const auto& first = entries[0];
    EXPECT_EQ(TextField(first, "ZuvNic Name"), "vmk2");
    EXPECT_EQ(TextField(first, "Interface UUID"), "5e1c0d3a-0000-0000-0000-000000000002");
    EXPECT_EQ(TextField(first, "Agent Group Multicast Address"), "224.2.3.4");
    EXPECT_EQ(TextField(first, "Agent Group IPv6 Multicast Address"), "FF19:0:0:0:0:2:3:4");
    EXPECT_EQ(IntField(first, "Agent Group Multicast Port"), 23451);
    EXPECT_EQ(TextField(first, "Master Group Multicast Address"), "224.1.2.3");
    EXPECT_EQ(TextField(first, "Master Group IPv6 Multicast Address"), "FF19:0:0:0:0:1:2:3");
    EXPECT_EQ(IntField(first, "Master Group Multicast Port"), 12345);
    EXPECT_EQ(IntField(first, "Host Unicast Channel Bound Port"), 12321);
    EXPECT_EQ(IntField(first, "Multicast TTL"), 5);
    EXPECT_EQ(TextField(first, "Traffic Type"), "mesk, witness");

    const auto& second = entries[1];
    EXPECT_EQ(TextField(second, "ZuvNic Name"), "vmk0");
    EXPECT_EQ(TextField(second, "Interface UUID"), "");
    EXPECT_EQ(TextField(second, "Agent Group Multicast Address"), "ff05::1");
    EXPECT_EQ(TextField(second, "Master Group IPv6 Multicast Address"), "ff05::4");
    // 32-bit values are widened with their sign.
    EXPECT_EQ(IntField(second, "Agent Group Multicast Port"), -1);
    EXPECT_EQ(IntField(second, "Master Group Multicast Port"), -2147483648LL);
    EXPECT_EQ(IntField(second, "Multicast TTL"), -5);
    EXPECT_EQ(TextField(second, "Traffic Type"), "");

    EXPECT_EQ(TextField(entries[2], "ZuvNic Name"), "vmk1");
    EXPECT_EQ(TextField(entries[2], "Traffic Type"), "witness");
}

TEST_F(NetworkListTest, NoInterfaceIsAnEmptyCompleteList) {
    auto output = Run(*NetworkList::New());
    EXPECT_THAT(Errors(*output), IsEmpty());
    EXPECT_TRUE(output->IsComplete());
    EXPECT_THAT(ListElements(output->GetRootObject()), IsEmpty());
}

// A record's accessors are plain inline members that cannot fail, so the library can fail
// only while the plug-in, the info object or the record list is obtained: before the first
// entry. The list built so far is then empty, and it is still the result, completed, beside
// the bare message.
TEST_F(NetworkListTest, LibraryFailureStillSetsTheListSoFarAndCompletes) {
    {
        SCOPED_TRACE("record list fails");
        EXPECT_CALL(info, GetZuvNicConfigs()).WillOnce(Fail("config store locked"));
        auto output = Run(*NetworkList::New());
        EXPECT_THAT(Errors(*output), ElementsAre("config store locked"));
        EXPECT_TRUE(output->IsComplete());
        EXPECT_THAT(ListElements(output->GetRootObject()), IsEmpty());
    }
    {
        SCOPED_TRACE("plug-in fails");
        EXPECT_CALL(host, GetMeskPlugin()).WillOnce(Fail("no plugin"));
        auto output = Run(*NetworkList::New());
        EXPECT_THAT(Errors(*output), ElementsAre("no plugin"));
        EXPECT_TRUE(output->IsComplete());
        EXPECT_THAT(ListElements(output->GetRootObject()), IsEmpty());
    }
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
