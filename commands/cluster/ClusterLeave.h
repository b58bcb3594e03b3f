// `mesk cluster leave`
#pragma once

#include <memory>
#include <string>

#include "autocli/AutoCli.h"

namespace OrvaneCli {
namespace MeskNamespace {

class ClusterLeave : public virtual Kalmor::AutoCli::Command {
  public:
    static std::shared_ptr<ClusterLeave> New();
    ClusterLeave();
    ~ClusterLeave() override;

    std::shared_ptr<Kalmor::CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<Kalmor::CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(std::shared_ptr<Kalmor::CallSpec::Input> input,
                         std::shared_ptr<Kalmor::CallSpec::Output> output) override;
};

// Tells the host management agent about a datastore event ("PreUnmount", "FailedUnmount")
// by running its notification script; what the script does or prints is ignored.
void NotifyDatastore(const std::string& eventType, const std::string& datastoreName);

}  // namespace MeskNamespace
}  // namespace OrvaneCli
