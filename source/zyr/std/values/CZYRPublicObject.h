/// \file
/// What every library object behind a public interface shares, and what every value
/// wrapper around such an interface shares.
#pragma once

#include <cstdint>
#include <utility>

#include "C_SmartPtr.h"
#include "zyr/std/core/CZYRClientBase.h"
#include "zyr/std/core/CZYRSmartPtr.h"

namespace ZYRStd {

/// The reference-count protocol of the public interfaces; the last release deletes the
/// object, whose storage goes back through CZYRClientBase.
template <class Interface> class CZYRPublicObject : public Interface, public CZYRClientBase {
public:
    /// addRef takes a reference, release drops one (the last deletes the object), isShared
    /// tells whether more than one is held; the debug pair shows the count. Any thread.
    ///@{
    void addRef() override { rc_.addRef(); }
    void release() override {
        if (rc_.release())
            delete this;
    }
    bool isShared() const override { return rc_.isShared(); }
    unsigned int debugGetRefCount() const override { return rc_.debugGetRefCount(); }
    const unsigned int* debugGetRefCountAddr() const override { return rc_.debugGetRefCountAddr(); }
    ///@}

protected:
    CZYRPublicObject() = default;

private:
    CZYRPublicRefCountBase rc_;
};

/// A value that shares one interface object: copies add a reference, destruction releases.
/// A null object makes the value invalid.
template <class Interface> class CZYRInterfaceValue : public CZYRClientBase {
public:
    /// The object, borrowed; null when invalid.
    Interface* getImpl() const { return impl_; }
    /// True when an object is held.
    bool isValid() const { return impl_ != nullptr; }
    /// A new reference to the object, for the interface calls.
    operator ZYRPublic::C_SmartPtr<Interface>() const {
        return ZYRPublic::C_SmartPtr<Interface>(impl_, true);
    }

protected:
    CZYRInterfaceValue() = default;
    /// Holds `object`, taking a reference with `addRef`, else adopting the caller's.
    CZYRInterfaceValue(Interface* object, bool addRef) : impl_(object) {
        if (impl_ && addRef)
            impl_->addRef();
    }
    /// Shares the object: one more reference.
    CZYRInterfaceValue(const CZYRInterfaceValue& other) : CZYRClientBase(), impl_(other.impl_) {
        if (impl_)
            impl_->addRef();
    }
    /// Takes the other's reference; the other becomes invalid.
    CZYRInterfaceValue(CZYRInterfaceValue&& other) noexcept
        : CZYRClientBase(), impl_(std::exchange(other.impl_, nullptr)) {}
    /// The new object gains its reference before the old one may go.
    CZYRInterfaceValue& operator=(const CZYRInterfaceValue& other) {
        if (other.impl_ != impl_) {
            if (other.impl_)
                other.impl_->addRef();
            adopt(other.impl_);
        }
        return *this;
    }
    /// Takes the other's reference, releasing the one held before.
    CZYRInterfaceValue& operator=(CZYRInterfaceValue&& other) noexcept {
        if (this != &other)
            adopt(std::exchange(other.impl_, nullptr));
        return *this;
    }
    ~CZYRInterfaceValue() override {
        if (impl_)
            impl_->release();
    }

    /// Takes over a reference the caller holds, releasing the current object.
    void adopt(Interface* object) {
        if (Interface* old = std::exchange(impl_, object))
            old->release();
    }

    /// The held object, with one reference; null when invalid.
    Interface* impl_ = nullptr;
};

} // namespace ZYRStd
