#pragma once

#include <korvane/foundation/KVExport.h>

#include <thread>

/// A handle on one thread, which runs from the moment that the handle is made.
///
///     KVThread worker(&run, &job, "decode");
///     worker.wait();
///
/// `wait` or `detach` once: what is called on the handle after that does nothing. A handle that
/// goes while its thread is attached detaches it. Both, and the end of a handle, belong to one
/// thread; the rest may be called from any. An exception that leaves the function ends the process.
class KV_EXPORT KVThread {
public:
    /// The system's thread, by the name that the standard library has for it.
    using Native = std::thread::native_handle_type;

    /// `name` may be null; the system keeps up to 15 bytes of it. Throws KVSystemException if the
    /// thread cannot be started.
    KVThread(void (*function)(void*), void* argument, char const* name);
    KVThread(KVThread const&) = delete;
    KVThread& operator=(KVThread const&) = delete;
    ~KVThread();

    /// Asks the thread to end at its next cancellation point (POSIX).
    void cancel() noexcept;
    /// Waits for the end of the thread.
    void wait() noexcept;
    /// Lets the thread go on alone.
    void detach() noexcept;
    /// The calling thread.
    static Native self() noexcept;
    /// Whether this handle's thread is the calling one.
    bool isSelf() const noexcept { return thread_ == self(); }
    bool operator==(KVThread const& other) const noexcept { return thread_ == other.thread_; }

    /// Runs `function(argument, index, count)` once for each index from 0 up to `count`, exclusive,
    /// and waits for all of them. `count` is that of the processors (`KVInfo_ProcessorCount`); each
    /// index has a thread of its own or, where none could be started, the calling one. The function
    /// must not throw.
    static void KVFork(void (*function)(void*, int, int), void* argument);

private:
    Native thread_{};
    bool attached_ = false;
};
