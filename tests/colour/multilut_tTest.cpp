#include <korvane/colour/multilut_t.h>

#include "colour/LutSupport.h"

namespace {

TEST(multilut_t, ReadsTheTablesOfAFileInTurn)
{
    struct Row {
        char const* text;
        int code;
        std::vector<int> kinds;
    } const rows[] = {
        {"LUT_1D_SIZE 2\nLUT_3D_SIZE 1\n\n0\n1\n\n.5 .5 .5\n", 0, {5, 6}},
        // Its reader takes no index: not the same table for ever.
        {"#type: 3D cube file\nin 1\nvalues red green blue\n0 1 2 3\n", 0, {6}},
        {"TITLE \"none\"\n", 0, {}},
        {"nothing", cc::kUnknownFormat, {}},
        {"LUT_1D_SIZE 2\nLUT_1D_SIZE 2\n0\n1\n\n0\n", cc::kBadData, {5}}, // the second is short
    };
    TemporaryFolder const folder;
    for (auto const& row : rows) {
        cc::multilut_t luts;
        EXPECT_EQ(luts.read(folder.write("l.cube", row.text).c_str(), false), row.code) << row.text;
        std::vector<int> kinds;
        for (auto const& lut : luts.tables)
            kinds.push_back(lut.kind);
        EXPECT_EQ(kinds, row.kinds) << row.text;
    }
}

TEST(multilut_t, AppendsOnDemandAndStopsAtItsLimit)
{
    TemporaryFolder const folder;
    std::string text;
    for (int i = 0; i < 600; ++i)
        text += i < 300 ? "LUT_3D_SIZE 1\n" : "0 0 1\n\n";
    std::string const many = folder.write("many.cube", text);
    std::string const one = folder.write("one.cube", "LUT_3D_SIZE 1\n0 0 0\n");
    cc::multilut_t luts;
    std::size_t expected = cc::multilut_t::kMostTables;
    for (auto const& [path, append] : {std::pair(many, true), {one, true}, {one, false}}) {
        EXPECT_EQ(luts.read(path.c_str(), append), cc::kSuccess);
        EXPECT_EQ(luts.tables.size(), append ? expected++ : 1u);
    }
}

} // namespace
