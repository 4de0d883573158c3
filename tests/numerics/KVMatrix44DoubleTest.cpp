#include <korvane/foundation/KVException.h>
#include <korvane/numerics/KVMatrix44Double.h>
#include <korvane/platform/CFNumber.h>
#include <korvane/platform/KVKeyedCoder.h>

#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <cstring>
#include <limits>
#include <numbers>

namespace {

constexpr double pi = std::numbers::pi;
constexpr double notANumber = std::numeric_limits<double>::quiet_NaN();

using Object = KVMatrix44Double;
using M = Object::Matrix;
using Ref = KVNSRef<Object*>;

constexpr double counted[] = {1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15, 16};

std::string text(KVString const& string)
{
    return string.toUTF8();
}

} // namespace

TEST(KVMatrix44Double, isMadeFromDoublesNumbersAndColumns)
{
    Object const object(counted);
    EXPECT_EQ(object.doubleValueAtRow(1, 2), 7);
    double mine[16];
    std::copy_n(counted, 16, mine);
    Object const copied(mine, true); // "external" makes no difference
    mine[0] = 99;
    auto const columns = object.SIMDDouble4x4();
    auto const narrow = object.SIMDFloat4x4();
    EXPECT_EQ(columns.columns[2].y, 7); // lane is the row
    EXPECT_EQ(narrow.columns[3].x, 4.0f);
    Object wide, single;
    wide.setSIMDDouble4x4(columns);
    single.setSIMDFloat4x4(narrow);
    for (Object const& same :
         {copied, Object(object.array()), *Object::matrixWithSIMDDouble4x4(columns),
          *Object::matrixWithSIMDFloat4x4(narrow), wide, single, *object.copy()})
        EXPECT_EQ(*same.kvMatrix(), *object.kvMatrix());
    wide.getDoubles(mine);
    EXPECT_EQ(std::memcmp(mine, counted, sizeof mine), 0);
}

TEST(KVMatrix44Double, arraysThatAreNotSixteenNumbersAreRefused)
{
    NSNumber const number(1.0);
    std::vector<NSObject const*> objects(15, &number);
    EXPECT_THROW(Object{KVMakeRef<NSArray>(objects).get()}, KVBadIndexException);
    EXPECT_THROW(Object{static_cast<CFArrayRef>(nullptr)}, KVBadIndexException);
    objects.push_back(NSNull::null());
    EXPECT_THROW(Object{KVMakeRef<NSArray>(objects).get()}, KVIllegalArgumentException);
    objects.back() = &number;
    objects.push_back(NSNull::null()); // what follows the sixteen is not looked at
    EXPECT_EQ(Object{KVMakeRef<NSArray>(objects).get()}.doubleValueAtRow(3, 3), 1);
}

TEST(KVMatrix44Double, arraysShareTheCommonNumbersAndTheIdentity)
{
    Object object;
    auto const identity = object.array();
    object.setDoubleValue(-1, 0, 0);
    object.setDoubleValue(0.5, 1, 1);
    auto const array = object.array(), again = object.array();
    EXPECT_EQ(array->objectAtIndex(1), identity->objectAtIndex(1));
    EXPECT_EQ(array->objectAtIndex(10), identity->objectAtIndex(0));
    EXPECT_EQ(array->objectAtIndex(0), again->objectAtIndex(0));
    EXPECT_NE(array->objectAtIndex(5), again->objectAtIndex(5));

    // What is nearly the identity becomes it. Twice the identity counts as one, but is not this
    // array.
    M nearly, twice;
    nearly(0, 1) = 1e-8;
    twice.leftScale(2, 2, 2);
    twice(3, 3) = 2;
    ASSERT_TRUE(twice.isIdentity());
    EXPECT_EQ(Object(nearly).array().get(), identity.get());
    EXPECT_NE(Object(twice).array().get(), identity.get());
}

