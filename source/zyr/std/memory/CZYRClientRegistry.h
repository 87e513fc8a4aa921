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
    CZYRClientRegistry(const CZYRClientRegistry&) = default;
    CZYRClientRegistry& operator=(const CZYRClientRegistry&) = default;
    ~CZYRClientRegistry() override;

    void registerClient(unsigned int id) { clients_[id] = false; }
    void markNotification(unsigned int id) { clients_[id] = true; }
    /// Throws kZYRErrorBadParam for an identifier never registered or marked.
    bool notificationReceived(unsigned int id) const;
    bool allNotificationsReceived() const;

private:
    using Entry = std::pair<const unsigned int, bool>;
    std::map<unsigned int, bool, std::less<unsigned int>, CZYRStdAllocator<Entry>> clients_;
};

class ZYRSTD_API CZYRClientRegistrar : public CZYRClientBase {
public:
    /// 1 first; safe from any thread. The argument is not used.
    static unsigned int makeID(const void* client);

private:
    CZYRClientRegistrar() = default;
};

} // namespace ZYRStd
