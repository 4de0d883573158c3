#include <korvane/colour/tfreader_t.h>

#include <support/TemporaryFolder.h>

#include <gtest/gtest.h>

#include <bit>
#include <string>
#include <string_view>
#include <vector>

#include <unistd.h>

namespace {

using namespace std::string_literals;
using Lines = std::vector<std::string>;

Lines linesOf(std::string_view bytes, int encoding = cc::tfreader_t::kUTF8)
{
    TemporaryFolder const folder;
    cc::tfreader_t reader(encoding);
    EXPECT_EQ(reader.open(folder.write("text", bytes).c_str()), cc::kSuccess);
    Lines lines;
    for (std::string line; reader.readln(line);)
        lines.push_back(line);
    return lines;
}

/// A text as UTF-16 of an order, behind a mark.
std::string unitsOf(std::string_view text, bool bigEndian)
{
    std::string units = bigEndian ? "\xFE\xFF" : "\xFF\xFE";
    for (char const c : text)
        units += bigEndian ? std::string{'\0', c} : std::string{c, '\0'};
    return units;
}

TEST(tfreader_t, EveryEndingEndsALineAndPairsAreOne)
{
    struct Row {
        std::string bytes;
        Lines lines;
    } const rows[] = {
        {"a\nb\n", {"a", "b"}},         {"a\rb\r", {"a", "b"}},       {"\n", {""}},
        {"a\r\nb\r\n", {"a", "b"}},     {"a\n\rb\n\r", {"a", "b"}},   {"", {}},
        {"a\n\nb", {"a", "", "b"}},     {"a\r\rb", {"a", "", "b"}},   {"a", {"a"}},
        {"a\r\n\r\nb", {"a", "", "b"}}, {"a\n\r\nb", {"a", "", "b"}}, {"\r\r\n\r", {"", "", ""}},
        {"a\r\n\n\rb", {"a", "", "b"}}, {"a\0b\n"s, {"a\0b"s}}};
    for (auto const& row : rows) {
        EXPECT_EQ(linesOf(row.bytes), row.lines) << row.bytes;
        EXPECT_EQ(linesOf("\xEF\xBB\xBF" + row.bytes), row.lines) << row.bytes;
        for (bool const bigEndian : {false, true})
            EXPECT_EQ(linesOf(unitsOf(row.bytes, bigEndian), cc::tfreader_t::kUTF16), row.lines);
    }
    EXPECT_EQ(linesOf("a\n\xEF\xBB\xBF"), (Lines{"a", "\xEF\xBB\xBF"})); // no mark there
}

TEST(tfreader_t, LinesGoAcrossTheBuffersEnd)
{
    // An ending at every place of a word, cut by the end of the 4096 bytes, or just beside it.
    for (std::size_t const length : {1u, 2u, 3u, 4u, 5u, 6u, 7u, 8u, 2046u, 2047u, 4094u, 4095u,
                                     4096u, 4097u, 8191u, 20000u}) {
        std::string const text(length, 'x');
        for (char const* const ending : {"\r\n", "\n\r", "\n", "\r"}) {
            std::string const bytes = text + ending + "b\v\f\x8A\x8D" + ending;
            EXPECT_EQ(linesOf(bytes), (Lines{text, "b\v\f\x8A\x8D"})) << length;
            EXPECT_EQ(linesOf(unitsOf(text + ending + text, true), cc::tfreader_t::kUTF16),
                      (Lines{text, text}));
        }
    }
}

TEST(tfreader_t, OtherEncodingsComeOutAsUTF8)
{
    struct Row {
        int encoding;
        std::string bytes;
        Lines lines;
    } const rows[] = {
        {0, "caf\x8E\r\xF0\r", {"café", "\xEF\xA3\xBF"}},
        {2, "\xFE\xFF\0\xE9\0\n\0\n"s, {"é", ""}},
        {2, "\xFE\xFF\0a\x0D\x0A\0b"s, {"a", "b"}}, // two single bytes
        {2, "\xFE\xFF\xD8\x3D\xDE\x00\xD8\x3D"s, {"\U0001F600\uFFFD"}},
        {2, unitsOf("a", false) + "b", {"a"}}, // half a unit at the end
    };
    for (auto const& row : rows)
        EXPECT_EQ(linesOf(row.bytes, row.encoding), row.lines);
}

TEST(tfreader_t, UTF16WithoutAMarkIsInTheOrderThatIsSet)
{
    TemporaryFolder const folder;
    std::string const path = folder.write("text", unitsOf("a\nb", true).substr(2));
    for (bool const swap : {true, false}) {
        cc::tfreader_t reader(cc::tfreader_t::kUTF16);
        ASSERT_EQ(reader.open(path.c_str()), cc::kSuccess);
        reader.setSwapBytes(swap);
        std::string line;
        EXPECT_TRUE(reader.readln(line));
        EXPECT_TRUE(reader.rewind()); // keeps the order
        EXPECT_TRUE(reader.readln(line));
        bool const isNative = swap == (std::endian::native == std::endian::little);
        EXPECT_EQ(line == "a", isNative);
    }
}

TEST(tfreader_t, AnswersWithCodes)
{
    EXPECT_EQ(cc::kAlreadyOpen, 0x21636C73);
    EXPECT_EQ(cc::kCannotOpen, 0x21666420);
    EXPECT_EQ(cc::kUnknownFormat, 0x216C7574);

    TemporaryFolder const folder;
    std::string const path = folder.write("text", "a\nb\n");
    cc::tfreader_t reader;
    std::string line = "left over";
    EXPECT_FALSE(reader.readln(line));
    EXPECT_EQ(line, "");
    EXPECT_FALSE(reader.rewind());
    EXPECT_EQ(reader.open(nullptr), cc::kCannotOpen);
    EXPECT_EQ(reader.open(folder.path("none").c_str()), cc::kCannotOpen);
    EXPECT_EQ(reader.open(path.c_str()), cc::kSuccess);
    EXPECT_EQ(reader.open(path.c_str()), cc::kAlreadyOpen);
    EXPECT_EQ(reader.fileSize(), 4);
    while (reader.readln(line)) {}
    EXPECT_EQ(line, "");
    EXPECT_TRUE(reader.rewind());
    EXPECT_TRUE(reader.readln(line));
    EXPECT_EQ(line, "a");
    reader.close();
    EXPECT_FALSE(reader.readln(line));
    EXPECT_EQ(reader.open(folder.path("").c_str()),
              cc::kSuccess); // a folder opens and has no lines
    EXPECT_FALSE(reader.readln(line));
}

TEST(tfreader_t, APipeDoesNotRewind)
{
    int ends[2];
    ASSERT_EQ(::pipe(ends), 0);
    ASSERT_EQ(::write(ends[1], "a\nb\n", 4), 4);
    cc::tfreader_t reader;
    ASSERT_EQ(reader.open(("/proc/self/fd/" + std::to_string(ends[0])).c_str()), cc::kSuccess);
    EXPECT_EQ(reader.fileSize(), -1);
    std::string line;
    EXPECT_TRUE(reader.readln(line));
    EXPECT_FALSE(reader.rewind());
    EXPECT_FALSE(reader.readln(line));
    ::close(ends[0]);
    ::close(ends[1]);
}

TEST(tfreader_t, TheLimitCutsLinesAndNotTheFile)
{
    TemporaryFolder const folder;
    std::string const path =
        folder.write("text", "abcdef\n" + std::string(9000, 'x') + "\nab\n\xEF\xBB\xBF\n");
    cc::tfreader_t reader(cc::tfreader_t::kUTF8, 3);
    ASSERT_EQ(reader.open(path.c_str()), cc::kSuccess);
    Lines lines;
    for (std::string line; reader.readln(line);)
        lines.push_back(line);
    EXPECT_EQ(lines, (Lines{"abc", "xxx", "ab", "\xEF\xBB\xBF"}));
}

} // namespace
