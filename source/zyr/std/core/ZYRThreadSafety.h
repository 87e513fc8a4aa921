/// \file
/// Lock annotations for clang's thread-safety analysis (-Wthread-safety): which mutex
/// guards which data, and which helpers expect it held. Other compilers see nothing.
#pragma once

#include <mutex>

#if defined(__clang__)
/// A clang thread-safety attribute; nothing for other compilers.
#define ZYR_THREAD_ANNOTATION(x) __attribute__((x))
#else
/// A clang thread-safety attribute; nothing for other compilers.
#define ZYR_THREAD_ANNOTATION(x)
#endif

/// Marks a class as a lock the analysis follows.
#define ZYR_CAPABILITY(name) ZYR_THREAD_ANNOTATION(capability(name))
/// Marks a class that holds a lock for its scope.
#define ZYR_SCOPED_CAPABILITY ZYR_THREAD_ANNOTATION(scoped_lockable)
/// Data that may be touched only with `m` held.
#define ZYR_GUARDED_BY(m) ZYR_THREAD_ANNOTATION(guarded_by(m))
/// Data behind a pointer that may be touched only with `m` held.
#define ZYR_PT_GUARDED_BY(m) ZYR_THREAD_ANNOTATION(pt_guarded_by(m))
/// A function the caller must call with the locks held.
#define ZYR_REQUIRES(...) ZYR_THREAD_ANNOTATION(requires_capability(__VA_ARGS__))
/// A function that takes the locks (this object's without arguments).
#define ZYR_ACQUIRE(...) ZYR_THREAD_ANNOTATION(acquire_capability(__VA_ARGS__))
/// A function that releases the locks (this object's without arguments).
#define ZYR_RELEASE(...) ZYR_THREAD_ANNOTATION(release_capability(__VA_ARGS__))
/// A function that takes the lock when it returns the given value.
#define ZYR_TRY_ACQUIRE(...) ZYR_THREAD_ANNOTATION(try_acquire_capability(__VA_ARGS__))
/// A function the caller must not call with the locks held.
#define ZYR_EXCLUDES(...) ZYR_THREAD_ANNOTATION(locks_excluded(__VA_ARGS__))
/// A function that states, unchecked, that the caller holds `m`.
#define ZYR_ASSERT_CAPABILITY(m) ZYR_THREAD_ANNOTATION(assert_capability(m))
/// A function that returns the lock `m`.
#define ZYR_RETURN_CAPABILITY(m) ZYR_THREAD_ANNOTATION(lock_returned(m))
/// A function the analysis skips.
#define ZYR_NO_THREAD_SAFETY_ANALYSIS ZYR_THREAD_ANNOTATION(no_thread_safety_analysis)

namespace ZYRStd::detail {

/// A standard mutex the analysis can follow (libstdc++'s own carries no annotations).
template <class Native> class ZYR_CAPABILITY("mutex") AnnotatedMutex {
public:
    /// Blocks until the calling thread holds the mutex.
    void lock() ZYR_ACQUIRE() { native_.lock(); }
    /// Releases the mutex.
    void unlock() ZYR_RELEASE() { native_.unlock(); }
    /// Takes the mutex if free; true when taken.
    bool try_lock() ZYR_TRY_ACQUIRE(true) { return native_.try_lock(); }
    /// States a precondition the analysis cannot follow: the caller holds this mutex (for a
    /// function whose declaration lives where the mutex cannot be named).
    void assertHeld() const ZYR_ASSERT_CAPABILITY(this) {}
    /// For condition variables, which need the standard type.
    Native& native() noexcept { return native_; }

private:
    Native native_;
};

/// A non-recursive mutex the analysis follows.
using Mutex = AnnotatedMutex<std::mutex>;
/// A recursive mutex the analysis follows.
using RecursiveMutex = AnnotatedMutex<std::recursive_mutex>;

/// Holds a mutex for its scope, like std::lock_guard.
template <class M> class ZYR_SCOPED_CAPABILITY LockGuard {
public:
    /// Blocks until `m` is held.
    explicit LockGuard(M& m) ZYR_ACQUIRE(m) : m_(m) { m_.lock(); }
    ~LockGuard() ZYR_RELEASE() { m_.unlock(); }
    LockGuard(const LockGuard&) = delete;
    LockGuard& operator=(const LockGuard&) = delete;

private:
    M& m_;
};

/// Holds a mutex for its scope and lends it to a condition variable's wait, like
/// std::unique_lock; the analysis treats the wait as keeping the lock.
template <class M> class ZYR_SCOPED_CAPABILITY UniqueLock {
public:
    /// Blocks until `m` is held.
    explicit UniqueLock(M& m) ZYR_ACQUIRE(m) : lock_(m.native()) {}
    ~UniqueLock() ZYR_RELEASE() = default;
    UniqueLock(const UniqueLock&) = delete;
    UniqueLock& operator=(const UniqueLock&) = delete;
    /// Releases the mutex before the end of the scope.
    void unlock() ZYR_RELEASE() { lock_.unlock(); }
    /// Takes the mutex again.
    void lock() ZYR_ACQUIRE() { lock_.lock(); }
    /// The standard lock inside, for a condition variable's wait.
    std::unique_lock<std::remove_reference_t<decltype(std::declval<M&>().native())>>& native() {
        return lock_;
    }

private:
    std::unique_lock<std::remove_reference_t<decltype(std::declval<M&>().native())>> lock_;
};

} // namespace ZYRStd::detail
