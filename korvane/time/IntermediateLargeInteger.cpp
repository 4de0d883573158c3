#include <korvane/time/IntermediateLargeInteger.h>

#include <korvane/platform/Int128_p.h>
#include <korvane/time/IntermediateLargeInteger_p.h>

#include <algorithm>
#include <bit>

using kv::uint128;

namespace {

using Limbs = std::array<std::uint64_t, 4>;

bool isNegative(Limbs const& x) noexcept
{
    return x[3] >> 63;
}

unsigned int significantBits(Limbs const& x) noexcept
{
    for (unsigned int i = 4; i-- > 0;)
        if (x[i] != 0)
            return 64 * i + static_cast<unsigned int>(std::bit_width(x[i]));
    return 0;
}

Limbs difference(Limbs const& a, Limbs const& b) noexcept
{
    Limbs result;
    std::uint64_t borrow = 0;
    for (std::size_t i = 0; i < 4; ++i) {
        uint128 const d = uint128{a[i]} - b[i] - borrow;
        result[i] = static_cast<std::uint64_t>(d);
        borrow = static_cast<std::uint64_t>(d >> 64) & 1;
    }
    return result;
}

Limbs negated(Limbs const& x) noexcept
{
    return difference({}, x);
}

Limbs magnitudeOf(Limbs const& x) noexcept
{
    return isNegative(x) ? negated(x) : x;
}

bool isLess(Limbs const& a, Limbs const& b) noexcept
{
    return std::lexicographical_compare(a.rbegin(), a.rend(), b.rbegin(), b.rend());
}

Limbs shiftedRight(Limbs const& x, unsigned int count) noexcept
{
    Limbs result{};
    unsigned int const limbs = count / 64, bits = count % 64;
    for (unsigned int i = 0; i + limbs < 4; ++i) {
        result[i] = x[i + limbs] >> bits;
        if (bits != 0 && i + limbs < 3)
            result[i] |= x[i + limbs + 1] << (64 - bits);
    }
    return result;
}

Limbs shiftedLeft(Limbs const& x, unsigned int count) noexcept
{
    Limbs result{};
    unsigned int const limbs = count / 64, bits = count % 64;
    for (unsigned int i = limbs; i < 4; ++i) {
        result[i] = x[i - limbs] << bits;
        if (bits != 0 && i > limbs)
            result[i] |= x[i - limbs - 1] >> (64 - bits);
    }
    return result;
}

uint128 low128(Limbs const& x) noexcept
{
    return uint128{x[1]} << 64 | x[0];
}

Limbs widened(uint128 x) noexcept
{
    return {static_cast<std::uint64_t>(x), static_cast<std::uint64_t>(x >> 64), 0, 0};
}

bool fits128(Limbs const& x) noexcept
{
    return (x[2] | x[3]) == 0;
}

/// The value, if it is that of a signed 64-bit number.
bool fits64(Limbs const& x) noexcept
{
    std::uint64_t const sign = x[0] >> 63 ? ~std::uint64_t{0} : 0;
    return x[1] == sign && x[2] == sign && x[3] == sign;
}

/// Unsigned; the divisor is not 0.
Limbs divide(Limbs const& a, Limbs const& b, Limbs& remainder) noexcept
{
    if (fits128(a) && fits128(b)) {
        remainder = widened(low128(a) % low128(b));
        return widened(low128(a) / low128(b));
    }
    Limbs quotient{};
    remainder = a;
    if (isLess(a, b))
        return quotient;
    unsigned int bit = significantBits(a) - significantBits(b) + 1;
    for (Limbs shifted = shiftedLeft(b, bit - 1); bit-- > 0; shifted = shiftedRight(shifted, 1)) {
        if (isLess(remainder, shifted))
            continue;
        remainder = difference(remainder, shifted);
        quotient[bit / 64] |= std::uint64_t{1} << bit % 64;
    }
    return quotient;
}

/// x *= factor
void multiply(Limbs& x, std::uint64_t factor) noexcept
{
    std::uint64_t carry = 0;
    for (std::uint64_t& limb : x) {
        uint128 const product = uint128{limb} * factor + carry;
        limb = static_cast<std::uint64_t>(product);
        carry = static_cast<std::uint64_t>(product >> 64);
    }
}

/// x /= divisor, which is not 0; returns the remainder.
std::uint64_t divideBy(Limbs& x, std::uint64_t divisor) noexcept
{
    std::uint64_t rest = 0;
    for (std::size_t i = 4; i-- > 0;) {
        if (x[i] == 0 && rest == 0)
            continue;
        uint128 const part = uint128{rest} << 64 | x[i];
        x[i] = static_cast<std::uint64_t>(part / divisor);
        rest = static_cast<std::uint64_t>(part % divisor);
    }
    return rest;
}

/// The time of a reduced fraction of magnitudes, both terms halved until they fit a CMTime.
CMTime timeFromReduced(Limbs numerator, Limbs denominator, bool negative,
                       bool alreadyRounded) noexcept
{
    std::uint32_t flags =
        kCMTimeFlags_Valid | (alreadyRounded ? std::uint32_t{kCMTimeFlags_HasBeenRounded} : 0u);
    unsigned int numeratorBits = significantBits(numerator);
    unsigned int denominatorBits = significantBits(denominator);

    if (numeratorBits > 63) {
        unsigned int const halvings = std::min(numeratorBits - 63, denominatorBits - 1);
        if (halvings != 0)
            flags |= kCMTimeFlags_HasBeenRounded;
        numerator = shiftedRight(numerator, halvings);
        denominator = shiftedRight(denominator, halvings);
        numeratorBits -= halvings;
        denominatorBits -= halvings;
        if (numeratorBits > 63)
            return negative ? kCMTimeNegativeInfinity : kCMTimePositiveInfinity;
    }

    if (denominatorBits > 31) {
        unsigned int const halvings = denominatorBits - 31;
        flags |= kCMTimeFlags_HasBeenRounded;
        // The numerator is 1 after all halvings but one of its bits; one more spares it, the next
        // ends at 0.
        if (halvings > numeratorBits)
            return {0, 1, flags, 0};
        numerator = shiftedRight(numerator, std::min(halvings, numeratorBits - 1));
        denominator = shiftedRight(denominator, halvings);
    }
    return {kv::withSign(negative, numerator[0]), static_cast<CMTimeScale>(denominator[0]), flags,
            0};
}

/// Stein's algorithm, for a < b. The count of zeros is taken of a - b,
/// whichever is the larger, so that it does not wait for the comparison.
std::uint64_t gcd(std::uint64_t a, std::uint64_t b) noexcept
{
    if (a == 0)
        return b;
    int const shift = std::countr_zero(a | b);
    a >>= std::countr_zero(a);
    b >>= std::countr_zero(b);
    while (a != b) {
        std::uint64_t const difference = a - b;
        int const zeros = std::countr_zero(difference);
        std::uint64_t const smaller = a < b ? a : b;
        a = (a < b ? 0 - difference : difference) >> zeros;
        b = smaller;
    }
    return a << shift;
}

} // namespace

