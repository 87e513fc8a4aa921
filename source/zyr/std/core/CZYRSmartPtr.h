/// \file
/// Reference counting: the internal count base, the public count member, and their pointers.
#pragma once

#include <utility>

#include "CZYRBaseRefCnt.h"
#include "C_SmartPtr.h"
#include "ZYRStdExport.h"
#include "zyr/std/core/CZYRClientBase.h"

namespace ZYRStd {

/// Count operations on a bare word, atomic so they never tear (the word must be 4-byte
/// aligned). This one adds a reference.
ZYRSTD_API void ZYRIncrementRefCnt_ThreadSafe(unsigned int* count);
/// Drops a reference; returns the new count.
ZYRSTD_API unsigned int ZYRDecrementRefCnt_ThreadSafe(unsigned int* count);
/// True when the count is above 1.
ZYRSTD_API bool ZYRIsShared_ThreadSafe(const unsigned int* count);
/// The present count.
ZYRSTD_API unsigned int ZYRPeekValue_ThreadSafe(const unsigned int* count);

/// Storage for smart-pointer containers, from the front; throws on failure.
[[nodiscard]] ZYRSTD_API void* czyrsmartptralloc(unsigned int size);
/// Gives back storage from czyrsmartptralloc.
ZYRSTD_API void czyrsmartptrfree(void* p);

/// The count member behind every library implementation of a public interface.
class ZYRSTD_API CZYRPublicRefCountBase : public CZYRClientBase {
public:
    CZYRPublicRefCountBase() noexcept = default;
    /// Copies the count word, as a memberwise copy would.
    CZYRPublicRefCountBase(const CZYRPublicRefCountBase& other) noexcept
        : CZYRClientBase(), count_(other.count_) {}
    /// Copies the count word, as a memberwise copy would.
    CZYRPublicRefCountBase& operator=(const CZYRPublicRefCountBase&) noexcept = default;
    ~CZYRPublicRefCountBase() override;

    /// Takes one more reference; any thread.
    void addRef() const noexcept { count_.increment(); }
    /// True exactly for the call that took the count from 1 to 0; the owner deletes.
    [[nodiscard]] bool release() const noexcept { return count_.decrement() == 0; }
    /// A count of 0 also answers true.
    bool isShared() const noexcept { return count_.value() != 1; }
    /// The present count, for diagnostics.
    unsigned int debugGetRefCount() const noexcept { return count_.value(); }
    /// The address of the count word, for diagnostics.
    const unsigned int* debugGetRefCountAddr() const noexcept { return count_.address(); }

private:
    detail::RefCountWord count_;
};

/// Sole owner; deletes its object through the object's virtual destructor.
template <class T> class CZYRSmartPtr {
public:
    CZYRSmartPtr() noexcept = default;
    /// Takes ownership of `p`.
    explicit CZYRSmartPtr(T* p) noexcept : p_(p) {}
    CZYRSmartPtr(const CZYRSmartPtr&) = delete;
    CZYRSmartPtr& operator=(const CZYRSmartPtr&) = delete;
    virtual ~CZYRSmartPtr() { delete p_; }

    /// Deletes the object held and takes ownership of `p`.
    void reset(T* p = nullptr) noexcept {
        if (p != p_)
            delete std::exchange(p_, p);
    }
    /// The object, borrowed; null when empty.
    T* get() const noexcept { return p_; }
    /// The object, borrowed.
    T* operator->() const noexcept { return p_; }
    /// The object, borrowed; must not be null.
    T& operator*() const noexcept { return *p_; }
    /// True when an object is held.
    explicit operator bool() const noexcept { return p_ != nullptr; }

private:
    T* p_ = nullptr;
};

/// Marks classes that are never copied.
class CZYRPolicyNoCopy {
public:
    CZYRPolicyNoCopy() = default;
    CZYRPolicyNoCopy(const CZYRPolicyNoCopy&) = delete;
    CZYRPolicyNoCopy& operator=(const CZYRPolicyNoCopy&) = delete;
};

/// Lends a count to an object that has none; the box's storage comes from the front.
template <class T> class CZYRSmartRefPtrContainer : public CZYRBaseRefCnt {
public:
    /// How the object is destroyed with the box; null means delete.
    using Deleter = void (*)(T*);

    /// A box owning `object`, with one reference for the caller; throws when out of memory.
    static CZYRSmartRefPtrContainer* create(T* object, Deleter deleter = nullptr) {
        void* where = czyrsmartptralloc(sizeof(CZYRSmartRefPtrContainer));
        return ::new (where) CZYRSmartRefPtrContainer(object, deleter);
    }

    /// The boxed object, borrowed.
    T* getObject() const noexcept { return object_; }

    ~CZYRSmartRefPtrContainer() override {
        if (object_) {
            if (deleter_)
                deleter_(object_);
            else
                delete object_;
        }
    }

    /// The storage came from czyrsmartptralloc, so it goes back there.
    static void operator delete(void* p) noexcept { czyrsmartptrfree(p); }

private:
    CZYRSmartRefPtrContainer(T* object, Deleter deleter) noexcept
        : object_(object), deleter_(deleter) {}

    T* object_;
    Deleter deleter_;
};

} // namespace ZYRStd
