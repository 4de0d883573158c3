#include "tool/Tool.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::StartsWith;

namespace {

ToolResult run(char const* command, std::vector<std::string> words)
{
    words.insert(words.begin(), command);
    return runTool(words);
}

} // namespace

TEST(ToolTime, Calculates)
{
    struct Row {
        std::vector<std::string> words;
        char const* line;
    } const rows[] = {
        {{"1001/30000 * 30000"}, "30030000/30000 = 1001/1 = 1001.000000 s, exact"},
        {{"(1/2 + 0.25) / -3"}, "-1/4 = -0.250000 s, exact"},
        {{"6 / 3/2"}, "4/1 = 4.000000 s, exact"}, // 3/2 is one number
        {{"1/1000000007 + 1/998244353"}, "2/1000000007 = 0.000000 s, rounded"},
        {{"--", "-inf"}, "-inf"},
        {{"floor", "3.52", "--frame", "1001/24000"}, "84084/24000 = 7007/2000 = 3.503500 s, exact"},
        {{"ceiling", "1/3 + 1/5", "--frame", "1/24"}, "13/24 = 0.541667 s, exact"},
        {{"round", "1/48", "--frame", "1/24"}, "1/24 = 0.041667 s, exact"},
        {{"sample", "-3.52", "--frame", "1/24"}, "-84"},
        {{"remap", "100/30000", "1001/30000", "1/25", "--exact"}, "4/1001 = 0.003996 s, exact"},
        {{"sum", "1001/30000", "--times", "1000000"},
         "1001000000/30000 = 100100/3 = 33366.666667 s, exact"},
        {{"halve", "1/600"}, "1/1200 = 0.000833 s, exact"},
        {{"reduce", "1000/30000"}, "1/30 = 0.033333 s, exact"},
        {{"alias", "100/2997"}, "1001/30000 = 0.033367 s, exact"},
    };
    for (Row const& row : rows) {
        ToolResult const result = run("time", row.words);
        EXPECT_EQ(result.out, std::string(row.line) + "\n") << result.messages;
        EXPECT_EQ(result.exitCode, 0);
    }
}

TEST(ToolTime, PrintsJson)
{
    struct Row {
        std::vector<std::string> words;
        char const* text;
    } const rows[] = {
        {{"time", "--json", "2/1000000007"}, "\"value\": 2,\n  \"timescale\": 1000000007,"},
        {{"time", "--json", "inf"}, "\"kind\": \"inf\""},
        {{"time", "--json", "sample", "1", "--frame", "1/24"}, "\"sample\": 24"},
        {{"ranges", "union", "--json", "0..3=a"}, "\"duration\": {\n        \"value\": 3,"},
    };
    for (Row const& row : rows)
        EXPECT_THAT(runTool(row.words).out, HasSubstr(row.text));
}

TEST(ToolTime, ToldWhatIsWrong)
{
    struct Row {
        std::vector<std::string> words;
        int code;
        char const* message;
    } const rows[] = {
        {{"1 / 0"}, 1, ""}, // the answer is: invalid
        {{"1/2 + x"}, 2, "korvane: \"1/2 + x\" is not a time (character 7)\n"},
        {{"(1"}, 2, "korvane: \"(1\" lacks a ) (character 3)\n"},
        {{"1/0"}, 2, "korvane: \"1/0\" is not a timescale from 1 to 2147483647 (character 3)\n"},
        {{"9223372036854775808"}, 2, "korvane: \"9223372036854775808\" does not fit 64 bits"},
        {{"9223372036854775807.1"}, 2, "korvane: \"9223372036854775807.1\" does not fit 64 bits"},
        {{std::string(101, '(') + "1"}, 2, "korvane: \"(((((((((("},
        {{"floor", "1"}, 2, "korvane: floor needs --frame\n"},
        {{"floor", "1", "--frame", "0"}, 2, "korvane: --frame: \"0\" is not a length above zero\n"},
        {{"sample", "inf", "--frame", "1/24"}, 1, "korvane: inf lies in no frame\n"},
        {{"remap", "1", "2"}, 2, "korvane: remap needs TIME OLD NEW\n"},
    };
    for (Row const& row : rows) {
        ToolResult const result = run("time", row.words);
        EXPECT_EQ(result.exitCode, row.code) << result.messages;
        EXPECT_THAT(result.messages, StartsWith(row.message));
    }
}

