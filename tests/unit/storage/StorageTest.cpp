#include <algorithm>
#include <map>

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

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using Kalmor::AutoCli::Command;
using namespace MeskTest;
using ::testing::_;
using ::testing::ElementsAre;
using StorageTest = HostTest;

// Each command checks its options, then calls one operation of the library; `failed` is the
// outcome when that operation fails with "x". A refusal calls nothing.
TEST_F(StorageTest, ChecksOptionsThenCallsOneOperation) {
    ON_CALL(info, AddDisks(_, _)).WillByDefault(Record("AddDisks"));
    ON_CALL(info, RemoveDisk(_, _)).WillByDefault(Record("RemoveDisk"));
    ON_CALL(info, RemoveDiskGroup(_, _)).WillByDefault(Record("RemoveDiskGroup"));
    ON_CALL(info, RemoveDiskByUuid(_, _)).WillByDefault(Record("RemoveDiskByUuid"));
    ON_CALL(info, MountDiskGroup(_, _)).WillByDefault(Record("MountDiskGroup"));
    ON_CALL(info, MountByUuid(_)).WillByDefault(Record("MountByUuid"));
    ON_CALL(info, MountDisk(_)).WillByDefault(Record("MountDisk"));
    ON_CALL(info, UnmountDiskGroup(_, _)).WillByDefault(Record("UnmountDiskGroup"));
    ON_CALL(info, UnmountDisk(_, _)).WillByDefault(Record("UnmountDisk"));
    ON_CALL(info, AddCapacityFlashTag(_)).WillByDefault(Record("AddCapacityFlashTag"));
    ON_CALL(info, RemoveCapacityFlashTag(_)).WillByDefault(Record("RemoveCapacityFlashTag"));
    ON_CALL(info, SetAutoClaimMode(_)).WillByDefault(Record("SetAutoClaimMode"));
    ON_CALL(info, GetAutoClaimMode()).WillByDefault(Record("GetAutoClaimMode", true));
    const std::string done = "true, complete", none = "; no result, incomplete";
    const std::string one = "At most one of --disk or --ssd or --uuid can be specified." + none;
    const std::string mode =
        "Expected a single value from the set [noAction, ensureObjectAccessibility, "
        "evacuateAllData] got '";
    const struct {
        std::shared_ptr<Command> command;
        std::string options, calls, answered, failed;  // failed: not tried when empty
    } cases[] = {
        {StorageAdd::New(), "ssd=s1 disks=h1 disks=h2", "AddDisks(s1, h1,h2)", done,
         "Unable to add device: x" + none},
        {StorageTagAdd::New(), "tag=capacityFlash disk=d1", "AddCapacityFlashTag(d1)", done,
         "Unable to add tag to disk: x" + none},
        {StorageTagRemove::New(), "tag=capacityFlash disk=d1", "RemoveCapacityFlashTag(d1)", done,
         "Unable to remove tag for disk: x" + none},
        {StorageAutoModeGet::New(), "", "GetAutoClaimMode()", "{Enabled=true}, complete",
         "Unable to get Mesk storage auto claim mode: x" + none},
        // Still true and complete after a failure.
        {StorageAutoModeSet::New(), "enabled=true", "SetAutoClaimMode(true)", done,
         "Unable to set storage auto claim mode: x; true, complete"},
        {StorageRemove::New(), "disk=d1", "RemoveDisk(d1, )", done,
         "Unable to remove device: x" + none},
        {StorageRemove::New(), "ssd=s1 evacuation-mode=evacuateAllData",
         "RemoveDiskGroup(s1, EvacuateAllData)", done, ""},
        {StorageRemove::New(), "uuid=u1 evacuation-mode=EnsureObjectAccessibility",
         "RemoveDiskByUuid(u1, EnsureObjectAccessibility)", done, ""},
        {StorageRemove::New(), "ssd= uuid=b evacuation-mode=bad", "", one, ""},
        {StorageRemove::New(), "disk=a evacuation-mode=noaction", "", mode + "noaction'" + none,
         ""},
        {StorageRemove::New(), "disk=a evacuation-mode=", "", mode + "'" + none, ""},
        {StorageRemove::New(), "evacuation-mode=bad", "", mode + "bad'" + none, ""},
        {StorageRemove::New(), "", "", "No option provided" + none, ""},
        {StorageDiskgroupMount::New(), "ssd=s1", "MountDiskGroup(s1, false)", done,
         "Unable to mount: x" + none},
        {StorageDiskgroupMount::New(), "uuid=u1", "MountByUuid(u1)", done, ""},
        {StorageDiskgroupMount::New(), "disk=", "MountDisk()", done, ""},
        {StorageDiskgroupMount::New(), "ssd=s1 uuid=u1", "",
         "Specify only one of --ssd, --disk or --uuid." + none, ""},
        // The one refusal that answers false.
        {StorageDiskgroupMount::New(), "", "",
         "Either --ssd, --disk or --uuid is required; false, incomplete", ""},
        {StorageDiskgroupUmount::New(), "ssd=s1", "UnmountDiskGroup(s1, true)", done,
         "Unable to unmount: x" + none},
        {StorageDiskgroupUmount::New(), "disk=d1", "UnmountDisk(d1, true)", done, ""},
        {StorageDiskgroupUmount::New(), "disk=d1 ssd=", "",
         "Can't specify both --disk and --ssd." + none, ""},
        {StorageDiskgroupUmount::New(), "", "", "Need one of --disk or --ssd." + none, ""},
    };
    for (const auto& c : cases) {
        for (const bool fails : {false, true}) {
            if (fails && c.failed.empty()) continue;
            SCOPED_TRACE(c.command->GetDescription() + " " + c.options + (fails ? " failing" : ""));
            calls.clear(), failure = fails ? "x" : "";
            EXPECT_EQ(Outcome(*Run(*c.command, c.options)), fails ? c.failed : c.answered);
            EXPECT_EQ(calls, c.calls);
        }
    }
}

