// The reference-counted pointer to interfaces that cross the library boundary.
#pragma once

#include "ZYRRefCount.h"

namespace ZYRPublic {

template <class T> class C_SmartPtr : public ZYRStd::detail::IntrusivePtr<T> {
    using Base = ZYRStd::detail::IntrusivePtr<T>;

public:
    C_SmartPtr() noexcept = default;
    // `addRef` false adopts the reference the caller already holds.
    C_SmartPtr(T* p, bool addRef) noexcept : Base(p, addRef) {}
    template <class U> C_SmartPtr(const C_SmartPtr<U>& other) noexcept : Base(other.get(), true) {}

    bool isNull() const noexcept { return this->get() == nullptr; }
};

} // namespace ZYRPublic
