#pragma once

#include <korvane/platform/CFBase.h>

/// An immutable number: a 64-bit signed integer or a `double`.
///
///     auto const rate = KVMakeRef<NSNumber>(23.976);
///     rate->int64Value();                   // 23
struct KV_EXPORT __CFNumber final : NSObject {
    explicit __CFNumber(int value) noexcept : integer_(value) {}
    explicit __CFNumber(unsigned int value) noexcept : integer_(value) {}
    explicit __CFNumber(long value) noexcept : integer_(value) {}
    explicit __CFNumber(long long value) noexcept : integer_(value) {}
    explicit __CFNumber(bool value) noexcept : integer_(value) {}
    explicit __CFNumber(double value) noexcept : real_(value), isFloat_(true) {}

    /// Whether it was made from a `double`.
    bool isFloat() const noexcept { return isFloat_; }
    double doubleValue() const noexcept;
    /// A `double` is cut toward zero; NaN gives 0, what is out of range the nearest end.
    std::int64_t int64Value() const noexcept;
    /// The low 32 bits of `int64Value()`.
    std::int32_t intValue() const noexcept;
    /// Whether it is other than 0, as NaN is.
    bool boolValue() const noexcept;

    /// By value, whatever the form: 1 equals 1.0. NaN equals no number.
    bool isEqual(NSObject const* other) const override;
    std::size_t hash() const override;
    /// The shortest decimal text that reads back as the same number: "1", "0.5".
    KVString description() const override;

private:
    std::int64_t integer_ = 0;
    double real_ = 0;
    bool isFloat_ = false;
};

using CFNumberRef = __CFNumber const*;
using NSNumber = __CFNumber;
