#include "SerializationSupport.h"

#include <numeric>

TEST(KVBufferReadStream, ReadsWhatIsLeft)
{
    auto data = KVCFRef<CFDataRef>::adopt(CFDataCreate(nullptr, "abcdef", 6));
    KVBufferReadStream stream(data);
    data = nullptr; // the stream keeps its block
    char out[8] = {};
    EXPECT_EQ(stream.read(out, 4), 4);
    EXPECT_EQ(stream.read(out + 4, 4), 2);
    EXPECT_STREQ(out, "abcdef");
    EXPECT_EQ(stream.read(out, 4), 0);
    stream.setPos(7);
    EXPECT_EQ(stream.getPos(), 6u) << "a position behind the end is the end";
    EXPECT_EQ(stream.read(out, 1), 0);
    stream.setPos(2);
    EXPECT_EQ(stream.write("xyz", 3), 0);
    EXPECT_EQ(stream.getPos(), 2u) << "writing moves nothing";
    EXPECT_EQ(stream.read(out, ~0ull), 4);
    EXPECT_EQ(KVBufferReadStream(nullptr).read(out, 1), 0);
}

TEST(KVBufferWriteStream, GrowsWhenAWriteReachesItsEnd)
{
    // Lengths around every end of the block, written whole and byte by byte.
    for (int length = 0; length < 40; ++length) {
        std::string text(static_cast<std::size_t>(length), '\0');
        std::iota(text.begin(), text.end(), 'A');
        KVBufferWriteStream whole(8, 4), bytes(0, 0);
        EXPECT_EQ(whole.write(text.data(), text.size()), length);
        EXPECT_EQ(textOf(whole), text);
        for (char const& c : text)
            bytes.write(&c, 1);
        EXPECT_EQ(textOf(bytes), text);
        EXPECT_EQ(bytes.getPos(), text.size());
    }
}

TEST(KVBufferWriteStream, FollowsItsPosition)
{
    KVBufferWriteStream stream(4, 4);
    stream << "0123456789";
    stream.setPos(3);
    stream << "ab";
    EXPECT_EQ(stream.getPos(), 5u);
    EXPECT_EQ(textOf(stream), "012ab56789");
    stream.setPos(8);
    stream << "xyz and much more than the block had room for";
    EXPECT_EQ(textOf(stream), "012ab567xyz and much more than the block had room for");
    EXPECT_EQ(stream.read(nullptr, 4), 0);

    stream.reset();
    stream.setPos(5);
    EXPECT_EQ(stream.getBufferSize(), 0u) << "only a write extends the data";
    stream << "x";
    EXPECT_EQ(textOf(stream), std::string(5, '\0') + "x") << "and fills the gap with zeros";
}

TEST(KVBufferWriteStream, CopiesItsData)
{
    KVBufferWriteStream stream(16, 16);
    stream << "copied";
    KVCFRef<CFDataRef> const data = stream.copyData();
    std::unique_ptr<char, decltype(&std::free)> const block(static_cast<char*>(stream.copyBuffer()),
                                                            &std::free);
    stream.reset();
    stream << "******";
    EXPECT_EQ(std::string_view(block.get(), 6), "copied");
    EXPECT_EQ(data->description().toUTF8(), "<636f7069 6564>");
}

TEST(KVBufferWriteStream, ThrowsWhatItCannotHold)
{
    EXPECT_THROW(KVBufferWriteStream(-1, 16), KVException_WriteError);
    KVBufferWriteStream stream(16, 16);
    stream << "kept";
    for (unsigned long long const position : {0x100000000ull, ~0ull}) {
        stream.setPos(position);
        EXPECT_THROW(stream.write("x", 1), KVException_WriteError) << position;
    }
    stream.setPos(4);
    stream << "!";
    EXPECT_EQ(textOf(stream), "kept!");
}
