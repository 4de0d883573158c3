#include "time/TimeTesting.h"

#include <cmath>
#include <limits>

using namespace timetest;

namespace {

constexpr CMTime invalid = kCMTimeInvalid, indefinite = kCMTimeIndefinite;
constexpr CMTime plusInfinity = kCMTimePositiveInfinity, minusInfinity = kCMTimeNegativeInfinity;
constexpr double infinite = std::numeric_limits<double>::infinity();
constexpr double notANumber = std::numeric_limits<double>::quiet_NaN();

} // namespace

TEST(CMTime, Adds)
{
    struct Row {
        CMTime a, b, sum;
    } const rows[] = {
        {T(1, 2), T(1, 3), T(5, 6)},
        // A least common multiple of 0x7FFFFFFF still fits; beyond it the larger timescale rounds.
        {T(1, 0x7FFFFFFF), T(1, 1), T(0x80000000, 0x7FFFFFFF)},
        {T(1, 0x7FFFFFFF), T(1, 0x7FFFFFFE), T(2, 0x7FFFFFFF, rounded)},
        {T(1, 1000000000), T(1001, 30000), T(33366668, 1000000000, rounded)},
        {T(3, 0x7FFFFFFE), T(1, 4), T(536870915, 0x7FFFFFFE, rounded)}, // half away from 0
        // Beyond 64 bits half of the timescale, and so on, to 1.
        {T(highest, 600), T(highest, 600), T(highest, 300)},
        {T(lowest, 3), T(-2, 3), T(-3074457345618258603, 1, rounded)},
        {T(highest, 1), T(1, 1), plusInfinity},
        {T(lowest, 1), T(-1, 1), minusInfinity},
        {T(highest, 1), T(lowest, 1), T(-1, 1)},
        // The rounded bit stays on.
        {T(1, 600, rounded), T(1, 600), T(2, 600, rounded)},
        {T(1, 600), T(1, 300, rounded), T(3, 600, rounded)},
        // Epochs: 0 takes the other's, two different ones do not add.
        {T(1, 1, valid, 2), T(1, 1), T(2, 1, valid, 2)},
        {T(1, 1, valid, 2), T(1, 1, valid, 2), T(2, 1, valid, 2)},
        {T(1, 1, valid, 2), T(1, 1, valid, 3), invalid},
        // Other kinds: invalid, then infinities, then indefinite.
        {invalid, plusInfinity, invalid},
        {plusInfinity, minusInfinity, invalid},
        {plusInfinity, T(1, 1), plusInfinity},
        {indefinite, minusInfinity, minusInfinity},
        {T(1, 1), indefinite, indefinite},
        // A negative timescale is that of the negated value; 0 is none.
        {T(1, -2), T(1, 2), T(0, 2)},
        {T(1, -2), T(1, -2), T(2, -2)},
        {T(1, INT32_MIN), T(1, 1), T(0x7FFFFFFE, 0x7FFFFFFF, rounded)},
        {T(1, 0), T(1, 0), invalid},
    };
    for (Row const& row : rows)
        EXPECT_EQ(CMTimeAdd(row.a, row.b), row.sum)
            << row.a.value << "/" << row.a.timescale << " + " << row.b.value << "/"
            << row.b.timescale;
}

TEST(CMTime, Subtracts)
{
    struct Row {
        CMTime a, b, difference;
    } const rows[] = {
        {T(1, 2), T(1, 3), T(1, 6)},
        {T(lowest, 1), T(1, 1), minusInfinity},
        {T(0, 1), T(lowest, 1), plusInfinity},
        {T(lowest, 600), T(lowest, 600), T(0, 600)},
        {T(5, 1, valid, 2), T(3, 1, valid, 2), T(2, 1)},
        {T(5, 1), T(3, 1, valid, 2), T(2, 1, valid, 2)},
        {plusInfinity, plusInfinity, invalid},
        {T(1, 1), plusInfinity, minusInfinity},
    };
    for (Row const& row : rows)
        EXPECT_EQ(CMTimeSubtract(row.a, row.b), row.difference);
}

