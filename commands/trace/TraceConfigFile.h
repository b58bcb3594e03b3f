// The tracing service's configuration file, as the trace commands read and rewrite it, and the
// service's control script.
//
// The file is plain text, one KEY=value setting per line; lines whose first character is '#'
// are comments. These functions work on text only and touch no file, so that the commands
// keep their own order of opening, reporting and service handling.
#pragma once

#include <cstdint>
#include <istream>
#include <optional>
#include <string>
#include <vector>

namespace OrvaneCli {
namespace MeskNamespace {

// Where the file lives on the host (opened through HostPath), and the service's control
// script (run through MeskExec with exactly this path).
inline constexpr char TRACE_CONFIG_FILE[] = "/etc/orvane/mesk/mesktraced.conf";
inline constexpr char TRACE_SERVICE_SCRIPT[] = "/etc/init.d/mesktraced";

// Keys of the file, each with its equals sign.
inline constexpr char TRACE_KEY_LAST_SELECTED_VOLUME[] =  // read by trace get, never written
    "MESKTRACED_LAST_SELECTED_VOLUME=";
inline constexpr char TRACE_KEY_VOLUME[] = "MESKTRACED_VOLUME=";  // written, never read
inline constexpr char TRACE_KEY_ROTATE_MAX_FILES[] = "MESKTRACED_ROTATE_MAX_FILES=";
inline constexpr char TRACE_KEY_ROTATE_FILE_SIZE[] = "MESKTRACED_ROTATE_FILE_SIZE=";
inline constexpr char TRACE_KEY_LOG_URGENT_TO_SYSLOG[] = "MESKTRACED_LOG_URGENT_TO_SYSLOG=";

// The settings that trace get reports; a key absent from the file keeps its default.
struct TraceSettings {
    std::string directory = "No volume selected.";
    int32_t maxFiles = 8;
    int32_t fileSizeMb = 45;
    bool logUrgentToSyslog = true;
};

// Reads the settings from the file's text to its end. A key counts only when it begins at the
// line's first character other than a space (a leading tab hides it); its value is what
// follows the line's first equals sign. The last line for a key wins. Numbers and the flag are
// taken by stream extraction, so a value without leading digits gives 0 or false.
TraceSettings ReadTraceSettings(std::istream& in);

// What trace set was given; reset excludes the others.
struct TraceChanges {
    std::optional<std::string> path;
    std::optional<int32_t> maxFiles;
    std::optional<int32_t> fileSizeMb;
    std::optional<bool> logUrgentToSyslog;
    bool reset = false;
};

// Every line of the text, without its newline.
std::vector<std::string> ReadTraceLines(std::istream& in);

// The lines of the rewritten file: the old lines that survive, in order, then one line per
// given setting in the order path, file count, syslog flag, size. An old line is dropped when
// it begins at its very first character with a key that is being set (so an indented setting
// is kept), and on reset when it is not a comment (empty lines included).
std::vector<std::string> RewriteTraceLines(const std::vector<std::string>& oldLines,
                                           const TraceChanges& changes);

}  // namespace MeskNamespace
}  // namespace OrvaneCli
