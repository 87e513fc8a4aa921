// Per-thread records, locks, identifiers, the client base and its registry, and reference
// counts on both schemes with the pointers that hold them.
#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <functional>
#include <set>
#include <thread>
#include <vector>

#include "C_SmartPtr.h"
#include "TestSupport.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/CZYRSmartPtr.h"
#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/core/ZYRThread.h"
#include "zyr/std/core/ZYRUniqueID.h"
#include "zyr/std/memory/CZYRClientRegistry.h"

using namespace ZYRStd;
using ZYRPublic::C_SmartPtr;

namespace {

std::atomic<int> liveObjects{0};

class TrackedRecord : public CZYRThreadSpecificPtr {
public:
    TrackedRecord(const char* name, bool blockable) : CZYRThreadSpecificPtr(name, blockable) {
        ++liveObjects;
    }
    ~TrackedRecord() override { --liveObjects; }
};

class Counted : public CZYRBaseRefCnt {
public:
    Counted() { ++liveObjects; }
    ~Counted() override { --liveObjects; }
};

// A public-interface implementation the way the library writes them.
class PublicObject : public CZYRClientBase {
public:
    PublicObject() { ++liveObjects; }
    ~PublicObject() override { --liveObjects; }
    void addRef() { rc_.addRef(); }
    void release() {
        if (rc_.release())
            delete this;
    }
    unsigned int debugGetRefCount() const { return rc_.debugGetRefCount(); }

private:
    CZYRPublicRefCountBase rc_;
};

zyrtest::FailingHost* failingHost = nullptr;
int handlerCalls = 0;
void recoveringHandler() {
    ++handlerCalls;
    failingHost->failAll = false;
}

} // namespace

TEST(ZYRThreadTest, RecordsBelongToTheirThreads) {
    std::thread([] {
        EXPECT_EQ(GetCZYRThreadSpecificPtr(), nullptr) << "a new thread has no record";
        auto* first = new TrackedRecord("renderer", true);
        SetCZYRThreadSpecificPtr(first);
        SetCZYRThreadSpecificPtr(first); // the same record again is kept
        EXPECT_EQ(liveObjects, 1);
        EXPECT_EQ(GetCZYRThreadSpecificPtr(), first);
        EXPECT_STREQ(first->getThreadName(), "renderer");
        EXPECT_FLOAT_EQ(first->getZoom(), 1.0f);
        EXPECT_TRUE(first->IsThisThreadBlockable());
        auto* second = new TrackedRecord("renderer", false);
        EXPECT_NE(second->getThreadId(), first->getThreadId());
        SetCZYRThreadSpecificPtr(second);
        EXPECT_EQ(liveObjects, 1) << "the replaced record is deleted";
        std::thread([] { EXPECT_EQ(GetCZYRThreadSpecificPtr(), nullptr); }).join();
    }).join();
    EXPECT_EQ(liveObjects, 0) << "a finished thread's record is deleted";
    EXPECT_FALSE(ZYRSingleThreadProcess());
}

// The condition's timed wait answers false on time-out; a wait may wake spuriously, so only
// one that reaches its deadline must time out.
TEST(ZYRThreadTest, TimedWaitTimesOut) {
    ZYRStd::mutex guard;
    detail::condition_impl nobody;
    mutex::scoped_lock lock(guard);
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::milliseconds(5);
    bool timedOut = false;
    while (!timedOut && std::chrono::steady_clock::now() < deadline + std::chrono::seconds(5))
        timedOut = !nobody.do_timed_wait(lock, deadline);
    EXPECT_TRUE(timedOut);
    EXPECT_GE(std::chrono::steady_clock::now(), deadline);
}

// Unique and client identifiers: distinct across threads, increasing within one, from 1.
TEST(ZYRThreadTest, IdentifiersAreDistinctAcrossThreads) {
    const std::function<unsigned long long()> makers[] = {
        [] { return createUniqueID(); }, [] { return CZYRClientRegistrar::makeID(nullptr); }};
    for (const auto& make : makers) {
        std::vector<unsigned long long> ids[2];
        std::thread first([&] { std::generate_n(std::back_inserter(ids[0]), 1000, make); });
        std::thread second([&] { std::generate_n(std::back_inserter(ids[1]), 1000, make); });
        first.join();
        second.join();
        std::set<unsigned long long> all;
        for (const auto& list : ids) {
            EXPECT_TRUE(std::is_sorted(list.begin(), list.end(), std::less_equal<>()));
            all.insert(list.begin(), list.end());
        }
        EXPECT_EQ(all.size(), 2000u);
        EXPECT_GE(*all.begin(), 1u);
        EXPECT_GT(make(), *all.rbegin());
    }
    EXPECT_EQ(CZYRClientRegistrar::makeID(nullptr), 2002u) << "client identifiers start at 1";
}

TEST(ZYRThreadTest, ClientBaseAllocatesThroughTheFrontAndTheNewHandler) {
    struct Object : CZYRClientBase {
        int payload[4];
    };
    zyrtest::FailingHost host;
    failingHost = &host;
    tZYRMemMgr record = host.record();
    zyrtest::installFront(0, &record);
    const unsigned long long before = GetMemUsage();
    auto* object = new Object;
    EXPECT_EQ(ZYRMemSize(object), sizeof(Object));
    EXPECT_EQ(GetMemUsage(), before + sizeof(Object));
    delete object;
    EXPECT_EQ(GetMemUsage(), before);

    // A request beyond the front's 32-bit sizes is refused, never cut down.
    EXPECT_THROW(CZYRClientBase::operator new (std::size_t{5} << 30), ZYROutOfMemoryError);
    // A failing front: the new handler is called until it recovers (without one the fault
    // sweep sees ZYROutOfMemoryError).
    host.failAll = true;
    const std::new_handler previous = std::set_new_handler(recoveringHandler);
    object = new Object;
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
    try {
        registry.notificationReceived(3);
        ADD_FAILURE() << "unknown identifiers are an error";
    } catch (const CZYRError& e) {
        EXPECT_EQ(e.getError(), ZYRPublic::kZYRErrorBadParam);
        EXPECT_STREQ(e.getMessage(), "CZYRClientRegistry:: Unknown clientID");
        EXPECT_STREQ(e.getSrcFileName(), "source/zyr/std/CZYRClientRegistry");
        EXPECT_EQ(e.getSrcLineNumber(), 61);
    }
}

