// Bounding boxes and fixed-point quotients against the same arithmetic written inline.
#include <benchmark/benchmark.h>

#include <algorithm>
#include <cstdint>
#include <random>
#include <vector>

#include "BenchSupport.h"
#include "zyr/std/geometry/CZYRMatrix.h"
#include "zyr/std/geometry/ZYRFixed.h"

namespace {

constexpr size_t kCount = 1000000;

const std::vector<ZYRStd::sZYRRect>& rects() {
    static const std::vector<ZYRStd::sZYRRect> data = [] {
        std::mt19937_64 rng(1);
        std::uniform_real_distribution<double> coord(-1000.0, 1000.0);
        std::vector<ZYRStd::sZYRRect> v(kCount);
        for (auto& r : v) {
            const double x0 = coord(rng), x1 = coord(rng), y0 = coord(rng), y1 = coord(rng);
            r = {std::min(x0, x1), std::min(y0, y1), std::max(y0, y1), std::max(x0, x1)};
        }
        return v;
    }();
    return data;
}

struct Triple {
    int32_t a, b, c;
};

const std::vector<Triple>& triples() {
    static const std::vector<Triple> data = [] {
        std::mt19937 rng(2);
        std::uniform_int_distribution<int32_t> wide(-0x40000000, 0x40000000);
        std::uniform_int_distribution<int32_t> fixed(-0x01000000, 0x01000000);
        std::vector<Triple> v(kCount);
        for (auto& t : v) {
            t = {wide(rng), fixed(rng), wide(rng)};
            if (t.c == 0)
                t.c = 1;
        }
        return v;
    }();
    return data;
}

// A mirroring, rotating matrix; read through DoNotOptimize so it is not folded in.
ZYRStd::CZYRMatrix benchMatrix() {
    ZYRStd::CZYRMatrix m(0.8, -0.6, 0.6, 0.8, 12.5, -3.0);
    m.scale(-1.0, 2.0);
    return m;
}

void peerBBoxes(const ZYRStd::sZYRMatrix& m, const std::vector<ZYRStd::sZYRRect>& in,
                ZYRStd::sZYRRect* out) {
    for (size_t i = 0; i < in.size(); ++i) {
        const ZYRStd::sZYRRect& r = in[i];
        const double xl = m.a * r.left, xr = m.a * r.right;
        const double xb = m.c * r.bottom, xt = m.c * r.top;
        const double yl = m.b * r.left, yr = m.b * r.right;
        const double yb = m.d * r.bottom, yt = m.d * r.top;
        out[i].left = (xl < xr ? xl : xr) + (xb < xt ? xb : xt) + m.tx;
        out[i].right = (xl < xr ? xr : xl) + (xb < xt ? xt : xb) + m.tx;
        out[i].bottom = (yl < yr ? yl : yr) + (yb < yt ? yb : yt) + m.ty;
        out[i].top = (yl < yr ? yr : yl) + (yb < yt ? yt : yb) + m.ty;
    }
}

void ourBBoxes(const ZYRStd::CZYRMatrix& m, const std::vector<ZYRStd::sZYRRect>& in,
               ZYRStd::sZYRRect* out) {
    for (size_t i = 0; i < in.size(); ++i)
        out[i] = m.transformBBox(in[i]);
}

int32_t peerMulDiv(int32_t a, int32_t b, int32_t c, bool rounded) {
    const int64_t n = static_cast<int64_t>(a) * b;
    int64_t q = n / c;
    const int64_t r = n % c;
    if (rounded && 2 * (r < 0 ? -r : r) >= (c < 0 ? -int64_t{c} : c))
        q += ((n < 0) != (c < 0)) ? -1 : 1;
    return q > INT32_MAX ? INT32_MAX : q < INT32_MIN ? INT32_MIN : static_cast<int32_t>(q);
}

void BM_TransformBBox_Ours(benchmark::State& state) {
    const auto& in = rects();
    std::vector<ZYRStd::sZYRRect> out(in.size()), check(in.size());
    ZYRStd::CZYRMatrix m = benchMatrix();
    ourBBoxes(m, in, out.data());
    peerBBoxes(m, in, check.data());
    for (size_t i = 0; i < in.size(); ++i) {
        if (out[i].left != check[i].left || out[i].top != check[i].top) {
            state.SkipWithError("transformBBox differs from the inline loop");
            return;
        }
    }
    for (auto _ : state) {
        benchmark::DoNotOptimize(m);
        ourBBoxes(m, in, out.data());
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(static_cast<int64_t>(state.iterations()) * kCount);
}

void BM_TransformBBox_Peer(benchmark::State& state) {
    const auto& in = rects();
    std::vector<ZYRStd::sZYRRect> out(in.size());
    ZYRStd::sZYRMatrix m = benchMatrix();
    for (auto _ : state) {
        benchmark::DoNotOptimize(m);
        peerBBoxes(m, in, out.data());
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(static_cast<int64_t>(state.iterations()) * kCount);
}

void BM_FixedMulDiv_Ours(benchmark::State& state) {
    const auto& in = triples();
    std::vector<int32_t> out(in.size());
    for (size_t i = 0; i < in.size(); ++i) {
        const bool rounded = (i & 1) != 0;
        if (ZYRStd::FixedMulDiv(in[i].a, in[i].b, in[i].c, rounded) !=
            peerMulDiv(in[i].a, in[i].b, in[i].c, rounded)) {
            state.SkipWithError("FixedMulDiv differs from the inline loop");
            return;
        }
    }
    for (auto _ : state) {
        for (size_t i = 0; i < in.size(); ++i)
            out[i] = ZYRStd::FixedMulDiv(in[i].a, in[i].b, in[i].c, (i & 1) != 0);
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(static_cast<int64_t>(state.iterations()) * kCount);
}

void BM_FixedMulDiv_Peer(benchmark::State& state) {
    const auto& in = triples();
    std::vector<int32_t> out(in.size());
    for (auto _ : state) {
        for (size_t i = 0; i < in.size(); ++i)
            out[i] = peerMulDiv(in[i].a, in[i].b, in[i].c, (i & 1) != 0);
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(static_cast<int64_t>(state.iterations()) * kCount);
}

BENCHMARK(BM_TransformBBox_Ours)->Repetitions(5)->MinTime(0.1)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_TransformBBox_Peer)->Repetitions(5)->MinTime(0.1)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_FixedMulDiv_Ours)->Repetitions(5)->MinTime(0.1)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_FixedMulDiv_Peer)->Repetitions(5)->MinTime(0.1)->Unit(benchmark::kMillisecond);

} // namespace

int main(int argc, char** argv) {
    return zyrbench::runWithRatios(
        argc, argv,
        {{"transformBBox_1M", "BM_TransformBBox_Ours", "BM_TransformBBox_Peer"},
         {"FixedMulDiv_1M", "BM_FixedMulDiv_Ours", "BM_FixedMulDiv_Peer"}});
}
