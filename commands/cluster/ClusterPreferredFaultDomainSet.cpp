#include "commands/cluster/ClusterPreferredFaultDomainSet.h"

#include <cstddef>
#include <string>

#include "MeskConstants.h"
#include "hostctl/MeskCtlException.h"
#include "hostctl/MeskPlugin.h"
#include "hostctl/MeskUtil.h"

namespace OrvaneCli {
namespace MeskNamespace {

using HostCtl::Lib::Mesk::MeskCtlException;
using Kalmor::CallSpec::Input;
using Kalmor::CallSpec::InputSpec;
using Kalmor::CallSpec::Output;
using Kalmor::CallSpec::OutputSpec;
using Kalmor::CallSpec::ParameterSpec;
using Kalmor::MetaObj::MetaBool;
using ZuvCtl::Mesk::MeskUtil;

namespace {

// The longest preferred fault domain name, in UTF-8 characters.
const size_t kMaxPreferredFaultDomainChars = 256;

}  // namespace

std::shared_ptr<ClusterPreferredFaultDomainSet> ClusterPreferredFaultDomainSet::New() {
    return std::make_shared<ClusterPreferredFaultDomainSet>();
}

ClusterPreferredFaultDomainSet::ClusterPreferredFaultDomainSet() {
    SetDescription("Set the preferred fault domain for a stretched cluster.");
    SetMetaDataField("type", "operation");
}

ClusterPreferredFaultDomainSet::~ClusterPreferredFaultDomainSet() = default;

std::shared_ptr<InputSpec> ClusterPreferredFaultDomainSet::GetInputSpecInternal() {
    auto spec = InputSpec::New();

    auto name = ParameterSpec::New("preferred-fault-domain-name", Kalmor::CallSpec::PARAM_STRING);
    name->SetShortName("n");
    name->SetRequired(true);
    name->SetDescription("Preferred Fault domain name to use for a stretched cluster.");
    spec->AddParameter(name);

    return spec;
}

std::shared_ptr<OutputSpec> ClusterPreferredFaultDomainSet::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaBool::New());
    return spec;
}

void ClusterPreferredFaultDomainSet::ExecuteInternal(std::shared_ptr<Input> input,
                                                     std::shared_ptr<Output> output) {
    try {
        const std::string name = input->GetParameter("preferred-fault-domain-name");

        // The name is checked before the host's role, so a bad name is reported on any host.
        if (name.empty()) {
            output->AddErrorMessage("Cannot set preferred fault domain name as empty.");
            return;
        }
        if (MeskUtil::UTF8StringCharLength(name) > kMaxPreferredFaultDomainChars) {
            output->AddErrorMessage("Preferred Fault domain name cannot exceed " +
                                    std::to_string(kMaxPreferredFaultDomainChars) + " characters.");
            return;
        }
        if (!MeskUtil::IsWitnessNode()) {
            output->AddErrorMessage(
                "Cannot set preferred fault domain if the host is not a witness node.");
            return;
        }

        // Whether the host is in a stretched cluster at all is left to the library.
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();
        info->SetPreferredFaultDomain(name);
        output->SetRootObject(MetaBool::New(true));
        output->SetComplete();
    } catch (const MeskCtlException& e) {
        output->AddErrorMessage("Unable to set preferred fault domain name: " + e.GetMessage());
    }
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
