#include <memory>
#include <sstream>
#include <string>
#include <vector>

#include "MockHost.h"
#include "commands/network/NetworkClear.h"
#include "commands/network/NetworkIpAdd.h"
#include "commands/network/NetworkIpRemove.h"
#include "commands/network/NetworkIpSet.h"
#include "commands/network/NetworkList.h"
#include "commands/network/NetworkRemove.h"
#include "commands/network/NetworkRestore.h"
#include "hostctl/NetworkAddress.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using HostCtl::Mesk::MeskIpAddress;
using HostCtl::Mesk::MeskZuvNicConfig2;
using HostCtl::Network::Ipv4Address;
using HostCtl::Network::Ipv6Address;
using Kalmor::AutoCli::Command;
using Kalmor::CallSpec::Input;
using namespace MeskTest;
using ::testing::_;
using ::testing::ElementsAre;
using ::testing::InSequence;
using ::testing::IsEmpty;
using ::testing::Mock;
using ::testing::Return;
using Commands = std::initializer_list<std::shared_ptr<Command>>;

// An interface record as text: name, agent and master groups (IPv4, IPv6), agent, master and
// unicast ports, TTL, then the traffic types it carries.
std::string Describe(const MeskZuvNicConfig2& c) {
    std::ostringstream text;
    text << c.GetZuvnicName() << ' ' << c.GetAgentMulticastGroup().GetStringAddress() << ' '
         << c.GetAgentV6MulticastGroup().GetStringAddress() << ' '
         << c.GetMasterMulticastGroup().GetStringAddress() << ' '
         << c.GetMasterV6MulticastGroup().GetStringAddress() << ' ' << c.GetAgentMulticastPort()
         << ' ' << c.GetMasterMulticastPort() << ' ' << c.GetHostUnicastPort() << ' '
         << c.GetMulticastTTL() << (c.meskTraffic ? " mesk" : "")
         << (c.witnessTraffic ? " witness" : "");
    return text.str();
}

// A list entry's field values in field order, integers in decimal.
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

std::shared_ptr<Input> Named(const std::string& name = "zuvnic1", bool force = false) {
    auto input = Input::New();
    input->SetParameter("interface-name", name);
    if (force) input->SetFlag("force");
    return input;
}

void ExpectSucceeded(const Kalmor::CallSpec::Output& output) {
    EXPECT_TRUE(Errors(output).empty() && BoolResult(output) && output.IsComplete());
}
void ExpectFailedWith(const Kalmor::CallSpec::Output& output, const std::string& message) {
    EXPECT_THAT(Errors(output), ElementsAre(message));
    EXPECT_TRUE(output.GetRootObject() == nullptr && !output.IsComplete());
}

// A configured interface; every record has the groups and numbers shown in kCurrent.
struct Nic {
    std::string name;
    bool mesk, witness;
};
const std::string kCurrent = "zuvnic1 239.1.1.1 ff05::1 239.2.2.2 ff05::2 1000 2000 3000 9";

class NetworkTest : public HostTest {
  protected:
    // Makes the in-use test answer for "zuvnic1".
    void InUse(bool mesk, bool witness) {
        ON_CALL(info, IsZuvNicInUse("zuvnic1", "mesk")).WillByDefault(Return(mesk));
        ON_CALL(info, IsZuvNicInUse("zuvnic1", "witness")).WillByDefault(Return(witness));
    }
    // Makes GetZuvNicConfigs return records of these interfaces, afresh on every call.
    void Configured(std::vector<Nic> nics) {
        ON_CALL(info, GetZuvNicConfigs()).WillByDefault([nics] {
            NicList list;
            for (const auto& n : nics) {
                list.push_back(std::make_unique<MeskZuvNicConfig2>(
                    n.name, MeskIpAddress(Ipv4Address("239.1.1.1")),
                    MeskIpAddress(Ipv6Address("ff05::1")), MeskIpAddress(Ipv4Address("239.2.2.2")),
                    MeskIpAddress(Ipv6Address("ff05::2")), 1000, 2000, 3000, 9, n.mesk, n.witness,
                    "opts"));
            }
            return list;
        });
    }
    // Captures the record that SetZuvNicConfig receives.
    void CaptureWrite() {
        written.clear();
        EXPECT_CALL(info, SetZuvNicConfig(_)).WillOnce([this](const MeskZuvNicConfig2& c) {
            written = Describe(c);
            writtenOptions = c.GetOptions();
            return true;
        });
    }

