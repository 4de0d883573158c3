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
#include <optional>

using namespace kv::binary;

namespace {

/// Room for the encoded form of any value but a string, with an attribute's token in front of it.
constexpr std::size_t encodedSize = 64;

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

/// Writes the attribute's token, if there is one, and the tag, length and UTF-8 form of the text,
/// all in one piece. Without memory for it the length and the text are left out.
void writeString(KVStream& stream, std::optional<unsigned int> attribute, KVString const& text)
{
    unsigned char head[encodedSize];
    unsigned char* headEnd = attribute ? putVarInt(head, *attribute) : head;
    *headEnd++ = stringTag;

    constexpr std::size_t headRoom = 16;
    unsigned char local[1024];
    std::unique_ptr<unsigned char[]> allocated;
    unsigned char* bytes = local;
    std::size_t const needed = headRoom + CFStringGetMaximumUTF8Length(text.size());
    if (needed > sizeof local) {
        allocated.reset(new (std::nothrow) unsigned char[needed]);
        bytes = allocated.get();
    }
    if (!bytes) {
        stream.write(head, static_cast<unsigned long long>(headEnd - head));
        return;
    }
    std::size_t const length =
        CFStringEncodeUTF8(text.view(), reinterpret_cast<char*>(bytes + headRoom));
    headEnd = putVarInt(headEnd, static_cast<std::uint32_t>(length));
    auto const headLength = static_cast<std::size_t>(headEnd - head);
    unsigned char* const start = bytes + headRoom - headLength;
    std::memcpy(start, head, headLength);
    stream.write(start, headLength + length);
}

} // namespace

KVBinaryXMLWriteStream::KVBinaryXMLWriteStream(KVStream& stream, unsigned int major,
                                               unsigned int minor)
    : stream_(stream), attributeBuffer_(4096, 1024)
{
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

// --- Elements ---

void KVBinaryXMLWriteStream::startElement(unsigned int token)
{
    KVScope* const scope = topScope();
    bool const nested = !elements_.empty();
    if (nested)
        flushAttributes();
    if (!scope)
        throwScopeUndefined();
    KVScope const* const row = findElement(scope, token);
    if (!row)
        throwTokenUndefined(scope);
    attributeBuffer_.reset();
    attributeCount_ = 0;
    attributesFlushed_ = false;

    unsigned char bytes[encodedSize];
    unsigned char* end = bytes;
    if (nested)
        *end++ = childTag;
    end = putVarInt(end, token);
    auto const sizeOffset = static_cast<unsigned long long>(end - bytes);
    end = storeLittleEndian(end, 0, sizeFieldLength);
    unsigned long long const sizePosition = stream_.getPos() + sizeOffset;
    stream_.write(bytes, sizeOffset + sizeFieldLength);
    elements_.push_back({row->name, token, true, sizePosition});
}

void KVBinaryXMLWriteStream::endElement()
{
    if (elements_.empty())
        throwNothingToEnd();
    flushAttributes();
    unsigned long long const sizePosition = elements_.back().sizePosition;
    unsigned long long const end = stream_.getPos();
    unsigned long long const size = end - sizePosition - sizeFieldLength;
    if (size > 0xFFFFFFFFu && !cutSizeLogged_) {
        cutSizeLogged_ = true;
        _KVLogMessage(__FILE__, __LINE__,
                      "The element %s has %llu bytes; its size is cut to 32 bits.",
                      elements_.back().name, size);
    }
    unsigned char bytes[sizeFieldLength];
    storeLittleEndian(bytes, size, sizeFieldLength);
    stream_.setPos(sizePosition);
    stream_.write(bytes, sizeFieldLength);
    stream_.setPos(end);
    elements_.pop_back();
}

void KVBinaryXMLWriteStream::close() {}

void KVBinaryXMLWriteStream::flushAttributes()
{
    if (attributesFlushed_)
        return;
    writeVarInt(stream_, attributeCount_);
    if (attributeCount_ != 0)
        stream_.write(attributeBuffer_.getBuffer(), attributeBuffer_.getBufferSize());
    attributeBuffer_.reset();
    attributeCount_ = 0;
    attributesFlushed_ = true;
}

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
    flushAttributes();
    write(stream_, value);
}

template <class T>
void KVBinaryXMLWriteStream::writeTaggedAttribute(unsigned int token, T const& value)
{
    KVScope const* const row = findAttribute(openElementToken(), token);
    unsigned char bytes[encodedSize];
    unsigned char const* const end = put(putVarInt(bytes, row->attributeToken), value);
    attributeBuffer_.write(bytes, static_cast<unsigned long long>(end - bytes));
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
    flushAttributes();
    writeString(stream_, std::nullopt, value);
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
    KVScope const* const row = findAttribute(openElementToken(), token);
    writeString(attributeBuffer_, row->attributeToken, value);
    // An empty one is in the buffer and is not counted: so it has always been written.
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
