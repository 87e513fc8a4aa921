// The library's exported copies of the inline fixed-point functions.
#include "ZYRStdExport.h"
#include "zyr/std/geometry/ZYRFixedDetail.h"

// ZYRFixed.h is not included: its inline-only definitions and these out-of-line ones may
// not meet in one translation unit (clang refuses the pair). The declarations agree.

namespace ZYRStd {

ZYRSTD_API int32_t FixedMul(int32_t a, int32_t b) {
    return fixed_detail::fixedMul(a, b);
}

ZYRSTD_API int32_t fracmul(int32_t a, int32_t b) {
    return fixed_detail::fracMul(a, b);
}

ZYRSTD_API int32_t TFixedDiv(int32_t a, int32_t b) {
    return fixed_detail::fixedDiv(a, b);
}

ZYRSTD_API int32_t fixratio(int32_t a, int32_t b) {
    return fixed_detail::fixRatio(a, b);
}

ZYRSTD_API int32_t FixedMulDiv(int32_t a, int32_t b, int32_t c, bool rounded) {
    return fixed_detail::fixedMulDiv(a, b, c, rounded);
}

ZYRSTD_API int32_t PFloatToFixed(float* p) {
    return fixed_detail::floatToFixed(p);
}

} // namespace ZYRStd
