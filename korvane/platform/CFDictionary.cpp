#include <korvane/platform/CFDictionary.h>

#include <algorithm>
#include <cstddef>

namespace {

/// Up to so many keys, going through them is as fast as an index.
constexpr std::size_t kSmall = 16;

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
    indexFrom(0);
}

__CFDictionary::~__CFDictionary()
{
    removeAllValues();
}

std::size_t __CFDictionary::find(std::u16string_view key) const noexcept
{
    if (!index_.empty()) {
        auto const found = index_.find(key);
        return found == index_.end() ? kNone : found->second;
    }
    for (std::size_t i = 0; i < entries_.size(); ++i)
        if (entries_[i].first->view() == key)
            return i;
    return kNone;
}

void __CFDictionary::indexFrom(std::size_t place)
{
    if (entries_.size() <= kSmall)
        return index_.clear();
    if (index_.empty())
        place = 0;
    for (; place < entries_.size(); ++place)
        index_[entries_[place].first->view()] = place;
}

NSObject const* __CFDictionary::value(CFStringRef key) const noexcept
{
    std::size_t const place = find(key->view());
    return place == kNone ? nullptr : entries_[place].second;
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
    std::size_t const place = find(key->view());
    CFRetain(value);
    if (place != kNone) {
        std::swap(entries_[place].second, value);
        return CFRelease(value);
    }
    entries_.emplace_back(CFRetain(key), value);
    indexFrom(entries_.size() - 1);
}

void __CFDictionary::setValue(std::string_view asciiKey, NSObject const* value)
{
    CFStringRef key = __CFString::createASCII(asciiKey);
    setValue(key, value);
    CFRelease(key);
}

void __CFDictionary::removeValue(CFStringRef key)
{
    std::size_t const place = find(key->view());
    if (place == kNone)
        return;
    auto const [k, v] = entries_[place];
    index_.clear();
    entries_.erase(entries_.begin() + static_cast<std::ptrdiff_t>(place));
    indexFrom(0);
    CFRelease(k);
    CFRelease(v);
}

void __CFDictionary::removeAllValues() noexcept
{
    index_.clear();
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
