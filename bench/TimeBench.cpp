// Sums and products of times beside other exact arithmetic, and whole sets of ranges.

#include <korvane/korvane.h>

#include <benchmark/benchmark.h>

#include <array>
#include <random>

#ifdef HAVE_LIBAVUTIL
extern "C" {
#include <libavutil/mathematics.h>
}
#endif
#ifdef HAVE_BOOST
#include <boost/multiprecision/cpp_int.hpp>
#endif

namespace {

constexpr std::size_t count = 1024;

/// Times of a few hours, the second operands of a few frames, on timescales taken in turn.
struct Operands {
    std::array<CMTime, count> a, b;
};

Operands operands(std::initializer_list<int> scalesA, std::initializer_list<int> scalesB)
{
    std::mt19937_64 random(1);
    Operands result;
    for (std::size_t i = 0; i < count; ++i) {
        int const scaleA = scalesA.begin()[i % scalesA.size()];
        int const scaleB = scalesB.begin()[i % scalesB.size()];
        result.a[i] = CMTimeMake(static_cast<std::int64_t>(random() % (10000ull * 30000)), scaleA);
        result.b[i] = CMTimeMake(static_cast<std::int64_t>(random() % 100000), scaleB);
    }
    return result;
}

template <class Operation>
void onAll(benchmark::State& state, Operands const& operands, Operation operation)
{
    std::size_t i = 0;
    for (auto _ : state) {
        benchmark::DoNotOptimize(operation(operands.a[i], operands.b[i]));
        i = (i + 1) % count;
    }
}

// --- Sums ---

Operands const& equalTimescales()
{
    static Operands const result = operands({30000}, {30000});
    return result;
}

Operands const& mixedTimescales()
{
    static Operands const result = operands({30000, 24000, 600}, {24000, 90000, 48000, 1001});
    return result;
}

void addEqual(benchmark::State& state)
{
    onAll(state, equalTimescales(), KV_CMTimeSaferAdd);
}
BENCHMARK(addEqual)->Name("AddEqual/ours");

void addMixed(benchmark::State& state)
{
    onAll(state, mixedTimescales(), KV_CMTimeSaferAdd);
}
BENCHMARK(addMixed)->Name("AddMixed/ours");

__extension__ typedef __int128 Int128;

/// The sum over the product of the denominators, reduced by Euclid's algorithm in 128 bits.
CMTime addIn128Bits(CMTime const& a, CMTime const& b)
{
    Int128 numerator = Int128{a.value} * b.timescale + Int128{b.value} * a.timescale;
    Int128 denominator = Int128{a.timescale} * b.timescale;
    Int128 common = numerator, rest = denominator;
    while (rest != 0) {
        common %= rest;
        std::swap(common, rest);
    }
    return CMTimeMake(static_cast<std::int64_t>(numerator / common),
                      static_cast<std::int32_t>(denominator / common));
}

void addMixedIn128Bits(benchmark::State& state)
{
    onAll(state, mixedTimescales(), addIn128Bits);
}
BENCHMARK(addMixedIn128Bits)->Name("AddMixed/peer:128-bit gcd");

#ifdef HAVE_LIBAVUTIL
void addEqualLibavutil(benchmark::State& state)
{
    // The step as a time base of its own, which is the quicker of its two forms.
    onAll(state, equalTimescales(), [](CMTime const& a, CMTime const& b) {
        return av_add_stable({1, a.timescale}, a.value, {static_cast<int>(b.value), b.timescale},
                             1);
    });
}
BENCHMARK(addEqualLibavutil)->Name("AddEqual/peer:libavutil");
#endif

// --- Products ---

void multiplyFast(benchmark::State& state)
{
    onAll(state, equalTimescales(), [](CMTime const& a, CMTime const&) {
        return KV_CMTimeMultiply64Divide64(a, 1001, 24000);
    });
}
BENCHMARK(multiplyFast)->Name("MultiplyFast/ours");

/// Values of 60 bits times and over others of 60.
struct LongFactors {
    std::array<CMTime, count> time;
    std::array<std::int64_t, count> multiplier, divisor;
};

LongFactors const& longFactors()
{
    static LongFactors const result = [] {
        std::mt19937_64 random(2);
        auto const wide = [&] { return static_cast<std::int64_t>(random() >> 4 | 1ull << 59); };
        LongFactors factors;
        for (std::size_t i = 0; i < count; ++i) {
            factors.time[i] = CMTimeMake(wide(), i % 2 ? 30000 : 90000);
            factors.multiplier[i] = wide();
            factors.divisor[i] = wide();
        }
        return factors;
    }();
    return result;
}

template <class Operation>
void onLongFactors(benchmark::State& state, Operation operation)
{
    LongFactors const& factors = longFactors();
    std::size_t i = 0;
    for (auto _ : state) {
        benchmark::DoNotOptimize(
            operation(factors.time[i], factors.multiplier[i], factors.divisor[i]));
        i = (i + 1) % count;
    }
}

void multiplyWide(benchmark::State& state)
{
    onLongFactors(state, KV_CMTimeMultiply64Divide64);
}
BENCHMARK(multiplyWide)->Name("MultiplyWide/ours");

#ifdef HAVE_BOOST
CMTime multiplyInInt256(CMTime const& time, std::int64_t multiplier, std::int64_t divisor)
{
    using boost::multiprecision::int256_t;
    int256_t numerator = int256_t(time.value) * multiplier;
    int256_t denominator = int256_t(time.timescale) * divisor;
    bool const negative = (numerator < 0) != (denominator < 0);
    numerator = abs(numerator);
    denominator = abs(denominator);
    int256_t const common = gcd(numerator, denominator);
    if (common != 1) {
        numerator /= common;
        denominator /= common;
    }
    std::uint32_t flags = kCMTimeFlags_Valid;
    auto const halve = [&](int256_t& x, int256_t& y, unsigned int steps) {
        x >>= steps;
        y >>= steps;
        flags |= kCMTimeFlags_HasBeenRounded;
    };
    if (unsigned const bits = msb(numerator); bits > 62)
        halve(numerator, denominator, std::min(bits - 62, msb(denominator)));
    if (unsigned const bits = msb(denominator); bits > 30)
        halve(numerator, denominator, bits - 30);
    auto const value = static_cast<std::int64_t>(numerator);
    return {negative ? -value : value, static_cast<std::int32_t>(denominator), flags, 0};
}

void multiplyWideBoost(benchmark::State& state)
{
    onLongFactors(state, multiplyInInt256);
}
BENCHMARK(multiplyWideBoost)->Name("MultiplyWide/peer:boost int256");
#endif

// --- Sets of ranges ---

/// `size` ranges of a few frames anywhere in twice as many seconds, in no order.
VexTimeRangeArray scattered(std::int64_t size, unsigned int seed)
{
    std::mt19937_64 random(seed);
    auto const below = [&](std::int64_t end) {
        return static_cast<std::int64_t>(random() % static_cast<std::uint64_t>(end));
    };
    VexTimeRangeArray ranges;
    for (std::int64_t i = 0; i < size; ++i)
        ranges.push_back(
            KVMakeRef<VexTimeRangeObj>(CMTimeRangeMake(CMTimeMake(below(2 * size * 24000), 24000),
                                                       CMTimeMake(1001 * (1 + below(24)), 24000))));
    return ranges;
}

void eachOf(benchmark::State& state)
{
    state.counters["each"] =
        benchmark::Counter(static_cast<double>(state.iterations() * state.range(0)),
                           benchmark::Counter::kIsRate | benchmark::Counter::kInvert);
}

void addUnsorted(benchmark::State& state)
{
    VexTimeRangeArray const a = scattered(state.range(0), 1), b = scattered(state.range(0), 2);
    for (auto _ : state)
        benchmark::DoNotOptimize(VexTimeRangesAddUnsortedRanges(a, b));
    eachOf(state);
}
BENCHMARK(addUnsorted)->Name("AddUnsorted/ours")->Arg(10000)->Arg(100000);

void subtractUnsorted(benchmark::State& state)
{
    VexTimeRangeArray const a = scattered(state.range(0), 1), b = scattered(state.range(0), 2);
    for (auto _ : state)
        benchmark::DoNotOptimize(VexTimeRangesSubtractUnsortedRanges(a, b));
    eachOf(state);
}
BENCHMARK(subtractUnsorted)->Name("SubtractUnsorted/ours")->Arg(10000)->Arg(100000);

void subtractSorted(benchmark::State& state)
{
    VexTimeRangeArray holes;
    for (std::int64_t i = 0; i < state.range(0); ++i)
        holes.push_back(KVMakeRef<VexTimeRangeObj>(
            CMTimeRangeMake(CMTimeMake(2 * i + 1, 24), CMTimeMake(1, 24))));
    auto const range = KVMakeRef<VexTimeRangeObj>(
        CMTimeRangeMake(kCMTimeZero, CMTimeMake(2 * state.range(0) + 1, 24)));
    for (auto _ : state)
        benchmark::DoNotOptimize(VexTimeRangeObjSubtractSortedRanges(range, holes));
    eachOf(state);
}
BENCHMARK(subtractSorted)->Name("SubtractSorted/ours")->Arg(1000)->Arg(10000);

} // namespace
