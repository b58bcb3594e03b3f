#include "PluginLoader.h"

#include <unistd.h>

#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <stdexcept>

namespace FrameworkTest {
namespace {

using Kalmor::AutoCli::Namespace;
using Kalmor::AutoCli::NamespaceNode;
using Kalmor::AutoCli::App::LoadPlugins;
using Kalmor::AutoCli::App::PluginDirectories;
using Kalmor::AutoCli::App::PluginReport;
using Kalmor::AutoCli::App::RegisterPlugin;

TEST(PluginLoader, ReportsAndSkipsBrokenLibrariesAndLoadsEachLibraryOnce) {
    const char* plugins = std::getenv("MESK_TEST_PLUGIN_DIR");
    if (!plugins) GTEST_SKIP() << "MESK_TEST_PLUGIN_DIR is not set";
    namespace fs = std::filesystem;
    char pattern[] = "/tmp/autocli-plugins.XXXXXX";
    const std::string dir = mkdtemp(pattern);
    std::ofstream(dir + "/broken.so") << "not a library\n";
    std::ofstream(dir + "/readme.txt") << "ignored\n";
    // A loadable library without the entry point, a usable one and a link to it.
    fs::copy_file(std::string(plugins) + "/unusable/libno_entry_plugin.so", dir + "/no-entry.so");
    fs::copy_file(std::string(plugins) + "/libother_mesk_plugin.so", dir + "/other.so");
    fs::create_symlink(dir + "/other.so", dir + "/x-link.so");

    auto root = Namespace::New();
    PluginReport report;
    // Listed twice: the second listing finds every name already loaded.
    LoadPlugins({dir, "/nonexistent/plugins", dir}, root, report);
    fs::remove_all(dir);

    EXPECT_EQ(report.loaded, std::vector<std::string>{dir + "/other.so"});
    ASSERT_EQ(report.problems.size(), 2u);
    EXPECT_EQ(report.problems[0].rfind("cannot load plug-in " + dir + "/broken.so: ", 0), 0u)
        << report.problems[0];
    EXPECT_EQ(
        report.problems[1],
        "plug-in " + dir + "/no-entry.so has no AutoCli_RegisterNamespaces entry point; skipped");
    EXPECT_NE(root->ResolveNode({"mesk", "other", "hello"}), nullptr);
}

void RegisterThenThrow(std::shared_ptr<NamespaceNode>* root) {
    (*root)->SubNamespace("early");
    throw std::runtime_error("half way");
}

TEST(PluginLoader, ExceptionFromEntryPointIsReportedAndEarlierRegistrationsStay) {
    auto root = Namespace::New();
    PluginReport report;
    EXPECT_FALSE(RegisterPlugin(&RegisterThenThrow, "/plugins/bad.so", root, report));
    EXPECT_EQ(report.problems,
              std::vector<std::string>{
                  "plug-in /plugins/bad.so failed to register its commands: half way"});
    EXPECT_TRUE(root->HasNamespaceNode("early"));
    EXPECT_TRUE(report.loaded.empty());
}

TEST(PluginLoader, EnvironmentOverridesTheDefaultDirectories) {
    const std::vector<std::string> defaults = {"/build/plugins", "/usr/lib/autocli/plugins"};
    EXPECT_EQ(PluginDirectories(nullptr, defaults[0] + ":" + defaults[1]), defaults);
    EXPECT_EQ(PluginDirectories("", defaults[0] + ":" + defaults[1]), defaults);
    EXPECT_EQ(PluginDirectories("/a::/b:", "/c"), (std::vector<std::string>{"/a", "/b"}));
}

}  // namespace
}  // namespace FrameworkTest
