#include "commands/cluster/ClusterLeave.h"

#include <string>

#include "MeskConstants.h"
#include "commands/common/HostPath.h"
#include "hostctl/MeskCtlException.h"
#include "hostctl/MeskPlugin.h"

namespace OrvaneCli {
namespace MeskNamespace {

using HostCtl::Lib::Mesk::MeskCtlException;
using Kalmor::CallSpec::Input;
using Kalmor::CallSpec::InputSpec;
using Kalmor::CallSpec::Output;
using Kalmor::CallSpec::OutputSpec;
using Kalmor::MetaObj::MetaBool;

namespace {

// The one datastore that the cluster mounts on this host.
const std::string kMeskDatastoreName = "meskDatastore";

}  // namespace

void NotifyDatastore(const std::string& eventType, const std::string& datastoreName) {
    // The values are passed unquoted: both come from this plug-in, never from the user. The
    // host root in front of the script's path is quoted, as it comes from the environment.
    const std::string command = HostShellPath("/usr/lib/orvane/tavord/bin/notifyDatastore.py") +
                                " -t " + eventType + " -d " + datastoreName;
    std::string scriptOutput;
    Kalmor::AutoCli::AutoCli_ShellCmd(command, scriptOutput, "");
}

std::shared_ptr<ClusterLeave> ClusterLeave::New() {
    return std::make_shared<ClusterLeave>();
}

ClusterLeave::ClusterLeave() {
    SetDescription("Leave the Mesk cluster the host is currently joined to.");
    SetMetaDataField("type", "operation");
}

ClusterLeave::~ClusterLeave() = default;

std::shared_ptr<InputSpec> ClusterLeave::GetInputSpecInternal() {
    return InputSpec::New();
}

std::shared_ptr<OutputSpec> ClusterLeave::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaBool::New());
    return spec;
}

void ClusterLeave::ExecuteInternal(std::shared_ptr<Input> /*input*/,
                                   std::shared_ptr<Output> output) {
    std::unique_ptr<HostCtl::MeskPlugin> plugin;
    std::unique_ptr<HostCtl::Mesk::MeskInfo> info;
    try {
        plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        info = plugin->GetMeskInfo();
        if (!info->GetClusterConfig().enabled) {
            output->AddErrorMessage("The host is not in a Mesk cluster.");
            return;
        }
    } catch (const MeskCtlException& e) {
        // Nothing was announced yet, so there is nothing to take back.
        output->AddErrorMessage(e.GetMessage());
        return;
    }

    // The management agent hears of the datastore's unmount before the host leaves, and of
    // its failure when the leave did not happen, so that it does not wait for an unmount
    // that never comes.
    try {
        NotifyDatastore("PreUnmount", kMeskDatastoreName);
        info->LeaveCluster(false);
        output->SetRootObject(MetaBool::New(true));
        output->SetComplete();
    } catch (const MeskCtlException& e) {
        output->AddErrorMessage(e.GetMessage());
        NotifyDatastore("FailedUnmount", kMeskDatastoreName);
    }
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
