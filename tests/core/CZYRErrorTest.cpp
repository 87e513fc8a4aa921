#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>

#include "TestSupport.h"
#include "zyr/std/core/internal/ZYRErrorBoundary.h"

using namespace ZYRStd;
using namespace ZYRPublic;

namespace {

std::string fields(const C_Error& e) {
    return zyrtest::describe(e);
}
std::string fields(const CZYRError& e) {
    return zyrtest::describe(e) + (e.getUnExpectedErr() ? " unexpected" : "");
}
template <class Body> std::string thrown(Body body) {
    try {
        body();
    } catch (const CZYRError& e) {
        return fields(e);
    }
    return "no error";
}
const std::string kNone = "0: <null> (<null>:-1)";

struct EnvGuard {
    EnvGuard(const char* name, const char* value) : name(name) {
        value ? ::setenv(name, value, 1) : ::unsetenv(name);
    }
    ~EnvGuard() { ::unsetenv(name); }
    const char* name;
};

using Block = std::unique_ptr<void, void (*)(void*)>;

void workload() {
    void* block = ZYRDMMMalloc(100, "FAULTS", nullptr, nullptr, nullptr,
                               ZYRPublic::eFlushMemorySeverityNormal);
    ZYRDMMFree(block, "FAULTS", nullptr);
    std::vector<int, CZYRStdAllocator<int>> numbers(64, 7);
    numbers.resize(1000);
    Block sure(ZYRSureCalloc(4, 10), ZYRFree);
    void* grown = ZYRSureRealloc(sure.get(), 400); // a failed resize leaves the block valid
    sure.release();
    sure.reset(grown);
    sure.reset(ZYRSureMalloc(24));
    delete new CZYRClientBase;
    CZYRSmartZYRRefPtr<CZYRSmartRefPtrContainer<int>> box(
        CZYRSmartRefPtrContainer<int>::create(nullptr));
    ZYRFixedSizePool pool(16, 4);
    pool.Free(pool.SureAlloc());
}

} // namespace

TEST(CZYRErrorTest, ExceptionClassesAreCaughtWhereCallersLook) {
    const std::pair<std::function<void()>, const char*> cases[] = {
        {[] { throwCZYRUnexpt(); }, "1: <null> (<null>:-1) unexpected"},
        {[] { throwAssertionFailed("source/zyr/std/CZYRHash", 12); },
         "5: assertion failed (source/zyr/std/CZYRHash:12)"},
        {[] { throw CZYRBadAlloc("msg", "file", 9); }, "7: msg (file:9)"},
        {[] { throw ZYROutOfMemoryError("src", 92); }, "7: Memory alloc failed (src:92)"}};
    for (const auto& [body, expected] : cases)
        EXPECT_EQ(thrown(body), expected);
    const std::bad_alloc &bad = CZYRBadAlloc("m", "f", 1), &oom = ZYROutOfMemoryError("f", 1);
    EXPECT_EQ(std::string(bad.what()) + oom.what(), "bad allocationbad allocation");

    CZYRError plain(kZYRErrorBadParam, "a", "b", 1);
    const CZYRError& self = plain;
    plain = self;
    EXPECT_EQ(fields(plain), "6: a (b:1)");
    plain = CZYRUnexpectError();
    EXPECT_EQ(fields(plain), "1: <null> (<null>:-1) unexpected") << "assignment copies every field";
    plain.setError(kZYRErrorFatal, "x", "y", 2);
    EXPECT_TRUE(plain.getUnExpectedErr()) << "setError leaves the unexpected flag alone";
    EXPECT_TRUE(ZYRErrorFromStdException(std::runtime_error("x")) == kZYRErrorUnknown &&
                ZYRErrorFromJTError(42) == kZYRErrorUnknown);
}

