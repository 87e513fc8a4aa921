// Client identifiers and notification bookkeeping.
#include "zyr/std/memory/CZYRClientRegistry.h"

#include <algorithm>
#include <atomic>

#include "zyr/std/core/CZYRError.h"

namespace ZYRStd {

namespace {
// Hosts see these in the error record; they stay put when this file changes.
constexpr const char* kSource = "source/zyr/std/CZYRClientRegistry";
constexpr int kUnknownClientLine = 61;

constinit std::atomic<unsigned int> lastClientID{0};
} // namespace

CZYRClientRegistry::~CZYRClientRegistry() = default;

bool CZYRClientRegistry::notificationReceived(unsigned int id) const {
    const auto found = clients_.find(id);
    if (found == clients_.end())
        throw CZYRError(ZYRPublic::kZYRErrorBadParam, "CZYRClientRegistry:: Unknown clientID",
                        kSource, kUnknownClientLine);
    return found->second;
}

bool CZYRClientRegistry::allNotificationsReceived() const {
    return std::all_of(clients_.begin(), clients_.end(),
                       [](const Entry& entry) { return entry.second; });
}

unsigned int CZYRClientRegistrar::makeID(const void*) {
    // Relaxed: only distinctness matters, which the atomic increment alone guarantees.
    return lastClientID.fetch_add(1, std::memory_order_relaxed) + 1;
}

} // namespace ZYRStd
