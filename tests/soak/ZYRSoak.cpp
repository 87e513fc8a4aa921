// Threads allocating under a tight limit: an interpreter-like worker pool with flushable
// caches, a renderer filling heap and virtual-memory bands, and a thread resizing one big
// block. Each statistics level runs in a process of its own (the level is fixed at start-up).
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
using Clock = std::chrono::steady_clock;

constexpr unsigned long long kMiB = 1024 * 1024;
constexpr unsigned long long kHeadroom = 48 * kMiB;
constexpr unsigned int kWorkers = 4;
const char* const kNames[kWorkers] = {"worker0", "worker1", "worker2", "worker3"};

// Counters for the summary only: relaxed, nothing is published through them.
std::atomic<unsigned long long> allocations{0}, refusals{0}, flushes{0}, syncs{0}, resizes{0};
void count(std::atomic<unsigned long long>& counter) {
    counter.fetch_add(1, std::memory_order_relaxed);
}

// Blocks kept for later, all dropped when the memory manager asks.
struct Cache : I_FlushableMemoryClient {
    explicit Cache(const char* name) : name(name) {}
    ~Cache() override { dropAll(); }
    void keep(void* block, unsigned int size) {
        std::lock_guard hold(guard);
        blocks.emplace_back(block, size);
        bytes += size;
    }
    bool flushMemory(unsigned int, unsigned int, eFlushMemorySeverity) override {
        count(flushes);
        return dropAll() > 0;
    }
    unsigned int getFlushableMemorySize() override {
        std::lock_guard hold(guard);
        return bytes;
    }
    const char* getClientName() override { return name; }
    unsigned int dropAll() {
        std::lock_guard hold(guard);
        for (const auto& [block, size] : blocks)
            ZYRDMMFree(block, name, nullptr);
        blocks.clear();
        return std::exchange(bytes, 0);
    }

    const char* name;
    std::mutex guard; // blocks and bytes
    std::vector<std::pair<void*, unsigned int>> blocks;
    unsigned int bytes = 0;
};

// Fills bands from the heap and from virtual memory (some partly decommitted), and gives
// them all back when the interpreter asks it to catch up.
struct Renderer : ZYRPublic::I_SurfaceQueue {
    bool synchronize(bool) override {
        count(syncs);
        std::lock_guard hold(guard);
        for (const auto& [band, isVirtual] : bands)
            isVirtual ? VirtualMemFree(band) : ZYRFree(band);
        bands.clear();
        return true;
    }
    void run(const std::atomic<bool>& stop) {
        SetCZYRThreadSpecificPtr(new CZYRThreadSpecificPtr("renderer", false));
        for (unsigned int n = 0; !stop.load(std::memory_order_relaxed); ++n) {
            const bool isVirtual = n % 2 != 0;
            auto* band = static_cast<char*>(isVirtual ? VirtualMemAlloc(200001 + n % 3 * 4096)
                                                      : ZYRMalloc(256 * 1024));
            if (band && isVirtual && n % 4 == 1)
                VirtualMemDecommit(band, band + 65536, 65536);
            if (band) {
                std::lock_guard hold(guard);
                bands.emplace_back(band, isVirtual);
            }
            std::this_thread::sleep_for(std::chrono::microseconds(200));
        }
        synchronize(false);
    }

    std::mutex guard; // bands
    std::vector<std::pair<void*, bool>> bands;
};

// Resizes one block between 1 and 16 MiB, racing the others for the last bytes.
void resize(const std::atomic<bool>& stop) {
    std::mt19937 random(99);
    void* block = ZYRMalloc(kMiB);
    while (block && !stop.load(std::memory_order_relaxed))
        if (void* resized =
                ZYRRealloc(block, static_cast<unsigned int>((1 + random() % 16) * kMiB)))
            block = resized, count(resizes);
    ZYRFree(block);
}

