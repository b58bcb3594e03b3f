#include "commands/cluster/ClusterNew.h"

#include <cstdlib>
#include <cstring>
#include <string>

#include "MeskConstants.h"
#include "hostctl/HostUuid.h"
#include "hostctl/MeskCtlException.h"
#include "hostctl/MeskPlugin.h"

namespace OrvaneCli {
namespace MeskNamespace {

using HostCtl::Lib::Mesk::MeskCtlException;
using Kalmor::CallSpec::Input;
using Kalmor::CallSpec::InputSpec;
using Kalmor::CallSpec::Output;
using Kalmor::CallSpec::OutputSpec;
using Kalmor::MetaObj::MetaBool;

namespace {

// A new random cluster UUID in the text form the cluster service takes, or the empty text
// when none could be made or packed.
std::string GenerateClusterUuid() {
    std::unique_ptr<char, decltype(&std::free)> text(UUID_CreateRandom(), &std::free);
    if (text == nullptr) return std::string();
    if (UUID_PackText(text.get(), text.get(), std::strlen(text.get())) == nullptr) {
        return std::string();
    }
    return std::string(text.get());
}

}  // namespace

std::shared_ptr<ClusterNew> ClusterNew::New() {
    return std::make_shared<ClusterNew>();
}

ClusterNew::ClusterNew() {
    SetDescription(
        "Create a Mesk cluster with current host joined. A random sub-cluster UUID will be "
        "generated.");
    SetMetaDataField("type", "operation");
}

ClusterNew::~ClusterNew() = default;

std::shared_ptr<InputSpec> ClusterNew::GetInputSpecInternal() {
    return InputSpec::New();
}

std::shared_ptr<OutputSpec> ClusterNew::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaBool::New());
    return spec;
}

void ClusterNew::ExecuteInternal(std::shared_ptr<Input> /*input*/, std::shared_ptr<Output> output) {
    try {
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();

        if (info->GetClusterConfig().enabled) {
            output->AddErrorMessage(
                "The host is in a Mesk cluster and enabled for Mesk. You need to remove it from "
                "the cluster or disable Mesk.");
            return;
        }

        const std::string clusterUuid = GenerateClusterUuid();
        if (clusterUuid.empty()) {
            output->AddErrorMessage("Unable to generate a UUID");
            return;
        }

        info->CreateCluster(clusterUuid, true, false);
        output->SetRootObject(MetaBool::New(true));
        output->SetComplete();
    } catch (const MeskCtlException& e) {
        // Unlike join, a failed creation says what it was doing, with a false result.
        output->AddErrorMessage("Unable to create the new Mesk cluster: " + e.GetMessage());
        output->SetRootObject(MetaBool::New(false));
        output->SetComplete();
    }
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
