#include <korvane/cache/KVEvictionHeap.h>

#include <gtest/gtest.h>

#include <map>
#include <string>

namespace {

struct Stamp {
    std::uint64_t timestamp;
    std::uint64_t heapIndex;
};
using Stamps = std::map<char, Stamp>;
using Heap = KVEvictionHeap<Stamps::iterator>;

/// A heap whose array holds a, b, c ... in this order.
struct Fixture {
    explicit Fixture(std::vector<std::uint64_t> const& times)
    {
        for (std::uint64_t const time : times)
            heap.add(stamps.insert({static_cast<char>('a' + stamps.size()), {time, 99}}).first);
    }
    /// The array's entries in order; "?" marks one whose stored position is wrong.
    std::string layout() const
    {
        std::string result;
        for (std::size_t i = 0; i < heap.size(); ++i) {
            result += heap[i]->first;
            if (heap[i]->second.heapIndex != i)
                result += '?';
        }
        return result;
    }
    Stamps stamps;
    Heap heap;
};

TEST(KVEvictionHeap, KeepsTheOldestOnTop)
{
    constexpr std::uint64_t removed = 0;
    struct Row {
        std::vector<std::uint64_t> times;
        char changed;
        std::uint64_t time;
        char const* layout;
    } const rows[] = {
        {{1, 2, 3, 4, 5}, 'a', 9, "bdcae"}, // left child older, and its left child again
        {{1, 3, 2, 4, 5}, 'a', 9, "cbade"}, // right child older
        {{1, 2, 2, 4, 5}, 'a', 9, "bdcae"}, // equal children: the left one
        {{1, 2, 3, 4, 5}, 'a', 2, "abcde"}, // equal is not older
        {{2, 3, 4, 5, 6}, 'e', 1, "eacdb"}, // nothing to sink past, so it rises
        {{2, 3, 4, 5, 6}, 'e', 3, "abcde"}, // rising stops at an equal parent
        {{1}, 'a', removed, ""},
        {{1, 2, 3}, 'c', removed, "ab"},     // the last one itself
        {{1, 2, 3, 4}, 'a', removed, "bdc"}, // the last one takes its place and sinks
        {{1, 10, 2, 11, 12, 3, 4}, 'd', removed, "agcbef"}, // or rises
    };
    for (auto const& row : rows) {
        Fixture fixture(row.times);
        auto const entry = fixture.stamps.find(row.changed);
        entry->second.timestamp = row.time == removed ? entry->second.timestamp : row.time;
        row.time == removed ? fixture.heap.remove(entry) : fixture.heap.bubble(entry);
        EXPECT_EQ(fixture.layout(), row.layout) << row.changed << " at " << row.time;
    }
}

} // namespace
