#include "MockHost.h"

#include <sstream>

#include "hostctl/MeskUtil.h"

namespace MeskTest {

using Kalmor::MetaObj::MetaBool;
using Kalmor::MetaObj::MetaInt;
using Kalmor::MetaObj::MetaList;
using Kalmor::MetaObj::MetaObject;
using Kalmor::MetaObj::MetaString;
using Kalmor::MetaObj::MetaStruct;
using ::testing::_;
using ::testing::Invoke;
using ::testing::ReturnRef;

namespace {

// Forwards every MeskInfo operation to the test's mock; counts its own release.
template <class Base>
class InfoForward : public Base {
  public:
    InfoForward(MockMeskInfo& target, int& released) : t_(target), released_(released) {}
    ~InfoForward() override { ++released_; }

    const MeskClusterConfig& GetClusterConfig() override { return t_.GetClusterConfig(); }
    bool IsWitness() override { return t_.IsWitness(); }
    MeskConfigGeneration GetConfigGeneration() override { return t_.GetConfigGeneration(); }
    void JoinCluster(const Uuid& u, bool w, const std::string& p, bool wait, int32_t f) override {
        t_.JoinCluster(u, w, p, wait, f);
    }
    void CreateCluster(const std::string& u, bool a, bool b) override { t_.CreateCluster(u, a, b); }
    void LeaveCluster(bool f) override { t_.LeaveCluster(f); }
    void RestoreClusterConfig(bool b) override { t_.RestoreClusterConfig(b); }
    void SetPreferredFaultDomain(const std::string& n) override { t_.SetPreferredFaultDomain(n); }
    void GetUnicastWitnesses(std::vector<std::string>& w) override { t_.GetUnicastWitnesses(w); }
    void AddUnicastAgent(const std::string& u, bool w, bool s, const MeskIpAddress& a, int32_t p,
                         bool h, const std::string& i) override {
        t_.AddUnicastAgent(u, w, s, a, p, h, i);
    }
    void RefreshUnicastAgents() override { t_.RefreshUnicastAgents(); }
    void GetUnicastAgents(std::vector<std::string>& a) override { t_.GetUnicastAgents(a); }
    bool RemoveUnicastAgent(const std::string& u, const MeskIpAddress& a, int32_t p) override {
        return t_.RemoveUnicastAgent(u, a, p);
    }
    bool IsZuvNicInUse(const std::string& n, const std::string& t) override {
        return t_.IsZuvNicInUse(n, t);
    }
    bool RemoveZuvNic(const std::string& n, bool f, const std::string& t) override {
        return t_.RemoveZuvNic(n, f, t);
    }
    void ClearNetworkConfig() override { t_.ClearNetworkConfig(); }
    void RestoreNetworkConfig() override { t_.RestoreNetworkConfig(); }
    void GetMeskDiskUuids(std::vector<Uuid>& u) override { t_.GetMeskDiskUuids(u); }
    void GetDiskInfo(const Uuid& u, const LunList& l, MeskDiskInfo& i) override {
        t_.GetDiskInfo(u, l, i);
    }
    void AddDisks(const std::string& s, const std::vector<std::string>& d) override {
        t_.AddDisks(s, d);
    }
    void RemoveDisk(const std::string& d, const std::string& m) override { t_.RemoveDisk(d, m); }
    void RemoveDiskGroup(const std::string& s, const std::string& m) override {
        t_.RemoveDiskGroup(s, m);
    }
    void RemoveDiskByUuid(const std::string& u, const std::string& m) override {
        t_.RemoveDiskByUuid(u, m);
    }
    void MountDiskGroup(const std::string& s, bool f) override { t_.MountDiskGroup(s, f); }
    void MountByUuid(const std::string& u) override { t_.MountByUuid(u); }
    void MountDisk(const std::string& d) override { t_.MountDisk(d); }
    void UnmountDiskGroup(const std::string& s, bool f) override { t_.UnmountDiskGroup(s, f); }
    void UnmountDisk(const std::string& d, bool f) override { t_.UnmountDisk(d, f); }
    void AddCapacityFlashTag(const std::string& d) override { t_.AddCapacityFlashTag(d); }
    void RemoveCapacityFlashTag(const std::string& d) override { t_.RemoveCapacityFlashTag(d); }
    bool GetAutoClaimMode() override { return t_.GetAutoClaimMode(); }
    void SetAutoClaimMode(bool e) override { t_.SetAutoClaimMode(e); }
    std::string GetDatastoreName() override { return t_.GetDatastoreName(); }
    void SetDatastoreName(const std::string& n) override { t_.SetDatastoreName(n); }
    std::string GetFaultDomainName() override { return t_.GetFaultDomainName(); }
    void SetFaultDomainName(const std::string& n) override { t_.SetFaultDomainName(n); }
    void ResetFaultDomainName() override { t_.ResetFaultDomainName(); }
    std::string GetDefaultPolicy(const std::string& c) override { return t_.GetDefaultPolicy(c); }
    void SetDefaultPolicy(const std::string& c, const std::string& p) override {
        t_.SetDefaultPolicy(c, p);
    }
    void ClearDefaultPolicies() override { t_.ClearDefaultPolicies(); }
    int64_t GetResyncBandwidth() override { return t_.GetResyncBandwidth(); }
    int64_t GetResyncThrottle() override { return t_.GetResyncThrottle(); }
    void SetResyncThrottle(int64_t l) override { t_.SetResyncThrottle(l); }

