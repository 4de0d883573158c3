#include "time/Exact.h"
#include "time/TimeTesting.h"

#include <korvane/time/IntermediateLargeInteger.h>

#include <random>

using namespace timetest;
using Large = IntermediateLargeInteger;

namespace {

/// The value as a 256-bit two's complement number.
Large large(Exact x)
{
    Exact const base = Exact(1ll << 62) * 4;
    bool const negative = x.isNegative();
    Exact rest = negative ? -x - 1 : x;
    bignum_s256 bits;
    for (std::uint64_t& limb : bits.limbs) {
        auto const [quotient, remainder] = Exact::divide(rest, base);
        limb =
            static_cast<std::uint64_t>((remainder / 2).value()) * 2 + (remainder.isEven() ? 0 : 1);
        limb = negative ? ~limb : limb;
        rest = quotient;
    }
    return Large(bits);
}

bool equal(Large const& a, Large const& b)
{
    return a.bits().limbs == b.bits().limbs;
}

Exact powerOfTwo(int exponent)
{
    Exact result = 1;
    for (; exponent > 0; --exponent)
        result = result + result;
    return result;
}

/// Numbers of every length up to `bits`, and the ones around the limbs' borders.
std::vector<Exact> samples(int bits)
{
    std::mt19937_64 random(1);
    std::vector<Exact> result = {0, 1, -1, 2, 3, -7, highest, lowest};
    for (int const edge : {31, 63, 64, 127, 128, 191, 254})
        for (Exact const& x : {powerOfTwo(edge) - 1, powerOfTwo(edge), powerOfTwo(edge) + 1})
            if (edge < bits) {
                result.push_back(x);
                result.push_back(-x);
            }
    for (int i = 0; i < 16; ++i) {
        auto const word = [&] { return static_cast<std::int64_t>(random()); };
        Exact const x = Exact(word()) * word() * word() * (word() >> 3);
        result.push_back(x / powerOfTwo(256 - bits + static_cast<int>(random() % 200)));
    }
    return result;
}

} // namespace

TEST(Bignum, ExtendsSigns)
{
    for (std::int64_t const x :
         {std::int64_t{0}, std::int64_t{5}, std::int64_t{-5}, highest, lowest}) {
        auto const low = static_cast<std::uint64_t>(x);
        std::uint64_t const sign = x < 0 ? ~0ull : 0;
        bignum_s128 narrow;
        bignum_s128_init_from_s64(x, &narrow);
        EXPECT_EQ(narrow.limbs, (std::array{low, sign}));
        bignum_s256 wide;
        bignum_s256_init_from_s64(x, &wide);
        EXPECT_EQ(wide.limbs, (std::array{low, sign, sign, sign}));
        EXPECT_TRUE(Large(wide) == x);
    }
}

TEST(Bignum, SubtractsAndNegates)
{
    for (Exact const& a : samples(255))
        for (Exact const& b : samples(255)) {
            bignum_s256 result = large(a).bits();
            bignum_s256 const other = large(b).bits();
            if ((a - b).abs() < powerOfTwo(255)) {
                bignum_s256_sub(&result, &other, &result);
                EXPECT_TRUE(equal(Large(result), large(a - b)));
            }
            bignum_s256_neg(&result, &other);
            EXPECT_TRUE(equal(Large(result), large(-b)));
        }
}

TEST(Bignum, MultipliesInFull)
{
    for (Exact const& a : samples(127))
        for (Exact const& b : samples(127)) {
            auto const narrow = [](Exact const& x) {
                auto const limbs = large(x).bits().limbs;
                return bignum_s128{{limbs[0], limbs[1]}};
            };
            bignum_s128 const factorA = narrow(a), factorB = narrow(b);
            bignum_s256 product;
            bignum_s128_full_multiply(&factorA, &factorB, &product);
            EXPECT_TRUE(equal(Large(product), large(a * b)));
        }
    bignum_s128 const least{{0, 1ull << 63}};
    bignum_s256 square;
    bignum_s128_full_multiply(&least, &least, &square);
    EXPECT_EQ(square.limbs, (std::array<std::uint64_t, 4>{0, 0, 0, 1ull << 62}));
}

