// The dynamic memory manager: the recovery ladder, flushing, and client accounting.
#include "zyr/std/memory/ZYRDMM.h"

#include <algorithm>
#include <array>
#include <atomic>
#include <cstdarg>
#include <mutex>

#include "I_SurfaceQueue.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/core/ZYRStdInit.h"
#include "zyr/std/core/ZYRThread.h"
#include "zyr/std/core/ZYRThreadSafety.h"
#include "zyr/std/core/ZYRVirtualMem.h"
#include "zyr/std/core/internal/ZYRDMMLog.h"
#include "zyr/std/core/internal/ZYRFlushRegistry.h"
#include "zyr/std/core/internal/ZYRMemInternal.h"
#include "zyr/std/core/internal/ZYRNoDestructor.h"
#include "zyr/std/memory/I_VariableSizeAllocator.h"

namespace ZYRStd {

namespace {

using detail::dmmLogPrintf;
using ZYRPublic::eFlushMemorySeverityNormal;
using ZYRPublic::eFlushMemorySeverityUrgent;

constexpr unsigned int kMaxCollected = 8;
constexpr const char* kCannotFlush = "------ Memory can not be flushed anymore, \n------ Client "
                                     "might have some fallback mechanism to arrange memory\n";
// "client’s" is written with the Windows-1252 right single quotation mark, byte 0x92.
constexpr const char* kFlushStatus =
    "-- Status :<flushing : %s> \n---- flushable client\x92s total memory (before call): <%u "
    "bytes> \t\t\t\t\t\t   \n---- flushable client\x92s total memory (after call): <%u bytes> \n";
constexpr const char* kThreadSafeFlushStatus =
    "-- Status :<flushing : %s> \n---- flushable client\x92s total memory (before call): <%u "
    "bytes> \t\t\t\t   \n---- flushable client\x92s total memory (after call): <%u bytes> \n";

constinit std::atomic<ZYRPublic::I_SurfaceQueue*> surfaceQueue{nullptr};
constinit std::atomic<uint64_t> interpreterThreadId{~uint64_t{0}};
constinit std::atomic<unsigned int> jovMaxSingleBlock{1073741824};

const char* nameOf(const char* name) {
    return name ? name : "unknown";
}
const char* clientName(I_FlushableMemoryClient* client) {
    return client ? nameOf(client->getClientName()) : "unknown";
}

bool threadMayBlock() {
    const CZYRThreadSpecificPtr* record = GetCZYRThreadSpecificPtr();
    return record && record->IsThisThreadBlockable();
}

bool isInterpreterThread() {
    const CZYRThreadSpecificPtr* record = GetCZYRThreadSpecificPtr();
    // Relaxed: the identifier is one word compared on its own; nothing else is read on the
    // strength of it.
    return record && record->getThreadId() == interpreterThreadId.load(std::memory_order_relaxed);
}

// The ladder's demand doubles in 32 bits; once it would wrap, a client that keeps
// answering true without freeing anything would keep the ladder going for ever.
bool doubleDemand(unsigned int& need) {
    if (need > 0x7FFFFFFFu)
        return false;
    need *= 2;
    return true;
}

// Allocation with recovery, shared by the heap and the virtual-memory variants.
template <class Allocate>
void* allocateWithRecovery(Allocate allocate, unsigned int n, const char* client,
                           I_FlushableMemoryClient* requester, eFlushMemorySeverity severity) {
    if (void* p = allocate())
        return p;
    const char* name = nameOf(client);
    dmmLogPrintf("Memory Allocation Failed for Client : <%s>, [memory needed = %u bytes ] \n", name,
                 n);
    if (!threadMayBlock()) {
        dmmLogPrintf("Memory can not be arranged for this thread \n");
        return nullptr;
    }
    if (ArrangeMemoryBySyncRendererThread(n, true)) {
        if (void* p = allocate()) {
            dmmLogPrintf("---- Memory allocation succeed after SyncRendererThread for Client : "
                         "<%s> , [memory needed = %u bytes ]  \n",
                         name, n);
            return p;
        }
    }
    dmmLogPrintf("---- Memory allocation failed after SyncRendererThread for Client : <%s> , "
                 "[memory needed = %u bytes ]  \n",
                 name, n);
    unsigned int need = n;
    while (ZYRFlushMemory(requester, need, severity)) {
        if (void* p = allocate()) {
            dmmLogPrintf("----  Memory allocation succeed after flushing for Client : <%s> , "
                         "[memory needed = %u bytes ] \n",
                         name, n);
            return p;
        }
        dmmLogPrintf("----  Memory allocation failed after flushing for Client : <%s> , [memory "
                     "needed = %u bytes ] \n",
                     name, n);
        if (!doubleDemand(need))
            break;
    }
    if (severity == eFlushMemorySeverityNormal &&
        ZYRFlushMemory(requester, n, eFlushMemorySeverityUrgent)) {
        if (void* p = allocate()) {
            dmmLogPrintf("----  Memory allocation succeed after flushing for Client : <%s> , "
                         "[memory needed = %u bytes ] \n",
                         name, n);
            return p;
        }
    }
    dmmLogPrintf("%s", kCannotFlush);
    return nullptr;
}

// ---- TUMA and JOV accounting ----------------------------------------------------------

struct ClientRecord {
    uint64_t current = 0;
    uint64_t peak = 0;

