// Virtual-memory blocks under the front's limit, and the memory status.
#include <gtest/gtest.h>

#include <cstring>
#include <filesystem>
#include <string>

#include "TestSupport.h"
#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/core/ZYRVirtualMem.h"

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

TEST_F(ZYRVirtualMemTest, CgroupCapIsTheProcessesOwnGroup) {
    zyrtest::TempDir dir;
    const std::string root = dir.file("fs");
    const std::string self = dir.file("cgroup");
    auto put = [&](const std::string& relative, const std::string& text) {
        std::filesystem::create_directories(std::filesystem::path(root + relative).parent_path());
        zyrtest::writeFile(root + relative, text);
    };
    using detail::cgroupMemoryLimit;

    // Version 2: the smallest memory.max on the way up from the process's group.
    put("/memory.max", "max\n");
    put("/system.slice/memory.max", "3000000\n");
    put("/system.slice/engine.service/memory.max", "max\n");
    zyrtest::writeFile(self, "0::/system.slice/engine.service\n");
    EXPECT_EQ(cgroupMemoryLimit(self, root), 3000000u) << "a parent's cap binds";
    put("/system.slice/engine.service/memory.max", "2000000\n");
    EXPECT_EQ(cgroupMemoryLimit(self, root), 2000000u);
    zyrtest::writeFile(self, "0::/\n");
    EXPECT_EQ(cgroupMemoryLimit(self, root), UINT64_MAX) << "the root has no cap";
    zyrtest::writeFile(self, "0::/gone\n");
    EXPECT_EQ(cgroupMemoryLimit(self, root), UINT64_MAX) << "a group that is not there";

    // Version 1 (also beside an empty version 2 line in a hybrid layout).
    put("/memory/memory.limit_in_bytes", "9223372036854771712\n");
    put("/memory/jobs/memory.limit_in_bytes", "9223372036854771712\n");
    put("/memory/jobs/print/memory.limit_in_bytes", "5000000\n");
    zyrtest::writeFile(self, "12:cpu,cpuacct:/jobs\n4:memory:/jobs/print\n0::/jobs\n");
    EXPECT_EQ(cgroupMemoryLimit(self, root), 5000000u);
    zyrtest::writeFile(self, "3:cpuset,memory:/jobs\n");
    EXPECT_EQ(cgroupMemoryLimit(self, root), 9223372036854771712u);

    // Without /proc/self/cgroup: the root's own file, as before.
    put("/memory.max", "7000000\n");
    EXPECT_EQ(cgroupMemoryLimit(dir.file("missing"), root), 7000000u);

    tZYRVirtualMemoryInfo info{};
    VirtualMemStatus(&info);
    EXPECT_LE(info.totalVirtual, cgroupMemoryLimit("/proc/self/cgroup", "/sys/fs/cgroup"));
}
