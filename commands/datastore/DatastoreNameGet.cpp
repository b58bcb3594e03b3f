#include "commands/datastore/DatastoreNameGet.h"

#include "MeskConstants.h"
#include "commands/common/OutputFields.h"
#include "hostctl/MeskCtlException.h"
#include "hostctl/MeskPlugin.h"

namespace OrvaneCli {
namespace MeskNamespace {

using HostCtl::Lib::Mesk::MeskCtlException;
using Kalmor::CallSpec::Input;
using Kalmor::CallSpec::InputSpec;
using Kalmor::CallSpec::Output;
using Kalmor::CallSpec::OutputSpec;
using Kalmor::MetaObj::META_STRING;
using Kalmor::MetaObj::MetaString;
using Kalmor::MetaObj::MetaStruct;

namespace {

// The result's fields; ExecuteInternal fills them by these names.
const OutputField kName{"Name", META_STRING};
const OutputField* const kFields[] = {&kName};

}  // namespace

std::shared_ptr<DatastoreNameGet> DatastoreNameGet::New() {
    return std::make_shared<DatastoreNameGet>();
}

DatastoreNameGet::DatastoreNameGet() {
    SetDescription("Get Mesk datastore name.");
    SetMetaDataField("type", "fetcher");
    SetDefaultOutputFormatter("simple");
}

DatastoreNameGet::~DatastoreNameGet() = default;

std::shared_ptr<InputSpec> DatastoreNameGet::GetInputSpecInternal() {
    return InputSpec::New();
}

std::shared_ptr<OutputSpec> DatastoreNameGet::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(GetOutputStructure());
    return spec;
}

std::shared_ptr<MetaStruct> DatastoreNameGet::GetOutputStructure() {
    auto structure = MetaStruct::New("DatastoreName");
    AddEmptyFields(*structure, kFields);
    return structure;
}

void DatastoreNameGet::ExecuteInternal(std::shared_ptr<Input> /*input*/,
                                       std::shared_ptr<Output> output) {
    try {
        auto result = GetOutputStructure();
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();
        result->SetField(kName.Text(), MetaString::New(info->GetDatastoreName()),
                         MetaStruct::_docEmpty);
        output->SetRootObject(result);
        output->SetComplete();
    } catch (const MeskCtlException& e) {
        output->AddErrorMessage("Unable to get Mesk datastore name: " + e.GetMessage());
    }
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
