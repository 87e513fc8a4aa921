/// \file
/// Sub-allocators and pools: many small blocks carved out of few large pieces.
#pragma once

#include <cstdint>
#include <memory>

#include "ZYRStdExport.h"
#include "zyr/std/core/CZYRClientBase.h"
#include "zyr/std/memory/I_VariableSizeAllocator.h"

namespace ZYRStd {

/// Where VariableSizeAllocator and FixedSizeAllocator get their pages. Pieces must be at
/// least 8-byte aligned. When either procedure is null, both default to VirtualMemAlloc /
/// VirtualMemFree, so that a piece is never given back to a procedure that did not make it.
using tZYRPoolAllocProc = void* (*)(unsigned int bytes, void* userData);
/// Gives back a piece from the matching tZYRPoolAllocProc.
using tZYRPoolFreeProc = void (*)(void* block, void* userData);

} // namespace ZYRStd

/// The pools' block records; they live in the library, hosts only pass them back.
struct BlkHeader;
class FreeBlock;
struct DMMPoolBlock;
struct DMMPoolControl;
namespace ZYRStd {
struct ZYRStdAllocatorFixedSizePoolPage;
}

/// A best-fit allocator over pages with boundary tags, a free tree keyed by size and bins for
/// small sizes. Requests above the page size get a block of their own ("large" blocks). Not
/// thread-safe: the owning client serialises its use.
class ZYRSTD_API VariableSizeAllocator : public ZYRStd::I_VariableSizeAllocator,
                                         public ZYRStd::CZYRClientBase {
public:
    /// The smallest block: room for the free-tree node built in a free block.
    static constexpr unsigned int kMinBlockSize = 32;
    /// Page bytes beyond the usable size: 8-byte page word pair, first header, end sentinel.
    static constexpr unsigned int kPageOverhead = 24;
    /// Large blocks up to this request are kept for reuse when freed.
    static constexpr unsigned int kMaxCachedLargeBlock = 131071;

    /// The first page, of initialPages x pageSize usable bytes, is kept as the reserved page.
    /// `reservedCount` is accepted and not used.
    VariableSizeAllocator(const char* name, unsigned int initialPages, unsigned int reservedCount,
                          unsigned int pageSize, ZYRStd::tZYRPoolAllocProc alloc,
                          ZYRStd::tZYRPoolFreeProc free, void* userData);
    ~VariableSizeAllocator() override;
    VariableSizeAllocator(const VariableSizeAllocator&) = delete;
    VariableSizeAllocator& operator=(const VariableSizeAllocator&) = delete;

    void* allocate(unsigned int size, unsigned int& obtained) override;
    /// Null is ignored.
    unsigned int Free(void* p) override;

    /// 0 for null; the request of a large block, else the block's size.
    unsigned int GetPtrSize(void* p) const;
    /// A page of `bytes` usable bytes laid out as one free block, counted in the held bytes.
    void* allocVarPage(unsigned int bytes);
    /// Gives a page of allocVarPage back to the supplier.
    void freeVarPage(void* page);
    /// The bytes now taken from the supplier.
    unsigned long long getVarPageCurrAllocAmount() const { return held_; }
    /// The most bytes ever taken from the supplier at once.
    unsigned long long getVarPagePeakAllocAmount() const { return peakHeld_; }
    /// The usable bytes of a page.
    unsigned int pageSize() const { return pageSize_; }
    /// Everything now taken from the supplier (the held bytes).
    unsigned long long totalAllocatedMemory() const { return held_; }
    /// Takes a free block out of the tree, its bin or its same-size list.
    void RemoveBlock(BlkHeader* header);
    /// Obtains the first page as the reserved page (construction does this).
    void InitializePages();
    /// Kept for callers; logs nothing.
    void LogAllocFailure(unsigned int) {}
    /// Kept for callers; throws nothing.
    void ThrowBadAlloc() {}

    /// The name given at construction, borrowed.
    const char* name() const { return name_; }
    /// Debug check of the tree, the bins, the same-size lists, every page's boundary tags and
    /// the held bytes. Null when all is sound, else what is broken.
    const char* checkInvariants() const;

private:
    void* allocateLarge(unsigned int size, unsigned int& obtained);
    unsigned int freeLarge(unsigned char* header);
    /// Merges a block that just became free with its free neighbours, then keeps, returns or
    /// files the result; the bytes given back to the supplier.
    unsigned int release(unsigned char* header);
    void fileBlock(unsigned char* header, unsigned int size);
    void unfile(unsigned char* header);
    bool registerPage(unsigned char* page);
    void unregisterPage(unsigned char* page);
    void noteHeld(unsigned long long bytes);
    bool isFiled(const unsigned char* header, unsigned int size) const;
    static bool isBinned(unsigned int size) { return size < kBinLimit && size % 8 == 0; }
    /// The head of the free blocks of the smallest size at least n (a bin head or a tree
    /// node); when it comes from the tree, `below` gets the tree node just under n.
    FreeBlock* bestFit(unsigned int n, FreeBlock*& below) const;
    /// Takes a list head that has no members out of its bin or the tree.
    void dropHead(FreeBlock* head, unsigned int size);
    const char* checkSizeList(const FreeBlock* head, unsigned long long& filed,
                              unsigned long long maxBlocks) const;

    unsigned int initialPages_;
    unsigned int reservedCount_;
    unsigned int pageSize_;
    unsigned char* cachedLarge_ = nullptr;
    unsigned int cachedLargeSize_ = 0;
    unsigned char* reservedPage_ = nullptr;
    ZYRStd::tZYRPoolAllocProc alloc_;
    ZYRStd::tZYRPoolFreeProc free_;
    void* userData_;
    unsigned long long held_ = 0;
    unsigned long long peakHeld_ = 0;
    bool log_;
    char name_[39];
    /// Every page held, so that the debug check can walk them; a page's index here is kept
    /// in its unused second word.
    unsigned char** pages_ = nullptr;
    unsigned int pageCount_ = 0;
    unsigned int pageCapacity_ = 0;
    unsigned long long liveLargeBytes_ = 0;

    /// Free sizes below kBinLimit that are multiples of 8 head their lists from a bin instead
    /// of a tree node (see FreeIndex).
    static constexpr unsigned int kBinLimit = 4096;
    /// The free tree and the bins, kept apart from the allocator's record.
    struct FreeIndex;
    std::unique_ptr<FreeIndex> index_;
};

