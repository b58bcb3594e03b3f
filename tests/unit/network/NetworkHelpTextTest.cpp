#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>

#include "autocli/AutoCli.h"
#include "commands/network/NetworkIpAdd.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using ::testing::HasSubstr;

TEST(NetworkCommands, TrafficTypeHelpKeepsItsLongStandingWording) {
    auto type = NetworkIpAdd::GetInputSpecCommon()->FindParameter("traffic-type");
    ASSERT_NE(type, nullptr);
    const std::string& help = type->GetDescription();
    EXPECT_THAT(help, ::testing::StartsWith("Network transmission type of Mesk traffic through "
                                            "a virtual network adapter.Supported values are "
                                            "mesk, witness."));
    EXPECT_THAT(help, HasSubstr("stop using virtual adpater with mesk traffic type"));
    EXPECT_THAT(help, HasSubstr("use first dicovered virtual adapter"));
    EXPECT_THAT(help, ::testing::EndsWith(
                          "Multiple traffic types can be provided in format -T type1 -T type2. "
                          "Default value is mesk, if this option is not specified."));
    EXPECT_EQ(help.size(), 699u);
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
