// Sub-allocators and pools.
#include "zyr/std/memory/ZYRPool.h"

#include <algorithm>
#include <cstdlib>
#include <new>

#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/core/ZYRVirtualMem.h"
#include "zyr/std/memory/ZYRDMM.h"
#include "zyr/std/memory/internal/ZYRPoolBlocks.h"

#if defined(__SANITIZE_ADDRESS__)
#include <sanitizer/asan_interface.h>
#define ZYR_POOL_POISON(addr, size) ASAN_POISON_MEMORY_REGION(addr, size)
#define ZYR_POOL_UNPOISON(addr, size) ASAN_UNPOISON_MEMORY_REGION(addr, size)
#else
#define ZYR_POOL_POISON(addr, size) ((void)(addr), (void)(size))
#define ZYR_POOL_UNPOISON(addr, size) ((void)(addr), (void)(size))
#endif

namespace ZYRStd {} // namespace ZYRStd

namespace {

constexpr const char* kSource = "source/zyr/std/ZYRPool";
// The lines of the pools' out-of-memory records, as hosts see them; they stay put when
// this file changes.
constexpr int kFixedPoolAllocationLine = 102;
constexpr int kAllocatorPoolAllocationLine = 173;

// Bit 0 of a header's first word: the block is free.
constexpr uint32_t kFreeBit = 1;
// Bit 1 of a header's first word: the block is a large block. A page block's first word is
// a multiple of 8 plus the free bit, so this never appears there; the size word alone
// (page size + 1) could be a real block size in a first page of several page sizes.
constexpr uint32_t kLargeBit = 2;
constexpr uint32_t kLargeHeader = 16;
constexpr uint64_t kMaxSupplierRequest = UINT32_MAX;

uint32_t load32(const unsigned char* p) {
    uint32_t v;
    std::memcpy(&v, p, sizeof v);
    return v;
}

void store32(unsigned char* p, uint32_t v) {
    std::memcpy(p, &v, sizeof v);
}

// Headers are read with memcpy: with a page size that is not a multiple of 8 the end
// sentinel need not be aligned.
uint32_t prevSizeOf(const unsigned char* h) {
    return load32(h) & ~kFreeBit;
}
uint32_t sizeOf(const unsigned char* h) {
    return load32(h + 4);
}
bool isFree(const unsigned char* h) {
    return (load32(h) & kFreeBit) != 0;
}
// No real block has size 0 unless a zero-byte page spans it, and that block is both the
// first block and followed by the sentinel, which the callers test first.
bool isSentinel(const unsigned char* h) {
    return sizeOf(h) == 0;
}
void setPrevSize(unsigned char* h, uint32_t prevSize) {
    store32(h, prevSize | (load32(h) & kFreeBit));
}

FreeBlock* nodeAt(unsigned char* h) {
    return std::launder(reinterpret_cast<FreeBlock*>(h + 8));
}
const FreeBlock* nodeAt(const unsigned char* h) {
    return std::launder(reinterpret_cast<const FreeBlock*>(h + 8));
}
unsigned char* headerOf(FreeBlock* node) {
    return reinterpret_cast<unsigned char*>(node) - 8;
}
const unsigned char* headerOf(const FreeBlock* node) {
    return reinterpret_cast<const unsigned char*>(node) - 8;
}

// A page: {usable bytes S, registry index}, the first block's header, S bytes, the sentinel.
unsigned char* firstHeader(unsigned char* page) {
    return page + 8;
}

void layOutPage(unsigned char* page) {
    const uint32_t usable = load32(page);
    store32(page + 8, kFreeBit);
    store32(page + 12, usable);
    store32(page + 16 + usable, 0);
    store32(page + 20 + usable, 0);
}

void* defaultSupplierAlloc(unsigned int bytes, void*) {
    return ZYRStd::VirtualMemAlloc(bytes);
}

void defaultSupplierFree(void* block, void*) {
    ZYRStd::VirtualMemFree(block);
}

bool usesDefaultSupplier(ZYRStd::tZYRPoolAllocProc alloc, ZYRStd::tZYRPoolFreeProc free) {
    return alloc == nullptr || free == nullptr;
}

// The first set bit at or after `from` in a bitmap of `count` bits, or `count`.
unsigned int nextSetBit(const uint64_t* bits, unsigned int from, unsigned int count) {
    unsigned int word = from / 64;
    uint64_t w = bits[word] & (~uint64_t{0} << (from % 64));
    while (w == 0) {
        if (++word == count / 64)
            return count;
        w = bits[word];
    }
    return word * 64 + static_cast<unsigned int>(__builtin_ctzll(w));
}

uintptr_t address(const void* p) {
    return reinterpret_cast<uintptr_t>(p);
}

} // namespace

