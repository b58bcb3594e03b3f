#include "commands/storage/StorageAutoModeGet.h"

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
using Kalmor::MetaObj::META_BOOL;
using Kalmor::MetaObj::MetaBool;
using Kalmor::MetaObj::MetaStruct;

namespace {

// The result's fields; ExecuteInternal fills them by these names.
const OutputField kEnabled{"Enabled", META_BOOL};
const OutputField* const kFields[] = {&kEnabled};

}  // namespace

std::shared_ptr<StorageAutoModeGet> StorageAutoModeGet::New() {
    return std::make_shared<StorageAutoModeGet>();
}

StorageAutoModeGet::StorageAutoModeGet() {
    // The leading blank belongs to the description as the host shows it.
    SetDescription(" Get status of storage auto claim mode.");
    SetMetaDataField("type", "fetcher");
    SetDefaultOutputFormatter("simple");
}

StorageAutoModeGet::~StorageAutoModeGet() = default;

std::shared_ptr<InputSpec> StorageAutoModeGet::GetInputSpecInternal() {
    return InputSpec::New();
}

std::shared_ptr<OutputSpec> StorageAutoModeGet::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(GetOutputStructure());
    return spec;
}

std::shared_ptr<MetaStruct> StorageAutoModeGet::GetOutputStructure() {
    auto structure = MetaStruct::New("AutoMode");
    AddEmptyFields(*structure, kFields);
    return structure;
}

void StorageAutoModeGet::ExecuteInternal(std::shared_ptr<Input> /*input*/,
                                         std::shared_ptr<Output> output) {
    try {
        auto result = GetOutputStructure();
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();
        result->SetField(kEnabled.Text(), MetaBool::New(info->GetAutoClaimMode()),
                         MetaStruct::_docEmpty);
        output->SetRootObject(result);
        output->SetComplete();
    } catch (const MeskCtlException& e) {
        output->AddErrorMessage("Unable to get Mesk storage auto claim mode: " + e.GetMessage());
    }
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
