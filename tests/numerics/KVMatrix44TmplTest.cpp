#include <korvane/numerics/KVMatrix33Tmpl.h>
#include <korvane/numerics/KVMatrix44Tmpl.h>

#include <gtest/gtest.h>

#include <cmath>
#include <functional>
#include <limits>
#include <numbers>
#include <random>

namespace {

constexpr double pi = std::numbers::pi;
constexpr double notANumber = std::numeric_limits<double>::quiet_NaN();
constexpr double infinity = std::numeric_limits<double>::infinity();

using M = KVMatrix44Tmpl<double>;
using V2 = KVVector2<double>;
using V3 = KVVector3<double>;
using V4 = KVVector4<double>;
using Rect = KVRect<double>;

constexpr M counted({1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15, 16});
static_assert(counted(1, 2) == 7 && counted.data()[4] == 5);
static_assert(sizeof(M) == 128 && sizeof(KVMatrix44Tmpl<float>) == 64);

template <class T>
KVMatrix44Tmpl<T> randomMatrix(std::mt19937& random)
{
    std::uniform_real_distribution<T> element(-2, 2);
    KVMatrix44Tmpl<T> m;
    for (int i = 0; i < 16; ++i)
        m.data()[i] = element(random);
    return m;
}

/// Row by row in the order in which the elements are written, each product and each sum rounded.
template <class T>
KVMatrix44Tmpl<T> plainProduct(KVMatrix44Tmpl<T> const& a, KVMatrix44Tmpl<T> const& b)
{
    KVMatrix44Tmpl<T> product;
    for (int row = 0; row < 4; ++row)
        for (int col = 0; col < 4; ++col) {
            T volatile sum = a(row, 0) * b(0, col);
            for (int k = 1; k < 4; ++k) {
                T volatile const term = a(row, k) * b(k, col);
                sum = sum + term;
            }
            product(row, col) = sum;
        }
    return product;
}

template <class T>
double distance(KVMatrix44Tmpl<T> const& a, KVMatrix44Tmpl<T> const& b)
{
    double largest = 0;
    for (int i = 0; i < 16; ++i) {
        double const d = std::abs(static_cast<double>(a.data()[i]) - b.data()[i]);
        largest = d <= largest ? largest : d;
    }
    return largest;
}

M rotation(M::axis axis, double s, double c)
{
    switch (axis) {
    case M::xAxis:
        return M({1, 0, 0, 0, 0, c, -s, 0, 0, s, c, 0, 0, 0, 0, 1});
    case M::yAxis:
        return M({c, 0, s, 0, 0, 1, 0, 0, -s, 0, c, 0, 0, 0, 0, 1});
    default:
        return M({c, -s, 0, 0, s, c, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1});
    }
}

} // namespace

template <class T>
class KVMatrix44 : public ::testing::Test {};
using Precisions = ::testing::Types<float, double>;
TYPED_TEST_SUITE(KVMatrix44, Precisions);

TYPED_TEST(KVMatrix44, productRoundsEveryStepAndMayBeInPlace)
{
    std::mt19937 random(1);
    for (int i = 0; i < 100; ++i) {
        auto const a = randomMatrix<TypeParam>(random);
        auto const b = randomMatrix<TypeParam>(random);
        auto const expected = plainProduct(a, b);
        EXPECT_EQ(a * b, expected);
        auto left = b, right = a, m = a;
        left.leftMult(a);
        right.rightMult(b);
        EXPECT_EQ(left, expected);
        EXPECT_EQ(right, expected);
        m.leftMult(m);
        EXPECT_EQ(m, plainProduct(a, a));
        m = a;
        m.rightMult(m);
        EXPECT_EQ(m, plainProduct(a, a));
    }
}

