#include "SerializationSupport.h"

#include <gmock/gmock.h>

namespace {

/// The digest's bytes in memory, as digests are usually printed.
std::string digits(KVHash128State const& hash)
{
    std::string text;
    for (auto word : hash.words)
        for (int shift = 0; shift < 32; shift += 4)
            text += "0123456789abcdef"[word >> (shift ^ 4) & 15];
    return text;
}

std::string digestOf(std::string_view bytes)
{
    return digits(KVMD5HashWithBytes(bytes.data(), bytes.size()));
}

std::string logged;

/// What `body` logs.
template <class Body>
std::string loggedBy(Body body)
{
    logged.clear();
    KVSetLogSink([](char const* line, std::size_t length) { logged.append(line, length) += '\n'; });
    body();
    KVSetLogSink(nullptr);
    return logged;
}

} // namespace

TEST(KVMD5, AgreesWithTheVectorsOfRFC1321)
{
    struct Row {
        std::string_view text;
        std::string_view digest;
    } const rows[] = {
        {"", "d41d8cd98f00b204e9800998ecf8427e"},
        {"abc", "900150983cd24fb0d6963f7d28e17f72"},
        {"ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789",
         "d174ab98d277d9f5a5611c2c9f419d9f"},
        {"1234567890123456789012345678901234567890"
         "1234567890123456789012345678901234567890",
         "57edf4a22be3c955ac49da2e2107b67a"},
    };
    for (auto const& row : rows)
        EXPECT_EQ(digestOf(row.text), row.digest) << row.text;
    // The lengths on both sides of the room for the length, by md5sum.
    EXPECT_EQ(digestOf(std::string(55, 'x')), "04364420e25c512fd958a70738aa8f72");
    EXPECT_EQ(digestOf(std::string(56, 'x')), "668a72d5ba17f08e62dabcafad6db14b");
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
            EXPECT_EQ(digits(md5.getHash()), digestOf({bytes.data(), length}))
                << length << " in pieces of " << piece;
        }
    // Nothing is taken after the end.
    KVMD5 md5;
    md5.writeBytes("abc", 3);
    md5.finish();
    EXPECT_NE(loggedBy([&] { md5.writeBytes("d", 1); }), "");
    EXPECT_EQ(digits(md5.getHash()), digestOf("abc"));
    EXPECT_EQ(digits(md5.getHash()), digestOf("abc"));
    // md5sum of the same bytes.
    EXPECT_EQ(digestOf(bytes), "d8fb14c35cd5d3d83ced11a73dfdd2d8");
}

TEST(KVMD5, HashesValuesAsPackedArrays)
{
    KVString const text("é\U0001F600");
    char16_t const units[] = {0xE9, 0xD83D, 0xDE00};
    void const* pointer = &text;
    struct Row {
        char const* what;
        KVHash128State hash;
        std::string bytes;
    } const rows[] = {
        {"int32", KVMD5HashWithInt32(3, 1, -2, 3), bytesOf(1) + bytesOf(-2) + bytesOf(3)},
        {"no int32", KVMD5HashWithInt32(0), ""},
        {"int64", KVMD5HashWithInt64(2, -2LL, 1LL << 40), bytesOf(-2LL) + bytesOf(1LL << 40)},
        {"float64", KVMD5HashWithFloat64(2, 0.5, -0.0), bytesOf(0.5) + bytesOf(-0.0)},
        {"pointer", KVMD5HashWithPointer(pointer), bytesOf(pointer)},
        {"CFString", KVMD5HashWithCFString(text.cf_str()), bytesOf(units)},
        {"NSString", KVMD5HashWithNSString(text.ns_str()), bytesOf(units)},
        {"object", KVMD5HashWithObject(text.ns_str()), bytesOf(units)},
        {"no string", KVMD5HashWithCFString(nullptr), ""},
    };
    for (Row const& row : rows)
        EXPECT_EQ(digits(row.hash), digestOf(row.bytes)) << row.what;
}

TEST(KVMD5, RefusesOtherObjects)
{
    auto const refusal = [](NSObject const* object) {
        return loggedBy([&] { EXPECT_TRUE(KVMD5HashWithObject(object) == KVHash128State()); });
    };
    EXPECT_THAT(refusal(KVMakeRef<NSNumber>(1)),
                testing::HasSubstr("Cannot archive of type NSValue, rather consider using one of "
                                   "the supported KVMD5HashWith<Type> equivalents."));
    EXPECT_THAT(refusal(nullptr), testing::HasSubstr("only strings are supported"));
}

TEST(KVMD5, GoesToTextAndBack)
{
    auto const hash = KVMD5HashWithBytes("abc", 3);
    // The words print each four bytes in the other order.
    EXPECT_EQ(std::string(KVMD5HashToString(hash)), "98500190b04fd23c7d3f96d6727fe128");
    auto const text = KVCFRef<CFStringRef>::adopt(KVCreateStringFromMD5Hash(hash));
    EXPECT_EQ(std::string(KVString(text.get())), "98500190b04fd23c7d3f96d6727fe128");
    EXPECT_TRUE(KVMD5HashFromCFString(text) == hash);
    EXPECT_TRUE(KVMD5HashFromNSString(text) == hash);
    EXPECT_TRUE(KVMD5HashFromNSString(nullptr) == KVHash128State());
}
