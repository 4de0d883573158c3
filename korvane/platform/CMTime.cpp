#include <korvane/platform/CMTime.h>

#include <korvane/platform/Int128_p.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <numeric>

using kv::uint128;

namespace {

constexpr std::uint32_t greatestTimescale = 0x7FFFFFFF;

/// In the order of CMTimeCompare.
enum class Kind { negativeInfinity, numeric, indefinite, positiveInfinity, invalid };

Kind kindOf(CMTime const& time) noexcept
{
    if (!CMTimeIsValid(time))
        return Kind::invalid;
    if (time.flags & kCMTimeFlags_PositiveInfinity)
        return Kind::positiveInfinity;
    if (time.flags & kCMTimeFlags_NegativeInfinity)
        return Kind::negativeInfinity;
    if (time.flags & kCMTimeFlags_Indefinite)
        return Kind::indefinite;
    return time.timescale == 0 ? Kind::invalid : Kind::numeric;
}

bool isInfinite(Kind kind) noexcept
{
    return kind == Kind::negativeInfinity || kind == Kind::positiveInfinity;
}

CMTime infinity(bool negative) noexcept
{
    return negative ? kCMTimeNegativeInfinity : kCMTimePositiveInfinity;
}

std::uint32_t roundedBit(CMTime const& time) noexcept
{
    return time.flags & kCMTimeFlags_HasBeenRounded;
}

bool isNegative(CMTime const& number) noexcept
{
    return (number.value < 0) != (number.timescale < 0);
}

std::uint32_t timescaleOf(CMTime const& number) noexcept
{
    return static_cast<std::uint32_t>(kv::magnitude(number.timescale));
}

/// A number of seconds, exactly. The denominator is not 0 and stays below 2^96, so that times a
/// timescale it fits 128 bits.
struct Fraction {
    bool negative;
    uint128 numerator;
    uint128 denominator;
};

/// A count of ticks without its sign.
struct Ticks {
    uint128 count;
    bool exact;

