#include <korvane/serialization/KVBinaryXMLWriteStream.h>

#include <korvane/foundation/KVException.h>
#include <korvane/foundation/KVPrint.h>
#include <korvane/serialization/KVBinaryXMLFormat_p.h>
#include <korvane/serialization/KVFileWriteStream.h>
#include <korvane/serialization/KVNumberText_p.h>

#include <bit>
#include <cstring>
#include <memory>
#include <new>

using namespace kv::binary;

namespace {

/// Room for the encoded form of any value but a string, with an attribute's token in front of it.
constexpr std::size_t encodedSize = 64;
/// Room for an element's head: the marker of a child, token, size and number of attributes.
constexpr std::size_t headSize = 16;
constexpr std::size_t initialCapacity = 4096;
/// An element of more bytes goes out before it ends.
constexpr std::size_t heldSize = 2048;

unsigned char* putVarInt(unsigned char* out, std::uint32_t value) noexcept
{
    for (; value >= 0x80; value >>= 7)
        *out++ = static_cast<unsigned char>(value | 0x80);
    *out++ = static_cast<unsigned char>(value);
    return out;
}

unsigned char* putInteger(unsigned char* out, std::uint64_t magnitude, bool negative) noexcept
{
    if (magnitude <= 1) {
        *out++ = magnitude == 1 ? oneTag : zeroTag;
        return out;
    }
    unsigned int const length = byteLength(magnitude);
    *out++ =
        static_cast<unsigned char>((firstIntegerTag - 1 + length) | (negative ? negativeBit : 0u));
    return storeLittleEndian(out, magnitude, length);
}

unsigned char* putNegative(unsigned char* out, std::uint64_t magnitude) noexcept
{
    if (magnitude != 1)
        return putInteger(out, magnitude, true);
    *out++ = static_cast<unsigned char>(firstIntegerTag | negativeBit);
    *out++ = 1;
    return out;
}

// --- `put`: the tag and payload of each kind of value ---

unsigned char* put(unsigned char* out, unsigned long long value) noexcept
{
    return putInteger(out, value, false);
}

unsigned char* put(unsigned char* out, unsigned int value) noexcept
{
    return putInteger(out, value, false);
}

unsigned char* put(unsigned char* out, long long value) noexcept
{
    auto const bits = static_cast<std::uint64_t>(value);
    return value < 0 ? putNegative(out, 0 - bits) : putInteger(out, bits, false);
}

unsigned char* put(unsigned char* out, int value) noexcept
{
    if (value >= 0)
        return putInteger(out, static_cast<std::uint32_t>(value), false);
    // The magnitude of the lowest int is again that int, and its sign is extended: documents hold
    // it as 0xFFFFFFFF80000000.
    auto const magnitude = static_cast<std::int32_t>(0 - static_cast<std::uint32_t>(value));
    return putNegative(out, static_cast<std::uint64_t>(std::int64_t{magnitude}));
}

template <class T>
bool isInteger(T value) noexcept
{
    return value >= T(-0x1p63) && value < T(0x1p63) &&
           static_cast<T>(static_cast<std::int64_t>(value)) == value;
}

unsigned char* put(unsigned char* out, float value) noexcept
{
    if (isInteger(value))
        return put(out, static_cast<long long>(value));
    *out++ = floatTag;
    return storeLittleEndian(out, std::bit_cast<std::uint32_t>(value), sizeof value);
}

unsigned char* put(unsigned char* out, double value) noexcept
{
    if (isInteger(value))
        return put(out, static_cast<long long>(value));
    *out++ = doubleTag;
    return storeLittleEndian(out, std::bit_cast<std::uint64_t>(value), sizeof value);
}

unsigned char* put(unsigned char* out, KVUUID const& value) noexcept
{
    *out++ = uuidTag;
    for (std::uint32_t const word : value.words)
        out = storeLittleEndian(out, word, sizeof word);
    return out;
}

/// 0, 1, 2, 3 for 1, 2, 4, 8 bytes.
unsigned int sizeExponent(std::uint64_t value) noexcept
{
    return static_cast<unsigned int>(std::bit_width(byteLength(value) - 1));
}

unsigned char* put(unsigned char* out, CMTime const& time) noexcept
{
    auto const value = static_cast<std::uint64_t>(time.value);
    auto const timescale = static_cast<std::uint32_t>(time.timescale);
    auto const epoch = static_cast<std::uint64_t>(time.epoch);
    unsigned int const descriptor = sizeExponent(value) | (byteLength(timescale) - 1) << 2 |
                                    (byteLength(time.flags) - 1) << 4 | sizeExponent(epoch) << 6;
    TimeSizes const sizes = TimeSizes::of(descriptor);
    *out++ = timeTag;
    *out++ = static_cast<unsigned char>(descriptor);
    out = storeLittleEndian(out, value, sizes.value);
    out = storeLittleEndian(out, timescale, sizes.timescale);
    out = storeLittleEndian(out, time.flags, sizes.flags);
    return storeLittleEndian(out, epoch, sizes.epoch);
}

template <class T>
void write(KVStream& stream, T const& value)
{
    unsigned char bytes[encodedSize];
    unsigned char const* const end = put(bytes, value);
    stream.write(bytes, static_cast<unsigned long long>(end - bytes));
}

std::size_t stringSize(KVString const& text) noexcept
{
    return 6 + CFStringGetMaximumUTF8Length(text.size());
}

/// Needs `stringSize` bytes.
unsigned char* put(unsigned char* out, KVString const& text) noexcept
{
    *out++ = stringTag;
    CFStringRef const string = text.cf_str();
    if (string->isASCII()) {
        out = putVarInt(out, text.size());
        char16_t const* const units = string->units();
        for (std::size_t i = 0, length = text.size(); i < length; ++i)
            out[i] = static_cast<unsigned char>(units[i]);
        return out + text.size();
    }
    constexpr std::size_t mostOfVarInt = 5;
    auto* const utf8 = out + mostOfVarInt;
    std::size_t const length = CFStringEncodeUTF8(text.view(), reinterpret_cast<char*>(utf8));
    out = putVarInt(out, static_cast<std::uint32_t>(length));
    std::memmove(out, utf8, length);
    return out + length;
}

} // namespace

