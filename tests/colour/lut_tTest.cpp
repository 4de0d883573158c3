#include "colour/LutSupport.h"

#include <cerrno>
#include <cmath>
#include <functional>
#include <limits>
#include <stdexcept>

#include <sys/stat.h>

namespace {

TEST(lut_t, FormatsAreFoundByTheirHeader)
{
    struct Row {
        unsigned int format;
        std::string texts;
    } const rows[] = {
        // No white space behind the key, some before it, too much within, too long a line.
        {0, "|# a comment\n0 0 0\n|\x89PNG\r\n\x1A\n|#type:3D cube file\n|#type: 3D  cube file\n|"
            "LUT_1D_INPUT_RANGE\n| LUT_1D_INPUT_RANGE 0 1\n|DOMAIN_MIN 0 0 0\n|TITLE \"" +
                std::string(5000, ' ') + "\"\n"},
        {1, "#type: Pandora 3D LUT file\n|#type: A 3d Cube File\n|"
            "#type:\tmy PANDORA 3d lUt FiLe, second version\n"},
        {2, "#type: other\nTITLE \"x\"\n|TITLE \"x\"\n#type: 3D cube file\n|"
            "LUT_1D_INPUT_RANGE 0 1\n|LUT_3D_INPUT_RANGE 0 1\n|0 0 0\nrubbish\nLUT_1D_SIZE 1\n|"
            "LUT_3D_SIZE \n"},
    };
    for (auto const& row : rows)
        for (std::string const& text : split(row.texts)) {
            ReadLut const read = readLut(text);
            EXPECT_EQ(read.lut.format(), row.format) << text;
            EXPECT_EQ(read.code == cc::kUnknownFormat, row.format == 0) << text;
        }
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
        {"bare.cube", "TITLE warm", "bare", "bare"},
    };
    testing::internal::CaptureStderr();
    for (auto const& row : rows) {
        ReadLut const read = readLut(std::string(row.line) + "\n", 0, row.file);
        EXPECT_EQ(read.code, 0) << row.file;
        EXPECT_EQ(read.lut.title, row.title) << row.file;
        EXPECT_EQ(read.lut.name, row.name) << row.file;
    }
    EXPECT_EQ(testing::internal::GetCapturedStderr(),
              "TITLE keyword was expecting a quotes surround a text value in: TITLE warm Adobe "
              "Specification wants: TITLE <sp> \"<text>\"\n");
}

TEST(lut_t, ReadingStartsAnew)
{
    TemporaryFolder const folder;
    std::string const path =
        folder.write("a.cube", "TITLE \"first\"\nLUT_3D_SIZE 1\nLUT_3D_INPUT_RANGE 2 3\n3 3 3\n");
    for (auto const& [next, code] : {std::pair(folder.path("none.cube"), cc::kCannotOpen),
                                     std::pair(folder.path(""), cc::kUnknownFormat)}) {
        ReadLut read;
        ASSERT_EQ(read.lut.read(path.c_str(), 0), 0);
        ASSERT_EQ(read.lut.domainMax, 3);
        EXPECT_EQ(read.lut.read(next.c_str(), 0), code);
        EXPECT_EQ(read.lut.read(nullptr, 0), cc::kCannotOpen);
        EXPECT_EQ(outcomeOf(read), "0 0 0:");
        EXPECT_EQ(read.lut.domainMin, 0);
        EXPECT_EQ(read.lut.domainMax, 1);
        EXPECT_EQ(read.lut.title, "");
    }
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
        {path, 3, EINVAL}, // leaves the file alone
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
    struct stat status;
    ASSERT_EQ(::stat(path.c_str(), &status), 0);
    EXPECT_GT(status.st_size, 1000);
    mode_t const mask = ::umask(0);
    ::umask(mask);
    EXPECT_EQ(status.st_mode & 0777, 0755 & ~mask);
}

