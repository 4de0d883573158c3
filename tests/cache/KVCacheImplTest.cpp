#include <korvane/cache/KVCache.h>

#include <gtest/gtest.h>
#include <support/Allocations.h>

#include <algorithm>
#include <new>
#include <numeric>
#include <random>
#include <string>
#include <vector>

namespace {

constexpr std::uint64_t unbounded = KVCacheImpl<int, int>::kUnbounded;

/// Empty when all invariants hold, else what is wrong.
template <class Key, class Value>
std::string faults(KVCacheImpl<Key, Value> const& cache)
{
    std::string result;
    auto const& heap = cache.heap();
    if (cache.size() != heap.size())
        result += "sizes differ; ";
    std::uint64_t cost = 0;
    for (auto entry = cache.entries().begin(); entry != cache.entries().end(); ++entry) {
        cost += entry->second.cost;
        std::size_t const index = entry->second.heapIndex;
        if (index >= heap.size() || &*heap[index] != &*entry)
            result += "heapIndex is not the entry's own; ";
        else if (index && heap[(index - 1) / 2]->second.timestamp >= entry->second.timestamp)
            result += "a parent is younger; ";
    }
    if (cost != cache.totalCost())
        result += "totalCost is not the sum; ";
    return result;
}

template <class Key, class Value>
std::string keys(KVCacheImpl<Key, Value> const& cache)
{
    std::string result;
    for (auto const& entry : cache.entries())
        result += entry.first;
    return result;
}

TEST(KVCacheImpl, LeastRecentlyUsedEntryLeavesFirst)
{
    // Each step adds a key, or finds it when in capitals.
    struct Row {
        std::uint64_t maxEntries;
        char const* steps;
        char const* kept;
    } const rows[] = {
        {2, "abc", "bc"},   {2, "abAc", "ac"}, // a hit makes it the newest
        {2, "abac", "ac"},                     // so does adding it again
        {2, "abAXc", "ac"},                    // a miss touches nothing
        {0, "aA", ""},                         // evicted in the same call
    };
    for (auto const& row : rows) {
        KVCacheImpl<char, int> cache(row.maxEntries);
        for (char const step : std::string_view(row.steps)) {
            bool found = false;
            if (step >= 'a')
                cache.addValue(step, step, 0);
            else
                cache.findValue(static_cast<char>(step - 'A' + 'a'), found);
        }
        EXPECT_EQ(keys(cache), row.kept) << row.steps;
        EXPECT_EQ(faults(cache), "") << row.steps;
    }
}

TEST(KVCacheImpl, NothingIsDearerThanNoBound)
{
    KVCacheImpl<char, int> cache;
    cache.addValue('a', 1, unbounded);
    cache.addValue('b', 1, 2); // the sum wraps to 1, which is in bounds
    EXPECT_EQ(keys(cache), "ab");
    EXPECT_EQ(cache.totalCost(), 1u);
}

/// The same cache by plain search: entries from the oldest to the newest.
class Model {
public:
    struct Entry {
        int key;
        int value;
        std::uint64_t cost;
    };

    Entry const* find(int key)
    {
        auto const entry = position(key);
        if (entry == entries.end())
            return nullptr;
        std::rotate(entry, entry + 1, entries.end());
        return &entries.back();
    }
    void add(int key, int value, std::uint64_t cost)
    {
        if (cost > maxCost && !hold)
            return;
        auto const entry = position(key);
        // Meant so: the same cost again evicts nothing, even when a hold left too much behind.
        bool const sameCost = entry != entries.end() && entry->cost == cost;
        if (entry != entries.end())
            entries.erase(entry);
        entries.push_back({key, value, cost});
        if (!sameCost)
            evict();
    }
    void evict()
    {
        while (!hold && (entries.size() > maxEntries || total() > maxCost))
            entries.erase(entries.begin());
    }
    std::uint64_t total() const
    {
        return std::accumulate(
            entries.begin(), entries.end(), std::uint64_t(0),
            [](std::uint64_t sum, Entry const& entry) { return sum + entry.cost; });
    }

