// The parameters of the unicast agent commands. Their descriptions, types
// and output parameters are checked with every other command's by the registry's tests.
#include <memory>
#include <string>
#include <vector>

#include "MockHost.h"
#include "commands/cluster/ClusterUnicastAgentAdd.h"
#include "commands/cluster/ClusterUnicastAgentClear.h"
#include "commands/cluster/ClusterUnicastAgentList.h"
#include "commands/cluster/ClusterUnicastAgentRemove.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

// A parameter as "--name -s kind required|optional [enum values] help".
std::string Describe(const Kalmor::CallSpec::ParameterSpec& p) {
    static const char* const kinds[] = {"text", "int", "bool", "flag", "list"};
    std::string text = "--" + p.GetName() + " -" + p.GetShortName() + " " + kinds[p.GetType()] +
                       (p.IsRequired() ? " required " : " optional ");
    if (const auto& constraint = p.GetConstraint()) {
        text += constraint->GetType() == Kalmor::CallSpec::CONSTRAINT_STRING_ENUM ? "[" : "[?";
        for (const auto& value : constraint->GetStringEnum()) {
            text += value.value + (value.description.empty() ? "," : "=" + value.description + ",");
        }
        text += "] ";
    }
    return text + p.GetDescription();
}

std::vector<std::string> Parameters(Kalmor::AutoCli::Command& command) {
    std::vector<std::string> described;
    const auto spec = command.GetInputSpecInternal();
    for (const auto& p : spec->GetParameters()) {
        described.push_back(Describe(*p));
    }
    return described;
}

TEST(UnicastAgentMetadata, ParametersAreDeclaredInOrderWithTheirHelp) {
    const std::string addr = "--addr -a text required IP address of the unicast agent.";
    const std::string port = "--port -p int optional Port the unicast agent is listening on.";
    EXPECT_THAT(
        Parameters(*ClusterUnicastAgentAdd::New()),
        ElementsAre(
            "--type -t text optional [witness,node,] Type of the unicast agent (One of %ENUM%, "
            "default is witness).",
            "--uuid -u text optional UUID of the unicast agent (required for -t node).",
            "--supports-unicast -U bool optional Whether the software version supports unicast "
            "(required for -t node)",
            addr, port,
            "--bound-interface-name -i text optional Name of the bound outgoing network "
            "interface."));
    EXPECT_THAT(Parameters(*ClusterUnicastAgentRemove::New()),
                ElementsAre("--uuid -u text optional UUID of the unicast agent.", addr, port));
    EXPECT_THAT(Parameters(*ClusterUnicastAgentList::New()), IsEmpty());
    EXPECT_THAT(Parameters(*ClusterUnicastAgentClear::New()), IsEmpty());
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
