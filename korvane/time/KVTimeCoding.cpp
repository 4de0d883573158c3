#include <korvane/time/KVTimeCoding.h>

#include <korvane/foundation/KVNSRef.h>
#include <korvane/platform/CFNumber.h>
#include <korvane/time/KVTime.h>

#include <cstring>

// --- Archives ---

namespace {

template <class Record>
std::optional<Record> decodeRecord(NSCoder& coder, std::string_view key)
{
    auto const bytes = coder.decodeBytes(key);
    Record record;
    if (!bytes || bytes->size() != sizeof record)
        return std::nullopt;
    std::memcpy(&record, bytes->data(), sizeof record);
    return record;
}

} // namespace

static_assert(sizeof(CMTime) == 24 && sizeof(CMTimeRange) == 48);

void KVEncodeCMTime(NSCoder& coder, CMTime const& time, std::string_view key)
{
    coder.encodeBytes(&time, sizeof time, key);
}

std::optional<CMTime> KVDecodeCMTime(NSCoder& coder, std::string_view key)
{
    return decodeRecord<CMTime>(coder, key);
}

void KVEncodeCMTimeRange(NSCoder& coder, CMTimeRange const& range, std::string_view key)
{
    coder.encodeBytes(&range, sizeof range, key);
}

std::optional<CMTimeRange> KVDecodeCMTimeRange(NSCoder& coder, std::string_view key)
{
    auto range = decodeRecord<CMTimeRange>(coder, key);
    if (range && KV_CMTimeIsNegative(range->duration))
        range->duration = kCMTimeZero;
    return range;
}

// --- Dictionaries ---

namespace {

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
    auto const dictionary = KVMakeRef<NSMutableDictionary>();
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
    auto const dictionary = KVMakeRef<NSMutableDictionary>();
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
