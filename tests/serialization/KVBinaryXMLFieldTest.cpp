#include "SerializationSupport.h"

#include <cmath>
#include <limits>
#include <memory>
#include <optional>

namespace {

template <class T>
using Limits = std::numeric_limits<T>;

constexpr long long longMax = Limits<long long>::max();
constexpr long long longMin = Limits<long long>::min();
constexpr unsigned long long ulongMax = Limits<unsigned long long>::max();
constexpr int intMax = Limits<int>::max();
constexpr int intMin = Limits<int>::min();
constexpr unsigned int uintMax = Limits<unsigned int>::max();

using Field = KVBinaryXMLField;

Field text(char const* utf8)
{
    return Field(KVString(utf8));
}

} // namespace

TEST(KVBinaryXMLField, KnowsItsKind)
{
    EXPECT_EQ(Field(-1LL).kind(), 0u);
    EXPECT_EQ(Field(1UL).kind(), 1u);
    EXPECT_EQ(Field(1.0f).kind(), 2u);
    EXPECT_EQ(Field(1.0).kind(), 3u);
    EXPECT_EQ(Field(CMTimeMake(1, 2)).kind(), 4u);
    EXPECT_EQ(text("").kind(), 5u);
    EXPECT_EQ(Field(KVUUID()).kind(), 6u);
    EXPECT_EQ(Field().kind(), 5u);
}

TEST(KVBinaryXMLField, ConvertsToIntegers)
{
    struct Row {
        Field field;
        bool answer; // of the signed getters; for the unsigned ones see `unsignedAnswer`
        int int32;
        long long int64;
        bool unsignedAnswer;
        unsigned int uint32;
        unsigned long long uint64;
    } const rows[] = {
        // Integers are cut to the narrower type.
        {Field(-2LL), true, -2, -2, true, uintMax - 1, ulongMax - 1},
        {Field((1LL << 32) + 5), true, 5, (1LL << 32) + 5, true, 5, (1ULL << 32) + 5},
        {Field(0x80000000ULL), true, intMin, 0x80000000LL, true, 0x80000000u, 0x80000000ULL},
        {Field(ulongMax), true, -1, -1, true, uintMax, ulongMax},
        // Floating values are cut toward zero and held within the range.
        {Field(2.9f), true, 2, 2, true, 2, 2},
        {Field(-2.9), true, -2, -2, true, 0, 0},
        {Field(-0.9), true, 0, 0, true, 0, 0},
        {Field(4294967295.5), true, intMax, 4294967295, true, uintMax, 4294967295},
        {Field(1e30), true, intMax, longMax, true, uintMax, ulongMax},
        {Field(-1e30f), true, intMin, longMin, true, 0, 0},
        {Field(0x1p63), true, intMax, longMax, true, uintMax, 1ULL << 63},
        {Field(Limits<double>::infinity()), true, intMax, longMax, true, uintMax, ulongMax},
        {Field(Limits<float>::quiet_NaN()), true, 0, 0, true, 0, 0},
        // Texts are read in 64 bits, then cut.
        {text(" -12abc"), true, -12, -12, true, uintMax - 11, ulongMax - 11},
        {text("4294967298"), true, 2, 4294967298, true, 2, 4294967298},
        {text("abc"), true, 0, 0, true, 0, 0},
        {Field(), true, 0, 0, true, 0, 0},
        {text("9223372036854775808"), false, -1, longMax, true, 0, 1ULL << 63},
        {text("-9223372036854775809"), false, 0, longMin, true, uintMax,
         static_cast<unsigned long long>(longMax)},
        {text("18446744073709551616"), false, -1, longMax, false, uintMax, ulongMax},
        // Times and UUIDs leave the output alone.
        {Field(CMTimeMake(1, 2)), true, 77, 77, true, 77, 77},
        {Field(KVUUID{{1, 2, 3, 4}}), true, 77, 77, true, 77, 77},
    };
    for (Row const& row : rows) {
        int int32 = 77;
        long long int64 = 77;
        unsigned int uint32 = 77;
        unsigned long long uint64 = 77;
        auto const index = &row - rows;
        EXPECT_EQ(row.field.getAsInt32(&int32), row.answer) << index;
        EXPECT_EQ(row.field.getAsInt64(&int64), row.answer) << index;
        EXPECT_EQ(row.field.getAsUInt32(&uint32), row.unsignedAnswer) << index;
        EXPECT_EQ(row.field.getAsUInt64(&uint64), row.unsignedAnswer) << index;
        EXPECT_EQ(int32, row.int32) << index;
        EXPECT_EQ(int64, row.int64) << index;
        EXPECT_EQ(uint32, row.uint32) << index;
        EXPECT_EQ(uint64, row.uint64) << index;
    }
}

