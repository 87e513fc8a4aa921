/// \file
/// The library's locks and the per-thread record that decides who may wait for memory.
#pragma once

#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <mutex>

#include "ZYRStdExport.h"
#include "zyr/std/core/CZYRClientBase.h"
#include "zyr/std/core/ZYRThreadSafety.h"

namespace ZYRStd {

/// Non-recursive; taken through a scoped lock.
class ZYRSTD_API ZYR_CAPABILITY("mutex") mutex {
public:
    class scoped_lock;

    constexpr mutex() noexcept = default;
    mutex(const mutex&) = delete;
    mutex& operator=(const mutex&) = delete;

    /// Blocks until the calling thread holds the mutex; not recursive.
    void lock() ZYR_ACQUIRE() { m_.lock(); }
    /// Takes the mutex if free; true when taken.
    bool try_lock() ZYR_TRY_ACQUIRE(true) { return m_.try_lock(); }
    /// Releases the mutex the calling thread holds.
    void unlock() ZYR_RELEASE() { m_.unlock(); }
    /// The standard mutex inside, for condition variables.
    std::mutex& native() noexcept { return m_; }

private:
    std::mutex m_;
};

/// Holds a ZYRStd::mutex for its scope.
class ZYR_SCOPED_CAPABILITY mutex::scoped_lock {
public:
    /// Blocks until `m` is held.
    explicit scoped_lock(mutex& m) ZYR_ACQUIRE(m) : lock_(m.native()) {}
    ~scoped_lock() ZYR_RELEASE() = default;
    scoped_lock(const scoped_lock&) = delete;
    scoped_lock& operator=(const scoped_lock&) = delete;
    /// The standard lock inside, for condition variables.
    std::unique_lock<std::mutex>& native() noexcept { return lock_; }

private:
    std::unique_lock<std::mutex> lock_;
};

namespace detail {

/// A condition variable over ZYRStd::mutex.
class ZYRSTD_API condition_impl {
public:
    /// Releases `lock`, waits for a notification and takes it again.
    void do_wait(mutex::scoped_lock& lock) { cv_.wait(lock.native()); }
    /// False on time-out.
    template <class Clock, class Duration>
    bool do_timed_wait(mutex::scoped_lock& lock,
                       const std::chrono::time_point<Clock, Duration>& deadline) {
        return cv_.wait_until(lock.native(), deadline) == std::cv_status::no_timeout;
    }
    /// Wakes one waiting thread.
    void notify_one() noexcept { cv_.notify_one(); }
    /// Wakes every waiting thread.
    void notify_all() noexcept { cv_.notify_all(); }

private:
    std::condition_variable cv_;
};

} // namespace detail

/// The record a working thread hands to SetCZYRThreadSpecificPtr when it starts.
class ZYRSTD_API CZYRThreadSpecificPtr : public CZYRClientBase {
public:
    /// `name` is not copied: it must outlive the record.
    CZYRThreadSpecificPtr(const char* name, bool blockable);
    /// Copies every field, the name pointer included.
    CZYRThreadSpecificPtr(const CZYRThreadSpecificPtr&) = default;
    /// Copies every field, the name pointer included.
    CZYRThreadSpecificPtr& operator=(const CZYRThreadSpecificPtr&) = default;
    ~CZYRThreadSpecificPtr() override;

    /// The thread's name, borrowed.
    const char* getThreadName() const { return name_; }
    /// The thread's process-unique identifier (createUniqueID).
    unsigned long long getThreadId() const { return id_; }
    /// The rendering zoom of the thread's work, 1 by default.
    float getZoom() const { return zoom_; }
    /// Sets the zoom.
    void setZoom(float zoom) { zoom_ = zoom; }
    /// True when the thread may wait for the renderer during memory recovery.
    bool IsThisThreadBlockable() const { return blockable_; }

private:
    const char* name_;
    unsigned long long id_;
    float zoom_ = 1.0f;
    bool blockable_;
};

/// The calling thread's record, or null.
ZYRSTD_API CZYRThreadSpecificPtr* GetCZYRThreadSpecificPtr();
/// The slot owns the record: a replaced record and a finished thread's record are deleted.
ZYRSTD_API void SetCZYRThreadSpecificPtr(CZYRThreadSpecificPtr* record);
/// The "SingleThreadProcess" start-up option (false by default).
ZYRSTD_API bool ZYRSingleThreadProcess();
/// The kernel's identifier of the calling thread.
ZYRSTD_API uint32_t ZYRGetCurrentThreadId();

} // namespace ZYRStd
