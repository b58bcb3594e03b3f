// `mesk policy getdefault`
#pragma once

#include <memory>

#include "autocli/AutoCli.h"

namespace OrvaneCli {
namespace MeskNamespace {

class PolicyGetDefault : public virtual Kalmor::AutoCli::Command {
  public:
    static std::shared_ptr<PolicyGetDefault> New();
    PolicyGetDefault();
    ~PolicyGetDefault() override;

    std::shared_ptr<Kalmor::CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<Kalmor::CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(std::shared_ptr<Kalmor::CallSpec::Input> input,
                         std::shared_ptr<Kalmor::CallSpec::Output> output) override;

    // Builds an empty "Policy" structure: one row of the result list.
    std::shared_ptr<Kalmor::MetaObj::MetaStruct> GetOutputStructure();
};

}  // namespace MeskNamespace
}  // namespace OrvaneCli
