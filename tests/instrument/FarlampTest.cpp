#include <gtest/gtest.h>

#include <filesystem>
#include <future>

#include "RecordingKelvrin.h"
#include "TestSupport.h"
#include "zyr/std/config/ZYRStartupOptions.h"
#include "zyr/std/core/CZYRErrorStk.h"
#include "zyr/std/instrument/CZYRAnalyticsData.h"
#include "zyr/std/instrument/Farlamp.h"
#include "zyr/std/values/CZYRDict.h"

using namespace ZYRStd;
using namespace ZYRPublic;
using zyrtest::RecordingKelvrin;
using Calls = std::vector<std::string>;

namespace {

std::u16string wide(const std::string& s) {
    return std::u16string(s.begin(), s.end());
}

Calls group(int id, const char* name, std::initializer_list<const char*> entries,
            const char* label = nullptr) {
    const std::string number = std::to_string(id);
    Calls calls;
    if (name)
        calls.push_back(std::string("UTNewDataGroup(") + name + ",," + (label ? label : name) +
                        ")=" + number);
    for (const char* entry : entries)
        calls.push_back("UTAddToGroup(" + number + "," + entry + ")");
    return calls;
}

Calls operator+(Calls first, const Calls& second) {
    first.insert(first.end(), second.begin(), second.end());
    return first;
}

std::u16string drainErrorStack() {
    std::u16string text;
    return CZYRErrorStk().getErrorMessage(text) ? text : u"";
}

template <class R> void setPairs(R&) {}
template <class R, class Value, class... Rest>
void setPairs(R& r, const char* key, Value value, Rest... rest) {
    r.set(CZYRUniString(key), value);
    setPairs(r, rest...);
}
template <class R = CZYRAnalyticsData, class... Pairs> R record(const char* group, Pairs... pairs) {
    ZYRSetAnalyticsActive(true);
    R r;
    if (group)
        r.set(CZYRUniString("DataGroupName"), CZYRUniString(group));
    setPairs(r, pairs...);
    return r;
}

class FarlampTest : public ::testing::Test {
protected:
    void SetUp() override {
        recorder.refuseSessions(false);
        drainErrorStack();
    }
    void TearDown() override {
        recorder.hold(false);
        Farlamp::CloseSession();
        ZYRSetAnalyticsActive(false);
        (void)recorder.take();
    }
    void start() {
        ASSERT_TRUE(Farlamp::StartSession(true, wide(dir.path()).c_str()));
        ASSERT_TRUE(Farlamp::LoggingEnabled());
        (void)recorder.take();
    }
    // The calls made so far: a record waits for the writer, which runs calls in order.
    Calls settled() {
        Farlamp::LogDataObject(record("NoSuchGroup"));
        return recorder.take();
    }

    RecordingKelvrin& recorder = RecordingKelvrin::get();
    zyrtest::TempDir dir;
};

} // namespace

