#include "commands/cluster/ClusterRestore.h"

#include "MeskConstants.h"
#include "hostctl/MeskCtlException.h"
#include "hostctl/MeskPlugin.h"

namespace OrvaneCli {
namespace MeskNamespace {

using HostCtl::Lib::Mesk::MeskCtlException;
using Kalmor::CallSpec::Input;
using Kalmor::CallSpec::InputSpec;
using Kalmor::CallSpec::Output;
using Kalmor::CallSpec::OutputSpec;
using Kalmor::CallSpec::ParameterSpec;
using Kalmor::MetaObj::MetaBool;

std::shared_ptr<ClusterRestore> ClusterRestore::New() {
    return std::make_shared<ClusterRestore>();
}

ClusterRestore::ClusterRestore() {
    SetDescription("Restore the persisted Mesk cluster configuration.");
    SetMetaDataField("type", "operation");
}

ClusterRestore::~ClusterRestore() = default;

std::shared_ptr<InputSpec> ClusterRestore::GetInputSpecInternal() {
    auto spec = InputSpec::New();

    auto boot = ParameterSpec::New("boot", Kalmor::CallSpec::PARAM_FLAG);
    boot->SetRequired(false);
    boot->SetDescription("Set when restoring the cluster during boot (internal only!)");
    spec->AddParameter(boot);

    return spec;
}

std::shared_ptr<OutputSpec> ClusterRestore::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaBool::New());
    return spec;
}

void ClusterRestore::ExecuteInternal(std::shared_ptr<Input> input, std::shared_ptr<Output> output) {
    // Restoring does not ask whether the host is in a cluster: the persisted configuration
    // says so, and re-applying it is the library's business.
    try {
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();
        info->RestoreClusterConfig(input->IsFlagSet("boot"));
        output->SetRootObject(MetaBool::New(true));
        output->SetComplete();
    } catch (const MeskCtlException& e) {
        output->AddErrorMessage(e.GetMessage());
        output->SetRootObject(MetaBool::New(false));
        output->SetComplete();
    }
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
