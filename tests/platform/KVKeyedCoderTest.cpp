#include <korvane/foundation/KVException.h>
#include <korvane/platform/CFArray.h>
#include <korvane/platform/CFData.h>
#include <korvane/platform/CFNumber.h>
#include <korvane/platform/KVKeyedCoder.h>

#include <gtest/gtest.h>

#include <cmath>
#include <functional>
#include <limits>
#include <numeric>
#include <string>

namespace {

using Bytes = std::vector<std::uint8_t>;

/// A node of a graph: a number, and other nodes to hold.
class Knot final : public NSObject, public NSCoding {
public:
    explicit Knot(std::int64_t number) : value(number) {}

    static KVNSRef<NSObject*> initWithCoder(NSCoder& coder);
    static NSCodingClass const coding;
    NSCodingClass const& codingClass() const override { return coding; }
    void encodeWithCoder(NSCoder& coder) const override
    {
        ++encoded;
        coder.encodeInt64(value, "value");
        coder.encodeObject(left, "left");
        coder.encodeObject(right, "right");
    }

    std::int64_t value;
    KVNSRef<NSObject*> left, right;
    mutable int encoded = 0;
    static inline int made = 0;
};

NSCodingClass const Knot::coding{"Knot", &Knot::initWithCoder};

KVNSRef<NSObject*> Knot::initWithCoder(NSCoder& coder)
{
    ++made;
    if (coder.decodeInt64("value") < 0)
        return nullptr;
    auto knot = KVMakeRef<Knot>(coder.decodeInt64("value"));
    knot->left = coder.decodeObject("left", {&coding, &NSArrayCodingClass, &NSStringCodingClass});
    knot->right = coder.decodeObject("right", {&coding});
    return knot;
}

/// A class whose writing is given by the test.
class Scribe final : public NSObject, public NSCoding {
public:
    using Write = std::function<void(NSCoder&)>;
    explicit Scribe(Write write, char const* name = "Scribe")
        : write_(std::move(write)), coding_{name, nullptr}
    {}
    NSCodingClass const& codingClass() const override { return coding_; }
    void encodeWithCoder(NSCoder& coder) const override { write_(coder); }

private:
    Write write_;
    NSCodingClass coding_;
};

std::unique_ptr<KVKeyedCoder> reread(KVKeyedCoder const& coder)
{
    return KVKeyedCoder::fromBytes(coder.archivedBytes());
}

KVNSRef<NSObject*> arrayOf(std::initializer_list<NSObject const*> objects)
{
    return KVMakeRef<__CFArray>(std::span(objects.begin(), objects.size()));
}

/// What stands behind the magic and the version.
Bytes archive(std::initializer_list<int> tail)
{
    Bytes bytes = {'K', 'V', 'K', 'A', 1};
    for (int const byte : tail)
        bytes.push_back(static_cast<std::uint8_t>(byte));
    return bytes;
}

} // namespace

TEST(KVKeyedCoder, keepsPlainValues)
{
    KVKeyedCoder coder;
    std::uint8_t const block[] = {0, 255, 7};
    coder.encodeBytes(block, 3, "block");
    coder.encodeBytes(nullptr, 0, "no bytes");
    coder.encodeInt64(std::numeric_limits<std::int64_t>::min(), "integer");
    coder.encodeDouble(-0.0, "zero");
    coder.encodeDouble(std::nan("5"), "nan");
    coder.encodeBool(true, "flag");

    auto const reader = reread(coder);
    for (KVKeyedCoder const* from : {&std::as_const(coder), &std::as_const(*reader)}) {
        auto const bytes = from->decodeBytes("block").value();
        EXPECT_EQ(Bytes(bytes.begin(), bytes.end()), Bytes(block, block + 3));
        EXPECT_TRUE(from->decodeBytes("no bytes").value().empty());
        EXPECT_EQ(from->decodeInt64("integer"), std::numeric_limits<std::int64_t>::min());
        EXPECT_TRUE(std::signbit(from->decodeDouble("zero")));
        EXPECT_TRUE(std::isnan(from->decodeDouble("nan")));
        EXPECT_TRUE(from->decodeBool("flag"));
    }
}

TEST(KVKeyedCoder, missingKeysAndOtherKindsAreNothing)
{
    KVKeyedCoder coder;
    coder.encodeInt64(5, "integer");
    coder.encodeBool(true, "flag");
    coder.encodeString(KVString("text"), "text");
    coder.encodeString(KVString(), "null");
    coder.encodeObject(nullptr, "nil");
    for (char const* absent : {"absent", "null", "nil"})
        EXPECT_FALSE(coder.containsValueForKey(absent)) << absent;
    EXPECT_EQ(coder.decodeInt64("flag"), 0);
    EXPECT_EQ(coder.decodeDouble("integer"), 0);
    EXPECT_FALSE(coder.decodeBool("integer"));
    EXPECT_FALSE(coder.decodeBytes("text"));
    EXPECT_TRUE(coder.decodeString("integer").isNull());
    EXPECT_FALSE(coder.decodeObject("integer", {&NSNumberCodingClass}));
    coder.encodeInt64(6, "text"); // takes the string's place
    EXPECT_TRUE(coder.decodeString("text").isNull());
}

