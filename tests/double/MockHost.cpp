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

// Forwards every operation to the test's mock; counts its own release.
template <class Base>
class InfoForward : public Base {
  public:
    InfoForward(MockMeskInfo& target, int& released) : target_(target), released_(released) {}
    ~InfoForward() override { ++released_; }
    MESK_INFO_OPERATIONS(MESK_FORWARD_OPERATION)

  protected:
    MockMeskInfo& target_;
    int& released_;
};

class BasicInfo : public InfoForward<HostCtl::Mesk::MeskInfo> {
  public:
    using InfoForward::InfoForward;
};

class ExtendedInfo : public InfoForward<HostCtl::Mesk::MeskInfo2> {
  public:
    using InfoForward::InfoForward;
    MESK_INFO2_OPERATIONS(MESK_FORWARD_OPERATION)
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

std::string Arg(const std::string& text) {
    return text;
}

std::string Arg(const std::vector<std::string>& texts) {
    std::string joined;
    for (const auto& text : texts) joined += (joined.empty() ? "" : ",") + text;
    return joined;
}

std::string Arg(const MeskIpAddress& address) {
    return (address.IsIpv6() ? "v6:" : "v4:") + address.GetStringAddress();
}

std::string Arg(const Uuid& uuid) {
    return HostCtlSim::CurrentBackend().HostBackend::MeskUuidToString(uuid);
}

std::string Arg(const MeskZuvNicConfig2& nic) {
    std::ostringstream text;
    text << nic.GetZuvnicName() << ' ' << nic.GetAgentMulticastGroup().GetStringAddress() << ' '
         << nic.GetAgentV6MulticastGroup().GetStringAddress() << ' '
         << nic.GetMasterMulticastGroup().GetStringAddress() << ' '
         << nic.GetMasterV6MulticastGroup().GetStringAddress() << ' ' << nic.GetAgentMulticastPort()
         << ' ' << nic.GetMasterMulticastPort() << ' ' << nic.GetHostUnicastPort() << ' '
         << nic.GetMulticastTTL() << (nic.meskTraffic ? " mesk" : "")
         << (nic.witnessTraffic ? " witness" : "");
    if (!nic.GetOptions().empty()) text << " (" << nic.GetOptions() << ")";
    return text.str();
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

std::shared_ptr<Kalmor::CallSpec::Output> HostTest::Run(Kalmor::AutoCli::Command& command,
                                                        const std::string& options) {
    auto input = Kalmor::CallSpec::Input::New();
    std::istringstream words(options);
    for (std::string word; words >> word;) {
        const size_t equals = word.find('=');
        if (equals == std::string::npos) {
            input->SetFlag(word);
        } else {
            input->AddParameterValue(word.substr(0, equals), word.substr(equals + 1));
        }
    }
    return Run(command, input);
}

void HostTest::SetEnabled(bool enabled, const std::string& clusterUuid) {
    info.clusterConfig.enabled = enabled;
    info.clusterConfig.clusterUuid = clusterUuid;
}

std::string Shown(const std::shared_ptr<MetaObject>& value) {
    if (!value) return "no result";
    std::string text;
    if (auto s = std::dynamic_pointer_cast<MetaString>(value)) {
        return s->HasValue() ? s->GetValue() : "null";
    } else if (auto i = std::dynamic_pointer_cast<MetaInt>(value)) {
        return i->HasValue() ? std::to_string(i->GetValue()) : "null";
    } else if (auto b = std::dynamic_pointer_cast<MetaBool>(value)) {
        return !b->HasValue() ? "null" : b->GetValue() ? "true" : "false";
    } else if (auto structure = std::dynamic_pointer_cast<MetaStruct>(value)) {
        for (const auto& field : structure->GetFields()) {
            text += (text.empty() ? "" : ", ") + field.name + "=" + Shown(field.value);
        }
        return "{" + text + "}";
    }
    for (const auto& element : Elements(value)) text += (text.empty() ? "" : ", ") + element;
    return "[" + text + "]";
}

std::string Outcome(const Kalmor::CallSpec::Output& output) {
    std::string text;
    for (const auto& message : output.GetErrorMessages()) text += message + "; ";
    return text + Shown(output.GetRootObject()) +
           (output.IsComplete() ? ", complete" : ", incomplete");
}

std::vector<std::string> Elements(const std::shared_ptr<MetaObject>& list,
                                  const std::string& field) {
    auto l = std::dynamic_pointer_cast<MetaList>(list);
    EXPECT_TRUE(l) << Shown(list) << " is not a list";
    std::vector<std::string> elements;
    for (const auto& element : l ? l->GetElements() : std::vector<std::shared_ptr<MetaObject>>()) {
        auto row = std::dynamic_pointer_cast<MetaStruct>(element);
        auto value = field.empty() ? element : row ? row->GetField(field) : nullptr;
        EXPECT_TRUE(value) << "no field " << field << " in " << Shown(element);
        elements.push_back(Shown(value));
    }
    return elements;
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