    void add(uint64_t bytes) {
        current += bytes;
        peak = std::max(peak, current);
    }
    void subtract(uint64_t bytes) { current = current > bytes ? current - bytes : 0; }
};

struct EngineClient {
    ClientRecord all;
    ClientRecord interp;
};

struct ClientStatistics {
    detail::Mutex mutex; // guards both clients' records
    EngineClient tuma ZYR_GUARDED_BY(mutex);
    EngineClient jov ZYR_GUARDED_BY(mutex);
};

ClientStatistics& statistics() {
    static detail::NoDestructor<ClientStatistics> instance;
    return *instance;
}

void accountAlloc(EngineClient ClientStatistics::*client, void* p) {
    const uint64_t size = ZYRMemSize(p);
    const bool interp = isInterpreterThread();
    ClientStatistics& stats = statistics();
    detail::LockGuard lock(stats.mutex);
    EngineClient& records = stats.*client;
    if (interp)
        records.interp.add(size);
    records.all.add(size);
}

void accountFree(EngineClient ClientStatistics::*client, void* p) {
    if (p) {
        const uint64_t size = ZYRMemSize(p);
        const bool interp = isInterpreterThread();
        ClientStatistics& stats = statistics();
        detail::LockGuard lock(stats.mutex);
        EngineClient& records = stats.*client;
        if (interp)
            records.interp.subtract(size);
        records.all.subtract(size);
    }
    ZYRFree(p);
}

void* resizeAccounted(EngineClient ClientStatistics::*client, void* p, unsigned int size) {
    const uint64_t oldSize = ZYRMemSize(p);
    void* q = ZYRRealloc(p, size);
    if (!q)
        return nullptr;
    const uint64_t newSize = ZYRMemSize(q);
    if (newSize == oldSize)
        return q;
    const bool interp = isInterpreterThread();
    ClientStatistics& stats = statistics();
    detail::LockGuard lock(stats.mutex);
    EngineClient& records = stats.*client;
    if (interp) {
        records.interp.subtract(oldSize);
        records.interp.add(newSize);
    }
    records.all.subtract(oldSize);
    records.all.add(newSize);
    return q;
}

uint64_t currentOf(EngineClient ClientStatistics::*client, eZYRMemoryClientType type,
                   unsigned long long* peak) {
    ClientStatistics& stats = statistics();
    detail::LockGuard lock(stats.mutex);
    const ClientRecord& record =
        type == eZYRMemoryClientInterp ? (stats.*client).interp : (stats.*client).all;
    if (peak)
        *peak = record.peak;
    return record.current;
}

void* tumaRecover(unsigned int n) {
    dmmLogPrintf("Memory Allocation Failed : Client = <TUMA> [memory needed = %u bytes ]  \n", n);
    void* p = nullptr;
    ZYRPublic::I_SurfaceQueue* queue = surfaceQueue.load();
    if (threadMayBlock() && queue) {
        const unsigned long long before = GetMemUsage();
        queue->synchronize(false);
        const unsigned long long after = GetMemUsage();
        if (before > after && before - after > n)
            p = ZYRMalloc(n);
        dmmLogPrintf("---- Memory allocation %s after SyncRendererThread for Client : <TUMA> "
                     "[memory needed = %u bytes ]\n",
                     p ? "succeeded" : "failed", n);
    }
    unsigned int need = n;
    for (int round = 0; !p && round < 2; ++round) {
        if (!ZYRFlushMemory(nullptr, need, eFlushMemorySeverityNormal)) {
            if (ZYRFlushMemory(nullptr, n, eFlushMemorySeverityUrgent))
                p = ZYRMalloc(n);
            if (p)
                dmmLogPrintf("----  Memory allocation succeed after flushing for Client: <TUMA> "
                             "[memory needed = %u bytes ] \n",
                             n);
            else
                dmmLogPrintf("%s", kCannotFlush);
            break;
        }
        p = ZYRMalloc(n);
        dmmLogPrintf("----  Memory allocation %s after flushing for Client: <TUMA> [memory needed "
                     "= %u bytes ] \n",
                     p ? "succeeded" : "failed", n);
        doubleDemand(need);
    }
    return p;
}

} // namespace

// ---- allocation ----------------------------------------------------------------------------

void* ZYRDMMMalloc(unsigned int size, const char* clientName, I_VariableSizeAllocator* subAllocator,
                   unsigned int* actualSize, void* requester, eFlushMemorySeverity severity) {
    if (size == 0)
        return nullptr;
    if (subAllocator && !actualSize)
        ZYRExitProcess(CZYRError(ZYRPublic::kZYRErrorBadParam,
                                 "ZYRDMMMalloc: a sub-allocator needs actualSize",
                                 "source/zyr/std/ZYRDMM", __LINE__),
                       "source/zyr/std/ZYRDMM", __LINE__);
    auto allocate = [&]() -> void* {
        return subAllocator ? subAllocator->allocate(size, *actualSize) : ZYRMalloc(size);
    };
    return allocateWithRecovery(allocate, size, clientName,
                                static_cast<I_FlushableMemoryClient*>(requester), severity);
}

void ZYRDMMFree(void* p, const char*, I_VariableSizeAllocator* subAllocator) {
    if (subAllocator)
        subAllocator->Free(p);
    else
        ZYRFree(p);
}

void* ZYRDMMReAlloc(void* p, unsigned int size, const char* clientName, I_VariableSizeAllocator*) {
    if (!p)
        return ZYRDMMMalloc(size, clientName, nullptr, nullptr, nullptr,
                            eFlushMemorySeverityNormal);
    return ZYRRealloc(p, size);
}

void* ZYRDMMVirtualMemAlloc(unsigned int size, const char* clientName,
                            eFlushMemorySeverity severity) {
    if (size == 0)
        return nullptr;
    return allocateWithRecovery([size] { return VirtualMemAlloc(size); }, size, clientName, nullptr,
                                severity);
}

void ZYRDMMVirtualMemFree(void* p, const char*) {
    if (p)
        VirtualMemFree(p);
}

// ---- flushing ------------------------------------------------------------------------------

bool ZYRFlushMemory(I_FlushableMemoryClient* requester, unsigned int bytesNeeded,
                    eFlushMemorySeverity severity) {
    if (!threadMayBlock()) {
        dmmLogPrintf("-- Memory can not be arranged for this thread \n");
        return false;
    }
    dmmLogPrintf("Client %s is asking for %u bytes with severity <%d>\n", clientName(requester),
                 bytesNeeded, static_cast<int>(severity));

    detail::FlushRegistry& registry = detail::flushRegistry();
    detail::LockGuard lock(registry.mutex);

    std::array<I_FlushableMemoryClient*, kMaxCollected> collected{};
    unsigned int count = 0;
    const auto& clients = registry.mainForFlush();
    for (size_t i = 0; i < clients.size(); ++i) {
        if (count == kMaxCollected) {
            dmmLogPrintf("-- Too many flushable clients \n");
            break;
        }
        I_FlushableMemoryClient* client = clients[i];
        if (client != requester)
            collected[count++] = client;
    }

    // Largest first; sizes are asked afresh at every comparison, equal sizes keep their order.
    for (unsigned int i = 0; i < count; ++i) {
        unsigned int s = collected[i]->getFlushableMemorySize();
        for (unsigned int j = i + 1; j < count; ++j) {
            const unsigned int t = collected[j]->getFlushableMemorySize();
            if (s < t) {
                std::swap(collected[i], collected[j]);
                s = t;
            }
        }
    }

    for (unsigned int i = 0; i < count; ++i) {
        I_FlushableMemoryClient* client = collected[i];
        const unsigned int before = client->getFlushableMemorySize();
        if (severity == eFlushMemorySeverityNormal && before < bytesNeeded)
            break;
        if (severity != eFlushMemorySeverityNormal)
            dmmLogPrintf(
                "-- Calling flushing client : <%s> to arrange memory with severity <%d> \n",
                clientName(client), static_cast<int>(severity));
        else
            dmmLogPrintf("-- Calling flushing client : <%s> to arrange memory with severity <%d> "
                         "[memory need to be flushed = %u bytes]\n",
                         clientName(client), static_cast<int>(severity), bytesNeeded);
        const bool flushed = client->flushMemory(bytesNeeded, 0, severity);
        const unsigned int after = client->getFlushableMemorySize();
        dmmLogPrintf(kFlushStatus, flushed ? "succeed" : "Failed", before, after);
        if (flushed)
            return true;
    }

    const tOEMFlushCB& oem = ZYRGetOEMFlushCB();
    if (oem.flushProc) {
        if (severity != eFlushMemorySeverityNormal)
            dmmLogPrintf(
                "-- Calling flushing client : <OEM> to arrange memory with severity <%d> \n",
                static_cast<int>(severity));
        else
            dmmLogPrintf("-- Calling flushing client : <OEM> to arrange memory with severity <%d> "
                         "[memory need to be flushed = %u bytes] \n",
                         static_cast<int>(severity), bytesNeeded);
        if (oem.flushProc(bytesNeeded, 0, severity, oem.clientData)) {
            dmmLogPrintf("-- Status :<flushing : succeed> \n");
            return true;
        }
        dmmLogPrintf("-- Status :<flushing : failed> \n");
    }

    dmmLogPrintf("-- Status : <No eligible flushable client> : severity = %d : %s has max avail "
                 "flushable size = %u\n",
                 static_cast<int>(severity), count ? clientName(collected[0]) : "none",
                 count ? collected[0]->getFlushableMemorySize() : 0u);
    return false;
}

bool ZYRFlushMemoryThreadSafe(I_FlushableMemoryClient* requester, unsigned int bytesNeeded,
                              eFlushMemorySeverity severity) {
    dmmLogPrintf("ZYRFlushMemoryThreadSafe: Client %s is asking for %u bytes with severity <%d>\n",
                 clientName(requester), bytesNeeded, static_cast<int>(severity));

    detail::FlushRegistry& registry = detail::flushRegistry();
    detail::LockGuard lock(registry.mutex);

    struct Candidate {
        I_FlushableMemoryClient* client;
        unsigned int size;
    };
    std::array<Candidate, kMaxCollected> collected{};
    unsigned int count = 0;
    for (I_FlushableMemoryClient* client : registry.threadSafeForFlush()) {
        if (count == kMaxCollected) {
            dmmLogPrintf("-- Too many flushable clients \n");
            break;
        }
        if (client != requester)
            collected[count++] = {client, client->getFlushableMemorySize()};
    }
    for (unsigned int i = 0; i < count; ++i)
        for (unsigned int j = i + 1; j < count; ++j)
            if (collected[i].size < collected[j].size)
                std::swap(collected[i], collected[j]);

    for (unsigned int i = 0; i < count; ++i) {
        const Candidate& candidate = collected[i];
        if (severity == eFlushMemorySeverityNormal && candidate.size < bytesNeeded)
            break;
        if (severity == eFlushMemorySeverityNormal)
            dmmLogPrintf("-- Calling flushing client : <%s> to arrange memory with severity <%d> "
                         "[memory need to be flushed = %u bytes]\n",
                         clientName(candidate.client), static_cast<int>(severity), bytesNeeded);
        else
            dmmLogPrintf("-- Calling flushing client : <%s> to arrange memory with severity <%d>\n",
                         clientName(candidate.client), static_cast<int>(severity));
        const bool flushed = candidate.client->flushMemory(bytesNeeded, 0, severity);
        dmmLogPrintf(kThreadSafeFlushStatus, flushed ? "succeeded" : " failed", candidate.size,
                     candidate.client->getFlushableMemorySize());
        if (flushed)
            return true;
    }
    return false;
}

bool ZYRSynchronizeRendererThread(bool wait) {
    ZYRPublic::I_SurfaceQueue* queue = surfaceQueue.load();
    return queue ? queue->synchronize(!wait) : false;
}

bool ArrangeMemoryBySyncRendererThread(unsigned int bytesNeeded, bool wait) {
    ZYRPublic::I_SurfaceQueue* queue = surfaceQueue.load();
    if (!threadMayBlock() || !queue)
        return false;
    const unsigned long long before = GetMemUsage();
    queue->synchronize(!wait);
    const unsigned long long after = GetMemUsage();
    // Usage that grew meanwhile is no drop (the unsigned difference would wrap to "huge").
    return before > after && before - after > bytesNeeded;
}

void RegisterSurfaceQueueInstance(void* queue) {
    surfaceQueue.store(static_cast<ZYRPublic::I_SurfaceQueue*>(queue));
}

void RegisterFlushableMemoryClient(I_FlushableMemoryClient* client, bool threadSafe) {
    if (!client)
        return;
    detail::FlushRegistry& registry = detail::flushRegistry();
    detail::LockGuard lock(registry.mutex);
    detail::LockGuard listLock(registry.listMutex);
    registry.main.push_back(client);
    if (threadSafe)
        registry.threadSafe.push_back(client);
}

void UnregisterFlushableMemoryClient(I_FlushableMemoryClient* client) {
    if (!client)
        return;
    detail::FlushRegistry& registry = detail::flushRegistry();
    detail::LockGuard lock(registry.mutex);
    detail::LockGuard listLock(registry.listMutex);
    for (auto* list : {&registry.main, &registry.threadSafe}) {
        const auto found = std::find(list->begin(), list->end(), client);
        if (found != list->end())
            list->erase(found);
    }
}

void GetClientsMemoryUsedAndMemoryLimit(unsigned long long& flushable, unsigned long long& limit,
                                        unsigned long long& used) {
    flushable = 0;
    {
        // Under the list lock only: another thread may be registering meanwhile, and a flush
        // in progress holds the registry lock for as long as its clients take.
        detail::FlushRegistry& registry = detail::flushRegistry();
        detail::LockGuard lock(registry.listMutex);
        for (I_FlushableMemoryClient* client : registry.main)
            flushable += client->getFlushableMemorySize();
    }
    used = GetMemUsage();
    limit = ZYRGetMemLimit();
    if (limit > 2147483648ull) {
        tZYRVirtualMemoryInfo info{};
        VirtualMemStatus(&info);
        limit = std::min<unsigned long long>(limit, info.totalPhysical);
    }
}

// ---- the engine clients --------------------------------------------------------------------

void* DMM_TUMAAlloc(void*, unsigned int size) {
    const unsigned int n = std::max(size, 1u);
    void* p = ZYRMalloc(n);
    if (!p)
        p = tumaRecover(n);
    if (p)
        accountAlloc(&ClientStatistics::tuma, p);
    return p;
}

void DMM_TUMAFree(void*, void* p) {
    accountFree(&ClientStatistics::tuma, p);
}

void* DMM_TUMAReAlloc(void* ctx, void* p, unsigned int size) {
    if (!p)
        return DMM_TUMAAlloc(ctx, size);
    return resizeAccounted(&ClientStatistics::tuma, p, size);
}

void* DMM_JOVAlloc(unsigned int size) {
    const unsigned int n = std::max(size, 1u);
    if (n > jovMaxSingleBlock.load()) {
        tZYRVirtualMemoryInfo info{};
        VirtualMemStatus(&info);
        const uint64_t available = info.availableForAllocation;
        if (available < (8ull << 30) && static_cast<uint32_t>(available / 2) < n)
            return nullptr;
    }
    void* p = ZYRDMMMalloc(n, "JOV", nullptr, nullptr, nullptr, eFlushMemorySeverityNormal);
    if (p)
        accountAlloc(&ClientStatistics::jov, p);
    return p;
}

void DMM_JOVFree(void* p) {
    accountFree(&ClientStatistics::jov, p);
}

void* DMM_JOVRealloc(void* p, unsigned int size) {
    if (!p)
        return DMM_JOVAlloc(size);
    return resizeAccounted(&ClientStatistics::jov, p, std::max(size, 1u));
}

unsigned int DMM_JOVMemSize(void* p) {
    return ZYRMemSize(p);
}

unsigned long long DMM_GetCurrTUMAMem(eZYRMemoryClientType type, unsigned long long* peak) {
    return currentOf(&ClientStatistics::tuma, type, peak);
}

unsigned long long DMM_GetCurrJOVMem(eZYRMemoryClientType type, unsigned long long* peak) {
    return currentOf(&ClientStatistics::jov, type, peak);
}

unsigned long long DMM_GetCurrTUMAJOVMem(eZYRMemoryClientType type) {
    ClientStatistics& stats = statistics();
    detail::LockGuard lock(stats.mutex);
    if (type == eZYRMemoryClientInterp)
        return stats.tuma.interp.current + stats.jov.interp.current;
    if (type == eZYRMemoryClientOthers) {
        auto others = [](const EngineClient& c) {
            return c.all.current > c.interp.current ? c.all.current - c.interp.current : 0;
        };
        return others(stats.tuma) + others(stats.jov);
    }
    return stats.tuma.all.current + stats.jov.all.current;
}

void DMM_SetMemoryClientThreadID(eZYRMemoryClientType type, unsigned long long threadId) {
    if (type == eZYRMemoryClientInterp)
        interpreterThreadId.store(threadId);
}

void DMM_SetJOVAllocMaxSingleBlockSize() {
    tZYRVirtualMemoryInfo info{};
    VirtualMemStatus(&info);
    if (info.totalVirtual <= (4ull << 30))
        jovMaxSingleBlock.store(100663296);
}

unsigned int DMM_GetJOVAllocMaxSingleBlockSize() {
    return jovMaxSingleBlock.load();
}

// ---- statistics and log --------------------------------------------------------------------

void UpdateClientMemoryStat(const char* name, unsigned int bytes, bool add) {
    detail::dmmStatUpdate(name, bytes, add);
}

void UpdateClientMaxMemoryStat(const char* name, unsigned int bytes) {
    detail::dmmStatUpdateMax(name, bytes);
}

void LogDMMInfo(const char* format, ...) {
    va_list args;
    va_start(args, format);
    detail::dmmLogVPrintf(format, args);
    va_end(args);
}

void LogSubAlocInfo(const char* text) {
    dmmLogPrintf("%s\n", text ? text : "");
}

} // namespace ZYRStd
