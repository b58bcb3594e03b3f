// `mesk cluster unicastagent list`
#pragma once

#include <memory>

#include "autocli/AutoCli.h"

namespace OrvaneCli {
namespace MeskNamespace {

class ClusterUnicastAgentList : public virtual Kalmor::AutoCli::Command {
  public:
    static std::shared_ptr<ClusterUnicastAgentList> New();
    ClusterUnicastAgentList();
    ~ClusterUnicastAgentList() override;

    std::shared_ptr<Kalmor::CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<Kalmor::CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(std::shared_ptr<Kalmor::CallSpec::Input> input,
                         std::shared_ptr<Kalmor::CallSpec::Output> output) override;

    // Builds an empty "UnicastAgentList" structure: the template of the list and one row per agent.
    std::shared_ptr<Kalmor::MetaObj::MetaStruct> GetOutputStructure();
};

}  // namespace MeskNamespace
}  // namespace OrvaneCli
