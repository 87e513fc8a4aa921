// The allocation front: plain and guarded variants, the limit, the tracker, the leak report,
// and the virtual-memory blocks and status under the same limit.
#include <gtest/gtest.h>

#include <atomic>
#include <cstdint>
#include <cstring>
#include <filesystem>
#include <future>
#include <string>
#include <thread>
#include <tuple>
#include <vector>

#include "TestSupport.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/CZYRErrorStk.h"
#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/core/ZYRStdInit.h"
#include "zyr/std/core/ZYRThread.h"
#include "zyr/std/core/ZYRVirtualMem.h"

using namespace ZYRStd;

namespace {

constexpr unsigned long long kMiB = 1024 * 1024;
constexpr unsigned long long kLimit = 400 * kMiB; // the lowest limit that can be set

// Each test starts from a freshly installed plain front and leaves the C runtime front behind.
class ZYRMemTest : public ::testing::Test {
protected:
    void SetUp() override { zyrtest::installFront(0); }
    void TearDown() override { zyrtest::installFront(0); }
};

bool aligned16(const void* p) {
    return reinterpret_cast<uintptr_t>(p) % 16 == 0;
}

// What `body` throws: type, message, source and line; all empty when it throws nothing.
using Thrown = std::tuple<int, std::string, std::string, int>;
template <class Body> Thrown thrown(Body body) {
    try {
        body();
    } catch (const CZYRError& e) {
        return {e.getError(), e.getMessage() ? e.getMessage() : "(null)", e.getSrcFileName(),
                e.getSrcLineNumber()};
    }
    return {};
}

Thrown frontError(int type, const char* message, int line) {
    return {type, message, "source/zyr/std/ZYRMem", line};
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

// The error stack's text, which the fetch empties.
std::u16string fetchNotices() {
    CZYRErrorStk stack;
    std::u16string text;
    return stack.getErrorMessage(text) ? text : u"<none>";
}

} // namespace

// Edge cases, rounding and contents; a failing host gives null and leaves the block and the
// accounting as they were.
TEST_F(ZYRMemTest, PlainFrontEdgeCasesAndAccounting) {
    constexpr int kOutOfMemory = ZYRPublic::kZYRErrorOutOfMemory;
    EXPECT_EQ(thrown([] { (void)ZYRSureMalloc(0); }), frontError(kOutOfMemory, "(null)", 2042));
    EXPECT_EQ(thrown([] { (void)ZYRSureCalloc(0, 8); }), frontError(kOutOfMemory, "(null)", 2050));
    EXPECT_EQ(ZYRMalloc(0), nullptr);
    EXPECT_EQ(ZYRCalloc(0, 16), nullptr);
    EXPECT_EQ(ZYRMemSize(nullptr), 0u);
    ZYRFree(nullptr);
    zyrtest::FailingHost host;
    tZYRMemMgr record = host.record();
    zyrtest::installFront(0, &record);

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
    host.failAll = true;
    EXPECT_EQ(ZYRMalloc(8), nullptr);
    EXPECT_EQ(ZYRRealloc(p, 4000), nullptr);
    EXPECT_EQ(static_cast<unsigned char*>(p)[12], 0x5A);
    EXPECT_EQ(GetMemUsage(), before + 104);
    host.failAll = false;
    p = ZYRRealloc(p, 20);
    EXPECT_EQ(GetMemUsage(), before + 24) << "shrinking gives bytes back";
    ZYRFree(p);
    EXPECT_EQ(GetMemUsage(), before);

    void* fresh = ZYRRealloc(nullptr, 24);
    EXPECT_EQ(ZYRMemSize(fresh), 24u);
    ZYRFree(fresh);
    auto* zeroed = static_cast<unsigned char*>(ZYRCalloc(7, 9));
    ASSERT_NE(zeroed, nullptr);
    EXPECT_EQ(ZYRMemSize(zeroed), 63u);
    for (int i = 0; i < 63; ++i)
        ASSERT_EQ(zeroed[i], 0);
    ZYRFree(zeroed);
    EXPECT_EQ(GetMemUsage(), before);
}

TEST_F(ZYRMemTest, LimitTestAndNestedDisables) {
    const CZYRErrorStk notices; // the refusal notice goes there; build it before measuring
    ZYRSetMemLimit(kLimit);
    ASSERT_EQ(ZYRGetMemLimit(), kLimit);
    const unsigned long long used = GetMemUsage();
    const auto overBy8 = static_cast<unsigned int>(kLimit - used + 8);
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

TEST_F(ZYRMemTest, RecentFreesAreReusedAndNeverRefuse) {
    const CZYRErrorStk notices;
    ZYRSetMemLimit(kLimit);
    const auto room = static_cast<unsigned int>(kLimit - GetMemUsage());
    void* filler = ZYRMalloc(room - 4096);
    void* small = ZYRMalloc(4096);
    ASSERT_TRUE(filler && small);
    EXPECT_EQ(GetMemUsage(), kLimit);
    ZYRFree(small);
    EXPECT_EQ(GetMemUsage(), kLimit - 4096) << "a thread's own frees are always counted";
    small = ZYRMalloc(2048);
    void* other = ZYRMalloc(2048);
    EXPECT_NE(small, nullptr);
    EXPECT_NE(other, nullptr) << "freed bytes are available again at once";
    EXPECT_EQ(ZYRMalloc(8), nullptr);
    ZYRFree(other);
    std::thread([] {
        void* p = ZYRMalloc(2048);
        EXPECT_NE(p, nullptr) << "another thread sees the freed bytes too";
        ZYRFree(p);
    }).join();
    ZYRFree(small);
    ZYRFree(filler);
}

TEST_F(ZYRMemTest, FreedBytesAreNotReusedWhileUsageIsAboveTheLimit) {
    ZYRSetMemLimit(kLimit);
    const unsigned long long used = GetMemUsage();
    DisableMemUsageCheck();
    void* over = ZYRMalloc(static_cast<unsigned int>(kLimit - used + 4096));
    void* recent = ZYRMalloc(2000);
    EnableMemUsageCheck();
    ASSERT_TRUE(over && recent);
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

TEST_F(ZYRMemTest, UsageCountsFreesOfOtherAndEndingThreads) {
    const unsigned long long before = GetMemUsage();
    // The thread's only free is its record's, made while the thread is torn down.
    std::thread([] { SetCZYRThreadSpecificPtr(new CZYRThreadSpecificPtr("short", true)); }).join();
    EXPECT_EQ(GetMemUsage(), before);

    void* block = ZYRMalloc(1000);
    // The freeing thread stays alive while the usage is read: its end would hand its pending
    // bytes back anyway.
    std::promise<void> freed, done;
    std::thread renderer([&] {
        ZYRFree(block);
        freed.set_value();
        done.get_future().wait();
    });
    freed.get_future().wait();
    EXPECT_EQ(GetMemUsage(), before);
    done.set_value();
    renderer.join();
    EXPECT_EQ(GetMemUsage(), before);
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
    ZYRSetMemLimit(kLimit);
    const unsigned long long used = GetMemUsage();
    // Room for exactly 100 blocks of about 4 MiB; four threads race for 50 each.
    const auto blockSize = static_cast<unsigned int>((kLimit - used) / 100 / 8 * 8);
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
    EXPECT_LE(GetMemUsage(), kLimit);
    for (const auto& mine : got)
        for (void* p : mine)
            ZYRFree(p);
    EXPECT_EQ(GetMemUsage(), used);
}

// Guarded blocks: a damaged head or tail guard is found, and a damaged size is never
// followed out of the block (level 1 trusts it only behind a sound head guard, level 2 only
// when the allocation map confirms it).
TEST_F(ZYRMemTest, GuardCheckFindsDamageWithoutReadingPastTheBlock) {
    const Thrown invalid =
        frontError(ZYRPublic::kZYRErrorFatal, "ZYRCheckZYRMemAllocPtr:: ptr is invalid", 2012);
    for (int level : {1, 2}) {
        SCOPED_TRACE(level);
        zyrtest::installFront(level);
        auto* one = static_cast<unsigned char*>(ZYRMalloc(0));
        ASSERT_NE(one, nullptr);
        EXPECT_TRUE(aligned16(one));
        EXPECT_EQ(ZYRMemSize(one), 1u);
        EXPECT_EQ(thrown([&] { ZYRDbgCheckZYRMemAllocPtr(one); }), Thrown{});
        EXPECT_EQ(thrown([] { ZYRDbgCheckZYRMemAllocPtr(nullptr); }), Thrown{});
        one[1] = 0; // the first byte of the tail guard
        EXPECT_EQ(thrown([&] { ZYRDbgCheckZYRMemAllocPtr(one); }), invalid);
        ZYRFree(one);

        auto* block = static_cast<unsigned char*>(ZYRMalloc(32));
        block[-1] ^= 0xFF; // head guard
        EXPECT_EQ(thrown([&] { ZYRDbgCheckZYRMemAllocPtr(block); }), invalid);
        block[-1] ^= 0xFF;
        uint32_t size;
        std::memcpy(&size, block - 16, sizeof size);
        ASSERT_EQ(size, 32u);
        const uint32_t wild = 0xFFFFFF00u; // reading the tail there would fault
        std::memcpy(block - 16, &wild, sizeof wild);
        block[-1] ^= level == 1 ? 0xFF : 0;
        EXPECT_EQ(thrown([&] { ZYRDbgCheckZYRMemAllocPtr(block); }), invalid);
        block[-1] ^= level == 1 ? 0xFF : 0;
        std::memcpy(block - 16, &size, sizeof size);
        block = static_cast<unsigned char*>(ZYRRealloc(block, 100));
        EXPECT_EQ(ZYRMemSize(block), 100u);
        EXPECT_EQ(thrown([&] { ZYRDbgCheckZYRMemAllocPtr(block); }), Thrown{})
            << "guards and map follow a resize";
        ZYRFree(block);
    }
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
        torn += static_cast<long long>(s.currentBytes) - start.currentBytes != held * kAccounted;
    }
    stop = true;
    churn.join();
    EXPECT_EQ(torn, 0) << "counters read while an allocation was half recorded";
}

// The tracker's counters and the leak report: blocks in allocation order, the largest, the
// total and the peak. Each guarded block costs its request plus 20 bytes, rounded up to 8.
TEST_F(ZYRMemTest, TrackerCountsAndLeakReport) {
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

    b = ZYRRealloc(b, 200);
    sZYRDbgMemState s = ZYRMemMgr_dbgMemState();
    EXPECT_EQ(std::tie(s.allocCount, s.reallocCount, s.freeCount), std::make_tuple(3u, 1u, 0u));
    EXPECT_EQ(s.currentBytes, 32u + 224 + 56);
    EXPECT_EQ(GetMemUsage(), s.currentBytes);
    ZYRFree(a);
    ZYRFree(b);
    ZYRFree(c);
    s = ZYRMemMgr_dbgMemState();
    EXPECT_EQ(std::tie(s.freeCount, s.currentBytes, s.peakBytes), std::make_tuple(3u, 0u, 312u));
    const std::vector<std::string> after = leakReport();
    ASSERT_EQ(after.size(), 3u);
    EXPECT_EQ(after[1], "ZYRMem: Total Leaked: 0 bytes\n");
    zyrtest::installFront(0);
    s = ZYRMemMgr_dbgMemState();
    EXPECT_EQ(std::tie(s.allocCount, s.peakBytes), std::make_tuple(0u, 0u)) << "level 0: none";
    EXPECT_TRUE(leakReport().empty()) << "level 0 keeps no tracker";
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

TEST_F(ZYRMemTest, VirtualBlocksAreCountedAndDecommittedByWholePages) {
    const unsigned int page = GetPageSize();
    EXPECT_EQ(VirtualMemAllocUnitSize(), std::max(page, 65536u));
    EXPECT_EQ(VirtualMemAlloc(0), nullptr);
    const unsigned long long before = GetMemUsage();
    auto* block = static_cast<unsigned char*>(VirtualMemAlloc(4 * page + 1));
    ASSERT_NE(block, nullptr);
    EXPECT_EQ(GetMemUsage(), before + 5ull * page) << "counted in whole pages";
    std::memset(block, 0xAB, 5 * page);
    // Every page the range touches goes: pages 0 to 3 here.
    VirtualMemDecommit(block, block + page / 2, 3 * page);
    EXPECT_EQ(GetMemUsage(), before + 1ull * page);
    VirtualMemDecommit(block, block + page, 2 * page); // already decommitted: no change
    VirtualMemDecommit(nullptr, block, page);
    VirtualMemDecommit(block, block, 0);
    EXPECT_EQ(GetMemUsage(), before + 1ull * page);
    EXPECT_EQ(block[4 * page], 0xAB) << "pages outside the range keep their contents";
    VirtualMemFree(block);
    EXPECT_EQ(GetMemUsage(), before);
    VirtualMemFree(nullptr);

    zyrtest::installFront(2);
    block = static_cast<unsigned char*>(VirtualMemAlloc(3 * page));
    ASSERT_NE(block, nullptr);
    EXPECT_EQ(ZYRMemMgr_dbgMemState().currentBytes, 3 * page);
    VirtualMemDecommit(block, block + page, 1);
    EXPECT_EQ(ZYRMemMgr_dbgMemState().currentBytes, 2 * page);
    VirtualMemDecommit(block, block + page, page); // nothing left there: nothing changes
    EXPECT_EQ(ZYRMemMgr_dbgMemState().currentBytes, 2 * page);
    VirtualMemFree(block);
    EXPECT_EQ(ZYRMemMgr_dbgMemState().currentBytes, 0u) << "the tracker must not wrap";

    zyrtest::installFront(0);
    ZYRSetMemLimit(kLimit);
    EXPECT_EQ(VirtualMemAlloc(401u << 20), nullptr);
    DisableMemUsageCheck();
    void* big = VirtualMemAlloc(401u << 20);
    EXPECT_NE(big, nullptr);
    VirtualMemFree(big);
    EnableMemUsageCheck();
}

TEST_F(ZYRMemTest, StatusKeepsTheReserveBack) {
    tZYRVirtualMemoryInfo info{};
    VirtualMemStatus(&info);
    EXPECT_GT(info.totalPhysical, 0u);
    EXPECT_LE(info.availablePhysical, info.totalPhysical);
    EXPECT_GT(info.totalVirtual, 0u);
    EXPECT_LE(info.availableForAllocation, ZYRGetMemLimit() - ZYRGetMemReserve());
    // Usage at the limit: nothing is left to hand out.
    ZYRSetMemLimit(kLimit);
    DisableMemUsageCheck();
    void* filler = ZYRMalloc(static_cast<unsigned int>(kLimit - GetMemUsage()));
    ASSERT_NE(filler, nullptr);
    VirtualMemStatus(&info);
    EXPECT_EQ(info.availableForAllocation, 0u);
    ZYRFree(filler);
    EnableMemUsageCheck();
    ZYRSetTestAvailablePhysicalMemory(false);
    VirtualMemStatus(&info);
    EXPECT_EQ(info.availablePhysical, info.totalPhysical);
    ZYRSetTestAvailablePhysicalMemory(true);
}

// The cap is the smallest on the way up from the process's own group, in version 2 or 1 (also
// beside an empty version 2 line in a hybrid layout); without /proc/self/cgroup, the root's.
TEST_F(ZYRMemTest, CgroupCapIsTheProcessesOwnGroup) {
    zyrtest::TempDir dir;
    const std::string root = dir.file("fs");
    const std::string self = dir.file("cgroup");
    auto put = [&](const std::string& path, const std::string& text) {
        std::filesystem::create_directories(std::filesystem::path(path).parent_path());
        zyrtest::writeFile(path, text);
    };
    const std::string large = "9223372036854771712\n";
    for (const auto& [path, text] : {std::pair<std::string, std::string>{"/memory.max", "max\n"},
                                     {"/system.slice/memory.max", "3000000\n"},
                                     {"/system.slice/engine.service/memory.max", "max\n"},
                                     {"/memory/memory.limit_in_bytes", large},
                                     {"/memory/jobs/memory.limit_in_bytes", large},
                                     {"/memory/jobs/print/memory.limit_in_bytes", "5000000\n"}})
        put(root + path, text);
    const std::pair<const char*, uint64_t> cases[] = {
        {"0::/system.slice/engine.service\n", 3000000}, // a parent's cap binds
        {"0::/\n", UINT64_MAX},                         // the root has no cap
        {"0::/gone\n", UINT64_MAX},
        {"12:cpu,cpuacct:/jobs\n4:memory:/jobs/print\n0::/jobs\n", 5000000},
        {"3:cpuset,memory:/jobs\n", 9223372036854771712u}};
    for (const auto& [group, cap] : cases) {
        put(self, group);
        EXPECT_EQ(detail::cgroupMemoryLimit(self, root), cap) << group;
    }
    put(root + "/system.slice/engine.service/memory.max", "2000000\n");
    put(self, "0::/system.slice/engine.service\n");
    EXPECT_EQ(detail::cgroupMemoryLimit(self, root), 2000000u);
    put(root + "/memory.max", "7000000\n");
    EXPECT_EQ(detail::cgroupMemoryLimit(dir.file("missing"), root), 7000000u);
    tZYRVirtualMemoryInfo info{};
    VirtualMemStatus(&info);
    EXPECT_LE(info.totalVirtual, detail::cgroupMemoryLimit("/proc/self/cgroup", "/sys/fs/cgroup"));
}
