// The registry of flushable memory clients; not exported.
#pragma once

#include <mutex>
#include <vector>

#include "zyr/std/core/I_FlushableMemoryClient.h"

namespace ZYRStd::detail {

struct FlushRegistry {
    // Held for a whole flush, calls into the clients included.
    std::recursive_mutex mutex;
    // Taken inside `mutex` by every change of the lists, so that a reader holding only this
    // one sees them whole without waiting behind a flush (which may wait on that reader).
    std::mutex listMutex;
    std::vector<I_FlushableMemoryClient*> main;       // every client, in registration order
    std::vector<I_FlushableMemoryClient*> threadSafe; // clients callable from any thread
};

FlushRegistry& flushRegistry();

} // namespace ZYRStd::detail
