#include "time/Exact.h"
#include "time/TimeTesting.h"

#include <korvane/time/IntermediateLargeInteger.h>

#include <random>

using namespace timetest;
using Large = IntermediateLargeInteger;

namespace {

Exact powerOfTwo(unsigned int exponent)
{
    return Exact(1) << exponent;
}

/// The value as a 256-bit two's complement number.
Large large(Exact const& x)
{
    Exact rest = x < 0 ? x + powerOfTwo(256) : x;
    bignum_s256 bits;
    for (std::uint64_t& limb : bits.limbs) {
        limb = static_cast<std::uint64_t>(rest & UINT64_MAX);
        rest >>= 64;
    }
    return Large(bits);
}

bool equal(Large const& a, Large const& b)
{
    return a.bits().limbs == b.bits().limbs;
}

/// Numbers of every length up to `bits`, and the ones around the limbs' borders.
std::vector<Exact> samples(unsigned int bits)
{
    std::mt19937_64 random(1);
    std::vector<Exact> result = {0, 1, -1, 2, 3, -7, highest, lowest};
    for (unsigned int const edge : {31, 63, 64, 127, 128, 191, 254})
        for (Exact const& x : {powerOfTwo(edge) - 1, powerOfTwo(edge), powerOfTwo(edge) + 1})
            if (edge < bits) {
                result.push_back(x);
                result.push_back(-x);
            }
    for (int i = 0; i < 16; ++i) {
        auto const word = [&] { return static_cast<std::int64_t>(random()); };
        Exact const x = Exact(word()) * word() * word() * (word() >> 3);
        result.push_back(x / powerOfTwo(256 - bits + static_cast<unsigned int>(random() % 200)));
    }
    return result;
}

} // namespace

TEST(Bignum, ExtendsSigns)
{
    for (std::int64_t const x : {std::int64_t{0}, std::int64_t{-5}, highest, lowest}) {
        bignum_s128 narrow;
        bignum_s128_init_from_s64(x, &narrow);
        EXPECT_EQ(narrow.limbs,
                  (std::array<std::uint64_t, 2>{static_cast<std::uint64_t>(x), x < 0 ? ~0ull : 0}));
        bignum_s256 wide;
        bignum_s256_init_from_s64(x, &wide);
        EXPECT_TRUE(equal(Large(wide), large(x)));
        EXPECT_TRUE(equal(Large::product(x, lowest), large(Exact(x) * lowest)));
    }
}

TEST(Bignum, AgreesWithExactIntegers)
{
    for (Exact const& a : samples(255))
        for (Exact const& b : samples(255)) {
            bignum_s256 const first = large(a).bits(), second = large(b).bits();
            bignum_s256 result = first;
            bignum_s256_neg(&result, &second);
            EXPECT_TRUE(equal(Large(result), large(-b)));
            if (abs(a - b) < powerOfTwo(255)) {
                bignum_s256_sub(&first, &second, &result);
                EXPECT_TRUE(equal(Large(result), large(a - b)));
            }
            bignum_s256 quotient = first, remainder = second;
            bignum_s256_divide(&quotient, &remainder, &quotient, &remainder);
            EXPECT_TRUE(equal(Large(quotient), b == 0 ? 0 : large(a / b))); // toward zero
            EXPECT_TRUE(equal(Large(remainder), b == 0 ? 0 : large(a % b)));
            if (a >= 0 && b >= 0) {
                EXPECT_TRUE(equal(Large::gcd(large(a), large(b)), large(gcd(a, b))));
            }
        }
}

TEST(Bignum, MultipliesInFull)
{
    std::vector<Exact> factors = samples(127);
    factors.push_back(-powerOfTwo(127));
    for (Exact const& a : factors)
        for (Exact const& b : factors) {
            auto const low = large(a).bits().limbs, high = large(b).bits().limbs;
            bignum_s128 const factorA{{low[0], low[1]}}, factorB{{high[0], high[1]}};
            bignum_s256 product;
            bignum_s128_full_multiply(&factorA, &factorB, &product);
            EXPECT_TRUE(equal(Large(product), large(a * b)));
        }
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
