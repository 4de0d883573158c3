#include <korvane/serialization/KVXMLWriteStream.h>

#include <korvane/foundation/KVException.h>
#include <korvane/foundation/KVPrint.h>
#include <korvane/serialization/KVFileWriteStream.h>
#include <korvane/serialization/KVNumberText_p.h>
#include <korvane/serialization/KVXMLLocale_p.h>

#include <clocale>
#include <cstring>
#include <new>

namespace {

constexpr std::size_t scratchSize = 1024;

template <std::size_t Size>
char* put(char* out, char const (&text)[Size]) noexcept
{
    return static_cast<char*>(std::memcpy(out, text, Size - 1)) + Size - 1;
}

char* put(char* out, char const* text, std::size_t length) noexcept
{
    return static_cast<char*>(std::memcpy(out, text, length)) + length;
}

char* putTabs(char* out, std::size_t count) noexcept
{
    return static_cast<char*>(std::memset(out, '\t', count)) + count;
}

/// What stands for a character in the text; null for one that stands for itself.
constexpr char const* entityOf(char16_t unit) noexcept
{
    switch (unit) {
    case u'&':
        return "&amp;";
    case u'<':
        return "&lt;";
    case u'>':
        return "&gt;";
    case u'"':
        return "&quot;";
    default:
        return nullptr;
    }
}

/// The most bytes that an escaped UTF-16 unit takes: "&quot;".
constexpr std::size_t mostBytesOfUnit = 6;

/// Up to the first U+0000.
std::u16string_view writtenPart(KVString const& text) noexcept
{
    std::u16string_view const units = text.view();
    return units.substr(0, units.find(u'\0'));
}

/// Writes the text as UTF-8 with its entities. One pass gives what replacing one special character
/// after the other gives, "&" first: the later replacements meet no other "&".
char* putEscaped(char* out, std::u16string_view units) noexcept
{
    while (!units.empty()) {
        std::size_t plain = 0;
        while (plain < units.size() && units[plain] < 0x80 && !entityOf(units[plain]))
            *out++ = static_cast<char>(units[plain++]);
        units.remove_prefix(plain);
        if (units.empty())
            break;
        if (char const* const entity = entityOf(units.front())) {
            out = put(out, entity, std::strlen(entity));
            units.remove_prefix(1);
        } else {
            std::size_t other = 1;
            while (other < units.size() && units[other] >= 0x80)
                ++other;
            out += CFStringEncodeUTF8(units.substr(0, other), out);
            units.remove_prefix(other);
        }
    }
    return out;
}

} // namespace

void kvFixLocale()
{
    char const* const current = std::setlocale(LC_NUMERIC, nullptr);
    if (!current || std::strcmp(current, "C") != 0)
        std::setlocale(LC_NUMERIC, "C");
}

KVXMLWriteStream::KVXMLWriteStream(KVStream& stream, unsigned int major, unsigned int minor)
    : stream_(stream), scratch_(scratchSize)
{
    kvFixLocale();
    char* out = put(scratch_.data(), "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
                                     "<!DOCTYPE vzxmlscene>\n"
                                     "<vzml version=\"");
    out = kvFormat(out, static_cast<int>(major));
    *out++ = '.';
    out = kvFormat(out, static_cast<int>(minor));
    send(put(out, "\">\n\n"));
}

KVXMLWriteStream::~KVXMLWriteStream() = default;

/// The scratch buffer with room for that many bytes. What is in it may be lost.
char* KVXMLWriteStream::room(std::size_t size)
{
    if (size > scratch_.size())
        scratch_.resize(size);
    return scratch_.data();
}

void KVXMLWriteStream::send(char const* end)
{
    if (end != scratch_.data())
        stream_.write(scratch_.data(), static_cast<std::size_t>(end - scratch_.data()));
}

// --- Elements ---

void KVXMLWriteStream::startElement(unsigned int token)
{
    // The end of the parent's start tag is settled before anything is checked: without a scope it
    // is lost, without a row it goes out.
    bool endsParentsTag = false;
    if (!elements_.empty() && !elements_.back().startTagClosed) {
        KVXMLElementInfo& parent = elements_.back();
        parent.isEmpty = false;
        parent.startTagClosed = true;
        parent.hasChildLines = true;
        endsParentsTag = true;
    }
    KVScope* const scope = topScope();
    if (!scope)
        throwScopeUndefined();
    KVScope const* const row = findElement(scope, token);
    std::size_t const length = row ? std::strlen(row->name) : 0;
    char* out = room(depth_ + length + 8);
    if (endsParentsTag)
        out = put(out, ">\n");
    if (!row) {
        send(out);
        throwTokenUndefined(scope);
    }
    out = putTabs(out, depth_);
    *out++ = '<';
    send(put(out, row->name, length));
    elements_.push_back({row->name, token});
    ++depth_;
}

void KVXMLWriteStream::endElement()
{
    if (elements_.empty())
        throwNothingToEnd();
    --depth_;
    KVXMLElementInfo const& element = elements_.back();
    if (element.isEmpty) {
        send(put(scratch_.data(), "/>\n"));
    } else {
        std::size_t const length = std::strlen(element.name);
        char* out = room(depth_ + length + 8);
        if (element.hasChildLines)
            out = putTabs(out, depth_);
        out = put(out, "</");
        out = put(out, element.name, length);
        send(put(out, ">\n"));
    }
    elements_.pop_back();
}

