// Fixed-point rounding and saturation, at the boundaries and against exact 128-bit sums.
#include <gtest/gtest.h>

#include <bit>
#include <cmath>
#include <cstdint>
#include <limits>
#include <random>

#include "zyr/std/ZYRFixed.h"

using namespace ZYRStd;

namespace {

constexpr int32_t kMin = std::numeric_limits<int32_t>::min();
constexpr int32_t kMax = std::numeric_limits<int32_t>::max();
constexpr int32_t kOne = 0x00010000;
constexpr int32_t kFracOne = 0x40000000;

using i128 = __int128;

i128 floorDiv(i128 n, i128 d) {
    const i128 q = n / d;
    return (n % d != 0 && (n < 0) != (d < 0)) ? q - 1 : q;
}

// n / d to the nearest integer, halves away from zero.
i128 nearest(i128 n, i128 d) {
    if (d < 0) {
        n = -n;
        d = -d;
    }
    return n >= 0 ? floorDiv(2 * n + d, 2 * d) : -floorDiv(-2 * n + d, 2 * d);
}

int32_t clamp32(i128 v) {
    return v > kMax ? kMax : v < kMin ? kMin : static_cast<int32_t>(v);
}

int32_t refFixedMul(int32_t a, int32_t b) {
    return clamp32(nearest(i128{a} * b, i128{1} << 16));
}
int32_t refFracmul(int32_t a, int32_t b) {
    return clamp32(nearest(i128{a} * b, i128{1} << 30));
}
int32_t refTFixedDiv(int32_t a, int32_t b) {
    return b == 0 ? (a < 0 ? kMin : kMax) : clamp32((i128{a} << 16) / b);
}
int32_t refFixratio(int32_t a, int32_t b) {
    return b == 0 ? (a < 0 ? kMin : kMax) : clamp32(nearest(i128{a} << 30, b));
}
int32_t refFixedMulDiv(int32_t a, int32_t b, int32_t c, bool rounded) {
    if (c == 0) {
        const int negatives = (a < 0) + (b < 0);
        return negatives % 2 ? kMin : kMax;
    }
    const i128 n = i128{a} * b;
    return clamp32(rounded ? nearest(n, c) : n / c);
}
int32_t refPFloatToFixed(float x) {
    if (std::isnan(x))
        return 0;
    const long double v = static_cast<long double>(x) * 65536.0L;
    const long double r = v >= 0 ? std::floor(v + 0.5L) : -std::floor(-v + 0.5L);
    return r >= 2147483647.0L ? kMax : r <= -2147483648.0L ? kMin : static_cast<int32_t>(r);
}

int32_t toFixed(float x) {
    return PFloatToFixed(&x);
}

// Operands of every scale: full range, a random bit length, small values and the extremes.
class Operands {
public:
    explicit Operands(uint64_t seed) : rng_(seed) {}
    int32_t next() {
        const uint64_t r = rng_();
        switch (r % 8) {
        case 0:
        case 1:
            return static_cast<int32_t>(r >> 32);
        case 2:
        case 3:
        case 4: {
            const unsigned bits = 1 + static_cast<unsigned>((r >> 3) % 31);
            const auto mag = static_cast<int32_t>((r >> 32) & ((uint64_t{1} << bits) - 1));
            return (r >> 8) & 1 ? -mag : mag;
        }
        case 5:
            return static_cast<int32_t>(static_cast<int64_t>(r >> 40) - (int64_t{1} << 23)) >> 6;
        default: {
            static constexpr int32_t special[] = {0,         1,      -1,       kOne,     -kOne,
                                                  kMin,      kMax,   kMin + 1, kMax - 1, kFracOne,
                                                  -kFracOne, 0x8000, -0x8000,  2,        -2};
            return special[(r >> 32) % std::size(special)];
        }
        }
    }

private:
    std::mt19937_64 rng_;
};

} // namespace