    std::string written, writtenOptions = "unset";
};

TEST_F(NetworkTest, AddWithoutOptionsWritesTheDefaults) {
    InUse(false, false);
    EXPECT_CALL(info, GetZuvNicConfigs()).Times(0);
    CaptureWrite();
    ExpectSucceeded(*Run(*NetworkIpAdd::New(), Named()));
    EXPECT_EQ(
        written,
        "zuvnic1 224.2.3.4 FF19:0:0:0:0:2:3:4 224.1.2.3 FF19:0:0:0:0:1:2:3 23451 12345 12321 5 "
        "mesk");
    EXPECT_EQ(writtenOptions, "");
}

TEST_F(NetworkTest, GivenValuesOverrideAddDefaultsAndSetCurrentValues) {
    auto input = Named();
    input->SetParameter("agent-mc-addr", "224.9.9.1");
    input->SetParameter("agent-v6-mc-addr", "ff02::9");
    input->SetParameter("master-mc-addr", "224.9.9.2");
    input->SetParameter("master-v6-mc-addr", "ff02::a");
    // Only the low 32 bits of the framework's integers reach the record.
    input->SetParameterInt("agent-mc-port", (int64_t{1} << 32) + 2000);
    input->SetParameterInt("master-mc-port", 4294967295);
    input->SetParameterInt("host-uc-port", -7);
    input->SetParameterInt("multicast-ttl", 0);
    input->AddParameterValue("traffic-type", "witness");
    Configured({{"zuvnic1", true, false}});
    for (bool isSet : {false, true}) {
        SCOPED_TRACE(isSet ? "set" : "add");
        InUse(isSet, false);
        CaptureWrite();
        ExpectSucceeded(
            *(isSet ? Run(*NetworkIpSet::New(), input) : Run(*NetworkIpAdd::New(), input)));
        EXPECT_EQ(written, "zuvnic1 224.9.9.1 ff02::9 224.9.9.2 ff02::a 2000 -1 -7 0 witness");
    }
}

TEST_F(NetworkTest, SetKeepsEveryValueNotGivenOfTheExactlyNamedRecord) {
    // Near-miss names come first; of two records of the exact name the first counts.
    Configured({{"ZUVNIC1", true, true},
                {"zuvnic10", true, true},
                {"zuvnic1", false, true},
                {"zuvnic1", true, true}});
    InUse(false, true);
    CaptureWrite();
    auto input = Named();
    input->SetParameterInt("agent-mc-port", 2001);
    ExpectSucceeded(*Run(*NetworkIpSet::New(), input));
    EXPECT_EQ(written, "zuvnic1 239.1.1.1 ff05::1 239.2.2.2 ff05::2 2001 2000 3000 9 witness");

    // An interface in use without a record of its name is not found; nothing is written.
    EXPECT_CALL(info, IsZuvNicInUse("zuvnic7", "mesk")).WillOnce(Return(true));
    EXPECT_CALL(info, SetZuvNicConfig(_)).Times(0);
    ExpectFailedWith(*Run(*NetworkIpSet::New(), Named("zuvnic7")),
                     "This Zuvola network interface not found.");
}

TEST_F(NetworkTest, InUseTestAsksWitnessOnlyWhenMeskSaysNo) {
    const std::string already =
        "This Zuvola network interface is already in use. Can't add again. If you want to "
        "reconfigure, use 'set' command.";
    const std::string notInUse =
        "This Zuvola network interface is not in use. Can't set/reconfigure. If you want to "
        "add, use 'add' command.";
    const struct {
        bool isSet, mesk, witness;
        std::string error;  // empty: the record is written
    } cases[] = {
        {false, false, false, ""},
        {false, false, true, already},
        {true, false, false, notInUse},
        {true, true, false, ""},
    };
    Configured({{"zuvnic1", true, false}});
    for (const auto& c : cases) {
        SCOPED_TRACE(::testing::Message() << c.isSet << c.mesk << c.witness);
        EXPECT_CALL(info, IsZuvNicInUse("zuvnic1", "mesk")).WillOnce(Return(c.mesk));
        EXPECT_CALL(info, IsZuvNicInUse("zuvnic1", "witness"))
            .Times(c.mesk ? 0 : 1)
            .WillRepeatedly(Return(c.witness));
        // A refused command reads no record and writes nothing.
        EXPECT_CALL(info, GetZuvNicConfigs()).Times(c.isSet && c.error.empty() ? 1 : 0);
        EXPECT_CALL(info, SetZuvNicConfig(_)).Times(c.error.empty() ? 1 : 0);
        auto output =
            c.isSet ? Run(*NetworkIpSet::New(), Named()) : Run(*NetworkIpAdd::New(), Named());
        if (c.error.empty()) {
            ExpectSucceeded(*output);
        } else {
            ExpectFailedWith(*output, c.error);
        }
        Mock::VerifyAndClearExpectations(&info);
    }
}

