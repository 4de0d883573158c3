#include "colour/LutSupport.h"

#include <cmath>
#include <limits>
#include <random>

#include <fcntl.h>
#include <unistd.h>

namespace {

TEST(lut_cube, ParsesNumbers)
{
    std::string const zeros(400, '0');
    struct Row {
        int value; ///< cut, not rounded
        std::string texts;
    } const rows[] = {
        {32767, "0.5|.5|0.5 1 1| \t0.5\t1|5e-1|5E-1|0.005e2|+0.5|0.5,1|0.5.5|0.500000x|0.500000e0|"
                "0.5000000|0." +
                    zeros + "5e400|" + zeros + ".5"},
        {65535, "1.|1e|1e+0|1e400|1" + zeros + "|1" + zeros +
                    "e-400|10.00000|"
                    "1e99999999999999999999|99999999999999999999e-20"},
        {0, // blanks are a row of zeros, not an empty line
         "-0.5|x|x 1|.|-|--1|+-1|0x1|nan|inf|infinity| |1e-400|/.500000|:.500000|0. 99999|0." +
             zeros + "1|1e-99999999999999999999|0e99999999999999999999|-1e99999999999999999999"},
        {1208, "18446744073709551616e-21"},
    };
    for (auto const& row : rows)
        for (std::string const& text : split(row.texts)) {
            ReadLut const read = readLut("LUT_1D_SIZE 1\n" + text + "\n");
            EXPECT_EQ(read.code, cc::kSuccess) << text;
            EXPECT_EQ(read.lut.table[0], row.value) << text;
        }
}

TEST(lut_cube, NumbersAreTheNearestFloat)
{
    // In this domain the values of neighbouring floats differ by about 2. The first numbers lie
    // half-way between two floats, or a little to either side.
    float const minimum = 0.5f;
    float const maximum = 0.501953125f;
    std::vector<std::string> numbers = {"0.500000029802322387695312500000",
                                        "0.500000089406967163085937500000",
                                        "0.500000029802322387695312500001",
                                        "0.500000029802322387695312499999", "0.50000002980232239"};
    std::mt19937_64 random(7);
    while (numbers.size() < 3000) {
        std::string digits = std::to_string(random() % 1000000000000000000u);
        digits.resize(std::min<std::size_t>(digits.size(), 1 + random() % 18));
        numbers.push_back("0.500" + digits + (random() % 8 ? "" : "e0"));
    }
    std::string text = "LUT_3D_SIZE 10\nDOMAIN_MIN .5 .5 .5\nDOMAIN_MAX .501953125 .501953125 "
                       ".501953125\n";
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
        std::string line;
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
        {"DOMAIN_MAX2 2 2", 0, 1},
        {"DOMAIN_MAX " + std::string(4000, '1') + " 1", 0, std::numeric_limits<float>::infinity()},
        {"DOMAIN_MAX 2" + std::string(5000, ' ') + "2 2", 0, 1}, // longer than any header line
        {"LUT_1D_INPUT_RANGE -1 2", -1, 2},
        {"LUT_3D_INPUT_RANGE 100", 10, 0},
        {"LUT_3D_INPUT_RANGE 1.25", 1.2f, 5},
        {"LUT_3D_INPUT_RANGE 1", 0, 1},
    };
    for (auto const& row : rows) {
        ReadLut const read = readLut("TITLE \"\"\n" + row.line + "\n");
        EXPECT_EQ(read.lut.domainMin, row.domainMin) << row.line;
        EXPECT_EQ(read.lut.domainMax, row.domainMax) << row.line;
    }
}

