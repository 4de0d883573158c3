#include <korvane/foundation/KVSpinLock.h>

#include <sys/single_threaded.h>

namespace {

void relaxProcessor() noexcept
{
#if defined(__x86_64__)
    __builtin_ia32_pause();
#elif defined(__aarch64__)
    asm volatile("yield");
#endif
}

} // namespace

void KVSpinLock::lock() noexcept
{
    if (!try_lock())
        lockSlowly();
}

bool KVSpinLock::try_lock() noexcept
{
    // While there is one thread nobody can come between, and the bus need not be locked.
    if (__libc_single_threaded) {
        if (state_.load(std::memory_order_relaxed) != idle)
            return false;
        state_.store(taken, std::memory_order_relaxed);
        return true;
    }
    std::uint32_t expected = idle;
    return state_.compare_exchange_strong(expected, taken, std::memory_order_acquire,
                                          std::memory_order_relaxed);
}

void KVSpinLock::unlock() noexcept
{
    if (__libc_single_threaded)
        state_.store(idle, std::memory_order_relaxed);
    else if (state_.exchange(idle, std::memory_order_release) == contended)
        state_.notify_one();
}

void KVSpinLock::lockSlowly() noexcept
{
    for (int turn = 0; turn < 100; ++turn) {
        if (state_.load(std::memory_order_relaxed) == idle && try_lock())
            return;
        relaxProcessor();
    }
    // Whoever has slept takes the lock as contended: it cannot know that it was the last one.
    while (state_.exchange(contended, std::memory_order_acquire) != idle)
        state_.wait(contended, std::memory_order_relaxed);
}
