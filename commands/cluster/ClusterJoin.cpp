#include "commands/cluster/ClusterJoin.h"

#include <cstddef>
#include <string>

#include "MeskConstants.h"
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
using Kalmor::CallSpec::ParameterSpec;
using Kalmor::MetaObj::MetaBool;
using ZuvCtl::Mesk::MeskUtil;

namespace {

// The longest preferred fault domain name, in UTF-8 characters.
const size_t kMaxPreferredFaultDomainChars = 256;

}  // namespace

std::shared_ptr<ClusterJoin> ClusterJoin::New() {
    return std::make_shared<ClusterJoin>();
}

ClusterJoin::ClusterJoin() {
    SetDescription("Join the host to a Mesk cluster.");
    SetMetaDataField("type", "operation");
}

ClusterJoin::~ClusterJoin() = default;

std::shared_ptr<InputSpec> ClusterJoin::GetInputSpecInternal() {
    auto spec = InputSpec::New();

    auto clusterUuid = ParameterSpec::New("cluster-uuid", Kalmor::CallSpec::PARAM_STRING);
    clusterUuid->SetShortName("u");
    clusterUuid->SetRequired(true);
    clusterUuid->SetDescription(
        "Mesk cluster UUID of the cluster instance which the host will join, or create, in the "
        "form \"nnnnnnnn-nnnn-nnnn-nnnn-nnnnnnnnnnnn\" where n are hexadecimal digits.");
    spec->AddParameter(clusterUuid);

    auto wait = ParameterSpec::New("wait", Kalmor::CallSpec::PARAM_FLAG);
    wait->SetShortName("w");
    wait->SetRequired(false);
    wait->SetDescription("Wait until the host joins the cluster.");
    spec->AddParameter(wait);

    auto witnessNode = ParameterSpec::New("witness-node", Kalmor::CallSpec::PARAM_FLAG);
    witnessNode->SetShortName("t");
    witnessNode->SetRequired(false);
    witnessNode->SetDescription(
        "Join the host as a witness node to the cluster. It is required to specify "
        "\"--witness-preferred-fault-domain\" when this parameter is set.");
    spec->AddParameter(witnessNode);

    auto preferredFaultDomain =
        ParameterSpec::New("witness-preferred-fault-domain", Kalmor::CallSpec::PARAM_STRING);
    preferredFaultDomain->SetShortName("p");
    preferredFaultDomain->SetRequired(false);
    preferredFaultDomain->SetDescription(
        "Specify the fault domain that witness node prefers to respond in case of network "
        "partition. It should be either of the two fault domains for existing data sites. This "
        "parameter is useful only when \"--witness-node\" is set.");
    spec->AddParameter(preferredFaultDomain);

    return spec;
}

std::shared_ptr<OutputSpec> ClusterJoin::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaBool::New());
    return spec;
}

void ClusterJoin::ExecuteInternal(std::shared_ptr<Input> input, std::shared_ptr<Output> output) {
    const std::string clusterUuid = input->GetParameter("cluster-uuid");
    const bool witnessNode = input->IsFlagSet("witness-node");
    const std::string preferredFaultDomain = input->GetParameter("witness-preferred-fault-domain");
    const bool wait = input->IsFlagSet("wait");

    try {
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();

        // An enabled host is refused before its options are looked at: whatever was asked,
        // the host has to leave its cluster first.
        if (info->GetClusterConfig().enabled) {
            output->AddErrorMessage(
                "The host is in a Mesk cluster and enabled for Mesk. You need to remove it from "
                "the cluster or disable Mesk.");
            return;
        }

        if (witnessNode) {
            if (!input->HasParameter("witness-preferred-fault-domain")) {
                output->AddErrorMessage(
                    "If --witness-node is specified, --witness-preferred-fault-domain must also "
                    "be specified.");
                return;
            }
            if (preferredFaultDomain.empty() ||
                MeskUtil::UTF8StringCharLength(preferredFaultDomain) >
                    kMaxPreferredFaultDomainChars) {
                output->AddErrorMessage("Preferred fault domain name cannot be empty or exceed " +
                                        std::to_string(kMaxPreferredFaultDomainChars) +
                                        " characters.");
                return;
            }
        } else if (input->HasParameter("witness-preferred-fault-domain")) {
            output->AddErrorMessage(
                "--witness-preferred-fault-domain is valid only when --witness-node is "
                "specified.");
            return;
        }

        // The UUID's form is the library's to check: a malformed text fails the conversion
        // like any other library failure. Waiting for the join is the library's too.
        const HostCtl::Mesk::Uuid uuid = MeskUtil::StringToMeskUuid(clusterUuid);
        info->JoinCluster(uuid, witnessNode, preferredFaultDomain, wait, 0);
        output->SetRootObject(MetaBool::New(true));
        output->SetComplete();
    } catch (const MeskCtlException& e) {
        // A failed join reports the library's message as it is, with a false result.
        output->AddErrorMessage(e.GetMessage());
        output->SetRootObject(MetaBool::New(false));
        output->SetComplete();
    }
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
