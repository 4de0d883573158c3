// The cache against a map and a heap written by hand, without bounds of cost, holds or locks.

#include <korvane/cache/KVCacheImpl.h>
#include <korvane/cache/KVCachedFunctionImpl.h>

#include <benchmark/benchmark.h>

#include <cstdint>
#include <map>
#include <random>
#include <vector>

namespace {

constexpr std::size_t keyCount = 1000;

/// 64 Ki keys below 1000 in no order.
std::vector<int> const& hitKeys()
{
    static std::vector<int> const keys = [] {
        std::mt19937 random(1);
        std::vector<int> result(1 << 16);
        for (int& key : result)
            key = static_cast<int>(random() % keyCount);
        return result;
    }();
    return keys;
}

/// Every number once in 2^32 steps, far apart from the one before.
class FreshKeys {
public:
    int next() { return static_cast<int>(state_ += 2654435769u); }

private:
    std::uint32_t state_ = 0;
};

class HandWritten {
public:
    explicit HandWritten(std::size_t limit) : limit_(limit) {}

    int find(int key)
    {
        auto const entry = map_.find(key);
        if (entry == map_.end())
            return 0;
        entry->second.time = ++clock_;
        sink(entry, entry->second.index);
        return entry->second.value;
    }
    void insert(int key, int value)
    {
        // The newest entry has no younger parent: it stays at the end.
        auto const [entry, inserted] = map_.try_emplace(key, Record{value, ++clock_, heap_.size()});
        if (!inserted)
            return;
        heap_.push_back(entry);
        if (heap_.size() <= limit_)
            return;
        auto const oldest = heap_.front();
        auto const last = heap_.back();
        heap_.pop_back();
        sink(last, 0);
        map_.erase(oldest);
    }

private:
    struct Record {
        int value;
        std::uint64_t time;
        std::size_t index;
    };
    using Entry = std::map<int, Record>::iterator;

    void put(Entry entry, std::size_t index)
    {
        heap_[index] = entry;
        entry->second.index = index;
    }
    void sink(Entry entry, std::size_t index)
    {
        std::size_t child;
        while ((child = 2 * index + 1) < heap_.size()) {
            if (child + 1 < heap_.size() &&
                heap_[child + 1]->second.time < heap_[child]->second.time)
                ++child;
            if (entry->second.time < heap_[child]->second.time)
                break;
            put(heap_[child], index);
            index = child;
        }
        put(entry, index);
    }

    std::size_t limit_;
    std::map<int, Record> map_;
    std::vector<Entry> heap_;
    std::uint64_t clock_ = 0;
};

void hit(benchmark::State& state)
{
    KVCacheImpl<int, int> cache(keyCount);
    for (int i = 0; i < static_cast<int>(keyCount); ++i)
        cache.addValue(i, i, 0);
    auto const& keys = hitKeys();
    std::size_t i = 0;
    bool found = false;
    for (auto _ : state)
        benchmark::DoNotOptimize(cache.findValue(keys[i++ % keys.size()], found));
}
BENCHMARK(hit)->Name("Hit/ours");

void hitByHand(benchmark::State& state)
{
    HandWritten cache(keyCount);
    for (int i = 0; i < static_cast<int>(keyCount); ++i)
        cache.insert(i, i);
    auto const& keys = hitKeys();
    std::size_t i = 0;
    for (auto _ : state)
        benchmark::DoNotOptimize(cache.find(keys[i++ % keys.size()]));
}
BENCHMARK(hitByHand)->Name("Hit/peer:map and heap");

void insert(benchmark::State& state)
{
    KVCacheImpl<int, int> cache(keyCount);
    FreshKeys keys;
    for (std::size_t i = 0; i < keyCount; ++i)
        cache.addValue(keys.next(), 1, 0);
    for (auto _ : state)
        cache.addValue(keys.next(), 1, 0);
    benchmark::DoNotOptimize(cache.size());
}
BENCHMARK(insert)->Name("Insert/ours");

void insertByHand(benchmark::State& state)
{
    HandWritten cache(keyCount);
    FreshKeys keys;
    for (std::size_t i = 0; i < keyCount; ++i)
        cache.insert(keys.next(), 1);
    for (auto _ : state)
        cache.insert(keys.next(), 1);
    benchmark::DoNotOptimize(cache);
}
BENCHMARK(insertByHand)->Name("Insert/peer:map and heap");

/// Fills a cache, finds every entry and replaces all of them by others; `each` is the time for one
/// entry, which grows with the logarithm of their number and with what the caches of the machine
/// hold.
void turnOver(benchmark::State& state)
{
    auto const count = static_cast<int>(state.range(0));
    for (auto _ : state) {
        KVCacheImpl<int, int> cache(static_cast<std::uint64_t>(count));
        FreshKeys keys;
        bool found = false;
        for (int i = 0; i < count; ++i)
            cache.addValue(keys.next(), i, 0);
        FreshKeys again;
        for (int i = 0; i < count; ++i)
            cache.findValue(again.next(), found);
        for (int i = 0; i < count; ++i)
            cache.addValue(keys.next(), i, 0);
        benchmark::DoNotOptimize(found);
    }
    state.counters["each"] = benchmark::Counter(
        count, benchmark::Counter::kIsIterationInvariantRate | benchmark::Counter::kInvert);
}
BENCHMARK(turnOver)->Name("TurnOver/ours")->Arg(1000)->Arg(1000000)->Unit(benchmark::kMillisecond);

void memoised(benchmark::State& state)
{
    KVCachedFunctionImpl<int, int> square([](int value) { return value * value; }, keyCount);
    auto const& keys = hitKeys();
    std::size_t i = 0;
    for (auto _ : state)
        benchmark::DoNotOptimize(square(keys[i++ % keys.size()]));
}
BENCHMARK(memoised)->Name("Memoised/ours");

} // namespace
