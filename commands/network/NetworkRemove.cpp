#include "commands/network/NetworkRemove.h"

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

std::shared_ptr<NetworkRemove> NetworkRemove::New() {
    return std::make_shared<NetworkRemove>();
}

NetworkRemove::NetworkRemove() {
    SetDescription("Remove an interface from the Mesk network configuration.");
    SetMetaDataField("type", "operation");
}

NetworkRemove::~NetworkRemove() = default;

std::shared_ptr<InputSpec> NetworkRemove::GetInputSpecInternal() {
    auto spec = InputSpec::New();

    auto interfaceName = ParameterSpec::New("interface-name", Kalmor::CallSpec::PARAM_STRING);
    interfaceName->SetShortName("i");
    interfaceName->SetRequired(true);
    interfaceName->SetDescription("Interface name.");
    spec->AddParameter(interfaceName);

    auto force = ParameterSpec::New("force", Kalmor::CallSpec::PARAM_FLAG);
    force->SetShortName("f");
    force->SetRequired(false);
    force->SetDescription("Notify Mesk subsystem of removal, even if not configured.");
    spec->AddParameter(force);

    return spec;
}

std::shared_ptr<OutputSpec> NetworkRemove::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaBool::New());
    return spec;
}

void NetworkRemove::ExecuteInternal(std::shared_ptr<Input> input, std::shared_ptr<Output> output) {
    try {
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();
        // Both traffic types are always asked for, "mesk" first; the library decides what
        // removing a type the interface does not carry means. A failed "mesk" removal stops
        // before the "witness" one.
        info->RemoveZuvNic(input->GetParameter("interface-name"), input->IsFlagSet("force"),
                           TRAFFIC_TYPE_MESK);
        info->RemoveZuvNic(input->GetParameter("interface-name"), input->IsFlagSet("force"),
                           TRAFFIC_TYPE_WITNESS);
        output->SetRootObject(MetaBool::New(true));
        output->SetComplete();
    } catch (const MeskCtlException& e) {
        // A failure is reported as false and the output is still complete.
        output->AddErrorMessage(e.GetMessage());
        output->SetRootObject(MetaBool::New(false));
        output->SetComplete();
    }
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
