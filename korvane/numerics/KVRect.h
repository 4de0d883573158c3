#pragma once

#include <korvane/numerics/KVVector2.h>

/// A rectangle by its origin, the corner of least x and y, and its extent. A negative width or
/// height makes it the empty rectangle, which holds nothing; a width or height of 0 does not. A
/// default-made rectangle is empty.
///
///     KVRect<double> bounds;                   // empty
///     bounds |= {3, 4};                        // x 3, y 4, width 0, height 0
///     bounds |= {1, 9};                        // x 1, y 4, width 2, height 5
template <class T>
struct KVRect {
    T x = 0;
    T y = 0;
    T width = -1;
    T height = -1;

    constexpr KVRect() noexcept = default;
    constexpr KVRect(T xValue, T yValue, T widthValue, T heightValue) noexcept
        : x(xValue), y(yValue), width(widthValue), height(heightValue)
    {}

    constexpr bool isEmpty() const noexcept { return width < 0 || height < 0; }

    /// Grows just so far that the point lies in it, borders included.
    constexpr KVRect& operator|=(KVVector2<T> const& point) noexcept
    {
        if (isEmpty())
            return *this = {point.x, point.y, 0, 0};
        grow(x, width, point.x);
        grow(y, height, point.y);
        return *this;
    }
    /// Member by member, exactly: two empty rectangles may differ.
    friend constexpr bool operator==(KVRect const&, KVRect const&) noexcept = default;

private:
    static constexpr void grow(T& start, T& extent, T position) noexcept
    {
        T const end = start + extent;
        if (position < start) {
            start = position;
            extent = end - position;
        } else if (position > end) {
            extent = position - start;
        }
    }
};
