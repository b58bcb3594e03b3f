#include "commands/datastore/DatastoreNameSet.h"

#include "MeskConstants.h"
#include "hostctl/MeskCtlException.h"
#include "hostctl/MeskPlugin.h"

namespace OrvaneCli {
namespace MeskNamespace {

using HostCtl::Lib::Mesk::MeskCtlException;
using Kalmor::CallSpec::Input;
using Kalmor::CallSpec::InputSpec;
using Kalmor::CallSpec::Output;
using Kalmor::CallSpec::OutputSpec;
using Kalmor::CallSpec::ParameterSpec;
using Kalmor::MetaObj::MetaBool;

std::shared_ptr<DatastoreNameSet> DatastoreNameSet::New() {
    return std::make_shared<DatastoreNameSet>();
}

DatastoreNameSet::DatastoreNameSet() {
    SetDescription(
        "Configure Mesk datastore name. In general, Rename should always be done at cluster "
        "level. Across a Mesk cluster Mesk datastore name should be in sync.");
    SetMetaDataField("type", "operation");
}

DatastoreNameSet::~DatastoreNameSet() = default;

std::shared_ptr<InputSpec> DatastoreNameSet::GetInputSpecInternal() {
    auto spec = InputSpec::New();

    auto newname = ParameterSpec::New("newname", Kalmor::CallSpec::PARAM_STRING);
    newname->SetRequired(true);
    newname->SetDescription("Set Mesk datastore name.");
    spec->AddParameter(newname);

    return spec;
}

std::shared_ptr<OutputSpec> DatastoreNameSet::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaBool::New());
    return spec;
}

void DatastoreNameSet::ExecuteInternal(std::shared_ptr<Input> input,
                                       std::shared_ptr<Output> output) {
    try {
        const std::string name = input->GetParameter("newname");
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();
        info->SetDatastoreName(name);
    } catch (const MeskCtlException& e) {
        output->AddErrorMessage("Unable to set Mesk datastore name: " + e.GetMessage());
    }
    // The rename's result is true whether or not it succeeded: a failure shows only in the
    // error message.
    output->SetRootObject(MetaBool::New(true));
    output->SetComplete();
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
