#include "ArgumentParser.h"

#include <gtest/gtest.h>

#include "unit/framework/TestCommand.h"

namespace FrameworkTest {
namespace {

using Kalmor::AutoCli::App::GlobalOptions;
using Kalmor::AutoCli::App::ParseArguments;
using Kalmor::AutoCli::App::ParseResult;
using namespace Kalmor::CallSpec;

// The parsed values as "name=v1|v2;..." in name order; a flag shows as "name=".
std::string Values(const Input& input) {
    std::string text;
    for (const auto& entry : input.GetValues()) {
        text += (text.empty() ? "" : ";") + entry.first + "=";
        for (size_t i = 0; i < entry.second.size(); ++i) text += (i ? "|" : "") + entry.second[i];
    }
    return text;
}

TEST(ArgumentParser, TakesEverySpellingOfEveryKind) {
    const std::vector<std::pair<std::vector<std::string>, std::string>> cases = {
        {{"-nbob", "-c", "0", "--loud", "FALSE", "-w"}, "count=0;loud=false;name=bob;wave="},
        {{"--name=", "--count=512", "-l1"}, "count=512;loud=true;name="},
        // A value that looks like an option is taken unless it names one.
        {{"-n", "-x"}, "name=-x"},
        {{"-n", "a\tb", "--count", "+07"}, "count=7;name=a\tb"},
        {{"-n", "a", "--big", "-9223372036854775808"}, "big=-9223372036854775808;name=a"},
        {{"-i", "x", "-n", "a", "--item=y", "-iz", "-r", "node"}, "item=x|y|z;name=a;role=node"},
    };
    auto spec = EveryKind();
    for (const auto& [words, values] : cases) {
        ParseResult result = ParseArguments(words, *spec);
        EXPECT_EQ(result.error, "") << ::testing::PrintToString(words);
        EXPECT_EQ(Values(*result.input), values) << ::testing::PrintToString(words);
    }
}

TEST(ArgumentParser, RefusesBadInputWithOneMessage) {
    const std::string oneLine =
        "contains a control character; values must be a single line of text";
    const std::vector<std::pair<std::vector<std::string>, std::string>> cases = {
        {{"-w"}, "missing required option '--name'"},
        {{"-n", "a", "--bogus=1"}, "unknown option '--bogus'"},
        {{"-n", "a", "--lod", "1"}, "unknown option '--lod' (did you mean '--loud'?)"},
        {{"-n", "a", "stray"}, "unexpected argument 'stray'"},
        {{"--name", "--wave"}, "option '--name' needs a value"},
        {{"-n", "a", "-c", " 5"}, "option '--count' needs a decimal integer (got ' 5')"},
        {{"-n", "a", "--big", "9223372036854775808"},
         "option '--big' is out of the 64-bit integer range (got '9223372036854775808')"},
        {{"-n", "a", "--count=513"}, "option '--count' must be between 0 and 512 (got '513')"},
        {{"-n", "a", "--loud", "maybe"}, "option '--loud' needs true or false (got 'maybe')"},
        {{"-n", "a", "--loud"}, "option '--loud' needs a value: true or false"},
        {{"-n", "a", "--wave=yes"}, "option '--wave' takes no value"},
        {{"-n", "a", "-r", "Node"}, "option '--role' must be one of witness, node (got 'Node')"},
        {{"-n", "a", "--name", "b"}, "option '--name' given more than once"},
        {{"-n", "a", "-w", "--wave"}, "option '--wave' given more than once"},
        {{"-n", "a\nb"}, "option '--name' " + oneLine},
        {{"-n", std::string("a\0b", 3)}, "option '--name' " + oneLine},
        // A value echoed in a message stays on one line and cannot drive the terminal.
        {{"-n", "a", "--loud", "\x1b[31mtrue"},
         "option '--loud' needs true or false (got '\\x1b[31mtrue')"},
        {{"-n", "a", "st\nray\xff"}, "unexpected argument 'st\\nray\xEF\xBF\xBD'"},
        // The first problem is the one reported.
        {{"-c", "x", "--bogus"}, "option '--count' needs a decimal integer (got 'x')"},
    };
    auto spec = EveryKind();
    for (const auto& [words, message] : cases) {
        ParseResult result = ParseArguments(words, *spec);
        EXPECT_EQ(result.error, message) << ::testing::PrintToString(words);
        EXPECT_FALSE(result.helpRequested) << ::testing::PrintToString(words);
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
    EXPECT_EQ(globals.formatter, "json");
    EXPECT_TRUE(globals.noHeader && globals.debug);
    EXPECT_FALSE(globals.fieldsGiven);
    EXPECT_EQ(Values(*result.input), "fields=a,b;host=x");
    GlobalOptions fresh;
    EXPECT_EQ(ParseArguments({"--formatter"}, *spec, &fresh).error,
              "option '--formatter' needs a value");
    EXPECT_EQ(ParseArguments({"--debug", "--debug"}, *spec, &fresh).error,
              "option '--debug' given more than once");
}

// A request for documentation describes the command without checking the words around it, and
// a help flag where a value belongs is a request for help, not a value.
TEST(ArgumentParser, DocumentationRequestsSkipValidation) {
    auto spec = EveryKind();
    for (const std::vector<std::string>& words : std::vector<std::vector<std::string>>{
             {"--reference"}, {"--list-commands", "-c", "x"}, {"-n", "-h"}, {"-c", "--help"}}) {
        GlobalOptions globals;
        ParseResult result = ParseArguments(words, *spec, &globals);
        EXPECT_EQ(result.error, "") << ::testing::PrintToString(words);
        EXPECT_TRUE(result.documentationRequested) << ::testing::PrintToString(words);
    }
    // Every missing required option is named at once.
    auto two = InputSpec::New();
    two->AddParameter(Param("ssd", PARAM_STRING, "", true));
    two->AddParameter(Param("disks", PARAM_STRING_LIST, "", true));
    EXPECT_EQ(ParseArguments({}, *two).error, "missing required options '--ssd', '--disks'");
}

TEST(ArgumentParser, RefusesDeclarationsItCannotCheck) {
    auto integerEnum = InputSpec::New();
    integerEnum->AddParameter(
        Param("level", PARAM_INT, "", false, "", ParameterConstraint::New(CONSTRAINT_INT_ENUM)));
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
