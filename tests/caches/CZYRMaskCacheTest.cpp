// The mask cache: sizes and zeroing, bit-order conversion against a per-pixel reference,
// the reserved mask and its limits, running without memory, and failing allocations.
#include <gtest/gtest.h>

#include <cstdint>
#include <functional>
#include <random>
#include <set>
#include <vector>

#include "TestSupport.h"
#include "zyr/std/caches/CZYRMaskCache.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/CZYRErrorStk.h"
#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/core/ZYRVirtualMem.h"

using namespace ZYRStd;

namespace {

constexpr const char* kSource = "source/zyr/std/CZYRMaskCache";

void expectAssertion(const std::function<void()>& action) {
    try {
        action();
        ADD_FAILURE() << "no assertion";
    } catch (const CZYRError& e) {
        EXPECT_EQ(e.getError(), ZYRPublic::kZYRErrorAssertionFailed);
        EXPECT_STREQ(e.getMessage(), "assertion failed");
        EXPECT_STREQ(e.getSrcFileName(), kSource);
    }
}

bool allZero(const unsigned char* p, unsigned int n) {
    for (unsigned int i = 0; i < n; ++i)
        if (p[i])
            return false;
    return true;
}

// The mask the design describes, one pixel at a time: every pixel of the whole source bytes
// of a row (padding pixels of the last byte included) lands in mask order, the rest is 0.
std::vector<unsigned char> referenceMask(const std::vector<unsigned char>& src, unsigned int width,
                                         unsigned int srcRowBytes, unsigned int height,
                                         bool fourBit) {
    const unsigned int bits = fourBit ? 4 * width : width;
    const unsigned int maskRow = (bits + 31) / 32 * 4;
    const unsigned int srcBytes = (bits + 7) / 8;
    std::vector<unsigned char> mask(size_t{maskRow} * height, 0);
    for (unsigned int y = 0; y < height; ++y) {
        const unsigned char* row = src.data() + size_t{y} * srcRowBytes;
        unsigned char* out = mask.data() + size_t{y} * maskRow;
        if (fourBit) {
            for (unsigned int x = 0; x < srcBytes * 2; ++x) {
                const unsigned int pixel = (row[x / 2] >> (x % 2 ? 0 : 4)) & 0xF;
                out[x / 2] |= static_cast<unsigned char>(pixel << (x % 2 ? 4 : 0));
            }
        } else {
            for (unsigned int x = 0; x < srcBytes * 8; ++x)
                if ((row[x / 8] >> (7 - x % 8)) & 1)
                    out[x / 8] |= static_cast<unsigned char>(1u << (x % 8));
        }
    }
    return mask;
}

// Uses the front's limit so that virtual memory and the memory status run dry, and gives
// the room back at the end.
class ExhaustedMemory {
public:
    ExhaustedMemory() {
        ZYRSetMemLimit(400ull << 20);
        DisableMemUsageCheck();
        const unsigned long long room = ZYRGetMemLimit() - GetMemUsage();
        filler_ = ZYRMalloc(static_cast<unsigned int>(room));
        EnableMemUsageCheck();
    }
    ~ExhaustedMemory() { ZYRFree(filler_); }
    ExhaustedMemory(const ExhaustedMemory&) = delete;
    ExhaustedMemory& operator=(const ExhaustedMemory&) = delete;
    bool ok() const { return filler_ != nullptr; }

private:
    void* filler_;
};

} // namespace

