/// \file
/// Large blocks straight from virtual memory, under the front's limit, and memory status.
#pragma once

#include <cstdint>
#include <string>

#include "ZYRStdExport.h"

namespace ZYRStd {

/// The memory status VirtualMemStatus reports, in bytes.
struct tZYRVirtualMemoryInfo {
    uint64_t totalPhysical;     ///< physical memory of the machine (or of the process's cgroup cap)
    uint64_t availablePhysical; ///< physical memory free now
    uint64_t totalVirtual;      ///< address space of the process
    uint64_t availableForAllocation; ///< what the library may still take
};

/// Committed, read-write, page-aligned; null for size 0, on failure or over the limit.
[[nodiscard]] ZYRSTD_API void* VirtualMemAlloc(unsigned int size);
/// Gives back a block of VirtualMemAlloc; null is allowed.
ZYRSTD_API void VirtualMemFree(void* p);
/// Gives back the whole pages of [addr, addr + size) inside the block at `base`.
ZYRSTD_API void VirtualMemDecommit(void* base, void* addr, unsigned int size);
/// The page size, but at least 65536.
ZYRSTD_API unsigned int VirtualMemAllocUnitSize();
/// The system's page size.
ZYRSTD_API unsigned int GetPageSize();
/// Fills `*info` with the present memory status.
ZYRSTD_API void VirtualMemStatus(tZYRVirtualMemoryInfo* info);

namespace detail {
/// The memory cap of this process's own cgroup, UINT64_MAX for none: `procSelfCgroup` is
/// read as /proc/self/cgroup and the groups are found under `cgroupRoot` (/sys/fs/cgroup).
/// Version 2: the smallest memory.max along the group's path; version 1: the smallest
/// memory.limit_in_bytes along its memory group's path. Exported for the tests only.
ZYRSTD_API uint64_t cgroupMemoryLimit(const std::string& procSelfCgroup,
                                      const std::string& cgroupRoot);
/// As cgroupMemoryLimit, but each capped group's room: its cap less its usage
/// (memory.current, or memory.usage_in_bytes in version 1), the smallest along the path.
ZYRSTD_API uint64_t cgroupMemoryRoom(const std::string& procSelfCgroup,
                                     const std::string& cgroupRoot);
} // namespace detail

} // namespace ZYRStd
