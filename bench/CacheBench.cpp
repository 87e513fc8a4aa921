// The hash cache against a hand-built LRU map (hits in a full cache, and a churn of new keys
// into a full cache), and mask conversion against a plain copy of the same bytes.
#include <benchmark/benchmark.h>

#include <cstdint>
#include <cstring>
#include <list>
#include <random>
#include <unordered_map>
#include <vector>

#include "BenchSupport.h"
#include "ZYRStd.h"
#include "zyr/std/caches/CZYRMaskCache.h"
#include "zyr/std/caches/IZYRCache.h"

namespace {

constexpr int32_t kEntries = 100000;
constexpr int32_t kReleaseQuota = 64;
constexpr unsigned char kChainLength = 4;
constexpr size_t kProbes = 1 << 16;

struct Entry : ZYRStd::_t_Nlink {
    uint64_t key;
    uint64_t value;
};

class BenchCache final : public ZYRStd::IZYRCache {
public:
    BenchCache() : IZYRCache(0, kEntries, kReleaseQuota, kChainLength), pool_(sizeof(Entry), 4096) {
        hcSetPool(&pool_);
    }
    unsigned int hash(void* key) override {
        const uint64_t k = *static_cast<uint64_t*>(key);
        return static_cast<unsigned int>(k ^ (k >> 32));
    }
    bool match(ZYRStd::_t_Nlink* entry, void* key) override {
        return static_cast<Entry*>(entry)->key == *static_cast<uint64_t*>(key);
    }
    bool add(uint64_t key) {
        auto* entry = static_cast<Entry*>(hcGetEntry(&key, false));
        if (!entry)
            return false;
        entry->key = key;
        entry->value = key + 1;
        hcLinkEntry(hcGetHashHead(&key), entry);
        return true;
    }

private:
    ZYRStd::ZYRFixedSizePool pool_;
};

// The usual LRU: a list in use order, most recent first, and a map into it.
class LruMap {
public:
    struct Item {
        uint64_t key;
        uint64_t value;
    };
    Item* find(uint64_t key) {
        const auto found = index_.find(key);
        if (found == index_.end())
            return nullptr;
        order_.splice(order_.begin(), order_, found->second);
        return &*found->second;
    }
    void add(uint64_t key) {
        if (index_.size() >= static_cast<size_t>(kEntries)) {
            index_.erase(order_.back().key);
            order_.pop_back();
        }
        order_.push_front({key, key + 1});
        index_.emplace(key, order_.begin());
    }

private:
    std::list<Item> order_;
    std::unordered_map<uint64_t, std::list<Item>::iterator> index_;
};

struct Keys {
    std::vector<uint64_t> resident; // kEntries distinct keys
    std::vector<uint64_t> probes;   // random picks among them
};

// Distinct for every n (an odd multiplier is a bijection), and practically never one of the
// random resident keys.
uint64_t freshKey(uint64_t n) {
    return (n + 1) * 0x9E3779B97F4A7C15ull ^ 0x5DEECE66Dull;
}

const Keys& keys() {
    static const Keys built = [] {
        Keys k;
        std::mt19937_64 random(4711);
        std::unordered_map<uint64_t, bool> seen;
        while (k.resident.size() < static_cast<size_t>(kEntries)) {
            const uint64_t key = random();
            if (seen.emplace(key, true).second)
                k.resident.push_back(key);
        }
        for (size_t i = 0; i < kProbes; ++i)
            k.probes.push_back(k.resident[random() % k.resident.size()]);
        return k;
    }();
    return built;
}

void BM_HashCache_Hit(benchmark::State& state) {
    const Keys& k = keys();
    BenchCache cache;
    for (const uint64_t key : k.resident)
        cache.add(key);
    size_t i = 0;
    for (auto _ : state) {
        uint64_t key = k.probes[i++ & (kProbes - 1)];
        benchmark::DoNotOptimize(static_cast<Entry*>(cache.hcGetCachedEntry(&key))->value);
    }
}

void BM_LruMap_Hit(benchmark::State& state) {
    const Keys& k = keys();
    LruMap lru;
    for (const uint64_t key : k.resident)
        lru.add(key);
    size_t i = 0;
    for (auto _ : state)
        benchmark::DoNotOptimize(lru.find(k.probes[i++ & (kProbes - 1)])->value);
}

// New keys into a full cache: every insert needs room.
void BM_HashCache_Churn(benchmark::State& state) {
    const Keys& k = keys();
    BenchCache cache;
    for (const uint64_t key : k.resident)
        cache.add(key);
    size_t i = 0;
    for (auto _ : state)
        benchmark::DoNotOptimize(cache.add(freshKey(i++)));
}

void BM_LruMap_Churn(benchmark::State& state) {
    const Keys& k = keys();
    LruMap lru;
    for (const uint64_t key : k.resident)
        lru.add(key);
    size_t i = 0;
    for (auto _ : state) {
        lru.add(freshKey(i++));
        benchmark::ClobberMemory();
    }
}

constexpr unsigned int kMaskSide = 2000;
constexpr unsigned int kSourceRow = kMaskSide / 8;

std::vector<unsigned char> maskSource() {
    std::vector<unsigned char> source(size_t{kSourceRow} * kMaskSide);
    std::mt19937 random(5);
    for (unsigned char& b : source)
        b = static_cast<unsigned char>(random());
    return source;
}

void BM_MaskConvert(benchmark::State& state) {
    std::vector<unsigned char> source = maskSource();
    ZYRStd::CZYRMaskCache cache(64);
    unsigned int size = 0;
    for (auto _ : state) {
        ZYRStd::ZYR_MaskRec* mask = cache.CreateBitmapMask(source.data(), kMaskSide, kSourceRow,
                                                           kMaskSide, size, false, false);
        benchmark::DoNotOptimize(mask->data);
        benchmark::ClobberMemory();
        cache.DeleteBitmapMask(mask);
    }
}

void BM_MaskMemcpy(benchmark::State& state) {
    const std::vector<unsigned char> source = maskSource();
    std::vector<unsigned char> target(ZYRStd::CZYRMaskCache::RESERVED_MASK_BYTES);
    for (auto _ : state) {
        std::memcpy(target.data(), source.data(), source.size());
        benchmark::DoNotOptimize(target.data());
        benchmark::ClobberMemory();
    }
}

BENCHMARK(BM_HashCache_Hit)->Repetitions(3)->MinTime(0.2);
BENCHMARK(BM_LruMap_Hit)->Repetitions(3)->MinTime(0.2);
BENCHMARK(BM_HashCache_Churn)->Repetitions(3)->MinTime(0.2);
BENCHMARK(BM_LruMap_Churn)->Repetitions(3)->MinTime(0.2);
BENCHMARK(BM_MaskConvert)->Repetitions(3)->MinTime(0.2)->Unit(benchmark::kMicrosecond);
BENCHMARK(BM_MaskMemcpy)->Repetitions(3)->MinTime(0.2)->Unit(benchmark::kMicrosecond);

} // namespace

int main(int argc, char** argv) {
    return zyrbench::runWithRatios(argc, argv,
                                   {{"hashcache_hit", "BM_HashCache_Hit", "BM_LruMap_Hit"},
                                    {"hashcache_churn", "BM_HashCache_Churn", "BM_LruMap_Churn"},
                                    {"mask_convert", "BM_MaskConvert", "BM_MaskMemcpy"}});
}
