#include <atomic>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <mutex>
#include <random>
#include <thread>
#include <utility>
#include <vector>

#include <sys/wait.h>
#include <unistd.h>

#include "ZYRHostKit.h"
#include "ZYRStd.h"

namespace {

using namespace ZYRStd;
using Clock = std::chrono::steady_clock;

constexpr unsigned long long kMiB = 1024 * 1024;
constexpr unsigned long long kHeadroom = 48 * kMiB;
constexpr unsigned int kWorkers = 4;
constexpr size_t kCachedBlocksMost = 64;

std::atomic<unsigned long long> allocations{0}, refusals{0}, flushes{0}, syncs{0}, resizes{0};

class Cache : public I_FlushableMemoryClient {
public:
    explicit Cache(const char* name) : name_(name) {}
    ~Cache() override { dropAll(); }

    void keep(void* block, unsigned int size) {
        std::lock_guard<std::mutex> hold(guard_);
        blocks_.push_back({block, size});
        bytes_ += size;
        if (blocks_.size() > kCachedBlocksMost) {
            ZYRDMMFree(blocks_.front().first, name_, nullptr);
            bytes_ -= blocks_.front().second;
            blocks_.erase(blocks_.begin());
        }
    }
    bool flushMemory(unsigned int, unsigned int, eFlushMemorySeverity) override {
        flushes.fetch_add(1, std::memory_order_relaxed);
        return dropAll() > 0;
    }
    unsigned int getFlushableMemorySize() override {
        std::lock_guard<std::mutex> hold(guard_);
        return bytes_;
    }
    const char* getClientName() override { return name_; }

