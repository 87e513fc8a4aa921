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
constexpr size_t kCachedBlocksMost = 64;

std::atomic<unsigned long long> allocations{0}, refusals{0}, flushes{0}, syncs{0};

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

class Renderer : public ZYRPublic::I_SurfaceQueue {
public:
    bool synchronize(bool) override {
        syncs.fetch_add(1, std::memory_order_relaxed);
        std::lock_guard<std::mutex> hold(guard_);
        for (void* band : bands_)
            ZYRFree(band);
        bands_.clear();
        return true;
    }
    void run(const std::atomic<bool>& stop) {
        SetCZYRThreadSpecificPtr(new CZYRThreadSpecificPtr("renderer", false));
        while (!stop.load(std::memory_order_relaxed)) {
            if (void* band = ZYRMalloc(256 * 1024)) {
                std::lock_guard<std::mutex> hold(guard_);
                bands_.push_back(band);
            }
            std::this_thread::sleep_for(std::chrono::microseconds(200));
        }
        synchronize(false);
    }

private:
    std::mutex guard_; // bands_
    std::vector<void*> bands_;
};

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

} // namespace

int main() {
    ZYRStd::tZYRMemMgr host = ZYRHostKit::crtMemMgr();
    ZYRStdInit_ZYRMemMgrSet(&host);
    ZYRStdInit_InitializeFlushableMemoryClientRegistry();
    const char* seconds = std::getenv("ZYRSTD_SOAK_SECONDS");
    const int duration = seconds ? std::max(1, std::atoi(seconds)) : 2;

    const unsigned long long before = GetMemUsage();
    ZYRSetMemLimit(0);
    void* ballast = ZYRMalloc(static_cast<unsigned int>(ZYRGetMemLimit() - before - kHeadroom));
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
    std::vector<std::thread> threads;
    threads.emplace_back([&] { renderer.run(stop); });
    for (unsigned int i = 0; i < kWorkers; ++i)
        threads.emplace_back(work, i, std::ref(caches[i]), std::cref(stop));
    std::this_thread::sleep_for(std::chrono::seconds(duration));
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

    std::printf("soak: %d s, %u workers, %llu allocations, %llu refused, %llu flushes, "
                "%llu renderer syncs; usage before %llu, after %llu\n",
                duration, kWorkers, allocations.load(), refusals.load(), flushes.load(),
                syncs.load(), before, after);
    const bool ok = after == before && allocations.load() > 0;
    std::puts(ok ? "soak: ok" : "soak: FAILED, the accounting drifted or nothing was allocated");
    return ok ? 0 : 1;
}
