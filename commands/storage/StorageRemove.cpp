#include "commands/storage/StorageRemove.h"

#include <cctype>
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
using Kalmor::CallSpec::ParameterSpec;
using Kalmor::MetaObj::MetaBool;

namespace {

// The modes the library accepts, each with its first letter in upper case.
bool IsEvacuationMode(const std::string& mode) {
    return mode == "EnsureObjectAccessibility" || mode == "EvacuateAllData" || mode == "NoAction";
}

}  // namespace

std::shared_ptr<StorageRemove> StorageRemove::New() {
    return std::make_shared<StorageRemove>();
}

StorageRemove::StorageRemove() {
    SetDescription("Remove physical disks from Mesk disk groups.");
    SetMetaDataField("type", "operation");
}

StorageRemove::~StorageRemove() = default;

std::shared_ptr<InputSpec> StorageRemove::GetInputSpecInternal() {
    auto spec = InputSpec::New();

    auto disk = ParameterSpec::New("disk", Kalmor::CallSpec::PARAM_STRING);
    disk->SetShortName("d");
    disk->SetRequired(false);
    disk->SetDescription(
        "Specify individual hdd to remove from Mesk usage.e.g.: mpx.pthba2:C0:T1:L0");
    spec->AddParameter(disk);

    auto ssd = ParameterSpec::New("ssd", Kalmor::CallSpec::PARAM_STRING);
    ssd->SetShortName("s");
    ssd->SetRequired(false);
    ssd->SetDescription(
        "Specify a disk group's fronting ssd to remove the ssd and each backing hdd from Mesk "
        "usage.e.g.: mpx.pthba2:C0:T1:L0");
    spec->AddParameter(ssd);

    auto uuid = ParameterSpec::New("uuid", Kalmor::CallSpec::PARAM_STRING);
    uuid->SetShortName("u");
    uuid->SetRequired(false);
    uuid->SetDescription("Specify UUID of Mesk disk.e.g.: 52afa1de-4240-d5d6-17f9-8af1ec8509e5");
    spec->AddParameter(uuid);

    // The modes are checked by the command, not declared as an enumeration.
    auto mode = ParameterSpec::New("evacuation-mode", Kalmor::CallSpec::PARAM_STRING);
    mode->SetShortName("m");
    mode->SetRequired(false);
    mode->SetDescription(
        "Action the Mesk service must take before the host can enter maintenance mode (default "
        "noAction). Allowed values are:\n"
        "    ensureObjectAccessibility: Evacuate data from the disk to ensure object "
        "accessibility in the Mesk cluster, before removing the disk.\n"
        "    evacuateAllData: Evacuate all data from the disk before removing it.\n"
        "    noAction: Do not move Mesk data out of the disk before removing it.");
    spec->AddParameter(mode);

    return spec;
}

std::shared_ptr<OutputSpec> StorageRemove::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaBool::New());
    return spec;
}

void StorageRemove::ExecuteInternal(std::shared_ptr<Input> input, std::shared_ptr<Output> output) {
    try {
        // The plug-in comes first: a host without one fails before any option is judged.
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();

        // Presence is what counts: an option given with an empty value is a target too.
        const bool hasDisk = input->HasParameter("disk");
        const bool hasSsd = input->HasParameter("ssd");
        const bool hasUuid = input->HasParameter("uuid");
        if (int(hasDisk) + int(hasSsd) + int(hasUuid) > 1) {
            output->AddErrorMessage("At most one of --disk or --ssd or --uuid can be specified.");
            return;
        }

        // The user may write a mode with its first letter in either case; the library takes it
        // capitalised. Without the option the mode stays empty, which the library reads as
        // noAction.
        std::string mode;
        if (input->HasParameter("evacuation-mode")) {
            mode = input->GetParameter("evacuation-mode");
            if (!mode.empty()) {
                mode[0] = static_cast<char>(std::toupper(static_cast<unsigned char>(mode[0])));
            }
            if (!IsEvacuationMode(mode)) {
                output->AddErrorMessage(
                    "Expected a single value from the set [noAction, ensureObjectAccessibility, "
                    "evacuateAllData] got '" +
                    input->GetParameter("evacuation-mode") + "'");
                return;
            }
        }

        if (hasDisk) {
            info->RemoveDisk(input->GetParameter("disk"), mode);
        } else if (hasSsd) {
            info->RemoveDiskGroup(input->GetParameter("ssd"), mode);
        } else if (hasUuid) {
            info->RemoveDiskByUuid(input->GetParameter("uuid"), mode);
        } else {
            output->AddErrorMessage("No option provided");
            return;
        }
        output->SetRootObject(MetaBool::New(true));
        output->SetComplete();
    } catch (const MeskCtlException& e) {
        output->AddErrorMessage("Unable to remove device: " + e.GetMessage());
    }
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