TEST(CZYRMaskCacheTest, RecordsZeroedReusedAndGrownWhileMemoryLasts) {
    const unsigned long long before = GetMemUsage();
    const unsigned long long page = CZYRMaskCache::VAR_ALLOC_PAGE_SIZE + 24ull;
    {
        CZYRMaskCache cache(4);
        ZYR_MaskRec* mask = cache.GetMaskRec(33, 2);
        EXPECT_FALSE(cache.isReservedMask(mask));
        EXPECT_EQ(mask->width, 33);
        EXPECT_EQ(mask->height, 2);
        EXPECT_TRUE(allZero(mask->data, 16)) << "two rows of 8 bytes";
        std::memset(mask->data, 0xA5, 16);
        mask->flag = 9;
        cache.DeleteBitmapMask(mask);
        ZYR_MaskRec* again = cache.GetMaskRec(33, 2);
        EXPECT_EQ(again, mask) << "the record freed last comes back first";
        EXPECT_TRUE(allZero(again->data, 16)) << "reused storage is zeroed again";
        EXPECT_EQ(again->flag, 0);
        cache.DeleteBitmapMask(again);
        cache.DeleteBitmapMask(nullptr);

        unsigned long long current = 0, peak = 0;
        cache.GetStats(current, peak);
        EXPECT_EQ(current, page) << "one initial page up to " << CZYRMaskCache::MIN_THRESHOLD;
        cache.DeleteBitmapMask(cache.GetMaskRec(2000, 600)); // above the page size
        cache.GetStats(current, peak);
        EXPECT_GE(peak, page + 151200);

        // A new block needs the memory status to report room; AddressSanitizer's shadow
        // mapping takes the whole address space that the status counts.
        tZYRVirtualMemoryInfo info{};
        VirtualMemStatus(&info);
        if (info.availableForAllocation >= (64u << 20)) {
            std::vector<ZYR_MaskRec*> masks;
            for (int i = 0; i < 10; ++i) {
                masks.push_back(cache.GetMaskRec(64, 3));
                ASSERT_FALSE(cache.isReservedMask(masks.back()));
                std::memset(masks.back()->data, i, 24);
            }
            for (int i = 0; i < 10; ++i)
                EXPECT_EQ(masks[i]->data[23], i) << "masks must not share storage";
            for (ZYR_MaskRec* m : masks)
                cache.DeleteBitmapMask(m);
            // Record arrays of 64 KiB and more come from virtual memory.
            CZYRMaskCache many(3000);
            masks.clear();
            for (int i = 0; i < 3001; ++i) {
                masks.push_back(many.GetMaskRec(8, 1));
                ASSERT_FALSE(many.isReservedMask(masks.back()));
            }
            for (ZYR_MaskRec* m : masks)
                many.DeleteBitmapMask(m);
        }
    }
    {
        CZYRMaskCache big(CZYRMaskCache::MIN_THRESHOLD + 1);
        unsigned long long current = 0, peak = 0;
        big.GetStats(current, peak);
        EXPECT_EQ(current, 8ull * CZYRMaskCache::VAR_ALLOC_PAGE_SIZE + 24);
        EXPECT_EQ(peak, current);
        CZYRMaskCache threshold(CZYRMaskCache::MIN_THRESHOLD);
        threshold.GetStats(current, peak);
        EXPECT_EQ(current, page);
    }
    EXPECT_EQ(GetMemUsage(), before) << "the destructor returns every block and chunk";
    expectAssertion([] { CZYRMaskCache none(0); });
}

TEST(CZYRMaskCacheTest, ConversionMatchesAPerPixelReference) {
    CZYRMaskCache cache(8);
    unsigned int size = 0;
    ZYR_MaskRec* mask = cache.CreateBitmapMask(nullptr, 0, 0, 5, size, false, false);
    EXPECT_EQ(size, 0u);
    EXPECT_EQ(mask->width + mask->height, 0);
    cache.DeleteBitmapMask(mask);

    std::mt19937 random(77);
    for (int round = 0; round < 400; ++round) {
        const bool fourBit = random() % 2;
        const unsigned int width = 1 + random() % (round < 200 ? 80 : 700);
        const unsigned int height = 1 + random() % 24;
        const unsigned int srcBytes = ((fourBit ? 4 : 1) * width + 7) / 8;
        const unsigned int srcRowBytes = srcBytes + random() % 5;
        const bool useReserved = random() % 4 == 0;
        std::vector<unsigned char> src(size_t{srcRowBytes} * height);
        for (unsigned char& b : src)
            b = static_cast<unsigned char>(random());
        mask = cache.CreateBitmapMask(src.data(), width, srcRowBytes, height, size, fourBit,
                                      useReserved);
        const std::vector<unsigned char> expected =
            referenceMask(src, width, srcRowBytes, height, fourBit);
        ASSERT_EQ(size, expected.size());
        ASSERT_EQ(cache.isReservedMask(mask), useReserved);
        ASSERT_EQ(std::vector<unsigned char>(mask->data, mask->data + size), expected)
            << "width " << width << " height " << height << (fourBit ? " 4-bit" : " 1-bit");
        ASSERT_EQ(mask->width, width);
        ASSERT_EQ(mask->height, height);
        ASSERT_EQ(mask->flag, 0);
        // Dirty storage for the next mask, whose padding must still come out zero.
        std::memset(mask->data, 0xFF, size);
        cache.DeleteBitmapMask(mask);
    }
}

