/// \file
/// The allocation front: every heap block of the library and the engine, under one limit.
#pragma once

#include <cstdint>

#include "ZYRStdExport.h"

namespace ZYRStd {

/// Counters of the allocation front, for tests and reports.
struct sZYRDbgMemState {
    unsigned int allocCount;   ///< blocks allocated
    unsigned int reallocCount; ///< blocks resized
    unsigned int freeCount;    ///< blocks freed
    unsigned int currentBytes; ///< bytes held now
    unsigned int peakBytes;    ///< most bytes ever held at once
};

/// Allocates `size` bytes from the host's procedures under the process limit. Blocks are
/// 16-byte aligned. Null on failure; never throws. Any thread.
[[nodiscard]] ZYRSTD_API void* ZYRMalloc(unsigned int size);
/// As ZYRMalloc, for `count` * `size` zeroed bytes.
[[nodiscard]] ZYRSTD_API void* ZYRCalloc(unsigned int count, unsigned int size);
/// Resizes a block of the front, keeping its contents; null on failure, the old block kept.
[[nodiscard]] ZYRSTD_API void* ZYRRealloc(void* p, unsigned int size);
/// Gives a block of the front back; null is allowed.
ZYRSTD_API void ZYRFree(void* p);
/// The usable size of a block of the front.
ZYRSTD_API unsigned int ZYRMemSize(void* p);

/// As ZYRMalloc, but a null result throws CZYRError of kZYRErrorOutOfMemory.
[[nodiscard]] ZYRSTD_API void* ZYRSureMalloc(unsigned int size);
/// As ZYRCalloc, but a null result throws kZYRErrorOutOfMemory.
[[nodiscard]] ZYRSTD_API void* ZYRSureCalloc(unsigned int count, unsigned int size);
/// As ZYRRealloc, but a null result throws kZYRErrorOutOfMemory.
[[nodiscard]] ZYRSTD_API void* ZYRSureRealloc(void* p, unsigned int size);

/// Throws kZYRErrorFatal when a guarded block's head or tail guard is damaged.
ZYRSTD_API void ZYRDbgCheckZYRMemAllocPtr(void* p);
/// A snapshot of the front's counters.
ZYRSTD_API sZYRDbgMemState ZYRMemMgr_dbgMemState();

/// Turns the limit test on (it is on while the counter is 1 or more); calls nest.
ZYRSTD_API void EnableMemUsageCheck();
/// Turns the limit test off for one matching EnableMemUsageCheck.
ZYRSTD_API void DisableMemUsageCheck();
/// The bytes the front holds now.
ZYRSTD_API unsigned long long GetMemUsage();

/// memcpy with a 32-bit length; returns `dst`.
ZYRSTD_API void* Memcpy(void* dst, const void* src, unsigned int n);
/// memmove with a 32-bit length; returns `dst`.
ZYRSTD_API void* Memmove(void* dst, const void* src, unsigned int n);
/// memset with a 32-bit length; returns `dst`.
ZYRSTD_API void* Memset(void* dst, int value, unsigned int n);
/// Compares as unsigned bytes; returns exactly -1, 0 or 1.
ZYRSTD_API int Memcmp(const void* a, const void* b, unsigned int n);

/// Sets the process memory limit. Lowering below 400 MiB clamps to 400 MiB; raising
/// changes nothing.
ZYRSTD_API void ZYRSetMemLimit(unsigned long long limit);
/// The process memory limit in bytes.
ZYRSTD_API unsigned long long ZYRGetMemLimit();
/// The reserve kept back from what is reported available.
ZYRSTD_API unsigned long long ZYRGetMemReserve();
/// Makes allocations also test the physical memory still available (on with `test`).
ZYRSTD_API void ZYRSetTestAvailablePhysicalMemory(bool test);
/// True when allocations test the physical memory available.
ZYRSTD_API bool ZYRGetTestAvailablePhysicalMemory();
/// A debugging aid: the allocation with this serial number stops in ZYRDebugStopAtThis.
ZYRSTD_API void ZYRSetBreakOnAllocationCount(unsigned int serial);
/// The statistics level read from "ZYR_MEMORY_STAT" at the last ZYRStdInit_ZYRMemMgrSet.
ZYRSTD_API int ZYRGetMemStatLevel();

} // namespace ZYRStd
