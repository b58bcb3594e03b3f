// `mesk storage list`
#pragma once

#include <cstdint>
#include <memory>

#include "autocli/AutoCli.h"

namespace OrvaneCli {
namespace MeskNamespace {

class StorageList : public virtual Kalmor::AutoCli::Command {
  public:
    static std::shared_ptr<StorageList> New();
    StorageList();
    ~StorageList() override;

    std::shared_ptr<Kalmor::CallSpec::InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<Kalmor::CallSpec::OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(std::shared_ptr<Kalmor::CallSpec::Input> input,
                         std::shared_ptr<Kalmor::CallSpec::Output> output) override;

    // Builds an empty "MeskStorageList" structure: the template of the list and one row per disk.
    std::shared_ptr<Kalmor::MetaObj::MetaStruct> GetOutputStructure();

    // The display text of an on-disk format version code.
    std::shared_ptr<Kalmor::MetaObj::MetaString> MarshalVersion(int32_t code);
};

}  // namespace MeskNamespace
}  // namespace OrvaneCli
