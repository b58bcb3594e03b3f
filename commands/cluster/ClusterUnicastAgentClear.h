// `mesk cluster unicastagent clear`
#pragma once

#include <memory>

#include "autocli/AutoCli.h"

namespace OrvaneCli {
namespace MeskNamespace {

class ClusterUnicastAgentClear : public virtual Kalmor::AutoCli::Command {
  public:
    static std::shared_ptr<ClusterUnicastAgentClear> New();
    ClusterUnicastAgentClear();
    std::shared_ptr<Kalmor::CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<Kalmor::CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(std::shared_ptr<Kalmor::CallSpec::Input> input,
                         std::shared_ptr<Kalmor::CallSpec::Output> output) override;
    ~ClusterUnicastAgentClear() override;
};

}  // namespace MeskNamespace
}  // namespace OrvaneCli
