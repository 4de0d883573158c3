#include <korvane/korvane.h>

#include <gtest/gtest.h>

#include <array>
#include <atomic>
#include <chrono>
#include <mutex>
#include <semaphore>
#include <shared_mutex>
#include <thread>
#include <unistd.h>
#include <vector>

using namespace std::chrono_literals;

namespace {

/// Eight threads that add to one plain number under `lock`.
template <class Lock>
long countUnder(Lock& lock)
{
    long count = 0;
    std::vector<std::thread> threads;
    for (int i = 0; i < 8; ++i)
        threads.emplace_back([&] {
            for (int turn = 0; turn < 2000; ++turn) {
                std::scoped_lock const guard(lock);
                ++count;
            }
        });
    for (std::thread& thread : threads)
        thread.join();
    return count;
}

/// A thread that tries to do something.
class Waiting {
public:
    template <class Body>
    explicit Waiting(Body body) : thread_([this, body] { body(), through_ = true; })
    {
        std::this_thread::sleep_for(5ms);
    }
    bool isThrough() const { return through_; }
    bool getsThrough()
    {
        thread_.join();
        return through_;
    }

private:
    std::atomic<bool> through_{false};
    std::thread thread_;
};

} // namespace

TEST(Locks, ExcludeEachOther)
{
    KVMutex mutex, recursive(true);
    KVSpinLock spin;
    KVSharedMutex shared;
    EXPECT_EQ(countUnder(mutex), 16000);
    EXPECT_EQ(countUnder(recursive), 16000);
    EXPECT_EQ(countUnder(spin), 16000);
    EXPECT_EQ(countUnder(shared), 16000);
}

TEST(KVMutex, IsRecursiveIfAsked)
{
    KVMutex mutex(true);
    mutex.lock();
    mutex.lock();
    mutex.unlock();
    Waiting other([&] { std::scoped_lock const guard(mutex); });
    EXPECT_FALSE(other.isThrough());
    mutex.unlock();
    EXPECT_TRUE(other.getsThrough());
}

TEST(KVSpinLock, SleepsThroughALongSection)
{
    static_assert(sizeof(KVSpinLock) == 4);
    KVSpinLock lock;
    lock.lock();
    EXPECT_FALSE(lock.try_lock());
    std::chrono::nanoseconds processorTime{};
    std::thread waiting([&] {
        std::scoped_lock const guard(lock);
        timespec time;
        clock_gettime(CLOCK_THREAD_CPUTIME_ID, &time);
        processorTime = std::chrono::seconds(time.tv_sec) + std::chrono::nanoseconds(time.tv_nsec);
    });
    std::this_thread::sleep_for(100ms);
    lock.unlock();
    waiting.join();
    EXPECT_LT(processorTime, 30ms);
}

TEST(KVConditionVariable, WakesWaiters)
{
    KVMutex mutex;
    KVConditionVariable condition;
    int stage = 0;
    std::vector<std::thread> waiters;
    for (int i = 0; i < 3; ++i)
        waiters.emplace_back([&] {
            std::scoped_lock const guard(mutex);
            while (stage == 0)
                condition.wait(&mutex);
            ++stage;
        });
    {
        std::scoped_lock const guard(mutex);
        stage = 1;
    }
    condition.broadcast();
    for (std::thread& waiter : waiters)
        waiter.join();
    EXPECT_EQ(stage, 4);
}

TEST(KVSharedMutex, AWriterMayTakeEitherSideAgain)
{
    KVSharedMutex mutex;
    mutex.lock();
    mutex.lock();
    mutex.lock_shared();
    mutex.unlock_shared();
    mutex.unlock();
    // At recursion 0 the shared side has nothing to undo, and the lock stays the writer's.
    mutex.unlock_shared();
    Waiting reader([&] { std::shared_lock const guard(mutex); });
    EXPECT_FALSE(reader.isThrough());
    mutex.unlock();
    EXPECT_TRUE(reader.getsThrough());
}

TEST(KVSharedMutex, ReadersShareAndRecurseAndKeepWritersOut)
{
    KVSharedMutex mutex;
    mutex.unlock_shared(); // holds nothing: returns quietly
    mutex.lock_shared();
    std::thread([&] { std::shared_lock const guard(mutex); }).join();
    Waiting writer([&] { std::scoped_lock const guard(mutex); });
    EXPECT_FALSE(writer.isThrough());
    mutex.lock_shared(); // with a writer waiting
    mutex.unlock_shared();
    EXPECT_FALSE(writer.isThrough());
    mutex.unlock_shared();
    EXPECT_TRUE(writer.getsThrough());
}

