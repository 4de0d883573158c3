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

/// A time as a fraction: `value / timescale` seconds, on the timeline `epoch`.
///
///     CMTime frame = CMTimeMake(1001, 30000);   // one frame of 29.97
///
/// It is a number when `(flags & 0x1D) == kCMTimeFlags_Valid`; otherwise it is invalid, indefinite
/// or an infinity, and value and timescale mean nothing.
struct CMTime {
    CMTimeValue value;
    CMTimeScale timescale;
    std::uint32_t flags;
    CMTimeEpoch epoch;
};

/// A number: flags 1, epoch 0. Nothing is reduced or checked.
constexpr CMTime CMTimeMake(CMTimeValue value, CMTimeScale timescale) noexcept
{
    return {value, timescale, kCMTimeFlags_Valid, 0};
}

/// Seconds: value / timescale of a number; plus or minus infinity; NaN for all else.
KV_EXPORT double CMTimeGetSeconds(CMTime time) noexcept;
