#include "commands/storage/StorageDiskgroupMount.h"

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

std::shared_ptr<StorageDiskgroupMount> StorageDiskgroupMount::New() {
    return std::make_shared<StorageDiskgroupMount>();
}

StorageDiskgroupMount::StorageDiskgroupMount() {
    SetDescription("Mount a Mesk disk or disk group.");
    SetMetaDataField("type", "operation");
}

StorageDiskgroupMount::~StorageDiskgroupMount() = default;

std::shared_ptr<InputSpec> StorageDiskgroupMount::GetInputSpecInternal() {
    auto spec = InputSpec::New();

    auto ssd = ParameterSpec::New("ssd", Kalmor::CallSpec::PARAM_STRING);
    ssd->SetShortName("s");
    ssd->SetRequired(false);
    ssd->SetDescription(
        "Specify a disk group's fronting ssd to mount the ssd and each backing hdd for use by "
        "Mesk.e.g.: mpx.pthba2:C0:T1:L0");
    spec->AddParameter(ssd);

    auto disk = ParameterSpec::New("disk", Kalmor::CallSpec::PARAM_STRING);
    disk->SetShortName("d");
    disk->SetRequired(false);
    disk->SetDescription("Specify the disk to mount for use by Mesk.e.g.: mpx.pthba0:C0:T1:L0");
    spec->AddParameter(disk);

    auto uuid = ParameterSpec::New("uuid", Kalmor::CallSpec::PARAM_STRING);
    uuid->SetShortName("u");
    uuid->SetRequired(false);
    uuid->SetDescription(
        "Specify a Mesk UUID of the disk or fronting ssd to mount for use by Mesk.e.g.: "
        "5291022a-ad03-df90-dd0f-b9f980cc005e");
    spec->AddParameter(uuid);

    return spec;
}

std::shared_ptr<OutputSpec> StorageDiskgroupMount::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaBool::New());
    return spec;
}

void StorageDiskgroupMount::ExecuteInternal(std::shared_ptr<Input> input,
                                            std::shared_ptr<Output> output) {
    // Presence is what counts: an option given with an empty value is a target too.
    const bool hasSsd = input->HasParameter("ssd");
    const bool hasDisk = input->HasParameter("disk");
    const bool hasUuid = input->HasParameter("uuid");
    if (int(hasSsd) + int(hasDisk) + int(hasUuid) > 1) {
        output->AddErrorMessage("Specify only one of --ssd, --disk or --uuid.");
        return;
    }

    try {
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();
        if (hasSsd) {
            info->MountDiskGroup(input->GetParameter("ssd"), false);
        } else if (hasUuid) {
            // The UUID text goes to the library as typed; the library judges its form.
            info->MountByUuid(input->GetParameter("uuid"));
        } else if (hasDisk) {
            info->MountDisk(input->GetParameter("disk"));
        } else {
            // Unlike the other refusals, this one answers false, and leaves the output
            // incomplete.
            output->AddErrorMessage("Either --ssd, --disk or --uuid is required");
            output->SetRootObject(MetaBool::New(false));
            return;
        }
        output->SetRootObject(MetaBool::New(true));
        output->SetComplete();
    } catch (const MeskCtlException& e) {
        output->AddErrorMessage("Unable to mount: " + e.GetMessage());
    }
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
