#include <gtest/gtest.h>

#include <thread>

#include "TestSupport.h"

using namespace ZYRStd;

namespace {

std::atomic<int> liveObjects{0};
struct Alive {
    Alive() { ++liveObjects; }
    ~Alive() { --liveObjects; }
};
struct Counted : CZYRBaseRefCnt {
    Alive alive;
};
struct PublicObject : CZYRClientBase {
    Alive alive;
};

} // namespace

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
    EXPECT_TRUE(object->isShared() && (object->release(), object->peekRefCnt() == 1));
    object->release();
    CZYRPublicRefCountBase rc;
    EXPECT_TRUE(liveObjects == 0 && !rc.isShared());
    rc.addRef();
    EXPECT_TRUE(rc.isShared() && !rc.release());
    EXPECT_TRUE(rc.release()) << "true exactly on the 1 -> 0 step";
    EXPECT_TRUE(*rc.debugGetRefCountAddr() == 0 && rc.isShared()) << "0 answers shared";
    alignas(4) unsigned int count = 1;
    EXPECT_FALSE(ZYRIsShared_ThreadSafe(&count));
    ZYRIncrementRefCnt_ThreadSafe(&count);
    EXPECT_TRUE(ZYRPeekValue_ThreadSafe(&count) == 2u && ZYRIsShared_ThreadSafe(&count));
    EXPECT_EQ(ZYRDecrementRefCnt_ThreadSafe(&count) + ZYRDecrementRefCnt_ThreadSafe(&count), 1u);
}
