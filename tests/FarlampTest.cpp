// The telemetry session logger against a recording telemetry library: each call and its
// arguments for every group, document facts, errors, events, surfaces and the session folder.
#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <string>
#include <vector>

#include "RecordingKelvrin.h"
#include "TestSupport.h"
#include "zyr/std/CZYRAnalyticsData.h"
#include "zyr/std/CZYRDict.h"
#include "zyr/std/CZYRErrorStk.h"
#include "zyr/std/Farlamp.h"
#include "zyr/std/ZYRStartupOptions.h"

using namespace ZYRStd;
using namespace ZYRPublic;
using zyrtest::RecordingKelvrin;
using Calls = std::vector<std::string>;

namespace {

std::u16string wide(const std::string& s) {
    return std::u16string(s.begin(), s.end());
}

std::u16string drainErrorStack() {
    std::u16string text;
    CZYRErrorStk stack;
    return stack.getErrorMessage(text) ? text : u"";
}

class FarlampTest : public ::testing::Test {
protected:
    void SetUp() override {
        recorder.refuseSessions(false);
        recorder.setDelay(0);
        drainErrorStack();
    }
    void TearDown() override {
        Farlamp::CloseSession();
        ZYRSetAnalyticsActive(false);
        (void)recorder.take();
    }

    // An active session in a fresh folder, with the start-up calls taken.
    void start() {
        const std::u16string folder = wide(dir.path());
        ASSERT_TRUE(Farlamp::StartSession(true, folder.c_str()));
        ASSERT_TRUE(Farlamp::LoggingEnabled());
        (void)recorder.take();
    }

    // An enabled record of group `group`; values are set by the caller.
    static CZYRAnalyticsData record(const char* group) {
        ZYRSetAnalyticsActive(true);
        CZYRAnalyticsData r;
        if (group)
            r.set(CZYRUniString("DataGroupName"), CZYRUniString(group));
        return r;
    }

    RecordingKelvrin& recorder = RecordingKelvrin::get();
    zyrtest::TempDir dir;
};

} // namespace

TEST_F(FarlampTest, SessionFolderIsProbedWithFallback) {
    // A missing folder is created and probed; the probe file does not stay.
    const std::string fresh = dir.file("logs");
    const std::u16string freshWide = wide(fresh);
    ASSERT_TRUE(Farlamp::StartSession(true, freshWide.c_str()));
    EXPECT_TRUE(std::filesystem::is_directory(fresh));
    EXPECT_FALSE(std::filesystem::exists(fresh + "/test.txt"));
    const Calls started = {"UTInitialize(ZYRStd,0,<null>)", "UTSetOptIn(1)",
                           "UTStartSession(Print,ZYRStd,0.1.0.0,0.1,," + fresh + ")"};
    EXPECT_EQ(recorder.take(), started);
    EXPECT_TRUE(Farlamp::StartSession(true, freshWide.c_str())) << "a second start keeps it";
    EXPECT_EQ(recorder.take(), Calls{});
    EXPECT_EQ(drainErrorStack(), u"");
    Farlamp::CloseSession();
    (void)recorder.take();

    // A folder that cannot be made (under a plain file) falls back, with a report.
    zyrtest::writeFile(dir.file("plain"), "x");
    const std::u16string blocked = wide(dir.file("plain") + "/logs");
    ASSERT_TRUE(Farlamp::StartSession(true, blocked.c_str()));
    EXPECT_EQ(recorder.take().back(), "UTStartSession(Print,ZYRStd,0.1.0.0,0.1,,./AnalyticsLogs)");
    EXPECT_EQ(drainErrorStack(), u" Default directory was used to store analytics logs \n");
    Farlamp::CloseSession();

    // An inactive session goes to the default folder, with logging off.
    (void)recorder.take();
    ASSERT_TRUE(Farlamp::StartSession(false, freshWide.c_str()));
    EXPECT_FALSE(Farlamp::LoggingEnabled());
    EXPECT_EQ(recorder.take().back(), "UTStartSession(Print,ZYRStd,0.1.0.0,0.1,,./AnalyticsLogs)");
    Farlamp::LogDataObject(record("DripSessionInfo"));
    Farlamp::LogZYRError(kZYRErrorBadParam, "Area", "f.cpp");
    EXPECT_EQ(Farlamp::LogEvent(kZYRAnalyticsEventGlobalRasterization, false), 0u);
    Farlamp::CloseSession();
    EXPECT_EQ(recorder.take(), Calls{"UTCloseSession()"}) << "nothing logged while off";

    // A library that refuses the session: no session, logging off.
    recorder.refuseSessions(true);
    EXPECT_FALSE(Farlamp::StartSession(true, freshWide.c_str()));
    EXPECT_FALSE(Farlamp::LoggingEnabled());
}

