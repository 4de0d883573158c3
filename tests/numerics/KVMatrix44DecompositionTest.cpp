#include <korvane/numerics/KVMatrix44Tmpl.h>

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <numbers>
#include <random>
#include <unistd.h>

namespace {

constexpr double pi = std::numbers::pi;

using M = KVMatrix44Tmpl<double>;
using V3 = KVVector3<double>;
using Parameters = KVMatrix44Parameters<double>;

class Random {
public:
    double in(double low, double high)
    {
        return std::uniform_real_distribution<double>(low, high)(generator_);
    }
    V3 vector(double size) { return {in(-size, size), in(-size, size), in(-size, size)}; }
    /// A factor of either sign between 10^-exponent and 10^exponent.
    double scale(double exponent)
    {
        double const size = std::pow(10.0, in(-exponent, exponent));
        return in(-1, 1) < 0 ? -size : size;
    }

private:
    std::mt19937 generator_{1};
};

/// The three rows apart: one may be 1e60 times as long as another.
template <class T>
void expectSame(KVMatrix44Tmpl<T> const& a, KVMatrix44Tmpl<T> const& b, double tolerance)
{
    for (int row = 0; row < 3; ++row) {
        double const size = std::hypot(double(b(row, 0)), double(b(row, 1)), double(b(row, 2)));
        for (int col = 0; col < 3; ++col)
            EXPECT_NEAR(a(row, col), b(row, col), tolerance * size) << row << " " << col;
        EXPECT_EQ(a(row, 3), b(row, 3));
        EXPECT_EQ(a(3, row), 0);
    }
    EXPECT_EQ(a(3, 3), 1);
}

template <class T>
T& angleOf(KVVector3<T>& rotation, int axis)
{
    return axis == 0 ? rotation.x : axis == 1 ? rotation.y : rotation.z;
}

/// By order: the axes from the one that is applied first.
constexpr int appliedAxes[6][3] = {{0, 1, 2}, {0, 2, 1}, {1, 0, 2},
                                   {1, 2, 0}, {2, 0, 1}, {2, 1, 0}};

template <class T>
void decomposeAndCompose(KVMatrix44Parameters<T> const& made, double tolerance)
{
    KVMatrix44Tmpl<T> m, again;
    m.setTransformation(made);
    KVMatrix44Parameters<T> found;
    found.rotOrder = made.rotOrder;
    ASSERT_TRUE(m.getTransformation(found));
    again.setTransformation(found);
    expectSame(again, m, tolerance);
}

} // namespace

TEST(KVMatrix44Decomposition, composedTransformsAreRotationsInTheirOrderThenScaleThenTranslation)
{
    for (int order = 0; order < 6; ++order) {
        Parameters p;
        p.rotOrder = order;
        p.rotation = {0.3, -0.8, 2};
        p.scale = {2, 3, -4};
        p.shear = {0.5, -0.25};
        p.translation = {10, 20, 30};
        M expected;
        for (int const axis : appliedAxes[order])
            expected.leftRotate(angleOf(p.rotation, axis), static_cast<M::axis>(axis));
        expected.leftMult(M({2, 0, 0, 10, 0, 3, 0, 20, -2, 1, -4, 30, 0, 0, 0, 1}));
        M m;
        m.setTransformation(p);
        expectSame(m, expected, 1e-15);
    }
}

TEST(KVMatrix44Decomposition, decomposedAndComposedAgainItIsTheSame)
{
    Random random;
    for (int i = 0; i < 3000; ++i) {
        Parameters p;
        p.rotOrder = i % 6;
        p.translation = random.vector(1e6);
        p.rotation = random.vector(2 * pi);
        p.scale = {random.scale(30), random.scale(30), random.scale(30)};
        p.shear = {random.in(-3, 3), random.in(-3, 3)};
        // An arc sine near a right angle keeps half of the digits.
        double const middle = angleOf(p.rotation, appliedAxes[p.rotOrder][1]);
        decomposeAndCompose(p, std::abs(std::cos(middle)) > 0.01 ? 1e-12 : 1e-7);

        // In float the determinant must not underflow.
        KVMatrix44Parameters<float> narrow;
        narrow.rotOrder = p.rotOrder;
        narrow.rotation = KVVector3<float>(p.rotation);
        narrow.scale = {float(random.scale(3)), float(random.scale(3)), float(random.scale(3))};
        narrow.shear = KVVector2<float>(p.shear);
        decomposeAndCompose(narrow, 2e-3);
    }
}

