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

bool startsWith(const std::string& s, const std::string& prefix) {
    return s.compare(0, prefix.size(), prefix) == 0;
}

constexpr const char* kSource = "source/zyr/std/CZYRTraceMsg";

// Runs `call`, which must throw a CZYRError of `type` and of the `message`, `file` and `line`
// that are given.
template <class Call>
void expectError(Call call, ZYRPublic::eZYRErrorType type, const char* message = nullptr,
                 const char* file = nullptr, int line = 0) {
    try {
        call();
        ADD_FAILURE() << "no error";
    } catch (const CZYRError& e) {
        EXPECT_EQ(e.getError(), type);
        // Only what is given is checked.
        EXPECT_STREQ(e.getMessage(), message ? message : e.getMessage());
        EXPECT_STREQ(e.getSrcFileName(), file ? file : e.getSrcFileName());
        EXPECT_EQ(e.getSrcLineNumber(), line ? line : e.getSrcLineNumber());
    }
}

// Built on use: the string tables exist only once main() has run.
CZYRUniString render() {
    return CZYRUniString("Render");
}
const char16_t* const kNoWide = nullptr;

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

    EXPECT_EQ(zyrtest::readFile(dir.file("t.log")),
              "<ZYRTrace> Job 7 L2 [1.50000000 sec] [C:Render/Bands] [F:band/12] \n"
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
    trace.endTraceMsg();
    trace.endTraceMsg();
    trace.traceMsg("after the end");

    const auto got = lines(zyrtest::readFile(dir.file("t.log")));
    ASSERT_EQ(got.size(), 7u);
    EXPECT_TRUE(startsWith(got[0], "<ZYRTrace> Job 12 L3 [")) << got[0];
    EXPECT_NE(got[0].find(" sec] [C:Render/Bands] [F:src.cpp/40] "), std::string::npos);
    EXPECT_EQ(got[0].back(), ' ');
    EXPECT_EQ(got[1], "first");
    EXPECT_EQ(got[2], "<<");
    EXPECT_EQ(got[3], "second");
    EXPECT_EQ(got[4], "server/share/a.pdf");
    EXPECT_EQ(got[5], "/C:/dir/f\xc3\xa9");
    EXPECT_EQ(got[6], ">>");
}

TEST_F(CZYRTraceMsgTest, LevelRulesAndMapping) {
    EXPECT_EQ(mapToTraceMsgLevel(9), 8);
    EXPECT_EQ(mapToTraceMsgLevel(531308012), 531308012);
    EXPECT_EQ(mapToTraceMsgLevel(531308009), 8);
    EXPECT_EQ(mapToTraceMsgLevel(531308015), 8);
    EXPECT_EQ(mapToTraceMsgLevel(-5), 0);
    EXPECT_EQ(mapToTraceMsgLevel(8), 8);

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
        EXPECT_EQ(trace.getTraceMsgLevel(CZYRUniString("Known"), cat), 5)
            << "configuration Default";
        EXPECT_EQ(trace.getTraceMsgLevel(CZYRUniString("Known"), CZYRUniString("Other")), 2);
        EXPECT_EQ(trace.getTraceMsgLevel(CZYRUniString("Unknown"), cat), 0);
        EXPECT_EQ(trace.getTraceMsgLevel(CZYRUniString("NotADict"), cat), 0);
        EXPECT_EQ(trace.getTraceMsgLevel(CZYRUniString(), cat), 0);
        EXPECT_EQ(trace.getTraceMsgLevel(loose, looseCat), 8);
        EXPECT_EQ(trace.getTraceMsgLevel(CZYRUniString("Nine"), CZYRUniString("Zzz")), 8);
    }
}