TEST_F(FarlampTest, EveryGroupIsDispatchedByName) {
    start();
    auto product = record("ProductInfo");
    product.set(CZYRUniString("OEMName"), CZYRUniString("Acme"));
    product.set(CZYRUniString("OEMModelName"), CZYRUniString("P1"));
    product.set(CZYRUniString("NumDevices"), CZYRUniString("2"));
    product.set(CZYRUniString("InstanceMode"), CZYRUniString("Single"));
    product.set(CZYRUniString("xobjMode"), 2u);
    Farlamp::LogDataObject(product);

    auto font = record("FontInfo");
    font.set(CZYRUniString("NumSubstFont"), 3u);
    font.set(CZYRUniString("UseDefaultFont"), true);
    font.set(CZYRUniString("UseFontEmulation"), int32_t{-1});
    Farlamp::LogDataObject(font);

    auto drip = record("DripSessionInfo");
    drip.set(CZYRUniString("NumWorkers"), 4u);
    drip.set(CZYRUniString("WorkerCrashedCount"), 0u);
    Farlamp::LogDataObject(drip);

    auto control = record("dripCntrlJobInfo");
    control.set(CZYRUniString("JobStatus"), CZYRUniString("Done"));
    control.set(CZYRUniString("JobCompleteTime"), 2.5);
    control.set(CZYRUniString("NumSurfaces"), 9u);
    Farlamp::LogDataObject(control);

    auto error = record("ErrorInfo");
    error.set(CZYRUniString("Area"), CZYRUniString("PDF"));
    error.set(CZYRUniString("Type"), CZYRUniString("kZYRErrorPDF"));
    error.set(CZYRUniString("Parameter1"), CZYRUniString("page 3"));
    Farlamp::LogDataObject(error);

    auto job = record("JobInfo");
    job.set(CZYRUniString("StartTime"), 10.0);
    job.set(CZYRUniString("SurfaceCount"), 2u);
    job.set(CZYRUniString("TotalMediaSize"), 1.5);
    job.set(CZYRUniString("ErrorOccured"), CZYRUniString(u"n\u00e9"));
    Farlamp::LogDataObject(job);

    auto raster = record("RasterCacheInfo");
    raster.set(CZYRUniString("NumSmallRasters"), 5u);
    raster.set(CZYRUniString("RasterDiskCachingEnabled"), false);
    Farlamp::LogDataObject(raster);

    auto dl = record("DLCacheInfo");
    dl.set(CZYRUniString("NumLargeDLs"), 1u);
    Farlamp::LogDataObject(dl);

    // Records without a known group name are not logged.
    Farlamp::LogDataObject(record("NoSuchGroup"));
    Farlamp::LogDataObject(record(nullptr));
    Farlamp::LogDataObject(C_SmartPtr<I_AnalyticsData>());

    const Calls expected = {
        "UTNewDataGroup(ProductInfo,,ProductInfo)=100",
        "UTAddToGroup(100,OEMName,Acme)",
        "UTAddToGroup(100,OEMModelName,P1)",
        "UTAddToGroup(100,NumDevices,2)",
        "UTAddToGroup(100,InstanceMode,Single)",
        "UTAddToGroup(100,xobjMode,2)",
        "UTNewDataGroup(FontInfo,,FontInfo)=101",
        "UTAddToGroup(101,NumSubstFont,3)",
        "UTAddToGroup(101,PreferredFont,ERROR : PreferredFont Not Found)",
        "UTAddToGroup(101,UseDefaultFont,1)",
        "UTAddToGroup(101,UseFontEmulation,-1)",
        "UTNewDataGroup(DripSessionInfo,,DripSessionInfo)=102",
        "UTAddToGroup(102,NumWorkers,4)",
        "UTAddToGroup(102,WorkerCrashedCount,0)",
        "UTNewDataGroup(dripCntrlJobInfo,,dripCntrlJobInfo)=103",
        "UTAddToGroup(103,JobStatus,Done)",
        "UTAddToGroup(103,JobCompleteTime,2.5)",
        "UTAddToGroup(103,NumSurfaces,9)",
        "UTNewDataGroup(ErrorInfo,,ErrorInfo)=104",
        "UTAddToGroup(104,Area,PDF)",
        "UTAddToGroup(104,Type,kZYRErrorPDF)",
        "UTAddToGroup(104,Parameter1,page 3)",
        "UTNewDataGroup(JobInfo,,JobInfo)=105",
        "UTAddToGroup(105,SurfaceCount,2)",
        "UTAddToGroup(105,TotalMediaSize,1.5)",
        "UTAddToGroup(105,ErrorOccured,n\xc3\xa9)",
        "UTAddToGroup(105,NumSmallRasters,5)",
        "UTAddToGroup(105,RasterDiskCachingEnabled,0)",
        "UTAddToGroup(105,NumLargeDLs,1)",
    };
    EXPECT_EQ(recorder.take(), expected);

    // The job's start time gives its completion time; the next job gets a new group.
    Farlamp::LogEvent(kZYRAnalyticsEventHasTransparency, false);
    Farlamp::FlushJob(12.345);
    const Calls flushed = {"UTAddToGroup(105,CompletionTime,2.35)",
                           "UTAddToGroup(105,HasTrapping,0)",
                           "UTAddToGroup(105,HasTransparency,1)"};
    EXPECT_EQ(recorder.take(), flushed);
    Farlamp::LogDataObject(job);
    EXPECT_EQ(recorder.take().front(), "UTNewDataGroup(JobInfo,,JobInfo)=106");

    // A product mode other than 0 and 2 keeps the cache groups out.
    auto other = record("ProductInfo");
    other.set(CZYRUniString("xobjMode"), 1u);
    Farlamp::LogDataObject(other);
    Farlamp::LogDataObject(raster);
    Farlamp::LogDataObject(dl);
    const Calls onlyProduct = {"UTAddToGroup(100,xobjMode,1)"};
    EXPECT_EQ(recorder.take(), onlyProduct) << "the product group is reused";

    // The product group exists, so closing adds no placeholder.
    Farlamp::CloseSession();
    EXPECT_EQ(recorder.take(), Calls{"UTCloseSession()"});
}

