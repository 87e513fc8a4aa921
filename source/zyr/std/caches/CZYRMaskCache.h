/// \file
/// CZYRMaskCache: 1-bit and 4-bit mask bitmaps on a sub-allocator over virtual memory, with
/// one reserved mask so that a mask can always be produced.
#pragma once

#include <cstdint>
#include <memory>

#include "ZYRStdExport.h"
#include "zyr/std/core/CZYRClientBase.h"
#include "zyr/std/memory/ZYRPool.h"

namespace ZYRStd {

/// A mask: rows padded to whole 32-bit words, pixels of a byte least significant first.
struct ZYR_MaskRec {
    unsigned short width;  ///< pixels
    unsigned short height; ///< rows
    union {
        unsigned char* data;   ///< the rows, while the record is in use
        ZYR_MaskRec* nextFree; ///< while the record is free
    };
    unsigned char flag;           ///< always 0 from the cache
    unsigned char callerData[15]; ///< free for the caller; the cache does not touch it
};
static_assert(sizeof(ZYR_MaskRec) == 32);

/// Not thread-safe: one owner thread at a time.
class ZYRSTD_API CZYRMaskCache : public CZYRClientBase {
public:
    /// Pages the mask allocator starts with for large record blocks, and for small ones.
    ///@{
    static constexpr unsigned int NUM_INIT_PAGES = 8;
    static constexpr unsigned int MIN_INIT_PAGES = 1;
    ///@}
    /// Above this many records per block the allocator starts with NUM_INIT_PAGES pages.
    static constexpr unsigned int MIN_THRESHOLD = 500;
    /// Bytes of each page the mask allocator takes from virtual memory.
    static constexpr unsigned int VAR_ALLOC_PAGE_SIZE = 131068;
    static constexpr unsigned int ALIGNMENT = 8; ///< not used by the cache
    /// The name the mask allocator reports under.
    static constexpr const char* ALLOCATOR_CLIENT_NAME = "CZYRMaskCache";
    /// The reserved mask holds a 2000 x 2000 1-bit mask (252-byte rows).
    static constexpr unsigned int RESERVED_MASK_BYTES = 504000;
    /// CreateBitmapMask takes larger masks straight from the reserved record.
    ///@{
    static constexpr unsigned int MAX_ALLOCATED_1BIT_MASK = 131072;
    static constexpr unsigned int MAX_ALLOCATED_4BIT_MASK = 524288;
    ///@}
    /// The widest and tallest mask that a record can describe.
    static constexpr unsigned int MAX_MASK_EXTENT = 0xFFFF;

    /// Throws kZYRErrorOutOfMemory "failed to allocate mask cache storage" when the first
    /// record block or the reserved buffer cannot be had; recordsPerBlock must be at least 1.
    explicit CZYRMaskCache(unsigned int recordsPerBlock);
    ~CZYRMaskCache() override;
    /// The copies would share and free the same storage twice.
    CZYRMaskCache(const CZYRMaskCache&) = delete;
    CZYRMaskCache& operator=(const CZYRMaskCache&) = delete;

    /// A zeroed 1-bit mask. Falls back to the reserved mask when no storage can be had; a
    /// mask larger than the reserved buffer then raises kZYRErrorAssertionFailed, as does a
    /// width or height above MAX_MASK_EXTENT. Two live masks never share storage: while the
    /// reserved mask is in use a request that gets no storage, whatever the memory status
    /// said, throws kZYRErrorOutOfMemory "failed to allocate mask cache storage".
    ZYR_MaskRec* GetMaskRec(unsigned int width, unsigned int height);
    /// A mask filled from `src` (rows srcRowBytes apart): bit order reversed for 1-bit
    /// sources, nibbles swapped for 4-bit ones. `size` receives the mask's bytes.
    ZYR_MaskRec* CreateBitmapMask(unsigned char* const src, unsigned int width,
                                  unsigned int srcRowBytes, unsigned int height, unsigned int& size,
                                  bool fourBit, bool useReserved);
    /// Null is left alone; the reserved mask becomes free for the next fallback.
    void DeleteBitmapMask(ZYR_MaskRec* rec);
    /// Moves the first `size` bytes of a mask into the reserved mask and frees the mask; while
    /// another mask holds the reserved one, `rec` stays as it is and is returned.
    ZYR_MaskRec* FallbackToReservedMask(ZYR_MaskRec* rec, unsigned int size);
    /// True for the reserved mask's record.
    bool isReservedMask(const ZYR_MaskRec* rec) const { return rec == &reserved_; }
    /// The allocator's bytes now held and at their peak.
    void GetStats(unsigned long long& current, unsigned long long& peak) const;

private:
    struct RecordBlock;
    struct ChunkLink;

    static void* chunkAlloc(unsigned int bytes, void* cache);
    static void chunkFree(void* chunk, void* cache);

    RecordBlock* makeBlock() const;
    void freeBlock(RecordBlock* block) const;
    /// A record with `bytes` of storage, zero-filled when asked, or null. A new record block
    /// is made only when the memory status reports room for it, unless `despiteStatus`.
    ZYR_MaskRec* allocateRecord(unsigned int bytes, bool zeroFill, bool despiteStatus = false);
    /// The reserved record for a mask of `bytes` (too large is an assertion); while it is in
    /// use, storage of its own for the mask or the out-of-memory error.
    ZYR_MaskRec* fallbackRecord(unsigned int bytes, bool zeroFill);
    void releaseRecord(ZYR_MaskRec* rec);
    void releaseAll();

    RecordBlock* firstBlock_ = nullptr;
    RecordBlock* currentBlock_ = nullptr;
    unsigned int recordArrayBytes_;
    unsigned int recordsPerBlock_;
    ZYR_MaskRec reserved_{};
    bool reservedInUse_ = false;
    ChunkLink* chunks_ = nullptr;
    std::unique_ptr<VariableSizeAllocator> allocator_;
};

} // namespace ZYRStd
