#include "SimHost.h"

#include <arpa/inet.h>
#include <fcntl.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>
#include <uuid/uuid.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <ctime>

#include "hostctl/MeskCtlException.h"

extern char** environ;

namespace HostCtlSim {

using HostCtl::Lib::Mesk::MeskCtlException;
using HostCtl::Mesk::MeskClusterConfig;
using HostCtl::Mesk::MeskConfigGeneration;
using HostCtl::Mesk::MeskDiskInfo;
using HostCtl::Mesk::MeskDiskLun;
using HostCtl::Mesk::MeskIpAddress;
using HostCtl::Mesk::MeskMemberInfo;
using HostCtl::Mesk::MeskPolicyClass;
using HostCtl::Mesk::MeskZuvNicConfig2;
using HostCtl::Mesk::Uuid;

namespace {

const char* const kDefaultStatePath = "/var/lib/hostsim/state.db";
const char* const kDefaultHostRoot = "/var/lib/hostsim/root";
const size_t kMaxCapacityDisks = 7;

[[noreturn]] void Refuse(const std::string& message) {
    throw MeskCtlException(message);
}

int64_t NowNanoseconds() {
    timespec now{};
    clock_gettime(CLOCK_REALTIME, &now);
    return int64_t(now.tv_sec) * 1000000000 + now.tv_nsec;
}

std::string NewUuid() {
    uuid_t uuid;
    uuid_generate_random(uuid);
    char text[37];
    uuid_unparse_lower(uuid, text);
    return text;
}

std::string Quoted(const std::string& text) {
    return "'" + text + "'";
}

// The fields of a unicast agent entry "uuid;isWitness;supportsUnicast;ip;port;iface".
struct Agent {
    std::string uuid;
    bool witness = false;
    std::string ip;
    int port = 0;
};

bool ParseAgent(const std::string& entry, Agent& agent) {
    size_t cut[5];
    size_t from = 0;
    for (size_t& c : cut) {
        c = entry.find(';', from);
        if (c == std::string::npos) return false;
        from = c + 1;
    }
    agent.uuid = entry.substr(0, cut[0]);
    agent.witness = std::atoi(entry.substr(cut[0] + 1, cut[1] - cut[0] - 1).c_str()) != 0;
    agent.ip = entry.substr(cut[2] + 1, cut[3] - cut[2] - 1);
    agent.port = std::atoi(entry.substr(cut[3] + 1, cut[4] - cut[3] - 1).c_str());
    return true;
}

// True iff both texts name the same address ("fe80::1" and "FE80:0::1" do).
bool SameAddress(const std::string& a, const std::string& b) {
    unsigned char x[16] = {}, y[16] = {};
    for (int family : {AF_INET, AF_INET6}) {
        if (inet_pton(family, a.c_str(), x) == 1 && inet_pton(family, b.c_str(), y) == 1) {
            return std::memcmp(x, y, sizeof x) == 0;
        }
    }
    return a == b;
}

// Disks.

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

// Network interfaces.

std::string TrafficFlag(const std::string& trafficType) {
    if (trafficType == "mesk") return "meskTraffic";
    if (trafficType == "witness") return "witnessTraffic";
    Refuse("Unknown traffic type: " + Quoted(trafficType));
}

Json::iterator FindInterface(Json& interfaces, const std::string& name) {
    for (auto it = interfaces.begin(); it != interfaces.end(); ++it) {
        if ((*it)["name"] == name) return it;
    }
    return interfaces.end();
}

std::unique_ptr<MeskZuvNicConfig2> InterfaceRecord(const Json& n) {
    using HostCtl::Network::Ipv4Address;
    using HostCtl::Network::Ipv6Address;
    auto record = std::make_unique<MeskZuvNicConfig2>(
        n["name"].get<std::string>(), MeskIpAddress(Ipv4Address(n["agentGroup"])),
        MeskIpAddress(Ipv6Address(n["agentV6Group"])), MeskIpAddress(Ipv4Address(n["masterGroup"])),
        MeskIpAddress(Ipv6Address(n["masterV6Group"])), n["agentPort"].get<int32_t>(),
        n["masterPort"].get<int32_t>(), n["unicastPort"].get<int32_t>(), n["ttl"].get<int32_t>(),
        n["meskTraffic"].get<bool>(), n["witnessTraffic"].get<bool>(),
        n["options"].get<std::string>());
    record->SetIfaceUuid(n["uuid"]);
    return record;
}

void CheckPort(const char* what, int32_t port) {
    if (port < 1 || port > 65535)
        Refuse(std::string("Invalid ") + what + ": " + std::to_string(port));
}

void CheckGroup(const char* what, const MeskIpAddress& address, bool ipv6) {
    if (address.IsIpv6() != ipv6 || address.GetStringAddress().empty()) {
        Refuse(std::string("Invalid ") + what + ": " + Quoted(address.GetStringAddress()));
    }
}

// The cluster operations' common part: the host becomes a member of `clusterUuid`.
void EnterCluster(StateStore& store, const std::string& clusterUuid, bool witness,
                  const std::string& preferredFaultDomain) {
    Json cluster = store.ReadSection("cluster");
    if (cluster["enabled"].get<bool>()) {
        Refuse("The host is already a member of the Mesk cluster " +
               cluster["uuid"].get<std::string>());
    }
    if (witness && preferredFaultDomain.empty()) {
        Refuse("A witness node needs a preferred fault domain");
    }
    Json host = store.ReadSection("host");
    cluster["enabled"] = true;
    cluster["uuid"] = clusterUuid;
    cluster["witness"] = witness;
    cluster["stretched"] = witness;
    cluster["preferredFaultDomain"]["name"] = witness ? preferredFaultDomain : "";
    cluster["preferredFaultDomain"]["id"] = witness ? NewUuid() : "";
    Json& generation = cluster["configGeneration"];
    generation["uuid"] = NewUuid();
    generation["generation"] = generation["generation"].get<uint64_t>() + 1;
    generation["timestamp"] = uint64_t(NowNanoseconds() / 1000000);
    store.WriteSection("cluster", cluster);

    Json membership = store.ReadSection("membership");
    membership["localNodeUuid"] = host["nodeUuid"];
    membership["localNodeState"] = "MASTER";
    membership["localNodeHealthState"] = "HEALTHY";
    membership["masterUuid"] = host["nodeUuid"];
    membership["backupUuid"] = "";
    membership["entryRevision"] = membership["entryRevision"].get<uint64_t>() + 1;
    membership["membershipUuid"] = NewUuid();
    membership["maintenanceModeState"] = "OFF";
    membership["members"] =
        Json::array({{{"uuid", host["nodeUuid"]}, {"hostname", host["hostname"]}}});
    store.WriteSection("membership", membership);
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

// The info object: every operation reads or changes the simulated host's state.
class SimInfo : public HostCtl::Mesk::MeskInfo2 {
  public:
    explicit SimInfo(SimHost& host) : host_(host) {}

    const MeskClusterConfig& GetClusterConfig() override {
        return Serve(host_, "GetClusterConfig", Json::array(), [&]() -> const MeskClusterConfig& {
            Json cluster = Store().ReadSection("cluster");
            config_.enabled = cluster["enabled"];
            config_.clusterUuid = cluster["uuid"];
            return config_;
        });
    }

    bool IsWitness() override {
        return Serve(host_, "IsWitness", Json::array(),
                     [&] { return Store().ReadSection("cluster")["witness"].get<bool>(); });
    }

    MeskConfigGeneration GetConfigGeneration() override {
        return Serve(host_, "GetConfigGeneration", Json::array(), [&] {
            Json g = Store().ReadSection("cluster")["configGeneration"];
            MeskConfigGeneration generation;
            generation.uuid = g["uuid"];
            generation.generation = g["generation"];
            generation.timestamp = g["timestamp"];
            return generation;
        });
    }

    void JoinCluster(const Uuid& clusterUuid, bool witnessNode,
                     const std::string& preferredFaultDomain, bool wait, int32_t flags) override {
        std::string uuid = host_.HostBackend::MeskUuidToString(clusterUuid);
        Serve(host_, "JoinCluster",
              Json::array({uuid, witnessNode, preferredFaultDomain, wait, flags}), [&] {
                  if (clusterUuid == Uuid()) Refuse("Invalid cluster UUID: " + Quoted(uuid));
                  host_.Modify([&](StateStore& store) {
                      EnterCluster(store, uuid, witnessNode, preferredFaultDomain);
                  });
              });
    }

    void CreateCluster(const std::string& clusterUuid, bool join, bool wait) override {
        Serve(host_, "CreateCluster", Json::array({clusterUuid, join, wait}), [&] {
            if (!IsUuidText(clusterUuid) || clusterUuid == "00000000-0000-0000-0000-000000000000") {
                Refuse("Invalid cluster UUID: " + Quoted(clusterUuid));
            }
            host_.Modify(
                [&](StateStore& store) { EnterCluster(store, LowerCase(clusterUuid), false, ""); });
        });
    }

    void LeaveCluster(bool force) override {
        Serve(host_, "LeaveCluster", Json::array({force}), [&] {
            host_.Modify([&](StateStore& store) {
                Json cluster = store.ReadSection("cluster");
                if (!cluster["enabled"].get<bool>()) Refuse("The host is not in a Mesk cluster");
                Json fresh = DefaultHost();
                Json generation = cluster["configGeneration"];
                generation["generation"] = generation["generation"].get<uint64_t>() + 1;
                generation["timestamp"] = uint64_t(NowNanoseconds() / 1000000);
                bool unicastMode = cluster["unicastMode"];
                cluster = fresh["cluster"];
                cluster["unicastMode"] = unicastMode;
                cluster["configGeneration"] = generation;
                store.WriteSection("cluster", cluster);
                store.WriteSection("membership", fresh["membership"]);
            });
        });
    }

    void RestoreClusterConfig(bool boot) override {
        // The state is the persisted configuration; there is nothing to re-apply.
        Serve(host_, "RestoreClusterConfig", Json::array({boot}), [] {});
    }

    void SetPreferredFaultDomain(const std::string& name) override {
        Serve(host_, "SetPreferredFaultDomain", Json::array({name}), [&] {
            host_.Modify([&](StateStore& store) {
                Json cluster = store.ReadSection("cluster");
                if (!cluster["enabled"].get<bool>() || !cluster["stretched"].get<bool>() ||
                    !cluster["witness"].get<bool>()) {
                    Refuse("The host is not the witness node of a stretched cluster");
                }
                if (name.empty()) Refuse("The preferred fault domain name cannot be empty");
                Json& preferred = cluster["preferredFaultDomain"];
                if (preferred["name"] != name) {
                    preferred["name"] = name;
                    preferred["id"] = NewUuid();
                }
                store.WriteSection("cluster", cluster);
            });
        });
    }

    void GetUnicastWitnesses(std::vector<std::string>& witnesses) override {
        Serve(host_, "GetUnicastWitnesses", Json::array(), [&] {
            witnesses.clear();
            for (const Json& entry : Store().ReadSection("unicastAgents")) {
                Agent agent;
                if (ParseAgent(entry, agent) && agent.witness) {
                    witnesses.push_back(agent.ip + ":" + std::to_string(agent.port));
                }
            }
        });
    }

    void AddUnicastAgent(const std::string& nodeUuid, bool isWitness, bool supportsUnicast,
                         const MeskIpAddress& address, int32_t port, bool hasInterface,
                         const std::string& interfaceName) override {
        std::string ip = address.GetStringAddress();
        Serve(host_, "AddUnicastAgent",
              Json::array(
                  {nodeUuid, isWitness, supportsUnicast, ip, port, hasInterface, interfaceName}),
              [&] {
                  if (!IsUuidText(nodeUuid)) Refuse("Invalid node UUID: " + Quoted(nodeUuid));
                  if (ip.empty()) Refuse("Invalid IP address: ''");
                  CheckPort("port", port);
                  host_.Modify([&](StateStore& store) {
                      Json agents = store.ReadSection("unicastAgents");
                      for (const Json& entry : agents) {
                          Agent agent;
                          if (ParseAgent(entry, agent) && agent.port == port &&
                              LowerCase(agent.uuid) == LowerCase(nodeUuid) &&
                              SameAddress(agent.ip, ip)) {
                              Refuse("The unicast agent " + nodeUuid + " at " + ip + ":" +
                                     std::to_string(port) + " is already configured");
                          }
                      }
                      agents.push_back(nodeUuid + ";" + (isWitness ? "1" : "0") + ";" +
                                       (supportsUnicast ? "1" : "0") + ";" + ip + ";" +
                                       std::to_string(port) + ";" +
                                       (hasInterface ? interfaceName : ""));
                      store.WriteSection("unicastAgents", agents);
                  });
              });
    }

    void RefreshUnicastAgents() override {
        Serve(host_, "RefreshUnicastAgents", Json::array(), [] {});
    }

    void GetUnicastAgents(std::vector<std::string>& agents) override {
        Serve(host_, "GetUnicastAgents", Json::array(), [&] {
            agents.clear();
            for (const Json& entry : Store().ReadSection("unicastAgents")) {
                agents.push_back(entry);
            }
        });
    }

    bool RemoveUnicastAgent(const std::string& nodeUuid, const MeskIpAddress& address,
                            int32_t port) override {
        std::string ip = address.GetStringAddress();
        return Serve(host_, "RemoveUnicastAgent", Json::array({nodeUuid, ip, port}), [&] {
            bool witness = false;
            host_.Modify([&](StateStore& store) {
                Json agents = store.ReadSection("unicastAgents");
                for (auto it = agents.begin(); it != agents.end(); ++it) {
                    Agent agent;
                    if (ParseAgent(*it, agent) && agent.port == port &&
                        LowerCase(agent.uuid) == LowerCase(nodeUuid) && SameAddress(agent.ip, ip)) {
                        witness = agent.witness;
                        agents.erase(it);
                        store.WriteSection("unicastAgents", agents);
                        return;
                    }
                }
                Refuse("No unicast agent " + nodeUuid + " at " + ip + ":" + std::to_string(port));
            });
            return witness;
        });
    }

    bool IsZuvNicInUse(const std::string& interfaceName, const std::string& trafficType) override {
        return Serve(host_, "IsZuvNicInUse", Json::array({interfaceName, trafficType}), [&] {
            std::string flag = TrafficFlag(trafficType);
            Json interfaces = Store().ReadSection("network")["interfaces"];
            auto it = FindInterface(interfaces, interfaceName);
            return it != interfaces.end() && (*it)[flag].get<bool>();
        });
    }

    bool RemoveZuvNic(const std::string& interfaceName, bool force,
                      const std::string& trafficType) override {
        return Serve(host_, "RemoveZuvNic", Json::array({interfaceName, force, trafficType}), [&] {
            std::string flag = TrafficFlag(trafficType);
            bool removed = false;
            host_.Modify([&](StateStore& store) {
                Json network = store.ReadSection("network");
                Json& interfaces = network["interfaces"];
                auto it = FindInterface(interfaces, interfaceName);
                if (it == interfaces.end()) {
                    // An interface never configured is refused; with force the service is told
                    // anyway. One that this invocation already took out (its other traffic
                    // type went first) has nothing left to remove.
                    if (force || host_.RemovedInThisInvocation(interfaceName)) return;
                    Refuse("The interface " + Quoted(interfaceName) + " is not configured");
                }
                // An interface that does not carry this traffic type has nothing to remove.
                if (!(*it)[flag].get<bool>()) return;
                (*it)[flag] = false;
                if (!(*it)["meskTraffic"].get<bool>() && !(*it)["witnessTraffic"].get<bool>()) {
                    interfaces.erase(it);
                    host_.NoteRemoved(interfaceName);
                }
                network["persisted"] = interfaces;
                store.WriteSection("network", network);
                removed = true;
            });
            return removed;
        });
    }

    void ClearNetworkConfig() override {
        // The persisted copy stays, for RestoreNetworkConfig.
        Serve(host_, "ClearNetworkConfig", Json::array(), [&] {
            host_.Modify([&](StateStore& store) {
                Json network = store.ReadSection("network");
                network["interfaces"] = Json::array();
                store.WriteSection("network", network);
            });
        });
    }

    void RestoreNetworkConfig() override {
        Serve(host_, "RestoreNetworkConfig", Json::array(), [&] {
            host_.Modify([&](StateStore& store) {
                Json network = store.ReadSection("network");
                network["interfaces"] = network["persisted"];
                store.WriteSection("network", network);
            });
        });
    }

    std::vector<std::unique_ptr<MeskZuvNicConfig2>> GetZuvNicConfigs() override {
        return Serve(host_, "GetZuvNicConfigs", Json::array(), [&] {
            std::vector<std::unique_ptr<MeskZuvNicConfig2>> records;
            Json network = Store().ReadSection("network");
            for (const Json& n : network["interfaces"]) {
                records.push_back(InterfaceRecord(n));
            }
            return records;
        });
    }

    bool SetZuvNicConfig(const MeskZuvNicConfig2& config) override {
        Json n;
        n["name"] = config.GetZuvnicName();
        n["uuid"] = config.GetIfaceUuid();
        n["agentGroup"] = config.GetAgentMulticastGroup().GetStringAddress();
        n["agentV6Group"] = config.GetAgentV6MulticastGroup().GetStringAddress();
        n["masterGroup"] = config.GetMasterMulticastGroup().GetStringAddress();
        n["masterV6Group"] = config.GetMasterV6MulticastGroup().GetStringAddress();
        n["agentPort"] = config.GetAgentMulticastPort();
        n["masterPort"] = config.GetMasterMulticastPort();
        n["unicastPort"] = config.GetHostUnicastPort();
        n["ttl"] = config.GetMulticastTTL();
        n["meskTraffic"] = config.meskTraffic;
        n["witnessTraffic"] = config.witnessTraffic;
        n["options"] = config.GetOptions();
        return Serve(host_, "SetZuvNicConfig", Json::array({n}), [&] {
            if (config.GetZuvnicName().empty()) Refuse("The interface name cannot be empty");
            CheckGroup("agent multicast group", config.GetAgentMulticastGroup(), false);
            CheckGroup("agent IPv6 multicast group", config.GetAgentV6MulticastGroup(), true);
            CheckGroup("master multicast group", config.GetMasterMulticastGroup(), false);
            CheckGroup("master IPv6 multicast group", config.GetMasterV6MulticastGroup(), true);
            CheckPort("agent multicast port", config.GetAgentMulticastPort());
            CheckPort("master multicast port", config.GetMasterMulticastPort());
            CheckPort("host unicast port", config.GetHostUnicastPort());
            if (config.GetMulticastTTL() < 1 || config.GetMulticastTTL() > 255) {
                Refuse("Invalid multicast TTL: " + std::to_string(config.GetMulticastTTL()));
            }
            if (!config.meskTraffic && !config.witnessTraffic) {
                Refuse("The interface " + Quoted(config.GetZuvnicName()) +
                       " carries no traffic type");
            }
            host_.Modify([&](StateStore& store) {
                Json network = store.ReadSection("network");
                Json& interfaces = network["interfaces"];
                auto it = FindInterface(interfaces, config.GetZuvnicName());
                if (it != interfaces.end()) {
                    n["uuid"] = (*it)["uuid"];  // an interface keeps its UUID
                    *it = n;
                } else {
                    n["uuid"] = NewUuid();
                    interfaces.push_back(n);
                }
                network["persisted"] = interfaces;
                store.WriteSection("network", network);
            });
            return true;
        });
    }

    void GetMeskDiskUuids(std::vector<Uuid>& uuids) override {
        Serve(host_, "GetMeskDiskUuids", Json::array(), [&] {
            uuids.clear();
            for (const std::string& text : Store().ReadGroupedDiskUuids()) {
                uuids.push_back(host_.HostBackend::StringToMeskUuid(text));
            }
        });
    }

    void GetDiskInfo(const Uuid& uuid, const std::vector<std::shared_ptr<MeskDiskLun>>& luns,
                     MeskDiskInfo& info) override {
        std::string text = host_.HostBackend::MeskUuidToString(uuid);
        Serve(host_, "GetDiskInfo", Json::array({text, luns.size()}), [&] {
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

    void AddDisks(const std::string& ssd, const std::vector<std::string>& disks) override {
        Serve(host_, "AddDisks", Json::array({ssd, disks}), [&] {
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
                    if (IsGrouped(disk))
                        Refuse("Disk " + Quoted(name) + " is already in use by Mesk");
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

    void RemoveDisk(const std::string& disk, const std::string& evacuationMode) override {
        Serve(host_, "RemoveDisk", Json::array({disk, evacuationMode}), [&] {
            CheckEvacuationMode(evacuationMode);
            host_.Modify([&](StateStore& store) { ReleaseDisk(store, GroupedDisk(store, disk)); });
        });
    }

    void RemoveDiskGroup(const std::string& ssd, const std::string& evacuationMode) override {
        Serve(host_, "RemoveDiskGroup", Json::array({ssd, evacuationMode}), [&] {
            CheckEvacuationMode(evacuationMode);
            host_.Modify([&](StateStore& store) { ReleaseGroup(store, FrontingSsd(store, ssd)); });
        });
    }

    void RemoveDiskByUuid(const std::string& uuid, const std::string& evacuationMode) override {
        Serve(host_, "RemoveDiskByUuid", Json::array({uuid, evacuationMode}), [&] {
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

    void MountDiskGroup(const std::string& ssd, bool flag) override {
        Serve(host_, "MountDiskGroup", Json::array({ssd, flag}), [&] {
            host_.Modify(
                [&](StateStore& store) { SetGroupMounted(store, FrontingSsd(store, ssd), true); });
        });
    }

    void MountByUuid(const std::string& uuid) override {
        Serve(host_, "MountByUuid", Json::array({uuid}), [&] {
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

    void MountDisk(const std::string& disk) override {
        Serve(host_, "MountDisk", Json::array({disk}), [&] {
            host_.Modify(
                [&](StateStore& store) { SetMounted(store, GroupedDisk(store, disk), true); });
        });
    }

    void UnmountDiskGroup(const std::string& ssd, bool flag) override {
        Serve(host_, "UnmountDiskGroup", Json::array({ssd, flag}), [&] {
            host_.Modify(
                [&](StateStore& store) { SetGroupMounted(store, FrontingSsd(store, ssd), false); });
        });
    }

    void UnmountDisk(const std::string& disk, bool flag) override {
        Serve(host_, "UnmountDisk", Json::array({disk, flag}), [&] {
            host_.Modify(
                [&](StateStore& store) { SetMounted(store, GroupedDisk(store, disk), false); });
        });
    }

    void AddCapacityFlashTag(const std::string& disk) override {
        Serve(host_, "AddCapacityFlashTag", Json::array({disk}), [&] { Tag(disk, true); });
    }

    void RemoveCapacityFlashTag(const std::string& disk) override {
        Serve(host_, "RemoveCapacityFlashTag", Json::array({disk}), [&] { Tag(disk, false); });
    }

    bool GetAutoClaimMode() override {
        return Serve(host_, "GetAutoClaimMode", Json::array(),
                     [&] { return Store().ReadSection("storage")["autoClaimMode"].get<bool>(); });
    }

    void SetAutoClaimMode(bool enabled) override {
        Serve(host_, "SetAutoClaimMode", Json::array({enabled}),
              [&] { SetValue("storage", "autoClaimMode", enabled); });
    }

    std::string GetDatastoreName() override {
        return Serve(host_, "GetDatastoreName", Json::array(), [&] {
            return Store().ReadSection("settings")["datastoreName"].get<std::string>();
        });
    }

    void SetDatastoreName(const std::string& name) override {
        Serve(host_, "SetDatastoreName", Json::array({name}), [&] {
            if (name.empty()) Refuse("The datastore name cannot be empty");
            SetValue("settings", "datastoreName", name);
        });
    }

    std::string GetFaultDomainName() override {
        return Serve(host_, "GetFaultDomainName", Json::array(), [&] {
            return Store().ReadSection("settings")["faultDomainName"].get<std::string>();
        });
    }

    void SetFaultDomainName(const std::string& name) override {
        Serve(host_, "SetFaultDomainName", Json::array({name}), [&] {
            if (name.empty()) Refuse("The fault domain name cannot be empty");
            host_.Modify([&](StateStore& store) {
                Json settings = store.ReadSection("settings");
                if (settings["faultDomainName"] != name || settings["faultDomainId"] == "") {
                    settings["faultDomainName"] = name;
                    settings["faultDomainId"] = NewUuid();
                }
                store.WriteSection("settings", settings);
            });
        });
    }

    void ResetFaultDomainName() override {
        Serve(host_, "ResetFaultDomainName", Json::array(), [&] {
            host_.Modify([&](StateStore& store) {
                Json settings = store.ReadSection("settings");
                settings["faultDomainName"] = "";
                settings["faultDomainId"] = "";
                store.WriteSection("settings", settings);
            });
        });
    }

    std::string GetDefaultPolicy(const std::string& policyClass) override {
        return Serve(host_, "GetDefaultPolicy", Json::array({policyClass}), [&] {
            Json policies = Store().ReadSection("policies");
            if (!policies.contains(policyClass)) {
                Refuse("Unknown policy class: " + Quoted(policyClass));
            }
            return policies[policyClass].get<std::string>();
        });
    }

    void SetDefaultPolicy(const std::string& policyClass, const std::string& policy) override {
        Serve(host_, "SetDefaultPolicy", Json::array({policyClass, policy}), [&] {
            if (policy.empty()) Refuse("The policy cannot be empty");
            host_.Modify([&](StateStore& store) {
                Json policies = store.ReadSection("policies");
                if (!policies.contains(policyClass)) {
                    Refuse("Unknown policy class: " + Quoted(policyClass));
                }
                policies[policyClass] = policy;
                store.WriteSection("policies", policies);
            });
        });
    }

    void ClearDefaultPolicies() override {
        Serve(host_, "ClearDefaultPolicies", Json::array(), [&] {
            host_.Modify([&](StateStore& store) {
                Json policies = store.ReadSection("policies");
                for (auto& value : policies) value = "";
                store.WriteSection("policies", policies);
            });
        });
    }

    int64_t GetResyncBandwidth() override {
        return Serve(host_, "GetResyncBandwidth", Json::array(),
                     [&] { return Store().ReadSection("resync")["bandwidth"].get<int64_t>(); });
    }

    int64_t GetResyncThrottle() override {
        return Serve(host_, "GetResyncThrottle", Json::array(),
                     [&] { return Store().ReadSection("resync")["throttle"].get<int64_t>(); });
    }

    void SetResyncThrottle(int64_t level) override {
        Serve(host_, "SetResyncThrottle", Json::array({level}), [&] {
            if (level < 0) Refuse("Invalid resync throttle level: " + std::to_string(level));
            SetValue("resync", "throttle", level);
        });
    }

  private:
    StateStore& Store() { return host_.Store(); }

    void SetValue(const char* section, const char* key, const Json& value) {
        host_.Modify([&](StateStore& store) {
            Json s = store.ReadSection(section);
            s[key] = value;
            store.WriteSection(section, s);
        });
    }

    void Tag(const std::string& name, bool tagged) {
        host_.Modify([&](StateStore& store) {
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

    SimHost& host_;
    MeskClusterConfig config_;
};

class SimPlugin : public HostCtl::MeskPlugin {
  public:
    explicit SimPlugin(SimHost& host) : host_(host) {}
    std::unique_ptr<HostCtl::Mesk::MeskInfo> GetMeskInfo() override {
        return Serve(host_, "GetMeskInfo", Json::array(),
                     [&] { return std::unique_ptr<HostCtl::Mesk::MeskInfo>(new SimInfo(host_)); });
    }

  private:
    SimHost& host_;
};

}  // namespace

SimHost::Options SimHost::OptionsFromEnvironment() {
    Options options;
    const char* state = std::getenv("HOSTSIM_STATE");
    options.statePath = state != nullptr && *state != '\0' ? state : kDefaultStatePath;
    const char* root = std::getenv("MESK_HOST_ROOT");
    bool rootSet = root != nullptr && *root != '\0';
    options.hostRoot = rootSet ? root : kDefaultHostRoot;
    options.execRoot = rootSet ? root : "";
    return options;
}

SimHost& SimHost::Default() {
    static SimHost host(OptionsFromEnvironment());
    return host;
}

const std::vector<std::string>& SimHost::OperationNames() {
    static const std::vector<std::string> names = {
        // The plug-in, the core's statics and the host UUID functions.
        "GetMeskPlugin", "GetMeskInfo", "GetMeskDisks", "GetInfoFromKOVRA", "GetUnicastMode",
        "GetFormattedSystemDateTime", "StringToMeskUuid", "MeskUuidToString",
        "UTF8StringCharLength", "IsInStretchedCluster", "GetPreferredFaultDomainInfo",
        "IsWitnessNode", "GetFaultDomainId", "DecomCancel", "StringToMeskPolicyClass",
        "MeskPolicyClassToString", "GetMeskPolicyClasses", "MeskExec", "UUID_CreateRandom",
        "UUID_PackText",
        // The info object.
        "GetClusterConfig", "IsWitness", "GetConfigGeneration", "JoinCluster", "CreateCluster",
        "LeaveCluster", "RestoreClusterConfig", "SetPreferredFaultDomain", "GetUnicastWitnesses",
        "AddUnicastAgent", "RefreshUnicastAgents", "GetUnicastAgents", "RemoveUnicastAgent",
        "IsZuvNicInUse", "RemoveZuvNic", "ClearNetworkConfig", "RestoreNetworkConfig",
        "GetZuvNicConfigs", "SetZuvNicConfig", "GetMeskDiskUuids", "GetDiskInfo", "AddDisks",
        "RemoveDisk", "RemoveDiskGroup", "RemoveDiskByUuid", "MountDiskGroup", "MountByUuid",
        "MountDisk", "UnmountDiskGroup", "UnmountDisk", "AddCapacityFlashTag",
        "RemoveCapacityFlashTag", "GetAutoClaimMode", "SetAutoClaimMode", "GetDatastoreName",
        "SetDatastoreName", "GetFaultDomainName", "SetFaultDomainName", "ResetFaultDomainName",
        "GetDefaultPolicy", "SetDefaultPolicy", "ClearDefaultPolicies", "GetResyncBandwidth",
        "GetResyncThrottle", "SetResyncThrottle"};
    return names;
}

SimHost::SimHost(Options options)
    : options_(std::move(options)),
      root_(options_.hostRoot),
      invocation_(std::to_string(getpid()) + "-" + std::to_string(NowNanoseconds()) + "-" +
                  std::to_string(reinterpret_cast<uintptr_t>(this))) {}

SimHost::~SimHost() {
    try {
        Flush();
    } catch (...) {
        // The state is gone or locked for too long; the log of this invocation is lost.
    }
}

StateStore& SimHost::Store() {
    if (store_) return *store_;
    auto store = std::make_unique<StateStore>(options_.statePath);
    if (store->Open()) {
        try {
            root_.Create(DefaultHost()["services"]);
        } catch (const std::exception&) {
            // A host without its files still serves every operation but MeskExec.
        }
    }
    faults_ = store->ReadFaults();
    store_ = std::move(store);
    return *store_;
}

void SimHost::Enter(const char* op, Json args) {
    Store();
    pending_.push_back(PendingCall{NowNanoseconds(), op, std::move(args), false, std::string()});
    int64_t count = ++callCounts_[op];
    for (const Fault& fault : faults_) {
        if (fault.op == op && (fault.call == 0 || fault.call == count)) {
            throw MeskCtlException(fault.message);
        }
    }
}

void SimHost::NoteError(const std::string& message) {
    if (pending_.empty()) return;
    pending_.back().failed = true;
    pending_.back().error = message;
}

std::vector<CallRecord> SimHost::Pending() const {
    std::vector<CallRecord> calls;
    calls.reserve(pending_.size());
    // The text of {"op": ..., "args": [...], "error": ...}, written out in that key order.
    // Operation names are plain identifiers (OperationNames) and need no escaping.
    for (const auto& call : pending_) {
        std::string entry = "{\"op\":\"" + call.op + "\",\"args\":" + JsonText(call.args);
        if (call.failed) entry += ",\"error\":" + JsonText(call.error);
        entry += '}';
        calls.push_back(CallRecord{call.time, std::move(entry)});
    }
    return calls;
}

void SimHost::Flush() {
    if (pending_.empty() || !store_) return;
    StateStore::Transaction transaction(*store_);
    store_->AppendCalls(invocation_, Pending());
    transaction.Commit();
    pending_.clear();
}

std::unique_ptr<HostCtl::MeskPlugin> SimHost::GetMeskPlugin() {
    return Serve(*this, "GetMeskPlugin", Json::array(),
                 [&] { return std::unique_ptr<HostCtl::MeskPlugin>(new SimPlugin(*this)); });
}

void SimHost::GetMeskDisks(std::vector<std::shared_ptr<MeskDiskLun>>& luns) {
    Serve(*this, "GetMeskDisks", Json::array(), [&] {
        std::vector<StateStore::Lun> rows = Store().ReadLuns();
        luns.reserve(luns.size() + rows.size());
        for (const auto& row : rows) {
            luns.push_back(
                std::make_shared<SimLun>(row.name, HostBackend::StringToMeskUuid(row.uuid)));
        }
    });
}

void SimHost::GetInfoFromKOVRA(std::vector<MeskMemberInfo>& members, std::string& localNodeState,
                               std::string& localNodeUuid, std::string& localNodeHealthState,
                               uint64_t& membershipEntryRevision, std::string& membershipUuid,
                               std::string& masterUuid, std::string& backupUuid,
                               std::string& maintenanceModeState) {
    Serve(*this, "GetInfoFromKOVRA", Json::array(), [&] {
        Json m = Store().ReadSection("membership");
        members.clear();
        for (const Json& member : m["members"]) {
            members.push_back(MeskMemberInfo{member["uuid"], member["hostname"]});
        }
        localNodeState = m["localNodeState"];
        localNodeUuid = m["localNodeUuid"];
        localNodeHealthState = m["localNodeHealthState"];
        membershipEntryRevision = m["entryRevision"];
        membershipUuid = m["membershipUuid"];
        masterUuid = m["masterUuid"];
        backupUuid = m["backupUuid"];
        maintenanceModeState = m["maintenanceModeState"];
    });
}

void SimHost::GetUnicastMode(bool& unicast) {
    Serve(*this, "GetUnicastMode", Json::array(),
          [&] { unicast = Store().ReadSection("cluster")["unicastMode"]; });
}

bool SimHost::IsInStretchedCluster() {
    return Serve(*this, "IsInStretchedCluster", Json::array(), [&] {
        Json cluster = Store().ReadSection("cluster");
        return cluster["enabled"].get<bool>() && cluster["stretched"].get<bool>();
    });
}

void SimHost::GetPreferredFaultDomainInfo(std::string& id, std::string& name) {
    Serve(*this, "GetPreferredFaultDomainInfo", Json::array(), [&] {
        Json cluster = Store().ReadSection("cluster");
        if (!cluster["enabled"].get<bool>() || !cluster["stretched"].get<bool>()) {
            Refuse("The host is not in a stretched cluster");
        }
        id = cluster["preferredFaultDomain"]["id"];
        name = cluster["preferredFaultDomain"]["name"];
    });
}

bool SimHost::IsWitnessNode() {
    return Serve(*this, "IsWitnessNode", Json::array(),
                 [&] { return Store().ReadSection("cluster")["witness"].get<bool>(); });
}

std::string SimHost::GetFaultDomainId() {
    return Serve(*this, "GetFaultDomainId", Json::array(), [&] {
        return Store().ReadSection("settings")["faultDomainId"].get<std::string>();
    });
}

void SimHost::DecomCancel() {
    // Cancelling when no operation is in progress succeeds too.
    Serve(*this, "DecomCancel", Json::array(), [&] {
        Modify([&](StateStore& store) {
            Json settings = store.ReadSection("settings");
            settings["maintenanceOperation"] = "";
            store.WriteSection("settings", settings);
        });
    });
}

int32_t SimHost::MeskExec(const std::string& command, const std::string& argument, bool flag1,
                          bool flag2, bool flag3) {
    return Serve(*this, "MeskExec", Json::array({command, argument, flag1, flag2, flag3}), [&] {
        std::string path = command;
        if (!options_.execRoot.empty()) {
            path = HostRoot(options_.execRoot)
                       .PathOf(command.empty() || command[0] != '/' ? "/" + command : command);
        }
        // The program's output would mix with the command's own; it goes nowhere.
        posix_spawn_file_actions_t actions;
        posix_spawn_file_actions_init(&actions);
        posix_spawn_file_actions_addopen(&actions, 0, "/dev/null", O_RDONLY, 0);
        posix_spawn_file_actions_addopen(&actions, 1, "/dev/null", O_WRONLY, 0);
        posix_spawn_file_actions_addopen(&actions, 2, "/dev/null", O_WRONLY, 0);
        char* argv[] = {const_cast<char*>(path.c_str()), const_cast<char*>(argument.c_str()),
                        nullptr};
        pid_t child = 0;
        int error = posix_spawn(&child, path.c_str(), &actions, nullptr, argv, environ);
        posix_spawn_file_actions_destroy(&actions);
        if (error != 0) return int32_t{-1};
        int status = 0;
        while (waitpid(child, &status, 0) < 0) {
            if (errno != EINTR) return int32_t{-1};
        }
        if (WIFEXITED(status)) return int32_t(WEXITSTATUS(status));
        return WIFSIGNALED(status) ? int32_t(-WTERMSIG(status)) : int32_t{-1};
    });
}

std::string SimHost::GetFormattedSystemDateTime() {
    return Serve(*this, "GetFormattedSystemDateTime", Json::array(),
                 [&] { return HostBackend::GetFormattedSystemDateTime(); });
}

Uuid SimHost::StringToMeskUuid(const std::string& text) {
    return Serve(*this, "StringToMeskUuid", Json::array({text}),
                 [&] { return HostBackend::StringToMeskUuid(text); });
}

std::string SimHost::MeskUuidToString(const Uuid& uuid) {
    std::string text = HostBackend::MeskUuidToString(uuid);
    return Serve(*this, "MeskUuidToString", Json::array({text}), [&] { return text; });
}

size_t SimHost::UTF8StringCharLength(const std::string& text) {
    return Serve(*this, "UTF8StringCharLength", Json::array({text}),
                 [&] { return HostBackend::UTF8StringCharLength(text); });
}

MeskPolicyClass SimHost::StringToMeskPolicyClass(const std::string& name) {
    return Serve(*this, "StringToMeskPolicyClass", Json::array({name}),
                 [&] { return HostBackend::StringToMeskPolicyClass(name); });
}

std::string SimHost::MeskPolicyClassToString(MeskPolicyClass policyClass) {
    return Serve(*this, "MeskPolicyClassToString", Json::array({int32_t(policyClass)}),
                 [&] { return HostBackend::MeskPolicyClassToString(policyClass); });
}

std::vector<MeskPolicyClass> SimHost::GetMeskPolicyClasses() {
    return Serve(*this, "GetMeskPolicyClasses", Json::array(),
                 [&] { return HostBackend::GetMeskPolicyClasses(); });
}

char* SimHost::UUID_CreateRandom() {
    return Serve(*this, "UUID_CreateRandom", Json::array(),
                 [&] { return HostBackend::UUID_CreateRandom(); });
}

char* SimHost::UUID_PackText(const char* text, char* buffer, size_t length) {
    Json shown = text != nullptr ? Json(std::string(text, length)) : Json(nullptr);
    return Serve(*this, "UUID_PackText", Json::array({shown, length}),
                 [&] { return HostBackend::UUID_PackText(text, buffer, length); });
}

}  // namespace HostCtlSim
