#pragma once

#include <korvane/foundation/KVException.h>

#include <algorithm>
#include <limits>
#include <memory>
#include <new>
#include <utility>
#include <vector>

/// An array to insert into, which grows by doubling. Sizes are `unsigned int`.
///
///     KVDynamicArray<int> order(4);     // empty, with room for four
///     order.insert(0, 7);               // 7
///     order.insert(0, 5);               // 5 7
///
/// It must be given a positive capacity when it is made: twice nothing is nothing, and inserting
/// one value into an array of capacity 0 throws KVAssertionException. Pointers and iterators hold
/// until something is inserted. Not synchronised.
template <class T>
class KVDynamicArray {
public:
    explicit KVDynamicArray(unsigned int capacity = 0)
        : capacity_(capacity), data_(capacity ? std::make_unique<T[]>(capacity) : nullptr)
    {}
    KVDynamicArray(KVDynamicArray const& other) : KVDynamicArray(other.capacity_)
    {
        std::copy(other.begin(), other.end(), data_.get());
        size_ = other.size_;
    }
    KVDynamicArray(KVDynamicArray&& other) noexcept
        : size_(std::exchange(other.size_, 0)),
          capacity_(std::exchange(other.capacity_, 0)),
          data_(std::move(other.data_))
    {}
    KVDynamicArray& operator=(KVDynamicArray other) noexcept
    {
        std::swap(size_, other.size_);
        std::swap(capacity_, other.capacity_);
        std::swap(data_, other.data_);
        return *this;
    }

    unsigned int size() const noexcept { return size_; }
    unsigned int capacity() const noexcept { return capacity_; }
    T* begin() noexcept { return data_.get(); }
    T* end() noexcept { return data_.get() + size_; }
    T const* begin() const noexcept { return data_.get(); }
    T const* end() const noexcept { return data_.get() + size_; }
    /// Throws KVBadIndexException when out of range.
    T& operator[](unsigned int index) { return data_[checked(index)]; }
    T const& operator[](unsigned int index) const { return data_[checked(index)]; }

    /// Puts a copy in front of element `index`, or at the end. Returns whether the array had to
    /// grow. Throws KVBadIndexException for an index beyond the end, std::bad_alloc when there is
    /// no memory.
    bool insert(unsigned int index, T const& value)
    {
        if (capacity_ == 0)
            throw KVAssertionException("KVDynamicArray::insert");
        return insertRun(index, &value, 1, size_ == capacity_ ? 2ull * size_ : capacity_);
    }
    /// The same for `count` values; the capacity grows to just what is needed, from 0 too.
    bool insert(unsigned int index, T const* values, unsigned int count)
    {
        return insertRun(index, values, count,
                         std::max<unsigned long long>(capacity_, 0ull + size_ + count));
    }

private:
    bool insertRun(unsigned int index, T const* values, unsigned int count,
                   unsigned long long capacity);
    unsigned int checked(unsigned int index) const
    {
        if (index >= size_)
            throw KVBadIndexException(
                KVString::ssprintf("KVDynamicArray index %u of %u", index, size_));
        return index;
    }

    unsigned int size_ = 0;
    unsigned int capacity_ = 0;
    std::unique_ptr<T[]> data_;
};

template <class T>
bool KVDynamicArray<T>::insertRun(unsigned int index, T const* values, unsigned int count,
                                  unsigned long long capacity)
{
    if (index > size_)
        throw KVBadIndexException("KVDynamicArray::insert");
    if (capacity > std::numeric_limits<unsigned int>::max())
        throw std::bad_alloc();
    // The values may lie in this array: copy them before anything moves.
    std::vector<T> const copies(values, values + count);
    bool const grows = capacity > capacity_;
    if (grows) {
        auto grown = std::make_unique<T[]>(static_cast<std::size_t>(capacity));
        std::move(begin(), end(), grown.get());
        data_ = std::move(grown);
        capacity_ = static_cast<unsigned int>(capacity);
    }
    std::move_backward(begin() + index, end(), end() + count);
    std::copy(copies.begin(), copies.end(), begin() + index);
    size_ += count;
    return grows;
}
