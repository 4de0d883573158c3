#include <korvane/numerics/KVMatrix44Tmpl.h>

#include <korvane/numerics/KVMatrix33Tmpl.h>

#include <limits>
#include <numbers>
#include <utility>

namespace {

constexpr double tolerance = 1e-7;

/// Elements that lie side by side, for arithmetic on all at once.
template <class T, std::size_t count>
struct PackOf {
    typedef T Type __attribute__((vector_size(count * sizeof(T)), aligned(sizeof(T)), may_alias));
};
template <class T>
using Row = typename PackOf<T, 4>::Type;

template <class T>
inline Row<T>* rowsOf(T* elements) noexcept
{
    return reinterpret_cast<Row<T>*>(elements);
}
template <class T>
inline Row<T> const* rowsOf(T const* elements) noexcept
{
    return reinterpret_cast<Row<T> const*>(elements);
}

/// Writes a times b to `product`, which may be either: b is read first, then row by row of a.
template <class T>
[[gnu::always_inline]] inline void multiplyRows(T const* a, T const* b, T* product) noexcept
{
    Row<T> const b0 = rowsOf(b)[0], b1 = rowsOf(b)[1], b2 = rowsOf(b)[2], b3 = rowsOf(b)[3];
#pragma GCC unroll 4
    for (int i = 0; i < 4; ++i, a += 4)
        rowsOf(product)[i] = a[0] * b0 + a[1] * b1 + a[2] * b2 + a[3] * b3;
}

#if defined(__x86_64__)
/// On machines with AVX, which rounds as the other form does: none may fuse a product and a sum.
[[gnu::target("avx")]] void multiplyAVX(double const* a, double const* b, double* product) noexcept
{
    multiplyRows(a, b, product);
}
#endif

inline void multiply(double const* a, double const* b, double* product) noexcept
{
#if defined(__x86_64__)
    if (__builtin_cpu_supports("avx"))
        return multiplyAVX(a, b, product);
#endif
    multiplyRows(a, b, product);
}

inline void multiply(float const* a, float const* b, float* product) noexcept
{
    multiplyRows(a, b, product);
}

struct SineAndCosine {
    double sine;
    double cosine;
};

/// Exact near the multiples of a right angle that are met in practice.
SineAndCosine sineAndCosine(double angle) noexcept
{
    constexpr double pi = std::numbers::pi;
    auto const isNear = [angle](double special) { return std::abs(angle - special) < tolerance; };
    if (isNear(-pi / 2) || isNear(3 * pi / 2))
        return {-1, 0};
    if (isNear(pi / 2) || isNear(-3 * pi / 2))
        return {1, 0};
    if (isNear(-pi) || isNear(pi))
        return {0, -1};
    return {std::sin(angle), std::cos(angle)};
}

/// The tangent of a shear angle, kept away from the right angle where it has no bound.
double shearFactor(double angle) noexcept
{
    constexpr double pi = std::numbers::pi;
    constexpr double largest = 1.5655603390389135;
    if (angle == 0)
        return 0;
    if (!std::isfinite(angle))
        return std::numeric_limits<double>::quiet_NaN();
    // Turn by turn for angles that occur. A huge one does not change when pi is added.
    if (std::abs(angle) > 1000 * pi)
        angle = std::fmod(angle, pi);
    while (angle < 0)
        angle += pi;
    while (angle > pi)
        angle -= pi;
    if (angle >= largest && angle < 1.5760323145508794)
        angle = largest;
    return std::tan(angle);
}

/// The two rows or columns, in cyclic order, that a rotation about an axis combines: those of y and
/// z for x, of z and x for y, of x and y for z.
struct Plane {
    int first;
    int second;
};
constexpr Plane planes[] = {{1, 2}, {2, 0}, {0, 1}};

/// The six 2x2 minors of two rows, by their columns.
template <class T>
struct Minors {
    Minors(T const* a, T const* b) noexcept
        : m01(a[0] * b[1] - a[1] * b[0]),
          m02(a[0] * b[2] - a[2] * b[0]),
          m03(a[0] * b[3] - a[3] * b[0]),
          m12(a[1] * b[2] - a[2] * b[1]),
          m13(a[1] * b[3] - a[3] * b[1]),
          m23(a[2] * b[3] - a[3] * b[2])
    {}
    /// The determinant of the matrix with `upper` above these two rows.
    T determinantBelow(Minors const& upper) const noexcept
    {
        return upper.m01 * m23 - upper.m02 * m13 + upper.m03 * m12 + upper.m12 * m03 -
               upper.m13 * m02 + upper.m23 * m01;
    }

