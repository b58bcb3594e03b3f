// Shell completion: candidates for the word being typed, from the registered command tree.
#include "Completion.h"

#include <set>

#include "ArgumentParser.h"
#include "Formatter.h"

namespace Kalmor {
namespace AutoCli {
namespace App {

using CallSpec::InputSpec;
using CallSpec::ParameterSpec;

namespace {

bool StartsWith(const std::string& text, const std::string& prefix) {
    return text.compare(0, prefix.size(), prefix) == 0;
}

// The global option that `word` names, with or without "=value".
const GlobalOption* FindGlobalOption(const std::string& word) {
    const std::string name = word.substr(0, word.find('='));
    for (const auto& option : kGlobalOptions) {
        if (name == option.name) {
            return &option;
        }
    }
    return nullptr;
}

// The command's parameter that `word` names (`--name`, `--name=value`, `-x`, `-xvalue`), with
// whether the word carries the value itself.
const ParameterSpec* FindParameter(const InputSpec& spec, const std::string& word,
                                   bool& valueAttached) {
    if (StartsWith(word, "--")) {
        size_t equals = word.find('=');
        valueAttached = equals != std::string::npos;
        return spec.FindParameter(word.substr(2, valueAttached ? equals - 2 : std::string::npos))
            .get();
    }
    if (word.size() < 2) {
        return nullptr;
    }
    for (const auto& parameter : spec.GetParameters()) {
        if (parameter && parameter->GetShortName() == word.substr(1, 1)) {
            valueAttached = word.size() > 2;
            return parameter.get();
        }
    }
    return nullptr;
}

// Whether a text option names a file or directory, judged by its name: the framework knows no
// more about a value than its kind, and only then may the shell offer file names.
bool NamesAPath(const ParameterSpec& parameter) {
    const std::string& name = parameter.GetName();
    for (const char* word : {"path", "file", "dir"}) {
        if (name.find(word) != std::string::npos) {
            return true;
        }
    }
    return false;
}

// The field names of the command's result, as --fields takes them.
std::vector<std::string> CommandFieldNames(CommandSpec* command) {
    const auto outputSpec = command ? command->GetOutputSpec() : nullptr;
    return FieldNames(outputSpec ? outputSpec->GetRootObject().get() : nullptr);
}

// What the last complete word left waiting for a value.
struct Awaited {
    const ParameterSpec* parameter = nullptr;
    const GlobalOption* global = nullptr;
    bool Any() const { return parameter != nullptr || global != nullptr; }
};

class Completer {
  public:
    Completer(const std::string& current, Completion& result)
        : current_(current), result_(result) {}

    // The command whose options are being completed, for the names --fields takes.
    void SetCommand(CommandSpec* command) { command_ = command; }

    void Offer(const std::string& candidate) {
        if (StartsWith(candidate, current_)) {
            result_.candidates.push_back(candidate);
        }
    }

    // Values of an option; `prefix` is "--name=" when the value is typed in the same word.
    void OfferValues(const Awaited& awaited, const std::string& prefix) {
        if (awaited.global != nullptr) {
            const std::string name = awaited.global->name;
            if (name == "--formatter") {
                for (const auto& formatter : FormatterNames()) {
                    Offer(prefix + formatter);
                }
            } else if (name == "--fields") {
                OfferFields(prefix);
            }
            return;
        }
        const ParameterSpec& parameter = *awaited.parameter;
        if (parameter.GetType() == CallSpec::PARAM_BOOL) {
            Offer(prefix + "true");
            Offer(prefix + "false");
            return;
        }
        const auto& constraint = parameter.GetConstraint();
        if (constraint && constraint->GetType() == CallSpec::CONSTRAINT_STRING_ENUM) {
            for (const auto& entry : constraint->GetStringEnum()) {
                Offer(prefix + entry.value);
            }
            return;
        }
        const bool freeText = parameter.GetType() == CallSpec::PARAM_STRING ||
                              parameter.GetType() == CallSpec::PARAM_STRING_LIST;
        if (freeText && prefix.empty() && NamesAPath(parameter)) {
            result_.directive &= ~kCompleteNoFileNames;
        }
    }

    // The command's options not given yet (list options always), then the global options
    // that it does not shadow. Short names only once a "-" is typed.
    void OfferCommandOptions(const InputSpec& spec, const std::set<std::string>& given) {
        const bool withShort = !current_.empty() && !StartsWith(current_, "--");
        std::vector<std::string> shortNames;
        for (const auto& parameter : spec.GetParameters()) {
            if (!parameter || (given.count(parameter->GetName()) != 0 &&
                               parameter->GetType() != CallSpec::PARAM_STRING_LIST)) {
                continue;
            }
            Offer("--" + parameter->GetName());
            if (!parameter->GetShortName().empty()) {
                shortNames.push_back("-" + parameter->GetShortName());
            }
        }
        for (const auto& option : kGlobalOptions) {
            const std::string name = option.name;
            const bool isShort = !StartsWith(name, "--");
            bool attached = false;
            bool shadowed = isShort ? FindParameter(spec, name, attached) != nullptr
                                    : spec.FindParameter(name.substr(2)) != nullptr;
            if (!option.afterCommand || shadowed) {
                continue;
            }
            if (isShort) {
                shortNames.push_back(name);
            } else {
                Offer(name);
            }
        }
        if (withShort) {
            for (const auto& name : shortNames) {
                Offer(name);
            }
        }
    }

