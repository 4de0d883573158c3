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
    Stamps::iterator at(char name) { return stamps.find(name); }
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

TEST(KVEvictionHeap, AddLetsTheEntryRisePastYoungerParents)
{
    EXPECT_EQ(Fixture({1, 2, 3, 4}).layout(), "abcd");
    EXPECT_EQ(Fixture({4, 3, 2, 1}).layout(), "dcba");
    EXPECT_EQ(Fixture({5, 5, 5}).layout(), "abc"); // equal timestamps stop the climb
}

TEST(KVEvictionHeap, BubbleSinksTowardsTheOlderChild)
{
    struct Row {
        std::vector<std::uint64_t> times;
        char changed;
        std::uint64_t time;
        char const* layout;
    } const rows[] = {
        {{1, 2, 3, 4, 5}, 'a', 9, "bdcae"}, // left child older, and its left child again
        {{1, 3, 2, 4, 5}, 'a', 9, "cbade"}, // right child older
        {{1, 2, 2, 4, 5}, 'a', 9, "bdcae"}, // equal children: the left one
        {{1, 2, 5, 4, 6}, 'a', 3, "bacde"}, // only the left one is older
        {{1, 5, 2, 6, 7}, 'a', 3, "cbade"}, // only the right one is older
        {{1, 2, 3, 4, 5}, 'a', 2, "abcde"}, // equal is not older
        {{2, 3, 4, 5, 6}, 'e', 1, "eacdb"}, // nothing to sink past, so it rises
        {{2, 3, 4, 5, 6}, 'e', 3, "abcde"}, // rising stops at an equal parent
    };
    for (auto const& row : rows) {
        Fixture fixture(row.times);
        fixture.at(row.changed)->second.timestamp = row.time;
        fixture.heap.bubble(fixture.at(row.changed));
        EXPECT_EQ(fixture.layout(), row.layout) << row.changed << " at " << row.time;
    }
}

TEST(KVEvictionHeap, RemoveFillsThePlaceWithTheLastEntry)
{
    struct Row {
        std::vector<std::uint64_t> times;
        char removed;
        char const* layout;
    } const rows[] = {
        {{1}, 'a', ""},
        {{1, 2, 3}, 'c', "ab"},                    // the last one itself
        {{1, 2, 3, 4}, 'a', "bdc"},                // the filler sinks
        {{1, 10, 2, 11, 12, 3, 4}, 'd', "agcbef"}, // the filler rises
    };
    for (auto const& row : rows) {
        Fixture fixture(row.times);
        fixture.heap.remove(fixture.at(row.removed));
        EXPECT_EQ(fixture.layout(), row.layout) << row.removed;
    }
}

} // namespace
