#pragma once

#include <korvane/platform/CFBase.h>

#include <span>
#include <vector>

/// A block of bytes. A `CFDataRef` cannot be changed through, a `CFMutableDataRef` grows.
///
///     auto const data = KVCFRef<CFMutableDataRef>::adopt(CFDataCreateMutable(nullptr, 0));
///     CFDataAppendBytes(data, bytes, 16);
///
/// Pointers to the bytes hold until the length changes. What makes or grows a block throws
/// std::bad_alloc when there is no memory.
struct KV_EXPORT __CFData final : NSObject {
    __CFData() = default;
    /// Copies the bytes.
    __CFData(void const* bytes, std::size_t length);
    explicit __CFData(std::vector<std::uint8_t> bytes) noexcept : bytes_(std::move(bytes)) {}

    std::uint8_t const* bytes() const noexcept { return bytes_.data(); }
    std::size_t length() const noexcept { return bytes_.size(); }
    std::span<std::uint8_t const> span() const noexcept { return bytes_; }

    /// To be written to, within `length()`.
    std::uint8_t* mutableBytes() noexcept { return bytes_.data(); }
    /// New bytes at the end are zero.
    void setLength(std::size_t length) { bytes_.resize(length); }
    /// Copies the bytes, which must not be this block's own.
    void append(void const* bytes, std::size_t length);

    bool isEqual(NSObject const* other) const override;
    std::size_t hash() const override;
    KVString description() const override;

private:
    std::vector<std::uint8_t> bytes_;
};

using CFDataRef = __CFData const*;
using CFMutableDataRef = __CFData*;

// The functions take a null block for an empty one where they read it; to be changed, there must be
// one. A negative length counts as 0.

/// Copies the bytes.
KV_EXPORT CFDataRef CFDataCreate(CFAllocatorRef, void const* bytes, CFIndex length);
/// A private immutable copy; null stays null.
KV_EXPORT CFDataRef CFDataCreateCopy(CFAllocatorRef, CFDataRef);
/// Empty; `capacity` is a hint and takes no memory.
KV_EXPORT CFMutableDataRef CFDataCreateMutable(CFAllocatorRef, CFIndex capacity);
KV_EXPORT CFIndex CFDataGetLength(CFDataRef) noexcept;
/// Unowned; null for a null block, and it may be for an empty one.
KV_EXPORT UInt8 const* CFDataGetBytePtr(CFDataRef) noexcept;
KV_EXPORT UInt8* CFDataGetMutableBytePtr(CFMutableDataRef) noexcept;
/// New bytes at the end are zero.
KV_EXPORT void CFDataSetLength(CFMutableDataRef, CFIndex length);
KV_EXPORT void CFDataAppendBytes(CFMutableDataRef, void const* bytes, CFIndex length);
