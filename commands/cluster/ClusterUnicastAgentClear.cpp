#include "commands/cluster/ClusterUnicastAgentClear.h"

#include <cstdint>
#include <cstdlib>
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
using Kalmor::MetaObj::MetaBool;
using ZuvCtl::Mesk::MeskUtil;

std::shared_ptr<ClusterUnicastAgentClear> ClusterUnicastAgentClear::New() {
    return std::make_shared<ClusterUnicastAgentClear>();
}

ClusterUnicastAgentClear::ClusterUnicastAgentClear() {
    SetDescription("Removes all unicast agents in the Mesk cluster configuration.");
    SetMetaDataField("type", "operation");
}

ClusterUnicastAgentClear::~ClusterUnicastAgentClear() = default;

std::shared_ptr<InputSpec> ClusterUnicastAgentClear::GetInputSpecInternal() {
    return InputSpec::New();
}

std::shared_ptr<OutputSpec> ClusterUnicastAgentClear::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaBool::New());
    return spec;
}

// Clear never marks its output complete, not even on success: the result is set, the
// completion is not.
void ClusterUnicastAgentClear::ExecuteInternal(std::shared_ptr<Input> /*input*/,
                                               std::shared_ptr<Output> output) {
    // Failures of these first questions are not caught: they go to the framework.
    auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
    auto info = plugin->GetMeskInfo();
    if (!info->GetClusterConfig().enabled) {
        output->AddErrorMessage("Mesk isn't enabled on the host");
        return;
    }
    if (MeskUtil::IsWitnessNode()) {
        output->AddErrorMessage(
            "Unable to remove unicast agent(s), this host is a witness node which doesn't "
            "support removing unicast agent.");
        return;
    }

    try {
        std::vector<std::string> entries;
        info->GetUnicastAgents(entries);
        bool refreshNeeded = false;
        for (const std::string& entry : entries) {
            // A bad entry stops the clear where it is: agents removed for earlier entries stay
            // removed, and they are not refreshed.
            const UnicastAgentEntry fields(entry);
            if (fields.Separators() < 1) {
                output->AddErrorMessage("Invalid unicastAgent entry for nodeuuid " + entry);
                return;
            }
            if (fields.Separators() < 4) {
                output->AddErrorMessage("Invalid unicastAgent entries");
                return;
            }
            if (fields.Separators() < 5) {
                output->AddErrorMessage("Invalid unicastAgent entry for port " + entry);
                return;
            }

            const std::string ip = fields.Text(UnicastAgentEntry::kIp);
            MeskIpAddress address;
            if (!ToMeskIpAddress(ip, address)) {
                output->AddErrorMessage("Invalid IP address " + ip);
                return;
            }

            // The port is read as strtol reads it from the field's start; it stops at the ";".
            const int32_t port = static_cast<int32_t>(
                std::strtol(entry.c_str() + fields.Start(UnicastAgentEntry::kPort), nullptr, 10));

            if (!info->RemoveUnicastAgent(fields.Text(UnicastAgentEntry::kNodeUuid), address,
                                          port)) {
                refreshNeeded = true;
            }
        }
        // One refresh for all removed nodes; removing only a witness needs none.
        if (refreshNeeded) {
            info->RefreshUnicastAgents();
        }
        output->SetRootObject(MetaBool::New(true));
    } catch (const MeskCtlException& e) {
        output->AddErrorMessage("Unable to remove unicast agents: " + e.GetMessage());
    }
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
