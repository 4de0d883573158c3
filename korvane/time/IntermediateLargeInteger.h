#pragma once

#include <korvane/platform/CMTime.h>

#include <array>

// Integers of 128 and 256 bits in two's complement, least significant limb first: what products and
// quotients of times are made of before they become a CMTime again.

struct bignum_s128 {
    std::array<std::uint64_t, 2> limbs;
};

struct bignum_s256 {
    std::array<std::uint64_t, 4> limbs;
};

// In the functions below an output may be the same object as an input. Results that do not fit
// wrap.

KV_EXPORT void bignum_s128_init_from_s64(std::int64_t x, bignum_s128* out) noexcept;
KV_EXPORT void bignum_s256_init_from_s64(std::int64_t x, bignum_s256* out) noexcept;
/// out = -in
KV_EXPORT void bignum_s256_neg(bignum_s256* out, bignum_s256 const* in) noexcept;
/// out = a - b
KV_EXPORT void bignum_s256_sub(bignum_s256 const* a, bignum_s256 const* b,
                               bignum_s256* out) noexcept;
/// out = a * b, which always fits.
KV_EXPORT void bignum_s128_full_multiply(bignum_s128 const* a, bignum_s128 const* b,
                                         bignum_s256* out) noexcept;
/// a / b toward zero, and the remainder, which has the sign of `a`. Either output may be null. A
/// divisor of 0 gives 0 and 0.
KV_EXPORT void bignum_s256_divide(bignum_s256 const* a, bignum_s256 const* b, bignum_s256* quotient,
                                  bignum_s256* remainder) noexcept;

/// A signed integer of 256 bits, wide enough for the product of three fields of a CMTime with three
/// others.
///
///     // 2^62 * 3 / 6, as a time
///     auto const product = IntermediateLargeInteger::product(1ll << 62, 3);
///     CMTime const time = IntermediateLargeInteger::makeCMTime(product, 6, false, false);
class KV_EXPORT IntermediateLargeInteger {
public:
    constexpr IntermediateLargeInteger(long long value = 0) noexcept
        : bits_{{static_cast<std::uint64_t>(value), value < 0 ? ~0ull : 0, value < 0 ? ~0ull : 0,
                 value < 0 ? ~0ull : 0}}
    {}
    explicit constexpr IntermediateLargeInteger(bignum_s256 const& bits) noexcept : bits_(bits) {}
    /// a * b, exactly.
    static IntermediateLargeInteger product(long long a, long long b) noexcept;

    constexpr bignum_s256 const& bits() const noexcept { return bits_; }

    bool operator==(long long other) const noexcept;
    /// The remainder of the division toward zero; 0 for a divisor of 0.
    IntermediateLargeInteger operator%(IntermediateLargeInteger const& divisor) const noexcept;

    /// The greatest common divisor by Euclid's algorithm; of 0 and x, x. Of negative operands it
    /// has the sign that the truncating remainders leave.
    static IntermediateLargeInteger gcd(IntermediateLargeInteger a,
                                        IntermediateLargeInteger b) noexcept;

    /// numerator / denominator seconds. Unless `forceReduce`, a fraction that fits a CMTime is
    /// taken as it is, not reduced, over 0 as well. Otherwise it is reduced, and then both terms
    /// are halved, bits lost toward zero, until they fit; the rounded bit tells of it.
    ///
    /// What is too large for 64 bits when the denominator has come to 1 is an infinity, even though
    /// a quotient of the terms before they were halved might fit. A numerator of 1 is kept for one
    /// step in which only the denominator is halved, and is 0 at the next: what is too small is
    /// rounded up first, and then to 0. A reduced fraction over 0 is invalid.
    static CMTime makeCMTime(IntermediateLargeInteger const& numerator,
                             IntermediateLargeInteger const& denominator, bool alreadyRounded,
                             bool forceReduce) noexcept;

private:
    bignum_s256 bits_;
};
