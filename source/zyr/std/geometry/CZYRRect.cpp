// The out-of-line parts of CZYRRect: its key function and the throwing setter.
#include "zyr/std/geometry/CZYRRect.h"

#include "zyr/std/core/CZYRError.h"

namespace ZYRStd {

CZYRRect::~CZYRRect() = default;

void CZYRRect::setBoundingBox(const sZYRRect& r) {
    r_ = r;
    if (!isBoundingBox())
        throw CZYRError(ZYRPublic::kZYRErrorBadParam, "Invalid bounding box set",
                        "source/zyr/std/CZYRRect", __LINE__);
}

} // namespace ZYRStd
