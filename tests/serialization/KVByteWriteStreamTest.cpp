#include "SerializationSupport.h"

namespace {

using Bytes = std::vector<unsigned>;

Bytes written(KVByteWriteStream const& stream)
{
    return {stream.data(), stream.data() + stream.size()};
}

} // namespace

TEST(KVByteWriteStream, PacksBitsFromTheTop)
{
    struct Row {
        std::vector<std::pair<unsigned, unsigned>> runs;
        Bytes bytes;
    } const rows[] = {
        {{{5, 3}, {1, 2}}, {0xA8}},
        {{{1, 1}, {0, 7}, {1, 1}}, {0x80, 0x80}},
        {{{0xFFFFFFFF, 4}, {0xFFFFFFFF, 0}}, {0xF0}},
        {{{1, 1}, {0x80000001, 32}}, {0xC0, 0, 0, 0, 0x80}},
        {{{0x89ABCDEF, 99}}, {0x89, 0xAB, 0xCD, 0xEF}},
    };
    for (Row const& row : rows) {
        KVByteWriteStream stream;
        for (auto const& [value, count] : row.runs)
            stream.writeBits(value, count);
        stream.flushBits();
        EXPECT_EQ(written(stream), row.bytes);
    }
}

TEST(KVByteWriteStream, StartsWholeBytesBehindPendingBits)
{
    KVByteWriteStream other, stream;
    other.writeBits(1, 1);
    stream.writeBits(1, 1);
    stream.writeUInt8(0x1FE);
    stream.writeUInt16(0x12345);
    stream.writeUInt32(0x89ABCDEF);
    stream.writeData(reinterpret_cast<unsigned char const*>("xy"), 2);
    stream.writeBits(3, 2);
    stream.writeStream(other);
    Bytes bytes{0x80, 0xFE, 0x23, 0x45, 0x89, 0xAB, 0xCD, 0xEF, 'x', 'y', 0xC0, 0x80};
    EXPECT_EQ(written(stream), bytes);
    stream.writeStream(stream);
    bytes.insert(bytes.end(), bytes.begin(), bytes.begin() + 12);
    EXPECT_EQ(written(stream), bytes);
}

TEST(KVByteWriteStream, OverwritesFourBytesThatAreThere)
{
    KVByteWriteStream stream;
    EXPECT_THROW(stream.writeValueAtPos(1, 0), KVBadIndexException);
    for (int i = 0; i < 5; ++i)
        stream.writeUInt8(0xEE);
    stream.writeValueAtPos(0x01020304, 1);
    EXPECT_EQ(written(stream), (Bytes{0xEE, 1, 2, 3, 4}));
    for (unsigned const position : {2u, 5u, 0xFFFFFFFFu})
        EXPECT_THROW(stream.writeValueAtPos(1, position), KVBadIndexException) << position;
}

TEST(KVDebugByteWriteStream, PrintsEachByte)
{
    KVByteWriteStream other;
    other.writeUInt8(0xAB);
    KVDebugByteWriteStream stream;
    EXPECT_EQ(printedBy([&] {
                  stream.writeUInt16(600);
                  stream.writeBits(1, 1);
                  stream.writeStream(other);
              }),
              "02\n58\n80\nab\n");
}
