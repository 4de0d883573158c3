#include "SerializationSupport.h"

namespace {

std::string armour(std::string_view bytes)
{
    KVAsciiStream stream;
    EXPECT_EQ(stream.write(bytes.data(), bytes.size()), static_cast<long long>(bytes.size()));
    stream.close();
    return stream.getString();
}

// Eight bytes of length and a "*": with the length 5, 00 00 00 | 00 00 00 | 00 05 2A.
constexpr char headerOf0[] = "***********e";
constexpr char headerOf5[] = "**********Ie";

} // namespace

TEST(KVAsciiStream, WritesThreeBytesAsFourCharacters)
{
    EXPECT_EQ(armour(""), headerOf0);
    // FF 00 FF: 63, 48, 3, 63. 01 02 00: 0, 16, 8, 0.
    EXPECT_EQ(armour({"\xFF\x00\xFF\x01\x02", 5}), std::string(headerOf5) + "zk1z*E6*");
    int alphabet = 0;
    for (int c = 0; c < 256; ++c)
        alphabet += KVAsciiStream::validChar(static_cast<unsigned char>(c));
    EXPECT_EQ(alphabet, 64);
}

TEST(KVAsciiStream, ReadsWhatItWrote)
{
    for (std::size_t length = 0; length < 20; ++length) {
        std::string bytes(length, '\0');
        for (std::size_t i = 0; i < length; ++i)
            bytes[i] = static_cast<char>(i * 37 + 200);
        std::string const text = armour(bytes);
        for (unsigned long long const piece : {1, 2, 4, 5, 100}) {
            KVAsciiStream stream;
            ASSERT_TRUE(stream.open(text.c_str()));
            std::string read;
            char out[100];
            while (long long const count = stream.read(out, piece))
                read.append(out, static_cast<std::size_t>(count));
            EXPECT_EQ(read, bytes) << "in pieces of " << piece;
        }
    }
}

TEST(KVAsciiStream, DoesNotBelieveAHeaderThatLies)
{
    struct Row {
        char const* text;
        unsigned long long length;
        char const* error;
    } const rows[] = {
        {nullptr, 100, "Not enough data"},
        {"***********", 11, "Not enough data"},
        {"************", 12, "Magic Number does not match"},
        {"!!!!!!!!!!!!", 12, "Magic Number does not match"},
        {headerOf0, 12, ""},
    };
    for (Row const& row : rows) {
        KVAsciiStream stream;
        EXPECT_EQ(stream.open(row.text, row.length), *row.error == '\0');
        EXPECT_EQ(stream.getError().toUTF8(), row.error);
        char byte;
        EXPECT_EQ(stream.read(&byte, 1), 0);
    }
    // A length of all ones, with two groups and a stray character behind the header.
    KVAsciiStream stream;
    ASSERT_TRUE(stream.open("zzzzzzzzzzwezzzz****z"));
    unsigned char out[100];
    EXPECT_EQ(stream.read(out, 100), 6);
    EXPECT_EQ(out[2], 0xFF);
    EXPECT_EQ(out[3], 0);
}

TEST(KVAsciiStream, IsWrittenOrRead)
{
    KVAsciiStream stream;
    char byte = 'a';
    EXPECT_EQ(stream.write(&byte, 1), 1);
    EXPECT_EQ(stream.getString().toUTF8(), headerOf0) << "until it is closed";
    EXPECT_EQ(stream.read(&byte, 1), 0);
    stream.close();
    EXPECT_EQ(stream.write(&byte, 1), 0);
    std::string const text = stream.getString();
    ASSERT_TRUE(stream.open(text.c_str()));
    EXPECT_EQ(stream.write(&byte, 1), 0);
    stream.close();
    EXPECT_EQ(stream.read(&byte, 1), 1);
    stream.clear();
    EXPECT_EQ(stream.getString().toUTF8(), "");
    EXPECT_EQ(stream.write(&byte, 1), 1);
}