TYPED_TEST(KVMatrix44, editsAreProductsWithTheMatrixOfTheEdit)
{
    using Matrix = KVMatrix44Tmpl<TypeParam>;
    using Axis = typename Matrix::axis;
    auto const edited = [](M const& wide) {
        Matrix narrow;
        for (int i = 0; i < 16; ++i)
            narrow.data()[i] = static_cast<TypeParam>(wide.data()[i]);
        return narrow;
    };
    double const ta = std::tan(0.3);
    double const tb = std::tan(pi - 0.4);
    struct Row {
        char const* name;
        M matrix;
        std::function<void(Matrix&)> left, right;
    };
    std::vector<Row> rows = {
        {"translate", M({1, 0, 0, 2, 0, 1, 0, -3, 0, 0, 1, 4, 0, 0, 0, 1}),
         [](Matrix& m) { m.leftTranslate(2, -3, 4); },
         [](Matrix& m) { m.rightTranslate(2, -3, 4); }},
        {"scale", M({2, 0, 0, 0, 0, -3, 0, 0, 0, 0, 0.5, 0, 0, 0, 0, 1}),
         [](Matrix& m) { m.leftScale(2, -3, 0.5); }, [](Matrix& m) { m.rightScale(2, -3, 0.5); }},
        {"shear", M({1, ta, 0, 0, tb, 1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1}),
         [](Matrix& m) { m.leftShear(0.3, -0.4); }, [](Matrix& m) { m.rightShear(0.3, -0.4); }},
    };
    for (auto const axis : {M::xAxis, M::yAxis, M::zAxis})
        rows.push_back({"rotate", rotation(axis, std::sin(0.7), std::cos(0.7)),
                        [axis](Matrix& m) { m.leftRotate(0.7, static_cast<Axis>(axis)); },
                        [axis](Matrix& m) { m.rightRotate(0.7, static_cast<Axis>(axis)); }});

    std::mt19937 random(2);
    // Four products and three sums of numbers up to 8 in size.
    double const tolerance = 32 * std::numeric_limits<TypeParam>::epsilon();
    for (Row const& row : rows)
        for (int i = 0; i < 50; ++i) {
            auto const m = randomMatrix<TypeParam>(random);
            auto left = m, right = m;
            row.left(left);
            row.right(right);
            EXPECT_LE(distance(left, edited(row.matrix) * m), tolerance) << row.name;
            EXPECT_LE(distance(right, m * edited(row.matrix)), tolerance) << row.name;
        }
}

TYPED_TEST(KVMatrix44, inverseTimesMatrixIsTheIdentity)
{
    std::mt19937 random(3);
    for (int i = 0; i < 200; ++i) {
        auto const m = randomMatrix<TypeParam>(random);
        KVMatrix44Tmpl<TypeParam> inverse;
        if (!inverse.invert(m, 0.1))
            continue;
        // Elements up to 2 and a determinant of 0.1 or more: a condition below 4000.
        double const tolerance = 4000 * std::numeric_limits<TypeParam>::epsilon();
        EXPECT_LE(distance(inverse * m, KVMatrix44Tmpl<TypeParam>()), tolerance);
        EXPECT_LE(distance(m * inverse, KVMatrix44Tmpl<TypeParam>()), tolerance);
        auto own = m;
        EXPECT_TRUE(own.invert(own));
        EXPECT_EQ(own, inverse);
    }
}

TEST(KVMatrix44Tmpl, matricesActOnColumns)
{
    M m({1, 2, 3, 10, 4, 5, 6, 20, 7, 8, 9, 30, 0, 0, 0, 1});
    V4 out;
    EXPECT_EQ(m.transform(V4(1, 0, 0, 0), out), V4(1, 4, 7, 0));
    EXPECT_EQ(m.transform(V4(0, 0, 0, 1), out), V4(10, 20, 30, 1));
    m.transpose();
    EXPECT_EQ(m.transform(V4(1, 0, 0, 0), out), V4(1, 2, 3, 10));
    // What is put on the left acts last.
    M order;
    order.leftScale(2, 2, 1);
    order.leftTranslate(10, 0, 0);
    V3 point;
    EXPECT_EQ(order.transform(V3(1, 0, 0), point), V3(12, 0, 0));
}

