// `mesk cluster preferredfaultdomain set`
#pragma once

#include <memory>

#include "autocli/AutoCli.h"

namespace OrvaneCli {
namespace MeskNamespace {

class ClusterPreferredFaultDomainSet : public virtual Kalmor::AutoCli::Command {
  public:
    static std::shared_ptr<ClusterPreferredFaultDomainSet> New();
    ClusterPreferredFaultDomainSet();
    ~ClusterPreferredFaultDomainSet() override;

    std::shared_ptr<Kalmor::CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<Kalmor::CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(std::shared_ptr<Kalmor::CallSpec::Input> input,
                         std::shared_ptr<Kalmor::CallSpec::Output> output) override;
};

}  // namespace MeskNamespace
}  // namespace OrvaneCli
