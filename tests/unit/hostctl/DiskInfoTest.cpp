// GetDiskInfo reads a disk's stored record field by field, without building a document.
#include "SimFixture.h"
#include "StateDocument.h"
#include "hostctl/MeskUtil.h"

namespace SimTest {
namespace {

using HostCtl::Mesk::MeskDiskInfo;
using ZuvCtl::Mesk::MeskUtil;

using SimDiskInfo = SimFixture;

TEST_F(SimDiskInfo, ReadsEveryFieldOfTheRecord) {
    // Every value differs from the record's default and from its neighbours, so that a field
    // read under another key's name shows; the name needs unescaping.
    Json document = State();
    document["services"] = HostCtlSim::DefaultHost()["services"];
    Json& disk = document["storage"]["disks"][0];
    disk["name"] = "mpx.pthba2:C0:T0:L0 \"quoted\" \\ \u00e9";
    disk["diskGroupUuid"] = disk["uuid"];
    disk["diskGroupName"] = "group one";
    disk["usedByThisHost"] = true;
    disk["inKovra"] = true;
    disk["formatVersion"] = 4;
    disk["deduplication"] = true;
    disk["checksum"] = "a1b2";
    disk["checksumOk"] = true;
    disk["isCapacityTier"] = false;
    disk["encryption"] = true;
    disk["diskKeyLoaded"] = true;
    disk["capacityBytes"] = uint64_t{5000000000123};
    disk["mounted"] = true;
    disk["capacityFlashTag"] = false;
    host_->Store().Replace(HostCtlSim::NormalizeHost(document));

    MeskDiskInfo info;
    Info().GetDiskInfo(MeskUtil::StringToMeskUuid(kSsdUuid), {}, info);
    EXPECT_EQ(info.name, "mpx.pthba2:C0:T0:L0 \"quoted\" \\ \u00e9");
    EXPECT_TRUE(info.isSsd);
    EXPECT_EQ(info.meskUuid, kSsdUuid);
    EXPECT_EQ(info.diskGroupUuid, kSsdUuid);
    EXPECT_EQ(info.diskGroupName, "group one");
    EXPECT_TRUE(info.usedByThisHost);
    EXPECT_TRUE(info.inKovra);
    EXPECT_EQ(info.formatVersion, 4);
    EXPECT_TRUE(info.deduplication);
    EXPECT_EQ(info.checksum, "a1b2");
    EXPECT_TRUE(info.checksumOk);
    EXPECT_FALSE(info.isCapacityTier);
    EXPECT_TRUE(info.encryption);
    EXPECT_TRUE(info.diskKeyLoaded);
    EXPECT_EQ(info.capacityBytes, 5000000000123u);
    EXPECT_TRUE(info.isMounted);
    EXPECT_FALSE(info.capacityFlashTag);
}

}  // namespace
}  // namespace SimTest
