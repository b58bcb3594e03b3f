#include <stdlib.h>

#include <climits>
#include <filesystem>
#include <fstream>
#include <map>
#include <sstream>

#include "MockHost.h"
#include "commands/trace/MeskTraceGet.h"
#include "commands/trace/MeskTraceSet.h"
#include "commands/trace/TraceRestartWait.h"

namespace OrvaneCli {
namespace MeskNamespace {
namespace {

using HostCtl::Lib::Mesk::MeskCtlException;
using Kalmor::CallSpec::Input;
using MeskTest::BoolField;
using MeskTest::BoolResult;
using MeskTest::Errors;
using MeskTest::FieldNames;
using MeskTest::HostTest;
using MeskTest::IntField;
using MeskTest::TextField;
using ::testing::_;
using ::testing::AnyNumber;
using ::testing::ElementsAre;
using ::testing::ElementsAreArray;
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

// Runs the commands in a host root of their own, with a scripted service script and a wait
// that only records how long it was asked to wait.
class TraceCommandTest : public HostTest {
  protected:
    void SetUp() override {
        std::string pattern = (fs::temp_directory_path() / "mesk-trace-XXXXXX").string();
        ASSERT_NE(mkdtemp(pattern.data()), nullptr);
        root_ = pattern;
        fs::create_directories(root_ / "etc/orvane/mesk");
        if (const char* old = getenv("MESK_HOST_ROOT")) oldRoot_ = old;
        setenv("MESK_HOST_ROOT", root_.c_str(), 1);
        SetRestartWait([this](unsigned seconds) { waits.push_back(seconds); });

        // Any run of another script, or with other flags, is an unexpected call.
        EXPECT_CALL(host, MeskExec("/etc/init.d/mesktraced", _, false, true, false))
            .Times(AnyNumber())
            .WillRepeatedly([this](const std::string&, const std::string& verb, bool, bool, bool) {
                return Answer(verb);
            });
    }

    void TearDown() override {
        SetRestartWait({});
        if (oldRoot_) {
            setenv("MESK_HOST_ROOT", oldRoot_->c_str(), 1);
        } else {
            unsetenv("MESK_HOST_ROOT");
        }
        fs::remove_all(root_);
    }

    // The status the script gives for a verb: the scripted answers in turn, the last repeated.
    int32_t Answer(const std::string& verb) {
        runs.push_back(verb);
        auto& script = answers[verb];
        const int32_t answer = script.empty() ? 0 : script.front();
        if (script.size() > 1) script.erase(script.begin());
        if (answer == THROWS) throw MeskCtlException("exec failed.");
        return answer;
    }

    fs::path ConfigPath() const { return root_ / "etc/orvane/mesk/mesktraced.conf"; }
    void WriteConfig(const std::string& text) { std::ofstream(ConfigPath()) << text; }
    std::string ReadConfig() const {
        std::ostringstream text;
        text << std::ifstream(ConfigPath()).rdbuf();
        return text.str();
    }

    std::map<std::string, std::vector<int32_t>> answers;
    std::vector<std::string> runs;
    std::vector<unsigned> waits;

