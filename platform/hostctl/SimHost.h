// The simulated host: the default backend of the host-control library.
//
// Its state lives in a StateStore (opened on the first call that needs it) and its files in
// a HostRoot. Every host-control operation it serves is recorded, with its arguments, in the
// call log of the current invocation (one SimHost object is one invocation) and first
// consults the injected failures, so that any call can be made to throw. The answers of each
// area are in the area's file (Operations.h lists them).
#pragma once

#include <memory>
#include <set>
#include <string>
#include <vector>

#include "CallLog.h"
#include "HostBackend.h"
#include "HostRoot.h"
#include "Operations.h"
#include "StateDocument.h"
#include "StateStore.h"

namespace HostCtlSim {

#define HOSTCTL_SIM_OPERATION_(result, name, parameters, arguments) result name parameters override;
class SimHost : public HostBackend {
  public:
    struct Options {
        std::string statePath;  // the state database
        std::string hostRoot;   // the root directory of the host's files
        // Where MeskExec looks for programs: below this directory, or at the path as given
        // when it is empty.
        std::string execRoot;
        // Whether the calls are kept in the call log, replacing the last invocation's.
        bool keepCalls = false;
    };

    // HOSTSIM_STATE (default /var/lib/hostsim/state.db), MESK_HOST_ROOT (default
    // /var/lib/hostsim/root; programs run at their own paths when it is unset) and
    // HOSTSIM_CALLS (the calls are kept when it is set, and neither empty nor 0).
    static Options OptionsFromEnvironment();
    // The process's simulated host, made on first use from the environment. It lasts until
    // the process ends, which writes its call log when it keeps one.
    static SimHost& Default();

    explicit SimHost(Options options);
    // Writes the call log, when it keeps one.
    ~SimHost() override;

    // The state, opened (a missing database is made a fresh host, with its files).
    StateStore& Store();
    const HostRoot& Root() const { return root_; }

    // The static entry points, answered by the file of their area (Operations.h).
    std::unique_ptr<HostCtl::MeskPlugin> GetMeskPlugin() override;
    void GetMeskDisks(std::vector<std::shared_ptr<HostCtl::Mesk::MeskDiskLun>>& luns) override;
    HOSTCTL_UTIL_OPERATIONS(HOSTCTL_SIM_OPERATION_)
    HOSTCTL_UTIL_CONVERSIONS(HOSTCTL_SIM_OPERATION_)
    char* UUID_CreateRandom() override;
    char* UUID_PackText(const char* text, char* buffer, size_t length) override;

    // Records the call of `op`, then throws the failure injected for it, if any.
    void Enter(Operation op, CallArgs args);
    // Notes on the call being served that it threw.
    void NoteError(const std::string& message);
    // Runs `change` in one transaction.
    template <class Change>
    void Modify(Change&& change) {
        StateStore& store = Store();
        StateStore::Transaction transaction(store);
        change(store);
        transaction.Commit();
    }
    // Interfaces whose last traffic type this process removed.
    bool RemovedInThisInvocation(const std::string& name) const {
        return removedInterfaces_.count(name) != 0;
    }
    void NoteRemoved(const std::string& name) { removedInterfaces_.insert(name); }

  private:
    // The end of the process that made Default(): writes the call log and closes the state
    // if this process changed it.
    void EndProcess();

    Options options_;
    HostRoot root_;
    std::unique_ptr<StateStore> store_;
    std::vector<Fault> faults_;
    int64_t callCounts_[kOperationCount] = {};  // calls of each operation so far
    CallLog log_;
    std::set<std::string> removedInterfaces_;
};
#undef HOSTCTL_SIM_OPERATION_

// Runs `body` as the operation `op` of `host`: recorded, subject to injected failures, and
// noted in the log when it throws.
template <class Body>
auto Serve(SimHost& host, Operation op, CallArgs args, Body&& body) -> decltype(body()) {
    try {
        host.Enter(op, args);
        return body();
    } catch (const std::exception& error) {
        host.NoteError(error.what());
        throw;
    }
}

}  // namespace HostCtlSim
