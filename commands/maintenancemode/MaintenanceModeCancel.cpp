#include "commands/maintenancemode/MaintenanceModeCancel.h"

#include "MeskConstants.h"
#include "hostctl/MeskCtlException.h"
#include "hostctl/MeskUtil.h"

namespace OrvaneCli {
namespace MeskNamespace {

using HostCtl::Lib::Mesk::MeskCtlException;
using Kalmor::CallSpec::Input;
using Kalmor::CallSpec::InputSpec;
using Kalmor::CallSpec::Output;
using Kalmor::CallSpec::OutputSpec;
using Kalmor::MetaObj::MetaBool;

std::shared_ptr<MaintenanceModeCancel> MaintenanceModeCancel::New() {
    return std::make_shared<MaintenanceModeCancel>();
}

MaintenanceModeCancel::MaintenanceModeCancel() {
    SetDescription("Cancel an in-progress Mesk maintenance mode operation.");
    SetMetaDataField("type", "operation");
}

MaintenanceModeCancel::~MaintenanceModeCancel() = default;

std::shared_ptr<InputSpec> MaintenanceModeCancel::GetInputSpecInternal() {
    return InputSpec::New();
}

std::shared_ptr<OutputSpec> MaintenanceModeCancel::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaBool::New());
    return spec;
}

void MaintenanceModeCancel::ExecuteInternal(std::shared_ptr<Input> /*input*/,
                                            std::shared_ptr<Output> output) {
    // Cancelling is a static operation of the library's core: no plug-in or info object is
    // needed, and none is made.
    try {
        ZuvCtl::Mesk::MeskUtil::DecomCancel();
        output->SetRootObject(MetaBool::New(true));
        output->SetComplete();
    } catch (const MeskCtlException& e) {
        // The bare library text, then a false result that is still complete.
        output->AddErrorMessage(e.GetMessage());
        output->SetRootObject(MetaBool::New(false));
        output->SetComplete();
    }
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
