#include "commands/cluster/ClusterGet.h"

#include <cstdint>
#include <cstdio>
#include <cstring>
#include <ctime>
#include <string>
#include <vector>

#include "MeskConstants.h"
#include "commands/common/OutputFields.h"
#include "hostctl/MeskCtlException.h"
#include "hostctl/MeskPlugin.h"
#include "hostctl/MeskUtil.h"
#include "hostctl/Misc.h"

namespace OrvaneCli {
namespace MeskNamespace {

using HostCtl::Lib::Mesk::MeskCtlException;
using Kalmor::CallSpec::Input;
using Kalmor::CallSpec::InputSpec;
using Kalmor::CallSpec::Output;
using Kalmor::CallSpec::OutputSpec;
using Kalmor::MetaObj::META_BOOL;
using Kalmor::MetaObj::META_INT;
using Kalmor::MetaObj::META_LIST;
using Kalmor::MetaObj::META_STRING;
using Kalmor::MetaObj::MetaBool;
using Kalmor::MetaObj::MetaInt;
using Kalmor::MetaObj::MetaList;
using Kalmor::MetaObj::MetaString;
using Kalmor::MetaObj::MetaStruct;
using ZuvCtl::Mesk::MeskUtil;

namespace {

// The report's fields, in the order shown; ExecuteInternal fills them by these names.
const OutputField kEnabled{"Enabled", META_BOOL};
const OutputField kCurrentLocalTime{"Current Local Time", META_STRING};
const OutputField kLocalNodeUuid{"Local Node UUID", META_STRING};
const OutputField kLocalNodeType{"Local Node Type", META_STRING};
const OutputField kLocalNodeState{"Local Node State", META_STRING};
const OutputField kLocalNodeHealthState{"Local Node Health State", META_STRING};
const OutputField kMasterUuid{"Sub-Cluster Master UUID", META_STRING};
const OutputField kBackupUuid{"Sub-Cluster Backup UUID", META_STRING};
const OutputField kClusterUuid{"Sub-Cluster UUID", META_STRING};
const OutputField kMembershipEntryRevision{"Sub-Cluster Membership Entry Revision", META_INT};
const OutputField kMemberCount{"Sub-Cluster Member Count", META_INT};
const OutputField kMemberUuids{"Sub-Cluster Member UUIDs", META_LIST};
const OutputField kMembershipUuid{"Sub-Cluster Membership UUID", META_STRING};
const OutputField kUnicastModeEnabled{"Unicast Mode Enabled", META_BOOL};
const OutputField kMaintenanceModeState{"Maintenance Mode State", META_STRING};
const OutputField kConfigGeneration{"Config Generation", META_STRING};
const OutputField* const kFields[] = {
    &kEnabled,        &kCurrentLocalTime,        &kLocalNodeUuid,        &kLocalNodeType,
    &kLocalNodeState, &kLocalNodeHealthState,    &kMasterUuid,           &kBackupUuid,
    &kClusterUuid,    &kMembershipEntryRevision, &kMemberCount,          &kMemberUuids,
    &kMembershipUuid, &kUnicastModeEnabled,      &kMaintenanceModeState, &kConfigGeneration};

// The configuration generation's timestamp (milliseconds since the epoch) as local time with
// three-digit milliseconds and no zone suffix, e.g. "2017-07-14T02:40:00.007". A timestamp
// below one second is not a date: it prints as "0." and the milliseconds, e.g. "0.000".
std::string FormatGenerationTimestamp(uint64_t timestamp) {
    char buffer[32];
    const uint64_t seconds = timestamp / 1000;
    const uint64_t milliseconds = timestamp % 1000;
    size_t length = 0;
    if (seconds != 0) {
        const time_t when = static_cast<time_t>(seconds);
        struct tm local;
        std::memset(&local, 0, sizeof local);
        localtime_r(&when, &local);
        length = std::strftime(buffer, sizeof buffer, "%Y-%m-%dT%H:%M:%S.", &local);
    } else {
        std::strcpy(buffer, "0.");
        length = std::strlen(buffer);
    }
    std::snprintf(buffer + length, sizeof buffer - length, "%03u",
                  static_cast<unsigned>(milliseconds));
    return buffer;
}

}  // namespace

std::shared_ptr<ClusterGet> ClusterGet::New() {
    return std::make_shared<ClusterGet>();
}

ClusterGet::ClusterGet() {
    SetDescription("Get information about the Mesk cluster that this host is joined to.");
    SetMetaDataField("type", "fetcher");
    SetDefaultOutputFormatter("simple");
    SetDefaultOutputParameter("header:MeskClusterGet", "Cluster Information");
    // Unlike the other commands' lists, this one ends with a comma.
    SetDefaultOutputParameter("fields:MeskClusterGet", JoinFieldNames(kFields) + ",");
}

ClusterGet::~ClusterGet() = default;

std::shared_ptr<InputSpec> ClusterGet::GetInputSpecInternal() {
    return InputSpec::New();
}

std::shared_ptr<OutputSpec> ClusterGet::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(GetOutputStructure());
    return spec;
}

std::shared_ptr<MetaStruct> ClusterGet::GetOutputStructure() {
    auto structure = MetaStruct::New("MeskClusterGet");
    AddEmptyFields(*structure, kFields);
    return structure;
}

void ClusterGet::ExecuteInternal(std::shared_ptr<Input> /*input*/, std::shared_ptr<Output> output) {
    const std::string& doc = MetaStruct::_docEmpty;
    auto result = GetOutputStructure();
    try {
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();
        const HostCtl::Mesk::MeskClusterConfig& config = info->GetClusterConfig();
        if (!config.enabled) {
            output->AddErrorMessage("Mesk Clustering is not enabled on this host");
        } else {
            const std::string nodeType = info->IsWitness() ? "WITNESS" : "NORMAL";

            std::vector<HostCtl::Mesk::MeskMemberInfo> members;
            std::string localNodeState;
            std::string localNodeUuid;
            std::string localNodeHealthState;
            uint64_t membershipEntryRevision = 0;
            std::string membershipUuid;
            std::string masterUuid;
            std::string backupUuid;
            std::string maintenanceModeState;
            MeskUtil::GetInfoFromKOVRA(members, localNodeState, localNodeUuid, localNodeHealthState,
                                       membershipEntryRevision, membershipUuid, masterUuid,
                                       backupUuid, maintenanceModeState);

            bool unicastMode = false;
            MeskUtil::GetUnicastMode(unicastMode);

            auto memberUuids = MetaList::New(Kalmor::MetaObj::META_STRING);
            memberUuids->Reserve(members.size());
            for (const auto& member : members) memberUuids->Add(member.uuid);

            const HostCtl::Mesk::MeskConfigGeneration generation = info->GetConfigGeneration();
            const std::string timestamp = FormatGenerationTimestamp(generation.timestamp);
            const std::string configGeneration = HostCtl::Misc::StrPrintf(
                "%s %lu %s", generation.uuid.empty() ? "None" : generation.uuid.c_str(),
                static_cast<unsigned long>(generation.generation), timestamp.c_str());

            // The local time is read last, after every other query, so that it is the time
            // at which the report was put together.
            result->SetField(kEnabled.Text(), MetaBool::New(config.enabled), doc);
            result->SetField(kCurrentLocalTime.Text(),
                             MetaString::New(MeskUtil::GetFormattedSystemDateTime()), doc);
            result->SetField(kLocalNodeUuid.Text(), MetaString::New(localNodeUuid), doc);
            result->SetField(kLocalNodeType.Text(), MetaString::New(nodeType), doc);
            result->SetField(kLocalNodeState.Text(), MetaString::New(localNodeState), doc);
            result->SetField(kLocalNodeHealthState.Text(), MetaString::New(localNodeHealthState),
                             doc);
            result->SetField(kMasterUuid.Text(), MetaString::New(masterUuid), doc);
            result->SetField(kBackupUuid.Text(), MetaString::New(backupUuid), doc);
            result->SetField(kClusterUuid.Text(), MetaString::New(config.clusterUuid), doc);
            result->SetField(kMembershipEntryRevision.Text(),
                             MetaInt::New(static_cast<int64_t>(membershipEntryRevision)), doc);
            result->SetField(kMemberCount.Text(),
                             MetaInt::New(static_cast<int64_t>(members.size())), doc);
            result->SetField(kMemberUuids.Text(), memberUuids, doc);
            result->SetField(kMembershipUuid.Text(), MetaString::New(membershipUuid), doc);
            result->SetField(kUnicastModeEnabled.Text(), MetaBool::New(unicastMode), doc);
            result->SetField(kMaintenanceModeState.Text(), MetaString::New(maintenanceModeState),
                             doc);
            result->SetField(kConfigGeneration.Text(), MetaString::New(configGeneration), doc);
        }
    } catch (const MeskCtlException& e) {
        output->AddErrorMessage(e.GetMessage());
    }
    // Whatever happened, the report is handed back and complete: a host outside a cluster or
    // a failed query shows the fields gathered so far (none, or all empty) next to the error.
    output->SetRootObject(result);
    output->SetComplete();
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
