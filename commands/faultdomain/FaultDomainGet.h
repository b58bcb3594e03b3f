// `mesk faultdomain get`
#pragma once

#include <memory>

#include "autocli/AutoCli.h"

namespace OrvaneCli {
namespace MeskNamespace {

class FaultDomainGet : public virtual Kalmor::AutoCli::Command {
  public:
    static std::shared_ptr<FaultDomainGet> New();
    FaultDomainGet();
    ~FaultDomainGet() override;

    std::shared_ptr<Kalmor::CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<Kalmor::CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(std::shared_ptr<Kalmor::CallSpec::Input> input,
                         std::shared_ptr<Kalmor::CallSpec::Output> output) override;

    // Builds the empty "FaultDomain" structure.
    std::shared_ptr<Kalmor::MetaObj::MetaStruct> GetOutputStructure();
};

}  // namespace MeskNamespace
}  // namespace OrvaneCli
