#include "commands/policy/PolicyGetDefault.h"

#include <string>
#include <vector>

#include "MeskConstants.h"
#include "commands/common/OutputFields.h"
#include "hostctl/MeskCtlException.h"
#include "hostctl/MeskPlugin.h"
#include "hostctl/MeskUtil.h"

namespace OrvaneCli {
namespace MeskNamespace {

using HostCtl::Lib::Mesk::MeskCtlException;
using HostCtl::Mesk::MeskPolicyClass;
using Kalmor::CallSpec::Input;
using Kalmor::CallSpec::InputSpec;
using Kalmor::CallSpec::Output;
using Kalmor::CallSpec::OutputSpec;
using Kalmor::CallSpec::ParameterConstraint;
using Kalmor::CallSpec::ParameterSpec;
using Kalmor::MetaObj::META_STRING;
using Kalmor::MetaObj::MetaList;
using Kalmor::MetaObj::MetaString;
using Kalmor::MetaObj::MetaStruct;
using ZuvCtl::Mesk::MeskUtil;

namespace {

// A row's fields, in the order shown; ExecuteInternal fills them by these names.
const OutputField kPolicyClass{"Policy Class", META_STRING};
const OutputField kPolicyValue{"Policy Value", META_STRING};
const OutputField* const kFields[] = {&kPolicyClass, &kPolicyValue};

// The policy class names the user may give, each allowed value described by itself.
std::shared_ptr<ParameterConstraint> PolicyClassConstraint() {
    auto constraint = ParameterConstraint::New(Kalmor::CallSpec::CONSTRAINT_STRING_ENUM);
    for (const char* name : {"cluster", "vdisk", "vmnamespace", "vmswap", "vmem"}) {
        constraint->AddStringEnum(name, name);
    }
    return constraint;
}

}  // namespace

std::shared_ptr<PolicyGetDefault> PolicyGetDefault::New() {
    return std::make_shared<PolicyGetDefault>();
}

PolicyGetDefault::PolicyGetDefault() {
    SetDescription("Get default Mesk storage policy values.");
    SetMetaDataField("type", "fetcher");
    SetDefaultOutputFormatter("table");
    SetDefaultOutputParameter("fields:Policy", JoinFieldNames(kFields));
}

PolicyGetDefault::~PolicyGetDefault() = default;

std::shared_ptr<InputSpec> PolicyGetDefault::GetInputSpecInternal() {
    auto spec = InputSpec::New();

    auto policyClass = ParameterSpec::New("policy-class", Kalmor::CallSpec::PARAM_STRING);
    policyClass->SetShortName("c");
    policyClass->SetRequired(false);
    policyClass->SetDescription(
        "Mesk policy class whose default value to get. If not provided, defaults for all "
        "classes will be retrieved. Options are: %ENUM%.");
    policyClass->SetConstraint(PolicyClassConstraint());
    spec->AddParameter(policyClass);

    return spec;
}

std::shared_ptr<OutputSpec> PolicyGetDefault::GetOutputSpecInternal() {
    auto spec = OutputSpec::New();
    spec->SetRootObject(MetaList::New(Kalmor::MetaObj::META_STRUCT, GetOutputStructure()));
    return spec;
}

std::shared_ptr<MetaStruct> PolicyGetDefault::GetOutputStructure() {
    auto structure = MetaStruct::New("Policy");
    AddEmptyFields(*structure, kFields);
    return structure;
}

void PolicyGetDefault::ExecuteInternal(std::shared_ptr<Input> input,
                                       std::shared_ptr<Output> output) {
    // An empty class name, given or not, asks for every class.
    std::string className;
    if (input->HasParameter("policy-class")) {
        className = input->GetParameter("policy-class");
    }
    try {
        auto plugin = HostCtl::MeskPluginFactory::GetMeskPlugin();
        auto info = plugin->GetMeskInfo();
        auto result = MetaList::New(Kalmor::MetaObj::META_STRUCT, GetOutputStructure());

        std::vector<MeskPolicyClass> classes;
        if (!className.empty()) {
            classes.push_back(MeskUtil::StringToMeskPolicyClass(className));
        } else {
            classes = MeskUtil::GetMeskPolicyClasses();
        }

        for (const MeskPolicyClass policyClass : classes) {
            // The row shows the library's name of the class, also when the user named it.
            const std::string name = MeskUtil::MeskPolicyClassToString(policyClass);
            try {
                const std::string value = info->GetDefaultPolicy(name);
                auto row = GetOutputStructure();
                row->SetField(kPolicyClass.Text(), MetaString::New(name), MetaStruct::_docEmpty);
                row->SetField(kPolicyValue.Text(), MetaString::New(value), MetaStruct::_docEmpty);
                result->Add(row);
            } catch (const MeskCtlException&) {
                // A class whose default cannot be read is left out of the table without a
                // message; the other classes are still reported.
            }
        }

        output->SetRootObject(result);
        output->SetComplete();
    } catch (const MeskCtlException& e) {
        output->AddErrorMessage(e.GetMessage());
    }
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
