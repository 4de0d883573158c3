#pragma once

#include <korvane/foundation/KVNSRef.h>
#include <korvane/foundation/KVString.h>
#include <korvane/numerics/KVMatrix44Tmpl.h>
#include <korvane/platform/CFArray.h>
#include <korvane/platform/NSAffineTransform.h>
#include <korvane/platform/NSCoder.h>
#include <korvane/platform/simd.h>

/// What a transform does, by axis; that of the identity until it is filled. Rotations are in
/// radians, applied about z, then x, then y.
struct KVMatrix44TransformInfo {
    double translationX = 0, translationY = 0, translationZ = 0;
    double rotationX = 0, rotationY = 0, rotationZ = 0;
    double scaleX = 1, scaleY = 1, scaleZ = 1;
    double shearX = 0, shearY = 0;
};

/// A KVMatrix44Tmpl<double> as an object: shared by reference, archived, printed and edited in
/// place.
///
///     auto camera = KVMakeRef<KVMatrix44Double>();
///     camera->leftRotate(std::numbers::pi / 2, KVMatrix44Tmpl<double>::zAxis);
///     camera->leftTranslateX(0, 1.5, -4);
///     std::puts(camera->extendedDescription().toUTF8().c_str());
///
/// "Doubles" are always sixteen, row by row. What can fail answers false and changes nothing. Not
/// synchronised: an object that is edited belongs to one thread.
class KV_EXPORT KVMatrix44Double final : public NSObject, public NSCoding {
public:
    using Matrix = KVMatrix44Tmpl<double>;

    // --- Make ---

    /// The identity.
    KVMatrix44Double() = default;
    explicit KVMatrix44Double(Matrix const& matrix) noexcept : matrix_(matrix) {}
    /// Copies the doubles, whatever `external` says.
    explicit KVMatrix44Double(double const* doubles, bool external = false) noexcept;
    /// From the first sixteen numbers of the array. Throws KVBadIndexException if there are fewer,
    /// or no array, and KVIllegalArgumentException if one is not a number.
    explicit KVMatrix44Double(CFArrayRef numbers);
    explicit KVMatrix44Double(simd_float4x4 const& columns) noexcept;
    explicit KVMatrix44Double(simd_double4x4 const& columns) noexcept;
    static KVNSRef<KVMatrix44Double*> matrixWithSIMDFloat4x4(simd_float4x4 const& columns);
    static KVNSRef<KVMatrix44Double*> matrixWithSIMDDouble4x4(simd_double4x4 const& columns);

    // --- Archive ---

    /// The archive holds one block under the key "bytes": the doubles in the machine's byte order,
    /// 128 bytes.
    static NSCodingClass const coding;
    static constexpr bool supportsSecureCoding() noexcept { return true; }
    /// Null unless the coder has a block of 128 bytes or more, of which it takes the first 128.
    static KVNSRef<KVMatrix44Double*> initWithCoder(NSCoder const& coder);
    NSCodingClass const& codingClass() const override { return coding; }
    void encodeWithCoder(NSCoder& coder) const override;

    // --- Compare and copy ---

    /// Whether the other is a matrix too and every element differs by less than 1e-7. A matrix that
    /// holds something that is not a number or is infinite equals none.
    bool isEqual(NSObject const* other) const override;
    bool isEqualToKVMatrix44Double(KVMatrix44Double const* other) const noexcept;
    /// The first eight bytes of the MD5 digest (RFC 1321) of the 128 bytes, as a little-endian
    /// number. It tells apart matrices that are equal but not the same, 0 and -0 among them.
    std::size_t hash() const override;
    KVNSRef<KVMatrix44Double*> copy() const { return KVMakeRef<KVMatrix44Double>(matrix_); }
    NSObject* newCopy() const override { return copy().leak(); }

    // --- Print ---

    /// "(\n", four rows of four numbers of the form "%f", "\n)"; a comma follows every number but
    /// the last.
    KVString description() const override;
    /// "( %f,%f,%f,%f,,%f,...,%f )": the rows parted by two commas.
    KVString compactDescription() const;
    /// Translation, scale, rotation, in degrees and in radians, and shear by axis, then the matrix.
    KVString extendedDescription() const { return extendedDescription(this); }
    /// The same; a null matrix prints zeros.
    static KVString extendedDescription(KVMatrix44Double const* matrix);
    /// "<KVMatrix44Double: address>" and the extended description.
    KVString debugDescription() const;

    // --- Access ---

