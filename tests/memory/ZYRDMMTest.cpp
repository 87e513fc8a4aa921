#include <gtest/gtest.h>

#include <chrono>
#include <future>
#include <thread>

#include "TestSupport.h"

using namespace ZYRStd;
using ZYRPublic::eFlushMemorySeverityNormal;
using ZYRPublic::eFlushMemorySeverityUrgent;

namespace {

struct FakeClient : I_FlushableMemoryClient {
    FakeClient(const char* name, unsigned int size, std::function<bool(unsigned int)> answer = {},
               bool threadSafe = false)
        : name(name), size(size), answer(std::move(answer)) {
        RegisterFlushableMemoryClient(this, threadSafe);
    }
    ~FakeClient() override { UnregisterFlushableMemoryClient(this); }
    bool flushMemory(unsigned int need, unsigned int reserved,
                     eFlushMemorySeverity severity) override {
        EXPECT_EQ(reserved, 0u);
        return requests.push_back(need), severities.push_back(severity), answer && answer(need);
    }
    unsigned int getFlushableMemorySize() override { return ++sizeQueries, size; }
    const char* getClientName() override { return name; }

    const char* name;
    unsigned int size, sizeQueries = 0;
    std::function<bool(unsigned int)> answer;
    std::vector<unsigned int> requests;
    std::vector<eFlushMemorySeverity> severities;
};

struct FakeQueue : ZYRPublic::I_SurfaceQueue {
    bool synchronize(bool noWait) override {
        EXPECT_FALSE(noWait);
        ++calls;
        return onSync ? onSync() : void(), true;
    }
    int calls = 0;
    std::function<void()> onSync;
};

const auto yes = [](unsigned int) { return true; };
using Block = std::unique_ptr<void, void (*)(void*)>;

class ZYRDMMTest : public ::testing::Test {
protected:
    void SetUp() override {
        tZYRMemMgr record = host_.record();
        zyrtest::installFront(0, &record);
        SetCZYRThreadSpecificPtr(new CZYRThreadSpecificPtr("interpreter", true));
        logPath_ = dir_.file("dmm.log");
        ::setenv("ZYR_DMM_LOG", logPath_.c_str(), 1);
        tZYRMemMgr any{};
        ZYRStdInit_ZYRDMMEnv_set(&any);
    }
    void TearDown() override {
        RegisterSurfaceQueueInstance(nullptr);
        tOEMFlushCB none{nullptr, nullptr};
        ZYRStdInit_OEMFlushCBSet(&none);
        ZYRStdInit_ZYRDMMEnv_set(nullptr);
        ::unsetenv("ZYR_DMM_LOG");
        SetCZYRThreadSpecificPtr(nullptr);
        zyrtest::installFront(0);
    }

    std::string closeLog() {
        ZYRStdInit_ZYRDMMEnv_set(nullptr);
        return zyrtest::readFile(logPath_);
    }

    zyrtest::FailingHost host_;
    zyrtest::TempDir dir_;
    std::string logPath_;
};

void* dmmMalloc(unsigned int size, I_FlushableMemoryClient* requester = nullptr) {
    return ZYRDMMMalloc(size, "TEST", nullptr, nullptr, requester, eFlushMemorySeverityNormal);
}

size_t count(const std::string& text, const std::string& what) {
    size_t n = 0;
    for (size_t at = text.find(what); at != std::string::npos; at = text.find(what, at + 1))
        ++n;
    return n;
}

} // namespace

TEST_F(ZYRDMMTest, NormalFlushAsksOnlyClientsLargeEnoughLargestFirst) {
    FakeClient small("small", 10), large("large", 50), middle("middle", 30);
    EXPECT_FALSE(ZYRFlushMemory(nullptr, 40, eFlushMemorySeverityNormal));
    EXPECT_TRUE(large.requests == std::vector<unsigned int>{40} && middle.requests.empty());
    EXPECT_EQ(small.sizeQueries + large.sizeQueries + middle.sizeQueries, 10u);
    middle.answer = yes;
    EXPECT_TRUE(ZYRFlushMemory(nullptr, 40, eFlushMemorySeverityUrgent));
    EXPECT_TRUE(large.requests.size() == 2 && middle.requests.size() == 1);
    EXPECT_TRUE(small.requests.empty()) << "the walk stops at the first success";
    std::string sizes[] = {"50", "30"};
    for (std::string& text : sizes)
        text = "---- flushable client\x92s total memory (before call): <" + text +
               " bytes> \t\t\t\t\t\t   \n---- flushable client\x92s total memory (after call): <" +
               text + " bytes> \n";
    const std::string whileOpen = zyrtest::readFile(logPath_); // written line by line
    EXPECT_EQ(closeLog(), whileOpen);
    EXPECT_EQ(whileOpen,
              "Client unknown is asking for 40 bytes with severity <0>\n"
              "-- Calling flushing client : <large> to arrange memory with severity <0> "
              "[memory need to be flushed = 40 bytes]\n-- Status :<flushing : Failed> \n" +
                  sizes[0] +
                  "-- Status : <No eligible flushable client> : severity = 0 : large has max "
                  "avail flushable size = 50\nClient unknown is asking for 40 bytes with "
                  "severity <1>\n-- Calling flushing client : <large> to arrange memory with "
                  "severity <1> \n-- Status :<flushing : Failed> \n" +
                  sizes[0] +
                  "-- Calling flushing client : <middle> to arrange memory with severity <1> \n"
                  "-- Status :<flushing : succeed> \n" +
                  sizes[1]);
}

