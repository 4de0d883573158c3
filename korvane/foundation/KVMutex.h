#pragma once

#include <korvane/foundation/KVExport.h>

#include <condition_variable>
#include <mutex>
#include <type_traits>

/// A mutual-exclusion lock. It is a BasicLockable, so `std::scoped_lock` holds it.
///
///     KVMutex mutex;
///     std::scoped_lock const lock(mutex);
class KV_EXPORT KVMutex {
public:
    /// An ordinary lock. Throws KVSystemException if the system has no more.
    KVMutex();
    /// True makes a lock that its owner may take again; each `lock` needs its `unlock`.
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
