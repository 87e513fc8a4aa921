// The allocation front at statistics level 0 against glibc malloc/free, on one and two threads.
#include <benchmark/benchmark.h>

#include <array>
#include <cstdlib>
#include <random>

#include "BenchSupport.h"
#include "ZYRStd.h"

namespace {

constexpr size_t kRing = 64;
constexpr size_t kSizes = 4096;

const std::array<unsigned int, kSizes>& requestSizes() {
    static const std::array<unsigned int, kSizes> sizes = [] {
        std::array<unsigned int, kSizes> out{};
        std::mt19937 random(2024);
        std::uniform_int_distribution<unsigned int> size(16, 4096);
        for (auto& s : out)
            s = size(random);
        return out;
    }();
    return sizes;
}

// Each iteration frees the oldest of 64 live blocks and allocates a new one in its place.
template <class Allocate, class Free>
void churn(benchmark::State& state, Allocate allocate, Free release) {
    const auto& sizes = requestSizes();
    std::array<void*, kRing> live{};
    size_t next = static_cast<size_t>(state.thread_index()) * 977;
    for (auto _ : state) {
        void*& slot = live[next % kRing];
        release(slot);
        slot = allocate(sizes[next % kSizes]);
        benchmark::DoNotOptimize(slot);
        ++next;
    }
    for (void* p : live)
        release(p);
}

void BM_Front(benchmark::State& state) {
    churn(
        state, [](unsigned int n) { return ZYRStd::ZYRMalloc(n); },
        [](void* p) { ZYRStd::ZYRFree(p); });
}

void BM_Glibc(benchmark::State& state) {
    churn(
        state, [](unsigned int n) { return std::malloc(n); }, [](void* p) { std::free(p); });
}

BENCHMARK(BM_Front);
BENCHMARK(BM_Glibc);
BENCHMARK(BM_Front)->Threads(2)->UseRealTime();
BENCHMARK(BM_Glibc)->Threads(2)->UseRealTime();

} // namespace

int main(int argc, char** argv) {
    return zyrbench::runWithRatios(argc, argv,
                                   {{"front_malloc_free_1thread", "BM_Front", "BM_Glibc"},
                                    {"front_malloc_free_2threads", "BM_Front/real_time/threads:2",
                                     "BM_Glibc/real_time/threads:2"}});
}
