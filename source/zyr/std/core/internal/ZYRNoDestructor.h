// A process-wide object that is never destroyed, so that blocks freed during static
// destruction still find the bookkeeping they need.
#pragma once

#include <new>
#include <utility>

namespace ZYRStd::detail {

template <class T> class NoDestructor {
public:
    template <class... Args> explicit NoDestructor(Args&&... args) {
        ::new (static_cast<void*>(storage_)) T(std::forward<Args>(args)...);
    }
    NoDestructor(const NoDestructor&) = delete;
    NoDestructor& operator=(const NoDestructor&) = delete;

    T& operator*() noexcept { return *std::launder(reinterpret_cast<T*>(storage_)); }
    T* operator->() noexcept { return &**this; }

private:
    alignas(T) unsigned char storage_[sizeof(T)];
};

} // namespace ZYRStd::detail
