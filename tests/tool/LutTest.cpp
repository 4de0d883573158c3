#include "tool/Tool.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

using ::testing::EndsWith;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::MatchesRegex;
using ::testing::StartsWith;

namespace {

/// Red turns up at (1, 1, 0) alone, so the two ways of looking up differ in between.
char const* const corner = "TITLE \"Corner\"\nLUT_3D_SIZE 2\n0 0 0\n0 0 0\n0 0 0\n1 0 0\n"
                           "0 0 1\n0 0 1\n0 0 1\n0 0 1\n";
char const* const curve = "LUT_1D_SIZE 1024\nDOMAIN_MAX 2 2 2\n";

std::string squareCurve()
{
    std::string text = curve;
    for (int i = 0; i < 1024; ++i)
        text += std::to_string(2.0 * i * i / 1023 / 1023) + "\n";
    return text;
}

} // namespace

TEST(ToolLut, InfoTellsEveryTable)
{
    ScratchFolder const folder;
    std::string const path = folder.write("corner.cube", corner);
    std::string const expected = "format  Adobe Cube LUT (.cube)\n"
                                 "title   Corner\n"
                                 "size    3D, 2 x 2 x 2\n"
                                 "domain  0 to 1\n"
                                 "values  0 to 1 in red\n"
                                 "values  0 to 0 in green\n"
                                 "values  0 to 1 in blue\n";
    EXPECT_EQ(runTool({"lut", "info", path}).out, expected);
    EXPECT_EQ(runTool({"lut", "info", "-"}, corner).out, expected);

    std::string const two = "LUT_1D_SIZE 2\nLUT_3D_SIZE 1\nDOMAIN_MIN -1 -1 -1\n-1\n1\n\n0 0 0\n";
    EXPECT_THAT(
        runTool({"lut", "info", folder.write("two.cube", two)}).out,
        MatchesRegex("table   0\n.*title   two\nsize    1D, 1024 values\n.*\n\ntable   1\n.*"
                     "size    3D, 1 x 1 x 1\ndomain  -1 to 1\nvalues  -1.5258789e-05 to "
                     "-1.5258789e-05 in red\n.*"));
    ToolResult const json = runTool({"lut", "info", "--json", path});
    EXPECT_THAT(json.out,
                HasSubstr("\"kind\": \"3D\",\n    \"size\": 2,\n    \"title\": \"Corner\""));
}

