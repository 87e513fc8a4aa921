#include <gtest/gtest.h>

#include <deque>
#include <random>

#include "TestSupport.h"
#include "zyr/std/memory/internal/redblack_tree.h"

using namespace ZYRStd;

namespace {

struct Supplier {
    std::map<void*, unsigned int> live;
    unsigned int allocCalls = 0, failEvery = 0;
    unsigned long long freedBytes = 0;
    bool failAll = false;

    static void* alloc(unsigned int bytes, void* data) {
        auto& self = *static_cast<Supplier*>(data);
        if (++self.allocCalls,
            self.failAll || (self.failEvery && self.allocCalls % self.failEvery == 0))
            return nullptr;
        void* p =
            std::memset(std::malloc(bytes ? bytes : 1), 0xA5, bytes); // no zero word by chance
        return self.live[p] = bytes, p;
    }
    static void free(void* block, void* data) {
        auto& self = *static_cast<Supplier*>(data);
        const auto found = self.live.find(block);
        ASSERT_NE(found, self.live.end()) << "a block never handed out (or given back twice)";
        self.freedBytes += found->second;
        self.live.erase(found);
        std::free(block);
    }
};

std::string problems(const VariableSizeAllocator& a) {
    const char* why = a.checkInvariants();
    return why ? why : "";
}

VariableSizeAllocator makeAllocator(Supplier& s, unsigned int initialPages, unsigned int pageSize) {
    return VariableSizeAllocator("PoolTest", initialPages, 0, pageSize, Supplier::alloc,
                                 Supplier::free, &s);
}

char* alloc(VariableSizeAllocator& a, unsigned int size, unsigned int&& obtained = 0) {
    return static_cast<char*>(a.allocate(size, obtained));
}

uint32_t word(const void* at) {
    uint32_t v;
    std::memcpy(&v, at, sizeof v);
    return v;
}

struct PageScan {
    std::map<const char*, uint32_t> free;
    const char* reserved = nullptr;
};

PageScan scanPages(const Supplier& s, unsigned int pageSize, unsigned int initialPages) {
    PageScan scan;
    for (const auto& [block, bytes] : s.live) {
        if (bytes != pageSize + 24 && bytes != initialPages * pageSize + 24)
            continue;
        const auto* page = static_cast<const char*>(block);
        const uint32_t usable = word(page);
        for (uint32_t offset = 8; offset < 16 + usable;) {
            const char* h = page + offset;
            const uint32_t size = word(h + 4);
            if ((word(h) & 1) && offset == 8 && size == usable)
                scan.reserved = h;
            else if (word(h) & 1)
                scan.free[h] = size;
            offset += 8 + size;
        }
    }
    return scan;
}

struct IntNode : redblack_node<int, IntNode> {
    explicit IntNode(int k = 0) : value(k) {}
    int key() const { return value; }
    int value;
};

} // namespace

TEST(RedBlackTreeTest, LookupsReplaceUnlinkAndOwningCalls) {
    std::deque<IntNode> nodes;
    redblack_tree<IntNode, int> tree;
    for (int k : {50, 20, 80, 10, 30, 70, 90, 60}) {
        tree_search_state<IntNode> state;
        ASSERT_FALSE(tree.SetSearchState(state, k));
        tree.InsertNodeReference(state, &nodes.emplace_back(k));
    }
    tree.ReplaceNode(tree.FindNode(30), &nodes.emplace_back(30));
    tree.UnlinkNode(tree.FindNode(80));
    unsigned long long count = 0;
    EXPECT_TRUE(!tree.checkTree(&count) && count == 7);
    EXPECT_EQ(tree.FindNode(30), &nodes.back());
    EXPECT_TRUE(!tree.FindNode(80) && !tree.GetMinGTOrEqNode(91) && !tree.GetMaxLTOrEqNode(9));
    EXPECT_EQ(tree.GetMinGTOrEqNode(71)->key() * 100 + tree.GetMaxLTOrEqNode(89)->key(), 9070);
    std::vector<int> keys;
    for (auto it = tree.begin(); it != tree.end(); ++it)
        keys.push_back(it.get()->key());
    EXPECT_EQ(keys, (std::vector{10, 20, 30, 50, 60, 70, 90}));
    tree.ForgetAllNodes();
    EXPECT_TRUE(tree.empty());
    redblack_tree<IntNode, int> owning; // copies made with new and deleted by the tree
    for (int k : {5, 3, 8, 1})
        owning.InsertCopyOfNode(IntNode(k));
    EXPECT_EQ(owning.InsertCopyOfNode(IntNode(8)), nullptr) << "keys are unique";
    EXPECT_TRUE(owning.DeleteNode(3) && !owning.DeleteNode(3));
    owning.RemoveNode(owning.FindNode(5));
    const std::unique_ptr<IntNode> taken(owning.DeleteNodeReference(8));
    EXPECT_TRUE(taken && taken->key() == 8 && !owning.checkTree());
    owning.DeleteAllNodes();
    EXPECT_TRUE(owning.empty());
}

