/// \file
/// The root of the library's classes: their storage comes from the allocation front.
#pragma once

#include <cstddef>

#include "ZYRStdExport.h"

namespace ZYRStd {

/// Root of the library's classes: its class-level operator new and delete take storage
/// from the allocation front (ZYRMalloc), so every object counts against the memory limit.
/// Any thread may allocate and free.
class ZYRSTD_API CZYRClientBase {
public:
    CZYRClientBase() = default;
    /// Copies nothing: the base has no state.
    CZYRClientBase(const CZYRClientBase&) = default;
    /// Copies nothing: the base has no state.
    CZYRClientBase& operator=(const CZYRClientBase&) = default;
    virtual ~CZYRClientBase();

    /// Retries through the installed new-handler; throws ZYROutOfMemoryError without one.
    static void* operator new(std::size_t size);
    /// As operator new, for arrays.
    static void* operator new[](std::size_t size);
    /// Gives the block back to the front; null is allowed.
    static void operator delete(void* p) noexcept;
    /// As operator delete, for arrays.
    static void operator delete[](void* p) noexcept;
    /// Placement form: builds the object at `where`, allocating nothing.
    static void* operator new(std::size_t, void* where) noexcept { return where; }
    /// Placement form: frees nothing.
    static void operator delete(void*, void*) noexcept {}
};

} // namespace ZYRStd
