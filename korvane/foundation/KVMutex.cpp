#include <korvane/foundation/KVMutex.h>

#include <korvane/foundation/KVException.h>
#include <korvane/foundation/KVPrint.h>

#include <pthread.h>

namespace {

void check(int result, char const* call, int line)
{
    if (result == 0)
        return;
    KVPrint("error: %s returned %d", call, result);
    throw KVSystemException(KVString::ssprintf("error: %s returned %d", call, result), __FILE__,
                            line);
}

} // namespace

// The text of the call is the text of the error.
#define KV_CHECKED(call) check(call, #call, __LINE__)

KVMutex::KVMutex()
{
    pthread_mutex_t& _Mutex = mutex_;
    KV_CHECKED(pthread_mutex_init(&_Mutex, NULL));
}

KVMutex::KVMutex(bool recursive)
{
    pthread_mutex_t& _Mutex = mutex_;
    if (!recursive) {
        KV_CHECKED(pthread_mutex_init(&_Mutex, NULL));
        return;
    }
    pthread_mutexattr_t rmta;
    KV_CHECKED(pthread_mutexattr_init(&rmta));
    KV_CHECKED(pthread_mutexattr_settype(&rmta, PTHREAD_MUTEX_RECURSIVE));
    KV_CHECKED(pthread_mutex_init(&_Mutex, &rmta));
    KV_CHECKED(pthread_mutexattr_destroy(&rmta));
}

KVMutex::~KVMutex()
{
    ::pthread_mutex_destroy(&mutex_);
}

void KVMutex::lock() noexcept
{
    ::pthread_mutex_lock(&mutex_);
}

void KVMutex::unlock() noexcept
{
    ::pthread_mutex_unlock(&mutex_);
}

KVConditionVariable::KVConditionVariable() noexcept
{
    ::pthread_cond_init(&condition_, nullptr);
}

KVConditionVariable::~KVConditionVariable()
{
    ::pthread_cond_destroy(&condition_);
}

void KVConditionVariable::wait(KVMutex* mutex) noexcept
{
    ::pthread_cond_wait(&condition_, &mutex->mutex_);
}

void KVConditionVariable::signal() noexcept
{
    ::pthread_cond_signal(&condition_);
}

void KVConditionVariable::broadcast() noexcept
{
    ::pthread_cond_broadcast(&condition_);
}
