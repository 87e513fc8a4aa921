/// \file
/// Affine transforms in double precision (CZYRMatrix) and the ZYRMatrix_ free functions.
#pragma once

#include <algorithm>

#include "ZYRStdExport.h"
#include "sZYRMatrix.h"
#include "sZYRRect.h"
#include "zyr/std/core/CZYRClientBase.h"

namespace ZYRStd {

using ZYRPublic::sZYRMatrix;
using ZYRPublic::sZYRRect;

/// "A times B" applies A first, then B. Methods without the MTX suffix put their
/// operand first (M = N times M); the MTX forms put it last (M = M times N).
class ZYRSTD_API CZYRMatrix : public CZYRClientBase {
public:
    CZYRMatrix() : m_{1.0, 0.0, 0.0, 1.0, 0.0, 0.0} {}
    /// The matrix with these six entries (see sZYRMatrix).
    CZYRMatrix(double a, double b, double c, double d, double tx, double ty)
        : m_{a, b, c, d, tx, ty} {}
    /// A copy of the record `m`.
    CZYRMatrix(const sZYRMatrix& m) : m_(m) {}
    /// Copies the entries.
    CZYRMatrix(const CZYRMatrix&) = default;
    /// Copies the entries.
    CZYRMatrix& operator=(const CZYRMatrix&) = default;
    ~CZYRMatrix() override;

    /// The entries as the boundary record, borrowed from this object.
    operator const sZYRMatrix&() const { return m_; }

    /// This = this times `other`: `other` applies after this.
    CZYRMatrix& operator*=(const CZYRMatrix& other);
    /// This = `first` times this: `first` applies before this.
    void concat(const CZYRMatrix& first);
    /// This = this times `then`: `then` applies after this.
    void concatMTX(const CZYRMatrix& then);

    /// Prepends a translation by (x, y).
    void translate(double x, double y);
    /// Appends a translation by (x, y).
    void translateMTX(double x, double y);
    /// Prepends a scaling by (sx, sy).
    void scale(double sx, double sy);
    /// Appends a scaling by (sx, sy).
    void scaleMTX(double sx, double sy);
    /// Prepends a counter-clockwise rotation by `degrees`.
    void rotate(double degrees);
    /// Appends a counter-clockwise rotation by `degrees`.
    void rotateMTX(double degrees);

    /// Throws kZYRErrorBadParam when the determinant is exactly 0 and then leaves the
    /// matrix as it was; no tolerance, so ask invertible() first where that matters.
    void invert();

    /// Replaces all six entries.
    void setMtxVals(double a, double b, double c, double d, double tx, double ty) {
        m_ = {a, b, c, d, tx, ty};
    }
    /// Reads all six entries.
    void getMtxVals(double& a, double& b, double& c, double& d, double& tx, double& ty) const {
        a = m_.a;
        b = m_.b;
        c = m_.c;
        d = m_.d;
        tx = m_.tx;
        ty = m_.ty;
    }
    /// Reads all six entries, narrowed to float.
    void getMtxVals(float& a, float& b, float& c, float& d, float& tx, float& ty) const;
    /// Replaces the translation entries.
    void setTransVals(double tx, double ty) {
        m_.tx = tx;
        m_.ty = ty;
    }
    /// Reads the translation entries.
    void getTransVals(double& tx, double& ty) const {
        tx = m_.tx;
        ty = m_.ty;
    }

    /// Maps the point (x, y) in place.
    void transformPoint(double& x, double& y) const {
        const double px = x;
        const double py = y;
        x = m_.a * px + m_.c * py + m_.tx;
        y = m_.b * px + m_.d * py + m_.ty;
    }
    /// Computed in double, narrowed at the end.
    void transformPoint(float& x, float& y) const {
        double px = x;
        double py = y;
        transformPoint(px, py);
        x = static_cast<float>(px);
        y = static_cast<float>(py);
    }

    /// Each axis takes the smaller (larger) product of each column, so a mirroring
    /// matrix still gives left <= right and bottom <= top.
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

    /// a d - c b.
    double determinant() const { return m_.a * m_.d - m_.c * m_.b; }
    /// The length `r` becomes under this matrix (scaled by the square root of |determinant|).
    double resolution(double r) const;
    /// The determinant is judged in single precision: anything at or below the smallest
    /// normal float counts as singular.
    bool invertible() const;
    /// True for exactly the identity.
    bool isIdentity() const {
        return m_.a == 1.0 && m_.b == 0.0 && m_.c == 0.0 && m_.d == 1.0 && m_.tx == 0.0 &&
               m_.ty == 0.0;
    }
    /// True when every entry is finite.
    bool isValid() const;

    /// True when every entry is exactly equal.
    bool operator==(const CZYRMatrix& other) const {
        return m_.a == other.m_.a && m_.b == other.m_.b && m_.c == other.m_.c &&
               m_.d == other.m_.d && m_.tx == other.m_.tx && m_.ty == other.m_.ty;
    }
    /// Absolute difference of every entry, eps inclusive.
    bool equal(const CZYRMatrix& other, double eps) const;

private:
    sZYRMatrix m_;
};

/// A times B: A applies first.
ZYRSTD_API CZYRMatrix operator*(const CZYRMatrix& A, const CZYRMatrix& B);

/// src and dst may be the same object; dst is untouched when src is singular.
ZYRSTD_API void ZYRMatrix_invert(const CZYRMatrix& src, CZYRMatrix& dst);
/// Free forms of the member operations of the same names, on `m`.
///@{
ZYRSTD_API void ZYRMatrix_rotate(CZYRMatrix& m, double degrees);
ZYRSTD_API void ZYRMatrix_rotateMTX(CZYRMatrix& m, double degrees);
ZYRSTD_API void ZYRMatrix_scale(CZYRMatrix& m, double sx, double sy);
ZYRSTD_API void ZYRMatrix_scaleMTX(CZYRMatrix& m, double sx, double sy);
ZYRSTD_API void ZYRMatrix_translate(CZYRMatrix& m, double x, double y);
ZYRSTD_API void ZYRMatrix_translateMTX(CZYRMatrix& m, double x, double y);
ZYRSTD_API void ZYRMatrix_transformPoint(const CZYRMatrix& m, float& x, float& y);
ZYRSTD_API void ZYRMatrix_transformPoint(const CZYRMatrix& m, double& x, double& y);
ZYRSTD_API sZYRRect ZYRMatrix_transformBBox(const CZYRMatrix& m, const sZYRRect& r);
///@}

} // namespace ZYRStd