TEST(ZYRFixedTest, FixedMulRoundsAndSaturates) {
    EXPECT_EQ(FixedMul(0x00018000, 0x00018000), 0x00024000);
    EXPECT_EQ(FixedMul(3 * kOne, 2 * kOne), 6 * kOne);
    EXPECT_EQ(FixedMul(-3 * kOne, 2 * kOne), -6 * kOne);
    EXPECT_EQ(FixedMul(3 * kOne, -2 * kOne), -6 * kOne);
    EXPECT_EQ(FixedMul(-3 * kOne, -2 * kOne), 6 * kOne);
    EXPECT_EQ(FixedMul(0, -5), 0);
    EXPECT_EQ(FixedMul(-5, 0), 0);
    EXPECT_EQ(FixedMul(0, kMin), 0);

    // Halves round away from zero, anything less rounds toward it.
    EXPECT_EQ(FixedMul(1, 0x8000), 1);
    EXPECT_EQ(FixedMul(-1, 0x8000), -1);
    EXPECT_EQ(FixedMul(1, 0x7FFF), 0);
    EXPECT_EQ(FixedMul(-1, 0x7FFF), 0);
    EXPECT_EQ(FixedMul(3, -0x8000), -2);

    EXPECT_EQ(FixedMul(0x7FFFFFFF, 0x00020000), kMax);
    EXPECT_EQ(FixedMul(kMax - 1, kOne), kMax - 1);
    EXPECT_EQ(FixedMul(kMax, kOne), kMax);
    EXPECT_EQ(FixedMul(kMax, kOne + 1), kMax);
    EXPECT_EQ(FixedMul(0x40000000, 2 * kOne), kMax) << "2^31 is one past the largest";
    EXPECT_EQ(FixedMul(kMin + 1, kOne), kMin + 1);
    EXPECT_EQ(FixedMul(kMin, kOne), kMin);
    EXPECT_EQ(FixedMul(-0x40000000, 2 * kOne), kMin) << "-2^31 is representable";
    EXPECT_EQ(FixedMul(-0x40000001, 2 * kOne), kMin);
    EXPECT_EQ(FixedMul(kMin, kOne + 1), kMin);
    EXPECT_EQ(FixedMul(kMin, kMin), kMax);
    EXPECT_EQ(FixedMul(kMin, kMax), kMin);
    EXPECT_EQ(FixedMul(kMin, -kOne), kMax);
}

TEST(ZYRFixedTest, FracmulRoundsAndSaturates) {
    EXPECT_EQ(fracmul(kFracOne, kFracOne), kFracOne);
    EXPECT_EQ(fracmul(kFracOne / 2, -kFracOne), -kFracOne / 2);
    EXPECT_EQ(fracmul(-kFracOne / 2, -kFracOne / 2), kFracOne / 4);
    EXPECT_EQ(fracmul(0, -7), 0);
    EXPECT_EQ(fracmul(1, 0x20000000), 1);
    EXPECT_EQ(fracmul(-1, 0x20000000), -1);
    EXPECT_EQ(fracmul(1, 0x1FFFFFFF), 0);
    EXPECT_EQ(fracmul(-1, 0x1FFFFFFF), 0);

    EXPECT_EQ(fracmul(kMax - 1, kFracOne), kMax - 1);
    EXPECT_EQ(fracmul(kMax, kFracOne), kMax);
    EXPECT_EQ(fracmul(kMax, kFracOne + 1), kMax);
    EXPECT_EQ(fracmul(kMin + 1, kFracOne), kMin + 1);
    EXPECT_EQ(fracmul(kMin, kFracOne), kMin);
    EXPECT_EQ(fracmul(kMin, kFracOne + 1), kMin);
    EXPECT_EQ(fracmul(kMin, kMin), kMax);
    EXPECT_EQ(fracmul(kMin, -kFracOne), kMax);

    // The product needs more than 53 bits here; rounded through a double it would
    // land on the half and round up.
    EXPECT_EQ(fracmul(0x3172c8f0, 0x2a92a8b3), 551855119);
    EXPECT_EQ(fracmul(-0x3172c8f0, 0x2a92a8b3), -551855119);
}

TEST(ZYRFixedTest, TFixedDivTruncatesAndSaturates) {
    EXPECT_EQ(TFixedDiv(0x00010000, 0x00030000), 0x00005555);
    EXPECT_EQ(TFixedDiv(-0x00010000, 0x00030000), -0x00005555) << "truncation is toward zero";
    EXPECT_EQ(TFixedDiv(0x00010000, -0x00030000), -0x00005555);
    EXPECT_EQ(TFixedDiv(-0x00010000, -0x00030000), 0x00005555);
    EXPECT_EQ(TFixedDiv(2 * kOne, 3 * kOne), 0xAAAA) << "no rounding up";
    EXPECT_EQ(TFixedDiv(0, -5), 0);

    EXPECT_EQ(TFixedDiv(-5, 0), kMin);
    EXPECT_EQ(TFixedDiv(kMin, 0), kMin);
    EXPECT_EQ(TFixedDiv(0, 0), kMax);
    EXPECT_EQ(TFixedDiv(5, 0), kMax);

    EXPECT_EQ(TFixedDiv(kMax - 1, kOne), kMax - 1);
    EXPECT_EQ(TFixedDiv(kMax, kOne), kMax);
    EXPECT_EQ(TFixedDiv(0x8000, 1), kMax) << "2^31";
    EXPECT_EQ(TFixedDiv(0x7FFF, 1), 0x7FFF0000);
    EXPECT_EQ(TFixedDiv(kMin + 1, kOne), kMin + 1);
    EXPECT_EQ(TFixedDiv(kMin, kOne), kMin);
    EXPECT_EQ(TFixedDiv(-0x8000, 1), kMin);
    EXPECT_EQ(TFixedDiv(-0x8001, 1), kMin);
    EXPECT_EQ(TFixedDiv(kMin, -kOne), kMax);
    EXPECT_EQ(TFixedDiv(kMin, -1), kMax);
}

