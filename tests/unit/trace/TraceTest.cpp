#include <stdlib.h>

#include <climits>
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

using Kalmor::CallSpec::Input;
using namespace MeskTest;
using ::testing::_;
using ::testing::ElementsAre;
using ::testing::IsEmpty;

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

std::shared_ptr<Input> Options(const std::map<std::string, std::string>& values) {
    auto input = Input::New();
    for (const auto& [name, value] : values) input->SetParameter(name, value);
    return input;
}

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
                runs.push_back(verb);
                auto& script = answers[verb];
                const int32_t answer = script.empty() ? 0 : script.front();
                if (script.size() > 1) script.erase(script.begin());
                if (answer == THROWS) throw HostCtl::Lib::Mesk::MeskCtlException("exec failed.");
                return answer;
            });
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
    static void ExpectFailedWith(const Kalmor::CallSpec::Output& output,
                                 const std::string& message) {
        EXPECT_THAT(Errors(output), ElementsAre(message));
        EXPECT_TRUE(output.GetRootObject() == nullptr && !output.IsComplete());
    }

    std::map<std::string, std::vector<int32_t>> answers;
    std::vector<std::string> runs;
    std::vector<unsigned> waits;

  private:
    fs::path root_;
};

TEST_F(TraceCommandTest, GetReportsTheFileOnceTheServiceRuns) {
    WriteConfig(DEFAULT_CONFIG + std::string("   MESKTRACED_ROTATE_MAX_FILES=12\n"));
    answers["status"] = {1};
    auto output = Run(*MeskTraceGet::New());
    EXPECT_TRUE(Errors(*output).empty() && output->IsComplete());
    auto result = output->GetRootObject();
    EXPECT_EQ(TextField(result, "MESK Traces Directory"), "/scratch/mesktrace");
    EXPECT_EQ(IntField(result, "Number Of Files To Rotate"), 12);
    EXPECT_EQ(IntField(result, "Maximum Trace File Size"), 45);
    EXPECT_TRUE(BoolField(result, "Log Urgent Traces To Syslog"));
    EXPECT_THAT(runs, ElementsAre("status"));
}

TEST_F(TraceCommandTest, GetFailuresGiveOneMessageAndNoResult) {
    const struct {
        int32_t status;
        bool fileExists;
        const char* message;
    } cases[] = {
        {-1, true, "Checking mesktraced status failed.Refer to /var/log/syslog.log for details."},
        {THROWS, true, "exec failed.Refer to /var/log/syslog.log for details."},
        // The service is checked first: a stopped one is reported even without a file.
        {3, false, "Mesk is not enabled on this host."},
        {0, false, "Error opening Mesk trace config file for reading."},
    };
    for (const auto& c : cases) {
        fs::remove(ConfigPath());
        if (c.fileExists) WriteConfig(DEFAULT_CONFIG);
        answers["status"] = {c.status};
        ExpectFailedWith(*Run(*MeskTraceGet::New()), c.message);
    }
}

TEST_F(TraceCommandTest, SetRefusesBadOptionsBeforeTouchingFileOrService) {
    const struct {
        std::map<std::string, std::string> options;
        const char* message;
    } cases[] = {
        {{}, "No options provided."},
        {{{"reset", "false"}}, "No options provided."},
        {{{"reset", "false"}, {"numfiles", "3"}}, "reset cannot be used with other options."},
        {{{"size", "0"}}, "File size should be < 4096 MB."},
        {{{"size", "4096"}}, "File size should be < 4096 MB."},
        {{{"size", "0"}, {"reset", "true"}}, "File size should be < 4096 MB."},
    };
    WriteConfig(DEFAULT_CONFIG);
    for (const auto& c : cases)
        ExpectFailedWith(*Run(*MeskTraceSet::New(), Options(c.options)), c.message);
    EXPECT_EQ(ReadConfig(), DEFAULT_CONFIG);
    EXPECT_THAT(runs, IsEmpty());
}

TEST_F(TraceCommandTest, SetThatCannotWriteTheFileLeavesTheServiceAlone) {
    // A directory in the file's place can be opened for reading but not for writing.
    fs::create_directory(ConfigPath());
    ExpectFailedWith(*Run(*MeskTraceSet::New(), Options({{"numfiles", "3"}})),
                     "Error opening Mesk Trace Config File for writing.");
    EXPECT_THAT(runs, IsEmpty());
}

// Failed restarts are retried up to eight times, 5 seconds apart; a stopped service is not
// restarted at all. The new file stays whatever the service does.
TEST_F(TraceCommandTest, SetChecksAndRestartsTheServiceAfterWritingTheFile) {
    std::string eightFailures;
    for (int i = 0; i < 8; ++i) eightFailures += "Failed to restart mesktraced: 1; ";
    const std::string refer = " Refer /var/log/syslog.log for details.";
    const struct {
        int32_t status;
        std::vector<int32_t> restarts;
        size_t restartRuns;
        std::string message;  // empty on success
    } cases[] = {
        {3, {1}, 0, ""},
        {-1, {0}, 0, "Failed to check mesktraced status." + refer},
        {0, {1}, 8, eightFailures + refer},
        {0, {2, -1, 0}, 3, ""},
        {0, {1, THROWS}, 2, "exec failed." + refer},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.restartRuns);
        WriteConfig(DEFAULT_CONFIG);
        answers = {{"status", {c.status}}, {"restart", c.restarts}};
        runs.clear();
        waits.clear();
        auto output = Run(*MeskTraceSet::New(), Options({{"numfiles", "3"}}));
        EXPECT_THAT(ReadConfig(), ::testing::EndsWith("\nMESKTRACED_ROTATE_MAX_FILES=3\n"));
        std::vector<std::string> expectedRuns = {"status"};
        expectedRuns.resize(1 + c.restartRuns, "restart");
        EXPECT_EQ(runs, expectedRuns);
        EXPECT_EQ(waits, std::vector<unsigned>(c.restartRuns > 0 ? c.restartRuns - 1 : 0, 5));
        if (c.message.empty()) {
            EXPECT_TRUE(Errors(*output).empty() && BoolResult(*output) && output->IsComplete());
        } else {
            ExpectFailedWith(*output, c.message);
        }
    }
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

TEST(TraceConfigFile, RewriteDropsReplacedSettingsAndAppendsTheNewOnesInOrder) {
    TraceChanges size;
    size.fileSizeMb = 20;
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
        {"reset", reset, {"# trace settings", "#MESKTRACED_ROTATE_MAX_FILES=3"}},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        EXPECT_EQ(RewriteTraceLines(mixed, c.changes), c.expected);
    }
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
