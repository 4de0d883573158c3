#pragma once

#include <korvane/platform/CMTimeRange.h>
#include <korvane/platform/NSCoder.h>

#include <optional>
#include <string_view>

// Times in archives: the record as it lies in memory, value, timescale, flags and epoch in the
// machine's byte order; 24 bytes a time, 48 a range. Nothing is read back when the key is missing
// or its block has another size.

KV_EXPORT void KVEncodeCMTime(NSCoder& coder, CMTime const& time, std::string_view key);
KV_EXPORT std::optional<CMTime> KVDecodeCMTime(NSCoder& coder, std::string_view key);

KV_EXPORT void KVEncodeCMTimeRange(NSCoder& coder, CMTimeRange const& range, std::string_view key);
/// A negative duration comes back as 0.
KV_EXPORT std::optional<CMTimeRange> KVDecodeCMTimeRange(NSCoder& coder, std::string_view key);
