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
        recorder.hold(false);
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
    EXPECT_EQ(recorder.take().back(), "UTCloseSession()") << "the session follows the manager";
    EXPECT_FALSE(ZYREnqueueAnalyticsRecord(C_SmartPtr<ZYRPublic::I_AnalyticsData>()));

    recorder.refuseSessions(true);
    ZYRSetAnalyticsActive(true);
    EXPECT_TRUE(ZYRAnalyticsManagerInit());
    EXPECT_TRUE(!GetZYRAnalyticsManager() && !ZYRIsAnalyticsActive() && !Farlamp::LoggingEnabled());
    (void)recorder.take();
    EXPECT_TRUE(ZYRAnalyticsManagerTerm() && ZYRAnalyticsManagerTerm() && recorder.take().empty());
}

TEST_F(IImpZYRAnalyticsManagerTest, TerminationDropsWhatTheWorkerHasNotReached) {
    start();
    recorder.hold(true);
    produce(0);
    recorder.awaitHeldCall(); // the worker is inside the library with record 0
    std::thread terminator([] { ZYRAnalyticsManagerTerm(); });
    std::string error;
    for (unsigned int i = 1; error == "no error" || error.empty(); ++i)
        error = produce(i);
    recorder.hold(false);
    terminator.join();
    EXPECT_TRUE(zyrtest::startsWith(error, "20: Attempt to enqueue Job after ZYRTerminate "
                                           "called. (source/zyr/std/IImpZYRAnalyticsManager:"))
        << error;
    EXPECT_EQ(GetZYRAnalyticsManager(), nullptr);
    // Record 0, then the session's close; records beyond the queue's bound may be counted
    // as dropped, as a loaded machine lets the producer run ahead of the terminator.
    Calls calls = recorder.take();
    std::erase_if(calls, [](const std::string& c) { return c.starts_with("UTAddToSession("); });
    EXPECT_TRUE(calls.size() == 8 && calls[1] == "UTAddToGroup(100,NumWorkers,0)" &&
                calls[2] == "UTNewDataGroup(ProductInfo,,ProductInfo)=101" &&
                calls.back() == "UTCloseSession()")
        << calls.size();
}

// Producers never wait for a stalled library, and the queue behind it stays bounded: what
// does not fit is dropped and counted into the session at close.
TEST_F(IImpZYRAnalyticsManagerTest, QueueBehindAStalledLibraryIsBounded) {
    start();
    GetZYRAnalyticsManager()->enqueue(C_SmartPtr<ZYRPublic::I_AnalyticsData>()); // ignored
    recorder.hold(true);
    produce(0);
    recorder.awaitHeldCall();
    constexpr unsigned int kBound = 1024, kOver = 5;
    for (unsigned int i = 1; i <= kBound + kOver; ++i)
        ASSERT_EQ(produce(i), "no error");
    EXPECT_EQ(recorder.take(), Calls{});
    recorder.hold(false);
    Calls expected; // the first kBound + 1 records, in enqueue order
    for (unsigned int i = 0; i <= kBound; ++i) {
        const std::string id = std::to_string(100 + i);
        expected.push_back("UTNewDataGroup(DripSessionInfo,,DripSessionInfo)=" + id);
        expected.push_back("UTAddToGroup(" + id + ",NumWorkers," + std::to_string(i) + ")");
    }
    EXPECT_EQ(recorder.waitFor(expected.size()), expected);
    ZYRAnalyticsManagerTerm();
    const Calls closing = recorder.take();
    EXPECT_TRUE(closing.size() >= 2 &&
                closing[closing.size() - 2] ==
                    "UTAddToSession(DroppedRecords," + std::to_string(kOver) + ")");
}