// An unknown type fails like a library failure: the bare text, nothing written.
TEST_F(NetworkTest, TrafficTypesReplaceTheCurrentOnesOrFailOnAnUnknownOne) {
    const struct {
        std::vector<std::string> types;
        std::string written;  // or the error when it does not begin with a blank
    } cases[] = {
        {{"mesk", "witness"}, " mesk witness"},
        {{"witness"}, " witness"},
        {{"witness", "bogus"}, "Unknown traffic type"},
        {{"Mesk"}, "Unknown traffic type"},
    };
    // The current record carries both types, so a flag that is kept instead of replaced shows.
    Configured({{"zuvnic1", true, true}});
    InUse(true, true);
    for (const auto& c : cases) {
        SCOPED_TRACE(::testing::PrintToString(c.types));
        auto input = Named();
        for (const auto& type : c.types) input->AddParameterValue("traffic-type", type);
        if (c.written[0] == ' ') {
            CaptureWrite();
            ExpectSucceeded(*Run(*NetworkIpSet::New(), input));
            EXPECT_EQ(written, kCurrent + c.written);
        } else {
            EXPECT_CALL(info, SetZuvNicConfig(_)).Times(0);
            ExpectFailedWith(*Run(*NetworkIpSet::New(), input), c.written);
        }
        Mock::VerifyAndClearExpectations(&info);
    }
}

TEST_F(NetworkTest, CommandsNeedingMeskInfo2RefuseAPlainOrMissingInfoObject) {
    EXPECT_CALL(info, IsZuvNicInUse(_, _)).Times(0);
    EXPECT_CALL(info, GetZuvNicConfigs()).Times(0);
    for (auto kind : {InfoKind::Basic, InfoKind::Null}) {
        host.infoKind = kind;
        for (const auto& command :
             Commands{NetworkIpAdd::New(), NetworkIpSet::New(), NetworkList::New()}) {
            ExpectFailedWith(*Run(*command, Named()),
                             "Could not get MeskInfo2. Plugin version mismatch?");
        }
    }
    // The plain info object is released like any other.
    EXPECT_EQ(host.infosMade, host.infosReleased);
}

