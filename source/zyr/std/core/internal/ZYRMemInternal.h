// Accounting shared by the heap front, virtual memory and start-up; not exported.
#pragma once

#include <cstdint>

#include "sZYRTraceMsg.h"
#include "zyr/std/core/ZYRStdInit.h"

namespace ZYRStd {
class IStackWalker;
}

namespace ZYRStd::detail {

constexpr uint64_t kDefaultMemReserve = 314572800;    // 300 MiB
constexpr uint64_t kMinimumMemLimit = 419430400;      // 400 MiB
constexpr uint64_t kGuardedLimitCeiling = 1ull << 32; // guarded tests pass at 4 GiB or more

// The C runtime heap as a host record: the default until the host hands over its own.
tZYRMemMgr crtMemMgr();
// The record the front calls through (the library's own copy of the host's).
tZYRMemMgr& hostMemMgr();

// Start-up: resets the tracker to `level` and picks the front variants.
void configureFront(int level);
// Milliseconds since the library was loaded, for time stamps.
uint32_t processClockMs();
void setMemLimitRaw(uint64_t limit);
void setMemReserveRaw(uint64_t reserve);

int memStatLevel();
uint64_t memLimit();
uint64_t memReserve();

// Plain accounting: the test and the move of the total are one atomic step. A request
// reserves its bytes this way before the host is asked and gives them back if the host fails.
bool plainLimitTest(uint64_t add, uint64_t sub, bool move);
void plainUsageAdd(uint64_t bytes);
void plainUsageSub(uint64_t bytes);
uint64_t plainUsage();

// Tracker accounting (statistics level 1 or more).
// Tests `bytes` against the limit and reserves them, in one lock hold.
bool trackerReserve(uint64_t bytes);
// Gives back what trackerReserve took for a request the system refused.
void trackerUnreserve(uint64_t bytes);
// Counts one allocation of `bytes` that trackerReserve took; at level 2 enters `block` into
// the allocation map.
void trackerRecordAlloc(void* block, uint64_t bytes);
void trackerRecordFree(void* block, uint64_t bytes);
// A block of `before` bytes now holds `after`: a free and, when bytes remain, an allocation.
void trackerRecordDecommit(uint64_t before, uint64_t after);
void trackerAddVirtualBlock(void* base, unsigned int stackId);
// Removes the block from the virtual-block map and returns its stack identifier.
unsigned int trackerEraseVirtualBlock(void* base);
unsigned int trackerVirtualBlockId(void* base);
uint64_t trackerCurrentBytes();
IStackWalker& stackWalker();

// The one place the front reports "Insufficient Memory.\n" when a limit test fails.
void sendOutOfMemoryNotice();

void dumpMemList(ZYRPublic::tZYRTraceMsgCallback proc, void* data);

// Size of a virtual-memory block as the region table records it (0 when unknown).
uint64_t virtualRegionSize(const void* base);

} // namespace ZYRStd::detail
