/// \file
/// The exact fixed-point arithmetic behind ZYRFixed.h, in one place for the inline copies
/// and the library's exported ones.
#pragma once

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <limits>

namespace ZYRStd {

namespace fixed_detail {

inline constexpr int32_t kMin = std::numeric_limits<int32_t>::min();
inline constexpr int32_t kMax = std::numeric_limits<int32_t>::max();

/// |v| for every 32-bit v, including the one without a positive counterpart.
inline uint64_t magnitude(int64_t v) {
    return static_cast<uint64_t>(std::llabs(v));
}

/// Applies the sign to a magnitude, saturating at the 32-bit extremes. Every caller's
/// magnitude is below 2^63; selects rather than branches, as signs are unpredictable.
inline int32_t saturate(bool negative, uint64_t q) {
    const auto v = static_cast<int64_t>(q);
    return static_cast<int32_t>(std::clamp<int64_t>(negative ? -v : v, kMin, kMax));
}

/// a times b / 2^shift, half away from zero. The product needs at most 62 bits, so
/// the result is exact where a double product would round above 2^53.
inline int32_t mulShiftRounded(int32_t a, int32_t b, unsigned shift) {
    const int64_t p = static_cast<int64_t>(a) * b;
    const uint64_t half = uint64_t{1} << (shift - 1);
    return saturate(p < 0, (magnitude(p) + half) >> shift);
}

inline int32_t divideByZero(int32_t a) {
    return a < 0 ? kMin : kMax;
}

inline int32_t fixedMul(int32_t a, int32_t b) {
    return mulShiftRounded(a, b, 16);
}

inline int32_t fracMul(int32_t a, int32_t b) {
    return mulShiftRounded(a, b, 30);
}

inline int32_t fixedDiv(int32_t a, int32_t b) {
    if (b == 0)
        return divideByZero(a);
    // 2^47 at most, and 64-bit division truncates toward zero as required.
    const int64_t q = static_cast<int64_t>(a) * 65536 / b;
    return static_cast<int32_t>(std::clamp<int64_t>(q, kMin, kMax));
}

inline int32_t fixRatio(int32_t a, int32_t b) {
    if (b == 0)
        return divideByZero(a);
    const uint64_t num = magnitude(a) << 30;
    const uint64_t den = magnitude(b);
    uint64_t q = num / den;
    if (2 * (num % den) >= den)
        ++q;
    return saturate((a < 0) != (b < 0), q);
}

inline int32_t fixedMulDiv(int32_t a, int32_t b, int32_t c, bool rounded) {
    const bool negative = ((a < 0) ^ (b < 0) ^ (c < 0)) != 0;
    if (c == 0)
        return negative ? kMin : kMax;
    const uint64_t num = magnitude(a) * magnitude(b);
    const uint64_t den = magnitude(c);
    uint64_t q = num / den;
    // Rounding cannot carry a saturated quotient back into range, so one check suffices.
    if (rounded && 2 * (num % den) >= den)
        ++q;
    return saturate(negative, q);
}

inline int32_t floatToFixed(float* p) {
    const float x = *p;
    // Truncating NaN to an integer is undefined; it has no magnitude, so it becomes 0.
    if (std::isnan(x))
        return 0;
    // Scaling by a power of two is exact, and so is adding 0.5 in double: rounding in
    // single precision would push odd values between 2^23 and 2^24 up to the next even.
    const double v = static_cast<double>(x) * 65536.0;
    const double t = v < 0 ? v - 0.5 : v + 0.5;
    if (t < -2147483648.0)
        return kMin;
    if (t >= 2147483648.0)
        return kMax;
    return static_cast<int32_t>(t);
}

} // namespace fixed_detail

} // namespace ZYRStd