TEST_F(FarlampTest, DocumentFactsAndErrors) {
    start();
    CZYRDict info;
    info.set(CZYRUniString("DataGroupName"), CZYRUniString("PDFInfo"));
    info.set(CZYRUniString("PDFMajorVersion"), 1u);
    info.set(CZYRUniString("PDFMinorVersion"), int32_t{7});
    info.set(CZYRUniString("PDFX"), true);
    info.set(CZYRUniString("PDFCreatorApp"), CZYRUniString("Writer"));
    info.set(CZYRUniString("PDFPreTrapped"), CZYRUniString("False"));
    info.set(CZYRUniString("SecurityType"), 0u);
    info.set(CZYRUniString("NumPages"), 12u);
    Farlamp::LogDict(info);
    const Calls facts = {"UTNewDataGroup(PDFInfo,,PDFInfo)=100",
                         "UTAddToGroup(100,PDFVersion,1.7)",
                         "UTAddToGroup(100,PDFX,1)",
                         "UTAddToGroup(100,creatorApp,Writer)",
                         "UTAddToGroup(100,PreTrapped,False)",
                         "UTAddToGroup(100,HasPassword,0)",
                         "UTAddToGroup(100,NumPages,12)"};
    EXPECT_EQ(recorder.take(), facts);
    info.set(CZYRUniString("DataGroupName"), CZYRUniString("Other"));
    Farlamp::LogDict(info);
    EXPECT_EQ(recorder.take(), Calls{});

    Farlamp::LogZYRError(kZYRErrorBadParam, "Streams", "source/zyr/std\\deep/CZYRDict.cpp");
    Farlamp::LogZYRError(kZYRErrorFatal, "Init", "plain.cpp");
    const Calls errors = {"UTNewDataGroup(ErrorInfo,,ErrorInfo)=101",
                          "UTAddToGroup(101,Area,Streams)",
                          "UTAddToGroup(101,Type,kZYRErrorBadParam)",
                          "UTAddToGroup(101,Parameter1,CZYRDict.cpp)",
                          "UTAddToGroup(101,Parameter2,)",
                          "UTAddToGroup(101,Parameter3,)",
                          "UTAddToGroup(101,Fatal,0)",
                          "UTNewDataGroup(ErrorInfo,,ErrorInfo)=102",
                          "UTAddToGroup(102,Area,Init)",
                          "UTAddToGroup(102,Type,kZYRErrorFatal)",
                          "UTAddToGroup(102,Parameter1,plain.cpp)",
                          "UTAddToGroup(102,Parameter2,)",
                          "UTAddToGroup(102,Parameter3,)",
                          "UTAddToGroup(102,Fatal,1)"};
    EXPECT_EQ(recorder.take(), errors);
    EXPECT_EQ(drainErrorStack(), u"");

    // A type without a name is reported on the error stack.
    Farlamp::LogZYRError(static_cast<eZYRErrorType>(2), "Area", nullptr);
    EXPECT_EQ(drainErrorStack(), u" Error code not updated in Analytics \n");
    EXPECT_EQ(recorder.take()[2], "UTAddToGroup(103,Type,2)");

    // Never created, the product group gets placeholders when the session closes.
    Farlamp::CloseSession();
    const Calls closing = {
        "UTNewDataGroup(ProductInfo,,ProductInfo)=104", "UTAddToGroup(104,OEMName,NoData)",
        "UTAddToGroup(104,OEMModelName,NoData)",        "UTAddToGroup(104,NumDevices,NoData)",
        "UTAddToGroup(104,InstanceMode,NoData)",        "UTCloseSession()"};
    EXPECT_EQ(recorder.take(), closing);
}