TEST(CZYRErrorTest, StatusesRoundTripAndTheBoundaryConvertsEveryFailure) {
    C_Error status;
    auto both = [&] {
        return thrown([&] { ZYRCheckNThrowError(status); }) + ", " +
               thrown([&] { throwCZYRErrorIfErrorOccurred(status); }) + ", " + fields(status);
    };
    EXPECT_EQ(both(), "no error, no error, " + kNone);
    status.setError(kZYRErrorBadParam, nullptr, nullptr, 3);
    EXPECT_TRUE(status.errorOccurred()) << "a type without texts still counts";
    status.setError(kZYRErrorBadParam, "m", "f", 7);
    EXPECT_EQ(both(), "6: m (f:7), 6: m (f:7), 6: m (f:7)") << "throwing leaves the status";
    status.reset();
    EXPECT_TRUE(!status.errorOccurred() && fields(status) == kNone);
    constexpr const char* kOp = "Error in Test::op";
    EXPECT_TRUE(ZYRErrorBoundary(status, -1, kOp, "src", 1, [] { return 5; }) == 5 &&
                fields(status) == kNone);
    auto keyNotFound = []() -> int {
        throw CZYRError(kZYRErrorKeyNotFound, "Key not found", "s", 4);
    };
    EXPECT_EQ(ZYRErrorBoundary(status, -1, kOp, "src", 1, keyNotFound), -1);
    bool ran = false;
    EXPECT_EQ(ZYRErrorBoundary(status, -1, kOp, "src", 1, [&] { return ran = true; }), -1);
    EXPECT_TRUE(!ran && fields(status) == "13: Key not found (s:4)");
    EXPECT_EQ(createErrorStk(status), nullptr) << "also for the error stack";
    status.reset();
    C_Error foreign;
    foreign.setError(kZYRErrorTypeCheck, "t", "u", 8);
    ZYRErrorBoundary(status, 0, kOp, "src", 1, [&]() -> int { throw foreign; });
    EXPECT_EQ(fields(status), "14: t (u:8)");
    status.reset();
    ZYRErrorBoundary(status, 0, kOp, "src", 77, []() -> int { throw std::runtime_error("x"); });
    EXPECT_EQ(fields(status), "1: Error in Test::op (src:77)");
}

class FaultInjectionTest : public ::testing::TestWithParam<int> {};

TEST_P(FaultInjectionTest, EveryAllocationMayFail) {
    zyrtest::FailingHost host;
    tZYRMemMgr record = host.record();
    zyrtest::installFront(GetParam(), &record);
    CZYRErrorStk notices; // built, and string caches filled, before measuring
    workload();
    const unsigned long long baseline = GetMemUsage();
    host.calls = 0;
    workload();
    const unsigned int callsPerRun = host.calls;
    ASSERT_GT(callsPerRun, 5u);

    std::u16string notice;
    notices.getErrorMessage(notice); // what earlier tests left there
    std::set<std::string> seen;
    for (unsigned int failing = 1; failing <= callsPerRun; ++failing) {
        host.calls = 0;
        host.failAt = failing;
        try {
            workload();
        } catch (const CZYRError& e) {
            seen.insert(fields(e));
        } catch (const std::bad_alloc&) {
        }
        host.failAt = 0;
        ASSERT_EQ(GetMemUsage(), baseline) << "allocation " << failing << " failed";
        notice.clear();
        ASSERT_FALSE(notices.getErrorMessage(notice)) << "a failing host is no refusal to report";
    }
    for (const char* expected :
         {"7: <null> (source/zyr/std/ZYRMem:2042)", "7: <null> (source/zyr/std/ZYRMem:2050)",
          "7: <null> (source/zyr/std/ZYRMem:2058)",
          "7: Mem error in ZYRStdAllocator (source/zyr/std/CZYRStdAllocator:94)",
          "7: Memory alloc failed (source/zyr/std/CZYRClientBase:92)",
          "7: allocating smart ptr container (source/zyr/std/CZYRSmartPtr:242)",
          "7: ZYRFixedSizePool allocation failed (source/zyr/std/ZYRPool:102)"})
        EXPECT_TRUE(seen.count(expected)) << expected;
    zyrtest::installFront(0);
}

INSTANTIATE_TEST_SUITE_P(StatisticsLevels, FaultInjectionTest, ::testing::Values(0, 1, 2));

TEST(ZYRStdInitTest, LevelComesFromTheEnvironmentAndTheHostRecordIsCopied) {
    for (const auto& [value, level] :
         {std::pair<const char*, int>{nullptr, 0}, {"1", 1}, {"3", 3}, {"verbose", 0}, {"", 0}}) {
        EnvGuard env("ZYR_MEMORY_STAT", value);
        ZYRStdInit_ZYRMemMgrSet(nullptr);
        EXPECT_EQ(ZYRGetMemStatLevel(), level) << (value ? value : "(unset)");
        EXPECT_EQ(Block(ZYRMalloc(0), ZYRFree) != nullptr, level != 0) << "only guarded fronts";
        zyrtest::installFront(0);
    }
    zyrtest::FailingHost host;
    tZYRMemMgr record = host.record();
    ZYRStdInit_ZYRMemMgrSet(&record);
    record.clientData = nullptr; // the library's copy must not follow
    EXPECT_EQ(ZYRStdInit_ZYRMemMgrGet()->clientData, &host);
    EXPECT_TRUE(Block(ZYRMalloc(8), ZYRFree) && host.calls == 1);

    ZYRSetMemLimit(500 * 1024 * 1024);
    ZYRStdInit_ZYRMemMgrSet(nullptr);
    EXPECT_EQ(ZYRGetMemLimit(), 500u * 1024 * 1024) << "a null record leaves the limit alone";
    EXPECT_TRUE(ZYRStdInit_ZYRMemMgrGet()->allocProc && !ZYRStdInit_ZYRMemMgrGet()->clientData);
    zyrtest::installFront(0);
}

