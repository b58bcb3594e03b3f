#include "commands/faultdomain/FaultDomainReset.h"

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

std::shared_ptr<FaultDomainReset> FaultDomainReset::New() {
    return std::make_shared<FaultDomainReset>();
}

FaultDomainReset::FaultDomainReset() {
    SetDescription("Reset Host fault domain to default value");
    SetMetaDataField("type", "operation");
}

FaultDomainReset::~FaultDomainReset() = default;

std::shared_ptr<InputSpec> FaultDomainReset::GetInputSpecInternal() {
    return InputSpec::New();
}

std::shared_ptr<OutputSpec> FaultDomainReset::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaBool::New());
    return spec;
}

void FaultDomainReset::ExecuteInternal(std::shared_ptr<Input> /*input*/,
                                       std::shared_ptr<Output> output) {
    try {
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();
        info->ResetFaultDomainName();
    } catch (const MeskCtlException&) {
        // A fixed message: the library's own text is not shown.
        output->AddErrorMessage("Unable to reset fault domain name");
    }
    // The result is true whether or not the reset succeeded: a failure shows only in the
    // error message.
    output->SetRootObject(MetaBool::New(true));
    output->SetComplete();
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
