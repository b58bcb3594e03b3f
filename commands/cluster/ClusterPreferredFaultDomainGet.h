// `mesk cluster preferredfaultdomain get`
#pragma once

#include <memory>

#include "autocli/AutoCli.h"

namespace OrvaneCli {
namespace MeskNamespace {

class ClusterPreferredFaultDomainGet : public virtual Kalmor::AutoCli::Command {
  public:
    static std::shared_ptr<ClusterPreferredFaultDomainGet> New();
    ClusterPreferredFaultDomainGet();
    ~ClusterPreferredFaultDomainGet() override;

    std::shared_ptr<Kalmor::CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<Kalmor::CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(std::shared_ptr<Kalmor::CallSpec::Input> input,
                         std::shared_ptr<Kalmor::CallSpec::Output> output) override;

    // Builds the empty "PreferredFaultDomain" structure.
    std::shared_ptr<Kalmor::MetaObj::MetaStruct> GetOutputStructure();
};

}  // namespace MeskNamespace
}  // namespace OrvaneCli
