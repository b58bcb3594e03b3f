#include "commands/network/NetworkList.h"

#include <boost/algorithm/string/join.hpp>
#include <string>
#include <vector>

#include "MeskConstants.h"
#include "commands/common/OutputFields.h"
#include "hostctl/MeskCtlException.h"
#include "hostctl/MeskInfo.h"
#include "hostctl/MeskPlugin.h"
#include "hostctl/MeskTypes.h"

namespace OrvaneCli {
namespace MeskNamespace {

using HostCtl::Lib::Mesk::MeskCtlException;
using HostCtl::Mesk::MeskInfo2;
using Kalmor::CallSpec::Input;
using Kalmor::CallSpec::InputSpec;
using Kalmor::CallSpec::Output;
using Kalmor::CallSpec::OutputSpec;
using Kalmor::MetaObj::META_INT;
using Kalmor::MetaObj::META_STRING;
using Kalmor::MetaObj::MetaInt;
using Kalmor::MetaObj::MetaList;
using Kalmor::MetaObj::MetaString;
using Kalmor::MetaObj::MetaStruct;

namespace {

// An interface's fields, in the order shown; ExecuteInternal fills them by these names.
const OutputField kZuvNicName{"ZuvNic Name", META_STRING};
const OutputField kIpProtocol{"IP Protocol", META_STRING};
const OutputField kInterfaceUuid{"Interface UUID", META_STRING};
const OutputField kAgentGroupAddress{"Agent Group Multicast Address", META_STRING};
const OutputField kAgentGroupV6Address{"Agent Group IPv6 Multicast Address", META_STRING};
const OutputField kAgentGroupPort{"Agent Group Multicast Port", META_INT};
const OutputField kMasterGroupAddress{"Master Group Multicast Address", META_STRING};
const OutputField kMasterGroupV6Address{"Master Group IPv6 Multicast Address", META_STRING};
const OutputField kMasterGroupPort{"Master Group Multicast Port", META_INT};
const OutputField kUnicastPort{"Host Unicast Channel Bound Port", META_INT};
const OutputField kMulticastTtl{"Multicast TTL", META_INT};
const OutputField kTrafficType{"Traffic Type", META_STRING};
const OutputField* const kFields[] = {
    &kZuvNicName,          &kIpProtocol,     &kInterfaceUuid,      &kAgentGroupAddress,
    &kAgentGroupV6Address, &kAgentGroupPort, &kMasterGroupAddress, &kMasterGroupV6Address,
    &kMasterGroupPort,     &kUnicastPort,    &kMulticastTtl,       &kTrafficType};

}  // namespace

std::shared_ptr<NetworkList> NetworkList::New() {
    return std::make_shared<NetworkList>();
}

NetworkList::NetworkList() {
    SetDescription("List the network configuration currently in use by Mesk.");
    SetMetaDataField("type", "fetcher");
    SetDefaultOutputFormatter("simple");
    SetDefaultOutputParameter("header:MeskNetworkList", "Interface");
    SetDefaultOutputParameter("fields:MeskNetworkList", JoinFieldNames(kFields));
}

NetworkList::~NetworkList() = default;

std::shared_ptr<InputSpec> NetworkList::GetInputSpecInternal() {
    return InputSpec::New();
}

std::shared_ptr<OutputSpec> NetworkList::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaList::New(Kalmor::MetaObj::META_STRUCT, GetOutputStructure()));
    return spec;
}

std::shared_ptr<MetaStruct> NetworkList::GetOutputStructure() {
    auto structure = MetaStruct::New("MeskNetworkList");
    AddEmptyFields(*structure, kFields);
    return structure;
}

void NetworkList::ExecuteInternal(std::shared_ptr<Input> /*input*/,
                                  std::shared_ptr<Output> output) {
    auto list = MetaList::New(Kalmor::MetaObj::META_STRUCT, GetOutputStructure());
    try {
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();
        auto* info2 = dynamic_cast<MeskInfo2*>(info.get());
        if (info2 == nullptr) {
            output->AddErrorMessage("Could not get MeskInfo2. Plugin version mismatch?");
            return;
        }
        auto configs = info2->GetZuvNicConfigs();
        for (const auto& config : configs) {
            auto entry = GetOutputStructure();
            entry->SetField(kZuvNicName.Text(), MetaString::New(config->GetZuvnicName()),
                            MetaStruct::_docEmpty);
            // Every interface is an IP interface, whichever kind its groups are.
            entry->SetField(kIpProtocol.Text(), MetaString::New("IP"), MetaStruct::_docEmpty);
            entry->SetField(kInterfaceUuid.Text(), MetaString::New(config->GetIfaceUuid()),
                            MetaStruct::_docEmpty);
            entry->SetField(kAgentGroupAddress.Text(),
                            MetaString::New(config->GetAgentMulticastGroup().GetStringAddress()),
                            MetaStruct::_docEmpty);
            entry->SetField(kAgentGroupV6Address.name,
                            MetaString::New(config->GetAgentV6MulticastGroup().GetStringAddress()),
                            MetaStruct::_docEmpty);
            entry->SetField(kAgentGroupPort.Text(), MetaInt::New(config->GetAgentMulticastPort()),
                            MetaStruct::_docEmpty);
            entry->SetField(kMasterGroupAddress.Text(),
                            MetaString::New(config->GetMasterMulticastGroup().GetStringAddress()),
                            MetaStruct::_docEmpty);
            entry->SetField(kMasterGroupV6Address.name,
                            MetaString::New(config->GetMasterV6MulticastGroup().GetStringAddress()),
                            MetaStruct::_docEmpty);
            entry->SetField(kMasterGroupPort.Text(), MetaInt::New(config->GetMasterMulticastPort()),
                            MetaStruct::_docEmpty);
            entry->SetField(kUnicastPort.Text(), MetaInt::New(config->GetHostUnicastPort()),
                            MetaStruct::_docEmpty);
            entry->SetField(kMulticastTtl.Text(), MetaInt::New(config->GetMulticastTTL()),
                            MetaStruct::_docEmpty);
            std::vector<std::string> types;
            config->GetTrafficTypes(types);
            entry->SetField(kTrafficType.Text(),
                            MetaString::New(boost::algorithm::join(types, ", ")),
                            MetaStruct::_docEmpty);
            list->Add(entry);
        }
    } catch (const MeskCtlException& e) {
        output->AddErrorMessage(e.GetMessage());
    }
    // After a library failure the entries completed so far are still the result, and the
    // output is still complete.
    output->SetRootObject(list);
    output->SetComplete();
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
