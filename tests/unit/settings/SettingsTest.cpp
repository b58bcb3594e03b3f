#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "MockHost.h"
#include "commands/settings/DatastoreNameGet.h"
#include "commands/settings/DatastoreNameSet.h"
#include "commands/settings/FaultDomainGet.h"
#include "commands/settings/FaultDomainReset.h"
#include "commands/settings/FaultDomainSet.h"
#include "commands/settings/MaintenanceModeCancel.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using Kalmor::CallSpec::Output;
using namespace MeskTest;
using ::testing::ElementsAre;
using ::testing::Mock;
using ::testing::Return;

class SettingsTest : public HostTest {
  protected:
    std::shared_ptr<Output> RunWith(const std::shared_ptr<Kalmor::AutoCli::Command>& command,
                                    const std::string& parameter, const std::string& value) {
        auto input = Kalmor::CallSpec::Input::New();
        input->SetParameter(parameter, value);
        return Run(*command, input);
    }
    std::shared_ptr<Output> SetName(const std::string& name) {
        return RunWith(FaultDomainSet::New(), "fdname", name);
    }
};

TEST_F(SettingsTest, FaultDomainSetCountsBytesResetsOnEmptyAndIsAlwaysTrue) {
    std::string accents;  // 128 two-byte characters: 256 bytes
    for (int i = 0; i < 128; ++i) accents += "\xc3\xa9";
    enum Call { None, Set, Reset };
    const struct {
        std::string name;
        Call call;
    } cases[] = {{accents, Set}, {"", Reset}, {accents + "a", None}};  // 129 characters
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name.size());
        EXPECT_CALL(host, GetMeskPlugin()).Times(c.call == None ? 0 : 1);
        EXPECT_CALL(info, SetFaultDomainName(c.name)).Times(c.call == Set ? 1 : 0);
        EXPECT_CALL(info, ResetFaultDomainName()).Times(c.call == Reset ? 1 : 0);
        auto output = SetName(c.name);
        if (c.call == None) {
            EXPECT_THAT(Errors(*output),
                        ElementsAre("Fault domain name cannot exceed 256 characters."));
        } else {
            EXPECT_TRUE(Errors(*output).empty());
        }
        EXPECT_TRUE(BoolResult(*output) && output->IsComplete());
        Mock::VerifyAndClearExpectations(&info);
        Mock::VerifyAndClearExpectations(&host);
    }
}

TEST_F(SettingsTest, GetCommandsReportTheLibrarysTextsAndTheFaultDomainIdOnlyInACluster) {
    ON_CALL(info, GetFaultDomainName()).WillByDefault(Return("rack-1"));
    for (const bool enabled : {false, true}) {
        SetEnabled(enabled);
        EXPECT_CALL(host, GetFaultDomainId()).Times(enabled ? 1 : 0).WillRepeatedly(Return("fd"));
        auto output = Run(*FaultDomainGet::New());
        EXPECT_TRUE(output->IsComplete());
        EXPECT_EQ(TextField(output->GetRootObject(), "faultDomainName"), "rack-1");
        EXPECT_EQ(TextField(output->GetRootObject(), "faultDomainId"), enabled ? "fd" : "");
        Mock::VerifyAndClearExpectations(&host);
    }
    for (const std::string name : {"meskDatastore", ""}) {
        EXPECT_CALL(info, GetDatastoreName()).WillOnce(Return(name));
        auto output = Run(*DatastoreNameGet::New());
        EXPECT_TRUE(Errors(*output).empty() && output->IsComplete());
        EXPECT_EQ(TextField(output->GetRootObject(), "Name"), name);
    }
}

TEST_F(SettingsTest, OperationsAnswerTrueOnSuccess) {
    EXPECT_CALL(info, ResetFaultDomainName());
    EXPECT_CALL(info, SetDatastoreName(" new name "));
    EXPECT_CALL(host, DecomCancel());
    for (const auto& output :
         {Run(*FaultDomainReset::New()), RunWith(DatastoreNameSet::New(), "newname", " new name "),
          Run(*MaintenanceModeCancel::New())}) {
        EXPECT_TRUE(Errors(*output).empty() && BoolResult(*output) && output->IsComplete());
    }
    // Cancelling needs no plug-in object: only the two others made one.
    EXPECT_EQ(host.pluginsMade, 2);
}

// Getters leave no result; the setters and reset still answer true and complete, and
// maintenance mode cancel answers false.
TEST_F(SettingsTest, ResultAndCompletionAfterALibraryFailure) {
    enum Result { NoResult, True, False };
    const struct {
        std::function<void()> breakHost;
        std::function<std::shared_ptr<Output>()> run;
        std::string message;
        Result result;
    } cases[] = {
        {[&] { EXPECT_CALL(info, GetDatastoreName()).WillOnce(Fail("x")); },
         [&] { return Run(*DatastoreNameGet::New()); }, "Unable to get Mesk datastore name: x",
         NoResult},
        {[&] { EXPECT_CALL(info, SetDatastoreName("")).WillOnce(Fail("x")); },
         [&] { return RunWith(DatastoreNameSet::New(), "newname", ""); },
         "Unable to set Mesk datastore name: x", True},
        {[&] { EXPECT_CALL(info, GetFaultDomainName()).WillOnce(Fail("x")); },
         [&] { return Run(*FaultDomainGet::New()); }, "Unable to get fault domain name: x",
         NoResult},
        {[&] { EXPECT_CALL(info, SetFaultDomainName("r2")).WillOnce(Fail("x")); },
         [&] { return SetName("r2"); }, "Unable to set fault domain name: x", True},
        {[&] { EXPECT_CALL(info, ResetFaultDomainName()).WillOnce(Fail("x")); },
         [&] { return SetName(""); }, "Unable to set fault domain name: x", True},
        {[&] { EXPECT_CALL(info, ResetFaultDomainName()).WillOnce(Fail("x")); },
         [&] { return Run(*FaultDomainReset::New()); }, "Unable to reset fault domain name", True},
        {[&] { EXPECT_CALL(host, DecomCancel()).WillOnce(Fail("x")); },
         [&] { return Run(*MaintenanceModeCancel::New()); }, "x", False},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.message);
        c.breakHost();
        auto output = c.run();
        EXPECT_THAT(Errors(*output), ElementsAre(c.message));
        if (c.result == NoResult) {
            EXPECT_TRUE(output->GetRootObject() == nullptr && !output->IsComplete());
        } else {
            EXPECT_EQ(BoolResult(*output), c.result == True);
            EXPECT_TRUE(output->IsComplete());
        }
        Mock::VerifyAndClearExpectations(&info);
        Mock::VerifyAndClearExpectations(&host);
    }
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
