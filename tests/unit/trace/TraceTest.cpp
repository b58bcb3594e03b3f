#include <stdlib.h>
#include <sys/resource.h>

#include <climits>
#include <csignal>
#include <filesystem>
#include <fstream>
#include <map>
#include <sstream>

#include "MockHost.h"
#include "commands/trace/MeskTraceGet.h"
#include "commands/trace/MeskTraceSet.h"
#include "commands/trace/TraceConfigFile.h"
#include "commands/trace/TraceRestartWait.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using namespace MeskTest;
using ::testing::_;

namespace fs = std::filesystem;

// A scripted answer of the service script that throws instead of returning a status.
constexpr int32_t THROWS = INT32_MIN;

const char* const DEFAULT_CONFIG =
    "# tracing service settings\n"
    "MESKTRACED_LAST_SELECTED_VOLUME=\"/scratch/mesktrace\"\n"
    "MESKTRACED_ROTATE_MAX_FILES=8\n"
    "\n"
    "MESKTRACED_ROTATE_FILE_SIZE=45\n"
    "MESKTRACED_LOG_URGENT_TO_SYSLOG=1\n";

// Runs the commands in a host root of their own, with a scripted service script and a wait
// that only records how long it was asked to wait.
class TraceCommandTest : public HostTest {
  protected:
    void SetUp() override {
        std::string pattern = (fs::temp_directory_path() / "mesk-trace-XXXXXX").string();
        ASSERT_NE(mkdtemp(pattern.data()), nullptr);
        root_ = pattern;
        fs::create_directories(root_ / "etc/orvane/mesk");
        setenv("MESK_HOST_ROOT", root_.c_str(), 1);
        SetRestartWait([this](unsigned seconds) { waits.push_back(seconds); });
        // Any run of another script, or with other flags, is an unexpected call. The script
        // gives for a verb its scripted answers in turn, the last repeated.
        EXPECT_CALL(host, MeskExec("/etc/init.d/mesktraced", _, false, true, false))
            .Times(::testing::AnyNumber())
            .WillRepeatedly([this](const std::string&, const std::string& verb, bool, bool, bool) {
                runs += verb + " ";
                auto& script = answers[verb];
                const int32_t answer = script.empty() ? 0 : script.front();
                if (script.size() > 1) script.erase(script.begin());
                if (answer == THROWS) throw HostCtl::Lib::Mesk::MeskCtlException("exec failed.");
                return answer;
            });
        WriteConfig(DEFAULT_CONFIG);
    }
    void TearDown() override {
        SetRestartWait({});
        unsetenv("MESK_HOST_ROOT");
        fs::remove_all(root_);
    }

    fs::path ConfigPath() const { return root_ / "etc/orvane/mesk/mesktraced.conf"; }
    void WriteConfig(const std::string& text) { std::ofstream(ConfigPath()) << text; }
    std::string ReadConfig() const {
        std::ostringstream text;
        text << std::ifstream(ConfigPath()).rdbuf();
        return text.str();
    }

    std::map<std::string, std::vector<int32_t>> answers;
    std::string runs;
    std::vector<unsigned> waits;

  private:
    fs::path root_;
};

// The service is checked first: a stopped one is reported even without a file.
TEST_F(TraceCommandTest, GetReportsTheFileOnceTheServiceRuns) {
    const std::string none = "; no result, incomplete";
    const struct {
        int32_t status;
        bool fileExists;
        std::string outcome;
    } cases[] = {
        {1, true,
         "{MESK Traces Directory=/scratch/mesktrace, Number Of Files To Rotate=12, "
         "Maximum Trace File Size=45, Log Urgent Traces To Syslog=true}, complete"},
        {-1, true,
         "Checking mesktraced status failed.Refer to /var/log/syslog.log for details." + none},
        {THROWS, true, "exec failed.Refer to /var/log/syslog.log for details." + none},
        {3, false, "Mesk is not enabled on this host." + none},
        {0, false, "Error opening Mesk trace config file for reading." + none},
    };
    for (const auto& c : cases) {
        fs::remove(ConfigPath());
        if (c.fileExists)
            WriteConfig(DEFAULT_CONFIG + std::string("  MESKTRACED_ROTATE_MAX_FILES=12\n"));
        answers["status"] = {c.status};
        runs.clear();
        EXPECT_EQ(Outcome(*Run(*MeskTraceGet::New())), c.outcome);
        EXPECT_EQ(runs, "status ");
    }
}

