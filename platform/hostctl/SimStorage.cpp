// The simulated host's answers about disks and disk groups.
#include <algorithm>
#include <string_view>

#include "SimInfo.h"
#include "UuidText.h"

namespace HostCtlSim {

namespace {

const size_t kMaxCapacityDisks = 7;

bool IsFronting(const Disk& disk) {
    return disk.diskGroupUuid == disk.uuid;
}
bool IsGrouped(const Disk& disk) {
    return !disk.diskGroupUuid.empty();
}

Disk DeviceNamed(StateStore& store, const std::string& name) {
    const Disk* disk = store.FindDevice(name);
    if (disk == nullptr) Refuse("Unknown disk: " + Quoted(name));
    return *disk;
}

Disk DiskWithUuid(StateStore& store, const std::string& text) {
    if (!IsUuidText(text)) Refuse("Invalid UUID: " + Quoted(text));
    const Disk* disk = store.FindDisk(LowerCase(text));
    if (disk == nullptr) Refuse("No Mesk disk with UUID " + text);
    return *disk;
}

Disk GroupedDisk(StateStore& store, const std::string& name) {
    Disk disk = DeviceNamed(store, name);
    if (!IsGrouped(disk)) Refuse("Disk " + Quoted(name) + " is not in use by Mesk");
    return disk;
}

Disk FrontingSsd(StateStore& store, const std::string& name) {
    Disk disk = GroupedDisk(store, name);
    if (!IsFronting(disk)) {
        Refuse("Disk " + Quoted(name) + " is not the fronting SSD of a disk group");
    }
    return disk;
}

// The disks of the group that `ssd` fronts, the SSD included, in inventory order.
std::vector<Disk> GroupOf(StateStore& store, const Disk& ssd) {
    std::vector<Disk> group;
    for (const Disk& disk : store.Disks()) {
        if (disk.diskGroupUuid == ssd.diskGroupUuid) group.push_back(disk);
    }
    return group;
}

void CheckEvacuationMode(const std::string& mode) {
    if (mode.empty() || mode == "EnsureObjectAccessibility" || mode == "EvacuateAllData" ||
        mode == "NoAction") {
        return;
    }
    Refuse("Invalid evacuation mode: " + Quoted(mode));
}

// Gives the disk back to the host; a disk that the host has no device for is forgotten.
void Release(StateStore& store, const Disk& disk) {
    if (!disk.lun) {
        store.DeleteDisk(disk.uuid);
        return;
    }
    Disk released;
    released.name = disk.name;
    released.uuid = disk.uuid;
    released.isSsd = disk.isSsd;
    released.capacityBytes = disk.capacityBytes;
    released.capacityFlashTag = disk.capacityFlashTag;
    store.WriteDisk(released);
}

void Claim(Disk& disk, const std::string& groupUuid, const std::string& groupName,
           bool capacityTier) {
    disk.diskGroupUuid = groupUuid;
    disk.diskGroupName = groupName;
    disk.usedByThisHost = true;
    disk.inKovra = true;
    disk.formatVersion = 5;
    disk.checksum = "0";
    disk.checksumOk = true;
    disk.isCapacityTier = capacityTier;
    disk.mounted = true;
}

void ReleaseDisk(StateStore& store, const Disk& disk) {
    if (IsFronting(disk)) {
        Refuse("Disk " + Quoted(disk.name) +
               " is the fronting SSD of a disk group; remove the disk group instead");
    }
    Release(store, disk);
}

void ReleaseGroup(StateStore& store, const Disk& ssd) {
    for (const Disk& disk : GroupOf(store, ssd)) Release(store, disk);
}

void SetMounted(StateStore& store, Disk disk, bool mounted) {
    disk.mounted = mounted;
    store.WriteDisk(disk);
}

void SetGroupMounted(StateStore& store, const Disk& ssd, bool mounted) {
    for (const Disk& disk : GroupOf(store, ssd)) SetMounted(store, disk, mounted);
}

class SimLun : public MeskDiskLun {
  public:
    SimLun(std::string_view name, const Uuid& uuid) : name_(name), uuid_(uuid) {}
    Uuid GetUuid() const override { return uuid_; }
    std::string GetName() const override { return std::string(name_); }