TEST(CMTime, ComparesInOneOrder)
{
    // Each row is equal within and less than the next.
    std::vector<std::vector<CMTime>> const rows = {
        {minusInfinity, T(7, 3, 9)},
        {T(lowest, 1)},
        {T(lowest, 2), T(-4611686018427387904, 1)},
        {T(-1, 2), T(1, -2), T(-2, 4), T(-1, 2, rounded), T(0x40000000, INT32_MIN)},
        {T(0, 1), T(0, 600), T(0, -5)},
        {T(1, 3)},
        {T(1, 2), T(2, 4), T(-1, -2)},
        {T(highest - 1, 600)},
        {T(highest, 600)},
        {T(highest, 1)},
        {T(lowest, 1, valid, 1)}, // the next epoch
        {indefinite},
        {plusInfinity, T(7, 3, 5)},
        {invalid, T(1, 1, 0), T(1, 0)},
    };
    for (std::size_t i = 0; i < rows.size(); ++i)
        for (std::size_t j = 0; j < rows.size(); ++j)
            for (CMTime const& a : rows[i])
                for (CMTime const& b : rows[j])
                    EXPECT_EQ(CMTimeCompare(a, b), i < j ? -1 : i > j ? 1 : 0) << i << " " << j;
}

TEST(CMTime, Multiplies)
{
    struct Row {
        CMTime time;
        std::int64_t factor;
        CMTime product;
    } const rows[] = {
        {T(1001, 30000), 30000, T(30030000, 30000)},
        {T(1, 3, rounded, 2), -3, T(-3, 3, rounded, 2)},
        {T(highest, 3), 3, T(highest, 1)},
        {T(highest, 1), 2, plusInfinity},
        {T(lowest, 1), -1, plusInfinity},
        {T(lowest, 1), lowest, plusInfinity},
        {T(highest, 0x7FFFFFFF), lowest, minusInfinity},
        {plusInfinity, -2, minusInfinity},
        {minusInfinity, 0, invalid},
        {indefinite, 0, indefinite},
        {invalid, 1, invalid},
    };
    for (Row const& row : rows)
        EXPECT_EQ(CMTimeMultiply(row.time, row.factor), row.product) << row.factor;
}

TEST(CMTime, MultipliesByTheExactValueOfADouble)
{
    struct Row {
        CMTime time;
        double factor;
        CMTime product;
    } const rows[] = {
        {T(4, 600), 0.5, T(2, 600)},             // on its own timescale if it can be
        {T(1, 600), 0.5, T(1, 1200)},            // else as a reduced fraction
        {T(1, 1), 0.1, T(6554, 65536, rounded)}, // else on 65536 or more
        {T(1, 1), 0.5 + 0x1p-31, T(32768, 65536, rounded)},
        {T(1, 0x7FFFFFFF), 0.5, T(1, 0x7FFFFFFF, rounded)}, // half away from zero
        {T(-1, 0x7FFFFFFF), 0.5, T(-1, 0x7FFFFFFF, rounded)},
        {T(1, 65537), 0.5 - 0x1p-54, T(0, 65537, rounded)}, // just below half way
        {T(highest, 600), 4, T(highest, 150)},
        {T(highest, 7), 1.0 / 3, T(7027331075698876415, 16, rounded)}, // a half of a half ...
        {T(1, 1), 0x1p63, plusInfinity},
        {T(-1, 2), 0x1p64, T(lowest, 1)},
        {T(-1, 1), 1e300, minusInfinity},
        {T(highest, 1), 0x1p-80, T(0, 65536, rounded)}, // a breath below half a tick
        {T(7, 600, valid, 3), -0.0, T(0, 600, valid, 3)},
        {T(0, 600), infinite, invalid},
        {T(-1, 600), infinite, minusInfinity},
        {T(1, 600), notANumber, invalid},
        {plusInfinity, 0, invalid},
        {T(2, INT32_MIN), 1, T(-1, 0x40000000)},
    };
    for (Row const& row : rows)
        EXPECT_EQ(CMTimeMultiplyByFloat64(row.time, row.factor), row.product)
            << row.time.value << "/" << row.time.timescale << " * " << row.factor;
}

