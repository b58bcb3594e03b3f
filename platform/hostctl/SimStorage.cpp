// The simulated host's answers about disks and disk groups.
#include "SimInfo.h"

namespace HostCtlSim {

namespace {

const size_t kMaxCapacityDisks = 7;

bool IsFronting(const Json& disk) {
    return disk["diskGroupUuid"] == disk["uuid"];
}
bool IsGrouped(const Json& disk) {
    return !disk["diskGroupUuid"].get<std::string>().empty();
}
std::string NameOf(const Json& disk) {
    return disk["name"].get<std::string>();
}

Json DeviceNamed(StateStore& store, const std::string& name) {
    Json disk;
    if (!store.ReadDiskByName(name, disk)) Refuse("Unknown disk: " + Quoted(name));
    return disk;
}

Json DiskWithUuid(StateStore& store, const std::string& text) {
    if (!IsUuidText(text)) Refuse("Invalid UUID: " + Quoted(text));
    Json disk;
    if (!store.ReadDisk(LowerCase(text), disk)) Refuse("No Mesk disk with UUID " + text);
    return disk;
}

Json GroupedDisk(StateStore& store, const std::string& name) {
    Json disk = DeviceNamed(store, name);
    if (!IsGrouped(disk)) Refuse("Disk " + Quoted(name) + " is not in use by Mesk");
    return disk;
}

Json FrontingSsd(StateStore& store, const std::string& name) {
    Json disk = GroupedDisk(store, name);
    if (!IsFronting(disk)) {
        Refuse("Disk " + Quoted(name) + " is not the fronting SSD of a disk group");
    }
    return disk;
}

void CheckEvacuationMode(const std::string& mode) {
    if (mode.empty() || mode == "EnsureObjectAccessibility" || mode == "EvacuateAllData" ||
        mode == "NoAction") {
        return;
    }
    Refuse("Invalid evacuation mode: " + Quoted(mode));
}

// Gives the disk back to the host; a disk that the host has no device for is forgotten.
void Release(StateStore& store, Json disk) {
    if (!disk["lun"].get<bool>()) {
        store.DeleteDisk(disk["uuid"]);
        return;
    }
    disk["diskGroupUuid"] = "";
    disk["diskGroupName"] = "";
    disk["usedByThisHost"] = false;
    disk["inKovra"] = false;
    disk["formatVersion"] = 0;
    disk["deduplication"] = false;
    disk["checksum"] = "";
    disk["checksumOk"] = false;
    disk["isCapacityTier"] = false;
    disk["encryption"] = false;
    disk["diskKeyLoaded"] = false;
    disk["mounted"] = false;
    store.UpdateDisk(disk);
}

void Claim(Json& disk, const std::string& groupUuid, const std::string& groupName,
           bool capacityTier) {
    disk["diskGroupUuid"] = groupUuid;
    disk["diskGroupName"] = groupName;
    disk["usedByThisHost"] = true;
    disk["inKovra"] = true;
    disk["formatVersion"] = 5;
    disk["checksum"] = "0";
    disk["checksumOk"] = true;
    disk["isCapacityTier"] = capacityTier;
    disk["mounted"] = true;
}

void ReleaseDisk(StateStore& store, const Json& disk) {
    if (IsFronting(disk)) {
        Refuse("Disk " + Quoted(NameOf(disk)) +
               " is the fronting SSD of a disk group; remove the disk group instead");
    }
    Release(store, disk);
}

void ReleaseGroup(StateStore& store, const Json& ssd) {
    for (const Json& disk : store.ReadDiskGroup(ssd["diskGroupUuid"])) Release(store, disk);
}

void SetMounted(StateStore& store, Json disk, bool mounted) {
    disk["mounted"] = mounted;
    store.UpdateDisk(disk);
}

void SetGroupMounted(StateStore& store, const Json& ssd, bool mounted) {
    for (const Json& disk : store.ReadDiskGroup(ssd["diskGroupUuid"])) {
        SetMounted(store, disk, mounted);
    }
}

// Fills a disk information record straight from a disk's stored JSON text, without building
// a document: a listing reads thousands of records, and a document's allocations cost more
// than the parse itself. Only the record's own top-level keys are read.
class DiskInfoReader : public nlohmann::json_sax<Json> {
  public:
    explicit DiskInfoReader(MeskDiskInfo& info) : info_(info) {}