void work(unsigned int index, Cache& cache, const std::atomic<bool>& stop) {
    SetCZYRThreadSpecificPtr(new CZYRThreadSpecificPtr(kNames[index], true));
    std::mt19937 random(index + 1);
    std::vector<void*> mine; // blocks this thread holds for itself
    while (!stop.load(std::memory_order_relaxed)) {
        const unsigned int size = 16u << (random() % 17); // 16 bytes to 1 MiB
        void* p = ZYRDMMMalloc(size, kNames[index], nullptr, nullptr, &cache,
                               ZYRPublic::eFlushMemorySeverityNormal);
        count(p ? allocations : refusals);
        if (p && random() % 2)
            cache.keep(p, size);
        else if (p)
            mine.push_back(p);
        if (!mine.empty() && (mine.size() > 32 || random() % 4 == 0)) {
            std::swap(mine[random() % mine.size()], mine.back());
            ZYRDMMFree(mine.back(), kNames[index], nullptr);
            mine.pop_back();
        }
    }
    for (void* p : mine)
        ZYRDMMFree(p, kNames[index], nullptr);
    SetCZYRThreadSpecificPtr(nullptr);
}

// One round at the level of ZYR_MEMORY_STAT. Usage never passes the limit: the tracker's
// peak at levels 1 and 2, a sampled usage at level 0.
int soakRound(int duration) {
    ZYRStd::tZYRMemMgr host = ZYRHostKit::crtMemMgr();
    ZYRStdInit_ZYRMemMgrSet(&host);
    ZYRStdInit_InitializeFlushableMemoryClientRegistry();
    const unsigned long long before = GetMemUsage();
    ZYRSetMemLimit(0);
    const unsigned long long limit = ZYRGetMemLimit();
    void* ballast = ZYRMalloc(static_cast<unsigned int>(limit - before - kHeadroom));
    if (!ballast)
        return std::puts("soak: FAILED, no room for the ballast"), 1;

    Cache caches[kWorkers]{Cache("cache0"), Cache("cache1"), Cache("cache2"), Cache("cache3")};
    for (Cache& cache : caches)
        RegisterFlushableMemoryClient(&cache, true);
    Renderer renderer;
    RegisterSurfaceQueueInstance(&renderer);
    std::atomic<bool> stop{false};
    std::vector<std::thread> threads;
    threads.emplace_back([&] { renderer.run(stop); });
    threads.emplace_back(resize, std::cref(stop));
    for (unsigned int i = 0; i < kWorkers; ++i)
        threads.emplace_back(work, i, std::ref(caches[i]), std::cref(stop));
    unsigned long long sampled = 0;
    for (const auto end = Clock::now() + std::chrono::seconds(duration); Clock::now() < end;) {
        sampled = std::max(sampled, GetMemUsage());
        std::this_thread::sleep_for(std::chrono::microseconds(50));
    }
    stop = true;
    for (std::thread& t : threads)
        t.join();

    RegisterSurfaceQueueInstance(nullptr);
    for (Cache& cache : caches)
        UnregisterFlushableMemoryClient(&cache), cache.dropAll();
    ZYRFree(ballast);
    const unsigned long long after = GetMemUsage();
    ZYRStdInit_TerminateFlushableMemoryClientRegistry();
    const int level = ZYRGetMemStatLevel();
    const unsigned long long peak = level ? ZYRMemMgr_dbgMemState().peakBytes : sampled;
    const unsigned long long over = peak > limit ? peak - limit : 0;
    std::printf("soak: level %d, %d s, %u workers, %llu allocations, %llu refused, %llu resizes, "
                "%llu flushes, %llu renderer syncs; usage before %llu, after %llu; peak %llu, "
                "%llu over the limit\n",
                level, duration, kWorkers, allocations.load(), refusals.load(), resizes.load(),
                flushes.load(), syncs.load(), before, after, peak, over);
    const bool ok = after == before && allocations.load() > 0 && over == 0;
    std::puts(ok ? "soak: ok" : "soak: FAILED, the accounting drifted, passed the limit or idled");
    return ok ? 0 : 1;
}

} // namespace

int main() {
    const char* seconds = std::getenv("ZYRSTD_SOAK_SECONDS");
    const int duration = std::max(1, (seconds ? std::atoi(seconds) : 2) / 3);
    int failed = 0;
    for (const char* level : {"0", "1", "2"}) {
        std::fflush(stdout);
        const pid_t child = ::fork();
        if (child == 0) {
            ::setenv("ZYR_MEMORY_STAT", level, 1);
            const int status = soakRound(duration);
            std::fflush(stdout);
            std::_Exit(status);
        }
        int status = 0;
        failed += child < 0 || ::waitpid(child, &status, 0) != child || !WIFEXITED(status) ||
                  WEXITSTATUS(status) != 0;
    }
    return failed ? 1 : 0;
}
