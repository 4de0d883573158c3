#include <support/Allocations.h>

#include <atomic>
#include <cstdlib>
#include <new>

namespace {

std::atomic<long> made{0};
std::atomic<long> untilFailure{0};
std::atomic<std::size_t> largest{0};

} // namespace

long allocations::count() noexcept
{
    return made;
}

std::size_t allocations::takeLargest() noexcept
{
    return largest.exchange(0);
}

void allocations::failAt(long number) noexcept
{
    untilFailure = number;
}

void* operator new(std::size_t size)
{
    ++made;
    if (size > largest)
        largest = size;
    if (untilFailure > 0 && --untilFailure == 0)
        throw std::bad_alloc();
    if (void* const block = std::malloc(size ? size : 1))
        return block;
    throw std::bad_alloc();
}

void operator delete(void* block) noexcept
{
    std::free(block);
}

void operator delete(void* block, std::size_t) noexcept
{
    std::free(block);
}
