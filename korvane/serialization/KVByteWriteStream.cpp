#include <korvane/serialization/KVByteWriteStream.h>

#include <korvane/foundation/KVException.h>
#include <korvane/foundation/KVPrint.h>

#include <algorithm>

KVByteWriteStream::~KVByteWriteStream() = default;

void KVByteWriteStream::writeUInt8(unsigned int value)
{
    flushBits();
    currentByte_ = static_cast<unsigned char>(value);
    writeCurByte();
}

void KVByteWriteStream::writeUInt16(unsigned int value)
{
    writeUInt8(value >> 8);
    writeUInt8(value);
}

void KVByteWriteStream::writeUInt32(unsigned int value)
{
    writeUInt16(value >> 16);
    writeUInt16(value);
}

void KVByteWriteStream::writeData(unsigned char const* data, unsigned int length)
{
    bytes_.reserve(bytes_.size() + length);
    std::for_each(data, data + length, [this](unsigned char byte) { writeUInt8(byte); });
}

void KVByteWriteStream::writeStream(KVByteWriteStream& other)
{
    flushBits();
    other.flushBits();
    // By index, and the length first: the stream may be appended to itself.
    std::size_t const count = other.bytes_.size();
    bytes_.reserve(bytes_.size() + count);
    for (std::size_t i = 0; i < count; ++i)
        bytes_.push_back(other.bytes_[i]);
}

void KVByteWriteStream::writeValueAtPos(unsigned int value, unsigned int position)
{
    flushBits();
    if (bytes_.size() < 4 || position > bytes_.size() - 4)
        throw KVBadIndexException("KVByteWriteStream::writeValueAtPos");
    for (unsigned int i = 0; i < 4; ++i)
        bytes_[position + i] = static_cast<unsigned char>(value >> (24 - 8 * i));
}

void KVByteWriteStream::writeBits(unsigned int value, unsigned int count)
{
    for (unsigned int bit = std::min(count, 32u); bit-- > 0;) {
        currentByte_ =
            static_cast<unsigned char>(currentByte_ | (value >> bit & 1) << (7 - bitsUsed_));
        if (++bitsUsed_ == 8)
            writeCurByte();
    }
}

void KVByteWriteStream::flushBits()
{
    if (bitsUsed_ != 0)
        writeCurByte();
}

void KVByteWriteStream::writeCurByte()
{
    bytes_.push_back(currentByte_);
    currentByte_ = 0;
    bitsUsed_ = 0;
}

KVDebugByteWriteStream::~KVDebugByteWriteStream() = default;

void KVDebugByteWriteStream::writeStream(KVByteWriteStream& other)
{
    flushBits();
    std::size_t const start = size();
    KVByteWriteStream::writeStream(other);
    for (std::size_t i = start; i < size(); ++i)
        KVPrint("%02x\n", data()[i]);
}

void KVDebugByteWriteStream::writeCurByte()
{
    KVPrint("%02x\n", currentByte());
    KVByteWriteStream::writeCurByte();
}
