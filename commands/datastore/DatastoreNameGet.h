// `mesk datastore name get`
#pragma once

#include <memory>

#include "autocli/AutoCli.h"

namespace OrvaneCli {
namespace MeskNamespace {

class DatastoreNameGet : public virtual Kalmor::AutoCli::Command {
  public:
    static std::shared_ptr<DatastoreNameGet> New();
    DatastoreNameGet();
    ~DatastoreNameGet() override;

    std::shared_ptr<Kalmor::CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<Kalmor::CallSpec::OutputSpec> GetOutputSpecInternal() override;
    // Builds the empty "DatastoreName" structure.
    virtual std::shared_ptr<Kalmor::MetaObj::MetaStruct> GetOutputStructure();
    void ExecuteInternal(std::shared_ptr<Kalmor::CallSpec::Input> input,
                         std::shared_ptr<Kalmor::CallSpec::Output> output) override;
};

}  // namespace MeskNamespace
}  // namespace OrvaneCli