    bool key(string_t& key) override {
        if (depth_ == 1) key_.swap(key);
        return true;
    }
    bool string(string_t& value) override {
        if (depth_ != 1) return true;
        if (key_ == "name") {
            info_.name.swap(value);
        } else if (key_ == "uuid") {
            info_.meskUuid.swap(value);
        } else if (key_ == "diskGroupUuid") {
            info_.diskGroupUuid.swap(value);
        } else if (key_ == "diskGroupName") {
            info_.diskGroupName.swap(value);
        } else if (key_ == "checksum") {
            info_.checksum.swap(value);
        }
        return true;
    }
    bool boolean(bool value) override {
        if (depth_ != 1) return true;
        static const std::pair<const char*, bool MeskDiskInfo::*> kFlags[] = {
            {"isSsd", &MeskDiskInfo::isSsd},
            {"usedByThisHost", &MeskDiskInfo::usedByThisHost},
            {"inKovra", &MeskDiskInfo::inKovra},
            {"deduplication", &MeskDiskInfo::deduplication},
            {"checksumOk", &MeskDiskInfo::checksumOk},
            {"isCapacityTier", &MeskDiskInfo::isCapacityTier},
            {"encryption", &MeskDiskInfo::encryption},
            {"diskKeyLoaded", &MeskDiskInfo::diskKeyLoaded},
            {"mounted", &MeskDiskInfo::isMounted},
            {"capacityFlashTag", &MeskDiskInfo::capacityFlashTag},
        };
        for (const auto& flag : kFlags) {
            if (key_ == flag.first) {
                info_.*flag.second = value;
                break;
            }
        }
        return true;
    }
    bool number_integer(number_integer_t value) override {
        if (depth_ == 1 && key_ == "formatVersion") info_.formatVersion = int32_t(value);
        return true;
    }
    bool number_unsigned(number_unsigned_t value) override {
        if (depth_ != 1) return true;
        if (key_ == "formatVersion") info_.formatVersion = int32_t(value);
        if (key_ == "capacityBytes") info_.capacityBytes = value;
        return true;
    }
    bool number_float(number_float_t, const string_t&) override { return true; }
    bool null() override { return true; }
    bool binary(binary_t&) override { return true; }
    bool start_object(std::size_t) override {
        ++depth_;
        return true;
    }
    bool end_object() override {
        --depth_;
        return true;
    }
    bool start_array(std::size_t) override {
        ++depth_;
        return true;
    }
    bool end_array() override {
        --depth_;
        return true;
    }
    bool parse_error(std::size_t, const std::string&, const nlohmann::detail::exception&) override {
        return false;
    }

  private:
    MeskDiskInfo& info_;
    int depth_ = 0;
    std::string key_;
};

class SimLun : public MeskDiskLun {
  public:
    SimLun(std::string name, const Uuid& uuid) : name_(std::move(name)), uuid_(uuid) {}
    Uuid GetUuid() const override { return uuid_; }
    std::string GetName() const override { return name_; }

