// Affine transforms in double precision (CZYRMatrix) and the ZYRMatrix_ free functions.
#pragma once

#include <algorithm>

#include "ZYRStdExport.h"
#include "sZYRMatrix.h"
#include "sZYRRect.h"
#include "zyr/std/core/CZYRClientBase.h"

namespace ZYRStd {

using ZYRPublic::sZYRMatrix;
using ZYRPublic::sZYRRect;

// "A times B" applies A first, then B. Methods without the MTX suffix put their
// operand first (M = N times M); the MTX forms put it last (M = M times N).
class ZYRSTD_API CZYRMatrix : public CZYRClientBase {
public:
    CZYRMatrix() : m_{1.0, 0.0, 0.0, 1.0, 0.0, 0.0} {}
    CZYRMatrix(double a, double b, double c, double d, double tx, double ty)
        : m_{a, b, c, d, tx, ty} {}
    CZYRMatrix(const sZYRMatrix& m) : m_(m) {}
    CZYRMatrix(const CZYRMatrix&) = default;
    CZYRMatrix& operator=(const CZYRMatrix&) = default;
    ~CZYRMatrix() override;

    operator const sZYRMatrix&() const { return m_; }

    CZYRMatrix& operator*=(const CZYRMatrix& other);
    void concat(const CZYRMatrix& first);
    void concatMTX(const CZYRMatrix& then);

    void translate(double x, double y);
    void translateMTX(double x, double y);
    void scale(double sx, double sy);
    void scaleMTX(double sx, double sy);
    void rotate(double degrees);
    void rotateMTX(double degrees);

    // Throws kZYRErrorBadParam when the determinant is exactly 0 and then leaves the
    // matrix as it was; no tolerance, so ask invertible() first where that matters.
    void invert();

    void setMtxVals(double a, double b, double c, double d, double tx, double ty) {
        m_ = {a, b, c, d, tx, ty};
    }
    void getMtxVals(double& a, double& b, double& c, double& d, double& tx, double& ty) const {
        a = m_.a;
        b = m_.b;
        c = m_.c;
        d = m_.d;
        tx = m_.tx;
        ty = m_.ty;
    }
    void getMtxVals(float& a, float& b, float& c, float& d, float& tx, float& ty) const;
    void setTransVals(double tx, double ty) {
        m_.tx = tx;
        m_.ty = ty;
    }
    void getTransVals(double& tx, double& ty) const {
        tx = m_.tx;
        ty = m_.ty;
    }

    void transformPoint(double& x, double& y) const {
        const double px = x;
        const double py = y;
        x = m_.a * px + m_.c * py + m_.tx;
        y = m_.b * px + m_.d * py + m_.ty;
    }
    // Computed in double, narrowed at the end.
    void transformPoint(float& x, float& y) const {
        double px = x;
        double py = y;
        transformPoint(px, py);
        x = static_cast<float>(px);
        y = static_cast<float>(py);
    }

    // Each axis takes the smaller (larger) product of each column, so a mirroring
    // matrix still gives left <= right and bottom <= top.
    sZYRRect transformBBox(const sZYRRect& r) const {
        const double xl = m_.a * r.left;
        const double xr = m_.a * r.right;
        const double xb = m_.c * r.bottom;
        const double xt = m_.c * r.top;
        const double yl = m_.b * r.left;
        const double yr = m_.b * r.right;
        const double yb = m_.d * r.bottom;
        const double yt = m_.d * r.top;
        sZYRRect out;
        out.left = std::min(xl, xr) + std::min(xb, xt) + m_.tx;
        out.right = std::max(xl, xr) + std::max(xb, xt) + m_.tx;
        out.bottom = std::min(yl, yr) + std::min(yb, yt) + m_.ty;
        out.top = std::max(yl, yr) + std::max(yb, yt) + m_.ty;
        return out;
    }

    double determinant() const { return m_.a * m_.d - m_.c * m_.b; }
    double resolution(double r) const;
    // The determinant is judged in single precision: anything at or below the smallest
    // normal float counts as singular.
    bool invertible() const;
    bool isIdentity() const {
        return m_.a == 1.0 && m_.b == 0.0 && m_.c == 0.0 && m_.d == 1.0 && m_.tx == 0.0 &&
               m_.ty == 0.0;
    }
    bool isValid() const;

    bool operator==(const CZYRMatrix& other) const {
        return m_.a == other.m_.a && m_.b == other.m_.b && m_.c == other.m_.c &&
               m_.d == other.m_.d && m_.tx == other.m_.tx && m_.ty == other.m_.ty;
    }
    // Absolute difference of every entry, eps inclusive.
    bool equal(const CZYRMatrix& other, double eps) const;

private:
    sZYRMatrix m_;
};

// A times B: A applies first.
ZYRSTD_API CZYRMatrix operator*(const CZYRMatrix& A, const CZYRMatrix& B);

// src and dst may be the same object; dst is untouched when src is singular.
ZYRSTD_API void ZYRMatrix_invert(const CZYRMatrix& src, CZYRMatrix& dst);
ZYRSTD_API void ZYRMatrix_rotate(CZYRMatrix& m, double degrees);
ZYRSTD_API void ZYRMatrix_rotateMTX(CZYRMatrix& m, double degrees);
ZYRSTD_API void ZYRMatrix_scale(CZYRMatrix& m, double sx, double sy);
ZYRSTD_API void ZYRMatrix_scaleMTX(CZYRMatrix& m, double sx, double sy);
ZYRSTD_API void ZYRMatrix_translate(CZYRMatrix& m, double x, double y);
ZYRSTD_API void ZYRMatrix_translateMTX(CZYRMatrix& m, double x, double y);
ZYRSTD_API void ZYRMatrix_transformPoint(const CZYRMatrix& m, float& x, float& y);
ZYRSTD_API void ZYRMatrix_transformPoint(const CZYRMatrix& m, double& x, double& y);
ZYRSTD_API sZYRRect ZYRMatrix_transformBBox(const CZYRMatrix& m, const sZYRRect& r);

} // namespace ZYRStd
