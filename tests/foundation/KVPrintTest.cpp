#include <korvane/korvane.h>
#include <support/TemporaryFolder.h>

#include <gtest/gtest.h>

#include <cstdlib>
#include <regex>
#include <sys/wait.h>
#include <unistd.h>

namespace {

std::string logged;

/// Gathers what is logged while it lives.
class LogCapture {
public:
    LogCapture()
    {
        logged.clear();
        KVSetLogSink(
            [](char const* line, std::size_t length) { logged.append(line, length).append("\n"); });
    }
    ~LogCapture() { KVSetLogSink(nullptr); }
};

/// Runs `body` in a child process, which starts with nothing printed, and gives its process id.
template <class Body>
pid_t inChild(Body body)
{
    std::fflush(stdout);
    pid_t const child = fork();
    if (child == 0) {
        body();
        std::fflush(stdout);
        _exit(0);
    }
    int status = 0;
    waitpid(child, &status, 0);
    EXPECT_EQ(status, 0);
    return child;
}

std::string logPath(pid_t process)
{
    return "/tmp/output." + std::to_string(process) + ".log";
}

std::string contentsOf(std::string const& path)
{
    std::ostringstream text;
    text << std::ifstream(path).rdbuf();
    return text.str();
}

} // namespace

// This stands first: later tests have printed, and the answer of the environment is taken once.
TEST(KVPrint, GoesToALogFileIfTheEnvironmentAsks)
{
    pid_t const asked = inChild([] {
        setenv("kvPrintUseLogFile", "", 1);
        KVPrint("one %d\n", 1);
        KVPrintIndent(2, "two\n");
    });
    EXPECT_EQ(contentsOf(logPath(asked)), "one 1\n    two\n");
    std::filesystem::remove(logPath(asked));

    pid_t const tooLate = inChild([] {
        KVPrint("%s", "");
        setenv("kvPrintUseLogFile", "1", 1);
        KVPrint("%s", "");
    });
    EXPECT_FALSE(std::filesystem::exists(logPath(tooLate)));
}

TEST(KVPrint, DoesNotFollowAPlantedLink)
{
    TemporaryFolder const folder;
    std::string const target = folder.path("target");
    pid_t const child = inChild([&] {
        setenv("kvPrintUseLogFile", "1", 1);
        std::filesystem::create_symlink(target, logPath(getpid()));
        KVPrint("dropped\n");
        std::filesystem::remove(logPath(getpid()));
        KVPrint("tried again\n");
    });
    EXPECT_FALSE(std::filesystem::exists(target));
    EXPECT_EQ(contentsOf(logPath(child)), "tried again\n");
    std::filesystem::remove(logPath(child));
}

TEST(KVPrint, GoesToStandardOutput)
{
    testing::internal::CaptureStdout();
    KVPrint("%s %d\n", "a", 1);
    KVPrintIndent(0, "b\n");
    KVPrintIndent(3, "%d\n", 2);
    KVPrintStack();
    EXPECT_EQ(testing::internal::GetCapturedStdout(), "a 1\nb\n      2\n");
}

TEST(KVLog, AddsThePositionAsFarAsItFits)
{
    LogCapture const capture;
    std::string const position = " (file: a.cpp, line: 7)";
    struct Row {
        std::size_t length;
        std::string logged;
    } const rows[] = {
        {0, position},
        {1020, std::string(1020, 'x') + " (f"},
        {1022, std::string(1022, 'x') + " "},
        {1023, std::string(1023, 'x')},
        {5000, std::string(1023, 'x')},
    };
    for (Row const& row : rows) {
        logged.clear();
        _KVLogMessage("a.cpp", 7, "%s", std::string(row.length, 'x').c_str());
        EXPECT_EQ(logged, row.logged + "\n") << row.length;
        EXPECT_EQ(std::string(KVCrashReporterBuffer()), "Last Korvane Log: " + row.logged);
    }
    _KVSetCrashReporterMessage(std::string(2000, 'x').c_str());
    EXPECT_EQ(std::string(KVCrashReporterBuffer()).size(), 1123u);
    _KVSetCrashReporterMessage("short");
    EXPECT_STREQ(KVCrashReporterBuffer(), "Last Korvane Log: short");
}

