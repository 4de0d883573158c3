#include <korvane/numerics/KVMatrix44Double.h>

#include <korvane/foundation/KVException.h>
#include <korvane/platform/CFNumber.h>
#include <korvane/serialization/KVMD5.h>

#include <algorithm>
#include <charconv>
#include <cstring>
#include <numbers>
#include <string>

namespace {

using Matrix = KVMatrix44Double::Matrix;
using Number = KVNSRef<NSNumber*>;

constexpr std::size_t byteCount = 16 * sizeof(double);
static_assert(sizeof(Matrix) == byteCount);

/// The order in which hosts read the angles.
constexpr std::int32_t rotationOrder = 4;

template <class Columns>
Matrix fromColumns(Columns const& from)
{
    Matrix matrix;
    for (int col = 0; col < 4; ++col) {
        auto const& lanes = from.columns[col];
        matrix(0, col) = lanes.x;
        matrix(1, col) = lanes.y;
        matrix(2, col) = lanes.z;
        matrix(3, col) = lanes.w;
    }
    return matrix;
}

template <class Columns, class Lane>
Columns toColumns(Matrix const& matrix)
{
    Columns to;
    for (int col = 0; col < 4; ++col)
        to.columns[col] = {static_cast<Lane>(matrix(0, col)), static_cast<Lane>(matrix(1, col)),
                           static_cast<Lane>(matrix(2, col)), static_cast<Lane>(matrix(3, col))};
    return to;
}

Number numberOf(double value)
{
    static Number const zero = KVMakeRef<NSNumber>(0.0);
    static Number const one = KVMakeRef<NSNumber>(1.0);
    static Number const minusOne = KVMakeRef<NSNumber>(-1.0);
    if (value == 0)
        return zero;
    if (value == 1)
        return one;
    return value == -1 ? minusOne : KVMakeRef<NSNumber>(value);
}

KVCFRef<CFArrayRef> numbersOf(Matrix const& matrix)
{
    Number numbers[16];
    NSObject const* objects[16];
    for (int i = 0; i < 16; ++i)
        objects[i] = numbers[i] = numberOf(matrix.data()[i]);
    return KVCFRef<CFArrayRef>::adopt(new NSArray(objects));
}

std::size_t elementIndex(int row, int col)
{
    long long const index = 4LL * row + col;
    if (index < 0 || index > 15)
        throw KVBadIndexException("no such element of a 4x4 matrix", __FILE__, __LINE__);
    return static_cast<std::size_t>(index);
}

/// The text of "%.<digits>f" in the C locale.
std::string fixed(double value, int digits = 6)
{
    char text[400]; // the largest number has 309 digits before the point
    auto const end =
        std::to_chars(text, text + sizeof text, value, std::chars_format::fixed, digits).ptr;
    return {text, end};
}

std::string descriptionOf(Matrix const& matrix)
{
    std::string text = "(\n";
    for (int i = 0; i < 15; ++i)
        text += fixed(matrix.data()[i]) + (i % 4 == 3 ? ",\n" : ",");
    return text + fixed(matrix.data()[15]) + "\n)";
}

} // namespace

NSCodingClass const KVMatrix44Double::coding{
    "KVMatrix44Double", [](NSCoder& coder) -> KVNSRef<NSObject*> { return initWithCoder(coder); }};

KVMatrix44Double::KVMatrix44Double(double const* doubles, bool) noexcept
{
    setDoubles(doubles);
}

KVMatrix44Double::KVMatrix44Double(CFArrayRef numbers)
{
    if (!numbers || numbers->count() < 16)
        throw KVBadIndexException("a matrix needs sixteen numbers", __FILE__, __LINE__);
    for (std::size_t i = 0; i < 16; ++i) {
        auto const* number = dynamic_cast<NSNumber const*>(numbers->objectAtIndex(i));
        if (!number)
            throw KVIllegalArgumentException("a matrix is made of numbers", __FILE__, __LINE__);
        matrix_.data()[i] = number->doubleValue();
    }
}

