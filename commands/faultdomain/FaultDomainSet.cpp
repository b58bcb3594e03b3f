#include "commands/faultdomain/FaultDomainSet.h"

#include <cstddef>
#include <string>

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

namespace {

// The longest fault domain name this command passes on, in bytes of its UTF-8 text.
constexpr size_t kMaxFaultDomainNameBytes = 256;

}  // namespace

std::shared_ptr<FaultDomainSet> FaultDomainSet::New() {
    return std::make_shared<FaultDomainSet>();
}

FaultDomainSet::FaultDomainSet() {
    SetDescription("Set the fault domain for this host");
    SetMetaDataField("type", "operation");
}

FaultDomainSet::~FaultDomainSet() = default;

std::shared_ptr<InputSpec> FaultDomainSet::GetInputSpecInternal() {
    auto spec = InputSpec::New();

    auto fdname = ParameterSpec::New("fdname", Kalmor::CallSpec::PARAM_STRING);
    fdname->SetShortName("n");
    fdname->SetRequired(true);
    fdname->SetDescription(
        "Fault domain name to use for this host. Empty string means reset to default.");
    spec->AddParameter(fdname);

    return spec;
}

std::shared_ptr<OutputSpec> FaultDomainSet::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaBool::New());
    return spec;
}

void FaultDomainSet::ExecuteInternal(std::shared_ptr<Input> input, std::shared_ptr<Output> output) {
    const std::string name = input->GetParameter("fdname");
    // The limit counts bytes, not characters: a multi-byte name is refused with fewer than
    // 256 characters.
    if (name.size() > kMaxFaultDomainNameBytes) {
        output->AddErrorMessage("Fault domain name cannot exceed " +
                                std::to_string(kMaxFaultDomainNameBytes) + " characters.");
    } else {
        try {
            auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
            auto info = plugin->GetMeskInfo();
            // The empty name stands for the default fault domain.
            if (!name.empty()) {
                info->SetFaultDomainName(name);
            } else {
                info->ResetFaultDomainName();
            }
        } catch (const MeskCtlException& e) {
            output->AddErrorMessage("Unable to set fault domain name: " + e.GetMessage());
        }
    }
    // The result is true whether or not the name was taken: a refusal or a failure shows only
    // in the error message.
    output->SetRootObject(MetaBool::New(true));
    output->SetComplete();
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