TEST(KVMatrix44Tmpl, neutralArgumentsSkipTheirWork)
{
    // Zero times what stands here would not be a number.
    M const wild({infinity, notANumber, infinity, infinity, notANumber, infinity, infinity,
                  notANumber, infinity, notANumber, infinity, infinity, notANumber, infinity,
                  notANumber, infinity});
    struct Row {
        char const* name;
        void (*edit)(M&);
    } const rows[] = {
        {"leftTranslate", [](M& m) { m.leftTranslate(0, -0.0, 0); }},
        {"rightTranslate", [](M& m) { m.rightTranslate(0, -0.0, 0); }},
        {"leftScale", [](M& m) { m.leftScale(1, 1, 1); }},
        {"rightScale", [](M& m) { m.rightScale(1, 1, 1); }},
        {"leftShear", [](M& m) { m.leftShear(0, -0.0); }},
        {"rightShear", [](M& m) { m.rightShear(0, -0.0); }},
        {"leftRotate", [](M& m) { m.leftRotate(0, M::xAxis); }},
        {"rightRotate", [](M& m) { m.rightRotate(-0.0, M::zAxis); }},
        {"leftRotate about no axis", [](M& m) { m.leftRotate(1, static_cast<M::axis>(3)); }},
        {"rightRotate about no axis", [](M& m) { m.rightRotate(1, static_cast<M::axis>(-1)); }},
    };
    for (Row const& row : rows) {
        M m = wild;
        row.edit(m);
        for (int i = 0; i < 16; ++i)
            EXPECT_EQ(std::isnan(m.data()[i]), std::isnan(wild.data()[i])) << row.name << i;
    }
    // A scale that is not a number is no neutral one.
    M m;
    m.leftScale(notANumber, 1, 1);
    EXPECT_TRUE(std::isnan(m(0, 0)) && m(1, 1) == 1);
    m = M();
    m.rightScale(1, notANumber, 1);
    EXPECT_TRUE(std::isnan(m(1, 1)) && m(0, 0) == 1);
}

TEST(KVMatrix44Tmpl, rightAnglesAreExact)
{
    struct Row {
        double angle, sine, cosine;
    } const rows[] = {
        {pi / 2, 1, 0},
        {-pi / 2, -1, 0},
        {pi, 0, -1},
        {3 * pi / 2, -1, 0},
        {pi + 5e-8, 0, -1},
        {-3 * pi / 2 + 9.9e-8, 1, 0},
        {pi + 2e-7, std::sin(pi + 2e-7), std::cos(pi + 2e-7)},
        {2 * pi, std::sin(2 * pi), 1}, // a full turn is not one of them
    };
    for (Row const& row : rows)
        for (auto const axis : {M::xAxis, M::yAxis, M::zAxis}) {
            M left, right;
            left.leftRotate(row.angle, axis);
            right.rightRotate(row.angle, axis);
            EXPECT_EQ(left, rotation(axis, row.sine, row.cosine)) << row.angle << " " << axis;
            EXPECT_EQ(right, left) << row.angle << " " << axis;
        }
    KVMatrix44Tmpl<float> narrow;
    narrow.leftRotate(std::numbers::pi_v<float>, KVMatrix44Tmpl<float>::zAxis);
    EXPECT_EQ(narrow(0, 1), 0);
}

TEST(KVMatrix44Tmpl, shearAnglesAreBroughtIntoRange)
{
    double const steepest = std::tan(1.5655603390389135);
    struct Row {
        double angle, factor;
    } const rows[] = {
        {0.3, std::tan(0.3)},
        {-0.3, std::tan(-0.3 + pi)},
        {-20 * pi - 0.3, std::tan(-0.3)},
        {pi / 2, steepest},
        {1.5655603390389135, steepest},
        {std::nextafter(1.5655603390389135, 0), std::tan(std::nextafter(1.5655603390389135, 0))},
        {1.5760323145508794, std::tan(1.5760323145508794)}, // negative: the interval is half open
        {-1e18, std::tan(std::fmod(-1e18, pi) + pi)},
        {infinity, notANumber},
        {notANumber, notANumber},
    };
    for (Row const& row : rows) {
        M left, right;
        left.leftShear(row.angle, 0);
        right.rightShear(0, row.angle);
        EXPECT_EQ(left(1, 0), 0);
        EXPECT_EQ(right(0, 1), 0);
        if (std::isnan(row.factor)) {
            EXPECT_TRUE(std::isnan(left(0, 1)) && std::isnan(right(1, 0)));
        } else {
            EXPECT_NEAR(left(0, 1), row.factor, 1e-13 * (1 + row.factor * row.factor)) << row.angle;
            EXPECT_EQ(right(1, 0), left(0, 1));
        }
    }
    EXPECT_EQ(static_cast<int>(steepest), 190);
}

