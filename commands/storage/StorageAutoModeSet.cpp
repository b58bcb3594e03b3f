#include "commands/storage/StorageAutoModeSet.h"

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

std::shared_ptr<StorageAutoModeSet> StorageAutoModeSet::New() {
    return std::make_shared<StorageAutoModeSet>();
}

StorageAutoModeSet::StorageAutoModeSet() {
    SetDescription("Configure storage auto claim mode");
    SetMetaDataField("type", "operation");
}

StorageAutoModeSet::~StorageAutoModeSet() = default;

std::shared_ptr<InputSpec> StorageAutoModeSet::GetInputSpecInternal() {
    auto spec = InputSpec::New();

    // No short name, and the required flag is left at the framework's default.
    auto enabled = ParameterSpec::New("enabled", Kalmor::CallSpec::PARAM_BOOL);
    enabled->SetDescription(
        "Changing this value to true will result in enabling auto disk claim mode. Disks will be "
        "claimed by the Mesk service in next storage event, e.g.: adapter rescan and disk "
        "hot-plug. Set to false to disable storage auto claim mode.");
    spec->AddParameter(enabled);

    return spec;
}

std::shared_ptr<OutputSpec> StorageAutoModeSet::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaBool::New());
    return spec;
}

void StorageAutoModeSet::ExecuteInternal(std::shared_ptr<Input> input,
                                         std::shared_ptr<Output> output) {
    try {
        const bool enabled = input->GetParameterBool("enabled");
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();
        info->SetAutoClaimMode(enabled);
    } catch (const MeskCtlException& e) {
        output->AddErrorMessage("Unable to set storage auto claim mode: " + e.GetMessage());
    }
    // The result is true whether or not the change succeeded: a failure shows only in the
    // error message.
    output->SetRootObject(MetaBool::New(true));
    output->SetComplete();
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
