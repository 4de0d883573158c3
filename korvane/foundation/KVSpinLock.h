#pragma once

#include <korvane/foundation/KVExport.h>

#include <atomic>
#include <cstdint>

/// A lock of four bytes for short critical sections: unfair, without an owner, not recursive. A
/// thread that finds it taken spins for a moment and then sleeps, so that a long section costs
/// waiting threads no processor time.
///
///     KVSpinLock lock;
///     std::scoped_lock const held(lock);
class KV_EXPORT KVSpinLock {
public:
    constexpr KVSpinLock() noexcept = default;
    KVSpinLock(KVSpinLock const&) = delete;
    KVSpinLock& operator=(KVSpinLock const&) = delete;

    void lock() noexcept;
    /// Takes it if it is free, and answers whether it did.
    bool try_lock() noexcept;
    void unlock() noexcept;

private:
    /// `contended` is taken, with somebody asleep or about to be.
    enum State : std::uint32_t { idle, taken, contended };
    void lockSlowly() noexcept;

    std::atomic<std::uint32_t> state_{idle};
};
