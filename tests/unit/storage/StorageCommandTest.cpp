#include <memory>
#include <sstream>
#include <string>
#include <vector>

#include "MockHost.h"
#include "commands/storage/StorageAdd.h"
#include "commands/storage/StorageAutoModeSet.h"
#include "commands/storage/StorageDiskgroupMount.h"
#include "commands/storage/StorageDiskgroupUmount.h"
#include "commands/storage/StorageRemove.h"
#include "commands/storage/StorageTagAdd.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using Kalmor::AutoCli::Command;
using Kalmor::CallSpec::Input;
using Kalmor::MetaObj::MetaBool;
using MeskTest::Fail;
using ::testing::_;
using ::testing::ElementsAre;

enum class Result { None, False, True };

// Records every changing call of the library as "Operation(arguments)".
class StorageCommandTest : public MeskTest::HostTest {
  protected:
    StorageCommandTest() {
        auto record = [this](const char* op) {
            return [this, op](const auto&... args) {
                std::ostringstream call;
                const char* separator = "";
                call << std::boolalpha << op << '(';
                ((call << separator << args, separator = ","), ...);
                calls.push_back(call.str() + ")");
            };
        };
        ON_CALL(info, RemoveDisk(_, _)).WillByDefault(record("RemoveDisk"));
        ON_CALL(info, RemoveDiskGroup(_, _)).WillByDefault(record("RemoveDiskGroup"));
        ON_CALL(info, RemoveDiskByUuid(_, _)).WillByDefault(record("RemoveDiskByUuid"));
        ON_CALL(info, MountDiskGroup(_, _)).WillByDefault(record("MountDiskGroup"));
        ON_CALL(info, MountByUuid(_)).WillByDefault(record("MountByUuid"));
        ON_CALL(info, MountDisk(_)).WillByDefault(record("MountDisk"));
        ON_CALL(info, UnmountDiskGroup(_, _)).WillByDefault(record("UnmountDiskGroup"));
        ON_CALL(info, UnmountDisk(_, _)).WillByDefault(record("UnmountDisk"));
        ON_CALL(info, AddCapacityFlashTag(_)).WillByDefault(record("AddCapacityFlashTag"));
        ON_CALL(info, SetAutoClaimMode(_)).WillByDefault(record("SetAutoClaimMode"));
        ON_CALL(info, AddDisks(_, _))
            .WillByDefault([this](const std::string& ssd, const std::vector<std::string>& disks) {
                std::string call = "AddDisks(" + ssd;
                for (const auto& disk : disks) call += "," + disk;
                calls.push_back(call + ")");
            });
    }

    static Result ResultOf(const Kalmor::CallSpec::Output& output) {
        auto value = std::dynamic_pointer_cast<MetaBool>(output.GetRootObject());
        if (!value) return Result::None;
        return value->GetValue() ? Result::True : Result::False;
    }

    std::vector<std::string> calls;
};

