#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstdint>
#include <cstring>
#include <map>
#include <memory>
#include <random>
#include <set>
#include <string>
#include <tuple>
#include <vector>

#include "TestSupport.h"
#include "zyr/std/caches/CZYRMaskCache.h"
#include "zyr/std/caches/IZYRCache.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/CZYRErrorStk.h"
#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/core/ZYRVirtualMem.h"

using namespace ZYRStd;

namespace {

constexpr const char* kMaskSource = "source/zyr/std/CZYRMaskCache";
constexpr const char* kSource = "source/zyr/std/ZYRCache";
constexpr const char* kHeader = "source/zyr/std/IZYRCache";

template <class Call>
void expectError(Call call, int type, const char* message, const char* source, int line = 0) {
    std::string got = zyrtest::thrown(call);
    if (!line && got.rfind(':') != std::string::npos)
        got = got.substr(0, got.rfind(':')) + ":0)";
    EXPECT_EQ(got, zyrtest::describe(type, message, source, line));
}
template <class Call>
void expectAssertion(Call call, const char* source = kMaskSource, int line = 0) {
    expectError(call, ZYRPublic::kZYRErrorAssertionFailed, "assertion failed", source, line);
}

struct Entry : _t_Nlink {
    uint64_t key, value;
};
constexpr auto valueFor = [](uint64_t key) -> uint64_t { return key * 2654435761u + 17; };
using Keys = std::vector<uint64_t>;

// Keys hash to themselves, so a test picks a key's chain as key mod H.
class TestCache final : public IZYRCache {
public:
    TestCache(int32_t numEntries, int32_t releaseQuota, unsigned char chainLength,
              unsigned int entriesPerChunk = 64)
        : IZYRCache(0, numEntries, releaseQuota, chainLength),
          pool(sizeof(Entry), entriesPerChunk) {
        hcSetPool(&pool);
    }
    ~TestCache() { EXPECT_TRUE(checkInvariants()) << "invariants broken"; }

    unsigned int hash(void* key) override {
        return static_cast<unsigned int>(*static_cast<uint64_t*>(key));
    }
    bool match(_t_Nlink* entry, void* key) override {
        return static_cast<Entry*>(entry)->key == *static_cast<uint64_t*>(key);
    }
    bool HCFlushEntry(_t_Nlink* link, void*) override {
        const auto* entry = static_cast<Entry*>(link);
        EXPECT_EQ(entry->value, valueFor(entry->key)) << "entry damaged before its flush";
        offered.push_back(entry->key);
        return keepAll || kept.count(entry->key) != 0;
    }
    bool HCReportFlush(void* ctx) override {
        return ctx ? (reports.push_back(ctx), false) : recycle;
    }

    Entry* add(uint64_t key, bool force = false, bool link = true) {
        auto* entry = static_cast<Entry*>(hcGetEntry(&key, force));
        if (entry)
            *entry = Entry{{}, key, valueFor(key)};
        if (entry && link)
            hcLinkEntry(hcGetHashHead(&key), entry);
        return entry;
    }
    Entry* find(uint64_t key) { return static_cast<Entry*>(hcGetCachedEntry(&key)); }
    _t_HashHead* head(unsigned int index) { return hcGetTopHashTable() + index; }
    Keys chain(unsigned int index) { // front first
        Keys keys;
        for (_t_Nlink* e = head(index)->next; e != head(index); e = e->next)
            keys.push_back(static_cast<Entry*>(e)->key);
        return keys;
    }