// The command reference shows newlines as blanks; each evacuation mode is on a line of its own.
TEST(StorageRemoveHelp, EvacuationModesStandOnIndentedLinesOfTheirOwn) {
    const std::string help = StorageRemove::New()
                                 ->GetInputSpecInternal()
                                 ->FindParameter("evacuation-mode")
                                 ->GetDescription();
    EXPECT_EQ(std::count(help.begin(), help.end(), '\n'), 3);
    for (const char* line :
         {"\n    ensureObjectAccessibility: ", "\n    evacuateAllData: ", "\n    noAction: "}) {
        EXPECT_NE(help.find(line), std::string::npos) << line;
    }
}

const std::string kA = "0a000000-0000-0000-0000-000000000001";
const std::string kB = "5b000000-0000-0000-0000-000000000002";
const std::string kC = "ac000000-0000-0000-0000-000000000003";

// A host with the LUNs mpx.b (kB) and mpx.a (kA), whose service holds kC (which has no LUN)
// and kB. Each disk query answers for the UUID it was asked for, with a distinct value in
// each field, and checks what the command handed it.
class StorageListTest : public HostTest {
  protected:
    StorageListTest() {
        ON_CALL(host, GetMeskDisks(_)).WillByDefault([](LunList& out) {
            out.push_back(std::make_shared<FakeLun>("mpx.b", UuidOf(kB)));
            out.push_back(std::make_shared<FakeLun>("mpx.a", UuidOf(kA)));
        });
        ON_CALL(info, GetMeskDiskUuids(_)).WillByDefault([](std::vector<Uuid>& out) {
            out = {UuidOf(kC), UuidOf(kB)};
        });
        ON_CALL(info, GetDiskInfo(_, _, _))
            .WillByDefault([](const Uuid& uuid, const LunList& luns, MeskDiskInfo& d) {
                EXPECT_EQ(luns.size(), 2u) << "the disk query lacks the LUN list";
                EXPECT_TRUE(d.name.empty() && d.formatVersion == 0) << "a used record";
                d.meskUuid = Arg(uuid);
                d.name = "name-" + d.meskUuid.substr(0, 2);
                d.isSsd = d.inKovra = d.deduplication = d.encryption = true;
                d.diskGroupUuid = "g", d.diskGroupName = "gn", d.checksum = "c";
                d.formatVersion = 3;
            });
    }
};

// Only a non-empty filter filters, and only through the LUNs: the service's disks are listed
// without a filter alone, merged with the LUNs' in UUID text order, each once. What was found
// before a failure is still listed, and the listing is complete.
TEST_F(StorageListTest, FiltersThroughTheLunsAndMergesWithTheServiceOnlyUnfiltered) {
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
    ON_CALL(host, StringToMeskUuid("not-a-uuid")).WillByDefault(Fail("bad uuid"));
    for (const auto& c : cases) {
        SCOPED_TRACE(c.filters);
        auto output = Run(*StorageList::New(), c.filters);
        EXPECT_EQ(Elements(output->GetRootObject(), "MESK UUID"), c.listed);
        EXPECT_EQ(output->GetErrorMessages(), c.errors);
        EXPECT_TRUE(output->IsComplete());
    }
    ON_CALL(info, GetDiskInfo(UuidOf(kB), _, _)).WillByDefault(Fail("disk gone"));
    // The record's one name and one deduplication flag show under two fields each.
    EXPECT_EQ(Outcome(*Run(*StorageList::New())),
              "Unable to list devices: disk gone; [{Device=name-0a, Display Name=name-0a, "
              "Is SSD=true, MESK UUID=" +
                  kA +
                  ", MESK Disk Group UUID=g, MESK Disk Group Name=gn, Used by this host=false, "
                  "In KOVRA=true, On-disk format version=2.5, Deduplication=true, "
                  "Compression=true, Checksum=c, Checksum OK=false, Is Capacity Tier=false, "
                  "Encryption=true, DiskKeyLoaded=false}], complete");

    // Both filters together are refused before the host is asked.
    EXPECT_CALL(host, GetMeskDisks(_)).Times(0);
    EXPECT_EQ(Outcome(*Run(*StorageList::New(), "device=nowhere uuid=" + kA)),
              "Only one of --device or --uuid can be specified.; no result, incomplete");
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
