#include <korvane/time/KVTimeRange.h>

#include <korvane/foundation/KVNSRef.h>
#include <korvane/platform/CFNumber.h>
#include <korvane/platform/KVSaturatingCast_p.h>
#include <korvane/time/KVTime.h>

#include <cmath>
#include <optional>

namespace {

bool isEarlier(CMTime const& a, CMTime const& b) noexcept
{
    return CMTimeCompare(a, b) < 0;
}

CMTime const& earlier(CMTime const& a, CMTime const& b) noexcept
{
    return isEarlier(b, a) ? b : a;
}

CMTime const& later(CMTime const& a, CMTime const& b) noexcept
{
    return isEarlier(a, b) ? b : a;
}

bool isEqual(CMTime const& a, CMTime const& b) noexcept
{
    return CMTimeCompare(a, b) == 0;
}

} // namespace

// --- Make ---

CMTimeRange CMTimeRangeSaferMake(CMTime start, CMTime duration) noexcept
{
    CMTimeRange range = {start, KV_CMTimeIsNegative(duration) ? kCMTimeZero : duration};
    if (CMTimeIsRounded(CMTimeAdd(start, duration)) &&
        !((start.flags | duration.flags) & kCMTimeFlags_HasBeenRounded)) {
        SimpCMTime(&range.start);
        SimpCMTime(&range.duration);
    }
    return range;
}

CMTimeRange KV_CMTimeRangeMakeWithStartEnd(CMTime start, CMTime end) noexcept
{
    if (isEqual(start, kCMTimeNegativeInfinity) && CMTimeIsNumeric(end))
        start = CMTimeSubtract(end, kKV_CMTimeOneYear);
    return CMTimeRangeSaferMake(start, KV_CMTimeSaferSubtract(end, start));
}

CMTimeRange CMTimeRangeFromTimeToTime(CMTime start, CMTime end) noexcept
{
    return {start, KV_CMTimeSaferSubtract(end, start)};
}

CMTimeRange KV_CMTimeRangeMakeByAddingOffset(CMTimeRange const& range, CMTime offset) noexcept
{
    return CMTimeRangeSaferMake(KV_CMTimeSaferAdd(range.start, offset), range.duration);
}

CMTimeRange KV_CMTimeRangeMakeBySubtractingOffset(CMTimeRange const& range, CMTime offset) noexcept
{
    return CMTimeRangeSaferMake(KV_CMTimeSaferSubtract(range.start, offset), range.duration);
}

CMTimeRange KV_CMTimeRangeUnion(CMTimeRange const& a, CMTimeRange const& b) noexcept
{
    CMTime const start = earlier(a.start, b.start);
    CMTime const end = later(KV_CMTimeRangeEnd(a), KV_CMTimeRangeEnd(b));
    if (isEqual(start, kCMTimeNegativeInfinity) && isEqual(end, kCMTimePositiveInfinity))
        return {kCMTimeNegativeInfinity, kCMTimePositiveInfinity};
    return KV_CMTimeRangeMakeWithStartEnd(start, end);
}

CMTimeRange VexTimeRangeAdjustToBeWithinRangeWithMinimumDuration(CMTimeRange const& range,
                                                                 CMTimeRange const& outer,
                                                                 CMTime minimumDuration) noexcept
{
    CMTime const outerEnd = KV_CMTimeRangeEnd(outer);
    CMTimeRange moved = {range.start, later(range.duration, minimumDuration)};
    if (isEarlier(outerEnd, KV_CMTimeRangeEnd(moved)))
        moved.start = KV_CMTimeSaferSubtract(outerEnd, moved.duration);
    moved.start = later(moved.start, outer.start);
    return KV_CMTimeRangeMakeWithStartEnd(moved.start, earlier(KV_CMTimeRangeEnd(moved), outerEnd));
}

// --- Ask ---

CMTime KV_CMTimeRangeEnd(CMTimeRange const& range) noexcept
{
    constexpr std::uint32_t negative = kCMTimeFlags_Valid | kCMTimeFlags_NegativeInfinity;
    constexpr std::uint32_t positive = kCMTimeFlags_Valid | kCMTimeFlags_PositiveInfinity;
    if ((range.start.flags & negative) == negative && (range.duration.flags & positive) == positive)
        return kCMTimePositiveInfinity;
    return KV_CMTimeSaferAdd(range.start, range.duration);
}

KVString KV_CMTimeRangeToString(CMTimeRange const& range)
{
    KVString text("[");
    text.append(KV_CMTimeToString(range.start));
    text.append(", ");
    text.append(KV_CMTimeToString(KV_CMTimeRangeEnd(range)));
    text.append(")");
    return text;
}

