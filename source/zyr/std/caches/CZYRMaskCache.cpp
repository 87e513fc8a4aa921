// The mask cache: record blocks, storage from a sub-allocator over virtual-memory chunks,
// the reserved mask, and the conversion of source bitmaps into mask bit order.
#include "zyr/std/caches/CZYRMaskCache.h"

#include <array>
#include <cstring>
#include <new>

#if defined(__x86_64__)
#include <immintrin.h>
#endif

#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/core/ZYRVirtualMem.h"

namespace ZYRStd {

namespace {

constexpr const char* kSource = "source/zyr/std/CZYRMaskCache";
constexpr const char* kNoStorage = "failed to allocate mask cache storage";
// Record arrays below this size come from the heap, larger ones from virtual memory.
constexpr uint64_t kHeapRecordArrayLimit = 65536;

[[noreturn]] void throwNoStorage(int line) {
    throw CZYRError(ZYRPublic::kZYRErrorOutOfMemory, kNoStorage, kSource, line);
}

// Mask rows are whole 32-bit words.
unsigned int maskRowBytes(unsigned int bitsPerRow) {
    return (bitsPerRow + 31) / 32 * 4;
}

// 1-bit sources keep their leftmost pixel in the most significant bit, masks in the least.
constexpr std::array<unsigned char, 256> kReversedBits = [] {
    std::array<unsigned char, 256> table{};
    for (unsigned int b = 0; b < 256; ++b) {
        unsigned int reversed = 0;
        for (unsigned int bit = 0; bit < 8; ++bit)
            if (b & (1u << bit))
                reversed |= 0x80u >> bit;
        table[b] = static_cast<unsigned char>(reversed);
    }
    return table;
}();
// 4-bit sources keep their left pixel in the high nibble, masks in the low one.
constexpr std::array<unsigned char, 256> kSwappedNibbles = [] {
    std::array<unsigned char, 256> table{};
    for (unsigned int b = 0; b < 256; ++b)
        table[b] = static_cast<unsigned char>((b >> 4) | ((b & 0x0F) << 4));
    return table;
}();

// Byte by byte through the table, where the processor has no byte shuffle.
void convertRowsByTable(const unsigned char* src, unsigned int srcRowBytes, unsigned int rowBytes,
                        unsigned char* dst, unsigned int maskRow, unsigned int height,
                        bool fourBit) {
    const auto& table = fourBit ? kSwappedNibbles : kReversedBits;
    for (unsigned int row = 0; row < height; ++row) {
        for (unsigned int i = 0; i < rowBytes; ++i)
            dst[i] = table[src[i]];
        std::memset(dst + rowBytes, 0, maskRow - rowBytes);
        src += srcRowBytes;
        dst += maskRow;
    }
}

#if defined(__x86_64__)
// Shuffle tables indexed by a nibble. For 1-bit sources each nibble is reversed and moved to
// the other half of the byte; for 4-bit ones the nibbles only change places.
const __m128i kReverseLowToHigh =
    _mm_setr_epi8(0x00, char(0x80), 0x40, char(0xC0), 0x20, char(0xA0), 0x60, char(0xE0), 0x10,
                  char(0x90), 0x50, char(0xD0), 0x30, char(0xB0), 0x70, char(0xF0));
const __m128i kReverseHighToLow =
    _mm_setr_epi8(0x0, 0x8, 0x4, 0xC, 0x2, 0xA, 0x6, 0xE, 0x1, 0x9, 0x5, 0xD, 0x3, 0xB, 0x7, 0xF);
const __m128i kSwapLowToHigh =
    _mm_setr_epi8(0x00, 0x10, 0x20, 0x30, 0x40, 0x50, 0x60, 0x70, char(0x80), char(0x90),
                  char(0xA0), char(0xB0), char(0xC0), char(0xD0), char(0xE0), char(0xF0));
const __m128i kSwapHighToLow = _mm_setr_epi8(0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15);

__attribute__((target("ssse3"))) inline void convert16(const unsigned char* from, unsigned char* to,
                                                       __m128i lowToHigh, __m128i highToLow) {
    const __m128i nibble = _mm_set1_epi8(0x0F);
    const __m128i bytes = _mm_loadu_si128(reinterpret_cast<const __m128i*>(from));
    const __m128i low = _mm_and_si128(bytes, nibble);
    const __m128i high = _mm_and_si128(_mm_srli_epi16(bytes, 4), nibble);
    _mm_storeu_si128(
        reinterpret_cast<__m128i*>(to),
        _mm_or_si128(_mm_shuffle_epi8(lowToHigh, low), _mm_shuffle_epi8(highToLow, high)));
}

// Sixteen bytes at a time through two nibble look-ups, several times faster than the table.
// Chosen at run time, as the baseline x86-64 target has no byte shuffle.
__attribute__((target("ssse3"))) void
convertRowsShuffled(const unsigned char* src, unsigned int srcRowBytes, unsigned int rowBytes,
                    unsigned char* dst, unsigned int maskRow, unsigned int height, bool fourBit) {
    const __m128i lowToHigh = fourBit ? kSwapLowToHigh : kReverseLowToHigh;
    const __m128i highToLow = fourBit ? kSwapHighToLow : kReverseHighToLow;
    const auto& table = fourBit ? kSwappedNibbles : kReversedBits;
    for (unsigned int row = 0; row < height; ++row) {
        if (rowBytes >= 16) {
            unsigned int i = 0;
            for (; i + 16 <= rowBytes; i += 16)
                convert16(src + i, dst + i, lowToHigh, highToLow);
            // The last sixteen bytes again rather than a byte loop: rewriting a few bytes
            // with the same values costs less than a loop per row.
            if (i < rowBytes)
                convert16(src + rowBytes - 16, dst + rowBytes - 16, lowToHigh, highToLow);
        } else {
            for (unsigned int i = 0; i < rowBytes; ++i)
                dst[i] = table[src[i]];
        }
        for (unsigned int i = rowBytes; i < maskRow; ++i) // at most 3 bytes of padding
            dst[i] = 0;
        src += srcRowBytes;
        dst += maskRow;
    }
}

// The same with 32 bytes at a time; shorter rows go sixteen bytes at a time.
__attribute__((target("avx2"))) void
convertRowsShuffledWide(const unsigned char* src, unsigned int srcRowBytes, unsigned int rowBytes,
                        unsigned char* dst, unsigned int maskRow, unsigned int height,
                        bool fourBit) {
    if (rowBytes < 32) {
        convertRowsShuffled(src, srcRowBytes, rowBytes, dst, maskRow, height, fourBit);
        return;
    }
    const __m128i lowToHigh = fourBit ? kSwapLowToHigh : kReverseLowToHigh;
    const __m128i highToLow = fourBit ? kSwapHighToLow : kReverseHighToLow;
    const __m256i wideLowToHigh = _mm256_broadcastsi128_si256(lowToHigh);
    const __m256i wideHighToLow = _mm256_broadcastsi128_si256(highToLow);
    const __m256i nibble = _mm256_set1_epi8(0x0F);
    const auto convert32 = [&](const unsigned char* from, unsigned char* to)
        __attribute__((target("avx2"))) {
        const __m256i bytes = _mm256_loadu_si256(reinterpret_cast<const __m256i*>(from));
        const __m256i low = _mm256_and_si256(bytes, nibble);
        const __m256i high = _mm256_and_si256(_mm256_srli_epi16(bytes, 4), nibble);
        _mm256_storeu_si256(reinterpret_cast<__m256i*>(to),
                            _mm256_or_si256(_mm256_shuffle_epi8(wideLowToHigh, low),
                                            _mm256_shuffle_epi8(wideHighToLow, high)));
    };
    for (unsigned int row = 0; row < height; ++row) {
        unsigned int i = 0;
        for (; i + 32 <= rowBytes; i += 32)
            convert32(src + i, dst + i);
        if (i < rowBytes)
            convert32(src + rowBytes - 32, dst + rowBytes - 32);
        for (unsigned int pad = rowBytes; pad < maskRow; ++pad)
            dst[pad] = 0;
        src += srcRowBytes;
        dst += maskRow;
    }
}

#endif

void convertRows(const unsigned char* src, unsigned int srcRowBytes, unsigned int rowBytes,
                 unsigned char* dst, unsigned int maskRow, unsigned int height, bool fourBit) {
#if defined(__x86_64__)
    static const bool wide = __builtin_cpu_supports("avx2");
    static const bool shuffle = __builtin_cpu_supports("ssse3");
    if (wide)
        return convertRowsShuffledWide(src, srcRowBytes, rowBytes, dst, maskRow, height, fourBit);
    if (shuffle)
        return convertRowsShuffled(src, srcRowBytes, rowBytes, dst, maskRow, height, fourBit);
#endif
    convertRowsByTable(src, srcRowBytes, rowBytes, dst, maskRow, height, fourBit);
}

void requireRecordableExtent(unsigned int width, unsigned int height) {
    // The record keeps 16-bit extents; a larger one would describe other bytes than it has.
    if (width > CZYRMaskCache::MAX_MASK_EXTENT || height > CZYRMaskCache::MAX_MASK_EXTENT)
        throwAssertionFailed(kSource, __LINE__);
}

} // namespace

// A block of records: its array and the free records (of any block) waiting for reuse.
struct CZYRMaskCache::RecordBlock {
    RecordBlock* next;
    ZYR_MaskRec* records;
    ZYR_MaskRec* freeList;
};

// In front of every chunk that the allocator gets from the cache.
struct CZYRMaskCache::ChunkLink {
    ChunkLink* next;
};

CZYRMaskCache::CZYRMaskCache(unsigned int recordsPerBlock) : recordsPerBlock_(recordsPerBlock) {
    if (recordsPerBlock == 0)
        throwAssertionFailed(kSource, __LINE__);
    const uint64_t arrayBytes = uint64_t{recordsPerBlock} * sizeof(ZYR_MaskRec);
    if (arrayBytes > UINT32_MAX)
        throwNoStorage(__LINE__);
    recordArrayBytes_ = static_cast<unsigned int>(arrayBytes);
    try {
        firstBlock_ = currentBlock_ = makeBlock();
        if (!firstBlock_)
            throwNoStorage(__LINE__);
        reserved_.data = static_cast<unsigned char*>(VirtualMemAlloc(RESERVED_MASK_BYTES));
        if (!reserved_.data)
            throwNoStorage(__LINE__);
        // Chosen as a value: a conditional of the two constants would be an lvalue and
        // make the compiler emit (and export) storage for them.
        const unsigned int initPages =
            recordsPerBlock > MIN_THRESHOLD ? unsigned{NUM_INIT_PAGES} : unsigned{MIN_INIT_PAGES};
        allocator_ = std::make_unique<VariableSizeAllocator>(
            ALLOCATOR_CLIENT_NAME, initPages, 0, VAR_ALLOC_PAGE_SIZE, chunkAlloc, chunkFree, this);
    } catch (...) {
        releaseAll();
        throw;
    }
}

CZYRMaskCache::~CZYRMaskCache() {
    releaseAll();
}

void CZYRMaskCache::releaseAll() {
    // The allocator gives its reserved page and cached block back through chunkFree; the
    // pages that still hold masks are the chunk list's to return.
    allocator_.reset();
    while (ChunkLink* chunk = chunks_) {
        chunks_ = chunk->next;
        VirtualMemFree(chunk);
    }
    while (RecordBlock* block = firstBlock_) {
        firstBlock_ = block->next;
        freeBlock(block);
    }
    currentBlock_ = nullptr;
    VirtualMemFree(reserved_.data);
    reserved_.data = nullptr;
}

void* CZYRMaskCache::chunkAlloc(unsigned int bytes, void* cache) {
    auto* self = static_cast<CZYRMaskCache*>(cache);
    const uint64_t total = uint64_t{bytes} + sizeof(ChunkLink);
    if (total > UINT32_MAX)
        return nullptr;
    void* memory = VirtualMemAlloc(static_cast<unsigned int>(total));
    if (!memory)
        return nullptr;
    auto* link = ::new (memory) ChunkLink{self->chunks_};
    self->chunks_ = link;
    return link + 1;
}

void CZYRMaskCache::chunkFree(void* chunk, void* cache) {
    auto* self = static_cast<CZYRMaskCache*>(cache);
    ChunkLink* const link = static_cast<ChunkLink*>(chunk) - 1;
    for (ChunkLink** at = &self->chunks_; *at; at = &(*at)->next) {
        if (*at == link) {
            *at = link->next;
            VirtualMemFree(link);
            return;
        }
    }
}

CZYRMaskCache::RecordBlock* CZYRMaskCache::makeBlock() const {
    auto* block = static_cast<RecordBlock*>(ZYRMalloc(sizeof(RecordBlock)));
    if (!block)
        return nullptr;
    void* records = recordArrayBytes_ < kHeapRecordArrayLimit
                        ? ZYRCalloc(recordsPerBlock_, sizeof(ZYR_MaskRec))
                        : VirtualMemAlloc(recordArrayBytes_); // zero-filled by the system
    if (!records) {
        ZYRFree(block);
        return nullptr;
    }
    auto* array = static_cast<ZYR_MaskRec*>(records);
    for (unsigned int i = 0; i + 1 < recordsPerBlock_; ++i)
        array[i].nextFree = &array[i + 1];
    array[recordsPerBlock_ - 1].nextFree = nullptr;
    *block = RecordBlock{nullptr, array, array};
    return block;
}

void CZYRMaskCache::freeBlock(RecordBlock* block) const {
    if (recordArrayBytes_ < kHeapRecordArrayLimit)
        ZYRFree(block->records);
    else
        VirtualMemFree(block->records);
    ZYRFree(block);
}

ZYR_MaskRec* CZYRMaskCache::allocateRecord(unsigned int bytes, bool zeroFill, bool despiteStatus) {
    if (!currentBlock_->freeList) {
        tZYRVirtualMemoryInfo info{};
        VirtualMemStatus(&info);
        if (!despiteStatus &&
            info.availableForAllocation < uint64_t{recordArrayBytes_} + sizeof(RecordBlock))
            return nullptr;
        RecordBlock* const block = makeBlock();
        if (!block)
            return nullptr;
        currentBlock_->next = block;
        currentBlock_ = block;
    }
    ZYR_MaskRec* const rec = currentBlock_->freeList;
    unsigned int obtained = 0;
    void* const storage = allocator_->allocate(bytes, obtained);
    if (!storage)
        return nullptr; // the record stays on the free list
    currentBlock_->freeList = rec->nextFree;
    if (zeroFill)
        std::memset(storage, 0, bytes);
    rec->data = static_cast<unsigned char*>(storage);
    return rec;
}

ZYR_MaskRec* CZYRMaskCache::fallbackRecord(unsigned int bytes, bool zeroFill) {
    if (reservedInUse_) {
        // The memory status may report no room where there is some (a large address-space
        // reservation): only a real failure to get storage ends the request.
        ZYR_MaskRec* const rec = allocateRecord(bytes, zeroFill, true);
        if (!rec)
            throwNoStorage(__LINE__);
        return rec;
    }
    if (bytes > RESERVED_MASK_BYTES)
        throwAssertionFailed(kSource, __LINE__);
    if (zeroFill)
        std::memset(reserved_.data, 0, bytes);
    reservedInUse_ = true;
    return &reserved_;
}

void CZYRMaskCache::releaseRecord(ZYR_MaskRec* rec) {
    allocator_->Free(rec->data);
    rec->nextFree = currentBlock_->freeList;
    currentBlock_->freeList = rec;
}

ZYR_MaskRec* CZYRMaskCache::GetMaskRec(unsigned int width, unsigned int height) {
    requireRecordableExtent(width, height);
    const unsigned int bytes = maskRowBytes(width) * height;
    ZYR_MaskRec* rec = allocateRecord(bytes, true);
    if (!rec)
        rec = fallbackRecord(bytes, true);
    rec->width = static_cast<unsigned short>(width);
    rec->height = static_cast<unsigned short>(height);
    rec->flag = 0;
    return rec;
}

ZYR_MaskRec* CZYRMaskCache::CreateBitmapMask(unsigned char* const src, unsigned int width,
                                             unsigned int srcRowBytes, unsigned int height,
                                             unsigned int& size, bool fourBit, bool useReserved) {
    requireRecordableExtent(width, height);
    const unsigned int bitsPerRow = fourBit ? 4 * width : width;
    const unsigned int maskRow = maskRowBytes(bitsPerRow);
    size = maskRow * height;
    ZYR_MaskRec* rec = nullptr;
    if (!useReserved && size <= (fourBit ? MAX_ALLOCATED_4BIT_MASK : MAX_ALLOCATED_1BIT_MASK))
        rec = allocateRecord(size, false);
    if (!rec)
        rec = fallbackRecord(size, false);
    rec->flag = 0;
    if (size == 0) {
        rec->width = rec->height = 0;
        return rec;
    }
    if (!src) {
        // Leave nothing half made: the record goes back before the assertion.
        DeleteBitmapMask(rec);
        throwAssertionFailed(kSource, __LINE__);
    }
    // Every byte of the mask is written: the converted source bytes (the last one whole,
    // padding bits included) and zeros to the end of each row.
    const unsigned int srcBytes = (bitsPerRow + 7) / 8;
    convertRows(src, srcRowBytes, srcBytes, rec->data, maskRow, height, fourBit);
    rec->width = static_cast<unsigned short>(width);
    rec->height = static_cast<unsigned short>(height);
    return rec;
}

void CZYRMaskCache::DeleteBitmapMask(ZYR_MaskRec* rec) {
    if (rec == &reserved_)
        reservedInUse_ = false;
    else if (rec)
        releaseRecord(rec);
}

ZYR_MaskRec* CZYRMaskCache::FallbackToReservedMask(ZYR_MaskRec* rec, unsigned int size) {
    if (rec == &reserved_ || (rec && reservedInUse_))
        return rec;
    // Copying more than either buffer holds would run past it.
    if (!rec || size > RESERVED_MASK_BYTES || size > allocator_->GetPtrSize(rec->data))
        throwAssertionFailed(kSource, __LINE__);
    reserved_.width = rec->width;
    reserved_.height = rec->height;
    reserved_.flag = 0;
    std::memcpy(reserved_.data, rec->data, size);
    releaseRecord(rec);
    reservedInUse_ = true;
    return &reserved_;
}

void CZYRMaskCache::GetStats(unsigned long long& current, unsigned long long& peak) const {
    current = allocator_->getVarPageCurrAllocAmount();
    peak = allocator_->getVarPagePeakAllocAmount();
}

} // namespace ZYRStd