  private:
    std::string name_;
    Uuid uuid_;
};

void Tag(SimHost& host, const std::string& name, bool tagged) {
    host.Modify([&](StateStore& store) {
        Json disk = DeviceNamed(store, name);
        if (!disk["isSsd"].get<bool>()) {
            Refuse("Disk " + Quoted(name) + " is not an SSD; only an SSD can be tagged " +
                   "for capacity flash");
        }
        if (IsGrouped(disk)) Refuse("Disk " + Quoted(name) + " is in use by Mesk");
        disk["capacityFlashTag"] = tagged;
        store.UpdateDisk(disk);
    });
}

}  // namespace

void SimInfo::GetMeskDiskUuids(std::vector<Uuid>& uuids) {
    Serve(host_, Operation::GetMeskDiskUuids, Json::array(), [&] {
        uuids.clear();
        for (const std::string& text : Store().ReadGroupedDiskUuids()) {
            uuids.push_back(host_.HostBackend::StringToMeskUuid(text));
        }
    });
}

void SimInfo::GetDiskInfo(const Uuid& uuid, const std::vector<std::shared_ptr<MeskDiskLun>>& luns,
                          MeskDiskInfo& info) {
    std::string text = host_.HostBackend::MeskUuidToString(uuid);
    Serve(host_, Operation::GetDiskInfo, Json::array({text, luns.size()}), [&] {
        std::string record;
        if (!Store().ReadDiskRecord(text, record)) Refuse("No Mesk disk with UUID " + text);
        DiskInfoReader reader(info);
        if (!Json::sax_parse(record, &reader)) {
            // Not JSON: reading it as a document throws the parser's own error.
            Json document = Json::parse(record);
            static_cast<void>(document);
        }
    });
}

void SimInfo::AddDisks(const std::string& ssd, const std::vector<std::string>& disks) {
    Serve(host_, Operation::AddDisks, Json::array({ssd, disks}), [&] {
        host_.Modify([&](StateStore& store) {
            Json cache = DeviceNamed(store, ssd);
            if (!cache["isSsd"].get<bool>()) Refuse("Disk " + Quoted(ssd) + " is not an SSD");
            if (disks.empty()) Refuse("No capacity disk given for the disk group");
            size_t members = 0;
            if (IsGrouped(cache)) {
                if (!IsFronting(cache)) {
                    Refuse("Disk " + Quoted(ssd) + " is a capacity disk of a disk group");
                }
                members = store.ReadDiskGroup(cache["uuid"]).size() - 1;
            } else {
                Claim(cache, cache["uuid"], ssd, false);
                store.UpdateDisk(cache);
            }
            if (members + disks.size() > kMaxCapacityDisks) {
                Refuse("A disk group holds at most " + std::to_string(kMaxCapacityDisks) +
                       " capacity disks");
            }
            for (const std::string& name : disks) {
                Json disk = DeviceNamed(store, name);
                if (IsGrouped(disk)) Refuse("Disk " + Quoted(name) + " is already in use by Mesk");
                if (disk["isSsd"].get<bool>() && !disk["capacityFlashTag"].get<bool>()) {
                    Refuse("Disk " + Quoted(name) +
                           " is an SSD without the capacityFlash tag and cannot be a "
                           "capacity disk");
                }
                Claim(disk, cache["uuid"], cache["diskGroupName"], true);
                store.UpdateDisk(disk);
            }
        });
    });
}

void SimInfo::RemoveDisk(const std::string& disk, const std::string& evacuationMode) {
    Serve(host_, Operation::RemoveDisk, Json::array({disk, evacuationMode}), [&] {
        CheckEvacuationMode(evacuationMode);
        host_.Modify([&](StateStore& store) { ReleaseDisk(store, GroupedDisk(store, disk)); });
    });
}

void SimInfo::RemoveDiskGroup(const std::string& ssd, const std::string& evacuationMode) {
    Serve(host_, Operation::RemoveDiskGroup, Json::array({ssd, evacuationMode}), [&] {
        CheckEvacuationMode(evacuationMode);
        host_.Modify([&](StateStore& store) { ReleaseGroup(store, FrontingSsd(store, ssd)); });
    });
}

void SimInfo::RemoveDiskByUuid(const std::string& uuid, const std::string& evacuationMode) {
    Serve(host_, Operation::RemoveDiskByUuid, Json::array({uuid, evacuationMode}), [&] {
        CheckEvacuationMode(evacuationMode);
        host_.Modify([&](StateStore& store) {
            Json disk = DiskWithUuid(store, uuid);
            if (!IsGrouped(disk)) Refuse("Disk " + uuid + " is not in use by Mesk");
            if (IsFronting(disk)) {
                ReleaseGroup(store, disk);
            } else {
                Release(store, disk);
            }
        });
    });
}

void SimInfo::MountDiskGroup(const std::string& ssd, bool flag) {
    Serve(host_, Operation::MountDiskGroup, Json::array({ssd, flag}), [&] {
        host_.Modify(
            [&](StateStore& store) { SetGroupMounted(store, FrontingSsd(store, ssd), true); });
    });
}

void SimInfo::MountByUuid(const std::string& uuid) {
    Serve(host_, Operation::MountByUuid, Json::array({uuid}), [&] {
        host_.Modify([&](StateStore& store) {
            Json disk = DiskWithUuid(store, uuid);
            if (!IsGrouped(disk)) Refuse("Disk " + uuid + " is not in use by Mesk");
            if (IsFronting(disk)) {
                SetGroupMounted(store, disk, true);
            } else {
                SetMounted(store, disk, true);
            }
        });
    });
}

void SimInfo::MountDisk(const std::string& disk) {
    Serve(host_, Operation::MountDisk, Json::array({disk}), [&] {
        host_.Modify([&](StateStore& store) { SetMounted(store, GroupedDisk(store, disk), true); });
    });
}

void SimInfo::UnmountDiskGroup(const std::string& ssd, bool flag) {
    Serve(host_, Operation::UnmountDiskGroup, Json::array({ssd, flag}), [&] {
        host_.Modify(
            [&](StateStore& store) { SetGroupMounted(store, FrontingSsd(store, ssd), false); });
    });
}

void SimInfo::UnmountDisk(const std::string& disk, bool flag) {
    Serve(host_, Operation::UnmountDisk, Json::array({disk, flag}), [&] {
        host_.Modify(
            [&](StateStore& store) { SetMounted(store, GroupedDisk(store, disk), false); });
    });
}

void SimInfo::AddCapacityFlashTag(const std::string& disk) {
    Serve(host_, Operation::AddCapacityFlashTag, Json::array({disk}),
          [&] { Tag(host_, disk, true); });
}

void SimInfo::RemoveCapacityFlashTag(const std::string& disk) {
    Serve(host_, Operation::RemoveCapacityFlashTag, Json::array({disk}),
          [&] { Tag(host_, disk, false); });
}

bool SimInfo::GetAutoClaimMode() {
    return Serve(host_, Operation::GetAutoClaimMode, Json::array(),
                 [&] { return Store().ReadSection("storage")["autoClaimMode"].get<bool>(); });
}

void SimInfo::SetAutoClaimMode(bool enabled) {
    Serve(host_, Operation::SetAutoClaimMode, Json::array({enabled}),
          [&] { SetValue("storage", "autoClaimMode", enabled); });
}

void SimHost::GetMeskDisks(std::vector<std::shared_ptr<MeskDiskLun>>& luns) {
    Serve(*this, Operation::GetMeskDisks, Json::array(), [&] {
        std::vector<StateStore::Lun> rows = Store().ReadLuns();
        luns.reserve(luns.size() + rows.size());
        for (const auto& row : rows) {
            luns.push_back(
                std::make_shared<SimLun>(row.name, HostBackend::StringToMeskUuid(row.uuid)));
        }
    });
}

}  // namespace HostCtlSim
