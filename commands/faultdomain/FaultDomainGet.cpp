#include "commands/faultdomain/FaultDomainGet.h"

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

namespace {

// The result's fields, in the order shown; ExecuteInternal fills them by these names.
const OutputField kFaultDomainName{"faultDomainName", META_STRING};
const OutputField kFaultDomainId{"faultDomainId", META_STRING};
const OutputField* const kFields[] = {&kFaultDomainName, &kFaultDomainId};

}  // namespace

std::shared_ptr<FaultDomainGet> FaultDomainGet::New() {
    return std::make_shared<FaultDomainGet>();
}

FaultDomainGet::FaultDomainGet() {
    SetDescription("Get the fault domain name for this host.");
    SetMetaDataField("type", "fetcher");
    SetDefaultOutputFormatter("simple");
}

FaultDomainGet::~FaultDomainGet() = default;

std::shared_ptr<InputSpec> FaultDomainGet::GetInputSpecInternal() {
    return InputSpec::New();
}

std::shared_ptr<OutputSpec> FaultDomainGet::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(GetOutputStructure());
    return spec;
}

std::shared_ptr<MetaStruct> FaultDomainGet::GetOutputStructure() {
    auto structure = MetaStruct::New("FaultDomain");
    AddEmptyFields(*structure, kFields);
    return structure;
}

void FaultDomainGet::ExecuteInternal(std::shared_ptr<Input> /*input*/,
                                     std::shared_ptr<Output> output) {
    try {
        auto result = GetOutputStructure();
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();
        result->SetField(kFaultDomainName.Text(), MetaString::New(info->GetFaultDomainName()),
                         MetaStruct::_docEmpty);
        // A host outside any cluster has no fault domain identifier; it is not asked for then,
        // and the field stays empty.
        std::string id;
        if (info->GetClusterConfig().enabled) {
            id = ZuvCtl::Mesk::MeskUtil::GetFaultDomainId();
        }
        result->SetField(kFaultDomainId.Text(), MetaString::New(id), MetaStruct::_docEmpty);
        output->SetRootObject(result);
        output->SetComplete();
    } catch (const MeskCtlException& e) {
        output->AddErrorMessage("Unable to get fault domain name: " + e.GetMessage());
    }
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