// ---- VariableSizeAllocator ------------------------------------------------------------

static_assert(VariableSizeAllocator::kMinBlockSize == ((sizeof(FreeBlock) + 7) & ~7u),
              "the smallest block must hold the free-tree node, rounded up to 8 bytes");

// The free tree keyed by size, and the bins: free sizes below kBinLimit that are multiples
// of 8 head their lists from a bin with a presence bit instead of a tree node, so best fit
// is a bit scan, and filing or taking a block of such a size needs no tree search or
// rebalancing.
struct VariableSizeAllocator::FreeIndex : ZYRStd::CZYRClientBase {
    static constexpr unsigned int kBinSlots = kBinLimit / 8;
    ZYRStd::redblack_tree<FreeBlock, unsigned int> tree;
    FreeBlock* binHead[kBinSlots] = {};
    uint64_t binPresent[kBinSlots / 64] = {};
    // Tree sizes below kBinLimit (the last block of a page whose size is not a multiple of
    // 8); while there are any, small best-fit lookups also search the tree.
    unsigned int unbinnedSmallSizes = 0;
};

VariableSizeAllocator::VariableSizeAllocator(const char* name, unsigned int initialPages,
                                             unsigned int reservedCount, unsigned int pageSize,
                                             ZYRStd::tZYRPoolAllocProc alloc,
                                             ZYRStd::tZYRPoolFreeProc free, void* userData)
    : initialPages_(initialPages), reservedCount_(reservedCount), pageSize_(pageSize),
      alloc_(usesDefaultSupplier(alloc, free) ? defaultSupplierAlloc : alloc),
      free_(usesDefaultSupplier(alloc, free) ? defaultSupplierFree : free), userData_(userData),
      log_(std::getenv("ZYR_DMM_LOG") != nullptr), index_(std::make_unique<FreeIndex>()) {
    std::memset(name_, 0, sizeof name_);
    if (name)
        std::strncpy(name_, name, sizeof name_ - 1);
    InitializePages();
}

VariableSizeAllocator::~VariableSizeAllocator() {
    if (cachedLarge_) {
        free_(cachedLarge_, userData_);
        held_ -= cachedLargeSize_;
        cachedLarge_ = nullptr;
    }
    if (reservedPage_) {
        freeVarPage(reservedPage_);
        reservedPage_ = nullptr;
    }
    if (log_)
        ZYRStd::UpdateClientMaxMemoryStat(
            name_, static_cast<unsigned int>(std::min<unsigned long long>(peakHeld_, UINT32_MAX)));
    // The nodes live in pages that the clients may still use; they are not ours to touch.
    index_->tree.ForgetAllNodes();
    ZYRStd::ZYRFree(pages_);
}

void VariableSizeAllocator::InitializePages() {
    if (reservedPage_)
        return;
    // In 64 bits: a product that does not fit a supplier request gives no first page
    // rather than a wrapped, too small one.
    const uint64_t usable = uint64_t{initialPages_} * pageSize_;
    if (usable == 0 || usable + kPageOverhead > kMaxSupplierRequest)
        return;
    reservedPage_ = static_cast<unsigned char*>(allocVarPage(static_cast<unsigned int>(usable)));
}

void VariableSizeAllocator::noteHeld(unsigned long long bytes) {
    held_ += bytes;
    peakHeld_ = std::max(peakHeld_, held_);
}

bool VariableSizeAllocator::registerPage(unsigned char* page) {
    if (pageCount_ == pageCapacity_) {
        const unsigned int capacity = pageCapacity_ ? pageCapacity_ * 2 : 16;
        if (capacity > UINT32_MAX / sizeof(unsigned char*))
            return false;
        void* grown = ZYRStd::ZYRRealloc(pages_, capacity * sizeof(unsigned char*));
        if (!grown)
            return false;
        pages_ = static_cast<unsigned char**>(grown);
        pageCapacity_ = capacity;
    }
    store32(page + 4, pageCount_);
    pages_[pageCount_++] = page;
    return true;
}

void VariableSizeAllocator::unregisterPage(unsigned char* page) {
    const uint32_t index = load32(page + 4);
    unsigned char* last = pages_[--pageCount_];
    pages_[index] = last;
    store32(last + 4, index);
}

