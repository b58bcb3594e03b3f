// The simulated host's answers about network interfaces.
#include "SimInfo.h"

namespace HostCtlSim {

namespace {

std::string TrafficFlag(const std::string& trafficType) {
    if (trafficType == "mesk") return "meskTraffic";
    if (trafficType == "witness") return "witnessTraffic";
    Refuse("Unknown traffic type: " + Quoted(trafficType));
}

// `Interfaces` is Json or const Json.
template <class Interfaces>
auto FindInterface(Interfaces& interfaces, const std::string& name)
    -> decltype(interfaces.begin()) {
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

void CheckGroup(const char* what, const MeskIpAddress& address, bool ipv6) {
    if (address.IsIpv6() != ipv6 || address.GetStringAddress().empty()) {
        Refuse(std::string("Invalid ") + what + ": " + Quoted(address.GetStringAddress()));
    }
}

}  // namespace

bool SimInfo::IsZuvNicInUse(const std::string& interfaceName, const std::string& trafficType) {
    return Serve(host_, Operation::IsZuvNicInUse, {interfaceName, trafficType}, [&] {
        std::string flag = TrafficFlag(trafficType);
        const Json& interfaces = Store().ReadSection("network")["interfaces"];
        auto it = FindInterface(interfaces, interfaceName);
        return it != interfaces.end() && (*it)[flag].get<bool>();
    });
}

bool SimInfo::RemoveZuvNic(const std::string& interfaceName, bool force,
                           const std::string& trafficType) {
    return Serve(host_, Operation::RemoveZuvNic, {interfaceName, force, trafficType}, [&] {
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

void SimInfo::ClearNetworkConfig() {
    // The persisted copy stays, for RestoreNetworkConfig.
    Serve(host_, Operation::ClearNetworkConfig, {}, [&] {
        host_.Modify([&](StateStore& store) {
            Json network = store.ReadSection("network");
            network["interfaces"] = Json::array();
            store.WriteSection("network", network);
        });
    });
}

void SimInfo::RestoreNetworkConfig() {
    Serve(host_, Operation::RestoreNetworkConfig, {}, [&] {
        host_.Modify([&](StateStore& store) {
            Json network = store.ReadSection("network");
            network["interfaces"] = network["persisted"];
            store.WriteSection("network", network);
        });
    });
}

std::vector<std::unique_ptr<MeskZuvNicConfig2>> SimInfo::GetZuvNicConfigs() {
    return Serve(host_, Operation::GetZuvNicConfigs, {}, [&] {
        std::vector<std::unique_ptr<MeskZuvNicConfig2>> records;
        for (const Json& n : Store().ReadSection("network")["interfaces"]) {
            records.push_back(InterfaceRecord(n));
        }
        return records;
    });
}

bool SimInfo::SetZuvNicConfig(const MeskZuvNicConfig2& config) {
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
    return Serve(host_, Operation::SetZuvNicConfig, {n}, [&] {
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
            Refuse("The interface " + Quoted(config.GetZuvnicName()) + " carries no traffic type");
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

}  // namespace HostCtlSim
