// Process-wide unique identifiers.
#include "zyr/std/core/ZYRUniqueID.h"

#include <atomic>

namespace ZYRStd {

namespace {
constinit std::atomic<unsigned long long> lastUniqueID{0};
} // namespace

unsigned long long createUniqueID() {
    // Only distinctness matters, which the atomic increment alone guarantees.
    return lastUniqueID.fetch_add(1, std::memory_order_relaxed) + 1;
}

} // namespace ZYRStd
