#pragma once

#include <korvane/foundation/KVExport.h>
#include <korvane/numerics/KVMatrix44Parameters.h>
#include <korvane/numerics/KVQuat.h>
#include <korvane/numerics/KVRect.h>
#include <korvane/numerics/KVVector4.h>

#include <array>

/// A 4x4 transform by value, row-major, acting on column vectors: translation stands in column 3,
/// perspective in row 3. T is `float` or `double`; a default-made matrix is the identity.
///
///     | m(0,0) m(0,1) m(0,2) tx |   | x |
///     | m(1,0) m(1,1) m(1,2) ty | * | y |       in memory: m(0,0), m(0,1), m(0,2), tx, m(1,0), ...
///     | m(2,0) m(2,1) m(2,2) tz |   | z |
///     | px     py     pz     w  |   | 1 |
///
/// Angles are in radians. Rotations are right-handed:
///
///          | 1  0  0 |        |  c  0  s |        | c -s  0 |
///     Rx = | 0  c -s |   Ry = |  0  1  0 |   Rz = | s  c  0 |      c = cos angle, s = sin angle
///          | 0  s  c |        | -s  0  c |        | 0  0  1 |
///
/// The editing members work in place. `left...` puts its operation on the left, so that it acts
/// after what the matrix did so far, `right...` on the right, so that it acts before. Each skips
/// its work for the neutral argument: 0 for a translation or an angle, 1 for a scale.
///
///     KVMatrix44Tmpl<double> m;
///     m.leftScale(2, 2, 1);
///     m.leftTranslate(10, 0, 0);
///     KVVector3<double> p;
///     m.transform(KVVector3<double>(1, 0, 0), p);        // (12, 0, 0)
///
/// Nothing here throws: what can fail answers false. Not synchronised.
template <class T>
class KV_EXPORT KVMatrix44Tmpl {
public:
    enum axis : int { xAxis = 0, yAxis = 1, zAxis = 2 };

    // --- Make and read ---

    constexpr KVMatrix44Tmpl() noexcept : values_{1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1} {}
    /// Sixteen elements, row by row.
    constexpr explicit KVMatrix44Tmpl(std::array<T, 16> const& rowMajor) noexcept
        : values_(rowMajor)
    {}

    /// Rows and columns 0 to 3; an index outside them is undefined.
    constexpr T operator()(int row, int col) const noexcept { return values_[index(row, col)]; }
    constexpr T& operator()(int row, int col) noexcept { return values_[index(row, col)]; }
    /// The sixteen elements, row by row.
    constexpr T const* data() const noexcept { return values_.data(); }
    constexpr T* data() noexcept { return values_.data(); }
    /// Element by element, exactly.
    friend constexpr bool operator==(KVMatrix44Tmpl const&, KVMatrix44Tmpl const&) = default;

    /// Whether this is the identity times any factor that is not near 0: with w = m(3,3), |w| is at
    /// least 1e-7, the diagonal is closer than 1e-7 to w and all else closer than 1e-7 to 0.
    bool isIdentity() const noexcept;
    T determinant() const noexcept;

    // --- Multiply ---

    /// This times `b`.
    KVMatrix44Tmpl operator*(KVMatrix44Tmpl const& b) const noexcept;
    /// Becomes `a` times this; `a` may be this.
    void leftMult(KVMatrix44Tmpl const& a) noexcept;
    /// Becomes this times `a`; `a` may be this.
    void rightMult(KVMatrix44Tmpl const& a) noexcept;

    // --- Edit ---

    void leftTranslate(T x, T y, T z) noexcept;
    void rightTranslate(T x, T y, T z) noexcept;
    void leftScale(T x, T y, T z) noexcept;
    void rightScale(T x, T y, T z) noexcept;
    /// Multiplies by the matrix H with the rows (1, tan a), (tan b, 1) in its upper left corner. An
    /// angle is first brought into 0 to pi; one within 0.3 degrees of a right angle is taken as
    /// 1.5655603390389135, the right angle less 0.3 degrees. An angle that is not finite has a
    /// tangent that is not a number.
    void leftShear(double a, double b) noexcept;
    void rightShear(double a, double b) noexcept;
    /// Multiplies by Rx, Ry or Rz. An angle closer than 1e-7 to pi/2, pi or 3 pi/2, or to the
    /// negative of one, has a sine and cosine of exactly 0, 1 and -1. An axis outside 0 to 2 leaves
    /// the matrix alone.
    void leftRotate(double angle, axis about) noexcept;
    void rightRotate(double angle, axis about) noexcept;
    void transpose() noexcept;

    // --- Invert ---

    /// Becomes the inverse of `source`, which may be this, by the adjugate. Answers false and
    /// leaves this unchanged if the determinant is 0 or its absolute value below `tolerance`; one
    /// that is not a number is neither, and gives a matrix of such.
    bool invert(KVMatrix44Tmpl const& source, double tolerance = 0) noexcept;
    /// The inverse in the plane z = 0: inverts rows and columns 0, 1 and 3 of `source`, as `invert`
    /// does, and makes row 2 and column 2 zero, m(2,2) as well, so that the result flattens z.
    bool planarInverseZ(KVMatrix44Tmpl const& source, double tolerance = 0) noexcept;

    // --- Transform ---

    // Each returns `out`, which may be `in`. Three components stand for (x, y, z, 1), two for
    // (x, y, 0, 1).

