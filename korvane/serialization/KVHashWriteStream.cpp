#include <korvane/serialization/KVHashWriteStream.h>

#include <korvane/foundation/KVPrint.h>
#include <korvane/serialization/KVMD5Blocks_p.h>

#include <cstring>
#include <string>

static_assert(sizeof(CMTime) == 24 && sizeof(KVUUID) == 16 && sizeof(KVHash128) == 16,
              "records are folded in as they lie in memory");

KVHashWriteStream::KVHashWriteStream() noexcept
{
    reset();
}

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
    if (room() < sizeof value) [[unlikely]] {
        T const copy = value; // so that the value itself may stay in a register
        return foldBytes(reinterpret_cast<unsigned char const*>(&copy), sizeof copy);
    }
    std::memcpy(cursor_, &value, sizeof value);
    cursor_ += sizeof value;
}

void KVHashWriteStream::foldBytes(unsigned char const* data, std::size_t length) noexcept
{
    while (length > room()) {
        if (cursor_ == buffer_ && length > bufferSize) {
            // Whole buffers are taken from where they lie.
            auto const whole = (length - 1) / bufferSize * bufferSize;
            kv::md5Blocks(ahead_.words, data, whole / blockSize);
            hash_ = ahead_;
            data += whole;
            length -= whole;
            continue;
        }
        std::size_t const fitting = room();
        std::memcpy(cursor_, data, fitting);
        data += fitting;
        length -= fitting;
        endBlock();
    }
    std::memcpy(cursor_, data, length);
    cursor_ += length;
}

/// Runs the hash ahead over the block that has become full. The processor works at it while the
/// next values come in. A full buffer is kept until more comes: that is where `reset` cuts.
void KVHashWriteStream::endBlock() noexcept
{
    kv::md5Blocks(ahead_.words, blockEnd_ - blockSize, 1);
    cursor_ = blockEnd_;
    if (blockEnd_ == buffer_ + bufferSize) {
        hash_ = ahead_;
        cursor_ = buffer_;
    }
    blockEnd_ = cursor_ + blockSize;
}

void KVHashWriteStream::writeData(void const* data, unsigned int length)
{
    if (length > 0)
        foldBytes(static_cast<unsigned char const*>(data), length);
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
        foldBytes(reinterpret_cast<unsigned char const*>(units),
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
        foldBytes(reinterpret_cast<unsigned char const*>(text), std::strlen(text));
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
    unsigned char const* const block = blockEnd_ - blockSize;
    ahead_.addData(block, static_cast<unsigned int>(cursor_ - block));
    setHash(ahead_);
}

KVHash128 const& KVHashWriteStream::getHash()
{
    close();
    return hash_;
}

void KVHashWriteStream::setHash(KVHash128 const& hash) noexcept
{
    hash_ = hash;
    reset();
}

void KVHashWriteStream::reset() noexcept
{
    ahead_ = hash_;
    ahead_.addData(nullptr, 0); // starts it
    cursor_ = buffer_;
    blockEnd_ = buffer_ + blockSize;
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
