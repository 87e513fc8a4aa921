// Virtual-memory blocks under the front's limit, and the memory status.
#include <gtest/gtest.h>

#include <cstring>

#include "TestSupport.h"
#include "zyr/std/ZYRMem.h"
#include "zyr/std/ZYRVirtualMem.h"

using namespace ZYRStd;

namespace {
class ZYRVirtualMemTest : public ::testing::Test {
protected:
    void TearDown() override { zyrtest::installFront(0); }
};
} // namespace

TEST_F(ZYRVirtualMemTest, BlocksAreCountedAndDecommittedByWholePages) {
    zyrtest::installFront(0);
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
    EXPECT_EQ(GetMemUsage(), before + 1ull * page);
    VirtualMemDecommit(nullptr, block, page);
    VirtualMemDecommit(block, block, 0);
    EXPECT_EQ(block[4 * page], 0xAB) << "pages outside the range keep their contents";

    VirtualMemFree(block);
    EXPECT_EQ(GetMemUsage(), before);
    VirtualMemFree(nullptr);
}

TEST_F(ZYRVirtualMemTest, TrackedAtLevelTwoAndRefusedOverTheLimit) {
    zyrtest::installFront(2);
    const unsigned int page = GetPageSize();
    auto* block = static_cast<unsigned char*>(VirtualMemAlloc(3 * page));
    ASSERT_NE(block, nullptr);
    EXPECT_EQ(ZYRMemMgr_dbgMemState().currentBytes, 3 * page);
    VirtualMemDecommit(block, block + page, 1);
    EXPECT_EQ(ZYRMemMgr_dbgMemState().currentBytes, 2 * page);
    VirtualMemDecommit(block, block + page, page); // nothing left there: nothing changes
    EXPECT_EQ(ZYRMemMgr_dbgMemState().currentBytes, 2 * page);
    VirtualMemFree(block);
    EXPECT_EQ(ZYRMemMgr_dbgMemState().currentBytes, 0u) << "the tracker must not wrap";

    zyrtest::installFront(0);
    ZYRSetMemLimit(400ull << 20);
    EXPECT_EQ(VirtualMemAlloc(401u << 20), nullptr);
    DisableMemUsageCheck();
    void* big = VirtualMemAlloc(401u << 20);
    EXPECT_NE(big, nullptr);
    VirtualMemFree(big);
    EnableMemUsageCheck();
}

TEST_F(ZYRVirtualMemTest, StatusKeepsTheReserveAndPageFileCushion) {
    zyrtest::installFront(0);
    tZYRVirtualMemoryInfo info{};
    VirtualMemStatus(&info);
    EXPECT_GT(info.totalPhysical, 0u);
    EXPECT_LE(info.availablePhysical, info.totalPhysical);
    EXPECT_GT(info.totalVirtual, 0u);
    EXPECT_LE(info.availableForAllocation, ZYRGetMemLimit() - ZYRGetMemReserve());

    // Use up the limit: nothing is left to hand out.
    ZYRSetMemLimit(400ull << 20);
    DisableMemUsageCheck();
    const unsigned long long room = ZYRGetMemLimit() - GetMemUsage();
    void* filler = ZYRMalloc(static_cast<unsigned int>(room));
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
