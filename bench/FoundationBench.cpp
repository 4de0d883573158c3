// Strings in and out of UTF-8, and the spin lock beside the standard mutex.

#include <korvane/korvane.h>

#include <benchmark/benchmark.h>

#include <cstdlib>
#include <ctime>
#include <mutex>
#include <semaphore>
#include <thread>
#include <vector>

namespace {

constexpr char text32[] = "A text of thirty-two ASCII bytes";
static_assert(sizeof text32 == 33);

void stringFromUTF8(benchmark::State& state)
{
    for (auto _ : state) {
        KVString const text(text32);
        benchmark::DoNotOptimize(text.cf_str());
    }
}
BENCHMARK(stringFromUTF8)->Name("StringFromUTF8/ours");

void stringToUTF8(benchmark::State& state)
{
    KVString const text(text32);
    for (auto _ : state) {
        char* const utf8 = text.createCStr();
        benchmark::DoNotOptimize(utf8);
        std::free(utf8);
    }
}
BENCHMARK(stringToUTF8)->Name("StringToUTF8/ours");

void stringCopy(benchmark::State& state)
{
    KVString const text(text32);
    for (auto _ : state) {
        KVString const copy = text;
        benchmark::DoNotOptimize(copy.cf_str());
    }
}
BENCHMARK(stringCopy)->Name("StringCopy/ours");

/// A process with one thread takes shortcuts; `threads` says whether there is a second one, asleep.
template <class Lock, bool threads>
void uncontended(benchmark::State& state)
{
    std::binary_semaphore end{0};
    std::thread sleeper;
    if (threads)
        sleeper = std::thread([&] { end.acquire(); });
    Lock lock;
    for (auto _ : state) {
        lock.lock();
        benchmark::ClobberMemory();
        lock.unlock();
    }
    end.release();
    if (threads)
        sleeper.join();
}
BENCHMARK(uncontended<KVSpinLock, false>)->Name("LockAlone/ours");
BENCHMARK(uncontended<std::mutex, false>)->Name("LockAlone/peer:std::mutex");
BENCHMARK(uncontended<KVSpinLock, true>)->Name("LockUncontended/ours");
BENCHMARK(uncontended<std::mutex, true>)->Name("LockUncontended/peer:std::mutex");

double processorSeconds()
{
    timespec time;
    clock_gettime(CLOCK_PROCESS_CPUTIME_ID, &time);
    return static_cast<double>(time.tv_sec) + 1e-9 * static_cast<double>(time.tv_nsec);
}

/// Eight threads that each take the lock 20 000 times for a section of about 100 ns; the time
/// reported is the processor time of all of them.
template <class Lock>
void contended(benchmark::State& state)
{
    for (auto _ : state) {
        Lock lock;
        std::uint64_t shared = 1;
        double const before = processorSeconds();
        std::vector<std::thread> threads;
        for (int i = 0; i < 8; ++i)
            threads.emplace_back([&] {
                for (int turn = 0; turn < 20000; ++turn) {
                    std::scoped_lock const guard(lock);
                    for (int step = 0; step < 30; ++step)
                        shared = shared * 6364136223846793005u + 1;
                }
            });
        for (std::thread& thread : threads)
            thread.join();
        benchmark::DoNotOptimize(shared);
        state.SetIterationTime(processorSeconds() - before);
    }
}
BENCHMARK(contended<KVSpinLock>)
    ->Name("LockContended/ours")
    ->UseManualTime()
    ->Unit(benchmark::kMillisecond);
BENCHMARK(contended<std::mutex>)
    ->Name("LockContended/peer:std::mutex")
    ->UseManualTime()
    ->Unit(benchmark::kMillisecond);

} // namespace
