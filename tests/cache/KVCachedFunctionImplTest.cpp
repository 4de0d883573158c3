#include <korvane/cache/KVCachedFunctionImpl.h>
#include <korvane/foundation/KVException.h>
#include <korvane/platform/CFNumber.h>

#include <gtest/gtest.h>

#include <array>
#include <memory>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

namespace {

TEST(KVCachedFunctionImpl, ComputesOncePerTupleOfArguments)
{
    int calls = 0;
    KVCachedFunctionImpl<std::string, std::string const&, int> repeat(
        [&](std::string const& text, int count) {
            ++calls;
            return text + std::to_string(count);
        },
        2);
    EXPECT_EQ(repeat("a", 2), "a2");
    EXPECT_EQ(repeat("a", 2), "a2");
    EXPECT_EQ(calls, 1);
    EXPECT_EQ(repeat("a", 1), "a1");
    EXPECT_EQ(repeat("b", 2), "b2"); // the oldest of three leaves
    EXPECT_EQ(repeat("a", 2), "a2");
    EXPECT_EQ(calls, 4);
}

TEST(KVCachedFunctionImpl, CapacityIsWidenedWithItsSign)
{
    struct Row {
        int capacity;
        int calls;
    } const rows[] = {{-1, 100}, {0, 200}, {100, 100}, {99, 200}};
    for (auto const& row : rows) {
        int calls = 0;
        KVCachedFunctionImpl<int, int> count([&](int) { return ++calls; }, row.capacity);
        for (int i = 0; i < 200; ++i)
            count(i % 100);
        EXPECT_EQ(calls, row.calls) << row.capacity;
    }
}

TEST(KVCachedFunctionImpl, FailuresTravelAndAreNotKept)
{
    bool broken = true;
    KVCachedFunctionImpl<int, int> half(
        [&](int value) { return broken ? throw std::runtime_error("broken") : value / 2; }, 10);
    EXPECT_THROW(half(8), std::runtime_error);
    broken = false;
    EXPECT_EQ(half(8), 4); // the lock is free again and nothing was kept

    KVCachedFunctionImpl<int, int> none(nullptr, 10);
    EXPECT_THROW(none(1), std::bad_function_call);
    EXPECT_THROW(none(1), std::bad_function_call);
}

TEST(KVCachedFunctionImpl, RefusesToBeReentered)
{
    std::unique_ptr<KVCachedFunctionImpl<int, int>> factorial;
    factorial = std::make_unique<KVCachedFunctionImpl<int, int>>(
        [&](int value) { return value < 2 ? 1 : value * (*factorial)(value - 1); }, 10);
    EXPECT_EQ((*factorial)(1), 1);
    EXPECT_THROW((*factorial)(3), KVAssertionException);
    EXPECT_EQ((*factorial)(1), 1);
}

TEST(KVCachedFunctionImpl, PlainReferencesAreRetainedWhileTheirResultIsKept)
{
    auto const first = KVCFRef<CFNumberRef>::adopt(new __CFNumber(1LL));
    auto const second = KVCFRef<CFNumberRef>::adopt(new __CFNumber(2LL));
    KVCachedFunctionImpl<bool, CFNumberRef, CFNumberRef> same(
        [](CFNumberRef a, CFNumberRef b) { return CFEqual(a, b); }, 1);
    EXPECT_FALSE(same(first, second));
    EXPECT_EQ(first->retainCount(), 2u);
    EXPECT_TRUE(same(second, second)); // evicts the other tuple
    EXPECT_EQ(first->retainCount(), 1u);
    EXPECT_EQ(second->retainCount(), 3u);
    EXPECT_FALSE(same(nullptr, second));
}

TEST(KVCachedFunctionImpl, ThreadsComputeEachResidentKeyOnce)
{
    // Plain counters: the memoiser's lock is all that orders these writes.
    std::array<int, 50> calls{};
    KVCachedFunctionImpl<int, std::size_t> square(
        [&](std::size_t value) { return ++calls[value], static_cast<int>(value * value); }, 50);
    std::array<int, 4> wrong{};
    std::vector<std::thread> threads;
    for (std::size_t t = 0; t < wrong.size(); ++t)
        threads.emplace_back([&, t] {
            for (std::size_t i = 0; i < 5000; ++i) {
                std::size_t const value = (i * 7 + t * 13) % calls.size();
                wrong[t] += square(value) != static_cast<int>(value * value);
            }
        });
    for (auto& thread : threads)
        thread.join();
    EXPECT_EQ(wrong, (std::array<int, 4>{}));
    for (int const count : calls)
        EXPECT_EQ(count, 1);
}

} // namespace
