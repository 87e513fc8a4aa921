// Per-thread records, identifiers, locks and the client base.
#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <set>
#include <thread>

#include "TestSupport.h"
#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/core/ZYRThread.h"
#include "zyr/std/memory/CZYRClientRegistry.h"

using namespace ZYRStd;

namespace {
std::atomic<int> recordsAlive{0};

class TrackedRecord : public CZYRThreadSpecificPtr {
public:
    TrackedRecord(const char* name, bool blockable) : CZYRThreadSpecificPtr(name, blockable) {
        ++recordsAlive;
    }
    ~TrackedRecord() override { --recordsAlive; }
};
} // namespace

TEST(ZYRThreadTest, RecordsBelongToTheirThreads) {
    std::thread([] {
        EXPECT_EQ(GetCZYRThreadSpecificPtr(), nullptr) << "a new thread has no record";
        auto* first = new TrackedRecord("renderer", true);
        SetCZYRThreadSpecificPtr(first);
        SetCZYRThreadSpecificPtr(first); // the same record again is kept
        EXPECT_EQ(recordsAlive, 1);
        EXPECT_EQ(GetCZYRThreadSpecificPtr(), first);
        EXPECT_STREQ(first->getThreadName(), "renderer");
        EXPECT_FLOAT_EQ(first->getZoom(), 1.0f);
        EXPECT_TRUE(first->IsThisThreadBlockable());

        auto* second = new TrackedRecord("renderer", false);
        EXPECT_NE(second->getThreadId(), first->getThreadId());
        SetCZYRThreadSpecificPtr(second);
        EXPECT_EQ(recordsAlive, 1) << "the replaced record is deleted";
        std::thread([] { EXPECT_EQ(GetCZYRThreadSpecificPtr(), nullptr); }).join();
    }).join();
    EXPECT_EQ(recordsAlive, 0) << "a finished thread's record is deleted";
    EXPECT_FALSE(ZYRSingleThreadProcess());
}

TEST(ZYRThreadTest, MutexAndConditionHandOver) {
    ZYRStd::mutex guard;
    detail::condition_impl ready;
    bool flag = false;
    std::thread waiter([&] {
        mutex::scoped_lock lock(guard);
        while (!flag)
            ready.do_wait(lock);
    });
    {
        mutex::scoped_lock lock(guard);
        flag = true;
    }
    ready.notify_all();
    waiter.join();

    mutex::scoped_lock lock(guard);
    // A wait may wake spuriously, so only a wait that reaches its deadline must time out.
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::milliseconds(5);
    bool timedOut = false;
    while (!timedOut && std::chrono::steady_clock::now() < deadline + std::chrono::seconds(5))
        timedOut = !ready.do_timed_wait(lock, deadline);
    EXPECT_TRUE(timedOut) << "nobody notifies: a time-out";
    EXPECT_GE(std::chrono::steady_clock::now(), deadline);
}

TEST(ZYRThreadTest, ClientBaseAllocatesThroughTheFront) {
    struct Empty : CZYRClientBase {};
    const unsigned long long before = GetMemUsage();
    auto* object = new Empty;
    EXPECT_EQ(ZYRMemSize(object), sizeof(Empty));
    EXPECT_GT(GetMemUsage(), before);
    delete object;
    EXPECT_EQ(GetMemUsage(), before);
}

namespace {
int handlerCalls = 0;
zyrtest::FailingHost* failingHost = nullptr;
void recoveringHandler() {
    ++handlerCalls;
    failingHost->failAll = false;
}
} // namespace

TEST(ZYRThreadTest, ClientBaseNewRetriesThroughTheNewHandler) {
    struct Object : CZYRClientBase {
        int payload[4];
    };
    zyrtest::FailingHost host;
    failingHost = &host;
    ZYRStd::tZYRMemMgr record = host.record();
    zyrtest::installFront(0, &record);

    host.failAll = true;
    try {
        delete new Object;
        ADD_FAILURE() << "no handler: must throw";
    } catch (const ZYROutOfMemoryError& e) {
        EXPECT_STREQ(e.getMessage(), "Memory alloc failed");
        EXPECT_STREQ(e.getSrcFileName(), "source/zyr/std/CZYRClientBase");
        EXPECT_EQ(e.getSrcLineNumber(), 92);
    }
    // A request beyond the front's 32-bit sizes is refused, never cut down.
    EXPECT_THROW(CZYRClientBase::operator new (std::size_t{5} << 30), ZYROutOfMemoryError);
    const std::new_handler previous = std::set_new_handler(recoveringHandler);
    Object* object = new Object;
    std::set_new_handler(previous);
    EXPECT_EQ(handlerCalls, 1);
    delete object;
    zyrtest::installFront(0);
}

TEST(ZYRThreadTest, ClientRegistryNotifications) {
    CZYRClientRegistry registry;
    EXPECT_TRUE(registry.allNotificationsReceived());
    registry.registerClient(5);
    registry.markNotification(5);
    EXPECT_TRUE(registry.notificationReceived(5));
    registry.registerClient(5);
    EXPECT_FALSE(registry.notificationReceived(5)) << "registering again resets";
    registry.markNotification(9);
    EXPECT_FALSE(registry.allNotificationsReceived());
    registry.markNotification(5);
    EXPECT_TRUE(registry.allNotificationsReceived());

    CZYRClientRegistry copy(registry);
    copy.registerClient(9);
    EXPECT_TRUE(registry.notificationReceived(9)) << "copies are independent";
    try {
        registry.notificationReceived(3);
        ADD_FAILURE() << "unknown identifiers are an error";
    } catch (const CZYRError& e) {
        EXPECT_EQ(e.getError(), ZYRPublic::kZYRErrorBadParam);
        EXPECT_STREQ(e.getMessage(), "CZYRClientRegistry:: Unknown clientID");
        EXPECT_EQ(e.getSrcLineNumber(), 61);
    }
}

TEST(ZYRThreadTest, ClientIdentifiersAreDistinctAcrossThreads) {
    std::vector<unsigned int> ids[2];
    std::thread a([&] {
        for (int i = 0; i < 1000; ++i)
            ids[0].push_back(CZYRClientRegistrar::makeID(nullptr));
    });
    std::thread b([&] {
        for (int i = 0; i < 1000; ++i)
            ids[1].push_back(CZYRClientRegistrar::makeID(nullptr));
    });
    a.join();
    b.join();
    std::set<unsigned int> all(ids[0].begin(), ids[0].end());
    all.insert(ids[1].begin(), ids[1].end());
    EXPECT_EQ(all.size(), 2000u);
    EXPECT_EQ(*all.begin(), 1u) << "the first identifier is 1";
}
