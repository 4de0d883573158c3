#include <support/Allocations.h>

#include <algorithm>
#include <atomic>
#include <cstdlib>
#include <malloc.h>
#include <new>

namespace {

std::atomic<long> made{0};
std::atomic<long> untilFailure{0};
std::atomic<long> live{0};
std::atomic<long> most{0};
long liveAtStart = 0;

} // namespace

long allocations::count() noexcept
{
    return made;
}

long allocations::peak() noexcept
{
    return most - liveAtStart;
}

void allocations::startPeak() noexcept
{
    liveAtStart = live;
    most = live.load();
}

void allocations::failAt(long number) noexcept
{
    untilFailure = number;
}

void* operator new(std::size_t size)
{
    ++made;
    if (untilFailure > 0 && --untilFailure == 0)
        throw std::bad_alloc();
    void* const block = std::malloc(size ? size : 1);
    if (!block)
        throw std::bad_alloc();
    live += static_cast<long>(::malloc_usable_size(block));
    most = std::max(most.load(), live.load());
    return block;
}

void operator delete(void* block) noexcept
{
    live -= static_cast<long>(::malloc_usable_size(block));
    std::free(block);
}

void operator delete(void* block, std::size_t) noexcept
{
    operator delete(block);
}