void KVXMLWriteStream::close()
{
    send(put(scratch_.data(), "\n</vzml>\n"));
}

char* KVXMLWriteStream::terminateStartTag()
{
    if (elements_.empty())
        throwNothingToEnd();
    return closeStartTag(elements_.back(), scratch_.data());
}

char* KVXMLWriteStream::closeStartTag(KVXMLElementInfo& element, char* out) noexcept
{
    if (!element.startTagClosed) {
        element.isEmpty = false;
        element.startTagClosed = true;
        *out++ = '>';
    }
    return out;
}

// --- Values ---

template <class T>
void KVXMLWriteStream::writeNumber(T const& value)
{
    send(kvFormat(terminateStartTag(), value));
}

void KVXMLWriteStream::writeValue(int value)
{
    writeNumber(value);
}

void KVXMLWriteStream::writeValue(unsigned int value)
{
    writeNumber(value);
}

void KVXMLWriteStream::writeValue(long long value)
{
    writeNumber(value);
}

void KVXMLWriteStream::writeValue(unsigned long long value)
{
    writeNumber(value);
}

void KVXMLWriteStream::writeValue(float value)
{
    writeNumber(value);
}

void KVXMLWriteStream::writeValue(double value)
{
    writeNumber(value);
}

void KVXMLWriteStream::writeValue(KVUUID const& value)
{
    writeNumber(value);
}

void KVXMLWriteStream::writeValue(CMTime const& value)
{
    writeNumber(value);
}

void KVXMLWriteStream::writeValue(KVString const& value)
{
    if (elements_.empty()) {
        KVPrint("value not within an element body!\n");
        throw KVException_NoElementDefined();
    }
    std::u16string_view const units = writtenPart(value);
    try {
        room(mostBytesOfUnit * units.size() + 8);
    } catch (std::exception const&) {
        return; // no memory: the value is left out
    }
    send(putEscaped(closeStartTag(elements_.back(), scratch_.data()), units));
}

void KVXMLWriteStream::writeArray(unsigned int*, unsigned int) {}

void KVXMLWriteStream::writeArray(float*, unsigned int) {}

void KVXMLWriteStream::writeArray(double*, unsigned int) {}

// --- Attributes ---

KVScope* KVXMLWriteStream::getAttributeInfo(unsigned int token) const
{
    if (elements_.empty())
        throw KVException_NoElementDefined();
    return findAttribute(elements_.back().token, token);
}

/// Puts ` name="` in the scratch buffer.
char* KVXMLWriteStream::startAttribute(char const* name, std::size_t roomForValue)
{
    std::size_t const length = std::strlen(name);
    char* out = room(length + roomForValue + 8);
    *out++ = ' ';
    out = put(out, name, length);
    return put(out, "=\"");
}

template <class T>
void KVXMLWriteStream::writeNumberAttribute(unsigned int token, T const& value)
{
    char* const out = startAttribute(getAttributeInfo(token)->name, kvNumberTextSize);
    send(put(kvFormat(out, value), "\""));
}

void KVXMLWriteStream::writeAttribute(unsigned int token, unsigned int value)
{
    writeNumberAttribute(token, value);
}

void KVXMLWriteStream::writeAttribute(unsigned int token, int value)
{
    writeNumberAttribute(token, value);
}

void KVXMLWriteStream::writeAttribute(unsigned int token, unsigned long long value)
{
    writeNumberAttribute(token, value);
}

void KVXMLWriteStream::writeAttribute(unsigned int token, long long value)
{
    writeNumberAttribute(token, value);
}

void KVXMLWriteStream::writeAttribute(unsigned int token, float value)
{
    writeNumberAttribute(token, value);
}

void KVXMLWriteStream::writeAttribute(unsigned int token, double value)
{
    writeNumberAttribute(token, value);
}

void KVXMLWriteStream::writeAttribute(unsigned int token, KVUUID const& value)
{
    writeNumberAttribute(token, value);
}

void KVXMLWriteStream::writeAttribute(unsigned int token, CMTime const& value)
{
    writeNumberAttribute(token, value);
}

void KVXMLWriteStream::writeAttribute(unsigned int token, KVString const& value)
{
    char const* const name = getAttributeInfo(token)->name;
    std::u16string_view const units = writtenPart(value);
    char* out;
    try {
        out = startAttribute(name, mostBytesOfUnit * units.size());
    } catch (std::exception const&) {
        return; // no memory: the attribute is left out
    }
    send(put(putEscaped(out, units), "\""));
}

void KVXMLWriteStream::writeOptionalAttribute(unsigned int token, KVString const& value)
{
    writeAttribute(token, value);
}

void KVXMLWriteStream::writeBlankLine()
{
    send(put(scratch_.data(), "\n"));
}

KVURL KVXMLWriteStream::getURL() const
{
    auto const* const file = dynamic_cast<KVFileWriteStream const*>(&stream_);
    return file ? file->getURL() : url_;
}
