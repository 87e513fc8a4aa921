#include <gtest/gtest.h>

#include <chrono>
#include <thread>

#include "TestSupport.h"

using namespace ZYRStd;
using ZYRPublic::C_SmartPtr;

namespace {

std::atomic<int> liveObjects{0};
struct Alive {
    Alive() { ++liveObjects; }
    ~Alive() { --liveObjects; }
};
struct TrackedRecord : CZYRThreadSpecificPtr {
    using CZYRThreadSpecificPtr::CZYRThreadSpecificPtr;
    Alive alive;
};
struct Counted : CZYRBaseRefCnt {
    Alive alive;
};
struct PublicObject : CZYRClientBase {
    void addRef() { rc.addRef(); }
    void release() { rc.release() ? delete this : void(); }
    unsigned int debugGetRefCount() const { return rc.debugGetRefCount(); }
    CZYRPublicRefCountBase rc;
    Alive alive;
};

} // namespace

TEST(ZYRThreadTest, RecordsBelongToTheirThreads) {
    std::thread([] {
        EXPECT_EQ(GetCZYRThreadSpecificPtr(), nullptr) << "a new thread has no record";
        auto* first = new TrackedRecord("renderer", true);
        SetCZYRThreadSpecificPtr(first);
        SetCZYRThreadSpecificPtr(first); // the same record again is kept
        EXPECT_TRUE(liveObjects == 1 && GetCZYRThreadSpecificPtr() == first &&
                    std::string(first->getThreadName()) == "renderer" && first->getZoom() == 1.0f &&
                    first->IsThisThreadBlockable());
        auto* second = new TrackedRecord("renderer", false);
        EXPECT_NE(second->getThreadId(), first->getThreadId());
        SetCZYRThreadSpecificPtr(second);
        EXPECT_EQ(liveObjects, 1) << "the replaced record is deleted";
        std::thread([] { EXPECT_EQ(GetCZYRThreadSpecificPtr(), nullptr); }).join();
    }).join();
    EXPECT_EQ(liveObjects, 0) << "a finished thread's record is deleted";
    EXPECT_FALSE(ZYRSingleThreadProcess());
}

TEST(ZYRThreadTest, TimedWaitTimesOut) {
    using Clock = std::chrono::steady_clock;
    ZYRStd::mutex guard;
    detail::condition_impl nobody;
    mutex::scoped_lock lock(guard);
    const auto deadline = Clock::now() + std::chrono::milliseconds(5);
    bool timedOut = false;
    while (!timedOut && Clock::now() < deadline + std::chrono::seconds(5))
        timedOut = !nobody.do_timed_wait(lock, deadline);
    EXPECT_TRUE(timedOut && Clock::now() >= deadline);
}

TEST(ZYRThreadTest, IdentifiersAreDistinctAcrossThreads) {
    const std::function<unsigned long long()> makers[] = {
        [] { return createUniqueID(); }, [] { return CZYRClientRegistrar::makeID(nullptr); }};
    for (const auto& make : makers) {
        std::vector<unsigned long long> ids[2];
        std::thread first([&] { std::generate_n(std::back_inserter(ids[0]), 1000, make); });
        std::generate_n(std::back_inserter(ids[1]), 1000, make);
        first.join();
        std::set<unsigned long long> all(ids[0].begin(), ids[0].end());
        all.insert(ids[1].begin(), ids[1].end());
        EXPECT_TRUE(std::ranges::is_sorted(ids[0], std::less_equal<>()) &&
                    std::ranges::is_sorted(ids[1], std::less_equal<>()));
        EXPECT_TRUE(all.size() == 2000 && *all.begin() >= 1 && make() > *all.rbegin());
    }
    EXPECT_EQ(CZYRClientRegistrar::makeID(nullptr) % 2002, 0u);
}

TEST(ZYRThreadTest, ClientBaseAllocatesThroughTheFrontAndTheNewHandler) {
    static zyrtest::FailingHost host;
    static int handlerCalls;
    handlerCalls = 0;
    tZYRMemMgr record = host.record();
    zyrtest::installFront(0, &record);
    const unsigned long long before = GetMemUsage();
    auto* object = new PublicObject;
    EXPECT_TRUE(ZYRMemSize(object) == sizeof(PublicObject) &&
                GetMemUsage() == before + sizeof(PublicObject));
    delete object;
    EXPECT_EQ(GetMemUsage(), before);
    EXPECT_THROW(CZYRClientBase::operator new (std::size_t{5} << 30), ZYROutOfMemoryError);
    host.failAll = true;
    const std::new_handler previous = std::set_new_handler([] {
        ++handlerCalls;
        host.failAll = false;
    });
    delete new PublicObject;
    std::set_new_handler(previous);
    EXPECT_EQ(handlerCalls, 1);
    zyrtest::installFront(0);
}

