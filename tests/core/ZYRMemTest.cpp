// The allocation front: plain and guarded variants, the limit, the tracker, the leak report.
#include <gtest/gtest.h>

#include <atomic>
#include <condition_variable>
#include <cstdint>
#include <cstring>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "TestSupport.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/CZYRErrorStk.h"
#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/core/ZYRStdInit.h"
#include "zyr/std/core/ZYRThread.h"

using namespace ZYRStd;

namespace {

constexpr unsigned long long kMiB = 1024 * 1024;

// Each test starts from a freshly installed plain front and leaves the C runtime front behind.
class ZYRMemTest : public ::testing::Test {
protected:
    void SetUp() override { zyrtest::installFront(0); }
    void TearDown() override { zyrtest::installFront(0); }
};

bool aligned16(const void* p) {
    return reinterpret_cast<uintptr_t>(p) % 16 == 0;
}

std::vector<std::string> leakReport() {
    std::vector<std::string> lines;
    ZYRStdInit_ZYRMemMgrDumpMemList(
        [](ZYRPublic::sZYRTraceMsg* msg, ZYRPublic::sZYRTraceMsgDetail*, void* data) {
            static_cast<std::vector<std::string>*>(data)->push_back(msg->text);
        },
        &lines);
    return lines;
}

TEST_F(ZYRMemTest, PlainFrontEdgeCasesAndAccounting) {
    EXPECT_EQ(ZYRMalloc(0), nullptr);
    EXPECT_EQ(ZYRCalloc(0, 16), nullptr);
    EXPECT_EQ(ZYRMemSize(nullptr), 0u);
    ZYRFree(nullptr);

    const unsigned long long before = GetMemUsage();
    void* p = ZYRMalloc(13);
    ASSERT_NE(p, nullptr);
    EXPECT_TRUE(aligned16(p));
    EXPECT_EQ(ZYRMemSize(p), 13u);
    EXPECT_EQ(GetMemUsage(), before + 16) << "accounted size is rounded up to 8";

    EXPECT_EQ(ZYRRealloc(p, 0), p) << "resizing to 0 frees nothing";
    std::memset(p, 0x5A, 13);
    p = ZYRRealloc(p, 100);
    ASSERT_NE(p, nullptr);
    EXPECT_TRUE(aligned16(p));
    EXPECT_EQ(static_cast<unsigned char*>(p)[12], 0x5A);
    EXPECT_EQ(GetMemUsage(), before + 104);
    ZYRFree(p);
    EXPECT_EQ(GetMemUsage(), before);

    void* fresh = ZYRRealloc(nullptr, 24);
    ASSERT_NE(fresh, nullptr);
    ZYRFree(fresh);

    auto* zeroed = static_cast<unsigned char*>(ZYRCalloc(7, 9));
    ASSERT_NE(zeroed, nullptr);
    EXPECT_EQ(ZYRMemSize(zeroed), 63u);
    for (int i = 0; i < 63; ++i)
        ASSERT_EQ(zeroed[i], 0);
    ZYRFree(zeroed);
    EXPECT_EQ(GetMemUsage(), before);
}

TEST_F(ZYRMemTest, SureVariantsThrowWithTheirLines) {
    struct Case {
        void* (*call)();
        int line;
    };
    const Case cases[] = {{[] { return ZYRSureMalloc(0); }, 2042},
                          {[] { return ZYRSureCalloc(0, 8); }, 2050}};
    for (const Case& c : cases) {
        try {
            c.call();
            ADD_FAILURE() << "no throw for line " << c.line;
        } catch (const CZYRError& e) {
            EXPECT_EQ(e.getError(), ZYRPublic::kZYRErrorOutOfMemory);
            EXPECT_EQ(e.getMessage(), nullptr);
            EXPECT_STREQ(e.getSrcFileName(), "source/zyr/std/ZYRMem");
            EXPECT_EQ(e.getSrcLineNumber(), c.line);
        }
    }
    zyrtest::FailingHost host;
    ZYRStd::tZYRMemMgr record = host.record();
    zyrtest::installFront(0, &record);
    void* p = ZYRSureMalloc(8);
    host.failAll = true;
    try {
        p = ZYRSureRealloc(p, 64);
        ADD_FAILURE() << "a failed resize must throw";
    } catch (const CZYRError& e) {
        EXPECT_EQ(e.getSrcLineNumber(), 2058);
    }
    ZYRFree(p);
}

TEST_F(ZYRMemTest, LimitTestAndNestedDisables) {
    const CZYRErrorStk notices; // the refusal notice goes there; build it before measuring
    ZYRSetMemLimit(400 * kMiB);
    ASSERT_EQ(ZYRGetMemLimit(), 400 * kMiB);

    const unsigned long long used = GetMemUsage();
    const auto overBy8 = static_cast<unsigned int>(400 * kMiB - used + 8);
    EXPECT_EQ(ZYRMalloc(overBy8), nullptr);
    EXPECT_EQ(GetMemUsage(), used) << "a refused allocation is not counted";

    void* small = ZYRMalloc(64);
    ASSERT_NE(small, nullptr);
    EXPECT_EQ(ZYRRealloc(small, overBy8), nullptr);
    EXPECT_EQ(ZYRMemSize(small), 64u) << "a refused resize leaves the block valid";

    DisableMemUsageCheck();
    DisableMemUsageCheck();
    void* big = ZYRMalloc(overBy8);
    ASSERT_NE(big, nullptr);
    EXPECT_EQ(GetMemUsage(), used + 64 + overBy8);
    ZYRFree(big);

    EnableMemUsageCheck();
    big = ZYRMalloc(overBy8);
    EXPECT_NE(big, nullptr) << "one enable does not undo two disables";
    ZYRFree(big);

    EnableMemUsageCheck();
    EnableMemUsageCheck(); // a third enable changes nothing
    DisableMemUsageCheck();
    big = ZYRMalloc(overBy8);
    EXPECT_NE(big, nullptr) << "the extra enable must not have been counted";
    ZYRFree(big);
    EnableMemUsageCheck();
    EXPECT_EQ(ZYRMalloc(overBy8), nullptr);
    ZYRFree(small);
}

TEST_F(ZYRMemTest, RecentFreesAreReusedAndNeverRefuse) {
    const CZYRErrorStk notices;
    ZYRSetMemLimit(400 * kMiB);
    const auto room = static_cast<unsigned int>(400 * kMiB - GetMemUsage());
    void* filler = ZYRMalloc(room - 4096);
    void* small = ZYRMalloc(4096);
    ASSERT_NE(filler, nullptr);
    ASSERT_NE(small, nullptr);
    EXPECT_EQ(GetMemUsage(), 400 * kMiB);
    ZYRFree(small);
    EXPECT_EQ(GetMemUsage(), 400 * kMiB - 4096) << "a thread's own frees are always counted";
    small = ZYRMalloc(2048);
    void* other = ZYRMalloc(2048);
    EXPECT_NE(small, nullptr);
    EXPECT_NE(other, nullptr) << "freed bytes are available again at once";
    EXPECT_EQ(ZYRMalloc(8), nullptr);
    ZYRFree(other);
    std::thread([] {
        // Another thread sees the freed bytes too.
        void* p = ZYRMalloc(2048);
        EXPECT_NE(p, nullptr);
        ZYRFree(p);
    }).join();
    ZYRFree(small);
    ZYRFree(filler);
}

TEST_F(ZYRMemTest, FreesWhileAThreadEndsAreCounted) {
    const unsigned long long before = GetMemUsage();
    // The thread's only free is its record's, made while the thread is torn down.
    std::thread([] { SetCZYRThreadSpecificPtr(new CZYRThreadSpecificPtr("short", true)); }).join();
    EXPECT_EQ(GetMemUsage(), before);
}

TEST_F(ZYRMemTest, LimitSetterOnlyLowersAndClamps) {
    const unsigned long long machine = ZYRGetMemLimit();
    ASSERT_GT(machine, 1024 * kMiB);
    ZYRSetMemLimit(machine + 1);
    EXPECT_EQ(ZYRGetMemLimit(), machine);

    ZYRSetMemLimit(1024 * kMiB);
    EXPECT_EQ(ZYRGetMemLimit(), 1024 * kMiB);
    EXPECT_EQ(ZYRGetMemReserve(), 314572800u);

    ZYRSetMemLimit(100000000);
    EXPECT_EQ(ZYRGetMemLimit(), 419430400u);
    EXPECT_EQ(ZYRGetMemReserve(), 314572800u);
}

TEST_F(ZYRMemTest, HostFailuresReturnNullAndKeepAccounting) {
    zyrtest::FailingHost host;
    ZYRStd::tZYRMemMgr record = host.record();
    zyrtest::installFront(0, &record);
    const unsigned long long before = GetMemUsage();

    std::vector<void*> blocks;
    host.failEvery = 3;
    for (int i = 0; i < 30; ++i)
        if (void* p = ZYRMalloc(40))
            blocks.push_back(p);
    EXPECT_EQ(blocks.size(), 20u);
    EXPECT_EQ(GetMemUsage(), before + 20 * 40);

    host.failEvery = 0;
    host.failAll = true;
    std::memset(blocks[0], 0x33, 40);
    EXPECT_EQ(ZYRRealloc(blocks[0], 4000), nullptr);
    EXPECT_EQ(static_cast<unsigned char*>(blocks[0])[39], 0x33);
    EXPECT_EQ(GetMemUsage(), before + 20 * 40);
    host.failAll = false;

    for (void* p : blocks)
        ZYRFree(p);
    EXPECT_EQ(GetMemUsage(), before);
}

TEST_F(ZYRMemTest, GuardedBlocksDetectDamage) {
    zyrtest::installFront(1);
    auto* one = static_cast<unsigned char*>(ZYRMalloc(0));
    ASSERT_NE(one, nullptr);
    EXPECT_TRUE(aligned16(one));
    EXPECT_EQ(ZYRMemSize(one), 1u);
    EXPECT_NO_THROW(ZYRDbgCheckZYRMemAllocPtr(one));
    EXPECT_NO_THROW(ZYRDbgCheckZYRMemAllocPtr(nullptr));
    one[1] = 0; // the first byte of the tail guard
    try {
        ZYRDbgCheckZYRMemAllocPtr(one);
        ADD_FAILURE() << "a damaged tail guard must be found";
    } catch (const CZYRError& e) {
        EXPECT_EQ(e.getError(), ZYRPublic::kZYRErrorFatal);
        EXPECT_STREQ(e.getMessage(), "ZYRCheckZYRMemAllocPtr:: ptr is invalid");
        EXPECT_EQ(e.getSrcLineNumber(), 2012);
    }
    ZYRFree(one);

    auto* block = static_cast<unsigned char*>(ZYRMalloc(32));
    block[-1] ^= 0xFF; // head guard
    EXPECT_THROW(ZYRDbgCheckZYRMemAllocPtr(block), CZYRError);
    block[-1] ^= 0xFF;
    block = static_cast<unsigned char*>(ZYRRealloc(block, 64));
    EXPECT_NO_THROW(ZYRDbgCheckZYRMemAllocPtr(block)) << "guards are rewritten on resize";
    EXPECT_EQ(ZYRMemSize(block), 64u);
    ZYRFree(block);
}

TEST_F(ZYRMemTest, TrackerCountsAtLevelOne) {
    zyrtest::installFront(1);
    const sZYRDbgMemState start = ZYRMemMgr_dbgMemState();
    void* a = ZYRMalloc(10);
    void* b = ZYRMalloc(100);
    b = ZYRRealloc(b, 200);
    const sZYRDbgMemState mid = ZYRMemMgr_dbgMemState();
    EXPECT_EQ(mid.allocCount - start.allocCount, 2u);
    EXPECT_EQ(mid.reallocCount - start.reallocCount, 1u);
    // Each guarded block costs its request plus 20 bytes, rounded up to 8.
    EXPECT_EQ(mid.currentBytes - start.currentBytes, 32u + 224u);
    EXPECT_EQ(GetMemUsage(), mid.currentBytes);
    ZYRFree(a);
    ZYRFree(b);
    const sZYRDbgMemState end = ZYRMemMgr_dbgMemState();
    EXPECT_EQ(end.freeCount - start.freeCount, 2u);
    EXPECT_EQ(end.currentBytes, start.currentBytes);
    EXPECT_GE(end.peakBytes, start.currentBytes + 32 + 224);

    zyrtest::installFront(0);
    const sZYRDbgMemState plain = ZYRMemMgr_dbgMemState();
    EXPECT_EQ(plain.allocCount, 0u);
    EXPECT_EQ(plain.peakBytes, 0u);
}

TEST_F(ZYRMemTest, LeakReportListsBlocksInAllocationOrder) {
    zyrtest::installFront(2);
    void* a = ZYRMalloc(10);
    void* b = ZYRMalloc(30);
    void* c = ZYRMalloc(30);
    const std::vector<std::string> lines = leakReport();
    ASSERT_EQ(lines.size(), 6u);
    char expected[256];
    std::snprintf(expected, sizeof expected,
                  "ZYRMem: Leaked %8u bytes at Memory Ptr:: %#lx, Allocation Count = %8u\n", 10u,
                  static_cast<unsigned long>(reinterpret_cast<uintptr_t>(a) - 16), 1u);
    EXPECT_EQ(lines[0], expected);
    EXPECT_NE(lines[1].find("30 bytes"), std::string::npos);
    EXPECT_NE(lines[1].find("Allocation Count =        2"), std::string::npos);
    EXPECT_NE(lines[2].find("Allocation Count =        3"), std::string::npos);
    EXPECT_EQ(lines[3], "ZYRMem: Largest leak       30 bytes at Allocation Count =        2\n");
    EXPECT_EQ(lines[4], "ZYRMem: Total Leaked: 144 bytes\n"); // 32 + 56 + 56
    EXPECT_EQ(lines[5], "ZYRMem: Peak memory consumption: 144 bytes\n");
    ZYRFree(a);
    ZYRFree(b);
    ZYRFree(c);
    const std::vector<std::string> after = leakReport();
    ASSERT_EQ(after.size(), 3u);
    EXPECT_EQ(after[1], "ZYRMem: Total Leaked: 0 bytes\n");

    zyrtest::installFront(0);
    EXPECT_TRUE(leakReport().empty()) << "level 0 keeps no tracker";
}

TEST_F(ZYRMemTest, ConcurrentFrontKeepsTheTotalExact) {
    for (int level : {0, 1}) {
        zyrtest::installFront(level);
        const unsigned long long before = GetMemUsage();
        auto worker = [](unsigned int seed) {
            std::vector<void*> live;
            for (unsigned int i = 0; i < 20000; ++i) {
                seed = seed * 1103515245 + 12345;
                if (live.size() < 64 && (seed >> 16) % 3 != 0) {
                    live.push_back(ZYRMalloc(16 + (seed >> 8) % 2048));
                } else if (!live.empty()) {
                    ZYRFree(live.back());
                    live.pop_back();
                }
            }
            for (void* p : live)
                ZYRFree(p);
        };
        std::thread t1(worker, 1), t2(worker, 2);
        t1.join();
        t2.join();
        EXPECT_EQ(GetMemUsage(), before) << "level " << level;
    }
}

TEST_F(ZYRMemTest, ConcurrentAllocationsNeverPassTheLimit) {
    ZYRSetMemLimit(400 * kMiB);
    const unsigned long long used = GetMemUsage();
    // Room for exactly 100 blocks of 1 MiB; four threads race for 50 each.
    const unsigned long long room = 400 * kMiB - used;
    const auto blockSize = static_cast<unsigned int>(room / 100 / 8 * 8);
    std::vector<std::vector<void*>> got(4);
    std::vector<std::thread> threads;
    for (auto& mine : got)
        threads.emplace_back([&mine, blockSize] {
            for (int i = 0; i < 50; ++i)
                if (void* p = ZYRMalloc(blockSize))
                    mine.push_back(p);
        });
    for (auto& t : threads)
        t.join();
    size_t granted = 0;
    for (const auto& mine : got)
        granted += mine.size();
    EXPECT_EQ(granted, 100u);
    EXPECT_LE(GetMemUsage(), 400 * kMiB);
    for (const auto& mine : got)
        for (void* p : mine)
            ZYRFree(p);
    EXPECT_EQ(GetMemUsage(), used);
}

TEST_F(ZYRMemTest, MemOperationsCompareAsUnsignedBytes) {
    const unsigned char low[] = {0x01, 0x7F};
    const unsigned char high[] = {0x01, 0x80};
    EXPECT_EQ(Memcmp(low, high, 2), -1);
    EXPECT_EQ(Memcmp(high, low, 2), 1);
    EXPECT_EQ(Memcmp(low, high, 1), 0);
    char buffer[8] = "abcdefg";
    Memmove(buffer + 1, buffer, 6);
    EXPECT_STREQ(buffer, "aabcdef");
}

std::u16string fetchNotices() {
    CZYRErrorStk stack;
    std::u16string text;
    return stack.getErrorMessage(text) ? text : u"<none>";
}

TEST_F(ZYRMemTest, FreedBytesAreNotReusedWhileUsageIsAboveTheLimit) {
    ZYRSetMemLimit(400 * kMiB);
    const unsigned long long used = GetMemUsage();
    DisableMemUsageCheck();
    void* over = ZYRMalloc(static_cast<unsigned int>(400 * kMiB - used + 4096));
    void* recent = ZYRMalloc(2000);
    EnableMemUsageCheck();
    ASSERT_NE(over, nullptr);
    ASSERT_NE(recent, nullptr);
    fetchNotices(); // start from an empty stack

    ZYRFree(recent);
    void* again = ZYRMalloc(2000);
    EXPECT_EQ(again, nullptr) << "usage is still above the limit";
    EXPECT_EQ(fetchNotices(), u"Insufficient Memory.\n");
    ZYRFree(again);
    ZYRFree(over);

    void* fits = ZYRMalloc(2000);
    EXPECT_NE(fits, nullptr) << "back under the limit";
    ZYRFree(fits);
    EXPECT_EQ(GetMemUsage(), used);
}

TEST_F(ZYRMemTest, UsageCountsAnotherThreadsPendingFrees) {
    void* block = ZYRMalloc(1000);
    ASSERT_NE(block, nullptr);
    const unsigned long long held = GetMemUsage();
    std::mutex mutex;
    std::condition_variable changed;
    bool freed = false;
    bool done = false;
    // The freeing thread stays alive while the usage is read: its end would hand its
    // pending bytes back anyway.
    std::thread renderer([&] {
        ZYRFree(block);
        std::unique_lock lock(mutex);
        freed = true;
        changed.notify_all();
        changed.wait(lock, [&] { return done; });
    });
    {
        std::unique_lock lock(mutex);
        changed.wait(lock, [&] { return freed; });
    }
    EXPECT_EQ(GetMemUsage(), held - 1000);
    {
        std::lock_guard lock(mutex);
        done = true;
    }
    changed.notify_all();
    renderer.join();
    EXPECT_EQ(GetMemUsage(), held - 1000);
}

TEST_F(ZYRMemTest, GuardCheckNeverReadsPastADamagedBlock) {
    for (int level : {1, 2}) {
        zyrtest::installFront(level);
        auto* block = static_cast<unsigned char*>(ZYRMalloc(32));
        ASSERT_NE(block, nullptr);
        uint32_t size;
        std::memcpy(&size, block - 16, sizeof size);
        ASSERT_EQ(size, 32u);
        // A size far beyond the block: reading the tail there would fault.
        const uint32_t wild = 0xFFFFFF00u;
        std::memcpy(block - 16, &wild, sizeof wild);
        if (level == 1)
            block[-1] ^= 0xFF; // the head guard is the first thing found damaged
        EXPECT_THROW(ZYRDbgCheckZYRMemAllocPtr(block), CZYRError) << "level " << level;
        if (level == 1)
            block[-1] ^= 0xFF;
        std::memcpy(block - 16, &size, sizeof size);
        EXPECT_NO_THROW(ZYRDbgCheckZYRMemAllocPtr(block)) << "level " << level;
        ZYRFree(block);
    }
    zyrtest::installFront(2);
    auto* resized = static_cast<unsigned char*>(ZYRMalloc(8));
    resized = static_cast<unsigned char*>(ZYRRealloc(resized, 100));
    EXPECT_NO_THROW(ZYRDbgCheckZYRMemAllocPtr(resized)) << "the map follows a resize";
    ZYRFree(resized);
}

TEST_F(ZYRMemTest, DebugStateIsOneConsistentSnapshot) {
    zyrtest::installFront(1);
    const sZYRDbgMemState start = ZYRMemMgr_dbgMemState();
    const long long startHeld = static_cast<long long>(start.allocCount) - start.freeCount;
    constexpr long long kAccounted = 32; // 8 bytes, guards and header, rounded to 8
    std::atomic<bool> stop{false};
    std::thread churn([&] {
        while (!stop)
            ZYRFree(ZYRMalloc(8));
    });
    while (ZYRMemMgr_dbgMemState().allocCount < start.allocCount + 1000) {
    }
    int torn = 0;
    // Read all along a million allocations of the other thread.
    for (sZYRDbgMemState s = ZYRMemMgr_dbgMemState(); s.allocCount < start.allocCount + 1000000;
         s = ZYRMemMgr_dbgMemState()) {
        const long long held = static_cast<long long>(s.allocCount) - s.freeCount - startHeld;
        if (static_cast<long long>(s.currentBytes) - start.currentBytes != held * kAccounted)
            ++torn;
    }
    stop = true;
    churn.join();
    EXPECT_EQ(torn, 0) << "counters read while an allocation was half recorded";
}

} // namespace
