// One ZYRStopWatch pass on an empty section against a pair of steady_clock readings.
#include <benchmark/benchmark.h>

#include <chrono>

#include "BenchSupport.h"
#include "ZYRStd.h"

namespace {

void BM_StopWatch_Ours(benchmark::State& state) {
    ZYRStd::ZYRTimingManager::Initialize();
    ZYRStd::ZYRTimeAccumulator acc("", __FILE__, __LINE__);
    for (auto _ : state) {
        ZYRStd::ZYRStopWatch watch(acc);
    }
    benchmark::DoNotOptimize(acc.GetTotalTicks());
}

void BM_StopWatch_SteadyClock(benchmark::State& state) {
    long long total = 0;
    for (auto _ : state) {
        const auto start = std::chrono::steady_clock::now();
        const auto end = std::chrono::steady_clock::now();
        total += (end - start).count();
    }
    benchmark::DoNotOptimize(total);
}

BENCHMARK(BM_StopWatch_Ours)->Repetitions(5)->MinTime(0.2);
BENCHMARK(BM_StopWatch_SteadyClock)->Repetitions(5)->MinTime(0.2);

} // namespace

int main(int argc, char** argv) {
    return zyrbench::runWithRatios(
        argc, argv, {{"stopwatch", "BM_StopWatch_Ours", "BM_StopWatch_SteadyClock"}});
}
