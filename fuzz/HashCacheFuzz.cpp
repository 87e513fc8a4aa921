// The hash cache as an operation program read from the input, checked against a model: the
// set of keys that were linked and neither dropped by a sweep nor removed. Each step is
// followed by the cache's own invariants and a walk of every chain; every entry keeps the
// value it was given.
#include <cstdint>
#include <set>

#include "FuzzSupport.h"
#include "zyr/std/caches/IZYRCache.h"

namespace {

using namespace ZYRStd;

struct Entry : _t_Nlink {
    uint64_t key, value;
};

uint64_t valueFor(uint64_t key) {
    return key * 0x9E3779B97F4A7C15ull + 1;
}

class ModelCache final : public IZYRCache {
public:
    ModelCache(int32_t numEntries, int32_t quota, unsigned char chainLength)
        : IZYRCache(0, numEntries, quota, chainLength), pool_(sizeof(Entry), 32) {
        hcSetPool(&pool_);
    }
    ~ModelCache() override {
        keepMask = 0;
        hcRemoveLastEntries(GetCurrEntries(), nullptr);
        hcEmptyRecycler();
    }

    unsigned int hash(void* key) override {
        return static_cast<unsigned int>(*static_cast<uint64_t*>(key));
    }
    bool match(_t_Nlink* entry, void* key) override {
        return static_cast<Entry*>(entry)->key == *static_cast<uint64_t*>(key);
    }
    // Kept or dropped as the input decided for this key.
    bool HCFlushEntry(_t_Nlink* link, void*) override {
        const auto* entry = static_cast<Entry*>(link);
        zyrfuzz::require(entry->value == valueFor(entry->key));
        const bool keep = (keepMask >> (entry->key % 8)) & 1;
        if (!keep)
            model.erase(entry->key);
        return keep;
    }
    bool HCReportFlush(void*) override { return recycle; }

    // The walk of every chain: the model's keys, each once, with their values.
    bool agrees() const {
        std::set<uint64_t> seen;
        int32_t count = 0;
        for (_t_HashHead* head = hcGetTopHashTable(); head && head <= hcGetBotHashTable(); ++head) {
            unsigned int inChain = 0;
            for (_t_Nlink* e = head->next; e != head; e = e->next, ++inChain) {
                const auto* entry = static_cast<const Entry*>(e);
                if (entry->value != valueFor(entry->key) || !seen.insert(entry->key).second)
                    return false;
                ++count;
            }
            if (inChain != head->count || head->touched > head->count)
                return false;
        }
        return seen == model && count == GetCurrEntries() && checkInvariants();
    }

    std::set<uint64_t> model;
    uint8_t keepMask = 0;
    bool recycle = false;

private:
    ZYRFixedSizePool pool_;
};

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    zyrfuzz::setUpOnce();
    zyrfuzz::Input in(data, size);
    // Valid shapes only: a chain length of 1..8, at least that many entries, a quota within.
    const auto chainLength = static_cast<unsigned char>(in.byte() % 8 + 1);
    const int32_t numEntries = chainLength + in.byte() % 200;
    const int32_t quota = 1 + in.byte() % numEntries;
    ModelCache cache(numEntries, quota, chainLength);
    for (int steps = 0; !in.empty() && steps < 3000; ++steps) {
        // One byte of key: no chain can reach the 8-bit count's end.
        uint64_t key = in.byte();
        try {
            switch (in.byte() % 6) {
            case 0:
            case 1:
                if (!cache.model.count(key)) {
                    auto* entry = static_cast<Entry*>(cache.hcGetEntry(&key, in.byte() % 2));
                    if (entry) {
                        *entry = Entry{{}, key, valueFor(key)};
                        cache.hcLinkEntry(cache.hcGetHashHead(&key), entry);
                        cache.model.insert(key);
                    }
                }
                break;
            case 2:
                zyrfuzz::require((cache.hcGetCachedEntry(&key) != nullptr) ==
                                 (cache.model.count(key) != 0));
                break;
            case 3:
                if (cache.hcRemoveEntry(&key, nullptr))
                    zyrfuzz::require(cache.model.count(key) == 0);
                break;
            case 4:
                cache.hcScavenger(in.byte() % 16, nullptr);
                break;
            default:
                cache.keepMask = in.byte();
                cache.recycle = in.byte() % 2;
                if (in.byte() % 4 == 0)
                    cache.hcRemoveLastEntries(in.byte() % 32, nullptr);
            }
        } catch (const CZYRError&) {
            zyrfuzz::require(false); // valid calls on a valid cache raise nothing
        }
        zyrfuzz::require(cache.agrees());
    }
    return 0;
}
