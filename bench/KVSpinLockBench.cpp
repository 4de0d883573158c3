// A lock that nobody else wants, and one that eight threads want at once: what it costs in time,
// and what waiting costs in processor time.

#include <korvane/foundation/KVSpinLock.h>

#include <benchmark/benchmark.h>

#include <mutex>

namespace {

template <typename Lock>
void uncontended(benchmark::State& state)
{
    Lock lock;
    for (auto _ : state) {
        lock.lock();
        benchmark::ClobberMemory();
        lock.unlock();
    }
}
BENCHMARK(uncontended<KVSpinLock>)->Name("Uncontended/ours");
BENCHMARK(uncontended<std::mutex>)->Name("Uncontended/peer:std::mutex");

template <typename Lock>
void contended(benchmark::State& state)
{
    static Lock lock;
    static long shared = 0;
    for (auto _ : state) {
        lock.lock();
        for (int i = 0; i < 32; ++i)
            benchmark::DoNotOptimize(shared += i);
        lock.unlock();
    }
}
BENCHMARK(contended<KVSpinLock>)
    ->Name("Contended/ours")
    ->Threads(8)
    ->MeasureProcessCPUTime()
    ->UseRealTime();
BENCHMARK(contended<std::mutex>)
    ->Name("Contended/peer:std::mutex")
    ->Threads(8)
    ->MeasureProcessCPUTime()
    ->UseRealTime();

} // namespace
