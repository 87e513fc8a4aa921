// Per-thread records over Boost.Thread's thread-specific storage.
#include "zyr/std/core/ZYRThread.h"

#include <boost/thread/tss.hpp>
#include <sys/syscall.h>
#include <unistd.h>

#include "zyr/std/core/ZYRUniqueID.h"

namespace ZYRStd {

namespace {
boost::thread_specific_ptr<CZYRThreadSpecificPtr>& threadRecordSlot() {
    static boost::thread_specific_ptr<CZYRThreadSpecificPtr> slot;
    return slot;
}
} // namespace

CZYRThreadSpecificPtr::CZYRThreadSpecificPtr(const char* name, bool blockable)
    : name_(name), id_(createUniqueID()), blockable_(blockable) {}

CZYRThreadSpecificPtr::~CZYRThreadSpecificPtr() = default;

CZYRThreadSpecificPtr* GetCZYRThreadSpecificPtr() {
    return threadRecordSlot().get();
}

void SetCZYRThreadSpecificPtr(CZYRThreadSpecificPtr* record) {
    auto& slot = threadRecordSlot();
    if (slot.get() != record)
        slot.reset(record);
}

// ZYRSingleThreadProcess reads the start-up option store, in ZYRStartupOptions.cpp.

uint32_t ZYRGetCurrentThreadId() {
    return static_cast<uint32_t>(::syscall(SYS_gettid));
}

} // namespace ZYRStd
