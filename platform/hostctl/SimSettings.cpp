// The simulated host's answers about its settings: datastore, fault domain, maintenance mode,
// default policies and resync.
#include "SimInfo.h"

namespace HostCtlSim {

std::string SimInfo::GetDatastoreName() {
    return Serve(host_, Operation::GetDatastoreName, {}, [&] {
        return Store().ReadSection("settings")["datastoreName"].get<std::string>();
    });
}

void SimInfo::SetDatastoreName(const std::string& name) {
    Serve(host_, Operation::SetDatastoreName, {name}, [&] {
        if (name.empty()) Refuse("The datastore name cannot be empty");
        SetValue("settings", "datastoreName", name);
    });
}

std::string SimInfo::GetFaultDomainName() {
    return Serve(host_, Operation::GetFaultDomainName, {}, [&] {
        return Store().ReadSection("settings")["faultDomainName"].get<std::string>();
    });
}

void SimInfo::SetFaultDomainName(const std::string& name) {
    Serve(host_, Operation::SetFaultDomainName, {name}, [&] {
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

void SimInfo::ResetFaultDomainName() {
    Serve(host_, Operation::ResetFaultDomainName, {}, [&] {
        host_.Modify([&](StateStore& store) {
            Json settings = store.ReadSection("settings");
            settings["faultDomainName"] = "";
            settings["faultDomainId"] = "";
            store.WriteSection("settings", settings);
        });
    });
}

std::string SimInfo::GetDefaultPolicy(const std::string& policyClass) {
    return Serve(host_, Operation::GetDefaultPolicy, {policyClass}, [&] {
        const Json& policies = Store().ReadSection("policies");
        if (!policies.contains(policyClass)) {
            Refuse("Unknown policy class: " + Quoted(policyClass));
        }
        return policies[policyClass].get<std::string>();
    });
}

void SimInfo::SetDefaultPolicy(const std::string& policyClass, const std::string& policy) {
    Serve(host_, Operation::SetDefaultPolicy, {policyClass, policy}, [&] {
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

void SimInfo::ClearDefaultPolicies() {
    Serve(host_, Operation::ClearDefaultPolicies, {}, [&] {
        host_.Modify([&](StateStore& store) {
            Json policies = store.ReadSection("policies");
            for (auto& value : policies) value = "";
            store.WriteSection("policies", policies);
        });
    });
}

int64_t SimInfo::GetResyncBandwidth() {
    return Serve(host_, Operation::GetResyncBandwidth, {},
                 [&] { return Store().ReadSection("resync")["bandwidth"].get<int64_t>(); });
}

int64_t SimInfo::GetResyncThrottle() {
    return Serve(host_, Operation::GetResyncThrottle, {},
                 [&] { return Store().ReadSection("resync")["throttle"].get<int64_t>(); });
}

void SimInfo::SetResyncThrottle(int64_t level) {
    Serve(host_, Operation::SetResyncThrottle, {level}, [&] {
        if (level < 0) Refuse("Invalid resync throttle level: " + std::to_string(level));
        SetValue("resync", "throttle", level);
    });
}

std::string SimHost::GetFaultDomainId() {
    return Serve(*this, Operation::GetFaultDomainId, {}, [&] {
        return Store().ReadSection("settings")["faultDomainId"].get<std::string>();
    });
}

void SimHost::DecomCancel() {
    // Cancelling when no operation is in progress succeeds too.
    Serve(*this, Operation::DecomCancel, {}, [&] {
        Modify([&](StateStore& store) {
            Json settings = store.ReadSection("settings");
            settings["maintenanceOperation"] = "";
            store.WriteSection("settings", settings);
        });
    });
}

MeskPolicyClass SimHost::StringToMeskPolicyClass(const std::string& name) {
    return Serve(*this, Operation::StringToMeskPolicyClass, {name},
                 [&] { return HostBackend::StringToMeskPolicyClass(name); });
}

std::string SimHost::MeskPolicyClassToString(MeskPolicyClass policyClass) {
    return Serve(*this, Operation::MeskPolicyClassToString, {int32_t(policyClass)},
                 [&] { return HostBackend::MeskPolicyClassToString(policyClass); });
}

std::vector<MeskPolicyClass> SimHost::GetMeskPolicyClasses() {
    return Serve(*this, Operation::GetMeskPolicyClasses, {},
                 [&] { return HostBackend::GetMeskPolicyClasses(); });
}

}  // namespace HostCtlSim
