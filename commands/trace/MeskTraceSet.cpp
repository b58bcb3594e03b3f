#include "commands/trace/MeskTraceSet.h"

#include <fstream>
#include <sstream>

#include "MeskConstants.h"
#include "commands/common/HostPath.h"
#include "commands/trace/TraceConfigFile.h"
#include "commands/trace/TraceRestartWait.h"
#include "hostctl/MeskCtlException.h"
#include "hostctl/MeskUtil.h"
#include "hostctl/Misc.h"

namespace OrvaneCli {
namespace MeskNamespace {

using HostCtl::Lib::Mesk::MeskCtlException;
using Kalmor::CallSpec::Input;
using Kalmor::CallSpec::InputSpec;
using Kalmor::CallSpec::Output;
using Kalmor::CallSpec::OutputSpec;
using Kalmor::CallSpec::ParameterSpec;
using Kalmor::MetaObj::MetaBool;
using ZuvCtl::Mesk::MeskUtil;

namespace {

// How often a restart is tried, and how long to wait after each failed try but the last.
constexpr int RESTART_ATTEMPTS = 8;
constexpr unsigned RESTART_WAIT_SECONDS = 5;

}  // namespace

std::shared_ptr<MeskTraceSet> MeskTraceSet::New() {
    return std::make_shared<MeskTraceSet>();
}

MeskTraceSet::MeskTraceSet() {
    SetDescription("Configure Mesk trace. Please note: This command is not thread safe.");
    SetMetaDataField("type", "operation");
}

MeskTraceSet::~MeskTraceSet() = default;

std::shared_ptr<InputSpec> MeskTraceSet::GetInputSpecInternal() {
    auto spec = InputSpec::New();

    auto path = ParameterSpec::New("path", Kalmor::CallSpec::PARAM_STRING);
    path->SetShortName("p");
    path->SetRequired(false);
    path->SetDescription("Path to store Mesk trace files.");
    spec->AddParameter(path);

    auto numfiles = ParameterSpec::New("numfiles", Kalmor::CallSpec::PARAM_INT);
    numfiles->SetShortName("f");
    numfiles->SetRequired(false);
    numfiles->SetDescription("Log file rotation for Mesk trace files.");
    spec->AddParameter(numfiles);

    auto size = ParameterSpec::New("size", Kalmor::CallSpec::PARAM_INT);
    size->SetShortName("s");
    size->SetRequired(false);
    size->SetDescription("Maximum size of Mesk trace files in MB.");
    spec->AddParameter(size);

    auto logtosyslog = ParameterSpec::New("logtosyslog", Kalmor::CallSpec::PARAM_BOOL);
    logtosyslog->SetShortName("l");
    logtosyslog->SetRequired(false);
    logtosyslog->SetDescription(
        "Boolean value to enable or disable logging urgent traces to syslog.");
    spec->AddParameter(logtosyslog);

    auto reset = ParameterSpec::New("reset", Kalmor::CallSpec::PARAM_BOOL);
    reset->SetShortName("r");
    reset->SetRequired(false);
    reset->SetDescription("When set to true, reset defaults for Mesk trace files.");
    spec->AddParameter(reset);

    return spec;
}

std::shared_ptr<OutputSpec> MeskTraceSet::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaBool::New());
    return spec;
}

void MeskTraceSet::ExecuteInternal(std::shared_ptr<Input> input, std::shared_ptr<Output> output) {
    // The size is checked as soon as it is read, so a bad size is reported even together
    // with reset; reset given at all (even false) excludes every other option.
    TraceChanges changes;
    if (input->HasParameter("path")) changes.path = input->GetParameter("path");
    if (input->HasParameter("numfiles")) {
        changes.maxFiles = static_cast<int32_t>(input->GetParameterInt("numfiles"));
    }
    if (input->HasParameter("size")) {
        changes.fileSizeMb = static_cast<int32_t>(input->GetParameterInt("size"));
        if (*changes.fileSizeMb < 1 || *changes.fileSizeMb > 4095) {
            output->AddErrorMessage("File size should be < 4096 MB.");
            return;
        }
    }
    if (input->HasParameter("logtosyslog")) {
        changes.logUrgentToSyslog = input->GetParameterBool("logtosyslog");
    }
    const bool anySetting =
        changes.path || changes.maxFiles || changes.fileSizeMb || changes.logUrgentToSyslog;
    if (input->HasParameter("reset")) {
        if (anySetting) {
            output->AddErrorMessage("reset cannot be used with other options.");
            return;
        }
        changes.reset = input->GetParameterBool("reset");
    }
    if (!anySetting && !changes.reset) {
        output->AddErrorMessage("No options provided.");
        return;
    }

    const std::string configPath = HostPath(TRACE_CONFIG_FILE);
    std::string oldText;
    {
        std::ifstream in(configPath, std::ios::binary);
        if (!in.is_open()) {
            output->AddErrorMessage("Error opening Mesk Trace Config File for reading.");
            return;
        }
        std::ostringstream text;
        text << in.rdbuf();
        oldText = text.str();
    }
    std::istringstream oldLines(oldText);
    std::string newText;
    for (const auto& line : RewriteTraceLines(ReadTraceLines(oldLines), changes)) {
        newText += line + '\n';
    }

    // The file is truncated before it is written. A write that fails halfway (a full file
    // system) is reported like a file that could not be opened, and the old text is put back:
    // it fits again in the blocks that the truncation freed, so the file is left as it was.
    {
        std::ofstream out(configPath, std::ios::out | std::ios::trunc | std::ios::binary);
        if (!out.is_open()) {
            output->AddErrorMessage("Error opening Mesk Trace Config File for writing.");
            return;
        }
        out << newText;
        out.close();
        if (out.fail()) {
            std::ofstream(configPath, std::ios::out | std::ios::trunc | std::ios::binary)
                << oldText;
            output->AddErrorMessage("Error opening Mesk Trace Config File for writing.");
            return;
        }
    }

    // The new file stays in place whatever happens to the service from here on.
    try {
        const int32_t status =
            MeskUtil::MeskExec(TRACE_SERVICE_SCRIPT, "status", false, true, false);
        if (status < 0) throw MeskCtlException("Failed to check mesktraced status.");
        // Status 3: the service is stopped and picks the file up when it starts; no restart.
        if (status != 3) {
            std::string failures;
            bool restarted = false;
            for (int attempt = 1; attempt <= RESTART_ATTEMPTS; ++attempt) {
                const int32_t result =
                    MeskUtil::MeskExec(TRACE_SERVICE_SCRIPT, "restart", false, true, false);
                if (result == 0) {
                    restarted = true;
                    break;
                }
                failures += HostCtl::Misc::StrPrintf("Failed to restart mesktraced: %d; ", result);
                if (attempt < RESTART_ATTEMPTS) RestartWait(RESTART_WAIT_SECONDS);
            }
            if (!restarted) throw MeskCtlException(failures);
        }
    } catch (const MeskCtlException& e) {
        output->AddErrorMessage(e.GetMessage() + " Refer /var/log/syslog.log for details.");
        return;
    }

    output->SetRootObject(MetaBool::New(true));
    output->SetComplete();
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
