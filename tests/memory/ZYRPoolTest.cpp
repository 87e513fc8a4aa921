// Sub-allocators and pools: the free tree, VariableSizeAllocator, FixedSizeAllocator and the
// two element pools.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <deque>
#include <map>
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
    unsigned int freeCalls = 0;
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
        ++self->freeCalls;
        const auto found = self->live.find(block);
        if (found == self->live.end()) {
            ADD_FAILURE() << "supplier got back a block it never handed out (or twice)";
            return;
        }
        self->live.erase(found);
        std::free(block);
    }
    unsigned long long outstanding() const {
        unsigned long long sum = 0;
        for (const auto& [block, bytes] : live)
            sum += bytes;
        return sum;
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

// Runs `body`, which must fail for want of memory with `message` from the given line.
template <class Body> void expectOutOfMemory(Body body, const char* message, int line) {
    try {
        body();
        ADD_FAILURE() << "no error; expected \"" << message << "\"";
    } catch (const CZYRError& e) {
        EXPECT_EQ(e.getError(), ZYRPublic::kZYRErrorOutOfMemory);
        EXPECT_STREQ(e.getMessage(), message);
        EXPECT_STREQ(e.getSrcFileName(), "source/zyr/std/ZYRPool");
        EXPECT_EQ(e.getSrcLineNumber(), line);
    }
}

uint32_t word(const void* at) {
    uint32_t v;
    std::memcpy(&v, at, sizeof v);
    return v;
}

// The free blocks of every page (by header address, with their sizes), read from the
// boundary tags; the reserved page, one free block spanning its page, is left out.
std::map<const char*, uint32_t> freeBlocksOfPages(const Supplier& s, unsigned int pageSize,
                                                  unsigned int initialPages) {
    std::map<const char*, uint32_t> blocks;
    for (const auto& [block, bytes] : s.live) {
        if (bytes != pageSize + 24 && bytes != initialPages * pageSize + 24)
            continue;
        const auto* page = static_cast<const char*>(block);
        const uint32_t usable = word(page);
        for (uint32_t offset = 8; offset < 16 + usable;) {
            const char* h = page + offset;
            const uint32_t size = word(h + 4);
            const bool whole = offset == 8 && size == usable;
            if ((word(h) & 1) && !whole)
                blocks[h] = size;
            offset += 8 + size;
        }
    }
    return blocks;
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
        const unsigned action = rng() % 3;
        const auto found = model.find(key);
        if (found == model.end()) {
            storage.emplace_back(key);
            tree_search_state<IntNode> state;
            ASSERT_FALSE(tree.SetSearchState(state, key));
            tree.InsertNodeReference(state, &storage.back());
            model[key] = &storage.back();
        } else if (action == 0) {
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
    for (int k : {5, 3, 8, 3, 1})
        owning.InsertCopyOfNode(IntNode(k));
    EXPECT_EQ(owning.InsertCopyOfNode(IntNode(8)), nullptr) << "keys are unique";
    EXPECT_TRUE(owning.DeleteNode(3));
    EXPECT_FALSE(owning.DeleteNode(3));
    owning.RemoveNode(owning.FindNode(5));
    IntNode* taken = owning.DeleteNodeReference(8);
    ASSERT_NE(taken, nullptr);
    EXPECT_EQ(taken->key(), 8);
    delete taken;
    EXPECT_EQ(owning.checkTree(), nullptr);
    owning.DeleteAllNodes();
    EXPECT_TRUE(owning.empty());
}

TEST(VariableSizeAllocatorTest, RoundingSplittingAndMerging) {
    Supplier s;
    {
        VariableSizeAllocator a = makeAllocator(s, 0, 1024);
        EXPECT_EQ(s.allocCalls, 0u) << "no initial pages";

        unsigned int obtained = 99;
        char* one = static_cast<char*>(a.allocate(1, obtained));
        ASSERT_NE(one, nullptr);
        EXPECT_EQ(obtained, 1024u) << "a new page reports its usable size";
        EXPECT_EQ(s.outstanding(), 1024u + 24);
        EXPECT_EQ(a.getVarPageCurrAllocAmount(), 1024u + 24);
        EXPECT_EQ(a.GetPtrSize(one), 32u);
        EXPECT_EQ(reinterpret_cast<uintptr_t>(one) % 8, 0u);
        EXPECT_EQ(a.GetPtrSize(nullptr), 0u);
        char* odd = static_cast<char*>(a.allocate(33, obtained));
        EXPECT_EQ(obtained, 0u) << "served from the page already held";
        EXPECT_EQ(a.GetPtrSize(odd), 40u);
        EXPECT_EQ(odd, one + 32 + 8) << "blocks lie back to back";
        EXPECT_EQ(problems(a), "");
        EXPECT_EQ(a.Free(one), 0u);
        EXPECT_EQ(a.Free(odd), 0u) << "the whole page becomes the reserved page";
        EXPECT_EQ(problems(a), "");

        // Blocks a | b | c | guard: freeing a and c, then b, merges all three.
        char* blk[4];
        for (char*& p : blk)
            p = alloc(a, 64);
        EXPECT_EQ(a.Free(blk[0]), 0u);
        EXPECT_EQ(a.Free(blk[2]), 0u);
        EXPECT_EQ(problems(a), "");
        EXPECT_EQ(a.Free(blk[1]), 0u);
        EXPECT_EQ(problems(a), "");
        char* merged = alloc(a, 3 * 64 + 16);
        EXPECT_EQ(merged, blk[0]) << "a, b and c merged into one block";
        EXPECT_EQ(a.GetPtrSize(merged), 3u * 64 + 16);

        // Split threshold: a free block of n + 32 is handed out whole, n + 40 is split.
        a.Free(merged);
        char* hole = alloc(a, 96 + 32);
        ASSERT_NE(alloc(a, 32), nullptr); // a fence: the hole cannot merge with the rest
        a.Free(hole);
        char* whole = alloc(a, 96);
        EXPECT_EQ(whole, hole);
        EXPECT_EQ(a.GetPtrSize(whole), 128u);
        a.Free(whole);
        char* wider = alloc(a, 88); // the 128-byte block is n + 40 for n = 88
        EXPECT_EQ(wider, hole);
        EXPECT_EQ(a.GetPtrSize(wider), 88u);
        EXPECT_EQ(alloc(a, 32), hole + 88 + 8) << "the split-off rest is a 32-byte block";
        EXPECT_EQ(problems(a), "");
    }
    EXPECT_EQ(s.live.size(), 1u) << "a page that still holds blocks is not given back";
    for (auto& [block, bytes] : s.live)
        std::free(block);
}

// Small sizes head their lists from bins, larger ones from tree nodes: both behave alike.
TEST(VariableSizeAllocatorTest, SameSizeBlocksAreReusedLastFreedFirst) {
    for (const unsigned int size : {100u, 5000u}) {
        SCOPED_TRACE("block size " + std::to_string(size));
        Supplier s;
        VariableSizeAllocator a = makeAllocator(s, 1, 65536);
        char* blocks[6];
        char* fences[6];
        for (int i = 0; i < 6; ++i) {
            blocks[i] = alloc(a, size);
            fences[i] = alloc(a, 40);
        }
        for (char* p : blocks)
            a.Free(p);
        EXPECT_EQ(problems(a), "");
        for (int i = 5; i >= 0; --i)
            EXPECT_EQ(alloc(a, size), blocks[i]) << "the block freed last comes first";
        EXPECT_EQ(problems(a), "");

        // Take the list head itself out through a merge while its list has members.
        a.Free(blocks[0]);
        a.Free(blocks[1]);
        a.Free(blocks[2]);
        a.Free(fences[0]); // merges with blocks[0], the oldest and so the head
        EXPECT_EQ(problems(a), "");
        EXPECT_EQ(alloc(a, size), blocks[2]) << "the list member took the head's place";
        EXPECT_EQ(alloc(a, size), blocks[0]) << "carved from the merged block";
        EXPECT_EQ(problems(a), "");
        a.Free(blocks[0]);
        a.Free(blocks[2]);
        for (int i = 1; i < 6; ++i)
            a.Free(fences[i]);
        for (int i = 3; i < 6; ++i)
            a.Free(blocks[i]);
        EXPECT_EQ(problems(a), "");
        EXPECT_TRUE(a.empty()) << "everything merged back into the reserved page";
        EXPECT_EQ(s.allocCalls, 1u);
    }
}

TEST(VariableSizeAllocatorTest, ReservedPageAndPageReturn) {
    Supplier s;
    {
        VariableSizeAllocator a = makeAllocator(s, 2, 1000);
        EXPECT_EQ(s.allocCalls, 1u);
        EXPECT_EQ(s.outstanding(), 2000u + 24) << "the first page spans both initial pages";
        EXPECT_EQ(a.getVarPageCurrAllocAmount(), 2024u);
        EXPECT_EQ(a.getVarPagePeakAllocAmount(), 2024u);

        unsigned int obtained = 99;
        char* first = static_cast<char*>(a.allocate(1000, obtained));
        EXPECT_EQ(obtained, 0u) << "taken from the reserved page";
        EXPECT_EQ(s.allocCalls, 1u);
        EXPECT_EQ(a.Free(first), 0u) << "a whole free page is kept when none is reserved";
        EXPECT_EQ(s.freeCalls, 0u);
        first = static_cast<char*>(a.allocate(1000, obtained));
        EXPECT_EQ(obtained, 0u);
        EXPECT_EQ(s.allocCalls, 1u) << "the reserved page was reused";

        char* rest = alloc(a, 992); // the rest of the first page
        char* second = static_cast<char*>(a.allocate(1000, obtained));
        EXPECT_EQ(obtained, 1000u);
        EXPECT_EQ(s.allocCalls, 2u);
        EXPECT_EQ(a.getVarPageCurrAllocAmount(), 2024u + 1024);
        EXPECT_EQ(problems(a), "");

        EXPECT_EQ(a.Free(second), 0u) << "kept as the reserved page";
        a.Free(first);
        EXPECT_EQ(a.Free(rest), 2000u) << "a second whole page goes back: its usable size";
        EXPECT_EQ(s.freeCalls, 1u);
        EXPECT_EQ(a.getVarPageCurrAllocAmount(), 1024u);
        EXPECT_EQ(a.getVarPagePeakAllocAmount(), 3048u);
        EXPECT_EQ(problems(a), "");
    }
    EXPECT_TRUE(s.live.empty()) << "the reserved page goes back on destruction";
}

TEST(VariableSizeAllocatorTest, LargeBlocksAndTheCachedOne) {
    Supplier s;
    {
        VariableSizeAllocator a = makeAllocator(s, 0, 4096);
        unsigned int obtained = 0;
        char* big = static_cast<char*>(a.allocate(10000, obtained));
        ASSERT_NE(big, nullptr);
        EXPECT_EQ(obtained, 10000u);
        EXPECT_EQ(s.live.begin()->second, 10016u);
        EXPECT_EQ(reinterpret_cast<uintptr_t>(big) % 16, 0u);
        EXPECT_EQ(a.GetPtrSize(big), 10000u);
        EXPECT_EQ(a.getVarPageCurrAllocAmount(), 10000u) << "held bytes count the request";
        std::memset(big, 0xAB, 10000);

        EXPECT_EQ(a.Free(big), 0u) << "cached";
        char* again = static_cast<char*>(a.allocate(8000, obtained));
        EXPECT_EQ(again, big) << "a smaller request reuses the cached block";
        EXPECT_EQ(obtained, 0u);
        EXPECT_EQ(a.GetPtrSize(again), 10000u) << "it keeps its old size";
        EXPECT_EQ(s.allocCalls, 1u);

        char* other = static_cast<char*>(a.allocate(5000, obtained));
        EXPECT_EQ(a.Free(again), 0u);
        EXPECT_EQ(a.Free(other), 5000u) << "one block is cached at most";
        EXPECT_EQ(problems(a), "");

        char* larger = static_cast<char*>(a.allocate(20000, obtained));
        EXPECT_EQ(obtained, 20000u);
        EXPECT_EQ(s.live.size(), 1u) << "the smaller cached block went back";
        EXPECT_EQ(a.getVarPageCurrAllocAmount(), 20000u);
        EXPECT_EQ(a.Free(larger), 0u);

        char* huge = static_cast<char*>(a.allocate(200000, obtained));
        EXPECT_EQ(a.Free(huge), 200000u) << "blocks above 131071 bytes are never cached";
        EXPECT_EQ(a.allocate(0xFFFFFFF8u, obtained), nullptr) << "request + 16 overflows";
        EXPECT_EQ(problems(a), "");
    }
    EXPECT_TRUE(s.live.empty()) << "the cached block goes back on destruction";

    // With a page size of 8k - 1 a first page of several page sizes holds blocks of
    // page size + 1 bytes; they must not be taken for large blocks.
    Supplier t;
    VariableSizeAllocator b = makeAllocator(t, 4, 127);
    char* p = alloc(b, 127);
    char* q = alloc(b, 127);
    EXPECT_EQ(b.GetPtrSize(p), 128u);
    EXPECT_EQ(b.Free(p), 0u);
    EXPECT_EQ(problems(b), "");
    EXPECT_EQ(b.Free(q), 0u);
    EXPECT_EQ(t.allocCalls, 1u);
    EXPECT_EQ(t.freeCalls, 0u);
    EXPECT_EQ(problems(b), "");
}

TEST(VariableSizeAllocatorTest, SupplierFailureLeavesNothingBroken) {
    Supplier s;
    s.failAll = true;
    {
        VariableSizeAllocator a = makeAllocator(s, 4, 512);
        EXPECT_EQ(a.getVarPageCurrAllocAmount(), 0u) << "no first page";
        unsigned int obtained = 7;
        EXPECT_EQ(a.allocate(10, obtained), nullptr);
        EXPECT_EQ(obtained, 0u);
        EXPECT_EQ(a.allocate(5000, obtained), nullptr);
        EXPECT_EQ(obtained, 0u);
        EXPECT_EQ(problems(a), "");

        s.failAll = false;
        char* p = alloc(a, 10);
        ASSERT_NE(p, nullptr);
        char* big = alloc(a, 1000);
        ASSERT_NE(big, nullptr);
        a.Free(big); // cached
        s.failAll = true;
        char* q = alloc(a, 500); // the page has no room left for 504 bytes
        EXPECT_EQ(q, nullptr);
        EXPECT_EQ(alloc(a, 2000), nullptr) << "the cached block is too small, no new one";
        EXPECT_EQ(problems(a), "");
        EXPECT_EQ(a.getVarPageCurrAllocAmount(), 512u + 24);
        s.failAll = false;
        a.Free(p);
    }
    EXPECT_TRUE(s.live.empty());
}

// Random allocate/free against a model: live blocks never overlap, their contents survive,
// and the tree, the pages and the held bytes stay sound after every step.
TEST(VariableSizeAllocatorTest, RandomTraceAgainstModel) {
    struct Setup {
        unsigned int pageSize;
        unsigned int failEvery; // 0: reliable supplier
    };
    // 5000 bytes: the last block of each page is not a multiple of 8 (4 bytes over).
    // 20000 bytes: most free sizes are above the bins and live in the tree.
    for (const Setup setup : {Setup{4096, 0}, Setup{4096, 5}, Setup{5004, 0}, Setup{20000, 0}}) {
        const unsigned int pageSize = setup.pageSize;
        SCOPED_TRACE("page size " + std::to_string(pageSize) + ", supplier failing every " +
                     std::to_string(setup.failEvery) + "th call");
        Supplier s;
        s.failEvery = setup.failEvery;
        std::mt19937 rng(20240607);
        struct Live {
            unsigned int size;
            unsigned char fill;
        };
        std::map<char*, Live> live; // by address
        std::vector<char*> order;
        {
            VariableSizeAllocator a = makeAllocator(s, 2, pageSize);
            unsigned long long obtainedSum = 0;
            unsigned long long returnedSum = 0;
            for (int step = 0; step < 5000; ++step) {
                const bool doAlloc = order.empty() || rng() % 100 < (step < 2500 ? 60 : 40);
                if (doAlloc) {
                    unsigned int size;
                    const unsigned kind = rng() % 100;
                    if (kind < 60)
                        size = 1 + rng() % 128;
                    else if (kind < 95)
                        size = 1 + rng() % pageSize;
                    else
                        size = pageSize + 100 + rng() % 20000;
                    if (size + 16 == 2 * pageSize + 24)
                        ++size; // keeps large blocks apart from pages in the supplier's list
                    // Best fit: a block of the smallest free size that holds the request.
                    uint32_t bestSize = UINT32_MAX;
                    std::map<const char*, uint32_t> freeBefore;
                    if (size <= pageSize) {
                        const uint32_t n = (std::max(size, 32u) + 7) & ~7u;
                        freeBefore = freeBlocksOfPages(s, pageSize, 2);
                        for (const auto& [h, blockSize] : freeBefore)
                            if (blockSize >= n)
                                bestSize = std::min(bestSize, blockSize);
                    }
                    unsigned int obtained = 0;
                    auto* p = static_cast<char*>(a.allocate(size, obtained));
                    obtainedSum += obtained;
                    if (p && bestSize != UINT32_MAX) {
                        const auto chosen = freeBefore.find(p - 8);
                        ASSERT_NE(chosen, freeBefore.end()) << "not carved from a free block";
                        ASSERT_EQ(chosen->second, bestSize) << "not the best fit";
                    } else if (p && size <= pageSize) {
                        ASSERT_EQ(word(p - 8), 0u) << "no fit: the first block of a page";
                    }
                    if (!p) {
                        ASSERT_NE(setup.failEvery, 0u) << "null from a reliable supplier";
                        ASSERT_EQ(obtained, 0u);
                    } else {
                        ASSERT_GE(a.GetPtrSize(p), size);
                        ASSERT_EQ(reinterpret_cast<uintptr_t>(p) % 8, 0u);
                        auto after = live.lower_bound(p);
                        if (after != live.end()) {
                            ASSERT_LE(p + size, after->first) << "overlaps the next live block";
                        }
                        if (after != live.begin()) {
                            auto before = std::prev(after);
                            ASSERT_LE(before->first + before->second.size, p)
                                << "overlaps the previous live block";
                        }
                        const auto fill = static_cast<unsigned char>(rng());
                        std::memset(p, fill, size);
                        live[p] = {size, fill};
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
                    returnedSum += a.Free(p);
                }
                ASSERT_EQ(problems(a), "") << "at step " << step;
                // Held bytes: whole pages as obtained, large blocks without their header.
                unsigned long long expectedHeld = 0;
                for (const auto& [block, bytes] : s.live)
                    expectedHeld +=
                        bytes == pageSize + 24 || bytes == 2 * pageSize + 24 ? bytes : bytes - 16;
                ASSERT_EQ(a.getVarPageCurrAllocAmount(), expectedHeld) << "at step " << step;
            }
            EXPECT_GT(obtainedSum, 0u);
            EXPECT_GT(returnedSum, 0u);
            for (char* p : order)
                a.Free(p);
            EXPECT_EQ(problems(a), "");
            EXPECT_TRUE(a.empty());
            EXPECT_LE(s.live.size(), 2u) << "at most the reserved page and the cached block";
        }
        EXPECT_TRUE(s.live.empty());
    }
}

TEST(FixedSizeAllocatorTest, PoolsSlotsAndSupplier) {
    Supplier s;
    {
        FixedSizeAllocator f("PoolTest", 4, 0, 128, Supplier::alloc, Supplier::free, &s);
        EXPECT_EQ(s.outstanding(), 512u);
        EXPECT_EQ(f.heldBytes(), 512u);
        const auto* pool = static_cast<const unsigned char*>(s.live.begin()->first);

        std::set<DMMPoolBlock*> slots;
        for (int i = 0; i < 4; ++i) {
            int slotSize = 0;
            DMMPoolBlock* slot = f.GetPool(&slotSize);
            ASSERT_NE(slot, nullptr);
            EXPECT_EQ(slotSize, 112) << "(512 - 40) / 4 rounded down to 8";
            const auto* at = reinterpret_cast<const unsigned char*>(slot);
            EXPECT_TRUE(at >= pool + 40 && at + 112 <= pool + 512);
            slots.insert(slot);
        }
        EXPECT_EQ(slots.size(), 4u);
        EXPECT_EQ(s.allocCalls, 1u);

        int slotSize = 0;
        DMMPoolBlock* extra = f.GetPool(&slotSize);
        ASSERT_NE(extra, nullptr);
        EXPECT_EQ(slotSize, 88) << "a later pool holds one slot of 128 - 40 bytes";
        EXPECT_EQ(f.heldBytes(), 640u);
        std::memset(extra, 0x11, 88);
        f.FreePool(extra);
        EXPECT_EQ(f.heldBytes(), 512u) << "a wholly free later pool goes back";
        EXPECT_EQ(f.peakHeldBytes(), 640u);

        DMMPoolBlock* some = *slots.begin();
        f.FreePool(some);
        EXPECT_EQ(f.GetPool(nullptr), some) << "the slot just freed is reused";
        int outside = 0;
        f.FreePool(reinterpret_cast<DMMPoolBlock*>(&outside)); // ignored
        for (DMMPoolBlock* slot : slots)
            f.FreePool(slot);
        EXPECT_EQ(f.heldBytes(), 512u) << "the first pool stays";
        for (int i = 0; i < 4; ++i)
            EXPECT_NE(f.GetPool(nullptr), nullptr);

        s.failAll = true;
        EXPECT_EQ(f.GetPool(&slotSize), nullptr);
        EXPECT_EQ(f.heldBytes(), 512u);
        s.failAll = false;
    }
    EXPECT_TRUE(s.live.empty()) << "destruction gives back every pool";

    // Slots too small for a link: no pool is kept and nothing is handed out twice.
    Supplier t;
    {
        FixedSizeAllocator tiny("PoolTest", 0, 0, 40, Supplier::alloc, Supplier::free, &t);
        EXPECT_EQ(tiny.GetPool(nullptr), nullptr);
        t.failAll = true;
        FixedSizeAllocator failing("PoolTest", 8, 0, 64, Supplier::alloc, Supplier::free, &t);
        EXPECT_EQ(failing.heldBytes(), 0u);
        EXPECT_EQ(failing.GetPool(nullptr), nullptr);
    }
    EXPECT_TRUE(t.live.empty());
}

TEST(ZYRFixedSizePoolTest, ChunksFreeListAndFailure) {
    {
        ZYRFixedSizePool pool(1, 3);
        EXPECT_EQ(pool.elementSize(), 8u) << "room for the free-list link";
        std::set<void*> seen;
        std::vector<void*> handed;
        for (int i = 0; i < 7; ++i) {
            void* p = pool.Alloc();
            ASSERT_NE(p, nullptr);
            EXPECT_EQ(reinterpret_cast<uintptr_t>(p) % 8, 0u);
            std::memset(p, i, 8);
            seen.insert(p);
            handed.push_back(p);
        }
        EXPECT_EQ(seen.size(), 7u);
        for (int i = 0; i < 7; ++i)
            EXPECT_EQ(*static_cast<unsigned char*>(handed[i]), i) << "elements do not overlap";
        pool.Free(handed[2]);
        pool.Free(handed[5]);
        EXPECT_EQ(pool.Alloc(), handed[5]);
        EXPECT_EQ(pool.Alloc(), handed[2]);
        pool.FlushAll();
        EXPECT_NE(pool.SureAlloc(), nullptr);
    }

    ZYRFixedSizePool zeroPerChunk(64, 0);
    void* a = zeroPerChunk.Alloc();
    void* b = zeroPerChunk.Alloc();
    ASSERT_TRUE(a && b);
    EXPECT_NE(a, b);
    std::memset(a, 1, 64);
    std::memset(b, 2, 64);

    ZYRFixedSizePool pool(64, 16);
    zyrtest::FailingHost host;
    host.failAll = true;
    tZYRMemMgr record = host.record();
    zyrtest::installFront(0, &record);
    EXPECT_EQ(pool.Alloc(), nullptr);
    expectOutOfMemory([&] { (void)pool.SureAlloc(); }, "ZYRFixedSizePool allocation failed", 102);
    zyrtest::installFront(0);
}

TEST(ZYRStdAllocatorFixedSizePoolTest, RunsPagesAndFailure) {
    ZYRStdAllocatorFixedSizePool pool(16, 100);
    EXPECT_EQ(pool.Alloc(0), nullptr);
    // 8 GiB: no page can hold it.
    expectOutOfMemory([&] { (void)pool.SureAlloc(1u << 29); },
                      "ZYRStdAllocatorFixedSizePool allocation failed", 173);

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
