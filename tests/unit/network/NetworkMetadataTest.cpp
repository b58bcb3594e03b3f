#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <functional>
#include <string>
#include <utility>
#include <vector>

#include "autocli/AutoCli.h"
#include "autocli/MetaObj.h"
#include "commands/network/NetworkClear.h"
#include "commands/network/NetworkIpAdd.h"
#include "commands/network/NetworkIpRemove.h"
#include "commands/network/NetworkIpSet.h"
#include "commands/network/NetworkList.h"
#include "commands/network/NetworkRemove.h"
#include "commands/network/NetworkRestore.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using Kalmor::MetaObj::MetaType;
using Pairs = std::vector<std::pair<std::string, std::string>>;
using ::testing::HasSubstr;

// Each parameter as "name -short kind required", kind as the framework numbers it.
const std::vector<std::string> kAddSetParameters = {
    "interface-name -i 0 1", "agent-mc-addr -d 0 0",  "agent-v6-mc-addr -D 0 0",
    "agent-mc-port -p 1 0",  "master-mc-addr -u 0 0", "master-v6-mc-addr -U 0 0",
    "master-mc-port -o 1 0", "host-uc-port -c 1 0",   "multicast-ttl -t 1 0",
    "traffic-type -T 4 0"};
const std::vector<std::string> kRemoveParameters = {"interface-name -i 0 1", "force -f 3 0"};

struct Metadata {
    std::function<std::shared_ptr<Kalmor::AutoCli::Command>()> make;
    std::string description, type, formatter;
    Pairs outputParameters;
    std::vector<std::string> parameters;
    MetaType result;
};

TEST(NetworkCommands, DeclareTheirMetadataParametersAndResult) {
    const auto kBool = Kalmor::MetaObj::META_BOOL;
    const Metadata commands[] = {
        {[] { return NetworkIpAdd::New(); },
         "Add an IP interface to the Mesk network configuration.",
         "operation",
         "",
         {},
         kAddSetParameters,
         kBool},
        {[] { return NetworkIpSet::New(); },
         "Reconfigure an IP interface in the Mesk network configuration.",
         "operation",
         "",
         {},
         kAddSetParameters,
         kBool},
        {[] { return NetworkIpRemove::New(); },
         "Remove an IP interface from the Mesk network configuration.",
         "operation",
         "",
         {},
         kRemoveParameters,
         kBool},
        {[] { return NetworkRemove::New(); },
         "Remove an interface from the Mesk network configuration.",
         "operation",
         "",
         {},
         kRemoveParameters,
         kBool},
        {[] { return NetworkClear::New(); },
         "Clear the Mesk network configuration.",
         "operation",
         "",
         {},
         {},
         kBool},
        {[] { return NetworkRestore::New(); },
         "Restore the persisted Mesk network configuration.",
         "operation",
         "",
         {},
         {},
         kBool},
        {[] { return NetworkList::New(); },
         "List the network configuration currently in use by Mesk.",
         "fetcher",
         "simple",
         {{"header:MeskNetworkList", "Interface"},
          {"fields:MeskNetworkList",
           "ZuvNic Name,IP Protocol,Interface UUID,Agent Group Multicast Address,Agent Group "
           "IPv6 Multicast Address,Agent Group Multicast Port,Master Group Multicast "
           "Address,Master Group IPv6 Multicast Address,Master Group Multicast Port,Host "
           "Unicast Channel Bound Port,Multicast TTL,Traffic Type"}},
         {},
         Kalmor::MetaObj::META_LIST},
    };
    for (const auto& expected : commands) {
        auto command = expected.make();
        SCOPED_TRACE(expected.description);
        EXPECT_EQ(command->GetDescription(), expected.description);
        EXPECT_EQ(command->GetMetaData(), (Pairs{{"type", expected.type}}));
        EXPECT_EQ(command->GetDefaultOutputFormatter(), expected.formatter);
        EXPECT_EQ(command->GetDefaultOutputParameters(), expected.outputParameters);

        std::vector<std::string> parameters;
        auto input = command->GetInputSpecInternal();
        for (const auto& p : input->GetParameters()) {
            parameters.push_back(p->GetName() + " -" + p->GetShortName() + " " +
                                 std::to_string(p->GetType()) + " " +
                                 std::to_string(p->IsRequired()));
            EXPECT_FALSE(p->GetDescription().empty()) << p->GetName();
            EXPECT_EQ(p->GetConstraint(), nullptr) << p->GetName();
        }
        EXPECT_EQ(parameters, expected.parameters);
        EXPECT_EQ(command->GetOutputSpecInternal()->GetRootObject()->GetType(), expected.result);
    }
}

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
