// `mesk network list`
#pragma once

#include <memory>

#include "autocli/AutoCli.h"

namespace OrvaneCli {
namespace MeskNamespace {

class NetworkList : public virtual Kalmor::AutoCli::Command {
  public:
    static std::shared_ptr<NetworkList> New();
    NetworkList();
    ~NetworkList() override;

    std::shared_ptr<Kalmor::CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<Kalmor::CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(std::shared_ptr<Kalmor::CallSpec::Input> input,
                         std::shared_ptr<Kalmor::CallSpec::Output> output) override;

    // Builds an empty "MeskNetworkList" structure: the template of the list and one row per
    // interface.
    std::shared_ptr<Kalmor::MetaObj::MetaStruct> GetOutputStructure();
};

}  // namespace MeskNamespace
}  // namespace OrvaneCli
