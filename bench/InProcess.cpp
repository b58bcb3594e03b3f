// In-process benchmarks of what every invocation does after the plug-in is loaded: registering
// the namespace tree, running a command line through the framework against the scripted test
// double, and formatting a large result in each formatter.
#include <benchmark/benchmark.h>

#include <memory>
#include <string>
#include <vector>

#include "CommandLine.h"
#include "Formatter.h"
#include "MockHost.h"
#include "autocli/AutoCli.h"
#include "commands/storage/StorageList.h"

extern "C" void AutoCli_RegisterNamespaces(std::shared_ptr<Kalmor::AutoCli::NamespaceNode>* root);

namespace {

using Kalmor::AutoCli::Namespace;
using Kalmor::AutoCli::NamespaceNode;
using MeskTest::FakeLun;
using MeskTest::LunList;
using MeskTest::MeskDiskInfo;
using MeskTest::MockHost;
using MeskTest::MockMeskInfo;
using MeskTest::Uuid;
using ::testing::_;
using ::testing::Invoke;
using ::testing::NiceMock;

std::shared_ptr<NamespaceNode> RegisteredRoot() {
    std::shared_ptr<NamespaceNode> root = Namespace::New();
    AutoCli_RegisterNamespaces(&root);
    return root;
}

// The test double installed as the host-control backend for the scope of a benchmark.
struct Host {
    NiceMock<MockMeskInfo> info;
    NiceMock<MockHost> host{info};
    Host() { HostCtlSim::SetBackend(&host); }
    ~Host() { HostCtlSim::SetBackend(nullptr); }
};

void RegisterTree(benchmark::State& state) {
    for (auto _ : state) {
        benchmark::DoNotOptimize(RegisteredRoot());
    }
}
BENCHMARK(RegisterTree);

// `autocli mesk cluster get` from its words to its text, on a host in a cluster.
void RunClusterGet(benchmark::State& state) {
    Host host;
    host.info.clusterConfig.enabled = true;
    host.info.clusterConfig.clusterUuid = "52b0c1d2-0000-4000-8000-000000000abc";
    const auto root = RegisteredRoot();
    const std::vector<std::string> words = {"mesk", "cluster", "get"};
    for (auto _ : state) {
        auto result = Kalmor::AutoCli::App::Run(words, root);
        if (result.status != 0) state.SkipWithError(result.err.c_str());
        benchmark::DoNotOptimize(result);
    }
}
BENCHMARK(RunClusterGet);

// The UUID text of disk `n`.
std::string DiskUuid(int n) {
    char text[40];
    snprintf(text, sizeof text, "52b0c1d2-0000-4000-8000-%012x", n + 1);
    return text;
}

// The result of `mesk storage list` over `count` claimed disks, made by the command itself.
struct StorageListing {
    std::shared_ptr<Kalmor::MetaObj::MetaObject> root;
    Kalmor::AutoCli::App::FormatOptions options;
};

StorageListing ListDisks(int count) {
    Host host;
    LunList luns;
    for (int n = 0; n < count; ++n) {
        luns.push_back(std::make_shared<FakeLun>("mpx.pthba2:C0:T" + std::to_string(n) + ":L0",
                                                 MeskTest::UuidOf(DiskUuid(n))));
    }
    ON_CALL(host.host, GetMeskDisks(_)).WillByDefault(Invoke([&](LunList& out) { out = luns; }));
    ON_CALL(host.info, GetDiskInfo(_, _, _))
        .WillByDefault(Invoke([&](const Uuid& uuid, const LunList&, MeskDiskInfo& disk) {
            const std::string text = host.host.HostBackend::MeskUuidToString(uuid);
            const int n = std::stoi(text.substr(24), nullptr, 16) - 1;
            const int group = n / 8;
            disk.name = luns[n]->GetName();
            disk.isSsd = n % 8 == 0;
            disk.meskUuid = text;
            disk.diskGroupUuid = DiskUuid(group * 8);
            disk.diskGroupName = luns[group * 8]->GetName();
            disk.usedByThisHost = true;
            disk.inKovra = true;
            disk.formatVersion = 5;
            disk.checksum = "0";
            disk.checksumOk = true;
            disk.isCapacityTier = !disk.isSsd;
        }));
    auto command = OrvaneCli::MeskNamespace::StorageList::New();
    auto output = Kalmor::CallSpec::Output::New();
    command->ExecuteInternal(Kalmor::CallSpec::Input::New(), output);
    StorageListing listing;
    listing.root = output->GetRootObject();
    listing.options.outputParameters = command->GetDefaultOutputParameters();
    return listing;
}

void FormatStorageList(benchmark::State& state, const std::string& name) {
    static const StorageListing listing = ListDisks(4096);
    const auto formatter = Kalmor::AutoCli::App::FindFormatter(name);
    size_t bytes = 0;
    for (auto _ : state) {
        const std::string text = formatter(*listing.root, listing.options);
        bytes = text.size();
        benchmark::DoNotOptimize(text.data());
    }
    state.SetBytesProcessed(int64_t(state.iterations()) * int64_t(bytes));
}

// One benchmark per formatter that the framework offers.
const bool registered = [] {
    for (const auto& name : Kalmor::AutoCli::App::FormatterNames()) {
        benchmark::RegisterBenchmark(("FormatStorageList4096/" + name).c_str(), FormatStorageList,
                                     name)
            ->Unit(benchmark::kMillisecond);
    }
    return true;
}();

}  // namespace

BENCHMARK_MAIN();