TEST(KVMatrix44Double, isArchivedAsOneBlock)
{
    KVKeyedCoder coder;
    auto const object = KVMakeRef<Object>(counted);
    coder.encodeObject(object, "matrix");
    coder.encodeBytes(counted, sizeof counted, "bytes");
    auto const reader = KVKeyedCoder::fromBytes(coder.archivedBytes());
    ASSERT_TRUE(reader);
    auto const decoded = reader->decodeObjectOfClass<Object>(Object::coding, "matrix");
    ASSERT_TRUE(decoded);
    EXPECT_EQ(*decoded->kvMatrix(), *object->kvMatrix());
    EXPECT_TRUE(Object::supportsSecureCoding());
    // The block alone, as another writer would have left it.
    EXPECT_EQ(*Object::initWithCoder(*reader)->kvMatrix(), *object->kvMatrix());

    std::vector<std::uint8_t> bytes(136);
    std::memcpy(bytes.data(), counted, sizeof counted);
    for (std::size_t const length : {0u, 127u, 128u, 136u}) {
        KVKeyedCoder cut;
        cut.encodeBytes(bytes.data(), length, "bytes");
        auto const made = Object::initWithCoder(cut);
        EXPECT_EQ(made && *made->kvMatrix() == *object->kvMatrix(), length >= 128) << length;
    }
    KVKeyedCoder wrong;
    EXPECT_FALSE(Object::initWithCoder(wrong));
    wrong.encodeDouble(1, "bytes");
    EXPECT_FALSE(Object::initWithCoder(wrong));
}

TEST(KVMatrix44Double, equalityIsWithinATolerance)
{
    Object const object(counted);
    struct Row {
        double change;
        bool expected;
    } const rows[] = {
        {0, true}, {0.9e-7, true}, {-0.9e-7, true}, {1.1e-7, false}, {notANumber, false}};
    for (Row const& row : rows) {
        Object other(counted);
        other.setDoubleValue(1 + row.change, 0, 0);
        EXPECT_EQ(object.isEqual(&other), row.expected) << row.change;
        EXPECT_EQ(other.isEqualToKVMatrix44Double(&object), row.expected) << row.change;
    }
    EXPECT_FALSE(object.isEqual(nullptr));
    EXPECT_FALSE(object.isEqual(NSNull::null()));
    Object broken;
    broken.setDoubleValue(notANumber, 0, 0);
    EXPECT_FALSE(broken.isEqual(&broken));
}

TEST(KVMatrix44Double, hashIsOfTheBytes)
{
    // md5sum says 044d25ebecb5fe7647bf82120f61ad53.
    EXPECT_EQ(Object().hash(), 0x76feb5eceb254d04u);
    // Equal matrices may have different hashes: that is how the two are defined.
    Object near, negative;
    near.setDoubleValue(1e-9, 0, 1);
    negative.setDoubleValue(-0.0, 0, 1);
    for (Object const* other : {&near, &negative})
        EXPECT_TRUE(Object().isEqual(other) && Object().hash() != other->hash());
}

TEST(KVMatrix44Double, printsItsElements)
{
    Object object(counted);
    object.setDoubleValue(-0.1234567, 0, 0);
    object.setDoubleValue(1e20, 3, 3);
    object.setDoubleValue(std::numeric_limits<double>::infinity(), 2, 0);
    EXPECT_EQ(text(object.description()),
              "(\n-0.123457,2.000000,3.000000,4.000000,\n5.000000,6.000000,7.000000,8.000000,\n"
              "inf,10.000000,11.000000,12.000000,\n"
              "13.000000,14.000000,15.000000,100000000000000000000.000000\n)");
    EXPECT_EQ(text(Object().compactDescription()),
              "( 1.000000,0.000000,0.000000,0.000000,,0.000000,1.000000,0.000000,0.000000,,"
              "0.000000,0.000000,1.000000,0.000000,,0.000000,0.000000,0.000000,1.000000 )");
}

TEST(KVMatrix44Double, extendedDescriptionTakesItApart)
{
    Object object;
    object.leftRotate(pi / 2, M::zAxis);
    object.leftScaleX(2, 2, 2);
    object.leftTranslateX(1, -0.5, 0);
    EXPECT_EQ(text(object.extendedDescription()),
              "translation:\n\tx: 1\n\ty: -0.5\n\tz: 0\n"
              "scale:\n\tx: 2\n\ty: 2\n\tz: 2\n"
              "rotation:\n\tx: 0.00\xC2\xB0 (0)\n\ty: 0.00\xC2\xB0 (0)\n"
              "\tz: 90.00\xC2\xB0 (1.5707963267948966)\n"
              "shear:\n\tx: 0\n\ty: 0\n"
              "matrix:\n\t(\n\t0.000000,-2.000000,0.000000,1.000000,\n"
              "\t2.000000,0.000000,0.000000,-0.500000,\n"
              "\t0.000000,0.000000,2.000000,0.000000,\n"
              "\t0.000000,0.000000,0.000000,1.000000\n\t)");
    EXPECT_EQ(text(Object::extendedDescription(nullptr)),
              "translation:\n\tx: 0\n\ty: 0\n\tz: 0\nscale:\n\tx: 0\n\ty: 0\n\tz: 0\n"
              "rotation:\n\tx: 0.00\xC2\xB0 (0)\n\ty: 0.00\xC2\xB0 (0)\n\tz: 0.00\xC2\xB0 (0)\n"
              "shear:\n\tx: 0\n\ty: 0\nmatrix:\n\t(null)");
    char address[32];
    std::snprintf(address, sizeof address, "%p", static_cast<void const*>(&object));
    EXPECT_EQ(text(object.debugDescription()), std::string("<KVMatrix44Double: ") + address + ">" +
                                                   text(object.extendedDescription()));
}

