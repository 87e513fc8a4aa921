// Sub-allocators and pools: the free tree, VariableSizeAllocator, FixedSizeAllocator and the
// two element pools.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <deque>
#include <map>
#include <memory>
#include <random>
#include <set>
#include <string>
#include <vector>

#include "TestSupport.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/core/ZYRVirtualMem.h"
#include "zyr/std/memory/ZYRPool.h"
#include "zyr/std/memory/redblack_tree.h"

using namespace ZYRStd;

namespace {

// A page supplier over malloc that remembers what it handed out and can be told to fail.
struct Supplier {
    std::map<void*, unsigned int> live;
    unsigned int allocCalls = 0;
    unsigned long long freedBytes = 0;
    unsigned int failEvery = 0; // fail every n-th call
    bool failAll = false;

    static void* alloc(unsigned int bytes, void* data) {
        auto* self = static_cast<Supplier*>(data);
        ++self->allocCalls;
        if (self->failAll || (self->failEvery && self->allocCalls % self->failEvery == 0))
            return nullptr;
        void* p = std::malloc(bytes ? bytes : 1);
        self->live[p] = bytes;
        return p;
    }
    static void free(void* block, void* data) {
        auto* self = static_cast<Supplier*>(data);
        const auto found = self->live.find(block);
        ASSERT_NE(found, self->live.end()) << "a block never handed out (or given back twice)";
        self->freedBytes += found->second;
        self->live.erase(found);
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

char* alloc(VariableSizeAllocator& a, unsigned int size) {
    unsigned int obtained = 0;
    return static_cast<char*>(a.allocate(size, obtained));
}

uint32_t word(const void* at) {
    uint32_t v;
    std::memcpy(&v, at, sizeof v);
    return v;
}

// The free blocks of every page read from the boundary tags: by header address with their
// sizes, and apart from them the reserved page, one free block spanning its page.
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

TEST(RedBlackTreeTest, RandomInsertUnlinkReplaceKeepsInvariants) {
    std::mt19937 rng(1234);
    std::deque<IntNode> storage; // stable addresses
    std::map<int, IntNode*> model;
    redblack_tree<IntNode, int> tree;
    for (int step = 0; step < 6000; ++step) {
        const int key = static_cast<int>(rng() % 800);
        const auto found = model.find(key);
        if (found == model.end()) {
            storage.emplace_back(key);
            tree_search_state<IntNode> state;
            ASSERT_FALSE(tree.SetSearchState(state, key));
            tree.InsertNodeReference(state, &storage.back());
            model[key] = &storage.back();
        } else if (rng() % 3 == 0) {
            // Same key, new node: put in place of the old one.
            storage.emplace_back(key);
            tree.ReplaceNode(found->second, &storage.back());
            found->second = &storage.back();
        } else {
            tree.UnlinkNode(found->second);
            model.erase(found);
        }
        unsigned long long count = 0;
        const char* why = tree.checkTree(&count);
        ASSERT_EQ(why, nullptr) << why << " at step " << step;
        ASSERT_EQ(count, model.size());

        const int probe = static_cast<int>(rng() % 820) - 10;
        const auto ge = model.lower_bound(probe);
        ASSERT_EQ(tree.GetMinGTOrEqNode(probe), ge == model.end() ? nullptr : ge->second);
        auto le = model.upper_bound(probe);
        ASSERT_EQ(tree.GetMaxLTOrEqNode(probe), le == model.begin() ? nullptr : (--le)->second);
        const auto exact = model.find(probe);
        ASSERT_EQ(tree.FindNode(probe), exact == model.end() ? nullptr : exact->second);
    }
    auto it = tree.begin();
    for (const auto& [key, node] : model) {
        ASSERT_NE(it, tree.end());
        EXPECT_EQ(it.get(), node);
        ++it;
    }
    EXPECT_EQ(it, tree.end());
    tree.ForgetAllNodes();
    EXPECT_TRUE(tree.empty());

    // Owning calls: copies are made with new and deleted by the tree (ASan sees leaks).
    redblack_tree<IntNode, int> owning;
    for (int k : {5, 3, 8, 1})
        owning.InsertCopyOfNode(IntNode(k));
    EXPECT_EQ(owning.InsertCopyOfNode(IntNode(8)), nullptr) << "keys are unique";
    EXPECT_TRUE(owning.DeleteNode(3) && !owning.DeleteNode(3));
    owning.RemoveNode(owning.FindNode(5));
    const std::unique_ptr<IntNode> taken(owning.DeleteNodeReference(8));
    EXPECT_EQ(taken ? taken->key() : 0, 8);
    EXPECT_EQ(owning.checkTree(), nullptr);
    owning.DeleteAllNodes();
    EXPECT_TRUE(owning.empty());
}

// Random allocate/free against a model of the allocator: best fit, the order of same-size
// blocks (a list head stays and the newest member goes first), splitting, the reserved page,
// the one cached large block, what the supplier gives and gets back, and the held bytes.
// Live blocks never overlap and keep their contents, and the debug check passes at every step.
TEST(VariableSizeAllocatorTest, RandomTraceAgainstModel) {
    // Supplier failing every 5th call or never (0). 5004 bytes: the last block of each page is
    // not a multiple of 8 (4 bytes over). 20000 bytes: most free sizes are above the bins and
    // live in the tree.
    for (const auto& [pageSize, failEvery] : {std::pair{4096u, 0u}, std::pair{4096u, 5u},
                                              std::pair{5004u, 0u}, std::pair{20000u, 0u}}) {
        SCOPED_TRACE(std::to_string(pageSize) + " bytes a page, failing every " +
                     std::to_string(failEvery));
        Supplier s;
        s.failEvery = failEvery;
        std::mt19937 rng(20240607);
        struct Live {
            unsigned int size; // filled with `fill`
            unsigned int got;  // the block's size as the allocator has it
            unsigned char fill;
            bool large;
        };
        std::map<char*, Live> live; // by address
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
                const unsigned int calls = s.allocCalls;
                const unsigned long long freed = s.freedBytes;
                if (order.empty() || rng() % 100 < (step < 2500 ? 60 : 40)) {
                    const unsigned kind = rng() % 100;
                    unsigned int size = kind < 60   ? 1 + rng() % 128
                                        : kind < 88 ? 1 + rng() % pageSize
                                        : kind < 93 ? 4100 + 8 * (rng() % 2) // same tree sizes
                                        : kind < 98 ? pageSize + 100 + rng() % 20000
                                                    : 131064 + rng() % 16; // about the cache limit
                    if (size + 16 == 2 * pageSize + 24)
                        ++size; // keeps large blocks apart from pages in the supplier's list
                    const bool large = size > pageSize;
                    const uint32_t n = (std::max(size, 32u) + 7) & ~7u;
                    // Small requests: the expected block, its size, and the bytes obtained.
                    const char* expected = nullptr;
                    uint32_t blockSize = pageSize;
                    uint32_t best = UINT32_MAX;
                    for (const auto& [h, free] : before.free)
                        if (!large && free >= n)
                            best = std::min(best, free);
                    if (best != UINT32_MAX) {
                        const auto& list = lists.at(best);
                        expected = list.size() > 1 ? list[1] : list[0];
                        blockSize = best;
                    } else if (before.reserved) {
                        expected = before.reserved;
                        blockSize = word(expected + 4);
                    }
                    unsigned int obtained = 7;
                    auto* p = static_cast<char*>(a.allocate(size, obtained));
                    unsigned int got = size;
                    if (large) {
                        if (cached && cachedSize >= size) {
                            ASSERT_EQ(p, cached) << "a smaller request reuses the cached block";
                            ASSERT_EQ(obtained, 0u);
                            got = cachedSize;
                        } else {
                            ASSERT_EQ(s.freedBytes - freed, cached ? cachedSize + 16ull : 0ull)
                                << "a cached block too small goes back";
                            if (p) {
                                ASSERT_EQ(obtained, size);
                                ASSERT_EQ(s.live.at(p - 16), size + 16);
                            }
                        }
                        cached = nullptr;
                        ASSERT_EQ(reinterpret_cast<uintptr_t>(p) % 16, 0u);
                    } else if (p) {
                        if (expected) {
                            ASSERT_EQ(p - 8, expected) << "not the block of best fit and order";
                            ASSERT_EQ(s.allocCalls, calls);
                        } else {
                            ASSERT_EQ(word(p - 16), pageSize) << "not the start of a new page";
                        }
                        ASSERT_EQ(obtained, expected ? 0u : pageSize);
                        got = blockSize >= n + 40 ? n : blockSize; // split or given whole
                    }
                    ASSERT_EQ(a.GetPtrSize(p), p ? got : 0u);
                    if (!p) {
                        ASSERT_NE(failEvery, 0u) << "null from a reliable supplier";
                        ASSERT_TRUE(large || !expected) << "null although a block was free";
                        ASSERT_EQ(obtained, 0u);
                    } else {
                        ASSERT_EQ(reinterpret_cast<uintptr_t>(p) % 8, 0u);
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
                    for (unsigned int i = 0; i < block.size; ++i)
                        ASSERT_EQ(static_cast<unsigned char>(p[i]), block.fill)
                            << "contents changed at byte " << i << " of " << block.size;
                    live.erase(p);
                    const unsigned int returned = a.Free(p);
                    const unsigned long long gone = s.freedBytes - freed;
                    if (!block.large) {
                        ASSERT_EQ(returned, gone ? gone - 24 : 0u) << "a page's usable bytes";
                        ASSERT_TRUE(before.reserved || gone == 0)
                            << "a whole free page becomes the reserved one";
                    } else if (!cached && block.got <= 131071) {
                        ASSERT_EQ(returned, 0u) << "cached";
                        cached = p;
                        cachedSize = block.got;
                    } else {
                        ASSERT_EQ(returned, block.got) << "one block is cached at most";
                        ASSERT_EQ(gone, block.got + 16ull);
                    }
                }
                ASSERT_EQ(problems(a), "") << "at step " << step;
                // Free blocks that went leave their lists; a new one heads its list or follows
                // the head.
                const PageScan now = scanPages(s, pageSize, 2);
                for (const auto& [h, size] : before.free)
                    if (!now.free.count(h) || now.free.at(h) != size) {
                        auto& list = lists[size];
                        const auto at = std::find(list.begin(), list.end(), h);
                        ASSERT_NE(at, list.end());
                        list.erase(at);
                    }
                for (const auto& [h, size] : now.free)
                    if (!before.free.count(h) || before.free.at(h) != size) {
                        auto& list = lists[size];
                        list.insert(list.empty() ? list.end() : list.begin() + 1, h);
                    }
                before = now;
                // Held bytes: whole pages as obtained, large blocks without their header.
                unsigned long long held = 0;
                for (const auto& [block, bytes] : s.live)
                    held +=
                        bytes == pageSize + 24 || bytes == 2 * pageSize + 24 ? bytes : bytes - 16;
                peak = std::max(peak, held);
                ASSERT_EQ(a.getVarPageCurrAllocAmount(), held) << "at step " << step;
                ASSERT_EQ(a.getVarPagePeakAllocAmount(), peak) << "at step " << step;
            }
            for (char* p : order)
                a.Free(p);
            EXPECT_EQ(problems(a), "");
            EXPECT_LE(s.live.size(), 2u) << "at most the reserved page and the cached block";
        }
        EXPECT_TRUE(s.live.empty()) << "the reserved page and the cached block go back too";
    }
}

// What the trace does not reach: the edges of 32 bits and of the cache, a supplier failing
// from the start, and pages that outlive the allocator.
TEST(VariableSizeAllocatorTest, Boundaries) {
    Supplier s;
    char* kept = nullptr;
    {
        VariableSizeAllocator a = makeAllocator(s, 0, 4096);
        EXPECT_EQ(s.allocCalls, 0u) << "no initial pages";
        EXPECT_TRUE(!a.GetPtrSize(nullptr) && !a.Free(nullptr));
        unsigned int obtained = 0;
        EXPECT_EQ(a.allocate(0xFFFFFFF8u, obtained), nullptr) << "request + 16 overflows";
        EXPECT_EQ(a.Free(alloc(a, 131071)), 0u) << "the largest block that is cached";
        EXPECT_EQ(a.Free(alloc(a, 131072)), 131072u);
        kept = alloc(a, 100);
        EXPECT_EQ(problems(a), "");
    }
    ASSERT_EQ(s.live.size(), 1u) << "a page that still holds blocks is not given back";
    std::free(kept - 16);

    Supplier failing;
    failing.failAll = true;
    VariableSizeAllocator none = makeAllocator(failing, 4, 512);
    EXPECT_EQ(none.getVarPageCurrAllocAmount(), 0u) << "no first page";
    unsigned int obtained = 7;
    EXPECT_TRUE(!none.allocate(10, obtained) && obtained == 0);
    EXPECT_EQ(problems(none), "");

    // With an odd page size a first page of several page sizes holds blocks of page size + 1
    // bytes; they must not be taken for large blocks.
    Supplier t;
    VariableSizeAllocator b = makeAllocator(t, 4, 127);
    char* p = alloc(b, 127);
    char* q = alloc(b, 127);
    EXPECT_EQ(b.GetPtrSize(p), 128u);
    EXPECT_EQ(b.Free(p) + b.Free(q), 0u);
    // A long name is cut to 38 characters and ended, whatever the memory held before.
    alignas(VariableSizeAllocator) unsigned char raw[sizeof(VariableSizeAllocator)];
    std::memset(raw, 0xFF, sizeof raw);
    VariableSizeAllocator* named = std::construct_at(reinterpret_cast<VariableSizeAllocator*>(raw),
                                                     std::string(45, 'n').c_str(), 0, 0, 4096,
                                                     Supplier::alloc, Supplier::free, &t);
    EXPECT_EQ(std::string(named->name()), std::string(38, 'n'));
    std::destroy_at(named);
    EXPECT_TRUE(t.allocCalls == 1 && t.freedBytes == 0);
    EXPECT_EQ(problems(b), "");
}

TEST(FixedSizeAllocatorTest, PoolsSlotsAndSupplier) {
    Supplier s;
    {
        FixedSizeAllocator f("PoolTest", 4, 0, 128, Supplier::alloc, Supplier::free, &s);
        EXPECT_EQ(f.heldBytes(), 512u);
        ASSERT_EQ(s.live.size(), 1u);
        const auto* pool = static_cast<const char*>(s.live.begin()->first);
        std::set<DMMPoolBlock*> slots;
        int slotSize = 0;
        for (int i = 0; i < 4; ++i) {
            DMMPoolBlock* slot = f.GetPool(&slotSize);
            EXPECT_EQ(slotSize, 112) << "(512 - 40) / 4 rounded down to 8";
            const auto* at = reinterpret_cast<const char*>(slot);
            EXPECT_TRUE(at >= pool + 40 && at + 112 <= pool + 512);
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
    }
    EXPECT_TRUE(s.live.empty()) << "destruction gives back every pool";

    // Slots too small for a link: no pool is kept and nothing is handed out twice.
    Supplier t;
    {
        FixedSizeAllocator tiny("PoolTest", 0, 0, 40, Supplier::alloc, Supplier::free, &t);
        EXPECT_EQ(tiny.GetPool(nullptr), nullptr);
        t.failAll = true;
        FixedSizeAllocator failing("PoolTest", 8, 0, 64, Supplier::alloc, Supplier::free, &t);
        EXPECT_TRUE(failing.heldBytes() == 0 && !failing.GetPool(nullptr));
    }
    EXPECT_TRUE(t.live.empty());
}

TEST(ZYRFixedSizePoolTest, ChunksAndFreeList) {
    {
        ZYRFixedSizePool pool(1, 3);
        EXPECT_EQ(pool.elementSize(), 8u) << "room for the free-list link";
        std::vector<void*> handed;
        for (int i = 0; i < 7; ++i) {
            handed.push_back(pool.Alloc());
            ASSERT_NE(handed.back(), nullptr);
            EXPECT_EQ(reinterpret_cast<uintptr_t>(handed.back()) % 8, 0u);
            std::memset(handed.back(), i, 8);
        }
        for (int i = 0; i < 7; ++i)
            EXPECT_EQ(*static_cast<unsigned char*>(handed[i]), i) << "elements overlap";
        pool.Free(handed[2]);
        pool.Free(handed[5]);
        EXPECT_TRUE(pool.Alloc() == handed[5] && pool.Alloc() == handed[2]) << "last freed first";
        pool.FlushAll();
        EXPECT_NE(pool.SureAlloc(), nullptr);
    }
    ZYRFixedSizePool zeroPerChunk(64, 0);
    void *a = zeroPerChunk.Alloc(), *b = zeroPerChunk.Alloc();
    ASSERT_TRUE(a && b && a != b);
    std::memset(a, 1, 64);
    std::memset(b, 2, 64);
}

TEST(ZYRStdAllocatorFixedSizePoolTest, RunsPagesAndFailure) {
    ZYRStdAllocatorFixedSizePool pool(16, 100);
    EXPECT_EQ(pool.Alloc(0), nullptr);
    EXPECT_EQ(zyrtest::thrown([&] { (void)pool.SureAlloc(1u << 29); }), // 8 GiB: no page
              "7: ZYRStdAllocatorFixedSizePool allocation failed (source/zyr/std/ZYRPool:173)");

    tZYRVirtualMemoryInfo info{};
    VirtualMemStatus(&info);
    if (info.availableForAllocation < 65536) {
        EXPECT_EQ(pool.Alloc(1), nullptr) << "pages are refused when memory is short";
        // A sanitizer's shadow mappings count against the process's virtual size.
        GTEST_SKIP() << "virtual memory status reports too little memory for pages";
    }
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