TEST(CZYRSmartPtrTest, CountsOnBothSchemes) {
    auto* object = new Counted;
    EXPECT_EQ(object->peekRefCnt(), 1);
    EXPECT_FALSE(object->isShared());
    object->addRef();
    EXPECT_TRUE(object->isShared());
    object->release();
    EXPECT_EQ(object->peekRefCnt(), 1);
    object->release();
    EXPECT_EQ(liveObjects, 0);

    CZYRPublicRefCountBase rc;
    EXPECT_FALSE(rc.isShared());
    rc.addRef();
    EXPECT_TRUE(rc.isShared());
    EXPECT_FALSE(rc.release());
    EXPECT_TRUE(rc.release()) << "true exactly on the 1 -> 0 step";
    EXPECT_EQ(*rc.debugGetRefCountAddr(), 0u);
    EXPECT_TRUE(rc.isShared()) << "a count of 0 answers shared on the public base";

    alignas(4) unsigned int count = 1;
    EXPECT_FALSE(ZYRIsShared_ThreadSafe(&count));
    auto churn = [&count] {
        for (int i = 0; i < 100000; ++i)
            ZYRIncrementRefCnt_ThreadSafe(&count);
        for (int i = 0; i < 50000; ++i)
            ZYRDecrementRefCnt_ThreadSafe(&count);
    };
    std::thread first(churn), second(churn);
    first.join();
    second.join();
    EXPECT_EQ(ZYRPeekValue_ThreadSafe(&count), 100001u) << "counts must never tear";
    EXPECT_TRUE(ZYRIsShared_ThreadSafe(&count));
    count = 1;
    EXPECT_EQ(ZYRDecrementRefCnt_ThreadSafe(&count), 0u);
}

TEST(CZYRSmartPtrTest, PointersAddBeforeTheyRelease) {
    auto* raw = new PublicObject;
    {
        C_SmartPtr<PublicObject> first(raw, false); // adopts the creator's reference
        C_SmartPtr<PublicObject> second(first);
        EXPECT_EQ(raw->debugGetRefCount(), 2u);
        first = first;
        EXPECT_EQ(raw->debugGetRefCount(), 2u);
        second.reset();
        EXPECT_EQ(raw->debugGetRefCount(), 1u);
        // `first` holds the last reference; assigning the same object through another
        // pointer must not let it die in between.
        C_SmartPtr<PublicObject> third(raw, true);
        first = third;
        EXPECT_EQ(raw->debugGetRefCount(), 2u);
        C_SmartPtr<PublicObject> other(new PublicObject, false);
        first = other; // releases raw once, leaving third's reference
        EXPECT_EQ(raw->debugGetRefCount(), 1u);
        EXPECT_EQ(liveObjects, 2);
    }
    EXPECT_EQ(liveObjects, 0);
    {
        CZYRSmartZYRRefPtr<Counted> a(new Counted);
        CZYRSmartZYRRefPtr<Counted> b(a);
        EXPECT_EQ(a->peekRefCnt(), 2);
        CZYRSmartZYRRefPtr<Counted> c(new Counted);
        b = c;
        EXPECT_EQ(a->peekRefCnt(), 1);
        EXPECT_EQ(c->peekRefCnt(), 2);
        a = c; // the first object's last reference goes
        EXPECT_EQ(liveObjects, 1);
    }
    EXPECT_EQ(liveObjects, 0);

    C_SmartPtr<PublicObject> shared(new PublicObject, false);
    auto copies = [&shared] {
        for (int i = 0; i < 50000; ++i) {
            C_SmartPtr<PublicObject> copy(shared);
            C_SmartPtr<PublicObject> another;
            another = copy;
        }
    };
    std::thread first(copies), second(copies);
    first.join();
    second.join();
    EXPECT_EQ(shared->debugGetRefCount(), 1u) << "copies on two threads";
    shared.reset();
    EXPECT_EQ(liveObjects, 0);
}

TEST(CZYRSmartPtrTest, ContainerLendsACountAndUsesTheDeleter) {
    static int deleted = 0;
    struct Plain {
        int value = 4;
    };
    const unsigned long long before = GetMemUsage();
    {
        CZYRSmartZYRRefPtr<CZYRSmartRefPtrContainer<Plain>> box(
            CZYRSmartRefPtrContainer<Plain>::create(new Plain, [](Plain* p) {
                ++deleted;
                delete p;
            }));
        EXPECT_GT(GetMemUsage(), before) << "the box comes from the front";
        EXPECT_EQ(box->getObject()->value, 4);
    }
    EXPECT_EQ(deleted, 1);
    EXPECT_EQ(GetMemUsage(), before);
    void* one = czyrsmartptralloc(0);
    EXPECT_EQ(ZYRMemSize(one), 1u);
    czyrsmartptrfree(one);
    czyrsmartptrfree(nullptr);
}
