#include "commands/policy/PolicySetDefault.h"

#include <string>

#include "MeskConstants.h"
#include "hostctl/MeskCtlException.h"
#include "hostctl/MeskPlugin.h"

namespace OrvaneCli {
namespace MeskNamespace {

using HostCtl::Lib::Mesk::MeskCtlException;
using Kalmor::CallSpec::Input;
using Kalmor::CallSpec::InputSpec;
using Kalmor::CallSpec::Output;
using Kalmor::CallSpec::OutputSpec;
using Kalmor::CallSpec::ParameterConstraint;
using Kalmor::CallSpec::ParameterSpec;
using Kalmor::MetaObj::MetaBool;

namespace {

// The policy class names the user may give, each allowed value described by itself.
std::shared_ptr<ParameterConstraint> PolicyClassConstraint() {
    auto constraint = ParameterConstraint::New(Kalmor::CallSpec::CONSTRAINT_STRING_ENUM);
    for (const char* name : {"cluster", "vdisk", "vmnamespace", "vmswap", "vmem"}) {
        constraint->AddStringEnum(name, name);
    }
    return constraint;
}

// The help text of `policy`: one sentence, then the options of the service's policy string,
// one numbered option per line, each followed by its default value.
const char* const kPolicyHelp =
    "Mesk policy to set as default, in the form of a string."
    " Options are: \n"
    "1)cacheReservation - Flash capacity reserved as read cache for the storage "
    "object. The reservation is a share of the object's logical size in parts per "
    "million: 1000000 reserves flash equal to its full logical size, 0 reserves no "
    "flash. Reserved read cache is unavailable to other objects, so it should be "
    "used only to address read performance issues. Maximum value: 1000000.\n"
    "Default value: 0.\n"
    "2)forceProvisioning - If this option is \"1\", the object will be provisioned "
    "even if the policy requested in the storage policy cannot be satisfied with "
    "the resources currently available in the cluster. Mesk then tries to bring "
    "the object into compliance if and when resources become available. If it is "
    "\"0\", provisioning fails when the policy cannot be satisfied.\n"
    "Default value: 0.\n"
    "3)hostFailuresToTolerate - Number of host, disk or network failures a storage "
    "object can tolerate. When the fault tolerance method is mirroring, to "
    "tolerate n failures, n+1 copies of the object are created and 2n+1 hosts (or "
    "fault domains) contributing storage are required. When the fault tolerance "
    "method is erasure coding, to tolerate 1 failure, 4 hosts (or fault domains) "
    "are required, and to tolerate 2 failures, 6 hosts (or fault domains) are "
    "required. Maximum value: 3.\n"
    "Note: A host which is not part of a fault domain is counted as its own "
    "single-host fault domain.\n"
    "Default value: 1.\n"
    "4)stripeWidth - The number of HDDs across which each replica of a storage "
    "object is striped. A value higher than 1 may result in better performance, "
    "but also in higher use of system resources. Striping spreads the reads and "
    "writes of each replica over more disks. Maximum value: 12.\n"
    "Default value: 1.\n"
    "5)proportionalCapacity - Percentage of the logical size of the storage object "
    "that will be reserved (thick provisioned) upon VM provisioning, given as a "
    "whole number from 0 to 100. The rest of the storage object is thin "
    "provisioned and takes capacity only as it is written. Maximum value: 100%.\n"
    "Default value: 0%.\n"
    "6)iopsLimit - Defines the upper IOPS limit for a disk, in IO operations per "
    "second. IO above that rate is delayed so that the disk stays within the "
    "limit. A value of zero means that there is no limit and IO is never delayed.\n"
    "Default value: 0.\n"
    "7)replicaPreference - Defines the failure tolerance method: RAID-1 "
    "(mirroring), which gives better performance, or RAID-5/6 (erasure coding), "
    "which gives better space efficiency. RAID-5/6 is available only on all-flash "
    "clusters and when the number of failures to tolerate is 1 or 2: 1 failure "
    "means RAID-5 and 2 failures mean RAID-6. Any other number of failures to "
    "tolerate requires RAID-1.\n"
    "Default value: RAID-1.\n";

}  // namespace

std::shared_ptr<PolicySetDefault> PolicySetDefault::New() {
    return std::make_shared<PolicySetDefault>();
}

PolicySetDefault::PolicySetDefault() {
    SetDescription("Set default Mesk storage policy values.");
    SetMetaDataField("type", "operation");
}

PolicySetDefault::~PolicySetDefault() = default;

std::shared_ptr<InputSpec> PolicySetDefault::GetInputSpecInternal() {
    auto spec = InputSpec::New();

    auto policyClass = ParameterSpec::New("policy-class", Kalmor::CallSpec::PARAM_STRING);
    policyClass->SetShortName("c");
    policyClass->SetRequired(true);
    policyClass->SetDescription(
        "Mesk policy class whose default value to set. Options are: %ENUM%.");
    policyClass->SetConstraint(PolicyClassConstraint());
    spec->AddParameter(policyClass);

    auto policy = ParameterSpec::New("policy", Kalmor::CallSpec::PARAM_STRING);
    policy->SetShortName("p");
    policy->SetRequired(true);
    policy->SetDescription(kPolicyHelp);
    spec->AddParameter(policy);

    return spec;
}

std::shared_ptr<OutputSpec> PolicySetDefault::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaBool::New());
    return spec;
}

void PolicySetDefault::ExecuteInternal(std::shared_ptr<Input> input,
                                       std::shared_ptr<Output> output) {
    // The class name goes to the library as the user gave it (the framework has matched it
    // against the allowed names); the policy string is the service's to parse.
    const std::string policyClass = input->GetParameter("policy-class");
    const std::string policy = input->GetParameter("policy");
    try {
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();
        info->SetDefaultPolicy(policyClass, policy);
        output->SetRootObject(MetaBool::New(true));
        output->SetComplete();
    } catch (const MeskCtlException& e) {
        // The bare library text, then a false result that is still complete.
        output->AddErrorMessage(e.GetMessage());
        output->SetRootObject(MetaBool::New(false));
        output->SetComplete();
    }
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
