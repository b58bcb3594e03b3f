#include "commands/storage/StorageList.h"

#include <algorithm>
#include <string>
#include <vector>

#include "MeskConstants.h"
#include "commands/common/OutputFields.h"
#include "hostctl/MeskCtlException.h"
#include "hostctl/MeskInfo.h"
#include "hostctl/MeskPlugin.h"
#include "hostctl/MeskUtil.h"

namespace OrvaneCli {
namespace MeskNamespace {

using HostCtl::Lib::Mesk::MeskCtlException;
using HostCtl::Mesk::MeskDiskInfo;
using HostCtl::Mesk::MeskDiskLun;
using HostCtl::Mesk::MeskInfo;
using HostCtl::Mesk::Uuid;
using Kalmor::CallSpec::Input;
using Kalmor::CallSpec::InputSpec;
using Kalmor::CallSpec::Output;
using Kalmor::CallSpec::OutputSpec;
using Kalmor::CallSpec::ParameterSpec;
using Kalmor::MetaObj::META_BOOL;
using Kalmor::MetaObj::META_STRING;
using Kalmor::MetaObj::MetaBool;
using Kalmor::MetaObj::MetaList;
using Kalmor::MetaObj::MetaString;
using Kalmor::MetaObj::MetaStruct;
using ZuvCtl::Mesk::MeskUtil;

namespace {

// A disk's fields, in the order shown; ExecuteInternal fills them by these names.
const OutputField kDevice{"Device", META_STRING};
const OutputField kDisplayName{"Display Name", META_STRING};
const OutputField kIsSsd{"Is SSD", META_BOOL};
const OutputField kMeskUuid{"MESK UUID", META_STRING};
const OutputField kDiskGroupUuid{"MESK Disk Group UUID", META_STRING};
const OutputField kDiskGroupName{"MESK Disk Group Name", META_STRING};
const OutputField kUsedByThisHost{"Used by this host", META_BOOL};
const OutputField kInKovra{"In KOVRA", META_BOOL};
const OutputField kFormatVersion{"On-disk format version", META_STRING};
const OutputField kDeduplication{"Deduplication", META_BOOL};
const OutputField kCompression{"Compression", META_BOOL};
const OutputField kChecksum{"Checksum", META_STRING};
const OutputField kChecksumOk{"Checksum OK", META_BOOL};
const OutputField kIsCapacityTier{"Is Capacity Tier", META_BOOL};
const OutputField kEncryption{"Encryption", META_BOOL};
const OutputField kDiskKeyLoaded{"DiskKeyLoaded", META_BOOL};
const OutputField* const kFields[] = {
    &kDevice,        &kDisplayName,    &kIsSsd,          &kMeskUuid,
    &kDiskGroupUuid, &kDiskGroupName,  &kUsedByThisHost, &kInKovra,
    &kFormatVersion, &kDeduplication,  &kCompression,    &kChecksum,
    &kChecksumOk,    &kIsCapacityTier, &kEncryption,     &kDiskKeyLoaded};

}  // namespace

std::shared_ptr<StorageList> StorageList::New() {
    return std::make_shared<StorageList>();
}

StorageList::StorageList() {
    SetDescription("List Mesk storage configuration.");
    SetMetaDataField("type", "fetcher");
    SetDefaultOutputFormatter("simple");
    SetDefaultOutputParameter("header:MeskStorageList", "%Device%");
    SetDefaultOutputParameter("fields:MeskStorageList", JoinFieldNames(kFields));
}

StorageList::~StorageList() = default;

std::shared_ptr<InputSpec> StorageList::GetInputSpecInternal() {
    auto spec = InputSpec::New();

    auto device = ParameterSpec::New("device", Kalmor::CallSpec::PARAM_STRING);
    device->SetShortName("d");
    device->SetRequired(false);
    device->SetDescription(
        "Filter the output of this command to only show a single device with specified device "
        "name.");
    spec->AddParameter(device);

    auto uuid = ParameterSpec::New("uuid", Kalmor::CallSpec::PARAM_STRING);
    uuid->SetShortName("u");
    uuid->SetRequired(false);
    uuid->SetDescription(
        "Filter the output of this command to only show a single device with specified uuid.");
    spec->AddParameter(uuid);

    return spec;
}

std::shared_ptr<OutputSpec> StorageList::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaList::New(Kalmor::MetaObj::META_STRUCT, GetOutputStructure()));
    return spec;
}

std::shared_ptr<MetaStruct> StorageList::GetOutputStructure() {
    auto structure = MetaStruct::New("MeskStorageList");
    AddEmptyFields(*structure, kFields);
    return structure;
}

std::shared_ptr<MetaString> StorageList::MarshalVersion(int32_t code) {
    switch (code) {
        case 0:
            return MetaString::New("1");
        case 2:
            return MetaString::New("2");
        case 3:
            return MetaString::New("2.5");
        case 4:
            return MetaString::New("3");
        case 5:
            return MetaString::New("5");
        default:
            return MetaString::New("<Unknown>");
    }
}

