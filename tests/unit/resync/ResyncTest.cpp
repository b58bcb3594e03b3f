#include "MockHost.h"
#include "commands/resync/ResyncBandwidthGet.h"
#include "commands/resync/ResyncThrottleGet.h"
#include "commands/resync/ResyncThrottleSet.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using namespace MeskTest;
using ::testing::Return;
using ResyncTest = HostTest;

// No resync command ever marks its output complete; a failure gives the bare message and no
// result. Level 0 removes the throttle and is passed on like any other level.
TEST_F(ResyncTest, ResultsAreNeverMarkedComplete) {
    ON_CALL(info, GetResyncBandwidth()).WillByDefault(Return(1250));
    ON_CALL(info, GetResyncThrottle()).WillByDefault(Return(40));
    EXPECT_CALL(info, SetResyncThrottle(0));
    EXPECT_EQ(Outcome(*Run(*ResyncBandwidthGet::New())), "{Rate=1250}, incomplete");
    EXPECT_EQ(Outcome(*Run(*ResyncThrottleGet::New())), "{Level=40}, incomplete");
    EXPECT_EQ(Outcome(*Run(*ResyncThrottleSet::New(), "level=0")), "true, incomplete");

    EXPECT_CALL(info, GetResyncBandwidth()).WillOnce(Fail("x"));
    EXPECT_CALL(info, GetResyncThrottle()).WillOnce(Fail("x"));
    EXPECT_CALL(info, SetResyncThrottle(7)).WillOnce(Fail("x"));
    for (const auto& output : {Run(*ResyncBandwidthGet::New()), Run(*ResyncThrottleGet::New()),
                               Run(*ResyncThrottleSet::New(), "level=7")}) {
        EXPECT_EQ(Outcome(*output), "x; no result, incomplete");
    }
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
