#include "commands/network/NetworkRestore.h"

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
using Kalmor::MetaObj::MetaBool;

std::shared_ptr<NetworkRestore> NetworkRestore::New() {
    return std::make_shared<NetworkRestore>();
}

NetworkRestore::NetworkRestore() {
    SetDescription("Restore the persisted Mesk network configuration.");
    SetMetaDataField("type", "operation");
}

NetworkRestore::~NetworkRestore() = default;

std::shared_ptr<InputSpec> NetworkRestore::GetInputSpecInternal() {
    return InputSpec::New();
}

std::shared_ptr<OutputSpec> NetworkRestore::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaBool::New());
    return spec;
}

void NetworkRestore::ExecuteInternal(std::shared_ptr<Input> /*input*/,
                                     std::shared_ptr<Output> output) {
    try {
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();
        info->RestoreNetworkConfig();
        output->SetRootObject(MetaBool::New(true));
        output->SetComplete();
    } catch (const MeskCtlException& e) {
        // A failure is reported as false and the output is still complete.
        output->AddErrorMessage(e.GetMessage());
        output->SetRootObject(MetaBool::New(false));
        output->SetComplete();
    }
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
