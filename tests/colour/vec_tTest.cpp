#include <korvane/colour/vec_t.h>

#include <gtest/gtest.h>

#include <limits>

namespace {

TEST(vec_t, CapacitiesAreMultiplesOf16AndGrowingKeepsTheContents)
{
    cc::vec_t<int> array;
    EXPECT_EQ(array.capacity(), 0u);
    struct Row {
        std::size_t size;
        std::size_t capacity;
    } const rows[] = {{1, 16}, {16, 16}, {17, 32}, {3, 32}, {33, 48}};
    for (auto const& row : rows) {
        array.resize(row.size);
        EXPECT_EQ(array.capacity(), row.capacity) << row.size;
        array[row.size - 1] = static_cast<int>(row.size);
    }
    EXPECT_EQ(array[0], 1);
    EXPECT_EQ(array[2], 3);
    EXPECT_EQ(array[15], 0); // cut away by the size of 3, so zero again
    cc::vec_t<int> copy(array);
    copy[0] = 7;
    EXPECT_EQ(array[0], 1);
}

TEST(vec_t, PushBackDoublesAndImpossibleSizesThrow)
{
    cc::vec_t<unsigned short> array;
    for (int i = 0; i < 100; ++i)
        array.push_back(static_cast<unsigned short>(i));
    EXPECT_EQ(array.capacity(), 128u);
    EXPECT_EQ(array[99], 99);
    EXPECT_THROW(array.reserve(std::numeric_limits<std::size_t>::max()), std::bad_alloc);
    EXPECT_THROW(array.reserve(std::numeric_limits<std::size_t>::max() / 2), std::bad_alloc);
    EXPECT_EQ(array.size(), 100u);
}

} // namespace
