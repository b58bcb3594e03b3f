#include "commands/storage/StorageDiskgroupUmount.h"

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

std::shared_ptr<StorageDiskgroupUmount> StorageDiskgroupUmount::New() {
    return std::make_shared<StorageDiskgroupUmount>();
}

StorageDiskgroupUmount::StorageDiskgroupUmount() {
    SetDescription("Unmount Mesk disk or disk group.");
    SetMetaDataField("type", "operation");
}

StorageDiskgroupUmount::~StorageDiskgroupUmount() = default;

std::shared_ptr<InputSpec> StorageDiskgroupUmount::GetInputSpecInternal() {
    auto spec = InputSpec::New();

    auto ssd = ParameterSpec::New("ssd", Kalmor::CallSpec::PARAM_STRING);
    ssd->SetShortName("s");
    ssd->SetRequired(false);
    ssd->SetDescription(
        "Specify a disk group's fronting ssd to unmount the ssd and each backing hdd from Mesk "
        "usage.e.g.: mpx.pthba2:C0:T1:L0");
    spec->AddParameter(ssd);

    auto disk = ParameterSpec::New("disk", Kalmor::CallSpec::PARAM_STRING);
    disk->SetShortName("d");
    disk->SetRequired(false);
    disk->SetDescription("Specify the hdd to unmount from Mesk usage.e.g.: mpx.pthba0:C0:T1:L0");
    spec->AddParameter(disk);

    return spec;
}

std::shared_ptr<OutputSpec> StorageDiskgroupUmount::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaBool::New());
    return spec;
}

void StorageDiskgroupUmount::ExecuteInternal(std::shared_ptr<Input> input,
                                             std::shared_ptr<Output> output) {
    // Presence is what counts: an option given with an empty value is a target too.
    const bool hasSsd = input->HasParameter("ssd");
    const bool hasDisk = input->HasParameter("disk");
    if (hasDisk && hasSsd) {
        output->AddErrorMessage("Can't specify both --disk and --ssd.");
        return;
    }

    try {
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();
        if (hasSsd) {
            info->UnmountDiskGroup(input->GetParameter("ssd"), true);
        } else if (hasDisk) {
            info->UnmountDisk(input->GetParameter("disk"), true);
        } else {
            output->AddErrorMessage("Need one of --disk or --ssd.");
            return;
        }
        output->SetRootObject(MetaBool::New(true));
        output->SetComplete();
    } catch (const MeskCtlException& e) {
        output->AddErrorMessage("Unable to unmount: " + e.GetMessage());
    }
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
