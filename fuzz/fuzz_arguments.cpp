// Fuzzes autocli's command line over the mesk plug-in's whole registered tree.
//
// The input is the words of one command line, separated by NUL bytes. Each one runs as
// autocli runs it (path, global options, the command's options, the command itself against
// a scripted host in a cluster, and the formatter), and must:
//   - end with status 0, 1 or 2; with 2 (refused), print one line on stderr and not have run
//     the command at all;
//   - when accepted, hand the command only values that the parameters allow: no text with a
//     control character, integers within their range, enumerated texts from the list, every
//     required option present, and every text exactly as the user typed it;
//   - run no shell command line other than the datastore notifications, which hold no user
//     value.
#include <gmock/gmock.h>
#include <stdlib.h>
#include <unistd.h>

#include <nlohmann/json.hpp>

#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <memory>
#include <string>
#include <vector>

#include "ArgumentParser.h"
#include "CommandLine.h"
#include "CommandTree.h"
#include "FuzzCheck.h"
#include "HostBackend.h"
#include "MockHost.h"
#include "ShellCmdHook.h"
#include "autocli/AutoCli.h"
#include "commands/common/HostPath.h"
#include "commands/trace/TraceConfigFile.h"
#include "commands/trace/TraceRestartWait.h"

extern "C" void AutoCli_RegisterNamespaces(std::shared_ptr<Kalmor::AutoCli::NamespaceNode>* root);

using Kalmor::AutoCli::CommandSpec;
using Kalmor::AutoCli::NamespaceNode;
using Kalmor::AutoCli::NodeType;
using Kalmor::CallSpec::InputSpec;
using Kalmor::CallSpec::ParameterSpec;
using ::testing::NiceMock;
namespace App = Kalmor::AutoCli::App;
namespace CallSpec = Kalmor::CallSpec;

namespace {

constexpr size_t kMaxWords = 32;

const char kTraceFile[] =
    "# tracing service\n"
    "MESKTRACED_LAST_SELECTED_VOLUME=\"/scratch/trace\"\n"
    "MESKTRACED_ROTATE_MAX_FILES=8\n"
    "MESKTRACED_ROTATE_FILE_SIZE=45\n"
    "MESKTRACED_LOG_URGENT_TO_SYSLOG=1\n";

// Everything that lives for the whole run: the tree, the scripted host (in a cluster, not a
// witness), the host's files in a directory of their own, and what the commands did.
struct World {
    std::shared_ptr<NamespaceNode> root = Kalmor::AutoCli::Namespace::New();
    NiceMock<MeskTest::MockMeskInfo> info;
    NiceMock<MeskTest::MockHost> host{info};
    std::string hostRoot;
    std::string traceFile;
    std::vector<std::string> allowedShellLines;
    size_t shellRuns = 0;
    size_t waits = 0;

    World() {
        hostRoot = std::string(access("/dev/shm", W_OK) == 0 ? "/dev/shm" : "/tmp") +
                   "/mesk-fuzz-arguments.XXXXXX";
        if (mkdtemp(&hostRoot[0]) == nullptr) std::abort();
        setenv("MESK_HOST_ROOT", hostRoot.c_str(), 1);
        traceFile = OrvaneCli::MeskNamespace::HostPath(OrvaneCli::MeskNamespace::TRACE_CONFIG_FILE);
        std::filesystem::create_directories(std::filesystem::path(traceFile).parent_path());

        const std::string notify = OrvaneCli::MeskNamespace::HostShellPath(
            "/usr/lib/orvane/tavord/bin/notifyDatastore.py");
        for (const char* event : {"PreUnmount", "FailedUnmount"}) {
            allowedShellLines.push_back(notify + " -t " + event + " -d meskDatastore");
        }
        Kalmor::AutoCli::SetShellCmdHook(
            [this](const std::string& command, std::string& output, const std::string&) {
                bool allowed = false;
                for (const auto& line : allowedShellLines) allowed = allowed || command == line;
                FUZZ_CHECK(allowed);
                ++shellRuns;
                output.clear();
                return 0;
            });
        OrvaneCli::MeskNamespace::SetRestartWait([this](unsigned) { ++waits; });

        info.clusterConfig.enabled = true;
        info.clusterConfig.clusterUuid = "52b0c0de-0000-4000-8000-000000000001";
        HostCtlSim::SetBackend(&host);
        AutoCli_RegisterNamespaces(&root);
    }

    ~World() {
        HostCtlSim::SetBackend(nullptr);
        Kalmor::AutoCli::SetShellCmdHook(nullptr);
        OrvaneCli::MeskNamespace::SetRestartWait(nullptr);
        std::error_code ignored;
        std::filesystem::remove_all(hostRoot, ignored);
    }

    void ResetTraceFile() const { std::ofstream(traceFile, std::ios::trunc) << kTraceFile; }

