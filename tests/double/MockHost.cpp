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

// Fails the test unless the result has the shape the command declares: the same kinds and,
// for structures, the same field names in the same order, so that a row filled under a name
// missing from the command's declared fields shows up here.
void ExpectShapedLike(const std::shared_ptr<MetaObject>& declared,
                      const std::shared_ptr<MetaObject>& result) {
    ASSERT_TRUE(declared && result && declared->GetType() == result->GetType())
        << "the result " << Shown(result) << " is not shaped like " << Shown(declared);
    if (auto list = std::dynamic_pointer_cast<MetaList>(result)) {
        auto declaredList = std::static_pointer_cast<MetaList>(declared);
        ASSERT_EQ(declaredList->GetElementType(), list->GetElementType());
        if (!declaredList->GetTemplate()) return;
        for (const auto& element : list->GetElements()) {
            ExpectShapedLike(declaredList->GetTemplate(), element);
        }
    } else if (auto structure = std::dynamic_pointer_cast<MetaStruct>(result)) {
        auto shape = [](const MetaStruct& s) {
            std::string text;
            for (const auto& f : s.GetFields())
                text += f.name + ':' + std::to_string(f.value->GetType()) + ',';
            return text;
        };
        EXPECT_EQ(shape(*std::static_pointer_cast<MetaStruct>(declared)), shape(*structure));
    }
}

// Forwards every operation to the test's mock; counts its own release.
template <class Base>
class InfoForward : public Base {
  public:
    InfoForward(MockMeskInfo& target, int& released) : target_(target), released_(released) {}
    ~InfoForward() override { ++released_; }
    HOSTCTL_INFO_OPERATIONS(MESK_FORWARD_OPERATION)

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
    HOSTCTL_INFO2_OPERATIONS(MESK_FORWARD_OPERATION)
};

class FakePlugin : public HostCtl::MeskPlugin {
  public:
    FakePlugin(MockHost& host, MockMeskInfo& info) : host_(host), info_(info) {}

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

MockHost::MockHost(MockMeskInfo& info) {
    using Base = HostCtlSim::HostBackend;
    ON_CALL(*this, GetMeskPlugin()).WillByDefault(Invoke([this, &info] {
        ++pluginsMade;
        return std::unique_ptr<HostCtl::MeskPlugin>(std::make_unique<FakePlugin>(*this, info));
    }));
#define MESK_AS_THE_LIBRARY(result, name, parameters, arguments) \
    ON_CALL(*this, name).WillByDefault(Invoke([this] parameters { return Base::name arguments; }));
    HOSTCTL_UTIL_CONVERSIONS(MESK_AS_THE_LIBRARY)
#undef MESK_AS_THE_LIBRARY
    ON_CALL(*this, UUID_CreateRandom()).WillByDefault(Invoke([this] {
        return Base::UUID_CreateRandom();
    }));
    ON_CALL(*this, UUID_PackText(_, _, _))
        .WillByDefault(Invoke([this](const char* text, char* buffer, size_t length) {
            return Base::UUID_PackText(text, buffer, length);
        }));
}

MockHost::~MockHost() = default;

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
    auto output = Kalmor::CallSpec::Output::New();
    command.ExecuteInternal(input, output);
    if (output->GetRootObject()) {
        ExpectShapedLike(command.GetOutputSpecInternal()->GetRootObject(), output->GetRootObject());
    }
    return output;
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

}  // namespace MeskTest