TEST(KVKeyedCoder, archivesObjectsOfThePlatform)
{
    KVString const half = KVString::fromUTF16(u"a\xD800z");
    std::uint8_t const bytes[] = {1, 2};
    KVNSRef<NSObject*> const objects[] = {
        const_cast<__CFString*>(KVString("plain").cf_str()),
        const_cast<__CFString*>(KVString("Réel").cf_str()),
        const_cast<__CFString*>(half.cf_str()),
        KVMakeRef<__CFNumber>(-7),
        KVMakeRef<__CFNumber>(0.1),
        KVMakeRef<__CFData>(bytes, 2u),
        NSNull::null(),
        arrayOf({}),
    };
    std::vector<NSObject const*> all(std::begin(objects), std::end(objects));
    auto const nested = KVMakeRef<__CFArray>(all);
    KVKeyedCoder coder;
    coder.encodeObject(nested, "array");

    auto const reader = reread(coder);
    ASSERT_TRUE(reader);
    auto const decoded =
        reader->decodeObject("array", {&NSArrayCodingClass, &NSNullCodingClass, &NSDataCodingClass,
                                       &NSNumberCodingClass, &NSStringCodingClass});
    ASSERT_TRUE(decoded);
    EXPECT_TRUE(decoded->isEqual(nested));
    auto const* array = dynamic_cast<__CFArray const*>(decoded.get());
    ASSERT_TRUE(array);
    EXPECT_TRUE(dynamic_cast<__CFNumber const*>(array->objectAtIndex(4))->isFloat());
    EXPECT_EQ(reader->archivedBytes(), coder.archivedBytes());
}

TEST(KVKeyedCoder, anArrayIsDecodedOnlyIfAllWithinItIsAllowed)
{
    KVKeyedCoder coder;
    KVString const text("ruby");
    coder.encodeObject(arrayOf({arrayOf({text.cf_str()}), NSNull::null()}), "array");
    coder.encodeObject(KVMakeRef<Knot>(1), "knot");

    EXPECT_FALSE(coder.decodeObject("array", {&NSArrayCodingClass, &NSStringCodingClass}));
    EXPECT_TRUE(coder.decodeObject(
        "array", {&NSNullCodingClass, &NSArrayCodingClass, &NSStringCodingClass}));
    // Once made, it is still of a kind that this list does not name.
    EXPECT_FALSE(coder.decodeObject("array", {&NSArrayCodingClass, &NSStringCodingClass}));
    EXPECT_FALSE(coder.decodeObject("knot", {&NSStringCodingClass, nullptr}));
    EXPECT_FALSE(coder.decodeObjectOfClass<NSNumber>(Knot::coding, "knot"));
    EXPECT_TRUE(coder.decodeObjectOfClass<Knot>(Knot::coding, "knot"));
}

TEST(KVKeyedCoder, keepsTheIdentityOfObjects)
{
    auto const shared = KVMakeRef<Knot>(3);
    auto const top = KVMakeRef<Knot>(1);
    auto const side = KVMakeRef<Knot>(2);
    top->left = arrayOf({shared, side, shared});
    top->right = side;
    side->right = shared;
    KVKeyedCoder coder;
    coder.encodeObject(top, "top");
    coder.encodeObject(shared, "shared");
    shared->value = 4; // too late
    coder.encodeObject(shared, "again");
    EXPECT_EQ(shared->encoded, 1);

    auto const reader = reread(coder);
    ASSERT_TRUE(reader);
    Knot::made = 0;
    auto const one = reader->decodeObjectOfClass<Knot>(Knot::coding, "top");
    ASSERT_TRUE(one);
    auto const* row = dynamic_cast<__CFArray const*>(one->left.get());
    ASSERT_TRUE(row);
    EXPECT_EQ(row->objectAtIndex(0), row->objectAtIndex(2));
    EXPECT_EQ(row->objectAtIndex(1), one->right.get());
    auto const three = reader->decodeObjectOfClass<Knot>(Knot::coding, "shared");
    EXPECT_EQ(row->objectAtIndex(0), three.get());
    EXPECT_EQ(three->value, 3);
    EXPECT_EQ(three, reader->decodeObject("again", {&Knot::coding}));
    EXPECT_EQ(Knot::made, 3);
    EXPECT_EQ(reader->archivedBytes(), coder.archivedBytes());
}

