// Matrix products, rotations and inversion.
#include "zyr/std/geometry/CZYRMatrix.h"

#include <cmath>
#include <limits>

#include "zyr/std/core/CZYRError.h"

namespace ZYRStd {

namespace {

constexpr double kPi = 3.141592653589793;

double radians(double degrees) {
    return degrees * kPi / 180.0;
}

sZYRMatrix product(const sZYRMatrix& A, const sZYRMatrix& B) {
    return {A.a * B.a + A.b * B.c, A.a * B.b + A.b * B.d,          A.c * B.a + A.d * B.c,
            A.c * B.b + A.d * B.d, A.tx * B.a + A.ty * B.c + B.tx, A.tx * B.b + A.ty * B.d + B.ty};
}

// Computes into a copy so that a failure leaves every target as it was.
sZYRMatrix inverse(const sZYRMatrix& m) {
    const double D = m.b * m.c - m.a * m.d;
    if (D == 0.0)
        throw CZYRError(ZYRPublic::kZYRErrorBadParam, "Inverting Singular Matrix",
                        "source/zyr/std/CZYRMatrix", __LINE__);
    sZYRMatrix r;
    r.a = -m.d / D;
    r.b = m.b / D;
    r.c = m.c / D;
    r.d = -m.a / D;
    r.tx = -(m.tx * r.a + m.ty * r.c);
    r.ty = -(m.tx * r.b + m.ty * r.d);
    return r;
}

} // namespace

CZYRMatrix::~CZYRMatrix() = default;

CZYRMatrix& CZYRMatrix::operator*=(const CZYRMatrix& other) {
    m_ = product(m_, other.m_);
    return *this;
}

void CZYRMatrix::concat(const CZYRMatrix& first) {
    m_ = product(first.m_, m_);
}

void CZYRMatrix::concatMTX(const CZYRMatrix& then) {
    m_ = product(m_, then.m_);
}

void CZYRMatrix::translate(double x, double y) {
    m_.tx += m_.a * x + m_.c * y;
    m_.ty += m_.b * x + m_.d * y;
}

void CZYRMatrix::translateMTX(double x, double y) {
    m_.tx += x;
    m_.ty += y;
}

void CZYRMatrix::scale(double sx, double sy) {
    m_.a *= sx;
    m_.b *= sx;
    m_.c *= sy;
    m_.d *= sy;
}

void CZYRMatrix::scaleMTX(double sx, double sy) {
    m_.a *= sx;
    m_.c *= sx;
    m_.tx *= sx;
    m_.b *= sy;
    m_.d *= sy;
    m_.ty *= sy;
}

void CZYRMatrix::rotate(double degrees) {
    const double rad = radians(degrees);
    const double cs = std::cos(rad);
    const double sn = std::sin(rad);
    const sZYRMatrix m = m_;
    m_.a = cs * m.a + sn * m.c;
    m_.b = cs * m.b + sn * m.d;
    m_.c = cs * m.c - sn * m.a;
    m_.d = cs * m.d - sn * m.b;
}

void CZYRMatrix::rotateMTX(double degrees) {
    const double rad = radians(degrees);
    const double cs = std::cos(rad);
    const double sn = std::sin(rad);
    const sZYRMatrix m = m_;
    m_.a = m.a * cs - m.b * sn;
    m_.b = m.b * cs + m.a * sn;
    m_.c = m.c * cs - m.d * sn;
    m_.d = m.d * cs + m.c * sn;
    m_.tx = m.tx * cs - m.ty * sn;
    m_.ty = m.ty * cs + m.tx * sn;
}

void CZYRMatrix::invert() {
    m_ = inverse(m_);
}

void CZYRMatrix::getMtxVals(float& a, float& b, float& c, float& d, float& tx, float& ty) const {
    a = static_cast<float>(m_.a);
    b = static_cast<float>(m_.b);
    c = static_cast<float>(m_.c);
    d = static_cast<float>(m_.d);
    tx = static_cast<float>(m_.tx);
    ty = static_cast<float>(m_.ty);
}

double CZYRMatrix::resolution(double r) const {
    return std::sqrt(std::fabs(determinant())) * r;
}

bool CZYRMatrix::invertible() const {
    const auto magnitude = static_cast<float>(std::fabs(determinant()));
    return magnitude > std::numeric_limits<float>::min();
}

bool CZYRMatrix::isValid() const {
    return !std::isnan(m_.a) && !std::isnan(m_.b) && !std::isnan(m_.c) && !std::isnan(m_.d) &&
           !std::isnan(m_.tx) && !std::isnan(m_.ty);
}

bool CZYRMatrix::equal(const CZYRMatrix& other, double eps) const {
    return std::fabs(m_.a - other.m_.a) <= eps && std::fabs(m_.b - other.m_.b) <= eps &&
           std::fabs(m_.c - other.m_.c) <= eps && std::fabs(m_.d - other.m_.d) <= eps &&
           std::fabs(m_.tx - other.m_.tx) <= eps && std::fabs(m_.ty - other.m_.ty) <= eps;
}

CZYRMatrix operator*(const CZYRMatrix& A, const CZYRMatrix& B) {
    CZYRMatrix result(A);
    result *= B;
    return result;
}

void ZYRMatrix_invert(const CZYRMatrix& src, CZYRMatrix& dst) {
    const sZYRMatrix r = inverse(src);
    dst = CZYRMatrix(r);
}

void ZYRMatrix_rotate(CZYRMatrix& m, double degrees) {
    m.rotate(degrees);
}

void ZYRMatrix_rotateMTX(CZYRMatrix& m, double degrees) {
    m.rotateMTX(degrees);
}

void ZYRMatrix_scale(CZYRMatrix& m, double sx, double sy) {
    m.scale(sx, sy);
}

void ZYRMatrix_scaleMTX(CZYRMatrix& m, double sx, double sy) {
    m.scaleMTX(sx, sy);
}

void ZYRMatrix_translate(CZYRMatrix& m, double x, double y) {
    m.translate(x, y);
}

void ZYRMatrix_translateMTX(CZYRMatrix& m, double x, double y) {
    m.translateMTX(x, y);
}

void ZYRMatrix_transformPoint(const CZYRMatrix& m, float& x, float& y) {
    m.transformPoint(x, y);
}

void ZYRMatrix_transformPoint(const CZYRMatrix& m, double& x, double& y) {
    m.transformPoint(x, y);
}

sZYRRect ZYRMatrix_transformBBox(const CZYRMatrix& m, const sZYRRect& r) {
    return m.transformBBox(r);
}

} // namespace ZYRStd