TEST_F(StorageCommandTest, ValidatesOptionsThenDispatchesToOneOperation) {
    auto add = StorageAdd::New();
    auto remove = StorageRemove::New();
    auto mount = StorageDiskgroupMount::New();
    auto unmount = StorageDiskgroupUmount::New();
    auto tag = StorageTagAdd::New();
    auto automode = StorageAutoModeSet::New();
    struct Case {
        Command* command;
        std::vector<std::pair<std::string, std::string>> options;
        std::vector<std::string> calls;
        std::string error;  // empty: none
        Result result;
        int plugins;  // remove obtains the plug-in first; mount and unmount after their conflicts
    };
    const std::string one = "At most one of --disk or --ssd or --uuid can be specified.";
    const std::string mode =
        "Expected a single value from the set [noAction, ensureObjectAccessibility, "
        "evacuateAllData] got '";
    const std::vector<Case> cases = {
        {add.get(),
         {{"ssd", "s1"}, {"disks", "h1"}, {"disks", "h2"}},
         {"AddDisks(s1,h1,h2)"},
         "",
         Result::True,
         1},
        {tag.get(),
         {{"tag", "capacityFlash"}, {"disk", "d1"}},
         {"AddCapacityFlashTag(d1)"},
         "",
         Result::True,
         1},
        {automode.get(), {{"enabled", "true"}}, {"SetAutoClaimMode(true)"}, "", Result::True, 1},
        {remove.get(), {{"disk", "d1"}}, {"RemoveDisk(d1,)"}, "", Result::True, 1},
        {remove.get(),
         {{"ssd", "s1"}, {"evacuation-mode", "evacuateAllData"}},
         {"RemoveDiskGroup(s1,EvacuateAllData)"},
         "",
         Result::True,
         1},
        {remove.get(),
         {{"uuid", "u1"}, {"evacuation-mode", "EnsureObjectAccessibility"}},
         {"RemoveDiskByUuid(u1,EnsureObjectAccessibility)"},
         "",
         Result::True,
         1},
        {remove.get(),
         {{"disk", ""}, {"evacuation-mode", "noAction"}},
         {"RemoveDisk(,NoAction)"},
         "",
         Result::True,
         1},
        {remove.get(),
         {{"ssd", ""}, {"uuid", "b"}, {"evacuation-mode", "bad"}},
         {},
         one,
         Result::None,
         1},
        {remove.get(),
         {{"disk", "a"}, {"evacuation-mode", "noaction"}},
         {},
         mode + "noaction'",
         Result::None,
         1},
        {remove.get(), {{"disk", "a"}, {"evacuation-mode", ""}}, {}, mode + "'", Result::None, 1},
        {remove.get(), {{"evacuation-mode", "bad"}}, {}, mode + "bad'", Result::None, 1},
        {remove.get(), {}, {}, "No option provided", Result::None, 1},
        {mount.get(), {{"ssd", "s1"}}, {"MountDiskGroup(s1,false)"}, "", Result::True, 1},
        {mount.get(), {{"uuid", "u1"}}, {"MountByUuid(u1)"}, "", Result::True, 1},
        {mount.get(), {{"disk", ""}}, {"MountDisk()"}, "", Result::True, 1},
        {mount.get(),
         {{"ssd", "s1"}, {"uuid", "u1"}},
         {},
         "Specify only one of --ssd, --disk or --uuid.",
         Result::None,
         0},
        {mount.get(), {}, {}, "Either --ssd, --disk or --uuid is required", Result::False, 1},
        {unmount.get(), {{"ssd", "s1"}}, {"UnmountDiskGroup(s1,true)"}, "", Result::True, 1},
        {unmount.get(), {{"disk", "d1"}}, {"UnmountDisk(d1,true)"}, "", Result::True, 1},
        {unmount.get(),
         {{"disk", "d1"}, {"ssd", ""}},
         {},
         "Can't specify both --disk and --ssd.",
         Result::None,
         0},
        {unmount.get(), {}, {}, "Need one of --disk or --ssd.", Result::None, 1},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.command->GetDescription() + " " + ::testing::PrintToString(c.options));
        calls.clear();
        host.pluginsMade = 0;
        auto input = Input::New();
        for (const auto& option : c.options) input->AddParameterValue(option.first, option.second);
        auto output = Run(*c.command, input);
        EXPECT_EQ(calls, c.calls);
        EXPECT_EQ(output->GetErrorMessages(),
                  c.error.empty() ? std::vector<std::string>{} : std::vector<std::string>{c.error});
        EXPECT_EQ(ResultOf(*output), c.result);
        // Only a success completes: mount's missing target answers false yet stays incomplete.
        EXPECT_EQ(output->IsComplete(), c.error.empty());
        EXPECT_EQ(host.pluginsMade, c.plugins);
    }
}

// Removal and mounting leave no result after a library failure; automode set still answers
// true and completes.
TEST_F(StorageCommandTest, LibraryFailureKeepsEachCommandsResult) {
    EXPECT_CALL(info, RemoveDisk(_, _)).WillOnce(Fail("busy"));
    EXPECT_CALL(info, MountDisk(_)).WillOnce(Fail("busy"));
    EXPECT_CALL(info, SetAutoClaimMode(_)).WillOnce(Fail("busy"));
    auto input = Input::New();
    input->SetParameter("disk", "d1");
    auto removed = Run(*StorageRemove::New(), input);
    auto mounted = Run(*StorageDiskgroupMount::New(), input);
    auto automode = Run(*StorageAutoModeSet::New(), input);
    EXPECT_THAT(removed->GetErrorMessages(), ElementsAre("Unable to remove device: busy"));
    EXPECT_THAT(mounted->GetErrorMessages(), ElementsAre("Unable to mount: busy"));
    EXPECT_THAT(automode->GetErrorMessages(),
                ElementsAre("Unable to set storage auto claim mode: busy"));
    EXPECT_EQ(ResultOf(*removed), Result::None);
    EXPECT_EQ(ResultOf(*mounted), Result::None);
    EXPECT_FALSE(removed->IsComplete() || mounted->IsComplete());
    EXPECT_EQ(ResultOf(*automode), Result::True);
    EXPECT_TRUE(automode->IsComplete());
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