TEST_F(ZYRDMMTest, RequesterIsNeverAskedAndNinthClientIsIgnored) {
    std::vector<std::unique_ptr<FakeClient>> clients;
    for (unsigned int i = 0; i < 10; ++i)
        clients.push_back(std::make_unique<FakeClient>("c", 100 + i));
    EXPECT_FALSE(ZYRFlushMemory(clients[9].get(), 1, eFlushMemorySeverityUrgent));
    for (unsigned int i = 0; i < 10; ++i)
        EXPECT_EQ(clients[i]->requests.size(), i < 8 ? 1u : 0u) << i;
    EXPECT_EQ(count(closeLog(), "-- Too many flushable clients \n"), 1u);
}

TEST_F(ZYRDMMTest, LadderDoublesTheDemandThenTriesOneUrgentFlushAndStopsALiar) {
    FakeClient cache("cache", 1u << 30, [](unsigned int need) { return need < 800; });
    host_.failAll = true;
    EXPECT_EQ(dmmMalloc(100), nullptr);
    EXPECT_EQ(cache.requests, (std::vector<unsigned int>{100, 200, 400, 800, 100}));
    EXPECT_EQ(cache.severities.back(), eFlushMemorySeverityUrgent);
    FakeClient liar("liar", ~0u, yes);
    EXPECT_EQ(dmmMalloc(64), nullptr);
    EXPECT_LE(liar.requests.size(), 40u);
    const std::string log = closeLog(), need = "Client : <TEST> , [memory needed = 100 bytes ] ";
    EXPECT_EQ(
        (std::vector{count(log, "Memory Allocation Failed for Client : <TEST>, [memory "
                                "needed = 100 bytes ] \n"),
                     count(log, "----  Memory allocation failed after flushing for " + need + "\n"),
                     count(log, "---- Memory allocation failed after SyncRendererThread for " +
                                    need + " \n")}),
        (std::vector<size_t>{1, 3, 1}));
    EXPECT_TRUE(log.starts_with("Memory Allocation Failed for Client") &&
                log.ends_with("------ Memory can not be flushed anymore, \n------ Client might "
                              "have some fallback mechanism to arrange memory\n"));
}

TEST_F(ZYRDMMTest, SuccessfulFlushLetsTheRetrySucceed) {
    FakeClient cache("cache", 4096, [this](unsigned int) { return !(host_.failAll = false); });
    host_.failAll = true;
    EXPECT_EQ(dmmMalloc(100, &cache), nullptr) << "the requester is the only client: skipped";
    EXPECT_NE(Block(dmmMalloc(100), ZYRFree), nullptr);
    EXPECT_EQ(count(closeLog(), "----  Memory allocation succeed after flushing for Client : "
                                "<TEST> , [memory needed = 100 bytes ] \n"),
              1u);
}

TEST_F(ZYRDMMTest, RendererCatchesUpBeforeAnyFlush) {
    void* bands = ZYRMalloc(1 << 20);
    FakeQueue queue;
    queue.onSync = [&] {
        ZYRFree(bands);
        host_.failAll = false;
    };
    RegisterSurfaceQueueInstance(&queue);
    FakeClient cache("cache", 1 << 30, yes);
    host_.failAll = true;
    EXPECT_NE(Block(dmmMalloc(1000), ZYRFree), nullptr);
    EXPECT_TRUE(queue.calls == 1 && cache.requests.empty());
    void* more = ZYRMalloc(4000);
    queue.onSync = [&] { ZYRFree(more); };
    EXPECT_FALSE(ArrangeMemoryBySyncRendererThread(4000, true)) << "the drop must exceed the need";
    EXPECT_EQ(count(closeLog(), "---- Memory allocation succeed after SyncRendererThread for "
                                "Client : <TEST> , [memory needed = 1000 bytes ]  \n"),
              1u);
}

