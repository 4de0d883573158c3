#include <korvane/foundation/KVSpinLock.h>

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

void KVSpinLock::lockSlowly() noexcept
{
    for (int turn = 0; turn < 100; ++turn) {
        if (state_.load(std::memory_order_relaxed) == free && try_lock())
            return;
        relaxProcessor();
    }
    // Whoever has slept takes the lock as contended: it cannot know that it was the last one.
    while (state_.exchange(contended, std::memory_order_acquire) != free)
        state_.wait(contended, std::memory_order_relaxed);
}

void KVSpinLock::wakeOne() noexcept
{
    state_.notify_one();
}
