#include "colour/LutSupport.h"

#include <gtest/gtest.h>
#include <support/Allocations.h>

namespace {

using Values = std::vector<int>;

std::string const head = "#HEADER\n#type: Pandora 3D LUT file\n#title: Sample\n#END\n\n";

ReadLut readMGA(std::string const& body)
{
    return readLut(head + body, 0, "look.mga");
}

TEST(lut_mga, ValuesLineOrdersTheColumns)
{
    struct Row {
        char const* words;
        Values stored; ///< of the columns 1, 2 and 3
    } const rows[] = {
        {"red green blue", {1, 2, 3}},
        {"red blue green", {1, 3, 2}},
        {"red green x", {1, 3, 2}},
        {"blue red green", {3, 1, 2}},
        {"blue red x", {3, 1, 2}},
        {"blue green red", {3, 2, 1}},
        {"green red blue", {2, 1, 3}},
        {"green blue red", {2, 3, 1}},
        {"green x y", {2, 3, 1}},
        {"cyan red blue", {1, 2, 3}},
        {"\tred\t green  blue z", {1, 2, 3}},
        {"-, green red blue", {2, 1, 3}}, // searched for, not at the start only
        {"red green", {1, 3, 2}},         // the words red, gree and n
        {"red", {1, 2, 3}},               // the words r, e and d: no colour
        {"redgreenblue", {1, 2, 3}},      // the words redgreenbl, u and e
        {"RED GREEN BLUE", {1, 2, 3}},    // no colour: the order is left as it was
        {"ab", {1, 2, 3}},
    };
    for (auto const& row : rows) {
        ReadLut const read = readMGA(std::string("in 1\nvalues ") + row.words + "\n0 1 2 3\n");
        EXPECT_EQ(read.code, 0) << row.words;
        EXPECT_EQ(read.values(), row.stored) << row.words;
    }
}

TEST(lut_mga, PlacesCountValuesOrEntries)
{
    struct Row {
        char const* data;
        int code;
        Values values;
    } const rows[] = {
        {"0 1 2 3\n3 4 5 6\n", 0, {1, 2, 3, 4, 5, 6}},
        {"3 1 2 3\n0 4 5 6\n", 0, {4, 5, 6, 1, 2, 3}},
        // The first place that is no multiple of 3 switches to entries, stored backwards; what
        // was read before stays. Meant so.
        {"0 1 2 3\n1 4 5 6\n", 0, {1, 2, 3, 6, 5, 4}},
        {"1 4 5 6\n0 1 2 3\n", 0, {3, 2, 1, 6, 5, 4}},
        {"0 1 2 3\n0 4 5 6\n", 0, {4, 5, 6, 0, 0, 0}}, // a place twice counts twice
        {"0 1 2 3\n6 4 5 6\n", -1, {1, 2, 3, 0, 0, 0}},
        {"1 1 2 3\n2 4 5 6\n", -1, {0, 0, 0, 3, 2, 1}},
        {"1 1 2 3\n6148914691236517206 4 5 6\n", -1, {0, 0, 0, 3, 2, 1}}, // times 3 is 2^64 + 2
        {"0 1 2 3\n18446744073709551615 4 5 6\n", -1, {1, 2, 3, 0, 0, 0}},
        {"0 1 2 3\n", -1, {1, 2, 3, 0, 0, 0}},
        {"0 1 2 3\n3 4 5 6\n0 1 2 3\n", -1, {1, 2, 3, 4, 5, 6}},
        {"0 1 2 3\n3 4 5 6\n\nmore\n", 0, {1, 2, 3, 4, 5, 6}}, // an empty line ends it
        {"0 1 2 3\n \n", 0, {0, 0, 0, 0, 0, 0}},               // blanks are a row of zeros
    };
    for (auto const& row : rows) {
        ReadLut const read = readMGA(std::string("in 2\nvalues red green blue\n") + row.data);
        EXPECT_EQ(read.code, row.code) << row.data;
        EXPECT_EQ(read.values(), row.values) << row.data;
    }
}

TEST(lut_mga, ParsesNumbers)
{
    struct Row {
        char const* row;
        Values values;
    } const rows[] = {
        {"0\t1\t2\t3", {1, 2, 3}},
        {" 0  1 \t 2 3 4", {1, 2, 3}},
        {"0 65535 65536 65537", {65535, 0, 1}}, // cut to 16 bits
        {"0 18446744073709551617 1 1", {1, 1, 1}},
        {"0 1", {1, 0, 0}},
        {"", {0, 0, 0}},
        {"0 1,2 3", {1, 0, 0}}, // a missing number is 0, and nothing goes on behind it
        {"0 -1 2 3", {0, 0, 0}},
        {"0 1.5 2 3", {1, 0, 0}},
        {"rubbish", {0, 0, 0}},
    };
    for (auto const& row : rows) {
        ReadLut const read = readMGA(std::string("in 1\nvalues red green blue\n") + row.row + "\n");
        EXPECT_EQ(read.values(), row.values) << row.row;
        EXPECT_EQ(read.code, *row.row ? 0 : -1) << row.row;
    }
}

TEST(lut_mga, SizeIsTheWholeCubeRootOfTheCount)
{
    std::vector<int> edges = {64, 65, 100, 125, 129, 216, 256};
    for (int edge = 1; edge < 40; ++edge)
        edges.push_back(edge);
    for (int const edge : edges)
        for (int const change : {-1, 0, 1}) {
            int const count = edge * edge * edge + change;
            int const size = change < 0 ? edge - 1 : edge;
            TemporaryFolder const folder;
            // One row, then an end of data, and bytes enough for the count to be possible.
            std::string const path = folder.write("l.mga", head + "in " + std::to_string(count) +
                                                               "\nvalues r g b\n0 1 1 1\n\n");
            std::filesystem::resize_file(path, 200 + 2 * static_cast<std::size_t>(count));
            cc::lut_t lut;
            bool const allowed = count <= 16777216;
            EXPECT_EQ(lut.read(path.c_str(), 0), count == 1 ? 0 : -1) << count;
            EXPECT_EQ(lut.size, allowed ? size : 0) << count;
            EXPECT_EQ(lut.table.size(), allowed ? 3 * static_cast<std::size_t>(count) : 0) << count;
        }
}

TEST(lut_mga, HeaderAndCounts)
{
    struct Row {
        char const* text;
        int code;
        char const* title;
        std::size_t values;
    } const rows[] = {
        {"#type: 3D Cube File\n", 0, "look", 0}, // no rows of none expected
        {"#HEADERS\n#type: 3D Cube File\n#title: \tA  b\nin 5\n#ENDING\nin 1\nvalues x y z\n0\n", 0,
         "A  b", 3}, // "in" within the header is no count
        {"#type: 3D Cube File\n#title: outside\nin 1\nvalues x y z\n0\n", 0, "look", 3},
        {"#type: 3D Cube File\nin 1\nin 2\nout 7\nvalues x y z\n0\n3\n", 0, "look", 6},
        {"#type: 3D Cube File\nin -1\n", -1, "", 0},
        {"#type: 3D Cube File\nin 16777217\n", -1, "", 0},
        {"#type: 3D Cube File\nin 99999999999999999999\n", -1, "", 0},
        {"#type: 3D Cube File\nvalues x y z\n0 1 2 3\n", -1, "", 0},
        {"#type: 3D Cube File\nin 1\n0 1 2 3\n", -1, "", 3}, // data without "values"
    };
    for (auto const& row : rows) {
        ReadLut const read = readLut(row.text, 0, "look.mga");
        EXPECT_EQ(read.code, row.code) << row.text;
        EXPECT_EQ(read.lut.title, row.title) << row.text;
        EXPECT_EQ(read.lut.table.size(), row.values) << row.text;
        EXPECT_EQ(read.lut.kind, 6) << row.text;
    }
    allocations::startPeak();
    EXPECT_EQ(readMGA("in 16777216\n").code, -1); // too short a file: no memory is taken
    EXPECT_LT(allocations::peak(), 1 << 20);
}

TEST(lut_mga, IsWrittenSo)
{
    cc::lut_t lut = cubeOf(2, {1,  2,  3,  4,  5,  6,  7,  8,  9,  10, 11,    12,
                               13, 14, 15, 16, 17, 18, 19, 20, 21, 22, 65535, 0});
    lut.title = "Two\nlines";
    EXPECT_EQ(written(lut, cc::lut_t::kMGA, "a.b.mga"), "#HEADER\n"
                                                        "#filename: a.b\n"
                                                        "#type: Pandora 3D LUT file\n"
                                                        "#format: 1.00\n"
                                                        "#created: n/a\n"
                                                        "#owner: n/a\n"
                                                        "#title: Two lines\n"
                                                        "#END\n"
                                                        "\n"
                                                        "channel 3d\n"
                                                        "in 8\n"
                                                        "out 65536\n"
                                                        "\n"
                                                        "format lut\n"
                                                        "\n"
                                                        "values\tred\tgreen\tblue\n"
                                                        "0\t1\t2\t3\n"
                                                        "12\t13\t14\t15\n"
                                                        "6\t7\t8\t9\n"
                                                        "18\t19\t20\t21\n"
                                                        "3\t4\t5\t6\n"
                                                        "15\t16\t17\t18\n"
                                                        "9\t10\t11\t12\n"
                                                        "21\t22\t65535\t0\n");
}

TEST(lut_mga, WriteThenReadIsTheSame)
{
    cc::lut_t lut = scatteredCube(33);
    lut.title = "Scattered";
    ReadLut const read = readLut(written(lut, cc::lut_t::kMGA), 0, "x.mga");
    EXPECT_EQ(read.code, 0);
    EXPECT_EQ(read.lut.size, 33);
    EXPECT_EQ(read.lut.title, "Scattered");
    EXPECT_TRUE(std::equal(lut.table.begin(), lut.table.end(), read.lut.table.begin(),
                           read.lut.table.end()));
}

} // namespace
