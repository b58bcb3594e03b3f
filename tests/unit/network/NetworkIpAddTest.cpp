#include <optional>
#include <ostream>
#include <string>
#include <tuple>
#include <vector>

#include "MockHost.h"
#include "commands/network/NetworkIpAdd.h"
#include "commands/network/NetworkIpSet.h"
#include "commands/network/NetworkList.h"
#include "hostctl/NetworkAddress.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using HostCtl::Mesk::MeskIpAddress;
using HostCtl::Mesk::MeskZuvNicConfig2;
using HostCtl::Network::Ipv4Address;
using HostCtl::Network::Ipv6Address;
using Kalmor::CallSpec::Input;
using MeskTest::BoolResult;
using MeskTest::Errors;
using MeskTest::Fail;
using MeskTest::HostTest;
using MeskTest::InfoKind;
using MeskTest::NicList;
using ::testing::_;
using ::testing::ElementsAre;
using ::testing::InSequence;
using ::testing::Invoke;
using ::testing::IsEmpty;
using ::testing::Return;
using ::testing::SizeIs;

// The values of a written interface record, in text form for readable comparisons.
struct Nic {
    std::string name;
    std::string agent, agentV6, master, masterV6;
    int32_t agentPort, masterPort, unicastPort, ttl;
    bool mesk, witness;

    auto Tie() const {
        return std::tie(name, agent, agentV6, master, masterV6, agentPort, masterPort, unicastPort,
                        ttl, mesk, witness);
    }
    bool operator==(const Nic& other) const { return Tie() == other.Tie(); }
};

void PrintTo(const Nic& n, std::ostream* os) {
    *os << n.name << " agent " << n.agent << "/" << n.agentV6 << ":" << n.agentPort << " master "
        << n.master << "/" << n.masterV6 << ":" << n.masterPort << " uc " << n.unicastPort
        << " ttl " << n.ttl << " mesk " << n.mesk << " witness " << n.witness;
}

Nic ValuesOf(const MeskZuvNicConfig2& c) {
    return {c.GetZuvnicName(),
            c.GetAgentMulticastGroup().GetStringAddress(),
            c.GetAgentV6MulticastGroup().GetStringAddress(),
            c.GetMasterMulticastGroup().GetStringAddress(),
            c.GetMasterV6MulticastGroup().GetStringAddress(),
            c.GetAgentMulticastPort(),
            c.GetMasterMulticastPort(),
            c.GetHostUnicastPort(),
            c.GetMulticastTTL(),
            c.meskTraffic,
            c.witnessTraffic};
}

std::unique_ptr<MeskZuvNicConfig2> Record(const Nic& n) {
    return std::make_unique<MeskZuvNicConfig2>(
        n.name, MeskIpAddress(Ipv4Address(n.agent)), MeskIpAddress(Ipv6Address(n.agentV6)),
        MeskIpAddress(Ipv4Address(n.master)), MeskIpAddress(Ipv6Address(n.masterV6)), n.agentPort,
        n.masterPort, n.unicastPort, n.ttl, n.mesk, n.witness, "opts");
}

const Nic kDefaults{"vmk1",
                    "224.2.3.4",
                    "FF19:0:0:0:0:2:3:4",
                    "224.1.2.3",
                    "FF19:0:0:0:0:1:2:3",
                    23451,
                    12345,
                    12321,
                    5,
                    true,
                    false};
const Nic kCurrent{"vmk1", "239.1.1.1", "ff05::1", "239.2.2.2", "ff05::2", 1000,
                   2000,   3000,        9,         false,       true};

class NetworkIpAddTest : public HostTest {
  protected:
    // Makes the in-use test answer for "vmk1".
    void InUse(bool mesk, bool witness) {
        ON_CALL(info, IsZuvNicInUse("vmk1", "mesk")).WillByDefault(Return(mesk));
        ON_CALL(info, IsZuvNicInUse("vmk1", "witness")).WillByDefault(Return(witness));
    }
    // Makes GetZuvNicConfigs return these records, afresh on every call.
    void Configured(std::vector<Nic> nics) {
        ON_CALL(info, GetZuvNicConfigs()).WillByDefault(Invoke([nics] {
            NicList list;
            for (const auto& n : nics) list.push_back(Record(n));
            return list;
        }));
    }
    // Captures the record that SetZuvNicConfig receives.
    void CaptureWrite() {
        EXPECT_CALL(info, SetZuvNicConfig(_)).WillOnce(Invoke([this](const MeskZuvNicConfig2& c) {
            written = ValuesOf(c);
            writtenOptions = c.GetOptions();
            return true;
        }));
    }
    static std::shared_ptr<Input> Named(const std::string& name = "vmk1") {
        auto input = Input::New();
        input->SetParameter("interface-name", name);
        return input;
    }
    void ExpectSucceeded(const Kalmor::CallSpec::Output& output) {
        EXPECT_THAT(Errors(output), IsEmpty());
        EXPECT_TRUE(BoolResult(output));
        EXPECT_TRUE(output.IsComplete());
    }
    void ExpectFailedWith(const Kalmor::CallSpec::Output& output, const std::string& message) {
        EXPECT_THAT(Errors(output), ElementsAre(message));
        EXPECT_EQ(output.GetRootObject(), nullptr);
        EXPECT_FALSE(output.IsComplete());
    }

