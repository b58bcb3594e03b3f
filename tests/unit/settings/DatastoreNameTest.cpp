#include "MockHost.h"
#include "commands/settings/DatastoreNameGet.h"
#include "commands/settings/DatastoreNameSet.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using MeskTest::BoolResult;
using MeskTest::Errors;
using MeskTest::Fail;
using MeskTest::HostTest;
using MeskTest::TextField;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using ::testing::Return;

class DatastoreNameTest : public HostTest {};

TEST_F(DatastoreNameTest, GetReportsTheLibraryTextUnchangedIncludingEmpty) {
    for (const std::string name : {"meskDatastore", "", " spaced name "}) {
        EXPECT_CALL(info, GetDatastoreName()).WillOnce(Return(name));
        auto output = Run(*DatastoreNameGet::New());
        EXPECT_THAT(Errors(*output), IsEmpty());
        EXPECT_TRUE(output->IsComplete());
        EXPECT_EQ(TextField(output->GetRootObject(), "Name"), name);
    }
}

TEST_F(DatastoreNameTest, GetFailureIsPrefixedAndLeavesNoResult) {
    EXPECT_CALL(info, GetDatastoreName()).WillOnce(Fail("vsan down"));
    auto output = Run(*DatastoreNameGet::New());
    EXPECT_THAT(Errors(*output), ElementsAre("Unable to get Mesk datastore name: vsan down"));
    EXPECT_EQ(output->GetRootObject(), nullptr);
    EXPECT_FALSE(output->IsComplete());
}

TEST_F(DatastoreNameTest, SetIsTrueAndCompleteEvenAfterAFailure) {
    auto input = Kalmor::CallSpec::Input::New();
    input->SetParameter("newname", "");
    EXPECT_CALL(info, SetDatastoreName("")).WillOnce(Fail("busy"));
    auto output = Run(*DatastoreNameSet::New(), input);
    EXPECT_THAT(Errors(*output), ElementsAre("Unable to set Mesk datastore name: busy"));
    EXPECT_TRUE(BoolResult(*output));
    EXPECT_TRUE(output->IsComplete());
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
