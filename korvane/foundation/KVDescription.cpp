// The texts of the platform's objects. They stand on this floor because a description is a
// KVString, which the objects below know by name only.

#include <korvane/foundation/KVString.h>
#include <korvane/platform/CFArray.h>
#include <korvane/platform/CFData.h>
#include <korvane/platform/CFDictionary.h>
#include <korvane/platform/CFNumber.h>
#include <korvane/platform/CFURL.h>

#include <charconv>

KVString NSObject::description() const
{
    return KVString::ssprintf("<NSObject: %p>", static_cast<void const*>(this));
}

KVString __CFString::description() const
{
    return KVString(this);
}

KVString __CFURL::description() const
{
    return KVString(absolute_);
}

KVString NSNull::description() const
{
    return "<null>";
}

KVString __CFNumber::description() const
{
    char text[32];
    auto const end = isFloat_ ? std::to_chars(text, text + sizeof text, real_).ptr
                              : std::to_chars(text, text + sizeof text, integer_).ptr;
    return KVString::fromUTF8({text, static_cast<std::size_t>(end - text)});
}

KVString __CFData::description() const
{
    std::string text = "<";
    for (std::size_t i = 0; i < bytes_.size(); ++i) {
        constexpr char digits[] = "0123456789abcdef";
        if (i != 0 && i % 4 == 0)
            text += ' ';
        text += digits[bytes_[i] >> 4];
        text += digits[bytes_[i] & 15];
    }
    return text + ">";
}

KVString __CFArray::description() const
{
    std::string text = "(";
    for (NSObject const* object : objects_)
        text += "\n    " + object->description().toUTF8() + (object == objects_.back() ? "" : ",");
    return text + "\n)";
}

KVString __CFDictionary::description() const
{
    std::string text = "{";
    for (auto const& [key, value] : entries_)
        text += "\n    " + CFStringGetUTF8(key) + " = " + value->description().toUTF8() + ";";
    return text + "\n}";
}