    std::vector<Entry> entries;
    std::uint64_t maxEntries = 0;
    std::uint64_t maxCost = unbounded;
    bool hold = false;

private:
    std::vector<Entry>::iterator position(int key)
    {
        return std::find_if(entries.begin(), entries.end(),
                            [&](Entry const& entry) { return entry.key == key; });
    }
};

/// Which entries there are, from the oldest to the newest, with all that is kept of them.
void expectEqual(KVCacheImpl<int, int> const& cache, Model const& model)
{
    std::vector<KVCacheImpl<int, int>::Entries::const_iterator> byAge;
    for (auto entry = cache.entries().begin(); entry != cache.entries().end(); ++entry)
        byAge.push_back(entry);
    std::sort(byAge.begin(), byAge.end(), [](auto const& a, auto const& b) {
        return a->second.timestamp < b->second.timestamp;
    });
    ASSERT_EQ(byAge.size(), model.entries.size());
    for (std::size_t i = 0; i < byAge.size(); ++i) {
        ASSERT_EQ(byAge[i]->first, model.entries[i].key);
        ASSERT_EQ(byAge[i]->second.value, model.entries[i].value);
        ASSERT_EQ(byAge[i]->second.cost, model.entries[i].cost);
    }
}

TEST(KVCacheImpl, BehavesAsASimpleModelUnderRandomOperations)
{
    for (unsigned int seed = 0; seed < 20; ++seed) {
        std::mt19937 random(seed);
        auto const below = [&](unsigned int limit) { return static_cast<int>(random() % limit); };
        Model model;
        model.maxEntries = random() % 40;
        constexpr std::uint64_t bounds[] = {unbounded, 100, 8}; // costs go up to 11
        model.maxCost = bounds[seed % 3];
        KVCacheImpl<int, int> cache(model.maxEntries);
        cache.setMaxCost(model.maxCost);
        for (int step = 0; step < 2000; ++step) {
            int const key = below(60);
            switch (int const operation = below(20)) {
            case 0:
                cache.evictIfNecessary();
                model.evict();
                break;
            case 1:
                model.hold = below(4) == 0;
                cache.setEvictionHold(model.hold);
                break;
            default:
                if (operation < 10) {
                    bool found = false;
                    int const value = cache.findValue(key, found);
                    Model::Entry const* const expected = model.find(key);
                    ASSERT_EQ(found, expected != nullptr);
                    ASSERT_EQ(value, expected ? expected->value : 0);
                } else {
                    auto const cost = static_cast<std::uint64_t>(below(120) / 10);
                    cache.addValue(key, step, cost);
                    model.add(key, step, cost);
                }
            }
            ASSERT_EQ(faults(cache), "") << "seed " << seed << " step " << step;
            ASSERT_NO_FATAL_FAILURE(expectEqual(cache, model))
                << "seed " << seed << " step " << step;
        }
    }
}

TEST(KVCacheImpl, AFailedAllocationChangesNothing)
{
    std::string const text(100, 'x'); // beyond the small-string buffer: copying it allocates
    for (int const key : {5, 16}) {   // one to replace, one to insert
        bool failed = true;
        for (long allowed = 1; failed; ++allowed) {
            ASSERT_LT(allowed, 20);
            KVCacheImpl<int, std::string> cache(16);
            for (int i = 0; i < 16; ++i) // fills the heap's array, so that the next one has to grow
                cache.addValue(i, "old", 1);
            failed = false;
            allocations::failAt(allowed);
            try {
                cache.addValue(key, text, 2);
            } catch (std::bad_alloc const&) {
                failed = true;
            }
            allocations::failAt(0);
            ASSERT_EQ(faults(cache), "");
            ASSERT_EQ(cache.size(), 16u);
            if (failed) {
                EXPECT_EQ(cache.clock(), 16u);
                EXPECT_EQ(cache.totalCost(), 16u);
                EXPECT_EQ(cache.entries().count(key), key == 5 ? 1u : 0u);
                EXPECT_EQ(cache.entries().at(5).value, "old");
            } else {
                EXPECT_GT(allowed, key == 5 ? 1 : 3) << "no allocation was made to fail";
                EXPECT_EQ(cache.entries().at(key).value, text);
            }
        }
    }
}

/// Counts how often it is held, and fails if it is taken twice.
struct CountingLock {
    static inline int taken = 0;
    static inline bool held = false;
    void lock()
    {
        EXPECT_FALSE(held);
        held = true;
        ++taken;
    }
    void unlock() { held = false; }
};

TEST(KVCacheImpl, EachOperationHoldsTheLockOnce)
{
    KVCacheImpl<int, int, CountingLock> cache(1);
    bool found = false;
    cache.addValue(1, 1, 0);
    cache.addValue(2, 1, 0); // evicts
    cache.findValue(1, found);
    cache.findValue(2, found);
    cache.evictIfNecessary();
    EXPECT_EQ(CountingLock::taken, 5);
    EXPECT_FALSE(CountingLock::held);
}

TEST(KVCache, KeepsItsEntriesAlive)
{
    auto const value = std::make_shared<int>(1);
    KVCache<int, std::shared_ptr<int>> cache(1);
    cache->addValue(1, value, 0);
    KVCache<int, std::shared_ptr<int>> const moved(std::move(cache));
    EXPECT_EQ(value.use_count(), 2);
    moved->addValue(2, nullptr, 0);
    EXPECT_EQ(value.use_count(), 1);
}

} // namespace
