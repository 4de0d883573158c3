#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <utility>
#include <vector>

/// The order in which a cache gives up its entries: a binary min-heap on their timestamps, so that
/// the root is the entry touched longest ago.
///
/// `Iterator` points to a pair whose `second` has two unsigned 64-bit members: `timestamp`, which
/// the heap reads, and `heapIndex`, which the heap keeps equal to the entry's position in its
/// array. That stored position is what makes `bubble` and `remove` logarithmic, without a search.
///
///     parent of i: (i - 1) / 2        children of i: 2i + 1 and 2i + 2
///
/// The heap owns no entries. An iterator must stay valid for as long as it is in the heap.
template <class Iterator>
class KVEvictionHeap {
public:
    bool empty() const noexcept { return entries_.empty(); }
    std::size_t size() const noexcept { return entries_.size(); }
    /// The entry touched longest ago; the heap must not be empty.
    Iterator const& root() const noexcept { return entries_.front(); }
    /// The entry at a position below `size()`.
    Iterator const& operator[](std::size_t index) const noexcept { return entries_[index]; }

    /// Makes room for one more entry, so that the next `add` cannot fail. Throws std::bad_alloc.
    void reserveOne();
    /// Appends an entry and lets it rise. Throws std::bad_alloc, and then nothing has changed.
    void add(Iterator const& entry);
    /// Puts an entry of the heap in its place after its timestamp changed. It sinks below its older
    /// child; only an entry that does not sink rises.
    void bubble(Iterator const& entry) noexcept;
    /// Takes an entry out of the heap; the last one of the array fills its place.
    void remove(Iterator const& entry) noexcept;

private:
    static std::uint64_t timestamp(Iterator const& entry) noexcept
    {
        return entry->second.timestamp;
    }
    void put(std::size_t index, Iterator const& entry) noexcept
    {
        entries_[index] = entry;
        entry->second.heapIndex = index;
    }
    void siftUp(std::size_t index) noexcept;
    /// Whether the entry sank.
    bool siftDown(std::size_t index) noexcept;

    std::vector<Iterator> entries_;
};

template <class Iterator>
void KVEvictionHeap<Iterator>::reserveOne()
{
    if (entries_.size() == entries_.capacity())
        entries_.reserve(std::max<std::size_t>(16, 2 * entries_.size()));
}

template <class Iterator>
void KVEvictionHeap<Iterator>::add(Iterator const& entry)
{
    entries_.push_back(entry);
    entry->second.heapIndex = entries_.size() - 1;
    siftUp(entries_.size() - 1);
}

template <class Iterator>
void KVEvictionHeap<Iterator>::bubble(Iterator const& entry) noexcept
{
    std::size_t const index = entry->second.heapIndex;
    if (!siftDown(index))
        siftUp(index);
}

template <class Iterator>
void KVEvictionHeap<Iterator>::remove(Iterator const& entry) noexcept
{
    std::size_t const index = entry->second.heapIndex;
    Iterator const last = entries_.back();
    entries_.pop_back();
    if (index == entries_.size())
        return;
    put(index, last);
    bubble(last);
}

// Both sifts carry the moving entry and write it once, where it comes to rest. The moved entry's
// own timestamp is read once, and equal timestamps never swap.

template <class Iterator>
void KVEvictionHeap<Iterator>::siftUp(std::size_t index) noexcept
{
    Iterator const moving = entries_[index];
    std::uint64_t const time = timestamp(moving);
    while (index != 0) {
        std::size_t const parent = (index - 1) / 2;
        if (timestamp(entries_[parent]) <= time)
            break;
        put(index, entries_[parent]);
        index = parent;
    }
    put(index, moving);
}

template <class Iterator>
bool KVEvictionHeap<Iterator>::siftDown(std::size_t index) noexcept
{
    std::size_t const start = index;
    std::size_t const size = entries_.size();
    Iterator const moving = entries_[index];
    std::uint64_t const time = timestamp(moving);
    for (std::size_t child = 2 * index + 1; child < size; child = 2 * index + 1) {
        std::uint64_t childTime = timestamp(entries_[child]);
        if (child + 1 < size) {
            std::uint64_t const rightTime = timestamp(entries_[child + 1]);
            if (childTime > rightTime) {
                ++child;
                childTime = rightTime;
            }
        }
        if (time <= childTime)
            break;
        put(index, entries_[child]);
        index = child;
    }
    if (index == start)
        return false;
    put(index, moving);
    return true;
}
