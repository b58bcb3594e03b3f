#include "commands/network/NetworkList.h"

#include <boost/algorithm/string/join.hpp>
#include <string>
#include <vector>

#include "MeskConstants.h"
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
using Kalmor::MetaObj::MetaInt;
using Kalmor::MetaObj::MetaList;
using Kalmor::MetaObj::MetaString;
using Kalmor::MetaObj::MetaStruct;

std::shared_ptr<NetworkList> NetworkList::New() {
    return std::make_shared<NetworkList>();
}

NetworkList::NetworkList() {
    SetDescription("List the network configuration currently in use by Mesk.");
    SetMetaDataField("type", "fetcher");
    SetDefaultOutputFormatter("simple");
    SetDefaultOutputParameter("header:MeskNetworkList", "Interface");
    SetDefaultOutputParameter(
        "fields:MeskNetworkList",
        "ZuvNic Name,IP Protocol,Interface UUID,Agent Group Multicast Address,Agent Group IPv6 "
        "Multicast Address,Agent Group Multicast Port,Master Group Multicast Address,Master "
        "Group IPv6 Multicast Address,Master Group Multicast Port,Host Unicast Channel Bound "
        "Port,Multicast TTL,Traffic Type");
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
    structure->SetField("ZuvNic Name", MetaString::New(), MetaStruct::_docEmpty);
    structure->SetField("IP Protocol", MetaString::New(), MetaStruct::_docEmpty);
    structure->SetField("Interface UUID", MetaString::New(), MetaStruct::_docEmpty);
    structure->SetField("Agent Group Multicast Address", MetaString::New(), MetaStruct::_docEmpty);
    structure->SetField("Agent Group IPv6 Multicast Address", MetaString::New(),
                        MetaStruct::_docEmpty);
    structure->SetField("Agent Group Multicast Port", MetaInt::New(), MetaStruct::_docEmpty);
    structure->SetField("Master Group Multicast Address", MetaString::New(), MetaStruct::_docEmpty);
    structure->SetField("Master Group IPv6 Multicast Address", MetaString::New(),
                        MetaStruct::_docEmpty);
    structure->SetField("Master Group Multicast Port", MetaInt::New(), MetaStruct::_docEmpty);
    structure->SetField("Host Unicast Channel Bound Port", MetaInt::New(), MetaStruct::_docEmpty);
    structure->SetField("Multicast TTL", MetaInt::New(), MetaStruct::_docEmpty);
    structure->SetField("Traffic Type", MetaString::New(), MetaStruct::_docEmpty);
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
            entry->SetField("ZuvNic Name", MetaString::New(config->GetZuvnicName()),
                            MetaStruct::_docEmpty);
            // Every interface is an IP interface, whichever kind its groups are.
            entry->SetField("IP Protocol", MetaString::New("IP"), MetaStruct::_docEmpty);
            entry->SetField("Interface UUID", MetaString::New(config->GetIfaceUuid()),
                            MetaStruct::_docEmpty);
            entry->SetField("Agent Group Multicast Address",
                            MetaString::New(config->GetAgentMulticastGroup().GetStringAddress()),
                            MetaStruct::_docEmpty);
            entry->SetField("Agent Group IPv6 Multicast Address",
                            MetaString::New(config->GetAgentV6MulticastGroup().GetStringAddress()),
                            MetaStruct::_docEmpty);
            entry->SetField("Agent Group Multicast Port",
                            MetaInt::New(config->GetAgentMulticastPort()), MetaStruct::_docEmpty);
            entry->SetField("Master Group Multicast Address",
                            MetaString::New(config->GetMasterMulticastGroup().GetStringAddress()),
                            MetaStruct::_docEmpty);
            entry->SetField("Master Group IPv6 Multicast Address",
                            MetaString::New(config->GetMasterV6MulticastGroup().GetStringAddress()),
                            MetaStruct::_docEmpty);
            entry->SetField("Master Group Multicast Port",
                            MetaInt::New(config->GetMasterMulticastPort()), MetaStruct::_docEmpty);
            entry->SetField("Host Unicast Channel Bound Port",
                            MetaInt::New(config->GetHostUnicastPort()), MetaStruct::_docEmpty);
            entry->SetField("Multicast TTL", MetaInt::New(config->GetMulticastTTL()),
                            MetaStruct::_docEmpty);
            std::vector<std::string> types;
            config->GetTrafficTypes(types);
            entry->SetField("Traffic Type", MetaString::New(boost::algorithm::join(types, ", ")),
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
