// The `mesk` namespace tree: every namespace and command of the plug-in, in registration order.
//
// Adding a command takes, in this order:
//   1. its class, commands/<area>/<Class>.h and .cpp, shaped like its neighbours (the area's
//      sources are picked up by CMake; a new area is added to MESK_COMMAND_AREAS in the root
//      CMakeLists.txt); a result's fields are declared once, as the OutputField constants and
//      kFields array of its source (commands/common/OutputFields.h), which feed the "fields:"
//      output parameter, the structure and the rows (the test double fails a unit test whose
//      result strays from that declaration);
//   2. any host-control operation it needs that does not exist yet: its declaration in
//      frame/hostctl/, its row in platform/hostctl/Operations.h (which declares it for the
//      simulated host and the test double), the simulated host's answer in the file of its
//      area, and its name in docs/hostsim.md's list of operations;
//   3. its header included and one AddCommand line below, at its place in the tree;
//   4. docs/commands.md regenerated with scripts/gen-docs (tests/e2e/test_reference.sh fails
//      while it is stale);
//   5. unit tests in tests/unit/<area>/<Area>Test.cpp, through the test double: the success
//      path, each refusal and failure with its exact message, the result and completion after
//      a failure;
//   6. a case in tests/e2e/test_<area>.sh that runs it against the simulated host.
// The rules every command follows (tests/unit/registry/RegistryTest.cpp), the bad-input suite
// (tests/e2e/test_bad_input.sh) and the output formats test (tests/e2e/test_output_formats.sh)
// walk the registered tree and need no edit.

#include <memory>
#include <stdexcept>
#include <string>

#include "autocli/AutoCli.h"
#include "commands/cluster/ClusterGet.h"
#include "commands/cluster/ClusterJoin.h"
#include "commands/cluster/ClusterLeave.h"
#include "commands/cluster/ClusterNew.h"
#include "commands/cluster/ClusterPreferredFaultDomainGet.h"
#include "commands/cluster/ClusterPreferredFaultDomainSet.h"
#include "commands/cluster/ClusterRestore.h"
#include "commands/cluster/ClusterUnicastAgentAdd.h"
#include "commands/cluster/ClusterUnicastAgentClear.h"
#include "commands/cluster/ClusterUnicastAgentList.h"
#include "commands/cluster/ClusterUnicastAgentRemove.h"
#include "commands/datastore/DatastoreNameGet.h"
#include "commands/datastore/DatastoreNameSet.h"
#include "commands/faultdomain/FaultDomainGet.h"
#include "commands/faultdomain/FaultDomainReset.h"
#include "commands/faultdomain/FaultDomainSet.h"
#include "commands/maintenancemode/MaintenanceModeCancel.h"
#include "commands/network/NetworkClear.h"
#include "commands/network/NetworkIpAdd.h"
#include "commands/network/NetworkIpRemove.h"
#include "commands/network/NetworkIpSet.h"
#include "commands/network/NetworkList.h"
#include "commands/network/NetworkRemove.h"
#include "commands/network/NetworkRestore.h"
#include "commands/policy/PolicyClearDefault.h"
#include "commands/policy/PolicyGetDefault.h"
#include "commands/policy/PolicySetDefault.h"
#include "commands/resync/ResyncBandwidthGet.h"
#include "commands/resync/ResyncThrottleGet.h"
#include "commands/resync/ResyncThrottleSet.h"
#include "commands/storage/StorageAdd.h"
#include "commands/storage/StorageAutoModeGet.h"
#include "commands/storage/StorageAutoModeSet.h"
#include "commands/storage/StorageDiskgroupMount.h"
#include "commands/storage/StorageDiskgroupUmount.h"
#include "commands/storage/StorageList.h"
#include "commands/storage/StorageRemove.h"
#include "commands/storage/StorageTagAdd.h"
#include "commands/storage/StorageTagRemove.h"
#include "commands/trace/MeskTraceGet.h"
#include "commands/trace/MeskTraceSet.h"