// The size is checked as soon as it is read, even beside reset.
TEST_F(TraceCommandTest, SetRefusesBadOptionsBeforeTouchingFileOrService) {
    const struct {
        std::string options, message;
    } cases[] = {
        {"", "No options provided."},
        {"reset=false", "No options provided."},
        {"reset=false numfiles=3", "reset cannot be used with other options."},
        {"size=0", "File size should be < 4096 MB."},
        {"size=4096", "File size should be < 4096 MB."},
        {"size=0 reset=true", "File size should be < 4096 MB."},
    };
    for (const auto& c : cases) {
        EXPECT_EQ(Outcome(*Run(*MeskTraceSet::New(), c.options)),
                  c.message + "; no result, incomplete");
    }
    EXPECT_EQ(ReadConfig(), DEFAULT_CONFIG);
    EXPECT_EQ(runs, "");
}

// Failed restarts are tried up to eight times, 5 seconds apart; a stopped service is not
// restarted at all. The new file stays whatever the service does; one that cannot be written
// leaves the service alone.
TEST_F(TraceCommandTest, SetRestartsTheServiceAfterWritingTheFile) {
    std::string eightFailures;
    for (int i = 0; i < 8; ++i) eightFailures += "Failed to restart mesktraced: 1; ";
    const std::string refer = " Refer /var/log/syslog.log for details.; no result, incomplete";
    const std::string restarts8 =
        "restart restart restart restart restart restart restart restart ";
    const struct {
        int32_t status;
        std::vector<int32_t> restarts;
        std::string runs;
        size_t waits;
        std::string outcome;
    } cases[] = {
        {3, {1}, "status ", 0, "true, complete"},
        {-1, {0}, "status ", 0, "Failed to check mesktraced status." + refer},
        {0, {1}, "status " + restarts8, 7, eightFailures + refer},
        {0, {2, -1, 0}, "status restart restart restart ", 2, "true, complete"},
        {0, {1, THROWS}, "status restart restart ", 1, "exec failed." + refer},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.runs);
        WriteConfig(DEFAULT_CONFIG);
        answers = {{"status", {c.status}}, {"restart", c.restarts}};
        runs.clear(), waits.clear();
        EXPECT_EQ(Outcome(*Run(*MeskTraceSet::New(), "numfiles=3")), c.outcome);
        EXPECT_THAT(ReadConfig(), ::testing::EndsWith("\nMESKTRACED_ROTATE_MAX_FILES=3\n"));
        EXPECT_EQ(runs, c.runs);
        EXPECT_EQ(waits, std::vector<unsigned>(c.waits, 5));
    }
    // A directory in the file's place can be opened for reading but not for writing.
    fs::remove(ConfigPath());
    fs::create_directory(ConfigPath());
    runs.clear();
    const std::string cannotWrite =
        "Error opening Mesk Trace Config File for writing.; no result, incomplete";
    EXPECT_EQ(Outcome(*Run(*MeskTraceSet::New(), "numfiles=3")), cannotWrite);
    // A write that fails after the truncation (past the file size limit here, as on a full
    // file system) is reported alike and puts the old text back byte for byte.
    fs::remove(ConfigPath());
    const std::string old = DEFAULT_CONFIG + std::string("# no newline at the end");
    WriteConfig(old);
    rlimit saved{};
    getrlimit(RLIMIT_FSIZE, &saved);
    const rlimit small{4096, saved.rlim_max};
    signal(SIGXFSZ, SIG_IGN);  // a write past the limit fails instead of killing us
    setrlimit(RLIMIT_FSIZE, &small);
    const std::string outcome =
        Outcome(*Run(*MeskTraceSet::New(), "path=" + std::string(8192, 'p')));
    setrlimit(RLIMIT_FSIZE, &saved);
    EXPECT_EQ(outcome, cannotWrite);
    EXPECT_EQ(ReadConfig(), old);
    EXPECT_EQ(runs, "");
}