    std::optional<Nic> written;
    std::string writtenOptions = "unset";
};

TEST_F(NetworkIpAddTest, AddWithoutOptionsWritesTheDefaults) {
    InUse(false, false);
    EXPECT_CALL(info, GetZuvNicConfigs()).Times(0);
    CaptureWrite();
    auto output = Run(*NetworkIpAdd::New(), Named());
    ExpectSucceeded(*output);
    EXPECT_EQ(written, kDefaults);
    EXPECT_EQ(writtenOptions, "");
}

TEST_F(NetworkIpAddTest, GivenValuesOverrideAddDefaultsAndSetCurrentValues) {
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
    const Nic expected{"vmk1", "224.9.9.1", "ff02::9", "224.9.9.2", "ff02::a", 2000,
                       -1,     -7,          0,         false,       true};

    for (bool isSet : {false, true}) {
        SCOPED_TRACE(isSet ? "set" : "add");
        written.reset();
        InUse(isSet, false);
        Configured({kCurrent});
        CaptureWrite();
        auto output = isSet ? Run(*NetworkIpSet::New(), input) : Run(*NetworkIpAdd::New(), input);
        ExpectSucceeded(*output);
        EXPECT_EQ(written, expected);
    }
}

TEST_F(NetworkIpAddTest, SetKeepsEveryValueNotGivenOfTheExactlyNamedRecord) {
    // Near-miss names come first: only the exact name is the interface's record, and of two
    // records of that name the first counts.
    Nic upper = kDefaults, blank = kDefaults, other = kDefaults;
    upper.name = "VMK1";
    blank.name = "vmk1 ";
    other.name = "vmk10";
    Configured({upper, blank, other, kCurrent, kDefaults});
    InUse(false, true);
    CaptureWrite();
    auto input = Named();
    input->SetParameterInt("agent-mc-port", 2000);
    auto output = Run(*NetworkIpSet::New(), input);
    ExpectSucceeded(*output);
    Nic expected = kCurrent;
    expected.agentPort = 2000;
    EXPECT_EQ(written, expected);
}

TEST_F(NetworkIpAddTest, InUseTestAsksWitnessOnlyWhenMeskSaysNo) {
    const std::string kAlready =
        "This Zuvola network interface is already in use. Can't add again. If you want to "
        "reconfigure, use 'set' command.";
    const std::string kNotInUse =
        "This Zuvola network interface is not in use. Can't set/reconfigure. If you want to "
        "add, use 'add' command.";
    struct Case {
        bool isSet, mesk, witness;
        std::string error;  // empty: the record is written
    };
    const Case cases[] = {
        {false, false, false, ""},      {false, true, false, kAlready},
        {false, false, true, kAlready}, {true, false, false, kNotInUse},
        {true, true, false, ""},        {true, false, true, ""},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(::testing::Message()
                     << "set " << c.isSet << " mesk " << c.mesk << " witness " << c.witness);
        ::testing::Mock::VerifyAndClearExpectations(&info);
        Configured({kCurrent});
        {
            InSequence order;
            EXPECT_CALL(info, IsZuvNicInUse("vmk1", "mesk")).WillOnce(Return(c.mesk));
            if (c.mesk) {
                EXPECT_CALL(info, IsZuvNicInUse("vmk1", "witness")).Times(0);
            } else {
                EXPECT_CALL(info, IsZuvNicInUse("vmk1", "witness")).WillOnce(Return(c.witness));
            }
        }
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
    }
}

