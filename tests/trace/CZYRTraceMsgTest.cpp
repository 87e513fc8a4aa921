// Trace messages: the log layout, routing, level rules, the process-wide dictionary, the
// writer's locking, and the failures of construction and of the host.
#include <gtest/gtest.h>

#include <sstream>
#include <thread>

#include "EngineFakes.h"
#include "TestSupport.h"
#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/core/ZYRStdInit.h"
#include "zyr/std/trace/CZYRTraceMsg.h"

using namespace ZYRStd;
using zyrtest::FakeProgress;

namespace {

// Every test starts and ends with the log closed and no process-wide dictionary.
class CZYRTraceMsgTest : public ::testing::Test {
protected:
    void SetUp() override { reset(); }
    void TearDown() override { reset(); }
    static void reset() {
        closeTraceLogPath();
        ZYRTracingDict::getInstance().setTracingDict(CZYRDict(nullptr, false));
    }
    std::string log() const { return zyrtest::readFile(dir.file("t.log")); }

    zyrtest::TempDir dir;
};

CZYRDict levels(std::initializer_list<std::pair<const char*, int32_t>> entries) {
    CZYRDict d;
    for (const auto& [key, value] : entries)
        d.set(CZYRUniString(key), value);
    return d;
}

// A trace configuration with its "Path".
CZYRDict withPath(const std::string& path, CZYRDict config = CZYRDict()) {
    config.set(CZYRUniString("Path"), CZYRUniString(path.c_str()));
    return config;
}

// Job parameters with "JPJobID" and a trace configuration.
CZYRDict jobParams(const CZYRDict& config, int32_t jobId = 7) {
    CZYRDict params;
    params.set(CZYRUniString("JPJobID"), jobId);
    params.set(CZYRUniString("ZYRTraceMsg"), config);
    return params;
}

std::vector<std::string> lines(const std::string& text) {
    std::vector<std::string> out;
    std::istringstream in(text);
    for (std::string line; std::getline(in, line);)
        out.push_back(line);
    return out;
}

using zyrtest::startsWith;
using zyrtest::thrown;
using Calls = std::vector<std::string>;

// Built on use: the string tables exist only once main() has run.
CZYRUniString render() {
    return CZYRUniString("Render");
}
constexpr auto kL0 = ZYRPublic::kZYRTraceMsgLevel0;
constexpr auto kL1 = ZYRPublic::kZYRTraceMsgLevel1;

} // namespace

TEST_F(CZYRTraceMsgTest, HeadLayoutOfTheWriter) {
    CZYRTraceMsg trace(zyrtest::makeJob(jobParams(withPath(dir.file("t.log")))));
    ASSERT_EQ(ZYRGetTraceLogPath(), dir.file("t.log"));

    CZYRProgressInterface writer;
    C_Error err;
    const sZYRTraceMsg msg{"band done", nullptr};
    const sZYRTraceMsgDetail detail{2, "band", 12, nullptr, 0, 1500};
    writer.TraceMsg(7, nullptr, nullptr, render(), CZYRUniString("Bands"), &msg, &detail, err);
    const sZYRTraceMsgDetail zero{0, nullptr, 0, "worker", 5, 0};
    writer.TraceMsg(-3, nullptr, nullptr, render(), CZYRUniString(), &msg, &zero, err);
    // Records without text write nothing.
    const sZYRTraceMsg none{nullptr, nullptr};
    writer.TraceMsg(7, nullptr, nullptr, render(), render(), &none, &detail, err);
    writer.beginTraceMsg(7, nullptr, nullptr, render(), render(), nullptr, &detail, err);
    writer.traceMsg(&none, err);
    EXPECT_FALSE(err.errorOccurred());
    EXPECT_EQ(log(), "<ZYRTrace> Job 7 L2 [1.50000000 sec] [C:Render/Bands] [F:band/12] \n"
                     "band done\n"
                     "<ZYRTrace> Job -3 L0 [0.00000000 sec] [C:Render] [Th:worker/5] \n"
                     "band done\n");
}