TEST_F(ZYRDMMTest, ThreadsThatMayNotBlockNeverWaitOrFlush) {
    FakeQueue queue;
    RegisterSurfaceQueueInstance(&queue);
    FakeClient cache("cache", 1 << 30, yes);
    host_.failAll = true;
    std::thread([this] {
        EXPECT_EQ(dmmMalloc(10), nullptr);
        host_.failAll = false;
        SetCZYRThreadSpecificPtr(new CZYRThreadSpecificPtr("host", false));
        host_.failAll = true;
        EXPECT_EQ(dmmMalloc(10), nullptr);
        EXPECT_FALSE(ZYRFlushMemory(nullptr, 10, eFlushMemorySeverityUrgent));
    }).join();
    EXPECT_TRUE(queue.calls == 0 && cache.requests.empty());
    EXPECT_EQ(count(closeLog(), "Memory can not be arranged for this thread \n"), 3u);
}

TEST_F(ZYRDMMTest, ZeroBytesAndTheOEMCallback) {
    EXPECT_EQ(dmmMalloc(0), nullptr);
    tOEMFlushCB oem{[](unsigned int need, unsigned int reserved, eFlushMemorySeverity, void* data) {
                        return reserved == 0 && data == reinterpret_cast<void*>(0x42) && need == 7;
                    },
                    reinterpret_cast<void*>(0x42)};
    ZYRStdInit_OEMFlushCBSet(&oem);
    EXPECT_TRUE(ZYRFlushMemory(nullptr, 7, eFlushMemorySeverityNormal));
    EXPECT_FALSE(ZYRFlushMemory(nullptr, 8, eFlushMemorySeverityUrgent));
    EXPECT_EQ(closeLog(),
              "Client unknown is asking for 7 bytes with severity <0>\n"
              "-- Calling flushing client : <OEM> to arrange memory with severity <0> "
              "[memory need to be flushed = 7 bytes] \n-- Status :<flushing : succeed> \n"
              "Client unknown is asking for 8 bytes with severity <1>\n"
              "-- Calling flushing client : <OEM> to arrange memory with severity <1> \n"
              "-- Status :<flushing : failed> \n-- Status : <No eligible flushable client> : "
              "severity = 1 : none has max avail flushable size = 0\n");
}

TEST_F(ZYRDMMTest, ThreadSafeFlushUsesItsOwnListAndStoredSizes) {
    FakeClient smaller("smaller", 60, {}, true), everywhere("everywhere", 100, yes, true),
        tie("tie", 100, {}, true), mainOnly("mainOnly", 500, yes);
    EXPECT_TRUE(ZYRFlushMemoryThreadSafe(nullptr, 50, eFlushMemorySeverityNormal));
    EXPECT_TRUE(mainOnly.requests.empty() && everywhere.requests.size() == 1 &&
                tie.requests.empty() && smaller.requests.empty())
        << "largest first; equal sizes keep their registration order";
    EXPECT_FALSE(ZYRFlushMemoryThreadSafe(&everywhere, 50, eFlushMemorySeverityNormal));
    UnregisterFlushableMemoryClient(&everywhere);
    EXPECT_FALSE(ZYRFlushMemoryThreadSafe(nullptr, 50, eFlushMemorySeverityNormal));
    EXPECT_TRUE(closeLog().starts_with(
        "ZYRFlushMemoryThreadSafe: Client unknown is asking for 50 bytes with severity <0>\n-- "
        "Calling flushing client : <everywhere> to arrange memory with severity <0> [memory need "
        "to be flushed = 50 bytes]\n-- Status :<flushing : succeeded> \n---- flushable "
        "client\x92s total memory (before call): <100 bytes> \t\t\t\t   \n"));
}

