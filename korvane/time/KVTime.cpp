#include <korvane/time/KVTime.h>

#include <korvane/foundation/KVPrint.h>
#include <korvane/platform/Int128_p.h>
#include <korvane/platform/KVSaturatingCast_p.h>
#include <korvane/time/IntermediateLargeInteger_p.h>
#include <korvane/time/TimeText_p.h>

#include <algorithm>
#include <cmath>
#include <numeric>

namespace {

constexpr CMTimeScale greatestTimescale = 0x7FFFFFFF;
constexpr std::uint32_t roundedFlags = kCMTimeFlags_Valid | kCMTimeFlags_HasBeenRounded;

CMTime withoutRoundedBit(CMTime time) noexcept
{
    time.flags &= ~std::uint32_t{kCMTimeFlags_HasBeenRounded};
    return time;
}

CMTime withRoundedBit(CMTime time) noexcept
{
    time.flags |= kCMTimeFlags_HasBeenRounded;
    return time;
}

/// On that timescale, if the value can be there to the last bit and is not marked as rounded;
/// `ticks` is its value.
bool isExactOn(CMTimeScale timescale, CMTime const& time, std::int64_t* ticks) noexcept
{
    CMTime const there = CMTimeConvertScale(time, timescale, kCMTimeRoundingMethod_RoundTowardZero);
    *ticks = there.value;
    return CMTimeIsNumeric(there) && !CMTimeIsRounded(there);
}

std::uint64_t gcd(std::int64_t a, std::int64_t b) noexcept
{
    return std::gcd(kv::magnitude(a), kv::magnitude(b));
}

std::int64_t dividedBy(std::int64_t value, std::uint64_t divisor) noexcept
{
    return kv::withSign(value < 0, kv::magnitude(value) / divisor);
}

} // namespace

// --- Add, multiply, divide ---

bool SimpCMTime(CMTime* time) noexcept
{
    if (!CMTimeIsNumeric(*time))
        return false;
    std::uint64_t const common = gcd(time->value, time->timescale);
    if (common < 2)
        return false;
    time->value = dividedBy(time->value, common);
    time->timescale = static_cast<CMTimeScale>(dividedBy(time->timescale, common));
    return true;
}

namespace {

/// Numbers on one timescale, which is the usual case.
bool areAlike(CMTime const& a, CMTime const& b) noexcept
{
    return a.timescale == b.timescale && a.timescale != 0 && a.flags == kCMTimeFlags_Valid &&
           b.flags == kCMTimeFlags_Valid && (a.epoch | b.epoch) == 0;
}

template <CMTime (*operation)(CMTime, CMTime)>
CMTime safer(CMTime a, CMTime b) noexcept
{
    CMTime const result = operation(a, b);
    if (!CMTimeIsRounded(result) || ((a.flags | b.flags) & kCMTimeFlags_HasBeenRounded))
        return result;
    bool const reducedA = SimpCMTime(&a), reducedB = SimpCMTime(&b);
    return reducedA || reducedB ? operation(a, b) : result;
}

} // namespace

CMTime KV_CMTimeSaferAdd(CMTime a, CMTime b) noexcept
{
    CMTimeValue sum;
    if (areAlike(a, b) && !__builtin_add_overflow(a.value, b.value, &sum))
        return CMTimeMake(sum, a.timescale);
    return safer<CMTimeAdd>(a, b);
}

CMTime KV_CMTimeSaferSubtract(CMTime a, CMTime b) noexcept
{
    CMTimeValue difference;
    if (areAlike(a, b) && !__builtin_sub_overflow(a.value, b.value, &difference))
        return CMTimeMake(difference, a.timescale);
    return safer<CMTimeSubtract>(a, b);
}

