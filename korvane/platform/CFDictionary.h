#pragma once

#include <korvane/platform/CFString.h>

#include <string_view>
#include <unordered_map>
#include <utility>
#include <vector>

/// Objects under string keys, kept in the order in which their keys first came. A
/// `CFDictionaryRef` is read only, a `CFMutableDictionaryRef` can be changed.
///
///     auto const details = KVMakeRef<NSMutableDictionary>();
///     details->setValue("frame", KVMakeRef<NSNumber>(24));
///
/// Keys are told apart unit by unit and are not null.
struct KV_EXPORT __CFDictionary final : NSObject {
    __CFDictionary() = default;
    /// Shares the values, retained.
    __CFDictionary(__CFDictionary const& other);
    __CFDictionary& operator=(__CFDictionary const&) = delete;
    ~__CFDictionary() override;

    std::size_t count() const noexcept { return entries_.size(); }
    /// Unowned; null when there is no such key.
    NSObject const* value(CFStringRef key) const noexcept;
    NSObject const* value(std::string_view asciiKey) const noexcept;
    /// Unowned, in order; the index must be below `count()`.
    CFStringRef keyAtIndex(std::size_t index) const noexcept { return entries_[index].first; }
    NSObject const* valueAtIndex(std::size_t index) const noexcept
    {
        return entries_[index].second;
    }

    /// Retains both. A key that is there keeps its place. A null value removes the key.
    void setValue(CFStringRef key, NSObject const* value);
    void setValue(std::string_view asciiKey, NSObject const* value);
    void removeValue(CFStringRef key);
    void removeAllValues() noexcept;

    /// The same keys with equal values, in any order.
    bool isEqual(NSObject const* other) const override;
    std::size_t hash() const override;
    KVString description() const override;

private:
    static constexpr std::size_t kNone = static_cast<std::size_t>(-1);

    /// The place of the key, or kNone.
    std::size_t find(std::u16string_view key) const noexcept;
    void indexFrom(std::size_t place);

    std::vector<std::pair<CFStringRef, NSObject const*>> entries_;
    /// The places of the keys, once there are so many that going through them would be slow. The
    /// texts are those of the keys.
    std::unordered_map<std::u16string_view, std::size_t> index_;
};

using CFDictionaryRef = __CFDictionary const*;
using CFMutableDictionaryRef = __CFDictionary*;
using NSDictionary = __CFDictionary;
using NSMutableDictionary = __CFDictionary;

// A null dictionary reads as an empty one and copies to null; to be changed, there must be one.

/// Empty; `capacity` is a hint and takes no memory.
KV_EXPORT CFMutableDictionaryRef CFDictionaryCreateMutable(CFAllocatorRef, CFIndex capacity);
/// A dictionary of its own, which shares the values.
KV_EXPORT CFDictionaryRef CFDictionaryCreateCopy(CFAllocatorRef, CFDictionaryRef);
KV_EXPORT CFMutableDictionaryRef CFDictionaryCreateMutableCopy(CFAllocatorRef, CFIndex capacity,
                                                               CFDictionaryRef);
KV_EXPORT CFIndex CFDictionaryGetCount(CFDictionaryRef) noexcept;
/// Unowned; null when there is no such key.
KV_EXPORT CFTypeRef CFDictionaryGetValue(CFDictionaryRef, CFStringRef key) noexcept;
KV_EXPORT bool CFDictionaryContainsKey(CFDictionaryRef, CFStringRef key) noexcept;
/// Retains both. A key that is there keeps its place. A null value removes the key.
KV_EXPORT void CFDictionarySetValue(CFMutableDictionaryRef, CFStringRef key, CFTypeRef value);
KV_EXPORT void CFDictionaryRemoveValue(CFMutableDictionaryRef, CFStringRef key);
