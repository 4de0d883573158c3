#include "time/Exact.h"
#include "time/TimeTesting.h"

#include <korvane/foundation/KVPrint.h>

#include <optional>
#include <random>

// The operations of KVTime.h against their definitions, carried out step by step on integers
// without a size.

using namespace timetest;

namespace {

struct Model {
    Exact numerator, denominator;
};

bool fits(Exact const& x)
{
    return x >= lowest && x <= highest;
}

/// One bit at a time.
CMTime makeTime(Model x, bool alreadyRounded, bool forceReduce)
{
    CMTime result = kCMTimeZero;
    result.flags = alreadyRounded ? rounded : valid;
    Exact const limit = 0x7FFFFFFF;
    auto& [num, den] = x;
    if (!forceReduce && fits(num) && den >= 0 && den <= limit) {
        result.value = static_cast<std::int64_t>(num);
        result.timescale = static_cast<std::int32_t>(den);
        return result;
    }
    if (den == 0)
        return kCMTimeInvalid;
    bool const negative = (num < 0) != (den < 0);
    num = abs(num);
    den = abs(den);
    Exact const common = gcd(num, den);
    num = num / common;
    den = den / common;
    while (!fits(num) && den > 1) {
        num /= 2;
        den /= 2;
        result.flags = rounded;
    }
    bool spared = false;
    while (den > limit) {
        result.flags = rounded;
        den /= 2;
        if (num == 1) {
            if (spared) {
                num = 0;
                den = 1;
                break;
            }
            spared = true;
        } else {
            num /= 2;
        }
    }
    if (!fits(num))
        return negative ? kCMTimeNegativeInfinity : kCMTimePositiveInfinity;
    result.value = static_cast<std::int64_t>(negative ? -num : num);
    result.timescale = static_cast<std::int32_t>(den);
    return result;
}

CMTime multiplyDivide(CMTime const& t, std::int64_t m, std::int64_t d)
{
    if (d == 0 || t.timescale == 0)
        return kCMTimeInvalid;
    CMTime const r =
        makeTime({Exact(t.value) * m, Exact(t.timescale) * d}, CMTimeIsRounded(t), false);
    if (CMTimeIsNumeric(r) && !CMTimeIsRounded(r) && r.timescale > t.timescale && t.timescale > 0) {
        Exact const ticks = Exact(r.value) * t.timescale;
        if (ticks % r.timescale == 0 && fits(ticks / r.timescale))
            return CMTimeMake(static_cast<std::int64_t>(ticks / r.timescale), t.timescale);
    }
    return r;
}

CMTime remapExactly(CMTime const& t, CMTime const& o, CMTime const& n)
{
    Exact const oldScale = t.timescale == o.timescale ? 1 : o.timescale;
    Exact const scale = t.timescale == o.timescale ? 1 : t.timescale;
    return makeTime({Exact(t.value) * n.value * oldScale, Exact(o.value) * scale * n.timescale},
                    CMTimeIsRounded(t), true);
}

Exact floorOf(Exact const& a, Exact const& b)
{
    Exact const rest = a % b;
    return rest == 0 || (rest < 0) == (b < 0) ? Exact(a / b) : Exact(a / b - 1);
}

/// The grid point that many `frame`s from 0, as the functions answer it.
CMTime gridPoint(Exact const& count, CMTime const& frame)
{
    Exact const ticks = count * frame.value;
    if (!fits(ticks))
        return ticks < 0 ? kCMTimeNegativeInfinity : kCMTimePositiveInfinity;
    return CMTimeMake(static_cast<std::int64_t>(ticks), frame.timescale);
}

/// Whether a - b is exactly c, all numeric.
bool isDifference(CMTime const& a, CMTime const& b, CMTime const& c)
{
    Exact const difference = Exact(a.value) * b.timescale - Exact(b.value) * a.timescale;
    return difference * c.timescale == Exact(c.value) * a.timescale * b.timescale;
}

class Random {
public:
    /// Of any length up to 64 bits, often at the ends.
    std::int64_t value()
    {
        if (next() % 8 == 0)
            return std::array{highest,         lowest,          highest - 1,     lowest + 1,
                              std::int64_t{0}, std::int64_t{1}, std::int64_t{-1}}[next() % 7];
        return static_cast<std::int64_t>(next()) >> next() % 64;
    }
    std::int32_t timescale()
    {
        constexpr std::int32_t usual[] = {1,     24,    25,    600,        24000,
                                          30000, 48000, 90000, 1000000000, INT32_MAX};
        if (next() % 4 != 0)
            return usual[next() % std::size(usual)];
        auto const any = static_cast<std::int32_t>(next()) >> next() % 31;
        return any == 0 ? 1 : any;
    }
    CMTime time() { return T(value(), timescale(), next() % 8 == 0 ? rounded : valid); }

private:
    std::uint64_t next() { return engine_(); }
    std::mt19937_64 engine_{20};
};

void checkAll(CMTime const& t, CMTime const& o, CMTime const& n, std::int64_t m, std::int64_t d)
{
    EXPECT_EQ(KV_CMTimeMultiply64Divide64(t, m, d), multiplyDivide(t, m, d)) << m << " / " << d;
    if (CMTimeCompare(o, n) != 0 && o.value != 0) {
        EXPECT_EQ(KV_CMTimeRemap(t, o, n, true), remapExactly(t, o, n));
    }

    CMTime const difference = KV_CMTimeSaferSubtract(t, o);
    if (CMTimeIsNumeric(difference) && !CMTimeIsRounded(difference)) {
        EXPECT_TRUE(isDifference(t, o, difference));
    }
    CMTime const sum = KV_CMTimeSaferAdd(t, o);
    if (CMTimeIsNumeric(sum) && !CMTimeIsRounded(sum)) {
        EXPECT_TRUE(isDifference(sum, o, t));
    }

    CMTime const half = KV_CMTimeHalve(t);
    if (!CMTimeIsRounded(half)) {
        EXPECT_TRUE(isDifference(t, half, half));
    }

    // On a grid of whole, positive steps.
    if (o.value < 1 || o.timescale < 1)
        return;
    Exact const a = Exact(t.value) * o.timescale, b = Exact(t.timescale) * o.value;
    Exact const below = floorOf(a, b), above = -floorOf(-a, b);
    CMTime const floor = gridPoint(below, o), ceiling = gridPoint(above, o);
    // A conversion to the frame's timescale that overflows is an infinity before it is a grid
    // point.
    if (fits(Exact(t.value) * o.timescale / t.timescale + 1) &&
        fits(Exact(t.value) * o.timescale / t.timescale - 1)) {
        EXPECT_EQ(KV_CMTimeFloorToSampleDuration(t, o), floor);
        EXPECT_EQ(KV_CMTimeCeilingToSampleDuration(t, o), ceiling);
        // Twice the time, and twice the middle, in units of frames / b.
        bool const lower = 2 * a * (b < 0 ? -1 : 1) < (below + above) * abs(b);
        CMTime const nearest = lower ? floor : ceiling;
        if (CMTimeIsNumeric(floor) && CMTimeIsNumeric(ceiling)) {
            EXPECT_EQ(KV_CMTimeRoundToSampleDuration(t, o), nearest);
        }
    }
}

} // namespace

