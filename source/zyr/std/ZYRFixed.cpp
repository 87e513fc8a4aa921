// The library's exported copies of the inline fixed-point functions.
#include "zyr/std/ZYRFixed.h"

namespace ZYRStd {

int32_t FixedMul(int32_t a, int32_t b) {
    return fixed_detail::fixedMul(a, b);
}

int32_t fracmul(int32_t a, int32_t b) {
    return fixed_detail::fracMul(a, b);
}

int32_t TFixedDiv(int32_t a, int32_t b) {
    return fixed_detail::fixedDiv(a, b);
}

int32_t fixratio(int32_t a, int32_t b) {
    return fixed_detail::fixRatio(a, b);
}

int32_t FixedMulDiv(int32_t a, int32_t b, int32_t c, bool rounded) {
    return fixed_detail::fixedMulDiv(a, b, c, rounded);
}

int32_t PFloatToFixed(float* p) {
    return fixed_detail::floatToFixed(p);
}

} // namespace ZYRStd
