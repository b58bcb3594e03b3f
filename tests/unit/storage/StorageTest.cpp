#include <algorithm>
#include <map>
#include <memory>
#include <sstream>
#include <string>
#include <vector>

#include "MockHost.h"
#include "commands/storage/StorageAdd.h"
#include "commands/storage/StorageAutoModeGet.h"
#include "commands/storage/StorageAutoModeSet.h"
#include "commands/storage/StorageDiskgroupMount.h"
#include "commands/storage/StorageDiskgroupUmount.h"
#include "commands/storage/StorageList.h"
#include "commands/storage/StorageRemove.h"
#include "commands/storage/StorageTagAdd.h"
#include "commands/storage/StorageTagRemove.h"
#include "hostctl/MeskUtil.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using Kalmor::AutoCli::Command;
using Kalmor::CallSpec::Input;
using Kalmor::CallSpec::Output;
using Kalmor::MetaObj::MetaBool;
using namespace MeskTest;
using ::testing::_;
using ::testing::ElementsAre;
using ::testing::ElementsAreArray;

enum Result { kNone, kFalse, kTrue };

Result ResultOf(const Kalmor::CallSpec::Output& output) {
    auto value = std::dynamic_pointer_cast<MetaBool>(output.GetRootObject());
    return !value ? kNone : value->GetValue() ? kTrue : kFalse;
}

