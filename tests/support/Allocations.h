#pragma once

#include <cstddef>

/// Control over `operator new`, for a test program that lists `../support/Allocations.cpp` among
/// its sources. Use it from one thread.
namespace allocations {

/// How many allocations there have been.
long count() noexcept;
/// The largest block asked for since the last call of this.
std::size_t takeLargest() noexcept;
/// The most bytes that were held at any moment since the last call of `startPeak`, beyond what was
/// held then.
long peak() noexcept;
void startPeak() noexcept;
/// The bytes held now beyond what was held then.
long held() noexcept;
/// Lets the `number`th allocation from now throw std::bad_alloc, 1 being the next; 0 lets none.
void failAt(long number) noexcept;

} // namespace allocations
