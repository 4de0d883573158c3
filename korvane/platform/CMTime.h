#pragma once

#include <korvane/foundation/KVExport.h>

#include <cstdint>

using CMTimeValue = std::int64_t;
using CMTimeScale = std::int32_t;
using CMTimeEpoch = std::int64_t;

/// Bits of `CMTime::flags`.
enum CMTimeFlags : std::uint32_t {
    kCMTimeFlags_Valid = 1u << 0,
    kCMTimeFlags_HasBeenRounded = 1u << 1,
    kCMTimeFlags_PositiveInfinity = 1u << 2,
    kCMTimeFlags_NegativeInfinity = 1u << 3,
    kCMTimeFlags_Indefinite = 1u << 4,
    kCMTimeFlags_ImpliedValueFlagsMask =
        kCMTimeFlags_PositiveInfinity | kCMTimeFlags_NegativeInfinity | kCMTimeFlags_Indefinite,
};

/// What becomes of a value that lies between two ticks.
enum CMTimeRoundingMethod : std::uint32_t {
    kCMTimeRoundingMethod_RoundHalfAwayFromZero = 1,
    kCMTimeRoundingMethod_RoundTowardZero = 2,
    kCMTimeRoundingMethod_RoundAwayFromZero = 3,
    /// Any other number means this one too.
    kCMTimeRoundingMethod_Default = kCMTimeRoundingMethod_RoundHalfAwayFromZero,
};

/// A time as a fraction: `value / timescale` seconds, on the timeline `epoch`.
///
///     CMTime frame = CMTimeMake(1001, 30000);   // one frame of 29.97
///     CMTime two = CMTimeAdd(frame, frame);     // 2002/30000
///
/// It is numeric when `(flags & 0x1D) == kCMTimeFlags_Valid`; otherwise it is invalid, indefinite
/// or an infinity, and value and timescale mean nothing. A fraction is not reduced unless an
/// operation says so.
///
/// The operations below never trap and never wrap. What has no exact answer is rounded and carries
/// kCMTimeFlags_HasBeenRounded, which stays on in all that is made from it; what is too large is an
/// infinity; what has no answer is kCMTimeInvalid. A negative timescale counts as that of the
/// negated value; a timescale of 0 counts as invalid.
struct CMTime {
    CMTimeValue value;
    CMTimeScale timescale;
    std::uint32_t flags;
    CMTimeEpoch epoch;
};

// --- Make ---

inline constexpr CMTime kCMTimeInvalid = {0, 0, 0, 0};
inline constexpr CMTime kCMTimeZero = {0, 1, kCMTimeFlags_Valid, 0};
inline constexpr CMTime kCMTimeIndefinite = {0, 0, kCMTimeFlags_Valid | kCMTimeFlags_Indefinite, 0};
inline constexpr CMTime kCMTimePositiveInfinity = {
    0, 0, kCMTimeFlags_Valid | kCMTimeFlags_PositiveInfinity, 0};
inline constexpr CMTime kCMTimeNegativeInfinity = {
    0, 0, kCMTimeFlags_Valid | kCMTimeFlags_NegativeInfinity, 0};

/// A number: flags 1, epoch 0. Nothing is reduced or checked.
constexpr CMTime CMTimeMake(CMTimeValue value, CMTimeScale timescale) noexcept
{
    return {value, timescale, kCMTimeFlags_Valid, 0};
}

/// The floor of `seconds * timescale`, that product formed in `double`; the rounded bit if it was
/// not whole. What is too large for the timescale takes half of it, and so on down to 1, then an
/// infinity. NaN or a timescale below 1 gives invalid.
KV_EXPORT CMTime CMTimeMakeWithSeconds(double seconds, CMTimeScale timescale) noexcept;

// --- Ask ---

constexpr bool CMTimeIsValid(CMTime const& time) noexcept
{
    return (time.flags & kCMTimeFlags_Valid) != 0;
}

/// Valid, and neither indefinite nor an infinity.
constexpr bool CMTimeIsNumeric(CMTime const& time) noexcept
{
    return (time.flags & (kCMTimeFlags_Valid | kCMTimeFlags_ImpliedValueFlagsMask)) ==
           kCMTimeFlags_Valid;
}

/// Numeric and marked as rounded.
constexpr bool CMTimeIsRounded(CMTime const& time) noexcept
{
    return CMTimeIsNumeric(time) && (time.flags & kCMTimeFlags_HasBeenRounded) != 0;
}

/// Seconds: value / timescale of a number; plus or minus infinity; NaN for all else.
KV_EXPORT double CMTimeGetSeconds(CMTime time) noexcept;

/// -1, 0 or 1 in the order: minus infinity, numbers, indefinite, plus infinity, invalid. Numbers
/// compare by epoch first and then, exactly, by value: 1/2 equals 2/4. Two of any other kind are
/// equal.
KV_EXPORT std::int32_t CMTimeCompare(CMTime a, CMTime b) noexcept;

// --- Calculate ---

/// The sum, on the common timescale if both have one, else on their least common multiple if that
/// is at most 0x7FFFFFFF, else rounded (half away from zero) to the larger of the two. A sum that
/// overflows takes half of the timescale, and so on; where 1 is too large yet, an infinity.
///
/// Invalid wins over all else, then an infinity, then indefinite; opposite infinities give invalid.
/// An epoch of 0 takes the other's; two different ones give invalid.
KV_EXPORT CMTime CMTimeAdd(CMTime a, CMTime b) noexcept;
/// The difference, by the same rules; the epoch of a difference within one epoch is 0.
KV_EXPORT CMTime CMTimeSubtract(CMTime a, CMTime b) noexcept;

/// On the timescale of `time`, or on a half of it and so on as a sum is. An infinity times 0 is
/// invalid.
KV_EXPORT CMTime CMTimeMultiply(CMTime time, std::int64_t multiplier) noexcept;

/// The exact product with the value that the `double` stands for, on the timescale of `time` if it
/// can be; else as a reduced fraction if it can be; else rounded, half away from zero, on the
/// larger of the timescale and 65536, or on a half of that and so on as a sum is. NaN, or an
/// infinity times 0, gives invalid.
KV_EXPORT CMTime CMTimeMultiplyByFloat64(CMTime time, double multiplier) noexcept;

/// The same time on another timescale. An overflow gives an infinity. What is not numeric comes
/// back as it is, before a new timescale below 1 makes the result invalid.
KV_EXPORT CMTime CMTimeConvertScale(CMTime time, CMTimeScale newTimescale,
                                    CMTimeRoundingMethod method) noexcept;
