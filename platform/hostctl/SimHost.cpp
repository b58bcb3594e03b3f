#include "SimHost.h"

#include <cstdlib>
#include <ctime>

#include "SimInfo.h"
#include "UuidText.h"

namespace HostCtlSim {

namespace {

const char* const kDefaultStatePath = "/var/lib/hostsim/state.db";
const char* const kDefaultHostRoot = "/var/lib/hostsim/root";

class SimPlugin : public HostCtl::MeskPlugin {
  public:
    explicit SimPlugin(SimHost& host) : host_(host) {}
    std::unique_ptr<HostCtl::Mesk::MeskInfo> GetMeskInfo() override {
        return Serve(host_, Operation::GetMeskInfo, {},
                     [&] { return std::unique_ptr<HostCtl::Mesk::MeskInfo>(new SimInfo(host_)); });
    }

  private:
    SimHost& host_;
};

// The simulated host's files live below its root, never at the host paths themselves. A
// process that loads this library (autocli with the plug-in, hostsim) therefore has
// MESK_HOST_ROOT name that root even when nobody set it, so that the plug-in, the scripts run
// through MeskExec and hostsim all reach the same files; run before any command.
__attribute__((constructor)) void ExportDefaultHostRoot() {
    const char* root = std::getenv("MESK_HOST_ROOT");
    if (root == nullptr || *root == '\0') setenv("MESK_HOST_ROOT", kDefaultHostRoot, 1);
}

}  // namespace

[[noreturn]] void Refuse(const std::string& message) {
    throw MeskCtlException(message);
}

int64_t NowNanoseconds() {
    timespec now{};
    clock_gettime(CLOCK_REALTIME, &now);
    return int64_t(now.tv_sec) * 1000000000 + now.tv_nsec;
}

std::string Quoted(const std::string& text) {
    return "'" + text + "'";
}

void CheckPort(const char* what, int32_t port) {
    if (port < 1 || port > 65535)
        Refuse(std::string("Invalid ") + what + ": " + std::to_string(port));
}

void SimInfo::SetValue(const char* section, const char* key, const Json& value) {
    host_.Modify([&](StateStore& store) {
        Json s = store.ReadSection(section);
        s[key] = value;
        store.WriteSection(section, s);
    });
}

SimHost::Options SimHost::OptionsFromEnvironment() {
    Options options;
    const char* state = std::getenv("HOSTSIM_STATE");
    options.statePath = state != nullptr && *state != '\0' ? state : kDefaultStatePath;
    const char* root = std::getenv("MESK_HOST_ROOT");
    bool rootSet = root != nullptr && *root != '\0';
    options.hostRoot = rootSet ? root : kDefaultHostRoot;
    options.execRoot = rootSet ? root : "";
    // Only when asked for: a listing records calls by the thousand and writes megabytes.
    const char* calls = std::getenv("HOSTSIM_CALLS");
    options.keepCalls = calls != nullptr && *calls != '\0' && std::string(calls) != "0";
    return options;
}

SimHost& SimHost::Default() {
    // Never destroyed: freeing all it read would only cost the process's end time. An exit
    // handler writes the call log and closes the state only where this process changed it.
    static SimHost* const host = new SimHost(OptionsFromEnvironment());
    static const bool ending = std::atexit([] { host->EndProcess(); }) == 0;
    (void)ending;
    return *host;
}

SimHost::SimHost(Options options) : options_(std::move(options)), root_(options_.hostRoot) {}

SimHost::~SimHost() {
    if (options_.keepCalls) log_.Write(root_);
}

void SimHost::EndProcess() {
    if (options_.keepCalls) log_.Write(root_);
    // A writer closes, so that the last one to close copies the log back into the database.
    // A reader's connection is left to the end of the process, which releases its locks: it
    // wrote nothing and has nothing to undo.
    if (store_ && store_->IsWritable()) store_.reset();
}

StateStore& SimHost::Store() {
    if (store_) return *store_;
    auto store = std::make_unique<StateStore>(options_.statePath);
    store->Open([&] {
        try {
            root_.Create(DefaultHost()["services"]);
        } catch (const std::exception&) {
            // A host without its files still serves every operation but MeskExec.
        }
    });
    faults_ = store->ReadFaults();
    store_ = std::move(store);
    return *store_;
}

void SimHost::Enter(Operation op, CallArgs args) {
    Store();
    if (options_.keepCalls) log_.Record(op, args);
    int64_t count = ++callCounts_[static_cast<size_t>(op)];
    for (const Fault& fault : faults_) {
        if (fault.op == OperationName(op) && (fault.call == 0 || fault.call == count)) {
            throw MeskCtlException(fault.message);
        }
    }
}

void SimHost::NoteError(const std::string& message) {
    if (options_.keepCalls) log_.NoteError(message);
}

std::unique_ptr<HostCtl::MeskPlugin> SimHost::GetMeskPlugin() {
    return Serve(*this, Operation::GetMeskPlugin, {},
                 [&] { return std::unique_ptr<HostCtl::MeskPlugin>(new SimPlugin(*this)); });
}

std::string SimHost::GetFormattedSystemDateTime() {
    return Serve(*this, Operation::GetFormattedSystemDateTime, {},
                 [&] { return HostBackend::GetFormattedSystemDateTime(); });
}

Uuid SimHost::StringToMeskUuid(const std::string& text) {
    // A text that parses is plain, and is logged without another look at it.
    Uuid uuid;
    if (!ParseUuid(text.data(), text.size(), uuid)) {
        return Serve(*this, Operation::StringToMeskUuid, {text},
                     [&] { return HostBackend::StringToMeskUuid(text); });
    }
    return Serve(*this, Operation::StringToMeskUuid, {CallArg::Plain(text)}, [&] { return uuid; });
}

std::string SimHost::MeskUuidToString(const Uuid& uuid) {
    std::string text = HostBackend::MeskUuidToString(uuid);
    // Logged before it is handed over.
    return Serve(*this, Operation::MeskUuidToString, {CallArg::Plain(text)},
                 [&] { return std::move(text); });
}

size_t SimHost::UTF8StringCharLength(const std::string& text) {
    return Serve(*this, Operation::UTF8StringCharLength, {text},
                 [&] { return HostBackend::UTF8StringCharLength(text); });
}

char* SimHost::UUID_CreateRandom() {
    return Serve(*this, Operation::UUID_CreateRandom, {},
                 [&] { return HostBackend::UUID_CreateRandom(); });
}

char* SimHost::UUID_PackText(const char* text, char* buffer, size_t length) {
    Json shown = text != nullptr ? Json(std::string(text, length)) : Json(nullptr);
    return Serve(*this, Operation::UUID_PackText, {shown, length},
                 [&] { return HostBackend::UUID_PackText(text, buffer, length); });
}

}  // namespace HostCtlSim
