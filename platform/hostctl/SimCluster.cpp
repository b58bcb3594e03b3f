// The simulated host's answers about cluster membership and unicast agents.
#include <arpa/inet.h>

#include <cstdlib>
#include <cstring>

#include "SimInfo.h"

namespace HostCtlSim {

namespace {

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

}  // namespace

const MeskClusterConfig& SimInfo::GetClusterConfig() {
    return Serve(host_, Operation::GetClusterConfig, {}, [&]() -> const MeskClusterConfig& {
        const Json& cluster = Store().ReadSection("cluster");
        config_.enabled = cluster["enabled"];
        config_.clusterUuid = cluster["uuid"];
        return config_;
    });
}

bool SimInfo::IsWitness() {
    return Serve(host_, Operation::IsWitness, {},
                 [&] { return Store().ReadSection("cluster")["witness"].get<bool>(); });
}

MeskConfigGeneration SimInfo::GetConfigGeneration() {
    return Serve(host_, Operation::GetConfigGeneration, {}, [&] {
        const Json& g = Store().ReadSection("cluster")["configGeneration"];
        MeskConfigGeneration generation;
        generation.uuid = g["uuid"];
        generation.generation = g["generation"];
        generation.timestamp = g["timestamp"];
        return generation;
    });
}

void SimInfo::JoinCluster(const Uuid& clusterUuid, bool witnessNode,
                          const std::string& preferredFaultDomain, bool wait, int32_t flags) {
    std::string uuid = host_.HostBackend::MeskUuidToString(clusterUuid);
    Serve(host_, Operation::JoinCluster, {uuid, witnessNode, preferredFaultDomain, wait, flags},
          [&] {
              if (clusterUuid == Uuid()) Refuse("Invalid cluster UUID: " + Quoted(uuid));
              host_.Modify([&](StateStore& store) {
                  EnterCluster(store, uuid, witnessNode, preferredFaultDomain);
              });
          });
}

void SimInfo::CreateCluster(const std::string& clusterUuid, bool join, bool wait) {
    Serve(host_, Operation::CreateCluster, {clusterUuid, join, wait}, [&] {
        if (!IsUuidText(clusterUuid) || clusterUuid == "00000000-0000-0000-0000-000000000000") {
            Refuse("Invalid cluster UUID: " + Quoted(clusterUuid));
        }
        host_.Modify(
            [&](StateStore& store) { EnterCluster(store, LowerCase(clusterUuid), false, ""); });
    });
}

void SimInfo::LeaveCluster(bool force) {
    Serve(host_, Operation::LeaveCluster, {force}, [&] {
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

void SimInfo::RestoreClusterConfig(bool boot) {
    // The state is the persisted configuration; there is nothing to re-apply.
    Serve(host_, Operation::RestoreClusterConfig, {boot}, [] {});
}

void SimInfo::SetPreferredFaultDomain(const std::string& name) {
    Serve(host_, Operation::SetPreferredFaultDomain, {name}, [&] {
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

// "address:port", with an IPv6 address in brackets so that address and port can be told apart.
static std::string Endpoint(const std::string& ip, int port) {
    const std::string address = ip.find(':') == std::string::npos ? ip : "[" + ip + "]";
    return address + ":" + std::to_string(port);
}

void SimInfo::GetUnicastWitnesses(std::vector<std::string>& witnesses) {
    Serve(host_, Operation::GetUnicastWitnesses, {}, [&] {
        witnesses.clear();
        for (const Json& entry : Store().ReadSection("unicastAgents")) {
            Agent agent;
            if (ParseAgent(entry, agent) && agent.witness) {
                witnesses.push_back(Endpoint(agent.ip, agent.port));
            }
        }
    });
}

void SimInfo::AddUnicastAgent(const std::string& nodeUuid, bool isWitness, bool supportsUnicast,
                              const MeskIpAddress& address, int32_t port, bool hasInterface,
                              const std::string& interfaceName) {
    std::string ip = address.GetStringAddress();
    Serve(
        host_, Operation::AddUnicastAgent,
        {nodeUuid, isWitness, supportsUnicast, ip, port, hasInterface, interfaceName}, [&] {
            if (!IsUuidText(nodeUuid)) Refuse("Invalid node UUID: " + Quoted(nodeUuid));
            if (ip.empty()) Refuse("Invalid IP address: ''");
            CheckPort("port", port);
            host_.Modify([&](StateStore& store) {
                Json agents = store.ReadSection("unicastAgents");
                for (const Json& entry : agents) {
                    Agent agent;
                    if (ParseAgent(entry, agent) && agent.port == port &&
                        LowerCase(agent.uuid) == LowerCase(nodeUuid) && SameAddress(agent.ip, ip)) {
                        Refuse("The unicast agent " + nodeUuid + " at " + Endpoint(ip, port) +
                               " is already configured");
                    }
                }
                agents.push_back(nodeUuid + ";" + (isWitness ? "1" : "0") + ";" +
                                 (supportsUnicast ? "1" : "0") + ";" + ip + ";" +
                                 std::to_string(port) + ";" + (hasInterface ? interfaceName : ""));
                store.WriteSection("unicastAgents", agents);
            });
        });
}

void SimInfo::RefreshUnicastAgents() {
    Serve(host_, Operation::RefreshUnicastAgents, {}, [] {});
}

void SimInfo::GetUnicastAgents(std::vector<std::string>& agents) {
    Serve(host_, Operation::GetUnicastAgents, {}, [&] {
        agents.clear();
        for (const Json& entry : Store().ReadSection("unicastAgents")) {
            agents.push_back(entry);
        }
    });
}

bool SimInfo::RemoveUnicastAgent(const std::string& nodeUuid, const MeskIpAddress& address,
                                 int32_t port) {
    std::string ip = address.GetStringAddress();
    return Serve(host_, Operation::RemoveUnicastAgent, {nodeUuid, ip, port}, [&] {
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
            Refuse("No unicast agent " + nodeUuid + " at " + Endpoint(ip, port));
        });
        return witness;
    });
}

void SimHost::GetInfoFromKOVRA(std::vector<MeskMemberInfo>& members, std::string& localNodeState,
                               std::string& localNodeUuid, std::string& localNodeHealthState,
                               uint64_t& membershipEntryRevision, std::string& membershipUuid,
                               std::string& masterUuid, std::string& backupUuid,
                               std::string& maintenanceModeState) {
    Serve(*this, Operation::GetInfoFromKOVRA, {}, [&] {
        const Json& m = Store().ReadSection("membership");
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
    Serve(*this, Operation::GetUnicastMode, {},
          [&] { unicast = Store().ReadSection("cluster")["unicastMode"]; });
}

bool SimHost::IsInStretchedCluster() {
    return Serve(*this, Operation::IsInStretchedCluster, {}, [&] {
        const Json& cluster = Store().ReadSection("cluster");
        return cluster["enabled"].get<bool>() && cluster["stretched"].get<bool>();
    });
}

void SimHost::GetPreferredFaultDomainInfo(std::string& id, std::string& name) {
    Serve(*this, Operation::GetPreferredFaultDomainInfo, {}, [&] {
        const Json& cluster = Store().ReadSection("cluster");
        if (!cluster["enabled"].get<bool>() || !cluster["stretched"].get<bool>()) {
            Refuse("The host is not in a stretched cluster");
        }
        id = cluster["preferredFaultDomain"]["id"];
        name = cluster["preferredFaultDomain"]["name"];
    });
}

bool SimHost::IsWitnessNode() {
    return Serve(*this, Operation::IsWitnessNode, {},
                 [&] { return Store().ReadSection("cluster")["witness"].get<bool>(); });
}

}  // namespace HostCtlSim
