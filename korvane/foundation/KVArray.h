#pragma once

#include <korvane/foundation/KVException.h>

#include <algorithm>
#include <limits>
#include <memory>
#include <new>
#include <type_traits>

/// How a KVArray handles elements of type `T`. Specialise it for types that need another zero.
template <class T>
struct KVArray_Traits {
    /// `count` elements, each zero: all bits for trivial types, value-initialised otherwise.
    static std::unique_ptr<T[]> make(std::size_t count) { return std::make_unique<T[]>(count); }
    static void zero(T* first, T* last) { std::fill(first, last, T()); }
};

/// A growing array whose new elements are zero. Sizes are `int`. KVDynamicArray is the one to
/// insert into; `cc::vec_t` the one of look-up tables, without checks.
///
///     KVArray<float> weights;
///     weights.resize(3, 0);        // three zeros
///     weights.push(0.5f);
///
/// Pointers and iterators hold until the capacity changes. Allocation throws std::bad_alloc and
/// leaves the array as it was. Not synchronised.
template <class T, class Traits = KVArray_Traits<T>>
class KVArray {
public:
    KVArray() noexcept = default;
    /// So many zeros. Throws KVIllegalArgumentException for a negative size.
    explicit KVArray(int size) { resize(size, 0); }
    KVArray(KVArray const& other)
    {
        resize(other.size_, 0);
        std::copy(other.begin(), other.end(), begin());
    }
    KVArray(KVArray&& other) noexcept { swap(other); }
    KVArray& operator=(KVArray other) noexcept
    {
        swap(other);
        return *this;
    }
    virtual ~KVArray() = default;

    int size() const noexcept { return size_; }
    int capacity() const noexcept { return capacity_; }
    /// Null as long as the capacity is 0.
    T* data() noexcept { return data_.get(); }
    T const* data() const noexcept { return data_.get(); }
    T* begin() noexcept { return data(); }
    T* end() noexcept { return data() + size_; }
    T const* begin() const noexcept { return data(); }
    T const* end() const noexcept { return data() + size_; }

    /// Throws KVBadIndexException outside 0 to size() - 1.
    T& operator[](int index) { return data_[checked(index)]; }
    T const& operator[](int index) const { return data_[checked(index)]; }

    /// Sets the size, and the capacity to the larger of the two, also where that is less than it
    /// was. Elements between the old size and a larger new one are zero; those beyond a smaller one
    /// keep what they hold as long as the capacity stays. Throws KVIllegalArgumentException for a
    /// negative size.
    void resize(int size, int capacity);
    /// Appends a copy, which may be of an element of this array. A full array doubles its capacity.
    void push(T const& value);

private:
    std::size_t checked(int index) const
    {
        if (index < 0 || index >= size_)
            throw KVBadIndexException(
                KVString::ssprintf("KVArray index %d out of range %d", index, size_ - 1));
        return static_cast<std::size_t>(index);
    }
    void swap(KVArray& other) noexcept
    {
        std::swap(capacity_, other.capacity_);
        std::swap(size_, other.size_);
        std::swap(data_, other.data_);
    }

    int capacity_ = 0;
    int size_ = 0;
    std::unique_ptr<T[]> data_;
};

template <class T, class Traits>
void KVArray<T, Traits>::resize(int size, int capacity)
{
    if (size < 0)
        throw KVIllegalArgumentException("KVArray::resize");
    int const newCapacity = std::max(capacity, size);
    if (newCapacity != capacity_) {
        auto grown = newCapacity ? Traits::make(static_cast<std::size_t>(newCapacity)) : nullptr;
        std::move(begin(), begin() + std::min(size_, size), grown.get());
        data_ = std::move(grown);
    } else if (size > size_) {
        Traits::zero(begin() + size_, begin() + size);
    }
    capacity_ = newCapacity;
    size_ = size;
}

template <class T, class Traits>
void KVArray<T, Traits>::push(T const& value)
{
    T copy(value);
    if (size_ == capacity_) {
        if (size_ == std::numeric_limits<int>::max())
            throw std::bad_alloc();
        int const limit = std::numeric_limits<int>::max();
        resize(size_ + 1, capacity_ > limit / 2 ? limit : std::max(4, 2 * capacity_));
    } else {
        ++size_;
    }
    data_[static_cast<std::size_t>(size_ - 1)] = std::move(copy);
}
