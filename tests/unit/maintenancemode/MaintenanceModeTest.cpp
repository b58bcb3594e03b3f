#include "MockHost.h"
#include "commands/maintenancemode/MaintenanceModeCancel.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using namespace MeskTest;
using MaintenanceModeTest = HostTest;

// A static operation of the library: no plug-in object is made, and a failure answers false.
TEST_F(MaintenanceModeTest, CancelWithAndWithoutALibraryFailure) {
    ON_CALL(host, DecomCancel()).WillByDefault(Record("DecomCancel"));
    for (const bool fails : {false, true}) {
        calls.clear(), failure = fails ? "x" : "", host.pluginsMade = 0;
        EXPECT_EQ(Outcome(*Run(*MaintenanceModeCancel::New())),
                  fails ? "x; false, complete" : "true, complete");
        EXPECT_EQ(calls, "DecomCancel()");
        EXPECT_EQ(host.pluginsMade, 0);
    }
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
