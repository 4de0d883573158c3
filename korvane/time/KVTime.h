#pragma once

#include <korvane/foundation/KVString.h>
#include <korvane/platform/CMTime.h>

#include <iosfwd>

// Media time that is calculated without silent loss. These operations reduce fractions before they
// add, and multiply and divide with as many bits as it takes, so that a result is rounded only when
// no CMTime could hold it.
//
//     CMTime frame = CMTimeMake(1001, 30000);
//     CMTime reel = KV_CMTimeFromSampleNumberAndDuration(30000, frame);   // 1001 seconds, exactly
//     CMTime cut = KV_CMTimeFloorToSampleDuration(CMTimeMake(352, 100), frame);   // 105105/30000
//     if (CMTimeIsRounded(frame * CMTimeMake(1, 1000000007)))
//         ...                                        // it is: no CMTime holds the exact product
//
// What cannot be calculated is kCMTimeInvalid or an infinity, what is approximate carries the
// rounded bit; nothing throws, traps or allocates (those that make text excepted). Where
// `sampleDuration` or `frame` is asked for it is the length of one sample in seconds, positive in
// all sensible use.

// --- Add, multiply, divide ---

/// The sum or difference. If it would be rounded, and neither argument is yet, both arguments are
/// reduced to lowest terms and it is tried again.
KV_EXPORT CMTime KV_CMTimeSaferAdd(CMTime a, CMTime b) noexcept;
KV_EXPORT CMTime KV_CMTimeSaferSubtract(CMTime a, CMTime b) noexcept;

/// `time * multiplier / divisor`, on the timescale of `time` if that holds it. A divisor of 0 gives
/// invalid, for an infinity as well. A small product is not reduced: 1/3 times 3 is 3/3. The epoch
/// becomes 0.
KV_EXPORT CMTime KV_CMTimeMultiply64Divide64(CMTime time, std::int64_t multiplier,
                                             std::int64_t divisor) noexcept;

/// Half of it: of the value if that is even, else on twice the timescale, else of the reduced
/// fraction. Where none of them can be, the result is rounded, and a warning logged. What is not
/// numeric comes back as it is.
KV_EXPORT CMTime KV_CMTimeHalve(CMTime time) noexcept;

/// Reduces a number to lowest terms, in place; false if it was, or is not a number.
KV_EXPORT bool SimpCMTime(CMTime* time) noexcept;

/// The product of the two in seconds, itself as a time in seconds: `KV_CMTimeMultiply64Divide64` by
/// the value and the timescale of `b`. Its flags do not count, so a mark of rounding that only `b`
/// has is lost, and an infinity, whose timescale is 0, gives invalid.
KV_EXPORT CMTime operator*(CMTime const& a, CMTime const& b) noexcept;
/// `CMTimeMultiplyByFloat64`, and `CMTimeMultiply` for integers.
KV_EXPORT CMTime operator*(CMTime const& time, double factor) noexcept;
KV_EXPORT CMTime operator*(double factor, CMTime const& time) noexcept;
KV_EXPORT CMTime operator*(CMTime const& time, int factor) noexcept;
KV_EXPORT CMTime operator*(int factor, CMTime const& time) noexcept;
KV_EXPORT CMTime operator*(CMTime const& time, unsigned int factor) noexcept;
KV_EXPORT CMTime operator*(unsigned int factor, CMTime const& time) noexcept;
/// The quotient of two times, itself as a time in seconds, by the same rules.
KV_EXPORT CMTime operator/(CMTime const& a, CMTime const& b) noexcept;
/// `KV_CMTimeMultiply64Divide64`: a divisor of 0 gives invalid.
KV_EXPORT CMTime operator/(CMTime const& time, int divisor) noexcept;
KV_EXPORT CMTime operator/(CMTime const& time, unsigned int divisor) noexcept;
/// Divides by a fraction near `divisor`, over the first of the timescale, its double, and so on to
/// 131072 that comes within 1e-5; over the last one if none does. NaN, an infinite divisor, or one
/// whose fraction is 0, gives invalid, and so does whatever has a timescale of 0.
KV_EXPORT CMTime operator/(CMTime const& time, double divisor) noexcept;

// --- Ask ---

/// Numeric: the sign of the value differs from that of the timescale, 0 counting as positive.
/// Otherwise: minus infinity.
KV_EXPORT bool KV_CMTimeIsNegative(CMTime time) noexcept;

/// The time in 1/1024 seconds, toward zero, its low 32 bits: 1/2 and 2/4 hash alike. Values beyond
/// 53 bits wrap; a timescale of 0 gives 0.
KV_EXPORT std::uint32_t GetCMTimeHash(CMTime time) noexcept;

// --- Samples and frames ---