TEST(KVKeyedCoder, anObjectThatIsNotMadeIsNullAndNotTriedAgain)
{
    // Each level names the next one twice: tried again and again, they would never end.
    auto knot = KVMakeRef<Knot>(-1);
    for (unsigned int level = 0; level + 2 < KVKeyedCoder::maximumDepth; ++level) {
        auto const outer = KVMakeRef<Knot>(0);
        outer->left = outer->right = knot;
        knot = outer;
    }
    KVKeyedCoder coder;
    coder.encodeObject(knot, "knot");
    coder.encodeObject(arrayOf({KVMakeRef<Knot>(-2)}), "array");
    Knot::made = 0;
    auto const decoded = coder.decodeObjectOfClass<Knot>(Knot::coding, "knot");
    EXPECT_TRUE(decoded);
    EXPECT_EQ(Knot::made, static_cast<int>(KVKeyedCoder::maximumDepth) - 1);
    EXPECT_FALSE(coder.decodeObject("array", {&NSArrayCodingClass, &Knot::coding}));
}

TEST(KVKeyedCoder, refusesWhatCannotBeArchived)
{
    KVKeyedCoder coder;
    coder.encodeInt64(1, "kept");
    auto const refuses = [&](NSObject const* object) {
        EXPECT_THROW(coder.encodeObject(object, "kept"), KVIllegalArgumentException);
        EXPECT_EQ(coder.decodeInt64("kept"), 1);
        auto const reader = reread(coder);
        ASSERT_TRUE(reader);
        EXPECT_EQ(reader->decodeInt64("kept"), 1);
    };
    NSObject const stranger;
    refuses(&stranger);
    refuses(arrayOf({NSNull::null(), &stranger}));
    refuses(KVMakeRef<Scribe>([](NSCoder&) {}, ""));
    refuses(KVMakeRef<Scribe>([](NSCoder&) {}, "Sch\xC3\xB6n"));
    refuses(KVMakeRef<Scribe>([](NSCoder& c) { c.encodeBool(true, "\xC3\xB6"); }));

    auto const circle = KVMakeRef<Knot>(1);
    circle->left = arrayOf({circle});
    refuses(circle);
    circle->left = nullptr; // or it would never be freed
    coder.encodeObject(circle, "circle");
    EXPECT_TRUE(coder.decodeObject("circle", {&Knot::coding}));

    KVNSRef<NSObject*> deep = NSNull::null();
    for (unsigned int height = 1; height < KVKeyedCoder::maximumDepth; ++height)
        deep = arrayOf({deep});
    coder.encodeObject(deep, "deep");
    EXPECT_TRUE(coder.decodeObject("deep", {&NSArrayCodingClass, &NSNullCodingClass}));
    refuses(arrayOf({deep}));
    refuses(arrayOf({NSNull::null(), arrayOf({deep})}));
    EXPECT_TRUE(reread(coder)->containsValueForKey("deep"));
}

TEST(KVKeyedCoder, doesNotWriteWhileItReads)
{
    static bool refused;
    static NSCodingClass const meddler{"Scribe", [](NSCoder& coder) -> KVNSRef<NSObject*> {
                                           try {
                                               coder.encodeInt64(2, "value");
                                           } catch (KVIllegalArgumentException const&) {
                                               refused = true;
                                           }
                                           return KVMakeRef<__CFNumber>(coder.decodeInt64("value"));
                                       }};
    KVKeyedCoder coder;
    coder.encodeObject(KVMakeRef<Scribe>([](NSCoder& c) { c.encodeInt64(1, "value"); }), "object");
    auto const made = coder.decodeObject("object", {&meddler});
    EXPECT_TRUE(refused);
    EXPECT_TRUE(made->isEqual(KVMakeRef<__CFNumber>(1)));
    coder.encodeInt64(3, "after"); // and writes again afterwards
}

TEST(KVKeyedCoder, bytesHaveTheLayoutThatIsWritten)
{
    KVKeyedCoder coder;
    coder.encodeDouble(1.0, "d");
    coder.encodeBool(true, "b");
    coder.encodeBytes("\x80", 1, "k");
    KVString const text("\xC3\xA9"); // U+00E9
    auto const knot = KVMakeRef<Knot>(-2);
    knot->left = const_cast<__CFString*>(text.cf_str());
    coder.encodeObject(arrayOf({text.cf_str(), knot, text.cf_str()}), "a");
    EXPECT_EQ(coder.archivedBytes(),
              archive({3,                                 //
                       2,   1,   0xE9, 0,                 //
                       7,   4,   'K',  'n', 'o', 't',  2, //
                       4,   'l', 'e',  'f', 't', 0x14, 0, //
                       5,   'v', 'a',  'l', 'u', 'e',  0x11, 0xFE, 255, 255,  255,
                       255, 255, 255,  255, 6,   3,    0,    1,    0,               //
                       4,                                                           //
                       1,   'a', 0x14, 2,                                           //
                       1,   'b', 0x13, 1,                                           //
                       1,   'd', 0x12, 0,   0,   0,    0,    0,    0,   0xF0, 0x3F, //
                       1,   'k', 0x10, 1,   0x80}));
}