TEST(KVBinaryXMLField, ConvertsToFloatsAndBool)
{
    double const infinity = Limits<double>::infinity();
    struct Row {
        Field field;
        bool floatAnswer;
        float single;
        bool doubleAnswer;
        double number;
        bool boolean;
    } const rows[] = {
        {Field(-3LL), true, -3, true, -3, true},
        {Field(ulongMax), true, 0x1p64f, true, 0x1p64, true},
        {Field(0ULL), true, 0, true, 0, false},
        {Field(0.1f), true, 0.1f, true, static_cast<double>(0.1f), true},
        {Field(0.1), true, 0.1f, true, 0.1, true},
        {Field(-0.0), true, 0, true, 0, false},
        {Field(Limits<double>::quiet_NaN()), true, NAN, true, NAN, true},
        {text("0.25e1x"), true, 2.5f, true, 2.5, false}, // the number is "0"
        {text("1e39"), false, static_cast<float>(infinity), true, 1e39, true},
        {text("-1e999"), false, -static_cast<float>(infinity), false, -infinity, true},
        {text("1e-45"), true, 1e-45f, true, 1e-45, true}, // subnormal is no failure
        {text("true"), true, 0, true, 0, false},
        {text("99999999999999999999"), true, 1e20f, true, 1e20, true},
        {text(""), true, 0, true, 0, false},
        {Field(CMTimeMake(1, 2)), true, 77, true, 77, true},
        {Field(KVUUID()), true, 77, true, 77, true},
    };
    for (Row const& row : rows) {
        float single = 77;
        double number = 77;
        bool boolean = true;
        auto const index = &row - rows;
        EXPECT_EQ(row.field.getAsFloat(&single), row.floatAnswer) << index;
        EXPECT_EQ(row.field.getAsDouble(&number), row.doubleAnswer) << index;
        EXPECT_TRUE(row.field.getAsBool(&boolean)) << index;
        EXPECT_TRUE(single == row.single || (std::isnan(single) && std::isnan(row.single)))
            << index << ": " << single;
        EXPECT_TRUE(number == row.number || (std::isnan(number) && std::isnan(row.number)))
            << index << ": " << number;
        EXPECT_EQ(boolean, row.boolean) << index;
    }
}

TEST(KVBinaryXMLField, Prints)
{
    struct Row {
        Field field;
        std::string expected;
    } const rows[] = {
        {Field(longMin), "-9223372036854775808"},
        {Field(ulongMax), "18446744073709551615"},
        {Field(0.1f), "0.1000000015"},
        {Field(0.1), "0.1"}, // one digit less than the text form writes
        {Field(1.0 / 3), "0.3333333333333333"},
        {Field(-Limits<double>::infinity()), "-inf"},
        {Field(Limits<float>::quiet_NaN()), "nan"},
        {Field(CMTime{-5, 600, 0x1D, 7}), "-5 600 1d 7"},
        {Field(KVUUID{{1, 0xABCDEF01u, 0, 0xFFFFFFFFu}}), "00000001abcdef0100000000ffffffff"},
        {text("é\n"), "é\n"},
        {Field(), ""},
    };
    for (Row const& row : rows) {
        KVString printed("before");
        EXPECT_TRUE(row.field.getAsString(&printed));
        EXPECT_EQ(printed.toUTF8(), row.expected);
    }
}

TEST(KVBinaryXMLField, GivesUUIDsAndTimes)
{
    struct Row {
        Field field;
        std::optional<KVUUID> uuid;
        bool isTime;
        CMTime time;
    } const rows[] = {
        {Field(KVUUID{{1, 2, 3, 4}}), KVUUID{{1, 2, 3, 4}}, false, {}},
        {text("000000010000000200000003000000ffx"), KVUUID{{1, 2, 3, 255}}, false, {}},
        {Field(CMTime{1, 600, 1, 1LL << 33}), std::nullopt, true, {1, 600, 1, 1LL << 33}},
        // Of a text's epoch the low 32 bits count.
        {text("1 600 1 4294967297"), std::nullopt, true, {1, 600, 1, 1}},
        {text("99999999999999999999 1 1 0"), std::nullopt, false, {}},
        {Field(1LL), std::nullopt, false, {}},
        {Field(1.0), std::nullopt, false, {}},
    };
    for (Row const& row : rows) {
        auto const index = &row - rows;
        std::unique_ptr<KVUUID> const uuid(row.field.getAsUUID());
        ASSERT_EQ(uuid != nullptr, row.uuid.has_value()) << index;
        if (uuid) {
            EXPECT_TRUE(*uuid == *row.uuid) << index;
            continue;
        }
        CMTime time{9, 9, 9, 9};
        EXPECT_EQ(row.field.getAsVexTime(&time), row.isTime) << index;
        CMTime const expected = row.isTime ? row.time : CMTime{9, 9, 9, 9};
        EXPECT_EQ(time.value, expected.value) << index;
        EXPECT_EQ(time.timescale, expected.timescale) << index;
        EXPECT_EQ(time.flags, expected.flags) << index;
        EXPECT_EQ(time.epoch, expected.epoch) << index;
    }
}
