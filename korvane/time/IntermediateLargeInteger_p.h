#pragma once

#include <korvane/time/IntermediateLargeInteger.h>

#include <initializer_list>

namespace kv {

/// The product of the numerators over that of the denominators, which are not 0, as
/// IntermediateLargeInteger::makeCMTime gives it when it is told to reduce.
///
/// Reducing factor by factor leaves the same fraction as reducing the products would, and needs
/// 64 bits only. At most three factors on either side.
CMTime timeFromFactors(std::initializer_list<std::int64_t> numerators,
                       std::initializer_list<std::int64_t> denominators,
                       bool alreadyRounded) noexcept;

} // namespace kv