using Kalmor::AutoCli::Namespace;
using Kalmor::AutoCli::NamespaceNode;

namespace {

using namespace OrvaneCli::MeskNamespace;

std::shared_ptr<Namespace> MakeNamespace(const std::string& description) {
    std::shared_ptr<Namespace> node = Namespace::New();
    node->SetDescription(description);
    return node;
}

// Makes a new object of the command class and registers it under `name`.
template <class CommandClass>
void AddCommand(Namespace& parent, const std::string& name) {
    std::shared_ptr<NamespaceNode> node = CommandClass::New();
    parent.RegisterNamespaceNode(node, name);
}

// The `mesk` namespace of the root: the existing one (another plug-in may have made it), or a
// new one registered at once.
std::shared_ptr<Namespace> FindOrMakeMesk(NamespaceNode& root) {
    if (root.HasNamespaceNode("mesk")) {
        auto mesk = std::dynamic_pointer_cast<Namespace>(root.GetNamespaceNode("mesk"));
        if (!mesk) {
            throw std::runtime_error(
                "cannot register the mesk commands: the name \"mesk\" is already taken by a "
                "node that is not a namespace");
        }
        return mesk;
    }
    std::shared_ptr<Namespace> mesk = Namespace::New();
    root.RegisterNamespaceNode(mesk, "mesk");
    return mesk;
}

// `ip` and its compatibility alias `ipv4` hold the same commands, each its own objects.
std::shared_ptr<Namespace> MakeIpNamespace(const std::string& description) {
    auto ip = MakeNamespace(description);
    AddCommand<NetworkIpAdd>(*ip, "add");
    AddCommand<NetworkIpRemove>(*ip, "remove");
    AddCommand<NetworkIpSet>(*ip, "set");
    return ip;
}

}  // namespace