TEST_F(CZYRTraceMsgTest, BeginContinuationEndLayoutAndWideTexts) {
    CZYRDict config = withPath(dir.file("t.log"), levels({{"Default", 0}}));
    config.set(render(), levels({{"Bands", 3}}));
    CZYRTraceMsg trace(zyrtest::makeJob(jobParams(config, 12)));

    trace.traceMsg("before any begin");
    trace.endTraceMsg();
    trace.beginTraceMsg(render(), CZYRUniString("Bands"), ZYRPublic::kZYRTraceMsgLevel3, "first",
                        false, "src.cpp", 40);
    trace.traceMsg("second");
    trace.traceMsg(u"\\\\server\\share\\a.pdf");
    trace.traceMsg(u"C:\\dir\\f\u00e9");
    trace.traceMsg(u"d:x \u20ac\U0001F600\xD800x\xDC00");
    trace.endTraceMsg();
    trace.endTraceMsg();
    trace.traceMsg("after the end");

    const auto got = lines(log());
    ASSERT_EQ(got.size(), 8u);
    EXPECT_TRUE(startsWith(got[0], "<ZYRTrace> Job 12 L3 [")) << got[0];
    EXPECT_NE(got[0].find(" sec] [C:Render/Bands] [F:src.cpp/40] "), std::string::npos);
    EXPECT_EQ(got[0].back(), ' ');
    const std::vector<std::string> rest = {
        "first",
        "<<",
        "second",
        "server/share/a.pdf",
        "/C:/dir/f\xc3\xa9",
        "/d:x \xe2\x82\xac\xf0\x9f\x98\x80\xef\xbf\xbdx\xef\xbf\xbd",
        ">>"};
    EXPECT_EQ(std::vector<std::string>(got.begin() + 1, got.end()), rest);
}

TEST_F(CZYRTraceMsgTest, LevelRulesAndMapping) {
    // The kept levels are 0x1FAB1DEA to 0x1FAB1DEE.
    for (const auto& [value, level] : {std::pair{9, 8},
                                       {8, 8},
                                       {0, 0},
                                       {-1, 0},
                                       {-5, 0},
                                       {531308010, 531308010},
                                       {531308014, 531308014},
                                       {531308009, 8},
                                       {531308015, 8}})
        EXPECT_EQ(mapToTraceMsgLevel(value), level) << value;

    CZYRDict config = withPath("stdout");
    config.set(CZYRUniString("Default"), 5u);
    config.set(CZYRUniString("Nine"), levels({{"All", 9}, {"Cat", 1}}));
    config.set(CZYRUniString("Kept"), levels({{"Cat", 531308012}}));
    CZYRDict unsignedNegative;
    unsignedNegative.set(CZYRUniString("Default"), static_cast<unsigned int>(-5));
    config.set(CZYRUniString("Negative"), unsignedNegative);
    config.set(CZYRUniString("Known"), levels({{"Other", 2}}));
    config.set(CZYRUniString("NotADict"), 4u);
    CZYRTraceMsg trace(zyrtest::makeJob(jobParams(config)));

    // Levels are remembered per string object: asked again, through other objects of the
    // same text, and with many areas in turn, each pair keeps its own level.
    const CZYRUniString cat("Cat");
    C_Error err;
    const CZYRUniString loose(createUniString("Nine", err), false);
    const CZYRUniString looseCat(createUniString("Cat", err), false);
    for (int round = 0; round < 3; ++round) {
        EXPECT_EQ(trace.getTraceMsgLevel(CZYRUniString("Nine"), cat), 8) << "All wins and maps";
        EXPECT_EQ(trace.getTraceMsgLevel(CZYRUniString("Kept"), cat), 531308012);
        EXPECT_EQ(trace.getTraceMsgLevel(CZYRUniString("Negative"), cat), 0);
        EXPECT_EQ(trace.getTraceMsgLevel(CZYRUniString("Known"), cat), 5) << "config Default";
        EXPECT_EQ(trace.getTraceMsgLevel(CZYRUniString("Known"), CZYRUniString("Other")), 2);
        EXPECT_EQ(trace.getTraceMsgLevel(CZYRUniString("Unknown"), cat), 0);
        EXPECT_EQ(trace.getTraceMsgLevel(CZYRUniString("NotADict"), cat), 0);
        EXPECT_EQ(trace.getTraceMsgLevel(CZYRUniString(), cat), 0);
        EXPECT_EQ(trace.getTraceMsgLevel(loose, looseCat), 8);
        EXPECT_EQ(trace.getTraceMsgLevel(CZYRUniString("Nine"), CZYRUniString("Zzz")), 8);
    }
}

