#include "SerializationSupport.h"

TEST(KVStreamElement, ReadsAUUIDOf32Digits)
{
    struct Row {
        char const* text;
        bool read;
    } const rows[] = {
        {"0123456789abcdefFEDCBA9876543210", true},
        {"0123456789abcdefFEDCBA98765432109", true},
        {"0123456789abcdefFEDCBA987654321", false},
        {"01234567-89abcdefFEDCBA9876543210", false},
        {" 0123456789abcdefFEDCBA9876543210", false},
        {"g123456789abcdefFEDCBA9876543210", false},
        {"", false},
    };
    for (Row const& row : rows) {
        char const* cursor = row.text;
        std::unique_ptr<KVUUID> const uuid(KVStreamElement::atoUUID(&cursor));
        ASSERT_EQ(uuid != nullptr, row.read) << row.text;
        EXPECT_EQ(cursor - row.text, row.read ? 32 : 0) << row.text;
        if (uuid) {
            EXPECT_EQ(*uuid, (KVUUID{{0x01234567, 0x89abcdef, 0xfedcba98, 0x76543210}}));
        }
    }
    EXPECT_EQ(KVStreamElement::atoUUID(nullptr), nullptr);
    char const* null = nullptr;
    EXPECT_EQ(KVStreamElement::atoUUID(&null), nullptr);
}

TEST(KVStreamElement, ReadsATime)
{
    constexpr CMTime untouched{9, 9, 9, 9};
    struct Row {
        char const* text;
        CMTime time;
        long length; // 0: refused
    } const rows[] = {
        {"\n-7\t+600  1F -1 rest", {-7, 600, 0x1f, 0xFFFFFFFF}, 15},
        // The epoch keeps 32 bits and loses its sign, unlike the text that is written.
        {"1 600 1 4294967296", {1, 600, 1, 0}, 18},
        {"9223372036854775807 4294967297 100000003 4294967295", {INT64_MAX, 1, 3, 0xFFFFFFFF}, 51},
        {"1 1 0x11 0", {1, 1, 0x11, 0}, 10},
        {"1 1 -1 0", {1, 1, 0xFFFFFFFF, 0}, 8},
        {"5", {5, 0, 0, 0}, 1},
        {"-9223372036854775809 1 1 0", untouched, 0},
        {"1 9223372036854775808 1 0", untouched, 0},
        {"1 1 10000000000000000 0", untouched, 0},
        {"1 1 1 99999999999999999999999999", untouched, 0},
    };
    for (Row const& row : rows) {
        char const* cursor = row.text;
        CMTime time = untouched;
        EXPECT_EQ(KVStreamElement::aToVexTime(&cursor, &time), row.length > 0) << row.text;
        EXPECT_EQ(bytesOf(time), bytesOf(row.time)) << row.text;
        EXPECT_EQ(cursor - row.text, row.length) << row.text;
    }
    CMTime time;
    EXPECT_FALSE(KVStreamElement::aToVexTime(nullptr, &time));
    char const* cursor = nullptr;
    EXPECT_FALSE(KVStreamElement::aToVexTime(&cursor, &time));
    cursor = "when"; // no number is zeros
    EXPECT_TRUE(KVStreamElement::aToVexTime(&cursor, &time));
    EXPECT_EQ(time.value, 0);
    EXPECT_STREQ(cursor, "when");
}