// Records every changing call of the library as "Operation(arguments)"; while `failing` is
// set, each call then throws.
class StorageCommandTest : public HostTest {
  protected:
    StorageCommandTest() {
        auto record = [this](const char* op) {
            return [this, op](const auto&... args) {
                std::ostringstream call;
                const char* separator = "";
                call << std::boolalpha << op << '(';
                ((call << separator << args, separator = ","), ...);
                calls += call.str() + ")";
                if (failing) throw HostCtl::Lib::Mesk::MeskCtlException("busy");
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
        ON_CALL(info, RemoveCapacityFlashTag(_)).WillByDefault(record("RemoveCapacityFlashTag"));
        ON_CALL(info, SetAutoClaimMode(_)).WillByDefault(record("SetAutoClaimMode"));
        ON_CALL(info, AddDisks(_, _))
            .WillByDefault([this](const std::string& ssd, const std::vector<std::string>& disks) {
                calls += "AddDisks(" + ssd;
                for (const auto& disk : disks) calls += "," + disk;
                calls += ")";
                if (failing) throw HostCtl::Lib::Mesk::MeskCtlException("busy");
            });
    }

    std::string calls;
    bool failing = false;
};

TEST_F(StorageCommandTest, ValidatesOptionsThenDispatchesToOneOperation) {
    const std::string one = "At most one of --disk or --ssd or --uuid can be specified.";
    const std::string mode =
        "Expected a single value from the set [noAction, ensureObjectAccessibility, "
        "evacuateAllData] got '";
    const struct {
        std::shared_ptr<Command> command;
        std::string options, calls, error;  // error empty: none
        Result result;
    } cases[] = {
        {StorageAdd::New(), "ssd=s1 disks=h1 disks=h2", "AddDisks(s1,h1,h2)", "", kTrue},
        {StorageTagAdd::New(), "tag=capacityFlash disk=d1", "AddCapacityFlashTag(d1)", "", kTrue},
        {StorageTagRemove::New(), "tag=capacityFlash disk=d1", "RemoveCapacityFlashTag(d1)", "",
         kTrue},
        {StorageAutoModeSet::New(), "enabled=true", "SetAutoClaimMode(true)", "", kTrue},
        {StorageRemove::New(), "disk=d1", "RemoveDisk(d1,)", "", kTrue},
        {StorageRemove::New(), "ssd=s1 evacuation-mode=evacuateAllData",
         "RemoveDiskGroup(s1,EvacuateAllData)", "", kTrue},
        {StorageRemove::New(), "uuid=u1 evacuation-mode=EnsureObjectAccessibility",
         "RemoveDiskByUuid(u1,EnsureObjectAccessibility)", "", kTrue},
        {StorageRemove::New(), "ssd= uuid=b evacuation-mode=bad", "", one, kNone},
        {StorageRemove::New(), "disk=a evacuation-mode=noaction", "", mode + "noaction'", kNone},
        {StorageRemove::New(), "disk=a evacuation-mode=", "", mode + "'", kNone},
        {StorageRemove::New(), "evacuation-mode=bad", "", mode + "bad'", kNone},
        {StorageRemove::New(), "", "", "No option provided", kNone},
        {StorageDiskgroupMount::New(), "ssd=s1", "MountDiskGroup(s1,false)", "", kTrue},
        {StorageDiskgroupMount::New(), "uuid=u1", "MountByUuid(u1)", "", kTrue},
        {StorageDiskgroupMount::New(), "disk=", "MountDisk()", "", kTrue},
        {StorageDiskgroupMount::New(), "ssd=s1 uuid=u1", "",
         "Specify only one of --ssd, --disk or --uuid.", kNone},
        {StorageDiskgroupMount::New(), "", "", "Either --ssd, --disk or --uuid is required",
         kFalse},
        {StorageDiskgroupUmount::New(), "ssd=s1", "UnmountDiskGroup(s1,true)", "", kTrue},
        {StorageDiskgroupUmount::New(), "disk=d1", "UnmountDisk(d1,true)", "", kTrue},
        {StorageDiskgroupUmount::New(), "disk=d1 ssd=", "", "Can't specify both --disk and --ssd.",
         kNone},
        {StorageDiskgroupUmount::New(), "", "", "Need one of --disk or --ssd.", kNone},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.command->GetDescription() + " " + c.options);
        calls.clear();
        auto output = Run(*c.command, InputOf(c.options));
        EXPECT_EQ(calls, c.calls);
        EXPECT_EQ(Errors(*output),
                  c.error.empty() ? std::vector<std::string>{} : std::vector<std::string>{c.error});
        EXPECT_EQ(ResultOf(*output), c.result);
        // Only a success completes: mount's missing target answers false yet stays incomplete.
        EXPECT_EQ(output->IsComplete(), c.error.empty());
    }
}

TEST_F(StorageCommandTest, AutomodeGetReportsTheLibrarysMode) {
    for (const bool enabled : {true, false}) {
        EXPECT_CALL(info, GetAutoClaimMode()).WillOnce(::testing::Return(enabled));
        auto output = Run(*StorageAutoModeGet::New());
        EXPECT_TRUE(Errors(*output).empty() && output->IsComplete());
        EXPECT_EQ(BoolField(output->GetRootObject(), "Enabled"), enabled);
    }
}

// Each command names what failed before the library's text; all but automode set then leave
// no result, while automode set still answers true and completes.
TEST_F(StorageCommandTest, LibraryFailureIsPrefixedPerCommand) {
    failing = true;
    EXPECT_CALL(info, GetAutoClaimMode()).WillOnce(Fail("busy"));
    const struct {
        std::shared_ptr<Command> command;
        std::string options, message;
    } cases[] = {
        {StorageAdd::New(), "ssd=s1 disks=h1", "Unable to add device: busy"},
        {StorageRemove::New(), "disk=d1", "Unable to remove device: busy"},
        {StorageDiskgroupMount::New(), "disk=d1", "Unable to mount: busy"},
        {StorageDiskgroupUmount::New(), "disk=d1", "Unable to unmount: busy"},
        {StorageTagAdd::New(), "disk=d1", "Unable to add tag to disk: busy"},
        {StorageTagRemove::New(), "disk=d1", "Unable to remove tag for disk: busy"},
        {StorageAutoModeGet::New(), "", "Unable to get Mesk storage auto claim mode: busy"},
        {StorageAutoModeSet::New(), "enabled=false", "Unable to set storage auto claim mode: busy"},
    };
    for (const auto& c : cases) {
        auto output = Run(*c.command, InputOf(c.options));
        EXPECT_THAT(Errors(*output), ElementsAre(c.message));
        const bool answersTrue = c.message.rfind("Unable to set storage", 0) == 0;
        EXPECT_EQ(ResultOf(*output), answersTrue ? kTrue : kNone) << c.message;
        EXPECT_EQ(output->IsComplete(), answersTrue) << c.message;
    }
}

// The command reference shows newlines as blanks; each evacuation mode is on a line of its own.
TEST(StorageRemoveHelp, EvacuationModesStandOnIndentedLinesOfTheirOwn) {
    auto mode = StorageRemove::New()->GetInputSpecInternal()->FindParameter("evacuation-mode");
    const std::string& help = mode->GetDescription();
    EXPECT_EQ(std::count(help.begin(), help.end(), '\n'), 3);
    for (const char* line :
         {"\n    ensureObjectAccessibility: ", "\n    evacuateAllData: ", "\n    noAction: "}) {
        EXPECT_NE(help.find(line), std::string::npos) << line;
    }
}

const std::string kA = "0a000000-0000-0000-0000-000000000001";
const std::string kB = "5b000000-0000-0000-0000-000000000002";
const std::string kC = "ac000000-0000-0000-0000-000000000003";

// A host whose LUNs are `luns` (name, UUID text) and whose service holds `service`. Each disk
// query reports the UUID it was asked for as "MESK UUID" and checks what the command handed it.
class StorageListTest : public HostTest {
  protected:
    void SetHost(const std::vector<std::pair<std::string, std::string>>& luns,
                 const std::vector<std::string>& service) {
        ON_CALL(host, GetMeskDisks(_)).WillByDefault([luns](LunList& out) {
            for (const auto& [name, uuid] : luns) {
                out.push_back(std::make_shared<FakeLun>(name, UuidOf(uuid)));
            }
        });
        ON_CALL(info, GetMeskDiskUuids(_)).WillByDefault([service](std::vector<Uuid>& out) {
            for (const auto& text : service) out.push_back(UuidOf(text));
        });
        ON_CALL(info, GetDiskInfo(_, _, _))
            .WillByDefault([count = luns.size()](const Uuid& uuid, const LunList& luns,
                                                 HostCtl::Mesk::MeskDiskInfo& d) {
                EXPECT_EQ(luns.size(), count) << "the disk query lacks the LUN list";
                EXPECT_TRUE(d.name.empty() && d.meskUuid.empty() && d.formatVersion == 0)
                    << "the disk query got a used record";
                d.meskUuid = ZuvCtl::Mesk::MeskUtil::MeskUuidToString(uuid);
                d.name = "name-" + d.meskUuid;
                d.deduplication = d.meskUuid[0] == '5';
            });
    }