CMTime kv::timeFromFactors(std::initializer_list<std::int64_t> numerators,
                           std::initializer_list<std::int64_t> denominators,
                           bool alreadyRounded) noexcept
{
    bool negative = false;
    Limbs numerator{1}, denominator{1};
    for (std::int64_t const factor : numerators) {
        negative ^= factor < 0;
        multiply(numerator, magnitude(factor));
    }
    for (std::int64_t const factor : denominators) {
        negative ^= factor < 0;
        std::uint64_t const divisor = magnitude(factor);
        Limbs rest = numerator;
        std::uint64_t const common = gcd(divideBy(rest, divisor), divisor);
        if (common != 1)
            divideBy(numerator, common);
        multiply(denominator, divisor / common);
    }
    return timeFromReduced(numerator, denominator, negative, alreadyRounded);
}

// --- The C layer ---

void bignum_s128_init_from_s64(std::int64_t x, bignum_s128* out) noexcept
{
    out->limbs = {static_cast<std::uint64_t>(x), x < 0 ? ~std::uint64_t{0} : 0};
}

void bignum_s256_init_from_s64(std::int64_t x, bignum_s256* out) noexcept
{
    *out = IntermediateLargeInteger(x).bits();
}

void bignum_s256_neg(bignum_s256* out, bignum_s256 const* in) noexcept
{
    out->limbs = negated(in->limbs);
}

void bignum_s256_sub(bignum_s256 const* a, bignum_s256 const* b, bignum_s256* out) noexcept
{
    out->limbs = difference(a->limbs, b->limbs);
}

