// `mesk resync throttle get`
#pragma once

#include <memory>

#include "autocli/AutoCli.h"

namespace OrvaneCli {
namespace MeskNamespace {

class ResyncThrottleGet : public virtual Kalmor::AutoCli::Command {
  public:
    static std::shared_ptr<ResyncThrottleGet> New();
    ResyncThrottleGet();
    std::shared_ptr<Kalmor::CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<Kalmor::CallSpec::OutputSpec> GetOutputSpecInternal() override;
    // Builds the empty "ResyncThrottle" structure.
    virtual std::shared_ptr<Kalmor::MetaObj::MetaStruct> GetOutputStructure();
    void ExecuteInternal(std::shared_ptr<Kalmor::CallSpec::Input> input,
                         std::shared_ptr<Kalmor::CallSpec::Output> output) override;
    ~ResyncThrottleGet() override;
};

}  // namespace MeskNamespace
}  // namespace OrvaneCli
