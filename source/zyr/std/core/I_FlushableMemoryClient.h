/// \file
/// The interface of engine caches that can give memory back when an allocation fails.
#pragma once

#include "ZYRStdExport.h"
#include "eFlushMemorySeverity.h"

namespace ZYRStd {

using ZYRPublic::eFlushMemorySeverity;

/// An engine cache that gives memory back when an allocation fails. Registered with
/// ZYRRegisterFlushableMemoryClient; the manager calls it on the allocating thread while
/// it holds the registry mutex, so a client must not register or allocate with recovery
/// from inside flushMemory.
class ZYRSTD_API I_FlushableMemoryClient {
public:
    virtual ~I_FlushableMemoryClient();
    /// True when the client freed memory; `reserved` is always 0.
    virtual bool flushMemory(unsigned int bytesNeeded, unsigned int reserved,
                             eFlushMemorySeverity severity) = 0;
    /// The bytes the client could give back now; larger clients are asked first.
    virtual unsigned int getFlushableMemorySize() = 0;
    /// May be null; the library prints "unknown" then.
    virtual const char* getClientName() = 0;
};

} // namespace ZYRStd