TEST_F(FarlampTest, SessionFolderIsProbedWithFallback) {
    // The probe neither follows a link into someone's file nor deletes a file of that name.
    const std::string fresh = dir.file("logs"), precious = dir.file("precious");
    zyrtest::writeFile(precious, "keep");
    std::filesystem::create_directory(fresh);
    std::filesystem::create_symlink(precious, fresh + "/test.txt");
    zyrtest::writeFile(fresh + "/.zyrstd-probe-XXXXXX", "mine");
    ASSERT_TRUE(Farlamp::StartSession(true, wide(fresh).c_str()));
    EXPECT_TRUE(zyrtest::readFile(precious) == "keep" &&
                zyrtest::readFile(fresh + "/.zyrstd-probe-XXXXXX") == "mine" &&
                std::distance(std::filesystem::directory_iterator(fresh), {}) == 2);
    EXPECT_EQ(recorder.take(), (Calls{"UTInitialize(ZYRStd,0,<null>)", "UTSetOptIn(1)",
                                      "UTStartSession(Print,ZYRStd,0.1.0.0,0.1,," + fresh + ")"}));
    EXPECT_TRUE(Farlamp::StartSession(true, wide(fresh).c_str()) && recorder.take().empty() &&
                drainErrorStack().empty())
        << "a second start keeps it";

    zyrtest::writeFile(dir.file("plain"), "x");
    const std::string kDefault = "UTStartSession(Print,ZYRStd,0.1.0.0,0.1,,./AnalyticsLogs)";
    for (const std::string& folder :
         {dir.file("plain") + "/logs", dir.file("plain"), std::string()}) {
        Farlamp::CloseSession();
        (void)recorder.take();
        ASSERT_TRUE(Farlamp::StartSession(true, wide(folder).c_str()));
        EXPECT_EQ(recorder.take().back(), kDefault) << folder;
        EXPECT_EQ(drainErrorStack(),
                  folder.empty() ? u"" : u" Default directory was used to store analytics logs \n");
    }

    Farlamp::CloseSession();
    (void)recorder.take();
    ASSERT_TRUE(Farlamp::StartSession(false, wide(fresh).c_str()));
    EXPECT_FALSE(Farlamp::LoggingEnabled());
    EXPECT_EQ(recorder.take(), (Calls{"UTInitialize(ZYRStd,0,<null>)", "UTSetOptIn(0)", kDefault}));
    Farlamp::LogDataObject(record("DripSessionInfo"));
    Farlamp::LogZYRError(kZYRErrorBadParam, "Area", "f.cpp");
    Farlamp::LogDict(CZYRDict());
    Farlamp::LogEventNow(kZYRAnalyticsEventGlobalRasterization);
    Farlamp::UpdateCurrentSurfaceInfo(1, 1, 1);
    Farlamp::LogSurfaceDataGroup();
    Farlamp::FlushJob(1);
    EXPECT_EQ(Farlamp::LogEvent(kZYRAnalyticsEventGlobalRasterization, false), 0u);
    Farlamp::CloseSession();
    EXPECT_EQ(recorder.take(), Calls{"UTCloseSession()"}) << "nothing logged while off";

    recorder.refuseSessions(true);
    EXPECT_FALSE(Farlamp::StartSession(true, wide(fresh).c_str()) || Farlamp::LoggingEnabled());
}

