// One invocation of autocli: from the words of the command line to texts and an exit status.
#pragma once

#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "autocli/AutoCli.h"

namespace Kalmor {
namespace AutoCli {
namespace App {

// Exit statuses.
constexpr int kExitSuccess = 0;
constexpr int kExitCommandFailed = 1;  // the command reported errors, or threw
constexpr int kExitUsage = 2;          // autocli refused the command line; nothing ran

struct RunResult {
    int status = kExitSuccess;
    std::string out;  // help and results (what was not handed to Run's `print`)
    std::string err;  // errors, one per line
    // The command's result, for the caller to release when it likes: a process about to end
    // need not free it value by value.
    std::shared_ptr<const void> result;
};

// Runs `autocli [global options] <namespace>... <command> [options]` over the tree at `root`
// (the words exclude the program name): resolves the path, prints help or the command list,
// or parses and checks the options, runs the command and formats its result.
//
// A path that stops at a namespace prints that namespace's help: with --help that is the
// answer (status 0); without, the command is missing, so the help goes with an error and
// status 2, and a script that forgot a word does not take the help for a result.
//
// With `print`, a long result goes to it in pieces as it is formatted, before Run returns:
// an invocation printing a large listing then holds only a piece of its text at a time.
RunResult Run(const std::vector<std::string>& words, const std::shared_ptr<NamespaceNode>& root,
              const std::function<void(const std::string&)>& print = nullptr);

// The hidden first word of a shell completion request (`autocli __complete <words...>`).
// Its answer goes to stdout with status 0 whatever the words, and nothing to stderr.
constexpr char kCompleteWord[] = "__complete";

}  // namespace App
}  // namespace AutoCli
}  // namespace Kalmor
