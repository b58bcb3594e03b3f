// The command line: global options, and a command's options checked against its parameters.
#include "ArgumentParser.h"

#include <cerrno>
#include <cstdlib>
#include <set>

#include "Text.h"

namespace Kalmor {
namespace AutoCli {
namespace App {

using CallSpec::InputSpec;
using CallSpec::ParameterConstraint;
using CallSpec::ParameterSpec;

namespace {

bool StartsWith(const std::string& text, const char* prefix) {
    return text.rfind(prefix, 0) == 0;
}

bool IsHelpFlag(const std::string& word) {
    return word == "--help" || word == "-h";
}

// A word that cannot be the value of the option before it: another long option, or -h, which
// asks for help whichever way it is spelt. Other words that begin with a dash, negative
// numbers among them, are values.
bool LooksLikeLongOption(const std::string& word) {
    return StartsWith(word, "--") || IsHelpFlag(word);
}

// Matches `--name value` and `--name=value` at words[index], moving `index` past them.
// Returns false when the word is another option.
bool MatchValueOption(const std::vector<std::string>& words, size_t& index, const char* option,
                      std::string& value, std::string& error) {
    const std::string& word = words[index];
    const std::string name = option;
    if (word == name) {
        if (index + 1 >= words.size() || LooksLikeLongOption(words[index + 1])) {
            error = "option '" + name + "' needs a value";
            index += 1;
            return true;
        }
        value = words[index + 1];
        index += 2;
        return true;
    }
    if (StartsWith(word, (name + "=").c_str())) {
        value = word.substr(name.size() + 1);
        if (value.empty()) {
            error = "option '" + name + "' needs a value";
        }
        index += 1;
        return true;
    }
    return false;
}

// Parses a decimal 64-bit integer with an optional sign. Refuses blanks, trailing garbage
// and values out of range.
enum class IntParse { Ok, NotANumber, OutOfRange };

IntParse ParseInt64(const std::string& text, int64_t& value) {
    size_t digits = (!text.empty() && (text[0] == '-' || text[0] == '+')) ? 1 : 0;
    if (digits == text.size()) {
        return IntParse::NotANumber;
    }
    for (size_t i = digits; i < text.size(); ++i) {
        if (text[i] < '0' || text[i] > '9') {
            return IntParse::NotANumber;
        }
    }
    errno = 0;
    char* end = nullptr;
    long long parsed = std::strtoll(text.c_str(), &end, 10);
    if (errno == ERANGE) {
        return IntParse::OutOfRange;
    }
    value = static_cast<int64_t>(parsed);
    return IntParse::Ok;
}

bool ParseBool(const std::string& text, bool& value) {
    std::string lower;
    for (char c : text) {
        lower += static_cast<char>(c >= 'A' && c <= 'Z' ? c - 'A' + 'a' : c);
    }
    if (lower == "true" || lower == "1") {
        value = true;
        return true;
    }
    if (lower == "false" || lower == "0") {
        value = false;
        return true;
    }
    return false;
}

// No command takes multi-line text: a newline or another control character in a value is
// almost always a quoting mistake, and would garble the host's configuration files.
bool HasControlCharacter(const std::string& text) {
    for (char c : text) {
        unsigned char byte = static_cast<unsigned char>(c);
        if ((byte < 0x20 && byte != '\t') || byte == 0x7F) {
            return true;
        }
    }
    return false;
}

// Quotes a text for a message; what the user typed is shown on one line (MessageText).
std::string Quoted(const std::string& text) {
    return "'" + MessageText(text) + "'";
}

std::string EnumValues(const ParameterConstraint& constraint) {
    std::vector<std::string> values;
    for (const auto& entry : constraint.GetStringEnum()) {
        values.push_back(entry.value);
    }
    return Join(values, ", ");
}

const ParameterSpec* FindShort(const InputSpec& spec, const std::string& letter) {
    for (const auto& parameter : spec.GetParameters()) {
        if (parameter && parameter->GetShortName() == letter) {
            return parameter.get();
        }
    }
    return nullptr;
}

// Checks one text value against the parameter's enumeration; returns an error or "".
std::string CheckText(const ParameterSpec& parameter, const std::string& value) {
    const std::string option = "--" + parameter.GetName();
    if (HasControlCharacter(value)) {
        return "option " + Quoted(option) +
               " contains a control character; values must be a single line of text";
    }
    const auto& constraint = parameter.GetConstraint();
    if (constraint && constraint->GetType() == CallSpec::CONSTRAINT_STRING_ENUM) {
        for (const auto& entry : constraint->GetStringEnum()) {
            if (entry.value == value) {
                return std::string();
            }
        }
        return "option " + Quoted(option) + " must be one of " + EnumValues(*constraint) +
               " (got " + Quoted(value) + ")";
    }
    return std::string();
}

// Checks a value and stores it in `input`; returns an error or "".
std::string Store(const ParameterSpec& parameter, const std::string& value,
                  CallSpec::Input& input) {
    const std::string& name = parameter.GetName();
    const std::string option = Quoted("--" + name);
    switch (parameter.GetType()) {
        case CallSpec::PARAM_STRING: {
            std::string error = CheckText(parameter, value);
            if (error.empty()) {
                input.SetParameter(name, value);
            }
            return error;
        }
        case CallSpec::PARAM_STRING_LIST: {
            std::string error = CheckText(parameter, value);
            if (error.empty()) {
                input.AddParameterValue(name, value);
            }
            return error;
        }
        case CallSpec::PARAM_INT: {
            int64_t number = 0;
            switch (ParseInt64(value, number)) {
                case IntParse::NotANumber:
                    return "option " + option + " needs a decimal integer (got " + Quoted(value) +
                           ")";
                case IntParse::OutOfRange:
                    return "option " + option + " is out of the 64-bit integer range (got " +
                           Quoted(value) + ")";
                case IntParse::Ok:
                    break;
            }
            const auto& constraint = parameter.GetConstraint();
            if (constraint && constraint->GetType() == CallSpec::CONSTRAINT_INT_RANGE &&
                (number < constraint->GetIntMinimum() || number > constraint->GetIntMaximum())) {
                return "option " + option + " must be between " +
                       std::to_string(constraint->GetIntMinimum()) + " and " +
                       std::to_string(constraint->GetIntMaximum()) + " (got " + Quoted(value) + ")";
            }
            input.SetParameterInt(name, number);
            return std::string();
        }
        case CallSpec::PARAM_BOOL: {
            bool flag = false;
            if (!ParseBool(value, flag)) {
                return "option " + option + " needs true or false (got " + Quoted(value) + ")";
            }
            input.SetParameterBool(name, flag);
            return std::string();
        }
        case CallSpec::PARAM_FLAG:
            input.SetFlag(name);
            return std::string();
    }
    return "option " + option + " has a kind that this tool does not know";
}

// A declaration the parser cannot honour is refused before any word is read, so that the
// command never runs with a parameter nobody can check.
std::string CheckDeclarations(const InputSpec& spec) {
    std::set<std::string> names;
    for (const auto& parameter : spec.GetParameters()) {
        if (!parameter) {
            continue;
        }
        const std::string option = Quoted("--" + parameter->GetName());
        if (!names.insert(parameter->GetName()).second) {
            return "the command declares " + option + " twice";
        }
        const auto& constraint = parameter->GetConstraint();
        if (constraint && constraint->GetType() == CallSpec::CONSTRAINT_INT_ENUM) {
            return "the command declares an integer enumeration for " + option +
                   ", which this tool does not support";
        }
    }
    return std::string();
}

}  // namespace

std::vector<std::string> GlobalOptionNames() {
    std::vector<std::string> names;
    for (const auto& option : kGlobalOptions) {
        if (option.name[1] == '-') names.push_back(option.name);
    }
    return names;
}

bool TakeGlobalOption(const std::vector<std::string>& words, size_t& index, GlobalOptions& globals,
                      std::string& error) {
    const std::string& word = words[index];
    // Asking for documentation twice is harmless; any other global option given twice is
    // refused like a repeated command option, since only one of the two could be honoured.
    const std::string name = word.substr(0, word.find('='));
    const bool documentation =
        IsHelpFlag(name) || name == "--list-commands" || name == "--reference";
    if (!documentation && StartsWith(name, "--") && globals.given.count(name) != 0) {
        error = "option " + Quoted(name) + " given more than once";
    }
    if (word == "--help" || word == "-h") {
        globals.help = true;
    } else if (word == "--list-commands") {
        globals.listCommands = true;
    } else if (word == "--reference") {
        globals.reference = true;
    } else if (word == "--debug") {
        globals.debug = true;
    } else if (word == "--no-header") {
        globals.noHeader = true;
    } else {
        std::string value;
        std::string valueError;
        if (MatchValueOption(words, index, "--formatter", value, valueError)) {
            globals.formatter = value;
        } else if (MatchValueOption(words, index, "--fields", value, valueError)) {
            globals.fieldsGiven = true;
            globals.fields = SplitNames(value);
            if (valueError.empty() && globals.fields.empty()) {
                valueError = "option '--fields' needs at least one field name";
            }
        } else {
            return false;
        }
        if (error.empty()) {
            error = valueError;
        }
        globals.given.insert(name);
        return true;
    }
    globals.given.insert(name);
    index += 1;
    return true;
}

ParseResult ParseArguments(const std::vector<std::string>& words, const InputSpec& spec,
                           GlobalOptions* globals) {
    ParseResult result;
    result.input = CallSpec::Input::New();
    // Every word is read even after an error, so that a --help anywhere still wins.
    std::string firstError = CheckDeclarations(spec);
    const auto fail = [&firstError](const std::string& message) {
        if (firstError.empty()) {
            firstError = message;
        }
    };
    std::set<std::string> seen;

    for (size_t i = 0; i < words.size(); ++i) {
        const std::string& word = words[i];
        const ParameterSpec* parameter = nullptr;
        std::string value;
        bool valueGiven = false;

        if (word.size() > 2 && StartsWith(word, "--")) {
            size_t equals = word.find('=');
            std::string name = word.substr(2, equals == std::string::npos ? equals : equals - 2);
            if (equals != std::string::npos) {
                value = word.substr(equals + 1);
                valueGiven = true;
            }
            parameter = spec.FindParameter(name).get();
        } else if (word.size() >= 2 && word[0] == '-' && word[1] != '-') {
            parameter = FindShort(spec, word.substr(1, 1));
            if (parameter && word.size() > 2) {
                value = word.substr(2);
                valueGiven = true;
            }
        } else {
            fail("unexpected argument " + Quoted(word));
            continue;
        }

        if (!parameter) {
            size_t next = i;
            std::string error;
            if (globals && TakeGlobalOption(words, next, *globals, error)) {
                if (!error.empty()) {
                    fail(error);
                }
                i = next - 1;
                continue;
            }
            std::string option =
                StartsWith(word, "--") ? word.substr(0, word.find('=')) : word.substr(0, 2);
            std::vector<std::string> known = GlobalOptionNames();
            for (const auto& candidate : spec.GetParameters()) {
                if (candidate) {
                    known.push_back("--" + candidate->GetName());
                }
            }
            fail("unknown option " + Quoted(option) +
                 (StartsWith(option, "--") ? DidYouMean(option, known) : std::string()));
            continue;
        }

        const std::string& name = parameter->GetName();
        const std::string option = Quoted("--" + name);
        if (parameter->GetType() == CallSpec::PARAM_FLAG) {
            if (valueGiven) {
                fail("option " + option + " takes no value");
                continue;
            }
        } else if (!valueGiven) {
            if (i + 1 >= words.size() || LooksLikeLongOption(words[i + 1])) {
                fail("option " + option +
                     (parameter->GetType() == CallSpec::PARAM_BOOL ? " needs a value: true or false"
                                                                   : " needs a value"));
                continue;
            }
            value = words[++i];
        }

        if (!seen.insert(name).second && parameter->GetType() != CallSpec::PARAM_STRING_LIST) {
            fail("option " + option + " given more than once");
            continue;
        }
        std::string error = Store(*parameter, value, *result.input);
        if (!error.empty()) {
            fail(error);
        }
    }

    std::vector<std::string> missing;
    for (const auto& parameter : spec.GetParameters()) {
        if (parameter && parameter->IsRequired() && !seen.count(parameter->GetName())) {
            missing.push_back(Quoted("--" + parameter->GetName()));
        }
    }
    if (missing.size() == 1) {
        fail("missing required option " + missing[0]);
    } else if (!missing.empty()) {
        fail("missing required options " + Join(missing, ", "));
    }

    // A request for documentation describes the command; it does not run it, so the
    // arguments around it are not checked.
    if (globals && (globals->help || globals->listCommands || globals->reference)) {
        result.helpRequested = globals->help;
        result.documentationRequested = true;
    } else {
        result.error = firstError;
    }
    return result;
}

}  // namespace App
}  // namespace AutoCli
}  // namespace Kalmor
