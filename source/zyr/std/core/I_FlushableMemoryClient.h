// The interface of engine caches that can give memory back when an allocation fails.
#pragma once

#include "ZYRStdExport.h"
#include "eFlushMemorySeverity.h"

namespace ZYRStd {

using ZYRPublic::eFlushMemorySeverity;

class ZYRSTD_API I_FlushableMemoryClient {
public:
    virtual ~I_FlushableMemoryClient();
    // True when the client freed memory; `reserved` is always 0.
    virtual bool flushMemory(unsigned int bytesNeeded, unsigned int reserved,
                             eFlushMemorySeverity severity) = 0;
    virtual unsigned int getFlushableMemorySize() = 0;
    // May be null; the library prints "unknown" then.
    virtual const char* getClientName() = 0;
};

} // namespace ZYRStd
