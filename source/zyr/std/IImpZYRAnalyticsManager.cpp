// The analytics manager: a FIFO of finalized records that one Boost thread hands, in order,
// to the telemetry session logger, so that no producer waits for logging.
#include "zyr/std/IImpZYRAnalyticsManager.h"

#include <boost/thread/thread.hpp>

#include <deque>
#include <memory>
#include <shared_mutex>
#include <utility>

#include "zyr/std/CZYRClientBase.h"
#include "zyr/std/CZYRError.h"
#include "zyr/std/Farlamp.h"
#include "zyr/std/ZYRStartupOptions.h"
#include "zyr/std/ZYRThread.h"

namespace ZYRStd {

namespace {

constexpr const char* kSource = "source/zyr/std/IImpZYRAnalyticsManager";

class IImpZYRAnalyticsManager final : public IZYRAnalyticsManager, public CZYRClientBase {
public:
    IImpZYRAnalyticsManager() = default;
    ~IImpZYRAnalyticsManager() override { stop(); }

    void start() {
        worker_ = boost::thread([this] { run(); });
    }

    void enqueue(C_SmartPtr<I_AnalyticsData> record) override {
        if (!record)
            return;
        {
            const mutex::scoped_lock lock(lock_);
            if (terminating_)
                throw CZYRError(ZYRPublic::kZYRErrorInvalidFuncCall,
                                "Attempt to enqueue Job after ZYRTerminate called.", kSource,
                                __LINE__);
            queue_.push_back(std::move(record));
        }
        // Woken outside the lock, so that the worker does not wake only to block on it.
        wakeup_.notify_one();
    }

    // Sets the terminating flag and joins the worker; what it has not reached is dropped.
    void stop() {
        {
            const mutex::scoped_lock lock(lock_);
            terminating_ = true;
        }
        wakeup_.notify_one();
        if (worker_.joinable())
            worker_.join();
    }

private:
    void run() {
        for (;;) {
            C_SmartPtr<I_AnalyticsData> record;
            {
                mutex::scoped_lock lock(lock_);
                while (queue_.empty()) {
                    if (terminating_)
                        return;
                    wakeup_.do_wait(lock);
                }
                current_ = std::move(queue_.front());
                queue_.pop_front();
                if (terminating_)
                    return; // none is logged once termination began
                record = current_;
            }
            Farlamp::LogDataObject(record);
        }
    }

    boost::thread worker_;
    bool terminating_ = false;      // guarded by lock_
    detail::condition_impl wakeup_; // the queue got a record, or termination began
    mutex lock_;                    // guards terminating_, queue_ and current_
    std::deque<C_SmartPtr<I_AnalyticsData>> queue_;
    C_SmartPtr<I_AnalyticsData> current_; // the record being logged
};

// Producers read the singleton under a shared lock, so that ZYRAnalyticsManagerTerm cannot
// destroy the manager while an enqueue is inside it.
std::shared_mutex singletonLock;
IImpZYRAnalyticsManager* singleton = nullptr; // guarded by singletonLock

} // namespace

IZYRAnalyticsManager::~IZYRAnalyticsManager() = default;

bool ZYRAnalyticsManagerInit() {
    {
        const std::shared_lock lock(singletonLock);
        if (singleton)
            return true;
    }
    const bool wanted = ZYRIsAnalyticsActive();
    const bool ok = Farlamp::StartSession(wanted, ZYRGetAnalyticsLogFolder());
    // A session also opens when analytics are off (it records nothing); records stay
    // disabled then, since nothing would log them.
    ZYRSetAnalyticsActive(ok && wanted);
    if (ok) {
        auto manager = std::make_unique<IImpZYRAnalyticsManager>();
        manager->start();
        const std::unique_lock lock(singletonLock);
        singleton = manager.release();
    }
    return true;
}

bool ZYRAnalyticsManagerTerm() {
    IImpZYRAnalyticsManager* manager;
    {
        const std::shared_lock lock(singletonLock);
        manager = singleton;
    }
    // The worker is joined before the session closes: a worker still logging would call
    // into the unloaded telemetry library. Producers meanwhile see the terminating error.
    if (manager) {
        manager->stop();
        {
            const std::unique_lock lock(singletonLock); // waits for enqueues under way
            singleton = nullptr;
        }
        delete manager;
    }
    Farlamp::CloseSession();
    return true;
}

IZYRAnalyticsManager* GetZYRAnalyticsManager() {
    const std::shared_lock lock(singletonLock);
    return singleton;
}

bool ZYREnqueueAnalyticsRecord(C_SmartPtr<I_AnalyticsData> record) {
    const std::shared_lock lock(singletonLock);
    if (!singleton)
        return false;
    singleton->enqueue(std::move(record));
    return true;
}

} // namespace ZYRStd
