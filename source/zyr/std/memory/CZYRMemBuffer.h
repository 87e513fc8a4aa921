/// \file
/// A growable scratch buffer of elements whose storage comes from the dynamic memory manager.
#pragma once

#include <type_traits>

#include "zyr/std/core/CZYRClientBase.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/memory/ZYRDMM.h"

namespace ZYRStd {

/// Allocation policy: blocks from the dynamic memory manager under one client tag.
template <class T> struct CZYRMemBufferAlloc {
    static constexpr const char* kClientName =
        "CZYRMemBufferAlloc"; ///< the name the DMM log shows for these blocks
    /// Storage for `count` elements; throws kZYRErrorOutOfMemory on failure.
    static T* allocate(unsigned int count) {
        const unsigned long long bytes = static_cast<unsigned long long>(count) * sizeof(T);
        void* p = bytes > 0xFFFFFFFFull
                      ? nullptr
                      : ZYRDMMMalloc(static_cast<unsigned int>(bytes), kClientName, nullptr,
                                     nullptr, nullptr, ZYRPublic::eFlushMemorySeverityNormal);
        if (!p)
            throw CZYRError(ZYRPublic::kZYRErrorOutOfMemory, nullptr,
                            "source/zyr/std/CZYRMemBuffer", __LINE__);
        return static_cast<T*>(p);
    }
    /// Gives storage from allocate back.
    static void free(T* p) { ZYRDMMFree(p, kClientName, nullptr); }
};

/// The bound error of checked element access.
[[noreturn]] inline void throwInvalidMemBufferIndex(int line) {
    throw CZYRError(ZYRPublic::kZYRErrorBadParam, "invalid index", "source/zyr/std/CZYRMemBuffer",
                    line);
}

/// A scratch array of trivially copyable elements, storage from `Alloc`; sole owner
/// of its block, not copyable, one thread at a time.
template <class T, class Alloc> class CZYRBaseMemBuffer : public CZYRClientBase {
    static_assert(std::is_trivially_copyable_v<T>, "elements are raw storage");

public:
    CZYRBaseMemBuffer() = default;
    CZYRBaseMemBuffer(const CZYRBaseMemBuffer&) = delete;
    CZYRBaseMemBuffer& operator=(const CZYRBaseMemBuffer&) = delete;
    ~CZYRBaseMemBuffer() override {
        if (data_)
            Alloc::free(data_);
    }

    /// Replaces the block by one of `count` elements; the old contents are discarded.
    void grow(unsigned int count) {
        T* fresh = count ? Alloc::allocate(count) : nullptr;
        if (data_)
            Alloc::free(data_);
        data_ = fresh;
        count_ = count;
    }
    /// Checked access: throws kZYRErrorBadParam "invalid index" past the end.
    T& operator[](unsigned int index) {
        if (index >= count_)
            throwInvalidMemBufferIndex(__LINE__);
        return data_[index];
    }
    /// Checked access: throws kZYRErrorBadParam "invalid index" past the end.
    const T& operator[](unsigned int index) const {
        if (index >= count_)
            throwInvalidMemBufferIndex(__LINE__);
        return data_[index];
    }
    /// The number of elements.
    unsigned int count() const { return count_; }
    /// The elements, borrowed; null when empty.
    T* data() { return data_; }
    /// The elements, borrowed; null when empty.
    const T* data() const { return data_; }

private:
    unsigned int count_ = 0;
    T* data_ = nullptr;
};

/// The scratch buffer over the dynamic memory manager ("CZYRMemBufferAlloc" in its log).
template <class T> class CZYRMemBuffer : public CZYRBaseMemBuffer<T, CZYRMemBufferAlloc<T>> {};

} // namespace ZYRStd
