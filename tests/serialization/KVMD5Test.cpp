#include <korvane/serialization/KVMD5.h>

#include <korvane/foundation/KVNSRef.h>
#include <korvane/foundation/KVPrint.h>
#include <korvane/platform/CFNumber.h>

#include <gtest/gtest.h>

#include <cstring>

namespace {

/// The digest's bytes in memory, as digests are usually printed.
std::string bytesOf(KVHash128State const& hash)
{
    std::string text;
    for (auto word : hash.words)
        for (int shift = 0; shift < 32; shift += 4)
            text += "0123456789abcdef"[word >> (shift ^ 4) & 15];
    return text;
}

std::string digestOf(std::string_view bytes)
{
    return bytesOf(KVMD5HashWithBytes(bytes.data(), bytes.size()));
}

TEST(KVMD5, AgreesWithTheVectorsOfRFC1321)
{
    struct Row {
        std::string_view text;
        std::string_view digest;
    } const rows[] = {
        {"", "d41d8cd98f00b204e9800998ecf8427e"},
        {"a", "0cc175b9c0f1b6a831c399e269772661"},
        {"abc", "900150983cd24fb0d6963f7d28e17f72"},
        {"message digest", "f96b697d7cb7938d525a2f31aaf161d0"},
        {"abcdefghijklmnopqrstuvwxyz", "c3fcd3d76192e4007dfb496cca67e13b"},
        {"ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789",
         "d174ab98d277d9f5a5611c2c9f419d9f"},
        {"1234567890123456789012345678901234567890"
         "1234567890123456789012345678901234567890",
         "57edf4a22be3c955ac49da2e2107b67a"},
    };
    for (auto const& row : rows)
        EXPECT_EQ(digestOf(row.text), row.digest) << row.text;
    // The words print each four bytes in the other order.
    EXPECT_EQ(std::string(KVMD5HashToString(KVMD5HashWithBytes("abc", 3))),
              "98500190b04fd23c7d3f96d6727fe128");
    auto const* abc = reinterpret_cast<unsigned char const*>("abc");
    EXPECT_FALSE(KVHash128(abc, 3) == KVMD5HashWithBytes(abc, 3));
}

TEST(KVMD5, GivesOneDigestForAnyCuts)
{
    std::string bytes(3000, '\0');
    for (std::size_t i = 0; i < bytes.size(); ++i)
        bytes[i] = static_cast<char>(i * i >> 3);
    // Around the ends of a block, of the room for the length and of the gathering of 512 bytes.
    for (std::size_t length : {0, 55, 56, 63, 64, 65, 511, 512, 513, 568, 1024, 3000})
        for (std::size_t piece : {1, 7, 64, 500, 512, 513, 2048}) {
            KVMD5 md5;
            for (std::size_t i = 0; i < length; i += piece)
                md5.writeBytes(bytes.data() + i, std::min(piece, length - i));
            EXPECT_EQ(bytesOf(md5.getHash()), digestOf({bytes.data(), length}))
                << length << " in pieces of " << piece;
        }
    // md5sum of the same bytes.
    EXPECT_EQ(digestOf(bytes), "d8fb14c35cd5d3d83ced11a73dfdd2d8");
}

int logged = 0;

TEST(KVMD5, TakesNothingAfterItsEnd)
{
    KVMD5 md5;
    md5.writeBytes("abc", 3);
    md5.finish();
    logged = 0;
    KVSetLogSink([](char const*, std::size_t) { ++logged; });
    md5.writeBytes("d", 1);
    KVSetLogSink(nullptr);
    EXPECT_EQ(logged, 1);
    EXPECT_EQ(bytesOf(md5.getHash()), digestOf("abc"));
    EXPECT_EQ(bytesOf(md5.getHash()), digestOf("abc"));
}

TEST(KVMD5, HashesValuesAsPackedArrays)
{
    std::int32_t const ints[] = {1, -2, 3};
    std::int64_t const longs[] = {1, -2, 1LL << 40};
    double const doubles[] = {0.5, -0.0};
    EXPECT_TRUE(KVMD5HashWithInt32(3, 1, -2, 3) == KVMD5HashWithBytes(ints, sizeof ints));
    EXPECT_TRUE(KVMD5HashWithInt64(3, longs[0], longs[1], longs[2]) ==
                KVMD5HashWithBytes(longs, sizeof longs));
    EXPECT_TRUE(KVMD5HashWithFloat64(2, 0.5, -0.0) == KVMD5HashWithBytes(doubles, sizeof doubles));
    EXPECT_EQ(bytesOf(KVMD5HashWithInt32(0)), digestOf(""));
    void const* pointer = &ints;
    EXPECT_TRUE(KVMD5HashWithPointer(pointer) == KVMD5HashWithBytes(&pointer, sizeof pointer));
}

TEST(KVMD5, HashesTheUnitsOfAString)
{
    KVString const text("é\U0001F600");
    char16_t const units[] = {0xE9, 0xD83D, 0xDE00};
    auto const expected = KVMD5HashWithBytes(units, sizeof units);
    EXPECT_TRUE(KVMD5HashWithCFString(text.cf_str()) == expected);
    EXPECT_TRUE(KVMD5HashWithNSString(text.ns_str()) == expected);
    EXPECT_TRUE(KVMD5HashWithObject(text.ns_str()) == expected);
    EXPECT_EQ(bytesOf(KVMD5HashWithCFString(nullptr)), digestOf(""));
}

std::string lastLine;

TEST(KVMD5, RefusesOtherObjects)
{
    auto const number = KVNSRef<NSNumber*>::adopt(new NSNumber(1));
    KVSetLogSink([](char const* line, std::size_t length) { lastLine.assign(line, length); });
    EXPECT_TRUE(KVMD5HashWithObject(number) == KVHash128State());
    EXPECT_NE(lastLine.find("Cannot archive of type NSValue, rather consider using one of the "
                            "supported KVMD5HashWith<Type> equivalents."),
              std::string::npos)
        << lastLine;
    EXPECT_TRUE(KVMD5HashWithObject(nullptr) == KVHash128State());
    KVSetLogSink(nullptr);
    EXPECT_NE(lastLine.find("only strings are supported"), std::string::npos) << lastLine;
}

TEST(KVMD5, GoesToTextAndBack)
{
    auto const hash = KVMD5HashWithBytes("abc", 3);
    auto const text = KVCFRef<CFStringRef>::adopt(KVCreateStringFromMD5Hash(hash));
    EXPECT_EQ(std::string(KVString(text.get())), "98500190b04fd23c7d3f96d6727fe128");
    EXPECT_TRUE(KVMD5HashFromCFString(text) == hash);
    EXPECT_TRUE(KVMD5HashFromNSString(text) == hash);
    EXPECT_TRUE(KVMD5HashFromNSString(nullptr) == KVHash128State());
}

} // namespace
