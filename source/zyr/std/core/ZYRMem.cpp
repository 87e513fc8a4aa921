// The allocation front: plain and guarded variants, the memory limit, the tracker and
// the leak report.
#include "zyr/std/core/ZYRMem.h"

#include <pthread.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <fstream>
#include <map>
#include <mutex>
#include <string>

#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/CZYRErrorStk.h"
#include "zyr/std/core/CZYRSmartPtr.h"
#include "zyr/std/core/IStackWalker.h"
#include "zyr/std/core/ZYRThread.h"
#include "zyr/std/core/ZYRThreadSafety.h"
#include "zyr/std/core/internal/ZYRMemInternal.h"
#include "zyr/std/core/internal/ZYRNoDestructor.h"

namespace ZYRStd {

namespace {

constexpr const char* kSource = "source/zyr/std/ZYRMem";
constexpr int kInvalidPointerLine = 2012;
constexpr uint32_t kGuardWord = 0xDEADBEEF;
// Plain blocks carry the requested size in a 16-byte header so that any host allocator
// works (there is no portable usable-size query) and the user pointer stays 16-aligned.
constexpr size_t kPlainHeader = 16;
// Guarded blocks: size, stack identifier, padding, head guard, user bytes, tail guard.
constexpr size_t kGuardHeader = 16;
constexpr size_t kGuardOverhead = kGuardHeader + sizeof(uint32_t);

struct GuardHeader {
    uint32_t size;
    uint32_t stackId;
    uint32_t padding;
    uint32_t headGuard;
};
static_assert(sizeof(GuardHeader) == kGuardHeader);

constexpr uint64_t round8(uint64_t n) {
    return (n + 7) & ~uint64_t{7};
}
constexpr uint64_t guardedAccounted(uint32_t requested) {
    return round8(uint64_t{requested} + kGuardOverhead);
}

void* crtAlloc(size_t size, void*) {
    return std::malloc(size);
}
void* crtRealloc(void* block, size_t size, void*) {
    return std::realloc(block, size);
}
void crtFree(void* block, void*) {
    std::free(block);
}

constinit tZYRMemMgr host{crtAlloc, crtRealloc, crtFree, nullptr};
constinit int statLevel = 0;

// The accounting words are counters, not flags that publish data: every access to them is
// relaxed. The limit test and the move of the total are one compare-exchange on the total
// itself, and atomicity alone keeps the sum exact whichever order threads see; no other
// memory is read on the strength of a count, so nothing needs acquire or release.
constinit std::atomic<uint64_t> memLimitBytes{0};
constinit std::atomic<uint64_t> memReserveBytes{detail::kDefaultMemReserve};
constinit std::atomic<uint64_t> totalUsage{0};
constinit std::atomic<int> usageCheckCounter{1};
constinit std::atomic<bool> testAvailablePhysical{true};

// Bytes a thread freed that the total still counts. The thread hands them straight to its
// next allocations, so most allocations and frees touch no shared cache line, while the
// total never counts less than is held. It runs ahead by at most kPendingFreeLimit per
// thread, and a limit test about to refuse first takes back every thread's pending bytes.
constexpr uint64_t kPendingFreeLimit = 64 * 1024;

struct PendingFrees {
    std::atomic<uint64_t> bytes{0}; // taken by its thread, drained by a refusing one
    PendingFrees* next = nullptr;   // in the list of threads that have pending frees
    bool registered = false;
    bool exited = false; // the thread is ending: frees go straight to the total
};
// Initial-exec: the hot path reads it without a call into the dynamic linker.
[[gnu::tls_model("initial-exec")]] thread_local constinit PendingFrees pendingFrees{};

struct PendingRegistry {
    detail::Mutex mutex; // guards the list of threads
    PendingFrees* head ZYR_GUARDED_BY(mutex) = nullptr;
};
PendingRegistry& pendingRegistry() {
    static detail::NoDestructor<PendingRegistry> instance;
    return *instance;
}

// Relaxed: the bytes move from one counter to another; the exchange hands each byte over
// exactly once, which is all the total needs.
void flushPendingFrees(PendingFrees& pending) {
    if (pending.bytes.load(std::memory_order_relaxed) != 0)
        totalUsage.fetch_sub(pending.bytes.exchange(0, std::memory_order_relaxed),
                             std::memory_order_relaxed);
}

// Returns true when some thread's pending bytes went back to the total.
bool drainAllPendingFrees() {
    PendingRegistry& registry = pendingRegistry();
    detail::LockGuard lock(registry.mutex);
    bool drained = false;
    for (PendingFrees* pending = registry.head; pending; pending = pending->next) {
        // Relaxed: the registry lock keeps the record alive; the exchange alone makes the
        // hand-over exact.
        const uint64_t bytes = pending->bytes.exchange(0, std::memory_order_relaxed);
        if (bytes != 0) {
            totalUsage.fetch_sub(bytes, std::memory_order_relaxed);
            drained = true;
        }
    }
    return drained;
}

// A thread's pending bytes go back when it ends. A pthread key rather than a thread_local
// destructor: frees made while other per-thread data is torn down (the thread record, for
// one) may register late, and key destructors are run again for keys set meanwhile.
void pendingFreesThreadExit(void* data) {
    auto* pending = static_cast<PendingFrees*>(data);
    PendingRegistry& registry = pendingRegistry();
    detail::LockGuard lock(registry.mutex);
    for (PendingFrees** link = &registry.head; *link; link = &(*link)->next) {
        if (*link == pending) {
            *link = pending->next;
            break;
        }
    }
    flushPendingFrees(*pending);
    pending->exited = true;
}

pthread_key_t pendingFreesKey() {
    static const pthread_key_t key = [] {
        pthread_key_t created{};
        ::pthread_key_create(&created, pendingFreesThreadExit);
        return created;
    }();
    return key;
}

// On a thread's first free: list its pending bytes and have them given back at its end.
void registerPendingFrees(PendingFrees& pending) {
    ::pthread_setspecific(pendingFreesKey(), &pending);
    PendingRegistry& registry = pendingRegistry();
    detail::LockGuard lock(registry.mutex);
    pending.next = registry.head;
    registry.head = &pending;
    pending.registered = true;
}

// Takes `bytes` from this thread's pending frees when it has that many.
// Relaxed: a draining thread may take the bytes meanwhile; the compare-exchange then fails
// and nothing is counted twice.
bool takePendingFrees(PendingFrees& pending, uint64_t bytes) {
    uint64_t available = pending.bytes.load(std::memory_order_relaxed);
    while (available >= bytes)
        if (pending.bytes.compare_exchange_weak(available, available - bytes,
                                                std::memory_order_relaxed))
            return true;
    return false;
}

// Relaxed: a switch of the check that races with a request may or may not apply to it, as
// with any lock; it guards no other data.
bool usageCheckOn() {
    return usageCheckCounter.load(std::memory_order_relaxed) >= 1;
}

// Reusing freed bytes leaves the total as it is, which passes the limit test only while the
// total is within the limit: above it (check switched off and on again, or the limit lowered
// below usage) every request takes the full test.
bool mayReusePendingFrees() {
    // Relaxed: a stale answer only sends the request through the full, atomic test.
    return totalUsage.load(std::memory_order_relaxed) <=
               memLimitBytes.load(std::memory_order_relaxed) ||
           !usageCheckOn();
}

// An entry of the allocation map: the serial for the leak report, and the requested size so
// that the guard check can trust the header's size before reading the tail guard.
struct AllocationEntry {
    unsigned int serial;
    uint32_t size; // 0 for virtual blocks, which carry no guards
};

struct Tracker {
    detail::RecursiveMutex mutex; // guards every field below
    unsigned int allocCount ZYR_GUARDED_BY(mutex) = 0;
    unsigned int reallocCount ZYR_GUARDED_BY(mutex) = 0;
    unsigned int freeCount ZYR_GUARDED_BY(mutex) = 0;
    unsigned int currentBytes ZYR_GUARDED_BY(mutex) = 0;
    // Bytes that requests have reserved against the limit and not yet counted as held: the
    // limit test counts them, the counters and the leak report do not.
    uint64_t reservedBytes ZYR_GUARDED_BY(mutex) = 0;
    unsigned int peakBytes ZYR_GUARDED_BY(mutex) = 0;
    std::map<void*, AllocationEntry>
        allocations ZYR_GUARDED_BY(mutex); // block -> serial and requested size
    std::map<void*, unsigned int> virtualBlocks ZYR_GUARDED_BY(mutex); // base -> stack identifier
    CZYRSmartPtr<IStackWalker> walker ZYR_GUARDED_BY(mutex){IImpStackWalkerStub::create()};
    unsigned int breakAtSerial ZYR_GUARDED_BY(mutex) = ~0u;