TEST_F(NetworkIpAddTest, SetOfAnInterfaceWithoutRecordWritesNothing) {
    InUse(true, false);
    for (const std::vector<Nic>& records : {std::vector<Nic>{}, std::vector<Nic>{kDefaults}}) {
        Configured(records);
        EXPECT_CALL(info, IsZuvNicInUse("vmk7", "mesk")).WillOnce(Return(true));
        EXPECT_CALL(info, SetZuvNicConfig(_)).Times(0);
        auto output = Run(*NetworkIpSet::New(), Named("vmk7"));
        ExpectFailedWith(*output, "This Zuvola network interface not found.");
    }
}

TEST_F(NetworkIpAddTest, TrafficTypesReplaceTheCurrentOnesOrFailOnAnUnknownOne) {
    struct Case {
        std::vector<std::string> types;
        bool mesk, witness;
        std::string error;  // empty: the record is written with these flags
    };
    const Case cases[] = {
        {{"mesk", "witness"}, true, true, ""},
        {{"witness"}, false, true, ""},
        {{"mesk", "mesk"}, true, false, ""},
        {{"witness", "bogus"}, false, false, "Unknown traffic type"},
        {{"Mesk"}, false, false, "Unknown traffic type"},
    };
    // The current record carries both types, so a flag that is kept instead of replaced shows.
    Nic current = kCurrent;
    current.mesk = true;
    current.witness = true;
    Configured({current});
    InUse(true, true);
    for (const auto& c : cases) {
        SCOPED_TRACE(::testing::PrintToString(c.types));
        ::testing::Mock::VerifyAndClearExpectations(&info);
        written.reset();
        auto input = Named();
        for (const auto& type : c.types) input->AddParameterValue("traffic-type", type);
        if (c.error.empty()) {
            CaptureWrite();
        } else {
            EXPECT_CALL(info, SetZuvNicConfig(_)).Times(0);
        }
        auto output = Run(*NetworkIpSet::New(), input);
        if (c.error.empty()) {
            ExpectSucceeded(*output);
            ASSERT_TRUE(written);
            EXPECT_EQ(written->mesk, c.mesk);
            EXPECT_EQ(written->witness, c.witness);
        } else {
            ExpectFailedWith(*output, c.error);
        }
    }
}

TEST_F(NetworkIpAddTest, LibraryFailuresAreReportedBareAndWriteNothing) {
    InUse(false, false);
    {
        SCOPED_TRACE("in-use test fails");
        EXPECT_CALL(info, IsZuvNicInUse(_, "mesk")).WillOnce(Fail("hostd unreachable"));
        EXPECT_CALL(info, SetZuvNicConfig(_)).Times(0);
        ExpectFailedWith(*Run(*NetworkIpAdd::New(), Named()), "hostd unreachable");
    }
    {
        SCOPED_TRACE("an address the library rejects");
        ::testing::Mock::VerifyAndClearExpectations(&info);
        EXPECT_CALL(info, SetZuvNicConfig(_)).Times(0);
        auto input = Named();
        input->SetParameter("agent-mc-addr", "FF19:0:0:0:0:2:3:4");
        auto output = Run(*NetworkIpAdd::New(), input);
        EXPECT_THAT(Errors(*output), SizeIs(1));
        EXPECT_EQ(output->GetRootObject(), nullptr);
        EXPECT_FALSE(output->IsComplete());
    }
    {
        SCOPED_TRACE("the write fails");
        ::testing::Mock::VerifyAndClearExpectations(&info);
        EXPECT_CALL(info, SetZuvNicConfig(_)).WillOnce(Fail("vmk1 does not exist"));
        ExpectFailedWith(*Run(*NetworkIpAdd::New(), Named()), "vmk1 does not exist");
    }
}

TEST_F(NetworkIpAddTest, CommandsNeedingMeskInfo2RefuseAPlainOrMissingInfoObject) {
    struct Command {
        const char* name;
        std::shared_ptr<Kalmor::AutoCli::Command> command;
    };
    const Command commands[] = {
        {"add", NetworkIpAdd::New()}, {"set", NetworkIpSet::New()}, {"list", NetworkList::New()}};
    for (InfoKind kind : {InfoKind::Basic, InfoKind::Null}) {
        host.infoKind = kind;
        for (const auto& c : commands) {
            SCOPED_TRACE(::testing::Message() << c.name << " kind " << static_cast<int>(kind));
            EXPECT_CALL(info, IsZuvNicInUse(_, _)).Times(0);
            EXPECT_CALL(info, GetZuvNicConfigs()).Times(0);
            auto output = Run(*c.command, Named());
            ExpectFailedWith(*output, "Could not get MeskInfo2. Plugin version mismatch?");
        }
    }
    // The plain info object is released like any other.
    EXPECT_EQ(host.infosMade, host.infosReleased);
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