  private:
    fs::path root_;
    std::optional<std::string> oldRoot_;
};

std::shared_ptr<Input> Options(const std::map<std::string, std::string>& values) {
    auto input = Input::New();
    for (const auto& [name, value] : values) input->SetParameter(name, value);
    return input;
}

// Description, type and output defaults are checked for every command by the registry's
// conformance test; what is particular here is set's parameter table and the result shapes.
TEST_F(TraceCommandTest, ParametersAndResultShapes) {
    const auto spec = MeskTraceSet::New()->GetInputSpecInternal();
    std::vector<std::string> parameters;
    for (const auto& p : spec->GetParameters()) {
        parameters.push_back(p->GetName() + " -" + p->GetShortName() + " " +
                             std::to_string(p->GetType()) + (p->IsRequired() ? " required " : " ") +
                             (p->GetConstraint() ? "constrained " : "") + p->GetDescription());
    }
    EXPECT_THAT(
        parameters,
        ElementsAre(
            "path -p 0 Path to store Mesk trace files.",
            "numfiles -f 1 Log file rotation for Mesk trace files.",
            "size -s 1 Maximum size of Mesk trace files in MB.",
            "logtosyslog -l 2 Boolean value to enable or disable logging urgent traces to syslog.",
            "reset -r 2 When set to true, reset defaults for Mesk trace files."));
    EXPECT_TRUE(std::dynamic_pointer_cast<Kalmor::MetaObj::MetaBool>(
        MeskTraceSet::New()->GetOutputSpecInternal()->GetRootObject()));
    EXPECT_THAT(MeskTraceGet::New()->GetInputSpecInternal()->GetParameters(), IsEmpty());
    EXPECT_THAT(FieldNames(MeskTraceGet::New()->GetOutputSpecInternal()->GetRootObject()),
                ElementsAre("MESK Traces Directory", "Number Of Files To Rotate",
                            "Maximum Trace File Size", "Log Urgent Traces To Syslog"));
}

TEST_F(TraceCommandTest, GetReportsTheFileOnceTheServiceRuns) {
    WriteConfig(DEFAULT_CONFIG + std::string("   MESKTRACED_ROTATE_MAX_FILES=12\n"));
    answers["status"] = {1};
    auto output = Run(*MeskTraceGet::New());
    EXPECT_THAT(Errors(*output), IsEmpty());
    EXPECT_TRUE(output->IsComplete());
    auto result = output->GetRootObject();
    EXPECT_THAT(FieldNames(result),
                ElementsAre("MESK Traces Directory", "Number Of Files To Rotate",
                            "Maximum Trace File Size", "Log Urgent Traces To Syslog"));
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
        SCOPED_TRACE(c.message);
        fs::remove(ConfigPath());
        if (c.fileExists) WriteConfig(DEFAULT_CONFIG);
        answers["status"] = {c.status};
        auto output = Run(*MeskTraceGet::New());
        EXPECT_THAT(Errors(*output), ElementsAre(c.message));
        EXPECT_EQ(output->GetRootObject(), nullptr);
        EXPECT_FALSE(output->IsComplete());
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
        {{{"reset", "true"}, {"path", "/p"}}, "reset cannot be used with other options."},
        {{{"size", "0"}}, "File size should be < 4096 MB."},
        {{{"size", "4096"}}, "File size should be < 4096 MB."},
        {{{"size", "-1"}, {"path", "/p"}}, "File size should be < 4096 MB."},
        {{{"size", "0"}, {"reset", "true"}}, "File size should be < 4096 MB."},
    };
    WriteConfig(DEFAULT_CONFIG);
    for (const auto& c : cases) {
        SCOPED_TRACE(c.message);
        auto output = Run(*MeskTraceSet::New(), Options(c.options));
        EXPECT_THAT(Errors(*output), ElementsAre(c.message));
        EXPECT_EQ(output->GetRootObject(), nullptr);
        EXPECT_FALSE(output->IsComplete());
    }
    EXPECT_EQ(ReadConfig(), DEFAULT_CONFIG);
    EXPECT_THAT(runs, IsEmpty());
}

TEST_F(TraceCommandTest, SetFileFailuresLeaveTheServiceAlone) {
    // No file: nothing is created.
    auto output = Run(*MeskTraceSet::New(), Options({{"numfiles", "3"}}));
    EXPECT_THAT(Errors(*output), ElementsAre("Error opening Mesk Trace Config File for reading."));
    EXPECT_FALSE(fs::exists(ConfigPath()));

    // A directory in the file's place can be opened for reading but not for writing.
    fs::create_directory(ConfigPath());
    output = Run(*MeskTraceSet::New(), Options({{"numfiles", "3"}}));
    EXPECT_THAT(Errors(*output), ElementsAre("Error opening Mesk Trace Config File for writing."));
    EXPECT_EQ(output->GetRootObject(), nullptr);
    EXPECT_FALSE(output->IsComplete());
    EXPECT_THAT(runs, IsEmpty());
}

TEST_F(TraceCommandTest, SetChecksAndRestartsTheServiceAfterWritingTheFile) {
    const std::string eightFailures =
        "Failed to restart mesktraced: 1; Failed to restart mesktraced: 1; "
        "Failed to restart mesktraced: 1; Failed to restart mesktraced: 1; "
        "Failed to restart mesktraced: 1; Failed to restart mesktraced: 1; "
        "Failed to restart mesktraced: 1; Failed to restart mesktraced: 1; ";
    const struct {
        const char* name;
        int32_t status;
        std::vector<int32_t> restarts;
        std::string message;  // empty on success
        size_t restartRuns;
        std::vector<unsigned> waits;
    } cases[] = {
        {"stopped service", 3, {1}, "", 0, {}},
        {"status fails",
         -1,
         {0},
         "Failed to check mesktraced status. Refer /var/log/syslog.log for details.",
         0,
         {}},
        {"status throws",
         THROWS,
         {0},
         "exec failed. Refer /var/log/syslog.log for details.",
         0,
         {}},
        {"every restart fails",
         0,
         {1},
         eightFailures + " Refer /var/log/syslog.log for details.",
         8,
         {5, 5, 5, 5, 5, 5, 5}},
        {"third restart succeeds", 0, {2, -1, 0}, "", 3, {5, 5}},
        {"restart throws",
         0,
         {1, THROWS},
         "exec failed. Refer /var/log/syslog.log for details.",
         2,
         {5}},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        WriteConfig(DEFAULT_CONFIG);
        answers = {{"status", {c.status}}, {"restart", c.restarts}};
        runs.clear();
        waits.clear();
        auto output = Run(*MeskTraceSet::New(), Options({{"path", "/vol/t"},
                                                         {"numfiles", "3"},
                                                         {"size", "4095"},
                                                         {"logtosyslog", "false"}}));

        // The new file stays whatever the service does.
        EXPECT_EQ(ReadConfig(),
                  "# tracing service settings\n"
                  "MESKTRACED_LAST_SELECTED_VOLUME=\"/scratch/mesktrace\"\n"
                  "\n"
                  "MESKTRACED_VOLUME=\"/vol/t\"\n"
                  "MESKTRACED_ROTATE_MAX_FILES=3\n"
                  "MESKTRACED_LOG_URGENT_TO_SYSLOG=0\n"
                  "MESKTRACED_ROTATE_FILE_SIZE=4095\n");
        std::vector<std::string> expectedRuns = {"status"};
        expectedRuns.resize(1 + c.restartRuns, "restart");
        EXPECT_THAT(runs, ElementsAreArray(expectedRuns));
        EXPECT_THAT(waits, ElementsAreArray(c.waits));
        if (c.message.empty()) {
            EXPECT_THAT(Errors(*output), IsEmpty());
            EXPECT_TRUE(BoolResult(*output));
            EXPECT_TRUE(output->IsComplete());
        } else {
            EXPECT_THAT(Errors(*output), ElementsAre(c.message));
            EXPECT_EQ(output->GetRootObject(), nullptr);
            EXPECT_FALSE(output->IsComplete());
        }
    }
}

}  // namespace
}  // namespace MeskNamespace
}  // namespace OrvaneCli
