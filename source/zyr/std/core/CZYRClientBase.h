// The root of the library's classes: their storage comes from the allocation front.
#pragma once

#include <cstddef>

#include "ZYRStdExport.h"

namespace ZYRStd {

class ZYRSTD_API CZYRClientBase {
public:
    CZYRClientBase() = default;
    CZYRClientBase(const CZYRClientBase&) = default;
    CZYRClientBase& operator=(const CZYRClientBase&) = default;
    virtual ~CZYRClientBase();

    // Retries through the installed new-handler; throws ZYROutOfMemoryError without one.
    static void* operator new(std::size_t size);
    static void* operator new[](std::size_t size);
    static void operator delete(void* p) noexcept;
    static void operator delete[](void* p) noexcept;
    static void* operator new(std::size_t, void* where) noexcept { return where; }
    static void operator delete(void*, void*) noexcept {}
};

} // namespace ZYRStd
