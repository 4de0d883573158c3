#include <support/Allocations.h>

#include <algorithm>
#include <atomic>
#include <cstdlib>
#include <malloc.h>
#include <new>

namespace {

std::atomic<long> made{0};
std::atomic<long> untilFailure{0};
std::atomic<std::size_t> largest{0};
std::atomic<long> heldNow{0};
std::atomic<long> mostHeld{0};
long heldAtStart = 0;

} // namespace

long allocations::count() noexcept
{
    return made;
}

std::size_t allocations::takeLargest() noexcept
{
    return largest.exchange(0);
}

long allocations::peak() noexcept
{
    return mostHeld - heldAtStart;
}

void allocations::startPeak() noexcept
{
    heldAtStart = heldNow;
    mostHeld = heldAtStart;
}

long allocations::held() noexcept
{
    return heldNow - heldAtStart;
}

void allocations::failAt(long number) noexcept
{
    untilFailure = number;
}

void* operator new(std::size_t size)
{
    ++made;
    largest = std::max(largest.load(), size);
    if (untilFailure > 0 && --untilFailure == 0)
        throw std::bad_alloc();
    void* const block = std::malloc(size ? size : 1);
    if (!block)
        throw std::bad_alloc();
    heldNow += static_cast<long>(::malloc_usable_size(block));
    mostHeld = std::max(mostHeld.load(), heldNow.load());
    return block;
}

void operator delete(void* block) noexcept
{
    heldNow -= static_cast<long>(::malloc_usable_size(block));
    std::free(block);
}

void operator delete(void* block, std::size_t) noexcept
{
    operator delete(block);
}
