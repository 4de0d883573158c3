#pragma once

#include <korvane/foundation/KVCFRef.h>
#include <korvane/platform/CFDictionary.h>
#include <korvane/platform/CMTimeRange.h>
#include <korvane/platform/NSCoder.h>

#include <optional>
#include <string_view>

// Times in archives and dictionaries.
//
//     KVEncodeCMTimeRange(coder, shot, "shot");
//     CMTimeRange const back = KVDecodeCMTimeRange(coder, "shot").value_or(kCMTimeRangeZero);

// --- Archives ---
//
// One block under the key: the record as it lies in memory, value, timescale, flags and epoch in
// the machine's byte order; 24 bytes a time, 48 a range. Nothing is read back when the key is
// missing or its block has another size.

KV_EXPORT void KVEncodeCMTime(NSCoder& coder, CMTime const& time, std::string_view key);
KV_EXPORT std::optional<CMTime> KVDecodeCMTime(NSCoder& coder, std::string_view key);

KV_EXPORT void KVEncodeCMTimeRange(NSCoder& coder, CMTimeRange const& range, std::string_view key);
/// A negative duration comes back as 0.
KV_EXPORT std::optional<CMTimeRange> KVDecodeCMTimeRange(NSCoder& coder, std::string_view key);

// --- Dictionaries ---

/// { "value", "timescale", "flags", "epoch" }, each a number.
KV_EXPORT KVCFRef<CFDictionaryRef> CMTimeCopyAsDictionary(CMTime const& time);
/// Invalid for null, and when a number is missing or does not fit its field.
KV_EXPORT CMTime CMTimeMakeFromDictionary(CFDictionaryRef dictionary) noexcept;
/// { "start", "duration" }, each a dictionary.
KV_EXPORT KVCFRef<CFDictionaryRef> CMTimeRangeCopyAsDictionary(CMTimeRange const& range);
/// Each time that is missing or bad is invalid; a negative duration becomes 0.
KV_EXPORT CMTimeRange CMTimeRangeMakeFromDictionary(CFDictionaryRef dictionary) noexcept;
