// What the simulated host does with each operation: the state it keeps coherent, and the
// refusals that leave it unchanged.
#include <algorithm>
#include <functional>

#include "SimFixture.h"
#include "hostctl/MeskUtil.h"

namespace SimTest {
namespace {

using HostCtl::Mesk::MeskDiskInfo;
using HostCtl::Mesk::MeskDiskLun;
using HostCtl::Mesk::MeskIpAddress;
using HostCtl::Mesk::MeskMemberInfo;
using HostCtl::Mesk::MeskZuvNicConfig2;
using HostCtl::Network::Ipv4Address;
using HostCtl::Network::Ipv6Address;
using ZuvCtl::Mesk::MeskUtil;

using SimHost = SimFixture;

struct Membership {
    std::vector<MeskMemberInfo> members;
    std::string state, uuid, health, membershipUuid, master, backup, maintenance;
    uint64_t revision = 0;
};

Membership ReadMembership() {
    Membership m;
    MeskUtil::GetInfoFromKOVRA(m.members, m.state, m.uuid, m.health, m.revision, m.membershipUuid,
                               m.master, m.backup, m.maintenance);
    return m;
}

MeskDiskInfo DiskInfo(HostCtl::Mesk::MeskInfo& info, const std::string& uuid) {
    std::vector<std::shared_ptr<MeskDiskLun>> luns;
    HostCtl::Mesk::MeskInfo::GetMeskDisks(luns);
    MeskDiskInfo disk;
    info.GetDiskInfo(MeskUtil::StringToMeskUuid(uuid), luns, disk);
    return disk;
}

std::vector<std::string> GroupedUuids(HostCtl::Mesk::MeskInfo& info) {
    std::vector<HostCtl::Mesk::Uuid> uuids;
    info.GetMeskDiskUuids(uuids);
    std::vector<std::string> texts;
    for (const auto& uuid : uuids) texts.push_back(MeskUtil::MeskUuidToString(uuid));
    return texts;
}

MeskZuvNicConfig2 Interface(const std::string& name, bool mesk, bool witness,
                            int32_t port = 23451) {
    return MeskZuvNicConfig2(
        name, MeskIpAddress(Ipv4Address("224.2.3.4")),
        MeskIpAddress(Ipv6Address("FF19:0:0:0:0:2:3:4")), MeskIpAddress(Ipv4Address("224.1.2.3")),
        MeskIpAddress(Ipv6Address("FF19:0:0:0:0:1:2:3")), port, 12345, 12321, 5, mesk, witness, "");
}

TEST_F(SimHost, JoinMakesTheHostItsOnlyMemberAndLeaveClearsIt) {
    EXPECT_FALSE(Info().GetClusterConfig().enabled);
    auto before = Info().GetConfigGeneration();

    Info().JoinCluster(MeskUtil::StringToMeskUuid(kClusterUuid), false, "", true, 0);
    EXPECT_TRUE(Info().GetClusterConfig().enabled);
    EXPECT_EQ(Info().GetClusterConfig().clusterUuid, kClusterUuid);
    EXPECT_FALSE(Info().IsWitness());
    EXPECT_FALSE(MeskUtil::IsInStretchedCluster());
    Membership m = ReadMembership();
    std::string self = State()["host"]["nodeUuid"];
    EXPECT_EQ(m.uuid, self);
    EXPECT_EQ(m.master, self);
    ASSERT_EQ(m.members.size(), 1u);
    EXPECT_EQ(m.members[0].uuid, self);
    EXPECT_EQ(m.revision, 1u);
    auto joined = Info().GetConfigGeneration();
    EXPECT_EQ(joined.generation, before.generation + 1);
    EXPECT_FALSE(joined.uuid.empty());
    EXPECT_GT(joined.timestamp, 1500000000000u);

    ExpectRefusal("already a member", [&] { Info().CreateCluster(kHdd1Uuid, true, false); });

    Info().LeaveCluster(false);
    EXPECT_FALSE(Info().GetClusterConfig().enabled);
    EXPECT_EQ(Info().GetClusterConfig().clusterUuid, "");
    EXPECT_TRUE(ReadMembership().members.empty());
    EXPECT_EQ(Info().GetConfigGeneration().generation, joined.generation + 1);
    ExpectRefusal("not in a Mesk cluster", [&] { Info().LeaveCluster(false); });
}

TEST_F(SimHost, WitnessJoinMakesAStretchedClusterWitness) {
    Info().JoinCluster(MeskUtil::StringToMeskUuid(kClusterUuid), true, "site-a", false, 0);
    EXPECT_TRUE(Info().IsWitness());
    EXPECT_TRUE(MeskUtil::IsWitnessNode());
    EXPECT_TRUE(MeskUtil::IsInStretchedCluster());
    std::string id, name;
    MeskUtil::GetPreferredFaultDomainInfo(id, name);
    EXPECT_EQ(name, "site-a");
    EXPECT_FALSE(id.empty());

    Info().SetPreferredFaultDomain("site-b");
    MeskUtil::GetPreferredFaultDomainInfo(id, name);
    EXPECT_EQ(name, "site-b");

    Info().LeaveCluster(false);
    EXPECT_FALSE(MeskUtil::IsWitnessNode());
    ExpectRefusal("stretched", [&] { MeskUtil::GetPreferredFaultDomainInfo(id, name); });
    ExpectRefusal("witness node", [&] { Info().SetPreferredFaultDomain("site-c"); });
}

TEST_F(SimHost, ClusterEntryRefusesMalformedRequests) {
    ExpectRefusal("Invalid cluster UUID", [&] { Info().CreateCluster("not-a-uuid", true, false); });
    ExpectRefusal("Invalid cluster UUID",
                  [&] { Info().JoinCluster(HostCtl::Mesk::Uuid(), false, "", false, 0); });
    ExpectRefusal("preferred fault domain", [&] {
        Info().JoinCluster(MeskUtil::StringToMeskUuid(kClusterUuid), true, "", false, 0);
    });
    Info().CreateCluster("52F1C2A0-7B3E-4D01-9A6E-00A1B2C3D4E5", true, false);
    EXPECT_EQ(Info().GetClusterConfig().clusterUuid, kClusterUuid);
}

TEST_F(SimHost, AddedDisksFormAGroupUnderTheirSsdUntilRemoved) {
    std::vector<std::shared_ptr<MeskDiskLun>> luns;
    HostCtl::Mesk::MeskInfo::GetMeskDisks(luns);
    ASSERT_EQ(luns.size(), 4u);
    EXPECT_EQ(luns[0]->GetName(), kSsd);
    EXPECT_EQ(MeskUtil::MeskUuidToString(luns[0]->GetUuid()), kSsdUuid);
    EXPECT_TRUE(GroupedUuids(Info()).empty());

    Info().AddDisks(kSsd, {kHdd1});
    Info().AddDisks(kSsd, {kHdd2});  // extends the group
    EXPECT_EQ(GroupedUuids(Info()), (std::vector<std::string>{kSsdUuid, kHdd1Uuid, kHdd2Uuid}));
    MeskDiskInfo hdd = DiskInfo(Info(), kHdd2Uuid);
    EXPECT_EQ(hdd.name, kHdd2);
    EXPECT_EQ(hdd.meskUuid, kHdd2Uuid);
    EXPECT_EQ(hdd.diskGroupUuid, kSsdUuid);
    EXPECT_EQ(hdd.diskGroupName, kSsd);
    EXPECT_TRUE(hdd.isCapacityTier);
    EXPECT_TRUE(hdd.usedByThisHost);
    EXPECT_TRUE(hdd.isMounted);
    EXPECT_FALSE(hdd.isSsd);
    MeskDiskInfo ssd = DiskInfo(Info(), kSsdUuid);
    EXPECT_TRUE(ssd.isSsd);
    EXPECT_FALSE(ssd.isCapacityTier);

    Info().RemoveDisk(kHdd1, "EvacuateAllData");
    EXPECT_EQ(GroupedUuids(Info()), (std::vector<std::string>{kSsdUuid, kHdd2Uuid}));
    EXPECT_EQ(DiskInfo(Info(), kHdd1Uuid).diskGroupUuid, "");
    Info().RemoveDiskByUuid(kHdd2Uuid, "");
    Info().AddDisks(kSsd, {kHdd1, kHdd3});
    Info().RemoveDiskGroup(kSsd, "NoAction");
    EXPECT_TRUE(GroupedUuids(Info()).empty());
}

TEST_F(SimHost, StorageRefusalsChangeNothing) {
    Info().AddDisks(kSsd, {kHdd1});
    struct Case {
        const char* what;
        const char* message;
        std::function<void(HostCtl::Mesk::MeskInfo&)> action;
    };
    const Case cases[] = {
        {"unknown ssd", "Unknown disk", [](auto& i) { i.AddDisks("mpx.none", {kHdd2}); }},
        {"unknown disk", "Unknown disk",
         [](auto& i) {
             i.AddDisks(kSsd, {kHdd2, "mpx.none"});
         }},
        {"hdd as ssd", "not an SSD", [](auto& i) { i.AddDisks(kHdd2, {kHdd3}); }},
        {"claimed disk", "already in use",
         [](auto& i) {
             i.AddDisks(kSsd, {kHdd2, kHdd1});
         }},
        {"no disks", "No capacity disk", [](auto& i) { i.AddDisks(kSsd, {}); }},
        {"bad mode", "evacuation mode", [](auto& i) { i.RemoveDisk(kHdd1, "noAction"); }},
        {"unclaimed", "not in use", [](auto& i) { i.RemoveDisk(kHdd2, ""); }},
        {"fronting ssd", "fronting SSD", [](auto& i) { i.RemoveDisk(kSsd, ""); }},
        {"hdd as group", "not the fronting", [](auto& i) { i.RemoveDiskGroup(kHdd1, ""); }},
        {"bad uuid", "Invalid UUID", [](auto& i) { i.RemoveDiskByUuid("52a0e7c4", ""); }},
        {"unknown uuid", "No Mesk disk",
         [](auto& i) { i.RemoveDiskByUuid("52a0e7c4-0000-0000-0000-000000000000", ""); }},
        {"mount unknown", "Unknown disk", [](auto& i) { i.MountDisk(""); }},
        {"mount by bad uuid", "Invalid UUID", [](auto& i) { i.MountByUuid("x"); }},
        {"unmount unclaimed", "not in use", [](auto& i) { i.UnmountDisk(kHdd2, true); }},
        {"tag hdd", "not an SSD", [](auto& i) { i.AddCapacityFlashTag(kHdd2); }},
        {"tag claimed", "in use", [](auto& i) { i.AddCapacityFlashTag(kSsd); }},
        {"unknown info", "No Mesk disk",
         [](auto& i) {
             MeskDiskInfo disk;
             i.GetDiskInfo(MeskUtil::StringToMeskUuid(kClusterUuid), {}, disk);
         }},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.what);
        ExpectRefusal(c.message, [&] { c.action(Info()); });
    }
}

TEST_F(SimHost, MountStateFollowsGroupsAndDisks) {
    Info().AddDisks(kSsd, {kHdd1, kHdd2});
    auto mounted = [&](const char* uuid) { return DiskInfo(Info(), uuid).isMounted; };
    Info().UnmountDiskGroup(kSsd, true);
    EXPECT_FALSE(mounted(kSsdUuid));
    EXPECT_FALSE(mounted(kHdd2Uuid));
    Info().MountByUuid(kSsdUuid);
    EXPECT_TRUE(mounted(kHdd1Uuid));
    Info().UnmountDisk(kHdd1, true);
    EXPECT_FALSE(mounted(kHdd1Uuid));
    EXPECT_TRUE(mounted(kHdd2Uuid));
    Info().MountDisk(kHdd1);
    EXPECT_TRUE(mounted(kHdd1Uuid));
}

TEST_F(SimHost, TaggedSsdServesAsCapacityDisk) {
    Json ssd2 = State()["storage"]["disks"][0];
    ssd2["name"] = "mpx.pthba2:C0:T4:L0";
    ssd2["uuid"] = "52a0e7c4-1b2d-4e3f-8a90-0b1c2d3e4f05";
    Json doc = State();
    doc["storage"]["disks"].push_back(ssd2);
    doc["services"] = HostCtlSim::DefaultHost()["services"];
    {
        HostCtlSim::StateStore::Transaction t(host_->Store());
        host_->Store().Replace(HostCtlSim::NormalizeHost(doc));
        t.Commit();
    }
    ExpectRefusal("capacityFlash", [&] { Info().AddDisks(kSsd, {"mpx.pthba2:C0:T4:L0"}); });
    Info().AddCapacityFlashTag("mpx.pthba2:C0:T4:L0");
    Info().AddDisks(kSsd, {"mpx.pthba2:C0:T4:L0"});
    EXPECT_TRUE(DiskInfo(Info(), "52a0e7c4-1b2d-4e3f-8a90-0b1c2d3e4f05").capacityFlashTag);
}

TEST_F(SimHost, InterfacesByTrafficType) {
    EXPECT_TRUE(Info().SetZuvNicConfig(Interface("zuvnic1", true, true)));
    EXPECT_TRUE(Info().SetZuvNicConfig(Interface("zuvnic2", false, true)));
    EXPECT_TRUE(Info().IsZuvNicInUse("zuvnic1", "mesk"));
    EXPECT_FALSE(Info().IsZuvNicInUse("zuvnic2", "mesk"));
    EXPECT_TRUE(Info().IsZuvNicInUse("zuvnic2", "witness"));
    EXPECT_FALSE(Info().IsZuvNicInUse("zuvnic9", "mesk"));

    auto records = Info().GetZuvNicConfigs();
    ASSERT_EQ(records.size(), 2u);
    std::string uuid = records[0]->GetIfaceUuid();
    EXPECT_EQ(uuid.size(), 36u);
    EXPECT_EQ(records[0]->GetAgentV6MulticastGroup().GetStringAddress(), "FF19:0:0:0:0:2:3:4");
    // Reconfiguring keeps the interface's UUID.
    Info().SetZuvNicConfig(Interface("zuvnic1", true, true, 2000));
    records = Info().GetZuvNicConfigs();
    EXPECT_EQ(records[0]->GetIfaceUuid(), uuid);
    EXPECT_EQ(records[0]->GetAgentMulticastPort(), 2000);

    // Removal per traffic type; the record goes with its last type.
    EXPECT_TRUE(Info().RemoveZuvNic("zuvnic1", false, "witness"));
    EXPECT_FALSE(Info().IsZuvNicInUse("zuvnic1", "witness"));
    EXPECT_TRUE(Info().IsZuvNicInUse("zuvnic1", "mesk"));
    EXPECT_FALSE(Info().RemoveZuvNic("zuvnic1", false, "witness"));
    ExpectRefusal("not configured", [&] { Info().RemoveZuvNic("nosuch", false, "mesk"); });
    EXPECT_FALSE(Info().RemoveZuvNic("nosuch", true, "mesk"));
    Info().RemoveZuvNic("zuvnic1", false, "mesk");
    EXPECT_EQ(Info().GetZuvNicConfigs().size(), 1u);

    // Clear keeps the persisted copy, which restore brings back.
    Info().ClearNetworkConfig();
    EXPECT_TRUE(Info().GetZuvNicConfigs().empty());
    Info().RestoreNetworkConfig();
    records = Info().GetZuvNicConfigs();
    ASSERT_EQ(records.size(), 1u);
    EXPECT_EQ(records[0]->GetZuvnicName(), "zuvnic2");

    ExpectRefusal("Unknown traffic type", [&] { Info().IsZuvNicInUse("zuvnic2", "Mesk"); });
    ExpectRefusal("port", [&] { Info().SetZuvNicConfig(Interface("zuvnic3", true, false, 0)); });
    ExpectRefusal("no traffic type",
                  [&] { Info().SetZuvNicConfig(Interface("zuvnic3", false, false)); });
}

TEST_F(SimHost, UnicastAgentsAreKeptAsEntries) {
    const std::string node = "52f1c2a0-7b3e-4d01-9a6e-00a1b2c3d4e5";
    const std::string none = "00000000-0000-0000-0000-000000000000";
    MeskIpAddress v4(Ipv4Address("192.168.10.21"));
    MeskIpAddress v6(Ipv6Address("fe80::1"));
    Info().AddUnicastAgent(node, false, true, v4, 12321, true, "zuvnic1");
    Info().AddUnicastAgent(none, true, false, v6, 12321, false, "ignored");
    std::vector<std::string> agents;
    Info().GetUnicastAgents(agents);
    EXPECT_EQ(agents, (std::vector<std::string>{node + ";0;1;192.168.10.21;12321;zuvnic1",
                                                none + ";1;0;fe80::1;12321;"}));
    std::vector<std::string> witnesses;
    Info().GetUnicastWitnesses(witnesses);
    EXPECT_EQ(witnesses, std::vector<std::string>{"fe80::1:12321"});

    ExpectRefusal("already configured",
                  [&] { Info().AddUnicastAgent(node, false, true, v4, 12321, false, ""); });
    ExpectRefusal("Invalid node UUID",
                  [&] { Info().AddUnicastAgent("u1", false, true, v4, 1, false, ""); });
    ExpectRefusal("Invalid port",
                  [&] { Info().AddUnicastAgent(node, false, true, v4, 70000, false, ""); });
    ExpectRefusal("No unicast agent", [&] { Info().RemoveUnicastAgent(node, v4, 12322); });

    // The address matches whatever way it is written.
    EXPECT_TRUE(Info().RemoveUnicastAgent(none, MeskIpAddress(Ipv6Address("FE80:0::1")), 12321));
    EXPECT_FALSE(Info().RemoveUnicastAgent(node, v4, 12321));
    Info().GetUnicastAgents(agents);
    EXPECT_TRUE(agents.empty());
}

TEST_F(SimHost, SettingsPoliciesAndResync) {
    EXPECT_EQ(Info().GetDatastoreName(), "meskDatastore");
    Info().SetDatastoreName("clusterStore2");
    EXPECT_EQ(Info().GetDatastoreName(), "clusterStore2");
    ExpectRefusal("cannot be empty", [&] { Info().SetDatastoreName(""); });

    Info().SetFaultDomainName("rack-1");
    EXPECT_EQ(Info().GetFaultDomainName(), "rack-1");
    EXPECT_EQ(MeskUtil::GetFaultDomainId().size(), 36u);
    Info().ResetFaultDomainName();
    EXPECT_EQ(Info().GetFaultDomainName(), "");

    for (const char* policyClass : {"cluster", "vdisk", "vmnamespace", "vmswap", "vmem"}) {
        EXPECT_EQ(Info().GetDefaultPolicy(policyClass), "") << policyClass;
    }
    Info().SetDefaultPolicy("vdisk", "((\"hostFailuresToTolerate\" i1))");
    EXPECT_EQ(Info().GetDefaultPolicy("vdisk"), "((\"hostFailuresToTolerate\" i1))");
    ExpectRefusal("Unknown policy class", [&] { Info().SetDefaultPolicy("disk", "()"); });
    ExpectRefusal("Unknown policy class", [&] { Info().GetDefaultPolicy("VDISK"); });
    Info().ClearDefaultPolicies();
    EXPECT_EQ(Info().GetDefaultPolicy("vdisk"), "");

    Info().SetResyncThrottle(512);
    EXPECT_EQ(Info().GetResyncThrottle(), 512);
    EXPECT_EQ(Info().GetResyncBandwidth(), 0);
    ExpectRefusal("throttle", [&] { Info().SetResyncThrottle(-1); });

    Info().SetAutoClaimMode(true);
    EXPECT_TRUE(Info().GetAutoClaimMode());
}

}  // namespace
}  // namespace SimTest
