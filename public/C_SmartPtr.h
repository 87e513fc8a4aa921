/// \file
/// The reference-counted pointer to interfaces that cross the library boundary.
#pragma once

#include "ZYRRefCount.h"

namespace ZYRPublic {

/// Holds one reference to a public interface (I_Dict, I_UniString, ...) and releases it
/// when destroyed. Copies add a reference; the count is atomic, so copies may live on any
/// thread.
template <class T> class C_SmartPtr : public ZYRStd::detail::IntrusivePtr<T> {
    using Base = ZYRStd::detail::IntrusivePtr<T>;

public:
    C_SmartPtr() noexcept = default;
    /// `addRef` false adopts the reference the caller already holds.
    C_SmartPtr(T* p, bool addRef) noexcept : Base(p, addRef) {}
    /// Shares an object of a derived interface: one more reference.
    template <class U> C_SmartPtr(const C_SmartPtr<U>& other) noexcept : Base(other.get(), true) {}

    /// True when no object is held.
    bool isNull() const noexcept { return this->get() == nullptr; }
};

} // namespace ZYRPublic
