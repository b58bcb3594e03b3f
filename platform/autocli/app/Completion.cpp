// Shell completion: candidates for the word being typed, from the registered command tree.
#include "Completion.h"

#include <set>

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

// autocli's own options, as TakeGlobalOption reads them. Those marked `afterCommand` are
// offered after a command too, where the parser also takes them.
struct GlobalOption {
    const char* name;
    bool takesValue;
    bool afterCommand;
};

const GlobalOption kGlobalOptions[] = {
    {"--formatter", true, true},   {"--fields", true, true},    {"--no-header", false, true},
    {"--debug", false, true},      {"--help", false, true},     {"--list-commands", false, false},
    {"--reference", false, false}, {"--version", false, false}, {"-h", false, true},
};

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

    void Offer(const std::string& candidate) {
        if (StartsWith(candidate, current_)) {
            result_.candidates.push_back(candidate);
        }
    }

    // Values of an option; `prefix` is "--name=" when the value is typed in the same word.
    void OfferValues(const Awaited& awaited, const std::string& prefix) {
        if (awaited.global != nullptr) {
            if (std::string(awaited.global->name) == "--formatter") {
                for (const auto& name : FormatterNames()) {
                    Offer(prefix + name);
                }
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
        if (freeText && prefix.empty()) {
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

    void OfferGlobalOptions() {
        for (const auto& option : kGlobalOptions) {
            Offer(option.name);
        }
    }

  private:
    const std::string& current_;
    Completion& result_;
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
            completer.Offer("bash");
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

const std::string& BashCompletionScript() {
    static const std::string script =
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
    local answer line lines=()
    answer=$("${words[0]}" __complete "${words[@]:1:cword-1}" "$cur" 2>/dev/null) || return 0
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
    COMPREPLY=("${lines[@]}")
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
    return script;
}

}  // namespace App
}  // namespace AutoCli
}  // namespace Kalmor
