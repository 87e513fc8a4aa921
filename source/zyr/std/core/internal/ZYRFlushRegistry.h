// The registry of flushable memory clients; not exported.
#pragma once

#include <mutex>
#include <vector>

#include "zyr/std/core/I_FlushableMemoryClient.h"
#include "zyr/std/core/ZYRThreadSafety.h"

namespace ZYRStd::detail {

struct FlushRegistry {
    // Held for a whole flush, calls into the clients included.
    detail::RecursiveMutex mutex;
    // Taken inside `mutex` by every change of the lists, so that a reader holding only this
    // one sees them whole without waiting behind a flush (which may wait on that reader).
    detail::Mutex listMutex;
    // Every client, in registration order; and the clients callable from any thread.
    std::vector<I_FlushableMemoryClient*> main ZYR_GUARDED_BY(listMutex);
    std::vector<I_FlushableMemoryClient*> threadSafe ZYR_GUARDED_BY(listMutex);

    // The lists as a flush reads them: every change holds `mutex` as well, so holding it
    // alone is enough to read (the analysis knows only one guard per field).
    const std::vector<I_FlushableMemoryClient*>& mainForFlush() const ZYR_REQUIRES(mutex)
        ZYR_NO_THREAD_SAFETY_ANALYSIS {
        return main;
    }
    const std::vector<I_FlushableMemoryClient*>& threadSafeForFlush() const ZYR_REQUIRES(mutex)
        ZYR_NO_THREAD_SAFETY_ANALYSIS {
        return threadSafe;
    }
};

FlushRegistry& flushRegistry();

} // namespace ZYRStd::detail