TEST(KVMatrix44Double, elementsAreFoundByRowTimesFourPlusColumn)
{
    Object object(counted);
    EXPECT_EQ(object.doubleValueAtRow(1, -1), 4); // no check on row and column alone
    struct Row {
        int row, col;
    } const rows[] = {{0, -1}, {4, 0}, {3, 4}, {std::numeric_limits<int>::max(), 0}};
    for (Row const& row : rows) {
        EXPECT_THROW(object.doubleValueAtRow(row.row, row.col), KVBadIndexException);
        EXPECT_THROW(object.setDoubleValue(1, row.row, row.col), KVBadIndexException);
    }
}

TEST(KVMatrix44Double, editsReachTheMatrix)
{
    Object a, b;
    a.leftFlipAboutY(3);
    EXPECT_EQ(a.transformPoint({1, 1}), KVVector2<double>(1, 5));
    b.leftTranslateX(1, 0, 0);
    Object product(*a.kvMatrix());
    product.leftMult(b);
    EXPECT_EQ(*product.kvMatrix(), *b.kvMatrix() * *a.kvMatrix());
    product = a;
    product.rightMult(b);
    EXPECT_EQ(*product.kvMatrix(), *a.kvMatrix() * *b.kvMatrix());
    EXPECT_TRUE(b.invert());
    EXPECT_EQ(b.doubleValueAtRow(0, 3), -1);
    EXPECT_TRUE(b.invert2D());
    EXPECT_EQ(b.doubleValueAtRow(2, 2), 0);
    EXPECT_FALSE(b.invert());
    EXPECT_TRUE(product.transformRect({0, 0, -1, 0}).isEmpty());
}

TEST(KVMatrix44Double, tellsWhatItDoes)
{
    Object object, flat;
    object.leftScaleX(2, 3, 4);
    flat.leftScaleX(0, 1, 1);
    for (Object* one : {&object, &flat})
        one->leftTranslateX(5, 6, 7);
    auto const info = object.transformInfo();
    EXPECT_EQ(info.translationZ, 7);
    EXPECT_EQ(info.scaleY, 3);
    EXPECT_EQ(flat.transformInfo().translationX, 0);
    EXPECT_EQ(flat.transformInfo().scaleX, 1);
    double x = 0, z = 0;
    EXPECT_TRUE(object.scaleSizeX(10, 10, 10, &x, nullptr, &z));
    EXPECT_EQ(x + z, 20 + 40);
    EXPECT_FALSE(flat.scaleSizeX(10, 10, 10, &x, nullptr, nullptr));
    EXPECT_EQ(x, 10);

    // Paired without transposing, though the conventions differ: that is meant.
    auto const affine = Object(counted).newNSAffineTransform();
    EXPECT_EQ((std::array{affine.m11, affine.m12, affine.m21, affine.m22, affine.tX, affine.tY}),
              (std::array{1.0, 2.0, 5.0, 6.0, 4.0, 8.0}));
}

TEST(KVMatrix44Double, transformToLeadsFromOneToTheOther)
{
    Object from, to;
    from.leftScaleX(2, 2, 2);
    to.leftTranslateX(3, 0, 0);
    Ref const between = from.newTransformTo(&to);
    between->rightMult(from);
    EXPECT_TRUE(between->isEqual(&to));
    Ref const planar = from.newPlanarTransformTo(&to);
    EXPECT_EQ(planar->transformPoint({2, 2}), KVVector2<double>(4, 1));
    EXPECT_EQ(planar->doubleValueAtRow(2, 2), 0);

    // To an equal one, or to none, it is the identity; no inverse is asked for.
    Object singular;
    singular.leftScaleX(0, 1, 1);
    EXPECT_EQ(*singular.newTransformTo(&singular)->kvMatrix(), M());
    EXPECT_EQ(*singular.newTransformTo(nullptr)->kvMatrix(), M());
    EXPECT_EQ(*singular.newPlanarTransformTo(nullptr)->kvMatrix(), M());
    // Where there is no inverse the matrix itself stays.
    EXPECT_EQ(*singular.newTransformTo(&to)->kvMatrix(), *to.kvMatrix() * *singular.kvMatrix());
}