KVMatrix44Double::KVMatrix44Double(simd_float4x4 const& columns) noexcept
    : matrix_(fromColumns(columns))
{}

KVMatrix44Double::KVMatrix44Double(simd_double4x4 const& columns) noexcept
    : matrix_(fromColumns(columns))
{}

KVNSRef<KVMatrix44Double*> KVMatrix44Double::matrixWithSIMDFloat4x4(simd_float4x4 const& columns)
{
    return KVMakeRef<KVMatrix44Double>(columns);
}

KVNSRef<KVMatrix44Double*> KVMatrix44Double::matrixWithSIMDDouble4x4(simd_double4x4 const& columns)
{
    return KVMakeRef<KVMatrix44Double>(columns);
}

KVNSRef<KVMatrix44Double*> KVMatrix44Double::initWithCoder(NSCoder const& coder)
{
    auto const bytes = coder.decodeBytes("bytes");
    if (!bytes || bytes->size() < byteCount)
        return nullptr;
    Matrix matrix;
    std::memcpy(matrix.data(), bytes->data(), byteCount);
    return KVMakeRef<KVMatrix44Double>(matrix);
}

void KVMatrix44Double::encodeWithCoder(NSCoder& coder) const
{
    coder.encodeBytes(matrix_.data(), byteCount, "bytes");
}

bool KVMatrix44Double::isEqual(NSObject const* other) const
{
    return isEqualToKVMatrix44Double(dynamic_cast<KVMatrix44Double const*>(other));
}

bool KVMatrix44Double::isEqualToKVMatrix44Double(KVMatrix44Double const* other) const noexcept
{
    return other && std::equal(matrix_.data(), matrix_.data() + 16, other->matrix_.data(),
                               [](double a, double b) { return std::abs(a - b) < 1e-7; });
}

std::size_t KVMatrix44Double::hash() const
{
    KVHash128State const digest = KVMD5HashWithBytes(matrix_.data(), byteCount);
    return digest.words[0] | std::uint64_t(digest.words[1]) << 32;
}

KVString KVMatrix44Double::description() const
{
    return descriptionOf(matrix_);
}

KVString KVMatrix44Double::compactDescription() const
{
    std::string text = "( ";
    for (int i = 0; i < 15; ++i)
        text += fixed(matrix_.data()[i]) + (i % 4 == 3 ? ",," : ",");
    return text + fixed(matrix_.data()[15]) + " )";
}

KVString KVMatrix44Double::extendedDescription(KVMatrix44Double const* matrix)
{
    KVMatrix44TransformInfo info;
    std::string text = "(null)";
    if (matrix) {
        info = matrix->transformInfo();
        text = descriptionOf(matrix->matrix_);
    } else {
        info.scaleX = info.scaleY = info.scaleZ = 0;
    }
    auto const line = [](char axis, double value) {
        return std::string("\n\t") + axis + ": " + numberOf(value)->description().toUTF8();
    };
    auto const turn = [](char axis, double value) {
        Number const radians = numberOf(value);
        return std::string("\n\t") + axis + ": " +
               fixed(radians->doubleValue() * 180 / std::numbers::pi, 2) + "\xC2\xB0 (" +
               radians->description().toUTF8() + ")";
    };
    std::string indented;
    for (char const c : text)
        indented += c == '\n' ? std::string("\n\t") : std::string(1, c);
    return "translation:" + line('x', info.translationX) + line('y', info.translationY) +
           line('z', info.translationZ) + "\nscale:" + line('x', info.scaleX) +
           line('y', info.scaleY) + line('z', info.scaleZ) +
           "\nrotation:" + turn('x', info.rotationX) + turn('y', info.rotationY) +
           turn('z', info.rotationZ) + "\nshear:" + line('x', info.shearX) +
           line('y', info.shearY) + "\nmatrix:\n\t" + indented;
}

KVString KVMatrix44Double::debugDescription() const
{
    return KVString::ssprintf("<KVMatrix44Double: %p>", static_cast<void const*>(this)).toUTF8() +
           extendedDescription().toUTF8();
}

