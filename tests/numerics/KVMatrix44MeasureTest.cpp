#include <korvane/numerics/KVMatrix44Measure.h>

#include <gtest/gtest.h>

#include <cmath>

namespace {

using M = KVMatrix44Tmpl<double>;
using V3 = KVVector3<double>;

void expectNear(V3 const& a, V3 const& b, double tolerance = 1e-14)
{
    EXPECT_NEAR((a - b).length(), 0, tolerance) << a.x << " " << a.y << " " << a.z;
}

/// w = 1 + z / 2: what lies farther is smaller.
M perspective()
{
    M m;
    m(3, 2) = 0.5;
    return m;
}

} // namespace

TEST(KVMatrix44Measure, scaleIsTheLengthOfTheColumns)
{
    M m({3, 0, 0, 5, 4, -2, 0, 6, 0, 0, -7, 7, 0, 0, 0, 1});
    V3 scale;
    getScale(m, scale);
    expectNear(scale, {5, 2, 7});
    getScale(m, V3(1, 2, 3), scale); // without perspective it is the same everywhere
    expectNear(scale, {5, 2, 7});
    // The size weighs rows, not columns.
    getScale(m, V3(), V3(1, 10, 1), scale);
    expectNear(scale, {std::hypot(3, 40), 20, 7});
    getScale(m, V3(), V3(1, 1, 1), scale, true);
    expectNear(scale, {5, -2, -7});

    V3 translate;
    getScaleTranslate(m, scale, translate);
    expectNear(scale, {5, 2, 7});
    expectNear(translate, {5, 6, 7});
    getScaleTranslateFlip(m, V3(1, 0, 0), scale, translate);
    expectNear(scale, {5, -2, -7});
    expectNear(translate, {7, 10, 7});
    getScaleTranslateFlip(m, V3(1, 0, 0), V3(2, 2, 2), scale, translate);
    expectNear(scale, {10, -4, -14});
}

TEST(KVMatrix44Measure, perspectiveIsMeasuredAtThePoint)
{
    V3 scale, translate;
    getScaleTranslate(perspective(), V3(1, 0, 2), scale, translate);
    // w is 2 there: x and y halve, and z / (1 + z/2) has the slope 1/4. Column 2 takes x along.
    expectNear(scale, {0.5, 0.5, std::hypot(0.125, 0.25)});
    expectNear(translate, {-0.5, 0, -1});
}

TEST(KVMatrix44Measure, angleHasTheOppositeSense)
{
    V3 scale, translate;
    double angle = 0;
    M m;
    m.leftRotate(0.4, M::zAxis);
    getScaleTranslateRotate(m, scale, translate, angle);
    EXPECT_NEAR(angle, -0.4, 1e-15);

    struct Row {
        M matrix;
        double expected;
    } const rows[] = {
        // Row 0 is longer, row 1 is longer, and neither: then row 1 is asked.
        {M({3, 3, 0, 0, 1, 0, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1}), std::atan2(3, 3)},
        {M({1, 0, 0, 0, 3, 3, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1}), std::atan2(-3, 3)},
        {M({1, 0, 9, 0, 0, -1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1}), std::atan2(-0.0, -1)},
    };
    for (Row const& row : rows) {
        getScaleTranslateRotate(row.matrix, V3(), scale, translate, angle);
        EXPECT_EQ(angle, row.expected);
    }
    getScaleTranslateRotate(rows[2].matrix, V3(), V3(2, 2, 2), scale, translate, angle);
    expectNear(scale, {2, 2, std::hypot(18, 2)});
}

TEST(KVMatrix44Measure, affineMapTouchesTheTransformAtThePoint)
{
    M m = perspective();
    m.leftTranslate(1, 2, 3);
    m.leftRotate(0.7, M::yAxis);
    V3 const point(0.3, -0.2, 1.5);
    M affine;
    perspectiveToAffine(m, point, affine);
    for (int col = 0; col < 3; ++col)
        EXPECT_EQ(affine(3, col), 0);
    EXPECT_EQ(affine(3, 3), 1);
    V3 exact, straight;
    expectNear(affine.transform(point, straight), m.transform(point, exact));
    // Nearby the two part with the square of the distance.
    V3 const near = point + V3(1e-4, 2e-4, -1e-4);
    expectNear(affine.transform(near, straight), m.transform(near, exact), 1e-7);
    perspectiveToAffine(m, point, m);
    EXPECT_EQ(m, affine);
}
