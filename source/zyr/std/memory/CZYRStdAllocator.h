/// \file
/// The standard-container allocator of the library, over the dynamic memory manager.
#pragma once

#include <algorithm>
#include <cstddef>

#include "zyr/std/core/CZYRError.h"
#include "zyr/std/memory/ZYRDMM.h"

namespace ZYRStd {

/// Allocator for standard containers: blocks from the dynamic memory manager under the
/// client name "CZYRSTDALLOCATOR", so they count against the limit and may trigger
/// flushes. Stateless; any thread.
template <class T> class CZYRStdAllocator {
public:
    /// The element type.
    using value_type = T;

    CZYRStdAllocator() noexcept = default;
    /// Rebinding copy: stateless, so nothing to copy.
    template <class U> CZYRStdAllocator(const CZYRStdAllocator<U>&) noexcept {}

    /// Storage for `n` elements; throws CZYRBadAlloc on failure.
    T* allocate(std::size_t n) {
        const std::size_t bytes = std::max<std::size_t>(n, 1) * sizeof(T);
        void* p = bytes > 0xFFFFFFFFu
                      ? nullptr
                      : ZYRDMMMalloc(static_cast<unsigned int>(bytes), kClientName, nullptr,
                                     nullptr, nullptr, ZYRPublic::eFlushMemorySeverityNormal);
        if (!p)
            throw CZYRBadAlloc("Mem error in ZYRStdAllocator", kSource, kAllocationLine);
        return static_cast<T*>(p);
    }
    /// Gives storage from allocate back.
    void deallocate(T* p, std::size_t) noexcept { ZYRDMMFree(p, kClientName, nullptr); }

    /// Always true: any instance frees what another allocated.
    template <class U> bool operator==(const CZYRStdAllocator<U>&) const noexcept { return true; }

private:
    /// The name the memory manager's log shows for these blocks.
    static constexpr const char* kClientName = "CZYRSTDALLOCATOR";
    /// The record of a failed allocation, as hosts have always seen it.
    static constexpr const char* kSource = "source/zyr/std/CZYRStdAllocator";
    static constexpr int kAllocationLine = 94;
};

} // namespace ZYRStd
