// `mesk cluster join`
#pragma once

#include <memory>

#include "autocli/AutoCli.h"

namespace OrvaneCli {
namespace MeskNamespace {

class ClusterJoin : public virtual Kalmor::AutoCli::Command {
  public:
    static std::shared_ptr<ClusterJoin> New();
    ClusterJoin();
    ~ClusterJoin() override;

    std::shared_ptr<Kalmor::CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<Kalmor::CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(std::shared_ptr<Kalmor::CallSpec::Input> input,
                         std::shared_ptr<Kalmor::CallSpec::Output> output) override;
};

}  // namespace MeskNamespace
}  // namespace OrvaneCli
