// The allocation front: every heap block of the library and the engine, under one limit.
#pragma once

#include <cstdint>

#include "ZYRStdExport.h"

namespace ZYRStd {

struct sZYRDbgMemState {
    unsigned int allocCount;
    unsigned int reallocCount;
    unsigned int freeCount;
    unsigned int currentBytes;
    unsigned int peakBytes;
};

// Blocks are 16-byte aligned. Null on failure; these never throw.
[[nodiscard]] ZYRSTD_API void* ZYRMalloc(unsigned int size);
[[nodiscard]] ZYRSTD_API void* ZYRCalloc(unsigned int count, unsigned int size);
[[nodiscard]] ZYRSTD_API void* ZYRRealloc(void* p, unsigned int size);
ZYRSTD_API void ZYRFree(void* p);
ZYRSTD_API unsigned int ZYRMemSize(void* p);

// As above, but a null result throws CZYRError of kZYRErrorOutOfMemory.
[[nodiscard]] ZYRSTD_API void* ZYRSureMalloc(unsigned int size);
[[nodiscard]] ZYRSTD_API void* ZYRSureCalloc(unsigned int count, unsigned int size);
[[nodiscard]] ZYRSTD_API void* ZYRSureRealloc(void* p, unsigned int size);

// Throws kZYRErrorFatal when a guarded block's head or tail guard is damaged.
ZYRSTD_API void ZYRDbgCheckZYRMemAllocPtr(void* p);
ZYRSTD_API sZYRDbgMemState ZYRMemMgr_dbgMemState();

// The limit test is on while the counter is 1 or more; disables nest.
ZYRSTD_API void EnableMemUsageCheck();
ZYRSTD_API void DisableMemUsageCheck();
ZYRSTD_API unsigned long long GetMemUsage();

ZYRSTD_API void* Memcpy(void* dst, const void* src, unsigned int n);
ZYRSTD_API void* Memmove(void* dst, const void* src, unsigned int n);
ZYRSTD_API void* Memset(void* dst, int value, unsigned int n);
// Compares as unsigned bytes; returns exactly -1, 0 or 1.
ZYRSTD_API int Memcmp(const void* a, const void* b, unsigned int n);

// The process memory limit and the reserve kept back from what is reported available.
// Lowering below 400 MiB clamps to 400 MiB; raising changes nothing.
ZYRSTD_API void ZYRSetMemLimit(unsigned long long limit);
ZYRSTD_API unsigned long long ZYRGetMemLimit();
ZYRSTD_API unsigned long long ZYRGetMemReserve();
ZYRSTD_API void ZYRSetTestAvailablePhysicalMemory(bool test);
ZYRSTD_API bool ZYRGetTestAvailablePhysicalMemory();
ZYRSTD_API void ZYRSetBreakOnAllocationCount(unsigned int serial);
// The statistics level read from "ZYR_MEMORY_STAT" at the last ZYRStdInit_ZYRMemMgrSet.
ZYRSTD_API int ZYRGetMemStatLevel();

} // namespace ZYRStd