TEST(lut_t, ATableThatIsNotAsItsSizeTellsIsWrittenAsFarAsItGoes)
{
    // A curve, meant so as neither format has a form for it; a cube that was cut short; sizes that
    // no table has.
    struct Row {
        int size;
        std::size_t values;
        std::ptrdiff_t cubeRows;
        std::ptrdiff_t mgaRows;
        char const* told;
    } const rows[] = {{1024, 1024, 341, 1, "in 1073741824\n"},
                      {256, 42, 14, 1, "in 16777216\n"},
                      {2, 14, 4, 1, "in 8\n"},
                      {-5, 4, 0, 0, "in 0\n"},
                      {2000000000, 4, 1, 1, "in "}};
    for (auto const& row : rows) {
        cc::lut_t lut;
        lut.kind = cc::lut_t::k3D;
        lut.size = row.size;
        lut.table.resize(row.values);
        std::string const cube = written(lut, cc::lut_t::kCUBE);
        EXPECT_EQ(std::count(cube.begin(), cube.end(), '\n'), 6 + row.cubeRows) << row.size;
        std::string const mga = written(lut, cc::lut_t::kMGA);
        EXPECT_EQ(std::count(mga.begin(), mga.end(), '\n'), 16 + row.mgaRows) << row.size;
        EXPECT_NE(mga.find(row.told), std::string::npos) << row.size;
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
    lut.process(Function([&](cc::rgb_t const& colour) { return asked.emplace_back(colour); }));
    ASSERT_EQ(asked.size(), 27u);
    EXPECT_EQ(asked[1], (cc::rgb_t{0.5f, -1.0f, -1.0f}));
    EXPECT_EQ(asked[3], (cc::rgb_t{-1.0f, 0.5f, -1.0f}));
    EXPECT_EQ(asked[9], (cc::rgb_t{-1.0f, -1.0f, 0.5f}));
    EXPECT_EQ(asked[26], (cc::rgb_t{2.0f, 2.0f, 2.0f}));
    // Entry (0, 1, 2): 0, then 32767.5 rounded up, then the end.
    std::size_t const place = 3 * ((2 * 3 + 1) * 3 + 0);
    EXPECT_EQ(lut.table[place], 0);
    EXPECT_EQ(lut.table[place + 1], 32768);
    EXPECT_EQ(lut.table[place + 2], 65535);
    // The steps are added up in float, so the last point need not be the domain's end.
    lut.makeCube(20);
    float last = 0;
    lut.process(Function([&](cc::rgb_t const& colour) { return last = colour[2], colour; }));
    EXPECT_EQ(last, 0.999999821f);
}

TEST(lut_t, ProcessRoundsAndClampsAndTakesWholeCubesOnly)
{
    constexpr float infinity = std::numeric_limits<float>::infinity();
    cc::lut_t lut;
    lut.makeCube(1);
    for (auto const& [out, value] : {std::pair(0.5f, 32768),
                                     {0.0000077f, 1},
                                     {0.0000076f, 0},
                                     {-0.5f, 0},
                                     {1.5f, 65535},
                                     {infinity, 65535},
                                     {-infinity, 0},
                                     {std::nanf(""), 0}}) {
        lut.process(Function([&](cc::rgb_t const&) { return cc::rgb_t{out, 0, 0}; }));
        EXPECT_EQ(lut.table[0], value) << out;
    }
    Function const refuses(
        [](cc::rgb_t const&) -> cc::rgb_t { throw std::runtime_error("asked"); });
    for (int const edge : {-1, 0, 257, 2}) {
        lut.makeCube(edge);
        EXPECT_EQ(lut.kind, edge == 2 ? 6 : 0);
        lut.kind = cc::lut_t::k1D;
        lut.process(refuses);
        lut.kind = cc::lut_t::k3D;
        lut.table.resize(23);
        lut.process(refuses);
    }
    lut.table.resize(24);
    EXPECT_THROW(lut.process(refuses), std::runtime_error);
}

TEST(lut_t, WhatIsWrittenIsReadAndItsTruncationsAreRefused)
{
    struct Row {
        unsigned int format;
        float domainMin;
        int tolerance;
    } const rows[] = {{cc::lut_t::kMGA, 0.0f, 0},
                      {cc::lut_t::kCUBE, 0.0f, 1}, // meant so: six decimals are cut on reading
                      {cc::lut_t::kCUBE, -0.5f, 1}};
    for (auto const& row : rows) {
        cc::lut_t lut = scatteredCube(17);
        lut.domainMin = row.domainMin;
        lut.title = "Scattered";
        ReadLut const read = readLut(written(lut, row.format));
        ASSERT_TRUE(outcomeOf(read).starts_with("0 6 17:")) << row.format;
        EXPECT_EQ(read.lut.domainMin, row.domainMin);
        EXPECT_EQ(read.lut.title, "Scattered");
        for (std::size_t i = 0; i < lut.table.size(); ++i)
            ASSERT_LE(std::abs(read.lut.table[i] - lut.table[i]), row.tolerance) << i;

        testing::internal::CaptureStderr(); // titles that are cut short are told
        std::string const whole = written(scatteredCube(2), row.format);
        for (std::size_t length = 0; length < whole.size(); length += 1 + length % 3) {
            ReadLut const part = readLut(whole.substr(0, length));
            // Meant so: a part of the last row is a row.
            bool const nearlyWhole = length > whole.rfind('\n', whole.size() - 2) + 1;
            EXPECT_TRUE(part.code != 0 || nearlyWhole || part.lut.table.empty()) << length;
        }
        testing::internal::GetCapturedStderr();
    }
}

} // namespace