    bool fits(bool negative) const noexcept { return count <= kv::greatestMagnitude(negative); }
};

template <class Integer>
bool isRoundedUp(Integer left, Integer denominator, CMTimeRoundingMethod method) noexcept
{
    switch (method) {
    case kCMTimeRoundingMethod_RoundAwayFromZero:
        return left != 0;
    case kCMTimeRoundingMethod_RoundTowardZero:
        return false;
    default:
        return left >= denominator - left;
    }
}

Ticks ticksOf(Fraction const& seconds, std::uint32_t timescale,
              CMTimeRoundingMethod method) noexcept
{
    // Mostly all of it fits 64 bits, which divide much faster.
    std::uint64_t product;
    if (seconds.numerator <= UINT64_MAX && seconds.denominator <= UINT64_MAX &&
        !__builtin_mul_overflow(static_cast<std::uint64_t>(seconds.numerator), timescale,
                                &product)) {
        auto const denominator = static_cast<std::uint64_t>(seconds.denominator);
        std::uint64_t const ticks = product / denominator, left = product % denominator;
        return {uint128{ticks} + isRoundedUp(left, denominator, method), left == 0};
    }
    uint128 const whole = seconds.numerator / seconds.denominator;
    if (whole >> 64)
        return {~uint128{0}, false};
    uint128 const rest = (seconds.numerator - whole * seconds.denominator) * timescale;
    uint128 const ticks = rest / seconds.denominator;
    uint128 const left = rest - ticks * seconds.denominator;
    return {whole * timescale + ticks + isRoundedUp(left, seconds.denominator, method), left == 0};
}

CMTime make(bool negative, uint128 count, std::uint32_t timescale, std::uint32_t flags,
            CMTimeEpoch epoch) noexcept
{
    return {kv::withSign(negative, static_cast<std::uint64_t>(count)),
            static_cast<CMTimeScale>(timescale), flags, epoch};
}

/// On `timescale` or the first of its halves that holds the value; an infinity when 1 does not.
CMTime nearest(Fraction const& seconds, std::uint32_t timescale, std::uint32_t flags,
               CMTimeEpoch epoch) noexcept
{
    for (std::uint32_t scale = std::min(timescale, greatestTimescale); scale != 0; scale /= 2) {
        Ticks const ticks = ticksOf(seconds, scale, kCMTimeRoundingMethod_RoundHalfAwayFromZero);
        if (ticks.fits(seconds.negative))
            return make(seconds.negative, ticks.count, scale,
                        flags | (ticks.exact ? 0u : kCMTimeFlags_HasBeenRounded), epoch);
    }
    return infinity(seconds.negative);
}

/// The sum of two of which not both are numeric; `kindB` is that of what is added.
CMTime sumOfKinds(Kind kindA, Kind kindB) noexcept
{
    if (kindA == Kind::invalid || kindB == Kind::invalid)
        return kCMTimeInvalid;
    if (isInfinite(kindA) && isInfinite(kindB) && kindA != kindB)
        return kCMTimeInvalid;
    if (isInfinite(kindA) || isInfinite(kindB))
        return infinity((isInfinite(kindA) ? kindA : kindB) == Kind::negativeInfinity);
    return kCMTimeIndefinite;
}

Kind negated(Kind kind) noexcept
{
    return kind == Kind::negativeInfinity   ? Kind::positiveInfinity
           : kind == Kind::positiveInfinity ? Kind::negativeInfinity
                                            : kind;
}

/// a + b or a - b.
template <bool subtract>
CMTime sum(CMTime const& a, CMTime const& b) noexcept
{
    Kind const kindA = kindOf(a), kindB = kindOf(b);
    if (kindA != Kind::numeric || kindB != Kind::numeric)
        return sumOfKinds(kindA, subtract ? negated(kindB) : kindB);

    if (a.epoch != b.epoch && a.epoch != 0 && b.epoch != 0)
        return kCMTimeInvalid;
    CMTimeEpoch const epoch = subtract && a.epoch == b.epoch ? 0 : a.epoch != 0 ? a.epoch : b.epoch;
    std::uint32_t const flags = kCMTimeFlags_Valid | roundedBit(a) | roundedBit(b);

    std::int64_t value;
    if (a.timescale == b.timescale &&
        !(subtract ? __builtin_sub_overflow(a.value, b.value, &value)
                   : __builtin_add_overflow(a.value, b.value, &value)))
        return {value, a.timescale, flags, epoch};

    std::uint32_t const scaleA = timescaleOf(a), scaleB = timescaleOf(b);
    std::uint32_t const common = std::gcd(scaleA, scaleB);
    std::uint64_t const multiple = std::uint64_t{scaleA / common} * scaleB;
    // Two values below 2^63, times a timescale each: below 2^95.
    kv::int128 const ticksA = kv::int128{a.timescale < 0 ? -1 : 1} * a.value * (scaleB / common);
    kv::int128 const ticksB = kv::int128{b.timescale < 0 ? -1 : 1} * b.value * (scaleA / common);
    kv::int128 const ticks = subtract ? ticksA - ticksB : ticksA + ticksB;
    bool const negative = ticks < 0;
    auto const count = static_cast<uint128>(negative ? -ticks : ticks);
    if (multiple <= greatestTimescale && count <= kv::greatestMagnitude(negative))
        return make(negative, count, static_cast<std::uint32_t>(multiple), flags, epoch);
    auto const timescale = multiple <= greatestTimescale ? static_cast<std::uint32_t>(multiple)
                                                         : std::max(scaleA, scaleB);
    return nearest({negative, count, multiple}, timescale, flags, epoch);
}

/// An infinity or indefinite, times a number or an infinity.
CMTime productOfKinds(Kind kind, bool zero, bool negative) noexcept
{
    if (kind == Kind::invalid || (isInfinite(kind) && zero))
        return kCMTimeInvalid;
    if (kind == Kind::indefinite)
        return kCMTimeIndefinite;
    return infinity((kind == Kind::negativeInfinity) != negative);
}

} // namespace

CMTime CMTimeMakeWithSeconds(double seconds, CMTimeScale timescale) noexcept
{
    if (timescale < 1 || std::isnan(seconds))
        return kCMTimeInvalid;
    for (CMTimeScale scale = timescale; scale != 0; scale /= 2) {
        double const ticks = seconds * scale;
        double const whole = std::floor(ticks);
        if (whole >= -0x1p63 && whole < 0x1p63)
            return {static_cast<CMTimeValue>(whole), scale,
                    kCMTimeFlags_Valid | (whole == ticks ? 0u : kCMTimeFlags_HasBeenRounded), 0};
    }
    return infinity(seconds < 0);
}

double CMTimeGetSeconds(CMTime time) noexcept
{
    using limits = std::numeric_limits<double>;
    if (!CMTimeIsValid(time))
        return limits::quiet_NaN();
    if (time.flags & kCMTimeFlags_PositiveInfinity)
        return limits::infinity();
    if (time.flags & kCMTimeFlags_NegativeInfinity)
        return -limits::infinity();
    // 0/0 would be a negative NaN on some processors, and print as one.
    if ((time.flags & kCMTimeFlags_Indefinite) || (time.timescale == 0 && time.value == 0))
        return limits::quiet_NaN();
    return static_cast<double>(time.value) / time.timescale;
}

