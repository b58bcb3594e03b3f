#include "commands/cluster/ClusterUnicastAgentAdd.h"

#include <boost/algorithm/string/join.hpp>
#include <cstdint>
#include <string>
#include <vector>

#include "MeskConstants.h"
#include "commands/cluster/UnicastAgent.h"
#include "hostctl/MeskCtlException.h"
#include "hostctl/MeskPlugin.h"
#include "hostctl/MeskUtil.h"

namespace OrvaneCli {
namespace MeskNamespace {

using HostCtl::Lib::Mesk::MeskCtlException;
using HostCtl::Mesk::MeskIpAddress;
using Kalmor::CallSpec::Input;
using Kalmor::CallSpec::InputSpec;
using Kalmor::CallSpec::Output;
using Kalmor::CallSpec::OutputSpec;
using Kalmor::CallSpec::ParameterConstraint;
using Kalmor::CallSpec::ParameterSpec;
using Kalmor::MetaObj::MetaBool;
using ZuvCtl::Mesk::MeskUtil;

std::shared_ptr<ClusterUnicastAgentAdd> ClusterUnicastAgentAdd::New() {
    return std::make_shared<ClusterUnicastAgentAdd>();
}

ClusterUnicastAgentAdd::ClusterUnicastAgentAdd() {
    SetDescription("Add a unicast agent to the Mesk cluster configuration.");
    SetMetaDataField("type", "operation");
}

ClusterUnicastAgentAdd::~ClusterUnicastAgentAdd() = default;

std::shared_ptr<InputSpec> ClusterUnicastAgentAdd::GetInputSpecInternal() {
    auto spec = InputSpec::New();

    auto type = ParameterSpec::New("type", Kalmor::CallSpec::PARAM_STRING);
    type->SetShortName("t");
    type->SetRequired(false);
    type->SetDescription("Type of the unicast agent (One of %ENUM%, default is witness).");
    auto types = ParameterConstraint::New(Kalmor::CallSpec::CONSTRAINT_STRING_ENUM);
    types->AddStringEnum("witness", "");
    types->AddStringEnum("node", "");
    type->SetConstraint(types);
    spec->AddParameter(type);

    auto uuid = ParameterSpec::New("uuid", Kalmor::CallSpec::PARAM_STRING);
    uuid->SetShortName("u");
    uuid->SetRequired(false);
    uuid->SetDescription("UUID of the unicast agent (required for -t node).");
    spec->AddParameter(uuid);

    auto unicast = ParameterSpec::New("supports-unicast", Kalmor::CallSpec::PARAM_BOOL);
    unicast->SetShortName("U");
    unicast->SetRequired(false);
    unicast->SetDescription("Whether the software version supports unicast (required for -t node)");
    spec->AddParameter(unicast);

    auto addr = ParameterSpec::New("addr", Kalmor::CallSpec::PARAM_STRING);
    addr->SetShortName("a");
    addr->SetRequired(true);
    addr->SetDescription("IP address of the unicast agent.");
    spec->AddParameter(addr);

    auto port = ParameterSpec::New("port", Kalmor::CallSpec::PARAM_INT);
    port->SetShortName("p");
    port->SetRequired(false);
    port->SetDescription("Port the unicast agent is listening on.");
    spec->AddParameter(port);

    auto iface = ParameterSpec::New("bound-interface-name", Kalmor::CallSpec::PARAM_STRING);
    iface->SetShortName("i");
    iface->SetRequired(false);
    iface->SetDescription("Name of the bound outgoing network interface.");
    spec->AddParameter(iface);

    return spec;
}

std::shared_ptr<OutputSpec> ClusterUnicastAgentAdd::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaBool::New());
    return spec;
}

void ClusterUnicastAgentAdd::ExecuteInternal(std::shared_ptr<Input> input,
                                             std::shared_ptr<Output> output) {
    // A witness node keeps no unicast agents of its own. Asked before the library is touched,
    // and a failure of the question itself goes to the framework.
    if (MeskUtil::IsWitnessNode()) {
        output->AddErrorMessage(
            "This host is a witness node which doesn't support adding unicast agent.");
        return;
    }

    try {
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();

        // Without a type the agent is a witness.
        const bool isWitness =
            !input->HasParameter("type") || input->GetParameter("type") == "witness";

        std::string nodeUuid = kNoNodeUuid;
        if (input->HasParameter("uuid")) {
            nodeUuid = input->GetParameter("uuid");
        } else if (!isWitness) {
            output->AddErrorMessage("Can not add unicastagent without specifying node-uuid");
            return;
        }

        bool supportsUnicast = false;
        if (input->HasParameter("supports-unicast")) {
            supportsUnicast = input->GetParameterBool("supports-unicast");
        } else if (!isWitness) {
            output->AddErrorMessage("Can not add unicastagent without specifying unicast support");
            return;
        }

        const std::string addr = input->GetParameter("addr");
        MeskIpAddress address;
        if (!ToMeskIpAddress(addr, address)) {
            output->AddErrorMessage("Invalid IP address " + addr);
            return;
        }

        const int32_t port = input->HasParameter("port")
                                 ? static_cast<int32_t>(input->GetParameterInt("port"))
                                 : kDefaultUnicastAgentPort;

        const bool hasInterface = input->HasParameter("bound-interface-name");
        const std::string interfaceName =
            hasInterface ? input->GetParameter("bound-interface-name") : std::string();

        // The cluster service talks to at most one unicast witness: any configured witness,
        // even the same one again, refuses a new one.
        if (isWitness) {
            std::vector<std::string> witnesses;
            info->GetUnicastWitnesses(witnesses);
            if (witnesses.size() == 1) {
                output->AddErrorMessage(
                    "Mesk does not support connecting to more than one unicast witness, and "
                    "there is already a unicast witness configured: " +
                    witnesses.front() + ".");
                return;
            }
            if (witnesses.size() > 1) {
                output->AddErrorMessage(
                    "Mesk does not support connecting to more than one unicast witness, and "
                    "there are already multiple unicast witnesses configured: " +
                    boost::algorithm::join(witnesses, ",") + ".");
                return;
            }
        }

        info->AddUnicastAgent(nodeUuid, isWitness, supportsUnicast, address, port, hasInterface,
                              interfaceName);
        // A node joins the peers that the cluster service refreshes; a witness needs no refresh.
        if (!isWitness) {
            info->RefreshUnicastAgents();
        }

        output->SetRootObject(MetaBool::New(true));
        output->SetComplete();
    } catch (const MeskCtlException& e) {
        output->AddErrorMessage(e.GetMessage());
    }
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