CMTime KV_CMTimeMultiply64Divide64(CMTime time, std::int64_t multiplier,
                                   std::int64_t divisor) noexcept
{
    if (divisor == 0)
        return kCMTimeInvalid;
    if (!CMTimeIsNumeric(time))
        return CMTimeMultiplyByFloat64(time, static_cast<double>(multiplier) /
                                                 static_cast<double>(divisor));
    if (time.timescale == 0)
        return kCMTimeInvalid;

    std::int64_t numerator, denominator;
    if (!__builtin_mul_overflow(time.value, multiplier, &numerator) &&
        !__builtin_mul_overflow(std::int64_t{time.timescale}, divisor, &denominator) &&
        denominator >= 0 && denominator <= greatestTimescale) {
        // On the timescale of the time this would be numerator / divisor ticks.
        bool const isRounded = CMTimeIsRounded(time);
        if (divisor > 1 && !isRounded && numerator % divisor == 0)
            return CMTimeMake(numerator / divisor, time.timescale);
        return {numerator, static_cast<CMTimeScale>(denominator),
                isRounded ? roundedFlags : kCMTimeFlags_Valid, 0};
    }
    CMTime const result = kv::timeFromFactors({time.value, multiplier}, {time.timescale, divisor},
                                              CMTimeIsRounded(time));
    std::int64_t ticks;
    if (result.timescale > time.timescale && !CMTimeIsRounded(result) &&
        isExactOn(time.timescale, result, &ticks))
        return CMTimeMake(ticks, time.timescale);
    return result;
}

CMTime KV_CMTimeHalve(CMTime time) noexcept
{
    if (!CMTimeIsNumeric(time))
        return time;
    if (time.value % 2 == 0) {
        time.value /= 2;
        return time;
    }
    if (time.timescale <= 0x3FFFFFFF && time.timescale >= -0x40000000) {
        time.timescale *= 2;
        return time;
    }
    std::uint64_t const common = gcd(time.value, time.timescale);
    if (common >= 2) {
        time.value = dividedBy(time.value, common);
        time.timescale = static_cast<CMTimeScale>(dividedBy(time.timescale, common) * 2);
        return time;
    }
    _KVLogMessage(__FILE__, __LINE__,
                  "KV_CMTimeHalve: WARNING: Halving CMTime %lld/%d is falling back to "
                  "CMTimeMultiplyByFloat64 - loss of precision",
                  static_cast<long long>(time.value), time.timescale);
    return withRoundedBit(CMTimeMultiplyByFloat64(time, 0.5));
}

CMTime operator*(CMTime const& a, CMTime const& b) noexcept
{
    return KV_CMTimeMultiply64Divide64(a, b.value, b.timescale);
}

CMTime operator*(CMTime const& time, double factor) noexcept
{
    return CMTimeMultiplyByFloat64(time, factor);
}

CMTime operator*(double factor, CMTime const& time) noexcept
{
    return CMTimeMultiplyByFloat64(time, factor);
}

CMTime operator*(CMTime const& time, int factor) noexcept
{
    return CMTimeMultiply(time, factor);
}

CMTime operator*(int factor, CMTime const& time) noexcept
{
    return CMTimeMultiply(time, factor);
}

CMTime operator*(CMTime const& time, unsigned int factor) noexcept
{
    return CMTimeMultiply(time, factor);
}

CMTime operator*(unsigned int factor, CMTime const& time) noexcept
{
    return CMTimeMultiply(time, factor);
}

CMTime operator/(CMTime const& a, CMTime const& b) noexcept
{
    return KV_CMTimeMultiply64Divide64(a, b.timescale, b.value);
}

CMTime operator/(CMTime const& time, int divisor) noexcept
{
    return KV_CMTimeMultiply64Divide64(time, 1, divisor);
}

CMTime operator/(CMTime const& time, unsigned int divisor) noexcept
{
    return KV_CMTimeMultiply64Divide64(time, 1, divisor);
}

CMTime operator/(CMTime const& time, double divisor) noexcept
{
    if (!std::isfinite(divisor))
        return kCMTimeInvalid;
    std::int64_t scale = time.timescale;
    while (scale != 0 && std::abs(scale) <= 65536) {
        double const s = static_cast<double>(scale);
        if (std::fabs(std::floor(s * divisor) / s - divisor) < 1e-5)
            break;
        scale *= 2;
    }
    return KV_CMTimeMultiply64Divide64(
        time, scale, kvSaturatingCast<std::int64_t>(static_cast<double>(scale) * divisor));
}

// --- Ask ---