TEST(CZYRMaskCacheTest, ReservedMaskLimits) {
    CZYRMaskCache cache(8);
    std::vector<unsigned char> src(size_t{512} * 2001, 0xC3);
    unsigned int size = 0;
    struct Case {
        unsigned int width, height;
        bool fourBit, reserved;
        unsigned int bytes;
    };
    for (const Case& c :
         {Case{1024, 1024, false, false, 131072}, // at the 1-bit limit
          Case{1024, 1025, false, true, 131200}, Case{2000, 600, false, true, 151200},
          Case{2000, 2000, false, true, 504000}, // fills the reserved mask
          Case{1024, 1024, true, false, 524288}, // at the 4-bit limit
          Case{1000, 1009, true, false, 504500}}) {
        const unsigned int srcRow = c.fourBit ? c.width / 2 : (c.width + 7) / 8;
        ZYR_MaskRec* mask =
            cache.CreateBitmapMask(src.data(), c.width, srcRow, c.height, size, c.fourBit, false);
        EXPECT_EQ(size, c.bytes);
        EXPECT_EQ(cache.isReservedMask(mask), c.reserved) << c.width << " x " << c.height;
        EXPECT_EQ(mask->data[size - 1], c.fourBit ? 0x3C : (c.width % 32 ? 0 : 0xC3));
        cache.DeleteBitmapMask(mask);
    }
    expectAssertion(
        [&] { cache.CreateBitmapMask(src.data(), 2000, 250, 2001, size, false, false); });
    EXPECT_EQ(size, 504252u);
    expectAssertion([&] { cache.CreateBitmapMask(src.data(), 1100, 550, 1000, size, true, true); });
    expectAssertion([&] { cache.GetMaskRec(70000, 1); });
    expectAssertion([&] { cache.CreateBitmapMask(src.data(), 8, 1, 65536, size, false, true); });
    expectAssertion([&] { cache.CreateBitmapMask(nullptr, 8, 1, 1, size, false, false); });

    // Small masks still come from the reserved record when asked to.
    ZYR_MaskRec* reserved = cache.CreateBitmapMask(src.data(), 8, 1, 1, size, false, true);
    EXPECT_TRUE(cache.isReservedMask(reserved));
    cache.DeleteBitmapMask(reserved);
    EXPECT_EQ(reserved->data[0], 0xC3) << "deleting the reserved mask leaves it alone";

    // Moving a mask into the reserved record.
    ZYR_MaskRec* mask = cache.CreateBitmapMask(src.data(), 40, 5, 3, size, false, false);
    ASSERT_EQ(size, 24u);
    const std::vector<unsigned char> bytes(mask->data, mask->data + size);
    ZYR_MaskRec* moved = cache.FallbackToReservedMask(mask, size);
    EXPECT_TRUE(cache.isReservedMask(moved));
    EXPECT_EQ(moved->width, 40);
    EXPECT_EQ(moved->height, 3);
    EXPECT_EQ(std::vector<unsigned char>(moved->data, moved->data + size), bytes);
    EXPECT_EQ(cache.FallbackToReservedMask(moved, 5), moved);
    EXPECT_EQ(cache.GetMaskRec(8, 1), mask) << "the moved mask's record was freed";
    ZYR_MaskRec* small = cache.GetMaskRec(8, 1);
    expectAssertion([&] { cache.FallbackToReservedMask(small, 4096); });
    expectAssertion([&] { cache.FallbackToReservedMask(nullptr, 4); });
    cache.DeleteBitmapMask(small);
    cache.DeleteBitmapMask(mask);
}

