#include "colour/LutSupport.h"

#include <gtest/gtest.h>
#include <support/Allocations.h>

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <limits>
#include <random>

#include <fcntl.h>
#include <unistd.h>

namespace {

using Values = std::vector<int>;

/// The value of the one row of a curve.
int valueOf(std::string const& number)
{
    ReadLut const read = readLut("LUT_1D_SIZE 1\n" + number + "\n");
    EXPECT_EQ(read.code, cc::kSuccess) << number;
    return read.lut.table[0];
}

TEST(lut_cube, ParsesNumbers)
{
    std::string const zeros(400, '0');
    struct Row {
        std::string text;
        int value;
    } const rows[] = {
        {"0.5", 32767}, // cut, not rounded
        {".5", 32767},
        {"0.5 1 1", 32767},
        {" \t0.5\t1", 32767},
        {"5e-1", 32767},
        {"5E-1", 32767},
        {"0.005e2", 32767},
        {"+0.5", 32767},
        {"1.", 65535},
        {"1e", 65535},
        {"1e+0", 65535},
        {"0.5,1", 32767}, // what is no number ends it
        {"0.5.5", 32767},
        {"-0.5", 0},
        {"x", 0},
        {"x 1", 0},
        {".", 0},
        {"-", 0},
        {"--1", 0},
        {"+-1", 0},
        {"0x1", 0},
        {"nan", 0},
        {"inf", 0},
        {"infinity", 0},
        {" ", 0}, // a line of blanks is a row of zeros, not an empty line
        {"1e400", 65535},
        {"1e-400", 0},
        {"0." + zeros + "1", 0},
        {"0." + zeros + "5e400", 32767},
        {"1" + zeros, 65535},
        {"1" + zeros + "e-400", 65535},
        {zeros + ".5", 32767},
        {"1e99999999999999999999", 65535},
        {"1e-99999999999999999999", 0},
        {"0e99999999999999999999", 0},
        {"-1e99999999999999999999", 0},
        {"99999999999999999999e-20", 65535},
        {"18446744073709551616e-21", 1208},
    };
    for (auto const& row : rows)
        EXPECT_EQ(valueOf(row.text), row.value) << row.text;
}

TEST(lut_cube, NumbersAreTheNearestFloat)
{
    // In this domain the values of neighbouring floats differ by about 2.
    float const minimum = 0.5f;
    float const maximum = 0.501953125f;
    std::vector<std::string> numbers = {
        // Half-way between two floats, to the even one; and a little to either side.
        "0.500000029802322387695312500000",
        "0.500000089406967163085937500000",
        "0.500000029802322387695312500001",
        "0.500000029802322387695312499999",
        "0.50000002980232239",
    };
    std::mt19937_64 random(7);
    while (numbers.size() < 3000) {
        std::string digits = std::to_string(random() % 1000000000000000000u);
        digits.resize(std::min<std::size_t>(digits.size(), 3 + random() % 16));
        numbers.push_back("0.500" + digits + (random() % 8 ? "" : "e0"));
    }
    std::string text =
        "LUT_3D_SIZE 10\nDOMAIN_MIN .5 .5 .5\nDOMAIN_MAX .501953125 .501953125 .501953125\n";
    for (std::size_t i = 0; i < numbers.size(); ++i)
        text += numbers[i] + (i % 3 == 2 ? "\n" : " ");
    ReadLut const read = readLut(text);
    ASSERT_EQ(read.code, cc::kSuccess);
    for (std::size_t i = 0; i < numbers.size(); ++i) {
        float const v = (std::strtof(numbers[i].c_str(), nullptr) - minimum) / (maximum - minimum);
        float const clamped = std::clamp(v, 0.0f, 1.0f);
        ASSERT_EQ(read.lut.table[i], static_cast<int>(clamped * 65535.0f)) << numbers[i];
    }
}

TEST(lut_cube, DomainsAreSearchedForTheirNumbers)
{
    struct Row {
        char const* line;
        float domainMin;
        float domainMax;
    } const rows[] = {
        {"DOMAIN_MIN 0.5 -1 0.25", -1, 1}, // the smallest of the minima
        {"DOMAIN_MAX 0.5 1 2.5", 0, 2.5},  // the largest of the maxima
        {"DOMAIN_MAX\t.5,.25 x +4 5 6 7", 0, 6},
        {"DOMAIN_MAX 2 3 4 x", 0, 4},
        {"DOMAIN_MAX 100", 0, 1},      // the numbers 1, 0 and 0
        {"DOMAIN_MAX 1e-3 0 0", 0, 0}, // the numbers -3, 0 and 0
        {"DOMAIN_MAX 1.5-2.5+3.5", 0, 3.5},
        {"DOMAIN_MAX 1 2345", 0, 234}, // 1, 234 and 5
        {"DOMAIN_MAX 1. 2. 3.", 0, 1}, // no digit behind the point: no match, so it stays 1
        {"DOMAIN_MAX 12", 0, 1},
        {"DOMAIN_MAX", 0, 1},
        {"DOMAIN_MAX2 2 2", 0, 1},
        {"LUT_1D_INPUT_RANGE -1 2", -1, 2},
        {"LUT_3D_INPUT_RANGE -1 2", -1, 2},
        {"LUT_3D_INPUT_RANGE 100", 10, 0},
        {"LUT_3D_INPUT_RANGE 1.25", 1.2f, 5},
        {"LUT_3D_INPUT_RANGE 1", 0, 1},
    };
    for (auto const& row : rows) {
        ReadLut const read = readLut(std::string("TITLE \"\"\n") + row.line + "\n");
        EXPECT_EQ(read.lut.domainMin, row.domainMin) << row.line;
        EXPECT_EQ(read.lut.domainMax, row.domainMax) << row.line;
    }
    std::string const digits(4000, '1');
    EXPECT_EQ(readLut("TITLE \"\"\nDOMAIN_MAX " + digits + " 1\n").lut.domainMax,
              std::numeric_limits<float>::infinity());
    std::string const blanks(5000, ' '); // longer than any header line
    EXPECT_EQ(readLut("TITLE \"\"\nDOMAIN_MAX 2" + blanks + "2 2\n").lut.domainMax, 1.0f);
}

TEST(lut_cube, EachChannelHasItsOwnDomain)
{
    std::string const head = "LUT_3D_SIZE 1\nDOMAIN_MIN 0 -1 0\nDOMAIN_MAX 1 1 2\n";
    EXPECT_EQ(readLut(head + "0.5 0 1\n").values(), (Values{32767, 32767, 32767}));
    EXPECT_EQ(readLut(head + "-0.5 1.5 3\n").values(), (Values{0, 65535, 65535})); // clamped
    EXPECT_EQ(readLut("LUT_3D_SIZE 1\nLUT_3D_INPUT_RANGE 1 1\n1 2 0\n").values(),
              (Values{0, 65535, 0})); // an empty domain: NaN, then both infinities
}

TEST(lut_cube, RowsMustFitTheHeader)
{
    struct Row {
        char const* text;
        int code;
        Values values;
    } const rows[] = {
        {"LUT_3D_SIZE 1\n0 1 0\n", 0, {0, 65535, 0}},
        {"LUT_3D_SIZE 1\n\n# comment\n0 1 0", 0, {0, 65535, 0}},
        {"LUT_3D_SIZE 1\n0 1 0 1 1\n", 0, {0, 65535, 0}}, // numbers beyond the third
        {"LUT_3D_SIZE 1\n0 1\n", 0, {0, 65535, 0}},       // a missing one is 0
        {"LUT_3D_SIZE 1\n0 1 0\n#\n", 0, {0, 65535, 0}},
        {"LUT_3D_SIZE 1\n0 1 0\n\n1 1 1\n", 0, {0, 65535, 0}}, // an empty line ends the data
        {"LUT_3D_SIZE 1\n0 1 0\n1 1 1\n", -1, {0, 65535, 0}},  // a row too many
        {"LUT_3D_SIZE 1\n0 1 0\n \n", -1, {0, 65535, 0}},      // blanks are a row
        {"LUT_3D_SIZE 1\nUNKNOWN 1\n", 0, {0, 65535, 0}},      // so is an unknown keyword
        {"LUT_3D_SIZE 1\nTITLE\n", 0, {0, 0, 0}},              // and one without its white space
        {"LUT_3D_SIZE 1\n", -1, {0, 0, 0}},
        {"TITLE \"\"\n1 1 1\n", -1, {}}, // no size
        {"TITLE \"\"\nLUT_3D_SIZE 0\n", -1, {}},
        {"TITLE \"\"\nLUT_3D_SIZE -1\n", -1, {}},
        {"TITLE \"\"\nLUT_3D_SIZE 257\n", -1, {}},
        {"TITLE \"\"\nLUT_3D_SIZE 1000000000\n", -1, {}},
        {"TITLE \"\"\nLUT_3D_SIZE -9999999999999999999\n", -1, {}},
        {"TITLE \"\"\nLUT_3D_SIZE 99999999999999999999\n", -1, {}},
        {"TITLE \"\"\nLUT_3D_SIZE big\n", -1, {}},
        {"TITLE \"\"\nLUT_1D_SIZE 0\n", -1, {}},
        {"TITLE \"\"\nLUT_1D_SIZE 65537\n", -1, {}},
    };
    for (auto const& row : rows) {
        ReadLut const read = readLut(row.text);
        EXPECT_EQ(read.code, row.code) << row.text;
        EXPECT_EQ(read.values(), row.values) << row.text;
    }
    // Far too short for its size: refused before any memory is taken for it.
    allocations::startPeak();
    EXPECT_EQ(readLut("LUT_3D_SIZE 256\n0 0 0\n").code, -1);
    EXPECT_LT(allocations::peak(), 1 << 20);
}

TEST(lut_cube, ACurveOfAnyLengthHas1024Values)
{
    ReadLut const two = readLut("LUT_1D_SIZE 2\n.25 0 0\n.5 0 0\n");
    EXPECT_EQ(two.lut.kind, 5);
    EXPECT_EQ(two.lut.size, 1024);
    ASSERT_EQ(two.lut.table.size(), 1024u);
    EXPECT_EQ(two.lut.table[0], 16383);
    EXPECT_EQ(two.lut.table[1022], 16383); // nothing in between: the row before
    EXPECT_EQ(two.lut.table[1023], 32767);

    auto const curve = [](std::size_t rows) {
        std::string text = "LUT_1D_SIZE " + std::to_string(rows) + "\n";
        for (std::size_t i = 0; i < rows; ++i)
            text += i + 1 < rows ? "0\n" : "1\n";
        ReadLut const read = readLut(text);
        EXPECT_EQ(read.code, 0) << rows;
        return read.lut;
    };
    EXPECT_EQ(curve(1).table[512], 65535); // one row is all there is
    EXPECT_EQ(curve(1024).table[1023], 65535);
    EXPECT_EQ(curve(1024).table[1022], 0);
    EXPECT_EQ(curve(65536).table[1023], 65535);
    // Meant so: for 25 lengths, this the least, 1023 * ((n - 1) / 1023.0) falls short of n - 1.
    EXPECT_EQ(curve(16374).table[1023], 0);
    EXPECT_EQ(curve(16373).table[1023], 65535);

    ReadLut const cutShort = readLut("LUT_1D_SIZE 2\n1\n");
    EXPECT_EQ(cutShort.code, -1);
    EXPECT_EQ(cutShort.lut.table[1022], 65535); // what was read is there
    EXPECT_EQ(cutShort.lut.table[1023], 0);
}

TEST(lut_cube, IndexChoosesAmongTables)
{
    std::string const head = "LUT_3D_SIZE 1\nLUT_1D_SIZE 1\nDOMAIN_MAX 2 2 2\nLUT_3D_SIZE 1\n\n";
    std::string const text = head + "0 0 1\n\n1\n\n# third\n2 2 2\n";
    struct Row {
        std::string text;
        unsigned long index;
        int code;
        int kind;
        int first;
    } const rows[] = {
        {text, 0, 0, 6, 0},
        {text, 1, 0, 5, 32767},
        {text, 2, 0, 6, 65535},
        {text, 3, 0, 0, -1}, // beyond the last one: a success without a table
        {text, 4000000000ul, 0, 0, -1},
        {head + "0 0 1\n\n\n1\n", 1, -1, 5, 0}, // meant so: two empty lines are two ends
        {head + "0 0 1\n", 1, -1, 5, 0},
    };
    for (auto const& row : rows) {
        ReadLut const read = readLut(row.text, row.index);
        EXPECT_EQ(read.code, row.code) << row.index;
        EXPECT_EQ(read.lut.kind, row.kind) << row.index;
        EXPECT_EQ(read.lut.table.empty() ? -1 : read.lut.table[0], row.first) << row.index;
    }
}

TEST(lut_cube, IsWrittenSo)
{
    cc::lut_t lut = cubeOf(2, {0,     0, 0, 65535, 0, 0, 0,     32768, 0, 1,     2,     3,
                               65534, 0, 0, 65535, 0, 0, 65535, 65535, 0, 65535, 65535, 65535});
    lut.title = "Two \"by\" two";
    EXPECT_EQ(written(lut, cc::lut_t::kCUBE), "# Generated by Brovo\n"
                                              "TITLE \"Two \"by\" two\"\n"
                                              "LUT_3D_SIZE 2\n"
                                              "DOMAIN_MIN 0.000000 0.000000 0.000000\n"
                                              "DOMAIN_MAX 1.000000 1.000000 1.000000\n"
                                              "\n"
                                              "0.000000 0.000000 0.000000\n"
                                              "1.000000 0.000000 0.000000\n"
                                              "0.000000 0.500008 0.000000\n"
                                              "0.000015 0.000031 0.000046\n"
                                              "0.999985 0.000000 0.000000\n"
                                              "1.000000 0.000000 0.000000\n"
                                              "1.000000 1.000000 0.000000\n"
                                              "1.000000 1.000000 1.000000\n");
    lut = cubeOf(1, {0, 32768, 65535});
    lut.domainMin = -1;
    lut.domainMax = 100;
    EXPECT_EQ(written(lut, cc::lut_t::kCUBE, "/a/../b.c.cube"), "");
    EXPECT_EQ(written(lut, cc::lut_t::kCUBE, "b.c.cube"),
              "# Generated by Brovo\n"
              "TITLE \"b.c\"\n"
              "LUT_3D_SIZE 1\n"
              "DOMAIN_MIN -1.000000 -1.000000 -1.000000\n"
              "DOMAIN_MAX 100.000000 100.000000 100.000000\n"
              "\n"
              "-1.000000 49.500771 100.000000\n");
}

TEST(lut_cube, NumbersAreWrittenAsPrintfWritesThem)
{
    std::vector<float> numbers = {0.0f,
                                  -0.0f,
                                  1.0f,
                                  0.9999995f,
                                  0.9999996f,
                                  0.0000005f,
                                  0x1p-7f,   // 0.0078125: a tie, to the even digit below
                                  0x1.8p-6f, // 0.0234375: a tie, to the even digit above
                                  0x1p-149f,
                                  -0x1p-40f,
                                  8388607.5f,
                                  8388608.0f,
                                  -16777216.0f,
                                  std::numeric_limits<float>::max(),
                                  std::numeric_limits<float>::lowest(),
                                  std::numeric_limits<float>::infinity()};
    std::mt19937 random(3);
    for (int i = 0; i < 2000; ++i)
        numbers.push_back(std::ldexp(static_cast<float>(static_cast<std::int32_t>(random())),
                                     static_cast<int>(random() % 80) - 60));
    TemporaryFolder const folder;
    std::string const path = folder.path("numbers");
    int const fd = ::open(path.c_str(), O_WRONLY | O_CREAT, 0600);
    ASSERT_GE(fd, 0);
    std::string expected;
    for (float const number : numbers) {
        cc::lut_t lut;
        lut.domainMin = number;
        EXPECT_EQ(lut.writeCUBE(fd, "n"), 0);
        auto const value = static_cast<double>(number);
        char line[200];
        std::snprintf(line, sizeof line, "DOMAIN_MIN %f %f %f\n", value, value, value);
        expected += line;
    }
    ::close(fd);
    cc::tfreader_t reader;
    ASSERT_EQ(reader.open(path.c_str()), 0);
    std::string found;
    for (std::string line; reader.readln(line);)
        if (line.starts_with("DOMAIN_MIN"))
            found += line + "\n";
    EXPECT_TRUE(found == expected);
}

TEST(lut_cube, WriteThenReadIsWithinOne)
{
    for (float const domainMin : {0.0f, -0.5f}) {
        cc::lut_t lut = scatteredCube(17);
        lut.domainMin = domainMin;
        ReadLut const read = readLut(written(lut, cc::lut_t::kCUBE));
        ASSERT_EQ(read.code, 0);
        EXPECT_EQ(read.lut.domainMin, domainMin);
        ASSERT_EQ(read.lut.table.size(), lut.table.size());
        // Six decimals are cut on reading, so most come back one lower: meant so.
        for (std::size_t i = 0; i < lut.table.size(); ++i)
            ASSERT_LE(std::abs(read.lut.table[i] - lut.table[i]), 1) << i;
    }
}

TEST(lut_cube, LoadingTakesTheTableAndLittleMore)
{
    TemporaryFolder const folder;
    cc::lut_t const lut = scatteredCube(33);
    std::string const path = folder.path("big.cube");
    lut.write(path.c_str(), cc::lut_t::kCUBE);
    auto const bytes = static_cast<long>(lut.table.size() * sizeof(unsigned short));
    allocations::startPeak();
    cc::lut_t read;
    ASSERT_EQ(read.read(path.c_str(), 0), 0);
    EXPECT_LT(allocations::peak(), bytes + (1 << 16));

    // A line of 100 MB: its first MiB counts.
    std::string const longLine = folder.write("long.cube", "LUT_3D_SIZE 1\n0 1");
    std::filesystem::resize_file(longLine, 100'000'000);
    allocations::startPeak();
    EXPECT_EQ(read.read(longLine.c_str(), 0), 0);
    EXPECT_LT(allocations::peak(), 1 << 22);
}

TEST(lut_cube, ReadsWhatOtherToolsWrite)
{
    struct Row {
        char const* file;
        int kind;
        int size;
        std::size_t place; ///< of a value in the table
        int value;
    } const rows[] = {
        {"opencolorio-3d.cube", 6, 5, 3, static_cast<int>(0.271916f * 65535)},
        {"opencolorio-1d.cube", 5, 1024, 600, static_cast<int>(0.707107f * 65535)},
        {"argyll-3d.cube", 6, 5, 16, static_cast<int>(0.258145f * 65535)},
    };
    for (auto const& row : rows) {
        cc::lut_t lut;
        std::string const path = std::string(KORVANE_TEST_DATA "/lut/") + row.file;
        EXPECT_EQ(lut.read(path.c_str(), 0), 0) << row.file;
        EXPECT_EQ(lut.kind, row.kind) << row.file;
        EXPECT_EQ(lut.size, row.size) << row.file;
        ASSERT_GT(lut.table.size(), row.place) << row.file;
        EXPECT_EQ(lut.table[row.place], row.value) << row.file;
        EXPECT_EQ(lut.title + ".cube", row.file);
    }
}

} // namespace