    template <class V>
    constexpr KVVector4<V>& transform(KVVector4<V> const& in, KVVector4<V>& out) const noexcept
    {
        return out = KVVector4<V>(row(0, in), row(1, in), row(2, in), row(3, in));
    }
    template <class V>
    constexpr KVVector4<V>& transform(KVVector3<V> const& in, KVVector4<V>& out) const noexcept
    {
        return out = KVVector4<V>(row(0, in), row(1, in), row(2, in), row(3, in));
    }
    template <class V>
    constexpr KVVector4<V>& transform(KVVector2<V> const& in, KVVector4<V>& out) const noexcept
    {
        return out = KVVector4<V>(row(0, in), row(1, in), row(2, in), row(3, in));
    }
    /// Divides by the resulting w, without any test of it: 0 gives infinities or NaN.
    template <class V>
    constexpr KVVector3<V>& transform(KVVector3<V> const& in, KVVector3<V>& out) const noexcept
    {
        V const w = row(3, in);
        return out = KVVector3<V>(row(0, in) / w, row(1, in) / w, row(2, in) / w);
    }
    /// Divides by the resulting w, without any test of it.
    template <class V>
    constexpr KVVector2<V>& transform(KVVector2<V> const& in, KVVector2<V>& out) const noexcept
    {
        V const w = row(3, in);
        return out = KVVector2<V>(row(0, in) / w, row(1, in) / w);
    }
    /// The bounds of the transformed corners, divided by w. An empty `in` makes `out` empty, its
    /// origin left alone. Answers false and leaves `out` unchanged if the corners' w differ in sign
    /// or one is 0 or not a number: the rectangle then reaches behind the eye. `out` may be `in`.
    bool transformRect(KVRect<T> const& in, KVRect<T>& out) const noexcept;
    /// The derivative of the perspective division at `p`, the homogeneous result of `transform`:
    /// (w m(r,c) - p(r) m(3,c)) / w^2 for rows and columns 0 to 2, with w = p.w, and elsewhere as
    /// the identity.
    KVMatrix44Tmpl jacobianPost(KVVector4<T> const& p) const noexcept;

    // --- Take apart and put together ---

    /// Takes the transform apart as
    ///
    ///                               | sx     0      0  |
    ///     m / m(3,3) = Translation * | .      sy     0  | * Rotation
    ///                               | sz shx sz shy sz |
    ///
    /// by orthogonalising the rows of its 3x3 part from the first to the last (Gram and Schmidt;
    /// Thomas 1991). What the dot stands for, a shear of y by x, and all perspective are dropped. A
    /// mirror turns the sign of all three scales.
    ///
    /// Writes translation, scale and shear into `parameters` and the 3x3 part of Rotation into
    /// `rotation`, whose fourth row and column it leaves alone. Answers false, with nothing
    /// written, if m(3,3) is 0 or the 3x3 part singular.
    bool getPartialTransformation(KVMatrix44Parameters<T>& parameters,
                                  KVMatrix44Tmpl& rotation) const noexcept;
    /// The same with Rotation as three angles, in the order that `parameters.rotOrder` asks for; an
    /// order outside 0 to 5 prints "bad rotOrder" and aborts the process, once all else succeeded.
    ///
    /// The angle of the axis that is applied second is an arc sine, not clamped: an entry that
    /// rounding pushed beyond 1 makes it not a number. Where the cosine of that angle is closer
    /// than 1e-7 to 0 (gimbal lock) one of the others can be chosen: it is 0, y in the orders 1 and
    /// 3, z in the rest.
    bool getTransformation(KVMatrix44Parameters<T>& parameters) const;
    /// The same with Rotation as a quaternion; the angles of `parameters` are left alone. A half
    /// turn's axis has no negative components.
    bool getTransformation(KVMatrix44Parameters<T>& parameters,
                           KVQuat<T>& quaternion) const noexcept;
    /// Becomes Translation * Scale and shear * Rotation: the reverse of `getTransformation`. Aborts
    /// in the same way for a bad `rotOrder`.
    void setTransformation(KVMatrix44Parameters<T> const& parameters);

private:
    /// All elements are about to be written.
    struct Unset {};
    explicit KVMatrix44Tmpl(Unset) noexcept {}
    static constexpr std::size_t index(int row, int col) noexcept
    {
        return static_cast<std::size_t>(row * 4 + col);
    }
    template <class V>
    constexpr V row(int r, KVVector4<V> const& v) const noexcept
    {
        T const* m = data() + 4 * r;
        return static_cast<V>(m[0] * v.x + m[1] * v.y + m[2] * v.z + m[3] * v.w);
    }
    template <class V>
    constexpr V row(int r, KVVector3<V> const& v) const noexcept
    {
        T const* m = data() + 4 * r;
        return static_cast<V>(m[0] * v.x + m[1] * v.y + m[2] * v.z + m[3]);
    }
    template <class V>
    constexpr V row(int r, KVVector2<V> const& v) const noexcept
    {
        T const* m = data() + 4 * r;
        return static_cast<V>(m[0] * v.x + m[1] * v.y + m[3]);
    }

    std::array<T, 16> values_;
};

extern template class KVMatrix44Tmpl<float>;
extern template class KVMatrix44Tmpl<double>;

/// `out.planarInverseZ(source, tolerance)`.
template <class T>
bool KVMatrix44_planarInverseZ(KVMatrix44Tmpl<T>& out, KVMatrix44Tmpl<T> const& source,
                               double tolerance) noexcept
{
    return out.planarInverseZ(source, tolerance);
}
