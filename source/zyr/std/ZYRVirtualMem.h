// Large blocks straight from virtual memory, under the front's limit, and memory status.
#pragma once

#include <cstdint>

#include "ZYRStdExport.h"

namespace ZYRStd {

struct tZYRVirtualMemoryInfo {
    uint64_t totalPhysical;
    uint64_t availablePhysical;
    uint64_t totalVirtual;
    uint64_t availableForAllocation; // what the library may still take
};

// Committed, read-write, page-aligned; null for size 0, on failure or over the limit.
[[nodiscard]] ZYRSTD_API void* VirtualMemAlloc(unsigned int size);
ZYRSTD_API void VirtualMemFree(void* p);
// Gives back the whole pages of [addr, addr + size) inside the block at `base`.
ZYRSTD_API void VirtualMemDecommit(void* base, void* addr, unsigned int size);
// The page size, but at least 65536.
ZYRSTD_API unsigned int VirtualMemAllocUnitSize();
ZYRSTD_API unsigned int GetPageSize();
ZYRSTD_API void VirtualMemStatus(tZYRVirtualMemoryInfo* info);

} // namespace ZYRStd
