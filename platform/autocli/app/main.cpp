// autocli: loads the plug-ins, runs one command line and prints what it gave.
#include <csignal>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "CommandLine.h"
#include "Output.h"
#include "PluginLoader.h"
#include "Text.h"

namespace {

// Where plug-ins are looked for when AUTOCLI_PLUGIN_PATH is unset: the plug-in directory
// relative to this executable, wherever its tree lies, and no other.
std::string DefaultPluginPath() {
    const std::string beside = Kalmor::AutoCli::App::ExecutableDirectory();
    return beside.empty() ? std::string() : beside + "/" + AUTOCLI_PLUGIN_DIR_FROM_EXECUTABLE;
}

// Holds objects until the process ends, without destroying them: they stay reachable, so
// leak checkers do not count them.
void KeepUntilExit(std::shared_ptr<const void> object) {
    static auto* kept = new std::vector<std::shared_ptr<const void>>();
    kept->push_back(std::move(object));
}

}  // namespace

int main(int argc, char** argv) {
    // An ignored SIGCHLD inherited from whoever started us would make the scripts we run
    // vanish before their exit status is read.
    signal(SIGCHLD, SIG_DFL);
    using namespace Kalmor::AutoCli;

    std::shared_ptr<NamespaceNode> root = Namespace::New();
    App::PluginReport report;
    const std::vector<std::string> directories =
        App::PluginDirectories(std::getenv("AUTOCLI_PLUGIN_PATH"), DefaultPluginPath());
    App::LoadPlugins(directories, root, report);
    // A completion request runs on every key press: a broken plug-in must not scribble over
    // the command line being typed.
    const bool completing = argc > 1 && std::strcmp(argv[1], App::kCompleteWord) == 0;
    std::string problems;
    for (const auto& problem : report.problems) {
        problems += "autocli: " + problem + "\n";
    }
    // The completion scripts need no plug-in: they are printed at build time without any.
    const bool scriptOnly = argc > 1 && std::strcmp(argv[1], "completion") == 0;
    if (report.loaded.empty() && !scriptOnly) {
        const std::string searched = App::Join(directories, ", ");
        problems += "autocli: no plug-in was found in " +
                    (searched.empty() ? std::string("any directory") : searched) +
                    " (AUTOCLI_PLUGIN_PATH, directories separated by colons, changes where)\n";
    }
    if (!completing) {
        Output::Err(problems);
    }

    if (argc == 2 && std::strcmp(argv[1], "--version") == 0) {
        std::string text = std::string("autocli ") + AUTOCLI_VERSION + "\n";
        for (const auto& path : report.loaded) {
            std::string version = App::PluginVersion(path);
            text +=
                "plug-in " + (version.empty() ? "without a version" : version) + ": " + path + "\n";
        }
        Output::Out(text);
        return Output::Finish("autocli", 0);
    }

    App::RunResult result =
        App::Run(std::vector<std::string>(argv + 1, argv + argc), root, Output::Out);
    // The tree and the result stay until the process ends: freeing them object by object
    // would take longer than printing a large result.
    KeepUntilExit(std::move(root));
    KeepUntilExit(std::move(result.result));
    Output::Out(result.out);
    Output::Err(result.err);
    return Output::Finish("autocli", result.status);
}
