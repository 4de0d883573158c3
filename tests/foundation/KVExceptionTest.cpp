#include <korvane/korvane.h>

#include <gtest/gtest.h>

TEST(KVException, DescribesItselfInOneLine)
{
    EXPECT_EQ(KVException().getInfo(), "KVException");
    EXPECT_EQ(KVException("no row").getInfo(), "KVException: no row");
    EXPECT_EQ(KVException("no row", "a.cpp", 12).getInfo(), "KVException: no row (a.cpp:12)");
    EXPECT_EQ(KVException("no row", "a.cpp", 0).getInfo(), "KVException: no row");
    EXPECT_EQ(KVBadIndexException("", "a.cpp", -1).getInfo(), "KVBadIndexException (a.cpp:-1)");
    EXPECT_STREQ(KVSystemException("r\u00E9el").what(), "KVSystemException: r\u00E9el");
    testing::internal::CaptureStderr();
    KVException("m").report();
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "KVException: m\n");
}

TEST(KVException, NamesOfTheTree)
{
    struct Row {
        KVString name;
        char const* expected;
    } const rows[] = {
        {KVNullPointerException().className(), "KVNullPointerException"},
        {KVIllegalArgumentException().className(), "KVIllegalArgumentException"},
        {KVUnsupportedOperationException().className(), "KVUnsupportedOperationException"},
        {KVDivideByZeroException().className(), "KVDivideByZeroException"},
        {KVMatrixErrorException().className(), "KVMatrixErrorException"},
        // These four go by their parent's name, on purpose.
        {KVException_ScopeUndefined().className(), "KVException"},
        {KVException_NoElementDefined().className(), "KVException"},
        {KVException_AttributeUndefined().className(), "KVException"},
        {KVException_WriteError().className(), "KVException"},
    };
    for (Row const& row : rows)
        EXPECT_EQ(row.name, row.expected);
}

TEST(KVException, ATextIsAMessageAndNotASwitch)
{
    EXPECT_EQ(KVNullPointerException("text").message(), "text");
    EXPECT_EQ(KVNullPointerException(false).callStackSymbols(), nullptr);
    KVNullPointerException const captured(true);
    ASSERT_NE(captured.callStackSymbols(), nullptr);
    EXPECT_GT(captured.callStackSymbols()->count(), 1u);
}

TEST(KVException, TravelsByValueWithAllItCarries)
{
    try {
        KVAssertionException exception("m", "f", 3);
        exception.addCallStackSymbols();
        static_cast<void>(exception.what());
        throw exception;
    } catch (KVException const& caught) {
        EXPECT_STREQ(caught.what(), "KVAssertionException: m (f:3)");
        EXPECT_NE(caught.callStackSymbols(), nullptr);
    }
    EXPECT_THROW(_KVMod_error("mod", "f", 1), KVIllegalArgumentException);
}