void* VariableSizeAllocator::allocVarPage(unsigned int bytes) {
    const uint64_t total = uint64_t{bytes} + kPageOverhead;
    if (total > kMaxSupplierRequest)
        return nullptr;
    auto* page = static_cast<unsigned char*>(alloc_(static_cast<unsigned int>(total), userData_));
    if (!page)
        return nullptr;
    if (!registerPage(page)) {
        free_(page, userData_);
        return nullptr;
    }
    noteHeld(total);
    store32(page, bytes);
    layOutPage(page);
    return page;
}

void VariableSizeAllocator::freeVarPage(void* page) {
    auto* p = static_cast<unsigned char*>(page);
    const uint32_t usable = load32(p);
    unregisterPage(p);
    free_(p, userData_);
    held_ -= uint64_t{usable} + kPageOverhead;
}

void* VariableSizeAllocator::allocate(unsigned int size, unsigned int& obtained) {
    obtained = 0;
    if (size > pageSize_)
        return allocateLarge(size, obtained);
    const uint64_t wanted = (std::max<uint64_t>(size, kMinBlockSize) + 7) & ~uint64_t{7};
    if (wanted > UINT32_MAX)
        return nullptr;
    const auto n = static_cast<uint32_t>(wanted);

    unsigned char* h;
    FreeBlock* below = nullptr;
    FreeBlock* head = bestFit(n, below);
    if (!head) {
        unsigned char* page = reservedPage_;
        if (page) {
            reservedPage_ = nullptr;
        } else {
            page = static_cast<unsigned char*>(allocVarPage(pageSize_));
            if (!page) {
                LogAllocFailure(size);
                return nullptr;
            }
            obtained = pageSize_;
        }
        layOutPage(page);
        h = firstHeader(page);
    } else if (FreeBlock* member = head->nextSameSize()) {
        // The head stays while its list has members: the most recently freed member goes
        // first.
        FreeBlock* after = member->nextSameSize();
        head->setNextSameSize(after);
        if (after)
            after->setPrevSameSize(head);
        h = headerOf(member);
    } else {
        h = headerOf(head);
    }

    store32(h, load32(h) & ~kFreeBit);
    const uint32_t blockSize = sizeOf(h);
    const bool headLeaves = head && headerOf(head) == h;
    if (uint64_t{blockSize} < uint64_t{n} + kMinBlockSize + 8) {
        if (headLeaves)
            dropHead(head, blockSize);
        return h + 8;
    }

    // The rest needs no merging: the block was free, so its neighbours are not.
    const uint32_t restSize = blockSize - n - 8;
    store32(h + 4, n);
    unsigned char* rest = h + 8 + n;
    store32(rest, n | kFreeBit);
    store32(rest + 4, restSize);
    unsigned char* after = rest + 8 + restSize;
    if (!isSentinel(after))
        setPrevSize(after, restSize);
    if (headLeaves && !isBinned(blockSize) && !isBinned(restSize) &&
        (!below || below->key() < restSize)) {
        // No free size in the tree lies between the node's predecessor and the rest, so the
        // rest can take the node's place without a search or rebalancing.
        index_->tree.ReplaceNode(head, ::new (static_cast<void*>(rest + 8)) FreeBlock());
        if (blockSize < kBinLimit)
            --index_->unbinnedSmallSizes;
        if (restSize < kBinLimit)
            ++index_->unbinnedSmallSizes;
        return h + 8;
    }
    if (headLeaves)
        dropHead(head, blockSize);
    fileBlock(rest, restSize);
    return h + 8;
}

void* VariableSizeAllocator::allocateLarge(unsigned int size, unsigned int& obtained) {
    if (cachedLarge_) {
        unsigned char* block = cachedLarge_;
        const uint32_t cachedSize = cachedLargeSize_;
        cachedLarge_ = nullptr;
        cachedLargeSize_ = 0;
        if (cachedSize >= size) {
            // Reused as it is: its recorded size stays, so the accounting still matches
            // when it is given back.
            liveLargeBytes_ += cachedSize;
            return block + kLargeHeader;
        }
        free_(block, userData_);
        held_ -= cachedSize;
    }
    if (uint64_t{size} + kLargeHeader > kMaxSupplierRequest)
        return nullptr;
    auto* block = static_cast<unsigned char*>(alloc_(size + kLargeHeader, userData_));
    if (!block) {
        LogAllocFailure(size);
        return nullptr;
    }
    noteHeld(size);
    liveLargeBytes_ += size;
    store32(block, 0);
    store32(block + 4, size);
    store32(block + 8, kLargeBit);
    store32(block + 12, pageSize_ + 1);
    obtained = size;
    return block + kLargeHeader;
}

