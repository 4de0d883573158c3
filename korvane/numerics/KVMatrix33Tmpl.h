#pragma once

#include <korvane/foundation/KVExport.h>
#include <korvane/numerics/KVVector3.h>

#include <array>

/// A 3x3 matrix by value, row-major, acting on column vectors. T is `float` or `double`; a
/// default-made matrix is the identity.
///
///     | m(0,0) m(0,1) m(0,2) |   | x |
///     | m(1,0) m(1,1) m(1,2) | * | y |          in memory: m(0,0), m(0,1), m(0,2), m(1,0), ...
///     | m(2,0) m(2,1) m(2,2) |   | z |
///
///     KVMatrix33Tmpl<double> m({2, 0, 0, 0, 2, 0, 0, 0, 2});
///     KVMatrix33Tmpl<double> inverse;
///     if (inverse.invert(m))
///         KVVector3<double> half = inverse * v;
template <class T>
class KV_EXPORT KVMatrix33Tmpl {
public:
    constexpr KVMatrix33Tmpl() noexcept : values_{1, 0, 0, 0, 1, 0, 0, 0, 1} {}
    /// Nine elements, row by row.
    constexpr explicit KVMatrix33Tmpl(std::array<T, 9> const& rowMajor) noexcept : values_(rowMajor)
    {}

    /// Rows and columns 0 to 2; an index outside them is undefined.
    constexpr T operator()(int row, int col) const noexcept { return values_[index(row, col)]; }
    constexpr T& operator()(int row, int col) noexcept { return values_[index(row, col)]; }
    /// The nine elements, row by row.
    constexpr T const* data() const noexcept { return values_.data(); }
    constexpr T* data() noexcept { return values_.data(); }
    /// Element by element, exactly.
    friend constexpr bool operator==(KVMatrix33Tmpl const&, KVMatrix33Tmpl const&) = default;

    /// This times `b`: what acts first stands on the right.
    KVMatrix33Tmpl operator*(KVMatrix33Tmpl const& b) const noexcept;
    constexpr KVVector3<T> operator*(KVVector3<T> const& v) const noexcept
    {
        auto const& m = values_;
        return {m[0] * v.x + m[1] * v.y + m[2] * v.z, m[3] * v.x + m[4] * v.y + m[5] * v.z,
                m[6] * v.x + m[7] * v.y + m[8] * v.z};
    }
    void transpose() noexcept;
    T determinant() const noexcept;
    /// Becomes the inverse of `source`, which may be this, by the adjugate. Answers false and
    /// leaves this unchanged if the determinant is 0 or its absolute value below `tolerance`; one
    /// that is not a number is neither.
    bool invert(KVMatrix33Tmpl const& source, double tolerance = 0) noexcept;

private:
    static constexpr std::size_t index(int row, int col) noexcept
    {
        return static_cast<std::size_t>(row * 3 + col);
    }

    std::array<T, 9> values_;
};

extern template class KVMatrix33Tmpl<float>;
extern template class KVMatrix33Tmpl<double>;
