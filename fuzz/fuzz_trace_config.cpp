// Fuzzes the reading and rewriting of the tracing service's file.
//
// The input's first bytes choose the changes that trace set would make (and the path value);
// the rest is the file's text. Besides never crashing, a rewrite must keep what it promises:
// unchanged lines stay as they were, every new setting reads back as written, a path without
// a line break adds exactly one line, and a reset leaves only the defaults.
#include <fuzzer/FuzzedDataProvider.h>

#include <cstdint>
#include <cstdlib>
#include <sstream>
#include <string>
#include <vector>

#include "FuzzCheck.h"
#include "commands/trace/TraceConfigFile.h"

using OrvaneCli::MeskNamespace::ReadTraceLines;
using OrvaneCli::MeskNamespace::ReadTraceSettings;
using OrvaneCli::MeskNamespace::RewriteTraceLines;
using OrvaneCli::MeskNamespace::TraceChanges;
using OrvaneCli::MeskNamespace::TraceSettings;

namespace {

std::string Joined(const std::vector<std::string>& lines) {
    std::string text;
    for (const auto& line : lines) text += line + "\n";
    return text;
}

TraceSettings Settings(const std::string& text) {
    std::istringstream in(text);
    return ReadTraceSettings(in);
}

std::vector<std::string> Lines(const std::string& text) {
    std::istringstream in(text);
    return ReadTraceLines(in);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    FuzzedDataProvider in(data, size);
    TraceChanges changes;
    const uint8_t which = in.ConsumeIntegral<uint8_t>();
    changes.reset = (which & 0x10) != 0;
    if (!changes.reset) {
        if (which & 0x01) changes.path = in.ConsumeRandomLengthString(64);
        if (which & 0x02) changes.maxFiles = in.ConsumeIntegral<int32_t>();
        if (which & 0x04) changes.fileSizeMb = in.ConsumeIntegral<int32_t>();
        if (which & 0x08) changes.logUrgentToSyslog = in.ConsumeBool();
    }
    const std::string text = in.ConsumeRemainingBytesAsString();

    const TraceSettings before = Settings(text);
    const std::vector<std::string> oldLines = Lines(text);
    const std::vector<std::string> newLines = RewriteTraceLines(oldLines, changes);
    const std::string rewritten = Joined(newLines);
    const TraceSettings after = Settings(rewritten);

    // A value with a line break of its own adds a line to the file; the framework refuses
    // such values before trace set sees them, so only the other promises hold for it.
    bool lineBreak = false;
    for (const auto& line : newLines) lineBreak = lineBreak || line.find('\n') != std::string::npos;

    const bool anyChange = changes.reset || changes.path || changes.maxFiles ||
                           changes.fileSizeMb || changes.logUrgentToSyslog;
    if (!anyChange) {
        FUZZ_CHECK(newLines == oldLines);
    }
    if (changes.maxFiles) FUZZ_CHECK(after.maxFiles == *changes.maxFiles);
    if (changes.fileSizeMb) FUZZ_CHECK(after.fileSizeMb == *changes.fileSizeMb);
    if (changes.logUrgentToSyslog)
        FUZZ_CHECK(after.logUrgentToSyslog == *changes.logUrgentToSyslog);
    // trace set never writes the key that trace get reads the directory from.
    if (!changes.reset && !lineBreak) FUZZ_CHECK(after.directory == before.directory);
    if (changes.reset) {
        const TraceSettings defaults;
        FUZZ_CHECK(after.directory == defaults.directory && after.maxFiles == defaults.maxFiles &&
                   after.fileSizeMb == defaults.fileSizeMb &&
                   after.logUrgentToSyslog == defaults.logUrgentToSyslog);
    }
    // The file read back has exactly the lines written.
    if (!lineBreak) FUZZ_CHECK(Lines(rewritten) == newLines);
    return 0;
}
