// The reference-counted pointer to interfaces that cross the library boundary.
#pragma once

#include <utility>

namespace ZYRPublic {

template <class T> class C_SmartPtr {
public:
    C_SmartPtr() noexcept = default;
    // `addRef` false adopts the reference the caller already holds.
    C_SmartPtr(T* p, bool addRef) noexcept : p_(p) {
        if (p_ && addRef)
            p_->addRef();
    }
    C_SmartPtr(const C_SmartPtr& other) noexcept : p_(other.p_) {
        if (p_)
            p_->addRef();
    }
    C_SmartPtr(C_SmartPtr&& other) noexcept : p_(std::exchange(other.p_, nullptr)) {}
    template <class U> C_SmartPtr(const C_SmartPtr<U>& other) noexcept : p_(other.get()) {
        if (p_)
            p_->addRef();
    }
    // Adds to the new object before releasing the old one, so that assigning an
    // object to the pointer that holds its last reference keeps it alive.
    C_SmartPtr& operator=(const C_SmartPtr& other) noexcept {
        if (this != &other && other.p_ != p_) {
            if (other.p_)
                other.p_->addRef();
            T* old = std::exchange(p_, other.p_);
            if (old)
                old->release();
        }
        return *this;
    }
    C_SmartPtr& operator=(C_SmartPtr&& other) noexcept {
        if (this != &other) {
            T* old = std::exchange(p_, std::exchange(other.p_, nullptr));
            if (old)
                old->release();
        }
        return *this;
    }
    ~C_SmartPtr() { reset(); }

    void reset() noexcept {
        if (T* old = std::exchange(p_, nullptr))
            old->release();
    }
    T* get() const noexcept { return p_; }
    T* operator->() const noexcept { return p_; }
    T& operator*() const noexcept { return *p_; }
    explicit operator bool() const noexcept { return p_ != nullptr; }
    bool isNull() const noexcept { return p_ == nullptr; }
    // Hands the reference to the caller without releasing it.
    [[nodiscard]] T* detach() noexcept { return std::exchange(p_, nullptr); }

private:
    T* p_ = nullptr;
};

} // namespace ZYRPublic
