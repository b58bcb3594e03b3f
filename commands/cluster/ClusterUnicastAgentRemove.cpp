#include "commands/cluster/ClusterUnicastAgentRemove.h"

#include <cstdint>
#include <string>

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
using Kalmor::CallSpec::ParameterSpec;
using Kalmor::MetaObj::MetaBool;
using ZuvCtl::Mesk::MeskUtil;

std::shared_ptr<ClusterUnicastAgentRemove> ClusterUnicastAgentRemove::New() {
    return std::make_shared<ClusterUnicastAgentRemove>();
}

ClusterUnicastAgentRemove::ClusterUnicastAgentRemove() {
    SetDescription("Remove a unicast agent from the Mesk cluster configuration.");
    SetMetaDataField("type", "operation");
}

ClusterUnicastAgentRemove::~ClusterUnicastAgentRemove() = default;

std::shared_ptr<InputSpec> ClusterUnicastAgentRemove::GetInputSpecInternal() {
    auto spec = InputSpec::New();

    auto uuid = ParameterSpec::New("uuid", Kalmor::CallSpec::PARAM_STRING);
    uuid->SetShortName("u");
    uuid->SetRequired(false);
    uuid->SetDescription("UUID of the unicast agent.");
    spec->AddParameter(uuid);

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

    return spec;
}

std::shared_ptr<OutputSpec> ClusterUnicastAgentRemove::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaBool::New());
    return spec;
}

void ClusterUnicastAgentRemove::ExecuteInternal(std::shared_ptr<Input> input,
                                                std::shared_ptr<Output> output) {
    // Asked before the library is touched; a failure of the question goes to the framework.
    if (MeskUtil::IsWitnessNode()) {
        output->AddErrorMessage(
            "This host is a witness node which doesn't support removing unicast agent.");
        return;
    }

    try {
        // Unlike list and clear, remove does not ask whether the host is in a cluster.
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();

        const std::string nodeUuid =
            input->HasParameter("uuid") ? input->GetParameter("uuid") : std::string(kNoNodeUuid);

        const std::string addr = input->GetParameter("addr");
        MeskIpAddress address;
        if (!ToMeskIpAddress(addr, address)) {
            output->AddErrorMessage("Invalid IP address " + addr);
            return;
        }

        const int32_t port = input->HasParameter("port")
                                 ? static_cast<int32_t>(input->GetParameterInt("port"))
                                 : kDefaultUnicastAgentPort;

        // Removing a node changes the peers that the cluster service refreshes; removing the
        // witness does not.
        const bool wasWitness = info->RemoveUnicastAgent(nodeUuid, address, port);
        if (!wasWitness) {
            info->RefreshUnicastAgents();
        }

        output->SetRootObject(MetaBool::New(true));
        output->SetComplete();
    } catch (const MeskCtlException& e) {
        output->AddErrorMessage("Unable to remove the unicast agent: " + e.GetMessage());
    }
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