  protected:
    MockMeskInfo& t_;
    int& released_;
};

class BasicInfo : public InfoForward<HostCtl::Mesk::MeskInfo> {
  public:
    using InfoForward::InfoForward;
};

class ExtendedInfo : public InfoForward<HostCtl::Mesk::MeskInfo2> {
  public:
    using InfoForward::InfoForward;
    NicList GetZuvNicConfigs() override { return t_.GetZuvNicConfigs(); }
    bool SetZuvNicConfig(const MeskZuvNicConfig2& c) override { return t_.SetZuvNicConfig(c); }
};

class FakePlugin : public HostCtl::MeskPlugin {
  public:
    FakePlugin(MockHost& host, MockMeskInfo& info) : host_(host), info_(info) {}
    ~FakePlugin() override { ++host_.pluginsReleased; }

    std::unique_ptr<HostCtl::Mesk::MeskInfo> GetMeskInfo() override {
        switch (host_.infoKind) {
            case InfoKind::Null:
                return nullptr;
            case InfoKind::Basic:
                ++host_.infosMade;
                return std::make_unique<BasicInfo>(info_, host_.infosReleased);
            case InfoKind::Extended:
                break;
        }
        ++host_.infosMade;
        return std::make_unique<ExtendedInfo>(info_, host_.infosReleased);
    }

