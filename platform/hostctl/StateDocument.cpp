#include "StateDocument.h"

#include <cctype>
#include <cinttypes>
#include <cstdio>
#include <limits>
#include <set>
#include <type_traits>
#include <vector>

#include "UuidText.h"
#include "hostctl/NetworkAddress.h"

namespace HostCtlSim {

namespace {

const char* const kHostNodeUuid = "5e1f0c2d-6a7b-4c8d-9e0f-112233445566";
const char* const kPolicyClasses[] = {"cluster", "vdisk", "vmnamespace", "vmswap", "vmem"};
const uint64_t kGiB = uint64_t{1} << 30;

// Reads the keys of one object of the document, each with its expected type, and refuses
// keys that it was not asked for.
class Reader {
  public:
    Reader(const Json& value, std::string path) : value_(value), path_(std::move(path)) {
        if (!value_.is_object()) Fail(path_, "expected an object");
    }

    bool Bool(const char* key) {
        const Json& v = At(key);
        if (!v.is_boolean()) Fail(Path(key), "expected true or false");
        return v.get<bool>();
    }

    int64_t Int(const char* key, int64_t lowest, int64_t highest) {
        const Json& v = At(key);
        if (!v.is_number_integer() ||
            (v.is_number_unsigned() &&
             v.get<uint64_t>() > uint64_t(std::numeric_limits<int64_t>::max()))) {
            Fail(Path(key), "expected an integer");
        }
        int64_t n = v.get<int64_t>();
        if (n < lowest || n > highest) {
            Fail(Path(key), "expected an integer from " + std::to_string(lowest) + " to " +
                                std::to_string(highest));
        }
        return n;
    }

    uint64_t Unsigned(const char* key) {
        const Json& v = At(key);
        if (!v.is_number_unsigned()) Fail(Path(key), "expected an integer of at least 0");
        return v.get<uint64_t>();
    }

    std::string Text(const char* key) {
        const Json& v = At(key);
        if (!v.is_string()) Fail(Path(key), "expected a text");
        return v.get<std::string>();
    }

    // A UUID text, returned in lower case; the empty text too when `emptyAllowed`.
    std::string Uuid(const char* key, bool emptyAllowed) {
        std::string text = Text(key);
        if (text.empty() && emptyAllowed) return text;
        if (!IsUuidText(text)) {
            Fail(Path(key), "expected a UUID (nnnnnnnn-nnnn-nnnn-nnnn-nnnnnnnnnnnn)" +
                                std::string(emptyAllowed ? " or an empty text" : "") + ", got '" +
                                text + "'");
        }
        return LowerCase(text);
    }

    std::string Ipv4(const char* key) {
        std::string text = Text(key);
        if (!HostCtl::Network::Ipv4Address::IsValidAddress(text)) {
            Fail(Path(key), "expected an IPv4 address, got '" + text + "'");
        }
        return text;
    }

    std::string Ipv6(const char* key) {
        std::string text = Text(key);
        if (!HostCtl::Network::Ipv6Address::IsValidAddress(text)) {
            Fail(Path(key), "expected an IPv6 address, got '" + text + "'");
        }
        return text;
    }

    const Json& Array(const char* key) {
        const Json& v = At(key);
        if (!v.is_array()) Fail(Path(key), "expected an array");
        return v;
    }

    Reader Object(const char* key) { return Reader(At(key), Path(key)); }

    std::string Path(const std::string& key) const {
        return path_.empty() ? key : path_ + "." + key;
    }

    // Refuses any key that was not read.
    void Done() const {
        for (auto it = value_.begin(); it != value_.end(); ++it) {
            if (!read_.count(it.key())) Fail(Path(it.key()), "unknown key");
        }
    }

    [[noreturn]] static void Fail(const std::string& path, const std::string& message) {
        throw DocumentError(path + ": " + message);
    }

  private:
    const Json& At(const char* key) {
        auto it = value_.find(key);
        if (it == value_.end()) Fail(Path(key), "missing");
        read_.insert(key);
        return *it;
    }

