#include <korvane/foundation/KVShared.h>

KV_Sp_counted_base::~KV_Sp_counted_base() = default;

void KV_Sp_counted_base::destroy() noexcept
{
    delete this;
}

bool KV_Sp_counted_base::add_ref_lock() noexcept
{
    std::scoped_lock const lock(mutex);
    unsigned int count = useCount;
    while (count != 0)
        if (useCount.compare_exchange_weak(count, count + 1))
            return true;
    return false;
}

void KV_Sp_counted_base::release() noexcept
{
    if (--useCount != 0)
        return;
    dispose();
    // Waits for a thread that is just finding out, under the mutex, that the count is zero.
    {
        std::scoped_lock const barrier(mutex);
    }
    weak_release();
}

void KV_Sp_counted_base::weak_release() noexcept
{
    if (--weakCount != 0)
        return;
    {
        std::scoped_lock const barrier(mutex);
    }
    destroy();
}

void KV_Sp_counted_base_impl::dispose() noexcept
{
    if (!object_)
        return;
    object_->disposedByBlock_ = true;
    object_->dispose();
}

void KV_Sp_counted_base_impl::objectDied() noexcept
{
    {
        std::scoped_lock const lock(mutex);
        useCount = 0;
        object_ = nullptr;
    }
    weak_release();
}

void KVWeakCount::alloc(KVShared_base* object)
{
    if (block_.load())
        return;
    auto* const fresh = new KV_Sp_counted_base_impl(object);
    KV_Sp_counted_base_impl* none = nullptr;
    if (!block_.compare_exchange_strong(none, fresh))
        delete fresh;
}

KVShared_base::~KVShared_base()
{
    KV_Sp_counted_base_impl* const block = weakCount_.block();
    if (block && !disposedByBlock_)
        block->objectDied();
}

void KVShared_base::dispose() noexcept
{
    delete this;
}

KV_Sp_counted_base* KVShared_base::sharedBlock()
{
    weakCount_.alloc(this);
    return weakCount_.block();
}