// "stdout" opens no file and sends everything to the host.
TEST_F(CZYRTraceMsgTest, AllOverridesAreasAndLevelZeroPasses) {
    FakeProgress* host = nullptr;
    CZYRDict config = withPath("stdout", levels({{"All", 3}}));
    config.set(render(), levels({{"All", 8}}));
    CZYRTraceMsg trace(zyrtest::makeJob(jobParams(config), &host));
    ASSERT_TRUE(trace.isSendToHost());
    EXPECT_EQ(ZYRGetTraceLogPath(), "");

    trace.traceMsg(render(), CZYRUniString("X"), ZYRPublic::kZYRTraceMsgLevel3, "three");
    trace.traceMsg(render(), CZYRUniString("X"), ZYRPublic::kZYRTraceMsgLevel4, "four");
    trace.traceMsg(CZYRUniString("Elsewhere"), CZYRUniString(), ZYRPublic::kZYRTraceMsgLevel0,
                   "zero");
    trace.traceMsg(CZYRUniString("Elsewhere"), CZYRUniString(), ZYRPublic::kZYRTraceMsgLevel8,
                   "forced", true);
    trace.beginTraceMsg(render(), CZYRUniString("B"), ZYRPublic::kZYRTraceMsgLevel1, u"wide");
    trace.traceMsg(u"part");
    trace.endTraceMsg();
    ASSERT_EQ(host->calls.size(), 6u);
    EXPECT_EQ(host->calls[0].text, "three");
    EXPECT_EQ(host->calls[0].level, 3);
    EXPECT_EQ(host->calls[1].text, "zero");
    EXPECT_EQ(host->calls[2].text, "forced");
    EXPECT_EQ(host->calls[3].text, "wide");
    EXPECT_EQ(host->calls[4].text, "part");
    EXPECT_EQ(host->calls[5].kind, "end");
    EXPECT_EQ(trace.getTraceMsgLevel(render(), CZYRUniString("X")), 3);
}

TEST_F(CZYRTraceMsgTest, RoutingToTheHost) {
    FakeProgress* host = nullptr;
    CZYRTraceMsg trace(
        zyrtest::makeJob(jobParams(withPath(dir.file("t.log"), levels({{"All", 8}}))), &host));
    EXPECT_FALSE(trace.isSendToHost());

    const CZYRUniString fontMgr("FontMgr");
    trace.beginTraceMsg(CZYRUniString("DLCacheOEMInfo"), CZYRUniString("Any"),
                        ZYRPublic::kZYRTraceMsgLevel1, "dl");
    trace.traceMsg("dl more");
    trace.endTraceMsg();
    trace.traceMsg(fontMgr, CZYRUniString("EmulatedFontInfo"), ZYRPublic::kZYRTraceMsgLevel1,
                   u"emulated");
    trace.traceMsg(fontMgr, CZYRUniString("Other"), ZYRPublic::kZYRTraceMsgLevel1, "to log");

    ASSERT_EQ(host->calls.size(), 4u);
    EXPECT_EQ(host->calls[0].kind, "begin");
    EXPECT_EQ(host->calls[0].area, "DLCacheOEMInfo");
    EXPECT_EQ(host->calls[1].kind, "text");
    EXPECT_EQ(host->calls[1].text, "dl more");
    EXPECT_EQ(host->calls[2].kind, "end");
    EXPECT_EQ(host->calls[3].kind, "whole");
    EXPECT_EQ(host->calls[3].text, "emulated");
    const std::string log = zyrtest::readFile(dir.file("t.log"));
    EXPECT_EQ(log.find("dl"), std::string::npos);
    EXPECT_NE(log.find("[C:FontMgr/Other] \nto log\n"), std::string::npos) << log;

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
    trace.traceMsg(render(), render(), ZYRPublic::kZYRTraceMsgLevel0, "dropped");
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
    trace.traceMsg(render(), render(), ZYRPublic::kZYRTraceMsgLevel1, "shown");
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
    if (ZYRGetTempDirectory().empty())
        EXPECT_EQ(ZYRGetTraceLogPath(), dir.file("traceLog.log"));
    else
        EXPECT_EQ(ZYRGetTraceLogPath(), ZYRGetTempDirectory() + "/traceLog.log");
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
            trace.traceMsg(a, CZYRUniString(), ZYRPublic::kZYRTraceMsgLevel1, text);
    };
    std::thread first(writer, "AreaA", "text of A");
    std::thread second(writer, "AreaB", "text of B");
    first.join();
    second.join();

    const auto got = lines(zyrtest::readFile(dir.file("t.log")));
    ASSERT_EQ(got.size(), 4u * kMessages);
    for (size_t i = 0; i < got.size(); i += 2) {
        ASSERT_TRUE(startsWith(got[i], "<ZYRTrace> Job 7 L1 [")) << got[i];
        const bool isA = got[i].find("[C:AreaA] ") != std::string::npos;
        ASSERT_EQ(got[i + 1], isA ? "text of A" : "text of B") << "after " << got[i];
    }
}

