// One invocation of autocli: from the words of the command line to texts and an exit status.
#include "CommandLine.h"

#include <algorithm>
#include <exception>

#include "ArgumentParser.h"
#include "CommandTree.h"
#include "Completion.h"
#include "Formatter.h"
#include "Help.h"
#include "Reference.h"
#include "Text.h"

namespace Kalmor {
namespace AutoCli {
namespace App {

namespace {

constexpr char kDefaultFormatter[] = "simple";

// "autocli: " or "autocli: mesk cluster get: " before a message.
std::string Prefix(const NamespaceNode* node) {
    std::string path = node ? node->GetPathString(' ') : std::string();
    return path.empty() ? "autocli: " : "autocli: " + path + ": ";
}

RunResult UsageError(RunResult result, const NamespaceNode* node, const std::string& message) {
    result.err += Prefix(node) + message + "\n";
    result.status = kExitUsage;
    return result;
}

// Refuses --fields names that the command's result does not have, before the command runs.
std::string CheckFields(CommandSpec& command, const std::vector<std::string>& fields) {
    auto outputSpec = command.GetOutputSpec();
    const std::vector<std::string> known = FieldNames(outputSpec->GetRootObject().get());
    if (known.empty()) {
        return std::string();
    }
    for (const auto& name : fields) {
        if (std::find(known.begin(), known.end(), name) == known.end()) {
            return "unknown field '" + MessageText(name) + "' for --fields" +
                   DidYouMean(name, known) + "; valid choices: " + Join(known, ", ");
        }
    }
    return std::string();
}

// --reference: Markdown, or JSON with the json formatters.
RunResult Reference(RunResult result, const std::shared_ptr<NamespaceNode>& node,
                    const std::string& formatter) {
    if (formatter.empty()) {
        result.out = RenderReference(node);
    } else if (formatter == "json" || formatter == "json-pretty") {
        result.out = RenderReferenceJson(node, formatter == "json-pretty");
    } else {
        return UsageError(result, nullptr,
                          "--reference is Markdown, or JSON with --formatter json or "
                          "json-pretty; not '" +
                              MessageText(formatter) + "'");
    }
    return result;
}

RunResult RunCommand(CommandSpec& command, const std::vector<std::string>& words, size_t next,
                     GlobalOptions globals, const std::function<void(const std::string&)>& print) {
    RunResult result;
    std::shared_ptr<CallSpec::InputSpec> inputSpec = command.GetInputSpec();
    ParseResult parsed = ParseArguments(
        std::vector<std::string>(words.begin() + static_cast<std::ptrdiff_t>(next), words.end()),
        *inputSpec, &globals);
    if (parsed.helpRequested) {
        result.out = RenderCommandHelp(command, *inputSpec);
        return result;
    }
    if (globals.listCommands) {
        result.out = ListCommands(command);
        return result;
    }
    if (globals.reference) {
        return Reference(result, command.GetThis(), globals.formatter);
    }
    if (!parsed.error.empty()) {
        return UsageError(result, &command, parsed.error);
    }

    std::string formatterName = globals.formatter;
    if (formatterName.empty()) {
        formatterName = command.GetDefaultOutputFormatter();
        if (!FindFormatter(formatterName)) {
            formatterName = kDefaultFormatter;
        }
    }
    FormatterFunction formatter = FindFormatter(formatterName);
    if (!formatter) {
        return UsageError(result, nullptr,
                          "unknown formatter '" + MessageText(formatterName) + "'" +
                              DidYouMean(formatterName, FormatterNames()) +
                              "; valid choices: " + Join(FormatterNames(), ", "));
    }
    if (globals.fieldsGiven) {
        std::string error = CheckFields(command, globals.fields);
        if (!error.empty()) {
            return UsageError(result, &command, error);
        }
    }

    std::shared_ptr<CallSpec::CallTarget> target = command.GetDispatcher();
    if (!target) {
        result.err = Prefix(&command) + "this command cannot be run\n";
        result.status = kExitCommandFailed;
        return result;
    }
    auto output = CallSpec::Output::New();
    target->Execute(parsed.input, output);

    if (const auto& root = output->GetRootObject()) {
        FormatOptions options;
        options.outputParameters = command.GetDefaultOutputParameters();
        options.fieldsGiven = globals.fieldsGiven;
        options.fields = globals.fields;
        options.noHeader = globals.noHeader;
        options.flush = print;
        result.out = formatter(*root, options);
    }
    for (const auto& message : output->GetErrorMessages()) {
        result.err += message + "\n";
    }
    if (globals.debug) {
        result.err +=
            std::string("output complete: ") + (output->IsComplete() ? "yes" : "no") + "\n";
    }
    result.status = output->GetErrorMessages().empty() ? kExitSuccess : kExitCommandFailed;
    result.result = std::move(output);
    return result;
}

// The words that autocli answers itself: `__complete <words...>` for the shell, and
// `completion bash` unless a plug-in registered "completion" at the root.
bool RunBuiltin(const std::vector<std::string>& words, const std::shared_ptr<NamespaceNode>& root,
                RunResult& result) {
    if (words.empty()) {
        return false;
    }
    if (words[0] == kCompleteWord) {
        result.out = RenderCompletion(
            Complete(std::vector<std::string>(words.begin() + 1, words.end()), root));
        return true;
    }
    if (words[0] != "completion" || root->HasNamespaceNode("completion")) {
        return false;
    }
    const std::string script = words.size() == 2 ? CompletionScript(words[1]) : std::string();
    if (!script.empty()) {
        result.out = script;
    } else {
        std::vector<std::string> shells(std::begin(kCompletionShells), std::end(kCompletionShells));
        result.err =
            "autocli: completion: name the shell; valid choices: " + Join(shells, ", ") + "\n";
        result.status = kExitUsage;
    }
    return true;
}

// Run() without its boundary; `node` follows the path as it is resolved.
RunResult Dispatch(const std::vector<std::string>& words,
                   const std::shared_ptr<NamespaceNode>& root, std::shared_ptr<NamespaceNode>& node,
                   const std::function<void(const std::string&)>& print) {
    RunResult result;
    if (RunBuiltin(words, root, result)) {
        return result;
    }
    GlobalOptions globals;
    size_t index = 0;
    // Global options may stand before the path and between its words; the words after a
    // command are the command's.
    while (true) {
        while (index < words.size() && !words[index].empty() && words[index][0] == '-') {
            std::string error;
            if (!TakeGlobalOption(words, index, globals, error)) {
                const std::string option = words[index].substr(0, words[index].find('='));
                return UsageError(result, node.get(),
                                  "unknown option '" + MessageText(option) + "'" +
                                      DidYouMean(option, GlobalOptionNames()));
            }
            if (!error.empty()) {
                return UsageError(result, node.get(), error);
            }
        }
        if (index >= words.size()) {
            break;
        }
        PathResolution path = ResolvePath(node, words, index);
        if (!path.error.empty()) {
            return UsageError(result, nullptr, path.error);
        }
        node = path.node;
        index = path.next;
        if (node->GetType() == NodeType::Command) {
            break;
        }
    }

    if (node->GetType() == NodeType::Command) {
        auto* command = dynamic_cast<CommandSpec*>(node.get());
        if (command == nullptr) {
            result.err = Prefix(node.get()) + "this command cannot be run\n";
            result.status = kExitCommandFailed;
            return result;
        }
        return RunCommand(*command, words, index, globals, print);
    }

    if (globals.help) {
        result.out = RenderNamespaceHelp(*node);
        return result;
    }
    if (globals.listCommands) {
        result.out = ListCommands(*node);
        return result;
    }
    if (globals.reference) {
        return Reference(result, node, globals.formatter);
    }
    result.out = RenderNamespaceHelp(*node);
    if (node->GetNamespaceNodes().empty()) {
        return UsageError(result, node.get(),
                          "no commands are registered; check the plug-in directories "
                          "(AUTOCLI_PLUGIN_PATH)");
    }
    return UsageError(
        result, node.get(),
        "missing command; valid choices: " + Join(node->GetNamespaceNodeNames(), ", "));
}

}  // namespace

// Plug-ins' code runs not only in a command's execution but wherever the tree is rendered
// (help, listings, the reference and completion build the commands' input and output
// descriptions): whatever it throws is caught here, once for all of them.
RunResult Run(const std::vector<std::string>& words, const std::shared_ptr<NamespaceNode>& root,
              const std::function<void(const std::string&)>& print) {
    std::shared_ptr<NamespaceNode> node = root;
    std::string what;
    try {
        return Dispatch(words, root, node, print);
    } catch (const std::exception& e) {
        what = std::string(": ") + e.what();
    } catch (...) {
        what = " with an unknown exception";
    }
    RunResult result;
    if (!words.empty() && words[0] == kCompleteWord) {
        Completion nothing;
        nothing.directive = kCompleteError;
        result.out = RenderCompletion(nothing);
        return result;
    }
    const bool command = node->GetType() == NodeType::Command;
    result.err =
        Prefix(node.get()) + (command ? "the command failed" : "a plug-in failed") + what + "\n";
    result.status = kExitCommandFailed;
    return result;
}

}  // namespace App
}  // namespace AutoCli
}  // namespace Kalmor
