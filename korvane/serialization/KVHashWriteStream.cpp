#include <korvane/serialization/KVHashWriteStream.h>

#include <korvane/foundation/KVPrint.h>

#include <cstring>
#include <string>

static_assert(sizeof(CMTime) == 24 && sizeof(KVUUID) == 16 && sizeof(KVHash128) == 16,
              "records are folded in as they lie in memory");

KVHashWriteStream::KVHashWriteStream() noexcept = default;
KVHashWriteStream::~KVHashWriteStream() = default;

void KVHashWriteStream::startElement(unsigned int) {}
void KVHashWriteStream::endElement() {}
void KVHashWriteStream::writeArray(unsigned int*, unsigned int) {}
void KVHashWriteStream::writeArray(float*, unsigned int) {}
void KVHashWriteStream::writeArray(double*, unsigned int) {}
void KVHashWriteStream::writeOptionalAttribute(unsigned int, KVString const&) {}
void KVHashWriteStream::writeBlankLine() {}

// --- Folding ---

template <class T>
[[gnu::always_inline]] inline void KVHashWriteStream::fold(T const& value) noexcept
{
    if (remaining() < sizeof value) [[unlikely]] {
        T const copy = value; // so that the value itself may stay in a register
        return foldAcrossRefill(reinterpret_cast<unsigned char const*>(&copy), sizeof copy);
    }
    std::memcpy(cursor_, &value, sizeof value);
    cursor_ += sizeof value;
}

/// Fills the buffer to its end before it goes to the hash, and leaves a full one to the next value:
/// that is where `reset` cuts.
void KVHashWriteStream::foldAcrossRefill(unsigned char const* data, std::size_t length) noexcept
{
    while (length > remaining()) {
        if (cursor_ == buffer_) {
            // Nothing waits: take whole buffers from where they lie.
            hash_.addData(data, bufferSize);
            data += bufferSize;
            length -= bufferSize;
            continue;
        }
        std::size_t const room = remaining();
        std::memcpy(cursor_, data, room);
        data += room;
        length -= room;
        hash_.addData(buffer_, bufferSize);
        cursor_ = buffer_;
    }
    std::memcpy(cursor_, data, length);
    cursor_ += length;
}

void KVHashWriteStream::writeData(void const* data, unsigned int length)
{
    if (length > 0)
        foldAcrossRefill(static_cast<unsigned char const*>(data), length);
}

// --- Values ---

void KVHashWriteStream::writeValue(int value)
{
    fold(value);
}

void KVHashWriteStream::writeValue(unsigned int value)
{
    fold(value);
}

void KVHashWriteStream::writeValue(long long value)
{
    fold(value);
}

void KVHashWriteStream::writeValue(unsigned long long value)
{
    fold(value);
}

void KVHashWriteStream::writeValue(float value)
{
    fold(value);
}

void KVHashWriteStream::writeValue(double value)
{
    fold(value);
}

void KVHashWriteStream::writeValue(KVUUID const& value)
{
    fold(value);
}

void KVHashWriteStream::writeValue(KVString const& value)
{
    if (char16_t const* const units = value.u_str())
        foldAcrossRefill(reinterpret_cast<unsigned char const*>(units),
                         sizeof *units * (std::size_t(value.size()) + 1));
}

void KVHashWriteStream::writeValue(CMTime const& value)
{
    fold(value);
}

void KVHashWriteStream::writeValue(void const* pointer)
{
    fold(pointer);
}

void KVHashWriteStream::writeValue(KVHash128 const& value)
{
    fold(value);
}

void KVHashWriteStream::writeValue(char const* text)
{
    if (text)
        foldAcrossRefill(reinterpret_cast<unsigned char const*>(text), std::strlen(text));
}

void KVHashWriteStream::writeValue(bool value)
{
    fold(value);
}

void KVHashWriteStream::writeValue(char value)
{
    fold(value);
}

void KVHashWriteStream::writeValue(signed char value)
{
    fold(value);
}

void KVHashWriteStream::writeValue(unsigned char value)
{
    fold(value);
}

void KVHashWriteStream::writeValue(short value)
{
    fold(value);
}

void KVHashWriteStream::writeValue(unsigned short value)
{
    fold(value);
}

// --- Attributes ---

void KVHashWriteStream::writeAttribute(unsigned int, unsigned int value)
{
    fold(value);
}

void KVHashWriteStream::writeAttribute(unsigned int, int value)
{
    fold(value);
}

void KVHashWriteStream::writeAttribute(unsigned int, unsigned long long value)
{
    fold(value);
}

void KVHashWriteStream::writeAttribute(unsigned int, long long value)
{
    fold(value);
}

void KVHashWriteStream::writeAttribute(unsigned int, float value)
{
    fold(value);
}

void KVHashWriteStream::writeAttribute(unsigned int, double value)
{
    fold(value);
}

void KVHashWriteStream::writeAttribute(unsigned int, KVUUID const& value)
{
    fold(value);
}

void KVHashWriteStream::writeAttribute(unsigned int, KVString const& value)
{
    writeValue(value);
}

void KVHashWriteStream::writeAttribute(unsigned int, CMTime const& value)
{
    fold(value);
}

// --- The hash ---

void KVHashWriteStream::close()
{
    if (cursor_ == buffer_)
        return;
    hash_.addData(buffer_, static_cast<unsigned int>(cursor_ - buffer_));
    reset();
}

KVHash128 const& KVHashWriteStream::getHash()
{
    close();
    return hash_;
}

void KVHashWriteStream::setHash(KVHash128 const& hash) noexcept
{
    hash_ = hash;
    cursor_ = buffer_;
}

void KVHashWriteStream::reset()
{
    cursor_ = buffer_;
}

bool KVHashWriteStream::isHashStream()
{
    return true;
}

void KVHashWriteStream::print()
{
    std::string line(cursor_ == buffer_ ? "      reset" : "      ");
    for (unsigned char const* byte = buffer_; byte != cursor_; ++byte) {
        line += "0123456789abcdef"[*byte >> 4];
        line += "0123456789abcdef"[*byte & 15];
    }
    KVPrint("%s\n", line.c_str());
}