    const Json& value_;
    std::string path_;
    std::set<std::string> read_;
};

std::string Indexed(const std::string& path, size_t index) {
    return path + "[" + std::to_string(index) + "]";
}

Json NormalizeDisk(const Json& value, const std::string& path) {
    Reader r(value, path);
    Disk disk;
    ForEachDiskField(disk, [&](const char* key, auto& member, DiskCheck check) {
        using Type = std::decay_t<decltype(member)>;
        if constexpr (std::is_same_v<Type, std::string>) {
            member = check == DiskCheck::kNone ? r.Text(key)
                                               : r.Uuid(key, check == DiskCheck::kUuidOrEmpty);
        } else if constexpr (std::is_same_v<Type, bool>) {
            member = r.Bool(key);
        } else if constexpr (std::is_same_v<Type, uint64_t>) {
            member = r.Unsigned(key);
        } else {
            member = r.Int(key, std::numeric_limits<int32_t>::min(),
                           std::numeric_limits<int32_t>::max());
        }
    });
    r.Done();
    return DiskDocument(disk);
}

Json NormalizeInterfaces(const Json& list, const std::string& path) {
    Json out = Json::array();
    std::set<std::string> names;
    for (size_t i = 0; i < list.size(); ++i) {
        Json nic = NormalizeInterface(list[i], Indexed(path, i));
        if (!names.insert(nic["name"].get<std::string>()).second) {
            Reader::Fail(Indexed(path, i) + ".name", "a second interface of that name");
        }
        out.push_back(std::move(nic));
    }
    return out;
}

Json DiskRecord(const std::string& name, const std::string& uuid, bool ssd, uint64_t bytes) {
    Disk disk;
    disk.name = name;
    disk.uuid = uuid;
    disk.isSsd = ssd;
    disk.capacityBytes = bytes;
    return DiskDocument(disk);
}

// A fixed, valid UUID text made from a prefix of 8 hex digits and a number.
std::string NumberedUuid(const char* prefix, uint64_t number) {
    char text[64];
    std::snprintf(text, sizeof text, "%.8s-0000-4000-8000-%012" PRIx64, prefix,
                  number & 0xffffffffffffu);
    return text;
}

}  // namespace

Json ParseDocument(std::string_view text) {
    // Brackets are counted outside strings only; the parser refuses what is not JSON.
    int depth = 0;
    bool inString = false;
    for (size_t i = 0; i < text.size(); ++i) {
        char c = text[i];
        if (inString) {
            if (c == '\\') {
                ++i;
            } else if (c == '"') {
                inString = false;
            }
        } else if (c == '"') {
            inString = true;
        } else if ((c == '[' || c == '{') && ++depth > kMaxDocumentDepth) {
            throw DocumentError("nested deeper than " + std::to_string(kMaxDocumentDepth) +
                                " levels of arrays and objects");
        } else if (c == ']' || c == '}') {
            --depth;
        }
    }
    return Json::parse(text, nullptr, false);
}

std::vector<std::string> AddMissingKeys(Json& document, const Json& defaults,
                                        const std::string& path) {
    std::vector<std::string> added;
    if (!document.is_object() || !defaults.is_object()) return added;
    for (auto it = defaults.begin(); it != defaults.end(); ++it) {
        std::string key = path.empty() ? it.key() : path + "." + it.key();
        if (!document.contains(it.key())) {
            document[it.key()] = it.value();
            added.push_back(key);
        } else {
            for (auto& inner : AddMissingKeys(document[it.key()], it.value(), key)) {
                added.push_back(std::move(inner));
            }
        }
    }
    return added;
}

Json DiskDocument(const Disk& disk) {
    Json document;
    ForEachDiskField(
        disk, [&](const char* key, const auto& member, DiskCheck) { document[key] = member; });
    return document;
}

Disk DiskFromDocument(const Json& document) {
    Disk disk;
    ForEachDiskField(
        disk, [&](const char* key, auto& member, DiskCheck) { document.at(key).get_to(member); });
    return disk;
}

bool IsUuidText(const std::string& text) {
    HostCtl::Mesk::Uuid uuid;
    return ParseUuid(text.data(), text.size(), uuid);
}

std::string LowerCase(std::string text) {
    for (char& c : text) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
    return text;
}

Json NormalizeInterface(const Json& value, const std::string& path) {
    Reader r(value, path);
    Json n;
    n["name"] = r.Text("name");
    n["uuid"] = r.Text("uuid");
    n["agentGroup"] = r.Ipv4("agentGroup");
    n["agentV6Group"] = r.Ipv6("agentV6Group");
    n["masterGroup"] = r.Ipv4("masterGroup");
    n["masterV6Group"] = r.Ipv6("masterV6Group");
    const int64_t lowest = std::numeric_limits<int32_t>::min();
    const int64_t highest = std::numeric_limits<int32_t>::max();
    n["agentPort"] = r.Int("agentPort", lowest, highest);
    n["masterPort"] = r.Int("masterPort", lowest, highest);
    n["unicastPort"] = r.Int("unicastPort", lowest, highest);
    n["ttl"] = r.Int("ttl", lowest, highest);
    n["meskTraffic"] = r.Bool("meskTraffic");
    n["witnessTraffic"] = r.Bool("witnessTraffic");
    n["options"] = r.Text("options");
    r.Done();
    return n;
}

Json NormalizeHost(const Json& document) {
    Reader top(document, "");
    Json out;

    Reader host = top.Object("host");
    out["host"]["nodeUuid"] = host.Uuid("nodeUuid", false);
    out["host"]["hostname"] = host.Text("hostname");
    host.Done();

    Reader cluster = top.Object("cluster");
    Json& c = out["cluster"];
    c["enabled"] = cluster.Bool("enabled");
    c["uuid"] = cluster.Uuid("uuid", true);
    c["witness"] = cluster.Bool("witness");
    c["stretched"] = cluster.Bool("stretched");
    Reader preferred = cluster.Object("preferredFaultDomain");
    c["preferredFaultDomain"]["name"] = preferred.Text("name");
    c["preferredFaultDomain"]["id"] = preferred.Text("id");
    preferred.Done();
    c["unicastMode"] = cluster.Bool("unicastMode");
    Reader generation = cluster.Object("configGeneration");
    c["configGeneration"]["uuid"] = generation.Text("uuid");
    c["configGeneration"]["generation"] = generation.Unsigned("generation");
    c["configGeneration"]["timestamp"] = generation.Unsigned("timestamp");
    generation.Done();
    cluster.Done();

    Reader membership = top.Object("membership");
    Json& m = out["membership"];
    for (const char* key :
         {"localNodeUuid", "localNodeState", "localNodeHealthState", "masterUuid", "backupUuid"}) {
        m[key] = membership.Text(key);
    }
    m["entryRevision"] = membership.Unsigned("entryRevision");
    m["membershipUuid"] = membership.Text("membershipUuid");
    m["maintenanceModeState"] = membership.Text("maintenanceModeState");
    m["members"] = Json::array();
    const Json& members = membership.Array("members");
    for (size_t i = 0; i < members.size(); ++i) {
        Reader member(members[i], Indexed(membership.Path("members"), i));
        Json record;
        record["uuid"] = member.Text("uuid");
        record["hostname"] = member.Text("hostname");
        member.Done();
        m["members"].push_back(std::move(record));
    }
    membership.Done();

    // Agent entries stay texts of any form, so that malformed ones can be simulated.
    out["unicastAgents"] = Json::array();
    const Json& agents = top.Array("unicastAgents");
    for (size_t i = 0; i < agents.size(); ++i) {
        if (!agents[i].is_string()) Reader::Fail(Indexed("unicastAgents", i), "expected a text");
        out["unicastAgents"].push_back(agents[i]);
    }

    Reader network = top.Object("network");
    out["network"]["interfaces"] =
        NormalizeInterfaces(network.Array("interfaces"), "network.interfaces");
    out["network"]["persisted"] =
        NormalizeInterfaces(network.Array("persisted"), "network.persisted");
    network.Done();

    Reader storage = top.Object("storage");
    out["storage"]["autoClaimMode"] = storage.Bool("autoClaimMode");
    Json disks = Json::array();
    std::set<std::string> uuids;
    std::set<std::string> names;
    const Json& diskList = storage.Array("disks");
    for (size_t i = 0; i < diskList.size(); ++i) {
        std::string path = Indexed("storage.disks", i);
        Json disk = NormalizeDisk(diskList[i], path);
        if (!uuids.insert(disk["uuid"].get<std::string>()).second) {
            Reader::Fail(path + ".uuid", "a second disk with that UUID");
        }
        if (disk["lun"].get<bool>() && !names.insert(disk["name"].get<std::string>()).second) {
            Reader::Fail(path + ".name", "a second device of that name");
        }
        disks.push_back(std::move(disk));
    }
    out["storage"]["disks"] = std::move(disks);
    storage.Done();

    Reader settings = top.Object("settings");
    for (const char* key :
         {"datastoreName", "faultDomainName", "faultDomainId", "maintenanceOperation"}) {
        out["settings"][key] = settings.Text(key);
    }
    settings.Done();

    // Policy classes are the keys; the value is the default policy, empty when none is set.
    Reader policies = top.Object("policies");
    out["policies"] = Json::object();
    const Json& classes = document.at("policies");
    for (auto it = classes.begin(); it != classes.end(); ++it) {
        out["policies"][it.key()] = policies.Text(it.key().c_str());
    }
    policies.Done();

    Reader resync = top.Object("resync");
    out["resync"]["bandwidth"] = resync.Int("bandwidth", 0, std::numeric_limits<int64_t>::max());
    out["resync"]["throttle"] = resync.Int("throttle", 0, std::numeric_limits<int64_t>::max());
    resync.Done();

    Reader services = top.Object("services");
    Reader trace = services.Object("mesktraced");
    Json& t = out["services"]["mesktraced"];
    std::string state = trace.Text("state");
    if (state != "running" && state != "stopped") {
        Reader::Fail("services.mesktraced.state", "expected \"running\" or \"stopped\"");
    }
    t["state"] = state;
    t["statusFails"] = trace.Bool("statusFails");
    t["restartFailures"] = trace.Int("restartFailures", -1, std::numeric_limits<int32_t>::max());
    trace.Done();
    services.Done();

    top.Done();
    return out;
}

Json DefaultHost() {
    Json doc;
    doc["host"]["nodeUuid"] = kHostNodeUuid;
    doc["host"]["hostname"] = "hostsim-01";

    Json& c = doc["cluster"];
    c["enabled"] = false;
    c["uuid"] = "";
    c["witness"] = false;
    c["stretched"] = false;
    c["preferredFaultDomain"]["name"] = "";
    c["preferredFaultDomain"]["id"] = "";
    c["unicastMode"] = false;
    c["configGeneration"]["uuid"] = "";
    c["configGeneration"]["generation"] = 0u;
    c["configGeneration"]["timestamp"] = 0u;

    Json& m = doc["membership"];
    for (const char* key :
         {"localNodeUuid", "localNodeState", "localNodeHealthState", "masterUuid", "backupUuid"}) {
        m[key] = "";
    }
    m["entryRevision"] = 0u;
    m["membershipUuid"] = "";
    m["maintenanceModeState"] = "";
    m["members"] = Json::array();

    doc["unicastAgents"] = Json::array();
    doc["network"]["interfaces"] = Json::array();
    doc["network"]["persisted"] = Json::array();

    doc["storage"]["autoClaimMode"] = false;
    Json disks = Json::array();
    disks.push_back(DiskRecord("mpx.pthba2:C0:T0:L0", "52a0e7c4-1b2d-4e3f-8a90-0b1c2d3e4f01", true,
                               200 * kGiB));
    for (int target = 1; target <= 3; ++target) {
        disks.push_back(
            DiskRecord("mpx.pthba2:C0:T" + std::to_string(target) + ":L0",
                       "52a0e7c4-1b2d-4e3f-8a90-0b1c2d3e4f0" + std::to_string(target + 1), false,
                       1024 * kGiB));
    }
    doc["storage"]["disks"] = std::move(disks);

    doc["settings"]["datastoreName"] = "meskDatastore";
    doc["settings"]["faultDomainName"] = "";
    doc["settings"]["faultDomainId"] = "";
    doc["settings"]["maintenanceOperation"] = "";

    doc["policies"] = Json::object();
    for (const char* name : kPolicyClasses) doc["policies"][name] = "";

    doc["resync"]["bandwidth"] = 0;
    doc["resync"]["throttle"] = 0;

    Json& t = doc["services"]["mesktraced"];
    t["state"] = "running";
    t["statusFails"] = false;
    t["restartFailures"] = 0;
    return doc;
}

Json PopulatedHost(int64_t luns, int64_t agents, int64_t nics) {
    Json doc = DefaultHost();
    const std::string clusterUuid = "52f1c2a0-7b3e-4d01-9a6e-00a1b2c3d4e5";
    const std::string self = doc["host"]["nodeUuid"];
    Json& c = doc["cluster"];
    c["enabled"] = true;
    c["uuid"] = clusterUuid;
    c["configGeneration"]["uuid"] = "8c3b7f4e-2d1a-4b6c-9e8f-7a6b5c4d3e2f";
    c["configGeneration"]["generation"] = 1u;
    c["configGeneration"]["timestamp"] = uint64_t{1500000000007};
    Json& m = doc["membership"];
    m["localNodeUuid"] = self;
    m["localNodeState"] = "MASTER";
    m["localNodeHealthState"] = "HEALTHY";
    m["masterUuid"] = self;
    m["entryRevision"] = 1u;
    m["membershipUuid"] = "6d2e1f0a-3b4c-4d5e-8f60-718293a4b5c6";
    m["maintenanceModeState"] = "OFF";
    m["members"] = Json::array({{{"uuid", self}, {"hostname", doc["host"]["hostname"]}}});

    // Groups of one SSD and up to seven HDDs, every disk claimed and mounted.
    Json disks = Json::array();
    std::string groupUuid;
    std::string groupName;
    for (int64_t i = 0; i < luns; ++i) {
        bool ssd = i % 8 == 0;
        char name[64];
        std::snprintf(name, sizeof name, "mpx.pthba2:C%" PRId64 ":T%" PRId64 ":L0", i / 256,
                      i % 256);
        Json d = DiskRecord(name, NumberedUuid("52b0c1d2", uint64_t(i) + 1), ssd,
                            (ssd ? 200 : 1024) * kGiB);
        if (ssd) {
            groupUuid = d["uuid"];
            groupName = name;
        }
        d["diskGroupUuid"] = groupUuid;
        d["diskGroupName"] = groupName;
        d["usedByThisHost"] = true;
        d["inKovra"] = true;
        d["formatVersion"] = 5;
        d["checksum"] = "0";
        d["checksumOk"] = true;
        d["isCapacityTier"] = !ssd;
        d["mounted"] = true;
        disks.push_back(std::move(d));
    }
    doc["storage"]["disks"] = std::move(disks);

    Json agentList = Json::array();
    for (int64_t i = 0; i < agents; ++i) {
        char entry[128];
        std::snprintf(entry, sizeof entry, "%s;0;1;10.%d.%d.%d;12321;",
                      NumberedUuid("5c0a9e11", uint64_t(i) + 1).c_str(), int(i >> 16 & 255),
                      int(i >> 8 & 255), int(i & 255));
        agentList.push_back(entry);
    }
    doc["unicastAgents"] = std::move(agentList);

    Json interfaces = Json::array();
    for (int64_t i = 0; i < nics; ++i) {
        Json n;
        n["name"] = "zuvnic" + std::to_string(i);
        n["uuid"] = NumberedUuid("5d0b8f22", uint64_t(i) + 1);
        n["agentGroup"] = "224.2.3.4";
        n["agentV6Group"] = "FF19:0:0:0:0:2:3:4";
        n["masterGroup"] = "224.1.2.3";
        n["masterV6Group"] = "FF19:0:0:0:0:1:2:3";
        n["agentPort"] = 23451;
        n["masterPort"] = 12345;
        n["unicastPort"] = 12321;
        n["ttl"] = 5;
        n["meskTraffic"] = true;
        n["witnessTraffic"] = false;
        n["options"] = "";
        interfaces.push_back(std::move(n));
    }
    doc["network"]["interfaces"] = interfaces;
    doc["network"]["persisted"] = std::move(interfaces);
    return doc;
}

}  // namespace HostCtlSim
