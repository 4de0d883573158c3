#include <korvane/serialization/KVXMLStreamElement.h>

#include <korvane/serialization/KVNumberText_p.h>

#include <cstring>
#include <utility>

namespace {

// Each parses one number and answers false when it is out of range, with the output set all the
// same.
constexpr auto parseInt32 = [](char const*& cursor, int& value) {
    long long wide;
    bool const inRange = kvParseInt(cursor, wide);
    value = static_cast<int>(wide);
    return inRange;
};
constexpr auto parseUInt32 = [](char const*& cursor, unsigned int& value) {
    unsigned long long wide;
    bool const inRange = kvParseUInt(cursor, wide);
    value = static_cast<unsigned int>(wide);
    return inRange;
};
constexpr auto parseInt64 = [](char const*& cursor, long long& value) {
    return kvParseInt(cursor, value);
};
constexpr auto parseUInt64 = [](char const*& cursor, unsigned long long& value) {
    return kvParseUInt(cursor, value);
};
constexpr auto parseReal = [](char const*& cursor, auto& value) {
    return kvParseFloat(cursor, value);
};
constexpr auto parseBool = [](char const*& cursor, bool& value) {
    unsigned long long number;
    bool const inRange = kvParseUInt(cursor, number);
    value = number != 0;
    return inRange;
};

struct Entity {
    std::string_view name;
    char character;
};

constexpr Entity ampersand[] = {{"&amp;", '&'}};
constexpr Entity others[] = {{"&lt;", '<'}, {"&gt;", '>'}, {"&quot;", '"'}};

template <std::size_t Size>
void replaceEntities(std::string& text, Entity const (&entities)[Size])
{
    std::size_t kept = text.find('&');
    if (kept == std::string::npos)
        return;
    for (std::size_t at = kept; at < text.size(); ++kept) {
        char character = text[at];
        std::size_t length = 1;
        if (character == '&') {
            for (Entity const& entity : entities) {
                if (text.compare(at, entity.name.size(), entity.name) == 0) {
                    character = entity.character;
                    length = entity.name.size();
                    break;
                }
            }
        }
        text[kept] = character;
        at += length;
    }
    text.resize(kept);
}

} // namespace

KVXMLStreamElement::KVXMLStreamElement(unsigned int elementToken, KVScope* inScope,
                                       KVSerializer* elementHandler)
    : KVStreamElement(elementToken, inScope, elementHandler),
      ownStorage_(std::make_unique<Storage>()),
      storage_(*ownStorage_)
{}

KVXMLStreamElement::KVXMLStreamElement(unsigned int elementToken, KVScope* inScope,
                                       KVSerializer* elementHandler, Storage& storage) noexcept
    : KVStreamElement(elementToken, inScope, elementHandler), storage_(storage)
{
    storage_.content.clear();
    storage_.values.clear();
}

KVXMLStreamElement::~KVXMLStreamElement() = default;

bool KVXMLStreamElement::isXMLStreamElement()
{
    return true;
}

// --- Content ---

void KVXMLStreamElement::appendContentWithNewline(char* text, bool newline)
{
    if (!text)
        return;
    if (hasContent_ && newline)
        storage_.content += '\n';
    storage_.content += text;
    hasContent_ = true;
    cursor_ = 0;
}

char const* KVXMLStreamElement::cursor() const noexcept
{
    return hasContent_ ? storage_.content.c_str() + cursor_ : nullptr;
}

void KVXMLStreamElement::setCursor(char const* position) noexcept
{
    cursor_ = static_cast<std::size_t>(position - storage_.content.c_str());
}

template <class T, class Parse>
bool KVXMLStreamElement::readContent(T* value, Parse parse)
{
    char const* position = cursor();
    if (!position || *position == '\0' || !parse(position, *value))
        return false;
    while (kvIsSpace(*position))
        ++position;
    setCursor(position);
    return true;
}

bool KVXMLStreamElement::getAsString(KVString* value)
{
    if (stringValue_.empty() && hasContent_) {
        std::string_view const content = storage_.content;
        if (content.find('&') == std::string_view::npos) {
            stringValue_ = KVString::fromUTF8(content);
        } else {
            std::string text(content);
            replaceEntities(text, ampersand);
            replaceEntities(text, others);
            stringValue_ = KVString::fromUTF8(text);
        }
    }
    *value = stringValue_;
    return true;
}

bool KVXMLStreamElement::getAsInt32(int* value)
{
    return readContent(value, parseInt32);
}

