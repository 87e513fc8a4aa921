/// \file
/// Client identifiers and the record of which clients acknowledged a notification.
#pragma once

#include <functional>
#include <map>

#include "ZYRStdExport.h"
#include "zyr/std/core/CZYRClientBase.h"
#include "zyr/std/memory/CZYRStdAllocator.h"

namespace ZYRStd {

/// No lock of its own: its owner serialises access.
class ZYRSTD_API CZYRClientRegistry : public CZYRClientBase {
public:
    CZYRClientRegistry() = default;
    /// Copies the record of every client.
    CZYRClientRegistry(const CZYRClientRegistry&) = default;
    /// Copies the record of every client.
    CZYRClientRegistry& operator=(const CZYRClientRegistry&) = default;
    ~CZYRClientRegistry() override;

    /// Adds client `id` (or resets it) as not yet notified.
    void registerClient(unsigned int id) { clients_[id] = false; }
    /// Records that client `id` acknowledged the notification.
    void markNotification(unsigned int id) { clients_[id] = true; }
    /// Throws kZYRErrorBadParam for an identifier never registered or marked.
    bool notificationReceived(unsigned int id) const;
    /// True when every registered client has acknowledged.
    bool allNotificationsReceived() const;

private:
    using Entry = std::pair<const unsigned int, bool>;
    std::map<unsigned int, bool, std::less<unsigned int>, CZYRStdAllocator<Entry>> clients_;
};

/// Hands out client identifiers for CZYRClientRegistry.
class ZYRSTD_API CZYRClientRegistrar : public CZYRClientBase {
public:
    /// 1 first; safe from any thread. The argument is not used.
    static unsigned int makeID(const void* client);

private:
    CZYRClientRegistrar() = default;
};

} // namespace ZYRStd
