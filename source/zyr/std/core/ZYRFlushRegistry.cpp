// The process-wide registry of flushable memory clients.
#include "zyr/std/core/internal/ZYRFlushRegistry.h"

#include "zyr/std/core/internal/ZYRNoDestructor.h"

namespace ZYRStd {

I_FlushableMemoryClient::~I_FlushableMemoryClient() = default;

namespace detail {

FlushRegistry& flushRegistry() {
    static NoDestructor<FlushRegistry> instance;
    return *instance;
}

} // namespace detail
} // namespace ZYRStd
