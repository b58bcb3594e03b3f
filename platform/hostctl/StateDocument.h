// The simulated host's state as one JSON document: the form that `hostsim show` prints and
// `hostsim load` reads, and from which a fresh host is made.
#pragma once

#include <nlohmann/json.hpp>

#include <cstdint>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

namespace HostCtlSim {

// Objects keep their keys in insertion order, so that a document prints in a stable order.
using Json = nlohmann::ordered_json;

// A document that does not describe a host; the message names the offending key.
class DocumentError : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

// The deepest nesting of arrays and objects that a host document or merge patch may have: a
// host needs 4 levels. Deeper input is refused before anything walks it, since copying,
// merging and printing a document recurse once per level and would run out of stack.
constexpr int kMaxDocumentDepth = 64;

// Parses the text of a host document or merge patch. Returns a discarded value when the text
// is not JSON; throws DocumentError when it is nested deeper than kMaxDocumentDepth.
Json ParseDocument(std::string_view text);

// The version of the document's keys, kept in the state beside them: raised whenever a key
// is added, so that a state written before gets the new keys' defaults when it is opened.
// Version 1: every state written before the version was kept.
constexpr int64_t kDocumentVersion = 1;

// Adds to the objects of `document` every key of `defaults` that they lack, with its default
// value (arrays are taken as they are); returns the added keys' paths ("cluster.witness").
std::vector<std::string> AddMissingKeys(Json& document, const Json& defaults,
                                        const std::string& path = "");

// The state of a fresh host: not in a cluster, one SSD and three HDDs unclaimed, no
// interfaces, no agents, no default policies, the tracing service running.
Json DefaultHost();

// A host in a cluster with `luns` disks claimed into disk groups of one SSD and up to seven
// HDDs, `agents` unicast agents and `nics` interfaces.
Json PopulatedHost(int64_t luns, int64_t agents, int64_t nics);

// Checks every key and value of `document` and returns it in canonical form: keys in their
// fixed order, UUIDs of disks and of the cluster in lower case. Throws DocumentError.
Json NormalizeHost(const Json& document);

// One interface record of the document ("network.interfaces"), canonical.
Json NormalizeInterface(const Json& record, const std::string& path);

// A disk of the inventory ("storage.disks"). A new disk is unclaimed and has a device.
struct Disk {
    std::string name;  // its device name
    std::string uuid;
    bool lun = true;
    bool isSsd = false;
    uint64_t capacityBytes = 0;
    std::string diskGroupUuid;  // the fronting SSD's UUID; "" for an unclaimed disk
    std::string diskGroupName;
    bool usedByThisHost = false;
    bool inKovra = false;
    int64_t formatVersion = 0;  // a 32-bit value
    bool deduplication = false;
    std::string checksum;
    bool checksumOk = false;
    bool isCapacityTier = false;
    bool encryption = false;
    bool diskKeyLoaded = false;
    bool mounted = false;
    bool capacityFlashTag = false;
};

// What the document requires of a disk field beyond its type.
enum class DiskCheck { kNone, kUuid, kUuidOrEmpty, kInt32 };

// Calls visit(key, member, check) for each field of `disk`, in document order: the one list
// of a disk's fields, from which the document form, its checks and the state database's
// columns are made. `DiskType` is Disk or const Disk.
template <class DiskType, class Visit>
void ForEachDiskField(DiskType& disk, Visit&& visit) {
    visit("name", disk.name, DiskCheck::kNone);
    visit("uuid", disk.uuid, DiskCheck::kUuid);
    visit("lun", disk.lun, DiskCheck::kNone);
    visit("isSsd", disk.isSsd, DiskCheck::kNone);
    visit("capacityBytes", disk.capacityBytes, DiskCheck::kNone);
    visit("diskGroupUuid", disk.diskGroupUuid, DiskCheck::kUuidOrEmpty);
    visit("diskGroupName", disk.diskGroupName, DiskCheck::kNone);
    visit("usedByThisHost", disk.usedByThisHost, DiskCheck::kNone);
    visit("inKovra", disk.inKovra, DiskCheck::kNone);
    visit("formatVersion", disk.formatVersion, DiskCheck::kInt32);
    visit("deduplication", disk.deduplication, DiskCheck::kNone);
    visit("checksum", disk.checksum, DiskCheck::kNone);
    visit("checksumOk", disk.checksumOk, DiskCheck::kNone);
    visit("isCapacityTier", disk.isCapacityTier, DiskCheck::kNone);
    visit("encryption", disk.encryption, DiskCheck::kNone);
    visit("diskKeyLoaded", disk.diskKeyLoaded, DiskCheck::kNone);
    visit("mounted", disk.mounted, DiskCheck::kNone);
    visit("capacityFlashTag", disk.capacityFlashTag, DiskCheck::kNone);
}

// A disk's document form, and the disk of a normalized document's disk.
Json DiskDocument(const Disk& disk);
Disk DiskFromDocument(const Json& document);

// True iff `text` is a UUID in its 36-character text form (hexadecimal digits in either case).
bool IsUuidText(const std::string& text);
// `text` with its letters in lower case.
std::string LowerCase(std::string text);

}  // namespace HostCtlSim

namespace HostCtlSim {
// The compact JSON text of `value`; bytes that are not UTF-8 become U+FFFD instead of throwing.
inline std::string JsonText(const Json& value) {
    return value.dump(-1, ' ', false, Json::error_handler_t::replace);
}
}  // namespace HostCtlSim
