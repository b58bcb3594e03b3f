#include "commands/resync/ResyncThrottleGet.h"

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
const OutputField kLevel{"Level", META_INT};
const OutputField* const kFields[] = {&kLevel};

}  // namespace

std::shared_ptr<ResyncThrottleGet> ResyncThrottleGet::New() {
    return std::make_shared<ResyncThrottleGet>();
}

ResyncThrottleGet::ResyncThrottleGet() {
    SetDescription("Get information about Mesk resync throttling");
    SetMetaDataField("type", "fetcher");
    SetDefaultOutputFormatter("simple");
    SetDefaultOutputParameter("units:ResyncThrottle.Level", "Mbps");
}

std::shared_ptr<InputSpec> ResyncThrottleGet::GetInputSpecInternal() {
    return InputSpec::New();
}

std::shared_ptr<OutputSpec> ResyncThrottleGet::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(GetOutputStructure());
    return spec;
}

std::shared_ptr<MetaStruct> ResyncThrottleGet::GetOutputStructure() {
    auto structure = MetaStruct::New("ResyncThrottle");
    AddEmptyFields(*structure, kFields);
    return structure;
}

void ResyncThrottleGet::ExecuteInternal(std::shared_ptr<Input> /*input*/,
                                        std::shared_ptr<Output> output) {
    // The output is never marked complete, on success or on failure.
    try {
        auto result = GetOutputStructure();
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();
        result->SetField(kLevel.Text(), MetaInt::New(info->GetResyncThrottle()),
                         MetaStruct::_docEmpty);
        output->SetRootObject(result);
    } catch (const MeskCtlException& e) {
        output->AddErrorMessage(e.GetMessage());
    }
}

ResyncThrottleGet::~ResyncThrottleGet() = default;

}  // namespace MeskNamespace
}  // namespace OrvaneCli