// "stdout" opens no file and sends everything to the host; otherwise two areas still go
// to the host and the rest to the log.
TEST_F(CZYRTraceMsgTest, LevelsAndRoutingToTheHost) {
    FakeProgress* host = nullptr;
    CZYRDict config = withPath("stdout", levels({{"All", 3}}));
    config.set(render(), levels({{"All", 8}}));
    CZYRTraceMsg trace(zyrtest::makeJob(jobParams(config), &host));
    ASSERT_TRUE(trace.isSendToHost());
    EXPECT_EQ(ZYRGetTraceLogPath(), "");
    trace.traceMsg(render(), CZYRUniString("X"), ZYRPublic::kZYRTraceMsgLevel3, "three");
    trace.traceMsg(render(), CZYRUniString("X"), ZYRPublic::kZYRTraceMsgLevel4, "four");
    trace.traceMsg(CZYRUniString("Elsewhere"), CZYRUniString(), kL0, "zero");
    trace.traceMsg(CZYRUniString("Elsewhere"), CZYRUniString(), ZYRPublic::kZYRTraceMsgLevel8,
                   "forced", true);
    trace.beginTraceMsg(render(), CZYRUniString("B"), kL1, u"wide");
    trace.traceMsg(u"part");
    trace.endTraceMsg();
    EXPECT_EQ(host->calls, (Calls{"whole Render/X L3: three", "whole Elsewhere/ L0: zero",
                                  "whole Elsewhere/ L8: forced", "begin Render/B L1: wide",
                                  "text: part", "end"}));
    EXPECT_EQ(trace.getTraceMsgLevel(render(), CZYRUniString("X")), 3);

    FakeProgress* other = nullptr;
    CZYRTraceMsg toLog(
        zyrtest::makeJob(jobParams(withPath(dir.file("t.log"), levels({{"All", 8}}))), &other));
    EXPECT_FALSE(toLog.isSendToHost());
    const CZYRUniString fontMgr("FontMgr");
    toLog.beginTraceMsg(CZYRUniString("DLCacheOEMInfo"), CZYRUniString("Any"), kL1, "dl");
    toLog.traceMsg("dl more");
    toLog.endTraceMsg();
    toLog.traceMsg(fontMgr, CZYRUniString("EmulatedFontInfo"), kL1, u"emulated");
    toLog.traceMsg(fontMgr, CZYRUniString("Other"), kL1, "to log");
    EXPECT_EQ(other->calls, (Calls{"begin DLCacheOEMInfo/Any L1: dl", "text: dl more", "end",
                                   "whole FontMgr/EmulatedFontInfo L1: emulated"}));
    EXPECT_EQ(log().find("dl"), std::string::npos);
    EXPECT_NE(log().find("[C:FontMgr/Other] \nto log\n"), std::string::npos) << log();

    // A later "stdout" configuration keeps the open log and does not send to the host.
    CZYRTraceMsg later(zyrtest::makeJob(jobParams(withPath("stdout"))));
    EXPECT_FALSE(later.isSendToHost());
    EXPECT_EQ(ZYRGetTraceLogPath(), dir.file("t.log"));
}

TEST_F(CZYRTraceMsgTest, WithoutConfigurationOnlyAlwaysTraceReachesStandardOutput) {
    CZYRDict params;
    params.set(CZYRUniString("JPJobID"), 3);
    FakeProgress* host = nullptr;
    CZYRTraceMsg trace(zyrtest::makeJob(params, &host));
    EXPECT_EQ(trace.getTraceMsgLevel(render(), render()), 0);
    ::testing::internal::CaptureStdout();
    trace.traceMsg(render(), render(), kL0, "dropped");
    trace.traceMsg(render(), render(), ZYRPublic::kZYRTraceMsgLevel5, u"C:\\kept", true);
    const std::string out = ::testing::internal::GetCapturedStdout();
    EXPECT_TRUE(startsWith(out, "<ZYRTrace> Job 3 L5 [")) << out;
    EXPECT_NE(out.find("[C:Render/Render] \nC:\\kept\n"), std::string::npos) << out;
    EXPECT_EQ(out.find("dropped"), std::string::npos);
    EXPECT_TRUE(host->calls.empty());
    EXPECT_EQ(ZYRGetTraceLogPath(), "");

    // A job dictionary without "JPJobID" prints job 0.
    CZYRTraceMsg noNumber(zyrtest::makeJob(CZYRDict()));
    ::testing::internal::CaptureStdout();
    noNumber.traceMsg(render(), render(), ZYRPublic::kZYRTraceMsgLevel5, "x", true);
    EXPECT_TRUE(startsWith(::testing::internal::GetCapturedStdout(), "<ZYRTrace> Job 0 L5 ["));
}

