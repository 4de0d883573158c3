#include "colour/LutSupport.h"

namespace {

std::string const type = "#type: 3D Cube File\n";

TEST(lut_mga, ValuesLineOrdersTheColumns)
{
    struct Row {
        char const* outcome; ///< of the columns 1, 2 and 3
        char const* words;
    } const rows[] = {
        // Without a colour first the order is left as it was: the words may be r, e and d, or
        // redgreenbl, u and e.
        {"0 6 1: 1 2 3", "red green blue|\tred\t green  blue z|cyan red blue|red|redgreenblue|"
                         "RED GREEN BLUE|ab"},
        {"0 6 1: 1 3 2", "red blue green|red green x|red green"}, // the words red, gree and n
        {"0 6 1: 3 1 2", "blue red green|blue red x"},
        {"0 6 1: 3 2 1", "blue green red"},
        {"0 6 1: 2 1 3", "green red blue|-, green red blue"}, // not at the start only
        {"0 6 1: 2 3 1", "green blue red|green x y"},
    };
    for (auto const& row : rows)
        for (std::string const& words : split(row.words))
            expectReadings(type, {{"in 1\nvalues " + words + "\n0 1 2 3\n", row.outcome}});
}

TEST(lut_mga, PlacesCountValuesOrEntries)
{
    expectReadings(
        type + "in 2\nvalues red green blue\n",
        {
            {"3 1 2 3\n0 4 5 6\n", "0 6 1: 4 5 6 1 2 3"},
            // The first place that is no multiple of 3 switches to entries, stored backwards; what
            // was read before stays. Meant so.
            {"0 1 2 3\n1 4 5 6\n", "0 6 1: 1 2 3 6 5 4"},
            {"1 4 5 6\n0 1 2 3\n", "0 6 1: 3 2 1 6 5 4"},
            {"0 1 2 3\n0 4 5 6\n", "0 6 1: 4 5 6 0 0 0"}, // a place twice counts twice
            {"0 1 2 3\n6 4 5 6\n", "-1 6 1: 1 2 3 0 0 0"},
            {"1 1 2 3\n2 4 5 6\n", "-1 6 1: 0 0 0 3 2 1"},
            {"1 1 2 3\n6148914691236517206 4 5 6\n", "-1 6 1: 0 0 0 3 2 1"}, // times 3 is 2^64 + 2
            {"0 1 2 3\n18446744073709551615 4 5 6\n", "-1 6 1: 1 2 3 0 0 0"},
            {"0 1 2 3\n", "-1 6 1: 1 2 3 0 0 0"},
            {"0 1 2 3\n3 4 5 6\n0 1 2 3\n", "-1 6 1: 1 2 3 4 5 6"},
            {"0 1 2 3\n3 4 5 6\n\nmore\n", "0 6 1: 1 2 3 4 5 6"}, // an empty line ends it
            {"0 1 2 3\n \n", "0 6 1: 0 0 0 0 0 0"},               // blanks are a row of zeros
            // Numbers are cut to 16 bits, and 0 where they are missing; nothing goes on behind a
            // character that is none of theirs.
            {" 0\t1  \t2 3 4\n3 65535 65536 65537\n", "0 6 1: 1 2 3 65535 0 1"},
            {"0 18446744073709551617 1 1\n3 1\n", "0 6 1: 1 1 1 1 0 0"},
            {"0 1,2 3\n3 -1 2 3\n", "0 6 1: 1 0 0 0 0 0"},
            {"rubbish\n3 1.5 2 3\n", "0 6 1: 0 0 0 1 0 0"},
        });
}

TEST(lut_mga, HeaderAndCounts)
{
    expectReadings(
        "",
        {
            {type, "0 6 0:"}, // no rows of none expected
            {"#HEADERS\n" + type + "in 5\n#ENDING\nin 1\nvalues x y z\n0 7\n", "0 6 1: 7 0 0"},
            {type + "in 1\nin 2\nout 7\nvalues x y z\n0\n3\n", "0 6 1: 0 0 0 0 0 0"},
            {type + "in -1\n", "-1 6 0:"},
            {type + "in 16777217\n", "-1 6 0:"},
            {type + "in 99999999999999999999\n", "-1 6 0:"},
            {type + "values x y z\n0 1 2 3\n", "-1 6 0:"},
            {type + "in 1\n0 1 2 3\n", "-1 6 1: 0 0 0"}, // data without "values"
            // The table has what the file has room for, and the size is the count's.
            {type + "in 16777216\nvalues x y z\n0 1 2 3\n3 4 5 6\n", "-1 6 256: 1 2 3 4 5 6 of 93"},
        });
    EXPECT_EQ(readLut("#HEADER\n" + type + "#title: \tA  b\n#END\n").lut.title, "A  b");
    EXPECT_EQ(readLut(type + "#title: outside\n").lut.title, "look");
    for (int const edge : {2, 3, 5, 33, 64, 65, 100, 129, 216, 255, 256})
        for (int const change : {-1, 0}) {
            std::string const count = std::to_string(edge * edge * edge + change);
            EXPECT_EQ(readLut(type + "in " + count + "\n").lut.size, edge + change) << count;
        }
}

TEST(lut_mga, IsWrittenSo)
{
    cc::lut_t lut = cubeOf(2, {1,  2,  3,  4,  5,  6,  7,  8,  9,  10, 11,    12,
                               13, 14, 15, 16, 17, 18, 19, 20, 21, 22, 65535, 0});
    lut.title = "Two\nlines";
    EXPECT_EQ(written(lut, cc::lut_t::kMGA, "a.b.mga"),
              "#HEADER\n#filename: a.b\n#type: Pandora 3D LUT file\n#format: 1.00\n#created: n/a\n"
              "#owner: n/a\n#title: Two lines\n#END\n\nchannel 3d\nin 8\nout 65536\n\nformat lut\n"
              "\nvalues\tred\tgreen\tblue\n"
              "0\t1\t2\t3\n12\t13\t14\t15\n6\t7\t8\t9\n18\t19\t20\t21\n"
              "3\t4\t5\t6\n15\t16\t17\t18\n9\t10\t11\t12\n21\t22\t65535\t0\n");
}

} // namespace
