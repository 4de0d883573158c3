#pragma once

#include <korvane/time/IntermediateLargeInteger.h>

#include <initializer_list>

namespace kv {

/// The product of the numerators over that of the denominators, which are not 0, as
/// IntermediateLargeInteger::makeCMTime gives it when it is told to reduce.
///
/// The numerator is reduced with one denominator after the other, each of 64 bits: that leaves the
/// same fraction as one reduction with their product, and is much faster. At most three factors on
/// either side.
CMTime timeFromFactors(std::initializer_list<std::int64_t> numerators,
                       std::initializer_list<std::int64_t> denominators,
                       bool alreadyRounded) noexcept;

} // namespace kv
