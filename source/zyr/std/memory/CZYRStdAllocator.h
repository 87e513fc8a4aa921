// The standard-container allocator of the library, over the dynamic memory manager.
#pragma once

#include <algorithm>
#include <cstddef>

#include "zyr/std/core/CZYRError.h"
#include "zyr/std/memory/ZYRDMM.h"

namespace ZYRStd {

template <class T> class CZYRStdAllocator {
public:
    using value_type = T;

    CZYRStdAllocator() noexcept = default;
    template <class U> CZYRStdAllocator(const CZYRStdAllocator<U>&) noexcept {}

    T* allocate(std::size_t n) {
        const std::size_t bytes = std::max<std::size_t>(n, 1) * sizeof(T);
        void* p = bytes > 0xFFFFFFFFu
                      ? nullptr
                      : ZYRDMMMalloc(static_cast<unsigned int>(bytes), "CZYRSTDALLOCATOR", nullptr,
                                     nullptr, nullptr, ZYRPublic::eFlushMemorySeverityNormal);
        if (!p)
            throw CZYRBadAlloc("Mem error in ZYRStdAllocator", "source/zyr/std/CZYRStdAllocator",
                               94);
        return static_cast<T*>(p);
    }
    void deallocate(T* p, std::size_t) noexcept { ZYRDMMFree(p, "CZYRSTDALLOCATOR", nullptr); }

    template <class U> bool operator==(const CZYRStdAllocator<U>&) const noexcept { return true; }
};

} // namespace ZYRStd
