#include "tool/Tool.h"

#include "AtomicOutput.h"
#include "Input.h"
#include "ToolError.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <csignal>
#include <functional>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

using ::testing::ElementsAre;
using ::testing::IsEmpty;

namespace {

/// Runs something in a process of its own, and gives its wait status.
int statusOf(std::function<void()> const& work)
{
    pid_t const child = fork();
    if (child == 0) {
        work();
        _exit(0);
    }
    int status = 0;
    waitpid(child, &status, 0);
    return status;
}

/// The code and message of what a function throws.
std::string errorOf(std::function<void()> const& work)
{
    try {
        work();
    } catch (ToolError const& error) {
        return std::to_string(static_cast<int>(error.code())) + " " + error.what();
    }
    return "none";
}

mode_t modeOf(std::string const& path)
{
    struct stat status = {};
    stat(path.c_str(), &status);
    return status.st_mode & 07777;
}

} // namespace

TEST(AtomicOutput, ReplacesTheTargetWhenCommittedAndKeepsItsMode)
{
    ScratchFolder const folder;
    std::string const path = folder.write("target", "old");
    ASSERT_EQ(symlink("target", folder.path("link").c_str()), 0);
    chmod(path.c_str(), 0640);
    AtomicOutput output(folder.path("link"));
    output.write("new ");
    output.write("text");
    EXPECT_EQ(folder.read("target"), "old");
    output.commit();
    EXPECT_EQ(folder.read("target"), "new text");
    EXPECT_EQ(modeOf(path), 0640u);
    EXPECT_THAT(folder.names(), ElementsAre("link", "target")) << "a link stays one";
}

TEST(AtomicOutput, LeavesNothingBehindWithoutACommit)
{
    ScratchFolder const folder;
    folder.write("old", "old");
    for (char const* name : {"old", "new"}) {
        AtomicOutput output(folder.path(name));
        output.write(std::string(200000, 'x'));
    }
    EXPECT_THAT(folder.names(), ElementsAre("old"));
    EXPECT_EQ(folder.read("old"), "old");
}

TEST(AtomicOutput, ASignalRemovesTheTemporaryFile)
{
    ScratchFolder const folder;
    for (int signal : {SIGINT, SIGTERM, SIGHUP}) {
        int const status = statusOf([&] {
            prepareProcess();
            AtomicOutput output(folder.path("target"));
            output.write("half");
            raise(signal);
        });
        EXPECT_TRUE(WIFSIGNALED(status) && WTERMSIG(status) == signal);
        EXPECT_THAT(folder.names(), IsEmpty());
    }
}

TEST(AtomicOutput, FailuresNameTheTarget)
{
    ScratchFolder const folder;
    struct Row {
        std::string path;
        char const* text;
    } const rows[] = {
        {folder.path("none/file"), "No such file or directory"},
        {folder.path(""), "Is a directory"},
        {"/dev/full", "No space left on device"},
    };
    for (Row const& row : rows)
        EXPECT_EQ(errorOf([&] {
                      AtomicOutput output(row.path);
                      output.write("text");
                      output.commit();
                  }),
                  "4 " + row.path + ": " + row.text);
    EXPECT_THAT(folder.names(), IsEmpty());
}

TEST(Input, ReadsAFileWholeOrTellsWhyNot)
{
    ScratchFolder const folder;
    std::string const bytes("a\0b\xFF", 4);
    EXPECT_EQ(readFile(folder.write("file", bytes)), bytes);
    std::string const missing = folder.path("missing");
    EXPECT_EQ(errorOf([&] { readFile(missing); }), "4 " + missing + ": No such file or directory");
    EXPECT_EQ(errorOf([&] { readFile(folder.path("")); }),
              "4 " + folder.path("") + ": Is a directory");
}
