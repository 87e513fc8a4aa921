// The count base of internally shared objects and the pointer that holds them; the stream
// and file-system interfaces derive from it, so it sits beside them above the library.
#pragma once

#include "ZYRRefCount.h"
#include "ZYRStdExport.h"

namespace ZYRStd {

// Base of internally shared objects; created with one reference held by its creator.
class ZYRSTD_API CZYRBaseRefCnt {
public:
    CZYRBaseRefCnt() noexcept = default;
    CZYRBaseRefCnt(const CZYRBaseRefCnt&) noexcept = default;
    CZYRBaseRefCnt& operator=(const CZYRBaseRefCnt&) noexcept = default;
    virtual ~CZYRBaseRefCnt();

    void addRef() const noexcept { count_.increment(); }
    void release() const noexcept {
        if (count_.decrement() == 0)
            delete this;
    }
    bool isShared() const noexcept { return count_.value() > 1; }
    int peekRefCnt() const noexcept { return static_cast<int>(count_.value()); }

private:
    detail::RefCountWord count_;
};

// Shared pointer over CZYRBaseRefCnt objects.
template <class T> class CZYRSmartZYRRefPtr : public detail::IntrusivePtr<T> {
    using Base = detail::IntrusivePtr<T>;

public:
    CZYRSmartZYRRefPtr() noexcept = default;
    // Adopts the creator's reference unless `addRef` asks for a new one.
    explicit CZYRSmartZYRRefPtr(T* p, bool addRef = false) noexcept : Base(p, addRef) {}
    template <class U>
    CZYRSmartZYRRefPtr(const CZYRSmartZYRRefPtr<U>& other) noexcept : Base(other.get(), true) {}
};

} // namespace ZYRStd
