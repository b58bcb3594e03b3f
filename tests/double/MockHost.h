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

class MockMeskInfo : public HostCtl::Mesk::MeskInfo2 {
  public:
    MockMeskInfo();
    ~MockMeskInfo() override;

    MOCK_METHOD(const MeskClusterConfig&, GetClusterConfig, (), (override));
    MOCK_METHOD(bool, IsWitness, (), (override));
    MOCK_METHOD(MeskConfigGeneration, GetConfigGeneration, (), (override));
    MOCK_METHOD(void, JoinCluster, (const Uuid&, bool, const std::string&, bool, int32_t),
                (override));
    MOCK_METHOD(void, CreateCluster, (const std::string&, bool, bool), (override));
    MOCK_METHOD(void, LeaveCluster, (bool), (override));
    MOCK_METHOD(void, RestoreClusterConfig, (bool), (override));
    MOCK_METHOD(void, SetPreferredFaultDomain, (const std::string&), (override));
    MOCK_METHOD(void, GetUnicastWitnesses, (std::vector<std::string>&), (override));
    MOCK_METHOD(void, AddUnicastAgent,
                (const std::string&, bool, bool, const MeskIpAddress&, int32_t, bool,
                 const std::string&),
                (override));
    MOCK_METHOD(void, RefreshUnicastAgents, (), (override));
    MOCK_METHOD(void, GetUnicastAgents, (std::vector<std::string>&), (override));
    MOCK_METHOD(bool, RemoveUnicastAgent, (const std::string&, const MeskIpAddress&, int32_t),
                (override));
    MOCK_METHOD(bool, IsZuvNicInUse, (const std::string&, const std::string&), (override));
    MOCK_METHOD(bool, RemoveZuvNic, (const std::string&, bool, const std::string&), (override));
    MOCK_METHOD(void, ClearNetworkConfig, (), (override));
    MOCK_METHOD(void, RestoreNetworkConfig, (), (override));
    MOCK_METHOD(void, GetMeskDiskUuids, (std::vector<Uuid>&), (override));
    MOCK_METHOD(void, GetDiskInfo, (const Uuid&, const LunList&, MeskDiskInfo&), (override));
    MOCK_METHOD(void, AddDisks, (const std::string&, const std::vector<std::string>&), (override));
    MOCK_METHOD(void, RemoveDisk, (const std::string&, const std::string&), (override));
    MOCK_METHOD(void, RemoveDiskGroup, (const std::string&, const std::string&), (override));
    MOCK_METHOD(void, RemoveDiskByUuid, (const std::string&, const std::string&), (override));
    MOCK_METHOD(void, MountDiskGroup, (const std::string&, bool), (override));
    MOCK_METHOD(void, MountByUuid, (const std::string&), (override));
    MOCK_METHOD(void, MountDisk, (const std::string&), (override));
    MOCK_METHOD(void, UnmountDiskGroup, (const std::string&, bool), (override));
    MOCK_METHOD(void, UnmountDisk, (const std::string&, bool), (override));
    MOCK_METHOD(void, AddCapacityFlashTag, (const std::string&), (override));
    MOCK_METHOD(void, RemoveCapacityFlashTag, (const std::string&), (override));
    MOCK_METHOD(bool, GetAutoClaimMode, (), (override));
    MOCK_METHOD(void, SetAutoClaimMode, (bool), (override));
    MOCK_METHOD(std::string, GetDatastoreName, (), (override));
    MOCK_METHOD(void, SetDatastoreName, (const std::string&), (override));
    MOCK_METHOD(std::string, GetFaultDomainName, (), (override));
    MOCK_METHOD(void, SetFaultDomainName, (const std::string&), (override));
    MOCK_METHOD(void, ResetFaultDomainName, (), (override));
    MOCK_METHOD(std::string, GetDefaultPolicy, (const std::string&), (override));
    MOCK_METHOD(void, SetDefaultPolicy, (const std::string&, const std::string&), (override));
    MOCK_METHOD(void, ClearDefaultPolicies, (), (override));
    MOCK_METHOD(int64_t, GetResyncBandwidth, (), (override));
    MOCK_METHOD(int64_t, GetResyncThrottle, (), (override));
    MOCK_METHOD(void, SetResyncThrottle, (int64_t), (override));
    MOCK_METHOD(NicList, GetZuvNicConfigs, (), (override));
    MOCK_METHOD(bool, SetZuvNicConfig, (const MeskZuvNicConfig2&), (override));

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
    // the conversions and UUID functions behave as the real library's.
    explicit MockHost(MockMeskInfo& info);
    ~MockHost() override;

