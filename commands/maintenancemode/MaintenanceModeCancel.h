// `mesk maintenancemode cancel`
#pragma once

#include <memory>

#include "autocli/AutoCli.h"

namespace OrvaneCli {
namespace MeskNamespace {

class MaintenanceModeCancel : public virtual Kalmor::AutoCli::Command {
  public:
    static std::shared_ptr<MaintenanceModeCancel> New();
    MaintenanceModeCancel();
    ~MaintenanceModeCancel() override;

    std::shared_ptr<Kalmor::CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<Kalmor::CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(std::shared_ptr<Kalmor::CallSpec::Input> input,
                         std::shared_ptr<Kalmor::CallSpec::Output> output) override;
};

}  // namespace MeskNamespace
}  // namespace OrvaneCli
