#pragma once

#include <korvane/foundation/KVExport.h>

#include <cstddef>
#include <vector>

/// Gathers bytes and runs of bits; numbers go most significant byte and bit first.
///
///     KVByteWriteStream stream;
///     stream.writeBits(5, 3);        // 101
///     stream.writeBits(1, 2);        // 01
///     stream.flushBits();            // 000: the byte is 0xA8
///     stream.writeUInt16(600);       // 0x02, 0x58
///
/// All but `writeBits` start at a whole byte: bits that are pending are filled up with zeros and
/// written first. A stream belongs to one thread.
class KV_EXPORT KVByteWriteStream {
public:
    KVByteWriteStream() = default;
    virtual ~KVByteWriteStream();

    /// The low 8, 16 or 32 bits.
    void writeUInt8(unsigned int value);
    void writeUInt16(unsigned int value);
    void writeUInt32(unsigned int value);
    /// Copies the bytes.
    void writeData(unsigned char const* data, unsigned int length);
    /// Appends all bytes of the other stream (which may be this one), whose pending bits are
    /// flushed first.
    virtual void writeStream(KVByteWriteStream& other);
    /// Overwrites the four bytes at `position`, counted from the start. Throws KVBadIndexException
    /// unless all of them have been written.
    void writeValueAtPos(unsigned int value, unsigned int position);

    /// The low `count` bits of `value`, at most 32.
    void writeBits(unsigned int value, unsigned int count);
    /// Fills the current byte up with zero bits; nothing when no bit is pending.
    void flushBits();
    /// Appends the current byte as it stands and starts a new one.
    virtual void writeCurByte();

    /// Valid until the next byte is written.
    unsigned char const* data() const noexcept { return bytes_.data(); }
    /// Whole bytes; pending bits do not count.
    std::size_t size() const noexcept { return bytes_.size(); }

protected:
    unsigned char currentByte() const noexcept { return currentByte_; }

private:
    std::vector<unsigned char> bytes_;
    unsigned char currentByte_ = 0;
    unsigned int bitsUsed_ = 0;
};

/// The same, and prints each byte through KVPrint as it is written: a line with two hexadecimal
/// digits.
class KV_EXPORT KVDebugByteWriteStream : public KVByteWriteStream {
public:
    ~KVDebugByteWriteStream() override;
    void writeStream(KVByteWriteStream& other) override;
    void writeCurByte() override;
};
