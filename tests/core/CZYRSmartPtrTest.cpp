// Reference counts on both schemes and the pointers that hold them.
#include <gtest/gtest.h>

#include <thread>
#include <vector>

#include "C_SmartPtr.h"
#include "TestSupport.h"
#include "zyr/std/core/CZYRSmartPtr.h"
#include "zyr/std/core/ZYRMem.h"

using namespace ZYRStd;
using ZYRPublic::C_SmartPtr;

namespace {

int liveObjects = 0;

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
    bool isShared() const { return rc_.isShared(); }
    unsigned int debugGetRefCount() const { return rc_.debugGetRefCount(); }

private:
    CZYRPublicRefCountBase rc_;
};

} // namespace

TEST(CZYRSmartPtrTest, InternalCountLifecycle) {
    auto* object = new Counted;
    EXPECT_EQ(object->peekRefCnt(), 1);
    EXPECT_FALSE(object->isShared());
    object->addRef();
    EXPECT_TRUE(object->isShared());
    object->release();
    EXPECT_EQ(object->peekRefCnt(), 1);
    EXPECT_EQ(liveObjects, 1);
    object->release();
    EXPECT_EQ(liveObjects, 0);
}

TEST(CZYRSmartPtrTest, PublicCountNeverDeletesItself) {
    CZYRPublicRefCountBase rc;
    EXPECT_FALSE(rc.isShared());
    rc.addRef();
    EXPECT_TRUE(rc.isShared());
    EXPECT_FALSE(rc.release());
    EXPECT_TRUE(rc.release()) << "true exactly on the 1 -> 0 step";
    EXPECT_EQ(rc.debugGetRefCount(), 0u);
    EXPECT_TRUE(rc.isShared()) << "a count of 0 answers shared on the public base";
    EXPECT_EQ(*rc.debugGetRefCountAddr(), 0u);
}

TEST(CZYRSmartPtrTest, BareCountFunctions) {
    alignas(4) unsigned int count = 1;
    EXPECT_FALSE(ZYRIsShared_ThreadSafe(&count));
    std::vector<std::thread> threads;
    for (int t = 0; t < 2; ++t)
        threads.emplace_back([&count] {
            for (int i = 0; i < 100000; ++i)
                ZYRIncrementRefCnt_ThreadSafe(&count);
            for (int i = 0; i < 50000; ++i)
                ZYRDecrementRefCnt_ThreadSafe(&count);
        });
    for (auto& t : threads)
        t.join();
    EXPECT_EQ(ZYRPeekValue_ThreadSafe(&count), 100001u) << "counts must never tear";
    EXPECT_TRUE(ZYRIsShared_ThreadSafe(&count));
    count = 1;
    EXPECT_EQ(ZYRDecrementRefCnt_ThreadSafe(&count), 0u);
}

TEST(CZYRSmartPtrTest, PublicPointerAddsBeforeItReleases) {
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
        EXPECT_EQ(liveObjects, 1);
        EXPECT_EQ(raw->debugGetRefCount(), 2u);

        C_SmartPtr<PublicObject> other(new PublicObject, false);
        first = other; // releases raw once, leaving third's reference
        EXPECT_EQ(raw->debugGetRefCount(), 1u);
        EXPECT_EQ(liveObjects, 2);
    }
    EXPECT_EQ(liveObjects, 0);
}

TEST(CZYRSmartPtrTest, InternalPointerProtocol) {
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
    ASSERT_NE(one, nullptr);
    EXPECT_EQ(ZYRMemSize(one), 1u);
    czyrsmartptrfree(one);
    czyrsmartptrfree(nullptr);
}

TEST(CZYRSmartPtrTest, ContainerAllocationFailureThrows) {
    zyrtest::FailingHost host;
    host.failAll = true;
    ZYRStd::tZYRMemMgr record = host.record();
    zyrtest::installFront(0, &record);
    try {
        czyrsmartptrfree(czyrsmartptralloc(16));
        ADD_FAILURE() << "must throw";
    } catch (const CZYRError& e) {
        EXPECT_EQ(e.getError(), ZYRPublic::kZYRErrorOutOfMemory);
        EXPECT_STREQ(e.getMessage(), "allocating smart ptr container");
        EXPECT_STREQ(e.getSrcFileName(), "source/zyr/std/CZYRSmartPtr");
        EXPECT_EQ(e.getSrcLineNumber(), 242);
    }
    zyrtest::installFront(0);
}

TEST(CZYRSmartPtrTest, SharedObjectSurvivesConcurrentCopies) {
    C_SmartPtr<PublicObject> shared(new PublicObject, false);
    std::vector<std::thread> threads;
    for (int t = 0; t < 2; ++t)
        threads.emplace_back([shared] {
            for (int i = 0; i < 50000; ++i) {
                C_SmartPtr<PublicObject> copy(shared);
                C_SmartPtr<PublicObject> another;
                another = copy;
            }
        });
    for (auto& t : threads)
        t.join();
    EXPECT_EQ(shared->debugGetRefCount(), 1u);
    shared.reset();
    EXPECT_EQ(liveObjects, 0);
}