TEST_F(FarlampTest, EveryGroupIsDispatchedByName) {
    start();
    using S = CZYRUniString;
    Farlamp::LogDataObject(record("ProductInfo", "OEMName", S("Acme"), "OEMModelName", S("P1"),
                                  "NumDevices", S("2"), "InstanceMode", S("Single"), "xobjMode",
                                  2u));
    Farlamp::LogDataObject(record("FontInfo", "NumSubstFont", 3u, "UseDefaultFont", true,
                                  "UseFontEmulation", int32_t{-1}));
    Farlamp::LogDataObject(record("DripSessionInfo", "NumWorkers", 4u, "WorkerCrashedCount", 0u));
    Farlamp::LogDataObject(record("dripCntrlJobInfo", "JobStatus", S("Done"), "JobCompleteTime",
                                  2.5, "NumSurfaces", 9u));
    Farlamp::LogDataObject(record("ErrorInfo", "Area", S("PDF"), "Type", S("kZYRErrorPDF"),
                                  "Parameter1", S("page 3")));
    const auto job = record("JobInfo", "StartTime", 10.0, "SurfaceCount", 2u, "TotalMediaSize", 1.5,
                            "ErrorOccured", S(u"n\u00e9"));
    Farlamp::LogDataObject(job);
    const auto raster =
        record("RasterCacheInfo", "NumSmallRasters", 5u, "RasterDiskCachingEnabled", false);
    Farlamp::LogDataObject(raster);
    const auto dl = record("DLCacheInfo", "NumLargeDLs", 1u);
    Farlamp::LogDataObject(dl);
    Farlamp::LogDataObject(record("NoSuchGroup"));
    Farlamp::LogDataObject(record(nullptr));
    Farlamp::LogDataObject(C_SmartPtr<I_AnalyticsData>());
    EXPECT_EQ(settled(),
              group(100, "ProductInfo",
                    {"OEMName,Acme", "OEMModelName,P1", "NumDevices,2", "InstanceMode,Single",
                     "xobjMode,2"}) +
                  group(101, "FontInfo",
                        {"NumSubstFont,3", "PreferredFont,ERROR : PreferredFont Not Found",
                         "UseDefaultFont,1", "UseFontEmulation,-1"}) +
                  group(102, "DripSessionInfo", {"NumWorkers,4", "WorkerCrashedCount,0"}) +
                  group(103, "dripCntrlJobInfo",
                        {"JobStatus,Done", "JobCompleteTime,2.5", "NumSurfaces,9"}) +
                  group(104, "ErrorInfo", {"Area,PDF", "Type,kZYRErrorPDF", "Parameter1,page 3"}) +
                  group(105, "JobInfo",
                        {"SurfaceCount,2", "TotalMediaSize,1.5", "ErrorOccured,n\xc3\xa9"}) +
                  group(105, nullptr,
                        {"NumSmallRasters,5", "RasterDiskCachingEnabled,0", "NumLargeDLs,1"}));

    Farlamp::LogEvent(kZYRAnalyticsEventHasTransparency, false);
    Farlamp::FlushJob(12.345);
    EXPECT_EQ(settled(),
              group(105, nullptr, {"CompletionTime,2.35", "HasTrapping,0", "HasTransparency,1"}));
    Farlamp::LogDataObject(job);
    EXPECT_EQ(settled().front(), "UTNewDataGroup(JobInfo,,JobInfo)=106");
    Farlamp::LogDataObject(record("ProductInfo", "xobjMode", 1u));
    Farlamp::LogDataObject(raster);
    Farlamp::LogDataObject(dl);
    EXPECT_EQ(settled(), group(100, nullptr, {"xobjMode,1"})) << "the product group is reused";
    Farlamp::CloseSession();
    EXPECT_EQ(settled(), Calls{"UTCloseSession()"});
}

TEST_F(FarlampTest, DocumentFactsAndErrors) {
    start();
    using S = CZYRUniString;
    CZYRDict info =
        record<CZYRDict>("PDFInfo", "PDFMajorVersion", 1u, "PDFMinorVersion", int32_t{7}, "PDFX",
                         true, "PDFCreatorApp", S("Writer"), "PDFPreTrapped", S("False"),
                         "SecurityType", 0u, "NumPages", 12u);
    Farlamp::LogDict(info);
    EXPECT_EQ(settled(), group(100, "PDFInfo",
                               {"PDFVersion,1.7", "PDFX,1", "creatorApp,Writer", "PreTrapped,False",
                                "HasPassword,0", "NumPages,12"}));
    info.remove(CZYRUniString("PDFMinorVersion"));
    Farlamp::LogDict(info);
    EXPECT_EQ(settled()[1], "UTAddToGroup(101,PDFX,1)") << "no version without both parts";
    info.set(CZYRUniString("DataGroupName"), CZYRUniString("Other"));
    Farlamp::LogDict(info);
    EXPECT_EQ(settled(), Calls{});

    Farlamp::LogZYRError(kZYRErrorBadParam, "Streams", "source/zyr/std\\deep/CZYRDict.cpp");
    Farlamp::LogZYRError(kZYRErrorFatal, "Init", "plain.cpp");
    EXPECT_EQ(settled(), group(102, "ErrorInfo",
                               {"Area,Streams", "Type,kZYRErrorBadParam", "Parameter1,CZYRDict.cpp",
                                "Parameter2,", "Parameter3,", "Fatal,0"}) +
                             group(103, "ErrorInfo",
                                   {"Area,Init", "Type,kZYRErrorFatal", "Parameter1,plain.cpp",
                                    "Parameter2,", "Parameter3,", "Fatal,1"}));
    EXPECT_EQ(drainErrorStack(), u"");
    Farlamp::LogZYRError(static_cast<eZYRErrorType>(35), nullptr, nullptr);
    EXPECT_TRUE(settled()[2] == "UTAddToGroup(104,Type,kZYRErrorModuleNotInitialized)" &&
                drainErrorStack().empty());
    int id = 105;
    for (const int type : {2, 36}) {
        Farlamp::LogZYRError(static_cast<eZYRErrorType>(type), "Area", nullptr);
        EXPECT_EQ(drainErrorStack(), u" Error code not updated in Analytics \n");
        EXPECT_EQ(settled()[2],
                  "UTAddToGroup(" + std::to_string(id++) + ",Type," + std::to_string(type) + ")");
    }

    Farlamp::CloseSession();
    EXPECT_EQ(settled(), group(107, "ProductInfo",
                               {"OEMName,NoData", "OEMModelName,NoData", "NumDevices,NoData",
                                "InstanceMode,NoData"}) +
                             Calls{"UTCloseSession()"});
}