    MOCK_METHOD(std::unique_ptr<HostCtl::MeskPlugin>, GetMeskPlugin, (), (override));
    MOCK_METHOD(void, GetMeskDisks, (LunList&), (override));
    MOCK_METHOD(void, GetInfoFromKOVRA,
                (std::vector<MeskMemberInfo>&, std::string&, std::string&, std::string&, uint64_t&,
                 std::string&, std::string&, std::string&, std::string&),
                (override));
    MOCK_METHOD(void, GetUnicastMode, (bool&), (override));
    MOCK_METHOD(bool, IsInStretchedCluster, (), (override));
    MOCK_METHOD(void, GetPreferredFaultDomainInfo, (std::string&, std::string&), (override));
    MOCK_METHOD(bool, IsWitnessNode, (), (override));
    MOCK_METHOD(std::string, GetFaultDomainId, (), (override));
    MOCK_METHOD(void, DecomCancel, (), (override));
    MOCK_METHOD(int32_t, MeskExec, (const std::string&, const std::string&, bool, bool, bool),
                (override));
    MOCK_METHOD(std::string, GetFormattedSystemDateTime, (), (override));
    MOCK_METHOD(Uuid, StringToMeskUuid, (const std::string&), (override));
    MOCK_METHOD(std::string, MeskUuidToString, (const Uuid&), (override));
    MOCK_METHOD(size_t, UTF8StringCharLength, (const std::string&), (override));
    MOCK_METHOD(MeskPolicyClass, StringToMeskPolicyClass, (const std::string&), (override));
    MOCK_METHOD(std::string, MeskPolicyClassToString, (MeskPolicyClass), (override));
    MOCK_METHOD(std::vector<MeskPolicyClass>, GetMeskPolicyClasses, (), (override));
    MOCK_METHOD(char*, UUID_CreateRandom, (), (override));
    MOCK_METHOD(char*, UUID_PackText, (const char*, char*, size_t), (override));

    // The kind of info object that the default plug-in hands out.
    InfoKind infoKind = InfoKind::Extended;
    // How many plug-in and info objects were made and released so far.
    int pluginsMade = 0;
    int pluginsReleased = 0;
    int infosMade = 0;
    int infosReleased = 0;

    std::unique_ptr<HostCtl::MeskPlugin> MakePlugin();

  private:
    MockMeskInfo& info_;
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

// Base fixture of the command tests: installs the double for the test's lifetime.
class HostTest : public ::testing::Test {
  protected:
    HostTest();
    ~HostTest() override;

    // Runs the command's ExecuteInternal with that input; returns the output.
    std::shared_ptr<Kalmor::CallSpec::Output> Run(
        Kalmor::AutoCli::Command& command,
        std::shared_ptr<Kalmor::CallSpec::Input> input = Kalmor::CallSpec::Input::New());

    // Sets whether the host is enabled in a cluster, as GetClusterConfig reports it.
    void SetEnabled(bool enabled, const std::string& clusterUuid = "");

    ::testing::NiceMock<MockMeskInfo> info;
    ::testing::NiceMock<MockHost> host{info};
};

// A command's input from options written as "name=value name=value"; a list option is given
// once per value.
std::shared_ptr<Kalmor::CallSpec::Input> InputOf(const std::string& options);

// Reading a result.
std::vector<std::string> Errors(const Kalmor::CallSpec::Output& output);
// A refusal before the command acted: that one error message, no result, output not complete.
void ExpectRefused(const Kalmor::CallSpec::Output& output, const std::string& message);
// The bare boolean result; fails the test when the root is not a set MetaBool.
bool BoolResult(const Kalmor::CallSpec::Output& output);
// The text, integer or boolean value of a structure's field; fails the test when it is
// missing or of another kind.
std::string TextField(const std::shared_ptr<Kalmor::MetaObj::MetaObject>& structure,
                      const std::string& field);
int64_t IntField(const std::shared_ptr<Kalmor::MetaObj::MetaObject>& structure,
                 const std::string& field);
bool BoolField(const std::shared_ptr<Kalmor::MetaObj::MetaObject>& structure,
               const std::string& field);
// The field names of a structure, in order.
std::vector<std::string> FieldNames(const std::shared_ptr<Kalmor::MetaObj::MetaObject>& structure);
// The elements of a list root object; fails the test when the root is not a list.
std::vector<std::shared_ptr<Kalmor::MetaObj::MetaObject>> ListElements(
    const std::shared_ptr<Kalmor::MetaObj::MetaObject>& list);

}  // namespace MeskTest
