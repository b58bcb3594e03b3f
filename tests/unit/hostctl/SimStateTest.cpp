// The simulated host's state across invocations and processes: persistence, the document
// form, injected failures, the call log, concurrent changes and the host's scripts.
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <functional>

#include "HostRoot.h"
#include "SimFixture.h"
#include "StateDocument.h"
#include "hostctl/MeskUtil.h"

namespace SimTest {
namespace {

using HostCtl::Mesk::MeskIpAddress;
using HostCtl::Network::Ipv4Address;
using HostCtlSim::DocumentError;
using HostCtlSim::NormalizeHost;
using ZuvCtl::Mesk::MeskUtil;

using SimState = SimFixture;

Json J(const char* text) {
    return Json::parse(text);
}

std::vector<Json> LoggedCalls(SimHost& host) {
    std::vector<Json> calls;
    for (const auto& call : host.Store().ReadCalls()) calls.push_back(Json::parse(call.entry));
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

TEST_F(SimState, ChangesPersistAcrossInvocations) {
    Info().CreateCluster(kClusterUuid, true, false);
    Info().AddDisks(kSsd, {kHdd1});
    Info().SetDatastoreName("renamed");
    Json before = State();
    NewInvocation();
    EXPECT_TRUE(Info().GetClusterConfig().enabled);
    EXPECT_EQ(Info().GetDatastoreName(), "renamed");
    EXPECT_EQ(State(), before);
}

TEST_F(SimState, DocumentRoundTripsExactly) {
    Info().JoinCluster(MeskUtil::StringToMeskUuid(kClusterUuid), true, "site-a", false, 0);
    Info().AddDisks(kSsd, {kHdd1, kHdd2});
    Info().AddUnicastAgent(kClusterUuid, false, true, MeskIpAddress(Ipv4Address("10.0.0.5")), 12321,
                           false, "");
    Info().SetDefaultPolicy("vmswap", "((\"stripeWidth\" i2))");
    Json document = State();
    document["services"] = host_->Root().ReadServices();
    Json normalized = NormalizeHost(document);
    EXPECT_EQ(normalized.dump(2), document.dump(2));
    {
        HostCtlSim::StateStore::Transaction transaction(host_->Store());
        host_->Store().Replace(normalized);
        transaction.Commit();
    }
    Json again = State();
    again["services"] = document["services"];
    EXPECT_EQ(again.dump(2), document.dump(2));
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
        {"host.nodeUuid: expected a UUID", [](Json& d) { d["host"]["nodeUuid"] = ""; }},
        {"membership.members: missing", [](Json& d) { d["membership"].erase("members"); }},
        {"unicastAgents[0]: expected a text", [](Json& d) { d["unicastAgents"] = {1}; }},
        {"storage.disks[1].uuid: a second disk",
         [](Json& d) { d["storage"]["disks"][1]["uuid"] = d["storage"]["disks"][0]["uuid"]; }},
        {"storage.disks[0].capacityBytes: expected an integer of at least 0",
         [](Json& d) { d["storage"]["disks"][0]["capacityBytes"] = -1; }},
        {"network.interfaces[0].agentGroup: expected an IPv4 address",
         [](Json& d) {
             Json nic = HostCtlSim::PopulatedHost(0, 0, 1)["network"]["interfaces"][0];
             nic["agentGroup"] = "FF19::1";
             d["network"]["interfaces"].push_back(nic);
         }},
        {"policies.vdisk: expected a text", [](Json& d) { d["policies"]["vdisk"] = nullptr; }},
        {"resync.throttle: expected an integer", [](Json& d) { d["resync"]["throttle"] = "0"; }},
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
    host_->Store().SetFault({"GetDatastoreName", 2, "second call fails"});
    host_->Store().SetFault({"AddDisks", 0, "no disks today"});
    NewInvocation();
    EXPECT_EQ(Info().GetDatastoreName(), "meskDatastore");
    try {
        Info().GetDatastoreName();
        ADD_FAILURE() << "the second call did not fail";
    } catch (const MeskCtlException& e) {
        EXPECT_EQ(e.GetMessage(), "second call fails");
    }
    EXPECT_EQ(Info().GetDatastoreName(), "meskDatastore");
    ExpectRefusal("no disks today", [&] { Info().AddDisks(kSsd, {kHdd1}); });
    ExpectRefusal("no disks today", [&] { Info().AddDisks(kSsd, {kHdd1}); });

    // Each invocation counts its calls anew.
    NewInvocation();
    Info().GetDatastoreName();
    EXPECT_THROW(Info().GetDatastoreName(), MeskCtlException);
    host_->Store().ClearFaults();
    NewInvocation();
    Info().AddDisks(kSsd, {kHdd1});
}

TEST_F(SimState, CallLogHoldsTheLastInvocationsCallsInOrder) {
    HostCtl::Mesk::Uuid cluster = MeskUtil::StringToMeskUuid(kClusterUuid);
    Info().JoinCluster(cluster, false, "", true, 0);
    EXPECT_THROW(Info().AddDisks(kHdd1, {kHdd2}), MeskCtlException);
    Info().GetDatastoreName();
    NewInvocation();
    std::vector<Json> expected = {
        J(R"({"op":"StringToMeskUuid","args":["52f1c2a0-7b3e-4d01-9a6e-00a1b2c3d4e5"]})"),
        J(R"({"op":"GetMeskPlugin","args":[]})"),
        J(R"({"op":"GetMeskInfo","args":[]})"),
        J(R"({"op":"JoinCluster","args":["52f1c2a0-7b3e-4d01-9a6e-00a1b2c3d4e5",false,"",true,0]})"),
        J(R"({"op":"AddDisks","args":["mpx.pthba2:C0:T1:L0",["mpx.pthba2:C0:T2:L0"]],
            "error":"Disk 'mpx.pthba2:C0:T1:L0' is not an SSD"})"),
        J(R"({"op":"GetDatastoreName","args":[]})"),
    };
    EXPECT_EQ(LoggedCalls(*host_), expected);

    // The next invocation's first call replaces the log.
    MeskUtil::IsWitnessNode();
    NewInvocation();
    EXPECT_EQ(LoggedCalls(*host_), std::vector<Json>{J(R"({"op":"IsWitnessNode","args":[]})")});
}

TEST_F(SimState, ConcurrentProcessesLoseNoChange) {
    const int kProcesses = 20;
    Info().GetDatastoreName();  // the state exists before the processes start
    NewInvocation();
    std::vector<pid_t> children;
    for (int i = 0; i < kProcesses; ++i) {
        pid_t child = fork();
        ASSERT_GE(child, 0);
        if (child == 0) {
            int status = 0;
            try {
                SimHost host(options_);
                auto plugin = host.GetMeskPlugin();
                auto info = plugin->GetMeskInfo();
                info->AddUnicastAgent(kClusterUuid, false, true,
                                      MeskIpAddress(Ipv4Address("10.0.1." + std::to_string(i))),
                                      12321, false, "");
            } catch (...) {
                status = 1;
            }
            _exit(status);
        }
        children.push_back(child);
    }
    for (pid_t child : children) {
        int status = 0;
        ASSERT_EQ(waitpid(child, &status, 0), child);
        EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0);
    }
    std::vector<std::string> agents;
    Info().GetUnicastAgents(agents);
    EXPECT_EQ(agents.size(), size_t(kProcesses));
}

TEST_F(SimState, MeskExecRunsTheHostsScripts) {
    Info();  // makes the host and its files
    const HostCtlSim::HostRoot& root = host_->Root();
    auto status = [] {
        return MeskUtil::MeskExec(HostCtlSim::kTraceScriptPath, "status", false, true, false);
    };
    auto restart = [] {
        return MeskUtil::MeskExec(HostCtlSim::kTraceScriptPath, "restart", false, true, false);
    };
    EXPECT_EQ(status(), 0);

    Json services = root.ReadServices();
    services["mesktraced"]["state"] = "stopped";
    root.WriteServices(services);
    EXPECT_EQ(status(), 3);
    services["mesktraced"]["restartFailures"] = 1;
    root.WriteServices(services);
    EXPECT_EQ(restart(), 1);
    EXPECT_EQ(restart(), 0);
    EXPECT_EQ(status(), 0);
    services = root.ReadServices();
    services["mesktraced"]["statusFails"] = true;
    root.WriteServices(services);
    EXPECT_LT(status(), 0);
    EXPECT_LT(MeskUtil::MeskExec("/bin/no-such-program", "x", false, true, false), 0);

    auto runs = root.ReadScriptLog();
    ASSERT_EQ(runs.size(), 6u);
    EXPECT_EQ(Json::parse(runs[0].entry),
              J(R"({"op":"/etc/init.d/mesktraced","args":["status"],"exit":0})"));
    EXPECT_EQ(Json::parse(runs[2].entry),
              J(R"({"op":"/etc/init.d/mesktraced","args":["restart"],"exit":1})"));
}

}  // namespace
}  // namespace SimTest