TEST(KVLog, ObjectFormats)
{
    LogCapture const capture;
    _KVNSLog(nullptr);
    EXPECT_EQ(logged, "");
    _KVNSLog(KVString("%@!").cf_str(), KVString("text").cf_str());
    EXPECT_EQ(logged, "text!\n");
    logged.clear();
    _KVPrintBacktrace();
    EXPECT_NE(logged.find('\n'), std::string::npos);
}

TEST(KVAssertion, GoesToTheRunningTestCaseOrToTheLog)
{
    struct Case : KVUnitTestCase {
        bool answer = true;
        std::string failure;
        bool recordFailure(char const* file, unsigned int line, KVString const& message) override
        {
            failure = std::string(file) + ":" + std::to_string(line) + " " + message.toUTF8();
            return answer;
        }
    } testCase;
    LogCapture const capture;

    _KVHandleLogAssertion(1, 0, "a.cpp", 3, "x is %d", 4);
    EXPECT_EQ(logged, "x is 4 (file: a.cpp, line: 3)\n");

    _KVInfo_SetUnitTesting(true);
    _KVUnitTesting_SetCurrentCase(&testCase);
    logged.clear();
    _KVHandleLogAssertion(1, 0, "a.cpp", 3, "x is %d", 4);
    EXPECT_EQ(testCase.failure, "a.cpp:3 x is 4");
    EXPECT_EQ(logged, "");

    testCase.answer = false;
    _KVHandleLogAssertion(1, 0, "a.cpp", 3, "x is %d", 4);
    EXPECT_EQ(logged.find("x is 4 (file: a.cpp, line: 3) :: No Current Test Case - backtrace: "),
              0u);

    // No assertion: logged as ever, with the stack behind it; no debugger, so it comes back.
    logged.clear();
    testCase.failure.clear();
    _KVHandleLogAssertion(0, 1, "a.cpp", 3, "note");
    EXPECT_EQ(logged.find("note (file: a.cpp, line: 3)\n"), 0u);
    EXPECT_GT(logged.size(), 40u);
    EXPECT_EQ(testCase.failure, "");
    _KVUnitTesting_SetCurrentCase(nullptr);
    _KVInfo_SetUnitTesting(false);
}

TEST(KVStackTrace, LinesHaveTheirColumns)
{
    KVStackTrace const trace(3);
    ASSERT_EQ(trace.lines().size(), 3u);
    std::regex const form("[0-9]+ +.{35} 0x[0-9a-f]{16} .+( \\+ [0-9]+|<unknown function>)");
    for (std::size_t i = 0; i < 3; ++i) {
        std::string const& line = trace.lines()[i];
        EXPECT_TRUE(std::regex_match(line, form)) << line;
        EXPECT_EQ(line.find(std::to_string(i) + "   "), 0u) << line;
        EXPECT_EQ(line.find("KVStackTrace::"), std::string::npos) << line;
    }
    std::ostringstream printed;
    trace.print(printed);
    EXPECT_EQ(printed.str().find("  0   "), 0u);
}

TEST(KVStackTrace, ACountOfZeroKeepsTheFramesThatWereCaptured)
{
    // The stop is tested after a line is kept, so zero is never met: five frames less those left
    // out.
    EXPECT_GE(KVStackTrace(0).lines().size(), 3u);
    EXPECT_LE(KVStackTrace(0).lines().size(), 5u);
    EXPECT_EQ(KVStackTrace(-5).lines().size(), 0u);
    EXPECT_LE(KVStackTrace(-4).lines().size(), 1u);
    EXPECT_GE(KVStackTrace(2147483647).lines().size(), 3u);
}