  private:
    MockHost& host_;
    MockMeskInfo& info_;
};

}  // namespace

MockMeskInfo::MockMeskInfo() {
    ON_CALL(*this, GetClusterConfig()).WillByDefault(ReturnRef(clusterConfig));
    ON_CALL(*this, GetZuvNicConfigs()).WillByDefault(Invoke([] { return NicList(); }));
}

MockMeskInfo::~MockMeskInfo() = default;

MockHost::MockHost(MockMeskInfo& info) : info_(info) {
    using Base = HostCtlSim::HostBackend;
    ON_CALL(*this, GetMeskPlugin()).WillByDefault(Invoke([this] { return MakePlugin(); }));
    ON_CALL(*this, GetFormattedSystemDateTime()).WillByDefault(Invoke([] {
        return std::string("2026-11-22 10:00:00");
    }));
    ON_CALL(*this, StringToMeskUuid(_)).WillByDefault(Invoke([this](const std::string& t) {
        return Base::StringToMeskUuid(t);
    }));
    ON_CALL(*this, MeskUuidToString(_)).WillByDefault(Invoke([this](const Uuid& u) {
        return Base::MeskUuidToString(u);
    }));
    ON_CALL(*this, UTF8StringCharLength(_)).WillByDefault(Invoke([this](const std::string& t) {
        return Base::UTF8StringCharLength(t);
    }));
    ON_CALL(*this, StringToMeskPolicyClass(_)).WillByDefault(Invoke([this](const std::string& n) {
        return Base::StringToMeskPolicyClass(n);
    }));
    ON_CALL(*this, MeskPolicyClassToString(_)).WillByDefault(Invoke([this](MeskPolicyClass c) {
        return Base::MeskPolicyClassToString(c);
    }));
    ON_CALL(*this, GetMeskPolicyClasses()).WillByDefault(Invoke([this] {
        return Base::GetMeskPolicyClasses();
    }));
    ON_CALL(*this, UUID_CreateRandom()).WillByDefault(Invoke([this] {
        return Base::UUID_CreateRandom();
    }));
    ON_CALL(*this, UUID_PackText(_, _, _))
        .WillByDefault(Invoke([this](const char* text, char* buffer, size_t length) {
            return Base::UUID_PackText(text, buffer, length);
        }));
}

MockHost::~MockHost() = default;

std::unique_ptr<HostCtl::MeskPlugin> MockHost::MakePlugin() {
    ++pluginsMade;
    return std::make_unique<FakePlugin>(*this, info_);
}

Uuid UuidOf(const std::string& text) {
    return HostCtlSim::CurrentBackend().HostBackend::StringToMeskUuid(text);
}

HostTest::HostTest() {
    HostCtlSim::SetBackend(&host);
}

HostTest::~HostTest() {
    HostCtlSim::SetBackend(nullptr);
}

std::shared_ptr<Kalmor::CallSpec::Output> HostTest::Run(
    Kalmor::AutoCli::Command& command, std::shared_ptr<Kalmor::CallSpec::Input> input) {
    auto output = Kalmor::CallSpec::Output::New();
    command.ExecuteInternal(input, output);
    return output;
}

void HostTest::SetEnabled(bool enabled, const std::string& clusterUuid) {
    info.clusterConfig.enabled = enabled;
    info.clusterConfig.clusterUuid = clusterUuid;
}

std::shared_ptr<Kalmor::CallSpec::Input> InputOf(const std::string& options) {
    auto input = Kalmor::CallSpec::Input::New();
    std::istringstream words(options);
    for (std::string word; words >> word;) {
        const size_t equals = word.find('=');
        input->AddParameterValue(word.substr(0, equals), word.substr(equals + 1));
    }
    return input;
}

std::vector<std::string> Errors(const Kalmor::CallSpec::Output& output) {
    return output.GetErrorMessages();
}

void ExpectRefused(const Kalmor::CallSpec::Output& output, const std::string& message) {
    EXPECT_THAT(Errors(output), ::testing::ElementsAre(message));
    EXPECT_TRUE(output.GetRootObject() == nullptr && !output.IsComplete());
}

bool BoolResult(const Kalmor::CallSpec::Output& output) {
    auto value = std::dynamic_pointer_cast<MetaBool>(output.GetRootObject());
    EXPECT_TRUE(value && value->HasValue()) << "the result is not a set boolean";
    return value && value->GetValue();
}

namespace {
std::shared_ptr<MetaObject> FieldOf(const std::shared_ptr<MetaObject>& structure,
                                    const std::string& field) {
    auto s = std::dynamic_pointer_cast<MetaStruct>(structure);
    EXPECT_TRUE(s) << "not a structure";
    if (!s) return nullptr;
    auto value = s->GetField(field);
    EXPECT_TRUE(value) << "no field " << field;
    return value;
}
}  // namespace

std::string TextField(const std::shared_ptr<MetaObject>& structure, const std::string& field) {
    auto value = std::dynamic_pointer_cast<MetaString>(FieldOf(structure, field));
    EXPECT_TRUE(value) << field << " is not a text";
    return value ? value->GetValue() : std::string();
}

int64_t IntField(const std::shared_ptr<MetaObject>& structure, const std::string& field) {
    auto value = std::dynamic_pointer_cast<MetaInt>(FieldOf(structure, field));
    EXPECT_TRUE(value) << field << " is not an integer";
    return value ? value->GetValue() : 0;
}

bool BoolField(const std::shared_ptr<MetaObject>& structure, const std::string& field) {
    auto value = std::dynamic_pointer_cast<MetaBool>(FieldOf(structure, field));
    EXPECT_TRUE(value) << field << " is not a boolean";
    return value && value->GetValue();
}

std::vector<std::string> FieldNames(const std::shared_ptr<MetaObject>& structure) {
    std::vector<std::string> names;
    auto s = std::dynamic_pointer_cast<MetaStruct>(structure);
    EXPECT_TRUE(s) << "not a structure";
    if (s) {
        for (const auto& field : s->GetFields()) names.push_back(field.name);
    }
    return names;
}

std::vector<std::shared_ptr<MetaObject>> ListElements(const std::shared_ptr<MetaObject>& list) {
    auto l = std::dynamic_pointer_cast<MetaList>(list);
    EXPECT_TRUE(l) << "not a list";
    return l ? l->GetElements() : std::vector<std::shared_ptr<MetaObject>>();
}

}  // namespace MeskTest
