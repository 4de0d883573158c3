#pragma once

#include <korvane/platform/NSObject.h>

#include <cstddef>
#include <cstdint>

/// Names that all CF kinds share. Functions with "Create" or "Copy" in their name
/// give the caller a reference to own: adopt it with `KVCFRef<...>::adopt`.
/// Functions with "Get" give none.
using CFTypeRef = NSObject const*;
using CFIndex = std::ptrdiff_t;
using CFHashCode = std::size_t;
using UInt8 = std::uint8_t;
using UniChar = char16_t;

/// All memory comes from the one default allocator; the parameter keeps call sites portable.
using CFAllocatorRef = void const*;
inline constexpr CFAllocatorRef kCFAllocatorDefault = nullptr;

enum CFComparisonResult : int {
    kCFCompareLessThan = -1,
    kCFCompareEqualTo = 0,
    kCFCompareGreaterThan = 1,
};

/// Adds a reference and returns its argument; null is allowed and stays null.
template <class T>
T CFRetain(T object) noexcept
{
    if (object)
        object->retain();
    return object;
}

/// Gives up a reference; null is allowed.
inline void CFRelease(CFTypeRef object) noexcept
{
    if (object)
        object->release();
}

/// Whether two objects are equal in value. Two nulls are equal, null and an object are not.
inline bool CFEqual(CFTypeRef a, CFTypeRef b)
{
    return a == b || (a && b && a->isEqual(b));
}

/// The object's `hash`; 0 for null.
inline CFHashCode CFHash(CFTypeRef object)
{
    return object ? object->hash() : 0;
}

/// The same as CFRetain and CFRelease, by the names that object kinds are known under.
template <class T>
T objc_retain(T object) noexcept
{
    return CFRetain(object);
}

inline void objc_release(CFTypeRef object) noexcept
{
    CFRelease(object);
}