TEST_F(NetworkTest, ListShowsEveryRecordFieldByFieldInTheLibrarysOrder) {
    EXPECT_CALL(info, GetZuvNicConfigs()).WillOnce([] {
        NicList list;
        list.push_back(
            std::make_unique<MeskZuvNicConfig2>("zuvnic2", MeskIpAddress(Ipv4Address("224.2.3.4")),
                                                MeskIpAddress(Ipv6Address("FF19:0:0:0:0:2:3:4")),
                                                MeskIpAddress(Ipv4Address("224.1.2.3")),
                                                MeskIpAddress(Ipv6Address("FF19:0:0:0:0:1:2:3")),
                                                23451, 12345, 12321, 5, true, true, ""));
        list.back()->SetIfaceUuid("5e1c0d3a-0000-0000-0000-000000000002");
        // IPv6 groups in every slot, negative numbers, no traffic type.
        list.push_back(std::make_unique<MeskZuvNicConfig2>(
            "zuvnic0", MeskIpAddress(Ipv6Address("ff05::1")), MeskIpAddress(Ipv6Address("ff05::2")),
            MeskIpAddress(Ipv6Address("ff05::3")), MeskIpAddress(Ipv6Address("ff05::4")), -1,
            -2147483647 - 1, 0, -5, false, false, ""));
        return list;
    });
    auto output = Run(*NetworkList::New());
    EXPECT_TRUE(Errors(*output).empty() && output->IsComplete());
    // Every entry has the template's fields in the template's order; 32-bit values are
    // widened with their sign; "IP Protocol" is "IP" whatever the groups are.
    auto declared = std::dynamic_pointer_cast<Kalmor::MetaObj::MetaList>(
        NetworkList::New()->GetOutputSpecInternal()->GetRootObject());
    std::vector<std::vector<std::string>> rows;
    for (const auto& entry : ListElements(output->GetRootObject())) {
        EXPECT_EQ(FieldNames(entry), FieldNames(declared->GetTemplate()));
        rows.push_back(Row(entry));
    }
    EXPECT_THAT(
        rows, ElementsAre(ElementsAre("zuvnic2", "IP", "5e1c0d3a-0000-0000-0000-000000000002",
                                      "224.2.3.4", "FF19:0:0:0:0:2:3:4", "23451", "224.1.2.3",
                                      "FF19:0:0:0:0:1:2:3", "12345", "12321", "5", "mesk, witness"),
                          ElementsAre("zuvnic0", "IP", "", "ff05::1", "ff05::2", "-1", "ff05::3",
                                      "ff05::4", "-2147483648", "0", "-5", "")));
}

// A record's accessors cannot fail, so the library can fail only before the first entry: the
// empty list so far is then still the result, completed, beside the bare message.
TEST_F(NetworkTest, ListThatFailsIsStillACompleteEmptyResult) {
    EXPECT_CALL(info, GetZuvNicConfigs()).WillOnce(Fail("locked"));
    auto output = Run(*NetworkList::New());
    EXPECT_THAT(Errors(*output), ElementsAre("locked"));
    EXPECT_TRUE(output->IsComplete());
    EXPECT_THAT(ListElements(output->GetRootObject()), IsEmpty());
}

// Both remove commands ask for "mesk" then "witness"; a failed "mesk" removal means "witness"
// is not asked for, and any failure gives the bare message and a false, complete result.
TEST_F(NetworkTest, RemoveAsksForMeskThenWitnessAndStopsAtAFailure) {
    enum Failing { kNone, kMesk, kWitness };
    for (const auto& command : Commands{NetworkIpRemove::New(), NetworkRemove::New()}) {
        for (const Failing failing : {kNone, kMesk, kWitness}) {
            SCOPED_TRACE(command->GetDescription() + std::to_string(failing));
            const bool force = failing == kNone;
            InSequence order;
            auto& mesk = EXPECT_CALL(info, RemoveZuvNic("zuvnic1", force, "mesk"));
            auto& witness = EXPECT_CALL(info, RemoveZuvNic("zuvnic1", force, "witness"));
            if (failing == kMesk) mesk.WillOnce(Fail("busy")), witness.Times(0);
            if (failing == kWitness) witness.WillOnce(Fail("busy"));
            auto output = Run(*command, Named("zuvnic1", force));
            if (failing == kNone) {
                ExpectSucceeded(*output);
            } else {
                EXPECT_THAT(Errors(*output), ElementsAre("busy"));
                EXPECT_TRUE(!BoolResult(*output) && output->IsComplete());
            }
            Mock::VerifyAndClearExpectations(&info);
        }
    }
}

TEST_F(NetworkTest, ClearAndRestoreAreTrueOrFalseAndAlwaysComplete) {
    for (const bool fails : {false, true}) {
        auto call = [fails] {
            if (fails) throw HostCtl::Lib::Mesk::MeskCtlException("locked");
        };
        EXPECT_CALL(info, ClearNetworkConfig()).WillOnce(call);
        EXPECT_CALL(info, RestoreNetworkConfig()).WillOnce(call);
        for (const auto& output : {Run(*NetworkClear::New()), Run(*NetworkRestore::New())}) {
            EXPECT_EQ(BoolResult(*output), !fails);
            EXPECT_TRUE(output->IsComplete());
            EXPECT_EQ(Errors(*output),
                      fails ? std::vector<std::string>{"locked"} : std::vector<std::string>{});
        }
        Mock::VerifyAndClearExpectations(&info);
    }
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