// Each sub-namespace is registered on its parent only once all its children are in it.
AUTOCLI_PLUGIN_ENTRY void AutoCli_RegisterNamespaces(std::shared_ptr<NamespaceNode>* rootHandle) {
    NamespaceNode& root = *rootHandle->get();
    std::shared_ptr<Namespace> mesk = FindOrMakeMesk(root);
    mesk->SetDescription("Orvane Mesk commands");

    auto policy = MakeNamespace("Commands for Mesk storage policy configuration");
    AddCommand<PolicyGetDefault>(*policy, "getdefault");
    AddCommand<PolicySetDefault>(*policy, "setdefault");
    AddCommand<PolicyClearDefault>(*policy, "cleardefault");
    mesk->RegisterNamespaceNode(policy, "policy");

    auto datastore = MakeNamespace("Commands for Mesk datastore configuration");
    auto datastoreName = MakeNamespace("Commands for configuring Mesk datastore name.");
    AddCommand<DatastoreNameGet>(*datastoreName, "get");
    AddCommand<DatastoreNameSet>(*datastoreName, "set");
    datastore->RegisterNamespaceNode(datastoreName, "name");
    mesk->RegisterNamespaceNode(datastore, "datastore");

    auto storage = MakeNamespace("Commands for Mesk physical storage configuration");
    AddCommand<StorageAdd>(*storage, "add");
    AddCommand<StorageRemove>(*storage, "remove");
    AddCommand<StorageList>(*storage, "list");
    auto automode = MakeNamespace("Commands for configuring Mesk storage auto claim mode.");
    AddCommand<StorageAutoModeGet>(*automode, "get");
    AddCommand<StorageAutoModeSet>(*automode, "set");
    storage->RegisterNamespaceNode(automode, "automode");
    auto diskgroup = MakeNamespace("Commands for configuring Mesk diskgroups");
    AddCommand<StorageDiskgroupMount>(*diskgroup, "mount");
    AddCommand<StorageDiskgroupUmount>(*diskgroup, "unmount");
    storage->RegisterNamespaceNode(diskgroup, "diskgroup");
    auto tag = MakeNamespace("Commands to add/remove tags for Mesk storage");
    AddCommand<StorageTagAdd>(*tag, "add");
    AddCommand<StorageTagRemove>(*tag, "remove");
    storage->RegisterNamespaceNode(tag, "tag");
    mesk->RegisterNamespaceNode(storage, "storage");

    auto network = MakeNamespace("Commands for Mesk host network configuration");
    AddCommand<NetworkRemove>(*network, "remove");
    AddCommand<NetworkRestore>(*network, "restore");
    AddCommand<NetworkClear>(*network, "clear");
    AddCommand<NetworkList>(*network, "list");
    network->RegisterNamespaceNode(MakeIpNamespace("Commands for configuring IP network for Mesk."),
                                   "ip");
    network->RegisterNamespaceNode(MakeIpNamespace("Compatibility alias for \"ip\""), "ipv4");
    mesk->RegisterNamespaceNode(network, "network");

    auto cluster = MakeNamespace("Commands for Mesk host cluster configuration");
    AddCommand<ClusterJoin>(*cluster, "join");
    AddCommand<ClusterLeave>(*cluster, "leave");
    AddCommand<ClusterGet>(*cluster, "get");
    AddCommand<ClusterRestore>(*cluster, "restore");
    AddCommand<ClusterNew>(*cluster, "new");
    auto unicastagent = MakeNamespace("Commands for configuring unicast agents for Mesk.");
    AddCommand<ClusterUnicastAgentAdd>(*unicastagent, "add");
    AddCommand<ClusterUnicastAgentRemove>(*unicastagent, "remove");
    AddCommand<ClusterUnicastAgentList>(*unicastagent, "list");
    AddCommand<ClusterUnicastAgentClear>(*unicastagent, "clear");
    cluster->RegisterNamespaceNode(unicastagent, "unicastagent");
    auto preferredfaultdomain =
        MakeNamespace("Commands for configuring a preferred fault domain for Mesk.");
    AddCommand<ClusterPreferredFaultDomainGet>(*preferredfaultdomain, "get");
    AddCommand<ClusterPreferredFaultDomainSet>(*preferredfaultdomain, "set");
    cluster->RegisterNamespaceNode(preferredfaultdomain, "preferredfaultdomain");
    mesk->RegisterNamespaceNode(cluster, "cluster");

    auto trace = MakeNamespace("Commands for Mesk trace configuration");
    AddCommand<MeskTraceSet>(*trace, "set");
    AddCommand<MeskTraceGet>(*trace, "get");
    mesk->RegisterNamespaceNode(trace, "trace");

    auto maintenancemode = MakeNamespace("Commands for Mesk maintenance mode operation");
    AddCommand<MaintenanceModeCancel>(*maintenancemode, "cancel");
    mesk->RegisterNamespaceNode(maintenancemode, "maintenancemode");

    auto faultdomain = MakeNamespace("Commands for Mesk fault domain configuration");
    AddCommand<FaultDomainSet>(*faultdomain, "set");
    AddCommand<FaultDomainGet>(*faultdomain, "get");
    AddCommand<FaultDomainReset>(*faultdomain, "reset");
    mesk->RegisterNamespaceNode(faultdomain, "faultdomain");

    auto resync = MakeNamespace("Commands for Mesk resync configuration");
    auto throttle = MakeNamespace("Commands for Mesk resync throttling");
    AddCommand<ResyncThrottleSet>(*throttle, "set");
    AddCommand<ResyncThrottleGet>(*throttle, "get");
    resync->RegisterNamespaceNode(throttle, "throttle");
    auto bandwidth = MakeNamespace("Commands for Mesk resync bandwidth");
    AddCommand<ResyncBandwidthGet>(*bandwidth, "get");
    resync->RegisterNamespaceNode(bandwidth, "bandwidth");
    mesk->RegisterNamespaceNode(resync, "resync");
}
