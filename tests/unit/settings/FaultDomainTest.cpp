#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "MockHost.h"
#include "commands/settings/FaultDomainGet.h"
#include "commands/settings/FaultDomainReset.h"
#include "commands/settings/FaultDomainSet.h"
#include "commands/settings/MaintenanceModeCancel.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using Kalmor::CallSpec::Output;
using MeskTest::BoolResult;
using MeskTest::Errors;
using MeskTest::Fail;
using MeskTest::HostTest;
using MeskTest::TextField;
using ::testing::_;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using ::testing::Mock;
using ::testing::Return;
using Messages = std::vector<std::string>;

class SettingsTest : public HostTest {
  protected:
    std::shared_ptr<Output> SetName(const std::string& name) {
        auto input = Kalmor::CallSpec::Input::New();
        input->SetParameter("fdname", name);
        return Run(*FaultDomainSet::New(), input);
    }
};

TEST_F(SettingsTest, FaultDomainSetCountsBytesResetsOnEmptyAndIsAlwaysTrue) {
    std::string accents;  // 128 two-byte characters: 256 bytes
    for (int i = 0; i < 128; ++i) accents += "\xc3\xa9";
    enum Call { None, Set, Reset };
    const struct {
        std::string name;
        Call call;
    } cases[] = {{accents, Set},
                 {std::string(256, 'a'), Set},
                 {"", Reset},
                 {accents + "a", None},  // 129 characters, 257 bytes
                 {std::string(257, 'a'), None}};
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name.size());
        EXPECT_CALL(host, GetMeskPlugin()).Times(c.call == None ? 0 : 1);
        EXPECT_CALL(info, SetFaultDomainName(_)).Times(c.call == Set ? 1 : 0);
        EXPECT_CALL(info, ResetFaultDomainName()).Times(c.call == Reset ? 1 : 0);
        auto output = SetName(c.name);
        EXPECT_EQ(Errors(*output), c.call == None
                                       ? Messages{"Fault domain name cannot exceed 256 characters."}
                                       : Messages{});
        EXPECT_TRUE(BoolResult(*output));
        EXPECT_TRUE(output->IsComplete());
        Mock::VerifyAndClearExpectations(&info);
        Mock::VerifyAndClearExpectations(&host);
    }
}

TEST_F(SettingsTest, FaultDomainGetAsksForTheIdOnlyInACluster) {
    ON_CALL(info, GetFaultDomainName()).WillByDefault(Return("rack-1"));
    for (const bool enabled : {false, true}) {
        SetEnabled(enabled);
        if (enabled) {
            EXPECT_CALL(host, GetFaultDomainId()).WillOnce(Return("fd"));
        } else {
            EXPECT_CALL(host, GetFaultDomainId()).Times(0);
        }
        auto output = Run(*FaultDomainGet::New());
        EXPECT_TRUE(output->IsComplete());
        EXPECT_EQ(TextField(output->GetRootObject(), "faultDomainName"), "rack-1");
        EXPECT_EQ(TextField(output->GetRootObject(), "faultDomainId"), enabled ? "fd" : "");
        Mock::VerifyAndClearExpectations(&host);
    }
}

TEST_F(SettingsTest, MaintenanceModeCancelNeedsNoPluginObject) {
    EXPECT_CALL(host, DecomCancel());
    EXPECT_CALL(host, GetMeskPlugin()).Times(0);
    auto output = Run(*MaintenanceModeCancel::New());
    EXPECT_THAT(Errors(*output), IsEmpty());
    EXPECT_TRUE(BoolResult(*output));
    EXPECT_TRUE(output->IsComplete());
}

TEST_F(SettingsTest, ResultAndCompletionAfterALibraryFailure) {
    enum Result { NoResult, True, False };
    auto get = [&] { return Run(*FaultDomainGet::New()); };
    auto set = [&] { return SetName("r2"); };
    auto reset = [&] { return Run(*FaultDomainReset::New()); };
    const struct {
        std::function<void()> breakHost;
        std::function<std::shared_ptr<Output>()> run;
        std::string message;
        Result result;
        bool complete;
    } cases[] = {
        {[&] { EXPECT_CALL(info, GetFaultDomainName()).WillOnce(Fail("x")); }, get,
         "Unable to get fault domain name: x", NoResult, false},
        {[&] {
             SetEnabled(true);
             EXPECT_CALL(host, GetFaultDomainId()).WillOnce(Fail("x"));
         },
         get, "Unable to get fault domain name: x", NoResult, false},
        {[&] { EXPECT_CALL(info, SetFaultDomainName("r2")).WillOnce(Fail("x")); }, set,
         "Unable to set fault domain name: x", True, true},
        {[&] { EXPECT_CALL(info, ResetFaultDomainName()).WillOnce(Fail("x")); },
         [&] { return SetName(""); }, "Unable to set fault domain name: x", True, true},
        {[&] { EXPECT_CALL(host, GetMeskPlugin()).WillOnce(Fail("x")); }, set,
         "Unable to set fault domain name: x", True, true},
        {[&] { EXPECT_CALL(info, ResetFaultDomainName()).WillOnce(Fail("x")); }, reset,
         "Unable to reset fault domain name", True, true},
        {[&] { EXPECT_CALL(host, GetMeskPlugin()).WillOnce(Fail("x")); }, reset,
         "Unable to reset fault domain name", True, true},
        {[&] { EXPECT_CALL(host, DecomCancel()).WillOnce(Fail("x")); },
         [&] { return Run(*MaintenanceModeCancel::New()); }, "x", False, true},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.message);
        SetEnabled(false);
        c.breakHost();
        auto output = c.run();
        EXPECT_THAT(Errors(*output), ElementsAre(c.message));
        if (c.result == NoResult) {
            EXPECT_EQ(output->GetRootObject(), nullptr);
        } else {
            EXPECT_EQ(BoolResult(*output), c.result == True);
        }
        EXPECT_EQ(output->IsComplete(), c.complete);
        Mock::VerifyAndClearExpectations(&info);
        Mock::VerifyAndClearExpectations(&host);
    }
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
