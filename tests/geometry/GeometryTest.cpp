#include <gtest/gtest.h>

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstdint>
#include <limits>
#include <random>
#include <tuple>
#include <vector>

#include "zyr/std/core/CZYRError.h"
#include "zyr/std/geometry/CZYRMatrix.h"
#include "zyr/std/geometry/CZYRRect.h"
#include "zyr/std/geometry/CZYRSampledFunc.h"
#include "zyr/std/geometry/ZYRFixed.h"

using namespace ZYRStd;
using namespace ZYRPublic;

namespace {

template <class Call> void expectBadParam(Call call, const char* message, const char* source) {
    try {
        call();
        ADD_FAILURE() << "expected " << message;
    } catch (const CZYRError& e) {
        EXPECT_EQ(
            std::tuple(e.getError(), std::string(e.getMessage()), std::string(e.getSrcFileName())),
            std::tuple(kZYRErrorBadParam, std::string(message), std::string(source)));
    }
}

::testing::AssertionResult near(const CZYRMatrix& got, const CZYRMatrix& want, double eps) {
    if (got.equal(want, eps))
        return ::testing::AssertionSuccess();
    const sZYRMatrix& g = got;
    return ::testing::AssertionFailure() << "got (" << g.a << ", " << g.b << ", " << g.c << ", "
                                         << g.d << ", " << g.tx << ", " << g.ty << ")";
}

const CZYRMatrix kA(1, 2, 3, 4, 5, 6);
const CZYRMatrix kB(7, 8, 9, 10, 11, 12);
const double kNaN = std::numeric_limits<double>::quiet_NaN();

::testing::AssertionResult is(const sZYRRect& g, double l, double b, double r, double t) {
    if (g.left == l && g.bottom == b && g.right == r && g.top == t)
        return ::testing::AssertionSuccess();
    return ::testing::AssertionFailure() << "got left " << g.left << " bottom " << g.bottom
                                         << " right " << g.right << " top " << g.top;
}

TEST(CZYRMatrixTest, ComparisonsInversionProductsPointsAndBoxes) {
    EXPECT_TRUE(CZYRMatrix().isIdentity() && CZYRMatrix(1, -0.0, 0, 1, 0, 0).isIdentity());
    EXPECT_FALSE(CZYRMatrix(1, 0, 0, 1, 0, 1e-300).isIdentity());
    const CZYRMatrix bad(1, 0, 0, 1, 0, kNaN);
    EXPECT_FALSE(bad.isValid() || bad == bad || bad.equal(bad, 1.0)) << "NaN is never equal";
    EXPECT_TRUE(kA.isValid() && kA != kB);
    // eps is inclusive for every entry, and any one entry beyond it counts.
    const CZYRMatrix shifted(1.5, 2.5, 3.5, 4.5, 5.5, 6.5);
    EXPECT_TRUE(kA.equal(shifted, 0.5));
    EXPECT_FALSE(kA.equal(shifted, 0.4999) || kA.equal(CZYRMatrix(1, 2, 3, 4.25, 5, 6), 0.2));

    float f[6];
    CZYRMatrix(0.1, 2, 3, 4, 1e40, -7).getMtxVals(f[0], f[1], f[2], f[3], f[4], f[5]);
    EXPECT_EQ(std::vector<float>(f, f + 6), (std::vector<float>{0.1f, 2, 3, 4, INFINITY, -7}))
        << "beyond float range narrows to infinity";
    EXPECT_EQ(std::pair(kA.determinant(), kA.resolution(72)), std::pair(-2.0, 72 * std::sqrt(2.0)));
    std::mt19937_64 rng(7);
    std::uniform_real_distribution<double> linear(-10.0, 10.0), shift(-1000.0, 1000.0);
    for (int i = 0; i < 1000; ++i) {
        const CZYRMatrix A(linear(rng), linear(rng), linear(rng), linear(rng), shift(rng),
                           shift(rng));
        if (std::fabs(A.determinant()) < 0.5)
            continue;
        CZYRMatrix inv;
        ZYRMatrix_invert(A, inv);
        ASSERT_TRUE(near(A * inv, CZYRMatrix(), 1e-9) && near(inv * A, CZYRMatrix(), 1e-9)) << i;
    }
    CZYRMatrix same = kA;
    ZYRMatrix_invert(same, same);
    EXPECT_TRUE(near(same * kA, CZYRMatrix(), 1e-12)) << "source and target may be one matrix";

    // Exactly singular: the error, and neither matrix changes.
    CZYRMatrix singular(1, 2, 2, 4, 0, 0), target = kB;
    EXPECT_FALSE(singular.invertible());
    expectBadParam([&] { singular.invert(); }, "Inverting Singular Matrix",
                   "source/zyr/std/CZYRMatrix");
    EXPECT_THROW(ZYRMatrix_invert(singular, target), CZYRError);
    EXPECT_TRUE(singular == CZYRMatrix(1, 2, 2, 4, 0, 0) && target == kB);

    // invert has no tolerance; invertible judges the determinant as a float.
    CZYRMatrix tiny(1e-20, 0, 0, 1e-20, 0, 0);
    const bool refused = tiny.invertible();
    tiny.invert();
    EXPECT_TRUE(!refused && near(tiny, CZYRMatrix(1e20, 0, 0, 1e20, 0, 0), 1e5));
    // The determinant must exceed the least float, not reach it.
    const double fmin = std::numeric_limits<float>::min();
    EXPECT_FALSE(CZYRMatrix(1, 0, 0, fmin, 0, 0).invertible() ||
                 CZYRMatrix(kNaN, 0, 0, 1, 0, 0).invertible());
    EXPECT_TRUE(CZYRMatrix(1, 0, 0, 2 * fmin, 0, 0).invertible() &&
                CZYRMatrix(0, 1e-3, 1, 0, 0, 0).invertible() &&
                CZYRMatrix(1e200, 0, 0, 1e200, 0, 0).invertible());
    // Worked by hand: in A times B, A applies first.
    const CZYRMatrix AB(25, 28, 57, 64, 100, 112), BA(31, 46, 39, 58, 52, 76);
    EXPECT_TRUE(kA * kB == AB && kB * kA == BA);
    double x = 1, y = 1;
    kA.transformPoint(x, y);
    ZYRMatrix_transformPoint(kB, x, y);
    EXPECT_EQ(std::pair(x, y), std::pair(182.0, 204.0));

    const double rad = 30 * 3.141592653589793 / 180;
    const CZYRMatrix R(std::cos(rad), std::sin(rad), -std::sin(rad), std::cos(rad), 0, 0);
    // Prefix (operand first) and postfix (MTX) forms, as methods and free functions.
    const std::tuple<void (*)(CZYRMatrix&), CZYRMatrix, double> forms[] = {
        {[](CZYRMatrix& m) { m *= kB; }, AB, 0},
        {[](CZYRMatrix& m) { m.concat(kB); }, BA, 0},
        {[](CZYRMatrix& m) { m.concatMTX(kB); }, AB, 0},
        {[](CZYRMatrix& m) { m.translate(2, 3); }, {1, 2, 3, 4, 16, 22}, 0},
        {[](CZYRMatrix& m) { ZYRMatrix_translate(m, 2, 3); }, {1, 2, 3, 4, 16, 22}, 0},
        {[](CZYRMatrix& m) { m.translateMTX(2, 3); }, {1, 2, 3, 4, 7, 9}, 0},
        {[](CZYRMatrix& m) { ZYRMatrix_translateMTX(m, 2, 3); }, {1, 2, 3, 4, 7, 9}, 0},
        {[](CZYRMatrix& m) { m.scale(2, 3); }, {2, 4, 9, 12, 5, 6}, 0},
        {[](CZYRMatrix& m) { ZYRMatrix_scale(m, 2, 3); }, {2, 4, 9, 12, 5, 6}, 0},
        {[](CZYRMatrix& m) { m.scaleMTX(2, 3); }, {2, 6, 6, 12, 10, 18}, 0},
        {[](CZYRMatrix& m) { ZYRMatrix_scaleMTX(m, 2, 3); }, {2, 6, 6, 12, 10, 18}, 0},
        {[](CZYRMatrix& m) { m.rotate(90); }, {3, 4, -1, -2, 5, 6}, 1e-12},
        {[](CZYRMatrix& m) { m.rotateMTX(90); }, {-2, 1, -4, 3, -6, 5}, 1e-12},
        {[](CZYRMatrix& m) { ZYRMatrix_rotate(m, 30); }, R * kA, 1e-12},
        {[](CZYRMatrix& m) { ZYRMatrix_rotateMTX(m, 30); }, kA * R, 1e-12},
    };
    for (const auto& [apply, want, eps] : forms) {
        CZYRMatrix m = kA;
        apply(m);
        EXPECT_TRUE(near(m, want, eps));
    }
    CZYRMatrix m;
    m.rotate(90);
    const double cos90 = std::cos(90 * 3.141592653589793 / 180); // not 0 in double, and kept
    EXPECT_TRUE(m == CZYRMatrix(cos90, 1, -1, cos90, 0, 0));
    float fx = 1.5f, fy = -2.0f, gx = 16777216.0f, gy = 1.0f;
    kA.transformPoint(fx, fy);
    // In float, 2^24 + 1 would round away before the translation cancels 2^24.
    ZYRMatrix_transformPoint(CZYRMatrix(1, 0, 1, 1, -16777216.0, 0), gx, gy);
    EXPECT_EQ(std::tuple(fx, fy, gx), std::tuple(0.5f, 1.0f, 1.0f));

    // A mirroring and rotating matrix: the box holds the extremes of the four corners.
    const sZYRRect box{-1, 2, 3, 4}; // left, bottom, top, right
    for (const sZYRRect& got : {CZYRMatrix(-2, 1, 3, -4, 1, 2).transformBBox(box),
                                ZYRMatrix_transformBBox(CZYRMatrix(-2, 1, 3, -4, 1, 2), box)})
        EXPECT_TRUE(is(got, -1, -11, 12, -2));
}

struct Collect : IEncodedDataCBProc {
    bool encodedSample(int index, float value) override {
        EXPECT_EQ(index, static_cast<int>(values.size()));
        values.push_back(value);
        return true;
    }
    std::vector<float> values;
};

std::vector<float> samples(std::vector<CZYRSampledFunc<float>::Point> points,
                           sZYRRangeT<float> domain, sZYRRangeT<float> range, int n) {
    CZYRSampledFunc<float> f(domain, range);
    f.setPoints(points.data(), static_cast<unsigned int>(points.size()));
    Collect out;
    const auto eightBit = Caculate8BitEncodedSamples(CZYRSampledFunc<float>(f), n, out);
    EXPECT_TRUE(eightBit.min == 0.0f && eightBit.max == 255.0f);
    return out.values;
}

constexpr int32_t kMin = std::numeric_limits<int32_t>::min(), kMax = -(kMin + 1);
constexpr int32_t kOne = 0x00010000, kFrac = 0x40000000;
using i128 = __int128;

// n / d to the nearest integer, halves away from zero.
i128 nearest(i128 n, i128 d) {
    if (d < 0)
        n = -n, d = -d;
    return n >= 0 ? (2 * n + d) / (2 * d) : -((-2 * n + d) / (2 * d));
}

int32_t clamp32(i128 v) {
    return v > kMax ? kMax : v < kMin ? kMin : static_cast<int32_t>(v);
}

// The exact results, saturated; a division by zero saturates by the sign of the rest.
int32_t refFixedMulDiv(int32_t a, int32_t b, int32_t c, bool rounded) {
    if (c == 0)
        return ((a < 0) + (b < 0)) % 2 ? kMin : kMax;
    return clamp32(rounded ? nearest(i128{a} * b, c) : i128{a} * b / c);
}

int32_t refDiv(int32_t a, int32_t b, int shift, bool rounded) {
    if (b == 0)
        return a < 0 ? kMin : kMax;
    return clamp32(rounded ? nearest(i128{a} << shift, b) : (i128{a} << shift) / b);
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

// Signs, halves, each extreme and its neighbours, and past faults: products over 53 bits, quotients
// near a half, 65535 * 65537 / 2 = 2^31 - 0.5 and 641 * 6700417 / 2 = 2^31 + 0.5.
constexpr int32_t kSpecial[] = {
    0,          1,          -1,         2,          3,           -5,         kOne,       -kOne,
    kOne + 1,   3 * kOne,   -3 * kOne,  0x18000,    kFrac,       -kFrac,     kFrac + 1,  kFrac - 1,
    0x20000000, 0x1FFFFFFF, kMin,       kMax,       kMin + 1,    kMax - 1,   0x7FFF,     0x8000,
    -0x8000,    -0x8001,    0x7FFF0000, 0x3172c8f0, -0x3172c8f0, 0x2a92a8b3, 0x57046cea, 0x72bbc2b1,
    65535,      -65535,     65537,      641,        -641,        6700417};

int32_t operand(std::mt19937_64& rng) {
    const uint64_t r = rng();
    const auto high = static_cast<int32_t>(r >> 32);
    const int32_t choices[] = {high, high >> (r >> 3) % 32, high >> 14,
                               kSpecial[(r >> 32) % std::size(kSpecial)]};
    return choices[r % 4];
}

::testing::AssertionResult exact(int32_t a, int32_t b, int32_t c, bool rounded) {
    const i128 p = i128{a} * b;
    if (FixedMul(a, b) != clamp32(nearest(p, 1 << 16)) ||
        fracmul(a, b) != clamp32(nearest(p, 1 << 30)) ||
        TFixedDiv(a, b) != refDiv(a, b, 16, false) || fixratio(a, b) != refDiv(a, b, 30, true) ||
        FixedMulDiv(a, b, c, rounded) != refFixedMulDiv(a, b, c, rounded))
        return ::testing::AssertionFailure()
               << a << ", " << b << ", " << c << (rounded ? " rounded" : "");
    return ::testing::AssertionSuccess();
}

TEST(GeometryTest, FixedPointRectanglesAndResampling) {
    const float half = 0.5f / 65536, inf = std::numeric_limits<float>::infinity();
    EXPECT_EQ(std::pair(toFixed(1.5f), toFixed(std::nextafter(32768.0f, 0.0f))),
              std::pair(0x00018000, 0x7FFFFF80));
    // 2^23 + 1 units is exact and must not round to an even neighbour.
    for (const float x :
         {-0.5f, -0.0f, 32768.0f, -32768.0f, 1e10f, -1e10f, std::nextafter(32768.0f, 0.0f),
          std::nextafter(-32768.0f, 0.0f), std::nextafter(-32768.0f, -inf), half, -half,
          std::nextafter(half, 0.0f), -std::nextafter(half, 0.0f), 8388609.0f / 65536,
          -8388609.0f / 65536, inf, -inf, std::numeric_limits<float>::quiet_NaN()})
        EXPECT_EQ(toFixed(x), refPFloatToFixed(x)) << "PFloatToFixed(" << x << ")";
    std::mt19937_64 rng(20240611);
    for (int i = 0; i < 1000000; ++i) {
        ASSERT_TRUE(exact(operand(rng), operand(rng), operand(rng), (i & 1) != 0));
        // Half arbitrary bit patterns (NaNs, infinities, subnormals), half ordinary values.
        const uint64_t r = rng();
        const float x = (i & 1) ? std::bit_cast<float>(static_cast<uint32_t>(r))
                                : std::ldexp(static_cast<float>(static_cast<int32_t>(r >> 32)),
                                             -16 - static_cast<int>(r % 40));
        ASSERT_EQ(toFixed(x), refPFloatToFixed(x)) << "PFloatToFixed(" << x << ")";
    }
    EXPECT_EQ(
        std::vector({fracmul(0x3172c8f0, 0x2a92a8b3), fixratio(0x57046cea, 0x72bbc2b1),
                     FixedMul(0x00018000, 0x00018000), TFixedDiv(0x00010000, 0x00030000),
                     FixedMulDiv(-65535, 65537, 2, false), FixedMulDiv(-65535, 65537, 2, true)}),
        std::vector({551855119, 814358052, 0x00024000, 0x5555, kMin + 1, kMin}));
    for (const int32_t a : kSpecial)
        for (const int32_t b : kSpecial)
            for (const int32_t c : kSpecial)
                for (const bool rounded : {false, true})
                    ASSERT_TRUE(exact(a, b, c, rounded));
    const sZYRRect rec = CZYRRect(1, 2, 3, 4); // left, bottom, right, top
    EXPECT_EQ(std::pair(rec.top, rec.right), std::pair(4.0, 3.0)) << "top before right";
    const double huge = std::numeric_limits<double>::max();
    CZYRRect r;
    EXPECT_TRUE(is(r, huge, huge, -huge, -huge) && r.isempty() && !r.isBoundingBox());
    r.updateBBoxPoint(5, 6);
    EXPECT_TRUE(is(r, 5, 6, 5, 6) && r.isBoundingBox() && r.isempty()) << "a point has no area";
    r.updateBBoxPoint(-1, 10);
    r.updateBBoxPoint(2, 0);
    EXPECT_TRUE(is(r, -1, 0, 5, 10) && !r.isempty());
    EXPECT_TRUE(CZYRRect(0, 0, 1, 0).isempty() && CZYRRect(0, 0, 0, 1).isempty());
    CZYRRect u; // the default is neutral for union
    u.unionRect(CZYRRect(1, 2, 3, 4));
    u.unionRect(CZYRRect(-5, 3, 0, 9));
    EXPECT_TRUE(is(u, -5, 2, 3, 9));
    r.setRect(CZYRRect(3, 0, 1, 1));
    EXPECT_TRUE(is(r, 3, 0, 1, 1)) << "setRect does not check";
    EXPECT_NO_THROW(r.setBoundingBox(CZYRRect(0, 0, 0, 0)));
    expectBadParam([&] { r.setBoundingBox(CZYRRect(0, 5, 1, 4)); }, "Invalid bounding box set",
                   "source/zyr/std/CZYRRect");
    EXPECT_TRUE(is(r, 0, 5, 1, 4)) << "the refused values are kept";
    r.setRect(CZYRRect(0, 0, 10, 10));
    r.intersectRect(CZYRRect(5, -5, 15, 8));
    EXPECT_TRUE(is(r, 5, 0, 10, 8));
    // Closed rectangles: a shared edge or corner, or containment, touches.
    const CZYRRect unit(0, 0, 1, 1);
    for (const CZYRRect& other : {CZYRRect(1, 0, 2, 1), CZYRRect(1, 1, 2, 2),
                                  CZYRRect(0.25, 0.25, 0.5, 0.5), CZYRRect(-1, -1, 0, 0)})
        EXPECT_TRUE(unit.touch(other) && other.touch(unit));
    for (const CZYRRect& other : {CZYRRect(1.5, 0, 2, 1), CZYRRect(0, 1.001, 1, 2),
                                  CZYRRect(-2, 0, -0.5, 1), CZYRRect(0, -2, 1, -0.5)})
        EXPECT_FALSE(unit.touch(other) || other.touch(unit));
    for (const CZYRRect& other :
         {CZYRRect(1, 0, 2, 1), CZYRRect(0, 1, 1, 2), CZYRRect(5, 5, 6, 6)}) {
        CZYRRect edge = unit;
        edge.intersectRect(other);
        EXPECT_TRUE(is(edge, 0, 0, 0, 0));
    }
    using V = std::vector<float>;
    EXPECT_EQ(samples({{0, 0}, {1, 1}}, {0, 1}, {0, 1}, 3), (V{0.0f, 127.5f, 255.0f}));
    // Points cover 0.25..0.75 of the domain: outside them the end values hold.
    const V held = samples({{0.25f, 0.2f}, {0.5f, 0.6f}, {0.75f, 0.4f}}, {0, 1}, {0, 1}, 5);
    const V want{0.2f * 255, 0.2f * 255, 0.6f * 255, 0.4f * 255, 0.4f * 255};
    for (size_t i = 0; i < want.size(); ++i)
        EXPECT_FLOAT_EQ(held.at(i), want[i]) << i;
    EXPECT_EQ(samples({{0, -1}, {1, 2}}, {0, 1}, {0, 1}, 2), (V{0, 255})) << "clamped";
    EXPECT_EQ(samples({{0, 0.5f}, {1, 0.5f}}, {0, 1}, {0.25f, 0.75f}, 2), (V{127.5f, 127.5f}));
    EXPECT_EQ(samples({{0, 0}, {1, 1}}, {0, 1}, {0.5f, 0.5f}, 5), (V{0, 0, 255, 255, 255}));
    // Two points at the same x: left of it the first y, from it on the second.
    EXPECT_EQ(samples({{0.5f, 0}, {0.5f, 1}}, {0, 1}, {0, 1}, 3), (V{0, 255, 255}));
    EXPECT_TRUE(samples({{0, 0}, {1, 1}}, {0.25f, 1}, {0, 1}, 0).empty());
    EXPECT_EQ(samples({{0, 0}, {1, 1}}, {0.25f, 1}, {0, 1}, 1), (V{0.25f * 255}));
    const auto onePoint = [] { samples({{0, 0}}, {0, 1}, {0, 1}, 4); };
    expectBadParam(onePoint, "invalid index", "source/zyr/std/CZYRMemBuffer");
}

} // namespace