TEST(ZYRStdInitTest, FactoryProcedureIsSetOnceAndWorkerIdentifierStartsAtOne) {
    static ZYRFactory::IZYRFactory* const fake = reinterpret_cast<ZYRFactory::IZYRFactory*>(0x1000);
    const tZYRFactoryProc first = [] { return fake; },
                          second = []() -> ZYRFactory::IZYRFactory * { return nullptr; };
    EXPECT_EQ(thrown([] { ZYRGetFactory(); }),
              "3: ZYRFactory Proc not set in ZYRStd (source/zyr/std/ZYRStdInit:35)");
    ZYRStdInit_SetZYRFactoryProc(first);
    EXPECT_EQ(thrown([&] { ZYRStdInit_SetZYRFactoryProc(second); }),
              "3: Default filsSys already set (source/zyr/std/ZYRStdInit:56)");
    EXPECT_EQ(ZYRGetFactory(), fake) << "the first procedure stays";
    ZYRStdInit_SetZYRFactoryProc(nullptr);
    ZYRStdInit_SetZYRFactoryProc(second);
    EXPECT_EQ(ZYRGetFactory(), nullptr);
    ZYRStdInit_SetZYRFactoryProc(nullptr);
    EXPECT_EQ(ZYRGetWorkerID(), 1u);
}

TEST(ZYRStdInitTest, DmmLogOpensOnlyWhenNamed) {
    zyrtest::TempDir dir;
    const std::string base = dir.path() + "/" + std::string(100, 'd') + "/";
    std::filesystem::create_directories(base);
    auto sized = [&](size_t n) { return base + std::string(n - base.size(), 'f'); };
    const auto openFiles = [] {
        return std::distance(std::filesystem::directory_iterator("/proc/self/fd"), {});
    };
    const auto before = openFiles();
    tZYRMemMgr any{};
    for (const auto& [named, expected] : {std::pair<std::string, const char*>{"", ""},
                                          {dir.path() + "/missing/dir/dmm.log", ""},
                                          {sized(260), "old"},
                                          {sized(259), "line\n"}}) {
        std::ofstream(named) << "old";
        EnvGuard env("ZYR_DMM_LOG", named.empty() ? nullptr : named.c_str());
        ZYRStdInit_ZYRDMMEnv_set(&any);
        ZYRStdInit_ZYRDMMEnv_set(&any); // opening again closes the file first
        LogDMMInfo("line\n");
        ZYRStdInit_ZYRDMMEnv_set(nullptr);
        EXPECT_EQ(zyrtest::readFile(named), expected) << named;
    }
    EXPECT_EQ(openFiles(), before) << "closing the log closes its file";
}

TEST(ZYRStdInitDeathTest, ExitRoutinesPrintTheirLinesAndAbort) {
    EXPECT_EQ(std::string(ZYRExceptionCodeName(0x80000001)) + ZYRExceptionCodeName(0xC00000FD),
              "EXCEPTION_GUARD_PAGEEXCEPTION_STACK_OVERFLOW");
    EXPECT_DEATH(ZYRSEHExitProcess(0xC0000005, nullptr, 7),
                 "\n\n\t\\*\\*\\* ZYRSEHExitProcess \\(, 7, EXCEPTION_ACCESS_VIOLATION, "
                 "0xC0000005\\)\\*\\*\\*\n\n");
    EXPECT_DEATH(ZYRSEHExitProcess(0xC0000007, "f.cpp", 3),
                 "ZYRSEHExitProcess \\(f.cpp, 3, UNKNOWN, 0xC0000007\\)");
    EXPECT_DEATH(ZYRExitProcess(CZYRError(kZYRErrorBadParam, "bad", "src", 4), "f", 9),
                 "\n\n\t\\*\\*\\* ZYRExitProcess \\(6, bad, src, 4\\)\\*\\*\\*\n\n");
    const CZYRError none(kZYRErrorNoError, nullptr, nullptr, 0);
    EXPECT_EXIT(ZYRExitProcess(none, "f", 9), ::testing::KilledBySignal(SIGABRT), "^$");

    auto withStdoutOnStderr = [](auto exit) { ::dup2(2, 1), exit(); }; // death tests see stderr
    EXPECT_DEATH(withStdoutOnStderr([] { ZYRSEHExitProcess(0xC0000005, nullptr, 7); }),
                 "\n\n\t\\*\\*\\* ZYRSEHExitProcess \\(, 7\\)\\*\\*\\*\n\n");
    EXPECT_DEATH(withStdoutOnStderr([&] { ZYRExitProcess(none, nullptr, 12); }),
                 "\n\n\t\\*\\*\\* ZYRExitProcess \\(, 12\\)\\*\\*\\*\n\n");
}