    T m01, m02, m03, m12, m13, m23;
};

/// Two columns of an inverse, from the two rows of the source that they look at and the minors of
/// the other two.
template <class T>
[[gnu::always_inline]] inline void invertColumns(T const* a, T const* b, Minors<T> const& minors,
                                                 T determinant, T* out) noexcept
{
    using Pair = typename PackOf<T, 2>::Type;
    Pair const c0{a[0], b[0]}, c1{a[1], b[1]}, c2{a[2], b[2]}, c3{a[3], b[3]};
    Pair const divisor{determinant, -determinant};
    auto const put = [out, divisor](int row, Pair cofactors) {
        *reinterpret_cast<Pair*>(out + 4 * row) = cofactors / divisor;
    };
    put(0, c1 * minors.m23 - c2 * minors.m13 + c3 * minors.m12);
    put(1, c2 * minors.m03 - c0 * minors.m23 - c3 * minors.m02);
    put(2, c0 * minors.m13 - c1 * minors.m03 + c3 * minors.m01);
    put(3, c1 * minors.m02 - c0 * minors.m12 - c2 * minors.m01);
}

} // namespace

template <class T>
bool KVMatrix44Tmpl<T>::isIdentity() const noexcept
{
    double const w = values_[15];
    if (std::abs(w) < tolerance)
        return false;
    for (std::size_t i = 0; i < 15; ++i)
        if (!(std::abs(values_[i] - (i % 5 == 0 ? w : 0)) < tolerance))
            return false;
    return true;
}

template <class T>
T KVMatrix44Tmpl<T>::determinant() const noexcept
{
    Minors<T> const upper(data(), data() + 4);
    Minors<T> const lower(data() + 8, data() + 12);
    return lower.determinantBelow(upper);
}

template <class T>
KVMatrix44Tmpl<T> KVMatrix44Tmpl<T>::operator*(KVMatrix44Tmpl const& b) const noexcept
{
    KVMatrix44Tmpl product{Unset()};
    multiply(data(), b.data(), product.data());
    return product;
}

template <class T>
void KVMatrix44Tmpl<T>::leftMult(KVMatrix44Tmpl const& a) noexcept
{
    multiply(a.data(), data(), data());
}

template <class T>
void KVMatrix44Tmpl<T>::rightMult(KVMatrix44Tmpl const& a) noexcept
{
    multiply(data(), a.data(), data());
}

template <class T>
void KVMatrix44Tmpl<T>::leftTranslate(T x, T y, T z) noexcept
{
    Row<T>* const rows = rowsOf(data());
    if (x != 0)
        rows[0] += x * rows[3];
    if (y != 0)
        rows[1] += y * rows[3];
    if (z != 0)
        rows[2] += z * rows[3];
}

template <class T>
void KVMatrix44Tmpl<T>::rightTranslate(T x, T y, T z) noexcept
{
    T const by[] = {x, y, z};
    for (int col = 0; col < 3; ++col)
        if (by[col] != 0)
            for (int row = 0; row < 4; ++row)
                (*this)(row, 3) += (*this)(row, col) * by[col];
}

template <class T>
void KVMatrix44Tmpl<T>::leftScale(T x, T y, T z) noexcept
{
    Row<T>* const rows = rowsOf(data());
    if (x != 1)
        rows[0] *= x;
    if (y != 1)
        rows[1] *= y;
    if (z != 1)
        rows[2] *= z;
}

template <class T>
void KVMatrix44Tmpl<T>::rightScale(T x, T y, T z) noexcept
{
    T const by[] = {x, y, z};
    for (int col = 0; col < 3; ++col)
        if (by[col] != 1)
            for (int row = 0; row < 4; ++row)
                (*this)(row, col) *= by[col];
}

template <class T>
void KVMatrix44Tmpl<T>::leftShear(double a, double b) noexcept
{
    Row<T>* const rows = rowsOf(data());
    T const ta = static_cast<T>(shearFactor(a));
    T const tb = static_cast<T>(shearFactor(b));
    Row<T> const old = rows[0];
    if (ta != 0)
        rows[0] += ta * rows[1];
    if (tb != 0)
        rows[1] += tb * old;
}