TEST(CMTime, ConvertsTheTimescale)
{
    constexpr CMTimeRoundingMethod half = kCMTimeRoundingMethod_RoundHalfAwayFromZero,
                                   down = kCMTimeRoundingMethod_RoundTowardZero,
                                   up = kCMTimeRoundingMethod_RoundAwayFromZero;
    struct Row {
        CMTime time;
        std::int32_t timescale;
        CMTimeRoundingMethod method;
        CMTime result;
    } const rows[] = {
        {T(1, 4), 2, half, T(1, 2, rounded)},
        {T(-1, 4), 2, half, T(-1, 2, rounded)},
        {T(1, 4), 2, static_cast<CMTimeRoundingMethod>(0), T(1, 2, rounded)},
        {T(3, 4), 2, down, T(1, 2, rounded)},
        {T(-3, 4), 2, down, T(-1, 2, rounded)},
        {T(1, 400), 2, up, T(1, 2, rounded)},
        {T(1, 2, rounded, 7), 4, up, T(2, 4, rounded, 7)},
        {T(highest, 1), 2, half, plusInfinity},
        {T(lowest, 1), 2, half, minusInfinity},
        {T(lowest, 4), 2, half, T(lowest / 2, 2)},
        {T(1, 2), 0, half, invalid},
        {T(1, 2), -2, half, invalid},
        {T(lowest, 1), 1, half, T(lowest, 1)},
        {indefinite, -2, half, indefinite},
        {T(5, 7, 13), 2, half, T(5, 7, 13)}, // not numeric: as it is
    };
    for (Row const& row : rows)
        EXPECT_EQ(CMTimeConvertScale(row.time, row.timescale, row.method), row.result)
            << row.time.value << "/" << row.time.timescale << " to " << row.timescale;
}

TEST(CMTime, MakesFromSecondsByTheFloor)
{
    struct Row {
        double seconds;
        std::int32_t timescale;
        CMTime time;
    } const rows[] = {
        {0.1, 600, T(60, 600)},
        {0.0001, 600, T(0, 600, rounded)},
        {-0.0001, 600, T(-1, 600, rounded)},
        {0x1p62, 2, T(1ll << 62, 1)},
        {0x1p56, 600, T(75 * (1ll << 56), 75)},
        {-0x1p63, 2, T(lowest, 1)},
        {0x1p63, 600, plusInfinity},
        {-infinite, 600, minusInfinity},
        {notANumber, 600, invalid},
        {1, 0, invalid},
    };
    for (Row const& row : rows)
        EXPECT_EQ(CMTimeMakeWithSeconds(row.seconds, row.timescale), row.time) << row.seconds;
}

TEST(CMTime, TellsSeconds)
{
    EXPECT_EQ(CMTimeGetSeconds(T(1001, 30000)), 1001.0 / 30000);
    EXPECT_EQ(CMTimeGetSeconds(T(1, -2)), -0.5);
    EXPECT_EQ(CMTimeGetSeconds(plusInfinity), infinite);
    EXPECT_EQ(CMTimeGetSeconds(minusInfinity), -infinite);
    for (CMTime const& none : {invalid, indefinite, T(0, 0), T(3, 2, 1 | 16), T(3, 2, 2)}) {
        EXPECT_TRUE(std::isnan(CMTimeGetSeconds(none)));
        EXPECT_FALSE(std::signbit(CMTimeGetSeconds(none)));
    }
}

TEST(CMTime, TellsItsKind)
{
    for (std::uint32_t flags = 0; flags < 64; ++flags) {
        CMTime const time = T(1, 1, flags);
        EXPECT_EQ(CMTimeIsNumeric(time), (flags & 0x1D) == 1) << flags;
        EXPECT_EQ(CMTimeIsRounded(time), (flags & 0x1F) == 3) << flags;
        EXPECT_EQ(CMTimeIsValid(time), (flags & 1) == 1) << flags;
    }
}
