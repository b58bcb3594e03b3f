#include "commands/network/NetworkIpAdd.h"

#include <cstdint>
#include <string>
#include <vector>

#include "MeskConstants.h"
#include "hostctl/MeskCtlException.h"
#include "hostctl/MeskInfo.h"
#include "hostctl/MeskPlugin.h"
#include "hostctl/MeskTypes.h"
#include "hostctl/NetworkAddress.h"

namespace OrvaneCli {
namespace MeskNamespace {

using HostCtl::Lib::Mesk::MeskCtlException;
using HostCtl::Mesk::MeskInfo2;
using HostCtl::Mesk::MeskIpAddress;
using HostCtl::Mesk::MeskZuvNicConfig2;
using HostCtl::Network::Ipv4Address;
using HostCtl::Network::Ipv6Address;
using Kalmor::CallSpec::Input;
using Kalmor::CallSpec::InputSpec;
using Kalmor::CallSpec::Output;
using Kalmor::CallSpec::OutputSpec;
using Kalmor::CallSpec::ParameterSpec;
using Kalmor::MetaObj::MetaBool;

namespace {

// Ports and time-to-live of a newly added interface.
const int32_t DEFAULT_AGENT_MULTICAST_PORT = 23451;
const int32_t DEFAULT_MASTER_MULTICAST_PORT = 12345;
const int32_t DEFAULT_HOST_UNICAST_PORT = 12321;
const int32_t DEFAULT_MULTICAST_TTL = 5;

MeskIpAddress V4(const std::string& text) {
    return MeskIpAddress(Ipv4Address(text));
}

MeskIpAddress V6(const std::string& text) {
    return MeskIpAddress(Ipv6Address(text));
}

// The framework's integers are 64 bits wide; the library's ports and TTL are 32. Only the
// low 32 bits are passed on, unchecked: the library judges the values.
int32_t Low32(int64_t value) {
    return static_cast<int32_t>(static_cast<uint32_t>(value));
}

}  // namespace

std::shared_ptr<NetworkIpAdd> NetworkIpAdd::New() {
    return std::make_shared<NetworkIpAdd>();
}

NetworkIpAdd::NetworkIpAdd() {
    SetDescription("Add an IP interface to the Mesk network configuration.");
    SetMetaDataField("type", "operation");
}

NetworkIpAdd::~NetworkIpAdd() = default;

std::shared_ptr<InputSpec> NetworkIpAdd::GetInputSpecInternal() {
    return GetInputSpecCommon();
}

std::shared_ptr<InputSpec> NetworkIpAdd::GetInputSpecCommon() {
    auto spec = InputSpec::New();

    auto interfaceName = ParameterSpec::New("interface-name", Kalmor::CallSpec::PARAM_STRING);
    interfaceName->SetShortName("i");
    interfaceName->SetRequired(true);
    interfaceName->SetDescription("Interface name.");
    spec->AddParameter(interfaceName);

    auto agentAddress = ParameterSpec::New("agent-mc-addr", Kalmor::CallSpec::PARAM_STRING);
    agentAddress->SetShortName("d");
    agentAddress->SetRequired(false);
    agentAddress->SetDescription(
        "IPv4 multicast address for agent (also called downstream) group.");
    spec->AddParameter(agentAddress);

    auto agentV6Address = ParameterSpec::New("agent-v6-mc-addr", Kalmor::CallSpec::PARAM_STRING);
    agentV6Address->SetShortName("D");
    agentV6Address->SetRequired(false);
    agentV6Address->SetDescription(
        "IPv6 multicast address for agent (also called downstream) group.");
    spec->AddParameter(agentV6Address);

    auto agentPort = ParameterSpec::New("agent-mc-port", Kalmor::CallSpec::PARAM_INT);
    agentPort->SetShortName("p");
    agentPort->SetRequired(false);
    agentPort->SetDescription("Multicast address port for agent (also called downstream) group.");
    spec->AddParameter(agentPort);

    auto masterAddress = ParameterSpec::New("master-mc-addr", Kalmor::CallSpec::PARAM_STRING);
    masterAddress->SetShortName("u");
    masterAddress->SetRequired(false);
    masterAddress->SetDescription(
        "IPv4 multicast address for master (also called upstream) group.");
    spec->AddParameter(masterAddress);

    auto masterV6Address = ParameterSpec::New("master-v6-mc-addr", Kalmor::CallSpec::PARAM_STRING);
    masterV6Address->SetShortName("U");
    masterV6Address->SetRequired(false);
    masterV6Address->SetDescription(
        "IPv6 multicast address for master (also called upstream) group.");
    spec->AddParameter(masterV6Address);

    auto masterPort = ParameterSpec::New("master-mc-port", Kalmor::CallSpec::PARAM_INT);
    masterPort->SetShortName("o");
    masterPort->SetRequired(false);
    masterPort->SetDescription("Multicast address port for master (also called upstream) group.");
    spec->AddParameter(masterPort);

    auto unicastPort = ParameterSpec::New("host-uc-port", Kalmor::CallSpec::PARAM_INT);
    unicastPort->SetShortName("c");
    unicastPort->SetRequired(false);
    unicastPort->SetDescription("Unicast address port for host unicast channel.");
    spec->AddParameter(unicastPort);

    auto ttl = ParameterSpec::New("multicast-ttl", Kalmor::CallSpec::PARAM_INT);
    ttl->SetShortName("t");
    ttl->SetRequired(false);
    ttl->SetDescription("Time-to-live for multicast packets.");
    spec->AddParameter(ttl);

    auto trafficType = ParameterSpec::New("traffic-type", Kalmor::CallSpec::PARAM_STRING_LIST);
    trafficType->SetShortName("T");
    trafficType->SetRequired(false);
    trafficType->SetDescription(
        "Network transmission type of Mesk traffic through a virtual network "
        "adapter.Supported values are mesk, witness. Type mesk means general Mesk "
        "transmission, which is used for both data and witness transmission, if there is no "
        "virtual adapter configured with witness traffic type; Type witness indicates that, "
        "Mesk zuvnic is used for Mesk witness transmission. Once a virtual adapter is "
        "configured with witness traffic type, Mesk witness data transmission will stop using "
        "virtual adpater with mesk traffic type, and use first dicovered virtual adapter with "
        "witness traffic type. Multiple traffic types can be provided in format -T type1 -T "
        "type2. Default value is mesk, if this option is not specified.");
    spec->AddParameter(trafficType);

    return spec;
}

std::shared_ptr<OutputSpec> NetworkIpAdd::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaBool::New());
    return spec;
}