TEST(ToolRanges, Operates)
{
    struct Row {
        std::vector<std::string> words;
        char const* out;
    } const rows[] = {
        {{"union", "0..2,5..6", "1..3,6..7"}, "0/1..3/1\n5/1..6/1\n6/1..7/1\n"},
        {{"union", "0..2=a, 1..4=b", "3+2=a"}, "0/1..5/1=a\n"},
        {{"union", "--apart", "0..2=a,1..4=b", "1+2=a"}, "0/1..3/1=a\n1/1..4/1=b\n"},
        {{"subtract", "0..3=a", "1..2"}, "0/1..1/1=a\n2/1..3/1=a\n"},
        {{"subtract", "-1/2..1.5", "0..1/4", "1..9"}, "-1/2..0/2\n1/4..4/4\n"},
        {{"subtract", "--", "-inf..inf", "5..6"}, "-31535995/1..5/1\n6/1..inf\n"},
        {{"mask", "0..10,20..30", "5..25"}, "5/1..10/1\n20/1..25/1\n"},
    };
    for (Row const& row : rows) {
        ToolResult const result = run("ranges", row.words);
        EXPECT_EQ(result.out, row.out) << result.messages;
        EXPECT_EQ(result.exitCode, 0);
    }
}

TEST(ToolRanges, ReadsAFileAndDraws)
{
    ScratchFolder const folder;
    std::string const file =
        folder.write("clips.txt", "# reel\n0..3=Ferry, wide\r\n\n 4 .. 6.5=Gulls\n");
    EXPECT_EQ(runTool({"ranges", "union", file}).out, "0/1..3/1=Ferry, wide\n4/1..65/10=Gulls\n");
    EXPECT_EQ(
        runTool({"ranges", "subtract", "--timeline", "0..10=a,12..16=long name,1..2", "3..4,8..13"})
            .out,
        "A [a=====================================)        [long name=====)\n"
        "      [==)\n"
        "B             [==)                [==================)\n"
        "= [a=========)    [a=============)                    [long name=)\n"
        "      [==)\n"
        "  0.000                                                     16.000\n");
    // Infinite ends reach the edge, an instant is a line.
    EXPECT_EQ(runTool({"ranges", "show", "0..inf,2..2,3..4"}).out,
              "A [==============================================================)\n"
              "                                  |               [==============)\n"
              "  0.000                                                      4.000\n");

    std::string const picture = folder.path("picture.svg");
    EXPECT_EQ(runTool({"ranges", "show", "--svg", picture, "0..1=a<b&\"c\""}).exitCode, 0);
    EXPECT_THAT(folder.read("picture.svg"), StartsWith("<svg xmlns="));
    EXPECT_THAT(folder.read("picture.svg"), HasSubstr("a&lt;b&amp;&quot;c&quot;"));
}

TEST(ToolRanges, ToldWhatIsWrong)
{
    ScratchFolder const folder;
    std::string const file = folder.write("clips.txt", "0..3\n# x\n4..\n");
    struct Row {
        std::vector<std::string> words;
        int code;
        std::string message;
    } const rows[] = {
        {{"union", "0..3,x"}, 2, "korvane: \"x\" is not START..END or START+DURATION"},
        {{"union", "3..2"}, 2, "korvane: \"3..2\" ends before it starts (character 4)\n"},
        {{"union", file}, 3, "korvane: " + file + ":3: \"\" is not a time"},
        {{"union", folder.path("none")}, 4, "korvane: " + folder.path("none") + ": No such file"},
        {{"mask", "0..3", "1..2", "1..2"}, 2, "korvane: "},
        {{}, 2, "korvane: "},
    };
    for (Row const& row : rows) {
        ToolResult const result = run("ranges", row.words);
        EXPECT_EQ(result.exitCode, row.code) << result.messages;
        EXPECT_THAT(result.messages, StartsWith(row.message));
        EXPECT_THAT(result.out, IsEmpty());
    }
}
