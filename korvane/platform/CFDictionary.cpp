#include <korvane/platform/CFDictionary.h>

#include <algorithm>

namespace {

bool sameText(CFStringRef key, std::string_view ascii) noexcept
{
    return key->length() == ascii.size() &&
           std::equal(ascii.begin(), ascii.end(), key->units(),
                      [](char a, char16_t b) { return static_cast<unsigned char>(a) == b; });
}

} // namespace

__CFDictionary::__CFDictionary(__CFDictionary const& other) : NSObject(other)
{
    entries_.reserve(other.entries_.size());
    for (auto const& [key, value] : other.entries_)
        entries_.emplace_back(CFRetain(key), CFRetain(value));
}

__CFDictionary::~__CFDictionary()
{
    removeAllValues();
}

NSObject const* __CFDictionary::value(CFStringRef key) const noexcept
{
    for (auto const& [k, v] : entries_)
        if (k == key || k->view() == key->view())
            return v;
    return nullptr;
}

NSObject const* __CFDictionary::value(std::string_view asciiKey) const noexcept
{
    for (auto const& [k, v] : entries_)
        if (sameText(k, asciiKey))
            return v;
    return nullptr;
}

void __CFDictionary::setValue(CFStringRef key, NSObject const* value)
{
    if (!value)
        return removeValue(key);
    for (auto& [k, v] : entries_) {
        if (k->view() != key->view())
            continue;
        CFRetain(value);
        std::swap(v, value);
        return CFRelease(value);
    }
    entries_.emplace_back(key, value);
    CFRetain(key);
    CFRetain(value);
}

void __CFDictionary::setValue(std::string_view asciiKey, NSObject const* value)
{
    CFStringRef key = __CFString::createASCII(asciiKey);
    setValue(key, value);
    CFRelease(key);
}

void __CFDictionary::removeValue(CFStringRef key)
{
    auto found = std::find_if(entries_.begin(), entries_.end(), [&](auto const& entry) {
        return entry.first->view() == key->view();
    });
    if (found == entries_.end())
        return;
    auto const [k, v] = *found;
    entries_.erase(found);
    CFRelease(k);
    CFRelease(v);
}

void __CFDictionary::removeAllValues() noexcept
{
    auto entries = std::move(entries_);
    entries_.clear();
    for (auto const& [key, value] : entries) {
        CFRelease(key);
        CFRelease(value);
    }
}

bool __CFDictionary::isEqual(NSObject const* other) const
{
    auto const* dictionary = dynamic_cast<__CFDictionary const*>(other);
    return dictionary && dictionary->count() == count() &&
           std::all_of(entries_.begin(), entries_.end(), [&](auto const& entry) {
               return CFEqual(entry.second, dictionary->value(entry.first));
           });
}

std::size_t __CFDictionary::hash() const
{
    return entries_.size();
}

CFMutableDictionaryRef CFDictionaryCreateMutable(CFAllocatorRef, CFIndex)
{
    return new __CFDictionary();
}

CFDictionaryRef CFDictionaryCreateCopy(CFAllocatorRef, CFDictionaryRef dictionary)
{
    return dictionary ? new __CFDictionary(*dictionary) : nullptr;
}

CFMutableDictionaryRef CFDictionaryCreateMutableCopy(CFAllocatorRef, CFIndex,
                                                     CFDictionaryRef dictionary)
{
    return dictionary ? new __CFDictionary(*dictionary) : nullptr;
}

CFIndex CFDictionaryGetCount(CFDictionaryRef dictionary) noexcept
{
    return dictionary ? static_cast<CFIndex>(dictionary->count()) : 0;
}

CFTypeRef CFDictionaryGetValue(CFDictionaryRef dictionary, CFStringRef key) noexcept
{
    return dictionary && key ? dictionary->value(key) : nullptr;
}

bool CFDictionaryContainsKey(CFDictionaryRef dictionary, CFStringRef key) noexcept
{
    return CFDictionaryGetValue(dictionary, key) != nullptr;
}

void CFDictionarySetValue(CFMutableDictionaryRef dictionary, CFStringRef key, CFTypeRef value)
{
    dictionary->setValue(key, value);
}

void CFDictionaryRemoveValue(CFMutableDictionaryRef dictionary, CFStringRef key)
{
    dictionary->removeValue(key);
}
