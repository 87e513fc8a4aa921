// Fixed (16.16) and Frac (2.30) arithmetic on signed 32-bit numbers.
#pragma once

#include <cstdint>

#include "ZYRStdExport.h"

namespace ZYRStd {

// Every result saturates to 0x80000000 or 0x7FFFFFFF instead of wrapping, and every
// rounding is half away from zero, computed exactly.

// a times b / 2^16, rounded.
ZYRSTD_API int32_t FixedMul(int32_t a, int32_t b);
// a times b / 2^30, rounded.
ZYRSTD_API int32_t fracmul(int32_t a, int32_t b);
// a / b times 2^16, truncated; b = 0 gives the extreme of a's sign (0 / 0 is positive).
ZYRSTD_API int32_t TFixedDiv(int32_t a, int32_t b);
// a / b times 2^30, rounded; b = 0 as for TFixedDiv.
ZYRSTD_API int32_t fixratio(int32_t a, int32_t b);
// a times b / c through a 64-bit product, truncated or rounded; c = 0 saturates.
ZYRSTD_API int32_t FixedMulDiv(int32_t a, int32_t b, int32_t c, bool rounded);
// *p times 2^16, rounded; NaN gives 0.
ZYRSTD_API int32_t PFloatToFixed(float* p);

} // namespace ZYRStd
