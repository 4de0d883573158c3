#pragma once

#include <korvane/time/VexTimeRanges.h>

namespace kv {

/// The object that an element belongs to; null for a plain range.
NSObject const* objectOf(VexTimeRangeObj const* range) noexcept;

// Adding and subtracting whole sets in one pass over their sorted ends, with the results of doing
// it range by range. That needs exact arithmetic: false, and nothing changed, unless all times are
// infinite or can be written as whole ticks of one timescale.

bool addBySweep(VexTimeRangeArray& array, VexTimeRangeArray const& ranges, bool keepObjectsApart);
bool subtractBySweep(VexTimeRangeArray& array, VexTimeRangeArray const& ranges);

} // namespace kv
