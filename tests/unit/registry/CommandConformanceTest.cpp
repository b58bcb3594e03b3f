// The rules that every registered command follows: complete help, well-formed parameters, a
// result shape that matches its formatter. What each command declares is pinned by the
// checked-in command reference.
#include <gtest/gtest.h>

#include <cctype>
#include <set>

#include "unit/registry/RegisteredTree.h"

namespace RegistryTest {
namespace {

using Kalmor::AutoCli::CommandSpec;
using Kalmor::MetaObj::MetaType;

TEST(CommandConformance, EveryCommandIsExplainedAndShapedForItsFormatter) {
    auto root = RegisteredRoot();
    for (const auto& [path, node] : Commands(root)) {
        auto command = std::dynamic_pointer_cast<CommandSpec>(node);
        ASSERT_TRUE(command) << path;
        const std::string type = command->GetMetaDataField("type");
        EXPECT_FALSE(command->GetDescription().empty()) << path;
        EXPECT_TRUE(type == "fetcher" || type == "operation") << path;
        EXPECT_EQ(command->GetMetaData().size(), 1u) << path;

        auto output = command->GetOutputSpec();
        ASSERT_TRUE(output && output->GetRootObject()) << path;
        // Commands with a structured result choose a formatter; success flags do not. Only
        // the unicast agent list is an operation with a structured result.
        const bool isFlag = output->GetRootObject()->GetType() == MetaType::META_BOOL;
        EXPECT_EQ(isFlag, command->GetDefaultOutputFormatter().empty()) << path;
        EXPECT_EQ(isFlag, type == "operation" && path != "mesk cluster unicastagent list") << path;

        // Each call builds its declarations afresh, so that no caller can change another's.
        EXPECT_NE(command->GetInputSpec(), command->GetInputSpec()) << path;
        EXPECT_NE(output->GetRootObject(), command->GetOutputSpec()->GetRootObject()) << path;
    }
}

TEST(CommandConformance, EveryParameterIsWellFormedAndExplained) {
    auto root = RegisteredRoot();
    for (const auto& [path, node] : Commands(root)) {
        auto spec = std::dynamic_pointer_cast<CommandSpec>(node)->GetInputSpec();
        ASSERT_TRUE(spec) << path << ": a command without parameters has an empty declaration";
        std::set<std::string> names, shortNames;
        for (const auto& parameter : spec->GetParameters()) {
            const std::string where = path + " --" + parameter->GetName();
            EXPECT_TRUE(names.insert(parameter->GetName()).second) << where;
            for (char c : parameter->GetName()) {
                EXPECT_TRUE(std::islower(static_cast<unsigned char>(c)) || std::isdigit(c) ||
                            c == '-')
                    << where;
            }
            const std::string& shortName = parameter->GetShortName();
            if (!shortName.empty()) {
                EXPECT_EQ(shortName.size(), 1u) << where;
                EXPECT_TRUE(shortNames.insert(shortName).second) << where;
            }
            EXPECT_FALSE(parameter->GetDescription().empty()) << where;
            const bool hasEnum = parameter->GetDescription().find("%ENUM%") != std::string::npos;
            EXPECT_EQ(hasEnum, parameter->GetConstraint() != nullptr) << where;
        }
    }
}

}  // namespace
}  // namespace RegistryTest