TEST_F(FarlampTest, EventsAreCountedAndFlushed) {
    start();
    for (const auto& [peek, count] : {std::pair{false, 1u}, {false, 2u}, {true, 2u}})
        EXPECT_EQ(Farlamp::LogEvent(kZYRAnalyticsEventTextAntiAliasing, peek), count) << peek;
    for (const auto type :
         {kZYRAnalyticsEventCachePlacedObject, // without its gate: not logged
          kZYRAnalyticsEventEnableCutContourProcessing, kZYRAnalyticsEventCutContourProcessed,
          kZYRAnalyticsEventHasTrapping, // counted only
          kZYRAnalyticsEventEnableLowResRasterization, kZYRAnalyticsEventZYREnableMTR})
        Farlamp::LogEvent(type, false);
    for (const int outside : {13, -1})
        EXPECT_EQ(Farlamp::LogEvent(static_cast<eZYRAnalyticsEventType>(outside), false), 0u);
    EXPECT_EQ(settled(), Calls{}) << "counting logs nothing";
    Farlamp::LogEvent(kZYRAnalyticsEventAll, false);
    EXPECT_EQ(settled(),
              (Calls{"UTLogEvent(Job,,EnableCutContourProcessing,0)",
                     "UTLogEvent(Job,,EnableLowResRasterization,0)",
                     "UTLogEvent(Job,,TextAntiAliasing,0)", "UTLogEvent(Job,,ZYREnableMTR,0)"}))
        << "each counted event once, in type order";
    for (int type = 0; type < kZYRAnalyticsEventAll; ++type)
        EXPECT_EQ(Farlamp::LogEvent(static_cast<eZYRAnalyticsEventType>(type), true), 0u)
            << "counter " << type << " is reset";

    Farlamp::LogEvent(kZYRAnalyticsEventPlacedObjectCached, false);
    Farlamp::LogEvent(kZYRAnalyticsEventCachePlacedObject, false);
    Farlamp::LogEventNow(kZYRAnalyticsEventGlobalRasterization);
    Farlamp::LogEventNow(kZYRAnalyticsEventZYREnableMTR);
    Farlamp::LogEventNow(kZYRAnalyticsEventHasTrapping); // has no event name
    Farlamp::LogEventNow(static_cast<eZYRAnalyticsEventType>(-1));
    EXPECT_EQ(settled(),
              (Calls{"UTLogEvent(Job,,GlobalRasterization,0)", "UTLogEvent(Job,,ZYREnableMTR,0)"}));
    Farlamp::FlushJob(1.0); // no job group: only the events
    EXPECT_EQ(settled(), Calls{"UTLogEvent(Job,,CachePlacedObject,0)"});
    Farlamp::LogEvent(kZYRAnalyticsEventTextAntiAliasing, false);
    Farlamp::CloseSession();
    start();
    EXPECT_EQ(Farlamp::LogEvent(kZYRAnalyticsEventTextAntiAliasing, true), 0u)
        << "a closed session's counts are dropped";
}