void bignum_s128_full_multiply(bignum_s128 const* a, bignum_s128 const* b,
                               bignum_s256* out) noexcept
{
    auto const [a0, a1] = a->limbs;
    auto const [b0, b1] = b->limbs;
    Limbs low{a0, a1, 0, 0}, high{a0, a1, 0, 0};
    multiply(low, b0);
    multiply(high, b1);
    Limbs result = difference(low, negated(shiftedLeft(high, 64)));
    // As unsigned numbers negative operands are too large by 2^128.
    if (a1 >> 63)
        result = difference(result, {0, 0, b0, b1});
    if (b1 >> 63)
        result = difference(result, {0, 0, a0, a1});
    out->limbs = result;
}

void bignum_s256_divide(bignum_s256 const* a, bignum_s256 const* b, bignum_s256* quotient,
                        bignum_s256* remainder) noexcept
{
    bool const negativeA = isNegative(a->limbs), negativeB = isNegative(b->limbs);
    Limbs const divisor = magnitudeOf(b->limbs);
    Limbs whole{}, rest{};
    if (significantBits(divisor) != 0)
        whole = divide(magnitudeOf(a->limbs), divisor, rest);
    if (quotient)
        quotient->limbs = negativeA != negativeB ? negated(whole) : whole;
    if (remainder)
        remainder->limbs = negativeA ? negated(rest) : rest;
}

// --- IntermediateLargeInteger ---

IntermediateLargeInteger IntermediateLargeInteger::product(long long a, long long b) noexcept
{
    kv::int128 const product = kv::int128{a} * b;
    std::uint64_t const sign = product < 0 ? ~std::uint64_t{0} : 0;
    return IntermediateLargeInteger(
        bignum_s256{{static_cast<std::uint64_t>(product),
                     static_cast<std::uint64_t>(static_cast<uint128>(product) >> 64), sign, sign}});
}

bool IntermediateLargeInteger::operator==(long long other) const noexcept
{
    return bits_.limbs == IntermediateLargeInteger(other).bits_.limbs;
}

IntermediateLargeInteger
IntermediateLargeInteger::operator%(IntermediateLargeInteger const& divisor) const noexcept
{
    if (fits64(bits_.limbs) && fits64(divisor.bits_.limbs)) {
        auto const a = static_cast<std::int64_t>(bits_.limbs[0]);
        auto const b = static_cast<std::int64_t>(divisor.bits_.limbs[0]);
        return b == 0 || b == -1 ? 0 : a % b;
    }
    bignum_s256 remainder;
    bignum_s256_divide(&bits_, &divisor.bits_, nullptr, &remainder);
    return IntermediateLargeInteger(remainder);
}

IntermediateLargeInteger IntermediateLargeInteger::gcd(IntermediateLargeInteger a,
                                                       IntermediateLargeInteger b) noexcept
{
    while (!(b == 0)) {
        a = a % b;
        std::swap(a, b);
    }
    return a;
}

CMTime IntermediateLargeInteger::makeCMTime(IntermediateLargeInteger const& numerator,
                                            IntermediateLargeInteger const& denominator,
                                            bool alreadyRounded, bool forceReduce) noexcept
{
    if (!forceReduce && fits64(numerator.bits_.limbs) && denominator.bits_.limbs[0] <= 0x7FFFFFFF &&
        fits64(denominator.bits_.limbs)) {
        CMTime time = CMTimeMake(static_cast<CMTimeValue>(numerator.bits_.limbs[0]),
                                 static_cast<CMTimeScale>(denominator.bits_.limbs[0]));
        if (alreadyRounded)
            time.flags |= kCMTimeFlags_HasBeenRounded;
        return time;
    }
    if (denominator == 0)
        return kCMTimeInvalid;
    bool const negative = isNegative(numerator.bits_.limbs) != isNegative(denominator.bits_.limbs);
    Limbs const n = magnitudeOf(numerator.bits_.limbs), d = magnitudeOf(denominator.bits_.limbs);
    Limbs const common =
        gcd(IntermediateLargeInteger(bignum_s256{n}), IntermediateLargeInteger(bignum_s256{d}))
            .bits_.limbs;
    Limbs rest;
    return timeFromReduced(divide(n, common, rest), divide(d, common, rest), negative,
                           alreadyRounded);
}
