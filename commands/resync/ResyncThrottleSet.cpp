#include "commands/resync/ResyncThrottleSet.h"

#include <cstdint>

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

std::shared_ptr<ResyncThrottleSet> ResyncThrottleSet::New() {
    return std::make_shared<ResyncThrottleSet>();
}

ResyncThrottleSet::ResyncThrottleSet() {
    SetDescription("Configure Mesk resync throttling");
    SetMetaDataField("type", "operation");
}

std::shared_ptr<InputSpec> ResyncThrottleSet::GetInputSpecInternal() {
    auto spec = InputSpec::New();

    // The framework refuses a level outside 0 to 512 before the command runs.
    auto range = ParameterConstraint::New(Kalmor::CallSpec::CONSTRAINT_INT_RANGE);
    range->SetIntRange(0, 512);
    auto level = ParameterSpec::New("level", Kalmor::CallSpec::PARAM_INT);
    level->SetRequired(true);
    level->SetDescription("Set Mesk resync throttle level in Mbps (%ENUM%, 0 means no throttling)");
    level->SetConstraint(range);
    spec->AddParameter(level);

    return spec;
}

std::shared_ptr<OutputSpec> ResyncThrottleSet::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaBool::New());
    return spec;
}

void ResyncThrottleSet::ExecuteInternal(std::shared_ptr<Input> input,
                                        std::shared_ptr<Output> output) {
    // The output is never marked complete, on success or on failure.
    try {
        const int64_t level = input->GetParameterInt("level");
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();
        info->SetResyncThrottle(level);
        output->SetRootObject(MetaBool::New(true));
    } catch (const MeskCtlException& e) {
        output->AddErrorMessage(e.GetMessage());
    }
}

ResyncThrottleSet::~ResyncThrottleSet() = default;

}  // namespace MeskNamespace
}  // namespace OrvaneCli
