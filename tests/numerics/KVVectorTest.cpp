#include <korvane/numerics/KVRect.h>
#include <korvane/numerics/KVVector4.h>

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <numbers>

namespace {

constexpr double pi = std::numbers::pi;
constexpr double notANumber = std::numeric_limits<double>::quiet_NaN();

using V3 = KVVector3<double>;
using V4 = KVVector4<double>;

// Values in constant expressions; the cross products are right-handed.
static_assert(KVVector2<double>(3, 4).dot({2, -1}) == 2);
static_assert(KVVector2<double>(1, 0).cross({0, 1}) == 1);
static_assert(V3(1, 0, 0).cross({0, 1, 0}) == V3(0, 0, 1));
static_assert(V3(0, 1, 0).cross({0, 0, 1}) == V3(1, 0, 0));
static_assert(2 * (V3(1, 2, 3) + V3(1, 1, 1)) - V3(4, 6, 8) / 2 == V3(2, 3, 4));
static_assert(-V4(1, 2, 3, 4) == V4(V3(-1, -2, -3), -4));
static_assert(KVVector3<float>(V3(1, 2, 3)) == KVVector3<float>(1, 2, 3));
static_assert(sizeof(KVVector2<float>) == 8 && sizeof(V3) == 24 && sizeof(V4) == 32);

} // namespace

TEST(KVVector3, normalizeLeavesVectorsShorterThanTheToleranceAlone)
{
    struct Row {
        V3 vector;
        double tolerance;
        bool expected;
    } const rows[] = {
        {{3, 0, 4}, 1, true},    {{3, 0, 4}, 5, true}, // strictly within, or it is divided
        {{3, 0, 4}, 5.1, false}, {{0, 0, 0}, 1e-7, false},
        {{0, 0, 0}, 0, true},    {{notANumber, 0, 0}, 1e-7, true},
    };
    for (Row const& row : rows) {
        V3 v = row.vector;
        EXPECT_EQ(v.normalize(row.tolerance), row.expected);
        if (!row.expected) {
            EXPECT_EQ(v, row.vector);
        } else if (row.vector.x == 3) {
            EXPECT_EQ(v, V3(0.6, 0, 0.8));
        } else {
            EXPECT_TRUE(std::isnan(v.x)); // nothing keeps 0 from being divided by 0
        }
    }
}

TEST(KVVector4, scaleGivesALengthToAllFourComponents)
{
    V4 v(1, -1, 1, -1);
    v.scale(6);
    EXPECT_EQ(v, V4(3, -3, 3, -3));
    V4 zero;
    zero.scale(6);
    EXPECT_EQ(zero, V4());
    KVVector4<float> f(0, 3, 0, 4);
    f.scale(1);
    EXPECT_FLOAT_EQ(f.w, 0.8f);
}

TEST(KVRect, growsToAPoint)
{
    KVRect<double> rect;
    EXPECT_TRUE(rect.isEmpty());
    struct Row {
        KVVector2<double> point;
        KVRect<double> expected;
    } const rows[] = {
        {{3, 4}, {3, 4, 0, 0}}, {{1, 9}, {1, 4, 2, 5}}, {{2, 5}, {1, 4, 2, 5}},
        {{3, 9}, {1, 4, 2, 5}}, {{7, 0}, {1, 0, 6, 9}},
    };
    for (Row const& row : rows)
        EXPECT_EQ(rect |= row.point, row.expected);
    EXPECT_EQ((KVRect<double>(5, 5, 3, -1) |= {2, 2}), KVRect<double>(2, 2, 0, 0));
}

TEST(KVCalcAxisAngle, turnsOneDirectionIntoTheOther)
{
    struct Row {
        V3 from, to;
        bool expected;
        V3 axis;
        double angle;
    } const rows[] = {
        {{2, 0, 0}, {0, 5, 0}, true, {0, 0, 1}, pi / 2},
        {{0, 5, 0}, {2, 0, 0}, true, {0, 0, -1}, pi / 2},
        {{0, 0, 1}, {1, 0, -1}, true, {0, 1, 0}, 3 * pi / 4},
        {{1, 2, 3}, {2, 4, 6}, false, {0, 0, 0}, 0},
        {{1, 2, 3}, {-1, -2, -3}, false, {0, 0, 0}, pi},
        {{1, 0, 0}, {1, 2e-7, 0}, true, {0, 0, 1}, 2e-7},
        {{1, 0, 0}, {1, 0.9e-7, 0}, false, {0, 0, 0.9e-7}, 0.9e-7}, // left as it is
    };
    for (Row const& row : rows) {
        V3 axis;
        double angle = 0;
        EXPECT_EQ(KVCalcAxisAngle(row.from, row.to, axis, angle), row.expected);
        EXPECT_NEAR((axis - row.axis).length(), 0, 1e-15);
        EXPECT_NEAR(angle, row.angle, 1e-15);
    }
    V3 axis;
    double angle = 0;
    EXPECT_FALSE(KVCalcAxisAngle(V3(), V3(1, 0, 0), axis, angle));
    EXPECT_TRUE(std::isnan(angle));
}
