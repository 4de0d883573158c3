#pragma once

#include <algorithm>
#include <cstddef>
#include <memory>
#include <new>
#include <utility>

namespace cc {

/// A growing array of plain values. Sizes and capacities count elements.
///
///     cc::vec_t<unsigned short> table;
///     table.resize(3 * 33 * 33 * 33);      // zeros
///     table[0] = 65535;
///
/// New elements are zero. A capacity that is asked for is rounded up to a multiple of 16; growing
/// copies what is there and ends the validity of pointers into it. Access is not checked.
template <class T>
class vec_t {
public:
    vec_t() noexcept = default;
    explicit vec_t(std::size_t size) { resize(size); }
    vec_t(vec_t const& other) : vec_t(other.size_)
    {
        std::copy(other.begin(), other.end(), begin());
    }
    vec_t(vec_t&& other) noexcept { swap(other); }
    vec_t& operator=(vec_t other) noexcept
    {
        swap(other);
        return *this;
    }

    std::size_t size() const noexcept { return size_; }
    std::size_t capacity() const noexcept { return capacity_; }
    bool empty() const noexcept { return size_ == 0; }
    /// Null as long as the capacity is 0.
    T* data() noexcept { return data_.get(); }
    T const* data() const noexcept { return data_.get(); }
    T* begin() noexcept { return data(); }
    T* end() noexcept { return data() + size_; }
    T const* begin() const noexcept { return data(); }
    T const* end() const noexcept { return data() + size_; }
    T& operator[](std::size_t index) noexcept { return data_[index]; }
    T const& operator[](std::size_t index) const noexcept { return data_[index]; }

    /// Makes room for `capacity` elements at least. Throws std::bad_alloc, as does all that grows.
    void reserve(std::size_t capacity);
    /// Cuts the array, or adds zeros.
    void resize(std::size_t size);
    /// Appends; an array that is full doubles its capacity.
    void push_back(T value);
    /// Size 0; the memory stays.
    void clear() noexcept { size_ = 0; }

    void swap(vec_t& other) noexcept
    {
        std::swap(data_, other.data_);
        std::swap(size_, other.size_);
        std::swap(capacity_, other.capacity_);
    }

private:
    std::unique_ptr<T[]> data_;
    std::size_t size_ = 0;
    std::size_t capacity_ = 0;
};

template <class T>
void vec_t<T>::reserve(std::size_t capacity)
{
    if (capacity <= capacity_)
        return;
    std::size_t rounded = 0;
    if (__builtin_add_overflow(capacity, std::size_t(15), &rounded))
        throw std::bad_alloc();
    rounded &= ~std::size_t(15);
    auto grown = std::make_unique<T[]>(rounded);
    std::copy(begin(), end(), grown.get());
    data_ = std::move(grown);
    capacity_ = rounded;
}

template <class T>
void vec_t<T>::resize(std::size_t size)
{
    reserve(size);
    if (size > size_)
        std::fill(end(), begin() + size, T());
    size_ = size;
}

template <class T>
void vec_t<T>::push_back(T value)
{
    if (size_ == capacity_)
        reserve(std::max(size_ + 1, 2 * size_));
    data_[size_++] = value;
}

} // namespace cc
