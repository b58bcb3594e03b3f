#include "commands/cluster/ClusterPreferredFaultDomainGet.h"

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
using Kalmor::MetaObj::MetaString;
using Kalmor::MetaObj::MetaStruct;
using ZuvCtl::Mesk::MeskUtil;

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
    structure->SetField("Preferred Fault Domain Name", MetaString::New(), MetaStruct::_docEmpty);
    structure->SetField("Preferred Fault Domain Id", MetaString::New(), MetaStruct::_docEmpty);
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
        result->SetField("Preferred Fault Domain Name", MetaString::New(name),
                         MetaStruct::_docEmpty);
        result->SetField("Preferred Fault Domain Id", MetaString::New(id), MetaStruct::_docEmpty);
        output->SetRootObject(result);
        output->SetComplete();
    } catch (const MeskCtlException& e) {
        output->AddErrorMessage("Unable to get preferred fault domain name: " + e.GetMessage());
    }
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
