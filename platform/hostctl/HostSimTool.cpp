// hostsim: sets up, inspects and fault-injects the simulated host that the host-control
// library serves. It shares the host with autocli through HOSTSIM_STATE and MESK_HOST_ROOT.
#include <cerrno>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <iostream>
#include <iterator>
#include <sstream>
#include <string>
#include <vector>

#include "CallLog.h"
#include "HostRoot.h"
#include "Output.h"
#include "SimHost.h"
#include "StateDocument.h"
#include "StateStore.h"

using HostCtlSim::CallRecord;
using HostCtlSim::HostRoot;
using HostCtlSim::Json;
using HostCtlSim::SimHost;
using HostCtlSim::StateStore;

namespace {

const char* const kUsage = R"(Usage: hostsim COMMAND [ARGUMENTS]

Sets up and inspects the simulated host behind the host-control library. The host's state is
the database HOSTSIM_STATE (default /var/lib/hostsim/state.db); its files lie below
MESK_HOST_ROOT (default /var/lib/hostsim/root).

Commands:
  reset                       a fresh host: no cluster, one SSD and three HDDs unclaimed, no
                              interfaces, no unicast agents, no default policies, the tracing
                              service running; clears injected failures and the call log
  show                        prints the whole host as one JSON document
  load [--merge] FILE|-       replaces the host by such a document (from standard input for -);
                              with --merge, FILE holds only the keys to change (a JSON merge
                              patch over the current host)
  fail OPERATION [--] MESSAGE [--call N]
                              makes every call of OPERATION (only the Nth of each invocation
                              with --call) throw MeskCtlException with MESSAGE (after --
                              when it begins with a dash)
  fail --clear [OPERATION]    removes every injected failure, or those of OPERATION
  fail --list                 prints the injected failures, one JSON object a line
  calls [--clear]             prints the host-control operations of the last invocation run
                              with HOSTSIM_CALLS=1 (the checkout's wrappers set it) and the
                              host scripts it ran, in order, one JSON object a line; --clear
                              empties the log
  service mesktraced running|stopped|status-fails|restart-fails [N]
                              sets how the tracing service's control script behaves: status
                              exits 0 (running) or 3 (stopped); status-fails makes the status
                              check die by a signal; restart-fails makes the next N restarts
                              (every restart without N) exit 1
  populate --luns N [--agents N] [--nics N]
                              a host in a cluster with N disks claimed into disk groups of one
                              SSD and up to seven HDDs, N unicast agents and N interfaces
  --help                      this text
  --version                   hostsim's version
)";

class UsageError : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

int64_t Number(const std::string& text, const char* what, int64_t lowest, int64_t highest) {
    errno = 0;
    char* end = nullptr;
    long long value = std::strtoll(text.c_str(), &end, 10);
    if (text.empty() || *end != '\0' || errno == ERANGE || value < lowest || value > highest) {
        throw UsageError(std::string(what) + " must be a whole number from " +
                         std::to_string(lowest) + " to " + std::to_string(highest) + ", not '" +
                         text + "'");
    }
    return value;
}

// The row of the state that lists the files of the last change still to be put in place.
const char* const kPendingFiles = "pendingFiles";

struct Host {
    SimHost::Options options = SimHost::OptionsFromEnvironment();
    StateStore store{options.statePath};
    HostRoot root{options.hostRoot};

    StateStore& Open() {
        store.Open([&] { root.Create(HostCtlSim::DefaultHost()["services"]); });
        return store;
    }

    Json Services() { return root.ReadServices(store.ReadExtra(kPendingFiles)); }

    Json Document() {
        Json document = Open().Dump();
        document["services"] = Services();
        return document;
    }

    // Runs `change` as one change of the whole host, files included: under one write
    // transaction it changes the state and writes the files aside (HostRoot::Files), which
    // are renamed into place only once the state is committed. A failure before that leaves
    // state and files as they were. The commit also records the files still to be renamed, so
    // that `show` reads them and the next change puts them in place when this process is
    // killed in between.
    template <class Change>
    void Modify(Change&& change, bool opened = false) {
        // A host made here gets its files under the creation lock, before anyone can see it.
        if (!opened) Open();
        StateStore::Transaction transaction(store);
        root.Complete(store.ReadExtra(kPendingFiles));
        HostRoot::Files files(root);
        change(files);
        store.WriteSection(kPendingFiles, files.Pending());
        transaction.Commit();
        files.Apply();
    }

    // Replaces the whole host by a normalized document; `fresh` also renews the host's files
    // and forgets the injected failures and the call log.
    void Replace(const Json& document, bool fresh) {
        store.OpenForReplacement([&] { root.Create(HostCtlSim::DefaultHost()["services"]); });
        Modify(
            [&](HostRoot::Files& files) {
                store.Replace(document);
                if (fresh) store.ClearFaults();
                if (fresh) {
                    for (const auto& file : HostRoot::FreshFiles(document["services"])) {
                        files.Write(file);
                    }
                } else {
                    files.Write(HostRoot::ServicesFile(document["services"]));
                }
            },
            true);
        if (fresh) HostCtlSim::CallLog::Clear(root);
    }

