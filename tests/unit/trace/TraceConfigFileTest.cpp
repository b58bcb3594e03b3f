#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <sstream>

#include "commands/trace/TraceConfigFile.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using ::testing::ElementsAreArray;

TraceSettings Settings(std::string directory, int32_t maxFiles, int32_t fileSizeMb, bool syslog) {
    return TraceSettings{std::move(directory), maxFiles, fileSizeMb, syslog};
}

TEST(TraceConfigFile, ReadRecognisesKeysOnlyAtTheFirstNonSpaceCharacter) {
    const TraceSettings defaults;
    const struct {
        const char* text;
        TraceSettings expected;
    } cases[] = {
        {"", defaults},
        {"#MESKTRACED_ROTATE_MAX_FILES=3\n", defaults},
        {"   MESKTRACED_ROTATE_MAX_FILES=3\n", Settings("No volume selected.", 3, 45, true)},
        {"\tMESKTRACED_ROTATE_MAX_FILES=3\n", defaults},
        {"X=1 MESKTRACED_ROTATE_MAX_FILES=3\n", defaults},
        {"MESKTRACED_ROTATE_MAX_FILES 3\n", defaults},
        {"MESKTRACED_LAST_SELECTED_VOLUME=\"/scratch/trace\"\n",
         Settings("/scratch/trace", 8, 45, true)},
        {"MESKTRACED_LAST_SELECTED_VOLUME=\"/a\"b\" \n", Settings("/ab ", 8, 45, true)},
        {"MESKTRACED_LAST_SELECTED_VOLUME=/x=y", Settings("/x=y", 8, 45, true)},
        {"MESKTRACED_VOLUME=\"/new\"\n", defaults},
        {"MESKTRACED_ROTATE_FILE_SIZE=10\nMESKTRACED_ROTATE_FILE_SIZE=20\n",
         Settings("No volume selected.", 8, 20, true)},
        {"MESKTRACED_LOG_URGENT_TO_SYSLOG=0\n", Settings("No volume selected.", 8, 45, false)},
        {"MESKTRACED_LOG_URGENT_TO_SYSLOG=0\nMESKTRACED_LOG_URGENT_TO_SYSLOG=1\n", defaults},
        {"MESKTRACED_LOG_URGENT_TO_SYSLOG=yes\n", Settings("No volume selected.", 8, 45, false)},
        {"MESKTRACED_ROTATE_MAX_FILES= 12MB\nMESKTRACED_ROTATE_FILE_SIZE=big\n",
         Settings("No volume selected.", 12, 0, true)},
        // The value starts after the line's first equals sign; the second key is part of it.
        {"MESKTRACED_ROTATE_MAX_FILES=MESKTRACED_ROTATE_FILE_SIZE=7\n",
         Settings("No volume selected.", 0, 45, true)},
    };
    for (const auto& c : cases) {
        std::istringstream in(c.text);
        const TraceSettings got = ReadTraceSettings(in);
        SCOPED_TRACE(c.text);
        EXPECT_EQ(got.directory, c.expected.directory);
        EXPECT_EQ(got.maxFiles, c.expected.maxFiles);
        EXPECT_EQ(got.fileSizeMb, c.expected.fileSizeMb);
        EXPECT_EQ(got.logUrgentToSyslog, c.expected.logUrgentToSyslog);
    }
}

TEST(TraceConfigFile, RewriteDropsReplacedSettingsAndAppendsTheNewOnesInOrder) {
    TraceChanges size;
    size.fileSizeMb = 20;
    TraceChanges all;
    all.path = "/p\"q";
    all.maxFiles = 4;
    all.fileSizeMb = 4095;
    all.logUrgentToSyslog = false;
    TraceChanges reset;
    reset.reset = true;

    const std::vector<std::string> mixed = {
        "# trace settings",
        "",
        "MESKTRACED_VOLUME=\"/old\"",
        "MESKTRACED_LAST_SELECTED_VOLUME=\"/old\"",
        "MESKTRACED_ROTATE_MAX_FILES=8",
        " MESKTRACED_ROTATE_FILE_SIZE=45",
        "MESKTRACED_ROTATE_FILE_SIZE=45",
        "MESKTRACED_LOG_URGENT_TO_SYSLOG=1",
        " # indented",
        "#MESKTRACED_ROTATE_MAX_FILES=3",
        "OTHER=1",
    };
    const struct {
        const char* name;
        TraceChanges changes;
        std::vector<std::string> expected;
    } cases[] = {
        {"size keeps the indented line",
         size,
         {"# trace settings", "", "MESKTRACED_VOLUME=\"/old\"",
          "MESKTRACED_LAST_SELECTED_VOLUME=\"/old\"", "MESKTRACED_ROTATE_MAX_FILES=8",
          " MESKTRACED_ROTATE_FILE_SIZE=45", "MESKTRACED_LOG_URGENT_TO_SYSLOG=1", " # indented",
          "#MESKTRACED_ROTATE_MAX_FILES=3", "OTHER=1", "MESKTRACED_ROTATE_FILE_SIZE=20"}},
        {"all four",
         all,
         {"# trace settings", "", "MESKTRACED_LAST_SELECTED_VOLUME=\"/old\"",
          " MESKTRACED_ROTATE_FILE_SIZE=45", " # indented", "#MESKTRACED_ROTATE_MAX_FILES=3",
          "OTHER=1", "MESKTRACED_VOLUME=\"/p\"q\"", "MESKTRACED_ROTATE_MAX_FILES=4",
          "MESKTRACED_LOG_URGENT_TO_SYSLOG=0", "MESKTRACED_ROTATE_FILE_SIZE=4095"}},
        {"reset", reset, {"# trace settings", "#MESKTRACED_ROTATE_MAX_FILES=3"}},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        EXPECT_THAT(RewriteTraceLines(mixed, c.changes), ElementsAreArray(c.expected));
    }
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
