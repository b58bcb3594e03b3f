#include "Help.h"

#include <gtest/gtest.h>

#include "unit/framework/TestCommand.h"

namespace FrameworkTest {
namespace {

using Kalmor::AutoCli::Namespace;
using Kalmor::AutoCli::App::ExpandEnum;
using Kalmor::AutoCli::App::RenderCommandHelp;
using Kalmor::AutoCli::App::RenderNamespaceHelp;
using namespace Kalmor::CallSpec;

struct Tree {
    std::shared_ptr<Namespace> root = Namespace::New();
    std::shared_ptr<Namespace> cluster = Namespace::New();
    std::shared_ptr<TestCommand> add = TestCommand::New("Add a unicast agent.");
};

Tree MakeTree() {
    Tree tree;
    auto mesk = Namespace::New();
    mesk->SetDescription("Orvane Mesk commands");
    tree.root->RegisterNamespaceNode(mesk, "mesk");
    tree.cluster->SetDescription("Commands for Mesk host cluster configuration");
    tree.cluster->RegisterNamespaceNode(TestCommand::New("Join the host to a Mesk cluster."),
                                        "join");
    auto agents = Namespace::New();
    agents->SetDescription("Commands for configuring unicast agents for Mesk.");
    agents->RegisterNamespaceNode(tree.add, "add");
    tree.cluster->RegisterNamespaceNode(agents, "unicastagent");
    tree.cluster->RegisterNamespaceNode(TestCommand::New("Get cluster information."), "get");
    mesk->RegisterNamespaceNode(tree.cluster, "cluster");

    auto& spec = *tree.add->inputSpec_;
    spec.AddParameter(Param("addr", PARAM_STRING, "a", true, "IP address of the agent."));
    auto port = Param("port", PARAM_INT, "p", false, "Port (%ENUM%).");
    port->SetConstraint(Range(1, 65535));
    spec.AddParameter(port);
    auto type = Param("type", PARAM_STRING, "t", false, "Type (One of %ENUM%).");
    type->SetConstraint(Enum({"witness", "node"}));
    spec.AddParameter(type);
    spec.AddParameter(Param("supports-unicast", PARAM_BOOL, "", false, "Unicast support."));
    spec.AddParameter(Param("force", PARAM_FLAG, "f", false, ""));
    spec.AddParameter(Param("tag", PARAM_STRING_LIST, "T", true, ""));
    return tree;
}

TEST(Help, NamespaceListsChildrenInRegistrationOrder) {
    Tree tree = MakeTree();
    EXPECT_EQ(RenderNamespaceHelp(*tree.cluster),
              "Usage: autocli [options] mesk cluster <namespace>... <command> [command options]\n"
              "\n"
              "Commands for Mesk host cluster configuration\n"
              "\n"
              "Available namespaces and commands:\n"
              "  join          Join the host to a Mesk cluster.\n"
              "  unicastagent  Commands for configuring unicast agents for Mesk.\n"
              "  get           Get cluster information.\n");
}

TEST(Help, RootAlsoListsTheGlobalOptions) {
    Tree tree = MakeTree();
    std::string help = RenderNamespaceHelp(*tree.root);
    EXPECT_EQ(help.substr(0, help.find("Options:")),
              "Usage: autocli [options] <namespace>... <command> [command options]\n"
              "\n"
              "Available namespaces and commands:\n"
              "  mesk  Orvane Mesk commands\n"
              "\n");
    for (const char* option :
         {"--formatter NAME", "--fields A,B", "--no-header", "--list-commands", "--debug",
          "-h, --help", "simple, table, json, json-pretty, xml, csv"}) {
        EXPECT_NE(help.find(option), std::string::npos) << option;
    }
}

TEST(Help, CommandShowsEveryParameterWithKindAndExpandedValues) {
    Tree tree = MakeTree();
    EXPECT_EQ(RenderCommandHelp(*tree.add, *tree.add->inputSpec_),
              "Usage: autocli [options] mesk cluster unicastagent add [command options]\n"
              "\n"
              "Add a unicast agent.\n"
              "\n"
              "Command options:\n"
              "  -a, --addr <text>                 IP address of the agent. (required)\n"
              "  -p, --port <integer>              Port (1-65535).\n"
              "  -t, --type <text>                 Type (One of witness, node).\n"
              "      --supports-unicast <boolean>  Unicast support.\n"
              "  -f, --force\n"
              "  -T, --tag <text>...               (required)\n");

    auto bare = TestCommand::New("");
    tree.cluster->RegisterNamespaceNode(bare, "bare");
    EXPECT_EQ(RenderCommandHelp(*bare, *bare->inputSpec_),
              "Usage: autocli [options] mesk cluster bare\n");
}

TEST(Help, ExpandsEveryPlaceholderByConstraintKind) {
    struct Case {
        std::shared_ptr<ParameterConstraint> constraint;
        std::string description;
        std::string expected;
    };
    const std::vector<Case> cases = {
        {Enum({"witness", "node"}), "One of %ENUM%, default is witness",
         "One of witness, node, default is witness"},
        {Enum({"capacityFlash"}), "Supported tags are %ENUM%.",
         "Supported tags are capacityFlash."},
        {Range(0, 512), "Level in Mbps (%ENUM%, 0 means no throttling)",
         "Level in Mbps (0-512, 0 means no throttling)"},
        {Range(-5, 5), "%ENUM%", "-5 to 5"},
        {Enum({"a", "b"}), "%ENUM% or %ENUM%", "a, b or a, b"},
        {nullptr, "Stays %ENUM%", "Stays %ENUM%"},
        {Enum({"a"}), "No placeholder", "No placeholder"},
    };
    for (const auto& entry : cases) {
        auto parameter = Param("p", PARAM_STRING, "", false, entry.description);
        parameter->SetConstraint(entry.constraint);
        EXPECT_EQ(ExpandEnum(*parameter), entry.expected) << entry.description;
    }
}

}  // namespace
}  // namespace FrameworkTest
