// The library's locks and the per-thread record that decides who may wait for memory.
#pragma once

#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <mutex>

#include "ZYRStdExport.h"
#include "zyr/std/core/CZYRClientBase.h"
#include "zyr/std/core/ZYRThreadSafety.h"

namespace ZYRStd {

// Non-recursive; taken through a scoped lock.
class ZYRSTD_API ZYR_CAPABILITY("mutex") mutex {
public:
    class scoped_lock;

    constexpr mutex() noexcept = default;
    mutex(const mutex&) = delete;
    mutex& operator=(const mutex&) = delete;

    void lock() ZYR_ACQUIRE() { m_.lock(); }
    bool try_lock() ZYR_TRY_ACQUIRE(true) { return m_.try_lock(); }
    void unlock() ZYR_RELEASE() { m_.unlock(); }
    std::mutex& native() noexcept { return m_; }

private:
    std::mutex m_;
};

class ZYR_SCOPED_CAPABILITY mutex::scoped_lock {
public:
    explicit scoped_lock(mutex& m) ZYR_ACQUIRE(m) : lock_(m.native()) {}
    ~scoped_lock() ZYR_RELEASE() = default;
    scoped_lock(const scoped_lock&) = delete;
    scoped_lock& operator=(const scoped_lock&) = delete;
    std::unique_lock<std::mutex>& native() noexcept { return lock_; }

private:
    std::unique_lock<std::mutex> lock_;
};

namespace detail {

// A condition variable over ZYRStd::mutex.
class ZYRSTD_API condition_impl {
public:
    void do_wait(mutex::scoped_lock& lock) { cv_.wait(lock.native()); }
    // False on time-out.
    template <class Clock, class Duration>
    bool do_timed_wait(mutex::scoped_lock& lock,
                       const std::chrono::time_point<Clock, Duration>& deadline) {
        return cv_.wait_until(lock.native(), deadline) == std::cv_status::no_timeout;
    }
    void notify_one() noexcept { cv_.notify_one(); }
    void notify_all() noexcept { cv_.notify_all(); }

private:
    std::condition_variable cv_;
};

} // namespace detail

// The record a working thread hands to SetCZYRThreadSpecificPtr when it starts.
class ZYRSTD_API CZYRThreadSpecificPtr : public CZYRClientBase {
public:
    // `name` is not copied: it must outlive the record.
    CZYRThreadSpecificPtr(const char* name, bool blockable);
    CZYRThreadSpecificPtr(const CZYRThreadSpecificPtr&) = default;
    CZYRThreadSpecificPtr& operator=(const CZYRThreadSpecificPtr&) = default;
    ~CZYRThreadSpecificPtr() override;

    const char* getThreadName() const { return name_; }
    unsigned long long getThreadId() const { return id_; }
    float getZoom() const { return zoom_; }
    void setZoom(float zoom) { zoom_ = zoom; }
    bool IsThisThreadBlockable() const { return blockable_; }

private:
    const char* name_;
    unsigned long long id_;
    float zoom_ = 1.0f;
    bool blockable_;
};

// The calling thread's record, or null.
ZYRSTD_API CZYRThreadSpecificPtr* GetCZYRThreadSpecificPtr();
// The slot owns the record: a replaced record and a finished thread's record are deleted.
ZYRSTD_API void SetCZYRThreadSpecificPtr(CZYRThreadSpecificPtr* record);
ZYRSTD_API bool ZYRSingleThreadProcess();
// The kernel's identifier of the calling thread.
ZYRSTD_API uint32_t ZYRGetCurrentThreadId();

} // namespace ZYRStd