/// Pools of equal slots. The first pool has room for slotsPerPool slots of slotBytes bytes
/// (header included); later pools hold one slot each. The usable slot size is reported by
/// GetPool.
class ZYRSTD_API FixedSizeAllocator : public ZYRStd::CZYRClientBase {
public:
    /// `name` and `reservedCount` are accepted and not kept.
    FixedSizeAllocator(const char* name, unsigned int slotsPerPool, unsigned int reservedCount,
                       unsigned int slotBytes, ZYRStd::tZYRPoolAllocProc alloc,
                       ZYRStd::tZYRPoolFreeProc free, void* userData);
    ~FixedSizeAllocator() override;
    FixedSizeAllocator(const FixedSizeAllocator&) = delete;
    FixedSizeAllocator& operator=(const FixedSizeAllocator&) = delete;

    /// A free slot (its usable bytes in *slotSize when not null), or null.
    DMMPoolBlock* GetPool(int* slotSize);
    /// A slot outside every pool is ignored.
    void FreePool(DMMPoolBlock* slot);
    /// Lays out a fresh pool of `bytes` bytes as free slots.
    void SetupPool(DMMPoolControl* pool, unsigned int bytes);

    /// The bytes now taken from the supplier.
    unsigned long long heldBytes() const { return held_; }
    /// The most bytes ever taken from the supplier at once.
    unsigned long long peakHeldBytes() const { return peakHeld_; }

private:
    static DMMPoolBlock* pop(DMMPoolControl* pool, int* slotSize);

    DMMPoolControl* pools_ = nullptr;
    unsigned int slotsPerPool_;
    unsigned int slotBytes_;
    ZYRStd::tZYRPoolAllocProc alloc_;
    ZYRStd::tZYRPoolFreeProc free_;
    void* userData_;
    unsigned long long held_ = 0;
    unsigned long long peakHeld_ = 0;
};

namespace ZYRStd {

/// A free-list pool of equal elements in chunks from ZYRMalloc. Elements are 8-byte aligned
/// and at least 8 bytes, since a free element holds the free-list link.
class ZYRSTD_API ZYRFixedSizePool : public CZYRClientBase {
public:
    /// A pool of `elementSize`-byte elements (rounded up to 8), `elementsPerChunk` to a
    /// chunk. Not locked: one thread at a time.
    ZYRFixedSizePool(unsigned int elementSize, unsigned int elementsPerChunk);
    ~ZYRFixedSizePool() override;
    ZYRFixedSizePool(const ZYRFixedSizePool&) = delete;
    ZYRFixedSizePool& operator=(const ZYRFixedSizePool&) = delete;

    /// Null when no chunk could be had.
    void* Alloc();
    /// Throws kZYRErrorOutOfMemory instead of returning null.
    void* SureAlloc();
    /// Null is ignored.
    void Free(void* p);
    /// Gives every chunk back; elements handed out become invalid.
    void FlushAll();

    /// The element size after rounding.
    unsigned int elementSize() const { return elementSize_; }

private:
    struct Chunk;

    void* allocFromChunks();

    unsigned int elementSize_;
    unsigned int elementsPerChunk_;
    Chunk* chunks_ = nullptr; ///< newest first
    void* freeList_ = nullptr;
};

/// A bump pool of element runs on virtual-memory pages; runs are only given back all at
/// once.
class ZYRSTD_API ZYRStdAllocatorFixedSizePool : public CZYRClientBase {
public:
    /// A pool of `elementSize`-byte elements, about `elementsPerPage` to a page. Not locked:
    /// one thread at a time.
    ZYRStdAllocatorFixedSizePool(unsigned int elementSize, unsigned int elementsPerPage);
    ~ZYRStdAllocatorFixedSizePool() override;
    ZYRStdAllocatorFixedSizePool(const ZYRStdAllocatorFixedSizePool&) = delete;
    ZYRStdAllocatorFixedSizePool& operator=(const ZYRStdAllocatorFixedSizePool&) = delete;

    /// `count` consecutive elements, or null (also for 0).
    void* Alloc(unsigned int count);
    /// Throws kZYRErrorOutOfMemory instead of returning null.
    void* SureAlloc(unsigned int count);
    /// Gives every page back; runs handed out become invalid.
    void FlushAll();

private:
    ZYRStdAllocatorFixedSizePoolPage* AddPage(unsigned int count);
    void* AllocFromPage(ZYRStdAllocatorFixedSizePoolPage* page, unsigned int count);
    void FreePage(ZYRStdAllocatorFixedSizePoolPage* page);
    unsigned int OptimalNumElementsPerPage(unsigned int count) const;

    unsigned int elementSize_;
    unsigned int elementsPerPage_;
    ZYRStdAllocatorFixedSizePoolPage* pages_ = nullptr; ///< newest first
    unsigned long long freeElements_ = 0;
};

} // namespace ZYRStd