// --- Pairs ---

KVCMTimePair VexTimePairMakeByAddingOffset(KVCMTimePair const& pair, CMTime offset) noexcept
{
    return {KV_CMTimeSaferAdd(pair.first, offset), KV_CMTimeSaferAdd(pair.second, offset)};
}

CMTime VexTimePairSecondMinusFirst(KVCMTimePair const& pair) noexcept
{
    return KV_CMTimeSaferSubtract(pair.second, pair.first);
}

// --- Frame numbers ---

namespace {

long long sample(CMTime time, CMTime sampleDuration) noexcept
{
    return KV_CMTimeGetSampleNumber(time, sampleDuration);
}

} // namespace

KVString VexTimeToSampleString(CMTime time, CMTime sampleDuration)
{
    return KVString::ssprintf("%lld", sample(time, sampleDuration));
}

KVString VexTimeCopySampleString(CMTime time, CMTime sampleDuration)
{
    return VexTimeToSampleString(time, sampleDuration);
}

KVString VexTimeRangeToSampleString(CMTimeRange const& range, CMTime sampleDuration)
{
    return KVString::ssprintf("[%lld,%lld)", sample(range.start, sampleDuration),
                              sample(KV_CMTimeRangeEnd(range), sampleDuration));
}

double VexTimeToRealFrameWithRate(CMTime const& time, double rate) noexcept
{
    return CMTimeGetSeconds(time) * rate;
}

std::int64_t VexTimeToFrameWithRate(CMTime const& time, double rate) noexcept
{
    return kvSaturatingCast<std::int64_t>(
        std::floor(VexTimeToRealFrameWithRate(time, rate) + 1e-7));
}

// --- Dictionaries ---

namespace {

using Dictionary = KVCFRef<CFMutableDictionaryRef>;

Dictionary makeDictionary()
{
    return Dictionary::adopt(CFDictionaryCreateMutable(kCFAllocatorDefault, 0));
}

void setNumber(CFMutableDictionaryRef dictionary, std::string_view key, std::int64_t number)
{
    auto const boxed = KVMakeRef<NSNumber>(static_cast<long long>(number));
    dictionary->setValue(key, boxed);
}

std::optional<std::int64_t> numberOf(CFDictionaryRef dictionary, std::string_view key) noexcept
{
    auto const* number = dynamic_cast<NSNumber const*>(dictionary->value(key));
    return number ? std::optional(number->int64Value()) : std::nullopt;
}

} // namespace

KVCFRef<CFDictionaryRef> CMTimeCopyAsDictionary(CMTime const& time)
{
    Dictionary const dictionary = makeDictionary();
    setNumber(dictionary, "value", time.value);
    setNumber(dictionary, "timescale", time.timescale);
    setNumber(dictionary, "flags", time.flags);
    setNumber(dictionary, "epoch", time.epoch);
    return dictionary;
}

CMTime CMTimeMakeFromDictionary(CFDictionaryRef dictionary) noexcept
{
    if (!dictionary)
        return kCMTimeInvalid;
    auto const value = numberOf(dictionary, "value"), timescale = numberOf(dictionary, "timescale");
    auto const flags = numberOf(dictionary, "flags"), epoch = numberOf(dictionary, "epoch");
    if (!value || !timescale || !flags || !epoch || *timescale < INT32_MIN ||
        *timescale > INT32_MAX || *flags < 0 || *flags > UINT32_MAX)
        return kCMTimeInvalid;
    return {*value, static_cast<CMTimeScale>(*timescale), static_cast<std::uint32_t>(*flags),
            *epoch};
}

KVCFRef<CFDictionaryRef> CMTimeRangeCopyAsDictionary(CMTimeRange const& range)
{
    Dictionary const dictionary = makeDictionary();
    dictionary->setValue("start", CMTimeCopyAsDictionary(range.start));
    dictionary->setValue("duration", CMTimeCopyAsDictionary(range.duration));
    return dictionary;
}

CMTimeRange CMTimeRangeMakeFromDictionary(CFDictionaryRef dictionary) noexcept
{
    auto const time = [&](std::string_view key) {
        return dictionary
                   ? CMTimeMakeFromDictionary(dynamic_cast<CFDictionaryRef>(dictionary->value(key)))
                   : kCMTimeInvalid;
    };
    CMTime const duration = time("duration");
    return {time("start"), KV_CMTimeIsNegative(duration) ? kCMTimeZero : duration};
}
