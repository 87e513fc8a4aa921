// Sub-allocators against glibc: VariableSizeAllocator on a random allocate/free trace and
// ZYRFixedSizePool on 64-byte elements; also the variable allocator's memory overhead.
#include <benchmark/benchmark.h>

#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <random>
#include <vector>

#include "BenchSupport.h"
#include "ZYRStd.h"
#include "zyr/std/memory/ZYRPool.h"

namespace {

constexpr unsigned int kPageSize = 65536;
constexpr unsigned int kTraceLiveTarget = 1000;
constexpr unsigned int kPoolElements = 1024;
constexpr unsigned int kPoolChurn = 4096;

// Pages come from the library's heap front, as a client's supplier would take them; the
// virtual-memory default would measure mmap rather than the allocator.
void* heapPage(unsigned int bytes, void*) {
    return ZYRStd::ZYRMalloc(bytes);
}
void heapPageFree(void* page, void*) {
    ZYRStd::ZYRFree(page);
}

// One step of a trace: allocate `size` bytes into `slot`, or free the slot when size is 0.
struct Step {
    uint32_t slot;
    uint32_t size;
};

struct Trace {
    std::vector<Step> steps;
    uint32_t slots = 0;
};

// Requests of 16 to 4096 bytes; frees interleave at random with the allocations, the live
// set grows to about kTraceLiveTarget blocks, and everything is freed by the end.
const Trace& trace() {
    static const Trace built = [] {
        Trace t;
        std::mt19937 random(20240607);
        std::uniform_int_distribution<uint32_t> size(16, 4096);
        std::vector<uint32_t> live;
        std::vector<uint32_t> freeSlots;
        for (int i = 0; i < 20000; ++i) {
            const unsigned allocPercent = live.size() < kTraceLiveTarget ? 70 : 50;
            if (live.empty() || random() % 100 < allocPercent) {
                uint32_t slot;
                if (freeSlots.empty()) {
                    slot = t.slots++;
                } else {
                    slot = freeSlots.back();
                    freeSlots.pop_back();
                }
                live.push_back(slot);
                t.steps.push_back({slot, size(random)});
            } else {
                const size_t pick = random() % live.size();
                t.steps.push_back({live[pick], 0});
                freeSlots.push_back(live[pick]);
                live[pick] = live.back();
                live.pop_back();
            }
        }
        std::shuffle(live.begin(), live.end(), random);
        for (uint32_t slot : live)
            t.steps.push_back({slot, 0});
        return t;
    }();
    return built;
}

template <class Allocate, class Free>
void replay(const Trace& t, std::vector<void*>& slots, Allocate allocate, Free release) {
    for (const Step& step : t.steps) {
        if (step.size) {
            slots[step.slot] = allocate(step.size);
            benchmark::DoNotOptimize(slots[step.slot]);
        } else {
            release(slots[step.slot]);
        }
    }
}

void BM_VariableSizeAllocator_Trace(benchmark::State& state) {
    const Trace& t = trace();
    std::vector<void*> slots(t.slots);
    VariableSizeAllocator allocator("PoolBench", 1, 0, kPageSize, heapPage, heapPageFree, nullptr);
    unsigned int obtained = 0;
    for (auto _ : state)
        replay(
            t, slots, [&](uint32_t n) { return allocator.allocate(n, obtained); },
            [&](void* p) { allocator.Free(p); });
    state.SetItemsProcessed(state.iterations() * static_cast<int64_t>(t.steps.size()));
}

void BM_Malloc_Trace(benchmark::State& state) {
    const Trace& t = trace();
    std::vector<void*> slots(t.slots);
    for (auto _ : state)
        replay(
            t, slots, [](uint32_t n) { return std::malloc(n); }, [](void* p) { std::free(p); });
    state.SetItemsProcessed(state.iterations() * static_cast<int64_t>(t.steps.size()));
}

// A pool's life: kPoolElements elements allocated, then kPoolChurn steps that each free a
// random live element and allocate one in its place, then everything freed in random order.
struct PoolPlan {
    std::vector<uint32_t> churn;
    std::vector<uint32_t> finalOrder;
};

const PoolPlan& poolPlan() {
    static const PoolPlan plan = [] {
        PoolPlan p;
        std::mt19937 random(99);
        for (unsigned int i = 0; i < kPoolChurn; ++i)
            p.churn.push_back(random() % kPoolElements);
        p.finalOrder.resize(kPoolElements);
        for (uint32_t i = 0; i < kPoolElements; ++i)
            p.finalOrder[i] = i;
        std::shuffle(p.finalOrder.begin(), p.finalOrder.end(), random);
        return p;
    }();
    return plan;
}

template <class Allocate, class Free>
void poolLife(benchmark::State& state, Allocate allocate, Free release) {
    const PoolPlan& plan = poolPlan();
    std::vector<void*> elements(kPoolElements);
    for (auto _ : state) {
        for (void*& e : elements) {
            e = allocate();
            benchmark::DoNotOptimize(e);
        }
        for (uint32_t i : plan.churn) {
            release(elements[i]);
            elements[i] = allocate();
            benchmark::DoNotOptimize(elements[i]);
        }
        for (uint32_t i : plan.finalOrder)
            release(elements[i]);
    }
    state.SetItemsProcessed(state.iterations() * (kPoolElements + kPoolChurn));
}

void BM_ZYRFixedSizePool_64(benchmark::State& state) {
    ZYRStd::ZYRFixedSizePool pool(64, 256);
    poolLife(
        state, [&] { return pool.Alloc(); }, [&](void* p) { pool.Free(p); });
}

void BM_Malloc_64(benchmark::State& state) {
    poolLife(
        state, [] { return std::malloc(64); }, [](void* p) { std::free(p); });
}

BENCHMARK(BM_VariableSizeAllocator_Trace);
BENCHMARK(BM_Malloc_Trace);
BENCHMARK(BM_ZYRFixedSizePool_64);
BENCHMARK(BM_Malloc_64);

// Peak bytes taken from the supplier over peak bytes requested and not yet freed.
double traceOverhead() {
    const Trace& t = trace();
    std::vector<void*> slots(t.slots);
    std::vector<uint32_t> sizes(t.slots);
    VariableSizeAllocator allocator("PoolBench", 1, 0, kPageSize, heapPage, heapPageFree, nullptr);
    uint64_t live = 0;
    uint64_t peakLive = 0;
    unsigned int obtained = 0;
    for (const Step& step : t.steps) {
        if (step.size) {
            slots[step.slot] = allocator.allocate(step.size, obtained);
            sizes[step.slot] = step.size;
            live += step.size;
            peakLive = std::max(peakLive, live);
        } else {
            allocator.Free(slots[step.slot]);
            live -= sizes[step.slot];
        }
    }
    return static_cast<double>(allocator.getVarPagePeakAllocAmount()) /
           static_cast<double>(peakLive);
}

} // namespace

int main(int argc, char** argv) {
    zyrbench::installFront();
    const double overhead = traceOverhead();
    const int status = zyrbench::runWithRatios(
        argc, argv,
        {{"VariableSizeAllocator_trace", "BM_VariableSizeAllocator_Trace", "BM_Malloc_Trace"},
         {"ZYRFixedSizePool_64", "BM_ZYRFixedSizePool_64", "BM_Malloc_64"}});
    std::printf("OVERHEAD VariableSizeAllocator peak_held_over_peak_live=%.3f\n", overhead);
    return status;
}