TEST_F(CZYRTraceMsgTest, OpenFailureWarnsAndFallsBackToStandardOutput) {
    ::testing::internal::CaptureStdout();
    CZYRTraceMsg trace(
        zyrtest::makeJob(jobParams(withPath(dir.file("missing/dir/t.log"), levels({{"All", 8}})))));
    trace.traceMsg(render(), render(), kL1, "shown");
    const std::string out = ::testing::internal::GetCapturedStdout();
    EXPECT_TRUE(startsWith(out, "TRACE WARNING: File open failed for trace log file. Trace logs "
                                "will be shown in standard output\n<ZYRTrace> Job 7 L1 ["))
        << out;
    EXPECT_NE(out.find("\nshown\n"), std::string::npos);
    EXPECT_EQ(ZYRGetTraceLogPath(), "");
}

TEST_F(CZYRTraceMsgTest, DefaultLogIsInTheTemporaryDirectory) {
    const char* saved = std::getenv("TMPDIR");
    const std::string savedText = saved ? saved : "";
    ::setenv("TMPDIR", dir.path().c_str(), 1);
    CZYRTraceMsg trace(zyrtest::makeJob(jobParams(levels({{"All", 1}}))));
    if (saved)
        ::setenv("TMPDIR", savedText.c_str(), 1);
    else
        ::unsetenv("TMPDIR");
    const std::string tempDir = ZYRGetTempDirectory();
    EXPECT_EQ(ZYRGetTraceLogPath(), (tempDir.empty() ? dir.path() : tempDir) + "/traceLog.log");
}

TEST_F(CZYRTraceMsgTest, ProcessWideDictionaryMerges) {
    CZYRDict global = withPath("stdout", levels({{"Default", 1}}));
    global.set(render(), levels({{"All", 6}}));
    ZYRTracingDict::getInstance().setTracingDict(global);
    // The stored dictionary is a clone: later changes to the original do not reach it.
    global.set(CZYRUniString("Late"), levels({{"All", 4}}));

    CZYRDict noConfig;
    noConfig.set(CZYRUniString("JPJobID"), 1);
    CZYRTraceMsg alone(zyrtest::makeJob(noConfig));
    EXPECT_EQ(alone.getTraceMsgLevel(render(), render()), 6);
    EXPECT_EQ(alone.getTraceMsgLevel(CZYRUniString("Late"), render()), 0);

    CZYRDict own;
    own.set(render(), levels({{"All", 2}}));
    own.set(CZYRUniString("Own"), levels({{"X", 3}}));
    CZYRTraceMsg merged(zyrtest::makeJob(jobParams(own)));
    EXPECT_EQ(merged.getTraceMsgLevel(render(), render()), 6) << "process-wide entries replace";
    EXPECT_EQ(merged.getTraceMsgLevel(CZYRUniString("Own"), CZYRUniString("X")), 3);
    EXPECT_EQ(merged.getTraceMsgLevel(CZYRUniString("Own"), CZYRUniString("Y")), 1);
    EXPECT_TRUE(merged.isSendToHost());
    EXPECT_EQ(own.getSize(), 2u) << "the job's own dictionary is left as the host made it";

    ZYRTracingDict::getInstance().setTracingDict(CZYRDict());
    EXPECT_FALSE(ZYRTracingDict::getInstance().getTracingDict());
}

TEST_F(CZYRTraceMsgTest, TwoThreadsNeverMixHeadsAndTexts) {
    CZYRDict params = jobParams(withPath(dir.file("t.log"), levels({{"All", 8}})));
    params.finalize();
    const auto job = zyrtest::makeJob(params);
    { CZYRTraceMsg open(job); }

    constexpr int kMessages = 300;
    auto writer = [&](const char* area, const char* text) {
        CZYRTraceMsg trace(job);
        const CZYRUniString a(area);
        for (int i = 0; i < kMessages; ++i)
            trace.traceMsg(a, CZYRUniString(), kL1, text);
    };
    std::thread first(writer, "AreaA", "text of A");
    std::thread second(writer, "AreaB", "text of B");
    first.join();
    second.join();

    const auto got = lines(log());
    ASSERT_EQ(got.size(), 4u * kMessages);
    for (size_t i = 0; i < got.size(); i += 2) {
        ASSERT_TRUE(startsWith(got[i], "<ZYRTrace> Job 7 L1 [")) << got[i];
        const bool isA = got[i].find("[C:AreaA] ") != std::string::npos;
        ASSERT_EQ(got[i + 1], isA ? "text of A" : "text of B") << "after " << got[i];
    }
}

