#include "commands/cluster/ClusterUnicastAgentList.h"

#include <cstdlib>
#include <string>
#include <vector>

#include "MeskConstants.h"
#include "commands/cluster/UnicastAgent.h"
#include "commands/common/OutputFields.h"
#include "hostctl/MeskCtlException.h"
#include "hostctl/MeskPlugin.h"
#include "hostctl/MeskUtil.h"

namespace OrvaneCli {
namespace MeskNamespace {

using HostCtl::Lib::Mesk::MeskCtlException;
using Kalmor::CallSpec::Input;
using Kalmor::CallSpec::InputSpec;
using Kalmor::CallSpec::Output;
using Kalmor::CallSpec::OutputSpec;
using Kalmor::MetaObj::META_BOOL;
using Kalmor::MetaObj::META_INT;
using Kalmor::MetaObj::META_STRING;
using Kalmor::MetaObj::MetaBool;
using Kalmor::MetaObj::MetaInt;
using Kalmor::MetaObj::MetaList;
using Kalmor::MetaObj::MetaString;
using Kalmor::MetaObj::MetaStruct;
using ZuvCtl::Mesk::MeskUtil;

namespace {

// An agent's fields, in the order shown; ExecuteInternal fills them by these names.
const OutputField kNodeUuid{"NodeUuid", META_STRING};
const OutputField kIsWitness{"IsWitness", META_INT};
const OutputField kSupportsUnicast{"Supports Unicast", META_BOOL};
const OutputField kIpAddress{"IP Address", META_STRING};
const OutputField kPort{"Port", META_INT};
const OutputField kIfaceName{"Iface Name", META_STRING};
const OutputField* const kFields[] = {&kNodeUuid,  &kIsWitness, &kSupportsUnicast,
                                      &kIpAddress, &kPort,      &kIfaceName};

// A number field as atoi reads it: leading blanks and digits only, so "yes" or "" is 0.
int AtoI(const std::string& text) {
    return std::atoi(text.c_str());
}

}  // namespace

std::shared_ptr<ClusterUnicastAgentList> ClusterUnicastAgentList::New() {
    return std::make_shared<ClusterUnicastAgentList>();
}

ClusterUnicastAgentList::ClusterUnicastAgentList() {
    SetDescription("List all unicast agents in the Mesk cluster configuration.");
    // Registered as an operation although it only reads.
    SetMetaDataField("type", "operation");
    SetDefaultOutputFormatter("table");
    SetDefaultOutputParameter("header:UnicastAgentList", "Unicast Agent");
    SetDefaultOutputParameter("fields:UnicastAgentList", JoinFieldNames(kFields));
}

ClusterUnicastAgentList::~ClusterUnicastAgentList() = default;

std::shared_ptr<InputSpec> ClusterUnicastAgentList::GetInputSpecInternal() {
    return InputSpec::New();
}

std::shared_ptr<OutputSpec> ClusterUnicastAgentList::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaList::New(Kalmor::MetaObj::META_STRUCT, GetOutputStructure()));
    return spec;
}

std::shared_ptr<MetaStruct> ClusterUnicastAgentList::GetOutputStructure() {
    auto structure = MetaStruct::New("UnicastAgentList");
    AddEmptyFields(*structure, kFields);
    return structure;
}

void ClusterUnicastAgentList::ExecuteInternal(std::shared_ptr<Input> /*input*/,
                                              std::shared_ptr<Output> output) {
    auto agents = MetaList::New(Kalmor::MetaObj::META_STRUCT, GetOutputStructure());

    // Failures of these first questions are not caught: they go to the framework.
    auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
    auto info = plugin->GetMeskInfo();
    if (!info->GetClusterConfig().enabled) {
        output->AddErrorMessage("Mesk isn't enabled on the host");
        return;
    }
    // A witness node has no agents to list: the refusal comes with an empty, complete table.
    if (MeskUtil::IsWitnessNode()) {
        output->AddErrorMessage(
            "Unable to list unicast agent, this host is a witness node which doesn't support "
            "listing unicast agent.");
        output->SetRootObject(agents);
        output->SetComplete();
        return;
    }

    try {
        std::vector<std::string> entries;
        info->GetUnicastAgents(entries);
        for (const std::string& entry : entries) {
            // One malformed entry refuses the whole list, even after good ones.
            const UnicastAgentEntry fields(entry);
            if (fields.Separators() < 1) {
                output->AddErrorMessage("Invalid unicastAgent entry for nodeuuid " + entry);
                return;
            }
            if (fields.Separators() < 2) {
                output->AddErrorMessage("Invalid unicastAgent entry for isWitness " + entry);
                return;
            }
            if (fields.Separators() < 3) {
                output->AddErrorMessage("Invalid unicastAgent entry for ucast support " + entry);
                return;
            }
            if (fields.Separators() < 4) {
                output->AddErrorMessage("Invalid unicastAgent entry for ip " + entry);
                return;
            }
            if (fields.Separators() < 5) {
                output->AddErrorMessage("Invalid unicastAgent entry for port " + entry);
                return;
            }

            auto agent = GetOutputStructure();
            agent->SetField(kNodeUuid.Text(),
                            MetaString::New(fields.Text(UnicastAgentEntry::kNodeUuid)),
                            MetaStruct::_docEmpty);
            agent->SetField(kIsWitness.Text(),
                            MetaInt::New(AtoI(fields.Text(UnicastAgentEntry::kIsWitness))),
                            MetaStruct::_docEmpty);
            agent->SetField(
                kSupportsUnicast.Text(),
                MetaBool::New(AtoI(fields.Text(UnicastAgentEntry::kSupportsUnicast)) != 0),
                MetaStruct::_docEmpty);
            // The address is shown as the library gave it, unchecked.
            agent->SetField(kIpAddress.Text(), MetaString::New(fields.Text(UnicastAgentEntry::kIp)),
                            MetaStruct::_docEmpty);
            agent->SetField(kPort.Text(), MetaInt::New(AtoI(fields.Text(UnicastAgentEntry::kPort))),
                            MetaStruct::_docEmpty);
            agent->SetField(kIfaceName.Text(),
                            MetaString::New(fields.Text(UnicastAgentEntry::kIfaceName)),
                            MetaStruct::_docEmpty);
            agents->Add(agent);
        }
    } catch (const MeskCtlException& e) {
        // The agents read so far are still shown, as a complete table.
        output->AddErrorMessage("Unable to list unicast agent: " + e.GetMessage());
    }

    output->SetRootObject(agents);
    output->SetComplete();
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
