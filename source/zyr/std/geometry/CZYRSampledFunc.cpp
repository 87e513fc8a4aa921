// Resampling of sampled functions to 8-bit outputs.
#include "zyr/std/geometry/CZYRSampledFunc.h"

namespace ZYRStd {

namespace {

float evaluate(const CZYRSampledFunc<float>::Point& p0, const CZYRSampledFunc<float>::Point& p1,
               double x) {
    if (p0.x == p1.x)
        return p0.x > x ? p0.y : p1.y;
    if (x <= p0.x)
        return p0.y;
    if (x >= p1.x)
        return p1.y;
    return static_cast<float>(p0.y + (p1.y - p0.y) * (x - p0.x) / (p1.x - p0.x));
}

float toEightBit(float y, sZYRRangeT<float> range) {
    const float width = range.max - range.min;
    const float v =
        width == 0.0f ? (range.min > y ? 0.0f : 255.0f) : (y - range.min) * 255.0f / width;
    return std::clamp(v, 0.0f, 255.0f);
}

} // namespace

sZYRRangeT<float> Caculate8BitEncodedSamples(const CZYRSampledFunc<float>& f, int n,
                                             IEncodedDataCBProc& cb) {
    constexpr sZYRRangeT<float> kEightBit{0.0f, 255.0f};
    unsigned int next = 1;
    const auto* p0 = &f.getPoint(0);
    const auto* p1 = &f.getPoint(next);
    if (n < 1)
        return kEightBit;
    const sZYRRangeT<float> domain = f.getDomain();
    const double step = (double{domain.max} - domain.min) / (n - 1);
    double x = domain.min;
    for (int index = 0; index < n; ++index) {
        cb.encodedSample(index, toEightBit(evaluate(*p0, *p1, x), f.getRange()));
        x += step;
        while (x > p1->x && next + 1 < f.getPointCount()) {
            p0 = p1;
            p1 = &f.getPoint(++next);
        }
    }
    return kEightBit;
}

} // namespace ZYRStd
