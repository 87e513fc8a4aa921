/// \file
/// Axis-aligned rectangles in double precision (CZYRRect).
#pragma once

#include <algorithm>

#include "ZYRStdExport.h"
#include "sZYRRect.h"
#include "zyr/std/core/CZYRClientBase.h"

namespace ZYRStd {

using ZYRPublic::sZYRRect;

/// A rectangle in double precision over the boundary record sZYRRect, for bounding boxes
/// and clips. A plain value: one thread at a time.
class ZYRSTD_API CZYRRect : public CZYRClientBase {
public:
    /// Inverted, so that the first union or updateBBoxPoint sets the real extent.
    CZYRRect() : r_{kHuge, kHuge, -kHuge, -kHuge} {}
    /// Arguments in reading order; stored in the record's order (left, bottom, top, right).
    CZYRRect(double left, double bottom, double right, double top) : r_{left, bottom, top, right} {}
    /// A copy of the record `r`.
    CZYRRect(const sZYRRect& r) : r_(r) {}
    /// Copies the extent.
    CZYRRect(const CZYRRect&) = default;
    /// Copies the extent.
    CZYRRect& operator=(const CZYRRect&) = default;
    ~CZYRRect() override;

    /// The extent as the boundary record, borrowed from this object.
    operator const sZYRRect&() const { return r_; }

    /// Replaces the extent, unchecked.
    void setRect(const sZYRRect& r) { r_ = r; }
    /// Keeps the values even when it throws kZYRErrorBadParam for an inverted box.
    void setBoundingBox(const sZYRRect& r);
    /// True when right >= left and top >= bottom.
    bool isBoundingBox() const { return r_.right >= r_.left && r_.top >= r_.bottom; }
    /// Zero width or height counts as empty.
    bool isempty() const { return r_.left >= r_.right || r_.bottom >= r_.top; }

    /// A result without area collapses to all zeros.
    void intersectRect(const sZYRRect& r) {
        r_.left = std::max(r_.left, r.left);
        r_.bottom = std::max(r_.bottom, r.bottom);
        r_.right = std::min(r_.right, r.right);
        r_.top = std::min(r_.top, r.top);
        if (r_.left >= r_.right || r_.bottom >= r_.top)
            r_ = {0.0, 0.0, 0.0, 0.0};
    }
    /// Grows to cover `r` as well.
    void unionRect(const sZYRRect& r) {
        r_.left = std::min(r_.left, r.left);
        r_.bottom = std::min(r_.bottom, r.bottom);
        r_.right = std::max(r_.right, r.right);
        r_.top = std::max(r_.top, r.top);
    }
    /// Closed rectangles: a shared edge or corner counts.
    bool touch(const sZYRRect& r) const {
        return r_.left <= r.right && r.left <= r_.right && r_.bottom <= r.top && r.bottom <= r_.top;
    }
    /// Grows to cover the point (x, y).
    void updateBBoxPoint(double x, double y) {
        r_.left = std::min(r_.left, x);
        r_.right = std::max(r_.right, x);
        r_.bottom = std::min(r_.bottom, y);
        r_.top = std::max(r_.top, y);
    }

    /// True when all four sides are exactly equal.
    bool operator==(const CZYRRect& other) const {
        return r_.left == other.r_.left && r_.bottom == other.r_.bottom && r_.top == other.r_.top &&
               r_.right == other.r_.right;
    }

private:
    static constexpr double kHuge = 1.7976931348623157e308;
    sZYRRect r_;
};

} // namespace ZYRStd
