#include "PluginLoader.h"

#include <unistd.h>

#include <gtest/gtest.h>

#include <cstdlib>
#include <fstream>
#include <stdexcept>

namespace FrameworkTest {
namespace {

using Kalmor::AutoCli::Namespace;
using Kalmor::AutoCli::NamespaceNode;
using Kalmor::AutoCli::App::LoadPlugin;
using Kalmor::AutoCli::App::LoadPlugins;
using Kalmor::AutoCli::App::PluginDirectories;
using Kalmor::AutoCli::App::PluginReport;
using Kalmor::AutoCli::App::RegisterPlugin;

std::string TestPluginDir() {
    const char* dir = std::getenv("MESK_TEST_PLUGIN_DIR");
    return dir ? dir : "";
}

std::string OtherPlugin() {
    return TestPluginDir() + "/libother_mesk_plugin.so";
}

// A loadable library without the entry point.
std::string NoEntryLibrary() {
    return TestPluginDir() + "/unusable/libno_entry_plugin.so";
}

class TempDir {
  public:
    TempDir() {
        char pattern[] = "/tmp/autocli-plugins.XXXXXX";
        path = mkdtemp(pattern);
    }
    ~TempDir() { std::system(("rm -rf '" + path + "'").c_str()); }
    void Copy(const std::string& from, const std::string& name) const {
        std::system(("cp '" + from + "' '" + path + "/" + name + "'").c_str());
    }
    void Write(const std::string& name, const std::string& text) const {
        std::ofstream(path + "/" + name) << text;
    }
    std::string path;
};

TEST(PluginLoader, RegistersIntoAFreshRootOrAnExistingMeskNamespace) {
    if (TestPluginDir().empty()) {
        GTEST_SKIP() << "MESK_TEST_PLUGIN_DIR is not set";
    }
    auto fresh = Namespace::New();
    PluginReport report;
    ASSERT_TRUE(LoadPlugin(OtherPlugin(), fresh, report))
        << (report.problems.empty() ? "" : report.problems.front());
    ASSERT_NE(fresh->ResolveNode({"mesk", "other", "hello"}), nullptr);
    EXPECT_EQ(fresh->GetNamespaceNode("mesk")->GetDescription(), "Other mesk");

    auto existing = Namespace::New();
    auto mesk = existing->SubNamespace("mesk");
    mesk->SetDescription("Orvane Mesk commands");
    mesk->SubNamespace("cluster");
    ASSERT_TRUE(LoadPlugin(OtherPlugin(), existing, report));
    EXPECT_EQ(existing->GetNamespaceNodeNames(), std::vector<std::string>{"mesk"});
    EXPECT_EQ(mesk->GetNamespaceNodeNames(), (std::vector<std::string>{"cluster", "other"}));
    EXPECT_EQ(mesk->GetDescription(), "Orvane Mesk commands");
    EXPECT_TRUE(report.problems.empty());
}

TEST(PluginLoader, ReportsAndSkipsBrokenLibrariesAndLoadsEachLibraryOnce) {
    if (TestPluginDir().empty()) {
        GTEST_SKIP() << "MESK_TEST_PLUGIN_DIR is not set";
    }
    TempDir dir;
    dir.Write("broken.so", "not a library\n");
    dir.Copy(NoEntryLibrary(), "no-entry.so");
    dir.Copy(OtherPlugin(), "other.so");
    dir.Write("readme.txt", "ignored\n");
    ASSERT_EQ(symlink((dir.path + "/other.so").c_str(), (dir.path + "/x-link.so").c_str()), 0);

    auto root = Namespace::New();
    PluginReport report;
    // Listed twice: the second listing finds every name already loaded.
    LoadPlugins({dir.path, "/nonexistent/plugins", dir.path}, root, report);

    EXPECT_EQ(report.loaded, std::vector<std::string>{dir.path + "/other.so"});
    ASSERT_EQ(report.problems.size(), 2u);
    EXPECT_EQ(report.problems[0].rfind("cannot load plug-in " + dir.path + "/broken.so: ", 0), 0u)
        << report.problems[0];
    EXPECT_EQ(report.problems[1], "plug-in " + dir.path +
                                      "/no-entry.so has no AutoCli_RegisterNamespaces entry "
                                      "point; skipped");
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
    const std::string defaults = "/build/plugins:/usr/lib/autocli/plugins";
    EXPECT_EQ(PluginDirectories(nullptr, defaults),
              (std::vector<std::string>{"/build/plugins", "/usr/lib/autocli/plugins"}));
    EXPECT_EQ(PluginDirectories("", defaults), PluginDirectories(nullptr, defaults));
    EXPECT_EQ(PluginDirectories("/a::/b:", defaults), (std::vector<std::string>{"/a", "/b"}));
}

}  // namespace
}  // namespace FrameworkTest
