#include "colour/LutSupport.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <cmath>
#include <functional>
#include <limits>
#include <stdexcept>

#include <sys/stat.h>

namespace {

using Values = std::vector<int>;

TEST(lut_t, FormatsAreFoundByTheirHeader)
{
    std::string const longLine(5000, ' ');
    struct Row {
        std::string text;
        unsigned int format;
    } const rows[] = {
        {"", 0},
        {"# a comment\n0 0 0\n", 0},
        {"\x89PNG\r\n\x1A\n", 0},
        {"#type: Pandora 3D LUT file\n", 1},
        {"#type:\tmy PANDORA 3d lUt FiLe, second version\n", 1},
        {"#type: A 3d Cube File\n", 1},
        {"#type:3D cube file\n", 0}, // no white space
        {"#type: 3D  cube file\n", 0},
        {"#type: other\nTITLE \"x\"\n", 2},
        {"TITLE \"x\"\n#type: 3D cube file\n", 2}, // the first one counts
        {"LUT_1D_INPUT_RANGE 0 1\n", 2},
        {"LUT_3D_INPUT_RANGE 0 1\n", 2},
        {"0 0 0\nrubbish\nLUT_1D_INPUT_RANGE \n", 2},
        {"LUT_1D_INPUT_RANGE\n", 0},
        {" LUT_1D_INPUT_RANGE 0 1\n", 0},
        {"DOMAIN_MIN 0 0 0\n", 0}, // tells nothing
        {"TITLE \"" + longLine + "\"\n", 0},
    };
    for (auto const& row : rows) {
        ReadLut const read = readLut(row.text);
        EXPECT_EQ(read.lut.format(), row.format) << row.text;
        EXPECT_EQ(read.code == cc::kUnknownFormat, row.format == 0) << row.text;
    }
    EXPECT_EQ(readLut("LUT_1D_SIZE 1\n0\n").lut.format(), 2u);
    EXPECT_EQ(readLut("LUT_3D_SIZE 1\n0\n").lut.format(), 2u);
}

TEST(lut_t, TitlesAndNames)
{
    struct Row {
        char const* file;
        char const* line;
        char const* title;
        char const* name;
    } const rows[] = {
        {"Warm.cube", "TITLE \"Warm look\"", "Warm look", "Warm"},
        {"Warm.CuBe", "TITLE \"\"", "Warm", "Warm"},
        {"Warm.MGA", "TITLE  \"a \"b\" c\" d", "a \"b\" c", "Warm"},
        {"a.cube.mga", "LUT_3D_INPUT_RANGE 0 1", "a.cube", "a.cube"},
        {"a.mga.cube", "LUT_3D_INPUT_RANGE 0 1", "a.mga", "a.mga"},
        {"a.txt", "LUT_3D_INPUT_RANGE 0 1", "a.txt", "a.txt"},
        {".cube", "LUT_3D_INPUT_RANGE 0 1", "", ""},
    };
    for (auto const& row : rows) {
        ReadLut const read = readLut(std::string(row.line) + "\n", 0, row.file);
        EXPECT_EQ(read.code, 0) << row.file;
        EXPECT_EQ(read.lut.title, row.title) << row.file;
        EXPECT_EQ(read.lut.name, row.name) << row.file;
    }
}

TEST(lut_t, ATitleWithoutQuotesIsReportedAndIsStillACube)
{
    testing::internal::CaptureStderr();
    ReadLut const read = readLut("TITLE warm\nLUT_3D_SIZE 1\n0 0 1\n");
    EXPECT_EQ(testing::internal::GetCapturedStderr(),
              "TITLE keyword was expecting a quotes surround a text value in: TITLE warm Adobe "
              "Specification wants: TITLE <sp> \"<text>\"\n");
    EXPECT_EQ(read.code, 0);
    EXPECT_EQ(read.lut.title, "look");
    EXPECT_EQ(read.values(), (Values{0, 0, 65535}));
}

TEST(lut_t, ReadingStartsAnew)
{
    TemporaryFolder const folder;
    cc::lut_t lut;
    std::string const path = folder.write(
        "a.cube", "TITLE \"first\"\nLUT_3D_SIZE 1\nDOMAIN_MIN 2 2 2\nDOMAIN_MAX 3 3 3\n3 3 3\n");
    ASSERT_EQ(lut.read(path.c_str(), 0), 0);
    EXPECT_EQ(lut.read(folder.path("none.cube").c_str(), 0), cc::kCannotOpen);
    EXPECT_EQ(lut.read(nullptr, 0), cc::kCannotOpen);
    EXPECT_EQ(lut.read(folder.path("").c_str(), 0), cc::kUnknownFormat); // a folder
    EXPECT_TRUE(lut.table.empty());
    EXPECT_EQ(lut.kind, 0);
    EXPECT_EQ(lut.size, 0);
    EXPECT_EQ(lut.domainMin, 0);
    EXPECT_EQ(lut.domainMax, 1);
    EXPECT_EQ(lut.title, "");
}

TEST(lut_t, WritingAnswers0AndTellsTheErrorBesides)
{
    TemporaryFolder const folder;
    cc::lut_t const lut = scatteredCube(33);
    std::string const path = folder.path("a.cube");
    struct Row {
        std::string path;
        unsigned int format;
        int error;
    } const rows[] = {
        {path, 2, 0},
        {path, 1, 0},
        {path, 0, EINVAL},
        {path, 3, EINVAL},
        {"/dev/full", 2, ENOSPC},
        {folder.path("none/a.cube"), 2, ENOENT},
        {folder.path(""), 2, EISDIR},
    };
    for (auto const& row : rows) {
        int error = -1;
        EXPECT_EQ(lut.write(row.path.c_str(), row.format, &error), 0) << row.path;
        EXPECT_EQ(error, row.error) << row.path;
        EXPECT_EQ(lut.write(row.path.c_str(), row.format), 0) << row.path;
    }
    EXPECT_GT(folder.read("a.cube").size(), 1000u); // an unknown format left it alone
    struct stat status;
    ASSERT_EQ(::stat(path.c_str(), &status), 0);
    mode_t const mask = ::umask(0);
    ::umask(mask);
    EXPECT_EQ(status.st_mode & 0777, 0755 & ~mask);
}

TEST(lut_t, ACurveIsWrittenAsACubeThatEndsEarly)
{
    // Meant so: neither format has a form for curves.
    ReadLut const curve = readLut("LUT_1D_SIZE 1\n1\n");
    std::string const cube = written(curve.lut, cc::lut_t::kCUBE);
    EXPECT_NE(cube.find("LUT_3D_SIZE 1024\n"), std::string::npos);
    EXPECT_EQ(std::count(cube.begin(), cube.end(), '\n'), 6 + 341);
    std::string const mga = written(curve.lut, cc::lut_t::kMGA);
    EXPECT_NE(mga.find("in 1073741824\n"), std::string::npos);
    EXPECT_EQ(mga.substr(mga.find("blue\n")), "blue\n0\t65535\t65535\t65535\n");

    cc::lut_t odd; // sizes that no table has
    odd.table.resize(4);
    for (int const size : {-5, 2000000000}) {
        odd.size = size;
        std::string const text = written(odd, cc::lut_t::kCUBE);
        EXPECT_EQ(std::count(text.begin(), text.end(), '\n'), size < 0 ? 6 : 7);
    }
}

/// A processor from a function.
class Function final : public cc::lut_t::processor_t {
public:
    explicit Function(std::function<cc::rgb_t(cc::rgb_t const&)> function)
        : function_(std::move(function))
    {}
    cc::rgb_t process(cc::rgb_t const& colour) const override { return function_(colour); }

private:
    std::function<cc::rgb_t(cc::rgb_t const&)> function_;
};

TEST(lut_t, ProcessAsksForEachGridPointWithRedFastest)
{
    cc::lut_t lut;
    lut.makeCube(3, -1.0f, 2.0f);
    std::vector<cc::rgb_t> asked;
    lut.process(Function([&](cc::rgb_t const& colour) {
        asked.push_back(colour);
        return colour;
    }));
    ASSERT_EQ(asked.size(), 27u);
    EXPECT_EQ(asked[1], (cc::rgb_t{0.5f, -1.0f, -1.0f}));
    EXPECT_EQ(asked[3], (cc::rgb_t{-1.0f, 0.5f, -1.0f}));
    EXPECT_EQ(asked[9], (cc::rgb_t{-1.0f, -1.0f, 0.5f}));
    EXPECT_EQ(asked[26], (cc::rgb_t{2.0f, 2.0f, 2.0f}));
    // Entry (r, g, b) lies at (b * size + g) * size + r.
    std::size_t const place = 3 * ((2 * 3 + 1) * 3 + 0);
    EXPECT_EQ(lut.table[place], 0);
    EXPECT_EQ(lut.table[place + 1], 32768); // rounded: 32767.5 and up
    EXPECT_EQ(lut.table[place + 2], 65535);

    // The steps are added up in float, so the last point need not be the domain's end.
    lut.makeCube(20);
    float last = 0;
    lut.process(Function([&](cc::rgb_t const& colour) { return last = colour[2], colour; }));
    EXPECT_EQ(last, 0.999999821f);
}

TEST(lut_t, ProcessRoundsAndClamps)
{
    constexpr float infinity = std::numeric_limits<float>::infinity();
    struct Row {
        float out;
        int value;
    } const rows[] = {
        {0.5f, 32768}, {0.0000077f, 1},   {0.0000076f, 0}, {-0.5f, 0},
        {1.5f, 65535}, {infinity, 65535}, {-infinity, 0},  {std::nanf(""), 0},
    };
    cc::lut_t lut;
    lut.makeCube(1);
    for (auto const& row : rows) {
        lut.process(Function([&](cc::rgb_t const&) { return cc::rgb_t{row.out, 0, 0}; }));
        EXPECT_EQ(lut.table[0], row.value) << row.out;
    }
}

TEST(lut_t, ProcessTakesWholeCubesOnly)
{
    Function const white([](cc::rgb_t const&) { return cc::rgb_t{1, 1, 1}; });
    cc::lut_t lut;
    lut.process(white);
    for (int const edge : {-1, 0, 257}) {
        lut.makeCube(edge);
        EXPECT_EQ(lut.kind, 0);
        lut.process(white);
        EXPECT_TRUE(lut.table.empty());
    }
    lut.makeCube(2);
    lut.kind = cc::lut_t::k1D;
    lut.process(white);
    EXPECT_EQ(lut.table[0], 0);
    lut.kind = cc::lut_t::k3D;
    lut.table.resize(23);
    lut.process(white);
    EXPECT_EQ(lut.table[0], 0);
    lut.table.resize(24);
    EXPECT_THROW(lut.process(Function(
                     [](cc::rgb_t const&) -> cc::rgb_t { throw std::runtime_error("no more"); })),
                 std::runtime_error);
    lut.process(white);
    EXPECT_EQ(lut.table[23], 65535);
}

TEST(lut_t, EveryTruncationIsReadOrRefused)
{
    TemporaryFolder const folder;
    cc::lut_t lut = scatteredCube(2);
    lut.title = "Sample";
    testing::internal::CaptureStderr(); // titles that are cut short are told
    for (unsigned int const format : {cc::lut_t::kCUBE, cc::lut_t::kMGA}) {
        std::string const whole = written(lut, format);
        for (std::size_t length = 0; length < whole.size(); ++length) {
            std::string const name = std::to_string(format) + "-" + std::to_string(length);
            std::string const path = folder.write(name, whole.substr(0, length));
            cc::lut_t read;
            int const code = read.read(path.c_str(), 0);
            // Meant so: a part of the last row is a row.
            bool const nearlyWhole = length > whole.rfind('\n', whole.size() - 2) + 1;
            EXPECT_TRUE(code != 0 || nearlyWhole || read.table.empty()) << length;
        }
    }
    testing::internal::GetCapturedStderr();
}

} // namespace
