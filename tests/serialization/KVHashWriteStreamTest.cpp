#include "SerializationSupport.h"

using namespace std::string_literals;

TEST(KVHashWriteStream, FoldsTheBytesOfValuesAlone)
{
    unsigned int numbers[] = {1, 2};
    float floats[] = {1, 2};
    double doubles[] = {1, 2};
    KVUUID const uuid{{1, 2, 3, 0xFFFFFFFFu}};
    KVHash128 const hash(9, 8, 7, 6);
    CMTime const time{-1, 600, 3, 1LL << 33};
    void const* const pointer = &time;
    struct Row {
        char const* what;
        std::function<void(KVHashWriteStream&)> write;
        std::string bytes;
    } const rows[] = {
        {"structure",
         [&](auto& s) {
             s.startElement(7);
             s.writeBlankLine();
             s.writeArray(numbers, 2);
             s.writeArray(floats, 2);
             s.writeArray(doubles, 2);
             s.writeOptionalAttribute(1, KVString("left out"));
             s.endElement();
         },
         ""},
        {"int", [](auto& s) { s.writeValue(-2); }, "\xFE\xFF\xFF\xFF"},
        {"float", [](auto& s) { s.writeValue(1.0f); }, "\0\0\x80\x3F"s},
        {"double", [](auto& s) { s.writeValue(1.0); }, "\0\0\0\0\0\0\xF0\x3F"s},
        {"long long", [](auto& s) { s.writeValue(-2LL); }, "\xFE\xFF\xFF\xFF\xFF\xFF\xFF\xFF"},
        {"bool", [](auto& s) { s.writeValue(true); }, "\1"},
        {"char", [](auto& s) { s.writeValue('a'); }, "a"},
        {"signed char", [](auto& s) { s.writeValue(static_cast<signed char>(-1)); }, "\xFF"},
        {"unsigned char", [](auto& s) { s.writeValue(static_cast<unsigned char>(7)); }, "\7"},
        {"short", [](auto& s) { s.writeValue(static_cast<short>(-2)); }, "\xFE\xFF"},
        {"unsigned short", [](auto& s) { s.writeValue(static_cast<unsigned short>(258)); }, "\2\1"},
        {"UUID", [&](auto& s) { s.writeValue(uuid); }, bytesOf(uuid)},
        {"hash", [&](auto& s) { s.writeValue(hash); }, bytesOf(hash)},
        {"time", [&](auto& s) { s.writeValue(time); },
         "\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF\x58\2\0\0\3\0\0\0\0\0\0\0\2\0\0\0"s},
        {"pointer", [&](auto& s) { s.writeValue(pointer); }, bytesOf(pointer)},
        {"C string", [](auto& s) { s.writeValue("ab"); }, "ab"},
        {"data", [](auto& s) { s.writeData("abc", 2); }, "ab"},
        {"string", [](auto& s) { s.writeValue(KVString("é1")); }, "\xE9\0\x31\0\0\0"s},
        {"empty string", [](auto& s) { s.writeValue(KVString("")); }, "\0\0"s},
        {"null string", [](auto& s) { s.writeValue(KVString()); }, ""},
        {"attributes",
         [&](auto& s) {
             s.writeAttribute(1, -2);
             s.writeAttribute(2, 2u);
             s.writeAttribute(3, 1.0f);
             s.writeAttribute(4, 1.0);
             s.writeAttribute(5, 3LL);
             s.writeAttribute(6, 4ULL);
             s.writeAttribute(7, uuid);
             s.writeAttribute(8, time);
             s.writeAttribute(9, KVString("a"));
         },
         bytesOf(-2) + bytesOf(2u) + bytesOf(1.0f) + bytesOf(1.0) + bytesOf(3LL) + bytesOf(4ULL) +
             bytesOf(uuid) + bytesOf(time) + "a\0\0\0"s},
    };
    for (auto const& row : rows) {
        KVHashWriteStream stream;
        row.write(stream);
        EXPECT_EQ(textOf(stream.getHash()), textOf(hashOf(row.bytes))) << row.what;
        EXPECT_EQ(textOf(stream.getHash()), textOf(hashOf(row.bytes))) << row.what << " again";
    }
}

TEST(KVHashWriteStream, GivesOneHashForAnyCutsOfTheBytes)
{
    std::string bytes(20000, '\0');
    for (std::size_t i = 0; i < bytes.size(); ++i)
        bytes[i] = static_cast<char>(i * i >> 4);
    for (unsigned total : {1u, 64u, 4095u, 4096u, 4097u, 8192u, 12289u, 20000u})
        for (unsigned piece : {1u, 24u, 63u, 4096u, 5000u, 20000u}) {
            KVHashWriteStream stream;
            for (unsigned i = 0; i < total; i += piece)
                stream.writeData(bytes.data() + i, std::min(piece, total - i));
            EXPECT_EQ(textOf(stream.getHash()), textOf(hashOf({bytes.data(), total})))
                << total << " in pieces of " << piece;
        }
    // A value that lies across the end of the buffer.
    KVHashWriteStream stream;
    stream.writeData(bytes.data(), 4090);
    stream.writeValue(CMTimeMake(1, 24));
    EXPECT_EQ(textOf(stream.getHash()),
              textOf(hashOf(bytes.substr(0, 4090) + bytesOf(CMTimeMake(1, 24)))));
}

TEST(KVHashWriteStream, IsCutWhereItIsRead)
{
    KVHashWriteStream read;
    read.writeValue(1);
    read.getHash();
    read.writeValue(2);
    KVHash128 expected = hashOf(bytesOf(1));
    expected.addData(reinterpret_cast<unsigned char const*>("\2\0\0"), 4);
    EXPECT_EQ(textOf(read.getHash()), textOf(expected));
}

TEST(KVHashWriteStream, ResetsTheBufferAndKeepsTheHash)
{
    std::string const block(4096, 'x');
    KVHashWriteStream stream;
    stream.writeData(block.data(), 4096);
    stream.reset(); // a full buffer has not gone to the hash yet
    EXPECT_EQ(textOf(stream.getHash()), std::string(32, '0'));

    stream.writeData(block.data(), 4096);
    stream.writeValue(true);
    stream.reset();
    EXPECT_EQ(textOf(stream.getHash()), textOf(hashOf(block)));

    stream.writeValue(1);
    stream.setHash(KVHash128(1, 2, 3, 4));
    EXPECT_EQ(textOf(stream.getHash()), "00000001000000020000000300000004");
}

TEST(KVHashWriteStream, PrintsItsBuffer)
{
    KVHashWriteStream stream;
    EXPECT_EQ(printedBy([&] {
                  stream.print();
                  stream.writeValue("\x01\xFF");
                  stream.print();
              }),
              "      reset\n      01ff\n");
}
