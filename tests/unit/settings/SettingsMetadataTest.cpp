#include <string>
#include <vector>

#include "MockHost.h"
#include "commands/settings/DatastoreNameGet.h"
#include "commands/settings/DatastoreNameSet.h"
#include "commands/settings/FaultDomainGet.h"
#include "commands/settings/FaultDomainReset.h"
#include "commands/settings/FaultDomainSet.h"
#include "commands/settings/MaintenanceModeCancel.h"
#include "unit/DescribeCommand.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using Lines = std::vector<std::string>;
using MeskTest::DescribeCommand;

TEST(SettingsCommands, DeclareTheirMetadataParametersAndResult) {
    EXPECT_EQ(DescribeCommand(*DatastoreNameGet::New()),
              (Lines{"Get Mesk datastore name.", "type=fetcher", "formatter=simple",
                     "DatastoreName{Name:text,}"}));
    EXPECT_EQ(DescribeCommand(*DatastoreNameSet::New()),
              (Lines{"Configure Mesk datastore name. In general, Rename should always be done at "
                     "cluster level. Across a Mesk cluster Mesk datastore name should be in sync.",
                     "type=operation",
                     "formatter=", "--newname - text required: Set Mesk datastore name.", "bool"}));
    EXPECT_EQ(DescribeCommand(*FaultDomainGet::New()),
              (Lines{"Get the fault domain name for this host.", "type=fetcher", "formatter=simple",
                     "FaultDomain{faultDomainName:text,faultDomainId:text,}"}));
    EXPECT_EQ(DescribeCommand(*FaultDomainSet::New()),
              (Lines{"Set the fault domain for this host", "type=operation", "formatter=",
                     "--fdname -n text required: Fault domain name to use for this host. Empty "
                     "string means reset to default.",
                     "bool"}));
    EXPECT_EQ(DescribeCommand(*FaultDomainReset::New()),
              (Lines{"Reset Host fault domain to default value", "type=operation",
                     "formatter=", "bool"}));
    EXPECT_EQ(DescribeCommand(*MaintenanceModeCancel::New()),
              (Lines{"Cancel an in-progress Mesk maintenance mode operation.", "type=operation",
                     "formatter=", "bool"}));
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
