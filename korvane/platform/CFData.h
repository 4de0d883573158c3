#pragma once

#include <korvane/platform/CFBase.h>

#include <span>
#include <vector>

/// A block of bytes. A `CFDataRef` cannot be changed through, a `CFMutableDataRef` grows.
struct KV_EXPORT __CFData final : NSObject {
    __CFData() = default;
    /// Copies the bytes.
    __CFData(void const* bytes, std::size_t length);
    explicit __CFData(std::vector<std::uint8_t> bytes) noexcept : bytes_(std::move(bytes)) {}

    std::uint8_t const* bytes() const noexcept { return bytes_.data(); }
    std::size_t length() const noexcept { return bytes_.size(); }
    std::span<std::uint8_t const> span() const noexcept { return bytes_; }

    std::uint8_t* mutableBytes() noexcept { return bytes_.data(); }
    /// New bytes at the end are zero.
    void setLength(std::size_t length) { bytes_.resize(length); }
    void append(void const* bytes, std::size_t length);

    bool isEqual(NSObject const* other) const override;
    std::size_t hash() const override;
    KVString description() const override;

private:
    std::vector<std::uint8_t> bytes_;
};

using CFDataRef = __CFData const*;
using CFMutableDataRef = __CFData*;

KV_EXPORT CFDataRef CFDataCreate(CFAllocatorRef, void const* bytes, CFIndex length);
/// A private immutable copy; null stays null.
KV_EXPORT CFDataRef CFDataCreateCopy(CFAllocatorRef, CFDataRef);
/// Empty; `capacity` is a hint and takes no memory.
KV_EXPORT CFMutableDataRef CFDataCreateMutable(CFAllocatorRef, CFIndex capacity);
KV_EXPORT CFIndex CFDataGetLength(CFDataRef) noexcept;
KV_EXPORT UInt8 const* CFDataGetBytePtr(CFDataRef) noexcept;
KV_EXPORT UInt8* CFDataGetMutableBytePtr(CFMutableDataRef) noexcept;
KV_EXPORT void CFDataSetLength(CFMutableDataRef, CFIndex length);
KV_EXPORT void CFDataAppendBytes(CFMutableDataRef, void const* bytes, CFIndex length);