TEST(VariableSizeAllocatorTest, RandomTraceAgainstModel) {
    for (const auto& [pageSize, failEvery] : {std::pair{4096u, 0u}, std::pair{4096u, 5u},
                                              std::pair{5004u, 0u}, std::pair{20000u, 0u}}) {
        SCOPED_TRACE(std::to_string(pageSize) + " " + std::to_string(failEvery));
        Supplier s;
        s.failEvery = failEvery;
        std::mt19937 rng(20240607);
        struct Live {
            unsigned int size, got;
            unsigned char fill;
            bool large;
        };
        std::map<char*, Live> live;
        std::vector<char*> order;
        std::map<uint32_t, std::deque<const char*>> lists; // free blocks of a size, head first
        char* cached = nullptr;
        unsigned int cachedSize = 0;
        {
            VariableSizeAllocator a = makeAllocator(s, 2, pageSize);
            ASSERT_EQ(s.live.begin()->second, 2 * pageSize + 24) << "one page for both";
            unsigned long long peak = 2 * pageSize + 24;
            PageScan before = scanPages(s, pageSize, 2);
            for (int step = 0; step < 5000; ++step) {
                SCOPED_TRACE(step);
                const unsigned int calls = s.allocCalls;
                const unsigned long long freed = s.freedBytes;
                if (order.empty() || rng() % 100 < (step < 2500 ? 60 : 40)) {
                    const unsigned kind = rng() % 100;
                    unsigned int size = kind < 60   ? 1 + rng() % 128
                                        : kind < 88 ? 1 + rng() % pageSize
                                        : kind < 93 ? 4100 + 8 * (rng() % 2)
                                        : kind < 98 ? pageSize + 100 + rng() % 20000
                                                    : 131064 + rng() % 16; // the cache limit
                    size += size + 16 == 2 * pageSize + 24; // large blocks never look like pages
                    const bool large = size > pageSize;
                    const uint32_t n = (std::max(size, 32u) + 7) & ~7u;
                    uint32_t best = UINT32_MAX;
                    for (const auto& [h, free] : before.free)
                        if (!large && free >= n)
                            best = std::min(best, free);
                    const auto* list = best == UINT32_MAX ? nullptr : &lists.at(best);
                    const char* expected = list ? list->at(list->size() > 1) : before.reserved;
                    const uint32_t blockSize = list       ? best
                                               : expected ? word(expected + 4)
                                                          : pageSize;
                    unsigned int obtained = 7;
                    auto* p = static_cast<char*>(a.allocate(size, obtained));
                    unsigned int got = size;
                    if (large && cached && cachedSize >= size) {
                        ASSERT_TRUE(p == cached && obtained == 0) << "the cached block reused";
                        got = cachedSize;
                    } else if (large) {
                        ASSERT_EQ(s.freedBytes - freed, cached ? cachedSize + 16ull : 0ull);
                        ASSERT_TRUE(!p || (obtained == size && s.live.at(p - 16) == size + 16 &&
                                           word(p - 16) == 0));
                    } else if (p) {
                        ASSERT_EQ(expected ? p - 8 : nullptr, expected) << "best fit and order";
                        ASSERT_TRUE(expected ? s.allocCalls == calls : word(p - 16) == pageSize);
                        ASSERT_EQ(obtained, expected ? 0u : pageSize);
                        got = blockSize >= n + 40 ? n : blockSize; // split or given whole
                    }
                    cached = large ? nullptr : cached;
                    ASSERT_EQ(a.GetPtrSize(p), p ? got : 0u);
                    ASSERT_EQ(reinterpret_cast<uintptr_t>(p) % (large ? 16 : 8), 0u);
                    ASSERT_TRUE(p || (failEvery && (large || !expected) && !obtained));
                    if (p) {
                        const auto fill = static_cast<unsigned char>(rng());
                        std::memset(p, fill, size);
                        live[p] = {size, got, fill, large};
                        order.push_back(p);
                    }
                } else {
                    const size_t pick = rng() % order.size();
                    char* p = order[pick];
                    order[pick] = order.back();
                    order.pop_back();
                    const Live block = live.at(p);
                    live.erase(p);
                    ASSERT_EQ(std::count(p, p + block.size, static_cast<char>(block.fill)),
                              std::ptrdiff_t(block.size));
                    const unsigned int returned = a.Free(p);
                    const unsigned long long gone = s.freedBytes - freed;
                    if (!block.large) {
                        ASSERT_EQ(returned, gone ? gone - 24 : 0u) << "a page's usable bytes";
                        ASSERT_TRUE(before.reserved || gone == 0) << "a free page is kept first";
                    } else if (!cached && block.got <= 131071) {
                        ASSERT_EQ(returned, 0u) << "cached";
                        cached = p;
                        cachedSize = block.got;
                    } else {
                        ASSERT_TRUE(returned == block.got && gone == block.got + 16ull);
                    }
                }
                ASSERT_EQ(problems(a), "");
                const PageScan now = scanPages(s, pageSize, 2);
                for (const auto& [h, size] : before.free)
                    if (!now.free.count(h) || now.free.at(h) != size) {
                        auto& list = lists[size];
                        ASSERT_EQ(std::erase(list, h), 1u);
                    }
                for (const auto& [h, size] : now.free)
                    if (!before.free.count(h) || before.free.at(h) != size) {
                        auto& list = lists[size];
                        list.insert(list.begin() + !list.empty(), h);
                    }
                before = now;
                unsigned long long held = 0; // whole pages, large blocks without their header
                for (const auto& [block, bytes] : s.live)
                    held +=
                        bytes == pageSize + 24 || bytes == 2 * pageSize + 24 ? bytes : bytes - 16;
                peak = std::max(peak, held);
                ASSERT_TRUE(a.getVarPageCurrAllocAmount() == held &&
                            a.getVarPagePeakAllocAmount() == peak);
            }
            for (char* p : order)
                a.Free(p);
            EXPECT_TRUE(problems(a).empty() && s.live.size() <= 2) << "reserved page and cache";
        }
        EXPECT_TRUE(s.live.empty()) << "the reserved page and the cached block go back too";
    }
}