TEST(ZYRFixedTest, FixratioRoundsAndSaturates) {
    EXPECT_EQ(fixratio(1, 3), 0x15555555);
    EXPECT_EQ(fixratio(2, 3), 0x2AAAAAAB) << "rounded, unlike TFixedDiv";
    EXPECT_EQ(fixratio(-1, 3), -0x15555555);
    EXPECT_EQ(fixratio(2, -3), -0x2AAAAAAB);
    EXPECT_EQ(fixratio(-2, -3), 0x2AAAAAAB);
    EXPECT_EQ(fixratio(1, kMin), -1) << "-0.5 rounds away from zero";
    EXPECT_EQ(fixratio(-1, kMin), 1);
    EXPECT_EQ(fixratio(0, -3), 0);

    EXPECT_EQ(fixratio(-5, 0), kMin);
    EXPECT_EQ(fixratio(0, 0), kMax);
    EXPECT_EQ(fixratio(5, 0), kMax);

    EXPECT_EQ(fixratio(1, 1), kFracOne);
    EXPECT_EQ(fixratio(kMax - 1, kFracOne), kMax - 1);
    EXPECT_EQ(fixratio(kMax, kFracOne), kMax);
    EXPECT_EQ(fixratio(kMax, kFracOne - 1), kMax);
    EXPECT_EQ(fixratio(2, 1), kMax);
    EXPECT_EQ(fixratio(kMin + 1, kFracOne), kMin + 1);
    EXPECT_EQ(fixratio(kMin, kFracOne), kMin);
    EXPECT_EQ(fixratio(kMin, kFracOne - 1), kMin);
    EXPECT_EQ(fixratio(-2, 1), kMin);
    EXPECT_EQ(fixratio(-3, 1), kMin);
    EXPECT_EQ(fixratio(kMin, -1), kMax);

    // Close to a half: a double quotient rounds this one the wrong way.
    EXPECT_EQ(fixratio(0x57046cea, 0x72bbc2b1), 814358052);
}

TEST(ZYRFixedTest, FixedMulDivSignsRoundingAndOverflow) {
    EXPECT_EQ(FixedMulDiv(0x40000000, 0x40000000, 0x40000000, false), 0x40000000);
    EXPECT_EQ(FixedMulDiv(7, 1, 2, false), 3);
    EXPECT_EQ(FixedMulDiv(7, 1, 2, true), 4);
    EXPECT_EQ(FixedMulDiv(-7, 1, 2, true), -4);
    EXPECT_EQ(FixedMulDiv(-7, 1, 2, false), -3);
    EXPECT_EQ(FixedMulDiv(7, -1, 2, true), -4);
    EXPECT_EQ(FixedMulDiv(7, 1, -2, true), -4);
    EXPECT_EQ(FixedMulDiv(-7, -1, 2, true), 4);
    EXPECT_EQ(FixedMulDiv(-7, -1, -2, true), -4);
    EXPECT_EQ(FixedMulDiv(5, 1, 3, true), 2) << "2/3 of a unit rounds up";
    EXPECT_EQ(FixedMulDiv(4, 1, 3, true), 1);
    EXPECT_EQ(FixedMulDiv(0, -5, 3, true), 0);
    EXPECT_EQ(FixedMulDiv(0, 5, -3, false), 0);

    EXPECT_EQ(FixedMulDiv(1, 1, 0, false), kMax);
    EXPECT_EQ(FixedMulDiv(-1, 1, 0, true), kMin);
    EXPECT_EQ(FixedMulDiv(-1, -1, 0, false), kMax);
    EXPECT_EQ(FixedMulDiv(0, 0, 0, false), kMax);

    EXPECT_EQ(FixedMulDiv(kMax - 1, 1, 1, false), kMax - 1);
    EXPECT_EQ(FixedMulDiv(kMax, 1, 1, false), kMax);
    EXPECT_EQ(FixedMulDiv(0x40000000, 2, 1, false), kMax);
    EXPECT_EQ(FixedMulDiv(kMin + 1, 1, 1, false), kMin + 1);
    EXPECT_EQ(FixedMulDiv(kMin, 1, 1, false), kMin);
    EXPECT_EQ(FixedMulDiv(kMin, -1, 1, false), kMax);
    EXPECT_EQ(FixedMulDiv(kMin, kMin, kMin, false), kMin);
    EXPECT_EQ(FixedMulDiv(kMax, kMax, kMax, true), kMax);

    // 65535 * 65537 / 2 = 2^31 - 0.5: fits truncated, overflows once rounded.
    EXPECT_EQ(FixedMulDiv(65535, 65537, 2, false), kMax);
    EXPECT_EQ(FixedMulDiv(65535, 65537, 2, true), kMax);
    EXPECT_EQ(FixedMulDiv(-65535, 65537, 2, false), kMin + 1);
    EXPECT_EQ(FixedMulDiv(-65535, 65537, 2, true), kMin);
    // 641 * 6700417 / 2 = 2^31 + 0.5.
    EXPECT_EQ(FixedMulDiv(-641, 6700417, 2, false), kMin);
    EXPECT_EQ(FixedMulDiv(641, 6700417, 2, false), kMax);
}