TEST_F(ZYRDMMTest, EngineClientsCountPerThread) {
    ZYRSetMemLimit(400ull << 20);
    EXPECT_EQ(DMM_JOVAlloc(DMM_GetJOVAllocMaxSingleBlockSize() + 1), nullptr);
    unsigned long long earlier = 0, peak = 0; // the peak lasts for the process
    DMM_SetMemoryClientThreadID(eZYRMemoryClientInterp, GetCZYRThreadSpecificPtr()->getThreadId());
    DMM_GetCurrTUMAMem(eZYRMemoryClientInterp, &earlier);
    void *tuma = DMM_TUMAAlloc(nullptr, 100), *jov = DMM_JOVAlloc(0), *other = nullptr;
    ASSERT_TRUE(tuma && jov && DMM_JOVMemSize(jov) == 1);
    std::thread([&] { other = DMM_TUMAAlloc(nullptr, 50); }).join();
    EXPECT_TRUE(DMM_GetCurrTUMAMem(eZYRMemoryClientInterp, &peak) == 100 &&
                peak == std::max(earlier, 100ull));
    EXPECT_EQ(DMM_GetCurrTUMAMem(eZYRMemoryClientAll, nullptr), 150u);
    EXPECT_EQ((std::vector{DMM_GetCurrTUMAJOVMem(eZYRMemoryClientInterp),
                           DMM_GetCurrTUMAJOVMem(eZYRMemoryClientOthers),
                           DMM_GetCurrTUMAJOVMem(eZYRMemoryClientAll)}),
              (std::vector<unsigned long long>{101, 50, 151}));
    tuma = DMM_TUMAReAlloc(nullptr, tuma, 300);
    EXPECT_TRUE(DMM_GetCurrTUMAMem(eZYRMemoryClientInterp, &peak) == 300 &&
                peak == std::max(earlier, 300ull));
    DMM_TUMAFree(nullptr, other); // by the interpreter: "others" clamps at 0
    DMM_TUMAFree(nullptr, tuma);
    EXPECT_EQ(DMM_GetCurrTUMAMem(eZYRMemoryClientInterp, nullptr), 0u);
    DMM_JOVFree(jov);
    EXPECT_EQ(DMM_GetCurrTUMAJOVMem(eZYRMemoryClientAll), 0u);
    DMM_SetMemoryClientThreadID(eZYRMemoryClientInterp, ~0ull);
    EXPECT_EQ(closeLog(), "");
}

TEST_F(ZYRDMMTest, TumaLadderFlushesThenGivesUp) {
    FakeClient cache("cache", 1 << 30, yes);
    host_.failAll = true;
    EXPECT_EQ(DMM_TUMAAlloc(nullptr, 64), nullptr);
    EXPECT_EQ(cache.requests, (std::vector<unsigned int>{64, 128}));
    const std::string log = closeLog();
    EXPECT_TRUE(log.starts_with(
        "Memory Allocation Failed : Client = <TUMA> [memory needed = 64 bytes ]  \n"));
    EXPECT_EQ(count(log, "----  Memory allocation failed after flushing for Client: <TUMA> "
                         "[memory needed = 64 bytes ] \n"),
              2u);
}

TEST_F(ZYRDMMTest, PerNameStatisticsAreWrittenAtClose) {
    for (const auto& [bytes, add] :
         {std::pair{100u, true}, {50u, true}, {120u, false}, {10u, true}})
        UpdateClientMemoryStat("zeta", bytes, add);
    UpdateClientMaxMemoryStat("alpha", 7);
    UpdateClientMaxMemoryStat("alpha", 3);
    UpdateClientMemoryStat("beta", 40, false); // only ever given back: no peak to report
    LogDMMInfo("info %d\n", 5);
    LogSubAlocInfo("sub");
    EXPECT_EQ(closeLog(), "info 5\nsub\nClient = alpha Peak Memory Usage = 7 \n\n"
                          "Client = zeta Peak Memory Usage = 150 \n\n");
    UpdateClientMemoryStat("ignored", 1, true); // the log is closed: nothing is kept
    LogDMMInfo("lost");
}

TEST_F(ZYRDMMTest, ClientTotalsDoNotWaitBehindAFlush) {
    std::promise<void> flushing, release;
    std::shared_future<void> released = release.get_future().share();
    FakeClient slow("slow", 1000,
                    [&](unsigned int) { return flushing.set_value(), released.wait(), false; }),
        other("other", 23);
    std::thread flusher([] {
        SetCZYRThreadSpecificPtr(new CZYRThreadSpecificPtr("flusher", true));
        ZYRFlushMemory(nullptr, 10, eFlushMemorySeverityNormal);
        SetCZYRThreadSpecificPtr(nullptr);
    });
    flushing.get_future().wait();
    unsigned long long flushable = 0, limit = 0, used = 0;
    auto totals = std::async(std::launch::async,
                             [&] { GetClientsMemoryUsedAndMemoryLimit(flushable, limit, used); });
    const bool answered = totals.wait_for(std::chrono::seconds(5)) == std::future_status::ready;
    release.set_value();
    flusher.join();
    totals.wait();
    EXPECT_TRUE(answered) << "the totals waited behind the flush";
    GetClientsMemoryUsedAndMemoryLimit(flushable, limit, used);
    tZYRVirtualMemoryInfo info{};
    VirtualMemStatus(&info);
    EXPECT_TRUE(flushable == 1023 && used == GetMemUsage() &&
                limit == std::min<unsigned long long>(ZYRGetMemLimit(), info.totalPhysical));
}
