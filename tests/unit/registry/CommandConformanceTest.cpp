// Every registered command, checked against the metadata table of the tree and against the
// rules that all commands share: complete help, well-formed parameters, a result shape that
// matches the formatter.
#include <gtest/gtest.h>

#include <cctype>
#include <map>
#include <memory>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include "autocli/AutoCli.h"

extern "C" void AutoCli_RegisterNamespaces(std::shared_ptr<Kalmor::AutoCli::NamespaceNode>* root);

namespace {

using Kalmor::AutoCli::CommandSpec;
using Kalmor::AutoCli::Namespace;
using Kalmor::AutoCli::NamespaceNode;
using Kalmor::AutoCli::NodeType;
using Kalmor::MetaObj::MetaType;
using Parameters = std::vector<std::pair<std::string, std::string>>;

struct Metadata {
    std::string path;
    std::string description;
    std::string type;
    std::string formatter;
    Parameters outputParameters;
};

const std::string kStorageFields =
    "Device,Display Name,Is SSD,MESK UUID,MESK Disk Group UUID,MESK Disk Group Name,Used by "
    "this host,In KOVRA,On-disk format version,Deduplication,Compression,Checksum,Checksum "
    "OK,Is Capacity Tier,Encryption,DiskKeyLoaded";
const std::string kNetworkFields =
    "ZuvNic Name,IP Protocol,Interface UUID,Agent Group Multicast Address,Agent Group IPv6 "
    "Multicast Address,Agent Group Multicast Port,Master Group Multicast Address,Master Group "
    "IPv6 Multicast Address,Master Group Multicast Port,Host Unicast Channel Bound "
    "Port,Multicast TTL,Traffic Type";
const std::string kClusterFields =
    "Enabled,Current Local Time,Local Node UUID,Local Node Type,Local Node State,Local Node "
    "Health State,Sub-Cluster Master UUID,Sub-Cluster Backup UUID,Sub-Cluster UUID,Sub-Cluster "
    "Membership Entry Revision,Sub-Cluster Member Count,Sub-Cluster Member UUIDs,Sub-Cluster "
    "Membership UUID,Unicast Mode Enabled,Maintenance Mode State,Config Generation,";

const std::vector<Metadata>& Table() {
    static const std::vector<Metadata> table = {
        {"mesk policy getdefault",
         "Get default Mesk storage policy values.",
         "fetcher",
         "table",
         {{"fields:Policy", "Policy Class,Policy Value"}}},
        {"mesk policy setdefault", "Set default Mesk storage policy values.", "operation", "", {}},
        {"mesk policy cleardefault",
         "Clear default Mesk storage policy values.",
         "operation",
         "",
         {}},
        {"mesk datastore name get", "Get Mesk datastore name.", "fetcher", "simple", {}},
        {"mesk datastore name set",
         "Configure Mesk datastore name. In general, Rename should always be done at cluster "
         "level. Across a Mesk cluster Mesk datastore name should be in sync.",
         "operation",
         "",
         {}},
        {"mesk storage add", "Add physical disk for Mesk usage.", "operation", "", {}},
        {"mesk storage remove",
         "Remove physical disks from Mesk disk groups.",
         "operation",
         "",
         {}},
        {"mesk storage list",
         "List Mesk storage configuration.",
         "fetcher",
         "simple",
         {{"header:MeskStorageList", "%Device%"}, {"fields:MeskStorageList", kStorageFields}}},
        {"mesk storage automode get",
         " Get status of storage auto claim mode.",
         "fetcher",
         "simple",
         {}},
        {"mesk storage automode set", "Configure storage auto claim mode", "operation", "", {}},
        {"mesk storage diskgroup mount", "Mount a Mesk disk or disk group.", "operation", "", {}},
        {"mesk storage diskgroup unmount", "Unmount Mesk disk or disk group.", "operation", "", {}},
        {"mesk storage tag add", "Add a Mesk storage tag.", "operation", "", {}},
        {"mesk storage tag remove", "Remove a Mesk storage tag.", "operation", "", {}},
        {"mesk network remove",
         "Remove an interface from the Mesk network configuration.",
         "operation",
         "",
         {}},
        {"mesk network restore",
         "Restore the persisted Mesk network configuration.",
         "operation",
         "",
         {}},
        {"mesk network clear", "Clear the Mesk network configuration.", "operation", "", {}},
        {"mesk network list",
         "List the network configuration currently in use by Mesk.",
         "fetcher",
         "simple",
         {{"header:MeskNetworkList", "Interface"}, {"fields:MeskNetworkList", kNetworkFields}}},
        {"mesk network ip add",
         "Add an IP interface to the Mesk network configuration.",
         "operation",
         "",
         {}},
        {"mesk network ip remove",
         "Remove an IP interface from the Mesk network configuration.",
         "operation",
         "",
         {}},
        {"mesk network ip set",
         "Reconfigure an IP interface in the Mesk network configuration.",
         "operation",
         "",
         {}},
        {"mesk network ipv4 add",
         "Add an IP interface to the Mesk network configuration.",
         "operation",
         "",
         {}},
        {"mesk network ipv4 remove",
         "Remove an IP interface from the Mesk network configuration.",
         "operation",
         "",
         {}},
        {"mesk network ipv4 set",
         "Reconfigure an IP interface in the Mesk network configuration.",
         "operation",
         "",
         {}},
        {"mesk cluster join", "Join the host to a Mesk cluster.", "operation", "", {}},
        {"mesk cluster leave",
         "Leave the Mesk cluster the host is currently joined to.",
         "operation",
         "",
         {}},
        {"mesk cluster get",
         "Get information about the Mesk cluster that this host is joined to.",
         "fetcher",
         "simple",
         {{"header:MeskClusterGet", "Cluster Information"},
          {"fields:MeskClusterGet", kClusterFields}}},
        {"mesk cluster restore",
         "Restore the persisted Mesk cluster configuration.",
         "operation",
         "",
         {}},
        {"mesk cluster new",
         "Create a Mesk cluster with current host joined. A random sub-cluster UUID will be "
         "generated.",
         "operation",
         "",
         {}},
        {"mesk cluster unicastagent add",
         "Add a unicast agent to the Mesk cluster configuration.",
         "operation",
         "",
         {}},
        {"mesk cluster unicastagent remove",
         "Remove a unicast agent from the Mesk cluster configuration.",
         "operation",
         "",
         {}},
        {"mesk cluster unicastagent list",
         "List all unicast agents in the Mesk cluster configuration.",
         "operation",
         "table",
         {{"header:UnicastAgentList", "Unicast Agent"},
          {"fields:UnicastAgentList",
           "NodeUuid,IsWitness,Supports Unicast,IP Address,Port,Iface Name"}}},
        {"mesk cluster unicastagent clear",
         "Removes all unicast agents in the Mesk cluster configuration.",
         "operation",
         "",
         {}},
        {"mesk cluster preferredfaultdomain get",
         "Get the preferred fault domain for a stretched cluster.",
         "fetcher",
         "simple",
         {}},
        {"mesk cluster preferredfaultdomain set",
         "Set the preferred fault domain for a stretched cluster.",
         "operation",
         "",
         {}},
        {"mesk trace set",
         "Configure Mesk trace. Please note: This command is not thread safe.",
         "operation",
         "",
         {}},
        {"mesk trace get",
         "Get the Mesk tracing configuration.",
         "fetcher",
         "simple",
         {{"fields:MeskTraceGet",
           "MESK Traces Directory,Number Of Files To Rotate,Maximum Trace File Size,Log Urgent "
           "Traces To Syslog"},
          {"units:MeskTraceGet.Maximum Trace File Size", "MB"}}},
        {"mesk maintenancemode cancel",
         "Cancel an in-progress Mesk maintenance mode operation.",
         "operation",
         "",
         {}},
        {"mesk faultdomain set", "Set the fault domain for this host", "operation", "", {}},
        {"mesk faultdomain get",
         "Get the fault domain name for this host.",
         "fetcher",
         "simple",
         {}},
        {"mesk faultdomain reset", "Reset Host fault domain to default value", "operation", "", {}},
        {"mesk resync throttle set", "Configure Mesk resync throttling", "operation", "", {}},
        {"mesk resync throttle get",
         "Get information about Mesk resync throttling",
         "fetcher",
         "simple",
         {{"units:ResyncThrottle.Level", "Mbps"}}},
        {"mesk resync bandwidth get",
         "Get information about Mesk resync bandwidth",
         "fetcher",
         "simple",
         {{"units:ResyncBandwidth.Rate", "Mbps"}}},
    };
    return table;
}

std::vector<std::string> Words(const std::string& path) {
    std::vector<std::string> words;
    size_t start = 0;
    while (start <= path.size()) {
        size_t end = path.find(' ', start);
        if (end == std::string::npos) end = path.size();
        words.push_back(path.substr(start, end - start));
        start = end + 1;
    }
    return words;
}

class CommandConformance : public ::testing::Test {
  protected:
    void SetUp() override {
        root_ = Namespace::New();
        AutoCli_RegisterNamespaces(&root_);
    }
    std::shared_ptr<CommandSpec> Command(const std::string& path) {
        return std::dynamic_pointer_cast<CommandSpec>(root_->ResolveNode(Words(path)));
    }
    std::shared_ptr<NamespaceNode> root_;
};

TEST_F(CommandConformance, MetadataOfEveryCommand) {
    ASSERT_EQ(Table().size(), 44u);
    for (const auto& row : Table()) {
        auto command = Command(row.path);
        ASSERT_TRUE(command) << row.path;
        EXPECT_EQ(command->GetDescription(), row.description) << row.path;
        EXPECT_EQ(command->GetMetaDataField("type"), row.type) << row.path;
        EXPECT_EQ(command->GetMetaData().size(), 1u) << row.path;
        EXPECT_EQ(command->GetDefaultOutputFormatter(), row.formatter) << row.path;
        EXPECT_EQ(command->GetDefaultOutputParameters(), row.outputParameters) << row.path;
    }
}

TEST_F(CommandConformance, EveryParameterIsWellFormedAndExplained) {
    for (const auto& row : Table()) {
        auto command = Command(row.path);
        ASSERT_TRUE(command) << row.path;
        auto spec = command->GetInputSpec();
        ASSERT_TRUE(spec) << row.path << ": a command without parameters has an empty spec";
        std::set<std::string> names, shortNames;
        for (const auto& parameter : spec->GetParameters()) {
            const std::string where = row.path + " --" + parameter->GetName();
            EXPECT_TRUE(names.insert(parameter->GetName()).second) << where;
            for (char c : parameter->GetName()) {
                EXPECT_TRUE(std::islower(static_cast<unsigned char>(c)) || std::isdigit(c) ||
                            c == '-')
                    << where;
            }
            const std::string& shortName = parameter->GetShortName();
            if (!shortName.empty()) {
                EXPECT_EQ(shortName.size(), 1u) << where;
                EXPECT_TRUE(shortNames.insert(shortName).second) << where;
            }
            EXPECT_FALSE(parameter->GetDescription().empty()) << where;
            const bool hasEnum = parameter->GetDescription().find("%ENUM%") != std::string::npos;
            EXPECT_EQ(hasEnum, parameter->GetConstraint() != nullptr) << where;
        }
    }
}

TEST_F(CommandConformance, ResultShapeMatchesTheFormatter) {
    for (const auto& row : Table()) {
        auto command = Command(row.path);
        ASSERT_TRUE(command) << row.path;
        auto spec = command->GetOutputSpec();
        ASSERT_TRUE(spec && spec->GetRootObject()) << row.path;
        const bool isFlag = spec->GetRootObject()->GetType() == MetaType::META_BOOL;
        // Commands with a structured result choose a formatter; success flags do not.
        EXPECT_EQ(isFlag, row.formatter.empty()) << row.path;
        EXPECT_EQ(isFlag, row.type == "operation" && row.path != "mesk cluster unicastagent list")
            << row.path;
    }
}

TEST_F(CommandConformance, SpecificationsAreBuiltAfreshEachTime) {
    for (const auto& row : Table()) {
        auto command = Command(row.path);
        ASSERT_TRUE(command) << row.path;
        EXPECT_NE(command->GetInputSpec(), command->GetInputSpec()) << row.path;
        EXPECT_NE(command->GetOutputSpec()->GetRootObject(),
                  command->GetOutputSpec()->GetRootObject())
            << row.path;
    }
}

}  // namespace
