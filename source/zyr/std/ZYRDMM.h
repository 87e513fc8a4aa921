// The dynamic memory manager: allocation that asks the renderer and flushable clients for
// memory before it fails.
#pragma once

#include "ZYRStdExport.h"
#include "eFlushMemorySeverity.h"
#include "zyr/std/I_FlushableMemoryClient.h"

namespace ZYRStd {

class I_VariableSizeAllocator;

ZYRSTD_API void* ZYRDMMMalloc(unsigned int size, const char* clientName,
                              I_VariableSizeAllocator* subAllocator, unsigned int* actualSize,
                              void* requester, eFlushMemorySeverity severity);
ZYRSTD_API void ZYRDMMFree(void* p, const char* clientName, I_VariableSizeAllocator* subAllocator);

} // namespace ZYRStd
