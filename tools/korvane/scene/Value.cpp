#include "Value.h"

#include "../Numbers.h"

#include <korvane/time/KVTime.h>

#include <algorithm>
#include <cctype>
#include <charconv>
#include <cmath>
#include <cstdlib>
#include <memory>

namespace scene {

namespace {

/// The value that `get` stores and says is good.
template <class T, class Get>
Value read(Get get)
{
    T value{};
    if (!get(&value))
        return {};
    // Whole numbers travel as integers in the compact form, which have no negative zero.
    if constexpr (std::is_floating_point_v<T>)
        return value == 0 ? T(0) : value;
    else
        return value;
}

Value adopt(KVUUID* uuid)
{
    std::unique_ptr<KVUUID> const owned(uuid);
    return owned ? Value(*owned) : Value();
}

/// The compact form gives a negative number of 33 bits, sign included, back as another one:
/// it travels as text, which reads and prints the same.
bool travelsAsText(long long value) noexcept
{
    return value < -0x7FFFFFFFLL && value >= -0xFFFFFFFFLL;
}

template <class Write>
void write(Value const& value, Write out)
{
    std::visit(
        [&](auto const& v) {
            using T = std::decay_t<decltype(v)>;
            if constexpr (std::is_same_v<T, int> || std::is_same_v<T, long long>) {
                if (travelsAsText(v))
                    out(KVString(std::to_string(v)));
                else
                    out(v);
            } else if constexpr (!std::is_same_v<T, std::monostate>) {
                out(v);
            }
        },
        value);
}

std::string textOf(KVUUID const& uuid)
{
    std::unique_ptr<char, decltype(&std::free)> const text(uuid.toCStr(), &std::free);
    return text ? text.get() : "";
}

/// In one line, with what would break the line or the terminal told by its number.
std::string quoted(std::string const& text)
{
    std::string shown = "\"";
    for (char c : text) {
        if (c == '\n')
            shown += "\\n";
        else if (c == '"' || c == '\\')
            shown += {'\\', c};
        else if (static_cast<unsigned char>(c) < 0x20 || c == 0x7F)
            shown += KVString::ssprintf("\\x%02x", static_cast<unsigned char>(c)).toUTF8();
        else
            shown += c;
    }
    return shown + '"';
}

template <class T>
bool isNumber(std::string_view text, int base = 10)
{
    // The C functions take a "+", and "nan" with a sign.
    if (text.starts_with('+'))
        text.remove_prefix(1);
    T number{};
    char const* const end = text.data() + text.size();
    std::from_chars_result result{};
    if constexpr (std::is_floating_point_v<T>)
        result = std::from_chars(text.data(), end, number);
    else
        result = std::from_chars(text.data(), end, number, base);
    return result.ec == std::errc() && result.ptr == end;
}

std::string_view nextWord(std::string_view& text)
{
    constexpr std::string_view blanks = " \t\r\n";
    text.remove_prefix(std::min(text.find_first_not_of(blanks), text.size()));
    std::string_view const word = text.substr(0, text.find_first_of(blanks));
    text.remove_prefix(word.size());
    return word;
}

bool isTime(std::string_view text)
{
    return isNumber<long long>(nextWord(text)) && isNumber<int>(nextWord(text)) &&
           isNumber<unsigned int>(nextWord(text), 16) && isNumber<long long>(nextWord(text)) &&
           nextWord(text).empty();
}

bool isUUID(std::string_view word)
{
    return word.size() == 32 && std::ranges::all_of(word, [](char c) {
               return std::isxdigit(static_cast<unsigned char>(c)) != 0;
           });
}

struct Describe {
    std::string operator()(std::monostate) const { return {}; }
    std::string operator()(KVUUID const& uuid) const { return textOf(uuid); }
    std::string operator()(KVString const& text) const { return quoted(text); }
    std::string operator()(CMTime const& time) const
    {
        return KV_CMTimeToFractionString(time).toUTF8();
    }
    std::string operator()(auto number) const { return shortest(number); }
};

struct Convert {
    Json operator()(std::monostate) const { return nullptr; }
    Json operator()(KVUUID const& uuid) const { return textOf(uuid); }
    Json operator()(KVString const& text) const { return text.toUTF8(); }
    Json operator()(CMTime const& time) const
    {
        return {{"value", time.value},
                {"timescale", time.timescale},
                {"flags", time.flags},
                {"epoch", time.epoch}};
    }
    Json operator()(auto number) const
    {
        // JSON has no words for what is no number.
        if constexpr (std::is_floating_point_v<decltype(number)>)
            if (!std::isfinite(number))
                return shortest(number);
        return number;
    }
};

} // namespace

bool isWellWritten(std::string_view text, Kind kind)
{
    if (kind == Kind::String || kind == Kind::None)
        return true;
    if (kind == Kind::Time)
        return isTime(text);
    std::string_view const word = nextWord(text);
    if (!nextWord(text).empty())
        return false;
    switch (kind) {
    case Kind::Int:
        return isNumber<int>(word);
    case Kind::UInt:
        return isNumber<unsigned int>(word);
    case Kind::Int64:
        return isNumber<long long>(word);
    case Kind::UInt64:
        return isNumber<unsigned long long>(word);
    case Kind::UUID:
        return isUUID(word);
    default:
        return isNumber<double>(word);
    }
}

Value readContent(KVStreamElement& element, Kind kind)
{
    switch (kind) {
    case Kind::Int:
        return read<int>([&](int* out) { return element.getAsInt32(out); });
    case Kind::UInt:
        return read<unsigned int>([&](unsigned int* out) { return element.getAsUInt32(out); });
    case Kind::Int64:
        return read<long long>([&](long long* out) { return element.getAsInt64(out); });
    case Kind::UInt64:
        return read<unsigned long long>(
            [&](unsigned long long* out) { return element.getAsUInt64(out); });
    case Kind::Float:
        return read<float>([&](float* out) { return element.getAsFloat(out); });
    case Kind::Double:
        return read<double>([&](double* out) { return element.getAsDouble(out); });
    case Kind::UUID:
        return adopt(element.getAsUUID());
    case Kind::String:
        return read<KVString>([&](KVString* out) { return element.getAsString(out); });
    case Kind::Time:
        return read<CMTime>([&](CMTime* out) { return element.getAsVexTime(out); });
    case Kind::None:
        break;
    }
    return {};
}

Value readAttribute(KVStreamElement const& element, AttributeInfo const& attribute)
{
    unsigned int const token = attribute.token;
    switch (attribute.kind) {
    case Kind::Int:
        return read<int>([&](int* out) { return element.getAttributeAsInt32(token, out); });
    case Kind::UInt:
        return read<unsigned int>(
            [&](unsigned int* out) { return element.getAttributeAsUInt32(token, out); });
    case Kind::Int64:
        return read<long long>(
            [&](long long* out) { return element.getAttributeAsInt64(token, out); });
    case Kind::UInt64:
        return read<unsigned long long>(
            [&](unsigned long long* out) { return element.getAttributeAsUInt64(token, out); });
    case Kind::Float:
        return read<float>([&](float* out) { return element.getAttributeAsFloat(token, out); });
    case Kind::Double:
        return read<double>([&](double* out) { return element.getAttributeAsDouble(token, out); });
    case Kind::UUID:
        return adopt(element.getAttributeAsUUID(token));
    case Kind::String:
        return read<KVString>(
            [&](KVString* out) { return element.getAttributeAsString(token, out); });
    case Kind::Time:
        return read<CMTime>([&](CMTime* out) { return element.getAttributeAsVexTime(token, out); });
    case Kind::None:
        break;
    }
    return {};
}

void writeContent(KVSerializerWriteStream& stream, Value const& value)
{
    write(value, [&](auto const& v) { stream.writeValue(v); });
}

void writeAttribute(KVSerializerWriteStream& stream, unsigned int token, Value const& value)
{
    // An empty text is left out: the compact form cannot hold it.
    if (auto const* text = std::get_if<KVString>(&value); text && text->empty())
        return;
    write(value, [&](auto const& v) { stream.writeAttribute(token, v); });
}

std::string describe(Value const& value)
{
    return std::visit(Describe{}, value);
}

Json toJson(Value const& value)
{
    return std::visit(Convert{}, value);
}

char const* nameOf(Kind kind) noexcept
{
    switch (kind) {
    case Kind::Int:
        return "a 32-bit integer";
    case Kind::UInt:
        return "a 32-bit integer without sign";
    case Kind::Int64:
        return "a 64-bit integer";
    case Kind::UInt64:
        return "a 64-bit integer without sign";
    case Kind::Float:
    case Kind::Double:
        return "a number";
    case Kind::UUID:
        return "a UUID of 32 hexadecimal digits";
    case Kind::String:
        return "a text";
    case Kind::Time:
        return "a time (value timescale flags epoch)";
    case Kind::None:
        break;
    }
    return "nothing";
}

} // namespace scene
