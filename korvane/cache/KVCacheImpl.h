#pragma once

#include <korvane/cache/KVEvictionHeap.h>

#include <cstdint>
#include <limits>
#include <map>
#include <memory>
#include <mutex>
#include <type_traits>
#include <utility>

/// A lock that does nothing, for caches that are guarded from outside.
struct KVNoLock {
    constexpr void lock() noexcept {}
    constexpr void unlock() noexcept {}
};

/// A bounded map from key to value that gives up its least recently used entries.
///
///     KVCacheImpl<int, std::string> cache(2);      // at most two entries
///     cache.addValue(1, "one", 0);
///     cache.addValue(2, "two", 0);
///     bool found = false;
///     cache.findValue(1, found);                   // "one"; 1 is now the newest
///     cache.addValue(3, "three", 0);               // 2 leaves
///
/// Two bounds hold after every change: the number of entries (`maxEntries`) and the sum of their
/// costs (`maxCost`), in any unit the caller likes. What leaves is always the entry touched longest
/// ago, however dear the others are. An entry is touched when it is added, replaced or found.
///
/// Look-up, insertion and eviction are logarithmic in the number of entries. Keys are ordered by
/// `std::less`. Keys and values live as long as their entry, so a key or value that holds a
/// reference keeps its object alive.
///
/// If a copy, a comparison or an allocation throws, the cache is as it was before the call; a
/// replaced value is so too if `Value` can be assigned without throwing, by copy or by move.
///
/// `LockPolicy` is a type with `lock` and `unlock`, held during each operation. With KVNoLock one
/// thread at a time may use the cache, for looking up as well: a look-up moves the entry it finds.
/// Values are copied and destroyed inside the operations: what they do then must not use the cache.
template <class Key, class Value, class LockPolicy = KVNoLock>
class KVCacheImpl {
public:
    static constexpr std::uint64_t kUnbounded = std::numeric_limits<std::uint64_t>::max();

    /// What is kept for a key.
    struct Data {
        Value value;
        /// In the caller's unit.
        std::uint64_t cost;
        /// The cache's clock at the last touch; no two entries have the same.
        std::uint64_t timestamp;
        /// This entry's position in the eviction heap.
        std::uint64_t heapIndex;
    };
    using Entries = std::map<Key, Data>;
    using Heap = KVEvictionHeap<typename Entries::iterator>;

    /// Empty; costs are not bounded.
    explicit KVCacheImpl(std::uint64_t maxEntries = kUnbounded) : maxEntries_(maxEntries) {}
    KVCacheImpl(KVCacheImpl const&) = delete;
    KVCacheImpl& operator=(KVCacheImpl const&) = delete;

    /// A copy of the value for `key`, which is touched, and `found` true; or a default-made value
    /// and `found` false.
    Value findValue(Key const& key, bool& found) const;
    /// Inserts or replaces, touches the entry and evicts until both bounds hold: the entry just
    /// added goes last. A `cost` above `maxCost` is refused: an entry already under that key stays
    /// as it was, untouched. With `maxEntries` 0 nothing is ever kept.
    void addValue(Key const& key, Value const& value, unsigned long long cost);
    /// Evicts until both bounds hold.
    void evictIfNecessary();

    /// The bounds, inclusive, `kUnbounded` for none. Setting one evicts nothing until the next
    /// `addValue` or `evictIfNecessary`. These and all below take no lock.
    std::uint64_t maxEntries() const noexcept { return maxEntries_; }
    std::uint64_t maxCost() const noexcept { return maxCost_; }
    void setMaxEntries(std::uint64_t count) noexcept { maxEntries_ = count; }
    void setMaxCost(std::uint64_t cost) noexcept { maxCost_ = cost; }
    /// While not 0 nothing is evicted, and a value dearer than `maxCost` is stored too.
    std::uint64_t evictionHold() const noexcept { return evictionHold_; }
    void setEvictionHold(std::uint64_t hold) noexcept { evictionHold_ = hold; }

    /// The number of entries.
    std::size_t size() const noexcept { return entries_.size(); }
    /// The sum of the costs of all entries, modulo 2^64.
    std::uint64_t totalCost() const noexcept { return totalCost_; }
    /// How many touches there have been.
    std::uint64_t clock() const noexcept { return clock_; }
    /// What is held, by key and by age, to look at. Looking touches nothing.
    Entries const& entries() const noexcept { return entries_; }
    Heap const& heap() const noexcept { return heap_; }

private:
    using Entry = typename Entries::iterator;

    void touch(Entry entry) const noexcept
    {
        entry->second.timestamp = ++clock_;
        heap_.bubble(entry);
    }
    static void assign(Value& to, Value const& from);
    void evict() noexcept;

    // Reserved: always empty.
    std::weak_ptr<void> self_;
    mutable Entries entries_;
    mutable Heap heap_;
    mutable std::uint64_t clock_ = 0;
    std::uint64_t totalCost_ = 0;
    std::uint64_t maxCost_ = kUnbounded;
    std::uint64_t maxEntries_;
    std::uint64_t evictionHold_ = 0;
    [[no_unique_address]] mutable LockPolicy lock_;
};

template <class Key, class Value, class LockPolicy>
Value KVCacheImpl<Key, Value, LockPolicy>::findValue(Key const& key, bool& found) const
{
    std::lock_guard<LockPolicy> const guard(lock_);
    Entry const entry = entries_.find(key);
    found = entry != entries_.end();
    if (!found)
        return Value();
    Value result(entry->second.value);
    touch(entry);
    return result;
}

template <class Key, class Value, class LockPolicy>
void KVCacheImpl<Key, Value, LockPolicy>::addValue(Key const& key, Value const& value,
                                                   unsigned long long cost)
{
    std::lock_guard<LockPolicy> const guard(lock_);
    if (cost > maxCost_ && evictionHold_ == 0)
        return;
    Entry entry = entries_.lower_bound(key);
    if (entry != entries_.end() && !entries_.key_comp()(key, entry->first)) {
        assign(entry->second.value, value);
        touch(entry);
        if (entry->second.cost == cost)
            return;
        totalCost_ += cost - entry->second.cost;
        entry->second.cost = cost;
    } else {
        // The heap's room comes first: from the insertion on nothing can fail.
        heap_.reserveOne();
        entry = entries_.emplace_hint(entry, key, Data{value, cost, clock_ + 1, 0});
        ++clock_;
        heap_.add(entry);
        totalCost_ += cost;
    }
    if (evictionHold_ == 0)
        evict();
}

template <class Key, class Value, class LockPolicy>
void KVCacheImpl<Key, Value, LockPolicy>::evictIfNecessary()
{
    std::lock_guard<LockPolicy> const guard(lock_);
    if (evictionHold_ == 0)
        evict();
}

template <class Key, class Value, class LockPolicy>
void KVCacheImpl<Key, Value, LockPolicy>::assign(Value& to, Value const& from)
{
    if constexpr (std::is_nothrow_copy_assignable_v<Value> ||
                  !std::is_nothrow_move_assignable_v<Value>) {
        to = from;
    } else {
        Value copy(from);
        to = std::move(copy);
    }
}

template <class Key, class Value, class LockPolicy>
void KVCacheImpl<Key, Value, LockPolicy>::evict() noexcept
{
    while ((totalCost_ > maxCost_ || entries_.size() > maxEntries_) && !heap_.empty()) {
        Entry const oldest = heap_.root();
        heap_.remove(oldest);
        totalCost_ -= oldest->second.cost;
        entries_.erase(oldest);
    }
}
