// Threads allocating under a tight limit: workers through the memory manager, a renderer
// filling heap and virtual-memory bands that it gives back when asked to catch up, and a
// thread resizing one big block. Each statistics level runs in a process of its own (it is fixed at
// start-up).
#include <sys/wait.h>
#include <unistd.h>

#include <atomic>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <mutex>
#include <random>
#include <thread>
#include <utility>
#include <vector>

#include "ZYRHostKit.h"
#include "ZYRStd.h"

namespace {

using namespace ZYRStd;
constexpr unsigned long long kMiB = 1024 * 1024;
// For the summary only: relaxed, nothing is published through them.
std::atomic<unsigned long long> allocations{0}, refusals{0}, resizes{0};

// Blocks (a memory-manager block, or a virtual one with size 0) held until given back.
struct Held {
    std::mutex guard; // blocks and bytes
    std::vector<std::pair<void*, unsigned int>> blocks;
    unsigned int bytes = 0;
    void keep(void* block, unsigned int size) {
        std::lock_guard hold(guard);
        blocks.emplace_back(block, size);
        bytes += size;
    }
    unsigned int dropAll() {
        std::lock_guard hold(guard);
        for (const auto& [block, size] : blocks)
            size ? ZYRDMMFree(block, "soak", nullptr) : VirtualMemFree(block);
        blocks.clear();
        return std::exchange(bytes, 0);
    }
};

// Heap bands (kept with their size) and virtual bands, some partly decommitted (kept with
// size 0), all given back when the interpreter asks the renderer to catch up.
struct Renderer : ZYRPublic::I_SurfaceQueue, Held {
    bool synchronize(bool) override { return dropAll(), true; }
    void run(const std::atomic<bool>& stop) {
        SetCZYRThreadSpecificPtr(new CZYRThreadSpecificPtr("renderer", false));
        for (unsigned int n = 0; !stop.load(std::memory_order_relaxed); ++n) {
            auto* band = static_cast<char*>(n % 2 ? VirtualMemAlloc(200001 + n % 3 * 4096)
                                                  : ZYRMalloc(256 * 1024));
            if (band && n % 4 == 1)
                VirtualMemDecommit(band, band + 65536, 65536);
            if (band)
                keep(band, n % 2 ? 0 : 256 * 1024);
            std::this_thread::sleep_for(std::chrono::microseconds(200));
        }
        synchronize(false);
    }
};

void work(unsigned int seed, const std::atomic<bool>& stop) {
    SetCZYRThreadSpecificPtr(new CZYRThreadSpecificPtr("worker", true));
    std::mt19937 random(seed);
    Held mine; // blocks this thread frees itself
    while (!stop.load(std::memory_order_relaxed)) {
        const unsigned int size = 16u << (random() % 17); // 16 bytes to 1 MiB
        void* p = ZYRDMMMalloc(size, "soak", nullptr, nullptr, nullptr,
                               ZYRPublic::eFlushMemorySeverityNormal);
        (p ? allocations : refusals).fetch_add(1, std::memory_order_relaxed);
        if (p)
            mine.keep(p, size);
        if (!p || mine.blocks.size() > random() % 1024) // refused: give all back, as a cache would
            mine.dropAll();
    }
    mine.dropAll();
    SetCZYRThreadSpecificPtr(nullptr);
}

// Resizes one block between 1 and 16 MiB, racing the others for the last bytes.
void resize(const std::atomic<bool>& stop) {
    std::mt19937 random(99);
    void* block = ZYRMalloc(kMiB);
    while (block && !stop.load(std::memory_order_relaxed))
        if (void* resized =
                ZYRRealloc(block, static_cast<unsigned int>((1 + random() % 16) * kMiB)))
            block = resized, resizes.fetch_add(1, std::memory_order_relaxed);
    ZYRFree(block);
}

// One round at the level of ZYR_MEMORY_STAT. Usage never passes the limit: the tracker's
// peak at levels 1 and 2, a sampled usage at level 0.
int soakRound(int seconds) {
    ZYRStd::tZYRMemMgr host = ZYRHostKit::crtMemMgr();
    ZYRStdInit_ZYRMemMgrSet(&host);
    ZYRStdInit_InitializeFlushableMemoryClientRegistry();
    const unsigned long long before = GetMemUsage();
    ZYRSetMemLimit(0);
    const unsigned long long limit = ZYRGetMemLimit();
    void* ballast = ZYRMalloc(static_cast<unsigned int>(limit - before - 48 * kMiB));
    Renderer renderer;
    RegisterSurfaceQueueInstance(&renderer);
    std::atomic<bool> stop{false};
    std::vector<std::thread> threads;
    threads.emplace_back([&] { renderer.run(stop); });
    threads.emplace_back(resize, std::cref(stop));
    for (unsigned int i = 0; i < 4; ++i)
        threads.emplace_back(work, i + 1, std::cref(stop));
    unsigned long long sampled = 0;
    const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(seconds);
    while (std::chrono::steady_clock::now() < end) {
        sampled = std::max(sampled, GetMemUsage());
        std::this_thread::sleep_for(std::chrono::microseconds(50));
    }
    stop = true;
    for (std::thread& t : threads)
        t.join();
    RegisterSurfaceQueueInstance(nullptr);
    ZYRFree(ballast);
    const unsigned long long after = GetMemUsage();
    ZYRStdInit_TerminateFlushableMemoryClientRegistry();
    const int level = ZYRGetMemStatLevel();
    const unsigned long long peak = level ? ZYRMemMgr_dbgMemState().peakBytes : sampled;
    const unsigned long long over = peak > limit ? peak - limit : 0;
    std::printf("soak: level %d, %d s, %llu allocations, %llu refused, %llu resizes; usage before "
                "%llu, after %llu; peak %llu, %llu over the limit\n",
                level, seconds, allocations.load(), refusals.load(), resizes.load(), before, after,
                peak, over);
    const bool ok = ballast && after == before && allocations.load() > 0 && over == 0;
    std::puts(ok ? "soak: ok"
                 : "soak: FAILED (no ballast, accounting drift, over the limit or idle)");
    return ok ? 0 : 1;
}

} // namespace

int main() {
    const char* seconds = std::getenv("ZYRSTD_SOAK_SECONDS");
    const int each = std::max(1, (seconds ? std::atoi(seconds) : 2) / 3);
    int failed = 0;
    for (const char* level : {"0", "1", "2"}) {
        std::fflush(stdout);
        const pid_t child = ::fork();
        if (child == 0) {
            ::setenv("ZYR_MEMORY_STAT", level, 1);
            const int status = soakRound(each);
            std::fflush(stdout);
            std::_Exit(status);
        }
        int status = 0;
        failed += child < 0 || ::waitpid(child, &status, 0) != child || !WIFEXITED(status) ||
                  WEXITSTATUS(status) != 0;
    }
    return failed ? 1 : 0;
}
