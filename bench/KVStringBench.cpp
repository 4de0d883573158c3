// Text of 32 ASCII bytes on its way in and out, and the copy of a string.

#include <korvane/foundation/KVString.h>

#include <benchmark/benchmark.h>

#include <string>

namespace {

char const* const text = "clip 0042 of the second sequence";

void fromUTF8(benchmark::State& state)
{
    for (auto _ : state) {
        KVString string(text);
        benchmark::DoNotOptimize(string);
    }
}
BENCHMARK(fromUTF8)->Name("FromUTF8/ours");

void toUTF8(benchmark::State& state)
{
    KVString const string(text);
    for (auto _ : state) {
        std::string utf8 = string;
        benchmark::DoNotOptimize(utf8);
    }
}
BENCHMARK(toUTF8)->Name("ToUTF8/ours");

void copy(benchmark::State& state)
{
    KVString const string(text);
    for (auto _ : state) {
        KVString other(string);
        benchmark::DoNotOptimize(other);
    }
}
BENCHMARK(copy)->Name("Copy/ours");

void standardCopy(benchmark::State& state)
{
    std::string const string(text);
    for (auto _ : state) {
        std::string other(string);
        benchmark::DoNotOptimize(other);
    }
}
BENCHMARK(standardCopy)->Name("Copy/peer:std::string");

} // namespace
