// The simulated host's state across invocations: a fresh host, the document form, injected
// failures and the call log.
#include <sys/stat.h>

#include <fstream>
#include <functional>
#include <map>
#include <regex>

#include "CallLog.h"
#include "HostRoot.h"
#include "Operations.h"
#include "SimFixture.h"
#include "StateDocument.h"
#include "hostctl/MeskUtil.h"

namespace SimTest {
namespace {

using HostCtlSim::DocumentError;
using HostCtlSim::NormalizeHost;
using ZuvCtl::Mesk::MeskUtil;

using SimState = SimFixture;

const auto J = [](const char* text) { return Json::parse(text); };

std::vector<Json> LoggedCalls(SimHost& host) {
    std::vector<Json> calls;
    for (const auto& call : HostCtlSim::CallLog::Read(host.Root())) {
        calls.push_back(Json::parse(call.entry));
    }
    return calls;
}

TEST_F(SimState, MissingStateBecomesAFreshHostWithItsFiles) {
    EXPECT_EQ(Info().GetDatastoreName(), "meskDatastore");
    struct stat info {};
    EXPECT_EQ(stat(options_.statePath.c_str(), &info), 0);
    for (const char* path : {HostCtlSim::kTraceConfigPath, HostCtlSim::kTraceScriptPath,
                             HostCtlSim::kNotifyScriptPath}) {
        EXPECT_EQ(stat((options_.hostRoot + path).c_str(), &info), 0) << path;
    }
    Json fresh = NormalizeHost(HostCtlSim::DefaultHost());
    fresh.erase("services");
    EXPECT_EQ(State(), fresh);
}

TEST_F(SimState, MalformedDocumentsAreRefusedNamingTheKey) {
    Json fresh = HostCtlSim::DefaultHost();
    struct Case {
        const char* error;
        std::function<void(Json&)> spoil;
    };
    const Case cases[] = {
        {"cluster.enabled: expected true or false", [](Json& d) { d["cluster"]["enabled"] = 1; }},
        {"cluster.uuid: expected a UUID", [](Json& d) { d["cluster"]["uuid"] = "52f1"; }},
        {"unicastAgents[0]: expected a text", [](Json& d) { d["unicastAgents"] = {1}; }},
        {"storage.disks[1].uuid: a second disk",
         [](Json& d) { d["storage"]["disks"][1]["uuid"] = d["storage"]["disks"][0]["uuid"]; }},
        {"storage.disks[0].capacityBytes: expected an integer of at least 0",
         [](Json& d) { d["storage"]["disks"][0]["capacityBytes"] = -1; }},
        {"settings.colour: unknown key", [](Json& d) { d["settings"]["colour"] = "red"; }},
        {"services.mesktraced.state: expected",
         [](Json& d) { d["services"]["mesktraced"]["state"] = "paused"; }},
        {"extra: unknown key", [](Json& d) { d["extra"] = true; }},
    };
    for (const Case& c : cases) {
        Json document = fresh;
        c.spoil(document);
        try {
            NormalizeHost(document);
            ADD_FAILURE() << "accepted: " << c.error;
        } catch (const DocumentError& e) {
            EXPECT_EQ(std::string(e.what()).rfind(c.error, 0), 0u) << e.what();
        }
    }
    // Agent entries stay texts of any form, so that malformed entries can be simulated.
    fresh["unicastAgents"] = {"u1;1;0;10.0.0.5", ""};
    EXPECT_EQ(NormalizeHost(fresh)["unicastAgents"], fresh["unicastAgents"]);
}

TEST_F(SimState, InjectedFailuresHitEveryCallOrTheNth) {
    {
        HostCtlSim::StateStore::Transaction transaction(host_->Store());
        host_->Store().SetFault({"GetDatastoreName", 2, "second call fails"});
        host_->Store().SetFault({"AddDisks", 0, "no disks today"});
        transaction.Commit();
    }
    NewInvocation();
    EXPECT_EQ(Info().GetDatastoreName(), "meskDatastore");
    try {
        Info().GetDatastoreName();
        ADD_FAILURE() << "the second call did not fail";
    } catch (const MeskCtlException& e) {
        EXPECT_EQ(e.GetMessage(), "second call fails");
    }
    EXPECT_EQ(Info().GetDatastoreName(), "meskDatastore");
    for (int call = 1; call <= 2; ++call) {
        ExpectRefusal("no disks today", [&] { Info().AddDisks(kSsd, {kHdd1}); });
    }

    // Each invocation counts its calls anew.
    NewInvocation();
    Info().GetDatastoreName();
    EXPECT_THROW(Info().GetDatastoreName(), MeskCtlException);
}

// An invocation answers from one snapshot of the host: another process's change made after
// its first call stays out of sight until the invocation changes the host itself.
TEST_F(SimState, InvocationReadsOneSnapshotAndSeesItsOwnChanges) {
    EXPECT_EQ(Info().GetDatastoreName(), "meskDatastore");
    {
        SimHost other(options_);
        auto plugin = other.GetMeskPlugin();
        plugin->GetMeskInfo()->SetDatastoreName("elsewhere");
    }
    EXPECT_EQ(Info().GetDatastoreName(), "meskDatastore");
    Info().SetResyncThrottle(3);
    EXPECT_EQ(Info().GetResyncThrottle(), 3);
    EXPECT_EQ(Info().GetDatastoreName(), "elsewhere");
}

TEST_F(SimState, CallLogHoldsTheLastInvocationsCallsInOrder) {
    HostCtl::Mesk::Uuid cluster = MeskUtil::StringToMeskUuid(kClusterUuid);
    Info().JoinCluster(cluster, false, "", true, 0);
    EXPECT_THROW(Info().AddDisks(kHdd1, {kHdd2}), MeskCtlException);
    Info().GetDatastoreName();
    MeskUtil::MeskUuidToString(cluster);
    EXPECT_THROW(MeskUtil::StringToMeskUuid("a \"uuid\"\n"), MeskCtlException);
    HostCtl::Mesk::MeskDiskInfo disk;
    EXPECT_THROW(Info().GetDiskInfo(cluster, {nullptr, nullptr}, disk), MeskCtlException);
    NewInvocation();
    std::vector<Json> expected = {
        J(R"({"op":"StringToMeskUuid","args":["52f1c2a0-7b3e-4d01-9a6e-00a1b2c3d4e5"]})"),
        J(R"({"op":"GetMeskPlugin","args":[]})"),
        J(R"({"op":"GetMeskInfo","args":[]})"),
        J(R"({"op":"JoinCluster","args":["52f1c2a0-7b3e-4d01-9a6e-00a1b2c3d4e5",false,"",true,0]})"),
        J(R"({"op":"AddDisks","args":["mpx.pthba2:C0:T1:L0",["mpx.pthba2:C0:T2:L0"]],
            "error":"Disk 'mpx.pthba2:C0:T1:L0' is not an SSD"})"),
        J(R"({"op":"GetDatastoreName","args":[]})"),
        J(R"({"op":"MeskUuidToString","args":["52f1c2a0-7b3e-4d01-9a6e-00a1b2c3d4e5"]})"),
        J(R"({"op":"StringToMeskUuid","args":["a \"uuid\"\n"],
            "error":"Invalid UUID: 'a \"uuid\"\n'"})"),
        J(R"({"op":"GetDiskInfo","args":["52f1c2a0-7b3e-4d01-9a6e-00a1b2c3d4e5",2],
            "error":"No Mesk disk with UUID 52f1c2a0-7b3e-4d01-9a6e-00a1b2c3d4e5"})"),
    };
    EXPECT_EQ(LoggedCalls(*host_), expected);

    // The next invocation's first call replaces the log.
    MeskUtil::IsWitnessNode();
    NewInvocation();
    EXPECT_EQ(LoggedCalls(*host_), std::vector<Json>{J(R"({"op":"IsWitnessNode","args":[]})")});
}