TEST(VariableSizeAllocatorTest, Boundaries) {
    Supplier s, failing, t;
    char* kept = nullptr;
    {
        VariableSizeAllocator a = makeAllocator(s, 0, 4096);
        EXPECT_TRUE(s.allocCalls == 0 && !a.GetPtrSize(nullptr) && !a.Free(nullptr));
        EXPECT_EQ(alloc(a, 0xFFFFFFF8u), nullptr) << "request + 16 overflows";
        kept = alloc(a, 100);
        EXPECT_EQ(problems(a), "");
    }
    ASSERT_EQ(s.live.size(), 1u) << "a page that still holds blocks is not given back";
    std::free(kept - 16);
    failing.failAll = true;
    VariableSizeAllocator none = makeAllocator(failing, 4, 512);
    unsigned int obtained = 7;
    EXPECT_TRUE(!none.getVarPageCurrAllocAmount() && !none.allocate(10, obtained) && !obtained);
    EXPECT_EQ(problems(none), "");
    VariableSizeAllocator b = makeAllocator(t, 4, 127);
    char *p = alloc(b, 127), *q = alloc(b, 127);
    EXPECT_EQ(b.GetPtrSize(p), 128u);
    EXPECT_EQ(b.Free(p) + b.Free(q), 0u);
    alignas(VariableSizeAllocator) unsigned char raw[sizeof(VariableSizeAllocator)];
    std::memset(raw, 0xFF, sizeof raw);
    VariableSizeAllocator* named = std::construct_at(reinterpret_cast<VariableSizeAllocator*>(raw),
                                                     std::string(45, 'n').c_str(), 0, 0, 4096,
                                                     Supplier::alloc, Supplier::free, &t);
    EXPECT_EQ(std::string(named->name()), std::string(38, 'n'));
    std::destroy_at(named);
    EXPECT_TRUE(t.allocCalls == 1 && t.freedBytes == 0 && problems(b).empty());
}