bool KV_CMTimeIsNegative(CMTime time) noexcept
{
    if (CMTimeIsNumeric(time))
        return (time.value < 0) != (time.timescale < 0);
    constexpr std::uint32_t negativeInfinity = kCMTimeFlags_Valid | kCMTimeFlags_NegativeInfinity;
    return (time.flags & negativeInfinity) == negativeInfinity;
}

std::uint32_t GetCMTimeHash(CMTime time) noexcept
{
    if (time.timescale == 0)
        return 0;
    auto const shifted = static_cast<std::int64_t>(static_cast<std::uint64_t>(time.value) << 10);
    if (time.timescale == -1)
        return static_cast<std::uint32_t>(0 - static_cast<std::uint64_t>(shifted));
    return static_cast<std::uint32_t>(shifted / time.timescale);
}

// --- Samples and frames ---

std::int64_t KV_CMTimeGetSampleNumber(CMTime time, CMTime sampleDuration) noexcept
{
    if (time.timescale == 0 || !CMTimeIsNumeric(time) || sampleDuration.timescale == 0 ||
        sampleDuration.value == 0) {
        constexpr std::uint32_t indefinite = kCMTimeFlags_Valid | kCMTimeFlags_Indefinite;
        if ((sampleDuration.flags & indefinite) != indefinite && sampleDuration.value != 0)
            _KVLogMessage(__FILE__, __LINE__,
                          "error: KV_CMTimeGetSampleNumber t.timescale == 0 || Non-Numeric(t) || "
                          "Invalid(t) || sampleDuration.timescale == 0 || sampleDuration.value == "
                          "0 (t=%s, sd=%s)",
                          kv::fractionText(time).c_str(), kv::fractionText(sampleDuration).c_str());
        return 0;
    }
    std::int64_t ticks;
    if (isExactOn(sampleDuration.timescale, time, &ticks))
        return kv::quotient(ticks, sampleDuration.value);
    if (isExactOn(time.timescale, sampleDuration, &ticks))
        return ticks == 0 ? 0 : kv::quotient(time.value, ticks);
    return kvSaturatingCast<std::int64_t>(CMTimeGetSeconds(time) /
                                          CMTimeGetSeconds(sampleDuration));
}

CMTime KV_CMTimeFromSampleNumberAndDuration(std::int64_t number, CMTime sampleDuration) noexcept
{
    if (number >= INT32_MIN && number <= INT32_MAX)
        return CMTimeMultiply(sampleDuration, number);
    return KV_CMTimeMultiply64Divide64(sampleDuration, number, 1);
}

CMTime KV_CMTimeGetSampleTime(CMTime time, CMTime sampleDuration) noexcept
{
    return KV_CMTimeFromSampleNumberAndDuration(KV_CMTimeGetSampleNumber(time, sampleDuration),
                                                sampleDuration);
}

namespace {

bool isGrid(CMTime const& frame) noexcept
{
    return CMTimeIsNumeric(frame) && CMTimeCompare(frame, kCMTimeZero) != 0;
}

/// The nearest grid point downward or upward.
CMTime onGrid(CMTime const& time, CMTime const& frame, bool upward) noexcept
{
    if (!CMTimeIsNumeric(time) || !isGrid(frame))
        return time;
    CMTime ticks = CMTimeConvertScale(time, frame.timescale,
                                      KV_CMTimeIsNegative(time) == upward
                                          ? kCMTimeRoundingMethod_RoundTowardZero
                                          : kCMTimeRoundingMethod_RoundAwayFromZero);
    if (!CMTimeIsNumeric(ticks))
        return ticks;
    if (frame.value >= 2) {
        kv::int128 const value = ticks.value;
        kv::int128 const step = frame.value;
        kv::int128 const point = upward ? (value < 0 ? value / step : (value + step - 1) / step)
                                        : (value < 0 ? (value - step + 1) / step : value / step);
        if (point * step > INT64_MAX)
            return kCMTimePositiveInfinity;
        if (point * step < INT64_MIN)
            return kCMTimeNegativeInfinity;
        ticks.value = static_cast<std::int64_t>(point * step);
    }
    return withoutRoundedBit(ticks);
}

} // namespace

CMTime KV_CMTimeFloorToSampleDuration(CMTime time, CMTime frame) noexcept
{
    return onGrid(time, frame, false);
}