TEST(KVTimeModel, HoldsOnASmallDomain)
{
    for (std::int64_t value = -9; value <= 9; ++value)
        for (std::int32_t const scale : {-3, 1, 2, 3, 4, 6})
            for (std::int64_t step = 1; step <= 6; ++step)
                for (std::int32_t const stepScale : {1, 2, 3, 6})
                    for (std::int64_t divisor = -2; divisor <= 3; ++divisor) {
                        SCOPED_TRACE(testing::PrintToString(T(value, scale)));
                        SCOPED_TRACE(testing::PrintToString(T(step, stepScale)));
                        checkAll(T(value, scale), T(step, stepScale), T(3, 4), step, divisor);
                        if (testing::Test::HasFailure())
                            return;
                    }
}

TEST(KVTimeModel, HoldsOverSixtyFourBits)
{
    KVSetLogSink([](char const*, std::size_t) {}); // halving warns of lost bits
    Random random;
    for (int i = 0; i < 10000 && !testing::Test::HasFailure(); ++i) {
        CMTime const t = random.time(), o = random.time(), n = random.time();
        SCOPED_TRACE(testing::PrintToString(t));
        SCOPED_TRACE(testing::PrintToString(o));
        SCOPED_TRACE(testing::PrintToString(n));
        checkAll(t, o, n, random.value(), random.value());
    }
    KVSetLogSink(nullptr);
}
