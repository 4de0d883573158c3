#pragma once

#include <korvane/foundation/KVExport.h>

#include <atomic>
#include <cstdint>

/// A lock of four bytes for short critical sections: unfair, without an owner, not recursive. A
/// thread that finds it taken spins for a moment and then sleeps, so that a long section costs
/// waiting threads no processor time.
class KV_EXPORT KVSpinLock {
public:
    constexpr KVSpinLock() noexcept = default;
    KVSpinLock(KVSpinLock const&) = delete;
    KVSpinLock& operator=(KVSpinLock const&) = delete;

    void lock() noexcept
    {
        std::uint32_t expected = free;
        if (!state_.compare_exchange_strong(expected, taken, std::memory_order_acquire,
                                            std::memory_order_relaxed))
            lockSlowly();
    }
    bool try_lock() noexcept
    {
        std::uint32_t expected = free;
        return state_.compare_exchange_strong(expected, taken, std::memory_order_acquire,
                                              std::memory_order_relaxed);
    }
    void unlock() noexcept
    {
        if (state_.exchange(free, std::memory_order_release) == contended)
            wakeOne();
    }

private:
    /// `contended` is taken, with somebody asleep or about to be.
    enum State : std::uint32_t { free, taken, contended };
    void lockSlowly() noexcept;
    void wakeOne() noexcept;

    std::atomic<std::uint32_t> state_{free};
};
