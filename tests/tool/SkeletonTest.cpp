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
