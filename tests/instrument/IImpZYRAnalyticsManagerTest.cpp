// The analytics manager: start-up against the telemetry session, logging in enqueue order on
// its own thread, termination, and producers that never wait for a slow telemetry library.
#include <gtest/gtest.h>

#include <string>
#include <thread>
#include <vector>

#include "RecordingKelvrin.h"
#include "TestSupport.h"
#include "zyr/std/config/ZYRStartupOptions.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/CZYRErrorStk.h"
#include "zyr/std/instrument/CZYRAnalyticsData.h"
#include "zyr/std/instrument/Farlamp.h"
#include "zyr/std/instrument/IImpZYRAnalyticsManager.h"

using namespace ZYRStd;
using namespace ZYRPublic;
using zyrtest::RecordingKelvrin;

namespace {

class IImpZYRAnalyticsManagerTest : public ::testing::Test {
protected:
    void SetUp() override {
        recorder.setDelay(0);
        recorder.refuseSessions(false);
        folder = std::u16string(dir.path().begin(), dir.path().end());
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

    // A finalized drip-session record whose "NumWorkers" is `n`.
    static void produce(unsigned int n) {
        CZYRAnalyticsData record;
        record.set(CZYRUniString("DataGroupName"), CZYRUniString("DripSessionInfo"));
        record.set(CZYRUniString("NumWorkers"), n);
        record.finalize();
    }

    RecordingKelvrin& recorder = RecordingKelvrin::get();
    zyrtest::TempDir dir;
    std::u16string folder;
};

} // namespace

TEST_F(IImpZYRAnalyticsManagerTest, InitFollowsTheSession) {
    // Inactive: the session still starts (recording nothing); records stay disabled.
    ZYRSetAnalyticsActive(false);
    EXPECT_TRUE(ZYRAnalyticsManagerInit());
    EXPECT_NE(GetZYRAnalyticsManager(), nullptr);
    EXPECT_FALSE(ZYRIsAnalyticsActive());
    EXPECT_FALSE(CZYRAnalyticsData().isAnalyticsEnabled());
    IZYRAnalyticsManager* first = GetZYRAnalyticsManager();
    EXPECT_TRUE(ZYRAnalyticsManagerInit()); // a no-op while running
    EXPECT_EQ(GetZYRAnalyticsManager(), first);
    EXPECT_TRUE(ZYRAnalyticsManagerTerm());
    EXPECT_EQ(GetZYRAnalyticsManager(), nullptr);
    const std::vector<std::string> expected = {
        "UTInitialize(ZYRStd,0,<null>)", "UTSetOptIn(0)",
        "UTStartSession(Print,ZYRStd,0.1.0.0,0.1,,./AnalyticsLogs)", "UTCloseSession()"};
    EXPECT_EQ(recorder.take(), expected);

    // A session that cannot start leaves analytics inactive and no manager.
    recorder.refuseSessions(true);
    ZYRSetAnalyticsActive(true);
    EXPECT_TRUE(ZYRAnalyticsManagerInit());
    EXPECT_EQ(GetZYRAnalyticsManager(), nullptr);
    EXPECT_FALSE(ZYRIsAnalyticsActive());
    EXPECT_FALSE(Farlamp::LoggingEnabled());

    // Term without a manager only closes the session.
    (void)recorder.take();
    EXPECT_TRUE(ZYRAnalyticsManagerTerm());
    EXPECT_TRUE(ZYRAnalyticsManagerTerm());
    EXPECT_EQ(recorder.take(), std::vector<std::string>{});
}

TEST_F(IImpZYRAnalyticsManagerTest, RecordsAreLoggedInEnqueueOrder) {
    ZYRSetAnalyticsActive(true);
    ASSERT_TRUE(ZYRAnalyticsManagerInit());
    ASSERT_TRUE(ZYRIsAnalyticsActive());
    (void)recorder.take();
    constexpr unsigned int kRecords = 50;
    for (unsigned int i = 0; i < kRecords; ++i)
        produce(i);
    const auto calls = recorder.waitFor(2 * kRecords);
    ASSERT_EQ(calls.size(), 2 * kRecords);
    for (unsigned int i = 0; i < kRecords; ++i) {
        EXPECT_EQ(calls[2 * i],
                  "UTNewDataGroup(DripSessionInfo,,DripSessionInfo)=" + std::to_string(100 + i));
        EXPECT_EQ(calls[2 * i + 1], "UTAddToGroup(" + std::to_string(100 + i) + ",NumWorkers," +
                                        std::to_string(i) + ")");
    }
}

TEST_F(IImpZYRAnalyticsManagerTest, TerminationDropsWhatTheWorkerHasNotReached) {
    ZYRSetAnalyticsActive(true);
    ASSERT_TRUE(ZYRAnalyticsManagerInit());
    (void)recorder.take();
    recorder.setDelay(50);
    const int startedBefore = recorder.callsStarted();
    for (unsigned int i = 0; i < 5; ++i)
        produce(i);
    // The worker is inside the first record's first call when termination begins.
    while (recorder.callsStarted() == startedBefore)
        std::this_thread::yield();

    std::thread terminator([] { ZYRAnalyticsManagerTerm(); });
    // Records finalized while the manager terminates fail with the enqueue error.
    bool refused = false;
    while (!refused) {
        CZYRAnalyticsData record;
        record.set(CZYRUniString("DataGroupName"), CZYRUniString("DripSessionInfo"));
        try {
            record.finalize();
        } catch (const CZYRError& e) {
            refused = true;
            EXPECT_EQ(e.getError(), kZYRErrorInvalidFuncCall);
            EXPECT_STREQ(e.getMessage(), "Attempt to enqueue Job after ZYRTerminate called.");
            EXPECT_STREQ(e.getSrcFileName(), "source/zyr/std/IImpZYRAnalyticsManager");
            EXPECT_FALSE(record.isFinalized());
        }
    }
    terminator.join();
    recorder.setDelay(0);
    EXPECT_EQ(GetZYRAnalyticsManager(), nullptr);
    // Only the record the worker was logging got through; the session was closed after it.
    const std::vector<std::string> expected = {
        "UTNewDataGroup(DripSessionInfo,,DripSessionInfo)=100",
        "UTAddToGroup(100,NumWorkers,0)",
        "UTNewDataGroup(ProductInfo,,ProductInfo)=101",
        "UTAddToGroup(101,OEMName,NoData)",
        "UTAddToGroup(101,OEMModelName,NoData)",
        "UTAddToGroup(101,NumDevices,NoData)",
        "UTAddToGroup(101,InstanceMode,NoData)",
        "UTCloseSession()"};
    EXPECT_EQ(recorder.take(), expected);
}

TEST_F(IImpZYRAnalyticsManagerTest, ProducersNeverWaitForASleepingLibrary) {
    ZYRSetAnalyticsActive(true);
    ASSERT_TRUE(ZYRAnalyticsManagerInit());
    (void)recorder.take();
    recorder.setDelay(1000);
    // Each telemetry call sleeps a second before it is recorded: a producer that waited for
    // logging would find a recorded call when its finalize returned.
    std::thread producer([] {
        for (unsigned int i = 0; i < 20; ++i)
            produce(i);
    });
    producer.join();
    for (unsigned int i = 20; i < 40; ++i)
        produce(i);
    EXPECT_EQ(recorder.take(), std::vector<std::string>{});
    recorder.setDelay(0);
}
