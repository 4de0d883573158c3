#include "SerializationSupport.h"

#include <cmath>
#include <limits>

using std::pair;

namespace {

using ULong = unsigned long long;

template <class T>
using Limits = std::numeric_limits<T>;

constexpr long long longMax = Limits<long long>::max();
constexpr long long longMin = Limits<long long>::min();
constexpr ULong ulongMax = Limits<ULong>::max();
constexpr int intMax = Limits<int>::max();
constexpr int intMin = Limits<int>::min();
constexpr unsigned int uintMax = Limits<unsigned int>::max();
constexpr double infinity = Limits<double>::infinity();

using Field = KVBinaryXMLField;

Field text(char const* utf8)
{
    return Field(KVString(utf8));
}

} // namespace

TEST(KVBinaryXMLField, ConvertsToIntegers)
{
    struct Row {
        Field field;
        int int32;
        long long int64;
        unsigned int uint32;
        ULong uint64;
        bool ok = true, unsignedOk = true;
    } const rows[] = {
        // Integers are cut to the narrower type.
        {Field(-2LL), -2, -2, uintMax - 1, ulongMax - 1},
        {Field((1LL << 32) + 5), 5, (1LL << 32) + 5, 5, (1ULL << 32) + 5},
        {Field(0x80000000ULL), intMin, 0x80000000LL, 0x80000000u, 0x80000000ULL},
        // Floating values are cut toward zero and held within the range.
        {Field(-2.9), -2, -2, 0, 0},
        {Field(4294967295.5), intMax, 4294967295, uintMax, 4294967295},
        {Field(1e30), intMax, longMax, uintMax, ulongMax},
        {Field(-1e30f), intMin, longMin, 0, 0},
        {Field(0x1p63), intMax, longMax, uintMax, 1ULL << 63},
        {Field(Limits<float>::quiet_NaN()), 0, 0, 0, 0},
        // Texts are read in 64 bits, then cut.
        {text(" -12abc"), -12, -12, uintMax - 11, ulongMax - 11},
        {text("9223372036854775808"), -1, longMax, 0, 1ULL << 63, false},
        {text("-9223372036854775809"), 0, longMin, uintMax, ulongMax / 2, false},
        {text("18446744073709551616"), -1, longMax, uintMax, ulongMax, false, false},
        // Times and UUIDs leave the output alone.
        {Field(CMTimeMake(1, 2)), 77, 77, 77, 77},
        {Field(KVUUID{{1, 2, 3, 4}}), 77, 77, 77, 77},
    };
    for (Row const& row : rows) {
        SCOPED_TRACE(&row - rows);
        EXPECT_EQ(got<int>(row.field, &Field::getAsInt32), pair(row.ok, row.int32));
        EXPECT_EQ(got<long long>(row.field, &Field::getAsInt64), pair(row.ok, row.int64));
        EXPECT_EQ(got<unsigned>(row.field, &Field::getAsUInt32), pair(row.unsignedOk, row.uint32));
        EXPECT_EQ(got<ULong>(row.field, &Field::getAsUInt64), pair(row.unsignedOk, row.uint64));
    }
}

TEST(KVBinaryXMLField, ConvertsToFloatsAndBool)
{
    struct Row {
        Field field;
        float single;
        double number;
        bool boolean;
        bool floatOk = true, doubleOk = true;
    } const rows[] = {
        {Field(ulongMax), 0x1p64f, 0x1p64, true},
        {Field(0.1f), 0.1f, static_cast<double>(0.1f), true},
        {Field(-0.0), 0, 0, false},
        {text("0.25e1x"), 2.5f, 2.5, false}, // the number is "0"
        {text("1e39"), static_cast<float>(infinity), 1e39, true, false},
        {text("-1e999"), -static_cast<float>(infinity), -infinity, true, false, false},
        {text("1e-45"), 1e-45f, 1e-45, true}, // subnormal is no failure
        {text(""), 0, 0, false},
        {Field(CMTimeMake(1, 2)), 77, 77, true},
        {Field(KVUUID()), 77, 77, true},
    };
    for (Row const& row : rows) {
        SCOPED_TRACE(&row - rows);
        EXPECT_EQ(got<float>(row.field, &Field::getAsFloat), pair(row.floatOk, row.single));
        EXPECT_EQ(got<double>(row.field, &Field::getAsDouble), pair(row.doubleOk, row.number));
        EXPECT_EQ(got<bool>(row.field, &Field::getAsBool), pair(true, row.boolean));
    }
    EXPECT_TRUE(got<bool>(Field(NAN), &Field::getAsBool).second);
}

TEST(KVBinaryXMLField, KnowsItsKindAndPrints)
{
    struct Row {
        Field field;
        unsigned int kind;
        char const* printed;
    } const rows[] = {
        {Field(longMin), 0, "-9223372036854775808"},
        {Field(ulongMax), 1, "18446744073709551615"},
        {Field(0.1f), 2, "0.1000000015"},
        {Field(Limits<float>::quiet_NaN()), 2, "nan"},
        {Field(1.0 / 3), 3, "0.3333333333333333"}, // one digit less than the text form writes
        {Field(-infinity), 3, "-inf"},
        {Field(CMTime{-5, 600, 0x1D, 7}), 4, "-5 600 1d 7"},
        {text("é\n"), 5, "é\n"},
        {Field(), 5, ""},
        {Field(KVUUID{{1, 0xABCDEF01u, 0, uintMax}}), 6, "00000001abcdef0100000000ffffffff"},
    };
    for (Row const& row : rows) {
        KVString printed("before");
        EXPECT_EQ(row.field.kind(), row.kind) << row.printed;
        EXPECT_TRUE(row.field.getAsString(&printed));
        EXPECT_EQ(printed.toUTF8(), row.printed);
    }
}

TEST(KVBinaryXMLField, GivesUUIDsAndTimes)
{
    constexpr CMTime untouched{9, 9, 9, 9};
    struct Row {
        Field field;
        bool isTime;
        CMTime time;
    } const rows[] = {
        {Field(CMTime{1, 600, 1, 1LL << 33}), true, {1, 600, 1, 1LL << 33}},
        {text("1 600 1 4294967297"), true, {1, 600, 1, 1}}, // the low 32 bits of the epoch
        {text("99999999999999999999 1 1 0"), false, untouched},
        {Field(1LL), false, untouched},
        {Field(1.0), false, untouched},
    };
    for (Row const& row : rows) {
        CMTime time = untouched;
        EXPECT_EQ(row.field.getAsVexTime(&time), row.isTime);
        EXPECT_EQ(bytesOf(time), bytesOf(row.time)) << &row - rows;
        EXPECT_EQ(row.field.getAsUUID(), nullptr) << &row - rows;
    }
    for (Field const& field :
         {Field(KVUUID{{1, 2, 3, 255}}), text("000000010000000200000003000000ffx")}) {
        std::unique_ptr<KVUUID> const uuid(field.getAsUUID());
        EXPECT_EQ(*uuid, (KVUUID{{1, 2, 3, 255}}));
    }
}