TEST(Bignum, DividesTowardZero)
{
    for (Exact const& a : samples(255))
        for (Exact const& b : samples(255)) {
            bignum_s256 quotient = large(a).bits(), remainder = large(b).bits();
            bignum_s256_divide(&quotient, &remainder, &quotient, &remainder);
            auto const [q, r] = b.isZero() ? std::pair<Exact, Exact>(0, 0) : Exact::divide(a, b);
            EXPECT_TRUE(equal(Large(quotient), large(q)));
            EXPECT_TRUE(equal(Large(remainder), large(r)));
            EXPECT_TRUE(equal(large(a) % large(b), large(r)));
        }
    bignum_s256 const seven = Large(7).bits();
    bignum_s256_divide(&seven, &seven, nullptr, nullptr);
}

TEST(IntermediateLargeInteger, FindsTheGreatestCommonDivisor)
{
    struct Row {
        Exact a, b, gcd;
    } const rows[] = {
        {12, 18, 6},
        {0, 5, 5},
        {5, 0, 5},
        {0, 0, 0},
        {powerOfTwo(200), powerOfTwo(130) * 3, powerOfTwo(130)},
        {Exact(highest) * highest * 6, Exact(highest) * 4, Exact(highest) * 2},
        {Exact(highest) * 10, 15, 5},
    };
    for (Row const& row : rows)
        EXPECT_TRUE(equal(Large::gcd(large(row.a), large(row.b)), large(row.gcd)));
}

TEST(IntermediateLargeInteger, MakesTimes)
{
    struct Row {
        Exact numerator, denominator;
        CMTime taken, reduced; // without and with `forceReduce`
    } const rows[] = {
        {3, 3, T(3, 3), T(1, 1)},
        {-6, 4, T(-6, 4), T(-3, 2)},
        {6, -4, T(-3, 2), T(-3, 2)}, // a negative denominator is not taken as it is
        {lowest, 1, T(lowest, 1), kCMTimeNegativeInfinity},
        {lowest, 2, T(lowest, 2), T(lowest / 2, 1)},
        {0, 7, T(0, 7), T(0, 1)},
        {5, 0, T(5, 0), kCMTimeInvalid}, // meant: a small fraction is not looked at
        {powerOfTwo(80), 0, kCMTimeInvalid, kCMTimeInvalid},
        {1, powerOfTwo(31) - 1, T(1, 0x7FFFFFFF), T(1, 0x7FFFFFFF)},
        {powerOfTwo(63), 1, kCMTimePositiveInfinity, kCMTimePositiveInfinity},
        {-powerOfTwo(63), 1, T(lowest, 1), kCMTimeNegativeInfinity},
        {-powerOfTwo(64), 1, kCMTimeNegativeInfinity, kCMTimeNegativeInfinity},
        // Both terms lose the same bits until the numerator fits ...
        {powerOfTwo(64) + 1, 6, T(1ll << 62, 1, rounded), T(1ll << 62, 1, rounded)},
        // ... even where the quotient would fit: 2^64 / 1.
        {powerOfTwo(65) + 1, 3, kCMTimePositiveInfinity, kCMTimePositiveInfinity},
        {powerOfTwo(66) + 1, powerOfTwo(64), T(1ll << 32, 1 << 30, rounded),
         T(1ll << 32, 1 << 30, rounded)},
        // The numerator 1 is spared once, then all is 0.
        {1, powerOfTwo(31), T(1, 1 << 30, rounded), T(1, 1 << 30, rounded)},
        {1, powerOfTwo(32), T(0, 1, rounded), T(0, 1, rounded)},
        {3, powerOfTwo(32), T(1, 1 << 30, rounded), T(1, 1 << 30, rounded)},
        {-3, powerOfTwo(33), T(0, 1, rounded), T(0, 1, rounded)},
        {5, -powerOfTwo(32), T(-1, 1 << 30, rounded), T(-1, 1 << 30, rounded)},
        {powerOfTwo(200) * 3, powerOfTwo(199), T(6, 1), T(6, 1)},
    };
    for (Row const& row : rows) {
        Large const n = large(row.numerator), d = large(row.denominator);
        EXPECT_EQ(Large::makeCMTime(n, d, false, false), row.taken);
        EXPECT_EQ(Large::makeCMTime(n, d, false, true), row.reduced);
        CMTime marked = row.reduced;
        if (CMTimeIsNumeric(marked))
            marked.flags |= kCMTimeFlags_HasBeenRounded;
        EXPECT_EQ(Large::makeCMTime(n, d, true, true), marked);
    }
    EXPECT_EQ(Large::makeCMTime(3, 3, true, false), T(3, 3, rounded));
}