    // Applies a JSON merge patch to the whole host, read and written in one change, so that
    // concurrent merges all land.
    void Merge(const Json& patch) {
        Modify([&](HostRoot::Files& files) {
            Json document = Document();
            document.merge_patch(patch);
            document = HostCtlSim::NormalizeHost(document);
            store.Replace(document);
            files.Write(HostRoot::ServicesFile(document["services"]));
        });
    }
};

std::string ReadInput(const std::string& file) {
    if (file == "-") {
        return std::string(std::istreambuf_iterator<char>(std::cin),
                           std::istreambuf_iterator<char>());
    }
    std::ifstream in(file, std::ios::binary);
    if (!in) throw std::runtime_error("cannot read " + file + ": " + std::strerror(errno));
    std::ostringstream text;
    text << in.rdbuf();
    return text.str();
}

int Load(const std::vector<std::string>& args) {
    bool merge = !args.empty() && args[0] == "--merge";
    if (args.size() != (merge ? 2u : 1u)) throw UsageError("load takes [--merge] FILE or -");
    Json input = HostCtlSim::ParseDocument(ReadInput(args.back()));
    if (input.is_discarded()) throw std::runtime_error(args.back() + ": not a JSON document");
    Host host;
    if (merge) {
        host.Merge(input);
    } else {
        host.Replace(HostCtlSim::NormalizeHost(input), false);
    }
    return 0;
}

// Refuses a name that no operation has, listing those that exist.
void CheckOperation(const std::string& name) {
    HostCtlSim::Operation operation;
    if (HostCtlSim::FindOperation(name, &operation)) return;
    std::string known;
    for (const char* operationName : HostCtlSim::kOperationNames) {
        known += (known.empty() ? "" : ", ") + std::string(operationName);
    }
    throw UsageError("unknown operation '" + name + "'; the operations are: " + known);
}

int Fail(std::vector<std::string> args) {
    Host host;
    if (!args.empty() && args[0] == "--clear" && args.size() <= 2) {
        const std::string op = args.size() == 2 ? args[1] : std::string();
        if (!op.empty()) CheckOperation(op);
        host.Modify([&](HostRoot::Files&) { host.store.ClearFaults(op); });
        return 0;
    }
    if (args.size() == 1 && args[0] == "--list") {
        for (const auto& fault : host.Open().ReadFaults()) {
            Json line;
            line["op"] = fault.op;
            line["call"] = fault.call;
            line["message"] = fault.message;
            std::cout << HostCtlSim::JsonText(line) << "\n";
        }
        return 0;
    }
    // A message that begins with a dash is almost always a misplaced option ("fail OP
    // --clear"); one that really does must follow "--".
    const bool marked = args.size() >= 2 && args[1] == "--";
    if (marked) args.erase(args.begin() + 1);
    if (!marked && args.size() >= 2 && !args[1].empty() && args[1][0] == '-') {
        throw UsageError("'" + args[1] + "' is no message; to clear " + args[0] +
                         "'s failures: hostsim fail --clear " + args[0] +
                         "; a message that begins with a dash follows --");
    }
    HostCtlSim::Fault fault;
    if (args.size() == 2) {
        fault.call = 0;
    } else if (args.size() == 4 && args[2] == "--call") {
        fault.call = Number(args[3], "--call", 1, 1000000000);
    } else {
        throw UsageError(
            "fail takes OPERATION [--] MESSAGE [--call N], --clear [OPERATION] or --list");
    }
    fault.op = args[0];
    fault.message = args[1];
    CheckOperation(fault.op);
    host.Modify([&](HostRoot::Files&) { host.store.SetFault(fault); });
    return 0;
}

int Calls(const std::vector<std::string>& args) {
    HostRoot root(SimHost::OptionsFromEnvironment().hostRoot);
    if (args.size() == 1 && args[0] == "--clear") {
        if (!HostCtlSim::CallLog::Clear(root)) {
            throw std::runtime_error("cannot clear " + root.PathOf(HostCtlSim::kCallLogPath));
        }
        HostRoot::Files files(root);
        files.Write({HostCtlSim::kScriptLogPath, "", 0644});
        files.Apply();
        return 0;
    }
    if (!args.empty()) throw UsageError("calls takes no argument but --clear");
    std::vector<CallRecord> calls = HostCtlSim::CallLog::Read(root);
    std::vector<CallRecord> scripts = root.ReadScriptLog();
    // Script runs of earlier invocations are left out.
    int64_t since = calls.empty() ? INT64_MIN : calls.front().time;
    size_t s = 0;
    while (s < scripts.size() && scripts[s].time < since) ++s;
    for (const CallRecord& call : calls) {
        while (s < scripts.size() && scripts[s].time < call.time) {
            std::cout << scripts[s++].entry << "\n";
        }
        std::cout << call.entry << "\n";
    }
    while (s < scripts.size()) std::cout << scripts[s++].entry << "\n";
    return 0;
}

int Service(const std::vector<std::string>& args) {
    if (args.size() < 2 || args[0] != "mesktraced") {
        throw UsageError("service takes mesktraced running|stopped|status-fails|restart-fails [N]");
    }
    const std::string& mode = args[1];
    int64_t restartFailures = -1;
    size_t expected = 2;
    if (mode == "restart-fails" && args.size() == 3) {
        restartFailures = Number(args[2], "N", 1, INT32_MAX);
        expected = 3;
    } else if (mode != "running" && mode != "stopped" && mode != "status-fails" &&
               mode != "restart-fails") {
        throw UsageError("unknown service behaviour '" + mode +
                         "'; use running, stopped, status-fails or restart-fails [N]");
    }
    if (args.size() != expected) throw UsageError("too many arguments to service");
    Host host;
    host.Modify([&](HostRoot::Files& files) {
        Json services = host.Services();
        Json& trace = services["mesktraced"];
        if (mode == "running" || mode == "stopped") {
            trace["state"] = mode;
            trace["statusFails"] = false;
            trace["restartFailures"] = 0;
        } else if (mode == "status-fails") {
            trace["statusFails"] = true;
        } else {
            trace["restartFailures"] = restartFailures;
        }
        files.Write(HostRoot::ServicesFile(services));
    });
    return 0;
}

int Populate(const std::vector<std::string>& args) {
    int64_t luns = -1, agents = 0, nics = 0;
    for (size_t i = 0; i < args.size(); i += 2) {
        if (i + 1 >= args.size()) throw UsageError(args[i] + " needs a number");
        int64_t value = Number(args[i + 1], args[i].c_str(), 0, 1000000);
        if (args[i] == "--luns") {
            luns = value;
        } else if (args[i] == "--agents") {
            agents = value;
        } else if (args[i] == "--nics") {
            nics = value;
        } else {
            throw UsageError("unknown option " + args[i]);
        }
    }
    if (luns < 0) throw UsageError("populate needs --luns N");
    Host host;
    host.Replace(HostCtlSim::NormalizeHost(HostCtlSim::PopulatedHost(luns, agents, nics)), true);
    return 0;
}

int Run(const std::string& command, const std::vector<std::string>& args) {
    if (command == "reset") {
        if (!args.empty()) throw UsageError("reset takes no argument");
        Host host;
        host.Replace(HostCtlSim::NormalizeHost(HostCtlSim::DefaultHost()), true);
        return 0;
    }
    if (command == "show") {
        if (!args.empty()) throw UsageError("show takes no argument");
        std::cout << Host().Document().dump(2, ' ', false, Json::error_handler_t::replace) << "\n";
        return 0;
    }
    if (command == "load") return Load(args);
    if (command == "fail") return Fail(args);
    if (command == "calls") return Calls(args);
    if (command == "service") return Service(args);
    if (command == "populate") return Populate(args);
    throw UsageError("unknown command '" + command + "'");
}

int Main(int argc, char** argv) {
    std::vector<std::string> args(argv + 1, argv + argc);
    if (args.empty()) {
        std::cerr << kUsage;
        return 1;
    }
    if (args[0] == "--help" || args[0] == "-h" || args[0] == "help") {
        std::cout << kUsage;
        return 0;
    }
    if (args.size() == 1 && args[0] == "--version") {
        std::cout << "hostsim " HOSTSIM_VERSION "\n";
        return std::cout.flush() ? 0 : 1;
    }
    std::string command = args[0];
    args.erase(args.begin());
    try {
        int status = Run(command, args);
        std::cout.flush();
        return status;
    } catch (const UsageError& error) {
        std::cerr << "hostsim " << command << ": " << error.what() << "\n"
                  << "Run 'hostsim --help' for the commands.\n";
    } catch (const HostCtlSim::DocumentError& error) {
        std::cerr << "hostsim " << command << ": invalid host document: " << error.what() << "\n";
    } catch (const std::exception& error) {
        std::cerr << "hostsim " << command << ": " << error.what() << "\n";
    }
    return 1;
}

}  // namespace

int main(int argc, char** argv) {
    // An ignored SIGCHLD inherited from whoever started us would make the scripts we run
    // vanish before their exit status is read.
    signal(SIGCHLD, SIG_DFL);
    std::cout.rdbuf(Output::StdoutBuffer());
    return Output::Finish("hostsim", Main(argc, argv));
}