    // --fields takes names separated by commas: the names typed so far stay in front, and
    // those already chosen are not offered again.
    void OfferFields(const std::string& prefix) {
        const std::string typed = current_.substr(std::min(prefix.size(), current_.size()));
        const size_t comma = typed.rfind(',');
        const std::string chosen = comma == std::string::npos ? "" : typed.substr(0, comma + 1);
        const std::string chosenList = "," + chosen;
        for (const auto& name : CommandFieldNames(command_)) {
            if (chosenList.find("," + name + ",") == std::string::npos) {
                Offer(prefix + chosen + name);
            }
        }
    }

    void OfferGlobalOptions() {
        for (const auto& option : kGlobalOptions) {
            Offer(option.name);
        }
    }

  private:
    const std::string& current_;
    Completion& result_;
    CommandSpec* command_ = nullptr;
};

Completion CompleteWords(const std::vector<std::string>& words,
                         const std::shared_ptr<NamespaceNode>& root) {
    Completion result;
    const std::string current = words.empty() ? std::string() : words.back();
    const size_t complete = words.empty() ? 0 : words.size() - 1;
    Completer completer(current, result);

    // `autocli completion bash`, unless a plug-in took the word.
    if (complete >= 1 && words[0] == "completion" && !root->HasNamespaceNode("completion")) {
        if (complete == 1) {
            for (const char* shell : kCompletionShells) {
                completer.Offer(shell);
            }
        }
        return result;
    }

    // Walk the words before the current one as the parser would: global options anywhere,
    // path words down to a command, then the command's options with their values.
    std::shared_ptr<NamespaceNode> node = root;
    std::shared_ptr<InputSpec> spec;
    std::set<std::string> given;
    Awaited awaited;
    for (size_t i = 0; i < complete; ++i) {
        const std::string& word = words[i];
        // The parser takes the next word as the value unless it is another long option.
        if (awaited.Any() && !StartsWith(word, "--")) {
            awaited = Awaited();
            continue;
        }
        awaited = Awaited();
        if (!word.empty() && word[0] == '-') {
            bool valueAttached = false;
            const ParameterSpec* parameter =
                spec ? FindParameter(*spec, word, valueAttached) : nullptr;
            if (parameter != nullptr) {
                given.insert(parameter->GetName());
                if (!valueAttached && parameter->GetType() != CallSpec::PARAM_FLAG) {
                    awaited.parameter = parameter;
                }
            } else if (const GlobalOption* global = FindGlobalOption(word)) {
                if (global->takesValue && word.find('=') == std::string::npos) {
                    awaited.global = global;
                }
            }
            continue;
        }
        if (spec) {
            continue;  // a stray word after the command: the parser refuses it, we skip it
        }
        std::shared_ptr<NamespaceNode> child = node->GetNamespaceNode(word);
        if (!child) {
            result.directive = kCompleteError;
            return result;
        }
        node = child;
        if (node->GetType() == NodeType::Command) {
            auto* command = dynamic_cast<CommandSpec*>(node.get());
            completer.SetCommand(command);
            spec = command ? command->GetInputSpec() : nullptr;
            if (!spec) {
                spec = InputSpec::New();
            }
        }
    }

    if (awaited.Any() && !StartsWith(current, "--")) {
        completer.OfferValues(awaited, std::string());
        return result;
    }
    const size_t equals = current.find('=');
    if (StartsWith(current, "--") && equals != std::string::npos) {
        const std::string option = current.substr(0, equals);
        bool valueAttached = false;
        Awaited named;
        named.parameter = spec ? FindParameter(*spec, option, valueAttached) : nullptr;
        named.global = named.parameter ? nullptr : FindGlobalOption(option);
        if (named.parameter && named.parameter->GetType() == CallSpec::PARAM_FLAG) {
            return result;
        }
        if (named.Any()) {
            completer.OfferValues(named, option + "=");
        }
        return result;
    }
    if (spec) {
        completer.OfferCommandOptions(*spec, given);
        return result;
    }
    if (!current.empty() && current[0] == '-') {
        completer.OfferGlobalOptions();
        return result;
    }
    for (const auto& name : node->GetNamespaceNodeNames()) {
        completer.Offer(name);
    }
    return result;
}

}  // namespace

Completion Complete(const std::vector<std::string>& words,
                    const std::shared_ptr<NamespaceNode>& root) {
    // A plug-in's declaration may throw; a completion must never end the shell's request
    // with a trace.
    try {
        return CompleteWords(words, root);
    } catch (...) {
        Completion failed;
        failed.directive = kCompleteError;
        return failed;
    }
}

std::string RenderCompletion(const Completion& completion) {
    std::string text;
    for (const auto& candidate : completion.candidates) {
        text += candidate + "\n";
    }
    return text + ":" + std::to_string(completion.directive) + "\n";
}

namespace {

const char kBashScript[] =
    R"BASH(# bash completion for autocli. The candidates come from autocli itself (`autocli __complete`),
# so the commands of every installed plug-in complete without regenerating this file.

# Without bash-completion's helpers, bash splits "--formatter=js" at "=" into three words;
# join them again so that autocli sees the option as typed.
_autocli_words() {
    words=()
    cword=-1
    local i last
    for ((i = 0; i < ${#COMP_WORDS[@]}; i++)); do
        last=$((${#words[@]} - 1))
        if ((i > 1)) && [[ ${COMP_WORDS[i]} == "=" || ${COMP_WORDS[i - 1]} == "=" ]] &&
            [[ ${words[last]} == --* ]]; then
            words[last]+=${COMP_WORDS[i]}
        else
            words+=("${COMP_WORDS[i]}")
        fi
        if ((i == COMP_CWORD)); then
            cword=$((${#words[@]} - 1))
        fi
    done
    if ((cword < 0)); then
        words+=("")
        cword=$((${#words[@]} - 1))
    fi
    cur=${words[cword]}
}

_autocli() {
    local cur words cword
    if declare -F _get_comp_words_by_ref >/dev/null; then
        _get_comp_words_by_ref -n = cur words cword
    else
        _autocli_words
    fi
    COMPREPLY=()
    # Field names hold blanks: autocli sees the word as it will be read, without the escapes.
    local typed=${cur//\\ / }
    local answer line lines=()
    answer=$("${words[0]}" __complete "${words[@]:1:cword-1}" "$typed" 2>/dev/null) || return 0
    while IFS= read -r line; do
        lines+=("$line")
    done <<<"$answer"
    local directive=${lines[${#lines[@]} - 1]#:}
    [[ ${lines[${#lines[@]} - 1]} == :* && $directive =~ ^[0-9]+$ ]] || return 0
    unset 'lines[${#lines[@]}-1]'
    ((directive & 1)) && return 0
    # Readline replaces only the text after "=", so the candidates lose the option part.
    if [[ $cur == *=* && $COMP_WORDBREAKS == *=* ]]; then
        lines=("${lines[@]#"${cur%%=*}="}")
    fi
    COMPREPLY=("${lines[@]//\ /\\ }")
    if ((directive & 2)); then
        compopt -o nospace 2>/dev/null
    fi
    if ((directive & 4)) || ((${#COMPREPLY[@]} > 0)); then
        compopt +o default 2>/dev/null
    fi
    return 0
}

complete -o default -F _autocli autocli
)BASH";

const char kZshScript[] =
    R"ZSH(#compdef autocli
# zsh completion for autocli: the candidates come from `autocli __complete`, as for bash.
_autocli() {
    local -a lines
    local directive
    lines=("${(@f)$("${words[1]}" __complete "${(@Q)words[2,CURRENT]}" 2>/dev/null)}")
    [[ ${lines[-1]} == :<-> ]] || return 1
    directive=${lines[-1]#:}
    lines=("${(@)lines[1,-2]}")
    (( directive & 1 )) && return 1
    if (( ${#lines} )); then
        if (( directive & 2 )); then
            compadd -S '' -- "${lines[@]}"
        else
            compadd -- "${lines[@]}"
        fi
    elif (( ! (directive & 4) )); then
        _files
    fi
}
if (( $+functions[compdef] )); then
    compdef _autocli autocli
fi
)ZSH";

const char kFishScript[] =
    R"FISH(# fish completion for autocli: the candidates come from `autocli __complete`, as for bash.
function __autocli_complete
    set -l words (commandline -opc)
    set -l current (commandline -ct)
    set -l answer ($words[1] __complete $words[2..-1] "$current" 2>/dev/null)
    or return
    string match -qr '^:[0-9]+$' -- $answer[-1]
    or return
    set -l directive (string sub -s 2 -- $answer[-1])
    set -e answer[-1]
    if test (math "$directive % 2") -eq 1
        return
    end
    if test (count $answer) -gt 0
        printf '%s\n' $answer
    else if test (math "floor($directive / 4) % 2") -eq 0
        __fish_complete_path "$current"
    end
end
complete -c autocli -f -a '(__autocli_complete)'
)FISH";

}  // namespace

std::string CompletionScript(const std::string& shell) {
    if (shell == "bash") return kBashScript;
    if (shell == "zsh") return kZshScript;
    if (shell == "fish") return kFishScript;
    return std::string();
}

}  // namespace App
}  // namespace AutoCli
}  // namespace Kalmor
