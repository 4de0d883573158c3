// Taking a transform apart and putting it together. Spencer W. Thomas, "Decomposing a matrix into
// simple transformations", Graphics Gems II, 1991, tells the method for row vectors.

#include <korvane/numerics/KVMatrix44Tmpl.h>

#include <korvane/foundation/KVPrint.h>

#include <algorithm>
#include <numbers>

namespace {

constexpr double tolerance = 1e-7;

bool isNearZero(double value) noexcept
{
    return -tolerance < value && value < tolerance;
}

[[noreturn]] void reportBadOrder()
{
    _KVShouldNotBeReached(__FILE__, __LINE__, "bad rotOrder");
}

/// Where the Euler angles of one order stand in the rotation matrix. An entry carries its sign; the
/// angles are called by their place in the order: `middle` is applied second.
struct Entry {
    int row;
    int col;
    int sign = 1;

    template <class T>
    double of(KVMatrix44Tmpl<T> const& m) const noexcept
    {
        return sign * static_cast<double>(m(row, col));
    }
};
struct Arc {
    Entry sine;
    Entry cosine;

    template <class T>
    double of(KVMatrix44Tmpl<T> const& m) const noexcept
    {
        return std::atan2(sine.of(m), cosine.of(m));
    }
};
/// In gimbal lock `last` becomes 0 and `first` stands at `locked`.
struct EulerOrder {
    int middleAxis, firstAxis, lastAxis;
    Entry middle;
    Arc first, last, locked;
    /// The axes from the one that is applied first.
    int applied[3];
};

constexpr EulerOrder orders[] = {
    // clang-format off
    // axes    middle    first                last                 locked               applied
    {1, 0, 2, {2,0,-1}, {{2,1},    {2,2}}, {{1,0},    {0,0}}, {{1,2,-1}, {1,1}}, {0,1,2}},
    {2, 0, 1, {1,0},    {{1,2,-1}, {1,1}}, {{2,0,-1}, {0,0}}, {{2,1},    {2,2}}, {0,2,1}},
    {0, 1, 2, {2,1},    {{2,0,-1}, {2,2}}, {{0,1,-1}, {1,1}}, {{0,2},    {0,0}}, {1,0,2}},
    {2, 0, 1, {0,1,-1}, {{2,1},    {1,1}}, {{0,2},    {0,0}}, {{1,2,-1}, {2,2}}, {1,2,0}},
    {0, 1, 2, {1,2,-1}, {{0,2},    {2,2}}, {{1,0},    {1,1}}, {{2,0,-1}, {0,0}}, {2,0,1}},
    {1, 0, 2, {0,2},    {{1,2,-1}, {2,2}}, {{0,1,-1}, {0,0}}, {{2,1},    {1,1}}, {2,1,0}},
    // clang-format on
};

template <class T>
EulerOrder const& orderOf(KVMatrix44Parameters<T> const& parameters)
{
    if (parameters.rotOrder < 0 || parameters.rotOrder > 5)
        reportBadOrder();
    return orders[parameters.rotOrder];
}

} // namespace

template <class T>
bool KVMatrix44Tmpl<T>::getPartialTransformation(KVMatrix44Parameters<T>& parameters,
                                                 KVMatrix44Tmpl& rotation) const noexcept
{
    using Vector = KVVector3<T>;
    T const w = values_[15];
    if (w == 0)
        return false;
    // Row 3 is not looked at: what perspective the matrix has is dropped.
    auto const& m = values_;
    Vector row0(m[0] / w, m[1] / w, m[2] / w);
    Vector row1(m[4] / w, m[5] / w, m[6] / w);
    Vector row2(m[8] / w, m[9] / w, m[10] / w);
    Vector const translation(m[3] / w, m[7] / w, m[11] / w);
    KVMatrix44Tmpl const affine({row0.x, row0.y, row0.z, translation.x, //
                                 row1.x, row1.y, row1.z, translation.y, //
                                 row2.x, row2.y, row2.z, translation.z, //
                                 0, 0, 0, 1});
    if (affine.determinant() == 0)
        return false;
    parameters.translation = translation;

    Vector& scale = parameters.scale;
    auto const normalize = [](Vector& row, T& length) {
        KVVector4<T> scaled(row, 0);
        length = scaled.length();
        scaled.scale(1.0);
        row = {scaled.x, scaled.y, scaled.z};
    };
    normalize(row0, scale.x);
    row1 -= row0.dot(row1) * row0;
    normalize(row1, scale.y);
    KVVector2<T>& shear = parameters.shear;
    shear.x = row0.dot(row2);
    row2 -= shear.x * row0;
    shear.y = row1.dot(row2);
    row2 -= shear.y * row1;
    normalize(row2, scale.z);
    shear /= scale.z;

    if (row0.dot(row1.cross(row2)) < 0) {
        scale = -scale;
        row0 = -row0;
        row1 = -row1;
        row2 = -row2;
    }
    auto const store = [&rotation](int row, Vector const& v) {
        rotation(row, 0) = v.x;
        rotation(row, 1) = v.y;
        rotation(row, 2) = v.z;
    };
    store(0, row0);
    store(1, row1);
    store(2, row2);
    return true;
}

