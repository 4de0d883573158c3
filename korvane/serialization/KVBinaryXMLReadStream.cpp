#include <korvane/serialization/KVBinaryXMLReadStream.h>

#include <korvane/serialization/KVBinaryInput_p.h>
#include <korvane/serialization/KVBinaryXMLFormat_p.h>
#include <korvane/serialization/KVBinaryXMLStreamElement.h>
#include <korvane/serialization/KVFileReadStream.h>
#include <korvane/serialization/KVNumberText_p.h>

#include <algorithm>
#include <bit>
#include <string>
#include <type_traits>
#include <typeinfo>

using namespace kv::binary;

namespace {

/// Gives bytes as KVBinaryInput does, but reads no byte ahead.
class PlainInput {
public:
    explicit PlainInput(KVStream& stream) noexcept : stream_(stream) {}

    unsigned char const* take(std::size_t count)
    {
        return stream_.read(bytes_, count) == static_cast<long long>(count) ? bytes_ : nullptr;
    }

private:
    KVStream& stream_;
    unsigned char bytes_[32];
};

// --- The decoders, over either input ---

template <class Input>
bool takeVarInt(Input& input, unsigned int* value)
{
    std::uint64_t result = 0;
    for (int shift = 0; shift < 35; shift += 7) {
        unsigned char const* const byte = input.take(1);
        if (!byte)
            return false;
        result |= static_cast<std::uint64_t>(*byte & 0x7F) << shift;
        if (*byte < 0x80) {
            *value = static_cast<unsigned int>(result);
            return true;
        }
    }
    return false;
}

template <class T, class Input>
bool takeInt(Input& input, unsigned int tag, T* value)
{
    bool const negative = tag & negativeBit;
    if (tag == zeroTag || tag == oneTag || (tag & ~negativeBit) < firstIntegerTag) {
        *value = tag == oneTag;
        return true;
    }
    if (!isIntegerTag(tag))
        return false;
    unsigned int const length = integerLength(tag);
    unsigned char const* const bytes = input.take(length);
    if (!bytes)
        return false;
    std::uint64_t const magnitude = loadLittleEndian(bytes, length);
    *value = static_cast<T>(negative ? 0 - magnitude : magnitude);
    return true;
}

template <class Input>
bool takeTime(Input& input, CMTime* value)
{
    unsigned char const* bytes = input.take(1);
    if (!bytes)
        return false;
    TimeSizes const sizes = TimeSizes::of(*bytes);
    bytes = input.take(sizes.sum());
    if (!bytes)
        return false;
    auto const next = [&bytes](unsigned int length) {
        std::uint64_t const field = loadLittleEndian(bytes, length);
        bytes += length;
        return field;
    };
    value->value = static_cast<CMTimeValue>(next(sizes.value));
    value->timescale = static_cast<CMTimeScale>(next(sizes.timescale));
    value->flags = static_cast<std::uint32_t>(next(sizes.flags));
    value->epoch = static_cast<CMTimeEpoch>(next(sizes.epoch));
    return true;
}

KVBinaryXMLStreamElement* asBinary(KVStreamElement* element) noexcept
{
    return element && typeid(*element) == typeid(KVBinaryXMLStreamElement)
               ? static_cast<KVBinaryXMLStreamElement*>(element)
               : nullptr;
}

} // namespace

KVBinaryXMLReadStream::KVBinaryXMLReadStream(KVStream& stream)
    : stream_(stream), input_(std::make_unique<KVBinaryInput>(stream))
{}

KVBinaryXMLReadStream::~KVBinaryXMLReadStream() = default;

// --- Documents ---

bool KVBinaryXMLReadStream::parse()
{
    input_->attach();
    reading_ = true;
    bool whole = readHeader();
    if (whole) {
        int result;
        do
            result = readElement();
        while (result == 1 && !aborted_ && !stopped_);
        whole = result != -1 && !aborted_;
    }
    reading_ = false;
    input_->detach();
    return whole;
}

bool KVBinaryXMLReadStream::readHeader()
{
    char header[headerLimit + 1] = {};
    for (std::size_t length = 0; length < headerLimit; ++length) {
        unsigned char const* const byte = input_->take(1);
        if (!byte || *byte == 0)
            break;
        header[length] = static_cast<char>(*byte);
    }
    std::size_t const magicLength = sizeof magic - 1;
    if (std::string_view(header, magicLength) != magic)
        return false;
    // "%d.%d", as far as the text goes.
    char const* cursor = header + magicLength;
    unsigned int version[2] = {0, 0};
    for (unsigned int& number : version) {
        char const* const start = cursor;
        long long value;
        if (!kvParseInt(cursor, value) || cursor == start)
            break;
        number = static_cast<unsigned int>(value);
        if (*cursor != '.')
            break;
        ++cursor;
    }
    setVersion(version[0], version[1]);
    return true;
}