KVBinaryXMLWriteStream::KVBinaryXMLWriteStream(KVStream& stream, unsigned int major,
                                               unsigned int minor)
    : stream_(stream)
{
    if (!reserve(initialCapacity))
        throw std::bad_alloc();
    held_ = headSize;
    // "%d.%d" of the two numbers, and the terminator.
    char header[sizeof magic + 2 * kvNumberTextSize];
    std::memcpy(header, magic, sizeof magic - 1);
    char* end = header + sizeof magic - 1;
    *end++ = ' ';
    end = kvFormat(end, static_cast<int>(major));
    *end++ = '.';
    end = kvFormat(end, static_cast<int>(minor));
    *end++ = '\0';
    stream_.write(header, static_cast<unsigned long long>(end - header));
}

KVBinaryXMLWriteStream::~KVBinaryXMLWriteStream() = default;

// --- The element that is held ---

/// Room for that many bytes behind what is held; false when there is no memory.
bool KVBinaryXMLWriteStream::reserve(std::size_t size) noexcept
{
    if (capacity_ - held_ >= size)
        return true;
    std::size_t const capacity = held_ + size + capacity_ / 2;
    std::unique_ptr<unsigned char[]> grown(new (std::nothrow) unsigned char[capacity]);
    if (!grown)
        return false;
    if (buffer_)
        std::memcpy(grown.get(), buffer_.get(), held_);
    buffer_ = std::move(grown);
    capacity_ = capacity;
    return true;
}

/// Where the next value of a fixed size, and an attribute's token in front of it, may be put.
unsigned char* KVBinaryXMLWriteStream::roomForValue()
{
    if (!reserve(encodedSize))
        throw std::bad_alloc();
    return buffer_.get() + held_;
}

/// A value or a child follows: the number of attributes is final.
void KVBinaryXMLWriteStream::endAttributes() noexcept
{
    // What is there without having been counted is an empty string. Alone, it has always been left
    // out.
    if (!attributesEnded_ && attributeCount_ == 0)
        held_ = headSize;
    attributesEnded_ = true;
}

/// Sends what is held of the element, with its size if that is known. Returns where its size
/// stands.
unsigned long long KVBinaryXMLWriteStream::send(bool whole)
{
    endAttributes();
    unsigned char head[headSize + 8];
    unsigned char* end = head;
    if (elements_.size() > 1)
        *end++ = childTag;
    end = putVarInt(end, elements_.back().token);
    unsigned char* const size = end;
    end = putVarInt(end + sizeFieldLength, attributeCount_);
    auto const headLength = static_cast<std::size_t>(end - head);
    auto const sizeOffset = static_cast<std::size_t>(size - head);
    std::size_t const inside = headLength - sizeOffset - sizeFieldLength + held_ - headSize;
    unsigned char sizeBytes[8];
    storeLittleEndian(sizeBytes, whole ? inside : 0, sizeFieldLength);
    std::memcpy(size, sizeBytes, sizeFieldLength);

    unsigned char* const start = buffer_.get() + headSize - headLength;
    std::memcpy(start, head, headLength);
    unsigned long long const position = whole ? 0 : stream_.getPos() + sizeOffset;
    stream_.write(start, headLength + held_ - headSize);
    held_ = headSize;
    sent_ = true;
    return position;
}

