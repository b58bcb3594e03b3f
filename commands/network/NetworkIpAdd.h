// `mesk network ip add`
#pragma once

#include <memory>

#include "autocli/AutoCli.h"

namespace OrvaneCli {
namespace MeskNamespace {

class NetworkIpAdd : public virtual Kalmor::AutoCli::Command {
  public:
    static std::shared_ptr<NetworkIpAdd> New();
    NetworkIpAdd();
    ~NetworkIpAdd() override;

    std::shared_ptr<Kalmor::CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<Kalmor::CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(std::shared_ptr<Kalmor::CallSpec::Input> input,
                         std::shared_ptr<Kalmor::CallSpec::Output> output) override;

    // The parameters of `ip add` and `ip set`.
    static std::shared_ptr<Kalmor::CallSpec::InputSpec> GetInputSpecCommon();
    // The whole execute logic of `ip add` (isSet false) and `ip set` (isSet true).
    static void ExecuteCommon(std::shared_ptr<Kalmor::CallSpec::Input> input,
                              std::shared_ptr<Kalmor::CallSpec::Output> output, bool isSet);
};

}  // namespace MeskNamespace
}  // namespace OrvaneCli
