#pragma once

#include <korvane/cache/KVCacheImpl.h>

#include <memory>

/// Owns one KVCacheImpl and ends it with itself. It moves, the cache behind it stays where it is;
/// what it has moved from owns none.
///
///     KVCache<std::string, Profile> profiles(100);
///     profiles->addValue(name, profile, 0);
template <class Key, class Value, class LockPolicy = KVNoLock>
class KVCache {
public:
    using Impl = KVCacheImpl<Key, Value, LockPolicy>;

    /// At most `maxEntries` entries; costs are not bounded.
    explicit KVCache(std::uint64_t maxEntries) : impl_(std::make_unique<Impl>(maxEntries)) {}

    /// Unowned.
    Impl* get() const noexcept { return impl_.get(); }
    Impl* operator->() const noexcept { return impl_.get(); }
    Impl& operator*() const noexcept { return *impl_; }

private:
    std::unique_ptr<Impl> impl_;
};