// The guide's list of operation names is the one a maintainer reads: every operation of the
// table, each once, and nothing else.
TEST(Operations, GuideListsEveryOperationOnce) {
    std::ifstream guide(MESK_SOURCE_DIR "/docs/hostsim.md");
    ASSERT_TRUE(guide) << "cannot read docs/hostsim.md";
    std::map<std::string, int> listed;
    std::string line;
    bool inList = false;
    const std::regex name("`([A-Za-z_0-9]+)`");
    while (std::getline(guide, line)) {
        if (line.rfind('#', 0) == 0) inList = line == "### Operation names";
        if (!inList || (line.rfind("- ", 0) != 0 && line.rfind("  ", 0) != 0)) continue;
        for (std::sregex_iterator it(line.begin(), line.end(), name), end; it != end; ++it) {
            ++listed[(*it)[1]];
        }
    }
    std::string wrong;
    for (const char* operation : HostCtlSim::kOperationNames) {
        if (listed[operation] != 1) wrong += std::string(" ") + operation;
        listed.erase(operation);
    }
    for (const auto& unknown : listed) wrong += " " + unknown.first + "(not an operation)";
    EXPECT_EQ(wrong, "") << "operations not listed once in docs/hostsim.md";
}

}  // namespace
}  // namespace SimTest