int KVBinaryXMLReadStream::parseElement()
{
    if (reading_) // called by a handler
        return readElement();
    input_->attach();
    reading_ = true;
    int const result = readElement();
    reading_ = false;
    input_->detach();
    return result;
}

void KVBinaryXMLReadStream::abortParse()
{
    aborted_ = true;
}

void KVBinaryXMLReadStream::stopParse()
{
    stopped_ = true;
}

void KVBinaryXMLReadStream::ignoreElement()
{
    KVStreamElement* const element = currentElement();
    if (!element)
        return;
    // Forward only: a size that ends before what has been read must not let it be read again.
    input_->skipTo(element->endPosition);
    element->ignored = true;
}

KVURL const& KVBinaryXMLReadStream::getURL() const noexcept
{
    auto const* const file = dynamic_cast<KVFileReadStream const*>(&stream_);
    return file ? file->getURL() : url_;
}

// --- Elements ---

int KVBinaryXMLReadStream::readElement()
{
    // Nesting is followed by a count and the stack of elements, so that depth takes no machine
    // stack.
    for (std::size_t open = 0;;) {
        switch (startElement()) {
        case Start::opened:
            ++open;
            break;
        case Start::passed:
            break;
        case Start::ended:
            return 0;
        case Start::failed:
            return -1;
        }
        Body body = Body::end;
        while (open > 0 && (body = readBody()) == Body::end) {
            endElement();
            --open;
        }
        if (open == 0)
            return 1;
        if (body == Body::failed)
            return -1;
    }
}

KVBinaryXMLReadStream::Start KVBinaryXMLReadStream::startElement()
{
    if (aborted_)
        return Start::failed;
    if (stopped_)
        return Start::ended;
    if (KVBinaryXMLStreamElement* const parent = asBinary(currentElement());
        parent && !parent->processed) {
        processElement(*parent);
        if (parent->ignored)
            return Start::passed;
    }
    unsigned int token;
    if (!takeVarInt(*input_, &token))
        return Start::ended;
    unsigned char const* const size = input_->take(sizeFieldLength);
    if (!size)
        return Start::failed;
    unsigned long long const end = input_->position() + loadLittleEndian(size, sizeFieldLength);

    KVScope* row;
    KVScope* scope;
    KVSerializer* handler;
    if (!getElementInfo(token, &row, &scope, &handler)) {
        input_->skipTo(end);
        return Start::passed;
    }
    auto* const element = new KVBinaryXMLStreamElement(row->elementToken, scope, handler);
    pushElement(element);
    element->endPosition = end;

    unsigned int count;
    if (!takeVarInt(*input_, &count))
        return Start::failed;
    element->expectAttributes(count);
    for (; count > 0; --count) {
        unsigned int attribute;
        if (!takeVarInt(*input_, &attribute))
            return Start::failed;
        unsigned char const* const tag = input_->take(1);
        if (!tag ||
            !readValue(*tag, [&](auto const& value) { element->addAttribute(attribute, value); }))
            return Start::failed;
    }
    return Start::opened;
}

/// Reads values up to the next child of the current element, or to its end.
KVBinaryXMLReadStream::Body KVBinaryXMLReadStream::readBody()
{
    KVBinaryXMLStreamElement* const element = asBinary(currentElement());
    if (!element) // a handler has taken it off
        return Body::failed;
    while (input_->position() < element->endPosition) {
        unsigned char const* const tag = input_->take(1);
        if (!tag)
            return Body::failed;
        if (*tag == childTag)
            return Body::child;
        if (!readValue(*tag, [element](auto const& value) { element->setContent(value); }))
            return Body::failed;
    }
    return Body::end;
}

void KVBinaryXMLReadStream::endElement()
{
    KVStreamElement* const element = currentElement();
    if (!element->processed)
        processElement(*element);
    if (element == currentHandlerElement())
        popHandler();
    popElement();
}

