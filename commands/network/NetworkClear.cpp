#include "commands/network/NetworkClear.h"

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

std::shared_ptr<NetworkClear> NetworkClear::New() {
    return std::make_shared<NetworkClear>();
}

NetworkClear::NetworkClear() {
    SetDescription("Clear the Mesk network configuration.");
    SetMetaDataField("type", "operation");
}

NetworkClear::~NetworkClear() = default;

std::shared_ptr<InputSpec> NetworkClear::GetInputSpecInternal() {
    return InputSpec::New();
}

std::shared_ptr<OutputSpec> NetworkClear::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaBool::New());
    return spec;
}

void NetworkClear::ExecuteInternal(std::shared_ptr<Input> /*input*/,
                                   std::shared_ptr<Output> output) {
    try {
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();
        info->ClearNetworkConfig();
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
