// Fuzzes the reader of hostsim's host document (what `hostsim load` accepts).
//
// The input is a JSON text; its first byte chooses between a whole document and a merge
// patch over the default host, as `hostsim load --merge` applies it. A document is either
// refused with a DocumentError or normalized; a normalized document normalizes to itself and
// comes back unchanged from the state database.
#include <unistd.h>

#include <cstdint>
#include <cstdlib>
#include <memory>
#include <string>
#include <string_view>

#include "FuzzCheck.h"
#include "StateDocument.h"
#include "StateStore.h"

using HostCtlSim::DocumentError;
using HostCtlSim::Json;
using HostCtlSim::StateStore;

namespace {

// One state database for the whole run, in a directory of its own that goes at exit.
class Scratch {
  public:
    Scratch() {
        const char* base = access("/dev/shm", W_OK) == 0 ? "/dev/shm" : "/tmp";
        dir_ = std::string(base) + "/mesk-fuzz-host.XXXXXX";
        if (mkdtemp(&dir_[0]) == nullptr) std::abort();
        store_ = std::make_unique<StateStore>(dir_ + "/state.db");
        store_->Open();
    }
    ~Scratch() {
        store_.reset();
        for (const char* suffix : {"", "-wal", "-shm"}) {
            unlink((dir_ + "/state.db" + suffix).c_str());
        }
        rmdir(dir_.c_str());
    }
    StateStore& Store() { return *store_; }

  private:
    std::string dir_;
    std::unique_ptr<StateStore> store_;
};

StateStore& Store() {
    static Scratch scratch;
    return scratch.Store();
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    if (size == 0) return 0;
    const bool merge = (data[0] & 1) != 0;
    Json normalized;
    try {
        Json input = HostCtlSim::ParseDocument(
            std::string_view(reinterpret_cast<const char*>(data) + 1, size - 1));
        if (input.is_discarded()) return 0;
        Json document = input;
        if (merge) {
            document = HostCtlSim::DefaultHost();
            document.merge_patch(input);
        }
        normalized = HostCtlSim::NormalizeHost(document);
    } catch (const DocumentError&) {
        return 0;
    }
    FUZZ_CHECK(HostCtlSim::NormalizeHost(normalized) == normalized);

    StateStore& store = Store();
    {
        StateStore::Transaction transaction(store);
        store.Replace(normalized);
        transaction.Commit();
    }
    Json stored = normalized;
    stored.erase("services");  // kept in the host's files, not in the database
    FUZZ_CHECK(store.Dump() == stored);
    return 0;
}
