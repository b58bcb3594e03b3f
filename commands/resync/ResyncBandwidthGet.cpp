#include "commands/resync/ResyncBandwidthGet.h"

#include "MeskConstants.h"
#include "commands/common/OutputFields.h"
#include "hostctl/MeskCtlException.h"
#include "hostctl/MeskPlugin.h"

namespace OrvaneCli {
namespace MeskNamespace {

using HostCtl::Lib::Mesk::MeskCtlException;
using Kalmor::CallSpec::Input;
using Kalmor::CallSpec::InputSpec;
using Kalmor::CallSpec::Output;
using Kalmor::CallSpec::OutputSpec;
using Kalmor::MetaObj::META_INT;
using Kalmor::MetaObj::MetaInt;
using Kalmor::MetaObj::MetaStruct;

namespace {

// The result's fields; ExecuteInternal fills them by these names.
const OutputField kRate{"Rate", META_INT};
const OutputField* const kFields[] = {&kRate};

}  // namespace

std::shared_ptr<ResyncBandwidthGet> ResyncBandwidthGet::New() {
    return std::make_shared<ResyncBandwidthGet>();
}

ResyncBandwidthGet::ResyncBandwidthGet() {
    SetDescription("Get information about Mesk resync bandwidth");
    SetMetaDataField("type", "fetcher");
    SetDefaultOutputFormatter("simple");
    SetDefaultOutputParameter("units:ResyncBandwidth.Rate", "Mbps");
}

ResyncBandwidthGet::~ResyncBandwidthGet() = default;

std::shared_ptr<InputSpec> ResyncBandwidthGet::GetInputSpecInternal() {
    return InputSpec::New();
}

std::shared_ptr<OutputSpec> ResyncBandwidthGet::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(GetOutputStructure());
    return spec;
}

std::shared_ptr<MetaStruct> ResyncBandwidthGet::GetOutputStructure() {
    auto structure = MetaStruct::New("ResyncBandwidth");
    AddEmptyFields(*structure, kFields);
    return structure;
}

void ResyncBandwidthGet::ExecuteInternal(std::shared_ptr<Input> /*input*/,
                                         std::shared_ptr<Output> output) {
    // The output is never marked complete, on success or on failure.
    try {
        auto result = GetOutputStructure();
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();
        result->SetField(kRate.Text(), MetaInt::New(info->GetResyncBandwidth()),
                         MetaStruct::_docEmpty);
        output->SetRootObject(result);
    } catch (const MeskCtlException& e) {
        output->AddErrorMessage(e.GetMessage());
    }
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
