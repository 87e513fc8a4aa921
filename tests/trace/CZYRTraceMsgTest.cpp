#include <gtest/gtest.h>

#include <sys/stat.h>
#include <thread>
#include <unistd.h>

#include "EngineFakes.h"
#include "TestSupport.h"
#include "zyr/std/config/ZYRResourceDirs.h"
#include "zyr/std/core/ZYRStdInit.h"
#include "zyr/std/io/internal/ZYRFileSys_helper.h"
#include "zyr/std/trace/CZYRTraceMsg.h"

using namespace ZYRStd;
using zyrtest::FakeProgress;
using zyrtest::startsWith;
using zyrtest::thrown;
using Calls = std::vector<std::string>;

namespace {

class CZYRTraceMsgTest : public ::testing::Test {
protected:
    void SetUp() override { TearDown(); }
    void TearDown() override {
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

CZYRDict withPath(const std::string& path, CZYRDict config = CZYRDict()) {
    config.set(CZYRUniString("Path"), CZYRUniString(path.c_str()));
    return config;
}

CZYRDict jobParams(const CZYRDict& config, int32_t jobId = 7) {
    CZYRDict params;
    params.set(CZYRUniString("JPJobID"), jobId);
    params.set(CZYRUniString("ZYRTraceMsg"), config);
    return params;
}

const auto text = [](const char* s) { return CZYRUniString(s); };
const auto level = [](int n) { return static_cast<eZYRTraceMsgLevel>(n); };

} // namespace

TEST_F(CZYRTraceMsgTest, LogLayout) {
    CZYRDict config = withPath(dir.file("t.log"), levels({{"Default", 0}}));
    config.set(text("Render"), levels({{"Bands", 3}}));
    CZYRTraceMsg trace(zyrtest::makeJob(jobParams(config, 12)));
    ASSERT_EQ(ZYRGetTraceLogPath(), dir.file("t.log"));

    CZYRProgressInterface writer;
    C_Error err;
    const sZYRTraceMsg msg{"band done", nullptr}, none{nullptr, nullptr};
    const sZYRTraceMsgDetail detail{2, "band", 12, nullptr, 0, 1500},
        zero{0, nullptr, 0, "worker", 5, 0};
    writer.TraceMsg(7, nullptr, nullptr, text("Render"), text("Bands"), &msg, &detail, err);
    writer.TraceMsg(-3, nullptr, nullptr, text("Render"), CZYRUniString(), &msg, &zero, err);
    writer.TraceMsg(7, nullptr, nullptr, text("R"), text("R"), &none, &detail, err);
    writer.beginTraceMsg(7, nullptr, nullptr, text("R"), text("R"), nullptr, &detail, err);
    writer.traceMsg(&none, err);
    EXPECT_FALSE(err.errorOccurred());
    EXPECT_EQ(log(), "<ZYRTrace> Job 7 L2 [1.50000000 sec] [C:Render/Bands] [F:band/12] \n"
                     "band done\n"
                     "<ZYRTrace> Job -3 L0 [0.00000000 sec] [C:Render] [Th:worker/5] \n"
                     "band done\n");

    const size_t before = log().size();
    CZYRTraceMsg parts(zyrtest::makeJob(jobParams(config, 12)));
    parts.traceMsg("before any begin");
    parts.endTraceMsg();
    parts.beginTraceMsg(text("Render"), text("Bands"), level(3), "first", false, "src.cpp", 40);
    parts.traceMsg("second");
    for (const char16_t* wide :
         {u"\\\\server\\share\\a.pdf", u"C:\\dir\\f\u00e9", u"d:x \u20ac\U0001F600\xD800x\xDC00",
          u"Z:z", u"z:", u"[:", u"@:", u"`:", u"{:"}) // the letters' ends and their neighbours
        parts.traceMsg(wide);
    parts.endTraceMsg();
    parts.endTraceMsg();
    parts.traceMsg("after the end");
    const std::string got = log().substr(before);
    const size_t head = got.find(" sec] [C:Render/Bands] [F:src.cpp/40] \n");
    EXPECT_TRUE(startsWith(got, "<ZYRTrace> Job 12 L3 [") && head != std::string::npos) << got;
    EXPECT_EQ(
        got.substr(head + 39),
        "first\n<<\nsecond\nserver/share/a.pdf\n/C:/dir/f\xc3\xa9\n"
        "/d:x "
        "\xe2\x82\xac\xf0\x9f\x98\x80\xef\xbf\xbdx\xef\xbf\xbd\n/Z:z\n/z:\n[:\n@:\n`:\n{:\n>>\n");
}

TEST_F(CZYRTraceMsgTest, LevelRulesAndMapping) {
    const int32_t values[] = {9, 8, 0, -1, 531308010, 531308014, 531308009, 531308015};
    const int32_t mapped[] = {8, 8, 0, 0, 531308010, 531308014, 8, 8};
    for (size_t i = 0; i < std::size(values); ++i)
        EXPECT_EQ(mapToTraceMsgLevel(values[i]), mapped[i]) << values[i];

    CZYRDict config = withPath("stdout");
    config.set(text("Default"), 5u);
    config.set(text("Nine"), levels({{"All", 9}, {"Cat", 1}}));
    config.set(text("Kept"), levels({{"Cat", 531308012}}));
    CZYRDict unsignedNegative;
    unsignedNegative.set(text("Default"), static_cast<unsigned int>(-5));
    config.set(text("Negative"), unsignedNegative);
    config.set(text("Known"), levels({{"Other", 2}}));
    config.set(text("NotADict"), 4u);
    CZYRTraceMsg trace(zyrtest::makeJob(jobParams(config)));
    C_Error err;
    const CZYRUniString loose(createUniString("Nine", err), false);
    const CZYRUniString looseCat(createUniString("Cat", err), false);
    for (int round = 0; round < 3; ++round) {
        std::istringstream in("Nine/Cat Kept/Cat Negative/Cat Known/Cat Known/Other Unknown/Cat "
                              "NotADict/Cat Nine/Zzz");
        std::string got;
        for (std::string p; in >> p;)
            got += std::to_string(trace.getTraceMsgLevel(text(p.substr(0, p.find('/')).c_str()),
                                                         text(p.substr(p.find('/') + 1).c_str()))) +
                   " ";
        got += std::to_string(trace.getTraceMsgLevel(CZYRUniString(), text("Cat"))) + " " +
               std::to_string(trace.getTraceMsgLevel(loose, looseCat));
        EXPECT_EQ(got, "8 531308012 0 5 2 0 0 8 0 8") << round;
    }
}

TEST_F(CZYRTraceMsgTest, LevelsAndRoutingToTheHost) {
    FakeProgress* host = nullptr;
    CZYRDict config = withPath("stdout", levels({{"All", 3}}));
    config.set(text("Render"), levels({{"All", 8}}));
    CZYRTraceMsg trace(zyrtest::makeJob(jobParams(config), &host));
    EXPECT_TRUE(trace.isSendToHost() && ZYRGetTraceLogPath().empty());
    trace.traceMsg(text("Render"), text("X"), level(3), "three");
    trace.traceMsg(text("Render"), text("X"), level(4), "four");
    trace.traceMsg(text("Elsewhere"), CZYRUniString(), level(0), "zero");
    trace.traceMsg(text("Elsewhere"), CZYRUniString(), level(8), "forced", true);
    trace.beginTraceMsg(text("Render"), text("B"), level(1), u"wide");
    trace.traceMsg(u"part");
    trace.endTraceMsg();
    EXPECT_EQ(host->calls, (Calls{"whole Render/X L3: three", "whole Elsewhere/ L0: zero",
                                  "whole Elsewhere/ L8: forced", "begin Render/B L1: wide",
                                  "text: part", "end"}));
    EXPECT_EQ(trace.getTraceMsgLevel(text("Render"), text("X")), 3);

    CZYRTraceMsg toLog(
        zyrtest::makeJob(jobParams(withPath(dir.file("t.log"), levels({{"All", 8}}))), &host));
    EXPECT_FALSE(toLog.isSendToHost());
    toLog.beginTraceMsg(text("DLCacheOEMInfo"), text("Any"), level(1), "dl");
    toLog.traceMsg("dl more");
    toLog.endTraceMsg();
    toLog.traceMsg(text("FontMgr"), text("EmulatedFontInfo"), level(1), u"emulated");
    toLog.traceMsg(text("FontMgr"), text("Other"), level(1), "to log");
    EXPECT_EQ(host->calls, (Calls{"begin DLCacheOEMInfo/Any L1: dl", "text: dl more", "end",
                                  "whole FontMgr/EmulatedFontInfo L1: emulated"}));
    EXPECT_TRUE(log().find("dl") == std::string::npos &&
                log().find("[C:FontMgr/Other] \nto log\n") != std::string::npos)
        << log();
    EXPECT_FALSE(CZYRTraceMsg(zyrtest::makeJob(jobParams(withPath("stdout")))).isSendToHost());
    EXPECT_EQ(ZYRGetTraceLogPath(), dir.file("t.log"));
}

TEST_F(CZYRTraceMsgTest, WithoutALogFile) {
    FakeProgress* host = nullptr;
    CZYRTraceMsg trace(zyrtest::makeJob(levels({{"JPJobID", 3}}), &host));
    EXPECT_EQ(trace.getTraceMsgLevel(text("Render"), text("Render")), 0);
    ::testing::internal::CaptureStdout();
    trace.traceMsg(text("Render"), text("Render"), level(0), "dropped");
    trace.traceMsg(text("Render"), text("Render"), level(5), u"C:\\kept", true);
    CZYRTraceMsg(zyrtest::makeJob(CZYRDict())).traceMsg(text("R"), text("R"), level(5), "x", true);
    std::string out = ::testing::internal::GetCapturedStdout();
    EXPECT_TRUE(startsWith(out, "<ZYRTrace> Job 3 L5 [")) << out;
    EXPECT_NE(out.find(" sec] [C:Render/Render] \nC:\\kept\n<ZYRTrace> Job 0 L5 ["), out.npos);
    EXPECT_TRUE(out.find("dropped") == out.npos && host->calls.empty() &&
                ZYRGetTraceLogPath().empty());

    ::testing::internal::CaptureStdout();
    CZYRTraceMsg failed(
        zyrtest::makeJob(jobParams(withPath(dir.file("missing/dir/t.log"), levels({{"All", 8}})))));
    failed.traceMsg(text("Render"), text("Render"), level(1), "shown");
    out = ::testing::internal::GetCapturedStdout();
    EXPECT_TRUE(startsWith(out, "TRACE WARNING: File open failed for trace log file. Trace logs "
                                "will be shown in standard output\n<ZYRTrace> Job 7 L1 [") &&
                out.find("\nshown\n") != out.npos && ZYRGetTraceLogPath().empty())
        << out;

    const char* saved = std::getenv("TMPDIR");
    const std::string savedText = saved ? saved : "";
    ::setenv("TMPDIR", dir.path().c_str(), 1);
    CZYRTraceMsg byDefault(zyrtest::makeJob(jobParams(levels({{"All", 1}}))));
    saved ? ::setenv("TMPDIR", savedText.c_str(), 1) : ::unsetenv("TMPDIR");
    const std::string tempDir = ZYRGetTempDirectory();
    EXPECT_EQ(ZYRGetTraceLogPath(), (tempDir.empty() ? dir.path() : tempDir) + "/traceLog.log");
}

// A log path is the file system's bytes, whatever the script, UTF-8 or not; and the log is
// never opened through a link someone placed where it goes.
TEST_F(CZYRTraceMsgTest, LogPathsAreBytesAndNeverALink) {
    const std::string named = dir.file("d\xc3\xa9j\xc3\xa0-\xff.log");
    CZYRDict config = levels({{"All", 8}});
    config.set(CZYRUniString("Path"), ZYRFileSys::uniPathOf(named.c_str()));
    CZYRTraceMsg(zyrtest::makeJob(jobParams(config)))
        .traceMsg(text("Render"), text("Bands"), level(1), "written");
    EXPECT_EQ(ZYRGetTraceLogPath(), named);
    closeTraceLogPath();
    EXPECT_NE(zyrtest::readFile(named).find("\nwritten\n"), std::string::npos);

    const std::string folder = dir.file("\xce\xb4\xe9"); // Greek, then a Latin-1 byte
    ASSERT_EQ(::mkdir(folder.c_str(), 0700), 0);
    zyrtest::writeFile(dir.file("victim"), "keep");
    ASSERT_EQ(::symlink(dir.file("victim").c_str(), (folder + "/traceLog.log").c_str()), 0);
    ZYRSetTempDirectory(ZYRFileSys::uniPathOf(folder.c_str()));
    ::testing::internal::CaptureStdout();
    CZYRTraceMsg(zyrtest::makeJob(jobParams(levels({{"All", 8}}))))
        .traceMsg(text("Render"), text("Bands"), level(1), "not through the link");
    const std::string out = ::testing::internal::GetCapturedStdout();
    EXPECT_EQ(ZYRGetTempDirectory(), folder);
    ZYRSetTempDirectory(CZYRUniString(""));
    EXPECT_TRUE(startsWith(out, "TRACE WARNING: File open failed") && ZYRGetTraceLogPath().empty())
        << out;
    EXPECT_EQ(zyrtest::readFile(dir.file("victim")), "keep");
}

TEST_F(CZYRTraceMsgTest, ProcessWideDictionaryMerges) {
    CZYRDict global = withPath("stdout", levels({{"Default", 1}}));
    global.set(text("Render"), levels({{"All", 6}}));
    ZYRTracingDict::getInstance().setTracingDict(global);
    global.set(text("Late"), levels({{"All", 4}}));
    CZYRTraceMsg alone(zyrtest::makeJob(levels({{"JPJobID", 1}})));
    EXPECT_TRUE(alone.getTraceMsgLevel(text("Render"), text("Render")) == 6 &&
                alone.getTraceMsgLevel(text("Late"), text("Render")) == 0);

    CZYRDict own;
    own.set(text("Render"), levels({{"All", 2}}));
    own.set(text("Own"), levels({{"X", 3}}));
    CZYRTraceMsg merged(zyrtest::makeJob(jobParams(own)));
    EXPECT_TRUE(merged.getTraceMsgLevel(text("Render"), text("Render")) == 6 &&
                merged.getTraceMsgLevel(text("Own"), text("X")) == 3 &&
                merged.getTraceMsgLevel(text("Own"), text("Y")) == 1 && merged.isSendToHost() &&
                own.getSize() == 2u);
    // Changed in place through the process-wide reference, at the top and in an area.
    CZYRDict live(ZYRTracingDict::getInstance().getTracingDict().get(), true), render;
    live.get(text("Render"), render);
    render.set(text("All"), 3);
    live.set(text("Late"), levels({{"All", 5}}));
    for (const CZYRTraceMsg* trace : {&alone, &merged})
        EXPECT_TRUE(trace->getTraceMsgLevel(text("Render"), text("Render")) == 3 &&
                    trace->getTraceMsgLevel(text("Late"), text("Render")) == 5);
    ZYRTracingDict::getInstance().setTracingDict(CZYRDict());
    EXPECT_FALSE(ZYRTracingDict::getInstance().getTracingDict());
}

TEST_F(CZYRTraceMsgTest, CyclicAndDeepConfigurationsAreReadOnlyWhereAsked) {
    CZYRDict config = withPath("stdout", levels({{"X", 2}})), at = config;
    config.set(text("Loop"), config);
    for (int i = 0; i < 300; ++i) {
        CZYRDict next;
        at.set(text("In"), next);
        at = next;
    }
    EXPECT_EQ(thrown([&] {
                  const CZYRTraceMsg trace(zyrtest::makeJob(jobParams(config)));
                  EXPECT_EQ(trace.getTraceMsgLevel(text("Loop"), text("X")), 2);
              }),
              "no error");
    config.remove(text("Loop")); // the cycle would leak
}

TEST_F(CZYRTraceMsgTest, OneObjectAskedFromTwoThreads) {
    CZYRDict config = withPath("stdout");
    const char* const areas[] = {"A", "B", "C", "D", "E", "F"};
    for (int i = 0; i < 6; ++i)
        config.set(text(areas[i]), levels({{"All", i}}));
    const CZYRTraceMsg trace(zyrtest::makeJob(jobParams(config)));
    auto ask = [&](int offset) { // more areas than remembered levels: the cache keeps changing
        for (int n = 0; n < 20000; ++n) {
            const int i = (n + offset) % 6;
            ASSERT_EQ(trace.getTraceMsgLevel(text(areas[i]), CZYRUniString()), i);
        }
    };
    std::thread first(ask, 0), second(ask, 3);
    first.join();
    second.join();
}

TEST_F(CZYRTraceMsgTest, TwoThreadsNeverMixHeadsAndTexts) {
    CZYRDict params = jobParams(withPath(dir.file("t.log"), levels({{"All", 8}})));
    params.finalize();
    const auto job = zyrtest::makeJob(params);
    { CZYRTraceMsg open(job); }
    constexpr int kMessages = 300;
    auto writer = [&](const char* area, const char* message) {
        CZYRTraceMsg trace(job);
        const CZYRUniString a(area);
        for (int i = 0; i < kMessages; ++i)
            trace.traceMsg(a, CZYRUniString(), level(1), message);
    };
    std::thread first(writer, "AreaA", "text of A"), second(writer, "AreaB", "text of B");
    first.join();
    second.join();
    std::istringstream in(log());
    int lines = 0;
    for (std::string head, message; std::getline(in, head) && std::getline(in, message); ++lines) {
        ASSERT_TRUE(startsWith(head, "<ZYRTrace> Job 7 L1 [")) << head;
        const bool isA = head.find("[C:AreaA] ") != std::string::npos;
        ASSERT_EQ(message, isA ? "text of A" : "text of B") << "after " << head;
    }
    EXPECT_EQ(lines, 2 * kMessages);
}

TEST_F(CZYRTraceMsgTest, ConstructionAndHostFailures) {
    auto job = zyrtest::make<zyrtest::FakeJob>();
    EXPECT_TRUE(startsWith(thrown([&] { CZYRTraceMsg trace{C_SmartPtr<ZYRPublic::I_Job>(job)}; }),
                           "4: Error getting OEM Interface"));
    FakeProgress* host = nullptr;
    const auto failing = zyrtest::makeJob(jobParams(withPath("stdout")), &host);
    static_cast<zyrtest::FakeJob&>(*failing).failWith = ZYRPublic::kZYRErrorTypeCheck;
    EXPECT_EQ(thrown([&] { CZYRTraceMsg trace(failing); }), "14: getter failed (fake:1)");
    const auto fromSurface = [](const C_SmartPtr<ZYRPublic::I_Surface>& surface) {
        return thrown(
            [&] { CZYRTraceMsg(surface).traceMsg(text("R"), text("R"), level(0), "ok"); });
    };
    EXPECT_TRUE(startsWith(fromSurface(zyrtest::makeSurface(4, C_SmartPtr<ZYRPublic::I_Job>())),
                           "25: miss job (source/zyr/std/CZYRTraceMsg:"));
    EXPECT_TRUE(startsWith(fromSurface(C_SmartPtr<ZYRPublic::I_Surface>()), "25: miss job"));
    const auto surface =
        zyrtest::makeSurface(4, zyrtest::makeJob(jobParams(withPath("stdout")), &host));
    surface->failWith = surface->owner->failWith = surface->owner->parent->failWith =
        ZYRPublic::kZYRErrorTypeCheck;
    EXPECT_EQ(fromSurface(surface), "no error");
    EXPECT_EQ(host->calls, Calls{"whole R/R L0: ok"});

    CZYRTraceMsg trace(zyrtest::makeJob(jobParams(withPath("stdout")), &host));
    host->failWith = ZYRPublic::kZYRErrorTypeCheck;
    const std::string failed = "14: host failed (fake:1)";
    EXPECT_EQ(thrown([&] { trace.beginTraceMsg(text("R"), text("R"), level(0), "x"); }), failed);
    EXPECT_EQ(thrown([&] { trace.traceMsg("more"); }), failed) << "the begun message is open";
    EXPECT_EQ(thrown([&] { trace.endTraceMsg(); }), failed);
    host->failWith = ZYRPublic::kZYRErrorNoError;
    trace.traceMsg("after");
    EXPECT_EQ(host->calls, (Calls{"begin R/R L0: x", "text: more", "end"}))
        << "a failed end still closes the message";
    host->throwForeign = true;
    const char16_t* const noText = nullptr;
    EXPECT_TRUE(startsWith(thrown([&] { trace.traceMsg(text("R"), text("R"), level(0), noText); }),
                           "1: Unknown exception in CZYRTraceMsg::traceMsg "
                           "(source/zyr/std/CZYRTraceMsg:"));
}

TEST_F(CZYRTraceMsgTest, CallbackWritesLevelFourTextsAndTakesTheLeakReport) {
    { CZYRTraceMsg open(zyrtest::makeJob(jobParams(withPath(dir.file("t.log"))))); }
    sZYRTraceMsg msg{"four ", nullptr}, wide{nullptr, u"\\\\a\\b|"};
    sZYRTraceMsgDetail four{4, nullptr, 0, nullptr, 0, 0}, three{3, nullptr, 0, nullptr, 0, 0};
    ZYRTraceMsgCallbackInternal(&msg, &four, nullptr);
    ZYRTraceMsgCallbackInternal(&msg, nullptr, nullptr);
    ZYRTraceMsgCallbackInternal(&msg, &three, nullptr);
    ZYRTraceMsgCallbackInternal(nullptr, &four, nullptr);
    ZYRTraceMsgCallbackInternal(&wide, &four, nullptr);
    EXPECT_EQ(log(), "four a/b|");
    zyrtest::installFront(1);
    ZYRStdInit_ZYRMemMgrDumpMemList(ZYRTraceMsgCallbackInternal, nullptr);
    zyrtest::installFront(0);
    EXPECT_NE(log().find("ZYRMem: Peak memory consumption: "), std::string::npos) << log();
    EXPECT_EQ(log().find("Total Leaked"), std::string::npos) << log();
}
