#include "commands/cluster/ClusterPreferredFaultDomainGet.h"

#include <string>

#include "MeskConstants.h"
#include "commands/common/OutputFields.h"
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
using Kalmor::MetaObj::META_STRING;
using Kalmor::MetaObj::MetaString;
using Kalmor::MetaObj::MetaStruct;
using ZuvCtl::Mesk::MeskUtil;

namespace {

// The result's fields, in the order shown; ExecuteInternal fills them by these names.
const OutputField kName{"Preferred Fault Domain Name", META_STRING};
const OutputField kId{"Preferred Fault Domain Id", META_STRING};
const OutputField* const kFields[] = {&kName, &kId};

}  // namespace

std::shared_ptr<ClusterPreferredFaultDomainGet> ClusterPreferredFaultDomainGet::New() {
    return std::make_shared<ClusterPreferredFaultDomainGet>();
}

ClusterPreferredFaultDomainGet::ClusterPreferredFaultDomainGet() {
    SetDescription("Get the preferred fault domain for a stretched cluster.");
    SetMetaDataField("type", "fetcher");
    SetDefaultOutputFormatter("simple");
}

ClusterPreferredFaultDomainGet::~ClusterPreferredFaultDomainGet() = default;

std::shared_ptr<InputSpec> ClusterPreferredFaultDomainGet::GetInputSpecInternal() {
    return InputSpec::New();
}

std::shared_ptr<OutputSpec> ClusterPreferredFaultDomainGet::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(GetOutputStructure());
    return spec;
}

std::shared_ptr<MetaStruct> ClusterPreferredFaultDomainGet::GetOutputStructure() {
    auto structure = MetaStruct::New("PreferredFaultDomain");
    AddEmptyFields(*structure, kFields);
    return structure;
}

void ClusterPreferredFaultDomainGet::ExecuteInternal(std::shared_ptr<Input> /*input*/,
                                                     std::shared_ptr<Output> output) {
    try {
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();

        // Only a stretched cluster has a preferred fault domain; a host outside any cluster
        // is not asked about stretching at all.
        if (!info->GetClusterConfig().enabled || !MeskUtil::IsInStretchedCluster()) {
            output->AddErrorMessage(
                "Cannot get preferred fault domain if host is not in a stretched cluster.");
            return;
        }

        std::string id;
        std::string name;
        MeskUtil::GetPreferredFaultDomainInfo(id, name);

        auto result = GetOutputStructure();
        result->SetField(kName.Text(), MetaString::New(name), MetaStruct::_docEmpty);
        result->SetField(kId.Text(), MetaString::New(id), MetaStruct::_docEmpty);
        output->SetRootObject(result);
        output->SetComplete();
    } catch (const MeskCtlException& e) {
        output->AddErrorMessage("Unable to get preferred fault domain name: " + e.GetMessage());
    }
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