    unsigned int dropAll() {
        std::lock_guard<std::mutex> hold(guard_);
        for (const auto& [block, size] : blocks_)
            ZYRDMMFree(block, name_, nullptr);
        blocks_.clear();
        return std::exchange(bytes_, 0);
    }

private:
    const char* name_;
    std::mutex guard_; // blocks_ and bytes_
    std::vector<std::pair<void*, unsigned int>> blocks_;
    unsigned int bytes_ = 0;
};

// Fills bands from the heap and from virtual memory (some partly decommitted), and gives
// them all back when the interpreter asks it to catch up.
class Renderer : public ZYRPublic::I_SurfaceQueue {
public:
    bool synchronize(bool) override {
        syncs.fetch_add(1, std::memory_order_relaxed);
        std::lock_guard<std::mutex> hold(guard_);
        for (const auto& [band, isVirtual] : bands_)
            isVirtual ? VirtualMemFree(band) : ZYRFree(band);
        bands_.clear();
        return true;
    }
    void run(const std::atomic<bool>& stop) {
        SetCZYRThreadSpecificPtr(new CZYRThreadSpecificPtr("renderer", false));
        for (unsigned int n = 0; !stop.load(std::memory_order_relaxed); ++n) {
            const bool isVirtual = n % 2 != 0;
            auto* band = static_cast<char*>(isVirtual ? VirtualMemAlloc(200001 + n % 3 * 4096)
                                                      : ZYRMalloc(256 * 1024));
            if (band) {
                if (isVirtual && n % 4 == 1)
                    VirtualMemDecommit(band, band + 65536, 65536);
                std::lock_guard<std::mutex> hold(guard_);
                bands_.emplace_back(band, isVirtual);
            }
            std::this_thread::sleep_for(std::chrono::microseconds(200));
        }
        synchronize(false);
    }

private:
    std::mutex guard_; // bands_
    std::vector<std::pair<void*, bool>> bands_;
};

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

void work(unsigned int index, Cache& cache, const std::atomic<bool>& stop) {
    static const char* const kNames[] = {"worker0", "worker1", "worker2", "worker3"};
    SetCZYRThreadSpecificPtr(new CZYRThreadSpecificPtr(kNames[index], true));
    std::mt19937 random(index + 1);
    std::vector<void*> mine; // blocks this thread holds for itself
    while (!stop.load(std::memory_order_relaxed)) {
        const unsigned int size = 16u << (random() % 17); // 16 bytes to 1 MiB
        void* p = ZYRDMMMalloc(size, kNames[index], nullptr, nullptr, &cache,
                               ZYRPublic::eFlushMemorySeverityNormal);
        if (!p) {
            refusals.fetch_add(1, std::memory_order_relaxed);
            continue;
        }
        allocations.fetch_add(1, std::memory_order_relaxed);
        if (random() % 2) {
            cache.keep(p, size);
        } else {
            mine.push_back(p);
            if (mine.size() > 32 || random() % 4 == 0) {
                const size_t at = random() % mine.size();
                ZYRDMMFree(mine[at], kNames[index], nullptr);
                mine.erase(mine.begin() + static_cast<long>(at));
            }
        }
    }
    for (void* p : mine)
        ZYRDMMFree(p, kNames[index], nullptr);
    SetCZYRThreadSpecificPtr(nullptr);
}

// One round at the statistics level of ZYR_MEMORY_STAT; usage never passes the limit: the
// tracker's peak at levels 1 and 2, a sampled usage at level 0.
int soakRound(int duration) {
    ZYRStd::tZYRMemMgr host = ZYRHostKit::crtMemMgr();
    ZYRStdInit_ZYRMemMgrSet(&host);
    ZYRStdInit_InitializeFlushableMemoryClientRegistry();
    const int level = ZYRGetMemStatLevel();

    const unsigned long long before = GetMemUsage();
    ZYRSetMemLimit(0);
    const unsigned long long limit = ZYRGetMemLimit();
    void* ballast = ZYRMalloc(static_cast<unsigned int>(limit - before - kHeadroom));
    if (!ballast) {
        std::puts("soak: FAILED, no room for the ballast");
        return 1;
    }

    Cache caches[kWorkers]{Cache("cache0"), Cache("cache1"), Cache("cache2"), Cache("cache3")};
    for (Cache& cache : caches)
        RegisterFlushableMemoryClient(&cache, true);
    Renderer renderer;
    RegisterSurfaceQueueInstance(&renderer);

    std::atomic<bool> stop{false};
    unsigned long long sampled = 0;
    std::vector<std::thread> threads;
    threads.emplace_back([&] { renderer.run(stop); });
    threads.emplace_back(resize, std::cref(stop));
    for (unsigned int i = 0; i < kWorkers; ++i)
        threads.emplace_back(work, i, std::ref(caches[i]), std::cref(stop));
    for (const auto end = Clock::now() + std::chrono::seconds(duration); Clock::now() < end;) {
        sampled = std::max(sampled, GetMemUsage());
        std::this_thread::sleep_for(std::chrono::microseconds(50));
    }
    stop = true;
    for (std::thread& t : threads)
        t.join();

    RegisterSurfaceQueueInstance(nullptr);
    for (Cache& cache : caches) {
        UnregisterFlushableMemoryClient(&cache);
        cache.dropAll();
    }
    ZYRFree(ballast);
    const unsigned long long after = GetMemUsage();
    ZYRStdInit_TerminateFlushableMemoryClientRegistry();
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

// Each statistics level in a process of its own (the level is fixed at start-up).
int main() {
    const char* seconds = std::getenv("ZYRSTD_SOAK_SECONDS");
    const int duration = std::max(1, (seconds ? std::atoi(seconds) : 2) / 3);
    int failed = 0;
    for (const char* level : {"0", "1", "2"}) {
        std::fflush(stdout);
        const pid_t child = ::fork();
        if (child == 0) {
            ::setenv("ZYR_MEMORY_STAT", level, 1);
            const int rc = soakRound(duration);
            std::fflush(stdout);
            std::_Exit(rc);
        }
        int status = 0;
        failed += child < 0 || ::waitpid(child, &status, 0) != child || !WIFEXITED(status) ||
                  WEXITSTATUS(status) != 0;
    }
    return failed ? 1 : 0;
}
