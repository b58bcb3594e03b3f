#include "Help.h"

#include <gtest/gtest.h>

#include "unit/framework/TestCommand.h"

namespace FrameworkTest {
namespace {

using Kalmor::AutoCli::Namespace;
using Kalmor::AutoCli::App::RenderCommandHelp;
using Kalmor::AutoCli::App::RenderNamespaceHelp;
using namespace Kalmor::CallSpec;

TEST(Help, NamespaceListsChildrenInRegistrationOrder) {
    auto root = Namespace::New();
    auto cluster = root->SubNamespace("mesk")->SubNamespace("cluster");
    cluster->SetDescription("Cluster commands");
    cluster->RegisterNamespaceNode(TestCommand::New("Join a cluster."), "join");
    cluster->SubNamespace("unicastagent")->SetDescription("Unicast agents.");
    cluster->RegisterNamespaceNode(TestCommand::New("Get cluster information."), "get");
    EXPECT_EQ(RenderNamespaceHelp(*cluster),
              "Usage: autocli [options] mesk cluster <namespace>... <command> [command options]\n"
              "\n"
              "Cluster commands\n"
              "\n"
              "Available namespaces and commands:\n"
              "  join          Join a cluster.\n"
              "  unicastagent  Unicast agents.\n"
              "  get           Get cluster information.\n");
}

TEST(Help, CommandShowsEveryParameterWithKindAndExpandedValues) {
    auto root = Namespace::New();
    auto agents = root->SubNamespace("mesk")->SubNamespace("unicastagent");
    auto add = TestCommand::New("Add a unicast agent.");
    auto bare = TestCommand::New("");
    agents->RegisterNamespaceNode(add, "add");
    agents->RegisterNamespaceNode(bare, "bare");
    auto& spec = *add->inputSpec_;
    spec.AddParameter(Param("addr", PARAM_STRING, "a", true, "IP address of the agent."));
    spec.AddParameter(Param("port", PARAM_INT, "p", false, "Port (%ENUM%).", Range(1, 65535)));
    spec.AddParameter(Param("offset", PARAM_INT, "o", false, "Offset, %ENUM%.", Range(-5, 5)));
    spec.AddParameter(Param("type", PARAM_STRING, "t", false, "One of %ENUM%; %ENUM% only.",
                            Enum({"witness", "node"})));
    spec.AddParameter(Param("supports-unicast", PARAM_BOOL, "", false, "Stays %ENUM%."));
    spec.AddParameter(Param("force", PARAM_FLAG, "f", false, ""));
    spec.AddParameter(Param("tag", PARAM_STRING_LIST, "T", true, ""));
    EXPECT_EQ(RenderCommandHelp(*add, spec),
              "Usage: autocli [options] mesk unicastagent add [command options]\n"
              "\n"
              "Add a unicast agent.\n"
              "\n"
              "Command options:\n"
              "  -a, --addr <text>                 IP address of the agent. (required)\n"
              "  -p, --port <integer>              Port (1-65535).\n"
              "  -o, --offset <integer>            Offset, -5 to 5.\n"
              "  -t, --type <text>                 One of witness, node; witness, node only.\n"
              "      --supports-unicast <boolean>  Stays %ENUM%.\n"
              "  -f, --force\n"
              "  -T, --tag <text>...               (required)\n");
    EXPECT_EQ(RenderCommandHelp(*bare, *bare->inputSpec_),
              "Usage: autocli [options] mesk unicastagent bare\n");
}

}  // namespace
}  // namespace FrameworkTest
