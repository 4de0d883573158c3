#pragma once

#include <korvane/numerics/KVVector3.h>

/// Four components by value: a homogeneous point, or the plane (a, b, c, d). T is `float` or
/// `double`; a default-made vector is zero. All four components take part in all that is done here.
template <class T>
struct KVVector4 {
    T x = 0;
    T y = 0;
    T z = 0;
    T w = 0;

    constexpr KVVector4() noexcept = default;
    constexpr KVVector4(T xValue, T yValue, T zValue, T wValue) noexcept
        : x(xValue), y(yValue), z(zValue), w(wValue)
    {}
    constexpr KVVector4(KVVector3<T> const& v, T wValue) noexcept
        : x(v.x), y(v.y), z(v.z), w(wValue)
    {}
    /// From the other precision.
    template <class U>
    constexpr explicit KVVector4(KVVector4<U> const& other) noexcept
        : x(static_cast<T>(other.x)),
          y(static_cast<T>(other.y)),
          z(static_cast<T>(other.z)),
          w(static_cast<T>(other.w))
    {}

    constexpr KVVector4& operator+=(KVVector4 const& v) noexcept { return *this = *this + v; }
    constexpr KVVector4& operator-=(KVVector4 const& v) noexcept { return *this = *this - v; }
    constexpr KVVector4& operator*=(T factor) noexcept { return *this = *this * factor; }
    constexpr KVVector4& operator/=(T divisor) noexcept { return *this = *this / divisor; }

    constexpr KVVector4 operator-() const noexcept { return {-x, -y, -z, -w}; }
    friend constexpr KVVector4 operator+(KVVector4 const& a, KVVector4 const& b) noexcept
    {
        return {a.x + b.x, a.y + b.y, a.z + b.z, a.w + b.w};
    }
    friend constexpr KVVector4 operator-(KVVector4 const& a, KVVector4 const& b) noexcept
    {
        return {a.x - b.x, a.y - b.y, a.z - b.z, a.w - b.w};
    }
    friend constexpr KVVector4 operator*(KVVector4 const& v, T factor) noexcept
    {
        return {v.x * factor, v.y * factor, v.z * factor, v.w * factor};
    }
    friend constexpr KVVector4 operator*(T factor, KVVector4 const& v) noexcept
    {
        return v * factor;
    }
    friend constexpr KVVector4 operator/(KVVector4 const& v, T divisor) noexcept
    {
        return {v.x / divisor, v.y / divisor, v.z / divisor, v.w / divisor};
    }
    /// Component by component, exactly.
    friend constexpr bool operator==(KVVector4 const&, KVVector4 const&) noexcept = default;

    constexpr T dot(KVVector4 const& v) const noexcept
    {
        return x * v.x + y * v.y + z * v.z + w * v.w;
    }
    constexpr T lengthSquared() const noexcept { return dot(*this); }
    T length() const noexcept { return std::sqrt(lengthSquared()); }

    /// Gives the vector the length `newLength`; a vector of length exactly 0 is left alone.
    void scale(double newLength) noexcept
    {
        T const size = length();
        if (size != 0)
            *this *= static_cast<T>(newLength / size);
    }
};