TEST(ToolLut, ARefusedFileIsToldByItsLine)
{
    std::string const mga = "#type: 3D cube file\n";
    struct Row {
        std::string text;
        char const* message; ///< behind the file's path
    } const rows[] = {
        {"", ": neither a .cube file, with TITLE, LUT_1D_SIZE or LUT_3D_SIZE at the start of a "
             "line, nor a .mga file, with \"#type: Pandora 3D LUT file\"\n"},
        {"\n# a\r\n  LUT_3D_SIZE 2\n", ":3: LUT_3D_SIZE must begin its line and be followed by "
                                       "white space: \"  LUT_3D_SIZE 2\"\n"},
        {"#type: a \x1B[2J\n", ":1: the type is not \"Pandora 3D LUT file\": \"#type: a ?[2J\"\n"},
        {"TITLE \"a\"\r\n\r\nLUT_3D_SIZE 257\r\n",
         ":3: LUT_3D_SIZE must be 1 to 256: \"LUT_3D_SIZE 257\"\n"},
        {"LUT_1D_SIZE 0\n", ":1: LUT_1D_SIZE must be 1 to 65536: \"LUT_1D_SIZE 0\"\n"},
        {"LUT_3D_SIZE 64\n0 0 0\n", ":3: the data end after 1 row, and line 1 announces 262144\n"},
        {"TITLE \"a\"\nDOMAIN 0 1\n",
         ":2: no size stands before this row of data: \"DOMAIN 0 1\"\n"},
        {"LUT_3D_SIZE 1\n# a\n0 0 0\n0 0 1\n",
         ":4: a row more than the 1 row that line 1 announces: \"0 0 1\"\n"},
        {"LUT_1D_SIZE 3\n0\n1\n\n1\n", ":4: the data end after 2 rows, and line 1 announces 3\n"},
        {"LUT_3D_SIZE 1\nLUT_3D_SIZE 1\n0 0 0\n\n", // the second table
         ":5: the data end after 0 rows, and line 2 announces 1\n"},
        {mga + "in -2\n", ":2: \"in\" must be 0 to 16777216: \"in -2\"\n"},
        {mga + "in 100\nin 2\nvalues a b c\n0 1 2 3\n", // the second one holds
         ":6: the data end after 1 row, and line 3 announces 2\n"},
        {mga + "in 1\n0 1 2 3\n",
         ":4: the file ends without a line \"values\" and data behind it\n"},
        {mga + "in 2\nvalues a b c\n1 1 2 3\n2 1 2 3\n",
         ":5: its place is beyond the 2 entries that line 2 announces: \"2 1 2 3\"\n"},
        {mga + "values a b c\n0 1 2 3\n",
         ":3: no line \"in\" stands before this row: \"0 1 2 3\"\n"},
    };
    ScratchFolder const folder;
    for (Row const& row : rows) {
        std::string const path = folder.write("bad", row.text);
        ToolResult const result = runTool({"lut", "info", path});
        EXPECT_EQ(result.exitCode, 3) << row.text;
        EXPECT_EQ(result.messages, "korvane: " + path + row.message);
        EXPECT_THAT(result.out, IsEmpty());
    }
    EXPECT_EQ(runTool({"lut", "info", folder.path("none")}).exitCode, 4);
    std::string const cube = folder.write("c.cube", corner);
    EXPECT_THAT(runTool({"lut", "apply", "--index", "1", cube, "0", "0", "0"}).messages,
                EndsWith("c.cube: it has no table 1\n"));
}

TEST(ToolLut, ConvertsBetweenFormatsAndSizes)
{
    ScratchFolder const folder;
    std::string const in = folder.write("corner.cube", corner);
    std::string const mga = folder.path("out.MGA");
    EXPECT_EQ(runTool({"lut", "convert", in, mga}).exitCode, 0);
    EXPECT_THAT(folder.read("out.MGA"), StartsWith("#HEADER\n#filename: out\n"));
    EXPECT_THAT(folder.read("out.MGA"), HasSubstr("#title: Corner\n"));
    std::string const back = folder.path("back.cube");
    EXPECT_EQ(runTool({"lut", "convert", mga, back}).exitCode, 0);
    EXPECT_THAT(folder.read("back.cube"), HasSubstr("TITLE \"Corner\"\nLUT_3D_SIZE 2\n"));
    EXPECT_EQ(runTool({"lut", "convert", back, "-", "--format", "mga"}).out,
              runTool({"lut", "convert", "--format", "mga", "-", "-"}, corner).out);

    // A finer cube gives the same colours at the old points.
    EXPECT_EQ(runTool({"lut", "convert", in, back, "--size", "3"}).exitCode, 0);
    EXPECT_THAT(runTool({"lut", "info", back}).out, HasSubstr("size    3D, 3 x 3 x 3\n"));
    EXPECT_EQ(runTool({"lut", "apply", back, "1", "1", "0"}).out, "1 0 0\n");

    // A curve becomes a cube that acts alike on each channel.
    std::string const square = folder.write("square.cube", squareCurve());
    EXPECT_EQ(runTool({"lut", "convert", square, back, "--size", "5"}).exitCode, 0);
    EXPECT_EQ(runTool({"lut", "apply", square, "0", "1", "2"}).out, "0 0.4999771 2\n");
    // One lower than in the curve: six decimals are cut on reading.
    EXPECT_EQ(runTool({"lut", "apply", back, "0", "1", "2"}).out, "0 0.4999466 2\n");
    ToolResult const lost = runTool({"lut", "convert", square, mga});
    EXPECT_EQ(lost.exitCode, 0);
    EXPECT_THAT(lost.messages, HasSubstr("cannot tell the domain 0 to 2"));

    EXPECT_EQ(runTool({"lut", "convert", in, folder.path("out.txt")}).exitCode, 2);
    EXPECT_EQ(runTool({"lut", "convert", in, back, "--index", "-1"}).exitCode, 2);
    ToolResult const full = runTool({"lut", "convert", in, "/dev/full", "--format", "cube"});
    EXPECT_EQ(full.exitCode, 4);
    EXPECT_EQ(full.messages, "korvane: /dev/full: No space left on device\n");
    EXPECT_THAT(folder.names(),
                ::testing::ElementsAre("back.cube", "corner.cube", "out.MGA", "square.cube"));
}

