#include "tool/Tool.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::StartsWith;

namespace {

std::string const sample = std::string(KORVANE_SOURCE_DIR) + "/examples/data/lighthouse.srt";
std::string const time = "00:00:01,000 --> 00:00:02,000\n";
std::string const later = "00:00:03,000 --> 00:00:04,000\n";

/// The text with "$" and "@" for two lines of times.
std::string withTimes(std::string text)
{
    for (std::size_t at; (at = text.find_first_of("$@")) != std::string::npos;)
        text.replace(at, 1, text[at] == '$' ? time : later);
    return text;
}

TEST(CaptionsTool, ShowListsWhatTheLibraryReads)
{
    ScratchFolder const folder;
    std::string const file = folder.write("a.srt", "1\n" + time + "<b>A</b>\nB\n");
    EXPECT_EQ(runTool({"captions", "show", file}).out, "   1  00:00:01,000  00:00:02,000  A / B\n");
    EXPECT_EQ(runTool({"captions", "show", "--tags", file}).out,
              "   1  00:00:01,000  00:00:02,000  <b><font color=\"#ffffff\">A</b> / B</font>\n");
    EXPECT_THAT(runTool({"captions", "show", "--json", file}).out,
                HasSubstr("\"text\": \"A\\nB\""));
}

TEST(CaptionsTool, ConvertMovesTimesOntoFrames)
{
    ScratchFolder const folder;
    std::string const out = folder.path("out.srt");
    runTool({"captions", "convert", sample, out, "--frame", "1001/24000", "--offset", "-01:00:00"});
    EXPECT_THAT(folder.read("out.srt"),
                StartsWith("1\n00:00:00,500 --> 00:00:02,919\nThe harbour of Thessaloniki"));
    EXPECT_EQ(runTool({"captions", "convert", sample, "-", "--offset", "0.25", "--tags"})
                  .out.substr(0, 35),
              "1\n01:00:00,750 --> 01:00:03,150\n<i>");
    // Without frames a file keeps its milliseconds: 1.001 seconds are 1000.99... of them as a
    // double.
    std::string const odd = "1\n00:00:01,001 --> 00:00:04,350\nA\n";
    EXPECT_EQ(runTool({"captions", "convert", "-", "-"}, odd).out, odd);
    ToolResult const cut = runTool({"captions", "convert", sample, "-", "--offset", "-01:00:01"});
    EXPECT_EQ(cut.exitCode, 0);
    EXPECT_THAT(cut.out, StartsWith("1\n00:00:00,000 --> 00:00:01,900\n"));
    EXPECT_THAT(cut.messages, HasSubstr("1 caption begins before zero"));
}

TEST(CaptionsTool, FailuresHaveACodeAndASentence)
{
    ScratchFolder const folder;
    std::string const gap = folder.write("gap.srt", "1\n" + time + "A\n\n3\n" + later + "B\n");
    std::string const bare = folder.write("bare.srt", "1\n00:00:01 --> 00:00:02,000\nA\n");
    std::string const empty = folder.write("empty.srt", "");
    std::string const half = folder.write(
        "half.srt", std::string("\xFE\xFF", 2) + [] {
            std::string wide;
            for (char c : "1\n" + time + "A")
                wide += std::string({'\0', c});
            return wide + "\xD8" + std::string(1, '\0');
        }());
    struct Row {
        std::vector<std::string> arguments;
        int code;
        std::string message;
    } const rows[] = {
        {{"show", folder.path("none")}, 4, "none: No such file or directory"},
        {{"show", gap}, 3, "gap.srt:5: found number 3, expected 2"},
        {{"show", bare}, 3, "bare.srt:2: found \"00:00:01\", which has no milliseconds"},
        {{"show", empty}, 3, "empty.srt:1: found no text at all"},
        {{"show", sample, "--frame", "5/1"}, 3, "lighthouse.srt: a caption has no length"},
        {{"convert", half, "-"}, 3, "half a surrogate pair"},
        {{"convert", sample, folder.path("none/out.srt")}, 4, "No such file or directory"},
        {{"convert", sample, "/dev/full"}, 4, "No space left on device"},
        {{"convert", sample, "-", "--offset", "-02:00:00"}, 1, "moves caption 1 before zero"},
        {{"convert", sample, "-", "--frame", "0/25"}, 2, "is not a duration"},
        {{"convert", sample, "-", "--offset", "1:2:3:4"}, 2, "is not an offset"},
        {{"check", empty, "--repair", folder.path("out.srt")}, 3, "nothing of it can be saved"},
    };
    for (Row const& row : rows) {
        std::vector<std::string> arguments = row.arguments;
        arguments.insert(arguments.begin(), "captions");
        ToolResult const result = runTool(arguments);
        EXPECT_EQ(result.exitCode, row.code) << result.messages;
        EXPECT_THAT(result.messages, StartsWith("korvane: "));
        EXPECT_THAT(result.messages, HasSubstr(row.message));
    }
}

TEST(CaptionsTool, CheckTellsLineFoundAndExpected)
{
    struct Row {
        std::string file;
        int code;
        std::vector<std::string> findings; // behind the file's name
    } const rows[] = {
        {"1\n$A\n", 0, {": 1 captions, 0 errors, 0 warnings, UTF-8; a strict import takes it"}},
        {"\uFEFF1\n$A\n", 0, {":1: warning: found a byte-order mark of UTF-8, expected none"}},
        {"\n\n1\n$A\n", 1, {":1: error: found an empty first line", "refuses it with code 1"}},
        {"1\n$A\n\n3\n@B\n", 1, {":5: error: found number 3, expected 2"}},
        {"1 \n$A\n", 1, {":1: error: found \"1 \", expected the digits alone"}},
        {"1\n$A\n\n@B\n", 1, {":5: error: found times without a number, expected 2"}},
        {"1\n00:00:01.000 --> 00:00:02,000\nA\n", 0, {"a full stop for the comma, expected 00"}},
        {"1\n00:00:01 --> 00:00:02,000\nA\n", 1, {":2: error: ", "no milliseconds", "code 2"}},
        {"1\n00:01,000 --> 00:02,5\nA\n", 1, {"which has no hours, expected 00:00:01,000"}},
        {"1\n00:00:01,5 --> 00:00:02,000\nA\n", 0, {"has not three digits of milliseconds"}},
        {"1\n00:00:01,000 -> 00:00:02,000\nA\n", 1, {"found \"->\", expected \"-->\""}},
        {"1\n00:00:01,000 --> 00:00:02,000 X1:40\nA\n", 1, {"found a placement behind the times"}},
        {"1\n00:00:05,000 --> 00:00:02,000\nA\n", 1, {"that precedes start time 00:00:05,000"}},
        {"1\n00:00:05,000 --> 00:00:05,000\nA\n", 1, {"found start and end at", "code 3"}},
        {"1\n00:00:01,000 --> 00:00:09,000\nA\n\n2\n@B\n",
         0,
         {":6: warning", "caption before ends"}},
        {"1\n@A\n\n2\n$B\n", 0, {":6: warning: found start time 00:00:01,000, expected"}},
        {"1\n$A\n\nmore\n", 1, {":5: error: found text behind an empty line: \"more\""}},
        {"1\n$A\n2\n@B\n", 1, {":4: error: found the next caption without an empty line"}},
        {"1\n$\n2\n@B\n", 1, {":3: error: found no text and one empty line"}},
        {"1\n$A\n \nB\n", 0, {":4: warning: found a line of blanks"}},
        {"1\n$one\n<span>two</span> {\\an8}\n", 0, {"unknown tag \"<span>\"", "\"{\\an8}\""}},
        {"1\n$</b><i>A < B\n",
         0,
         {"\"</b>\" without an opening tag", "<i> that is not closed", "closes: \"< B\""}},
        {"1\n$caf\xE9\n", 0, {":3: warning: found 1 line not in UTF-8", "Windows-1252"}},
        {"1\n$caf\xE9 / café\ncafé\n", 1, {":3: error: found 1 line not", "others that are"}},
        {"1\r00:00:01,000 --> 00:00:02,000\rA\r", 1, {":1: error: found carriage returns alone"}},
        {std::string("1\0\n\0", 4), 1, {": error: found UTF-16, little-endian, without a byte"}},
        {std::string("\xFF\xFE\0", 3), 1, {": error: found half a character at the end"}},
        {"1\n" + std::string(400, '9') + ":0:0,0 --> 00:00:02,000\nA\n",
         1,
         {":2: error: found \"9"}},
        {"\xFF\xD8\xFF\xE0 no text at all", 1, {":1: error: found", "a caption's number"}},
        {"\x1B[2J\n1\n$A\n", 1, {":1: error: found \"?[2J\""}},
        {"", 1, {": error: found no text at all"}},
    };
    ScratchFolder const folder;
    for (Row const& row : rows) {
        ToolResult const result =
            runTool({"captions", "check", folder.write("a.srt", withTimes(row.file))});
        EXPECT_EQ(result.exitCode, row.code) << row.file;
        EXPECT_THAT(result.messages, IsEmpty());
        for (std::string const& finding : row.findings)
            EXPECT_THAT(result.out, HasSubstr(finding));
    }
}

TEST(CaptionsTool, RepairSavesWhatItCanAndListsIt)
{
    ScratchFolder const folder;
    std::string const file = folder.write(
        "a.srt", "\n7\n00:00:01.000 -> 00:02\n<i>caf\xE9</i>\n\nmore\n9\n00:00:05,000 --> "
                 "00:00:04,000\nB\n\n10\nno times\n\n11\nx:y:z --> 00:00:09,000\nlost\n\n12\n"
                 "00:00:06,000 --> 00:00:06,000\nC\n\n13\n" +
                     later + "\n\n");
    ToolResult const result =
        runTool({"captions", "check", file, "--repair", folder.path("out.srt")});
    EXPECT_EQ(result.exitCode, 0) << result.messages;
    EXPECT_EQ(folder.read("out.srt"), "1\n00:00:01,000 --> 00:00:02,000\n<i>café</i>\nmore\n\n"
                                      "2\n00:00:04,000 --> 00:00:05,000\nB\n10\nno times\n\n"
                                      "3\n00:00:06,000 --> 00:00:08,000\nC\n");
    for (char const* repair :
         {"left out", "numbered anew from here on", "written as 00:00:02,000", "replaced",
          "joined to the text before", "the two are exchanged", "the caption is left out",
          "ends at 00:00:08,000", "read as Windows-1252, written as UTF-8"})
        EXPECT_THAT(result.out, HasSubstr(std::string("; repaired: ") + repair));
    EXPECT_THAT(runTool({"captions", "check", file, "--json"}).out,
                HasSubstr("\"strictImport\": {\n    \"code\": 1,\n    \"captions\": 0"));
    EXPECT_EQ(runTool({"captions", "check", folder.path("out.srt")}).exitCode, 0);
}

} // namespace