TEST_F(FarlampTest, EventsAreCountedAndFlushed) {
    start();
    EXPECT_EQ(Farlamp::LogEvent(kZYRAnalyticsEventTextAntiAliasing, false), 1u);
    EXPECT_EQ(Farlamp::LogEvent(kZYRAnalyticsEventTextAntiAliasing, false), 2u);
    EXPECT_EQ(Farlamp::LogEvent(kZYRAnalyticsEventTextAntiAliasing, true), 2u) << "peek";
    Farlamp::LogEvent(kZYRAnalyticsEventCachePlacedObject, false); // no gate: not logged
    Farlamp::LogEvent(kZYRAnalyticsEventEnableCutContourProcessing, false);
    Farlamp::LogEvent(kZYRAnalyticsEventCutContourProcessed, false); // opens event 1
    Farlamp::LogEvent(kZYRAnalyticsEventHasTrapping, false);         // counted only
    Farlamp::LogEvent(kZYRAnalyticsEventZYREnableMTR, false);
    EXPECT_EQ(recorder.take(), Calls{}) << "counting logs nothing";

    Farlamp::LogEvent(kZYRAnalyticsEventAll, false);
    const Calls logged = {"UTLogEvent(Job,,EnableCutContourProcessing,0)",
                          "UTLogEvent(Job,,TextAntiAliasing,0)", "UTLogEvent(Job,,ZYREnableMTR,0)"};
    EXPECT_EQ(recorder.take(), logged) << "each counted event once, in type order";
    for (int type = 0; type < kZYRAnalyticsEventAll; ++type)
        EXPECT_EQ(Farlamp::LogEvent(static_cast<eZYRAnalyticsEventType>(type), true), 0u)
            << "counter " << type << " is reset";

    Farlamp::LogEvent(kZYRAnalyticsEventPlacedObjectCached, false);
    Farlamp::LogEvent(kZYRAnalyticsEventCachePlacedObject, false);
    Farlamp::LogEventNow(kZYRAnalyticsEventGlobalRasterization);
    Farlamp::LogEventNow(kZYRAnalyticsEventHasTrapping); // has no event name
    EXPECT_EQ(recorder.take(), Calls{"UTLogEvent(Job,,GlobalRasterization,0)"});
    Farlamp::FlushJob(1.0); // no job group: only the events
    EXPECT_EQ(recorder.take(), Calls{"UTLogEvent(Job,,CachePlacedObject,0)"});
}

