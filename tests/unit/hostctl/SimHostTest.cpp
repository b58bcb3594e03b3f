// What the simulated host does with each operation: the state it keeps coherent, and the
// refusals that leave it unchanged.
#include <functional>

#include "SimFixture.h"
#include "hostctl/MeskUtil.h"

namespace SimTest {
namespace {

using HostCtl::Mesk::MeskDiskInfo;
using HostCtl::Mesk::MeskIpAddress;
using HostCtl::Mesk::MeskMemberInfo;
using HostCtl::Network::Ipv4Address;
using HostCtl::Network::Ipv6Address;
using ZuvCtl::Mesk::MeskUtil;

using SimHost = SimFixture;

MeskDiskInfo DiskInfo(HostCtl::Mesk::MeskInfo& info, const std::string& uuid) {
    MeskDiskInfo disk;
    info.GetDiskInfo(MeskUtil::StringToMeskUuid(uuid), {}, disk);
    return disk;
}

TEST_F(SimHost, JoinMakesTheHostItsOnlyMemberAndLeaveClearsIt) {
    std::vector<MeskMemberInfo> members;
    std::string state, local, health, membership, master, backup, maintenance;
    uint64_t revision = 0;
    auto readMembership = [&] {
        MeskUtil::GetInfoFromKOVRA(members, state, local, health, revision, membership, master,
                                   backup, maintenance);
    };
    auto before = Info().GetConfigGeneration();
    Info().JoinCluster(MeskUtil::StringToMeskUuid(kClusterUuid), false, "", true, 0);
    EXPECT_TRUE(Info().GetClusterConfig().enabled);
    readMembership();
    std::string self = State()["host"]["nodeUuid"];
    ASSERT_EQ(members.size(), 1u);
    EXPECT_EQ((std::vector<std::string>{local, master, members[0].uuid}),
              std::vector<std::string>(3, self));
    EXPECT_EQ(revision, 1u);
    auto joined = Info().GetConfigGeneration();
    EXPECT_EQ(joined.generation, before.generation + 1);
    EXPECT_GT(joined.timestamp, 1500000000000u);

    Info().LeaveCluster(false);
    EXPECT_EQ(Info().GetClusterConfig().clusterUuid, "");
    readMembership();
    EXPECT_TRUE(members.empty());
    EXPECT_EQ(Info().GetConfigGeneration().generation, joined.generation + 1);
}

TEST_F(SimHost, RefusalsNameTheFaultAndChangeNothing) {
    Info().AddDisks(kSsd, {kHdd1});
    MeskIpAddress v4(Ipv4Address("192.168.10.21"));
    Info().AddUnicastAgent(kClusterUuid, false, true, v4, 12321, false, "");
    auto cluster = MeskUtil::StringToMeskUuid(kClusterUuid);
    const std::vector<std::string> secondInUse = {kHdd2, kHdd1};
    struct Refusal {
        const char* message;
        std::function<void(HostCtl::Mesk::MeskInfo2&)> action;
    };
    const Refusal outsideCluster[] = {
        {"Invalid cluster UUID", [](auto& i) { i.CreateCluster("not-a-uuid", true, false); }},
        {"Invalid cluster UUID",
         [](auto& i) { i.JoinCluster(HostCtl::Mesk::Uuid(), false, "", false, 0); }},
        {"preferred fault domain", [&](auto& i) { i.JoinCluster(cluster, true, "", false, 0); }},
        {"not in a Mesk cluster", [](auto& i) { i.LeaveCluster(false); }},
        {"Unknown disk", [](auto& i) { i.AddDisks("mpx.none", {kHdd2}); }},
        {"not an SSD", [](auto& i) { i.AddDisks(kHdd2, {kHdd3}); }},
        // The first disk would do: nothing of the request may be applied.
        {"already in use", [&](auto& i) { i.AddDisks(kSsd, secondInUse); }},
        {"is given more than once",
         [](auto& i) {
             i.AddDisks(kSsd, {kHdd2, kHdd2});
         }},
        {"No capacity disk", [](auto& i) { i.AddDisks(kSsd, {}); }},
        {"evacuation mode", [](auto& i) { i.RemoveDisk(kHdd1, "noAction"); }},
        {"not in use", [](auto& i) { i.RemoveDisk(kHdd2, ""); }},
        {"fronting SSD", [](auto& i) { i.RemoveDisk(kSsd, ""); }},
        {"not the fronting", [](auto& i) { i.RemoveDiskGroup(kHdd1, ""); }},
        {"No Mesk disk",
         [](auto& i) { i.RemoveDiskByUuid("52a0e7c4-0000-0000-0000-000000000000", ""); }},
        {"in use", [](auto& i) { i.AddCapacityFlashTag(kSsd); }},
        {"not configured", [](auto& i) { i.RemoveZuvNic("nosuch", false, "mesk"); }},
        {"Unknown traffic type", [](auto& i) { i.IsZuvNicInUse("zuvnic2", "Mesk"); }},
        {"already configured",
         [&](auto& i) { i.AddUnicastAgent(kClusterUuid, false, true, v4, 12321, false, ""); }},
        {"Invalid node UUID",
         [&](auto& i) { i.AddUnicastAgent("u1", false, true, v4, 1, false, ""); }},
        {"No unicast agent", [&](auto& i) { i.RemoveUnicastAgent(kClusterUuid, v4, 1); }},
        // An IPv6 address is bracketed, so that its last group cannot be read as the port.
        {"at [fe80::10]:2000",
         [](auto& i) {
             i.RemoveUnicastAgent(kClusterUuid, MeskIpAddress(Ipv6Address("fe80::10")), 2000);
         }},
        {"cannot be empty", [](auto& i) { i.SetDatastoreName(""); }},
        {"Unknown policy class", [](auto& i) { i.GetDefaultPolicy("VDISK"); }},
        {"throttle", [](auto& i) { i.SetResyncThrottle(-1); }},
    };
    for (const Refusal& r : outsideCluster) {
        SCOPED_TRACE(r.message);
        ExpectRefusal(r.message, [&] { r.action(Info()); });
    }
    // Upper-case digits are accepted and kept in lower case.
    Info().CreateCluster("52F1C2A0-7B3E-4D01-9A6E-00A1B2C3D4E5", true, false);
    EXPECT_EQ(Info().GetClusterConfig().clusterUuid, kClusterUuid);
    ExpectRefusal("already a member", [&] { Info().CreateCluster(kSsdUuid, true, false); });
    ExpectRefusal("witness node", [&] { Info().SetPreferredFaultDomain("site-c"); });
}

TEST_F(SimHost, TaggedSsdServesAsCapacityDisk) {
    const char* ssd2 = "mpx.pthba2:C0:T4:L0";
    Json document = State();
    Json disk = document["storage"]["disks"][0];
    disk["name"] = ssd2;
    disk["uuid"] = "52a0e7c4-1b2d-4e3f-8a90-0b1c2d3e4f05";
    document["storage"]["disks"].push_back(disk);
    Load(document);
    ExpectRefusal("capacityFlash", [&] { Info().AddDisks(kSsd, {ssd2}); });
    Info().AddCapacityFlashTag(ssd2);
    Info().AddDisks(kSsd, {ssd2});
    EXPECT_TRUE(DiskInfo(Info(), disk["uuid"].get<std::string>()).isCapacityTier);
}

TEST_F(SimHost, GetDiskInfoReadsEveryFieldOfTheRecord) {
    // Every value differs from the record's default and from its neighbours, so that a field
    // read under another key's name shows; the name needs unescaping.
    Json document = State();
    document["storage"]["disks"][0].update(Json::parse(R"({
        "name": "mpx.pthba2:C0:T0:L0 \"quoted\" \\ \u00e9",
        "diskGroupUuid": "52a0e7c4-1b2d-4e3f-8a90-0b1c2d3e4f01", "diskGroupName": "group one",
        "usedByThisHost": true, "inKovra": true, "formatVersion": 4,
        "deduplication": true, "checksum": "a1b2", "checksumOk": true, "isCapacityTier": false,
        "encryption": true, "diskKeyLoaded": true, "capacityBytes": 5000000000123, "mounted": true,
        "capacityFlashTag": false})"));
    Load(document);
    MeskDiskInfo info = DiskInfo(Info(), kSsdUuid);
    EXPECT_EQ(info.name, "mpx.pthba2:C0:T0:L0 \"quoted\" \\ \u00e9");
    EXPECT_EQ(info.meskUuid, kSsdUuid);
    EXPECT_EQ(info.diskGroupUuid, kSsdUuid);
    EXPECT_EQ(info.diskGroupName, "group one");
    EXPECT_EQ(info.formatVersion, 4);
    EXPECT_EQ(info.checksum, "a1b2");
    EXPECT_EQ(info.capacityBytes, 5000000000123u);
    EXPECT_TRUE(info.isSsd && info.usedByThisHost && info.inKovra && info.deduplication &&
                info.checksumOk && info.encryption && info.diskKeyLoaded && info.isMounted);
    EXPECT_FALSE(info.isCapacityTier || info.capacityFlashTag);
}

TEST_F(SimHost, UnicastAgentIsRemovedByItsAddressHoweverWritten) {
    const std::string none = "00000000-0000-0000-0000-000000000000";
    Info().AddUnicastAgent(none, true, false, MeskIpAddress(Ipv6Address("fe80::1")), 12321, false,
                           "");
    // The result tells whether the removed agent was a witness.
    EXPECT_TRUE(Info().RemoveUnicastAgent(none, MeskIpAddress(Ipv6Address("FE80:0::1")), 12321));
    std::vector<std::string> agents;
    Info().GetUnicastAgents(agents);
    EXPECT_TRUE(agents.empty());
}

}  // namespace
}  // namespace SimTest
