#include <korvane/korvane.h>

#include <gtest/gtest.h>

TEST(KVString, NullAndEmptyAreBothEmptyAndDiffer)
{
    KVString const null;
    KVString const empty("");
    EXPECT_TRUE(null.empty() && null.isNull());
    EXPECT_TRUE(empty.empty() && !empty.isNull());
    EXPECT_LT(null.compare(empty), 0);
    EXPECT_GT(empty.compare(null), 0);
    EXPECT_EQ(null.compare(KVString()), 0);
    ASSERT_NE(null.cf_str(), nullptr);
    EXPECT_EQ(null.cf_str()->length(), 0u);
}
