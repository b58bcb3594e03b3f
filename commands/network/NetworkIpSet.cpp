#include "commands/network/NetworkIpSet.h"

#include "MeskConstants.h"
#include "commands/network/NetworkIpAdd.h"

namespace OrvaneCli {
namespace MeskNamespace {

using Kalmor::CallSpec::Input;
using Kalmor::CallSpec::InputSpec;
using Kalmor::CallSpec::Output;
using Kalmor::CallSpec::OutputSpec;
using Kalmor::MetaObj::MetaBool;

std::shared_ptr<NetworkIpSet> NetworkIpSet::New() {
    return std::make_shared<NetworkIpSet>();
}

NetworkIpSet::NetworkIpSet() {
    SetDescription("Reconfigure an IP interface in the Mesk network configuration.");
    SetMetaDataField("type", "operation");
}

NetworkIpSet::~NetworkIpSet() = default;

// Set takes the parameters of add; values not given keep the interface's current ones.
std::shared_ptr<InputSpec> NetworkIpSet::GetInputSpecInternal() {
    return NetworkIpAdd::GetInputSpecCommon();
}

std::shared_ptr<OutputSpec> NetworkIpSet::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaBool::New());
    return spec;
}

void NetworkIpSet::ExecuteInternal(std::shared_ptr<Input> input, std::shared_ptr<Output> output) {
    NetworkIpAdd::ExecuteCommon(input, output, true);
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