TEST_F(FarlampTest, RunsOfEqualSurfacesAreLoggedOnce) {
    start();
    const auto surface = [](double w, double h, unsigned int placed) {
        Farlamp::UpdateCurrentSurfaceInfo(w, h, placed);
        Farlamp::LogSurfaceDataGroup();
    };
    for (int i = 0; i < 3; ++i)
        surface(2480, 3508, 4);
    EXPECT_EQ(settled(), Calls{}) << "the run is still open";
    surface(1000.9, 500, 0);
    EXPECT_EQ(settled(),
              group(100, "SurfaceInfo",
                    {"Surface Resolution,2480X3508", "Placed Objects,4", "count,3"}, "Surface"));
    Farlamp::FlushJob(0);
    EXPECT_EQ(settled(),
              group(101, "SurfaceInfo",
                    {"Surface Resolution,1000X500", "Placed Objects,0", "count,1"}, "Surface"));
    Farlamp::FlushJob(0);
    EXPECT_EQ(settled(), Calls{}) << "a flushed run is not logged again";
    surface(1e300, -1e300, 1);
    Farlamp::FlushJob(0);
    EXPECT_EQ(settled().at(1), "UTAddToGroup(102,Surface Resolution,2147483647X-2147483648)");
}

// Engine threads only queue their calls, and the counts a job end takes keep every
// increment made while the library was still busy with that job.
TEST_F(FarlampTest, EngineThreadsNeverWaitForTheLibrary) {
    start();
    Farlamp::LogEvent(kZYRAnalyticsEventEnableLowResRasterization, false);
    recorder.hold(true);
    auto flush = std::async(std::launch::async, [] { Farlamp::FlushJob(1); });
    recorder.awaitHeldCall(); // the library is logging the counted event
    for (const auto type :
         {kZYRAnalyticsEventEnableLowResRasterization, kZYRAnalyticsEventHasTransparency})
        Farlamp::LogEvent(type, false);
    auto engine = std::async(std::launch::async, [] {
        Farlamp::UpdateCurrentSurfaceInfo(1, 1, 1);
        Farlamp::LogSurfaceDataGroup();
        Farlamp::LogEventNow(kZYRAnalyticsEventGlobalRasterization);
        Farlamp::LogZYRError(kZYRErrorBadParam, "Area", "f.cpp");
    });
    // A generous bound, only so that a waiting call fails instead of hanging.
    const bool returned = flush.wait_for(std::chrono::seconds(10)) == std::future_status::ready &&
                          engine.wait_for(std::chrono::seconds(10)) == std::future_status::ready;
    recorder.hold(false);
    EXPECT_TRUE(returned) << "an engine call waited for the library";
    flush.wait();
    engine.wait();
    EXPECT_EQ(Farlamp::LogEvent(kZYRAnalyticsEventEnableLowResRasterization, true) +
                  10 * Farlamp::LogEvent(kZYRAnalyticsEventHasTransparency, true),
              11u)
        << "increments made during the flush are kept for the next job";
    const Calls calls = settled();
    ASSERT_GE(calls.size(), 2u);
    EXPECT_EQ(Calls(calls.begin(), calls.begin() + 2),
              (Calls{"UTLogEvent(Job,,EnableLowResRasterization,0)",
                     "UTLogEvent(Job,,GlobalRasterization,0)"}));
}

TEST(FarlampLibraryTest, IncompleteLibraryLeavesTheLoggerIdle) {
    EXPECT_EXIT(
        {
            if (!dlopen(ZYRSTD_INCOMPLETE_KELVRIN, RTLD_NOW | RTLD_GLOBAL))
                std::_Exit(2);
            zyrtest::TempDir dir;
            const bool started = Farlamp::StartSession(true, wide(dir.path()).c_str());
            const bool idle = !started && !Farlamp::LoggingEnabled() &&
                              Farlamp::LogEvent(kZYRAnalyticsEventGlobalRasterization, false) == 0;
            Farlamp::CloseSession();
            std::_Exit(idle ? 0 : 1);
        },
        ::testing::ExitedWithCode(0), "");
}