/// Gives the value behind a tag to `sink`, in the type it is kept in; nothing for a tag without a
/// payload that is known. False when the bytes end too early.
template <class Sink>
bool KVBinaryXMLReadStream::readValue(unsigned int tag, Sink sink)
{
    auto const integer = [&]<class T>(T value) {
        if (!takeInt(*input_, tag, &value))
            return false;
        sink(static_cast<std::conditional_t<std::is_signed_v<T>, long long, unsigned long long>>(
            value));
        return true;
    };
    if (tag == zeroTag || tag == oneTag || (isIntegerTag(tag) && !(tag & negativeBit)))
        return integer(0ULL);
    if (isIntegerTag(tag)) // a negative one of up to four bytes is cut to an int
        return integerLength(tag) <= 4 ? integer(0) : integer(0LL);

    switch (tag) {
    case floatTag: {
        unsigned char const* const bytes = input_->take(4);
        if (bytes)
            sink(std::bit_cast<float>(static_cast<std::uint32_t>(loadLittleEndian(bytes, 4))));
        return bytes;
    }
    case doubleTag: {
        unsigned char const* const bytes = input_->take(8);
        if (bytes)
            sink(std::bit_cast<double>(loadLittleEndian(bytes, 8)));
        return bytes;
    }
    case uuidTag: {
        KVUUID uuid;
        unsigned char const* bytes = input_->take(sizeof uuid.words);
        if (!bytes)
            return false;
        for (std::uint32_t& word : uuid.words) {
            word = static_cast<std::uint32_t>(loadLittleEndian(bytes, sizeof word));
            bytes += sizeof word;
        }
        sink(uuid);
        return true;
    }
    case stringTag: {
        KVString text;
        if (!readString(&text))
            return false;
        sink(text);
        return true;
    }
    case timeTag: {
        CMTime time;
        if (!takeTime(*input_, &time))
            return false;
        sink(time);
        return true;
    }
    default:
        return true;
    }
}

bool KVBinaryXMLReadStream::readString(KVString* value)
{
    unsigned int length;
    if (!takeVarInt(*input_, &length))
        return false;
    std::string gathered;
    std::string_view text;
    if (length <= KVBinaryInput::windowSize) {
        auto const* const bytes = reinterpret_cast<char const*>(input_->take(length));
        if (!bytes)
            return false;
        text = {bytes, length};
    } else {
        // By the window, so that a length that lies costs no memory.
        for (std::size_t left = length; left > 0;) {
            std::size_t const piece = std::min(left, KVBinaryInput::windowSize);
            auto const* const bytes = reinterpret_cast<char const*>(input_->take(piece));
            if (!bytes)
                return false;
            gathered.append(bytes, piece);
            left -= piece;
        }
        text = gathered;
    }
    // A text ends at its first zero, if it has one.
    *value = KVString::fromUTF8(text.substr(0, text.find('\0')));
    return true;
}

// --- Decoders over any stream ---

bool KVBinaryXMLReadStream::readVarInt(KVStream& stream, unsigned int* value)
{
    PlainInput input(stream);
    return takeVarInt(input, value);
}

bool KVBinaryXMLReadStream::readInt(KVStream& stream, int tag, int* value)
{
    PlainInput input(stream);
    return takeInt(input, static_cast<unsigned int>(tag), value);
}

bool KVBinaryXMLReadStream::readInt(KVStream& stream, int tag, unsigned int* value)
{
    PlainInput input(stream);
    return takeInt(input, static_cast<unsigned int>(tag), value);
}

bool KVBinaryXMLReadStream::readInt(KVStream& stream, int tag, long long* value)
{
    PlainInput input(stream);
    return takeInt(input, static_cast<unsigned int>(tag), value);
}

bool KVBinaryXMLReadStream::readInt(KVStream& stream, int tag, long* value)
{
    PlainInput input(stream);
    return takeInt(input, static_cast<unsigned int>(tag), value);
}

bool KVBinaryXMLReadStream::readInt(KVStream& stream, int tag, unsigned long long* value)
{
    PlainInput input(stream);
    return takeInt(input, static_cast<unsigned int>(tag), value);
}

bool KVBinaryXMLReadStream::readInt(KVStream& stream, int tag, unsigned long* value)
{
    PlainInput input(stream);
    return takeInt(input, static_cast<unsigned int>(tag), value);
}

bool KVBinaryXMLReadStream::readVextime(KVStream& stream, CMTime* value)
{
    PlainInput input(stream);
    return takeTime(input, value);
}
