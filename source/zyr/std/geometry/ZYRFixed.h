/// \file
/// Fixed (16.16) and Frac (2.30) arithmetic on signed 32-bit numbers.
#pragma once

#include <cstdint>

#include "ZYRStdExport.h"
#include "zyr/std/geometry/ZYRFixedDetail.h"

namespace ZYRStd {
// Every result saturates to 0x80000000 or 0x7FFFFFFF instead of wrapping, and every
// rounding is half away from zero, computed exactly. Rasterising loops call these per
// pixel, so the bodies below are visible for inlining; they are gnu_inline, which makes
// them inline-only: a call that is not inlined goes to the library's one exported copy,
// and no program or library emits a weak copy of its own.

/// a times b / 2^16, rounded.
[[gnu::gnu_inline]] extern inline ZYRSTD_API int32_t FixedMul(int32_t a, int32_t b) {
    return fixed_detail::fixedMul(a, b);
}

/// a times b / 2^30, rounded.
[[gnu::gnu_inline]] extern inline ZYRSTD_API int32_t fracmul(int32_t a, int32_t b) {
    return fixed_detail::fracMul(a, b);
}

/// a / b times 2^16, truncated; b = 0 gives the extreme of a's sign (0 / 0 is positive).
[[gnu::gnu_inline]] extern inline ZYRSTD_API int32_t TFixedDiv(int32_t a, int32_t b) {
    return fixed_detail::fixedDiv(a, b);
}

/// a / b times 2^30, rounded; b = 0 as for TFixedDiv.
[[gnu::gnu_inline]] extern inline ZYRSTD_API int32_t fixratio(int32_t a, int32_t b) {
    return fixed_detail::fixRatio(a, b);
}

/// a times b / c through a 64-bit product, truncated or rounded; c = 0 saturates.
[[gnu::gnu_inline]] extern inline ZYRSTD_API int32_t FixedMulDiv(int32_t a, int32_t b, int32_t c,
                                                                 bool rounded) {
    return fixed_detail::fixedMulDiv(a, b, c, rounded);
}

/// *p times 2^16, rounded; NaN gives 0.
[[gnu::gnu_inline]] extern inline ZYRSTD_API int32_t PFloatToFixed(float* p) {
    return fixed_detail::floatToFixed(p);
}

} // namespace ZYRStd
