// The dynamic memory manager.
#include "zyr/std/ZYRDMM.h"

#include "zyr/std/ZYRMem.h"

namespace ZYRStd {

void* ZYRDMMMalloc(unsigned int size, const char*, I_VariableSizeAllocator*, unsigned int*, void*,
                   eFlushMemorySeverity) {
    if (size == 0)
        return nullptr;
    return ZYRMalloc(size);
}

void ZYRDMMFree(void* p, const char*, I_VariableSizeAllocator*) {
    ZYRFree(p);
}

} // namespace ZYRStd
