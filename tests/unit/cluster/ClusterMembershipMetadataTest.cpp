#include <memory>
#include <string>
#include <vector>

#include "MockHost.h"
#include "commands/cluster/ClusterGet.h"
#include "commands/cluster/ClusterJoin.h"
#include "commands/cluster/ClusterLeave.h"
#include "commands/cluster/ClusterNew.h"
#include "commands/cluster/ClusterPreferredFaultDomainGet.h"
#include "commands/cluster/ClusterPreferredFaultDomainSet.h"
#include "commands/cluster/ClusterRestore.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using Kalmor::MetaObj::MetaBool;
using Kalmor::MetaObj::MetaStruct;

// What a command declares, one line per fact: description, metadata fields, formatter, default
// output parameters, parameters ("name/short kind required: help") and the result's shape.
std::vector<std::string> Declared(Kalmor::AutoCli::Command& command) {
    std::vector<std::string> lines = {command.GetDescription()};
    for (const auto& [key, value] : command.GetMetaData()) lines.push_back(key + "=" + value);
    lines.push_back("formatter=" + command.GetDefaultOutputFormatter());
    for (const auto& [key, value] : command.GetDefaultOutputParameters()) {
        lines.push_back(key + "=" + value);
    }
    const auto inputSpec = command.GetInputSpecInternal();
    for (const auto& p : inputSpec->GetParameters()) {
        lines.push_back(p->GetName() + "/" + p->GetShortName() + " " +
                        std::to_string(p->GetType()) + (p->IsRequired() ? " required" : "") +
                        (p->GetConstraint() ? " constrained" : "") + ": " + p->GetDescription());
    }
    auto root = command.GetOutputSpecInternal()->GetRootObject();
    auto flag = std::dynamic_pointer_cast<MetaBool>(root);
    auto structure = std::dynamic_pointer_cast<MetaStruct>(root);
    lines.push_back(flag && !flag->HasValue() ? "result=bool"
                    : structure               ? "result=" + structure->GetName()
                                              : "result=?");
    return lines;
}

TEST(ClusterMembershipMetadata, DescribesCommandsParametersAndResultsExactly) {
    const std::vector<
        std::pair<std::shared_ptr<Kalmor::AutoCli::Command>, std::vector<std::string>>>
        table = {
            {ClusterGet::New(),
             {"Get information about the Mesk cluster that this host is joined to.", "type=fetcher",
              "formatter=simple", "header:MeskClusterGet=Cluster Information",
              "fields:MeskClusterGet=Enabled,Current Local Time,Local Node UUID,Local Node Type,"
              "Local Node State,Local Node Health State,Sub-Cluster Master UUID,Sub-Cluster "
              "Backup UUID,Sub-Cluster UUID,Sub-Cluster Membership Entry Revision,Sub-Cluster "
              "Member Count,Sub-Cluster Member UUIDs,Sub-Cluster Membership UUID,Unicast Mode "
              "Enabled,Maintenance Mode State,Config Generation,",
              "result=MeskClusterGet"}},
            {ClusterJoin::New(),
             {"Join the host to a Mesk cluster.", "type=operation", "formatter=",
              "cluster-uuid/u 0 required: Mesk cluster UUID of the cluster instance which the "
              "host will join, or create, in the form \"nnnnnnnn-nnnn-nnnn-nnnn-nnnnnnnnnnnn\" "
              "where n are hexadecimal digits.",
              "wait/w 3: Wait until the host joins the cluster.",
              "witness-node/t 3: Join the host as a witness node to the cluster. It is required "
              "to specify \"--witness-preferred-fault-domain\" when this parameter is set.",
              "witness-preferred-fault-domain/p 0: Specify the fault domain that witness node "
              "prefers to respond in case of network partition. It should be either of the two "
              "fault domains for existing data sites. This parameter is useful only when "
              "\"--witness-node\" is set.",
              "result=bool"}},
            {ClusterNew::New(),
             {"Create a Mesk cluster with current host joined. A random sub-cluster UUID will "
              "be generated.",
              "type=operation", "formatter=", "result=bool"}},
            {ClusterLeave::New(),
             {"Leave the Mesk cluster the host is currently joined to.", "type=operation",
              "formatter=", "result=bool"}},
            {ClusterRestore::New(),
             {"Restore the persisted Mesk cluster configuration.", "type=operation",
              "formatter=", "boot/ 3: Set when restoring the cluster during boot (internal only!)",
              "result=bool"}},
            {ClusterPreferredFaultDomainGet::New(),
             {"Get the preferred fault domain for a stretched cluster.", "type=fetcher",
              "formatter=simple", "result=PreferredFaultDomain"}},
            {ClusterPreferredFaultDomainSet::New(),
             {"Set the preferred fault domain for a stretched cluster.", "type=operation",
              "formatter=",
              "preferred-fault-domain-name/n 0 required: Preferred Fault domain name to use for "
              "a stretched cluster.",
              "result=bool"}},
        };
    for (const auto& [command, expected] : table) EXPECT_EQ(Declared(*command), expected);
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