TEST(KVMatrix44Decomposition, inGimbalLockOneAngleIsZero)
{
    Random random;
    for (int i = 0; i < 600; ++i) {
        int const order = i % 6;
        int const zeroed = order == 1 || order == 3 ? 1 : 2;
        for (double const middle : {pi / 2, -pi / 2}) {
            Parameters p;
            p.rotOrder = order;
            p.rotation = random.vector(3);
            angleOf(p.rotation, appliedAxes[order][1]) = middle;
            p.scale = {2, 0.5, 8}; // exact when divided out
            M m;
            m.setTransformation(p);
            Parameters found;
            found.rotOrder = order;
            ASSERT_TRUE(m.getTransformation(found));
            EXPECT_EQ(angleOf(found.rotation, zeroed), 0) << order;
            EXPECT_NEAR(angleOf(found.rotation, appliedAxes[order][1]), middle, 1e-7);
            M again;
            again.setTransformation(found);
            expectSame(again, m, 1e-7);
        }
    }
}

TEST(KVMatrix44Decomposition, theArcSineIsNotClamped)
{
    // The square of so small a scale has no digits left, and the row is made longer than 1.
    M m({0, 0, 2.7e-162, 0, 0, 1e80, 0, 0, -1e80, 0, 0, 0, 0, 0, 0, 1});
    Parameters p;
    p.rotOrder = 5;
    EXPECT_TRUE(m.getTransformation(p));
    EXPECT_TRUE(std::isnan(p.rotation.y));
    EXPECT_FALSE(std::isnan(p.rotation.x) || std::isnan(p.rotation.z));
}

TEST(KVMatrix44Decomposition, theShearOfYByXIsDropped)
{
    // Row 1 has a component along row 0, row 2 one along each.
    M const m({2, 0, 0, 5, 7, 3, 0, 6, 4, 8, 4, 7, 0, 0, 0, 1});
    Parameters p;
    M rotation;
    rotation(0, 3) = rotation(3, 0) = rotation(3, 3) = 42;
    ASSERT_TRUE(m.getPartialTransformation(p, rotation));
    EXPECT_EQ(p.scale, V3(2, 3, 4));
    EXPECT_EQ(p.shear, KVVector2<double>(1, 2));
    EXPECT_EQ(p.translation, V3(5, 6, 7));
    // The caller's fourth row and column stay.
    EXPECT_EQ(rotation, M({1, 0, 0, 42, 0, 1, 0, 0, 0, 0, 1, 0, 42, 0, 0, 42}));
}

TEST(KVMatrix44Decomposition, aMirrorTurnsTheSignOfAllScales)
{
    M m;
    m.leftScale(-1, 1, 1);
    Parameters p;
    M rotation;
    ASSERT_TRUE(m.getPartialTransformation(p, rotation));
    EXPECT_EQ(p.scale, V3(-1, -1, -1));
    EXPECT_EQ(rotation, M({1, 0, 0, 0, 0, -1, 0, 0, 0, 0, -1, 0, 0, 0, 0, 1}));
}

TEST(KVMatrix44Decomposition, isDividedByWAndTakesNoNoticeOfPerspective)
{
    M m;
    m.leftRotate(0.5, M::yAxis);
    m.leftTranslate(1, 2, 3);
    Parameters expected;
    ASSERT_TRUE(m.getTransformation(expected));
    M doubled = m;
    for (int i = 0; i < 16; ++i)
        doubled.data()[i] *= 2;
    M perspective = m;
    perspective(3, 0) = perspective(3, 1) = perspective(3, 2) = 0.7;
    for (M const& same : {doubled, perspective}) {
        Parameters p;
        ASSERT_TRUE(same.getTransformation(p));
        EXPECT_EQ(p.translation, expected.translation);
        EXPECT_EQ(p.rotation, expected.rotation);
        EXPECT_EQ(p.scale, expected.scale);
    }
}