unsigned int VariableSizeAllocator::freeLarge(unsigned char* header) {
    unsigned char* block = header - 8;
    const uint32_t request = load32(block + 4);
    liveLargeBytes_ -= request;
    if (request > kMaxCachedLargeBlock || cachedLarge_) {
        free_(block, userData_);
        held_ -= request;
        return request;
    }
    cachedLarge_ = block;
    cachedLargeSize_ = request;
    return 0;
}

unsigned int VariableSizeAllocator::Free(void* p) {
    if (!p)
        return 0;
    unsigned char* h = static_cast<unsigned char*>(p) - 8;
    if (load32(h) & kLargeBit)
        return freeLarge(h);
    return release(h);
}

unsigned int VariableSizeAllocator::release(unsigned char* h) {
    uint32_t size = sizeOf(h);
    unsigned char* next = h + 8 + size;
    if (!isSentinel(next) && isFree(next)) {
        unfile(next);
        size += sizeOf(next) + 8;
        store32(h + 4, size);
        unsigned char* after = h + 8 + size;
        if (!isSentinel(after))
            setPrevSize(after, size);
    }
    if (const uint32_t prevSize = prevSizeOf(h)) {
        unsigned char* prev = h - 8 - prevSize;
        if (isFree(prev)) {
            unfile(prev);
            size += sizeOf(prev) + 8;
            store32(prev + 4, size);
            unsigned char* after = prev + 8 + size;
            if (!isSentinel(after))
                setPrevSize(after, size);
            h = prev;
        }
    }
    if (prevSizeOf(h) == 0 && isSentinel(h + 8 + size)) {
        unsigned char* page = h - 8;
        if (!reservedPage_) {
            reservedPage_ = page;
            store32(h, kFreeBit);
            return 0;
        }
        freeVarPage(page);
        return size;
    }
    fileBlock(h, size);
    return 0;
}

void VariableSizeAllocator::fileBlock(unsigned char* h, unsigned int size) {
    store32(h, load32(h) | kFreeBit);
    FreeBlock* block = ::new (static_cast<void*>(h + 8)) FreeBlock();
    FreeBlock* head;
    ZYRStd::tree_search_state<FreeBlock> state;
    if (isBinned(size)) {
        head = index_->binHead[size / 8];
        if (!head) {
            index_->binHead[size / 8] = block;
            index_->binPresent[size / 512] |= uint64_t{1} << (size / 8 % 64);
            return;
        }
    } else if (index_->tree.SetSearchState(state, size)) {
        head = state.found;
    } else {
        index_->tree.InsertNodeReference(state, block);
        index_->unbinnedSmallSizes += size < kBinLimit;
        return;
    }
    FreeBlock* after = head->nextSameSize();
    block->setOwnerFlag(true);
    block->setPrevSameSize(head);
    block->setNextSameSize(after);
    if (after)
        after->setPrevSameSize(block);
    head->setNextSameSize(block);
}

void VariableSizeAllocator::dropHead(FreeBlock* head, unsigned int size) {
    if (isBinned(size)) {
        index_->binHead[size / 8] = nullptr;
        index_->binPresent[size / 512] &= ~(uint64_t{1} << (size / 8 % 64));
    } else {
        index_->tree.UnlinkNode(head);
        index_->unbinnedSmallSizes -= size < kBinLimit;
    }
}

void VariableSizeAllocator::unfile(unsigned char* h) {
    FreeBlock* block = nodeAt(h);
    FreeBlock* after = block->nextSameSize();
    if (block->inSizeList()) {
        FreeBlock* before = block->prevSameSize();
        before->setNextSameSize(after);
        if (after)
            after->setPrevSameSize(before);
        return;
    }
    if (!after) {
        dropHead(block, sizeOf(h));
        return;
    }
    // The first list member heads the list in the block's place.
    after->setOwnerFlag(false);
    const uint32_t size = sizeOf(h);
    if (isBinned(size)) {
        after->setPrevSameSize(nullptr);
        index_->binHead[size / 8] = after;
    } else {
        index_->tree.ReplaceNode(block, after);
    }
}

void VariableSizeAllocator::RemoveBlock(BlkHeader* header) {
    unfile(reinterpret_cast<unsigned char*>(header));
}