TEST(ToolLut, AppliesColoursOfArgumentsAndOfInput)
{
    ScratchFolder const folder;
    std::string const path = folder.write("corner.cube", corner);
    struct Row {
        std::vector<std::string> words;
        char const* out;
    } const rows[] = {
        {{"0.5", "0.5", "0"}, "0.5 0 0\n"},
        {{"--method", "trilinear", "0.5", "0.5", "0"}, "0.25 0 0\n"},
        {{"-0.5", "+7", "1e-1", "1", "1", "0"}, "0 0 0.1\n1 0 0\n"},
        {{"+.5", ".5", "-.2", "1", "1", "-1e-3"}, "0.5 0 0\n1 0 0\n"},
    };
    for (Row const& row : rows) {
        std::vector<std::string> arguments = {"lut", "apply", path};
        arguments.insert(arguments.end(), row.words.begin(), row.words.end());
        EXPECT_EQ(runTool(arguments).out, row.out);
    }
    ToolResult const input = runTool({"lut", "apply", path}, "0.5 0.5 0\n\n\t1 1\t0\r\n");
    EXPECT_EQ(input.out, "0.5 0 0\n1 0 0\n");
    EXPECT_EQ(runTool({"lut", "apply", path}, "0 0 0\n1 2\n").messages,
              "korvane: standard input:2: a colour is three numbers, here are 2\n");
    EXPECT_EQ(runTool({"lut", "apply", path}, "0 0 nan\n").exitCode, 3);
    EXPECT_EQ(runTool({"lut", "apply", path, "0", "0"}).exitCode, 2);
    for (char const* const word : {"x", "-.x", "-.", "+-1", "-x"})
        EXPECT_EQ(runTool({"lut", "apply", path, "0", "0", word}).exitCode, 2) << word;
}

TEST(ToolLut, PlotsAsSVG)
{
    ScratchFolder const folder;
    std::string const out = folder.path("out.svg");
    std::string const path =
        folder.write("a.cube", "TITLE \"<&>\"\n" + std::string(corner).substr(15));
    EXPECT_EQ(runTool({"lut", "plot", path, out, "--slice", "1"}).exitCode, 0);
    std::string const cube = folder.read("out.svg");
    EXPECT_THAT(cube, StartsWith("<svg xmlns=\"http://www.w3.org/2000/svg\""));
    EXPECT_THAT(cube, EndsWith("</svg>\n"));
    EXPECT_THAT(cube, HasSubstr("&lt;&amp;&gt; (2 x 2 x 2)"));
    EXPECT_THAT(cube, HasSubstr("fill=\"#0000ff\"")); // at blue 1 all is blue
    EXPECT_THAT(cube, ::testing::Not(HasSubstr("fill=\"#ff0000\"")));
    runTool({"lut", "plot", "-", out}, squareCurve());
    EXPECT_THAT(folder.read("out.svg"), HasSubstr("(curve)"));
    EXPECT_EQ(runTool({"lut", "plot", path, "/dev/full"}).exitCode, 4);
}
