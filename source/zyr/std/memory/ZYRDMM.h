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
/// Frees a block of ZYRDMMMalloc with the same client name and sub-allocator.
ZYRSTD_API void ZYRDMMFree(void* p, const char* clientName, I_VariableSizeAllocator* subAllocator);
/// No recovery for a resize; the sub-allocator argument is not used.
[[nodiscard]] ZYRSTD_API void* ZYRDMMReAlloc(void* p, unsigned int size, const char* clientName,
                                             I_VariableSizeAllocator* subAllocator);
/// Virtual memory under the same recovery as ZYRDMMMalloc; null when it still fails.
[[nodiscard]] ZYRSTD_API void* ZYRDMMVirtualMemAlloc(unsigned int size, const char* clientName,
                                                     eFlushMemorySeverity severity);
/// Frees a block of ZYRDMMVirtualMemAlloc.
ZYRSTD_API void ZYRDMMVirtualMemFree(void* p, const char* clientName);

/// Asks registered flushable clients other than `requester`, largest first, to give
/// `bytesNeeded` back; true when one did. Holds the registry mutex throughout.
ZYRSTD_API bool ZYRFlushMemory(I_FlushableMemoryClient* requester, unsigned int bytesNeeded,
                               eFlushMemorySeverity severity);
/// As ZYRFlushMemory, over the clients registered as thread-safe.
ZYRSTD_API bool ZYRFlushMemoryThreadSafe(I_FlushableMemoryClient* requester,
                                         unsigned int bytesNeeded, eFlushMemorySeverity severity);
/// Asks the registered surface queue to make the renderer catch up; false without one
/// or when the calling thread may not block.
ZYRSTD_API bool ZYRSynchronizeRendererThread(bool wait);
/// Makes the renderer catch up so that `bytesNeeded` may become free; true when it ran.
ZYRSTD_API bool ArrangeMemoryBySyncRendererThread(unsigned int bytesNeeded, bool wait);
/// `queue` is the engine's ZYRPublic::I_SurfaceQueue*.
ZYRSTD_API void RegisterSurfaceQueueInstance(void* queue);
/// Registers `client` (borrowed: it must unregister before it dies) in the main or,
/// with `threadSafe`, the thread-safe list. Takes the registry mutex.
ZYRSTD_API void RegisterFlushableMemoryClient(I_FlushableMemoryClient* client, bool threadSafe);
/// Removes `client` from both lists; takes the registry mutex, so not from inside a flush.
ZYRSTD_API void UnregisterFlushableMemoryClient(I_FlushableMemoryClient* client);
/// Reads the bytes the flushable clients could give back, the memory limit and the
/// bytes in use.
ZYRSTD_API void GetClientsMemoryUsedAndMemoryLimit(unsigned long long& flushable,
                                                   unsigned long long& limit,
                                                   unsigned long long& used);

/// The PDF library client; `ctx` is accepted and not used.
[[nodiscard]] ZYRSTD_API void* DMM_TUMAAlloc(void* ctx, unsigned int size);
/// Frees a block of DMM_TUMAAlloc.
ZYRSTD_API void DMM_TUMAFree(void* ctx, void* p);
/// Resizes a block of DMM_TUMAAlloc; null on failure, the old block kept.
[[nodiscard]] ZYRSTD_API void* DMM_TUMAReAlloc(void* ctx, void* p, unsigned int size);
/// Allocates for the JOV client, counted in its statistics; null on failure.
[[nodiscard]] ZYRSTD_API void* DMM_JOVAlloc(unsigned int size);
/// Frees a block of DMM_JOVAlloc.
ZYRSTD_API void DMM_JOVFree(void* p);
/// Resizes a block of DMM_JOVAlloc; null on failure, the old block kept.
[[nodiscard]] ZYRSTD_API void* DMM_JOVRealloc(void* p, unsigned int size);
/// The usable size of a block of DMM_JOVAlloc.
ZYRSTD_API unsigned int DMM_JOVMemSize(void* p);
/// The bytes the PDF library client holds for the threads `type` selects; its peak
/// goes to `*peak` when not null.
ZYRSTD_API unsigned long long DMM_GetCurrTUMAMem(eZYRMemoryClientType type,
                                                 unsigned long long* peak);
/// The same for the JOV client.
ZYRSTD_API unsigned long long DMM_GetCurrJOVMem(eZYRMemoryClientType type,
                                                unsigned long long* peak);
/// The bytes both clients hold for the threads `type` selects.
ZYRSTD_API unsigned long long DMM_GetCurrTUMAJOVMem(eZYRMemoryClientType type);
/// Names the interpreter thread (type eZYRMemoryClientInterp) whose use is counted apart.
ZYRSTD_API void DMM_SetMemoryClientThreadID(eZYRMemoryClientType type, unsigned long long threadId);
/// Limits a single JOV block to 96 MiB when the address space is at most 4 GiB.
ZYRSTD_API void DMM_SetJOVAllocMaxSingleBlockSize();
/// The largest single block of the JOV client.
ZYRSTD_API unsigned int DMM_GetJOVAllocMaxSingleBlockSize();

/// Adds (or, without `add`, removes) `bytes` to the statistics of the client `name`.
ZYRSTD_API void UpdateClientMemoryStat(const char* name, unsigned int bytes, bool add);
/// Raises the recorded peak of the client `name` to `bytes` when larger.
ZYRSTD_API void UpdateClientMaxMemoryStat(const char* name, unsigned int bytes);
/// Writes a printf-style line to the DMM log when it is open; takes the log mutex.
ZYRSTD_API void LogDMMInfo(const char* format, ...) __attribute__((format(printf, 1, 2)));
/// Writes `text` to the DMM log when it is open.
ZYRSTD_API void LogSubAlocInfo(const char* text);

} // namespace ZYRStd
