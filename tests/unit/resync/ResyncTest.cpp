#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "MockHost.h"
#include "commands/resync/ResyncBandwidthGet.h"
#include "commands/resync/ResyncThrottleGet.h"
#include "commands/resync/ResyncThrottleSet.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using Kalmor::CallSpec::Output;
using MeskTest::BoolResult;
using MeskTest::Errors;
using MeskTest::Fail;
using MeskTest::FieldNames;
using MeskTest::HostTest;
using MeskTest::IntField;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using ::testing::Mock;
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
    auto output = Run(*ResyncBandwidthGet::New());
    EXPECT_THAT(FieldNames(output->GetRootObject()), ElementsAre("Rate"));
    EXPECT_EQ(IntField(output->GetRootObject(), "Rate"), 1250);
    EXPECT_FALSE(output->IsComplete());

    ON_CALL(info, GetResyncThrottle()).WillByDefault(Return(40));
    output = Run(*ResyncThrottleGet::New());
    EXPECT_THAT(FieldNames(output->GetRootObject()), ElementsAre("Level"));
    EXPECT_EQ(IntField(output->GetRootObject(), "Level"), 40);
    EXPECT_FALSE(output->IsComplete());

    // Level 0 removes the throttle; it is passed on like any other level.
    for (const int64_t level : {0, 512}) {
        EXPECT_CALL(info, SetResyncThrottle(level));
        output = SetLevel(level);
        EXPECT_THAT(Errors(*output), IsEmpty());
        EXPECT_TRUE(BoolResult(*output));
        EXPECT_FALSE(output->IsComplete());
    }
}

TEST_F(ResyncTest, FailureGivesTheBareMessageAndNoResult) {
    const std::function<void()> breakHost[] = {
        [&] { EXPECT_CALL(info, GetResyncBandwidth()).WillOnce(Fail("x")); },
        [&] { EXPECT_CALL(info, GetResyncThrottle()).WillOnce(Fail("x")); },
        [&] { EXPECT_CALL(info, SetResyncThrottle(7)).WillOnce(Fail("x")); },
        [&] { EXPECT_CALL(host, GetMeskPlugin()).WillOnce(Fail("x")); },
    };
    const std::function<std::shared_ptr<Output>()> run[] = {
        [&] { return Run(*ResyncBandwidthGet::New()); },
        [&] { return Run(*ResyncThrottleGet::New()); },
        [&] { return SetLevel(7); },
        [&] { return Run(*ResyncBandwidthGet::New()); },
    };
    for (int i = 0; i < 4; ++i) {
        SCOPED_TRACE(i);
        breakHost[i]();
        auto output = run[i]();
        EXPECT_THAT(Errors(*output), ElementsAre("x"));
        EXPECT_EQ(output->GetRootObject(), nullptr);
        EXPECT_FALSE(output->IsComplete());
        Mock::VerifyAndClearExpectations(&info);
        Mock::VerifyAndClearExpectations(&host);
    }
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
