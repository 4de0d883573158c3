#include <korvane/serialization/KVHash128.h>

#include <gtest/gtest.h>

#include <cstdlib>
#include <memory>
#include <sstream>
#include <vector>

namespace {

char const initialWords[] = "67452301efcdab8998badcfe10325476";

std::string textOf(KVHash128 const& hash)
{
    return hash.getString();
}

KVHash128 hashOf(std::string_view bytes)
{
    return {reinterpret_cast<unsigned char const*>(bytes.data()),
            static_cast<unsigned int>(bytes.size())};
}

/// The compression function straight from RFC 1321, section 3.4, for comparison.
KVHash128 plainTransform(KVHash128 state, std::uint32_t const* words)
{
    static int const shifts[4][4] = {
        {7, 12, 17, 22}, {5, 9, 14, 20}, {4, 11, 16, 23}, {6, 10, 15, 21}};
    std::uint32_t v[4] = {state.words[0], state.words[1], state.words[2], state.words[3]};
    for (unsigned i = 0; i < 64; ++i) {
        std::uint32_t const x = v[1], y = v[2], z = v[3];
        std::uint32_t f = 0;
        unsigned k = 0;
        switch (i / 16) {
        case 0:
            f = (x & y) | (~x & z), k = i;
            break;
        case 1:
            f = (x & z) | (y & ~z), k = 5 * i + 1;
            break;
        case 2:
            f = x ^ y ^ z, k = 3 * i + 5;
            break;
        default:
            f = y ^ (x | ~z), k = 7 * i;
            break;
        }
        auto const sine = static_cast<std::uint32_t>(std::abs(__builtin_sin(i + 1)) * 4294967296.0);
        std::uint32_t const sum = v[0] + f + words[k % 16] + sine;
        int const shift = shifts[i / 16][i % 4];
        v[0] = v[3], v[3] = v[2], v[2] = v[1];
        v[1] += sum << shift | sum >> (32 - shift);
    }
    for (int i = 0; i < 4; ++i)
        state.words[i] += v[i];
    return state;
}

TEST(KVHash128, TransformIsTheCompressionFunctionOfMD5)
{
    KVHash128 hash(1, 0x80000000u, 0xFFFFFFFFu, 12345);
    std::uint32_t words[16];
    for (unsigned round = 0; round < 50; ++round) {
        for (unsigned i = 0; i < 16; ++i)
            words[i] = 0x9E3779B9u * (round * 16 + i + 1);
        KVHash128 const expected = plainTransform(hash, words);
        hash.transform(words);
        ASSERT_EQ(textOf(hash), textOf(expected)) << "round " << round;
    }
}

TEST(KVHash128, StartsFromTheInitialWordsEvenForNoData)
{
    EXPECT_EQ(textOf(KVHash128()), std::string(32, '0'));
    KVHash128 hash;
    hash.addData(nullptr, 0);
    EXPECT_EQ(textOf(hash), initialWords);
    EXPECT_EQ(textOf(KVHash128(nullptr, 0)), initialWords);
}

TEST(KVHash128, PadsEachCallThatIsNoMultipleOf64)
{
    struct Row {
        std::size_t length;
        std::size_t blocks;
    } const rows[] = {{1, 1}, {63, 1}, {64, 1}, {65, 2}, {127, 2}, {128, 2}, {4096, 64}};
    for (auto const& row : rows) {
        std::string padded(row.blocks * 64, '\0');
        for (std::size_t i = 0; i < row.length; ++i)
            padded[i] = static_cast<char>(7 * i + 1);
        std::string const data = padded.substr(0, row.length);
        if (row.length < padded.size())
            padded[row.length] = '\x80';
        KVHash128 expected{KVString(initialWords)};
        for (std::size_t i = 0; i < row.blocks; ++i) {
            std::uint32_t words[16];
            std::copy_n(padded.data() + 64 * i, 64, reinterpret_cast<char*>(words));
            expected = plainTransform(expected, words);
        }
        EXPECT_EQ(textOf(hashOf(data)), textOf(expected)) << row.length;
        // An odd address gives the same.
        EXPECT_EQ(textOf(hashOf(std::string_view(" " + data).substr(1))), textOf(expected));
    }
}

TEST(KVHash128, DependsOnTheCutsBetweenCalls)
{
    KVHash128 cut = hashOf("ab");
    cut.addData(reinterpret_cast<unsigned char const*>("cd"), 2);
    EXPECT_FALSE(cut == hashOf("abcd"));
    std::string const whole(192, 'x');
    KVHash128 joined = hashOf(whole.substr(0, 64));
    joined.addData(reinterpret_cast<unsigned char const*>(whole.data()), 128);
    EXPECT_EQ(textOf(joined), textOf(hashOf(whole)));
}

TEST(KVHash128, KeepsTheWordsThatHaveBeenStored)
{
    // Stored fingerprints are compared with new ones: these must never change.
    EXPECT_EQ(textOf(hashOf("a")), "889d383a7c7249a3ace95167370f0bae");
    KVHash128 sum(1, 2, 3, 4);
    sum += KVHash128(5, 6, 7, 8);
    EXPECT_EQ(textOf(sum), "866c0c61281fcfd925e1631e267f43c8");
}

TEST(KVHash128, AddsAsOneBlockWithAWholeWordOfPadding)
{
    KVHash128 const a(1, 2, 3, 4), b(5, 6, 7, 8), none;
    std::uint32_t const block[16] = {5, 6, 7, 8, 0x80000000u};
    EXPECT_EQ(textOf(KVHash128Add(a, b)), textOf(plainTransform(a, block)));
    EXPECT_FALSE(KVHash128Add(a, b) == KVHash128Add(b, a));
    EXPECT_EQ(textOf(KVHash128Add(none, b)),
              textOf(plainTransform(KVHash128(KVString(initialWords)), block)));
}

TEST(KVHash128, ReadsAndPrintsHexadecimalWords)
{
    struct Row {
        std::string_view text;
        std::string_view expected;
    } const rows[] = {
        {"0123456789abcdefFEDCBA9876543210", "0123456789abcdeffedcba9876543210"},
        {"0123456789abcdefFEDCBA9876543210xyz", "0123456789abcdeffedcba9876543210"},
        {"0123456789abcdefFEDCBA987654321", "00000000000000000000000000000000"},
        {"0123456789abcdefFEDCBA987654321g", "00000000000000000000000000000000"},
        {"01234567-89ab-cdef-FEDC-BA9876543210", "00000000000000000000000000000000"},
        {"\u0130123456789abcdefFEDCBA98765432100", "00000000000000000000000000000000"},
        {"", "00000000000000000000000000000000"},
    };
    for (auto const& row : rows) {
        KVHash128 const hash(KVString::fromUTF8(row.text));
        EXPECT_EQ(textOf(hash), row.expected) << row.text;
        std::ostringstream stream;
        stream << hash << ' ' << 10;
        EXPECT_EQ(stream.str(), std::string(row.expected) + " 10");
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
            KVHash128State const state = b;
            EXPECT_EQ(compare(a, b), expected);
            EXPECT_EQ(KVHash128Compare(a, state), expected);
            EXPECT_EQ(a == state, expected == 0);
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

} // namespace
