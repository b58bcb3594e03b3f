// `mesk faultdomain set`
#pragma once

#include <memory>

#include "autocli/AutoCli.h"

namespace OrvaneCli {
namespace MeskNamespace {

class FaultDomainSet : public virtual Kalmor::AutoCli::Command {
  public:
    static std::shared_ptr<FaultDomainSet> New();
    FaultDomainSet();
    ~FaultDomainSet() override;

    std::shared_ptr<Kalmor::CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<Kalmor::CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(std::shared_ptr<Kalmor::CallSpec::Input> input,
                         std::shared_ptr<Kalmor::CallSpec::Output> output) override;
};

}  // namespace MeskNamespace
}  // namespace OrvaneCli
