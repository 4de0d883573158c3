#include "SerializationSupport.h"

namespace {

template <class Write>
std::string written(Write write)
{
    KVBufferWriteStream stream(16, 16);
    write(stream);
    return textOf(stream);
}

} // namespace

TEST(KVStream, WritesTextWithoutItsTerminator)
{
    EXPECT_EQ(written([](KVStream& s) { s << "reel" << nullptr << " " << KVString("12"); }),
              "reel 12");
    EXPECT_EQ(written([](KVStream& s) { s << KVString() << KVString("") << ""; }), "");
}

// Meant: the count of UTF-16 units is taken as a count of bytes.
TEST(KVStream, CutsTextThatIsNotASCII)
{
    EXPECT_EQ(written([](KVStream& s) { s << KVString("Réel") << KVString("€"); }),
              "R\xC3\xA9\x65\xE2");
}

// Meant: each block of 20 levels ends with the zero byte behind the constant's 39 blanks.
TEST(KVStream, IndentsByTwoBlanksWithAZeroInEveryFullBlock)
{
    std::string const block = std::string(39, ' ') + '\0';
    struct Row {
        unsigned int levels;
        std::string text;
    } const rows[] = {
        {0, ""},     {1, "  "},          {19, std::string(38, ' ')},
        {20, block}, {21, block + "  "}, {40, block + block},
    };
    for (Row const& row : rows)
        EXPECT_EQ(written([&](KVStream& s) { s.indent(row.levels); }), row.text) << row.levels;
}