TEST(KVMatrix44Tmpl, singularMatricesAreNotInverted)
{
    M const singular({1, 2, 3, 4, 2, 4, 6, 8, 0, 0, 1, 0, 0, 0, 0, 1});
    EXPECT_EQ(singular.determinant(), 0);
    EXPECT_EQ(M({1, 2, 3, 4, 2, 1, 2, 3, 3, 2, 1, 2, 4, 3, 2, 1}).determinant(), -20);
    M m = singular;
    EXPECT_FALSE(m.invert(m));
    EXPECT_EQ(m, singular);
    m = counted;
    EXPECT_FALSE(m.invert(singular));
    EXPECT_EQ(m, counted);

    M small;
    small.leftScale(1e-3, 1e-3, -1);
    EXPECT_EQ(small.determinant(), -1e-6);
    EXPECT_FALSE(M().invert(small, 1.1e-6));
    EXPECT_TRUE(M().invert(small, 1e-6)); // below, not at

    // A determinant that is not a number is neither 0 nor small.
    M wild;
    wild(0, 0) = notANumber;
    EXPECT_TRUE(m.invert(wild, 1));
    EXPECT_TRUE(std::isnan(m(0, 0)));
}

TEST(KVMatrix44Tmpl, planarInverseFlattensZ)
{
    M const m({2, 1, 9, 3, 0, 4, 9, 5, 9, 9, 9, 9, 0.1, 0, 9, 1});
    M plane;
    ASSERT_TRUE(KVMatrix44_planarInverseZ(plane, m, 0.0));
    for (V2 const& point : {V2(0, 0), V2(3, -2), V2(0.5, 7)}) {
        V2 out;
        m.transform(point, out);
        plane.transform(out, out);
        EXPECT_NEAR((out - point).length(), 0, 1e-13);
    }
    for (int i = 0; i < 4; ++i)
        EXPECT_TRUE(plane(2, i) == 0 && plane(i, 2) == 0) << i; // element (2,2) as well
    M own = m;
    EXPECT_TRUE(own.planarInverseZ(own));
    EXPECT_EQ(own, plane);

    M flat; // invertible as a whole, not in the plane
    flat(1, 1) = flat(2, 2) = 0;
    flat(1, 2) = flat(2, 1) = 1;
    M const before = flat;
    EXPECT_FALSE(flat.planarInverseZ(flat));
    EXPECT_EQ(flat, before);
    EXPECT_FALSE(plane.planarInverseZ(M(), 1.5));
}

TEST(KVMatrix44Tmpl, transformsDivideByWhereTheOutputHasNoW)
{
    M const m({1, 0, 0, 1, 0, 2, 0, 0, 0, 0, 3, 0, 0, 0, 1, 1});
    V4 four;
    V3 three;
    V2 two;
    EXPECT_EQ(m.transform(V4(1, 1, 1, 2), four), V4(3, 2, 3, 3));
    EXPECT_EQ(m.transform(V3(1, 1, 1), four), V4(2, 2, 3, 2));
    EXPECT_EQ(m.transform(V2(1, 1), four), V4(2, 2, 0, 1));
    EXPECT_EQ(m.transform(V3(1, 1, 1), three), V3(1, 1, 1.5));
    EXPECT_EQ(m.transform(V2(1, 1), two), V2(2, 2));
    EXPECT_EQ(&m.transform(three, three), &three);
    EXPECT_EQ(three, V3(0.8, 0.8, 1.8)); // from (1, 1, 1.5) in place

    m.transform(V3(1, 0, -1), three); // w is 0 and nothing tests it
    EXPECT_EQ(three.x, infinity);
    EXPECT_TRUE(std::isnan(three.y));

    KVVector3<float> narrow;
    EXPECT_EQ(m.transform(KVVector3<float>(1, 1, 1), narrow), KVVector3<float>(1, 1, 1.5f));
}