TEST(KVMatrix44Decomposition, singularMatricesAreNotTakenApart)
{
    M flat;
    flat.leftScale(1, 0, 1);
    M withoutW;
    withoutW(3, 3) = 0;
    for (M const& m : {flat, withoutW}) {
        Parameters p;
        p.translation = {9, 9, 9};
        p.rotOrder = 17; // is not looked at
        M rotation;
        KVQuat<double> quaternion(9, 9, 9, 9);
        EXPECT_FALSE(m.getPartialTransformation(p, rotation));
        EXPECT_FALSE(m.getTransformation(p));
        EXPECT_FALSE(m.getTransformation(p, quaternion));
        EXPECT_EQ(p.translation, V3(9, 9, 9));
        EXPECT_EQ(rotation, M());
        EXPECT_EQ(quaternion.w, 9);
    }
}

TEST(KVMatrix44DecompositionDeathTest, anUnknownOrderAborts)
{
    Parameters p;
    for (int const order : {-1, 6}) {
        p.rotOrder = order;
        // The report goes to standard output, a death test reads the other one.
        EXPECT_DEATH((dup2(2, 1), M().getTransformation(p)), "bad rotOrder");
        EXPECT_DEATH((dup2(2, 1), M().setTransformation(p)), "bad rotOrder");
    }
}

TEST(KVMatrix44Decomposition, quaternionsTurnAboutTheAxis)
{
    Random random;
    for (int i = 0; i < 300; ++i) {
        Parameters p;
        p.rotOrder = i % 6;
        p.rotation = random.vector(3);
        p.scale = {2, 3, 4};
        M m, r;
        m.setTransformation(p);
        Parameters found;
        found.rotation = {9, 9, 9};
        KVQuat<double> q;
        ASSERT_TRUE(m.getTransformation(found, q));
        ASSERT_TRUE(m.getPartialTransformation(found, r));
        EXPECT_EQ(found.rotation, V3(9, 9, 9));
        double const w = q.w, x = q.x, y = q.y, z = q.z;
        M const turned({1 - 2 * (y * y + z * z), 2 * (x * y - w * z), 2 * (x * z + w * y), 0,
                        2 * (x * y + w * z), 1 - 2 * (x * x + z * z), 2 * (y * z - w * x), 0,
                        2 * (x * z - w * y), 2 * (y * z + w * x), 1 - 2 * (x * x + y * y), 0, 0, 0,
                        0, 1});
        expectSame(turned, r, 1e-9);
    }
}

TEST(KVMatrix44Decomposition, quaternionsOfNoTurnAndOfHalfTurns)
{
    double const half = std::sqrt(0.5);
    M aboutX, diagonal, slight;
    aboutX.leftRotate(pi, M::xAxis);
    // The half turn about (1, -1, 0): what the sign of its axis was cannot be told any more.
    diagonal = M({0, -1, 0, 0, -1, 0, 0, 0, 0, 0, -1, 0, 0, 0, 0, 1});
    slight.leftRotate(1e-4, M::zAxis); // sine squared is below 1e-7
    struct Row {
        M matrix;
        KVQuat<double> expected;
    } const rows[] = {
        {M(), {1, 0, 0, 0}},
        {aboutX, {0, 1, 0, 0}},
        {diagonal, {0, half, half, 0}},
        {slight, {1, 0, 0, 0}},
    };
    for (Row const& row : rows) {
        Parameters p;
        KVQuat<double> q;
        ASSERT_TRUE(row.matrix.getTransformation(p, q));
        EXPECT_NEAR(q.w, row.expected.w, 1e-15);
        EXPECT_NEAR(
            (V3(q.x, q.y, q.z) - V3(row.expected.x, row.expected.y, row.expected.z)).length(), 0,
            1e-15);
    }
}
