// A second plug-in for tests: `mesk other hello`, which greets --name, so that the framework's
// loading, versions and help can be driven end to end beside the real plug-in. With
// OTHER_PLUGIN_THROW set, the command's parameter declaration and the listing of `mesk other`
// throw, as a broken plug-in's tree would.
#include <cstdlib>
#include <memory>
#include <stdexcept>
#include <string>

#include "autocli/AutoCli.h"

namespace {

using namespace Kalmor::AutoCli;
using namespace Kalmor::CallSpec;
using namespace Kalmor::MetaObj;

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
    }

    std::shared_ptr<InputSpec> GetInputSpecInternal() override {
        ThrowIfAsked("parameters");
        auto spec = InputSpec::New();
        auto name = ParameterSpec::New("name", PARAM_STRING);
        name->SetShortName("n");
        name->SetDescription("Who to greet.");
        name->SetRequired(true);
        spec->AddParameter(name);
        auto count = ParameterSpec::New("count", PARAM_INT);
        count->SetShortName("c");
        count->SetRequired(false);
        count->SetDescription("How many times to greet (%ENUM%).");
        auto range = ParameterConstraint::New(CONSTRAINT_INT_RANGE);
        range->SetIntRange(0, 512);
        count->SetConstraint(range);
        spec->AddParameter(count);
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
        return structure;
    }

    void ExecuteInternal(std::shared_ptr<Input> input, std::shared_ptr<Output> output) override {
        auto result = GetOutputStructure();
        result->SetField("Greeting", MetaString::New("Hello, " + input->GetParameter("name")),
                         MetaStruct::_docEmpty);
        output->SetRootObject(result);
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
