#include "SerializationSupport.h"

#include <sstream>

// Stored fingerprints are compared with new ones: the words of these tables must never change. They
// come from the compression function of RFC 1321, section 3.4, written down by itself. Each call is
// padded with a single bit and no length, unless it fills its blocks.
TEST(KVHash128, KeepsTheWordsThatHaveBeenStored)
{
    struct Row {
        std::size_t length;
        char const* words;
    } const rows[] = {
        {1, "c2967ce41b5acaf028e090c052c27f41"},    {63, "6838a239978d5619cc2dafeddbbb5698"},
        {64, "056d88276444f2da3f15f0518d6a410b"},   {65, "b6ecc142eb74c8515a3f026f8a365639"},
        {127, "020a7f0c8662353017ee08fbef0028d4"},  {128, "0d7891f869a5d28ee122f1c1e4cfb89f"},
        {4096, "bec1cfa5646afe0b4b8820f3d9e0f830"},
    };
    std::string data(4097, '\0');
    for (std::size_t i = 0; i < 4096; ++i)
        data[i] = static_cast<char>(7 * i + 1);
    for (auto const& row : rows) {
        EXPECT_EQ(textOf(hashOf(data.substr(0, row.length))), row.words) << row.length;
        std::string const odd = " " + data;
        EXPECT_EQ(textOf(hashOf(std::string_view(odd).substr(1, row.length))), row.words);
    }
    EXPECT_EQ(textOf(KVHash128()), std::string(32, '0'));
    EXPECT_EQ(textOf(KVHash128(nullptr, 0)), "67452301efcdab8998badcfe10325476");
}

TEST(KVHash128, AddsAsOneBlockWithAWholeWordOfPadding)
{
    KVHash128 const a(1, 2, 3, 4), b(5, 6, 7, 8);
    EXPECT_EQ(textOf(KVHash128Add(a, b)), "866c0c61281fcfd925e1631e267f43c8");
    EXPECT_EQ(textOf(KVHash128Add(KVHash128(), b)), "289c3abd6d206657faff0b42f7a20a77");
    KVHash128 sum = a;
    sum += b;
    EXPECT_TRUE(sum == KVHash128Add(a, b));
}

TEST(KVHash128, ReadsAndPrintsHexadecimalWords)
{
    std::string const none(32, '0'), whole = "0123456789abcdeffedcba9876543210";
    struct Row {
        std::string_view text;
        std::string expected;
    } const rows[] = {
        {"0123456789abcdefFEDCBA9876543210", whole},
        {"0123456789abcdefFEDCBA9876543210xyz", whole},
        {"0123456789abcdefFEDCBA987654321", none},
        {"0123456789abcdefFEDCBA987654321g", none},
        {"01234567-89ab-cdef-FEDC-BA9876543210", none},
        {"\u0130123456789abcdefFEDCBA98765432100", none},
        {"", none},
    };
    for (auto const& row : rows) {
        KVHash128 const hash(KVString::fromUTF8(row.text));
        std::ostringstream stream;
        stream << hash << ' ' << 10;
        EXPECT_EQ(stream.str(), row.expected + " 10");
        std::unique_ptr<char, decltype(&std::free)> const text(KVHash128CreateCString(&hash),
                                                               &std::free);
        EXPECT_EQ(text.get(), row.expected);
    }
    EXPECT_EQ(KVHash128CreateCString(nullptr), nullptr);
}

TEST(KVHash128, ComparesWordsAsUnsignedNumbers)
{
    KVHash128 const rows[] = {
        {0, 0, 0, 0}, {0, 0, 0, 1}, {0, 0, 1, 0},
        {0, 1, 0, 0}, {1, 0, 0, 0}, {0x80000000u, 0, 0, 0},
    };
    for (auto const& a : rows)
        for (auto const& b : rows) {
            int const expected = &a < &b ? -1 : &a > &b;
            EXPECT_EQ(compare(a, b), expected);
            EXPECT_EQ(KVHash128Compare(a, b), expected);
            EXPECT_EQ(a == b, expected == 0);
            EXPECT_EQ(a < b, expected < 0);
            EXPECT_EQ(a > b, expected > 0);
        }
}

TEST(KVHash128, FoldsIntoKeys)
{
    KVHash128 const hash(0x11111111u, 0x22222222u, 0x80000000u, 0x00000001u);
    EXPECT_EQ(KVHash128Aligned32(hash), 0xB3333332u);
    EXPECT_EQ(KVHash128Aligned64(hash), 0x9111111122222223u);
    EXPECT_EQ(KVHash128AlignedLocal(hash), KVHash128Aligned64(hash));
}
