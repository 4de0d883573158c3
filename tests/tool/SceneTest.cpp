#include "Tool.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <sstream>

using testing::HasSubstr;
using testing::IsEmpty;
using testing::StartsWith;

namespace {

std::string const showreel = KORVANE_SOURCE_DIR "/examples/data/showreel.vzml";

std::string document(std::string const& body)
{
    return "<?xml version=\"1.0\"?>\n<vzml version=\"1.0\">\n" + body + "\n</vzml>\n";
}

/// Every kind of value, as attribute and as content, at its ends.
std::string const everyKind =
    document("<clip name=\"&lt;A &amp; &quot;B&quot;&gt;\" id=\"0123456789abcdef00000000ffffffff\""
             " start=\"-9223372036854775808 -2147483648 1d -1\" track=\"-2147483648\" "
             "digest=\"18446744073709551615\">"
             "<source>\u591C 'x'\ny</source><reel>ffffffffffffffffffffffffffffffff</reel>"
             "<in>1001 30000 1 "
             "0</in><length>-9223372036854775808</length><bytes>18446744073709551615</bytes>"
             "<lane>2147483647</lane><flags>4294967295</flags><gain>3.4028235e+38</"
             "gain><opacity>nan</opacity>"
             "<note created=\"-3000000000\"/><transform x=\"-inf\" y=\"4.9406564584124654e-324\" "
             "scale=\"1e-45\"/></clip>");

} // namespace

TEST(SceneShow, DrawsTheTreeOrSpeaksJson)
{
    std::string const json = runTool({"scene", "show", "--json", "-"}, everyKind).out;
    for (char const* text :
         {"\"digest\": 18446744073709551615", "\"content\": \"nan\"", "\"timescale\": -2147483648"})
        EXPECT_THAT(json, HasSubstr(text));

    ToolResult const result = runTool(
        {"scene", "show", "-"}, document("<project name=\"P\"><note>one\ntwo</note><group><clip "
                                         "track=\"-1\"/></group></project><group/>"));
    EXPECT_EQ(result.exitCode, 0) << result.messages;
    EXPECT_EQ(result.out, "project \"P\"\n"
                          "\u251C\u2500 note: \"one\\ntwo\"\n"
                          "\u2514\u2500 group\n"
                          "   \u2514\u2500 clip track=-1\n"
                          "group\n");
}

TEST(SceneCheck, NamesWhatIsWrongAndWhere)
{
    ToolResult const result =
        runTool({"scene", "check", "-"}, document("<project revision=\"12x\">\n"
                                                  "<clip/>\n"
                                                  "<reel2><clip/></reel2>\n"
                                                  "<note mood=\"good\"/>\n"
                                                  "<sequence frame=\"1001 24000 1\"/>\n"
                                                  "</project>"));
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_EQ(result.out, "standard input:3: project revision: found \"12x\", expected a 32-bit "
                          "integer without sign\n"
                          "standard input:4: clip does not belong in project\n"
                          "standard input:5: unknown element reel2\n"
                          "standard input:6: note: unknown attribute mood\n"
                          "standard input:7: sequence frame: found \"1001 24000 1\", expected a "
                          "time (value timescale flags epoch)\n");
    EXPECT_EQ(runTool({"scene", "check", showreel}).out, showreel + ": in order\n");
}

TEST(SceneConvert, GoesBetweenTheFormsWithoutLoss)
{
    ScratchFolder const folder;
    std::vector<std::string> documents = {everyKind, folder.read(showreel)};
    // The same text in every field, of whatever kind, where encodings change.
    std::istringstream edges(
        "-1 -2 127 128 255 256 -256 65536 16777217 2147483648 -2147483648 4294967296 -4294967296 "
        "1099511627776 9007199254740993 9223372036854775808 0.1 -0 -nan 1e39 1e400 "
        "2.2250738585072014e-308 0x1p-3 12abc &amp;lt; \u4E16\U0001F600");
    for (std::string edge; edges >> edge;) {
        std::string clip = "<clip name='$' id='$' start='$' track='$' digest='$'><source>$</source>"
                           "<reel>$</reel><in>$</in><length>$</length><bytes>$</bytes>"
                           "<lane>$</lane><flags>$</flags><gain>$</gain><opacity>$</opacity>"
                           "<transform x='$'/></clip>";
        for (std::size_t at; (at = clip.find('$')) != std::string::npos;)
            clip.replace(at, 1, edge);
        documents.push_back(document(clip));
    }
    for (std::string const& text : documents) {
        SCOPED_TRACE(text);
        auto const convert = [&](char const* from, char const* to, char const* form) {
            ToolResult const result =
                runTool({"scene", "convert", "--to", form, folder.path(from), folder.path(to)});
            EXPECT_EQ(result.exitCode, 0) << result.messages;
        };
        folder.write("in", text);
        convert("in", "text", "text");
        convert("in", "binary", "binary");
        convert("binary", "back", "text");
        convert("text", "again", "text");
        EXPECT_THAT(folder.read("binary"), StartsWith("VZBML"));
        EXPECT_EQ(folder.read("back"), folder.read("text"));
        EXPECT_EQ(folder.read("again"), folder.read("text"));
        EXPECT_EQ(runTool({"scene", "hash", folder.path("binary")}).out.substr(0, 32),
                  runTool({"scene", "hash", folder.path("text")}).out.substr(0, 32));
        if (text == documents[1]) {
            EXPECT_EQ(folder.read("text"), text) << "the sample is in its normal form";
        }
    }
}