TEST(CZYRMaskCacheTest, WithoutMemoryEveryRequestGetsTheReservedMask) {
    zyrtest::installFront(0);
    const CZYRErrorStk notices; // refusals are noticed there; built before measuring
    const unsigned long long before = GetMemUsage();
    {
        CZYRMaskCache cache(2);
        const ExhaustedMemory exhausted;
        ASSERT_TRUE(exhausted.ok());

        // The initial page still serves small masks.
        ZYR_MaskRec* first = cache.GetMaskRec(100, 10);
        EXPECT_FALSE(cache.isReservedMask(first));
        // The supplier refuses a large block...
        ZYR_MaskRec* large = cache.GetMaskRec(2000, 700);
        EXPECT_TRUE(cache.isReservedMask(large));
        EXPECT_EQ(large->width, 2000);
        EXPECT_EQ(large->height, 700);
        EXPECT_TRUE(allZero(large->data, 176400));
        // ...and once the records are used up no new block is made.
        ZYR_MaskRec* second = cache.GetMaskRec(100, 10);
        EXPECT_FALSE(cache.isReservedMask(second));
        unsigned int size = 0;
        std::vector<unsigned char> src(100, 0x80);
        ZYR_MaskRec* third = cache.CreateBitmapMask(src.data(), 8, 1, 100, size, false, false);
        EXPECT_TRUE(cache.isReservedMask(third));
        EXPECT_EQ(third->data[0], 0x01);
        EXPECT_EQ(third->data[4 * 99], 0x01);
        expectAssertion([&] { cache.GetMaskRec(2000, 2001); });

        cache.DeleteBitmapMask(first);
        ZYR_MaskRec* reused = cache.GetMaskRec(50, 1);
        EXPECT_EQ(reused, first) << "a freed record serves without new memory";
        cache.DeleteBitmapMask(reused);
        cache.DeleteBitmapMask(second);
    }
    EXPECT_EQ(GetMemUsage(), before);
    {
        const ExhaustedMemory exhausted;
        try {
            CZYRMaskCache refused(2);
            ADD_FAILURE() << "made without storage";
        } catch (const CZYRError& e) {
            EXPECT_EQ(e.getError(), ZYRPublic::kZYRErrorOutOfMemory);
            EXPECT_STREQ(e.getMessage(), "failed to allocate mask cache storage");
            EXPECT_STREQ(e.getSrcFileName(), kSource);
        }
    }
    EXPECT_EQ(GetMemUsage(), before) << "a refused construction keeps nothing";
}

TEST(CZYRMaskCacheTest, EveryHeapAllocationMayFail) {
    zyrtest::FailingHost host;
    tZYRMemMgr record = host.record();
    zyrtest::installFront(0, &record);
    const CZYRErrorStk notices;
    const auto workload = [] {
        CZYRMaskCache cache(3);
        std::vector<unsigned char> src(64 * 40, 0x5A);
        unsigned int size = 0;
        std::vector<ZYR_MaskRec*> masks;
        for (int i = 0; i < 8; ++i) {
            masks.push_back(cache.CreateBitmapMask(src.data(), 64 * 8, 64, 40, size, false, false));
            if (cache.isReservedMask(masks.back()))
                masks.pop_back();
        }
        for (ZYR_MaskRec* m : masks)
            cache.DeleteBitmapMask(m);
    };
    const unsigned long long before = GetMemUsage();
    host.calls = 0;
    workload();
    const unsigned int callsPerRun = host.calls;
    ASSERT_GE(callsPerRun, 4u);
    for (unsigned int failing = 1; failing <= callsPerRun; ++failing) {
        host.calls = 0;
        host.failAt = failing;
        try {
            workload();
        } catch (const CZYRError& e) {
            EXPECT_EQ(e.getError(), ZYRPublic::kZYRErrorOutOfMemory) << "allocation " << failing;
        }
        host.failAt = 0;
        ASSERT_EQ(GetMemUsage(), before) << "allocation " << failing << " failed";
    }
    zyrtest::installFront(0);
}