void KVBinaryXMLWriteStream::flushAttributes()
{
    if (!sent_)
        elements_.back().sizePosition = send(false);
}

// --- Elements ---

void KVBinaryXMLWriteStream::startElement(unsigned int token)
{
    KVScope* const scope = topScope();
    flushAttributes();
    if (!scope)
        throwScopeUndefined();
    KVScope const* const row = findElement(scope, token);
    if (!row)
        throwTokenUndefined(scope);
    elements_.push_back({row->name, token, true, 0});
    held_ = headSize;
    attributeCount_ = 0;
    attributesEnded_ = false;
    sent_ = false;
}

void KVBinaryXMLWriteStream::endElement()
{
    if (elements_.empty())
        throwNothingToEnd();
    if (sent_)
        writeSize(elements_.back());
    else
        send(true);
    elements_.pop_back();
}

void KVBinaryXMLWriteStream::writeSize(KVBinaryXMLElementInfo const& element)
{
    unsigned long long const end = stream_.getPos();
    unsigned long long const size = end - element.sizePosition - sizeFieldLength;
    if (size > 0xFFFFFFFFu && !cutSizeLogged_) {
        cutSizeLogged_ = true;
        _KVLogMessage(__FILE__, __LINE__,
                      "The element %s has %llu bytes; its size is cut to 32 bits.", element.name,
                      size);
    }
    unsigned char bytes[8];
    storeLittleEndian(bytes, size, sizeFieldLength);
    stream_.setPos(element.sizePosition);
    stream_.write(bytes, sizeFieldLength);
    stream_.setPos(end);
}

void KVBinaryXMLWriteStream::close() {}

unsigned int KVBinaryXMLWriteStream::openElementToken() const
{
    if (elements_.empty())
        throw KVException_NoElementDefined();
    return elements_.back().token;
}

// --- Values ---

template <class T>
void KVBinaryXMLWriteStream::writeTagged(T const& value)
{
    static_cast<void>(openElementToken());
    if (sent_)
        return write(stream_, value);
    endAttributes();
    held_ = static_cast<std::size_t>(put(roomForValue(), value) - buffer_.get());
    if (held_ > heldSize)
        flushAttributes();
}

/// The open element has an attribute of that token in the top scope, or this throws. An attribute
/// is mostly the one in the row behind the last one's.
void KVBinaryXMLWriteStream::useAttribute(unsigned int token)
{
    unsigned int const element = openElementToken();
    KVScope* const scope = topScope();
    if (scope && scope == expectedScope_ && expectedRow_->name &&
        expectedRow_->elementToken == element && expectedRow_->attributeToken == token &&
        token != 0) {
        ++expectedRow_;
        return;
    }
    expectedRow_ = findAttribute(element, token) + 1;
    expectedScope_ = scope;
}

template <class T>
void KVBinaryXMLWriteStream::writeTaggedAttribute(unsigned int token, T const& value)
{
    useAttribute(token);
    if (attributesEnded_)
        return;
    unsigned char* const end = put(putVarInt(roomForValue(), token), value);
    held_ = static_cast<std::size_t>(end - buffer_.get());
    ++attributeCount_;
}

void KVBinaryXMLWriteStream::writeValue(int value)
{
    writeTagged(value);
}

void KVBinaryXMLWriteStream::writeValue(unsigned int value)
{
    writeTagged(value);
}

void KVBinaryXMLWriteStream::writeValue(long long value)
{
    writeTagged(value);
}

void KVBinaryXMLWriteStream::writeValue(unsigned long long value)
{
    writeTagged(value);
}

void KVBinaryXMLWriteStream::writeValue(float value)
{
    writeTagged(value);
}

void KVBinaryXMLWriteStream::writeValue(double value)
{
    writeTagged(value);
}

void KVBinaryXMLWriteStream::writeValue(KVUUID const& value)
{
    writeTagged(value);
}

void KVBinaryXMLWriteStream::writeValue(CMTime const& value)
{
    writeTagged(value);
}

