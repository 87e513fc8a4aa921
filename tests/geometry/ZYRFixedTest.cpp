// Fixed-point rounding and saturation, at the boundaries and against exact 128-bit sums.
#include <gtest/gtest.h>

#include <bit>
#include <cmath>
#include <cstdint>
#include <limits>
#include <random>

#include "zyr/std/geometry/ZYRFixed.h"

using namespace ZYRStd;

namespace {

constexpr int32_t kMin = std::numeric_limits<int32_t>::min();
constexpr int32_t kMax = std::numeric_limits<int32_t>::max();
constexpr int32_t kOne = 0x00010000;
constexpr int32_t kFrac = 0x40000000;

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

int32_t refFixedMulDiv(int32_t a, int32_t b, int32_t c, bool rounded) {
    if (c == 0)
        return ((a < 0) + (b < 0)) % 2 ? kMin : kMax;
    return clamp32(rounded ? nearest(i128{a} * b, c) : i128{a} * b / c);
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

// Rows of {a, b, expected}.
template <size_t N>
void expectAll(const char* name, int32_t (*f)(int32_t, int32_t), const int32_t (&rows)[N][3]) {
    for (const auto& r : rows)
        EXPECT_EQ(f(r[0], r[1]), r[2]) << name << "(" << r[0] << ", " << r[1] << ")";
}

// Operands of every scale: full range, a random bit length, small values and the extremes.
int32_t operand(std::mt19937_64& rng) {
    static constexpr int32_t special[] = {0,    1,    -1,       kOne,     -kOne, kFrac,  -kFrac,
                                          kMin, kMax, kMin + 1, kMax - 1, 2,     0x8000, -0x8000};
    const uint64_t r = rng();
    const auto high = static_cast<int32_t>(r >> 32);
    switch (r % 4) {
    case 0:
        return high;
    case 1:
        return high >> (r >> 3) % 32;
    case 2:
        return high >> 14;
    default:
        return special[(r >> 32) % std::size(special)];
    }
}

} // namespace

// Each table: signs and zeros, then halves, then one unit either side of each extreme.
TEST(ZYRFixedTest, ProductsRoundHalfAwayAndSaturate) {
    // clang-format off
    const int32_t fixedMulRows[][3] = {
        {0x00018000, 0x00018000, 0x00024000}, {3 * kOne, 2 * kOne, 6 * kOne},
        {-3 * kOne, 2 * kOne, -6 * kOne}, {3 * kOne, -2 * kOne, -6 * kOne},
        {-3 * kOne, -2 * kOne, 6 * kOne}, {0, -5, 0}, {-5, 0, 0}, {0, kMin, 0},
        {1, 0x8000, 1}, {-1, 0x8000, -1}, {1, 0x7FFF, 0}, {-1, 0x7FFF, 0}, {3, -0x8000, -2},
        {kMax - 1, kOne, kMax - 1}, {kMax, kOne, kMax}, {kMax, kOne + 1, kMax},
        {0x40000000, 2 * kOne, kMax}, {0x7FFFFFFF, 0x00020000, kMax},
        {kMin + 1, kOne, kMin + 1}, {kMin, kOne, kMin}, {kMin, kOne + 1, kMin},
        {-0x40000000, 2 * kOne, kMin}, {kMin, kMin, kMax}, {kMin, kMax, kMin}, {kMin, -kOne, kMax},
    };
    const int32_t fracmulRows[][3] = {
        {kFrac, kFrac, kFrac}, {kFrac / 2, -kFrac, -kFrac / 2}, {-kFrac / 2, -kFrac / 2, kFrac / 4},
        {0, -7, 0}, {1, 0x20000000, 1}, {-1, 0x20000000, -1}, {1, 0x1FFFFFFF, 0},
        {-1, 0x1FFFFFFF, 0},
        {kMax - 1, kFrac, kMax - 1}, {kMax, kFrac, kMax}, {kMax, kFrac + 1, kMax},
        {kMin + 1, kFrac, kMin + 1}, {kMin, kFrac, kMin}, {kMin, kFrac + 1, kMin},
        {kMin, kMin, kMax}, {kMin, -kFrac, kMax},
        // More than 53 bits of product: through a double these would round up.
        {0x3172c8f0, 0x2a92a8b3, 551855119}, {-0x3172c8f0, 0x2a92a8b3, -551855119},
    };
    // clang-format on
    expectAll("FixedMul", FixedMul, fixedMulRows);
    expectAll("fracmul", fracmul, fracmulRows);
}

TEST(ZYRFixedTest, QuotientsTruncateOrRoundAndSaturate) {
    // clang-format off
    const int32_t tFixedDivRows[][3] = {
        {0x00010000, 0x00030000, 0x5555}, {-0x00010000, 0x00030000, -0x5555},
        {0x00010000, -0x00030000, -0x5555}, {-0x00010000, -0x00030000, 0x5555}, {0, -5, 0},
        {2 * kOne, 3 * kOne, 0xAAAA}, {-5, 0, kMin}, {kMin, 0, kMin}, {0, 0, kMax}, {5, 0, kMax},
        {kMax - 1, kOne, kMax - 1}, {kMax, kOne, kMax}, {0x7FFF, 1, 0x7FFF0000}, {0x8000, 1, kMax},
        {kMin + 1, kOne, kMin + 1}, {kMin, kOne, kMin}, {-0x8000, 1, kMin}, {-0x8001, 1, kMin},
        {kMin, -kOne, kMax}, {kMin, -1, kMax},
    };
    const int32_t fixratioRows[][3] = {
        {1, 3, 0x15555555}, {-1, 3, -0x15555555}, {2, -3, -0x2AAAAAAB}, {-2, -3, 0x2AAAAAAB},
        {0, -3, 0}, {1, kMin, -1}, {-1, kMin, 1}, {-5, 0, kMin}, {0, 0, kMax}, {5, 0, kMax},
        {1, 1, kFrac}, {kMax - 1, kFrac, kMax - 1}, {kMax, kFrac, kMax}, {kMax, kFrac - 1, kMax},
        {2, 1, kMax}, {kMin + 1, kFrac, kMin + 1}, {kMin, kFrac, kMin}, {kMin, kFrac - 1, kMin},
        {-3, 1, kMin}, {kMin, -1, kMax},
        // Close to a half: a double quotient rounds this one the wrong way.
        {0x57046cea, 0x72bbc2b1, 814358052},
    };
    // clang-format on
    expectAll("TFixedDiv", TFixedDiv, tFixedDivRows);
    expectAll("fixratio", fixratio, fixratioRows);
}

TEST(ZYRFixedTest, FixedMulDivSignsRoundingAndOverflow) {
    EXPECT_EQ(FixedMulDiv(0x40000000, 0x40000000, 0x40000000, false), 0x40000000);
    const int32_t signs[][4] = {{7, 1, 2, 4},   {-7, 1, 2, -4}, {7, -1, 2, -4},  {7, 1, -2, -4},
                                {-7, -1, 2, 4}, {-7, 1, -2, 4}, {-7, -1, -2, -4}};
    for (const auto& s : signs) {
        EXPECT_EQ(FixedMulDiv(s[0], s[1], s[2], true), s[3]) << s[0] << " " << s[1] << " " << s[2];
        EXPECT_EQ(FixedMulDiv(s[0], s[1], s[2], false), s[3] - (s[3] > 0 ? 1 : -1));
    }
    // Rows of {a, b, c, rounded, expected}: halves and zeros, division by zero, the extremes;
    // 65535 * 65537 / 2 is 2^31 - 0.5 (fits truncated, overflows once rounded), 641 * 6700417 / 2
    // is 2^31 + 0.5.
    // clang-format off
    const int32_t rows[][5] = {
        {5, 1, 3, 1, 2}, {4, 1, 3, 1, 1}, {0, -5, 3, 1, 0}, {0, 5, -3, 0, 0},
        {1, 1, 0, 0, kMax}, {-1, 1, 0, 1, kMin}, {-1, -1, 0, 0, kMax}, {0, 0, 0, 0, kMax},
        {kMax - 1, 1, 1, 0, kMax - 1}, {kMax, 1, 1, 0, kMax}, {0x40000000, 2, 1, 0, kMax},
        {kMin + 1, 1, 1, 0, kMin + 1}, {kMin, 1, 1, 0, kMin}, {kMin, -1, 1, 0, kMax},
        {kMin, kMin, kMin, 0, kMin}, {65535, 65537, 2, 0, kMax}, {-65535, 65537, 2, 0, kMin + 1},
        {-65535, 65537, 2, 1, kMin}, {-641, 6700417, 2, 0, kMin}, {641, 6700417, 2, 0, kMax},
    };
    // clang-format on
    for (const auto& r : rows)
        EXPECT_EQ(FixedMulDiv(r[0], r[1], r[2], r[3] != 0), r[4])
            << r[0] << " * " << r[1] << " / " << r[2] << (r[3] ? " rounded" : "");
}

TEST(ZYRFixedTest, PFloatToFixedRoundsAndSaturates) {
    const float half = 0.5f / 65536;
    const float inf = std::numeric_limits<float>::infinity();
    const struct {
        float x;
        int32_t want;
    } cases[] = {
        // clang-format off
        {1.5f, 0x00018000}, {-0.5f, static_cast<int32_t>(0xFFFF8000)}, {-0.0f, 0},
        {32768.0f, kMax}, {-32768.0f, kMin}, {1e10f, kMax}, {-1e10f, kMin},
        {std::nextafter(32768.0f, 0.0f), 0x7FFFFF80}, {std::nextafter(-32768.0f, 0.0f), -0x7FFFFF80},
        {std::nextafter(-32768.0f, -inf), kMin}, {half, 1}, {-half, -1},
        {std::nextafter(half, 0.0f), 0}, {-std::nextafter(half, 0.0f), 0},
        // 2^23 + 1 units is exact and must not round to an even neighbour.
        {8388609.0f / 65536, 8388609}, {-8388609.0f / 65536, -8388609},
        {inf, kMax}, {-inf, kMin}, {std::numeric_limits<float>::quiet_NaN(), 0},
        // clang-format on
    };
    for (const auto& c : cases)
        EXPECT_EQ(toFixed(c.x), c.want) << "PFloatToFixed(" << c.x << ")";
}

TEST(ZYRFixedTest, RandomSweepAgainstExactArithmetic) {
    std::mt19937_64 rng(20240611);
    for (int i = 0; i < 1000000; ++i) {
        const int32_t a = operand(rng), b = operand(rng), c = operand(rng);
        const i128 p = i128{a} * b;
        ASSERT_EQ(FixedMul(a, b), clamp32(nearest(p, 1 << 16))) << a << " * " << b;
        ASSERT_EQ(fracmul(a, b), clamp32(nearest(p, 1 << 30))) << a << " * " << b;
        if (b != 0) {
            ASSERT_EQ(TFixedDiv(a, b), clamp32((i128{a} << 16) / b)) << a << " / " << b;
            ASSERT_EQ(fixratio(a, b), clamp32(nearest(i128{a} << 30, b))) << a << " / " << b;
        }
        const bool rounded = (i & 1) != 0;
        ASSERT_EQ(FixedMulDiv(a, b, c, rounded), refFixedMulDiv(a, b, c, rounded))
            << a << " * " << b << " / " << c << (rounded ? " rounded" : "");

        // Half arbitrary bit patterns (NaNs, infinities, subnormals), half ordinary values.
        const uint64_t r = rng();
        const float x = (i & 1) ? std::bit_cast<float>(static_cast<uint32_t>(r))
                                : std::ldexp(static_cast<float>(static_cast<int32_t>(r >> 32)),
                                             -16 - static_cast<int>(r % 40));
        ASSERT_EQ(toFixed(x), refPFloatToFixed(x)) << "PFloatToFixed(" << x << ")";
    }
}