TEST_F(CZYRTraceMsgTest, ConstructionAndHostFailures) {
    auto job = zyrtest::make<zyrtest::FakeJob>();
    job->interfaces = zyrtest::make<zyrtest::FakeInterfaceSet>();
    const auto build = [&] { CZYRTraceMsg trace{C_SmartPtr<ZYRPublic::I_Job>(job)}; };
    EXPECT_EQ(thrown(build), "6: Required OEM interface not found "
                             "(source/zyr/std/ZYROEMInterfacesInternal:42)");
    job->interfaces.reset();
    EXPECT_EQ(thrown(build),
              "4: Error getting OEM Interface (source/zyr/std/ZYROEMInterfacesInternal:37)");
    FakeProgress* host = nullptr;
    const auto failing = zyrtest::makeJob(jobParams(withPath("stdout")), &host);
    static_cast<zyrtest::FakeJob&>(*failing).failWith = ZYRPublic::kZYRErrorTypeCheck;
    EXPECT_EQ(thrown([&] { CZYRTraceMsg trace(failing); }), "14: getter failed (fake:1)");
    // A surface whose walk meets a null step; one whose steps record errors still finds its
    // job, since the walk's own errors are not reported.
    const auto fromSurface = [](const C_SmartPtr<ZYRPublic::I_Surface>& surface) {
        return thrown([&] { CZYRTraceMsg(surface).traceMsg(render(), render(), kL0, "ok"); });
    };
    EXPECT_TRUE(startsWith(fromSurface(zyrtest::makeSurface(4, C_SmartPtr<ZYRPublic::I_Job>())),
                           "25: miss job (source/zyr/std/CZYRTraceMsg:"));
    EXPECT_TRUE(startsWith(fromSurface(C_SmartPtr<ZYRPublic::I_Surface>()), "25: miss job"));
    const auto surface =
        zyrtest::makeSurface(4, zyrtest::makeJob(jobParams(withPath("stdout")), &host));
    surface->failWith = surface->owner->failWith = surface->owner->parent->failWith =
        ZYRPublic::kZYRErrorTypeCheck;
    EXPECT_EQ(fromSurface(surface), "no error");
    EXPECT_EQ(host->calls, Calls{"whole Render/Render L0: ok"});

    // The host's errors are thrown; anything else it throws becomes the unknown error.
    CZYRTraceMsg trace(zyrtest::makeJob(jobParams(withPath("stdout")), &host));
    host->failWith = ZYRPublic::kZYRErrorTypeCheck;
    const std::string failed = "14: host failed (fake:1)";
    EXPECT_EQ(thrown([&] { trace.beginTraceMsg(render(), render(), kL0, "x"); }), failed);
    EXPECT_EQ(thrown([&] { trace.traceMsg("more"); }), failed) << "the begun message is open";
    EXPECT_EQ(thrown([&] { trace.endTraceMsg(); }), failed);
    host->failWith = ZYRPublic::kZYRErrorNoError;
    trace.traceMsg("after");
    EXPECT_EQ(host->calls, (Calls{"begin Render/Render L0: x", "text: more", "end"}))
        << "a failed end still closes the message";
    host->throwForeign = true;
    const char16_t* const noText = nullptr;
    EXPECT_TRUE(startsWith(thrown([&] { trace.traceMsg(render(), render(), kL0, noText); }),
                           "1: Unknown exception in CZYRTraceMsg::traceMsg "
                           "(source/zyr/std/CZYRTraceMsg:"));
}

TEST_F(CZYRTraceMsgTest, CallbackWritesLevelFourTextsAndTakesTheLeakReport) {
    { CZYRTraceMsg open(zyrtest::makeJob(jobParams(withPath(dir.file("t.log"))))); }

    sZYRTraceMsg msg{"four ", nullptr};
    sZYRTraceMsgDetail detail{4, nullptr, 0, nullptr, 0, 0};
    ZYRTraceMsgCallbackInternal(&msg, &detail, nullptr);
    ZYRTraceMsgCallbackInternal(&msg, nullptr, nullptr);
    detail.level = 3;
    ZYRTraceMsgCallbackInternal(&msg, &detail, nullptr);
    ZYRTraceMsgCallbackInternal(nullptr, &detail, nullptr);
    detail.level = 4;
    sZYRTraceMsg wide{nullptr, u"\\\\a\\b|"};
    ZYRTraceMsgCallbackInternal(&wide, &detail, nullptr);
    EXPECT_EQ(log(), "four a/b|");

    // The front's leak report: only its level-4 peak line reaches the log.
    zyrtest::installFront(1);
    ZYRStdInit_ZYRMemMgrDumpMemList(ZYRTraceMsgCallbackInternal, nullptr);
    zyrtest::installFront(0);
    EXPECT_NE(log().find("ZYRMem: Peak memory consumption: "), std::string::npos) << log();
    EXPECT_EQ(log().find("Total Leaked"), std::string::npos) << log();
}
