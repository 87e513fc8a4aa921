// The analytics manager: a FIFO of finalized records that one Boost thread hands, in order,
// to the telemetry session logger, so that no producer waits for logging.
#include "zyr/std/instrument/IImpZYRAnalyticsManager.h"

#include <boost/thread/thread.hpp>

#include <atomic>
#include <deque>
#include <utility>

#include "zyr/std/config/ZYRStartupOptions.h"
#include "zyr/std/core/CZYRClientBase.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/ZYRThread.h"
#include "zyr/std/instrument/Farlamp.h"
#include "zyr/std/instrument/internal/FarlampInternal.h"

namespace ZYRStd {

namespace {

constexpr const char* kSource = "source/zyr/std/IImpZYRAnalyticsManager";
// Records waiting beyond this are dropped and counted: a slow telemetry library must not
// make the queue grow without end.
constexpr size_t kMaxQueuedRecords = 1024;

class IImpZYRAnalyticsManager final : public IZYRAnalyticsManager, public CZYRClientBase {
public:
    IImpZYRAnalyticsManager() = default;
    ~IImpZYRAnalyticsManager() override { stop(); }

    void start() {
        terminating_ = false;
        worker_ = boost::thread([this] { run(); });
    }

    void enqueue(C_SmartPtr<I_AnalyticsData> record) override {
        if (!record)
            return;
        bool wasEmpty;
        {
            const mutex::scoped_lock lock(lock_);
            if (terminating_.load(std::memory_order_relaxed))
                throw CZYRError(ZYRPublic::kZYRErrorInvalidFuncCall,
                                "Attempt to enqueue Job after ZYRTerminate called.", kSource,
                                __LINE__);
            if (queue_.size() >= kMaxQueuedRecords) {
                ++dropped_;
                return;
            }
            wasEmpty = queue_.empty();
            queue_.push_back(std::move(record));
        }
        // The worker waits only on an empty queue, so only the first record wakes it; woken
        // outside the lock, so that it does not wake only to block on it.
        if (wasEmpty)
            wakeup_.notify_one();
    }

    // Sets the terminating flag and joins the worker; what it has not reached is dropped.
    // Enqueues keep failing until the next start.
    void stop() {
        {
            const mutex::scoped_lock lock(lock_);
            terminating_ = true;
        }
        wakeup_.notify_one();
        if (worker_.joinable())
            worker_.join();
        const mutex::scoped_lock lock(lock_);
        queue_.clear();
        if (dropped_)
            noteDroppedAnalyticsRecords(std::exchange(dropped_, 0));
    }

private:
    // Takes everything queued under one lock, so that producers rarely meet the worker on
    // it, and logs the records in order, each only while termination has not begun.
    void run() {
        std::deque<C_SmartPtr<I_AnalyticsData>> taken;
        for (;;) {
            {
                mutex::scoped_lock lock(lock_);
                while (queue_.empty()) {
                    if (terminating_.load(std::memory_order_relaxed))
                        return;
                    wakeup_.do_wait(lock);
                }
                taken.swap(queue_);
            }
            // Nothing in this object is written per record: a member written here shared a
            // cache line with queue_, and every producer's push paid for it.
            for (const auto& record : taken) {
                // Acquire: pairs with the store in stop(); none is logged once it is seen.
                if (terminating_.load(std::memory_order_acquire))
                    return;
                Farlamp::LogDataObject(record);
            }
            taken.clear();
        }
    }

    boost::thread worker_;
    // Written under lock_; the worker also reads it between records without the lock.
    // Relaxed: a late reading only lets the worker take one more record, and the queue
    // itself is read under lock_, which orders everything the record carries.
    std::atomic<bool> terminating_{false};
    detail::condition_impl wakeup_; // the queue got a record, or termination began
    mutex lock_;                    // guards queue_ and dropped_
    std::deque<C_SmartPtr<I_AnalyticsData>> queue_ ZYR_GUARDED_BY(lock_);
    // Records refused because the queue was full.
    unsigned long long dropped_ ZYR_GUARDED_BY(lock_) = 0;
};

// The manager lives as long as the process, so that a producer holding its pointer while
// ZYRAnalyticsManagerTerm runs meets the terminating error, never a destroyed object.
IImpZYRAnalyticsManager& theManager() {
    static IImpZYRAnalyticsManager manager;
    return manager;
}
// Acquire/release: a producer that sees the pointer sees the started manager.
std::atomic<IImpZYRAnalyticsManager*> singleton{nullptr};

} // namespace

IZYRAnalyticsManager::~IZYRAnalyticsManager() = default;

bool ZYRAnalyticsManagerInit() {
    if (singleton.load(std::memory_order_acquire))
        return true;
    const bool wanted = ZYRIsAnalyticsActive();
    const bool ok = Farlamp::StartSession(wanted, ZYRGetAnalyticsLogFolder());
    // A session also opens when analytics are off (it records nothing); records stay
    // disabled then, since nothing would log them.
    ZYRSetAnalyticsActive(ok && wanted);
    if (ok) {
        IImpZYRAnalyticsManager& manager = theManager();
        manager.start();
        singleton.store(&manager, std::memory_order_release);
    }
    return true;
}

bool ZYRAnalyticsManagerTerm() {
    // The worker is joined before the session closes: a worker still logging would call
    // into the unloaded telemetry library.
    if (IImpZYRAnalyticsManager* manager = singleton.load(std::memory_order_acquire)) {
        manager->stop();
        singleton.store(nullptr, std::memory_order_release);
    }
    Farlamp::CloseSession();
    return true;
}

IZYRAnalyticsManager* GetZYRAnalyticsManager() {
    return singleton.load(std::memory_order_acquire);
}

bool ZYREnqueueAnalyticsRecord(C_SmartPtr<I_AnalyticsData> record) {
    IImpZYRAnalyticsManager* manager = singleton.load(std::memory_order_acquire);
    if (!manager)
        return false;
    manager->enqueue(std::move(record));
    return true;
}

} // namespace ZYRStd
