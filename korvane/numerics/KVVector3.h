#pragma once

#include <korvane/numerics/KVVector2.h>

/// Three components by value. T is `float` or `double`; a default-made vector is zero.
///
///     KVVector3<double> const x(1, 0, 0), y(0, 1, 0);
///     x.cross(y);                 // (0, 0, 1): right-handed
template <class T>
struct KVVector3 {
    T x = 0;
    T y = 0;
    T z = 0;

    constexpr KVVector3() noexcept = default;
    constexpr KVVector3(T xValue, T yValue, T zValue) noexcept : x(xValue), y(yValue), z(zValue) {}
    /// From the other precision.
    template <class U>
    constexpr explicit KVVector3(KVVector3<U> const& other) noexcept
        : x(static_cast<T>(other.x)), y(static_cast<T>(other.y)), z(static_cast<T>(other.z))
    {}

    constexpr KVVector3& operator+=(KVVector3 const& v) noexcept { return *this = *this + v; }
    constexpr KVVector3& operator-=(KVVector3 const& v) noexcept { return *this = *this - v; }
    constexpr KVVector3& operator*=(T factor) noexcept { return *this = *this * factor; }
    constexpr KVVector3& operator/=(T divisor) noexcept { return *this = *this / divisor; }

    constexpr KVVector3 operator-() const noexcept { return {-x, -y, -z}; }
    friend constexpr KVVector3 operator+(KVVector3 const& a, KVVector3 const& b) noexcept
    {
        return {a.x + b.x, a.y + b.y, a.z + b.z};
    }
    friend constexpr KVVector3 operator-(KVVector3 const& a, KVVector3 const& b) noexcept
    {
        return {a.x - b.x, a.y - b.y, a.z - b.z};
    }
    friend constexpr KVVector3 operator*(KVVector3 const& v, T factor) noexcept
    {
        return {v.x * factor, v.y * factor, v.z * factor};
    }
    friend constexpr KVVector3 operator*(T factor, KVVector3 const& v) noexcept
    {
        return v * factor;
    }
    friend constexpr KVVector3 operator/(KVVector3 const& v, T divisor) noexcept
    {
        return {v.x / divisor, v.y / divisor, v.z / divisor};
    }
    /// Component by component, exactly.
    friend constexpr bool operator==(KVVector3 const&, KVVector3 const&) noexcept = default;

    constexpr T dot(KVVector3 const& v) const noexcept { return x * v.x + y * v.y + z * v.z; }
    constexpr KVVector3 cross(KVVector3 const& v) const noexcept
    {
        return {y * v.z - z * v.y, z * v.x - x * v.z, x * v.y - y * v.x};
    }
    constexpr T lengthSquared() const noexcept { return dot(*this); }
    T length() const noexcept { return std::sqrt(lengthSquared()); }

    /// Divides by the length and answers true. A length strictly between -tolerance and +tolerance
    /// leaves the vector alone and answers false.
    bool normalize(double tolerance) noexcept
    {
        T const size = length();
        if (-tolerance < size && size < tolerance)
            return false;
        *this /= size;
        return true;
    }
};

/// The rotation that turns the direction `from` into the direction `to`: `angle`, in radians from 0
/// to pi, about the unit vector `axis`, counterclockwise seen from its tip.
///
/// Answers false for parallel directions: the axis is then zero and the angle 0 or pi. A zero
/// vector has no direction; it gives false and an angle that is not a number.
template <class T>
bool KVCalcAxisAngle(KVVector3<T> const& from, KVVector3<T> const& to, KVVector3<T>& axis, T& angle)
{
    T const lengths = from.length() * to.length();
    T const cosine = from.dot(to) / lengths;
    KVVector3<T> normal = from.cross(to);
    angle = std::atan2(normal.length() / lengths, cosine);
    // 1e-7 as a float.
    bool const found = normal.normalize(1.0000000116860974e-7);
    axis = normal;
    return found;
}
