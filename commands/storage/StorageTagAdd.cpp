#include "commands/storage/StorageTagAdd.h"

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

std::shared_ptr<StorageTagAdd> StorageTagAdd::New() {
    return std::make_shared<StorageTagAdd>();
}

StorageTagAdd::StorageTagAdd() {
    SetDescription("Add a Mesk storage tag.");
    SetMetaDataField("type", "operation");
}

StorageTagAdd::~StorageTagAdd() = default;

std::shared_ptr<InputSpec> StorageTagAdd::GetInputSpecInternal() {
    auto spec = InputSpec::New();

    // The framework refuses any tag but capacityFlash; the command never reads the value, since
    // the library operation is specific to that tag.
    auto tag = ParameterSpec::New("tag", Kalmor::CallSpec::PARAM_STRING);
    tag->SetShortName("t");
    tag->SetRequired(true);
    auto tags = ParameterConstraint::New(Kalmor::CallSpec::CONSTRAINT_STRING_ENUM);
    tags->AddStringEnum("capacityFlash", "Tag for capacity flash.");
    tag->SetConstraint(tags);
    tag->SetDescription("Tag to be added to disk. Supported tags are %ENUM%.");
    spec->AddParameter(tag);

    auto disk = ParameterSpec::New("disk", Kalmor::CallSpec::PARAM_STRING);
    disk->SetShortName("d");
    disk->SetRequired(true);
    disk->SetDescription("Name of the disk to which the tag should be added.");
    spec->AddParameter(disk);

    return spec;
}

std::shared_ptr<OutputSpec> StorageTagAdd::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaBool::New());
    return spec;
}

void StorageTagAdd::ExecuteInternal(std::shared_ptr<Input> input, std::shared_ptr<Output> output) {
    try {
        const std::string disk = input->GetParameter("disk");
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();
        info->AddCapacityFlashTag(disk);
        output->SetRootObject(MetaBool::New(true));
        output->SetComplete();
    } catch (const MeskCtlException& e) {
        output->AddErrorMessage("Unable to add tag to disk: " + e.GetMessage());
    }
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
