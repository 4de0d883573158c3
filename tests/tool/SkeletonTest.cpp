#include "tool/Tool.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::MatchesRegex;
using ::testing::StartsWith;

TEST(ToolSkeleton, WhatIsAskedForGoesToStandardOutput)
{
    ToolResult const version = runTool({"--version"});
    EXPECT_EQ(version.exitCode, 0);
    EXPECT_THAT(version.out, MatchesRegex("korvane [0-9]+\\.[0-9]+\\.[0-9]+ \\(ABI [0-9]+\\)\n"));
    EXPECT_THAT(version.messages, IsEmpty());

    ToolResult const help = runTool({"--help"});
    EXPECT_EQ(help.exitCode, 0);
    for (char const* line : {"0  done", "1  failed", "2  usage", "3  bad input", "4  input/output"})
        EXPECT_THAT(help.out, HasSubstr(line));
    EXPECT_THAT(help.messages, IsEmpty());
}

TEST(ToolSkeleton, WrongUsageEndsWithCode2AndAMessage)
{
    std::vector<std::string> const rows[] = {{}, {"--nonsense"}, {"nonsense"}, {""}};
    for (std::vector<std::string> const& arguments : rows) {
        ToolResult const result = runTool(arguments);
        EXPECT_EQ(result.exitCode, 2) << ::testing::PrintToString(arguments);
        EXPECT_THAT(result.out, IsEmpty());
        EXPECT_THAT(result.messages, StartsWith("korvane: "));
    }
}

TEST(ToolSkeleton, ReadsFilesOfAnyNameAndPipes)
{
    ScratchFolder const folder;
    std::string const samples = KORVANE_SOURCE_DIR "/examples/data/";
    struct Row {
        char const* command;
        std::string sample;
    } const rows[] = {
        {"scene check", samples + "showreel.vzml"},
        {"captions show", samples + "lighthouse.srt"},
        {"lut info", samples + "warm-evening.cube"},
        {"matrix decompose", samples + "camera.txt"},
        {"report -o -", samples + "showreel.vzml"},
        {"media info", KORVANE_TEST_DATA "/media/head-moov.mp4"},
        {"report -o -", KORVANE_TEST_DATA "/media/head-moov.mp4"},
    };
    for (Row const& row : rows) {
        std::string const path = folder.write("<\xFF&\n[##]%41", folder.read(row.sample));
        std::string const tool = "\"$KORVANE\" " + std::string(row.command);
        for (std::string const& line :
             {tool + " '" + path + "'", "cat '" + path + "' | " + tool + " /dev/stdin"}) {
            if (line.starts_with("cat") && line.find("media") != line.npos)
                continue; // gone through more than once
            ToolResult const result = runShell(line);
            EXPECT_EQ(result.exitCode, 0) << line;
            EXPECT_THAT(result.messages, IsEmpty()) << line;
        }
    }
    EXPECT_EQ(runTool({"scene", "show", folder.path("a\nb\x1B")}).messages,
              "korvane: " + folder.path("a?b?") + ": No such file or directory\n");
    EXPECT_EQ(runTool({"media", "tree", "-"}, "x").messages,
              "korvane: standard input: a movie is gone through more than once: it must be a "
              "file\n");
}

TEST(ToolSkeleton, OutputThatCannotBeWrittenEndsWithCode4)
{
    struct Row {
        char const* line;
        char const* message;
    } const rows[] = {
        {"\"$KORVANE\" --version > /dev/full",
         "korvane: standard output: No space left on device\n"},
        {"\"$KORVANE\" --version >&-", "korvane: standard output: Bad file descriptor\n"},
        {"(sleep 0.3; \"$KORVANE\" --version; echo $? >&2) | :", "4\n"},
    };
    for (Row const& row : rows) {
        ToolResult const result = runShell(row.line);
        EXPECT_EQ(result.messages, row.message) << row.line;
    }
    EXPECT_EQ(runShell(rows[0].line).exitCode, 4);
    EXPECT_EQ(runShell(rows[1].line).exitCode, 4);
}
