#include "commands/storage/StorageTagRemove.h"

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
using Kalmor::CallSpec::ParameterConstraint;
using Kalmor::CallSpec::ParameterSpec;
using Kalmor::MetaObj::MetaBool;

std::shared_ptr<StorageTagRemove> StorageTagRemove::New() {
    return std::make_shared<StorageTagRemove>();
}

StorageTagRemove::StorageTagRemove() {
    SetDescription("Remove a Mesk storage tag.");
    SetMetaDataField("type", "operation");
}

StorageTagRemove::~StorageTagRemove() = default;

std::shared_ptr<InputSpec> StorageTagRemove::GetInputSpecInternal() {
    auto spec = InputSpec::New();

    // The framework refuses any tag but capacityFlash; the command never reads the value, since
    // the library operation is specific to that tag.
    auto tag = ParameterSpec::New("tag", Kalmor::CallSpec::PARAM_STRING);
    tag->SetShortName("t");
    tag->SetRequired(true);
    auto tags = ParameterConstraint::New(Kalmor::CallSpec::CONSTRAINT_STRING_ENUM);
    tags->AddStringEnum("capacityFlash", "Tag for capacity flash.");
    tag->SetConstraint(tags);
    tag->SetDescription("Tag to be removed from disk. Supported tags are %ENUM%.");
    spec->AddParameter(tag);

    auto disk = ParameterSpec::New("disk", Kalmor::CallSpec::PARAM_STRING);
    disk->SetShortName("d");
    disk->SetRequired(true);
    disk->SetDescription("Name of the disk from which the tag should be removed.");
    spec->AddParameter(disk);

    return spec;
}

std::shared_ptr<OutputSpec> StorageTagRemove::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaBool::New());
    return spec;
}

void StorageTagRemove::ExecuteInternal(std::shared_ptr<Input> input,
                                       std::shared_ptr<Output> output) {
    try {
        const std::string disk = input->GetParameter("disk");
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();
        info->RemoveCapacityFlashTag(disk);
        output->SetRootObject(MetaBool::New(true));
        output->SetComplete();
    } catch (const MeskCtlException& e) {
        output->AddErrorMessage("Unable to remove tag for disk: " + e.GetMessage());
    }
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
