#include "tool/Tool.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

using ::testing::HasSubstr;
using ::testing::IsEmpty;

namespace {

/// Twice as large and moved by (10, 20, 30).
constexpr char grown[] = "2 0 0 10\n0 2 0 20\n0 0 2 30\n0 0 0 1\n";

std::vector<std::string> withWords(std::vector<std::string> arguments, std::string_view words)
{
    for (std::size_t at = 0; at < words.size();) {
        std::size_t const end = std::min(words.find_first_of(" \n", at), words.size());
        arguments.emplace_back(words.substr(at, end - at));
        at = end + 1;
    }
    return arguments;
}

} // namespace

TEST(ToolMatrix, DecomposesNumbersAFileAndStandardInput)
{
    ScratchFolder const folder;
    std::string const printed = "(\n2.0,0,0,+10,\n0,2,0,20,\n0,0,2,30,\n[0;0;0;1e0]\n)";
    std::string const expected = "translation:\n\tx: 10\n\ty: 20\n\tz: 30\n"
                                 "scale:\n\tx: 2\n\ty: 2\n\tz: 2\n";
    for (ToolResult const& result :
         {runTool(withWords({"matrix", "decompose"}, grown)),
          runTool({"matrix", "decompose", folder.write("matrix.txt", printed)}),
          runTool({"matrix", "decompose", "-"}, grown)}) {
        EXPECT_THAT(result.out, HasSubstr(expected));
    }
    EXPECT_THAT(runTool({"matrix", "decompose", "--json", "-"}, grown).out,
                HasSubstr("\"scale\": {\n    \"x\": 2.0,"));
}

TEST(ToolMatrix, WhatIsNotSixteenNumbersEndsWithCode3AndSaysWhichOne)
{
    struct Row {
        std::string input;
        char const* message;
    } const rows[] = {
        {"", ":1: number 1 is missing: a matrix has sixteen, here are 0"},
        {"1 2 3 4\n5 six 7 8", ":2: number 6 \"six\" is not a number"},
        {"1 2 0x3", ":1: number 3 \"0x3\" is not a number"},
        {"nan", ":1: number 1 \"nan\" is out of range"},
        {std::string(grown) + "5", ":5: number 17 \"5\" is one too many: a matrix has sixteen"},
        {std::string("1 \0 2", 5), ":1: number 2 "},
    };
    for (Row const& row : rows) {
        ToolResult const result = runTool({"matrix", "invert", "-"}, row.input);
        EXPECT_EQ(result.exitCode, 3) << row.input;
        EXPECT_THAT(result.messages,
                    HasSubstr(std::string("korvane: standard input") + row.message));
        EXPECT_THAT(result.out, IsEmpty());
    }
    ToolResult const arguments = runTool({"matrix", "compose", "1", "two"});
    EXPECT_EQ(arguments.exitCode, 3);
    EXPECT_EQ(arguments.messages, "korvane: number 2 \"two\" is not a number\n");
    EXPECT_EQ(runTool({"matrix", "decompose", "1", "-2"}).messages,
              "korvane: number 3 is missing: a matrix has sixteen, here are 2\n");
    EXPECT_EQ(runTool({"matrix", "decompose", "/nowhere/matrix"}).exitCode, 4);
}

TEST(ToolMatrix, SingularMatricesEndWithCode1)
{
    char const flat[] = "1 0 0 0 0 1 0 0 0 0 0 0 0 0 0 1";
    for (char const* command : {"decompose", "invert"}) {
        ToolResult const result = runTool({"matrix", command, "-"}, flat);
        EXPECT_EQ(result.exitCode, 1) << command;
        EXPECT_THAT(result.messages, HasSubstr("singular"));
    }
    EXPECT_EQ(runTool({"matrix", "invert", "--planar", "-"}, flat).out,
              "1 0 0 0\n0 1 0 0\n0 0 0 0\n0 0 0 1\n");
    EXPECT_EQ(runTool({"matrix", "compose", "--scale", "1e200", "1", "1", "-"},
                      "1e200 0 0 0 0 1 0 0 0 0 1 0 0 0 0 1")
                  .exitCode,
              1); // beyond what a number holds
}

TEST(ToolMatrix, ComposesWhatDecomposeTells)
{
    EXPECT_EQ(runTool({"matrix", "compose"}).out, "1 0 0 0\n0 1 0 0\n0 0 1 0\n0 0 0 1\n");
    ToolResult const composed =
        runTool({"matrix", "compose", "--translate", "1", "-2", "3", "--scale", "2", "2", "2",
                 "--rotate", "0", "0", "90", "--shear", "0.5", "0"});
    EXPECT_EQ(composed.out, "0 -2 0 1\n2 0 0 -2\n0 -1 2 3\n0 0 0 1\n");
    ToolResult const again = runTool({"matrix", "decompose", "-"}, composed.out);
    EXPECT_THAT(again.out, HasSubstr("z: 90.00\xC2\xB0"));
    EXPECT_THAT(again.out, HasSubstr("shear:\n\tx: 0.5\n"));
    // The given transform acts first; invert takes the whole back.
    ToolResult const after =
        runTool({"matrix", "compose", "--translate", "1", "0", "0", "-"}, grown);
    EXPECT_EQ(after.out, "2 0 0 11\n0 2 0 20\n0 0 2 30\n0 0 0 1\n");
}