TEST(KVMatrix44Tmpl, transformRectBoundsTheCorners)
{
    M turn;
    turn.leftRotate(pi / 2, M::zAxis);
    M perspective; // w = 1 - x
    perspective(3, 0) = -1;
    M nowhere;
    nowhere(3, 3) = 0;
    M bad;
    bad(3, 1) = notANumber;
    Rect const before(7, 7, 7, 7);
    struct Row {
        char const* name;
        M const& matrix;
        Rect in;
        bool expected;
        Rect out;
    } const rows[] = {
        {"a quarter turn", turn, {1, 2, 3, 4}, true, {-6, 1, 4, 3}},
        {"empty in width", turn, {1, 2, -3, 4}, true, {7, 7, -1, -1}},
        {"empty in height", bad, {1, 2, 3, -4}, true, {7, 7, -1, -1}},
        {"in front of the eye", perspective, {0, 0, 0.5, 1}, true, {0, 0, 1, 2}},
        {"behind the eye", perspective, {2, 0, 1, 1}, true, {-2, -1, 0.5, 1}},
        {"across the plane of the eye", perspective, {0, 0, 3, 1}, false, before},
        {"touching it", perspective, {0, 0, 1, 1}, false, before},
        {"w of 0", nowhere, {0, 0, 1, 1}, false, before},
        {"w that is not a number", bad, {0, 0, 1, 1}, false, before},
    };
    for (Row const& row : rows) {
        Rect out = before;
        EXPECT_EQ(row.matrix.transformRect(row.in, out), row.expected) << row.name;
        EXPECT_EQ(out, row.out) << row.name;
    }
    Rect own(1, 2, 3, 4);
    EXPECT_TRUE(turn.transformRect(own, own));
    EXPECT_EQ(own, Rect(-6, 1, 4, 3));
}

TEST(KVMatrix44Tmpl, jacobianIsTheDerivativeOfTheDivision)
{
    std::mt19937 random(4);
    for (int i = 0; i < 20; ++i) {
        M m = randomMatrix<double>(random);
        m(3, 3) = 12; // keeps w away from 0
        V3 const at(0.5, -1, 0.25);
        V4 p;
        M const jacobian = m.jacobianPost(m.transform(at, p));
        double const step = 1e-6;
        for (int col = 0; col < 3; ++col) {
            V3 const by(col == 0 ? step : 0, col == 1 ? step : 0, col == 2 ? step : 0);
            V3 above, below;
            V3 const slope =
                (m.transform(at + by, above) - m.transform(at - by, below)) / (2 * step);
            EXPECT_NEAR(jacobian(0, col), slope.x, 1e-9);
            EXPECT_NEAR(jacobian(1, col), slope.y, 1e-9);
            EXPECT_NEAR(jacobian(2, col), slope.z, 1e-9);
            EXPECT_TRUE(jacobian(3, col) == 0 && jacobian(col, 3) == 0);
        }
        EXPECT_EQ(jacobian(3, 3), 1);
    }
}

TEST(KVMatrix44Tmpl, isIdentityLooksPastAUniformFactor)
{
    auto const filled = [](double diagonal, int index, double value) {
        M m({diagonal, 0, 0, 0, 0, diagonal, 0, 0, 0, 0, diagonal, 0, 0, 0, 0, diagonal});
        m.data()[index] = value;
        return m;
    };
    struct Row {
        M matrix;
        bool expected;
    } const rows[] = {
        {M(), true},
        {filled(2, 0, 2), true},
        {filled(0, 0, 0), false},
        {filled(0.9e-7, 0, 0.9e-7), false}, // too small to tell
        {filled(1, 5, 1 + 0.9e-7), true},
        {filled(1, 5, 1 + 1.1e-7), false},
        {filled(1, 3, 0.9e-7), true},
        {filled(1, 3, -1.1e-7), false},
        {filled(1, 6, notANumber), false},
        {filled(notANumber, 0, notANumber), false},
    };
    for (Row const& row : rows)
        EXPECT_EQ(row.matrix.isIdentity(), row.expected) << &row - rows;
}

TEST(KVMatrix33Tmpl, invertsByTheRulesOfTheLargerOne)
{
    KVMatrix33Tmpl<double> const m({2, 1, 0, 0, 4, 1, 1, 0, 1});
    EXPECT_EQ(m.determinant(), 9);
    KVMatrix33Tmpl<double> inverse;
    ASSERT_TRUE(inverse.invert(m, 9));
    auto const product = inverse * m;
    auto const identity = KVMatrix33Tmpl<double>();
    for (int i = 0; i < 9; ++i)
        EXPECT_NEAR(product.data()[i], identity.data()[i], 1e-15);
    EXPECT_FALSE(inverse.invert(m, 9.1));
    KVMatrix33Tmpl<float> singular({1, 2, 3, 2, 4, 6, 0, 0, 1});
    auto const before = singular;
    EXPECT_FALSE(singular.invert(singular));
    EXPECT_EQ(singular, before);

    auto turned = m;
    turned.transpose();
    EXPECT_EQ(turned * V3(1, 0, 0), V3(2, 1, 0));
    EXPECT_EQ(m * V3(1, 0, 0), V3(2, 0, 1));
}
