#include <string>
#include <vector>

#include "MockHost.h"
#include "commands/cluster/ClusterUnicastAgentList.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using HostCtl::Lib::Mesk::MeskCtlException;
using MeskTest::Errors;
using MeskTest::Fail;
using MeskTest::ListElements;
using ::testing::_;
using ::testing::ElementsAre;
using ::testing::ElementsAreArray;
using ::testing::IsEmpty;
using ::testing::Return;
using ::testing::SetArgReferee;
using Entries = std::vector<std::string>;

// A listed agent as "NodeUuid|IsWitness|Supports Unicast|IP Address|Port|Iface Name".
std::string Row(const std::shared_ptr<Kalmor::MetaObj::MetaObject>& row) {
    using namespace MeskTest;
    return TextField(row, "NodeUuid") + "|" + std::to_string(IntField(row, "IsWitness")) + "|" +
           (BoolField(row, "Supports Unicast") ? "true" : "false") + "|" +
           TextField(row, "IP Address") + "|" + std::to_string(IntField(row, "Port")) + "|" +
           TextField(row, "Iface Name");
}

class UnicastAgentListTest : public MeskTest::HostTest {
  protected:
    UnicastAgentListTest() { SetEnabled(true, "52f1c2a0-7b3e-4d01-9a6e-00a1b2c3d4e5"); }
};

TEST_F(UnicastAgentListTest, ConvertsEachFieldOfWellFormedEntries) {
    const struct {
        std::string entry, row;
    } cases[] = {
        {"u1;0;1;10.0.0.5;12321;", "u1|0|true|10.0.0.5|12321|"},
        {"u2;1;0;fe80::1;8000;zuvnic1", "u2|1|false|fe80::1|8000|zuvnic1"},
        // Numbers read as atoi reads them; the address is not checked; the name keeps its ";".
        {"u3;yes;2;not-an-ip;80x;a;b;", "u3|0|true|not-an-ip|80|a;b;"},
        {"u4; 7;-1;1.2.3.4;port;x", "u4|7|true|1.2.3.4|0|x"},
        {";;;;;", "|0|false||0|"},
    };
    Entries entries, rows;
    for (const auto& c : cases) entries.push_back(c.entry), rows.push_back(c.row);
    EXPECT_CALL(info, GetUnicastAgents(_)).WillOnce(SetArgReferee<0>(entries));

    auto output = Run(*ClusterUnicastAgentList::New());
    EXPECT_THAT(Errors(*output), IsEmpty());
    EXPECT_TRUE(output->IsComplete());
    Entries got;
    for (const auto& row : ListElements(output->GetRootObject())) got.push_back(Row(row));
    EXPECT_THAT(got, ElementsAreArray(rows));

    // The declared rows have the fields of the returned ones, in the same order.
    auto declared = std::dynamic_pointer_cast<Kalmor::MetaObj::MetaList>(
        ClusterUnicastAgentList::New()->GetOutputSpecInternal()->GetRootObject());
    ASSERT_NE(declared, nullptr);
    EXPECT_EQ(MeskTest::FieldNames(declared->GetTemplate()),
              MeskTest::FieldNames(ListElements(output->GetRootObject()).front()));
}

TEST_F(UnicastAgentListTest, OneMalformedEntryRefusesTheWholeList) {
    const struct {
        std::string entry, message;
    } cases[] = {
        {"u1", "Invalid unicastAgent entry for nodeuuid u1"},
        {"", "Invalid unicastAgent entry for nodeuuid "},
        {"u1;0", "Invalid unicastAgent entry for isWitness u1;0"},
        {"u1;0;1", "Invalid unicastAgent entry for ucast support u1;0;1"},
        {"u1;1;0;10.0.0.5", "Invalid unicastAgent entry for ip u1;1;0;10.0.0.5"},
        {"u1;0;1;10.0.0.5;12321", "Invalid unicastAgent entry for port u1;0;1;10.0.0.5;12321"},
    };
    for (const auto& c : cases) {
        EXPECT_CALL(info, GetUnicastAgents(_))
            .WillOnce(SetArgReferee<0>(Entries{"ok;0;1;10.0.0.1;12321;", c.entry}));
        auto output = Run(*ClusterUnicastAgentList::New());
        EXPECT_THAT(Errors(*output), ElementsAre(c.message));
        EXPECT_TRUE(output->GetRootObject() == nullptr && !output->IsComplete()) << c.entry;
    }
}

TEST_F(UnicastAgentListTest, RefusalsAndFailures) {
    SetEnabled(false);
    EXPECT_CALL(info, GetUnicastAgents(_)).Times(0);
    auto output = Run(*ClusterUnicastAgentList::New());
    EXPECT_THAT(Errors(*output), ElementsAre("Mesk isn't enabled on the host"));
    EXPECT_TRUE(output->GetRootObject() == nullptr && !output->IsComplete());

    // A witness node: the refusal comes with an empty, complete table.
    SetEnabled(true);
    EXPECT_CALL(host, IsWitnessNode()).WillOnce(Return(true));
    output = Run(*ClusterUnicastAgentList::New());
    EXPECT_THAT(Errors(*output),
                ElementsAre("Unable to list unicast agent, this host is a witness node which "
                            "doesn't support listing unicast agent."));
    EXPECT_THAT(ListElements(output->GetRootObject()), IsEmpty());
    EXPECT_TRUE(output->IsComplete());
    ::testing::Mock::VerifyAndClearExpectations(&info);
    ::testing::Mock::VerifyAndClearExpectations(&host);

    // The library failing to list: prefixed, and the table so far is still shown.
    EXPECT_CALL(info, GetUnicastAgents(_)).WillOnce(Fail("agents unreadable"));
    output = Run(*ClusterUnicastAgentList::New());
    EXPECT_THAT(Errors(*output), ElementsAre("Unable to list unicast agent: agents unreadable"));
    EXPECT_THAT(ListElements(output->GetRootObject()), IsEmpty());
    EXPECT_TRUE(output->IsComplete());

    // Failures before the listing are not the command's to report.
    EXPECT_CALL(host, IsWitnessNode()).WillOnce(Fail("no answer"));
    EXPECT_THROW(Run(*ClusterUnicastAgentList::New()), MeskCtlException);
    EXPECT_CALL(info, GetClusterConfig()).WillOnce(Fail("no config"));
    EXPECT_THROW(Run(*ClusterUnicastAgentList::New()), MeskCtlException);
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
