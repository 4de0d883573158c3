#pragma once

#include <korvane/serialization/KVHash128.h>
#include <korvane/serialization/KVSerializerWriteStream.h>

/// Folds what an object writes into a 128-bit fingerprint: the object's code for writing itself
/// gives, with this stream, a hash of its state.
///
///     KVHashWriteStream stream;
///     clip.writeBody(stream, false, false, false);
///     KVHash128 const fingerprint = stream.getHash();
///
/// Only values enter, as their bytes in memory and in order; elements, tokens, names, arrays and
/// optional attributes do not. So objects hash alike when they write the same bytes: `1.0f` and
/// `0x3F800000` are alike, the times 1/2 and 2/4 are not. Hashes hold for machines of one byte
/// order.
///
/// Scopes are not needed. Values gather in a buffer of 4096 bytes within the object; nothing is
/// allocated. A stream belongs to one thread.
class KV_EXPORT KVHashWriteStream : public KVSerializerWriteStream {
public:
    KVHashWriteStream() noexcept;
    ~KVHashWriteStream() override;

    using KVSerializerWriteStream::writeAttribute;
    using KVSerializerWriteStream::writeValue;

    // --- Nothing is folded in by these ---

    void startElement(unsigned int token) override;
    void endElement() override;
    void writeArray(unsigned int* values, unsigned int count) override;
    void writeArray(float* values, unsigned int count) override;
    void writeArray(double* values, unsigned int count) override;
    void writeOptionalAttribute(unsigned int token, KVString const& value) override;
    void writeBlankLine() override;

    // --- Values ---

    /// 4 bytes for an `int`, `unsigned int` or `float`, 8 for a `long long`, `unsigned long long`
    /// or `double`, 16 for a KVUUID, the record of 24 bytes for a time.
    void writeValue(int value) override;
    void writeValue(unsigned int value) override;
    void writeValue(long long value) override;
    void writeValue(unsigned long long value) override;
    void writeValue(float value) override;
    void writeValue(double value) override;
    void writeValue(KVUUID const& value) override;
    /// The UTF-16 units and a terminating zero: 2 bytes for the empty string, none for the null
    /// one.
    void writeValue(KVString const& value) override;
    void writeValue(CMTime const& value) override;

    /// The address itself: a hash with one in it is good for this process only.
    void writeValue(void const* pointer);
    void writeValue(KVHash128 const& value);
    /// The characters without the terminator; nothing for null.
    void writeValue(char const* text);
    void writeValue(bool value);
    void writeValue(char value);
    void writeValue(signed char value);
    void writeValue(unsigned char value);
    void writeValue(short value);
    void writeValue(unsigned short value);
    void writeData(void const* data, unsigned int length);

    /// As the value alone; the token does not count.
    void writeAttribute(unsigned int token, unsigned int value) override;
    void writeAttribute(unsigned int token, int value) override;
    void writeAttribute(unsigned int token, unsigned long long value) override;
    void writeAttribute(unsigned int token, long long value) override;
    void writeAttribute(unsigned int token, float value) override;
    void writeAttribute(unsigned int token, double value) override;
    void writeAttribute(unsigned int token, KVUUID const& value) override;
    void writeAttribute(unsigned int token, KVString const& value) override;
    void writeAttribute(unsigned int token, CMTime const& value) override;

    // --- The hash ---

    /// Folds in what the buffer holds. Unless that is a multiple of 64 bytes it is padded
    /// (see `KVHash128::addData`), so a stream that goes on after `close` or `getHash` gives
    /// another hash than one that was not read.
    void close() override;
    /// Calls `close`. All zero if nothing was written. Valid as long as the stream, and changed by
    /// what is written later.
    KVHash128 const& getHash();
    /// Goes on from `hash`, without what the buffer holds.
    void setHash(KVHash128 const& hash) noexcept;
    /// Throws away what the buffer holds and keeps the hash.
    void reset() noexcept override;
    /// True.
    bool isHashStream() override;
    /// Prints the bytes in the buffer on one line in hexadecimal, through KVPrint.
    void print();

private:
    static constexpr unsigned int bufferSize = 4096;
    static constexpr unsigned int blockSize = 64;

    std::size_t room() const noexcept { return static_cast<std::size_t>(blockEnd_ - cursor_); }
    template <class T>
    void fold(T const& value) noexcept;
    void foldBytes(unsigned char const* data, std::size_t length) noexcept;
    void endBlock() noexcept;

    KVHash128 hash_;
    // The hash with the full blocks of the buffer in it; always started.
    KVHash128 ahead_;
    unsigned char* cursor_;
    // The end of the block that is being filled.
    unsigned char* blockEnd_;
    unsigned char buffer_[bufferSize];
};
