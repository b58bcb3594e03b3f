// A simulated host of its own for each test, in a temporary directory, installed as the
// library's backend so that the static entry points reach it.
#pragma once

#include <gtest/gtest.h>
#include <stdlib.h>

#include <filesystem>
#include <memory>
#include <string>

#include "HostBackend.h"
#include "SimHost.h"
#include "StateDocument.h"
#include "hostctl/MeskCtlException.h"
#include "hostctl/MeskInfo.h"
#include "hostctl/MeskPlugin.h"

namespace SimTest {

using HostCtl::Lib::Mesk::MeskCtlException;
using HostCtlSim::Json;
using HostCtlSim::SimHost;

class SimFixture : public ::testing::Test {
  protected:
    SimFixture() {
        char pattern[] = "/tmp/hostctl-test.XXXXXX";
        directory_ = mkdtemp(pattern);
        options_ = {directory_ + "/state.db", directory_ + "/root", directory_ + "/root", true};
        NewInvocation();
    }

    ~SimFixture() override {
        EndInvocation();
        std::error_code error;
        std::filesystem::remove_all(directory_, error);
    }

    // Ends the current invocation: its call log is written.
    void EndInvocation() {
        info_.reset();
        plugin_.reset();
        HostCtlSim::SetBackend(nullptr);
        host_.reset();
    }

    // Ends the current invocation and starts the next one.
    void NewInvocation() {
        EndInvocation();
        host_ = std::make_unique<SimHost>(options_);
        HostCtlSim::SetBackend(host_.get());
    }

    // The info object of the current invocation, made on first use.
    HostCtl::Mesk::MeskInfo2& Info() {
        if (!info_) {
            plugin_ = HostCtl::MeskPluginFactory::GetMeskPlugin();
            info_ = plugin_->GetMeskInfo();
        }
        return dynamic_cast<HostCtl::Mesk::MeskInfo2&>(*info_);
    }

    // The whole host as `hostsim show` prints it, less the services.
    Json State() { return host_->Store().Dump(); }

    // Replaces the host by `document`, with the services of a fresh host.
    void Load(Json document) {
        document["services"] = HostCtlSim::DefaultHost()["services"];
        HostCtlSim::StateStore::Transaction transaction(host_->Store());
        host_->Store().Replace(HostCtlSim::NormalizeHost(document));
        transaction.Commit();
    }

    // Runs `action`, which must throw MeskCtlException with a message containing `text`,
    // and checks that it changed nothing.
    template <class Action>
    void ExpectRefusal(const std::string& text, Action&& action) {
        Json before = State();
        try {
            action();
            ADD_FAILURE() << "not refused; expected: " << text;
        } catch (const MeskCtlException& e) {
            EXPECT_NE(e.GetMessage().find(text), std::string::npos) << e.GetMessage();
        }
        EXPECT_EQ(State(), before) << "a refused operation changed the host";
    }

    std::string directory_;
    SimHost::Options options_;
    std::unique_ptr<SimHost> host_;
    std::unique_ptr<HostCtl::MeskPlugin> plugin_;
    std::unique_ptr<HostCtl::Mesk::MeskInfo> info_;
};

// The disks of a fresh host.
const char* const kSsd = "mpx.pthba2:C0:T0:L0";
const char* const kHdd1 = "mpx.pthba2:C0:T1:L0";
const char* const kHdd2 = "mpx.pthba2:C0:T2:L0";
const char* const kHdd3 = "mpx.pthba2:C0:T3:L0";
const char* const kSsdUuid = "52a0e7c4-1b2d-4e3f-8a90-0b1c2d3e4f01";
const char* const kClusterUuid = "52f1c2a0-7b3e-4d01-9a6e-00a1b2c3d4e5";

}  // namespace SimTest