bool KVXMLStreamElement::getAsUInt32(unsigned int* value)
{
    return readContent(value, parseUInt32);
}

bool KVXMLStreamElement::getAsInt64(long long* value)
{
    return readContent(value, parseInt64);
}

bool KVXMLStreamElement::getAsUInt64(unsigned long long* value)
{
    return readContent(value, parseUInt64);
}

bool KVXMLStreamElement::getAsFloat(float* value)
{
    return readContent(value, parseReal);
}

bool KVXMLStreamElement::getAsDouble(double* value)
{
    return readContent(value, parseReal);
}

bool KVXMLStreamElement::getAsBool(bool* value)
{
    return readContent(value, parseBool);
}

KVUUID* KVXMLStreamElement::getAsUUID()
{
    char const* position = cursor();
    KVUUID* const uuid = atoUUID(&position);
    if (uuid)
        setCursor(position);
    return uuid;
}

bool KVXMLStreamElement::getAsVexTime(CMTime* value)
{
    char const* position = cursor();
    if (!aToVexTime(&position, value))
        return false;
    setCursor(position);
    return true;
}

// --- Attributes ---

void KVXMLStreamElement::addAttribute(char const* name, char const* value)
{
    if (!scope)
        return;
    for (KVScope const* row = scope; row->name; ++row)
        if (row->elementToken == token && row->attributeToken != 0 &&
            std::strcmp(row->name, name) == 0)
            addAttribute(row->attributeToken, value);
}

void KVXMLStreamElement::addAttribute(unsigned int attribute, char const* value)
{
    std::size_t const start = storage_.values.size();
    storage_.values.append(value, std::strlen(value) + 1);
    if (attributeCount_ < std::size(attributes_)) {
        attributes_[attributeCount_++] = {attribute, start};
    } else {
        if (!moreAttributes_)
            moreAttributes_ = std::make_unique<std::map<unsigned int, std::size_t>>();
        (*moreAttributes_)[attribute] = start;
    }
}

char const* KVXMLStreamElement::getAttributeAsCString(unsigned int attribute) const noexcept
{
    for (unsigned int i = 0; i < attributeCount_; ++i)
        if (attributes_[i].token == attribute)
            return storage_.values.data() + attributes_[i].value;
    if (moreAttributes_)
        if (auto const found = moreAttributes_->find(attribute); found != moreAttributes_->end())
            return storage_.values.data() + found->second;
    return nullptr;
}

template <class T, class Parse>
bool KVXMLStreamElement::readAttribute(unsigned int attribute, T* value, Parse parse) const
{
    char const* position = getAttributeAsCString(attribute);
    return position && parse(position, *value);
}

bool KVXMLStreamElement::getAttributeAsString(unsigned int attribute, KVString* value) const
{
    char const* const text = getAttributeAsCString(attribute);
    if (text)
        *value = KVString(text);
    return text != nullptr;
}

bool KVXMLStreamElement::getAttributeAsInt32(unsigned int attribute, int* value) const
{
    return readAttribute(attribute, value, parseInt32);
}

bool KVXMLStreamElement::getAttributeAsUInt32(unsigned int attribute, unsigned int* value) const
{
    return readAttribute(attribute, value, parseUInt32);
}

bool KVXMLStreamElement::getAttributeAsInt64(unsigned int attribute, long long* value) const
{
    return readAttribute(attribute, value, parseInt64);
}

bool KVXMLStreamElement::getAttributeAsUInt64(unsigned int attribute,
                                              unsigned long long* value) const
{
    return readAttribute(attribute, value, parseUInt64);
}

bool KVXMLStreamElement::getAttributeAsFloat(unsigned int attribute, float* value) const
{
    return readAttribute(attribute, value, parseReal);
}

bool KVXMLStreamElement::getAttributeAsDouble(unsigned int attribute, double* value) const
{
    return readAttribute(attribute, value, parseReal);
}

bool KVXMLStreamElement::getAttributeAsBool(unsigned int attribute, bool* value) const
{
    return readAttribute(attribute, value, parseBool);
}

KVUUID* KVXMLStreamElement::getAttributeAsUUID(unsigned int attribute) const
{
    char const* position = getAttributeAsCString(attribute);
    return atoUUID(&position);
}

bool KVXMLStreamElement::getAttributeAsVexTime(unsigned int attribute, CMTime* value) const
{
    char const* position = getAttributeAsCString(attribute);
    return aToVexTime(&position, value);
}
