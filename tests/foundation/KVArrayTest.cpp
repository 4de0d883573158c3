#include <korvane/korvane.h>

#include <gtest/gtest.h>

TEST(KVArray, GrowsWithZerosAndShrinksWithoutClearing)
{
    KVArray<int> array;
    array.resize(2, 8);
    array[1] = 7;
    array.resize(1, 8);
    EXPECT_EQ(array.data()[1], 7); // beyond the size, untouched
    array.resize(4, 8);
    EXPECT_EQ(array[1], 0);
    array[3] = 9;
    array.resize(9, 0);
    EXPECT_EQ(array.capacity(), 9);
    EXPECT_EQ(array[3], 9);
    EXPECT_EQ(array[8], 0);
}

TEST(KVArray, RefusesWhatIsOutOfRange)
{
    KVArray<KVString> array(2);
    try {
        array.resize(-1, 0);
        FAIL();
    } catch (KVIllegalArgumentException const& exception) {
        EXPECT_EQ(exception.message(), "KVArray::resize");
    }
    EXPECT_THROW(array[-1], KVBadIndexException);
    EXPECT_THROW(array[2], KVBadIndexException);
}

TEST(KVArray, PushesItsOwnElements)
{
    KVArray<KVString> array;
    array.push("first");
    for (int i = 0; i < 20; ++i)
        array.push(array[0]);
    EXPECT_EQ(array.size(), 21);
    EXPECT_EQ(array[20], "first");
    KVArray<KVString> const copy = array;
    array[0] = "changed";
    EXPECT_EQ(copy[0], "first");
}

TEST(KVDynamicArray, DoublesWhenFullAndNeverFromNothing)
{
    KVDynamicArray<int> array(1);
    EXPECT_FALSE(array.insert(0, 1));
    EXPECT_TRUE(array.insert(0, 2));
    EXPECT_EQ(array.capacity(), 2u);
    EXPECT_TRUE(array.insert(1, 3));
    EXPECT_EQ(array.capacity(), 4u);
    EXPECT_EQ(std::vector<int>(array.begin(), array.end()), (std::vector<int>{2, 3, 1}));
    EXPECT_THROW(array.insert(4, 0), KVBadIndexException);
    EXPECT_THROW(array[3], KVBadIndexException);

    KVDynamicArray<int> empty;
    EXPECT_THROW(empty.insert(0, 1), KVAssertionException);
    EXPECT_EQ(empty.capacity(), 0u);
    int const values[] = {5, 6, 7};
    EXPECT_TRUE(empty.insert(0, values, 3));
    EXPECT_EQ(empty.capacity(), 3u);
}

TEST(KVDynamicArray, InsertsRunsOfItself)
{
    KVDynamicArray<KVString> array(2);
    array.insert(0, "a");
    array.insert(1, "b");
    EXPECT_TRUE(array.insert(1, array.begin(), 2));
    EXPECT_EQ(array.capacity(), 4u);
    std::string text;
    for (KVString const& element : array)
        text += element.toUTF8();
    EXPECT_EQ(text, "aabb");
    EXPECT_FALSE(array.insert(4, array.begin(), 0));
}