template <class T>
void KVMatrix44Tmpl<T>::rightShear(double a, double b) noexcept
{
    T const ta = static_cast<T>(shearFactor(a));
    T const tb = static_cast<T>(shearFactor(b));
    for (int row = 0; row < 4; ++row) {
        T const old = (*this)(row, 0);
        if (tb != 0)
            (*this)(row, 0) += tb * (*this)(row, 1);
        if (ta != 0)
            (*this)(row, 1) += ta * old;
    }
}

template <class T>
void KVMatrix44Tmpl<T>::leftRotate(double angle, axis about) noexcept
{
    if (angle == 0 || about < xAxis || about > zAxis)
        return;
    auto const [sine, cosine] = sineAndCosine(angle);
    T const s = static_cast<T>(sine);
    T const c = static_cast<T>(cosine);
    Row<T>& first = rowsOf(data())[planes[about].first];
    Row<T>& second = rowsOf(data())[planes[about].second];
    Row<T> const old = first;
    first = c * old - s * second;
    second = s * old + c * second;
}

template <class T>
void KVMatrix44Tmpl<T>::rightRotate(double angle, axis about) noexcept
{
    if (angle == 0 || about < xAxis || about > zAxis)
        return;
    auto const [sine, cosine] = sineAndCosine(angle);
    T const s = static_cast<T>(sine);
    T const c = static_cast<T>(cosine);
    for (int row = 0; row < 4; ++row) {
        T& first = (*this)(row, planes[about].first);
        T& second = (*this)(row, planes[about].second);
        T const old = first;
        first = c * old + s * second;
        second = c * second - s * old;
    }
}

template <class T>
void KVMatrix44Tmpl<T>::transpose() noexcept
{
    for (int row = 0; row < 4; ++row)
        for (int col = row + 1; col < 4; ++col)
            std::swap((*this)(row, col), (*this)(col, row));
}

template <class T>
bool KVMatrix44Tmpl<T>::invert(KVMatrix44Tmpl const& source, double least) noexcept
{
    T const* const m = source.data();
    Minors<T> const a(m, m + 4);
    Minors<T> const b(m + 8, m + 12);
    T const determinant = b.determinantBelow(a);
    if (determinant == 0 || std::abs(determinant) < least)
        return false;
    KVMatrix44Tmpl inverse{Unset()};
    T* const out = inverse.data();
    invertColumns(m + 4, m, b, determinant, out);
    invertColumns(m + 12, m + 8, a, determinant, out + 2);
    *this = inverse;
    return true;
}

template <class T>
bool KVMatrix44Tmpl<T>::planarInverseZ(KVMatrix44Tmpl const& source, double least) noexcept
{
    auto const& m = source.values_;
    KVMatrix33Tmpl<T> plane({m[0], m[1], m[3], m[4], m[5], m[7], m[12], m[13], m[15]});
    if (!plane.invert(plane, least))
        return false;
    T const* p = plane.data();
    values_ = {p[0], p[1], 0, p[2], p[3], p[4], 0, p[5], 0, 0, 0, 0, p[6], p[7], 0, p[8]};
    return true;
}

template <class T>
bool KVMatrix44Tmpl<T>::transformRect(KVRect<T> const& in, KVRect<T>& out) const noexcept
{
    if (in.isEmpty()) {
        out.width = out.height = -1;
        return true;
    }
    T const right = in.x + in.width;
    T const top = in.y + in.height;
    KVVector2<T> const corners[] = {{in.x, top}, {right, top}, {right, in.y}, {in.x, in.y}};
    KVRect<T> bounds;
    T firstW = 0;
    for (KVVector2<T> const& corner : corners) {
        KVVector4<T> p;
        transform(corner, p);
        if (firstW == 0)
            firstW = p.w;
        if (!(firstW > 0 ? p.w > 0 : p.w < 0))
            return false;
        bounds |= {p.x / p.w, p.y / p.w};
    }
    out = bounds;
    return true;
}

template <class T>
KVMatrix44Tmpl<T> KVMatrix44Tmpl<T>::jacobianPost(KVVector4<T> const& p) const noexcept
{
    KVMatrix44Tmpl jacobian;
    T const point[] = {p.x, p.y, p.z};
    T const square = p.w * p.w;
    for (int row = 0; row < 3; ++row)
        for (int col = 0; col < 3; ++col)
            jacobian(row, col) = (p.w * (*this)(row, col) - point[row] * (*this)(3, col)) / square;
    return jacobian;
}

template class KVMatrix44Tmpl<float>;
template class KVMatrix44Tmpl<double>;
