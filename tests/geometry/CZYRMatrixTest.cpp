// Matrix algebra: product orders, prefix and postfix forms, inversion, bounding boxes.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <random>

#include "zyr/std/core/CZYRError.h"
#include "zyr/std/geometry/CZYRMatrix.h"

using namespace ZYRStd;
using namespace ZYRPublic;

namespace {

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

TEST(CZYRMatrixTest, IdentityValidityAndComparisons) {
    EXPECT_TRUE(CZYRMatrix().isIdentity());
    EXPECT_TRUE(CZYRMatrix(1, -0.0, 0, 1, 0, 0).isIdentity()) << "-0.0 compares equal to 0";
    EXPECT_FALSE(CZYRMatrix(1, 0, 0, 1, 0, 1e-300).isIdentity());

    const CZYRMatrix bad(1, 0, 0, 1, 0, kNaN);
    EXPECT_FALSE(bad.isValid());
    EXPECT_FALSE(bad.isIdentity());
    EXPECT_FALSE(bad == bad) << "a NaN entry makes equality false";
    EXPECT_FALSE(bad.equal(bad, 1.0));
    EXPECT_TRUE(kA.isValid());
    EXPECT_TRUE(kA != kB);

    const CZYRMatrix shifted(1, 2, 3, 4, 5.5, 6);
    EXPECT_TRUE(kA.equal(shifted, 0.5)) << "eps is inclusive";
    EXPECT_FALSE(kA.equal(shifted, 0.4999));
    EXPECT_FALSE(kA.equal(CZYRMatrix(1, 2, 3, 4.25, 5, 6), 0.2)) << "every entry counts";

    CZYRMatrix m;
    m.setMtxVals(0.1, 2, 3, 4, 1e40, -7);
    float fa, fb, fc, fd, ftx, fty;
    m.getMtxVals(fa, fb, fc, fd, ftx, fty);
    EXPECT_EQ(fa, 0.1f);
    EXPECT_TRUE(std::isinf(ftx)) << "values beyond float range narrow to infinity";
    EXPECT_EQ(fty, -7.0f);

    EXPECT_EQ(kA.determinant(), -2.0);
    EXPECT_DOUBLE_EQ(kA.resolution(72), 72 * std::sqrt(2.0));
}

TEST(CZYRMatrixTest, ProductOrders) {
    // Worked by hand: in A times B, A applies first.
    const CZYRMatrix AB(25, 28, 57, 64, 100, 112);
    const CZYRMatrix BA(31, 46, 39, 58, 52, 76);
    EXPECT_TRUE(kA * kB == AB);
    EXPECT_TRUE(kB * kA == BA);

    CZYRMatrix m = kA;
    m *= kB;
    EXPECT_TRUE(m == AB);
    m = kA;
    m.concat(kB);
    EXPECT_TRUE(m == BA) << "concat puts its operand first";
    m = kA;
    m.concatMTX(kB);
    EXPECT_TRUE(m == AB) << "concatMTX puts its operand last";

    double x = 1, y = 1;
    kA.transformPoint(x, y);
    kB.transformPoint(x, y);
    EXPECT_EQ(x, 182);
    EXPECT_EQ(y, 204);
}

TEST(CZYRMatrixTest, PrefixAndPostfixForms) {
    const double rad = 30 * 3.141592653589793 / 180;
    const CZYRMatrix R(std::cos(rad), std::sin(rad), -std::sin(rad), std::cos(rad), 0, 0);
    const struct {
        void (*apply)(CZYRMatrix&);
        CZYRMatrix want;
        double eps;
    } forms[] = {
        {[](CZYRMatrix& m) { m.translate(2, 3); }, {1, 2, 3, 4, 16, 22}, 0},
        {[](CZYRMatrix& m) { m.translateMTX(2, 3); }, {1, 2, 3, 4, 7, 9}, 0},
        {[](CZYRMatrix& m) { m.scale(2, 3); }, {2, 4, 9, 12, 5, 6}, 0},
        {[](CZYRMatrix& m) { m.scaleMTX(2, 3); }, {2, 6, 6, 12, 10, 18}, 0},
        {[](CZYRMatrix& m) { m.rotate(90); }, {3, 4, -1, -2, 5, 6}, 1e-12},
        {[](CZYRMatrix& m) { m.rotateMTX(90); }, {-2, 1, -4, 3, -6, 5}, 1e-12},
        {[](CZYRMatrix& m) { m.rotate(30); }, R * kA, 1e-12},
        {[](CZYRMatrix& m) { m.rotateMTX(30); }, kA * R, 1e-12},
    };
    for (size_t i = 0; i < std::size(forms); ++i) {
        CZYRMatrix m = kA;
        forms[i].apply(m);
        EXPECT_TRUE(near(m, forms[i].want, forms[i].eps)) << "form " << i;
    }

    // cos 90 degrees is not 0 in double, and the rotation keeps that.
    const double cos90 = std::cos(90 * 3.141592653589793 / 180);
    CZYRMatrix m;
    m.rotate(90);
    EXPECT_TRUE(m == CZYRMatrix(cos90, 1, -1, cos90, 0, 0));
    m = CZYRMatrix();
    m.rotate(360);
    EXPECT_FALSE(m.isIdentity());

    // The free functions change the matrix exactly as the methods do.
    CZYRMatrix viaMethod = kA, viaFree = kA;
    viaMethod.rotate(17);
    ZYRMatrix_rotate(viaFree, 17);
    viaMethod.rotateMTX(-33);
    ZYRMatrix_rotateMTX(viaFree, -33);
    viaMethod.scale(2, -1);
    ZYRMatrix_scale(viaFree, 2, -1);
    viaMethod.scaleMTX(0.5, 3);
    ZYRMatrix_scaleMTX(viaFree, 0.5, 3);
    viaMethod.translate(4, -5);
    ZYRMatrix_translate(viaFree, 4, -5);
    viaMethod.translateMTX(-6, 7);
    ZYRMatrix_translateMTX(viaFree, -6, 7);
    EXPECT_TRUE(viaMethod == viaFree);
}

TEST(CZYRMatrixTest, Inversion) {
    CZYRMatrix m(2, 0, 0, 4, 10, 20);
    m.invert();
    EXPECT_TRUE(m == CZYRMatrix(0.5, 0, 0, 0.25, -5, -5));

    std::mt19937_64 rng(7);
    std::uniform_real_distribution<double> linear(-10.0, 10.0), shift(-1000.0, 1000.0);
    for (int i = 0; i < 1000; ++i) {
        const CZYRMatrix A(linear(rng), linear(rng), linear(rng), linear(rng), shift(rng),
                           shift(rng));
        if (std::fabs(A.determinant()) < 0.5)
            continue;
        CZYRMatrix inv = A;
        inv.invert();
        ASSERT_TRUE(near(A * inv, CZYRMatrix(), 1e-9)) << "case " << i;
        ASSERT_TRUE(near(inv * A, CZYRMatrix(), 1e-9)) << "case " << i;
    }
    CZYRMatrix same = kA;
    ZYRMatrix_invert(same, same);
    EXPECT_TRUE(near(same * kA, CZYRMatrix(), 1e-12)) << "source and target may be one matrix";

    // Exactly singular: the error, and neither matrix changes.
    CZYRMatrix singular(1, 2, 2, 4, 0, 0);
    EXPECT_FALSE(singular.invertible());
    try {
        singular.invert();
        FAIL() << "a singular matrix must not invert";
    } catch (const CZYRError& e) {
        EXPECT_EQ(e.getError(), kZYRErrorBadParam);
        EXPECT_STREQ(e.getMessage(), "Inverting Singular Matrix");
        EXPECT_STREQ(e.getSrcFileName(), "source/zyr/std/CZYRMatrix");
    }
    EXPECT_TRUE(singular == CZYRMatrix(1, 2, 2, 4, 0, 0));
    CZYRMatrix target = kB;
    EXPECT_THROW(ZYRMatrix_invert(singular, target), CZYRError);
    EXPECT_TRUE(target == kB);

    // invert has no tolerance; invertible judges the determinant as a float.
    CZYRMatrix tiny(1e-20, 0, 0, 1e-20, 0, 0);
    EXPECT_FALSE(tiny.invertible());
    EXPECT_NO_THROW(tiny.invert());
    EXPECT_TRUE(near(tiny, CZYRMatrix(1e20, 0, 0, 1e20, 0, 0), 1e5));
    const double fmin = std::numeric_limits<float>::min();
    EXPECT_FALSE(CZYRMatrix(1, 0, 0, fmin, 0, 0).invertible()) << "must exceed, not reach";
    EXPECT_TRUE(CZYRMatrix(1, 0, 0, 2 * fmin, 0, 0).invertible());
    EXPECT_TRUE(CZYRMatrix(0, 1e-3, 1, 0, 0, 0).invertible()) << "negative determinant";
    EXPECT_TRUE(CZYRMatrix(1e200, 0, 0, 1e200, 0, 0).invertible()) << "beyond float range";
    EXPECT_FALSE(CZYRMatrix(kNaN, 0, 0, 1, 0, 0).invertible());
}

TEST(CZYRMatrixTest, PointsAndBoundingBoxes) {
    float fx = 1.5f, fy = -2.0f;
    kA.transformPoint(fx, fy);
    EXPECT_EQ(fx, 0.5f);
    EXPECT_EQ(fy, 1.0f);
    // In float, 2^24 + 1 would round away before the translation cancels 2^24.
    const CZYRMatrix cancel(1, 0, 1, 1, -16777216.0, 0);
    fx = 16777216.0f;
    fy = 1.0f;
    ZYRMatrix_transformPoint(cancel, fx, fy);
    EXPECT_EQ(fx, 1.0f) << "float points are transformed in double";

    const sZYRRect r{1, 2, 4, 3}; // left, bottom, top, right
    const sZYRRect mirrored = CZYRMatrix(-1, 0, 0, 1, 0, 0).transformBBox(r);
    EXPECT_EQ(mirrored.left, -3);
    EXPECT_EQ(mirrored.bottom, 2);
    EXPECT_EQ(mirrored.top, 4);
    EXPECT_EQ(mirrored.right, -1);
    CZYRMatrix rot;
    rot.rotate(45);
    const sZYRRect diamond = rot.transformBBox({0, 0, 1, 1});
    EXPECT_NEAR(diamond.left, -std::sqrt(0.5), 1e-15);
    EXPECT_NEAR(diamond.right, std::sqrt(0.5), 1e-15);
    EXPECT_NEAR(diamond.top, std::sqrt(2.0), 1e-15);

    // Against the extremes of the four transformed corners, for arbitrary matrices.
    std::mt19937_64 rng(11);
    std::uniform_real_distribution<double> any(-100.0, 100.0);
    for (int i = 0; i < 2000; ++i) {
        const CZYRMatrix m(any(rng), any(rng), any(rng), any(rng), any(rng), any(rng));
        const double x0 = any(rng), x1 = any(rng), y0 = any(rng), y1 = any(rng);
        const sZYRRect box{std::min(x0, x1), std::min(y0, y1), std::max(y0, y1), std::max(x0, x1)};
        double lo[2] = {INFINITY, INFINITY}, hi[2] = {-INFINITY, -INFINITY};
        for (double cx : {x0, x1}) {
            for (double cy : {y0, y1}) {
                double p[2] = {cx, cy};
                m.transformPoint(p[0], p[1]);
                for (int k = 0; k < 2; ++k) {
                    lo[k] = std::min(lo[k], p[k]);
                    hi[k] = std::max(hi[k], p[k]);
                }
            }
        }
        const sZYRRect got = ZYRMatrix_transformBBox(m, box);
        ASSERT_NEAR(got.left, lo[0], 1e-9) << "case " << i;
        ASSERT_NEAR(got.right, hi[0], 1e-9) << "case " << i;
        ASSERT_NEAR(got.bottom, lo[1], 1e-9) << "case " << i;
        ASSERT_NEAR(got.top, hi[1], 1e-9) << "case " << i;
    }
}

} // namespace