    ZYRFixedSizePool pool;
    std::set<uint64_t> kept;
    bool keepAll = false, recycle = false;
    Keys offered;
    std::vector<void*> reports;
};

TEST(ZYRCacheTest, HeadTablesLongChainsRefusalsAndRelocation) {
    for (const auto& [n, l, heads, limit] :
         {std::tuple{100, 4, 37, 17}, {1000000, 2, 32771, 184}, {3, 1, 3, 6}, {42, 42, 3, 84}}) {
        TestCache cache(n, 1, static_cast<unsigned char>(l));
        EXPECT_EQ(std::tuple(cache.hcGetNumHeads(), cache.ValidateHashCtrl(), cache.hcMemUsed(),
                             cache.hcGetBotHashTable()),
                  std::tuple(heads, true, heads * 16u + sizeof(IZYRCache), cache.head(heads - 1)));
        for (const _t_HashHead* h = cache.head(0); h != cache.head(heads); ++h)
            ASSERT_EQ(std::tuple(h->next, h->count + h->touched, h->chainLimit),
                      std::tuple(h, 0, limit)); // an empty chain points at its own head
    }
    // Chain length above 42, fewer entries than L, quota above the entries, L of 0.
    for (const auto& [n, r, l] : {std::tuple{100, 4, 43}, {41, 4, 42}, {100, 101, 4}, {100, 4, 0}})
        expectAssertion([&] { TestCache(n, r, static_cast<unsigned char>(l)); }, kSource, 92);

    struct Unusable final : IZYRCache {
        unsigned int hash(void*) override { return 0; }
        bool match(_t_Nlink*, void*) override { return false; }
    } unusable;
    uint64_t key = 1;
    EXPECT_TRUE(!unusable.ValidateHashCtrl() && unusable.hcScavenger(5, nullptr) == 0 &&
                unusable.hcTraverse(nullptr, nullptr) == kHCSuccess);
    EXPECT_THROW(unusable.hcGetEntry(&key, true), CZYRError) << "no table to look in";
    TestCache cache(100, 4, 4);
    cache.add(36); // the last of 37 chains counts too
    EXPECT_EQ(cache.hcGetMaxChainLength(), 1);
    for (uint64_t k = 0; k < 40; ++k)
        if (k != 36)
            cache.add(k);
    // Same values change nothing; a new chain length alone is a change.
    for (const auto& [n, l, limit] : {std::tuple{100, 4, 17}, {100, 5, 255}, {200, 5, 255}}) {
        EXPECT_EQ(cache.hcUpdateCacheSize(n, static_cast<unsigned char>(l)), kHCSuccess);
        EXPECT_EQ(std::tuple(cache.GetNumEntries(), cache.GetChainLength(),
                             cache.head(36)->chainLimit, cache.head(0)->chainLimit,
                             cache.hcGetNumHeads()),
                  std::tuple(n, l, limit, limit, 37));
    }
    EXPECT_TRUE(cache.hcUpdateHowManyToRelease(9) == kHCSuccess && cache.GetAvailEntries() == 9);
    cache.kept = {3};
    EXPECT_TRUE(cache.hcFreeCacheControl() == kHCEntriesRemain && cache.hcCountEntries() == 1);
    cache.kept.clear();
    EXPECT_TRUE(cache.hcFreeCacheControl() == kHCSuccess && cache.GetCurrEntries() == 0 &&
                !cache.ValidateHashCtrl());
    expectAssertion([&] { (void)cache.hcUpdateCacheSize(1, 1); }, kHeader, 539);
    expectAssertion([&] { (void)cache.hcUpdateHowManyToRelease(1); }, kHeader, 561);
    EXPECT_THROW((void)cache.hcFreeCacheControl(), CZYRError);
    TestCache full(1000, 1, 1, 300); // 1031 heads
    for (uint64_t i = 0; i < 254; ++i)
        ASSERT_NE(full.add(i * 1031), nullptr);
    expectAssertion([&] { full.add(254 * 1031); }, kHeader, 551);
    EXPECT_TRUE(full.head(0)->count == 255 && IZYRCache::hcIsChainFull(full.head(0)) &&
                full.checkInvariants())
        << "linked and counted before the assertion";
    uint64_t overflow = 255 * 1031; // nothing more fits the 8-bit count: refused before linking
    auto* extra = static_cast<Entry*>(full.pool.Alloc());
    *extra = Entry{{}, overflow, valueFor(overflow)};
    expectAssertion([&] { full.hcInsertEntry(&overflow, extra); }, kHeader, 533);
    expectAssertion([&] { full.hcLinkEntry(full.head(0), extra); }, kHeader, 551);
    EXPECT_TRUE(full.head(0)->count == 255 && !full.find(overflow));
    *extra = Entry{{}, 1, valueFor(1)}; // another chain takes it
    full.hcInsertEntry(&extra->key, extra);
    EXPECT_TRUE(full.find(1) == extra && full.GetMaxEntries() == 256);
    {
        TestCache cache(100, 4, 4);
        for (uint64_t k : {0u, 37u, 74u})
            cache.add(k); // {74, 37, 0}
        Entry* first = static_cast<Entry*>(cache.head(0)->next);
        Entry front{}, loose{};
        IZYRCache::hcRelocateEntry(first, &front, sizeof(Entry));
        EXPECT_TRUE(cache.head(0)->next == &front && cache.chain(0) == (Keys{74, 37, 0}) &&
                    cache.checkInvariants());
        for (const auto& [from, to, bytes] : {std::tuple<Entry*, Entry*, int>{nullptr, &loose, 8},
                                              {&front, nullptr, 8},
                                              {&front, &loose, 0}})
            expectAssertion([&] { IZYRCache::hcRelocateEntry(from, to, bytes); }, kSource, 172);
        IZYRCache::hcRelocateEntry(&front, first, sizeof(Entry)); // back into pool memory
    }
    // One chain kept whole: above 8 L only forced requests succeed, past 250 entries none.
    for (const auto& [n, heads] : {std::pair{20u, 37u}, {251u, 257u}}) {
        TestCache crowded(n, 1, 1);
        crowded.keepAll = true;
        for (uint64_t i = 0; i < n; ++i)
            crowded.add(i * heads);
        EXPECT_EQ(
            (std::array<bool, 3>{!!crowded.add(n * heads, true), !!crowded.add((n + 1) * heads),
                                 !!crowded.add((n + 2) * heads)}),
            (std::array<bool, 3>{n < 250, true, false}))
            << n;
    }
    TestCache recycling(100, 4, 4); // entries dropped by a sweep wait for its report
    recycling.recycle = true;
    recycling.add(0);
    Entry* second = recycling.add(1);
    recycling.CleanupUnTouched(recycling.head(1), nullptr); // entry 1 is no longer touched
    EXPECT_TRUE(recycling.hcScavenger(1, &recycling) == 1 && recycling.add(4) == second);
}

// The cache's rules written out plainly over vectors of keys, front first.
struct Model {
    struct Chain {
        Keys keys;
        unsigned int touched = 0;
    };
    std::vector<Chain> chains;
    int32_t numEntries, release, chainLength;
    int32_t current = 0, peak = 0, skip = 0;
    size_t cursor = 0, reports = 0;
    std::set<uint64_t> kept;
    Keys offered;

