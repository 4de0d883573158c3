#pragma once

#include <korvane/time/VexTimeRanges.h>

#include <optional>

namespace kv {

/// The object that an element belongs to; null for a plain range.
NSObject const* objectOf(VexTimeRangeObj const* range) noexcept;

// Adding and subtracting whole sets in one pass over their sorted ends, with the results of doing
// it range by range. That needs exact arithmetic: nothing comes back unless all times are infinite
// or can be written as whole ticks of one timescale.

std::optional<VexTimeRangeArray> addBySweep(VexTimeRangeArray const& array,
                                            VexTimeRangeArray const& added, bool keepObjectsApart);
std::optional<VexTimeRangeArray> subtractBySweep(VexTimeRangeArray const& array,
                                                 VexTimeRangeArray const& subtracted);

} // namespace kv
