#include "commands/trace/MeskTraceGet.h"

#include <fstream>
#include <string>

#include "MeskConstants.h"
#include "commands/common/HostPath.h"
#include "commands/common/OutputFields.h"
#include "commands/trace/TraceConfigFile.h"
#include "hostctl/MeskCtlException.h"
#include "hostctl/MeskUtil.h"

namespace OrvaneCli {
namespace MeskNamespace {

using HostCtl::Lib::Mesk::MeskCtlException;
using Kalmor::CallSpec::Input;
using Kalmor::CallSpec::InputSpec;
using Kalmor::CallSpec::Output;
using Kalmor::CallSpec::OutputSpec;
using Kalmor::MetaObj::META_BOOL;
using Kalmor::MetaObj::META_INT;
using Kalmor::MetaObj::META_STRING;
using Kalmor::MetaObj::MetaBool;
using Kalmor::MetaObj::MetaInt;
using Kalmor::MetaObj::MetaString;
using Kalmor::MetaObj::MetaStruct;
using ZuvCtl::Mesk::MeskUtil;

namespace {

// The configuration's fields, in the order shown; ExecuteInternal fills them by these names.
const OutputField kDirectory{"MESK Traces Directory", META_STRING};
const OutputField kFilesToRotate{"Number Of Files To Rotate", META_INT};
const OutputField kMaxFileSize{"Maximum Trace File Size", META_INT};
const OutputField kLogUrgentToSyslog{"Log Urgent Traces To Syslog", META_BOOL};
const OutputField* const kFields[] = {&kDirectory, &kFilesToRotate, &kMaxFileSize,
                                      &kLogUrgentToSyslog};

}  // namespace

std::shared_ptr<MeskTraceGet> MeskTraceGet::New() {
    return std::make_shared<MeskTraceGet>();
}

// Unlike the other commands, the output defaults come before the "type" field.
MeskTraceGet::MeskTraceGet() {
    SetDescription("Get the Mesk tracing configuration.");
    SetDefaultOutputFormatter("simple");
    SetDefaultOutputParameter("fields:MeskTraceGet", JoinFieldNames(kFields));
    SetDefaultOutputParameter(std::string("units:MeskTraceGet.") + kMaxFileSize.name, "MB");
    SetMetaDataField("type", "fetcher");
}

MeskTraceGet::~MeskTraceGet() = default;

std::shared_ptr<InputSpec> MeskTraceGet::GetInputSpecInternal() {
    return InputSpec::New();
}

std::shared_ptr<OutputSpec> MeskTraceGet::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(GetOutputStructure());
    return spec;
}

std::shared_ptr<MetaStruct> MeskTraceGet::GetOutputStructure() {
    auto structure = MetaStruct::New("MeskTraceGet");
    AddEmptyFields(*structure, kFields);
    return structure;
}

void MeskTraceGet::ExecuteInternal(std::shared_ptr<Input> /*input*/,
                                   std::shared_ptr<Output> output) {
    // The service is checked before the file is read: a stopped service means the cluster
    // service is not enabled, whatever the file says.
    int32_t status = 0;
    try {
        status = MeskUtil::MeskExec(TRACE_SERVICE_SCRIPT, "status", false, true, false);
        if (status < 0) throw MeskCtlException("Checking mesktraced status failed.");
    } catch (const MeskCtlException& e) {
        output->AddErrorMessage(e.GetMessage() + "Refer to /var/log/syslog.log for details.");
        return;
    }
    if (status == 3) {
        output->AddErrorMessage("Mesk is not enabled on this host.");
        return;
    }

    std::ifstream file(HostPath(TRACE_CONFIG_FILE));
    if (!file.is_open()) {
        output->AddErrorMessage("Error opening Mesk trace config file for reading.");
        return;
    }

    auto result = GetOutputStructure();
    const TraceSettings settings = ReadTraceSettings(file);
    result->SetField(kDirectory.Text(), MetaString::New(settings.directory), MetaStruct::_docEmpty);
    result->SetField(kFilesToRotate.Text(), MetaInt::New(settings.maxFiles), MetaStruct::_docEmpty);
    result->SetField(kMaxFileSize.Text(), MetaInt::New(settings.fileSizeMb), MetaStruct::_docEmpty);
    result->SetField(kLogUrgentToSyslog.Text(), MetaBool::New(settings.logUrgentToSyslog),
                     MetaStruct::_docEmpty);
    file.close();
    output->SetRootObject(result);
    output->SetComplete();
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
