#pragma once

#include <korvane/foundation/KVExport.h>

#include <condition_variable>
#include <mutex>
#include <type_traits>

/// A mutual-exclusion lock. It is a BasicLockable, so `std::scoped_lock` holds it.
///
///     KVMutex mutex;
///     std::scoped_lock const lock(mutex);
///
/// The thread that took it gives it back; nobody may hold it when it is destroyed. An ordinary lock
/// that its owner asks for again waits for ever.
class KV_EXPORT KVMutex {
public:
    /// An ordinary lock. Throws KVSystemException if the system has no more.
    KVMutex();
    /// True makes a lock that its owner may take again; each `lock` needs its `unlock`. Throws as
    /// above.
    explicit KVMutex(bool recursive);
    KVMutex(KVMutex const&) = delete;
    KVMutex& operator=(KVMutex const&) = delete;
    virtual ~KVMutex();

    void lock() noexcept;
    void unlock() noexcept;

private:
    friend class KVConditionVariable;
    /// The system's lock, by the name that the standard library has for it.
    std::remove_pointer_t<std::mutex::native_handle_type> mutex_;
};

/// Lets threads wait until another one tells them to look again.
///
///     std::scoped_lock const lock(mutex);
///     while (queue.empty())
///         filled.wait(&mutex);       // another thread adds under the lock, then calls signal()
class KV_EXPORT KVConditionVariable {
public:
    KVConditionVariable() noexcept;
    KVConditionVariable(KVConditionVariable const&) = delete;
    KVConditionVariable& operator=(KVConditionVariable const&) = delete;
    ~KVConditionVariable();

    /// Releases the mutex, which the caller holds, waits, and takes it again. It may return without
    /// a signal: wait in a loop that tests what is waited for.
    void wait(KVMutex* mutex) noexcept;
    /// Wakes one waiting thread.
    void signal() noexcept;
    /// Wakes all of them.
    void broadcast() noexcept;

private:
    std::remove_pointer_t<std::condition_variable::native_handle_type> condition_;
};
