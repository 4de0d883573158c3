#include <korvane/colour/vec_t.h>

#include <gtest/gtest.h>

#include <limits>

namespace {

TEST(vec_t, CapacitiesAreMultiplesOf16AndGrowingKeepsTheContents)
{
    cc::vec_t<int> array;
    std::size_t const sizesAndCapacities[][2] = {{0, 0}, {1, 16}, {16, 16}, {17, 32}, {3, 32}};
    for (auto const& [size, capacity] : sizesAndCapacities) {
        array.resize(size);
        EXPECT_EQ(array.capacity(), capacity) << size;
        if (size)
            array[size - 1] = static_cast<int>(size);
    }
    array.resize(20);
    cc::vec_t<int> copy(array);
    copy[0] = 7;
    EXPECT_EQ(array[0], 1);
    EXPECT_EQ(array[2], 3);
    EXPECT_EQ(array[15], 0); // cut away by the size of 3, so zero again
    while (array.size() < 33)
        array.push_back(33);
    EXPECT_EQ(array.capacity(), 64u); // doubled
    EXPECT_EQ(array[32], 33);
    EXPECT_THROW(array.reserve(std::numeric_limits<std::size_t>::max()), std::bad_alloc);
    EXPECT_THROW(array.reserve(std::numeric_limits<std::size_t>::max() / 4), std::bad_alloc);
    EXPECT_EQ(array.size(), 33u);
}

} // namespace