TEST(KVKeyedCoder, badBytesAreRefused)
{
    struct Row {
        char const* fault;
        Bytes bytes;
    } const rows[] = {
        {"nothing", {}},
        {"another version", {'K', 'V', 'K', 'A', 2, 0, 0}},
        {"bytes behind the end", archive({0, 0, 0})},
        {"more objects than bytes", archive({255, 255, 255, 255, 255, 255, 255, 255, 127, 0})},
        {"a count beyond 63 bits", archive({255, 255, 255, 255, 255, 255, 255, 255, 255, 1, 0})},
        {"a count that is not shortest", archive({0x80, 0, 0})},
        {"a string that is not ASCII", archive({1, 1, 1, 0x80, 0})},
        {"ASCII as UTF-16", archive({1, 2, 1, 'a', 0, 0})},
        {"an unknown object", archive({1, 8, 0})},
        {"a flag of 2", archive({0, 1, 1, 'a', 0x13, 2})},
        {"a reference to itself", archive({1, 6, 1, 0, 0})},
        {"a reference to a later object", archive({2, 6, 1, 1, 0, 0})},
        {"a reference to no object", archive({1, 0, 1, 1, 'a', 0x14, 1})},
        {"a class without name", archive({1, 7, 0, 0, 0})},
        {"a key twice", archive({0, 2, 1, 'a', 0x13, 0, 1, 'a', 0x13, 0})},
        {"keys out of order", archive({0, 2, 1, 'b', 0x13, 0, 1, 'a', 0x13, 0})},
        {"a key that is not ASCII", archive({0, 1, 1, 0x80, 0x13, 0})},
        {"a block longer than the bytes", archive({0, 1, 1, 'a', 0x10, 9, 0})},
    };
    for (Row const& row : rows)
        EXPECT_FALSE(KVKeyedCoder::fromBytes(row.bytes)) << row.fault;
    EXPECT_TRUE(KVKeyedCoder::fromBytes(archive({0, 0})));
    EXPECT_TRUE(KVKeyedCoder::fromBytes(archive({0, 2, 0, 0x13, 0, 1, 'a', 0x13, 1})));
}

TEST(KVKeyedCoder, anArchiveCutShortIsRefused)
{
    KVKeyedCoder coder;
    auto const knot = KVMakeRef<Knot>(300);
    knot->left = arrayOf({KVMakeRef<Knot>(1)});
    coder.encodeObject(knot, "knot");
    coder.encodeString("R\xC3\xA9"
                       "el",
                       "text");
    coder.encodeDouble(0.5, "z");
    Bytes const whole = coder.archivedBytes();
    for (std::size_t length = 0; length < whole.size(); ++length)
        EXPECT_FALSE(KVKeyedCoder::fromBytes(std::span(whole).first(length))) << length;
}

TEST(KVKeyedCoder, hostileDepthIsRefusedAndSharingCostsNothing)
{
    // Arrays within one another, each holding the one before twice: 2 to the 199 paths.
    auto const nested = [](unsigned int height) {
        Bytes bytes = archive({});
        auto const number = [&bytes](unsigned int value) {
            for (; value >= 0x80; value >>= 7)
                bytes.push_back(static_cast<std::uint8_t>(value | 0x80));
            bytes.push_back(static_cast<std::uint8_t>(value));
        };
        number(height);
        bytes.push_back(0);
        for (unsigned int i = 0; i + 1 < height; ++i) {
            bytes.insert(bytes.end(), {6, 2});
            number(i);
            number(i);
        }
        bytes.insert(bytes.end(), {1, 1, 'a', 0x14});
        number(height - 1);
        return bytes;
    };
    EXPECT_FALSE(KVKeyedCoder::fromBytes(nested(KVKeyedCoder::maximumDepth + 1)));
    EXPECT_FALSE(KVKeyedCoder::fromBytes(nested(16000)));
    auto const reader = KVKeyedCoder::fromBytes(nested(KVKeyedCoder::maximumDepth));
    ASSERT_TRUE(reader);
    EXPECT_FALSE(reader->decodeObject("a", {&NSArrayCodingClass}));
    EXPECT_TRUE(reader->decodeObject("a", {&NSArrayCodingClass, &NSNullCodingClass}));
}