template <class T>
bool KVMatrix44Tmpl<T>::getTransformation(KVMatrix44Parameters<T>& parameters) const
{
    KVMatrix44Tmpl r;
    if (!getPartialTransformation(parameters, r))
        return false;
    EulerOrder const& order = orderOf(parameters);
    double const sine = order.middle.of(r);
    double const middle = std::asin(sine);
    // The cosine is out of reach of 0 unless the sine is near 1.
    bool const locked = std::abs(sine) > 0.99 && isNearZero(std::cos(middle));
    double const first = (locked ? order.locked : order.first).of(r);
    double const last = locked ? 0 : order.last.of(r);

    T angles[3];
    angles[order.firstAxis] = static_cast<T>(first);
    angles[order.middleAxis] = static_cast<T>(middle);
    angles[order.lastAxis] = static_cast<T>(last);
    parameters.rotation = {angles[0], angles[1], angles[2]};
    return true;
}

template <class T>
bool KVMatrix44Tmpl<T>::getTransformation(KVMatrix44Parameters<T>& parameters,
                                          KVQuat<T>& quaternion) const noexcept
{
    KVMatrix44Tmpl r;
    if (!getPartialTransformation(parameters, r))
        return false;
    double const trace = static_cast<double>(r(0, 0)) + r(1, 1) + r(2, 2);
    double const cosine = (trace - 1) * 0.5;
    double theta = std::acos(cosine);
    if (std::isnan(theta))
        theta = cosine > 0 ? 0 : std::numbers::pi;

    KVVector3<double> turn(static_cast<double>(r(2, 1)) - r(1, 2),
                           static_cast<double>(r(0, 2)) - r(2, 0),
                           static_cast<double>(r(1, 0)) - r(0, 1));
    if (isNearZero(turn.lengthSquared())) {
        // The angle is near 0 or pi.
        if (trace > 0) {
            quaternion = {};
            return true;
        }
        auto const component = [&r](int i) {
            return std::sqrt(std::max((static_cast<double>(r(i, i)) + 1) / 2, 0.0));
        };
        turn = {component(0), component(1), component(2)};
    }
    double length = turn.length();
    // 1e-7 as a float.
    if (std::abs(length) < 1.0000000116860974e-7)
        length = 1;
    double const sine = std::sin(theta / 2);
    quaternion = {static_cast<T>(std::cos(theta / 2)), static_cast<T>(sine * turn.x / length),
                  static_cast<T>(sine * turn.y / length), static_cast<T>(sine * turn.z / length)};
    return true;
}

template <class T>
void KVMatrix44Tmpl<T>::setTransformation(KVMatrix44Parameters<T> const& parameters)
{
    T const angles[] = {parameters.rotation.x, parameters.rotation.y, parameters.rotation.z};
    *this = KVMatrix44Tmpl();
    for (int const about : orderOf(parameters).applied)
        leftRotate(angles[about], static_cast<axis>(about));
    for (int col = 0; col < 3; ++col)
        (*this)(2, col) +=
            parameters.shear.x * (*this)(0, col) + parameters.shear.y * (*this)(1, col);
    leftScale(parameters.scale.x, parameters.scale.y, parameters.scale.z);
    leftTranslate(parameters.translation.x, parameters.translation.y, parameters.translation.z);
}

#define KV_INSTANTIATE(T)                                                                          \
    template bool KVMatrix44Tmpl<T>::getPartialTransformation(KVMatrix44Parameters<T>&,            \
                                                              KVMatrix44Tmpl&) const noexcept;     \
    template bool KVMatrix44Tmpl<T>::getTransformation(KVMatrix44Parameters<T>&) const;            \
    template bool KVMatrix44Tmpl<T>::getTransformation(KVMatrix44Parameters<T>&, KVQuat<T>&)       \
        const noexcept;                                                                            \
    template void KVMatrix44Tmpl<T>::setTransformation(KVMatrix44Parameters<T> const&)
KV_INSTANTIATE(float);
KV_INSTANTIATE(double);