double KVMatrix44Double::doubleValueAtRow(int row, int col) const
{
    return matrix_.data()[elementIndex(row, col)];
}

void KVMatrix44Double::setDoubleValue(double value, int row, int col)
{
    matrix_.data()[elementIndex(row, col)] = value;
}

void KVMatrix44Double::getDoubles(double* doubles) const noexcept
{
    std::copy_n(matrix_.data(), 16, doubles);
}

void KVMatrix44Double::setDoubles(double const* doubles) noexcept
{
    std::copy_n(doubles, 16, matrix_.data());
}

KVCFRef<CFArrayRef> KVMatrix44Double::array() const
{
    static KVCFRef<CFArrayRef> const identity = numbersOf(Matrix());
    return isIdentity() && matrix_(3, 3) == 1 ? identity : numbersOf(matrix_);
}

simd_float4x4 KVMatrix44Double::SIMDFloat4x4() const noexcept
{
    return toColumns<simd_float4x4, float>(matrix_);
}

void KVMatrix44Double::setSIMDFloat4x4(simd_float4x4 const& columns) noexcept
{
    matrix_ = fromColumns(columns);
}

simd_double4x4 KVMatrix44Double::SIMDDouble4x4() const noexcept
{
    return toColumns<simd_double4x4, double>(matrix_);
}

void KVMatrix44Double::setSIMDDouble4x4(simd_double4x4 const& columns) noexcept
{
    matrix_ = fromColumns(columns);
}

void KVMatrix44Double::leftFlipAboutY(double y) noexcept
{
    matrix_.leftTranslate(0, -y, 0);
    matrix_.leftScale(1, -1, 1);
    matrix_.leftTranslate(0, y, 0);
}

KVRect<double> KVMatrix44Double::transformRect(KVRect<double> const& rect) const noexcept
{
    KVRect<double> bounds;
    matrix_.transformRect(rect, bounds);
    return bounds;
}

KVVector2<double> KVMatrix44Double::transformPoint(KVVector2<double> const& point) const noexcept
{
    KVVector2<double> transformed;
    return matrix_.transform(point, transformed);
}

KVMatrix44TransformInfo KVMatrix44Double::transformInfo() const noexcept
{
    KVMatrix44Parameters<double> p;
    p.rotOrder = rotationOrder;
    if (!matrix_.getTransformation(p))
        return {};
    return {p.translation.x, p.translation.y, p.translation.z, p.rotation.x,
            p.rotation.y,    p.rotation.z,    p.scale.x,       p.scale.y,
            p.scale.z,       p.shear.x,       p.shear.y};
}

bool KVMatrix44Double::scaleSizeX(double sizeX, double sizeY, double sizeZ, double* scaledSizeX,
                                  double* scaledSizeY, double* scaledSizeZ) const noexcept
{
    KVMatrix44Parameters<double> p;
    p.rotOrder = rotationOrder;
    bool const found = matrix_.getTransformation(p);
    if (scaledSizeX)
        *scaledSizeX = sizeX * p.scale.x;
    if (scaledSizeY)
        *scaledSizeY = sizeY * p.scale.y;
    if (scaledSizeZ)
        *scaledSizeZ = sizeZ * p.scale.z;
    return found;
}

NSAffineTransform KVMatrix44Double::newNSAffineTransform() const noexcept
{
    auto const& m = matrix_;
    return {m(0, 0), m(0, 1), m(1, 0), m(1, 1), m(0, 3), m(1, 3)};
}

KVNSRef<KVMatrix44Double*> KVMatrix44Double::newTransformTo(KVMatrix44Double const* other) const
{
    if (!other || isEqual(other))
        return KVMakeRef<KVMatrix44Double>();
    auto transform = copy();
    transform->invert();
    transform->leftMult(*other);
    return transform;
}

KVNSRef<KVMatrix44Double*>
KVMatrix44Double::newPlanarTransformTo(KVMatrix44Double const* other) const
{
    if (!other || isEqual(other))
        return KVMakeRef<KVMatrix44Double>();
    auto transform = copy();
    transform->invert2D();
    transform->leftMult(*other);
    return transform;
}
