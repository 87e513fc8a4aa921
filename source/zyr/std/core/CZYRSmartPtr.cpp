// Reference counting on bare words and storage for smart-pointer containers.
#include "zyr/std/core/CZYRSmartPtr.h"

#include <atomic>

#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/ZYRMem.h"

namespace ZYRStd {

namespace {
// Hosts see these in the error record; they stay put when this file changes.
constexpr const char* kSource = "source/zyr/std/CZYRSmartPtr";
constexpr int kContainerAllocationLine = 242;

std::atomic_ref<unsigned int> countOf(unsigned int* count) {
    return std::atomic_ref<unsigned int>(*count);
}
std::atomic_ref<unsigned int> countOf(const unsigned int* count) {
    // atomic_ref needs a non-const referent even for loads.
    return std::atomic_ref<unsigned int>(*const_cast<unsigned int*>(count));
}
} // namespace

void ZYRIncrementRefCnt_ThreadSafe(unsigned int* count) {
    auto word = countOf(count);
    detail::RefCountOps::increment(word);
}

unsigned int ZYRDecrementRefCnt_ThreadSafe(unsigned int* count) {
    auto word = countOf(count);
    return detail::RefCountOps::decrement(word);
}

bool ZYRIsShared_ThreadSafe(const unsigned int* count) {
    return detail::RefCountOps::value(countOf(count)) > 1;
}

unsigned int ZYRPeekValue_ThreadSafe(const unsigned int* count) {
    return detail::RefCountOps::value(countOf(count));
}

void* czyrsmartptralloc(unsigned int size) {
    void* p = ZYRMalloc(size == 0 ? 1 : size);
    if (!p)
        throw CZYRError(ZYRPublic::kZYRErrorOutOfMemory, "allocating smart ptr container", kSource,
                        kContainerAllocationLine);
    return p;
}

void czyrsmartptrfree(void* p) {
    if (p)
        ZYRFree(p);
}

CZYRBaseRefCnt::~CZYRBaseRefCnt() = default;
CZYRPublicRefCountBase::~CZYRPublicRefCountBase() = default;

} // namespace ZYRStd