    Model(size_t heads, int32_t n, int32_t r, int32_t l)
        : chains(heads), numEntries(n), release(r), chainLength(l) {}
    Chain& chainOf(uint64_t key) { return chains[key % chains.size()]; }

    bool lookup(uint64_t key) {
        Chain& c = chainOf(key);
        const auto found = std::find(c.keys.begin(), c.keys.end(), key);
        if (found == c.keys.end())
            return false;
        const auto position = static_cast<unsigned int>(found - c.keys.begin()) + 1;
        std::rotate(c.keys.begin(), found, found + 1);
        c.touched = position == 1 ? std::max(c.touched, 1u) : c.touched + (position > c.touched);
        return true;
    }
    // Entries past the touched prefix are offered in order; the kept ones stay.
    int32_t cleanup(Chain& c) {
        Keys survivors(c.keys.begin(), c.keys.begin() + std::min<size_t>(c.touched, c.keys.size()));
        for (size_t i = survivors.size(); i < c.keys.size(); ++i) {
            offered.push_back(c.keys[i]);
            if (kept.count(c.keys[i]))
                survivors.push_back(c.keys[i]);
        }
        const auto dropped = static_cast<int32_t>(c.keys.size() - survivors.size());
        c = Chain{survivors, 0};
        return current -= dropped, dropped;
    }
    int32_t scavenge(int32_t count) {
        const size_t first = cursor;
        int32_t dropped = 0;
        do {
            Chain& c = chains[cursor];
            if (c.touched == c.keys.size() && c.touched > static_cast<unsigned>(chainLength))
                c.touched = chainLength;
            dropped += cleanup(c);
            cursor = (cursor + 1) % chains.size();
        } while (dropped < count && cursor != first);
        reports += dropped > 0;
        return dropped;
    }
    bool getEntry(bool force) {
        if (current >= numEntries) {
            if (skip > 0) {
                --skip;
            } else if (scavenge(release) == 0) {
                skip = release;
                const size_t longest =
                    std::max_element(chains.begin(), chains.end(), [](auto& a, auto& b) {
                        return a.keys.size() < b.keys.size();
                    })->keys.size();
                if (current > 8 * chainLength &&
                    (longest > 250 || (longest > size_t(8 * chainLength) && !force)))
                    return false;
            }
        }
        peak = std::max(peak, ++current);
        return true;
    }
    void link(uint64_t key) {
        chainOf(key).keys.insert(chainOf(key).keys.begin(), key);
        ++chainOf(key).touched;
    }
    bool remove(uint64_t key) {
        if (!lookup(key) || (offered.push_back(key), kept.count(key)))
            return false;
        chainOf(key).keys.erase(chainOf(key).keys.begin());
        --chainOf(key).touched;
        return --current, true;
    }
    RetCode traverse(uint64_t drop, uint64_t stop, std::vector<std::pair<uint64_t, bool>>& seen) {
        for (Chain& c : chains) {
            for (size_t i = 0; i < c.keys.size();) {
                const uint64_t key = c.keys[i];
                const bool touched = i < c.touched;
                seen.emplace_back(key, touched);
                if (key == stop)
                    return 7;
                if (key % 5 != drop && ++i)
                    continue;
                c.keys.erase(c.keys.begin() + static_cast<std::ptrdiff_t>(i));
                c.touched = std::min<unsigned>(c.touched - (touched && c.touched), c.keys.size());
                --current;
            }
        }
        return kHCSuccess;
    }
};

struct Visit {
    TestCache* cache;
    uint64_t drop, stop;
    std::vector<std::pair<uint64_t, bool>> seen;
};

// Releases key % 5 == drop, stays without releasing on the next residue, stops at `stop`.
RetCode traverseStep(_t_HashHead* head, bool touched, _t_Nlink* previous, void* ctx) {
    auto* v = static_cast<Visit*>(ctx);
    auto* entry = static_cast<Entry*>(previous->next);
    // Read before a release hands the entry back to its pool.
    const uint64_t key = entry->key;
    v->seen.emplace_back(key, touched);
    if (key == v->stop)
        return 7;
    if (key % 5 == v->drop)
        v->cache->hcReleaseEntry(head, touched, previous, entry);
    return key % 5 == v->drop || key % 5 == (v->drop + 1) % 5 ? kHCStayOnPrevious : kHCSuccess;
}

::testing::AssertionResult sameState(TestCache& cache, const Model& model) {
    if (!cache.checkInvariants() || cache.GetCurrEntries() != model.current ||
        cache.GetMaxEntries() != model.peak || cache.offered != model.offered ||
        cache.hcGetToBeCleaned() != cache.head(static_cast<unsigned>(model.cursor)) ||
        cache.reports.size() != model.reports)
        return ::testing::AssertionFailure() << "counts, cursor, flushes or reports differ";
    for (unsigned int i = 0; i < model.chains.size(); ++i)
        if (cache.chain(i) != model.chains[i].keys ||
            cache.head(i)->touched != model.chains[i].touched ||
            cache.head(i)->count != model.chains[i].keys.size())
            return ::testing::AssertionFailure() << "chain " << i << " differs";
    return ::testing::AssertionSuccess();
}

TEST(ZYRCacheTest, RandomRunExhaustedPoolAndEveryAllocationFailing) {
    for (const unsigned int seed : {1u, 2u, 3u}) {
        std::mt19937 random(seed);
        const int32_t n = 60, r = 5;
        const unsigned char l = static_cast<unsigned char>(2 + seed);
        TestCache cache(n, r, l, 16);
        Model model(static_cast<size_t>(cache.hcGetNumHeads()), n, r, l);
        const uint64_t keySpace = seed == 3 ? 300 : 150;
        int context = 0;
        for (int step = 0; step < 6000; ++step) {
            uint64_t key = random() % keySpace;
            if (random() % 4 == 0)
                key = (random() % 40) * static_cast<uint64_t>(cache.hcGetNumHeads());
            const unsigned int action = random() % 100;
            if (action < 40) {
                Entry* found = cache.find(key);
                ASSERT_EQ(found != nullptr, model.lookup(key)) << "step " << step;
                ASSERT_TRUE(!found || found->value == valueFor(key));
            } else if (action < 70) {
                const auto& keys = model.chainOf(key).keys;
                if (keys.size() >= 250 || std::count(keys.begin(), keys.end(), key) != 0)
                    continue;
                const bool force = random() % 8 == 0, link = random() % 10 != 0;
                const bool expected = model.getEntry(force);
                Entry* entry = cache.add(key, force, link);
                ASSERT_EQ(entry != nullptr, expected) << "step " << step;
                if (entry && link) {
                    model.link(key);
                } else if (entry) { // an entry never linked goes straight back, flushed
                    cache.hcReturnUnlinkedEntry(entry, &context);
                    model.offered.push_back(key);
                    --model.current;
                }
            } else if (action < 80) {
                ASSERT_EQ(cache.hcRemoveEntry(&key, &context), model.remove(key)) << step;
            } else if (action < 88) {
                const auto count = static_cast<int32_t>(random() % 10);
                ASSERT_EQ(cache.hcScavenger(count, &context), model.scavenge(count));
            } else if (action < 93) {
                Visit visit{&cache, random() % 5, random() % keySpace, {}};
                std::vector<std::pair<uint64_t, bool>> seen;
                ASSERT_EQ(cache.hcTraverse(traverseStep, &visit),
                          model.traverse(visit.drop, visit.stop, seen));
                ASSERT_EQ(visit.seen, seen) << "step " << step;
            } else if (action < 97) {
                model.kept = (cache.kept.erase(key) || cache.kept.insert(key).second, cache.kept);
            } else {
                cache.recycle = !cache.recycle;
                cache.hcEmptyRecycler();
            }
            ASSERT_TRUE(sameState(cache, model)) << action << " at step " << step << ", " << seed;
            cache.offered.clear();
            model.offered.clear();
        }
        cache.kept.clear();
        EXPECT_EQ(cache.hcFreeCacheControl(), kHCSuccess);
    }
    zyrtest::FailingHost host;
    tZYRMemMgr record = host.record();
    zyrtest::installFront(0, &record);
    {
        TestCache cache(100, 2, 4, 4); // one chunk of 4 entries, then the front fails
        for (uint64_t k = 0; k < 4; ++k)
            cache.add(k);
        host.failAll = true;
        cache.keepAll = true; // nothing flushable: refused, and no count moves
        EXPECT_TRUE(!cache.add(4) && cache.GetCurrEntries() == 4 && cache.GetMaxEntries() == 4);
        cache.keepAll = false;
        // First untouched entries are swept to make room; when all are used, the sweep only
        // resets the prefixes, so the quota of 2 goes from the ends of the first chains.
        for (const auto& [key, flushed] : {std::pair{4u, Keys{2, 3}}, {6u, Keys{0, 1}}}) {
            cache.find(0);
            cache.find(1);
            cache.offered.clear();
            ASSERT_NE(cache.add(key), nullptr);
            EXPECT_TRUE(cache.offered == flushed && cache.GetCurrEntries() == 3) << key;
            ASSERT_TRUE(key != 4 || cache.add(5)) << "the last element freed by the sweep";
        }
        EXPECT_TRUE(cache.find(4) && cache.find(5) && cache.find(6));
        cache.recycle = true; // the pool used up, a removed entry waits in the recycler
        cache.kept = {4, 5, 6, 7, 8, 9};
        uint64_t next = 7, removed = 6;
        while (next < 9 && cache.add(next))
            ++next;
        cache.kept.erase(removed);
        EXPECT_TRUE(next == 8 && cache.hcRemoveEntry(&removed, nullptr));
        EXPECT_NE(cache.add(9, true), nullptr) << "the recycled entry serves before a refusal";
        host.failAll = false;
    }
    zyrtest::installFront(0);
}

bool allZero(const unsigned char* p, unsigned int n) {
    return std::all_of(p, p + n, [](unsigned char c) { return c == 0; });
}

// The mask one pixel at a time, the padding pixels of a row's last source byte included.
std::vector<unsigned char> referenceMask(const std::vector<unsigned char>& src, unsigned int width,
                                         unsigned int srcRowBytes, unsigned int height,
                                         bool fourBit) {
    const unsigned int bits = fourBit ? 4 * width : width;
    const unsigned int maskRow = (bits + 31) / 32 * 4, srcBytes = (bits + 7) / 8;
    std::vector<unsigned char> mask(size_t{maskRow} * height, 0);
    for (unsigned int y = 0; y < height; ++y) {
        const unsigned char* row = src.data() + size_t{y} * srcRowBytes;
        unsigned char* out = mask.data() + size_t{y} * maskRow;
        for (unsigned int x = 0; fourBit && x < srcBytes * 2; ++x) {
            const unsigned int pixel = (row[x / 2] >> (x % 2 ? 0 : 4)) & 0xF;
            out[x / 2] |= static_cast<unsigned char>(pixel << (x % 2 ? 4 : 0));
        }
        for (unsigned int x = 0; !fourBit && x < srcBytes * 8; ++x)
            if ((row[x / 8] >> (7 - x % 8)) & 1)
                out[x / 8] |= static_cast<unsigned char>(1u << (x % 8));
    }
    return mask;
}

// Virtual memory and the memory status run dry until the returned block is freed.
std::unique_ptr<void, void (*)(void*)> exhaustMemory() {
    ZYRSetMemLimit(400ull << 20);
    DisableMemUsageCheck();
    void* filler = ZYRMalloc(static_cast<unsigned int>(ZYRGetMemLimit() - GetMemUsage()));
    EnableMemUsageCheck();
    return {filler, ZYRFree};
}

// Masks made, moved and freed at random, each checked against its bytes made pixel by pixel
// after every step: no two live masks share storage, and at most one is the reserved mask.
TEST(CZYRMaskCacheTest, RandomMasksAgainstAPerPixelModel) {
    const unsigned long long before = GetMemUsage();
    {
        CZYRMaskCache wide(2048); // a record array of 64 KiB: from virtual memory
        wide.DeleteBitmapMask(wide.GetMaskRec(8, 1));
        CZYRMaskCache cache(3); // small blocks: records come from many of them
        std::map<ZYR_MaskRec*, std::vector<unsigned char>> live;
        std::mt19937 random(77);
        const auto reservedLive = [&] {
            return std::any_of(live.begin(), live.end(),
                               [&](const auto& m) { return cache.isReservedMask(m.first); });
        };
        for (int round = 0; round < 1200; ++round) {
            const unsigned int action = random() % 8;
            const bool reservedTaken = reservedLive();
            if (action < 3 && !live.empty()) {
                const auto it = std::next(live.begin(), random() % live.size());
                // Scribbled over: whoever gets the storage next must write every byte.
                std::memset(it->first->data, 0xFF, it->second.size());
                cache.DeleteBitmapMask(it->first);
                live.erase(it);
            } else if (action == 3 && !live.empty()) {
                auto node = live.extract(std::next(live.begin(), random() % live.size()));
                ZYR_MaskRec* const moved = cache.FallbackToReservedMask(
                    node.key(), static_cast<unsigned int>(node.mapped().size()));
                ASSERT_EQ(moved == node.key(), reservedTaken) << "moved only into a free one";
                ASSERT_TRUE((cache.isReservedMask(moved) && moved->flag == 0) ||
                            moved == node.key());
                live[moved] = std::move(node.mapped());
            } else {
                const bool fourBit = random() % 2, useReserved = random() % 4 == 0;
                const unsigned int width = 1 + random() % (round % 3 ? 80 : 700);
                const unsigned int height = 1 + random() % 24;
                const unsigned int srcRowBytes = ((fourBit ? 4 : 1) * width + 7) / 8 + random() % 5;
                std::vector<unsigned char> src(size_t{srcRowBytes} * height);
                std::generate(src.begin(), src.end(), random);
                unsigned int size = 0;
                ZYR_MaskRec* const mask = cache.CreateBitmapMask(
                    src.data(), width, srcRowBytes, height, size, fourBit, useReserved);
                ASSERT_TRUE(!(reservedTaken && cache.isReservedMask(mask)) &&
                            (!useReserved || cache.isReservedMask(mask) == !reservedTaken));
                ASSERT_TRUE(mask->width == width && mask->height == height && mask->flag == 0);
                live[mask] = referenceMask(src, width, srcRowBytes, height, fourBit);
                ASSERT_EQ(size, live[mask].size());
            }
            for (const auto& [mask, bytes] : live)
                ASSERT_TRUE(std::equal(bytes.begin(), bytes.end(), mask->data)) << round;
        }
        for (const auto& [mask, bytes] : live)
            cache.DeleteBitmapMask(mask);
    }
    EXPECT_EQ(GetMemUsage(), before) << "the destructor returns every block and chunk";
}

TEST(CZYRMaskCacheTest, RecordsSizesLimitsAndTheReservedMaskWithoutMemory) {
    const unsigned long long page = CZYRMaskCache::VAR_ALLOC_PAGE_SIZE + 24ull;
    unsigned long long current = 0, peak = 0;
    CZYRMaskCache cache(8);
    ZYR_MaskRec* mask = cache.GetMaskRec(33, 2);
    EXPECT_TRUE(!cache.isReservedMask(mask) && mask->width == 33 && allZero(mask->data, 16));
    std::memset(mask->data, 0xA5, 16);
    mask->flag = 9;
    cache.DeleteBitmapMask(mask);
    cache.DeleteBitmapMask(nullptr);
    EXPECT_EQ(cache.GetMaskRec(33, 2), mask) << "the record freed last comes back first";
    EXPECT_TRUE(allZero(mask->data, 16) && mask->flag == 0) << "reused storage is zeroed";
    cache.DeleteBitmapMask(mask);
    cache.DeleteBitmapMask(cache.GetMaskRec(2000, 600)); // above the page size
    cache.GetStats(current, peak);
    EXPECT_TRUE(current == page && peak >= page + 151200) << "one initial page";
    for (const auto& [records, bytes] : {std::pair{CZYRMaskCache::MIN_THRESHOLD + 1,
                                                   8ull * CZYRMaskCache::VAR_ALLOC_PAGE_SIZE + 24},
                                         std::pair{CZYRMaskCache::MIN_THRESHOLD + 0, page}}) {
        CZYRMaskCache sized(records);
        sized.GetStats(current, peak);
        EXPECT_EQ(std::pair(current, peak), std::pair(bytes, bytes)) << records;
    }
    expectAssertion([] { CZYRMaskCache none(0); });

    std::vector<unsigned char> src(size_t{512} * 2001, 0xC3);
    unsigned int size = 0;
    for (const auto& [width, height, fourBit, reserved, bytes] :
         {std::tuple{1024u, 1024u, false, false, 131072u},
          {1024u, 1025u, false, true, 131200u},
          {2000u, 600u, false, true, 151200u},
          {2000u, 2000u, false, true, 504000u},
          {1024u, 1024u, true, false, 524288u},
          {1000u, 1009u, true, false, 504500u}}) {
        const unsigned int srcRow = fourBit ? width / 2 : (width + 7) / 8;
        mask = cache.CreateBitmapMask(src.data(), width, srcRow, height, size, fourBit, false);
        EXPECT_EQ(std::tuple(size, cache.isReservedMask(mask), mask->data[size - 1]),
                  std::tuple(bytes, reserved, fourBit ? 0x3C : (width % 32 ? 0 : 0xC3)));
        cache.DeleteBitmapMask(mask);
    }
    expectAssertion(
        [&] { cache.CreateBitmapMask(src.data(), 2000, 250, 2001, size, false, false); });
    EXPECT_EQ(size, 504252u);
    for (const auto& [width, rowBytes, height, fourBit, reserved] :
         {std::tuple{1100u, 550u, 1000u, true, true}, {8u, 1u, 65536u, false, true}})
        expectAssertion([&] {
            cache.CreateBitmapMask(src.data(), width, rowBytes, height, size, fourBit, reserved);
        });
    expectAssertion([&] { cache.GetMaskRec(70000, 1); });
    expectAssertion([&] { cache.CreateBitmapMask(nullptr, 8, 1, 1, size, false, false); });
    mask = cache.CreateBitmapMask(src.data(), 40, 5, 3, size, false, false);
    expectAssertion([&] { cache.FallbackToReservedMask(mask, 4096); });
    expectAssertion([&] { cache.FallbackToReservedMask(nullptr, 4); });
    cache.DeleteBitmapMask(mask);
    mask = cache.CreateBitmapMask(nullptr, 0, 0, 5, size, false, false);
    EXPECT_EQ(size + mask->width + mask->height, 0u);
    cache.DeleteBitmapMask(mask);

    zyrtest::installFront(0);
    const CZYRErrorStk notices; // refusals are noticed there; built before measuring
    const unsigned long long fronted = GetMemUsage();
    {
        CZYRMaskCache small(2);
        const auto exhausted = exhaustMemory();
        ASSERT_TRUE(exhausted);
        ZYR_MaskRec* first = small.GetMaskRec(100, 10);   // the initial page still serves
        ZYR_MaskRec* large = small.GetMaskRec(2000, 700); // the supplier refuses the block
        EXPECT_TRUE(!small.isReservedMask(first) && small.isReservedMask(large) &&
                    large->width == 2000 && large->height == 700 && allZero(large->data, 176400));
        ZYR_MaskRec* second = small.GetMaskRec(100, 10);
        std::vector<unsigned char> ones(100, 0x80);
        // While the reserved mask is in use no other mask may share it.
        expectError([&] { small.CreateBitmapMask(ones.data(), 8, 1, 100, size, false, true); },
                    ZYRPublic::kZYRErrorOutOfMemory, "failed to allocate mask cache storage",
                    kMaskSource);
        EXPECT_EQ(small.FallbackToReservedMask(second, 40), second);
        small.DeleteBitmapMask(large);
        expectAssertion([&] { small.GetMaskRec(2000, 2001); });
        ZYR_MaskRec* third = small.CreateBitmapMask(ones.data(), 8, 1, 100, size, false, false);
        EXPECT_TRUE(!small.isReservedMask(second) && small.isReservedMask(third) &&
                    third->data[0] == 0x01 && third->data[4 * 99] == 0x01);
        small.DeleteBitmapMask(first);
        EXPECT_EQ(small.GetMaskRec(50, 1), first) << "a freed record serves without new memory";
        small.DeleteBitmapMask(first);
        small.DeleteBitmapMask(second);
    }
    EXPECT_EQ(GetMemUsage(), fronted);
    {
        const auto exhausted = exhaustMemory();
        expectError([] { CZYRMaskCache refused(2); }, ZYRPublic::kZYRErrorOutOfMemory,
                    "failed to allocate mask cache storage", kMaskSource);
    }
    EXPECT_EQ(GetMemUsage(), fronted) << "a refused construction keeps nothing";
}

} // namespace
