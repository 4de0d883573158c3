#pragma once

#include <cmath>

/// Two components by value. T is `float` or `double`; a default-made vector is zero.
///
///     KVVector2<double> a(3, 4);
///     a.length();                 // 5
///     a.cross({1, 0});            // -4: {1, 0} lies clockwise of a
template <class T>
struct KVVector2 {
    T x = 0;
    T y = 0;

    constexpr KVVector2() noexcept = default;
    constexpr KVVector2(T xValue, T yValue) noexcept : x(xValue), y(yValue) {}
    /// From the other precision.
    template <class U>
    constexpr explicit KVVector2(KVVector2<U> const& other) noexcept
        : x(static_cast<T>(other.x)), y(static_cast<T>(other.y))
    {}

    constexpr KVVector2& operator+=(KVVector2 const& v) noexcept { return *this = *this + v; }
    constexpr KVVector2& operator-=(KVVector2 const& v) noexcept { return *this = *this - v; }
    constexpr KVVector2& operator*=(T factor) noexcept { return *this = *this * factor; }
    constexpr KVVector2& operator/=(T divisor) noexcept { return *this = *this / divisor; }

    constexpr KVVector2 operator-() const noexcept { return {-x, -y}; }
    friend constexpr KVVector2 operator+(KVVector2 const& a, KVVector2 const& b) noexcept
    {
        return {a.x + b.x, a.y + b.y};
    }
    friend constexpr KVVector2 operator-(KVVector2 const& a, KVVector2 const& b) noexcept
    {
        return {a.x - b.x, a.y - b.y};
    }
    friend constexpr KVVector2 operator*(KVVector2 const& v, T factor) noexcept
    {
        return {v.x * factor, v.y * factor};
    }
    friend constexpr KVVector2 operator*(T factor, KVVector2 const& v) noexcept
    {
        return v * factor;
    }
    friend constexpr KVVector2 operator/(KVVector2 const& v, T divisor) noexcept
    {
        return {v.x / divisor, v.y / divisor};
    }
    /// Component by component, exactly.
    friend constexpr bool operator==(KVVector2 const&, KVVector2 const&) noexcept = default;

    constexpr T dot(KVVector2 const& v) const noexcept { return x * v.x + y * v.y; }
    /// The third component of the cross product: positive when `v` lies counterclockwise of this,
    /// with y upwards.
    constexpr T cross(KVVector2 const& v) const noexcept { return x * v.y - y * v.x; }
    constexpr T lengthSquared() const noexcept { return dot(*this); }
    T length() const noexcept { return std::sqrt(lengthSquared()); }
};
