// The scripted test double of the host-control library.
//
// A test installs a MockHost as the library's backend (HostTest does it) and scripts it with
// GoogleMock: every static entry point (MockHost) and every operation of the info object
// (MockMeskInfo) can be given an answer or a failure, and every call is observed with its
// arguments. Commands obtain a fresh plug-in and info object as they would from the real
// library; those are thin proxies that forward to the test's MockMeskInfo, which outlives
// them, so the test can check calls after the command returned.
#pragma once

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "HostBackend.h"
#include "autocli/AutoCli.h"
#include "autocli/CallSpec.h"
#include "hostctl/MeskCtlException.h"
#include "hostctl/MeskInfo.h"
#include "hostctl/MeskPlugin.h"
#include "hostctl/MeskTypes.h"

namespace MeskTest {

using HostCtl::Mesk::MeskClusterConfig;
using HostCtl::Mesk::MeskConfigGeneration;
using HostCtl::Mesk::MeskDiskInfo;
using HostCtl::Mesk::MeskDiskLun;
using HostCtl::Mesk::MeskIpAddress;
using HostCtl::Mesk::MeskMemberInfo;
using HostCtl::Mesk::MeskPolicyClass;
using HostCtl::Mesk::MeskZuvNicConfig2;
using HostCtl::Mesk::Uuid;
using LunList = std::vector<std::shared_ptr<MeskDiskLun>>;
using NicList = std::vector<std::unique_ptr<MeskZuvNicConfig2>>;

// The mocks, and the proxies that commands get, are made from the operation tables of the
// simulated host (Operations.h): a new operation needs no line here.
#define MESK_MOCK_OPERATION(result, name, parameters, arguments) \
    MOCK_METHOD(result, name, parameters, (override));
#define MESK_FORWARD_OPERATION(result, name, parameters, arguments) \
    result name parameters override {                               \
        return target_.name arguments;                              \
    }

class MockMeskInfo : public HostCtl::Mesk::MeskInfo2 {
  public:
    MockMeskInfo();
    ~MockMeskInfo() override;

    HOSTCTL_INFO_OPERATIONS(MESK_MOCK_OPERATION)
    HOSTCTL_INFO2_OPERATIONS(MESK_MOCK_OPERATION)

    // What GetClusterConfig returns by default: not enabled, no UUID.
    MeskClusterConfig clusterConfig;
};

// What kind of info object the plug-in hands out.
enum class InfoKind {
    Extended,  // a MeskInfo2
    Basic,     // a MeskInfo that is not a MeskInfo2
    Null,      // no object at all
};

class MockHost : public HostCtlSim::HostBackend {
  public:
    // By default GetMeskPlugin hands out a plug-in whose info objects forward to `info`, and
    // the conversions and the UUID functions behave as the real library's.
    explicit MockHost(MockMeskInfo& info);
    ~MockHost() override;

    MOCK_METHOD(std::unique_ptr<HostCtl::MeskPlugin>, GetMeskPlugin, (), (override));
    MOCK_METHOD(void, GetMeskDisks, (LunList&), (override));
    HOSTCTL_UTIL_OPERATIONS(MESK_MOCK_OPERATION)
    HOSTCTL_UTIL_CONVERSIONS(MESK_MOCK_OPERATION)
    MOCK_METHOD(char*, UUID_CreateRandom, (), (override));
    MOCK_METHOD(char*, UUID_PackText, (const char*, char*, size_t), (override));

    // The kind of info object that the default plug-in hands out.
    InfoKind infoKind = InfoKind::Extended;
    // How many plug-in objects were made, and info objects made and released, so far.
    int pluginsMade = 0;
    int infosMade = 0;
    int infosReleased = 0;
};

// A disk device with a fixed name and UUID.
class FakeLun : public MeskDiskLun {
  public:
    FakeLun(std::string name, Uuid uuid) : name_(std::move(name)), uuid_(uuid) {}
    Uuid GetUuid() const override { return uuid_; }
    std::string GetName() const override { return name_; }

  private:
    std::string name_;
    Uuid uuid_;
};

// The UUID record of a UUID text (throws on a malformed one).
Uuid UuidOf(const std::string& text);

// An action that throws MeskCtlException with that message.
inline auto Fail(const std::string& message) {
    return ::testing::Throw(HostCtl::Lib::Mesk::MeskCtlException(message));
}

// An argument of a recorded call as text: a string as it is, a list of strings joined by
// ",", an address as "v4:" or "v6:" and its text, a UUID in text form, an interface record as
// its name, agent and master groups (IPv4, IPv6), agent, master and unicast ports, TTL, traffic
// types and (only when there are any) options in parentheses; anything else as GoogleTest
// prints it.
std::string Arg(const std::string& text);
std::string Arg(const std::vector<std::string>& texts);
std::string Arg(const MeskIpAddress& address);
std::string Arg(const Uuid& uuid);
std::string Arg(const MeskZuvNicConfig2& nic);
template <class T>
std::string Arg(const T& value) {
    return ::testing::PrintToString(value);
}

// Base fixture of the command tests: installs the double for the test's lifetime.
class HostTest : public ::testing::Test {
  protected:
    HostTest();
    ~HostTest() override;

    // Runs the command's ExecuteInternal with the options written as "name=value name=value"
    // (a list option once per value, a flag as its bare name); returns the output.
    std::shared_ptr<Kalmor::CallSpec::Output> Run(Kalmor::AutoCli::Command& command,
                                                  const std::string& options = "");

    // Sets whether the host is enabled in a cluster, as GetClusterConfig reports it.
    void SetEnabled(bool enabled, const std::string& clusterUuid = "");

    // An action for any operation of the double: appends the call to `calls` as
    // "Name(argument, ...)", then throws MeskCtlException(failure) if `failure` is set, or
    // returns the answer if one is given.
    template <class... Answer>
    auto Record(const std::string& name, Answer... answer) {
        return [this, name, answer...](const auto&... args) {
            std::string call;
            ((call += (call.empty() ? "" : ", ") + Arg(args)), ...);
            calls += (calls.empty() ? "" : " ") + name + "(" + call + ")";
            if (!failure.empty()) throw HostCtl::Lib::Mesk::MeskCtlException(failure);
            return (answer, ...);
        };
    }
    std::string calls, failure;

    ::testing::NiceMock<MockMeskInfo> info;
    ::testing::NiceMock<MockHost> host{info};
};

// A result value as text: a structure as {name=value, ...} in field order, a list as
// [element, ...], a value never set as null, no object at all as "no result".
std::string Shown(const std::shared_ptr<Kalmor::MetaObj::MetaObject>& value);
// What a run handed back, as one line: each error message followed by "; ", then the result
// as Shown, then ", complete" or ", incomplete". For example "true, complete", or
// "Unable to mount: busy; no result, incomplete".
std::string Outcome(const Kalmor::CallSpec::Output& output);
// The elements of a list, each as Shown, or one field of each; fails the test when `list` is
// not a list of structures with that field.
std::vector<std::string> Elements(const std::shared_ptr<Kalmor::MetaObj::MetaObject>& list,
                                  const std::string& field = "");

}  // namespace MeskTest
