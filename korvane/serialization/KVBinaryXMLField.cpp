#include <korvane/serialization/KVBinaryXMLField.h>

#include <korvane/platform/KVSaturatingCast_p.h>
#include <korvane/serialization/KVNumberText_p.h>
#include <korvane/serialization/KVStreamElement.h>

#include <concepts>

KVBinaryXMLField::KVBinaryXMLField(long long value) noexcept : value_(value) {}
KVBinaryXMLField::KVBinaryXMLField(long value) noexcept : value_(static_cast<long long>(value)) {}
KVBinaryXMLField::KVBinaryXMLField(unsigned long long value) noexcept : value_(value) {}
KVBinaryXMLField::KVBinaryXMLField(unsigned long value) noexcept
    : value_(static_cast<unsigned long long>(value))
{}
KVBinaryXMLField::KVBinaryXMLField(float value) noexcept : value_(value) {}
KVBinaryXMLField::KVBinaryXMLField(double value) noexcept : value_(value) {}
KVBinaryXMLField::KVBinaryXMLField(CMTime const& value) noexcept : value_(value) {}
KVBinaryXMLField::KVBinaryXMLField(KVString const& value) noexcept : value_(value) {}
KVBinaryXMLField::KVBinaryXMLField(KVUUID const& value) noexcept : value_(value) {}

bool KVBinaryXMLField::getAsString(KVString* value) const
{
    auto const print = [value]<class T>(T const& held) {
        if constexpr (std::same_as<T, KVString>) {
            *value = held;
        } else {
            char text[kvNumberTextSize];
            char const* end;
            if constexpr (std::same_as<T, double>)
                end = kvFormat(text, held, 16);
            else
                end = kvFormat(text, held);
            *value = KVString::fromUTF8({text, static_cast<std::size_t>(end - text)});
        }
    };
    std::visit(print, value_);
    return true;
}

// --- Numbers ---

template <class T>
bool KVBinaryXMLField::getInteger(T* value) const
{
    auto const convert = [value]<class Held>(Held const& held) {
        if constexpr (std::integral<Held>) {
            *value = static_cast<T>(held);
        } else if constexpr (std::floating_point<Held>) {
            *value = kvSaturatingCast<T>(held);
        } else if constexpr (std::same_as<Held, KVString>) {
            std::string const text = held;
            char const* cursor = text.c_str();
            // Read in 64 bits whatever the type, as strtol and strtoul do.
            if constexpr (std::is_signed_v<T>) {
                long long number;
                bool const inRange = kvParseInt(cursor, number);
                *value = static_cast<T>(number);
                return inRange;
            } else {
                unsigned long long number;
                bool const inRange = kvParseUInt(cursor, number);
                *value = static_cast<T>(number);
                return inRange;
            }
        }
        return true;
    };
    return std::visit(convert, value_);
}

template <class T>
bool KVBinaryXMLField::getFloat(T* value) const
{
    auto const convert = [value]<class Held>(Held const& held) {
        if constexpr (std::integral<Held> || std::floating_point<Held>) {
            *value = static_cast<T>(held);
        } else if constexpr (std::same_as<Held, KVString>) {
            std::string const text = held;
            char const* cursor = text.c_str();
            return kvParseFloat(cursor, *value);
        }
        return true;
    };
    return std::visit(convert, value_);
}

bool KVBinaryXMLField::getAsInt32(int* value) const
{
    return getInteger(value);
}

bool KVBinaryXMLField::getAsUInt32(unsigned int* value) const
{
    return getInteger(value);
}

bool KVBinaryXMLField::getAsInt64(long long* value) const
{
    return getInteger(value);
}

bool KVBinaryXMLField::getAsUInt64(unsigned long long* value) const
{
    return getInteger(value);
}

bool KVBinaryXMLField::getAsFloat(float* value) const
{
    return getFloat(value);
}

bool KVBinaryXMLField::getAsDouble(double* value) const
{
    return getFloat(value);
}

bool KVBinaryXMLField::getAsBool(bool* value) const
{
    auto const convert = [value]<class Held>(Held const& held) {
        if constexpr (std::integral<Held> || std::floating_point<Held>) {
            *value = held != 0;
        } else if constexpr (std::same_as<Held, KVString>) {
            std::string const text = held;
            char const* cursor = text.c_str();
            unsigned long long number;
            static_cast<void>(kvParseUInt(cursor, number));
            *value = number != 0;
        }
    };
    std::visit(convert, value_);
    return true;
}

// --- UUIDs and times ---

KVUUID* KVBinaryXMLField::getAsUUID() const
{
    if (auto const* uuid = std::get_if<KVUUID>(&value_))
        return new KVUUID(*uuid);
    if (auto const* string = std::get_if<KVString>(&value_)) {
        std::string const text = *string;
        char const* cursor = text.c_str();
        return KVStreamElement::atoUUID(&cursor);
    }
    return nullptr;
}

bool KVBinaryXMLField::getAsVexTime(CMTime* value) const
{
    if (auto const* time = std::get_if<CMTime>(&value_)) {
        *value = *time;
        return true;
    }
    if (auto const* string = std::get_if<KVString>(&value_)) {
        std::string const text = *string;
        char const* cursor = text.c_str();
        return KVStreamElement::aToVexTime(&cursor, value);
    }
    return false;
}
