#include <gtest/gtest.h>

#include <thread>

#include "RecordingKelvrin.h"
#include "TestSupport.h"
#include "zyr/std/config/ZYRStartupOptions.h"
#include "zyr/std/instrument/CZYRAnalyticsData.h"
#include "zyr/std/instrument/Farlamp.h"
#include "zyr/std/instrument/IImpZYRAnalyticsManager.h"

using namespace ZYRStd;
using Calls = std::vector<std::string>;

namespace {

class IImpZYRAnalyticsManagerTest : public ::testing::Test {
protected:
    void SetUp() override {
        recorder.refuseSessions(false);
        ZYRSetAnalyticsLogFolder(folder.c_str());
        (void)recorder.take();
    }
    void TearDown() override {
        recorder.setDelay(0);
        ZYRAnalyticsManagerTerm();
        ZYRSetAnalyticsActive(false);
        ZYRSetAnalyticsLogFolder(nullptr);
        (void)recorder.take();
    }
    void start() {
        ZYRSetAnalyticsActive(true);
        ASSERT_TRUE(ZYRAnalyticsManagerInit() && ZYRIsAnalyticsActive());
        (void)recorder.take();
    }
    static std::string produce(unsigned int n) {
        CZYRAnalyticsData record;
        record.set(CZYRUniString("DataGroupName"), CZYRUniString("DripSessionInfo"));
        record.set(CZYRUniString("NumWorkers"), n);
        const std::string error = zyrtest::thrown([&] { record.finalize(); });
        EXPECT_EQ(record.isFinalized(), error == "no error");
        return error;
    }

    zyrtest::RecordingKelvrin& recorder = zyrtest::RecordingKelvrin::get();
    zyrtest::TempDir dir;
    std::u16string folder{dir.path().begin(), dir.path().end()};
};

} // namespace

TEST_F(IImpZYRAnalyticsManagerTest, InitFollowsTheSession) {
    ZYRSetAnalyticsActive(false);
    EXPECT_TRUE(ZYRAnalyticsManagerInit());
    IZYRAnalyticsManager* const first = GetZYRAnalyticsManager();
    EXPECT_TRUE(first && !ZYRIsAnalyticsActive() && !CZYRAnalyticsData().isAnalyticsEnabled());
    EXPECT_TRUE(ZYRAnalyticsManagerInit() && GetZYRAnalyticsManager() == first)
        << "a no-op while running";
    EXPECT_TRUE(ZYRAnalyticsManagerTerm() && !GetZYRAnalyticsManager());
    EXPECT_EQ(recorder.take(), (Calls{"UTInitialize(ZYRStd,0,<null>)", "UTSetOptIn(0)",
                                      "UTStartSession(Print,ZYRStd,0.1.0.0,0.1,,./AnalyticsLogs)",
                                      "UTCloseSession()"}));
    EXPECT_FALSE(ZYREnqueueAnalyticsRecord(C_SmartPtr<ZYRPublic::I_AnalyticsData>()));

    recorder.refuseSessions(true);
    ZYRSetAnalyticsActive(true);
    EXPECT_TRUE(ZYRAnalyticsManagerInit());
    EXPECT_TRUE(!GetZYRAnalyticsManager() && !ZYRIsAnalyticsActive() && !Farlamp::LoggingEnabled());
    (void)recorder.take();
    EXPECT_TRUE(ZYRAnalyticsManagerTerm() && ZYRAnalyticsManagerTerm() && recorder.take().empty());
}

TEST_F(IImpZYRAnalyticsManagerTest, RecordsAreLoggedInEnqueueOrder) {
    start();
    GetZYRAnalyticsManager()->enqueue(C_SmartPtr<ZYRPublic::I_AnalyticsData>()); // ignored
    constexpr unsigned int kRecords = 50;
    Calls expected;
    for (unsigned int i = 0; i < kRecords; ++i) {
        EXPECT_EQ(produce(i), "no error");
        const std::string id = std::to_string(100 + i);
        expected.push_back("UTNewDataGroup(DripSessionInfo,,DripSessionInfo)=" + id);
        expected.push_back("UTAddToGroup(" + id + ",NumWorkers," + std::to_string(i) + ")");
    }
    EXPECT_EQ(recorder.waitFor(2 * kRecords), expected);
}

TEST_F(IImpZYRAnalyticsManagerTest, TerminationDropsWhatTheWorkerHasNotReached) {
    start();
    recorder.setDelay(50);
    const int startedBefore = recorder.callsStarted();
    for (unsigned int i = 0; i < 5; ++i)
        produce(i);
    while (recorder.callsStarted() == startedBefore)
        std::this_thread::yield();
    std::thread terminator([] { ZYRAnalyticsManagerTerm(); });
    std::string error;
    for (unsigned int i = 0; error == "no error" || error.empty(); ++i)
        error = produce(i);
    terminator.join();
    EXPECT_TRUE(zyrtest::startsWith(error, "20: Attempt to enqueue Job after ZYRTerminate "
                                           "called. (source/zyr/std/IImpZYRAnalyticsManager:"))
        << error;
    EXPECT_EQ(GetZYRAnalyticsManager(), nullptr);
    EXPECT_EQ(
        recorder.take(),
        (Calls{"UTNewDataGroup(DripSessionInfo,,DripSessionInfo)=100",
               "UTAddToGroup(100,NumWorkers,0)", "UTNewDataGroup(ProductInfo,,ProductInfo)=101",
               "UTAddToGroup(101,OEMName,NoData)", "UTAddToGroup(101,OEMModelName,NoData)",
               "UTAddToGroup(101,NumDevices,NoData)", "UTAddToGroup(101,InstanceMode,NoData)",
               "UTCloseSession()"}));
}

TEST_F(IImpZYRAnalyticsManagerTest, ProducersNeverWaitForASleepingLibrary) {
    start();
    recorder.setDelay(1000);
    std::thread producer([] {
        for (unsigned int i = 0; i < 20; ++i)
            produce(i);
    });
    producer.join();
    for (unsigned int i = 20; i < 40; ++i)
        produce(i);
    EXPECT_EQ(recorder.take(), Calls{});
}