TEST(lut_cube, RowsMustFitTheHeader)
{
    std::string const one = "LUT_3D_SIZE 1\n";
    std::string const domains = one + "DOMAIN_MIN 0 -1 0\nDOMAIN_MAX 1 1 2\n";
    expectReadings(
        "",
        {
            {one + "\n# comment\n0 1 0", "0 6 1: 0 65535 0"},
            {one + "0 1 0 1 1\n", "0 6 1: 0 65535 0"}, // numbers beyond the third
            {one + "0 1\n", "0 6 1: 0 65535 0"},       // a missing one is 0
            {one + "0 1 0\n#\n", "0 6 1: 0 65535 0"},
            {one + "0 1 0\n\n1 1 1\n", "0 6 1: 0 65535 0"}, // an empty line ends the data
            {one + "0 1 0\n1 1 1\n", "-1 6 1: 0 65535 0"},  // a row too many
            {one + "0 1 0\n \n", "-1 6 1: 0 65535 0"},      // blanks are a row
            {one + "UNKNOWN 1\n", "0 6 1: 0 65535 0"},      // so is an unknown keyword
            {one + "TITLE\n", "0 6 1: 0 0 0"},              // and one without its white space
            {one, "-1 6 1: 0 0 0"},
            {domains + "0.5 0 1\n", "0 6 1: 32767 32767 32767"}, // each channel has its own domain
            {domains + "-0.5 1.5 3\n", "0 6 1: 0 65535 65535"},
            {one + "LUT_3D_INPUT_RANGE 1 1\n1 2 0\n", "0 6 1: 0 65535 0"}, // NaN, both infinities
            // What is too short leaves what was read, and room for what the file could hold.
            {"LUT_3D_SIZE 2\n0 1 0\n1 0 0\n", "-1 6 2: 0 65535 0 65535 0 0 of 24"},
            {"LUT_3D_SIZE 256\n0 1 0\n1 0 0\n", "-1 6 256: 0 65535 0 65535 0 0 of 42"},
            {"LUT_1D_SIZE 2\n1\n", "-1 5 1024: 65535 65535 65535 65535 65535 65535 of 1024"},
            {"LUT_1D_SIZE 65536\n1\n", "-1 5 1024: 65535 0 0 0 0 0 of 1024"},
        });
    for (std::string const& size :
         split("3D_SIZE 0|3D_SIZE -1|3D_SIZE 257|3D_SIZE 1000000000|3D_SIZE -9999999999999999999|"
               "3D_SIZE 99999999999999999999|3D_SIZE big|1D_SIZE 0|1D_SIZE 65537|2D_SIZE 1"))
        expectReadings("TITLE \"\"\n", {{"LUT_" + size + "\n0 0 0\n", "-1 0 0:"}});
}

TEST(lut_cube, ACurveOfAnyLengthHas1024Values)
{
    struct Row {
        std::size_t rows; ///< 0.25 all of them, the last one excepted, which is 0.5
        int beforeLast;
        int last;
    } const rows[] = {
        {1, 32767, 32767},     {2, 16383, 32767}, // nothing in between
        {1024, 16383, 32767},  {16373, 16383, 32767},
        {16374, 16383, 16383}, // meant so: 1023 * ((n - 1) / 1023.0) falls short of n - 1
        {65536, 16383, 32767},
    };
    for (auto const& row : rows) {
        std::string text = "LUT_1D_SIZE " + std::to_string(row.rows) + "\n";
        for (std::size_t i = 1; i < row.rows; ++i)
            text += ".25 1 1\n";
        ReadLut const read = readLut(text + ".5 0 0\n");
        EXPECT_EQ(outcomeOf(read).substr(0, 9), "0 5 1024:") << row.rows;
        ASSERT_EQ(read.lut.table.size(), 1024u);
        EXPECT_EQ(read.lut.table[1022], row.beforeLast) << row.rows;
        EXPECT_EQ(read.lut.table[1023], row.last) << row.rows;
    }
}

TEST(lut_cube, IndexChoosesAmongTables)
{
    std::string const head = "LUT_3D_SIZE 1\nLUT_1D_SIZE 1\nDOMAIN_MAX 2 2 2\nLUT_3D_SIZE 1\n\n";
    std::string const text = head + "0 0 1\n\n1\n\n# third\n2 2 2\n";
    // An index beyond the last table is a success. Meant so: two empty lines are two ends.
    expectReadings("", {{text, "0 6 1: 0 0 32767", 0},
                        {text, "0 5 1024: 32767 32767 32767 32767 32767 32767 of 1024", 1},
                        {text, "0 6 1: 65535 65535 65535", 2},
                        {text, "0 0 0:", 3},
                        {text, "0 0 0:", 4000000000ul},
                        {head + "0 0 1\n\n\n1\n", "-1 5 1024: 0 0 0 0 0 0 of 1024", 1}});
}

