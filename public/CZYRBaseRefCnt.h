/// \file
/// The count base of internally shared objects and the pointer that holds them; the stream
/// and file-system interfaces derive from it, so it sits beside them above the library.
#pragma once

#include "ZYRRefCount.h"
#include "ZYRStdExport.h"

namespace ZYRStd {

/// Base of internally shared objects; created with one reference held by its creator.
class ZYRSTD_API CZYRBaseRefCnt {
public:
    CZYRBaseRefCnt() noexcept = default;
    /// A copy starts with the source's count word, as a memberwise copy would.
    CZYRBaseRefCnt(const CZYRBaseRefCnt&) noexcept = default;
    /// Copies the count word, as a memberwise copy would.
    CZYRBaseRefCnt& operator=(const CZYRBaseRefCnt&) noexcept = default;
    virtual ~CZYRBaseRefCnt();

    /// Takes one more reference; any thread.
    void addRef() const noexcept { count_.increment(); }
    /// Drops one reference; the last one deletes the object.
    void release() const noexcept {
        if (count_.decrement() == 0)
            delete this;
    }
    /// True while more than one reference is held.
    bool isShared() const noexcept { return count_.value() > 1; }
    /// The present count, for diagnostics.
    int peekRefCnt() const noexcept { return static_cast<int>(count_.value()); }

private:
    detail::RefCountWord count_;
};

/// Shared pointer over CZYRBaseRefCnt objects.
template <class T> class CZYRSmartZYRRefPtr : public detail::IntrusivePtr<T> {
    using Base = detail::IntrusivePtr<T>;

public:
    CZYRSmartZYRRefPtr() noexcept = default;
    /// Adopts the creator's reference unless `addRef` asks for a new one.
    explicit CZYRSmartZYRRefPtr(T* p, bool addRef = false) noexcept : Base(p, addRef) {}
    /// Shares an object of a derived type: one more reference.
    template <class U>
    CZYRSmartZYRRefPtr(const CZYRSmartZYRRefPtr<U>& other) noexcept : Base(other.get(), true) {}
};

} // namespace ZYRStd