FreeBlock* VariableSizeAllocator::bestFit(unsigned int n, FreeBlock*& below) const {
    below = nullptr;
    if (n >= kBinLimit)
        return index_->tree.GetMinGTOrEqNode(n, below);
    const unsigned int slot = nextSetBit(index_->binPresent, n / 8, FreeIndex::kBinSlots);
    FreeBlock* binned = slot < FreeIndex::kBinSlots ? index_->binHead[slot] : nullptr;
    // The tree holds small sizes only when pages end in blocks that are not multiples of 8.
    if (binned && index_->unbinnedSmallSizes == 0)
        return binned;
    FreeBlock* inTree = index_->tree.GetMinGTOrEqNode(n, below);
    return binned && (!inTree || slot * 8 < inTree->key()) ? binned : inTree;
}

unsigned int VariableSizeAllocator::GetPtrSize(void* p) const {
    if (!p)
        return 0;
    const unsigned char* h = static_cast<const unsigned char*>(p) - 8;
    if (load32(h) & kLargeBit)
        return load32(h - 4);
    return sizeOf(h);
}

bool VariableSizeAllocator::isFiled(const unsigned char* h, unsigned int size) const {
    const FreeBlock* wanted = nodeAt(h);
    for (const FreeBlock* b = isBinned(size) ? index_->binHead[size / 8]
                                             : index_->tree.FindNode(size);
         b; b = b->nextSameSize())
        if (b == wanted)
            return true;
    return false;
}

// A list of same-size blocks from its head; null when sound, else what is broken.
const char* VariableSizeAllocator::checkSizeList(const FreeBlock* head, unsigned long long& filed,
                                                 unsigned long long maxBlocks) const {
    if (head->inSizeList())
        return "a list head is marked as a list member";
    if (!isFree(headerOf(head)))
        return "a filed block is not marked free";
    ++filed;
    const FreeBlock* before = head;
    for (const FreeBlock* m = head->nextSameSize(); m; before = m, m = m->nextSameSize()) {
        if (++filed > maxBlocks)
            return "a size list does not end";
        if (!m->inSizeList() || m->prevSameSize() != before)
            return "a size list is not linked both ways";
        if (m->key() != head->key())
            return "a size list holds a block of another size";
        if (!isFree(headerOf(m)))
            return "a filed block is not marked free";
    }
    return nullptr;
}

const char* VariableSizeAllocator::checkInvariants() const {
    unsigned long long treeNodes = 0;
    if (const char* why = index_->tree.checkTree(&treeNodes))
        return why;

    // Bounds every list walk, so that a cycle is reported rather than followed forever.
    const unsigned long long maxBlocks = held_ / (kMinBlockSize + 8) + 1;
    unsigned long long filed = 0;
    unsigned int smallInTree = 0;
    for (auto it = index_->tree.begin(); it != index_->tree.end(); ++it) {
        if (isBinned(it->key()))
            return "a size that belongs in a bin is in the tree";
        smallInTree += it->key() < kBinLimit;
        if (const char* why = checkSizeList(it.get(), filed, maxBlocks))
            return why;
    }
    if (smallInTree != index_->unbinnedSmallSizes)
        return "the count of small sizes in the tree is wrong";
    for (unsigned int slot = 0; slot < FreeIndex::kBinSlots; ++slot) {
        const FreeBlock* head = index_->binHead[slot];
        if (((index_->binPresent[slot / 64] >> (slot % 64)) & 1) != (head != nullptr))
            return "a bin's bit disagrees with its list";
        if (!head)
            continue;
        if (head->key() != slot * 8)
            return "a bin holds a block of another size";
        if (const char* why = checkSizeList(head, filed, maxBlocks))
            return why;
    }

    unsigned long long pageBytes = 0;
    unsigned long long freeInPages = 0;
    bool reservedSeen = false;
    for (unsigned int i = 0; i < pageCount_; ++i) {
        const unsigned char* page = pages_[i];
        if (load32(page + 4) != i)
            return "a page's registry index is wrong";
        const uint32_t usable = load32(page);
        pageBytes += uint64_t{usable} + kPageOverhead;
        const uint64_t end = uint64_t{usable} + 16;
        const bool reserved = page == reservedPage_;
        reservedSeen |= reserved;
        uint64_t offset = 8;
        uint32_t expectedPrev = 0;
        bool prevFree = false;
        while (offset != end) {
            if (offset > end)
                return "a block runs past its page";
            const unsigned char* h = page + offset;
            const uint32_t word0 = load32(h);
            const uint32_t size = sizeOf(h);
            const bool whole = offset == 8 && uint64_t{size} + 16 == end;
            const bool last = offset + 8 + size == end;
            if ((word0 & ~kFreeBit) != expectedPrev)
                return "a previous-size word does not match the block before";
            if (size == 0 && !whole)
                return "an empty block inside a page";
            if (!last && (size % 8 != 0 || size < kMinBlockSize))
                return "a block size is not a multiple of 8 or is below the minimum";
            const bool free = isFree(h);
            if (reserved) {
                if (!whole || !free)
                    return "the reserved page is not one free block";
            } else if (free) {
                if (whole)
                    return "a wholly free page is kept besides the reserved page";
                if (prevFree)
                    return "two free blocks lie next to each other";
                if (!isFiled(h, size))
                    return "a free block is missing from the tree";
                ++freeInPages;
            }
            prevFree = free;
            expectedPrev = size;
            offset += uint64_t{size} + 8;
        }
        if (load32(page + end) != 0 || load32(page + end + 4) != 0)
            return "a page's end sentinel is damaged";
    }
    if (reservedPage_ && !reservedSeen)
        return "the reserved page is not a held page";
    if (filed != freeInPages)
        return "the tree holds blocks that are not free blocks of a page";
    if (held_ != pageBytes + liveLargeBytes_ + cachedLargeSize_)
        return "held bytes do not match the pages and large blocks";
    if (peakHeld_ < held_)
        return "peak held bytes are below the held bytes";
    return nullptr;
}