std::int32_t CMTimeCompare(CMTime a, CMTime b) noexcept
{
    Kind const kindA = kindOf(a), kindB = kindOf(b);
    if (kindA != kindB)
        return kindA < kindB ? -1 : 1;
    if (kindA != Kind::numeric)
        return 0;
    if (a.epoch != b.epoch)
        return a.epoch < b.epoch ? -1 : 1;
    kv::int128 left = a.value, right = b.value;
    if (a.timescale != b.timescale) {
        left *= b.timescale;
        right *= a.timescale;
    }
    if (left == right)
        return 0;
    // A negative factor on either side turns the order round; on both it does so twice.
    bool const turned =
        a.timescale == b.timescale ? a.timescale < 0 : (a.timescale < 0) != (b.timescale < 0);
    return (left < right) != turned ? -1 : 1;
}

CMTime CMTimeAdd(CMTime a, CMTime b) noexcept
{
    return sum<false>(a, b);
}

CMTime CMTimeSubtract(CMTime a, CMTime b) noexcept
{
    return sum<true>(a, b);
}

CMTime CMTimeMultiply(CMTime time, std::int64_t multiplier) noexcept
{
    Kind const kind = kindOf(time);
    if (kind != Kind::numeric)
        return productOfKinds(kind, multiplier == 0, multiplier < 0);
    std::int64_t value;
    if (!__builtin_mul_overflow(time.value, multiplier, &value))
        return {value, time.timescale, kCMTimeFlags_Valid | roundedBit(time), time.epoch};
    uint128 const product = uint128{kv::magnitude(time.value)} * kv::magnitude(multiplier);
    return nearest({isNegative(time) != (multiplier < 0), product, timescaleOf(time)},
                   timescaleOf(time), kCMTimeFlags_Valid | roundedBit(time), time.epoch);
}

CMTime CMTimeMultiplyByFloat64(CMTime time, double multiplier) noexcept
{
    if (std::isnan(multiplier))
        return kCMTimeInvalid;
    Kind const kind = kindOf(time);
    if (kind != Kind::numeric)
        return productOfKinds(kind, multiplier == 0, multiplier < 0);
    bool const negative = isNegative(time) != (multiplier < 0);
    if (std::isinf(multiplier))
        return time.value == 0 ? kCMTimeInvalid : infinity(negative);
    std::uint32_t const flags = kCMTimeFlags_Valid | roundedBit(time);
    if (multiplier == 0 || time.value == 0)
        return {0, time.timescale, flags, time.epoch};

    // The product is numerator / scale * 2^exponent, with 116 bits in the numerator at most.
    int exponent;
    double const fraction = std::frexp(std::fabs(multiplier), &exponent);
    uint128 numerator =
        uint128{kv::magnitude(time.value)} * static_cast<std::uint64_t>(std::ldexp(fraction, 53));
    exponent -= 53;
    std::uint32_t scale = timescaleOf(time);
    if (scale > greatestTimescale) {
        scale /= 2;
        --exponent;
    }
    while (exponent < 0 && numerator % 2 == 0) {
        numerator /= 2;
        ++exponent;
    }
    for (; exponent > 0; --exponent) {
        if (numerator >> 126)
            return infinity(negative);
        numerator *= 2;
    }

    if (exponent == 0 && numerator <= kv::greatestMagnitude(negative))
        return make(negative, numerator, scale, flags, time.epoch);
    std::uint64_t const common =
        std::gcd(static_cast<std::uint64_t>(numerator % scale), std::uint64_t{scale});
    if (numerator / common <= kv::greatestMagnitude(negative) && exponent > -31 &&
        (std::uint64_t{scale} / common << -exponent) <= greatestTimescale)
        return make(negative, numerator / common,
                    static_cast<std::uint32_t>(scale / common << -exponent), flags, time.epoch);

    // Bits beyond the 64th behind the point cannot reach a halfway mark: one of them stands for
    // all.
    if (exponent < -64) {
        int const excess = -exponent - 64;
        numerator = excess < 128 ? numerator >> excess | 1 : 1;
        exponent = -64;
    }
    return nearest({negative, numerator, uint128{scale} << -exponent}, std::max(scale, 65536u),
                   flags, time.epoch);
}

CMTime CMTimeConvertScale(CMTime time, CMTimeScale newTimescale,
                          CMTimeRoundingMethod method) noexcept
{
    if (!CMTimeIsNumeric(time))
        return time;
    if (newTimescale < 1 || time.timescale == 0)
        return kCMTimeInvalid;
    if (time.timescale == newTimescale)
        return time;
    auto const scale = static_cast<std::uint32_t>(newTimescale);
    bool const negative = isNegative(time);
    Ticks const ticks =
        ticksOf({negative, kv::magnitude(time.value), timescaleOf(time)}, scale, method);
    if (!ticks.fits(negative))
        return infinity(negative);
    std::uint32_t const inexact = ticks.exact ? 0u : kCMTimeFlags_HasBeenRounded;
    return make(negative, ticks.count, scale, kCMTimeFlags_Valid | roundedBit(time) | inexact,
                time.epoch);
}
