/// \file
/// The dynamic memory manager: allocation that makes the renderer catch up and asks
/// flushable clients for memory before it fails, and the TUMA and JOV client accounting.
#pragma once

#include "ZYRStdExport.h"
#include "eFlushMemorySeverity.h"
#include "zyr/std/core/I_FlushableMemoryClient.h"

namespace ZYRStd {

class I_VariableSizeAllocator;

/// Selects which counters the DMM_GetCurr... queries read.
enum eZYRMemoryClientType : int {
    eZYRMemoryClientInterp = 1,   ///< the interpreter thread only
    eZYRMemoryClientOthers = 256, ///< every thread but the interpreter
    eZYRMemoryClientAll = 0,      ///< any other value: every thread
};

/// `requester` is the caller's I_FlushableMemoryClient*, never asked to flush for itself.
/// With a sub-allocator, `actualSize` receives the bytes it took from its supplier.
[[nodiscard]] ZYRSTD_API void* ZYRDMMMalloc(unsigned int size, const char* clientName,
                                            I_VariableSizeAllocator* subAllocator,
                                            unsigned int* actualSize, void* requester,
                                            eFlushMemorySeverity severity);
ZYRSTD_API void ZYRDMMFree(void* p, const char* clientName, I_VariableSizeAllocator* subAllocator);
/// No recovery for a resize; the sub-allocator argument is not used.
[[nodiscard]] ZYRSTD_API void* ZYRDMMReAlloc(void* p, unsigned int size, const char* clientName,
                                             I_VariableSizeAllocator* subAllocator);
[[nodiscard]] ZYRSTD_API void* ZYRDMMVirtualMemAlloc(unsigned int size, const char* clientName,
                                                     eFlushMemorySeverity severity);
ZYRSTD_API void ZYRDMMVirtualMemFree(void* p, const char* clientName);

ZYRSTD_API bool ZYRFlushMemory(I_FlushableMemoryClient* requester, unsigned int bytesNeeded,
                               eFlushMemorySeverity severity);
ZYRSTD_API bool ZYRFlushMemoryThreadSafe(I_FlushableMemoryClient* requester,
                                         unsigned int bytesNeeded, eFlushMemorySeverity severity);
ZYRSTD_API bool ZYRSynchronizeRendererThread(bool wait);
ZYRSTD_API bool ArrangeMemoryBySyncRendererThread(unsigned int bytesNeeded, bool wait);
/// `queue` is the engine's ZYRPublic::I_SurfaceQueue*.
ZYRSTD_API void RegisterSurfaceQueueInstance(void* queue);
ZYRSTD_API void RegisterFlushableMemoryClient(I_FlushableMemoryClient* client, bool threadSafe);
ZYRSTD_API void UnregisterFlushableMemoryClient(I_FlushableMemoryClient* client);
ZYRSTD_API void GetClientsMemoryUsedAndMemoryLimit(unsigned long long& flushable,
                                                   unsigned long long& limit,
                                                   unsigned long long& used);

/// The PDF library client; `ctx` is accepted and not used.
[[nodiscard]] ZYRSTD_API void* DMM_TUMAAlloc(void* ctx, unsigned int size);
ZYRSTD_API void DMM_TUMAFree(void* ctx, void* p);
[[nodiscard]] ZYRSTD_API void* DMM_TUMAReAlloc(void* ctx, void* p, unsigned int size);
[[nodiscard]] ZYRSTD_API void* DMM_JOVAlloc(unsigned int size);
ZYRSTD_API void DMM_JOVFree(void* p);
[[nodiscard]] ZYRSTD_API void* DMM_JOVRealloc(void* p, unsigned int size);
ZYRSTD_API unsigned int DMM_JOVMemSize(void* p);
ZYRSTD_API unsigned long long DMM_GetCurrTUMAMem(eZYRMemoryClientType type,
                                                 unsigned long long* peak);
ZYRSTD_API unsigned long long DMM_GetCurrJOVMem(eZYRMemoryClientType type,
                                                unsigned long long* peak);
ZYRSTD_API unsigned long long DMM_GetCurrTUMAJOVMem(eZYRMemoryClientType type);
ZYRSTD_API void DMM_SetMemoryClientThreadID(eZYRMemoryClientType type, unsigned long long threadId);
ZYRSTD_API void DMM_SetJOVAllocMaxSingleBlockSize();
ZYRSTD_API unsigned int DMM_GetJOVAllocMaxSingleBlockSize();

ZYRSTD_API void UpdateClientMemoryStat(const char* name, unsigned int bytes, bool add);
ZYRSTD_API void UpdateClientMaxMemoryStat(const char* name, unsigned int bytes);
ZYRSTD_API void LogDMMInfo(const char* format, ...) __attribute__((format(printf, 1, 2)));
ZYRSTD_API void LogSubAlocInfo(const char* text);

} // namespace ZYRStd