TEST(lut_cube, IsWrittenSo)
{
    cc::lut_t lut = cubeOf(2, {0,     0, 0, 65535, 0, 0, 0,     32768, 0, 1,     2,     3,
                               65534, 0, 0, 65535, 0, 0, 65535, 65535, 0, 65535, 65535, 65535});
    lut.title = "Two \"by\" two";
    EXPECT_EQ(written(lut, cc::lut_t::kCUBE),
              "# Generated by Brovo\nTITLE \"Two \"by\" two\"\nLUT_3D_SIZE 2\n"
              "DOMAIN_MIN 0.000000 0.000000 0.000000\nDOMAIN_MAX 1.000000 1.000000 1.000000\n\n"
              "0.000000 0.000000 0.000000\n1.000000 0.000000 0.000000\n"
              "0.000000 0.500008 0.000000\n0.000015 0.000031 0.000046\n"
              "0.999985 0.000000 0.000000\n1.000000 0.000000 0.000000\n"
              "1.000000 1.000000 0.000000\n1.000000 1.000000 1.000000\n");
    lut = cubeOf(1, {0, 32768, 65535});
    lut.domainMin = -1;
    lut.domainMax = 100;
    EXPECT_EQ(written(lut, cc::lut_t::kCUBE, "b.c.cube"),
              "# Generated by Brovo\nTITLE \"b.c\"\nLUT_3D_SIZE 1\n"
              "DOMAIN_MIN -1.000000 -1.000000 -1.000000\n"
              "DOMAIN_MAX 100.000000 100.000000 100.000000\n\n-1.000000 49.500771 100.000000\n");
}

TEST(lut_cube, NumbersAreWrittenAsPrintfWritesThem)
{
    // Among them ties, to the even digit below and above.
    std::vector<float> numbers;
    for (std::string const& text :
         split("0|-0|1|0.9999995|0.9999996|0.0000005|0x1p-7|0x1.8p-6|0x1p-149|-0x1p-40|8388607.5|"
               "8388608|9.9999995|10|-16777216|0x1.fffffep127|-0x1.fffffep127|inf"))
        numbers.push_back(std::strtof(text.c_str(), nullptr));
    std::mt19937 random(3);
    for (int i = 0; i < 2000; ++i)
        numbers.push_back(std::ldexp(static_cast<float>(static_cast<std::int32_t>(random())),
                                     static_cast<int>(random() % 80) - 60));
    TemporaryFolder const folder;
    int const fd = ::open(folder.path("numbers").c_str(), O_WRONLY | O_CREAT, 0600);
    std::string expected;
    for (float const number : numbers) {
        cc::lut_t lut;
        lut.domainMin = number;
        EXPECT_EQ(lut.writeCUBE(fd, "n"), 0);
        auto const value = static_cast<double>(number);
        char lines[300];
        std::snprintf(lines, sizeof lines,
                      "# Generated by Brovo\nTITLE \"n\"\nLUT_3D_SIZE 0\nDOMAIN_MIN %f %f %f\n"
                      "DOMAIN_MAX 1.000000 1.000000 1.000000\n\n",
                      value, value, value);
        expected += lines;
    }
    ::close(fd);
    EXPECT_TRUE(folder.read("numbers") == expected);
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
        std::string name;
        char const* kindAndSize;
        std::size_t place; ///< of a value in the table
        float value;
    } const rows[] = {{"opencolorio-3d", "0 6 5:", 3, 0.271916f},
                      {"opencolorio-1d", "0 5 1024:", 600, 0.707107f},
                      {"argyll-3d", "0 6 5:", 16, 0.258145f}};
    for (auto const& row : rows) {
        ReadLut read;
        read.lut.read((KORVANE_TEST_DATA "/lut/" + row.name + ".cube").c_str(), 0);
        ASSERT_TRUE(outcomeOf(read).starts_with(row.kindAndSize)) << row.name;
        EXPECT_EQ(read.lut.table[row.place], static_cast<int>(row.value * 65535)) << row.name;
        EXPECT_EQ(read.lut.title, row.name);
    }
}

} // namespace