TEST_F(FarlampTest, RunsOfEqualSurfacesAreLoggedOnce) {
    start();
    for (int i = 0; i < 3; ++i) {
        Farlamp::UpdateCurrentSurfaceInfo(2480, 3508, 4);
        Farlamp::LogSurfaceDataGroup();
    }
    EXPECT_EQ(recorder.take(), Calls{}) << "the run is still open";
    Farlamp::UpdateCurrentSurfaceInfo(1000.9, 500, 0);
    Farlamp::LogSurfaceDataGroup();
    const Calls firstRun = {"UTNewDataGroup(SurfaceInfo,,Surface)=100",
                            "UTAddToGroup(100,Surface Resolution,2480X3508)",
                            "UTAddToGroup(100,Placed Objects,4)", "UTAddToGroup(100,count,3)"};
    EXPECT_EQ(recorder.take(), firstRun);
    Farlamp::FlushJob(0);
    const Calls lastRun = {"UTNewDataGroup(SurfaceInfo,,Surface)=101",
                           "UTAddToGroup(101,Surface Resolution,1000X500)",
                           "UTAddToGroup(101,Placed Objects,0)", "UTAddToGroup(101,count,1)"};
    EXPECT_EQ(recorder.take(), lastRun);
    Farlamp::FlushJob(0);
    EXPECT_EQ(recorder.take(), Calls{}) << "a flushed run is not logged again";

    // Extents beyond the printed range are clamped rather than converted.
    Farlamp::UpdateCurrentSurfaceInfo(1e300, -1e300, 1);
    Farlamp::LogSurfaceDataGroup();
    Farlamp::FlushJob(0);
    EXPECT_EQ(recorder.take().at(1), "UTAddToGroup(102,Surface Resolution,2147483647X-2147483648)");
}

// A library that lacks an entry point is not used, and no other is looked for in its place:
// the logger does nothing. Run in a child process, where the incomplete library is the first
// one named libKelvrin.so.
TEST(FarlampLibraryTest, IncompleteLibraryLeavesTheLoggerIdle) {
    EXPECT_EXIT(
        {
            if (!dlopen(ZYRSTD_INCOMPLETE_KELVRIN, RTLD_NOW | RTLD_GLOBAL))
                std::_Exit(2);
            zyrtest::TempDir dir;
            const std::u16string folder = wide(dir.path());
            const bool started = Farlamp::StartSession(true, folder.c_str());
            const bool idle = !started && !Farlamp::LoggingEnabled() &&
                              Farlamp::LogEvent(kZYRAnalyticsEventGlobalRasterization, false) == 0;
            Farlamp::CloseSession();
            std::_Exit(idle ? 0 : 1);
        },
        ::testing::ExitedWithCode(0), "");
}