TEST(KVThread, RunsWaitsAndKnowsItself)
{
    struct Job {
        std::atomic<bool> done{false};
        char name[16] = "";
    } job;
    KVThread thread(
        [](void* argument) {
            auto* const j = static_cast<Job*>(argument);
            pthread_getname_np(pthread_self(), j->name, sizeof j->name);
            j->done = true;
        },
        &job, "render-\u00E9\u00E9\u00E9\u00E9\u00E9\u00E9");
    EXPECT_FALSE(thread.isSelf());
    thread.wait();
    thread.wait();
    EXPECT_TRUE(job.done);
    // Fifteen bytes would end in the middle of a character.
    EXPECT_STREQ(job.name, "render-\u00E9\u00E9\u00E9\u00E9");
}

TEST(KVThread, CanBeCancelled)
{
    std::binary_semaphore started{0};
    KVThread thread(
        [](void* argument) {
            static_cast<std::binary_semaphore*>(argument)->release();
            for (;;)
                ::pause();
        },
        &started, nullptr);
    started.acquire();
    thread.cancel();
    thread.wait();
}

TEST(KVThread, ForkRunsEveryIndexOnce)
{
    struct Tally {
        std::array<std::atomic<int>, 1024> runs{};
        std::atomic<int> wrongCounts{0};
    } tally;
    KVThread::KVFork(
        [](void* argument, int index, int count) {
            auto* const t = static_cast<Tally*>(argument);
            ++t->runs[static_cast<std::size_t>(index)];
            if (count != KVInfo_ProcessorCount())
                ++t->wrongCounts;
        },
        &tally);
    for (int i = 0; i < static_cast<int>(tally.runs.size()); ++i)
        EXPECT_EQ(tally.runs[static_cast<std::size_t>(i)], i < KVInfo_ProcessorCount() ? 1 : 0);
    EXPECT_EQ(tally.wrongCounts, 0);
}

// --- Singletons ---

namespace {

std::string deleted;

struct Named : KVSingleton {
    Named(unsigned int order, char name) : KVSingleton(order), name_(name) {}
    ~Named() override { deleted += name_; }
    char name_;
};

/// Makes another one of its kind when it goes, `left` times.
struct Chained : KVSingleton {
    explicit Chained(int left) : KVSingleton(0), left_(left) {}
    ~Chained() override
    {
        deleted += 'c';
        if (left_ > 0)
            new Chained(left_ - 1);
    }
    int left_;
};

struct Killer : KVSingleton {
    Killer(unsigned int order, KVSingleton* victim) : KVSingleton(order), victim_(victim) {}
    ~Killer() override { delete victim_; }
    KVSingleton* victim_;
};

std::string deleteAll()
{
    deleted.clear();
    testing::internal::CaptureStdout();
    KVSingleton::deleteSingletons();
    return testing::internal::GetCapturedStdout();
}

} // namespace

TEST(KVSingleton, LowestOrderGoesFirst)
{
    new Named(3, 'c');
    new Named(1, 'a');
    auto* const early = new Named(9, 'x');
    new Named(2, 'b');
    delete early;
    EXPECT_EQ(deleteAll(), "");
    EXPECT_EQ(deleted, "abc");
    EXPECT_EQ(deleteAll(), "");
    EXPECT_EQ(deleted, "");
}

TEST(KVSingleton, WhatADestructorMakesGoesInTheNextOfSixPasses)
{
    new Chained(5);
    EXPECT_EQ(deleteAll(), "");
    EXPECT_EQ(deleted, "cccccc");
    new Chained(6);
    // Six passes ran and the words say five, joined to the next word: hosts look for just this.
    EXPECT_EQ(
        deleteAll(),
        "Korvane: KVSingleton could not successfully release all singletons in 5tries.\n"
        "This is caused by singletons being created during the application teardown process.\n");
    EXPECT_EQ(deleted, "cccccc");
    EXPECT_EQ(deleteAll(), "");
    EXPECT_EQ(deleted, "c");
}

TEST(KVSingleton, OneMayDeleteAnotherOfTheSamePass)
{
    new Killer(1, new Named(2, 'v'));
    EXPECT_EQ(deleteAll(), "");
    EXPECT_EQ(deleted, "v");
}