TEST(SceneConvert, LeavesNothingBehindWhenItFails)
{
    ScratchFolder const folder;
    ToolResult const missing = runTool({"scene", "convert", showreel, folder.path("no/out")});
    EXPECT_EQ(missing.exitCode, 4);
    EXPECT_THAT(missing.messages, HasSubstr(folder.path("no/out")));
    EXPECT_EQ(runTool({"scene", "convert", showreel, "/dev/full"}).exitCode, 4);
    EXPECT_EQ(runShell("\"$KORVANE\" scene convert '" + showreel + "' - >&-").exitCode, 4);
    std::string const bad = folder.write("bad", "<vzml><clip>");
    folder.write("out", "kept");
    EXPECT_EQ(runTool({"scene", "convert", bad, folder.path("out")}).exitCode, 3);
    EXPECT_EQ(folder.read("out"), "kept");
    EXPECT_THAT(folder.names(), testing::ElementsAre("bad", "out"));
}

TEST(Scene, RefusesWhatIsNoDocument)
{
    ScratchFolder const folder;
    std::string bomb = "<!DOCTYPE vzml [<!ENTITY a \"aaaaaaaaaa\">";
    for (char c = 'b'; c < 'k'; ++c) {
        std::string const before = std::string("&") + static_cast<char>(c - 1) + ";";
        bomb += std::string("<!ENTITY ") + c + " \"" + before + before + "\">";
    }
    bomb += "]><vzml><clip name=\"&j;&j;\"/></vzml>";
    struct Row {
        char const* name;
        std::string bytes;
        char const* message;
    } const rows[] = {
        {"empty", "", ": the file is empty"},
        {"words", "hello", ":1: "},
        {"cut", "<vzml>\n<clip name=\"x\">\n", ":2: "},
        {"root", "<xml/>", ": the root element is not vzml"},
        {"newer", "<vzml version=\"2.0\"/>", ": version 2.0 is newer than this tool"},
        {"bomb", bomb, ""},
    };
    for (Row const& row : rows) {
        std::string const path = folder.write(row.name, row.bytes);
        ToolResult const result = runTool({"scene", "show", path});
        EXPECT_EQ(result.exitCode, 3) << row.name;
        EXPECT_THAT(result.messages, StartsWith("korvane: " + path + row.message)) << row.name;
        EXPECT_THAT(result.out, IsEmpty());
    }
    EXPECT_EQ(runTool({"scene", "show", "-"}, "VZBML 1.0").exitCode, 0); // an empty document
}

TEST(Scene, HoldsThreeHundredThousandLevels)
{
    ScratchFolder const folder;
    std::string deep;
    for (int i = 0; i < 300000; ++i)
        deep += "<group>";
    for (int i = 0; i < 300000; ++i)
        deep += "</group>";
    std::string const path = folder.write("deep", document(deep));
    ToolResult const shown = runTool({"scene", "show", path});
    EXPECT_EQ(shown.exitCode, 0) << shown.messages;
    EXPECT_THAT(shown.out, HasSubstr("(300000) "));
    EXPECT_EQ(runTool({"scene", "show", "--json", path}).exitCode, 1);
    EXPECT_EQ(runTool({"scene", "convert", "--to", "binary", path, folder.path("out")}).exitCode,
              0);
    EXPECT_EQ(runTool({"scene", "hash", folder.path("out")}).exitCode, 0);
}
