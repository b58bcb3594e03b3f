// A second plug-in for tests: `mesk other hello`, with one parameter of every kind, an
// enumeration and an integer range, so that the framework's parser, help and formatters can
// be driven end to end without the real plug-in.
//
// The command greets --name and returns the "OtherHello" structure. Two names change what it
// does: "fail" adds an error message (the result is still set, the output not completed), and
// "throw" throws std::runtime_error out of the command. With OTHER_PLUGIN_THROW set, the
// command's specs and the listing of `mesk other` throw too, as a broken plug-in's tree would.
#include <cstdlib>
#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

#include "autocli/AutoCli.h"

namespace {

using Kalmor::AutoCli::Command;
using Kalmor::AutoCli::Namespace;
using Kalmor::AutoCli::NamespaceNode;
using Kalmor::AutoCli::NodeType;
using Kalmor::CallSpec::Input;
using Kalmor::CallSpec::InputSpec;
using Kalmor::CallSpec::Output;
using Kalmor::CallSpec::OutputSpec;
using Kalmor::CallSpec::ParameterConstraint;
using Kalmor::CallSpec::ParameterSpec;
using Kalmor::MetaObj::MetaBool;
using Kalmor::MetaObj::MetaInt;
using Kalmor::MetaObj::MetaList;
using Kalmor::MetaObj::MetaString;
using Kalmor::MetaObj::MetaStruct;

void ThrowIfAsked(const char* what) {
    if (std::getenv("OTHER_PLUGIN_THROW")) throw std::runtime_error(std::string("broken ") + what);
}

class OtherNamespace : public Namespace {
  public:
    std::vector<std::shared_ptr<NamespaceNode>> GetNamespaceNodes() const override {
        ThrowIfAsked("namespace");
        return Namespace::GetNamespaceNodes();
    }
};

class OtherHello : public virtual Command {
  public:
    OtherHello() {
        SetDescription("Greet someone from the second plug-in.");
        SetMetaDataField("type", "fetcher");
        SetDefaultOutputFormatter("simple");
        SetDefaultOutputParameter("header:OtherHello", "%Greeting%");
        SetDefaultOutputParameter("fields:OtherHello", "Greeting,Items,Count,");
        SetDefaultOutputParameter("units:OtherHello.Count", "times");
    }

    std::shared_ptr<InputSpec> GetInputSpecInternal() override {
        ThrowIfAsked("spec");
        auto spec = InputSpec::New();
        auto add = [&spec](const char* name, Kalmor::CallSpec::ParameterType type,
                           const char* shortName, const char* description) {
            auto parameter = ParameterSpec::New(name, type);
            parameter->SetShortName(shortName);
            parameter->SetRequired(false);
            parameter->SetDescription(description);
            spec->AddParameter(parameter);
            return parameter;
        };
        add("name", Kalmor::CallSpec::PARAM_STRING, "n", "Who to greet.")->SetRequired(true);
        auto range = ParameterConstraint::New(Kalmor::CallSpec::CONSTRAINT_INT_RANGE);
        range->SetIntRange(0, 512);
        add("count", Kalmor::CallSpec::PARAM_INT, "c", "How many times to greet (%ENUM%).")
            ->SetConstraint(range);
        add("loud", Kalmor::CallSpec::PARAM_BOOL, "l", "Shout the greeting.");
        add("wave", Kalmor::CallSpec::PARAM_FLAG, "w", "Wave as well.");
        add("item", Kalmor::CallSpec::PARAM_STRING_LIST, "i",
            "An item to hand over; repeat for several.");
        auto roles = ParameterConstraint::New(Kalmor::CallSpec::CONSTRAINT_STRING_ENUM);
        roles->AddStringEnum("witness", "");
        roles->AddStringEnum("node", "");
        add("role", Kalmor::CallSpec::PARAM_STRING, "r",
            "Role of the greeted node (One of %ENUM%, default is witness).")
            ->SetConstraint(roles);
        return spec;
    }

    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override {
        auto spec = OutputSpec::New();
        spec->SetRootObject(GetOutputStructure());
        return spec;
    }

    std::shared_ptr<MetaStruct> GetOutputStructure() {
        auto structure = MetaStruct::New("OtherHello");
        structure->SetField("Greeting", MetaString::New(), MetaStruct::_docEmpty);
        structure->SetField("Count", MetaInt::New(), MetaStruct::_docEmpty);
        structure->SetField("Items", MetaList::New(Kalmor::MetaObj::META_STRING),
                            MetaStruct::_docEmpty);
        structure->SetField("Ok", MetaBool::New(), MetaStruct::_docEmpty);
        return structure;
    }

    void ExecuteInternal(std::shared_ptr<Input> input, std::shared_ptr<Output> output) override {
        const std::string name = input->GetParameter("name");
        if (name == "throw") throw std::runtime_error("hello refused to greet 'throw'");
        std::string greeting = "Hello, " + name;
        if (input->GetParameterBool("loud")) greeting += "!";
        if (input->IsFlagSet("wave")) greeting += " (waving)";
        if (input->HasParameter("role")) greeting += " the " + input->GetParameter("role");
        std::vector<std::string> values;
        input->GetParameterList("item", values);
        auto items = MetaList::New(Kalmor::MetaObj::META_STRING);
        for (const auto& value : values) items->Add(value);

        auto result = GetOutputStructure();
        result->SetField("Greeting", MetaString::New(greeting), MetaStruct::_docEmpty);
        result->SetField(
            "Count",
            MetaInt::New(input->HasParameter("count") ? input->GetParameterInt("count") : 1),
            MetaStruct::_docEmpty);
        result->SetField("Items", items, MetaStruct::_docEmpty);
        result->SetField("Ok", MetaBool::New(name != "fail"), MetaStruct::_docEmpty);
        output->SetRootObject(result);
        if (name == "fail") {
            output->AddErrorMessage("Unable to greet fail: refused by the test plug-in");
            return;
        }
        output->SetComplete();
    }
};

}  // namespace

AUTOCLI_PLUGIN_ENTRY void AutoCli_RegisterNamespaces(std::shared_ptr<NamespaceNode>* root) {
    std::shared_ptr<NamespaceNode> mesk = (*root)->GetNamespaceNode("mesk");
    if (!mesk) {
        mesk = Namespace::New();
        mesk->SetDescription("Other mesk");
        (*root)->RegisterNamespaceNode(mesk, "mesk");
    } else if (mesk->GetType() != NodeType::Namespace) {
        throw std::logic_error("'mesk' on the root is not a namespace");
    }
    auto other = std::make_shared<OtherNamespace>();
    other->SetDescription("Commands of the second test plug-in");
    other->RegisterNamespaceNode(std::make_shared<OtherHello>(), "hello");
    mesk->RegisterNamespaceNode(other, "other");
}
