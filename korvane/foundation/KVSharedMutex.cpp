#include <korvane/foundation/KVSharedMutex.h>

#include <algorithm>
#include <chrono>
#include <mutex>
#include <thread>

namespace {

/// A number for each thread that is never 0 and never used again.
std::uint64_t currentThread() noexcept
{
    static std::atomic<std::uint64_t> next{0};
    thread_local std::uint64_t const id = ++next;
    return id;
}

} // namespace

std::vector<KVSharedMutex::Reader>::iterator KVSharedMutex::findReader(std::uint64_t thread)
{
    return std::find_if(readers_.begin(), readers_.end(),
                        [thread](Reader const& reader) { return reader.thread == thread; });
}

void KVSharedMutex::lock()
{
    std::uint64_t const self = currentThread();
    {
        std::scoped_lock const guard(mutex_);
        if (writer_ == self) {
            ++recursion_;
            return;
        }
    }
    for (std::uint64_t none = 0; !writer_.compare_exchange_strong(none, self); none = 0)
        std::this_thread::sleep_for(std::chrono::nanoseconds(100000));
    for (;;) {
        {
            std::scoped_lock const guard(mutex_);
            if (readers_.empty())
                return;
        }
        std::this_thread::yield();
    }
}

void KVSharedMutex::unlock()
{
    std::scoped_lock const guard(mutex_);
    if (recursion_ > 0)
        --recursion_;
    else
        writer_ = 0;
}

void KVSharedMutex::lock_shared()
{
    std::uint64_t const self = currentThread();
    for (;;) {
        {
            std::scoped_lock const guard(mutex_);
            if (writer_ == self) {
                ++recursion_;
                return;
            }
            if (auto const reader = findReader(self); reader != readers_.end()) {
                ++reader->count;
                return;
            }
            if (writer_ == 0) {
                readers_.push_back({self, 1});
                return;
            }
        }
        std::this_thread::yield();
    }
}

void KVSharedMutex::unlock_shared()
{
    std::uint64_t const self = currentThread();
    std::scoped_lock const guard(mutex_);
    if (writer_ == self) {
        // A writer that never locked again has nothing to undo here.
        if (recursion_ > 0)
            --recursion_;
        return;
    }
    auto const reader = findReader(self);
    if (reader == readers_.end())
        return;
    if (--reader->count == 0)
        readers_.erase(reader);
}