// ---- FixedSizeAllocator -----------------------------------------------------------------

namespace {
constexpr unsigned int kPoolHeader = sizeof(DMMPoolControl);
} // namespace

FixedSizeAllocator::FixedSizeAllocator(const char*, unsigned int slotsPerPool, unsigned int,
                                       unsigned int slotBytes, ZYRStd::tZYRPoolAllocProc alloc,
                                       ZYRStd::tZYRPoolFreeProc free, void* userData)
    : slotsPerPool_(slotsPerPool), slotBytes_(slotBytes),
      alloc_(usesDefaultSupplier(alloc, free) ? defaultSupplierAlloc : alloc),
      free_(usesDefaultSupplier(alloc, free) ? defaultSupplierFree : free), userData_(userData) {
    const uint64_t bytes = uint64_t{slotsPerPool} * slotBytes;
    if (bytes == 0 || bytes > kMaxSupplierRequest)
        return;
    void* memory = alloc_(static_cast<unsigned int>(bytes), userData_);
    if (!memory)
        return;
    pools_ = ::new (memory) DMMPoolControl();
    SetupPool(pools_, static_cast<unsigned int>(bytes));
    held_ = peakHeld_ = bytes;
}

FixedSizeAllocator::~FixedSizeAllocator() {
    while (DMMPoolControl* pool = pools_) {
        pools_ = pool->nextPool;
        held_ -= pool->poolBytes;
        free_(pool, userData_);
    }
}

void FixedSizeAllocator::SetupPool(DMMPoolControl* pool, unsigned int bytes) {
    auto* base = reinterpret_cast<unsigned char*>(pool);
    unsigned int slots = slotBytes_ ? bytes / slotBytes_ : 0;
    // A stride of 0 would hand out the same slot twice: such a pool gets no slots.
    const unsigned int stride =
        slots && bytes > kPoolHeader ? ((bytes - kPoolHeader) / slots) & ~7u : 0;
    if (stride == 0)
        slots = 0;
    pool->nextPool = nullptr;
    pool->end = base + bytes;
    pool->slots = slots;
    pool->freeSlots = slots;
    pool->stride = stride;
    pool->poolBytes = bytes;
    DMMPoolBlock* next = nullptr;
    for (unsigned int i = slots; i-- > 0;)
        next = ::new (base + kPoolHeader + uint64_t{i} * stride) DMMPoolBlock{next};
    pool->freeList = next;
}

DMMPoolBlock* FixedSizeAllocator::pop(DMMPoolControl* pool, int* slotSize) {
    DMMPoolBlock* slot = pool->freeList;
    pool->freeList = slot->next;
    --pool->freeSlots;
    if (slotSize)
        *slotSize = static_cast<int>(pool->stride);
    return slot;
}

DMMPoolBlock* FixedSizeAllocator::GetPool(int* slotSize) {
    DMMPoolControl* last = nullptr;
    for (DMMPoolControl* pool = pools_; pool; last = pool, pool = pool->nextPool)
        if (pool->freeSlots != 0)
            return pop(pool, slotSize);
    if (slotBytes_ == 0)
        return nullptr;
    void* memory = alloc_(slotBytes_, userData_);
    if (!memory)
        return nullptr;
    auto* pool = ::new (memory) DMMPoolControl();
    SetupPool(pool, slotBytes_);
    if (pool->slots == 0) {
        free_(memory, userData_);
        return nullptr;
    }
    held_ += slotBytes_;
    peakHeld_ = std::max(peakHeld_, held_);
    if (last)
        last->nextPool = pool;
    else
        pools_ = pool;
    return pop(pool, slotSize);
}