void NetworkIpAdd::ExecuteInternal(std::shared_ptr<Input> input, std::shared_ptr<Output> output) {
    ExecuteCommon(input, output, false);
}

void NetworkIpAdd::ExecuteCommon(std::shared_ptr<Input> input, std::shared_ptr<Output> output,
                                 bool isSet) {
    try {
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();
        auto* info2 = dynamic_cast<MeskInfo2*>(info.get());
        if (info2 == nullptr) {
            output->AddErrorMessage("Could not get MeskInfo2. Plugin version mismatch?");
            return;
        }

        const std::string interfaceName = input->GetParameter("interface-name");

        // An interface is in use when it carries either traffic type; "witness" is asked only
        // when "mesk" says no.
        const bool inUse = info2->IsZuvNicInUse(interfaceName, TRAFFIC_TYPE_MESK) ||
                           info2->IsZuvNicInUse(interfaceName, TRAFFIC_TYPE_WITNESS);
        if (isSet && !inUse) {
            output->AddErrorMessage(
                "This Zuvola network interface is not in use. Can't set/reconfigure. If you "
                "want to add, use 'add' command.");
            return;
        }
        if (!isSet && inUse) {
            output->AddErrorMessage(
                "This Zuvola network interface is already in use. Can't add again. If you want "
                "to reconfigure, use 'set' command.");
            return;
        }

        // Start values: the interface's current record for set, the defaults for add. The
        // addresses go through their text either way, so that the library's address types
        // judge every value that is written.
        MeskIpAddress agentGroup;
        MeskIpAddress agentV6Group;
        MeskIpAddress masterGroup;
        MeskIpAddress masterV6Group;
        int32_t agentPort = 0;
        int32_t masterPort = 0;
        int32_t unicastPort = 0;
        int32_t ttl = 0;
        bool meskTraffic = false;
        bool witnessTraffic = false;
        if (isSet) {
            auto configs = info2->GetZuvNicConfigs();
            const MeskZuvNicConfig2* current = nullptr;
            for (const auto& config : configs) {
                if (config->GetZuvnicName() == interfaceName) {
                    current = config.get();
                    break;
                }
            }
            if (current == nullptr) {
                output->AddErrorMessage("This Zuvola network interface not found.");
                return;
            }
            agentGroup = V4(current->GetAgentMulticastGroup().GetStringAddress());
            agentV6Group = V6(current->GetAgentV6MulticastGroup().GetStringAddress());
            masterGroup = V4(current->GetMasterMulticastGroup().GetStringAddress());
            masterV6Group = V6(current->GetMasterV6MulticastGroup().GetStringAddress());
            agentPort = current->GetAgentMulticastPort();
            masterPort = current->GetMasterMulticastPort();
            unicastPort = current->GetHostUnicastPort();
            ttl = current->GetMulticastTTL();
            meskTraffic = current->meskTraffic;
            witnessTraffic = current->witnessTraffic;
        } else {
            agentGroup = V4(AGENT_GROUP_MULTICAST_ADDRESS);
            agentV6Group = V6(AGENT_GROUP_IPV6_MULTICAST_ADDRESS);
            masterGroup = V4(MASTER_GROUP_MULTICAST_ADDRESS);
            masterV6Group = V6(MASTER_GROUP_IPV6_MULTICAST_ADDRESS);
            agentPort = DEFAULT_AGENT_MULTICAST_PORT;
            masterPort = DEFAULT_MASTER_MULTICAST_PORT;
            unicastPort = DEFAULT_HOST_UNICAST_PORT;
            ttl = DEFAULT_MULTICAST_TTL;
            meskTraffic = true;
            witnessTraffic = false;
        }

        if (input->HasParameter("agent-mc-addr")) {
            agentGroup = V4(input->GetParameter("agent-mc-addr"));
        }
        if (input->HasParameter("agent-v6-mc-addr")) {
            agentV6Group = V6(input->GetParameter("agent-v6-mc-addr"));
        }
        if (input->HasParameter("master-mc-addr")) {
            masterGroup = V4(input->GetParameter("master-mc-addr"));
        }
        if (input->HasParameter("master-v6-mc-addr")) {
            masterV6Group = V6(input->GetParameter("master-v6-mc-addr"));
        }
        if (input->HasParameter("agent-mc-port")) {
            agentPort = Low32(input->GetParameterInt("agent-mc-port"));
        }
        if (input->HasParameter("master-mc-port")) {
            masterPort = Low32(input->GetParameterInt("master-mc-port"));
        }
        if (input->HasParameter("host-uc-port")) {
            unicastPort = Low32(input->GetParameterInt("host-uc-port"));
        }
        if (input->HasParameter("multicast-ttl")) {
            ttl = Low32(input->GetParameterInt("multicast-ttl"));
        }
        // Given traffic types replace the current ones completely.
        if (input->HasParameter("traffic-type")) {
            std::vector<std::string> types;
            input->GetParameterList("traffic-type", types);
            meskTraffic = false;
            witnessTraffic = false;
            for (const auto& type : types) {
                if (type == TRAFFIC_TYPE_MESK) {
                    meskTraffic = true;
                } else if (type == TRAFFIC_TYPE_WITNESS) {
                    witnessTraffic = true;
                } else {
                    throw MeskCtlException("Unknown traffic type");
                }
            }
        }

        const MeskZuvNicConfig2 config(interfaceName, agentGroup, agentV6Group, masterGroup,
                                       masterV6Group, agentPort, masterPort, unicastPort, ttl,
                                       meskTraffic, witnessTraffic, "");
        info2->SetZuvNicConfig(config);
        output->SetRootObject(MetaBool::New(true));
        output->SetComplete();
    } catch (const MeskCtlException& e) {
        output->AddErrorMessage(e.GetMessage());
    }
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
