#pragma once

#include <korvane/platform/CFBase.h>

#include <span>
#include <vector>

/// An immutable row of objects, each retained. Elements are not null: NSNull stands for a missing
/// one.
///
///     NSObject const* const pair[] = {first, second};
///     auto const array = KVMakeRef<NSArray>(pair);
struct KV_EXPORT __CFArray final : NSObject {
    __CFArray() = default;
    /// Retains each object; nulls become NSNull.
    explicit __CFArray(std::span<NSObject const* const> objects);
    __CFArray(__CFArray const&) = delete;
    __CFArray& operator=(__CFArray const&) = delete;
    ~__CFArray() override;

    std::size_t count() const noexcept { return objects_.size(); }
    /// Unowned; null when the index is out of range.
    NSObject const* objectAtIndex(std::size_t index) const noexcept;
    /// All of them, unowned, valid as long as the array.
    std::span<NSObject const* const> objects() const noexcept { return objects_; }

    /// Equal length and equal elements.
    bool isEqual(NSObject const* other) const override;
    std::size_t hash() const override;
    KVString description() const override;

private:
    std::vector<NSObject const*> objects_;
};

using CFArrayRef = __CFArray const*;
using NSArray = __CFArray;

/// The one object that stands for "nothing" where an object is asked for.
class KV_EXPORT NSNull final : public NSObject {
public:
    /// Unowned; lives as long as the process.
    static NSNull* null() noexcept;
    KVString description() const override;
};
