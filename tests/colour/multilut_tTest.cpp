#include <korvane/colour/multilut_t.h>

#include "colour/LutSupport.h"

#include <gtest/gtest.h>

namespace {

TEST(multilut_t, ReadsTheTablesOfAFileInTurn)
{
    char const* const twoTables = "LUT_1D_SIZE 2\nLUT_3D_SIZE 1\n\n0\n1\n\n.5 .5 .5\n";
    char const* const oneMGA = "#type: 3D cube file\nin 1\nvalues red green blue\n0 1 2 3\n";
    struct Row {
        char const* text;
        int code;
        std::vector<int> kinds;
    } const rows[] = {
        {twoTables, 0, {5, 6}},
        {oneMGA, 0, {6}}, // its reader takes no index: not the same table for ever
        {"LUT_3D_SIZE 1\n0 0 0\n", 0, {6}},
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
    for (int i = 0; i < 300; ++i)
        text += "LUT_3D_SIZE 1\n";
    for (int i = 0; i < 300; ++i)
        text += "0 0 1\n\n";
    std::string const path = folder.write("many.cube", text);
    cc::multilut_t luts;
    EXPECT_EQ(luts.read(path.c_str(), true), cc::kSuccess);
    EXPECT_EQ(luts.tables.size(), cc::multilut_t::kMostTables);
    EXPECT_EQ(luts.tables.back().table[2], 65535);
    std::string const other = folder.write("one.cube", "LUT_3D_SIZE 1\n0 0 0\n");
    EXPECT_EQ(luts.read(other.c_str(), true), cc::kSuccess);
    EXPECT_EQ(luts.tables.size(), cc::multilut_t::kMostTables + 1);
    EXPECT_EQ(luts.read(other.c_str(), false), cc::kSuccess);
    EXPECT_EQ(luts.tables.size(), 1u);
}

} // namespace
