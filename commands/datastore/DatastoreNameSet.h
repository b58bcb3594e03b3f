// `mesk datastore name set`
#pragma once

#include <memory>

#include "autocli/AutoCli.h"

namespace OrvaneCli {
namespace MeskNamespace {

class DatastoreNameSet : public virtual Kalmor::AutoCli::Command {
  public:
    static std::shared_ptr<DatastoreNameSet> New();
    DatastoreNameSet();
    ~DatastoreNameSet() override;

    std::shared_ptr<Kalmor::CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<Kalmor::CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(std::shared_ptr<Kalmor::CallSpec::Input> input,
                         std::shared_ptr<Kalmor::CallSpec::Output> output) override;
};

}  // namespace MeskNamespace
}  // namespace OrvaneCli