// The settings read from `text`, as "directory|files|size|syslog".
std::string Read(const std::string& text) {
    std::istringstream in(text);
    const TraceSettings s = ReadTraceSettings(in);
    return s.directory + "|" + std::to_string(s.maxFiles) + "|" + std::to_string(s.fileSizeMb) +
           "|" + (s.logUrgentToSyslog ? "1" : "0");
}

TEST(TraceConfigFile, ReadRecognisesKeysOnlyAtTheFirstNonSpaceCharacter) {
    const std::string defaults = "No volume selected.|8|45|1";
    const struct {
        const char* text;
        std::string expected;
    } cases[] = {
        {"", defaults},
        {"#MESKTRACED_ROTATE_MAX_FILES=3\n", defaults},
        {"   MESKTRACED_ROTATE_MAX_FILES=3\n", "No volume selected.|3|45|1"},
        {"\tMESKTRACED_ROTATE_MAX_FILES=3\n", defaults},
        {"MESKTRACED_LAST_SELECTED_VOLUME=\"/a\"b\" \n", "/ab |8|45|1"},
        {"MESKTRACED_VOLUME=\"/new\"\n", defaults},
        {"MESKTRACED_ROTATE_FILE_SIZE=10\nMESKTRACED_ROTATE_FILE_SIZE=20\n",
         "No volume selected.|8|20|1"},
        {"MESKTRACED_LOG_URGENT_TO_SYSLOG=0\n", "No volume selected.|8|45|0"},
        {"MESKTRACED_ROTATE_MAX_FILES= 12MB\nMESKTRACED_ROTATE_FILE_SIZE=big\n",
         "No volume selected.|12|0|1"},
        // The value starts after the line's first equals sign; the second key is part of it.
        {"MESKTRACED_ROTATE_MAX_FILES=MESKTRACED_ROTATE_FILE_SIZE=7\n",
         "No volume selected.|0|45|1"},
    };
    for (const auto& c : cases) EXPECT_EQ(Read(c.text), c.expected) << c.text;
}

// Replaced settings go, unless indented; the new ones are appended in the order path, file
// count, syslog flag, size. A reset keeps only the comments.
TEST(TraceConfigFile, RewriteDropsReplacedSettingsAndAppendsTheNewOnesInOrder) {
    const std::vector<std::string> old = {
        "# trace settings",
        "",
        "MESKTRACED_VOLUME=\"/old\"",
        "MESKTRACED_LAST_SELECTED_VOLUME=\"/old\"",
        "MESKTRACED_ROTATE_MAX_FILES=8",
        " MESKTRACED_ROTATE_FILE_SIZE=45",
        "MESKTRACED_ROTATE_FILE_SIZE=45",
        "MESKTRACED_LOG_URGENT_TO_SYSLOG=1",
        "#MESKTRACED_ROTATE_MAX_FILES=3",
    };
    TraceChanges changes;
    changes.path = "/new", changes.fileSizeMb = 20, changes.logUrgentToSyslog = false;
    EXPECT_EQ(RewriteTraceLines(old, changes),
              (std::vector<std::string>{
                  "# trace settings", "", "MESKTRACED_LAST_SELECTED_VOLUME=\"/old\"",
                  "MESKTRACED_ROTATE_MAX_FILES=8", " MESKTRACED_ROTATE_FILE_SIZE=45",
                  "#MESKTRACED_ROTATE_MAX_FILES=3", "MESKTRACED_VOLUME=\"/new\"",
                  "MESKTRACED_LOG_URGENT_TO_SYSLOG=0", "MESKTRACED_ROTATE_FILE_SIZE=20"}));
    TraceChanges reset;
    reset.reset = true;
    EXPECT_EQ(RewriteTraceLines(old, reset),
              (std::vector<std::string>{"# trace settings", "#MESKTRACED_ROTATE_MAX_FILES=3"}));
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
