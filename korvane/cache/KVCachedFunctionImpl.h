#pragma once

#include <korvane/cache/KVCache.h>
#include <korvane/foundation/KVCFRef.h>
#include <korvane/foundation/KVExport.h>
#include <korvane/foundation/KVSpinLock.h>

#include <atomic>
#include <functional>
#include <mutex>
#include <thread>
#include <tuple>
#include <type_traits>
#include <utility>

/// How a memoiser keeps an argument of type `T` in its key: by value, and a plain reference to an
/// object in a holder, so that no other object can take its address while the entry lives. The
/// class of the object must be complete.
template <class T>
struct KVCachedArgument {
    using type = T;
};
template <class T>
requires std::is_convertible_v<T*, NSObject const*>
struct KVCachedArgument<T*> {
    using type = KVCFRef<T*>;
};

/// Remembers the results of a function that is dear to compute and depends on its arguments alone.
/// Any number of threads may call it.
///
///     KVCachedFunctionImpl<Hash, std::string> hash(&hashOfFile, 100);
///     hash("a.icc");      // computed
///     hash("a.icc");      // remembered
///
/// At most `capacity` results are kept, the most recently used ones. The function runs inside the
/// memoiser's lock: no result is computed twice while it is kept, and callers with other arguments
/// wait as well. It must not call its own memoiser, directly or in a roundabout way: that throws
/// KVAssertionException.
///
/// What the function throws travels to the caller and nothing is kept. The key's and the result's
/// types are copied on each hit: they should be small or hold a reference.
template <class Result, class... Args>
class KVCachedFunctionImpl {
public:
    /// At most `capacity` results; a negative number means no bound, with 0 every call computes.
    KVCachedFunctionImpl(std::function<Result(Args...)> function, int capacity)
        : function_(std::move(function)), cache_(static_cast<std::uint64_t>(capacity))
    {}
    KVCachedFunctionImpl(KVCachedFunctionImpl const&) = delete;
    KVCachedFunctionImpl& operator=(KVCachedFunctionImpl const&) = delete;

    /// The result for these arguments, as a copy. Throws std::bad_function_call if it has to be
    /// computed and there is no function.
    Result operator()(Args... args);

private:
    using Key = std::tuple<typename KVCachedArgument<std::decay_t<Args>>::type...>;

    void refuseReentry() const;
    Result compute(Args... args);

    std::function<Result(Args...)> function_;
    KVSpinLock lock_;
    KVCache<Key, Result> cache_;
    /// The thread that is inside `function_`.
    std::atomic<std::thread::id> computing_{};
};

/// Throws KVAssertionException.
[[noreturn]] KV_EXPORT void _KVCachedFunctionReentered();

template <class Result, class... Args>
Result KVCachedFunctionImpl<Result, Args...>::operator()(Args... args)
{
    refuseReentry();
    std::lock_guard<KVSpinLock> const guard(lock_);
    Key const key(args...);
    bool found = false;
    Result remembered = cache_->findValue(key, found);
    if (found)
        return remembered;
    Result result = compute(std::forward<Args>(args)...);
    cache_->addValue(key, result, 0);
    return result;
}

template <class Result, class... Args>
void KVCachedFunctionImpl<Result, Args...>::refuseReentry() const
{
    // Only this thread itself can have put its id there, so no order of memory matters.
    std::thread::id const thread = computing_.load(std::memory_order_relaxed);
    if (thread != std::thread::id() && thread == std::this_thread::get_id())
        _KVCachedFunctionReentered();
}

template <class Result, class... Args>
Result KVCachedFunctionImpl<Result, Args...>::compute(Args... args)
{
    struct Mark {
        std::atomic<std::thread::id>& thread;
        explicit Mark(std::atomic<std::thread::id>& slot) : thread(slot)
        {
            thread.store(std::this_thread::get_id(), std::memory_order_relaxed);
        }
        ~Mark() { thread.store(std::thread::id(), std::memory_order_relaxed); }
    } const mark(computing_);
    return function_(std::forward<Args>(args)...);
}
