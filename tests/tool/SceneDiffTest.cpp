#include "Tool.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

using testing::HasSubstr;

namespace {

std::string document(std::string const& body)
{
    return "<?xml version=\"1.0\"?>\n<vzml version=\"1.0\">\n" + body + "\n</vzml>\n";
}

} // namespace

TEST(SceneDiff, SaysWhereDocumentsDiffer)
{
    std::string const longText(200, 'x');
    struct Row {
        std::string first, second;
        std::string expected;
    } const rows[] = {
        {"<clip name='a'/>", "<clip name='a'></clip>", ""},
        {"<clip><gain>nan</gain></clip>", "<clip><gain>-nan</gain></clip>", ""},
        {"<clip name='a' track='1'/>", "<clip name='a' track='2'/>", "clip \"a\": track: 1 -> 2\n"},
        {"<note author='b'>x</note>", "<note author='b'/>", "note \"b\": \"x\" -> none\n"},
        // An id tells elements apart before a name does.
        {"<clip id='00000000000000000000000000000001' name='a'/>",
         "<clip id='00000000000000000000000000000001' name='b'/>",
         "clip \"a\": name: \"a\" -> \"b\"\n"},
        // Alike neighbours are numbered; what is left over is compared in its order.
        {"<group name='g'><clip/><clip/><clip track='1'/></group>",
         "<group name='g'><clip/><clip/><clip track='2'/></group>",
         "group \"g\" / clip[3]: track: 1 -> 2\n"},
        {"<clip name='a'/><clip name='b'/>", "<clip name='c'/><clip name='a'/>",
         "in another order\nclip \"b\": name: \"b\" -> \"c\"\n"},
        {"<group><clip name='a'/><note author='m'/></group>",
         "<group><clip name='a'/><clip name='b'/></group>",
         "group: only in A: note \"m\"\ngroup: only in B: clip \"b\"\n"},
        // Times are compared as records.
        {"<marker time='1 2 1 0'/>", "<marker time='2 4 1 0'/>",
         "marker time=0.500000(1/2): time: 0.500000(1/2) -> 0.500000(2/4)\n"},
        // Of long texts the part around the first difference is shown.
        {"<note>" + longText + "a" + longText + "</note>", "<note>" + longText + "b</note>",
         "note: ..." + std::string(20, 'x') + "a" + std::string(59, 'x') + "... -> ..." +
             std::string(20, 'x') + "b\"\n"},
    };
    ScratchFolder const folder;
    for (Row const& row : rows) {
        std::string const a = folder.write("A", document(row.first));
        std::string const b = folder.write("B", document(row.second));
        ToolResult const result =
            runShell("cd '" + folder.path("") + "' && \"$KORVANE\" scene diff A B");
        EXPECT_EQ(result.out, row.expected);
        EXPECT_EQ(result.messages, "");
        EXPECT_EQ(result.exitCode, row.expected.empty() ? 0 : 1) << row.first;
        // The form makes no difference.
        ASSERT_EQ(runTool({"scene", "convert", "--to", "binary", b, b}).exitCode, 0);
        EXPECT_EQ(runShell("cd '" + folder.path("") + "' && \"$KORVANE\" scene diff A B").out,
                  row.expected);
    }
}

TEST(SceneDiff, HoldsWideAndDeepDocuments)
{
    ScratchFolder const folder;
    std::string wide, deep;
    for (int i = 0; i < 50000; ++i)
        wide += "<clip track='" + std::to_string(i) + "'/>";
    for (int i = 0; i < 100000; ++i)
        deep += "<group>";
    deep += "<clip track='1'/>";
    for (int i = 0; i < 100000; ++i)
        deep += "</group>";
    std::string const a = folder.write("a", document(wide + deep));
    std::string const b = folder.write("b", document("<clip track='-1'/>" + wide));
    ToolResult const result = runTool({"scene", "diff", a, b});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_EQ(std::count(result.out.begin(), result.out.end(), '\n'), 50002);
    EXPECT_THAT(result.out, HasSubstr("only in " + a + ": group\n"));
    EXPECT_THAT(result.out, HasSubstr("clip[50000]: track: 49999 -> 49998\n"));
    EXPECT_THAT(runTool({"scene", "diff", "--json", a, b}).out,
                HasSubstr("\"what\": \"only in first\",\n    \"name\": \"group\""));
    EXPECT_EQ(runTool({"scene", "diff", a, folder.path("missing")}).exitCode, 4);
}
