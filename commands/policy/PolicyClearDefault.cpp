#include "commands/policy/PolicyClearDefault.h"

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

std::shared_ptr<PolicyClearDefault> PolicyClearDefault::New() {
    return std::make_shared<PolicyClearDefault>();
}

PolicyClearDefault::PolicyClearDefault() {
    SetDescription("Clear default Mesk storage policy values.");
    SetMetaDataField("type", "operation");
}

PolicyClearDefault::~PolicyClearDefault() = default;

std::shared_ptr<InputSpec> PolicyClearDefault::GetInputSpecInternal() {
    return InputSpec::New();
}

std::shared_ptr<OutputSpec> PolicyClearDefault::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaBool::New());
    return spec;
}

void PolicyClearDefault::ExecuteInternal(std::shared_ptr<Input> /*input*/,
                                         std::shared_ptr<Output> output) {
    try {
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();
        // Clears the defaults of every class at once; no class is named.
        info->ClearDefaultPolicies();
        output->SetRootObject(MetaBool::New(true));
        output->SetComplete();
    } catch (const MeskCtlException& e) {
        // The bare library text, then a false result that is still complete.
        output->AddErrorMessage(e.GetMessage());
        output->SetRootObject(MetaBool::New(false));
        output->SetComplete();
    }
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