void FixedSizeAllocator::FreePool(DMMPoolBlock* slot) {
    if (!slot)
        return;
    const uintptr_t at = address(slot);
    DMMPoolControl* before = nullptr;
    for (DMMPoolControl* pool = pools_; pool; before = pool, pool = pool->nextPool) {
        const uintptr_t first = address(pool) + kPoolHeader;
        if (at < first || at >= address(pool->end))
            continue;
        if (pool->stride == 0 || (at - first) % pool->stride != 0 ||
            (at - first) / pool->stride >= pool->slots)
            return;
        ++pool->freeSlots;
        if (pool->freeSlots == pool->slots && before) {
            before->nextPool = pool->nextPool;
            held_ -= pool->poolBytes;
            free_(pool, userData_);
            return;
        }
        slot->next = pool->freeList;
        pool->freeList = slot;
        return;
    }
}

// ---- ZYRFixedSizePool ---------------------------------------------------------------------

namespace ZYRStd {

namespace {
// 16 bytes, so that elements keep the 16-byte alignment of the front's blocks.
constexpr unsigned int kChunkHeader = 16;
constexpr unsigned int kPoolPageHeader = sizeof(ZYRStdAllocatorFixedSizePoolPage);
static_assert(kPoolPageHeader == 16);

// Rounded up to a multiple of 8 and at least 8; 0 when that does not fit 32 bits.
unsigned int roundElementSize(unsigned int size) {
    const uint64_t rounded = (std::max<uint64_t>(size, 8) + 7) & ~uint64_t{7};
    return rounded > UINT32_MAX ? 0 : static_cast<unsigned int>(rounded);
}
} // namespace

struct ZYRFixedSizePool::Chunk {
    Chunk* next;
    unsigned int handedOut;
    unsigned char* elements() { return reinterpret_cast<unsigned char*>(this) + kChunkHeader; }
};
static_assert(sizeof(void*) <= kChunkHeader - sizeof(unsigned int));

ZYRFixedSizePool::ZYRFixedSizePool(unsigned int elementSize, unsigned int elementsPerChunk)
    : elementSize_(roundElementSize(elementSize)),
      // An empty chunk would hand out memory past its end.
      elementsPerChunk_(std::max(elementsPerChunk, 1u)) {}

ZYRFixedSizePool::~ZYRFixedSizePool() {
    FlushAll();
}

namespace {
// Free elements are off limits to AddressSanitizer builds.
void poison([[maybe_unused]] void* element, [[maybe_unused]] unsigned int bytes) {
#if defined(__SANITIZE_ADDRESS__)
    __asan_poison_memory_region(element, bytes);
#endif
}
void unpoison([[maybe_unused]] void* element, [[maybe_unused]] unsigned int bytes) {
#if defined(__SANITIZE_ADDRESS__)
    __asan_unpoison_memory_region(element, bytes);
#endif
}
} // namespace

void* ZYRFixedSizePool::Alloc() {
    void* element = freeList_;
    if (!element)
        return allocFromChunks();
    unpoison(element, elementSize_);
    std::memcpy(&freeList_, element, sizeof freeList_);
    return element;
}

void ZYRFixedSizePool::Free(void* p) {
    if (!p)
        return;
    std::memcpy(p, &freeList_, sizeof freeList_);
    freeList_ = p;
    poison(p, elementSize_);
}

void* ZYRFixedSizePool::allocFromChunks() {
    if (chunks_ && chunks_->handedOut < elementsPerChunk_) {
        unsigned char* element = chunks_->elements() + uint64_t{chunks_->handedOut} * elementSize_;
        ++chunks_->handedOut;
        ZYR_POOL_UNPOISON(element, elementSize_);
        return element;
    }
    const uint64_t bytes = uint64_t{elementsPerChunk_} * elementSize_ + kChunkHeader;
    if (elementSize_ == 0 || bytes > kMaxSupplierRequest)
        return nullptr;
    void* memory = ZYRMalloc(static_cast<unsigned int>(bytes));
    if (!memory)
        return nullptr;
    chunks_ = ::new (memory) Chunk{chunks_, 1};
    unsigned char* first = chunks_->elements();
    ZYR_POOL_POISON(first + elementSize_, bytes - kChunkHeader - elementSize_);
    return first;
}

void* ZYRFixedSizePool::SureAlloc() {
    void* element = Alloc();
    if (!element)
        throw CZYRError(ZYRPublic::kZYRErrorOutOfMemory, "ZYRFixedSizePool allocation failed",
                        kSource, kFixedPoolAllocationLine);
    return element;
}

void ZYRFixedSizePool::FlushAll() {
    while (Chunk* chunk = chunks_) {
        chunks_ = chunk->next;
        ZYR_POOL_UNPOISON(chunk->elements(), uint64_t{elementsPerChunk_} * elementSize_);
        ZYRFree(chunk);
    }
    freeList_ = nullptr;
}

// ---- ZYRStdAllocatorFixedSizePool -----------------------------------------------------------

ZYRStdAllocatorFixedSizePool::ZYRStdAllocatorFixedSizePool(unsigned int elementSize,
                                                           unsigned int elementsPerPage)
    : elementSize_(roundElementSize(elementSize)),
      elementsPerPage_(OptimalNumElementsPerPage(elementsPerPage)) {}

ZYRStdAllocatorFixedSizePool::~ZYRStdAllocatorFixedSizePool() {
    FlushAll();
}

unsigned int ZYRStdAllocatorFixedSizePool::OptimalNumElementsPerPage(unsigned int count) const {
    if (elementSize_ == 0)
        return 0;
    const uint64_t bytes =
        (uint64_t{count} * elementSize_ + kPoolPageHeader + 4095) & ~uint64_t{4095};
    const uint64_t elements = (bytes - kPoolPageHeader) / elementSize_;
    return elements > UINT32_MAX ? UINT32_MAX : static_cast<unsigned int>(elements);
}

void* ZYRStdAllocatorFixedSizePool::AllocFromPage(ZYRStdAllocatorFixedSizePoolPage* page,
                                                  unsigned int count) {
    auto* base = reinterpret_cast<unsigned char*>(page) + kPoolPageHeader;
    void* run = base + uint64_t{page->elements - page->freeElements} * elementSize_;
    page->freeElements -= count;
    freeElements_ -= count;
    return run;
}

ZYRStdAllocatorFixedSizePoolPage* ZYRStdAllocatorFixedSizePool::AddPage(unsigned int count) {
    const unsigned int elements = OptimalNumElementsPerPage(std::max(count, elementsPerPage_));
    const uint64_t bytes = uint64_t{elements} * elementSize_ + kPoolPageHeader;
    if (elements == 0 || bytes > kMaxSupplierRequest)
        return nullptr;
    tZYRVirtualMemoryInfo info{};
    VirtualMemStatus(&info);
    constexpr uint64_t k4GiB = 4ull << 30;
    if (info.availableForAllocation < k4GiB && info.availableForAllocation < bytes)
        return nullptr;
    void* memory = VirtualMemAlloc(static_cast<unsigned int>(bytes));
    if (!memory)
        return nullptr;
    auto* page = ::new (memory) ZYRStdAllocatorFixedSizePoolPage{pages_, elements, elements};
    pages_ = page;
    freeElements_ += elements;
    return page;
}

void* ZYRStdAllocatorFixedSizePool::Alloc(unsigned int count) {
    if (count == 0)
        return nullptr;
    if (freeElements_ >= count)
        for (ZYRStdAllocatorFixedSizePoolPage* page = pages_; page; page = page->next)
            if (page->freeElements >= count)
                return AllocFromPage(page, count);
    ZYRStdAllocatorFixedSizePoolPage* page = AddPage(count);
    if (!page || page->freeElements < count)
        return nullptr;
    return AllocFromPage(page, count);
}

void* ZYRStdAllocatorFixedSizePool::SureAlloc(unsigned int count) {
    void* run = Alloc(count);
    if (!run)
        throw CZYRError(ZYRPublic::kZYRErrorOutOfMemory,
                        "ZYRStdAllocatorFixedSizePool allocation failed", kSource,
                        kAllocatorPoolAllocationLine);
    return run;
}

void ZYRStdAllocatorFixedSizePool::FreePage(ZYRStdAllocatorFixedSizePoolPage* page) {
    VirtualMemFree(page);
}

void ZYRStdAllocatorFixedSizePool::FlushAll() {
    while (ZYRStdAllocatorFixedSizePoolPage* page = pages_) {
        pages_ = page->next;
        FreePage(page);
    }
    freeElements_ = 0;
}

} // namespace ZYRStd
