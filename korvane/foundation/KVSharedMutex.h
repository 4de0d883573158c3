#pragma once

#include <korvane/foundation/KVMutex.h>

#include <atomic>
#include <cstdint>
#include <vector>

/// A reader-writer lock, recursive on both sides: a writer may take it again on either side, a
/// reader may read again. `std::scoped_lock` holds it to write, `std::shared_lock` to read.
///
///     KVSharedMutex mutex;
///     std::shared_lock const reading(mutex);
///
/// A writer that waits keeps new readers out. A reader must not ask for `lock`: it would wait for
/// itself, for ever. Who waits keeps looking, so sections should be short.
class KV_EXPORT KVSharedMutex {
public:
    KVSharedMutex() = default;
    KVSharedMutex(KVSharedMutex const&) = delete;
    KVSharedMutex& operator=(KVSharedMutex const&) = delete;

    /// Waits for the writer and then for all readers to leave.
    void lock();
    /// Undoes one `lock` of the writer. Only the writer may call it: this is not checked.
    void unlock();
    /// Waits for the writer to leave. Throws std::bad_alloc, with nothing taken.
    void lock_shared();
    /// Undoes one `lock_shared`. On a thread that holds nothing it changes nothing.
    void unlock_shared();

private:
    struct Reader {
        std::uint64_t thread;
        std::uint32_t count;
    };
    std::vector<Reader>::iterator findReader(std::uint64_t thread);

    KVMutex mutex_;
    std::atomic<std::uint64_t> writer_{0};
    std::uint32_t recursion_ = 0;
    std::vector<Reader> readers_;
};