TEST_F(CZYRTraceMsgTest, ConstructionFailures) {
    auto job = zyrtest::make<zyrtest::FakeJob>();
    job->interfaces = zyrtest::make<zyrtest::FakeInterfaceSet>();
    const auto build = [&] { CZYRTraceMsg trace{C_SmartPtr<ZYRPublic::I_Job>(job)}; };
    expectError(build, ZYRPublic::kZYRErrorBadParam, "Required OEM interface not found", nullptr,
                42);
    job->interfaces.reset();
    expectError(build, ZYRPublic::kZYRErrorInitFailed, "Error getting OEM Interface");
    // A surface whose walk breaks.
    expectError([] { CZYRTraceMsg trace(zyrtest::makeSurface(4, C_SmartPtr<ZYRPublic::I_Job>())); },
                ZYRPublic::kZYRErrorInvalidData, "miss job", kSource);
    EXPECT_THROW(CZYRTraceMsg(C_SmartPtr<ZYRPublic::I_Surface>()), CZYRError);

    // A complete surface chain finds the job.
    FakeProgress* host = nullptr;
    CZYRTraceMsg fromSurface(
        zyrtest::makeSurface(4, zyrtest::makeJob(jobParams(withPath("stdout")), &host)));
    fromSurface.traceMsg(render(), render(), ZYRPublic::kZYRTraceMsgLevel0, "ok");
    EXPECT_EQ(host->calls.size(), 1u);
}

TEST_F(CZYRTraceMsgTest, HostFailuresAreThrown) {
    FakeProgress* host = nullptr;
    CZYRTraceMsg trace(zyrtest::makeJob(jobParams(withPath("stdout")), &host));
    host->failWith = ZYRPublic::kZYRErrorTypeCheck;
    expectError(
        [&] { trace.beginTraceMsg(render(), render(), ZYRPublic::kZYRTraceMsgLevel0, "x"); },
        ZYRPublic::kZYRErrorTypeCheck);
    EXPECT_THROW(trace.traceMsg("more"), CZYRError) << "the begun message is open";
    host->failWith = ZYRPublic::kZYRErrorNoError;
    host->throwForeign = true;
    expectError([&] { trace.traceMsg(render(), render(), ZYRPublic::kZYRTraceMsgLevel0, kNoWide); },
                ZYRPublic::kZYRErrorUnknown, "Unknown exception in CZYRTraceMsg::traceMsg",
                kSource);
}

TEST_F(CZYRTraceMsgTest, CallbackWritesLevelFourTextsAndTakesTheLeakReport) {
    { CZYRTraceMsg open(zyrtest::makeJob(jobParams(withPath(dir.file("t.log"))))); }

    sZYRTraceMsg msg{"four ", nullptr};
    sZYRTraceMsgDetail detail{4, nullptr, 0, nullptr, 0, 0};
    ZYRTraceMsgCallbackInternal(&msg, &detail, nullptr);
    detail.level = 3;
    ZYRTraceMsgCallbackInternal(&msg, &detail, nullptr);
    ZYRTraceMsgCallbackInternal(nullptr, &detail, nullptr);
    detail.level = 4;
    sZYRTraceMsg wide{nullptr, u"\\\\a\\b|"};
    ZYRTraceMsgCallbackInternal(&wide, &detail, nullptr);
    EXPECT_EQ(zyrtest::readFile(dir.file("t.log")), "four a/b|");

    // The front's leak report: only its level-4 peak line reaches the log.
    zyrtest::installFront(1);
    ZYRStdInit_ZYRMemMgrDumpMemList(ZYRTraceMsgCallbackInternal, nullptr);
    zyrtest::installFront(0);
    const std::string log = zyrtest::readFile(dir.file("t.log"));
    EXPECT_NE(log.find("ZYRMem: Peak memory consumption: "), std::string::npos) << log;
    EXPECT_EQ(log.find("Total Leaked"), std::string::npos) << log;
}
