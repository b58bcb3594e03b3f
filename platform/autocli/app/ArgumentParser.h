// The command line: global options, and a command's options checked against its parameters.
#pragma once

#include <memory>
#include <set>
#include <string>
#include <vector>

#include "autocli/CallSpec.h"

namespace Kalmor {
namespace AutoCli {
namespace App {

// Options of autocli itself. They come before the command path, and may also follow a
// command that has no parameter of the same name.
struct GlobalOptions {
    bool help = false;          // --help, -h
    bool listCommands = false;  // --list-commands
    bool reference = false;     // --reference
    bool debug = false;         // --debug
    bool noHeader = false;      // --no-header
    std::string formatter;      // --formatter NAME; empty: the command's default
    bool fieldsGiven = false;   // --fields A,B
    std::vector<std::string> fields;
    std::set<std::string> given;  // the long names of the options above that were given
};

// autocli's own options, as TakeGlobalOption reads them (and --version, which main answers
// before any command). Those marked `afterCommand` may also follow a command.
struct GlobalOption {
    const char* name;
    bool takesValue;
    bool afterCommand;
};
inline constexpr GlobalOption kGlobalOptions[] = {
    {"--formatter", true, true},   {"--fields", true, true},    {"--no-header", false, true},
    {"--debug", false, true},      {"--help", false, true},     {"--list-commands", false, false},
    {"--reference", false, false}, {"--version", false, false}, {"-h", false, true},
};

// The long names of the global options, for suggestions.
std::vector<std::string> GlobalOptionNames();

// Tries words[index] as a global option. Returns false when it is none. Otherwise stores it
// in `globals`, moves `index` past the option and its value, and returns true; a missing
// value is reported in `error`.
bool TakeGlobalOption(const std::vector<std::string>& words, size_t& index, GlobalOptions& globals,
                      std::string& error);

struct ParseResult {
    // The parsed parameters; complete only when `error` is empty and help was not asked.
    std::shared_ptr<CallSpec::Input> input;
    // One message that names the offending option; empty on success.
    std::string error;
    // --help or -h was among the words: help wins over any error.
    bool helpRequested = false;
    // --help, -h, --list-commands or --reference was among the words: `error` stays empty.
    bool documentationRequested = false;
};

// Parses a command's options against its input specification: `--name value`,
// `--name=value`, `-x value` and `-xvalue`; flags without value; booleans as true, false, 1
// or 0; decimal 64-bit integers; list options repeated; required parameters, enumerations
// and integer ranges (both bounds allowed) checked; every missing required option named in one
// message. Any other option repeated, an unknown
// option, a stray word and a text value with a control character other than tab are errors.
// With `globals` set, global options that the command does not shadow are taken into it.
// Does no I/O.
ParseResult ParseArguments(const std::vector<std::string>& words, const CallSpec::InputSpec& spec,
                           GlobalOptions* globals = nullptr);

}  // namespace App
}  // namespace AutoCli
}  // namespace Kalmor
