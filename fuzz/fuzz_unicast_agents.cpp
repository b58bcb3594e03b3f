// Fuzzes the unicast agent entries that the library reports, as list and clear parse them.
//
// The input is the library's agent table, one entry per line. The entry splitter must give
// back the entry's own text; list either shows every entry or refuses with one message; clear
// either removes every agent or stops with one message, never removing more agents than
// there are entries.
#include <gmock/gmock.h>

#include <cstdint>
#include <cstdlib>
#include <memory>
#include <string>
#include <vector>

#include "Formatter.h"
#include "FuzzCheck.h"
#include "HostBackend.h"
#include "MockHost.h"
#include "autocli/MetaObj.h"
#include "commands/cluster/ClusterUnicastAgentClear.h"
#include "commands/cluster/ClusterUnicastAgentList.h"
#include "commands/cluster/UnicastAgent.h"

using Kalmor::CallSpec::Input;
using Kalmor::CallSpec::Output;
using Kalmor::MetaObj::MetaList;
using Kalmor::MetaObj::MetaString;
using Kalmor::MetaObj::MetaStruct;
using OrvaneCli::MeskNamespace::ClusterUnicastAgentClear;
using OrvaneCli::MeskNamespace::ClusterUnicastAgentList;
using OrvaneCli::MeskNamespace::UnicastAgentEntry;
using ::testing::_;
using ::testing::Invoke;
using ::testing::NiceMock;
namespace App = Kalmor::AutoCli::App;

namespace {

// A host in a cluster, not a witness, whose agent table is the current input.
struct Host {
    NiceMock<MeskTest::MockMeskInfo> info;
    NiceMock<MeskTest::MockHost> host{info};
    std::vector<std::string> entries;
    size_t removals = 0;

    Host() {
        info.clusterConfig.enabled = true;
        info.clusterConfig.clusterUuid = "52b0c0de-0000-4000-8000-000000000001";
        ON_CALL(info, GetUnicastAgents(_)).WillByDefault(Invoke([this](auto& out) {
            out = entries;
        }));
        ON_CALL(info, RemoveUnicastAgent(_, _, _))
            .WillByDefault(Invoke(
                [this](const std::string&, const auto&, int32_t) { return ++removals % 2 == 0; }));
        HostCtlSim::SetBackend(&host);
    }
    ~Host() { HostCtlSim::SetBackend(nullptr); }
};

Host& TheHost() {
    static Host host;
    return host;
}

std::vector<std::string> SplitLines(const uint8_t* data, size_t size) {
    std::vector<std::string> lines;
    std::string line;
    for (size_t i = 0; i < size && lines.size() < 64; ++i) {
        if (data[i] == '\n') {
            lines.push_back(line);
            line.clear();
        } else {
            line += static_cast<char>(data[i]);
        }
    }
    if (!line.empty() && lines.size() < 64) lines.push_back(line);
    return lines;
}

void CheckSplit(const std::string& entry) {
    const UnicastAgentEntry fields(entry);
    FUZZ_CHECK(fields.Separators() <= 5);
    std::string rebuilt;
    for (size_t f = UnicastAgentEntry::kNodeUuid; f < fields.Separators(); ++f) {
        const auto field = static_cast<UnicastAgentEntry::Field>(f);
        FUZZ_CHECK(fields.Text(field).find(';') == std::string::npos);
        rebuilt += fields.Text(field) + ";";
    }
    if (fields.Separators() == 5) {
        rebuilt += fields.Text(UnicastAgentEntry::kIfaceName);
        FUZZ_CHECK(rebuilt == entry);
    } else {
        FUZZ_CHECK(entry.compare(0, rebuilt.size(), rebuilt) == 0);
        FUZZ_CHECK(entry.find(';', rebuilt.size()) == std::string::npos);
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    Host& host = TheHost();
    host.entries = SplitLines(data, size);
    host.removals = 0;
    bool wellFormed = true;
    for (const auto& entry : host.entries) {
        CheckSplit(entry);
        wellFormed = wellFormed && UnicastAgentEntry(entry).Separators() == 5;
    }

    ClusterUnicastAgentList list;
    auto listed = Output::New();
    list.ExecuteInternal(Input::New(), listed);
    if (wellFormed) {
        FUZZ_CHECK(listed->GetErrorMessages().empty());
        auto rows = std::dynamic_pointer_cast<MetaList>(listed->GetRootObject());
        FUZZ_CHECK(rows && rows->Size() == host.entries.size());
        for (size_t i = 0; i < rows->Size(); ++i) {
            const auto& row = static_cast<const MetaStruct&>(*rows->GetElements()[i]);
            const UnicastAgentEntry fields(host.entries[i]);
            auto iface = std::dynamic_pointer_cast<MetaString>(row.GetField("Iface Name"));
            FUZZ_CHECK(iface && iface->GetValue() == fields.Text(UnicastAgentEntry::kIfaceName));
        }
        App::FormatOptions options;
        options.outputParameters = list.GetDefaultOutputParameters();
        App::FormatTable(*rows, options);
        App::FormatJson(*rows, options);
    } else {
        FUZZ_CHECK(listed->GetErrorMessages().size() == 1);
    }

    ClusterUnicastAgentClear clear;
    auto cleared = Output::New();
    clear.ExecuteInternal(Input::New(), cleared);
    FUZZ_CHECK(host.removals <= host.entries.size());
    FUZZ_CHECK(cleared->GetErrorMessages().size() <= 1);
    if (cleared->GetErrorMessages().empty()) FUZZ_CHECK(host.removals == host.entries.size());
    return 0;
}
