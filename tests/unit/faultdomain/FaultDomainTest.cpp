#include "MockHost.h"
#include "commands/faultdomain/FaultDomainGet.h"
#include "commands/faultdomain/FaultDomainReset.h"
#include "commands/faultdomain/FaultDomainSet.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using Kalmor::AutoCli::Command;
using namespace MeskTest;
using ::testing::_;
using ::testing::Return;
using FaultDomainTest = HostTest;

// Each command with the library answering and failing. The setter and reset answer true
// even after a failure; the getter then leaves no result.
TEST_F(FaultDomainTest, EachCommandWithAndWithoutALibraryFailure) {
    ON_CALL(info, GetFaultDomainName())
        .WillByDefault(Record("GetFaultDomainName", std::string("r1")));
    ON_CALL(info, SetFaultDomainName(_)).WillByDefault(Record("SetFaultDomainName"));
    ON_CALL(info, ResetFaultDomainName()).WillByDefault(Record("ResetFaultDomainName"));
    // Asked for only in a cluster.
    ON_CALL(host, GetFaultDomainId()).WillByDefault(Return("id"));
    std::string bytes256;  // 128 two-byte characters: the limit counts bytes
    for (int i = 0; i < 128; ++i) bytes256 += "\xc3\xa9";
    const std::string tooLong = "Fault domain name cannot exceed 256 characters.; true, complete";
    const struct {
        std::shared_ptr<Command> command;
        std::string options, calls, answered, failed;
        int plugins;
    } cases[] = {
        {FaultDomainGet::New(), "", "GetFaultDomainName()",
         "{faultDomainName=r1, faultDomainId=}, complete",
         "Unable to get fault domain name: x; no result, incomplete", 1},
        {FaultDomainSet::New(), "fdname=" + bytes256, "SetFaultDomainName(" + bytes256 + ")",
         "true, complete", "Unable to set fault domain name: x; true, complete", 1},
        {FaultDomainSet::New(), "fdname=", "ResetFaultDomainName()", "true, complete",
         "Unable to set fault domain name: x; true, complete", 1},
        {FaultDomainSet::New(), "fdname=" + bytes256 + "a", "", tooLong, tooLong, 0},
        {FaultDomainReset::New(), "", "ResetFaultDomainName()", "true, complete",
         "Unable to reset fault domain name; true, complete", 1},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.command->GetDescription());
        for (const bool fails : {false, true}) {
            calls.clear(), failure = fails ? "x" : "", host.pluginsMade = 0;
            EXPECT_EQ(Outcome(*Run(*c.command, c.options)), fails ? c.failed : c.answered);
            EXPECT_EQ(calls, c.calls);
            EXPECT_EQ(host.pluginsMade, c.plugins);
        }
    }
    failure.clear();
    SetEnabled(true);
    EXPECT_EQ(Outcome(*Run(*FaultDomainGet::New())),
              "{faultDomainName=r1, faultDomainId=id}, complete");
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
