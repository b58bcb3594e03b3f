#include "commands/trace/TraceConfigFile.h"

#include <algorithm>
#include <sstream>

namespace OrvaneCli {
namespace MeskNamespace {

namespace {

// True iff the key's first occurrence in the line lies exactly at `position`.
bool KeyAt(const std::string& line, const char* key, std::string::size_type position) {
    return line.find(key) == position;
}

// True iff the line begins, at its very first character, with the key.
bool BeginsWith(const std::string& line, const char* key) {
    return line.rfind(key, 0) == 0;
}

// Stream extraction of a decimal number, or of a flag in numeric form ("0" or "1"): leading
// white space is skipped and reading stops at the first character that cannot belong to the
// value; a value that cannot be read gives what the extraction stores (0 or false).
template <typename T>
T Extract(const std::string& value) {
    T result{};
    std::istringstream stream(value);
    stream >> result;
    return result;
}

}  // namespace

TraceSettings ReadTraceSettings(std::istream& in) {
    TraceSettings settings;
    std::string line;
    while (std::getline(in, line)) {
        const auto equals = line.find('=');
        if (equals == std::string::npos) continue;
        const auto start = line.find_first_not_of(' ');
        const std::string value = line.substr(equals + 1);

        if (KeyAt(line, TRACE_KEY_LAST_SELECTED_VOLUME, start)) {
            std::string directory = value;
            directory.erase(std::remove(directory.begin(), directory.end(), '"'), directory.end());
            settings.directory = directory;
        } else if (KeyAt(line, TRACE_KEY_ROTATE_MAX_FILES, start)) {
            settings.maxFiles = Extract<int32_t>(value);
        } else if (KeyAt(line, TRACE_KEY_ROTATE_FILE_SIZE, start)) {
            settings.fileSizeMb = Extract<int32_t>(value);
        } else if (KeyAt(line, TRACE_KEY_LOG_URGENT_TO_SYSLOG, start)) {
            settings.logUrgentToSyslog = Extract<bool>(value);
        }
    }
    return settings;
}

std::vector<std::string> ReadTraceLines(std::istream& in) {
    std::vector<std::string> lines;
    std::string line;
    while (std::getline(in, line)) lines.push_back(line);
    return lines;
}

std::vector<std::string> RewriteTraceLines(const std::vector<std::string>& oldLines,
                                           const TraceChanges& changes) {
    std::vector<std::string> lines;
    for (const auto& line : oldLines) {
        if (changes.path && BeginsWith(line, TRACE_KEY_VOLUME)) continue;
        if (changes.maxFiles && BeginsWith(line, TRACE_KEY_ROTATE_MAX_FILES)) continue;
        if (changes.fileSizeMb && BeginsWith(line, TRACE_KEY_ROTATE_FILE_SIZE)) continue;
        if (changes.logUrgentToSyslog && BeginsWith(line, TRACE_KEY_LOG_URGENT_TO_SYSLOG)) {
            continue;
        }
        // A reset keeps only the comments, so that every setting falls back to its default.
        if (changes.reset && (line.empty() || line[0] != '#')) continue;
        lines.push_back(line);
    }

    // The path is written in double quotes as given: a quote inside it is not escaped.
    if (changes.path) lines.push_back(TRACE_KEY_VOLUME + ("\"" + *changes.path + "\""));
    if (changes.maxFiles) {
        lines.push_back(TRACE_KEY_ROTATE_MAX_FILES + std::to_string(*changes.maxFiles));
    }
    if (changes.logUrgentToSyslog) {
        lines.push_back(TRACE_KEY_LOG_URGENT_TO_SYSLOG +
                        std::string(*changes.logUrgentToSyslog ? "1" : "0"));
    }
    if (changes.fileSizeMb) {
        lines.push_back(TRACE_KEY_ROTATE_FILE_SIZE + std::to_string(*changes.fileSizeMb));
    }
    return lines;
}

}  // namespace MeskNamespace
}  // namespace OrvaneCli
