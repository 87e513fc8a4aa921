// Stroke parameters: the setters' rules, the dash storage, copying and comparison.
#include "zyr/std/engine/CZYRStrokeParams.h"

#include <algorithm>
#include <cstring>
#include <vector>

#include "zyr/std/core/CZYRError.h"

namespace ZYRStd {

CZYRStrokeParams::CZYRStrokeParams(const CZYRStrokeParams& other)
    : CZYRClientBase(other), params_(other.params_), matrix_(other.matrix_) {
    params_.dashArray = nullptr;
    if (other.params_.dashArray)
        setDashedArray(other.params_.dashArray, other.params_.dashCount);
}

CZYRStrokeParams& CZYRStrokeParams::operator=(const CZYRStrokeParams& other) {
    if (this == &other)
        return *this;
    if (other.params_.dashArray)
        setDashedArray(other.params_.dashArray, other.params_.dashCount);
    float* const dashes = other.params_.dashArray ? params_.dashArray : nullptr;
    params_ = other.params_;
    params_.dashArray = dashes;
    matrix_ = other.matrix_;
    return *this;
}

CZYRStrokeParams::~CZYRStrokeParams() = default;

void CZYRStrokeParams::setLineWidth(float width) {
    params_.lineWidth = width > 0.0f ? width : 0.0f;
}

void CZYRStrokeParams::setMiterLimit(float limit) {
    params_.miterLimit = limit > 1.0f ? limit : 1.0f;
}

void CZYRStrokeParams::setDashedArray(const float* values, int count) {
    if (count < 0 || (count > 0 && !values))
        throw CZYRError(ZYRPublic::kZYRErrorBadParam, "invalid dash array",
                        "source/zyr/std/CZYRStrokeParams", __LINE__);
    const auto n = static_cast<unsigned int>(count);
    if (n > dashStorage_.count()) {
        // Growing drops the old block, which `values` may point into.
        std::vector<float> copy(values, values + n);
        dashStorage_.grow(n);
        std::memcpy(dashStorage_.data(), copy.data(), n * sizeof(float));
    } else if (n > 0) {
        std::memmove(dashStorage_.data(), values, n * sizeof(float));
    }
    params_.dashCount = count;
    params_.dashArray = dashStorage_.data();
}

bool CZYRStrokeParams::operator==(const CZYRStrokeParams& other) const {
    const sStrokeParams& a = params_;
    const sStrokeParams& b = other.params_;
    if (a.lineWidth != b.lineWidth || a.miterLimit != b.miterLimit ||
        a.dashOffset != b.dashOffset || a.strokeAdjust != b.strokeAdjust ||
        a.dashCount != b.dashCount || a.lineCap != b.lineCap || a.lineJoin != b.lineJoin)
        return false;
    if (a.dashCount == 0 || a.dashArray == b.dashArray)
        return true;
    if (!a.dashArray || !b.dashArray)
        return false;
    return std::equal(a.dashArray, a.dashArray + a.dashCount, b.dashArray);
}

} // namespace ZYRStd