  private:
    std::string_view name_;  // in its listing's names
    Uuid uuid_;
};

// The LUNs of one GetMeskDisks, made in two allocations however many there are: each LUN
// handed out shares the ownership of the whole listing.
struct LunListing {
    std::string names;  // every LUN's name, one after the other
    std::vector<SimLun> luns;
};

// The UUID of store.Disks()[i]; throws for a disk whose text is not a UUID.
Uuid UuidOfDisk(SimHost& host, StateStore& store, size_t i) {
    const Uuid& uuid = store.DiskUuids()[i];
    if (uuid != Uuid()) return uuid;
    return host.HostBackend::StringToMeskUuid(store.Disks()[i].uuid);
}

void Tag(SimHost& host, const std::string& name, bool tagged) {
    host.Modify([&](StateStore& store) {
        Disk disk = DeviceNamed(store, name);
        if (!disk.isSsd) {
            Refuse("Disk " + Quoted(name) + " is not an SSD; only an SSD can be tagged " +
                   "for capacity flash");
        }
        if (IsGrouped(disk)) Refuse("Disk " + Quoted(name) + " is in use by Mesk");
        disk.capacityFlashTag = tagged;
        store.WriteDisk(disk);
    });
}

}  // namespace

void SimInfo::GetMeskDiskUuids(std::vector<Uuid>& uuids) {
    Serve(host_, Operation::GetMeskDiskUuids, {}, [&] {
        uuids.clear();
        const std::vector<Disk>& disks = Store().Disks();
        uuids.reserve(size_t(std::count_if(disks.begin(), disks.end(), IsGrouped)));
        for (size_t i = 0; i < disks.size(); ++i) {
            if (IsGrouped(disks[i])) uuids.push_back(UuidOfDisk(host_, Store(), i));
        }
    });
}

void SimInfo::GetDiskInfo(const Uuid& uuid, const std::vector<std::shared_ptr<MeskDiskLun>>& luns,
                          MeskDiskInfo& info) {
    char text[37];
    FormatUuid(uuid, text);
    Serve(host_, Operation::GetDiskInfo, {CallArg::Plain({text, 36}), luns.size()}, [&] {
        const Disk* disk = Store().FindDisk(uuid);
        if (disk == nullptr) Refuse(std::string("No Mesk disk with UUID ") + text);
        info.name = disk->name;
        info.isSsd = disk->isSsd;
        info.meskUuid = disk->uuid;
        info.diskGroupUuid = disk->diskGroupUuid;
        info.diskGroupName = disk->diskGroupName;
        info.usedByThisHost = disk->usedByThisHost;
        info.inKovra = disk->inKovra;
        info.formatVersion = static_cast<int32_t>(disk->formatVersion);
        info.deduplication = disk->deduplication;
        info.checksum = disk->checksum;
        info.checksumOk = disk->checksumOk;
        info.isCapacityTier = disk->isCapacityTier;
        info.encryption = disk->encryption;
        info.diskKeyLoaded = disk->diskKeyLoaded;
        info.capacityBytes = disk->capacityBytes;
        info.isMounted = disk->mounted;
        info.capacityFlashTag = disk->capacityFlashTag;
    });
}

void SimInfo::AddDisks(const std::string& ssd, const std::vector<std::string>& disks) {
    Serve(host_, Operation::AddDisks, {ssd, disks}, [&] {
        host_.Modify([&](StateStore& store) {
            Disk cache = DeviceNamed(store, ssd);
            if (!cache.isSsd) Refuse("Disk " + Quoted(ssd) + " is not an SSD");
            if (disks.empty()) Refuse("No capacity disk given for the disk group");
            size_t members = 0;
            if (IsGrouped(cache)) {
                if (!IsFronting(cache)) {
                    Refuse("Disk " + Quoted(ssd) + " is a capacity disk of a disk group");
                }
                members = GroupOf(store, cache).size() - 1;
            } else {
                Claim(cache, cache.uuid, ssd, false);
                store.WriteDisk(cache);
            }
            if (members + disks.size() > kMaxCapacityDisks) {
                Refuse("A disk group holds at most " + std::to_string(kMaxCapacityDisks) +
                       " capacity disks");
            }
            for (auto name = disks.begin(); name != disks.end(); ++name) {
                if (std::find(disks.begin(), name, *name) != name) {
                    Refuse("Disk " + Quoted(*name) + " is given more than once");
                }
            }
            for (const std::string& name : disks) {
                Disk disk = DeviceNamed(store, name);
                if (IsGrouped(disk)) Refuse("Disk " + Quoted(name) + " is already in use by Mesk");
                if (disk.isSsd && !disk.capacityFlashTag) {
                    Refuse("Disk " + Quoted(name) +
                           " is an SSD without the capacityFlash tag and cannot be a "
                           "capacity disk");
                }
                Claim(disk, cache.uuid, cache.diskGroupName, true);
                store.WriteDisk(disk);
            }
        });
    });
}

void SimInfo::RemoveDisk(const std::string& disk, const std::string& evacuationMode) {
    Serve(host_, Operation::RemoveDisk, {disk, evacuationMode}, [&] {
        CheckEvacuationMode(evacuationMode);
        host_.Modify([&](StateStore& store) { ReleaseDisk(store, GroupedDisk(store, disk)); });
    });
}

void SimInfo::RemoveDiskGroup(const std::string& ssd, const std::string& evacuationMode) {
    Serve(host_, Operation::RemoveDiskGroup, {ssd, evacuationMode}, [&] {
        CheckEvacuationMode(evacuationMode);
        host_.Modify([&](StateStore& store) { ReleaseGroup(store, FrontingSsd(store, ssd)); });
    });
}

void SimInfo::RemoveDiskByUuid(const std::string& uuid, const std::string& evacuationMode) {
    Serve(host_, Operation::RemoveDiskByUuid, {uuid, evacuationMode}, [&] {
        CheckEvacuationMode(evacuationMode);
        host_.Modify([&](StateStore& store) {
            Disk disk = DiskWithUuid(store, uuid);
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
    Serve(host_, Operation::MountDiskGroup, {ssd, flag}, [&] {
        host_.Modify(
            [&](StateStore& store) { SetGroupMounted(store, FrontingSsd(store, ssd), true); });
    });
}

void SimInfo::MountByUuid(const std::string& uuid) {
    Serve(host_, Operation::MountByUuid, {uuid}, [&] {
        host_.Modify([&](StateStore& store) {
            Disk disk = DiskWithUuid(store, uuid);
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
    Serve(host_, Operation::MountDisk, {disk}, [&] {
        host_.Modify([&](StateStore& store) { SetMounted(store, GroupedDisk(store, disk), true); });
    });
}

void SimInfo::UnmountDiskGroup(const std::string& ssd, bool flag) {
    Serve(host_, Operation::UnmountDiskGroup, {ssd, flag}, [&] {
        host_.Modify(
            [&](StateStore& store) { SetGroupMounted(store, FrontingSsd(store, ssd), false); });
    });
}

void SimInfo::UnmountDisk(const std::string& disk, bool flag) {
    Serve(host_, Operation::UnmountDisk, {disk, flag}, [&] {
        host_.Modify(
            [&](StateStore& store) { SetMounted(store, GroupedDisk(store, disk), false); });
    });
}

void SimInfo::AddCapacityFlashTag(const std::string& disk) {
    Serve(host_, Operation::AddCapacityFlashTag, {disk}, [&] { Tag(host_, disk, true); });
}

void SimInfo::RemoveCapacityFlashTag(const std::string& disk) {
    Serve(host_, Operation::RemoveCapacityFlashTag, {disk}, [&] { Tag(host_, disk, false); });
}

bool SimInfo::GetAutoClaimMode() {
    return Serve(host_, Operation::GetAutoClaimMode, {},
                 [&] { return Store().ReadSection("storage")["autoClaimMode"].get<bool>(); });
}

void SimInfo::SetAutoClaimMode(bool enabled) {
    Serve(host_, Operation::SetAutoClaimMode, {enabled},
          [&] { SetValue("storage", "autoClaimMode", enabled); });
}

void SimHost::GetMeskDisks(std::vector<std::shared_ptr<MeskDiskLun>>& luns) {
    Serve(*this, Operation::GetMeskDisks, {}, [&] {
        const std::vector<Disk>& disks = Store().Disks();
        auto listing = std::make_shared<LunListing>();
        size_t count = 0, bytes = 0;
        for (const Disk& disk : disks) {
            count += disk.lun;
            bytes += disk.lun ? disk.name.size() : 0;
        }
        // Reserved whole, so that the names the LUNs point at stay where they are.
        listing->names.reserve(bytes);
        listing->luns.reserve(count);
        for (size_t i = 0; i < disks.size(); ++i) {
            if (!disks[i].lun) continue;
            listing->names += disks[i].name;
            std::string_view name(listing->names);
            listing->luns.emplace_back(name.substr(name.size() - disks[i].name.size()),
                                       UuidOfDisk(*this, Store(), i));
        }
        luns.reserve(luns.size() + count);
        for (SimLun& lun : listing->luns) luns.emplace_back(listing, &lun);
    });
}

}  // namespace HostCtlSim
