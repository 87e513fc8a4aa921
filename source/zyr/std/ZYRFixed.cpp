// The library's exported copies of the inline fixed-point functions.
#include "zyr/std/ZYRFixed.h"

namespace ZYRStd {

namespace {
// Taking the addresses makes the compiler emit one out-of-line copy of each function,
// exported for callers that do not inline them (function pointers, other languages).
[[gnu::used]] constexpr int32_t (*kExported2[])(int32_t, int32_t) = {&FixedMul, &fracmul,
                                                                     &TFixedDiv, &fixratio};
[[gnu::used]] constexpr int32_t (*kExportedMulDiv)(int32_t, int32_t, int32_t, bool) = &FixedMulDiv;
[[gnu::used]] constexpr int32_t (*kExportedFloat)(float*) = &PFloatToFixed;
} // namespace

} // namespace ZYRStd