TEST(ZYRFixedTest, PFloatToFixedRoundsAndSaturates) {
    EXPECT_EQ(toFixed(1.5f), 0x00018000);
    EXPECT_EQ(toFixed(-0.5f), static_cast<int32_t>(0xFFFF8000));
    EXPECT_EQ(toFixed(32768.0f), kMax);
    EXPECT_EQ(toFixed(-32768.0f), kMin);
    EXPECT_EQ(toFixed(1e10f), kMax);
    EXPECT_EQ(toFixed(-1e10f), kMin);
    EXPECT_EQ(toFixed(0.0f), 0);
    EXPECT_EQ(toFixed(-0.0f), 0);

    EXPECT_EQ(toFixed(std::nextafter(32768.0f, 0.0f)), 0x7FFFFF80);
    EXPECT_EQ(toFixed(std::nextafter(-32768.0f, 0.0f)), -0x7FFFFF80);
    EXPECT_EQ(toFixed(std::nextafter(-32768.0f, -1e9f)), kMin);

    const float half = 0.5f / 65536;
    EXPECT_EQ(toFixed(half), 1);
    EXPECT_EQ(toFixed(-half), -1);
    EXPECT_EQ(toFixed(std::nextafter(half, 0.0f)), 0);
    EXPECT_EQ(toFixed(-std::nextafter(half, 0.0f)), 0);

    // 2^23 + 1 units: an exact Fixed value, which must not round to an even neighbour.
    EXPECT_EQ(toFixed(8388609.0f / 65536), 8388609);
    EXPECT_EQ(toFixed(-8388609.0f / 65536), -8388609);

    EXPECT_EQ(toFixed(std::numeric_limits<float>::infinity()), kMax);
    EXPECT_EQ(toFixed(-std::numeric_limits<float>::infinity()), kMin);
    EXPECT_EQ(toFixed(std::numeric_limits<float>::quiet_NaN()), 0);
    EXPECT_EQ(toFixed(std::numeric_limits<float>::denorm_min()), 0);
}

TEST(ZYRFixedTest, RandomSweepAgainstExactArithmetic) {
    constexpr int kCases = 1000000;
    Operands ops(20240611);
    for (int i = 0; i < kCases; ++i) {
        const int32_t a = ops.next();
        const int32_t b = ops.next();
        const int32_t c = ops.next();
        ASSERT_EQ(FixedMul(a, b), refFixedMul(a, b)) << "FixedMul(" << a << ", " << b << ")";
        ASSERT_EQ(fracmul(a, b), refFracmul(a, b)) << "fracmul(" << a << ", " << b << ")";
        ASSERT_EQ(TFixedDiv(a, b), refTFixedDiv(a, b)) << "TFixedDiv(" << a << ", " << b << ")";
        ASSERT_EQ(fixratio(a, b), refFixratio(a, b)) << "fixratio(" << a << ", " << b << ")";
        const bool rounded = (i & 1) != 0;
        ASSERT_EQ(FixedMulDiv(a, b, c, rounded), refFixedMulDiv(a, b, c, rounded))
            << "FixedMulDiv(" << a << ", " << b << ", " << c << ", " << rounded << ")";
    }

    std::mt19937 rng(99);
    std::uniform_real_distribution<float> inRange(-40000.0f, 40000.0f);
    for (int i = 0; i < kCases; ++i) {
        // Half arbitrary bit patterns (NaNs, infinities, subnormals), half ordinary values.
        const float x = (i & 1) ? std::bit_cast<float>(static_cast<uint32_t>(rng()))
                                : std::ldexp(inRange(rng), -static_cast<int>(rng() % 24));
        ASSERT_EQ(toFixed(x), refPFloatToFixed(x)) << "PFloatToFixed(" << x << ")";
    }
}