TEST(ZYRThreadTest, ClientRegistryNotifications) {
    CZYRClientRegistry registry;
    EXPECT_TRUE(registry.allNotificationsReceived());
    registry.registerClient(5);
    registry.markNotification(5);
    const bool marked = registry.notificationReceived(5);
    registry.registerClient(5);
    EXPECT_TRUE(marked && !registry.notificationReceived(5)) << "registering again resets";
    registry.markNotification(9);
    const bool early = registry.allNotificationsReceived();
    registry.markNotification(5);
    EXPECT_TRUE(!early && registry.allNotificationsReceived());
    EXPECT_EQ(zyrtest::thrown([&] { registry.notificationReceived(3); }),
              "6: CZYRClientRegistry:: Unknown clientID (source/zyr/std/CZYRClientRegistry:61)");
}

TEST(CZYRSmartPtrTest, CountsOnBothSchemes) {
    auto* object = new Counted;
    EXPECT_TRUE(object->peekRefCnt() == 1 && !object->isShared());
    object->addRef();
    EXPECT_TRUE(object->isShared());
    object->release();
    EXPECT_EQ(object->peekRefCnt(), 1);
    object->release();
    CZYRPublicRefCountBase rc;
    EXPECT_TRUE(liveObjects == 0 && !rc.isShared());
    rc.addRef();
    EXPECT_TRUE(rc.isShared() && !rc.release());
    EXPECT_TRUE(rc.release()) << "true exactly on the 1 -> 0 step";
    EXPECT_TRUE(*rc.debugGetRefCountAddr() == 0 && rc.isShared()) << "0 answers shared";

    alignas(4) unsigned int count = 1;
    EXPECT_FALSE(ZYRIsShared_ThreadSafe(&count));
    auto churn = [&count] {
        for (int i = 0; i < 100000; ++i)
            ZYRIncrementRefCnt_ThreadSafe(&count);
        for (int i = 0; i < 50000; ++i)
            ZYRDecrementRefCnt_ThreadSafe(&count);
    };
    std::thread other(churn);
    churn();
    other.join();
    EXPECT_TRUE(ZYRPeekValue_ThreadSafe(&count) == 100001u && ZYRIsShared_ThreadSafe(&count));
    count = 1;
    EXPECT_EQ(ZYRDecrementRefCnt_ThreadSafe(&count), 0u);
}

TEST(CZYRSmartPtrTest, PointersAddBeforeTheyRelease) {
    auto* raw = new PublicObject;
    {
        C_SmartPtr<PublicObject> first(raw, false); // adopts the creator's reference
        C_SmartPtr<PublicObject> second(first);
        first = first;
        EXPECT_EQ(raw->debugGetRefCount(), 2u);
        second.reset();
        EXPECT_EQ(raw->debugGetRefCount(), 1u);
        C_SmartPtr<PublicObject> third(raw, true);
        first = third;
        EXPECT_EQ(raw->debugGetRefCount(), 2u);
        C_SmartPtr<PublicObject> other(new PublicObject, false);
        first = other; // releases raw once, leaving third's reference
        EXPECT_TRUE(raw->debugGetRefCount() == 1 && liveObjects == 2);
    }
    EXPECT_EQ(liveObjects, 0);
    {
        CZYRSmartZYRRefPtr<Counted> a(new Counted), b(a), c(new Counted);
        EXPECT_EQ(a->peekRefCnt(), 2);
        b = c;
        EXPECT_TRUE(a->peekRefCnt() == 1 && c->peekRefCnt() == 2);
        a = c; // the first object's last reference goes
        EXPECT_EQ(liveObjects, 1);
    }
    EXPECT_EQ(liveObjects, 0);

    C_SmartPtr<PublicObject> shared(new PublicObject, false);
    auto copies = [&shared] {
        for (int i = 0; i < 50000; ++i) {
            C_SmartPtr<PublicObject> copy(shared), another;
            another = copy;
        }
    };
    std::thread other(copies);
    copies();
    other.join();
    EXPECT_EQ(shared->debugGetRefCount(), 1u) << "copies on two threads";
}

TEST(CZYRSmartPtrTest, ContainerLendsACountAndUsesTheDeleter) {
    static int deleted;
    deleted = 0;
    const unsigned long long before = GetMemUsage();
    {
        CZYRSmartZYRRefPtr<CZYRSmartRefPtrContainer<int>> box(
            CZYRSmartRefPtrContainer<int>::create(new int(4), [](int* p) { ++deleted, delete p; }));
        EXPECT_TRUE(GetMemUsage() > before && *box->getObject() == 4);
    }
    EXPECT_TRUE(deleted == 1 && GetMemUsage() == before);
    void* one = czyrsmartptralloc(0);
    EXPECT_EQ(ZYRMemSize(one), 1u);
    czyrsmartptrfree(one);
    czyrsmartptrfree(nullptr);
}
