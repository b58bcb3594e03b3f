#include "commands/storage/StorageAdd.h"

#include <string>
#include <vector>

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

std::shared_ptr<StorageAdd> StorageAdd::New() {
    return std::make_shared<StorageAdd>();
}

StorageAdd::StorageAdd() {
    SetDescription("Add physical disk for Mesk usage.");
    SetMetaDataField("type", "operation");
}

StorageAdd::~StorageAdd() = default;

std::shared_ptr<InputSpec> StorageAdd::GetInputSpecInternal() {
    auto spec = InputSpec::New();

    auto ssd = ParameterSpec::New("ssd", Kalmor::CallSpec::PARAM_STRING);
    ssd->SetShortName("s");
    ssd->SetRequired(true);
    ssd->SetDescription(
        "Specify ssd to add for use by Mesk. Expects an empty ssd with no partitions in which "
        "case the ssd will be partitioned and formatted. Otherwise this operation will fail. If "
        "an ssd which is already added for use by Mesk, is provided along with '-d/--disks', "
        "then the disk mentioned with '-d' will be added to the existing diskgroup created under "
        "this ssd and in which case, the ssd won't be partitioned and formatted. The command "
        "expects the device name for the disk to be provided, e.g.: mpx.pthba2:C0:T1:L0");
    spec->AddParameter(ssd);

    auto disks = ParameterSpec::New("disks", Kalmor::CallSpec::PARAM_STRING_LIST);
    disks->SetShortName("d");
    disks->SetRequired(true);
    disks->SetDescription(
        "Specify hdds to add for use by Mesk. Expects an empty disk with no partitions in which "
        "case the disk will be partitioned and formatted. Otherwise this operation will fail. "
        "The command expects the device name for the disk to be provided, e.g.: "
        "mpx.pthba2:C0:T1:L0. Multiple hdds can be provided using format -d hdd1 -d hdd2 -d hdd3");
    spec->AddParameter(disks);

    return spec;
}

std::shared_ptr<OutputSpec> StorageAdd::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaBool::New());
    return spec;
}

void StorageAdd::ExecuteInternal(std::shared_ptr<Input> input, std::shared_ptr<Output> output) {
    try {
        const std::string ssd = input->GetParameter("ssd");
        std::vector<std::string> disks;
        input->GetParameterList("disks", disks);
        // The framework has made sure both are given; names and count are the library's to judge.
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();
        info->AddDisks(ssd, disks);
        output->SetRootObject(MetaBool::New(true));
        output->SetComplete();
    } catch (const MeskCtlException& e) {
        output->AddErrorMessage("Unable to add device: " + e.GetMessage());
    }
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
