#include <korvane/numerics/KVMatrix44Measure.h>

namespace {

using Matrix = KVMatrix44Tmpl<double>;
using Vector = KVVector3<double>;

constexpr Vector origin;
constexpr Vector unitSize(1, 1, 1);

Matrix jacobianAt(Matrix const& matrix, Vector const& point)
{
    KVVector4<double> p;
    return matrix.jacobianPost(matrix.transform(point, p));
}

Vector scaleOf(Matrix const& jacobian, Vector const& size, bool flip)
{
    auto const column = [&](int i) {
        double const length =
            Vector(jacobian(0, i) * size.x, jacobian(1, i) * size.y, jacobian(2, i) * size.z)
                .length();
        return flip && jacobian(i, i) < 0 ? -length : length;
    };
    return {column(0), column(1), column(2)};
}

Vector translationAt(Matrix const& matrix, Vector const& point)
{
    Vector moved;
    return matrix.transform(point, moved) - point;
}

double angleOf(Matrix const& j)
{
    double const row0 = j(0, 0) * j(0, 0) + j(0, 1) * j(0, 1);
    double const row1 = j(1, 0) * j(1, 0) + j(1, 1) * j(1, 1);
    return row0 > row1 ? std::atan2(j(0, 1), j(0, 0)) : std::atan2(-j(1, 0), j(1, 1));
}

} // namespace

void getScale(Matrix const& matrix, Vector const& point, Vector const& size, Vector& scale,
              bool flip)
{
    scale = scaleOf(jacobianAt(matrix, point), size, flip);
}

void getScale(Matrix const& matrix, Vector const& point, Vector& scale)
{
    getScale(matrix, point, unitSize, scale);
}

void getScale(Matrix const& matrix, Vector& scale)
{
    getScale(matrix, origin, unitSize, scale);
}

void getScaleTranslate(Matrix const& matrix, Vector const& point, Vector const& size, Vector& scale,
                       Vector& translate)
{
    Vector const moved = translationAt(matrix, point);
    getScale(matrix, point, size, scale);
    translate = moved;
}

void getScaleTranslate(Matrix const& matrix, Vector const& point, Vector& scale, Vector& translate)
{
    getScaleTranslate(matrix, point, unitSize, scale, translate);
}

void getScaleTranslate(Matrix const& matrix, Vector& scale, Vector& translate)
{
    getScaleTranslate(matrix, origin, unitSize, scale, translate);
}

void getScaleTranslateFlip(Matrix const& matrix, Vector const& point, Vector const& size,
                           Vector& scale, Vector& translate)
{
    Vector const moved = translationAt(matrix, point);
    getScale(matrix, point, size, scale, true);
    translate = moved;
}

void getScaleTranslateFlip(Matrix const& matrix, Vector const& point, Vector& scale,
                           Vector& translate)
{
    getScaleTranslateFlip(matrix, point, unitSize, scale, translate);
}

void getScaleTranslateFlip(Matrix const& matrix, Vector& scale, Vector& translate)
{
    getScaleTranslateFlip(matrix, origin, unitSize, scale, translate);
}

void getScaleTranslateRotate(Matrix const& matrix, Vector const& point, Vector const& size,
                             Vector& scale, Vector& translate, double& angle)
{
    Vector const moved = translationAt(matrix, point);
    Matrix const jacobian = jacobianAt(matrix, point);
    scale = scaleOf(jacobian, size, false);
    translate = moved;
    angle = angleOf(jacobian);
}

void getScaleTranslateRotate(Matrix const& matrix, Vector const& point, Vector& scale,
                             Vector& translate, double& angle)
{
    getScaleTranslateRotate(matrix, point, unitSize, scale, translate, angle);
}

void getScaleTranslateRotate(Matrix const& matrix, Vector& scale, Vector& translate, double& angle)
{
    getScaleTranslateRotate(matrix, origin, unitSize, scale, translate, angle);
}

void perspectiveToAffine(Matrix const& matrix, Vector const& point, Matrix& out)
{
    Matrix affine = jacobianAt(matrix, point);
    Vector moved;
    matrix.transform(point, moved);
    affine.rightTranslate(-point.x, -point.y, -point.z);
    affine.leftTranslate(moved.x, moved.y, moved.z);
    out = affine;
}
