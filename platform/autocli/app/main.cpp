// autocli: loads the plug-ins, runs one command line and prints what it gave.
#include <unistd.h>

#include <cstdlib>
#include <string>
#include <vector>

#include "CommandLine.h"
#include "PluginLoader.h"

namespace {

void WriteAll(int fd, const std::string& text) {
    size_t written = 0;
    while (written < text.size()) {
        ssize_t n = write(fd, text.data() + written, text.size() - written);
        if (n <= 0) {
            return;
        }
        written += static_cast<size_t>(n);
    }
}

}  // namespace

int main(int argc, char** argv) {
    using namespace Kalmor::AutoCli;

    std::shared_ptr<NamespaceNode> root = Namespace::New();
    App::PluginReport report;
    App::LoadPlugins(
        App::PluginDirectories(std::getenv("AUTOCLI_PLUGIN_PATH"), AUTOCLI_DEFAULT_PLUGIN_PATH),
        root, report);
    std::string problems;
    for (const auto& problem : report.problems) {
        problems += "autocli: " + problem + "\n";
    }
    WriteAll(STDERR_FILENO, problems);

    App::RunResult result = App::Run(std::vector<std::string>(argv + 1, argv + argc), root);
    WriteAll(STDOUT_FILENO, result.out);
    WriteAll(STDERR_FILENO, result.err);
    return result.status;
}
