#pragma once

#include <korvane/foundation/KVExport.h>

#include <pthread.h>

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

    void lock() noexcept { ::pthread_mutex_lock(&mutex_); }
    void unlock() noexcept { ::pthread_mutex_unlock(&mutex_); }

private:
    friend class KVConditionVariable;
    pthread_mutex_t mutex_;
};

/// Lets threads wait until another one tells them to look again.
class KV_EXPORT KVConditionVariable {
public:
    KVConditionVariable() noexcept { ::pthread_cond_init(&condition_, nullptr); }
    KVConditionVariable(KVConditionVariable const&) = delete;
    KVConditionVariable& operator=(KVConditionVariable const&) = delete;
    ~KVConditionVariable() { ::pthread_cond_destroy(&condition_); }

    /// Releases the mutex, which the caller holds, waits, and takes it again. It may return without
    /// a signal: wait in a loop that tests what is waited for.
    void wait(KVMutex* mutex) noexcept { ::pthread_cond_wait(&condition_, &mutex->mutex_); }
    /// Wakes one waiting thread.
    void signal() noexcept { ::pthread_cond_signal(&condition_); }
    /// Wakes all of them.
    void broadcast() noexcept { ::pthread_cond_broadcast(&condition_); }

private:
    pthread_cond_t condition_;
};
