// The count base of internally shared objects and the pointer that holds them; the stream
// and file-system interfaces derive from it, so it sits beside them above the library.
#pragma once

#include <atomic>
#include <utility>

#include "ZYRStdExport.h"

namespace ZYRStd {

// Base of internally shared objects; created with one reference held by its creator.
class ZYRSTD_API CZYRBaseRefCnt {
public:
    CZYRBaseRefCnt() noexcept = default;
    // Copies carry the count word over unchanged, as a memberwise copy would.
    CZYRBaseRefCnt(const CZYRBaseRefCnt& other) noexcept
        : count_(other.count_.load(std::memory_order_relaxed)) {}
    CZYRBaseRefCnt& operator=(const CZYRBaseRefCnt& other) noexcept {
        count_.store(other.count_.load(std::memory_order_relaxed), std::memory_order_relaxed);
        return *this;
    }
    virtual ~CZYRBaseRefCnt();

    // A new reference is taken from one already held, so no ordering is needed.
    void addRef() const noexcept { count_.fetch_add(1, std::memory_order_relaxed); }
    void release() const noexcept {
        if (decrementRefCnt() == 0)
            delete this;
    }
    bool isShared() const noexcept { return count_.load(std::memory_order_acquire) > 1; }
    int peekRefCnt() const noexcept {
        return static_cast<int>(count_.load(std::memory_order_acquire));
    }

private:
    // Release publishes this owner's writes; acquire on the last one makes them visible
    // to the destructor.
    unsigned int decrementRefCnt() const noexcept {
        return count_.fetch_sub(1, std::memory_order_acq_rel) - 1;
    }

    mutable std::atomic<unsigned int> count_{1};
};

// Shared pointer over CZYRBaseRefCnt objects.
template <class T> class CZYRSmartZYRRefPtr {
public:
    CZYRSmartZYRRefPtr() noexcept = default;
    // Adopts the creator's reference unless `addRef` asks for a new one.
    explicit CZYRSmartZYRRefPtr(T* p, bool addRef = false) noexcept : p_(p) {
        if (p_ && addRef)
            p_->addRef();
    }
    CZYRSmartZYRRefPtr(const CZYRSmartZYRRefPtr& other) noexcept : p_(other.p_) {
        if (p_)
            p_->addRef();
    }
    CZYRSmartZYRRefPtr(CZYRSmartZYRRefPtr&& other) noexcept
        : p_(std::exchange(other.p_, nullptr)) {}
    template <class U>
    CZYRSmartZYRRefPtr(const CZYRSmartZYRRefPtr<U>& other) noexcept : p_(other.get()) {
        if (p_)
            p_->addRef();
    }
    CZYRSmartZYRRefPtr& operator=(const CZYRSmartZYRRefPtr& other) noexcept {
        assign(other.p_);
        return *this;
    }
    CZYRSmartZYRRefPtr& operator=(CZYRSmartZYRRefPtr&& other) noexcept {
        if (this != &other) {
            T* old = std::exchange(p_, std::exchange(other.p_, nullptr));
            if (old)
                old->release();
        }
        return *this;
    }
    ~CZYRSmartZYRRefPtr() { reset(); }

    void reset() noexcept {
        if (T* old = std::exchange(p_, nullptr))
            old->release();
    }
    T* get() const noexcept { return p_; }
    T* operator->() const noexcept { return p_; }
    T& operator*() const noexcept { return *p_; }
    explicit operator bool() const noexcept { return p_ != nullptr; }
    // Gives up the reference without releasing it.
    [[nodiscard]] T* detach() noexcept { return std::exchange(p_, nullptr); }

private:
    // The new object gains its reference before the old one may be deleted.
    void assign(T* p) noexcept {
        if (p == p_)
            return;
        if (p)
            p->addRef();
        T* old = std::exchange(p_, p);
        if (old)
            old->release();
    }

    T* p_ = nullptr;
};

} // namespace ZYRStd