/// Which sample the time lies in, cut toward zero: a small negative time has number 0. A time that
/// is not numeric, or a sample duration of 0 value or timescale, gives 0 and logs an error, unless
/// the duration is indefinite or its value 0.
KV_EXPORT std::int64_t KV_CMTimeGetSampleNumber(CMTime time, CMTime sampleDuration) noexcept;
/// `number * sampleDuration`.
KV_EXPORT CMTime KV_CMTimeFromSampleNumberAndDuration(std::int64_t number,
                                                      CMTime sampleDuration) noexcept;
/// The start of the sample that the time lies in.
KV_EXPORT CMTime KV_CMTimeGetSampleTime(CMTime time, CMTime sampleDuration) noexcept;

/// The last grid point at or before, the first at or after, and the nearest (half way: the later
/// one) on the grid of `frame`, negative times too; without the rounded bit, as the result is
/// exact. A frame that is 0 or not numeric gives the time as it is, and so does a time that is not
/// numeric. A grid point that does not fit is an infinity. The grid has no steps within a tick: a
/// frame value below 2 counts as 1.
KV_EXPORT CMTime KV_CMTimeFloorToSampleDuration(CMTime time, CMTime frame) noexcept;
KV_EXPORT CMTime KV_CMTimeCeilingToSampleDuration(CMTime time, CMTime frame) noexcept;
KV_EXPORT CMTime KV_CMTimeRoundToSampleDuration(CMTime time, CMTime frame) noexcept;

/// Carries a time from one frame grid to another: frame n begins at frame n or, with `exact`, the
/// result is `time * newDuration / oldDuration` as a reduced ratio. Equal durations give the time
/// as it is, whatever it is; an old duration that is 0, or either one not numeric, gives invalid;
/// then a time that is not numeric comes back as it is.
KV_EXPORT CMTime KV_CMTimeRemap(CMTime time, CMTime oldDuration, CMTime newDuration,
                                bool exact) noexcept;

/// The broadcast form of a frame duration that was written from a rounded rate: 100/2997 gives
/// 1001/30000, 50/2997 1001/60000, and 125/2997, 100/2397, 100/2398 give 1001/24000, by value. Any
/// other duration comes back as it is.
KV_EXPORT CMTime KV_CMTimeGetPreferredSampleDurationAlias(CMTime duration) noexcept;

/// Seconds times `rate`, in frames per second.
KV_EXPORT double VexTimeToRealFrameWithRate(CMTime const& time, double rate) noexcept;
/// The whole frame that this lies in, negative times too; what lies within 1e-7 frames before a
/// frame counts to it. Out of range the nearest end, NaN 0.
KV_EXPORT std::int64_t VexTimeToFrameWithRate(CMTime const& time, double rate) noexcept;

// --- From seconds ---

/// The nearest tick, half way the later one. It carries the rounded bit unless half a tick later is
/// a whole one.
KV_EXPORT CMTime KV_CMTimeMakeWithSecondsRoundToNearest(double seconds,
                                                        CMTimeScale timescale) noexcept;
/// The next tick; what lies within 1e-7 ticks of one stays on it.
KV_EXPORT CMTime KV_CMTimeMakeWithSecondsRoundToCeiling(double seconds,
                                                        CMTimeScale timescale) noexcept;

// --- Text ---

/// Seconds with six places: "3.520000", "3.520000+round", "3.520000+epoch=2", "inf"; "inval",
/// "indef".
KV_EXPORT KVString KV_CMTimeToString(CMTime time);
/// With the fraction: "3.520000(352/100)", "3.520000(352/100+epoch=2+round)"; what is not a number
/// and has no value is written as above.
KV_EXPORT KVString KV_CMTimeToFractionString(CMTime time);

/// The sample number, for logs: "105". Both are the same.
KV_EXPORT KVString VexTimeCopySampleString(CMTime time, CMTime sampleDuration);
KV_EXPORT KVString VexTimeToSampleString(CMTime time, CMTime sampleDuration);

/// The seconds in the stream's own number format, "+epoch=" and the epoch unless it is 0, "+round"
/// if rounded; "inval", "indef". A stream that has been given a timescale prints numbers on that
/// instead: "[352/100]", "[352/100 +2 +round]" (epoch 2).
KV_EXPORT std::ostream& operator<<(std::ostream& stream, CMTime const& time);

/// Gives a stream a timescale to print times on; 0 takes it away.
///
///     std::cout << KVVexTimePreferredTimeScale(600) << time;
struct KVVexTimePreferredTimeScale {
    explicit constexpr KVVexTimePreferredTimeScale(
        CMTimeScale scale, CMTimeRoundingMethod method = kCMTimeRoundingMethod_Default) noexcept
        : timescale(scale), rounding(method)
    {}

    CMTimeScale timescale;
    CMTimeRoundingMethod rounding;
};
KV_EXPORT std::ostream& operator<<(std::ostream& stream, KVVexTimePreferredTimeScale option);

/// The `iword` slots of that option, the same for all streams of the process.
KV_EXPORT int getPreferredTimeScaleIndex();
KV_EXPORT int getPreferredTimeScaleRoundingIndex();