TEST(FixedSizeAllocatorTest, PoolsSlotsAndSupplier) {
    Supplier s, t;
    {
        FixedSizeAllocator f("PoolTest", 4, 0, 128, Supplier::alloc, Supplier::free, &s);
        ASSERT_TRUE(f.heldBytes() == 512 && s.live.size() == 1);
        const auto* pool = static_cast<const char*>(s.live.begin()->first);
        std::set<DMMPoolBlock*> slots;
        int slotSize = 0;
        for (int i = 0; i < 4; ++i) {
            DMMPoolBlock* slot = f.GetPool(&slotSize);
            const auto* at = reinterpret_cast<const char*>(slot);
            EXPECT_TRUE(slotSize == 112 && at >= pool + 40 && at + 112 <= pool + 512)
                << "(512-40)/4";
            slots.insert(slot);
        }
        EXPECT_TRUE(slots.size() == 4 && s.allocCalls == 1);
        int outside = 0;
        f.FreePool(reinterpret_cast<DMMPoolBlock*>(&outside)); // ignored, as is a slot's middle
        f.FreePool(reinterpret_cast<DMMPoolBlock*>(const_cast<char*>(pool) + 48));
        DMMPoolBlock* extra = f.GetPool(&slotSize);
        ASSERT_NE(extra, nullptr);
        EXPECT_TRUE(slotSize == 88 && f.heldBytes() == 640) << "one slot of 128 - 40 bytes";
        f.FreePool(extra);
        EXPECT_TRUE(f.heldBytes() == 512 && f.peakHeldBytes() == 640) << "a free later pool goes";
        DMMPoolBlock* some = *slots.begin();
        f.FreePool(some);
        EXPECT_EQ(f.GetPool(nullptr), some) << "the slot just freed is reused";
        for (DMMPoolBlock* slot : slots)
            f.FreePool(slot);
        EXPECT_EQ(f.heldBytes(), 512u) << "the first pool stays";
        for (int i = 0; i < 4; ++i)
            EXPECT_TRUE(slots.count(f.GetPool(nullptr)));
        s.failAll = true;
        EXPECT_EQ(f.GetPool(&slotSize), nullptr);
        FixedSizeAllocator tiny("PoolTest", 0, 0, 40, Supplier::alloc, Supplier::free, &t);
        EXPECT_EQ(tiny.GetPool(nullptr), nullptr) << "slots too small for a link: no pool kept";
        t.failAll = true;
        FixedSizeAllocator none("PoolTest", 8, 0, 64, Supplier::alloc, Supplier::free, &t);
        EXPECT_TRUE(none.heldBytes() == 0 && !none.GetPool(nullptr));
    }
    EXPECT_TRUE(s.live.empty() && t.live.empty()) << "destruction gives back every pool";
}

TEST(ZYRFixedSizePoolTest, ChunksAndFreeList) {
    ZYRFixedSizePool pool(1, 3), zeroPerChunk(64, 0);
    EXPECT_EQ(pool.elementSize(), 8u) << "room for the free-list link";
    std::vector<unsigned char*> handed;
    for (int i = 0; i < 7; ++i)
        handed.push_back(static_cast<unsigned char*>(std::memset(pool.Alloc(), i, 8)));
    for (int i = 0; i < 7; ++i)
        EXPECT_TRUE(handed[i][7] == i && reinterpret_cast<uintptr_t>(handed[i]) % 8 == 0) << i;
    pool.Free(handed[2]);
    pool.Free(handed[5]);
    EXPECT_TRUE(pool.Alloc() == handed[5] && pool.Alloc() == handed[2]) << "last freed first";
    pool.FlushAll();
    void *a = zeroPerChunk.Alloc(), *b = zeroPerChunk.Alloc();
    EXPECT_TRUE(pool.SureAlloc() && a && b && a != b);
    std::memset(a, 1, 64);
    std::memset(b, 2, 64);
}

TEST(ZYRStdAllocatorFixedSizePoolTest, RunsPagesAndFailure) {
    ZYRStdAllocatorFixedSizePool pool(16, 100);
    EXPECT_EQ(pool.Alloc(0), nullptr);
    EXPECT_EQ(zyrtest::thrown([&] { (void)pool.SureAlloc(1u << 29); }), // 8 GiB: no page
              "7: ZYRStdAllocatorFixedSizePool allocation failed (source/zyr/std/ZYRPool:173)");
    auto* first = static_cast<unsigned char*>(pool.Alloc(1));
    ASSERT_NE(first, nullptr);
    for (int i = 1; i < 255; ++i)
        ASSERT_EQ(pool.Alloc(1), first + 16 * i) << "(4096 - 16) / 16 = 255 elements a page";
    auto* next = static_cast<unsigned char*>(pool.Alloc(1));
    EXPECT_TRUE(next < first || next >= first + 255 * 16) << "the 256th starts a new page";
    std::memset(first, 0x3C, 255 * 16);
    auto* run = static_cast<unsigned char*>(pool.Alloc(300));
    ASSERT_NE(run, nullptr) << "a run larger than the default page gets its own page";
    std::memset(run, 0x5A, 300 * 16);
    EXPECT_EQ(pool.Alloc(200), run + 300 * 16) << "the newest page with room serves a run";
    EXPECT_EQ(pool.Alloc(254), next + 16) << "then an older page with room";
    EXPECT_EQ(first[255 * 16 - 1], 0x3C);
    pool.FlushAll();
    EXPECT_NE(pool.Alloc(4), nullptr);
}