void StorageList::ExecuteInternal(std::shared_ptr<Input> input, std::shared_ptr<Output> output) {
    // A filter with an empty value is no filter.
    const std::string device = input->GetParameter("device");
    const std::string uuid = input->GetParameter("uuid");
    const bool byDevice = !device.empty();
    const bool byUuid = !uuid.empty();
    if (byDevice && byUuid) {
        output->AddErrorMessage("Only one of --device or --uuid can be specified.");
        return;
    }

    auto result = MetaList::New(Kalmor::MetaObj::META_STRUCT, GetOutputStructure());
    try {
        // One listing of the host's disks serves the filters and every disk query below.
        std::vector<std::shared_ptr<MeskDiskLun>> luns;
        MeskInfo::GetMeskDisks(luns);

        Uuid target;
        if (byUuid) target = MeskUtil::StringToMeskUuid(uuid);

        std::vector<std::string> uuidTexts;
        for (const auto& lun : luns) {
            if (byDevice && lun->GetName() != device) continue;
            const Uuid lunUuid = lun->GetUuid();
            if (byUuid && lunUuid != target) continue;
            uuidTexts.push_back(MeskUtil::MeskUuidToString(lunUuid));
        }

        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();
        // Asked even with a filter, though a filtered listing shows only disks with a LUN.
        std::vector<Uuid> serviceUuids;
        info->GetMeskDiskUuids(serviceUuids);
        if (!byDevice && !byUuid) {
            uuidTexts.reserve(uuidTexts.size() + serviceUuids.size());
            for (const auto& serviceUuid : serviceUuids) {
                uuidTexts.push_back(MeskUtil::MeskUuidToString(serviceUuid));
            }
        }

        // A disk with a LUN that the service also holds is listed once, in UUID text order.
        std::sort(uuidTexts.begin(), uuidTexts.end());
        uuidTexts.erase(std::unique(uuidTexts.begin(), uuidTexts.end()), uuidTexts.end());

        result->Reserve(uuidTexts.size());
        for (const auto& text : uuidTexts) {
            auto row = GetOutputStructure();
            MeskDiskInfo disk;
            info->GetDiskInfo(MeskUtil::StringToMeskUuid(text), luns, disk);
            // The record holds one name and one deduplication flag; each shows under two fields.
            auto name = MetaString::New(disk.name);
            auto deduplication = MetaBool::New(disk.deduplication);
            row->SetField(kDevice.Text(), name, MetaStruct::_docEmpty);
            row->SetField(kDisplayName.Text(), name, MetaStruct::_docEmpty);
            row->SetField(kIsSsd.Text(), MetaBool::New(disk.isSsd), MetaStruct::_docEmpty);
            row->SetField(kMeskUuid.Text(), MetaString::New(disk.meskUuid), MetaStruct::_docEmpty);
            row->SetField(kDiskGroupUuid.Text(), MetaString::New(disk.diskGroupUuid),
                          MetaStruct::_docEmpty);
            row->SetField(kDiskGroupName.Text(), MetaString::New(disk.diskGroupName),
                          MetaStruct::_docEmpty);
            row->SetField(kUsedByThisHost.Text(), MetaBool::New(disk.usedByThisHost),
                          MetaStruct::_docEmpty);
            row->SetField(kInKovra.Text(), MetaBool::New(disk.inKovra), MetaStruct::_docEmpty);
            row->SetField(kFormatVersion.Text(), MarshalVersion(disk.formatVersion),
                          MetaStruct::_docEmpty);
            row->SetField(kDeduplication.Text(), deduplication, MetaStruct::_docEmpty);
            row->SetField(kCompression.Text(), deduplication, MetaStruct::_docEmpty);
            row->SetField(kChecksum.Text(), MetaString::New(disk.checksum), MetaStruct::_docEmpty);
            row->SetField(kChecksumOk.Text(), MetaBool::New(disk.checksumOk),
                          MetaStruct::_docEmpty);
            row->SetField(kIsCapacityTier.Text(), MetaBool::New(disk.isCapacityTier),
                          MetaStruct::_docEmpty);
            row->SetField(kEncryption.Text(), MetaBool::New(disk.encryption),
                          MetaStruct::_docEmpty);
            row->SetField(kDiskKeyLoaded.Text(), MetaBool::New(disk.diskKeyLoaded),
                          MetaStruct::_docEmpty);
            result->Add(row);
        }

        if (uuidTexts.empty()) {
            if (byDevice) output->AddErrorMessage("Unable to find device with name: " + device);
            if (byUuid) output->AddErrorMessage("Unable to find device with uuid: " + uuid);
        }
    } catch (const MeskCtlException& e) {
        output->AddErrorMessage("Unable to list devices: " + e.GetMessage());
    }
    // The disks listed before a failure are still shown, and the listing counts as complete.
    output->SetRootObject(result);
    output->SetComplete();
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