    void reset() ZYR_REQUIRES(mutex) {
        allocCount = reallocCount = freeCount = currentBytes = peakBytes = 0;
        reservedBytes = 0;
        allocations.clear();
        virtualBlocks.clear();
        breakAtSerial = ~0u;
    }
};

Tracker& tracker() {
    static detail::NoDestructor<Tracker> instance;
    return *instance;
}

bool debuggerAttached() {
    std::ifstream status("/proc/self/status");
    std::string line;
    while (std::getline(status, line))
        if (line.rfind("TracerPid:", 0) == 0)
            return std::atoi(line.c_str() + 10) != 0;
    return false;
}

// Caller holds the tracker mutex.
void recordAllocLocked(Tracker& t, void* block, uint64_t bytes, uint32_t requested)
    ZYR_REQUIRES(t.mutex) {
    t.currentBytes += static_cast<unsigned int>(bytes);
    t.allocCount += 1;
    t.peakBytes = std::max(t.peakBytes, t.currentBytes);
    if (t.allocCount == t.breakAtSerial && debuggerAttached())
        std::raise(SIGTRAP);
    if (statLevel >= 2 && block)
        t.allocations[block] = {t.allocCount, requested};
}

bool trackerLimitTestLocked(const Tracker& t, uint64_t add, uint64_t sub) ZYR_REQUIRES(t.mutex) {
    // Relaxed: the limit is one word read on its own; a lowering racing with this test may
    // apply from the next request.
    const uint64_t limit = memLimitBytes.load(std::memory_order_relaxed);
    if (limit >= detail::kGuardedLimitCeiling)
        return true;
    return !(t.currentBytes + t.reservedBytes + add - sub > limit && usageCheckOn());
}

// Caller holds the tracker mutex. The test and the reservation in one hold: a thread that
// tests after us sees our bytes, so two requests can never both take the last room. A
// shrink only tests; it gives its bytes back once the host has resized.
bool trackerReserveLocked(Tracker& t, uint64_t add, uint64_t sub) ZYR_REQUIRES(t.mutex) {
    if (!trackerLimitTestLocked(t, add, sub))
        return false;
    if (add > sub)
        t.reservedBytes += add - sub;
    return true;
}

// ---- plain variants -------------------------------------------------------------------

uint32_t& plainSize(void* block) {
    return *static_cast<uint32_t*>(block);
}
void* plainBlock(void* p) {
    return static_cast<unsigned char*>(p) - kPlainHeader;
}
void* plainUser(void* block) {
    return static_cast<unsigned char*>(block) + kPlainHeader;
}

void* plainAlloc(unsigned int size) {
    if (size == 0)
        return nullptr;
    // The bytes are reserved before the host is asked, so the total never passes the limit.
    const uint64_t accounted = round8(size);
    const bool reused = mayReusePendingFrees() && takePendingFrees(pendingFrees, accounted);
    if (!reused && !detail::plainLimitTest(accounted, 0, true)) {
        detail::sendOutOfMemoryNotice();
        return nullptr;
    }
    void* block = host.allocProc(size + kPlainHeader, host.clientData);
    if (!block) {
        detail::plainUsageSub(accounted);
        return nullptr;
    }
    plainSize(block) = size;
    return plainUser(block);
}

void plainFree(void* p) {
    void* block = plainBlock(p);
    const uint64_t accounted = round8(plainSize(block));
    host.freeProc(block, host.clientData);
    PendingFrees& pending = pendingFrees;
    if (pending.exited) {
        // Relaxed: a counter; only its atomicity matters.
        totalUsage.fetch_sub(accounted, std::memory_order_relaxed);
        return;
    }
    if (!pending.registered)
        registerPendingFrees(pending);
    // Relaxed: only this thread adds here; a draining thread's exchange takes them all.
    if (pending.bytes.fetch_add(accounted, std::memory_order_relaxed) + accounted >
        kPendingFreeLimit)
        flushPendingFrees(pending);
}

void* plainRealloc(void* p, unsigned int size) {
    void* block = plainBlock(p);
    const uint64_t oldAccounted = round8(plainSize(block));
    const uint64_t newAccounted = round8(size);
    const bool grows = newAccounted > oldAccounted;
    if (!detail::plainLimitTest(newAccounted, oldAccounted, grows)) {
        detail::sendOutOfMemoryNotice();
        return nullptr;
    }
    void* resized = host.reallocProc(block, size + kPlainHeader, host.clientData);
    if (!resized) {
        if (grows)
            detail::plainUsageSub(newAccounted - oldAccounted);
        return nullptr;
    }
    plainSize(resized) = size;
    if (!grows)
        detail::plainUsageSub(oldAccounted - newAccounted);
    return plainUser(resized);
}

// ---- guarded variants -----------------------------------------------------------------

GuardHeader* guardHeader(void* p) {
    return reinterpret_cast<GuardHeader*>(static_cast<unsigned char*>(p) - kGuardHeader);
}

void writeGuards(unsigned char* block, uint32_t size) {
    auto* header = reinterpret_cast<GuardHeader*>(block);
    header->size = size;
    header->padding = 0;
    header->headGuard = kGuardWord;
    std::memcpy(block + kGuardHeader + size, &kGuardWord, sizeof kGuardWord);
}

void* guardedAlloc(unsigned int size) {
    const uint32_t n = std::max(size, 1u);
    const uint64_t accounted = guardedAccounted(n);
    Tracker& t = tracker();
    bool reserved;
    {
        detail::LockGuard lock(t.mutex);
        reserved = trackerReserveLocked(t, accounted, 0);
    }
    if (!reserved) {
        detail::sendOutOfMemoryNotice(); // outside the tracker lock: reporting allocates
        return nullptr;
    }
    auto* block = static_cast<unsigned char*>(host.allocProc(n + kGuardOverhead, host.clientData));
    detail::LockGuard lock(t.mutex);
    t.reservedBytes -= accounted;
    if (!block)
        return nullptr;
    recordAllocLocked(t, block, accounted, n);
    writeGuards(block, n);
    reinterpret_cast<GuardHeader*>(block)->stackId = t.walker->capture(10, 2, 32, n);
    return block + kGuardHeader;
}

void guardedFree(void* p) {
    GuardHeader* header = guardHeader(p);
    Tracker& t = tracker();
    {
        detail::LockGuard lock(t.mutex);
        t.freeCount += 1;
        t.currentBytes -= static_cast<unsigned int>(guardedAccounted(header->size));
        if (statLevel >= 2)
            t.allocations.erase(header);
        if (header->stackId != 0) {
            t.walker->release(header->stackId, header->size);
            header->stackId = 0;
        }
    }
    host.freeProc(header, host.clientData);
}

void* guardedRealloc(void* p, unsigned int size) {
    GuardHeader* header = guardHeader(p);
    const uint32_t oldSize = header->size;
    const uint64_t oldAccounted = guardedAccounted(oldSize);
    const uint64_t newAccounted = guardedAccounted(size);
    Tracker& t = tracker();
    bool reserved;
    {
        detail::LockGuard lock(t.mutex);
        reserved = trackerReserveLocked(t, newAccounted, oldAccounted);
    }
    if (!reserved) {
        detail::sendOutOfMemoryNotice();
        return nullptr;
    }
    auto* resized = static_cast<unsigned char*>(
        host.reallocProc(header, size + kGuardOverhead, host.clientData));
    detail::LockGuard lock(t.mutex);
    if (newAccounted > oldAccounted)
        t.reservedBytes -= newAccounted - oldAccounted;
    if (!resized)
        return nullptr;
    t.reallocCount += 1;
    t.currentBytes += static_cast<unsigned int>(newAccounted - oldAccounted);
    t.peakBytes = std::max(t.peakBytes, t.currentBytes);
    if (statLevel >= 2) {
        if (auto node = t.allocations.extract(header)) {
            node.key() = resized;
            node.mapped().size = size;
            t.allocations.insert(std::move(node));
        }
    }
    t.walker->resize(reinterpret_cast<GuardHeader*>(resized)->stackId, oldSize, size);
    writeGuards(resized, size);
    return resized + kGuardHeader;
}

// ---- the table the front calls through ------------------------------------------------

struct FrontTable {
    void* (*allocate)(unsigned int);
    void (*free)(void*);
    void* (*reallocate)(void*, unsigned int);
};

constexpr FrontTable kPlainFront{plainAlloc, plainFree, plainRealloc};
constexpr FrontTable kGuardedFront{guardedAlloc, guardedFree, guardedRealloc};
// Filled with the plain variants at load so that a call before start-up is still sound.
constinit FrontTable front = kPlainFront;

void* sureResult(void* p, int line) {
    if (!p)
        throw CZYRError(ZYRPublic::kZYRErrorOutOfMemory, nullptr, kSource, line);
    return p;
}

thread_local bool sendingNotice = false;

} // namespace

// ---- front ------------------------------------------------------------------------------

void* ZYRMalloc(unsigned int size) {
    return front.allocate(size);
}

void* ZYRCalloc(unsigned int count, unsigned int size) {
    const unsigned int bytes = count * size; // 32-bit product, as callers were promised
    void* p = front.allocate(bytes);
    if (p)
        std::memset(p, 0, bytes);
    return p;
}

void* ZYRRealloc(void* p, unsigned int size) {
    if (size == 0)
        return p;
    if (!p)
        return front.allocate(size);
    return front.reallocate(p, size);
}

void ZYRFree(void* p) {
    if (p)
        front.free(p);
}

unsigned int ZYRMemSize(void* p) {
    if (!p)
        return 0;
    return statLevel != 0 ? guardHeader(p)->size : plainSize(plainBlock(p));
}

void* ZYRSureMalloc(unsigned int size) {
    return sureResult(ZYRMalloc(size), 2042);
}
void* ZYRSureCalloc(unsigned int count, unsigned int size) {
    return sureResult(ZYRCalloc(count, size), 2050);
}
void* ZYRSureRealloc(void* p, unsigned int size) {
    return sureResult(ZYRRealloc(p, size), 2058);
}

void ZYRDbgCheckZYRMemAllocPtr(void* p) {
    // Plain blocks carry no guards: there is nothing to check, and nothing safe to read.
    if (!p || statLevel == 0)
        return;
    const auto invalid = [] {
        return CZYRError(ZYRPublic::kZYRErrorFatal, "ZYRCheckZYRMemAllocPtr:: ptr is invalid",
                         kSource, kInvalidPointerLine);
    };
    // The tail guard sits at the header's size: that size is read only once the head guard
    // holds and, where the allocation map exists, once the map confirms it, so that a damaged
    // block cannot send the check itself out of bounds.
    const GuardHeader* header = guardHeader(p);
    if (header->headGuard != kGuardWord)
        throw invalid();
    if (statLevel >= 2) {
        Tracker& t = tracker();
        detail::LockGuard lock(t.mutex);
        const auto found = t.allocations.find(const_cast<GuardHeader*>(header));
        if (found == t.allocations.end() || found->second.size != header->size)
            throw invalid();
    }
    uint32_t tail;
    std::memcpy(&tail, static_cast<unsigned char*>(p) + header->size, sizeof tail);
    if (tail != kGuardWord)
        throw invalid();
}

sZYRDbgMemState ZYRMemMgr_dbgMemState() {
    if (statLevel < 1)
        return {};
    // Under the tracker lock: other threads update the counters meanwhile, and the five
    // must come from one moment.
    Tracker& t = tracker();
    detail::LockGuard lock(t.mutex);
    return {t.allocCount, t.reallocCount, t.freeCount, t.currentBytes, t.peakBytes};
}

// Relaxed: the counter is its own state; no data is published through it.
void EnableMemUsageCheck() {
    int current = usageCheckCounter.load(std::memory_order_relaxed);
    while (current < 1 && !usageCheckCounter.compare_exchange_weak(current, current + 1,
                                                                   std::memory_order_relaxed)) {
    }
}

void DisableMemUsageCheck() {
    usageCheckCounter.fetch_sub(1, std::memory_order_relaxed);
}

unsigned long long GetMemUsage() {
    if (statLevel != 0)
        return detail::trackerCurrentBytes();
    return detail::plainUsage();
}

void* Memcpy(void* dst, const void* src, unsigned int n) {
    return std::memcpy(dst, src, n);
}
void* Memmove(void* dst, const void* src, unsigned int n) {
    return std::memmove(dst, src, n);
}
void* Memset(void* dst, int value, unsigned int n) {
    return std::memset(dst, value, n);
}
int Memcmp(const void* a, const void* b, unsigned int n) {
    const int order = std::memcmp(a, b, n);
    return (order > 0) - (order < 0);
}

void ZYRSetMemLimit(unsigned long long limit) {
    if (limit >= memLimitBytes.load())
        return;
    if (limit < detail::kMinimumMemLimit) {
        memLimitBytes.store(detail::kMinimumMemLimit);
        memReserveBytes.store(detail::kDefaultMemReserve);
        return;
    }
    memLimitBytes.store(limit);
    if (memReserveBytes.load() > limit)
        memReserveBytes.store(limit);
}

unsigned long long ZYRGetMemLimit() {
    return memLimitBytes.load();
}
unsigned long long ZYRGetMemReserve() {
    return memReserveBytes.load();
}
void ZYRSetTestAvailablePhysicalMemory(bool test) {
    testAvailablePhysical.store(test);
}
bool ZYRGetTestAvailablePhysicalMemory() {
    return testAvailablePhysical.load();
}

void ZYRSetBreakOnAllocationCount(unsigned int serial) {
    Tracker& t = tracker();
    detail::LockGuard lock(t.mutex);
    t.breakAtSerial = serial;
}

int ZYRGetMemStatLevel() {
    return statLevel;
}

// ---- accounting shared with start-up and virtual memory ----------------------------------

namespace detail {

tZYRMemMgr crtMemMgr() {
    return {crtAlloc, crtRealloc, crtFree, nullptr};
}

tZYRMemMgr& hostMemMgr() {
    return host;
}

uint32_t processClockMs() {
    static const auto loaded = std::chrono::steady_clock::now();
    return static_cast<uint32_t>(std::chrono::duration_cast<std::chrono::milliseconds>(
                                     std::chrono::steady_clock::now() - loaded)
                                     .count());
}

void configureFront(int level) {
    Tracker& t = tracker();
    {
        detail::LockGuard lock(t.mutex);
        t.reset();
        if (level > 2)
            t.walker.reset(IImpStackWalkerStub::create());
    }
    drainAllPendingFrees();
    statLevel = level;
    front = level != 0 ? kGuardedFront : kPlainFront;
}

void setMemLimitRaw(uint64_t limit) {
    memLimitBytes.store(limit);
}
void setMemReserveRaw(uint64_t reserve) {
    memReserveBytes.store(reserve);
}
int memStatLevel() {
    return statLevel;
}
uint64_t memLimit() {
    return memLimitBytes.load();
}
uint64_t memReserve() {
    return memReserveBytes.load();
}

bool plainLimitTest(uint64_t add, uint64_t sub, bool move) {
    // One compare-exchange makes the test and the move indivisible without a lock. Relaxed:
    // the exchange compares the very value it replaces, whatever order other words are seen.
    uint64_t current = totalUsage.load(std::memory_order_relaxed);
    for (;;) {
        const uint64_t next = current + add - sub;
        if (next > memLimitBytes.load(std::memory_order_relaxed) && usageCheckOn()) {
            // Bytes freed but not yet given back must never be what refuses a request.
            if (!drainAllPendingFrees())
                return false;
            current = totalUsage.load(std::memory_order_relaxed);
            continue;
        }
        if (!move)
            return true;
        if (totalUsage.compare_exchange_weak(current, next, std::memory_order_relaxed))
            return true;
    }
}

// Relaxed, as every move of the total: atomicity keeps the sum exact.
void plainUsageAdd(uint64_t bytes) {
    totalUsage.fetch_add(bytes, std::memory_order_relaxed);
}
void plainUsageSub(uint64_t bytes) {
    totalUsage.fetch_sub(bytes, std::memory_order_relaxed);
}
uint64_t plainUsage() {
    // Every thread's pending frees go back first: a renderer thread that freed memory must
    // show as a drop to the thread that asked it to catch up.
    drainAllPendingFrees();
    // Relaxed: frees the caller waited for are ordered before it by that wait (a join, a
    // lock), and a read-modify-write chain is seen in its own order.
    return totalUsage.load(std::memory_order_relaxed);
}

bool trackerReserve(uint64_t bytes) {
    Tracker& t = tracker();
    detail::LockGuard lock(t.mutex);
    return trackerReserveLocked(t, bytes, 0);
}

void trackerUnreserve(uint64_t bytes) {
    Tracker& t = tracker();
    detail::LockGuard lock(t.mutex);
    t.reservedBytes -= bytes;
}

void trackerRecordAlloc(void* block, uint64_t bytes) {
    Tracker& t = tracker();
    detail::LockGuard lock(t.mutex);
    t.reservedBytes -= bytes;
    recordAllocLocked(t, block, bytes, 0);
}

void trackerRecordFree(void* block, uint64_t bytes) {
    Tracker& t = tracker();
    detail::LockGuard lock(t.mutex);
    t.freeCount += 1;
    t.currentBytes -= static_cast<unsigned int>(bytes);
    if (statLevel >= 2)
        t.allocations.erase(block);
}

void trackerRecordDecommit(uint64_t before, uint64_t after) {
    // One hold: freeing `before` and counting `after` anew in two steps would let another
    // thread take the `after` bytes in between and push the count past the limit.
    Tracker& t = tracker();
    detail::LockGuard lock(t.mutex);
    t.freeCount += 1;
    t.currentBytes -= static_cast<unsigned int>(before);
    if (after != 0)
        recordAllocLocked(t, nullptr, after, 0);
}

void trackerAddVirtualBlock(void* base, unsigned int stackId) {
    Tracker& t = tracker();
    detail::LockGuard lock(t.mutex);
    t.virtualBlocks[base] = stackId;
}

unsigned int trackerEraseVirtualBlock(void* base) {
    Tracker& t = tracker();
    detail::LockGuard lock(t.mutex);
    const auto found = t.virtualBlocks.find(base);
    if (found == t.virtualBlocks.end())
        return 0;
    const unsigned int id = found->second;
    t.virtualBlocks.erase(found);
    return id;
}

unsigned int trackerVirtualBlockId(void* base) {
    Tracker& t = tracker();
    detail::LockGuard lock(t.mutex);
    const auto found = t.virtualBlocks.find(base);
    return found == t.virtualBlocks.end() ? 0 : found->second;
}

uint64_t trackerCurrentBytes() {
    Tracker& t = tracker();
    detail::LockGuard lock(t.mutex);
    return t.currentBytes;
}

IStackWalker& stackWalker() {
    Tracker& t = tracker();
    detail::LockGuard lock(t.mutex); // the walker is only replaced at start-up, under the lock
    return *t.walker;
}

void sendOutOfMemoryNotice() {
    // Reporting allocates, and that allocation may itself fail the limit test: one
    // notice per thread at a time.
    if (sendingNotice)
        return;
    sendingNotice = true;
    try {
        reportUniqueToProcessStack(
            ZYRMakeErrorInfo(static_cast<short>(0xFFFF), u"Insufficient Memory.\n"));
    } catch (...) {
        // The notice is advice; the caller already gets its null.
    }
    sendingNotice = false;
}

void dumpMemList(ZYRPublic::tZYRTraceMsgCallback proc, void* data) {
    if (statLevel < 1 || !proc)
        return;
    const CZYRThreadSpecificPtr* thread = GetCZYRThreadSpecificPtr();
    char line[1024];
    auto emit = [&](int32_t level, uint32_t srcLine) {
        ZYRPublic::sZYRTraceMsg msg{line, nullptr};
        ZYRPublic::sZYRTraceMsgDetail detail{
            level,
            kSource,
            srcLine,
            thread ? thread->getThreadName() : nullptr,
            thread ? thread->getThreadId() : 0,
            processClockMs(),
        };
        proc(&msg, &detail, data);
    };

    Tracker& t = tracker();
    detail::LockGuard lock(t.mutex);
    if (statLevel >= 2) {
        std::map<unsigned int, void*> bySerial;
        for (const auto& [block, entry] : t.allocations)
            bySerial.emplace(entry.serial, block);
        uint32_t largestSize = 0;
        uint32_t largestSerial = 0;
        for (const auto& [serial, block] : bySerial) {
            const auto virtualBlock = t.virtualBlocks.find(block);
            const bool isVirtual = virtualBlock != t.virtualBlocks.end();
            const auto size = isVirtual ? static_cast<uint32_t>(virtualRegionSize(block))
                                        : static_cast<const GuardHeader*>(block)->size;
            const uint32_t stackId =
                isVirtual ? virtualBlock->second : static_cast<const GuardHeader*>(block)->stackId;
            std::snprintf(line, sizeof line,
                          "ZYRMem: Leaked %8u bytes at Memory Ptr:: %#lx, Allocation Count = %8u\n",
                          size, static_cast<unsigned long>(reinterpret_cast<uintptr_t>(block)),
                          serial);
            emit(6, 1421);
            if (stackId != 0) {
                line[0] = '\0';
                t.walker->describe(stackId, line, sizeof line);
                line[sizeof line - 1] = '\0';
                emit(8, 1434);
            }
            if (size > largestSize) {
                largestSize = size;
                largestSerial = serial;
            }
        }
        std::snprintf(line, sizeof line,
                      "ZYRMem: Largest leak %8u bytes at Allocation Count = %8u\n", largestSize,
                      largestSerial);
        emit(6, 1446);
    }
    std::snprintf(line, sizeof line, "ZYRMem: Total Leaked: %u bytes\n", t.currentBytes);
    emit(3, 1461);
    std::snprintf(line, sizeof line, "ZYRMem: Peak memory consumption: %u bytes\n", t.peakBytes);
    emit(4, 1473);
}

} // namespace detail

} // namespace ZYRStd