void KVBinaryXMLWriteStream::writeValue(KVString const& value)
{
    static_cast<void>(openElementToken());
    std::size_t const size = stringSize(value);
    std::unique_ptr<unsigned char[]> allocated;
    unsigned char* text;
    if (size <= heldSize && reserve(size)) {
        endAttributes();
        text = buffer_.get() + held_;
    } else {
        flushAttributes();
        allocated.reset(new (std::nothrow) unsigned char[size]);
        text = allocated.get();
    }
    if (!text) {
        unsigned char const tag = stringTag;
        stream_.write(&tag, 1);
        return;
    }
    auto const length = static_cast<std::size_t>(put(text, value) - text);
    if (sent_) {
        stream_.write(text, length);
        return;
    }
    held_ += length;
    if (held_ > heldSize)
        flushAttributes();
}

// --- Attributes ---

void KVBinaryXMLWriteStream::writeAttribute(unsigned int token, unsigned int value)
{
    writeTaggedAttribute(token, value);
}

void KVBinaryXMLWriteStream::writeAttribute(unsigned int token, int value)
{
    writeTaggedAttribute(token, value);
}

void KVBinaryXMLWriteStream::writeAttribute(unsigned int token, unsigned long long value)
{
    writeTaggedAttribute(token, value);
}

void KVBinaryXMLWriteStream::writeAttribute(unsigned int token, long long value)
{
    writeTaggedAttribute(token, value);
}

void KVBinaryXMLWriteStream::writeAttribute(unsigned int token, float value)
{
    writeTaggedAttribute(token, value);
}

void KVBinaryXMLWriteStream::writeAttribute(unsigned int token, double value)
{
    writeTaggedAttribute(token, value);
}

void KVBinaryXMLWriteStream::writeAttribute(unsigned int token, KVUUID const& value)
{
    writeTaggedAttribute(token, value);
}

void KVBinaryXMLWriteStream::writeAttribute(unsigned int token, CMTime const& value)
{
    writeTaggedAttribute(token, value);
}

void KVBinaryXMLWriteStream::writeAttribute(unsigned int token, KVString const& value)
{
    useAttribute(token);
    if (attributesEnded_)
        return;
    bool const fits = reserve(encodedSize + stringSize(value));
    unsigned char* end = putVarInt(roomForValue(), token);
    if (fits)
        end = put(end, value);
    else
        *end++ = stringTag;
    held_ = static_cast<std::size_t>(end - buffer_.get());
    // An empty one is not counted: so it has always been written.
    if (!value.empty())
        ++attributeCount_;
}

void KVBinaryXMLWriteStream::writeOptionalAttribute(unsigned int, KVString const&) {}
void KVBinaryXMLWriteStream::writeArray(unsigned int*, unsigned int) {}
void KVBinaryXMLWriteStream::writeArray(float*, unsigned int) {}
void KVBinaryXMLWriteStream::writeArray(double*, unsigned int) {}
void KVBinaryXMLWriteStream::writeBlankLine() {}

KVURL const& KVBinaryXMLWriteStream::getURL() const noexcept
{
    auto const* const file = dynamic_cast<KVFileWriteStream const*>(&stream_);
    return file ? file->getURL() : url_;
}

// --- Encoders ---

void KVBinaryXMLWriteStream::writeVarInt(KVStream& stream, unsigned int value)
{
    unsigned char bytes[encodedSize];
    unsigned char const* const end = putVarInt(bytes, value);
    stream.write(bytes, static_cast<unsigned long long>(end - bytes));
}

void KVBinaryXMLWriteStream::writeInt(KVStream& stream, int value)
{
    write(stream, value);
}

void KVBinaryXMLWriteStream::writeInt(KVStream& stream, unsigned int value)
{
    write(stream, value);
}

void KVBinaryXMLWriteStream::writeInt(KVStream& stream, long long value)
{
    write(stream, value);
}

void KVBinaryXMLWriteStream::writeInt(KVStream& stream, unsigned long long value)
{
    write(stream, value);
}

void KVBinaryXMLWriteStream::writeInt(KVStream& stream, long value)
{
    write(stream, static_cast<long long>(value));
}

void KVBinaryXMLWriteStream::writeInt(KVStream& stream, unsigned long value)
{
    write(stream, static_cast<unsigned long long>(value));
}

void KVBinaryXMLWriteStream::writeInt(KVStream& stream, unsigned long long value, bool negative)
{
    unsigned char bytes[encodedSize];
    unsigned char const* const end = putInteger(bytes, value, negative);
    stream.write(bytes, static_cast<unsigned long long>(end - bytes));
}

void KVBinaryXMLWriteStream::writeVexTime(KVStream& stream, CMTime const& value)
{
    write(stream, value);
}
