// Shell completion: the candidates for the word being typed, read from the same command tree
// that the parser resolves, so that commands of every loaded plug-in complete without any
// generated script.
//
// Protocol of the hidden `autocli __complete <words...>`: the words are those after the
// program name up to and including the word being completed (empty when the cursor follows a
// blank). It prints the candidates that start with that word, one per line, then one line
// ":<directive>", and always exits 0 with nothing on stderr.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "autocli/AutoCli.h"

namespace Kalmor {
namespace AutoCli {
namespace App {

// Bits of the directive line.
constexpr unsigned kCompleteError = 1;        // the words cannot be completed: offer nothing
constexpr unsigned kCompleteNoSpace = 2;      // do not add a blank after the candidate
constexpr unsigned kCompleteNoFileNames = 4;  // do not fall back to file names

struct Completion {
    std::vector<std::string> candidates;
    unsigned directive = kCompleteNoFileNames;
};

// The candidates for the last of `words`: child names in a namespace; option names (long,
// and short after a lone "-") in a command, those already given left out unless they may be
// repeated; the values of an enumeration, true and false for a boolean, the formatter names
// for --formatter, the result's field names for --fields (after the names already typed, comma
// separated). A text value without enumeration falls back to file names only when the
// option's name says it is a path, file or directory. A word that names no child sets
// kCompleteError. Never throws.
Completion Complete(const std::vector<std::string>& words,
                    const std::shared_ptr<NamespaceNode>& root);

// The candidates one per line, then ":<directive>".
std::string RenderCompletion(const Completion& completion);

// The shells that `autocli completion SHELL` prints an adaptor for.
constexpr const char* kCompletionShells[] = {"bash", "zsh", "fish"};

// The adaptor printed by `autocli completion SHELL`, "" for a shell not in kCompletionShells:
// it hands the words of the command line to `<the typed program> __complete` and offers the
// answer's candidates, falling back to file names only when the directive allows it.
std::string CompletionScript(const std::string& shell);

}  // namespace App
}  // namespace AutoCli
}  // namespace Kalmor