    /// The matrix itself, for direct use, as long as the object lives.
    Matrix* kvMatrix() noexcept { return &matrix_; }
    Matrix const* kvMatrix() const noexcept { return &matrix_; }

    /// Element row * 4 + col, whatever the two are apart; throws KVBadIndexException if that is not
    /// one of 0 to 15.
    double doubleValueAtRow(int row, int col) const;
    void setDoubleValue(double value, int row, int col);
    /// From and to sixteen doubles of the caller's; not null.
    void getDoubles(double* doubles) const noexcept;
    void setDoubles(double const* doubles) noexcept;
    /// Sixteen numbers. Those for 0, 1 and -1 are shared objects, and so is the whole array of an
    /// `isIdentity()` with element (3,3) of exactly 1; -0 comes as 0.
    KVCFRef<CFArrayRef> array() const;
    simd_float4x4 SIMDFloat4x4() const noexcept;
    void setSIMDFloat4x4(simd_float4x4 const& columns) noexcept;
    simd_double4x4 SIMDDouble4x4() const noexcept;
    void setSIMDDouble4x4(simd_double4x4 const& columns) noexcept;

    // --- Edit ---
    //
    // As the members of KVMatrix44Tmpl do it. `leftTranslateX`, `leftScaleX`, `leftShearX` and
    // their `right...` forms are named after their first argument: they move, scale and shear along
    // all axes that they have arguments for.

    bool isIdentity() const noexcept { return matrix_.isIdentity(); }
    void makeIdentity() noexcept { matrix_ = Matrix(); }
    void leftTranslateX(double x, double y, double z) noexcept { matrix_.leftTranslate(x, y, z); }
    void rightTranslateX(double x, double y, double z) noexcept { matrix_.rightTranslate(x, y, z); }
    void leftScaleX(double x, double y, double z) noexcept { matrix_.leftScale(x, y, z); }
    void rightScaleX(double x, double y, double z) noexcept { matrix_.rightScale(x, y, z); }
    void leftShearX(double x, double y) noexcept { matrix_.leftShear(x, y); }
    void rightShearX(double x, double y) noexcept { matrix_.rightShear(x, y); }
    void leftRotate(double angle, Matrix::axis about) noexcept { matrix_.leftRotate(angle, about); }
    void rightRotate(double angle, Matrix::axis about) noexcept
    {
        matrix_.rightRotate(angle, about);
    }
    bool invert() noexcept { return matrix_.invert(matrix_); }
    /// The inverse in the plane z = 0.
    bool invert2D() noexcept { return matrix_.planarInverseZ(matrix_); }
    void transpose() noexcept { matrix_.transpose(); }
    void leftMult(KVMatrix44Double const& a) noexcept { matrix_.leftMult(a.matrix_); }
    void rightMult(KVMatrix44Double const& a) noexcept { matrix_.rightMult(a.matrix_); }
    /// Mirrors the result in the line at height y: translates by -y, scales y by -1, translates by
    /// y.
    void leftFlipAboutY(double y) noexcept;

    // --- Use ---

    /// The bounds of the transformed rectangle; empty for an empty one and for one that reaches
    /// behind the eye.
    KVRect<double> transformRect(KVRect<double> const& rect) const noexcept;
    /// Divided by w, without any test of it.
    KVVector2<double> transformPoint(KVVector2<double> const& point) const noexcept;
    /// As `getTransformation` tells; that of the identity if the matrix cannot be taken apart.
    KVMatrix44TransformInfo transformInfo() const noexcept;
    /// Writes each size times the scale of its axis to the output, null for none. Answers false if
    /// the matrix cannot be taken apart; its scales then count as 1.
    bool scaleSizeX(double sizeX, double sizeY, double sizeZ, double* scaledSizeX,
                    double* scaledSizeY, double* scaledSizeZ) const noexcept;
    /// m(0,0), m(0,1), m(1,0), m(1,1), m(0,3), m(1,3) as m11, m12, m21, m22, tX, tY. They are not
    /// transposed, though this matrix acts on columns and that one on rows; that is meant.
    NSAffineTransform newNSAffineTransform() const noexcept;
    /// What takes this transform's result to the other's: other * inverse of this. The identity if
    /// the other is null or equal; where this has no inverse, other * this.
    KVNSRef<KVMatrix44Double*> newTransformTo(KVMatrix44Double const* other) const;
    /// The same with the inverse in the plane z = 0.
    KVNSRef<KVMatrix44Double*> newPlanarTransformTo(KVMatrix44Double const* other) const;

private:
    Matrix matrix_;
};