CMTime KV_CMTimeCeilingToSampleDuration(CMTime time, CMTime frame) noexcept
{
    return onGrid(time, frame, true);
}

CMTime KV_CMTimeRoundToSampleDuration(CMTime time, CMTime frame) noexcept
{
    if (!CMTimeIsNumeric(time) || !isGrid(frame))
        return time;
    CMTime const floor = onGrid(time, frame, false), ceiling = onGrid(time, frame, true);
    if (!CMTimeIsNumeric(floor) || !CMTimeIsNumeric(ceiling))
        return CMTimeIsNumeric(floor) ? floor : ceiling;
    // time - floor < ceiling - time, both sides times both timescales: below 2^97.
    kv::int128 const twice = kv::int128{2} * time.value * floor.timescale;
    kv::int128 const ends = (kv::int128{floor.value} + ceiling.value) * time.timescale;
    return (time.timescale < 0 ? twice > ends : twice < ends) ? floor : ceiling;
}

CMTime KV_CMTimeRemap(CMTime time, CMTime oldDuration, CMTime newDuration, bool exact) noexcept
{
    if (CMTimeCompare(oldDuration, newDuration) == 0)
        return time;
    if (CMTimeCompare(oldDuration, kCMTimeZero) == 0 || !CMTimeIsNumeric(oldDuration) ||
        !CMTimeIsNumeric(newDuration))
        return kCMTimeInvalid;
    if (!CMTimeIsNumeric(time))
        return time;
    if (!exact)
        return KV_CMTimeFromSampleNumberAndDuration(KV_CMTimeGetSampleNumber(time, oldDuration),
                                                    newDuration);

    // Equal timescales of the time and the old duration cancel, even where both are 0.
    bool const cancel = time.timescale == oldDuration.timescale;
    std::int64_t const oldScale = cancel ? 1 : oldDuration.timescale;
    std::int64_t const timeScale = cancel ? 1 : time.timescale;
    if (oldDuration.value == 0 || timeScale == 0 || newDuration.timescale == 0)
        return kCMTimeInvalid;
    return kv::timeFromFactors({time.value, newDuration.value, oldScale},
                               {oldDuration.value, timeScale, newDuration.timescale},
                               CMTimeIsRounded(time));
}

namespace {

struct Alias {
    CMTime duration;
    CMTime alias;
};

/// Exact hundredths of the broadcast rates.
constexpr Alias sStandardAliasList[] = {
    {CMTimeMake(100, 2997), CMTimeMake(1001, 30000)},
    {CMTimeMake(50, 2997), CMTimeMake(1001, 60000)},
    {CMTimeMake(125, 2997), CMTimeMake(1001, 24000)},
};

/// Film rate as files have it that cut or rounded it to two places.
constexpr Alias sWorkaroundAliasList[] = {
    {CMTimeMake(100, 2397), CMTimeMake(1001, 24000)},
    {CMTimeMake(100, 2398), CMTimeMake(1001, 24000)},
};

} // namespace

CMTime KV_CMTimeGetPreferredSampleDurationAlias(CMTime duration) noexcept
{
    for (Alias const& row : sStandardAliasList)
        if (CMTimeCompare(duration, row.duration) == 0)
            return row.alias;
    for (Alias const& row : sWorkaroundAliasList)
        if (CMTimeCompare(duration, row.duration) == 0)
            return row.alias;
    return duration;
}

// --- From seconds ---

CMTime KV_CMTimeMakeWithSecondsRoundToNearest(double seconds, CMTimeScale timescale) noexcept
{
    return CMTimeMakeWithSeconds(seconds + 0.5 / timescale, timescale);
}

CMTime KV_CMTimeMakeWithSecondsRoundToCeiling(double seconds, CMTimeScale timescale) noexcept
{
    double const ticks = seconds * timescale;
    double const nearest = std::round(ticks);
    if (std::fabs(ticks - nearest) >= 1e-7)
        seconds += 1.0 / timescale;
    // The floor of a product just below a tick would leave it.
    else if (ticks < nearest && timescale > 0)
        return withRoundedBit(CMTimeMake(static_cast<CMTimeValue>(nearest), timescale));
    return CMTimeMakeWithSeconds(seconds, timescale);
}