    // The "MESK UUID" of each listed disk.
    static std::vector<std::string> Listed(const Output& output) {
        std::vector<std::string> uuids;
        for (const auto& row : ListElements(output.GetRootObject())) {
            uuids.push_back(TextField(row, "MESK UUID"));
        }
        return uuids;
    }
};

// Only a non-empty filter filters, and only through the LUNs: the service's list is used
// without a filter alone. Both filters together are refused before the host is asked.
TEST_F(StorageListTest, FiltersByNonEmptyValueAndOnlyThroughTheLuns) {
    const struct {
        std::string filters;
        std::vector<std::string> listed, errors;
    } cases[] = {
        {"", {kA, kB, kC}, {}},
        {"device= uuid=", {kA, kB, kC}, {}},
        {"device=mpx.b", {kB}, {}},
        {"device=MPX.B", {}, {"Unable to find device with name: MPX.B"}},
        {"uuid=" + kA, {kA}, {}},
        {"uuid=" + kC, {}, {"Unable to find device with uuid: " + kC}},
        {"uuid=not-a-uuid", {}, {"Unable to list devices: bad uuid"}},
    };
    SetHost({{"mpx.b", kB}, {"mpx.a", kA}}, {kC, kB});  // kC has no LUN
    ON_CALL(host, StringToMeskUuid("not-a-uuid")).WillByDefault(Fail("bad uuid"));
    for (const auto& c : cases) {
        SCOPED_TRACE(c.filters);
        auto output = Run(*StorageList::New(), InputOf(c.filters));
        EXPECT_EQ(Listed(*output), c.listed);
        EXPECT_EQ(Errors(*output), c.errors);
        EXPECT_TRUE(output->IsComplete());
    }
    EXPECT_CALL(host, GetMeskDisks(_)).Times(0);
    auto output = Run(*StorageList::New(), InputOf("device=nowhere uuid=" + kA));
    EXPECT_THAT(Errors(*output), ElementsAre("Only one of --device or --uuid can be specified."));
    EXPECT_TRUE(output->GetRootObject() == nullptr && !output->IsComplete());
}

TEST_F(StorageListTest, MergesLunsAndServiceInByteOrderOnce) {
    SetHost({{"c", kC}, {"a", kA}, {"c2", kC}}, {kB, kA, kC, kB});
    EXPECT_CALL(info, GetDiskInfo(_, _, _)).Times(3);
    auto output = Run(*StorageList::New(), InputOf(""));
    EXPECT_THAT(Listed(*output), ElementsAreArray({kA, kB, kC}));
    EXPECT_TRUE(Errors(*output).empty());
    for (const auto& row : ListElements(output->GetRootObject())) {
        EXPECT_EQ(TextField(row, "Display Name"), TextField(row, "Device"));
        EXPECT_EQ(BoolField(row, "Compression"), BoolField(row, "Deduplication"));
    }
}

TEST_F(StorageListTest, FailureOnADiskKeepsTheDisksBeforeItAndCompletes) {
    SetHost({{"a", kA}, {"b", kB}, {"c", kC}}, {});
    EXPECT_CALL(info, GetDiskInfo(_, _, _)).Times(::testing::AnyNumber());
    EXPECT_CALL(info, GetDiskInfo(UuidOf(kB), _, _)).WillOnce(Fail("disk gone"));
    EXPECT_CALL(info, GetDiskInfo(UuidOf(kC), _, _)).Times(0);
    auto output = Run(*StorageList::New(), InputOf(""));
    EXPECT_THAT(Listed(*output), ElementsAre(kA));
    EXPECT_THAT(Errors(*output), ElementsAre("Unable to list devices: disk gone"));
    EXPECT_TRUE(output->IsComplete());
}

TEST(StorageListVersion, ShowsKnownCodesAndUnknownForTheRest) {
    const std::map<int32_t, std::string> table = {{0, "1"},         {1, "<Unknown>"}, {2, "2"},
                                                  {3, "2.5"},       {4, "3"},         {5, "5"},
                                                  {6, "<Unknown>"}, {-1, "<Unknown>"}};
    StorageList list;
    for (const auto& [code, text] : table) EXPECT_EQ(list.MarshalVersion(code)->GetValue(), text);
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
