#pragma once

/// A quaternion w + xi + yj + zk by value. One of length 1 stands for the rotation by the angle a
/// about the unit vector n: w = cos(a/2), (x, y, z) = sin(a/2) n. A default-made one is the
/// identity.
template <class T>
struct KVQuat {
    T w = 1;
    T x = 0;
    T y = 0;
    T z = 0;

    constexpr KVQuat() noexcept = default;
    constexpr KVQuat(T wValue, T xValue, T yValue, T zValue) noexcept
        : w(wValue), x(xValue), y(yValue), z(zValue)
    {}

    /// Component by component, exactly.
    friend constexpr bool operator==(KVQuat const&, KVQuat const&) noexcept = default;
};
