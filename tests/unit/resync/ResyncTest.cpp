#include <memory>

#include "MockHost.h"
#include "commands/resync/ResyncBandwidthGet.h"
#include "commands/resync/ResyncThrottleGet.h"
#include "commands/resync/ResyncThrottleSet.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using Kalmor::CallSpec::Output;
using namespace MeskTest;
using ::testing::ElementsAre;
using ::testing::Return;

class ResyncTest : public HostTest {
  protected:
    std::shared_ptr<Output> SetLevel(int64_t level) {
        auto input = Kalmor::CallSpec::Input::New();
        input->SetParameterInt("level", level);
        return Run(*ResyncThrottleSet::New(), input);
    }
};

TEST_F(ResyncTest, ResultsAreSetButNeverMarkedComplete) {
    ON_CALL(info, GetResyncBandwidth()).WillByDefault(Return(1250));
    ON_CALL(info, GetResyncThrottle()).WillByDefault(Return(40));
    auto bandwidth = Run(*ResyncBandwidthGet::New());
    auto throttle = Run(*ResyncThrottleGet::New());
    EXPECT_EQ(IntField(bandwidth->GetRootObject(), "Rate"), 1250);
    EXPECT_EQ(IntField(throttle->GetRootObject(), "Level"), 40);
    // Level 0 removes the throttle; it is passed on like any other level.
    EXPECT_CALL(info, SetResyncThrottle(0));
    auto set = SetLevel(0);
    EXPECT_TRUE(Errors(*set).empty() && BoolResult(*set));
    EXPECT_FALSE(bandwidth->IsComplete() || throttle->IsComplete() || set->IsComplete());
}

TEST_F(ResyncTest, FailureGivesTheBareMessageAndNoResult) {
    EXPECT_CALL(info, GetResyncBandwidth()).WillOnce(Fail("x"));
    EXPECT_CALL(info, GetResyncThrottle()).WillOnce(Fail("x"));
    EXPECT_CALL(info, SetResyncThrottle(7)).WillOnce(Fail("x"));
    for (const auto& output :
         {Run(*ResyncBandwidthGet::New()), Run(*ResyncThrottleGet::New()), SetLevel(7)}) {
        EXPECT_THAT(Errors(*output), ElementsAre("x"));
        EXPECT_TRUE(output->GetRootObject() == nullptr && !output->IsComplete());
    }
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
