#include <korvane/korvane.h>

#include <gtest/gtest.h>

#include <atomic>
#include <thread>
#include <vector>

namespace {

struct Counted : KVShared_base {
    explicit Counted(std::atomic<int>* alive) : alive_(alive) { ++*alive_; }
    ~Counted() override { --*alive_; }
    std::atomic<int>* alive_;
};

} // namespace

TEST(KVShared, LivesAsLongAsItsStrongReferences)
{
    std::atomic<int> alive{0};
    auto first = KVShared<Counted>::make(&alive);
    KVWeak<Counted> const weak(first);
    {
        KVShared<Counted> const second = weak.lock();
        first = {};
        EXPECT_EQ(alive, 1);
        EXPECT_EQ(weak.lock().get(), second.get());
    }
    EXPECT_EQ(alive, 0);
    EXPECT_FALSE(weak.lock());
}

TEST(KVShared, WeakReferencesOutliveAnObjectThatDiesByItself)
{
    std::atomic<int> alive{0};
    KVWeak<Counted> weak;
    {
        Counted onStack(&alive);
        weak = KVWeak<Counted>(&onStack);
    }
    EXPECT_FALSE(weak.lock());
    auto* const byHand = new Counted(&alive);
    KVWeak<Counted> const copy(byHand);
    delete byHand;
    EXPECT_FALSE(copy.lock());
    EXPECT_EQ(alive, 0);
}

TEST(KVShared, CountsFromManyThreads)
{
    for (int round = 0; round < 200; ++round) {
        std::atomic<int> alive{0};
        auto const object = KVMakeRef<NSObject>();
        auto strong = KVShared<Counted>::make(&alive);
        std::vector<std::thread> threads;
        for (int i = 0; i < 3; ++i)
            threads.emplace_back([object, weak = KVWeak<Counted>(strong)] {
                while (auto const held = weak.lock())
                    ASSERT_GE(held->alive_->load(), 1);
                for (int turn = 0; turn < 20; ++turn)
                    KVNSRef<NSObject*> const copy = object;
            });
        strong = {};
        for (std::thread& thread : threads)
            thread.join();
        ASSERT_EQ(alive, 0);
        ASSERT_EQ(object->retainCount(), 1u);
    }
}

TEST(KVNSRef, RetainsAndReleasesOnce)
{
    auto number = KVMakeRef<NSNumber>(1);
    EXPECT_EQ(number->retainCount(), 1u);
    KVNSRef<NSObject*> base = number;
    EXPECT_EQ(number->retainCount(), 2u);
    base = number;
    base = KVNSRef<NSObject*>(base);
    EXPECT_EQ(number->retainCount(), 2u);
    NSObject* const leaked = base.leak();
    EXPECT_EQ(base, nullptr);
    KVNSRef<NSObject*>::adopt(leaked);
    EXPECT_EQ(number->retainCount(), 1u);
    KVCFRef<CFTypeRef> const cf(number.get());
    EXPECT_EQ(number->retainCount(), 2u);
}

TEST(KVNSRef, ReplacingAParentByItsChildIsSafe)
{
    auto const child = KVString("child");
    NSObject const* const objects[] = {child.cf_str(), nullptr};
    auto parent = KVCFRef<CFTypeRef>::adopt(new __CFArray(objects));
    auto const* const array = static_cast<CFArrayRef>(parent.get());
    EXPECT_EQ(array->objectAtIndex(1), NSNull::null());
    parent = array->objectAtIndex(0);
    EXPECT_TRUE(CFEqual(parent, child.cf_str()));
}
