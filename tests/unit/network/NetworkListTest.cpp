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

// An entry's field values in field order, integers in decimal.
std::vector<std::string> Row(const std::shared_ptr<Kalmor::MetaObj::MetaObject>& entry) {
    std::vector<std::string> row;
    for (const auto& name : FieldNames(entry)) {
        auto value = std::dynamic_pointer_cast<Kalmor::MetaObj::MetaStruct>(entry)->GetField(name);
        row.push_back(value->GetType() == Kalmor::MetaObj::META_INT
                          ? std::to_string(IntField(entry, name))
                          : TextField(entry, name));
    }
    return row;
}

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

    // Every entry has the template's fields in the template's order; 32-bit values are
    // widened with their sign; "IP Protocol" is "IP" whatever the groups are.
    auto spec = NetworkList::New()->GetOutputSpecInternal();
    auto list = std::dynamic_pointer_cast<MetaList>(spec->GetRootObject());
    ASSERT_TRUE(list);
    // A group never set shows whatever text the library gives for it.
    const std::string unset = MeskIpAddress().GetStringAddress();
    std::vector<std::vector<std::string>> rows;
    for (const auto& entry : ListElements(output->GetRootObject())) {
        EXPECT_EQ(FieldNames(entry), FieldNames(list->GetTemplate()));
        rows.push_back(Row(entry));
    }
    EXPECT_THAT(
        rows, ElementsAre(ElementsAre("vmk2", "IP", "5e1c0d3a-0000-0000-0000-000000000002",
                                      "224.2.3.4", "FF19:0:0:0:0:2:3:4", "23451", "224.1.2.3",
                                      "FF19:0:0:0:0:1:2:3", "12345", "12321", "5", "mesk, witness"),
                          ElementsAre("vmk0", "IP", "", "ff05::1", "ff05::2", "-1", "ff05::3",
                                      "ff05::4", "-2147483648", "0", "-5", ""),
                          ElementsAre("vmk1", "IP", "", "239.0.0.1", unset, "1", "239.0.0.2", unset,
                                      "2", "3", "4", "witness")));
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
