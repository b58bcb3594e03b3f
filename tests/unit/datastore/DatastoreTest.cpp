#include "MockHost.h"
#include "commands/datastore/DatastoreNameGet.h"
#include "commands/datastore/DatastoreNameSet.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using Kalmor::AutoCli::Command;
using namespace MeskTest;
using ::testing::_;
using DatastoreTest = HostTest;

// Each command with the library answering and failing. The setter answers true even after a
// failure; the getter then leaves no result.
TEST_F(DatastoreTest, EachCommandWithAndWithoutALibraryFailure) {
    ON_CALL(info, GetDatastoreName()).WillByDefault(Record("GetDatastoreName", std::string("ds")));
    ON_CALL(info, SetDatastoreName(_)).WillByDefault(Record("SetDatastoreName"));
    const struct {
        std::shared_ptr<Command> command;
        std::string options, calls, answered, failed;
    } cases[] = {
        {DatastoreNameGet::New(), "", "GetDatastoreName()", "{Name=ds}, complete",
         "Unable to get Mesk datastore name: x; no result, incomplete"},
        {DatastoreNameSet::New(), "newname=n", "SetDatastoreName(n)", "true, complete",
         "Unable to set Mesk datastore name: x; true, complete"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.command->GetDescription());
        for (const bool fails : {false, true}) {
            calls.clear(), failure = fails ? "x" : "", host.pluginsMade = 0;
            EXPECT_EQ(Outcome(*Run(*c.command, c.options)), fails ? c.failed : c.answered);
            EXPECT_EQ(calls, c.calls);
            EXPECT_EQ(host.pluginsMade, 1);
        }
    }
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
