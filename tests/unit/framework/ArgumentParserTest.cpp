#include "ArgumentParser.h"

#include <gtest/gtest.h>

#include "unit/framework/TestCommand.h"

namespace FrameworkTest {
namespace {

using Kalmor::AutoCli::App::GlobalOptions;
using Kalmor::AutoCli::App::ParseArguments;
using Kalmor::AutoCli::App::ParseResult;
using namespace Kalmor::CallSpec;

std::shared_ptr<InputSpec> EveryKind() {
    auto spec = InputSpec::New();
    spec->AddParameter(Param("name", PARAM_STRING, "n", true));
    auto count = Param("count", PARAM_INT, "c");
    count->SetConstraint(Range(0, 512));
    spec->AddParameter(count);
    spec->AddParameter(Param("big", PARAM_INT));
    spec->AddParameter(Param("loud", PARAM_BOOL, "l"));
    spec->AddParameter(Param("wave", PARAM_FLAG, "w"));
    spec->AddParameter(Param("item", PARAM_STRING_LIST, "i"));
    auto role = Param("role", PARAM_STRING, "r");
    role->SetConstraint(Enum({"witness", "node"}));
    spec->AddParameter(role);
    return spec;
}

// The parsed values as "name=v1|v2;..." in name order; a flag shows as "name=".
std::string Values(const Input& input) {
    std::string text;
    for (const auto& entry : input.GetValues()) {
        text += (text.empty() ? "" : ";") + entry.first + "=";
        for (size_t i = 0; i < entry.second.size(); ++i) {
            text += (i ? "|" : "") + entry.second[i];
        }
    }
    return text;
}

struct ParseCase {
    std::vector<std::string> words;
    // On success the parsed values; on failure the message.
    std::string expected;
    bool ok;
};

TEST(ArgumentParser, ParsesEveryKindAndRefusesBadValuesWithOneMessage) {
    const std::vector<ParseCase> cases = {
        {{"--name", "bob"}, "name=bob", true},
        {{"--name=bob"}, "name=bob", true},
        {{"-n", "bob"}, "name=bob", true},
        {{"-nbob"}, "name=bob", true},
        {{"--name="}, "name=", true},
        {{"-n", "-x"}, "name=-x", true},
        {{"-n", "a\tb"}, "name=a\tb", true},
        {{"-n", "a", "-c", "0"}, "count=0;name=a", true},
        {{"-n", "a", "--count=512"}, "count=512;name=a", true},
        {{"-n", "a", "--count", "+07"}, "count=7;name=a", true},
        {{"-n", "a", "--big", "-9223372036854775808"}, "big=-9223372036854775808;name=a", true},
        {{"-n", "a", "--big=9223372036854775807"}, "big=9223372036854775807;name=a", true},
        {{"-n", "a", "--loud", "true"}, "loud=true;name=a", true},
        {{"-n", "a", "-l0"}, "loud=false;name=a", true},
        {{"-n", "a", "--loud=1"}, "loud=true;name=a", true},
        {{"-n", "a", "--loud", "FALSE"}, "loud=false;name=a", true},
        {{"-n", "a", "-w"}, "name=a;wave=", true},
        {{"-i", "x", "-n", "a", "--item=y", "-iz"}, "item=x|y|z;name=a", true},
        {{"-n", "a", "--role", "node"}, "name=a;role=node", true},

        {{}, "missing required option '--name'", false},
        {{"-w"}, "missing required option '--name'", false},
        {{"-n", "a", "--bogus"}, "unknown option '--bogus'", false},
        {{"-n", "a", "--bogus=1"}, "unknown option '--bogus'", false},
        {{"-n", "a", "-z"}, "unknown option '-z'", false},
        {{"-n", "a", "stray"}, "unexpected argument 'stray'", false},
        {{"--name"}, "option '--name' needs a value", false},
        {{"--name", "--wave"}, "option '--name' needs a value", false},
        {{"-n", "a", "-c", "12x"}, "option '--count' needs a decimal integer (got '12x')", false},
        {{"-n", "a", "-c", ""}, "option '--count' needs a decimal integer (got '')", false},
        {{"-n", "a", "-c", " 5"}, "option '--count' needs a decimal integer (got ' 5')", false},
        {{"-n", "a", "-c", "0x10"}, "option '--count' needs a decimal integer (got '0x10')", false},
        {{"-n", "a", "--big", "9223372036854775808"},
         "option '--big' is out of the 64-bit integer range (got '9223372036854775808')",
         false},
        {{"-n", "a", "--count=513"},
         "option '--count' must be between 0 and 512 (got '513')",
         false},
        {{"-n", "a", "--count=-1"}, "option '--count' must be between 0 and 512 (got '-1')", false},
        {{"-n", "a", "--loud", "maybe"},
         "option '--loud' needs true or false (got 'maybe')",
         false},
        {{"-n", "a", "--loud"}, "option '--loud' needs a value: true or false", false},
        {{"-n", "a", "--loud", "--wave"}, "option '--loud' needs a value: true or false", false},
        {{"-n", "a", "--wave=yes"}, "option '--wave' takes no value", false},
        {{"-n", "a", "-r", "Node"},
         "option '--role' must be one of witness, node (got 'Node')",
         false},
        {{"-n", "a", "--name", "b"}, "option '--name' given more than once", false},
        {{"-n", "a", "-w", "--wave"}, "option '--wave' given more than once", false},
        {{"-n", "a", "-c", "1", "-c", "1"}, "option '--count' given more than once", false},
        {{"-n", "a\nb"},
         "option '--name' contains a control character; values must be a single line of text",
         false},
        {{"-n", "a", "-i", "x\x1b[31m"},
         "option '--item' contains a control character; values must be a single line of text",
         false},
        {{"-n", std::string("a\0b", 3)},
         "option '--name' contains a control character; values must be a single line of text",
         false},
        // A value echoed in a message stays on one line and cannot drive the terminal.
        {{"-n", "a", "-c", "1\n2"},
         "option '--count' needs a decimal integer (got '1\\n2')",
         false},
        {{"-n", "a", "--loud", "\x1b[31mtrue"},
         "option '--loud' needs true or false (got '\\x1b[31mtrue')",
         false},
        {{"-n", "a", "--bo\rgus"}, "unknown option '--bo\\rgus'", false},
        {{"-n", "a", "st\nray\xff"}, "unexpected argument 'st\\nray\xEF\xBF\xBD'", false},
        // The first problem is the one reported.
        {{"-c", "x", "--bogus"}, "option '--count' needs a decimal integer (got 'x')", false},
    };
    auto spec = EveryKind();
    for (const auto& entry : cases) {
        std::string shown;
        for (const auto& word : entry.words) {
            shown += "[" + word + "]";
        }
        ParseResult result = ParseArguments(entry.words, *spec);
        if (entry.ok) {
            EXPECT_EQ(result.error, "") << shown;
            EXPECT_EQ(Values(*result.input), entry.expected) << shown;
        } else {
            EXPECT_EQ(result.error, entry.expected) << shown;
        }
        EXPECT_FALSE(result.helpRequested) << shown;
    }
}

TEST(ArgumentParser, TakesGlobalOptionsAfterTheCommandUnlessItHasOptionsOfThoseNames) {
    auto spec = InputSpec::New();
    spec->AddParameter(Param("fields", PARAM_STRING));
    spec->AddParameter(Param("host", PARAM_STRING, "h"));

    GlobalOptions globals;
    ParseResult result =
        ParseArguments({"--formatter", "json", "--fields=a,b", "--no-header", "--debug", "-h", "x"},
                       *spec, &globals);
    EXPECT_EQ(result.error, "");
    EXPECT_FALSE(result.helpRequested);
    EXPECT_EQ(globals.formatter, "json");
    EXPECT_TRUE(globals.noHeader);
    EXPECT_TRUE(globals.debug);
    EXPECT_FALSE(globals.fieldsGiven);
    EXPECT_EQ(Values(*result.input), "fields=a,b;host=x");

    GlobalOptions missing;
    EXPECT_EQ(ParseArguments({"--formatter"}, *spec, &missing).error,
              "option '--formatter' needs a value");
}

TEST(ArgumentParser, HelpWinsOverErrors) {
    auto spec = EveryKind();
    GlobalOptions globals;
    ParseResult result = ParseArguments({"--bogus", "-c", "x", "--help"}, *spec, &globals);
    EXPECT_TRUE(result.helpRequested);
    EXPECT_EQ(result.error, "");
}

TEST(ArgumentParser, RefusesDeclarationsItCannotCheck) {
    auto integerEnum = InputSpec::New();
    auto level = Param("level", PARAM_INT);
    level->SetConstraint(ParameterConstraint::New(CONSTRAINT_INT_ENUM));
    integerEnum->AddParameter(level);
    EXPECT_EQ(ParseArguments({"--level", "1"}, *integerEnum).error,
              "the command declares an integer enumeration for '--level', which this tool does "
              "not support");

    auto twice = InputSpec::New();
    twice->AddParameter(Param("name", PARAM_STRING));
    twice->AddParameter(Param("name", PARAM_INT));
    EXPECT_EQ(ParseArguments({}, *twice).error, "the command declares '--name' twice");
}

}  // namespace
}  // namespace FrameworkTest
