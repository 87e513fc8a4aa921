// Class-level allocation of library objects through the front.
#include "zyr/std/core/CZYRClientBase.h"

#include <algorithm>
#include <new>

#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/ZYRMem.h"

namespace ZYRStd {

namespace {
// Hosts see these in the error record; they stay put when this file changes.
constexpr const char* kSource = "source/zyr/std/CZYRClientBase";
constexpr int kOutOfMemoryLine = 92;

void* allocateClient(std::size_t size) {
    // The front counts in 32 bits; a larger request cannot be served, only refused.
    if (size > 0xFFFFFFFFu)
        throw ZYROutOfMemoryError(kSource, kOutOfMemoryLine);
    const auto n = static_cast<unsigned int>(std::max<std::size_t>(size, 1));
    for (;;) {
        if (void* block = ZYRMalloc(n))
            return block;
        const std::new_handler handler = std::get_new_handler();
        if (!handler)
            throw ZYROutOfMemoryError(kSource, kOutOfMemoryLine);
        handler();
    }
}
} // namespace

CZYRClientBase::~CZYRClientBase() = default;

void* CZYRClientBase::operator new(std::size_t size) {
    return allocateClient(size);
}

void* CZYRClientBase::operator new[](std::size_t size) {
    return allocateClient(size);
}

void CZYRClientBase::operator delete(void* p) noexcept {
    ZYRFree(p);
}

void CZYRClientBase::operator delete[](void* p) noexcept {
    ZYRFree(p);
}

} // namespace ZYRStd