    // A count that grows whenever a command did anything at all.
    size_t Activity() const { return static_cast<size_t>(host.pluginsMade) + shellRuns + waits; }
};

World& TheWorld() {
    static World world;
    return world;
}

std::vector<std::string> SplitWords(const uint8_t* data, size_t size) {
    std::vector<std::string> words(1);
    for (size_t i = 0; i < size; ++i) {
        if (data[i] != 0) {
            words.back() += static_cast<char>(data[i]);
        } else if (words.size() < kMaxWords) {
            words.emplace_back();
        } else {
            break;
        }
    }
    if (words.size() == 1 && words[0].empty()) words.clear();
    return words;
}

bool HasControlCharacter(const std::string& text) {
    for (char c : text) {
        const auto byte = static_cast<unsigned char>(c);
        if ((byte < 0x20 && byte != '\t') || byte == 0x7F) return true;
    }
    return false;
}

// Whether `value` stands in the command line as the user typed it: a whole word, or the part
// of a word after "--name=" or after "-x".
bool Typed(const std::vector<std::string>& words, const std::string& value) {
    for (const auto& word : words) {
        if (word.size() >= value.size() &&
            word.compare(word.size() - value.size(), value.size(), value) == 0) {
            return true;
        }
    }
    return false;
}

// The command the words name, and where its options start, as autocli resolves it.
CommandSpec* FindCommand(const std::vector<std::string>& words, size_t& next,
                         App::GlobalOptions& globals) {
    std::shared_ptr<NamespaceNode> node = TheWorld().root;
    size_t index = 0;
    while (true) {
        while (index < words.size() && !words[index].empty() && words[index][0] == '-') {
            std::string error;
            if (!App::TakeGlobalOption(words, index, globals, error) || !error.empty()) {
                return nullptr;
            }
        }
        if (index >= words.size()) return nullptr;
        App::PathResolution path = App::ResolvePath(node, words, index);
        if (!path.error.empty()) return nullptr;
        node = path.node;
        index = path.next;
        if (node->GetType() == NodeType::Command) break;
    }
    next = index;
    return dynamic_cast<CommandSpec*>(node.get());
}

// Checks every value that the parser accepted for the command against its parameters. Returns
// the formatter asked for, if any.
std::string CheckAccepted(const std::vector<std::string>& words) {
    size_t next = 0;
    App::GlobalOptions globals;
    CommandSpec* command = FindCommand(words, next, globals);
    if (command == nullptr) return std::string();
    std::shared_ptr<InputSpec> spec = command->GetInputSpec();
    App::ParseResult parsed = App::ParseArguments(
        std::vector<std::string>(words.begin() + static_cast<std::ptrdiff_t>(next), words.end()),
        *spec, &globals);
    if (!parsed.error.empty() || parsed.documentationRequested) return std::string();

    for (const auto& parameter : spec->GetParameters()) {
        const std::string& name = parameter->GetName();
        if (parameter->IsRequired()) FUZZ_CHECK(parsed.input->HasParameter(name));
    }
    for (const auto& entry : parsed.input->GetValues()) {
        std::shared_ptr<ParameterSpec> parameter = spec->FindParameter(entry.first);
        FUZZ_CHECK(parameter != nullptr);
        const auto& constraint = parameter->GetConstraint();
        for (const auto& value : entry.second) {
            switch (parameter->GetType()) {
                case CallSpec::PARAM_STRING:
                case CallSpec::PARAM_STRING_LIST: {
                    FUZZ_CHECK(!HasControlCharacter(value));
                    FUZZ_CHECK(Typed(words, value));
                    if (constraint && constraint->GetType() == CallSpec::CONSTRAINT_STRING_ENUM) {
                        bool listed = false;
                        for (const auto& allowed : constraint->GetStringEnum()) {
                            listed = listed || allowed.value == value;
                        }
                        FUZZ_CHECK(listed);
                    }
                    break;
                }
                case CallSpec::PARAM_INT: {
                    const int64_t number = parsed.input->GetParameterInt(entry.first);
                    if (constraint && constraint->GetType() == CallSpec::CONSTRAINT_INT_RANGE) {
                        FUZZ_CHECK(number >= constraint->GetIntMinimum() &&
                                   number <= constraint->GetIntMaximum());
                    }
                    break;
                }
                default:
                    break;
            }
        }
    }
    return globals.formatter;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    World& world = TheWorld();
    const std::vector<std::string> words = SplitWords(data, size);
    // Only the trace commands read or write the file; the other inputs need not pay for it.
    for (const auto& word : words) {
        if (word.find("trace") != std::string::npos) {
            world.ResetTraceFile();
            break;
        }
    }

    const size_t before = world.Activity();
    const App::RunResult result = App::Run(words, world.root);
    FUZZ_CHECK(result.status == App::kExitSuccess || result.status == App::kExitCommandFailed ||
               result.status == App::kExitUsage);
    if (result.status == App::kExitUsage) {
        FUZZ_CHECK(world.Activity() == before);
        FUZZ_CHECK(!result.err.empty() && result.err.find('\n') == result.err.size() - 1);
    }
    const std::string formatter = CheckAccepted(words);
    if ((formatter == "json" || formatter == "json-pretty") && result.status != App::kExitUsage &&
        !result.out.empty()) {
        FUZZ_CHECK(!nlohmann::json::parse(result.out, nullptr, false).is_discarded());
    }
    return 0;
}
