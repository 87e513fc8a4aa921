// Error statuses, exceptions and the boundary between them; every allocation of a realistic
// workload failing in turn: nothing may crash, leak, leave the accounting off or post a notice,
// and each kind of caller reports its failure with the record hosts know it by; and the
// start-up hooks, host procedures and process-exit routines.
#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <memory>
#include <set>
#include <stdexcept>
#include <string>
#include <tuple>
#include <vector>

#include "TestSupport.h"
#include "ZYRStd.h"
#include "zyr/std/core/internal/ZYRErrorBoundary.h"
#include "zyr/std/memory/ZYRPool.h"

using namespace ZYRStd;
using namespace ZYRPublic;

namespace {

// An error's fields; a null text reads "(null)".
using Fields = std::tuple<int, std::string, std::string, int, bool>;
std::string text(const char* s) {
    return s ? s : "(null)";
}
template <class Error> Fields fields(const Error& e) {
    bool unexpected = false;
    if constexpr (std::is_same_v<Error, CZYRError>)
        unexpected = e.getUnExpectedErr();
    return {e.getError(), text(e.getMessage()), text(e.getSrcFileName()), e.getSrcLineNumber(),
            unexpected};
}
// What `body` throws as a CZYRError; all empty when it throws none.
template <class Body> Fields thrown(Body body) {
    try {
        body();
    } catch (const CZYRError& e) {
        return fields(e);
    }
    return {};
}

// Sets (null: removes) an environment variable the tests do not otherwise use, and removes it
// again at the end.
struct EnvGuard {
    EnvGuard(const char* name, const char* value) : name(name) {
        value ? ::setenv(name, value, 1) : ::unsetenv(name);
    }
    ~EnvGuard() { ::unsetenv(name); }
    const char* name;
};

ZYRFactory::IZYRFactory* const kFakeFactory = reinterpret_cast<ZYRFactory::IZYRFactory*>(0x1000);
ZYRFactory::IZYRFactory* factoryA() {
    return kFakeFactory;
}
ZYRFactory::IZYRFactory* factoryB() {
    return nullptr;
}

int handlerCalls = 0;
void countingHandler() {
    ++handlerCalls;
}
void otherHandler() {}

struct OnClientBase : CZYRClientBase {
    int payload[4];
};

// Values, strings, the dynamic memory manager, the container allocator, the sure variants of
// the front, class allocation, smart-pointer boxes and a pool in one go.
void workload() {
    CZYRDict dict;
    dict.set(CZYRUniString("first key"), 1u);
    CZYRArray array;
    array.set(3, CZYRUniString("element"));
    array.set(1, CZYRDataBuffer("bytes", 5));
    dict.set(CZYRUniString("array"), array);
    const CZYRDict copy = dict.clone();
    CZYRUniString joined = CZYRUniString("left").concat(CZYRUniString("right"));
    joined.append(CZYRUniString("more"));
    const CZYRString narrow(joined);
    void* block = ZYRDMMMalloc(100, "FAULTS", nullptr, nullptr, nullptr,
                               ZYRPublic::eFlushMemorySeverityNormal);
    ZYRDMMFree(block, "FAULTS", nullptr);
    std::vector<int, CZYRStdAllocator<int>> numbers(64, 7);
    numbers.resize(1000);
    std::unique_ptr<void, void (*)(void*)> sure(ZYRSureCalloc(4, 10), ZYRFree);
    void* grown = ZYRSureRealloc(sure.get(), 400);
    sure.release();
    sure.reset(grown);
    sure.reset(ZYRSureMalloc(24));
    delete new OnClientBase;
    CZYRSmartZYRRefPtr<CZYRSmartRefPtrContainer<int>> box(
        CZYRSmartRefPtrContainer<int>::create(nullptr));
    ZYRFixedSizePool pool(16, 4);
    pool.Free(pool.SureAlloc());
}

} // namespace

TEST(CZYRErrorTest, StatusRoundTripsThroughExceptionAndResets) {
    C_Error status;
    EXPECT_EQ(fields(status), Fields(kZYRErrorNoError, "(null)", "(null)", -1, false));
    EXPECT_NO_THROW(ZYRCheckNThrowError(status));
    EXPECT_NO_THROW(throwCZYRErrorIfErrorOccurred(status));
    status.setError(kZYRErrorBadParam, nullptr, nullptr, 3);
    EXPECT_TRUE(status.errorOccurred()) << "a type without texts still counts";
    status.setError(kZYRErrorBadParam, "m", "f", 7);
    const Fields expected(kZYRErrorBadParam, "m", "f", 7, false);
    EXPECT_EQ(thrown([&] { ZYRCheckNThrowError(status); }), expected);
    EXPECT_EQ(thrown([&] { throwCZYRErrorIfErrorOccurred(status); }), expected);
    EXPECT_EQ(fields(status), expected) << "throwing leaves the status as it was";
    status.reset();
    EXPECT_FALSE(status.errorOccurred());
    EXPECT_EQ(fields(status), Fields(kZYRErrorNoError, "(null)", "(null)", -1, false));
}

TEST(CZYRErrorTest, ExceptionClassesAreCaughtWhereCallersLook) {
    EXPECT_EQ(thrown([] { throwCZYRUnexpt(); }),
              Fields(kZYRErrorUnknown, "(null)", "(null)", -1, true));
    EXPECT_EQ(
        thrown([] { throwAssertionFailed("source/zyr/std/CZYRHash", 12); }),
        Fields(kZYRErrorAssertionFailed, "assertion failed", "source/zyr/std/CZYRHash", 12, false));
    EXPECT_EQ(thrown([] { throw CZYRBadAlloc("msg", "file", 9); }),
              Fields(kZYRErrorOutOfMemory, "msg", "file", 9, false));
    EXPECT_EQ(thrown([] { throw ZYROutOfMemoryError("src", 92); }),
              Fields(kZYRErrorOutOfMemory, "Memory alloc failed", "src", 92, false));
    EXPECT_STREQ(CZYRBadAlloc("m", "f", 1).what(), "bad allocation");
    EXPECT_STREQ(ZYROutOfMemoryError("f", 1).what(), "bad allocation");
    EXPECT_THROW(throw CZYRBadAlloc("m", "f", 1), std::bad_alloc);
    EXPECT_THROW(throw ZYROutOfMemoryError("f", 1), std::bad_alloc);

    CZYRError plain(kZYRErrorBadParam, "a", "b", 1);
    const CZYRError& self = plain;
    plain = self;
    EXPECT_EQ(fields(plain), Fields(kZYRErrorBadParam, "a", "b", 1, false));
    plain = CZYRUnexpectError();
    EXPECT_EQ(fields(plain), Fields(kZYRErrorUnknown, "(null)", "(null)", -1, true))
        << "assignment copies every field, the unexpected flag too";
    plain.setError(kZYRErrorFatal, "x", "y", 2);
    EXPECT_TRUE(plain.getUnExpectedErr()) << "setError leaves the unexpected flag alone";
    EXPECT_EQ(ZYRErrorFromStdException(std::runtime_error("x")), kZYRErrorUnknown);
    EXPECT_EQ(ZYRErrorFromJTError(42), kZYRErrorUnknown);
}

TEST(CZYRErrorTest, BoundaryConvertsEveryKindOfFailure) {
    constexpr const char* kOp = "Error in Test::op";
    C_Error status;
    EXPECT_EQ(ZYRErrorBoundary(status, -1, kOp, "src", 1, [] { return 5; }), 5);
    EXPECT_FALSE(status.errorOccurred());
    EXPECT_EQ(ZYRErrorBoundary(
                  status, -1, kOp, "src", 1,
                  []() -> int { throw CZYRError(kZYRErrorKeyNotFound, "Key not found", "s", 4); }),
              -1);
    const Fields keyNotFound(kZYRErrorKeyNotFound, "Key not found", "s", 4, false);
    EXPECT_EQ(fields(status), keyNotFound);
    // An earlier error makes the next call a no-op that keeps the record.
    bool ran = false;
    EXPECT_EQ(ZYRErrorBoundary(status, -1, kOp, "src", 1,
                               [&] {
                                   ran = true;
                                   return 1;
                               }),
              -1);
    EXPECT_FALSE(ran);
    EXPECT_EQ(fields(status), keyNotFound);
    EXPECT_EQ(createErrorStk(status), nullptr) << "also for the error stack";

    status.reset();
    C_Error foreign;
    foreign.setError(kZYRErrorTypeCheck, "t", "u", 8);
    ZYRErrorBoundary(status, 0, kOp, "src", 1, [&]() -> int { throw foreign; });
    EXPECT_EQ(fields(status), Fields(kZYRErrorTypeCheck, "t", "u", 8, false));
    status.reset();
    ZYRErrorBoundary(status, 0, kOp, "src", 77, []() -> int { throw std::runtime_error("x"); });
    EXPECT_EQ(fields(status), Fields(kZYRErrorUnknown, kOp, "src", 77, false));
}

TEST(CZYRErrorTest, UnexpectedHandlerGuardsNestAndRestore) {
    const ZYRUnexpectedHandler original = ZYRGetUnexpectedHandler();
    {
        CZYRErrorSTC outer(countingHandler);
        EXPECT_EQ(ZYRGetUnexpectedHandler(), &countingHandler);
        {
            CZYRErrorSTC inner(otherHandler);
            EXPECT_EQ(ZYRGetUnexpectedHandler(), &otherHandler);
        }
        EXPECT_EQ(ZYRGetUnexpectedHandler(), &countingHandler);
        ZYRGetUnexpectedHandler()();
        EXPECT_EQ(handlerCalls, 1);
    }
    EXPECT_EQ(ZYRGetUnexpectedHandler(), original);
}

class FaultInjectionTest : public ::testing::TestWithParam<int> {};

TEST_P(FaultInjectionTest, EveryAllocationMayFail) {
    zyrtest::FailingHost host;
    tZYRMemMgr record = host.record();
    zyrtest::installFront(GetParam(), &record);
    CZYRErrorStk notices; // built before measuring; it lives for the process
    workload();           // the dynamic string cache keeps its texts from now on
    const unsigned long long baseline = GetMemUsage();
    host.calls = 0;
    workload();
    const unsigned int callsPerRun = host.calls;
    ASSERT_GT(callsPerRun, 10u);

    std::u16string notice;
    notices.getErrorMessage(notice); // what earlier tests left there
    std::set<Fields> seen;
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
    for (const auto& [message, source, line] :
         {std::tuple<const char*, const char*, int>{"(null)", "source/zyr/std/ZYRMem", 2042},
          {"(null)", "source/zyr/std/ZYRMem", 2050},
          {"(null)", "source/zyr/std/ZYRMem", 2058},
          {"Mem error in ZYRStdAllocator", "source/zyr/std/CZYRStdAllocator", 94},
          {"Memory alloc failed", "source/zyr/std/CZYRClientBase", 92},
          {"allocating smart ptr container", "source/zyr/std/CZYRSmartPtr", 242},
          {"ZYRFixedSizePool allocation failed", "source/zyr/std/ZYRPool", 102}})
        EXPECT_TRUE(seen.count({kZYRErrorOutOfMemory, message, source, line, false}))
            << message << " " << line;
    zyrtest::installFront(0);
}

// Plain and guarded fronts.
INSTANTIATE_TEST_SUITE_P(StatisticsLevels, FaultInjectionTest, ::testing::Values(0, 1));

TEST(ZYRStdInitTest, MemoryStatLevelComesFromTheEnvironment) {
    const struct {
        const char* value;
        int level;
    } cases[] = {{nullptr, 0}, {"1", 1}, {"3", 3}, {"verbose", 0}, {"", 0}};
    for (const auto& c : cases) {
        {
            EnvGuard env("ZYR_MEMORY_STAT", c.value);
            ZYRStdInit_ZYRMemMgrSet(nullptr);
            EXPECT_EQ(ZYRGetMemStatLevel(), c.level) << (c.value ? c.value : "(unset)");
            void* p = ZYRMalloc(0);
            EXPECT_EQ(p != nullptr, c.level != 0) << "only the guarded front serves 0 bytes";
            ZYRFree(p);
        }
        zyrtest::installFront(0);
    }
}

TEST(ZYRStdInitTest, HostRecordIsCopiedAndNullKeepsTheLimit) {
    zyrtest::FailingHost host;
    tZYRMemMgr record = host.record();
    ZYRStdInit_ZYRMemMgrSet(&record);
    EXPECT_GT(ZYRGetMemLimit(), 0u) << "a host record sets the limit from the machine";
    record.clientData = nullptr; // the library's copy must not follow
    EXPECT_EQ(ZYRStdInit_ZYRMemMgrGet()->clientData, &host);
    void* p = ZYRMalloc(8);
    EXPECT_EQ(host.calls, 1u);
    ZYRFree(p);

    ZYRSetMemLimit(500 * 1024 * 1024);
    ZYRStdInit_ZYRMemMgrSet(nullptr);
    EXPECT_EQ(ZYRGetMemLimit(), 500u * 1024 * 1024) << "a null record leaves the limit alone";
    EXPECT_NE(ZYRStdInit_ZYRMemMgrGet()->allocProc, nullptr);
    EXPECT_EQ(ZYRStdInit_ZYRMemMgrGet()->clientData, nullptr);
    zyrtest::installFront(0);
}

TEST(ZYRStdInitTest, FactoryProcedureIsSetOnceAndWorkerIdentifierStartsAtOne) {
    const std::string kSource = "source/zyr/std/ZYRStdInit";
    EXPECT_EQ(thrown([] { ZYRGetFactory(); }),
              Fields(kZYRErrorFatal, "ZYRFactory Proc not set in ZYRStd", kSource, 35, false));
    ZYRStdInit_SetZYRFactoryProc(factoryA);
    EXPECT_EQ(ZYRGetFactory(), kFakeFactory);
    EXPECT_EQ(thrown([] { ZYRStdInit_SetZYRFactoryProc(factoryB); }),
              Fields(kZYRErrorFatal, "Default filsSys already set", kSource, 56, false));
    EXPECT_EQ(ZYRGetFactory(), kFakeFactory) << "the first procedure stays";
    ZYRStdInit_SetZYRFactoryProc(nullptr);
    ZYRStdInit_SetZYRFactoryProc(factoryB);
    EXPECT_EQ(ZYRGetFactory(), nullptr);
    ZYRStdInit_SetZYRFactoryProc(nullptr);

    EXPECT_EQ(ZYRGetWorkerID(), 1u);
    ZYRStdInit_ZYRSetWorkerID(7);
    EXPECT_EQ(ZYRGetWorkerID(), 7u);
    ZYRSetWorkerID(1);
    EXPECT_EQ(ZYRGetWorkerID(), 1u);
}

// The log opens only where ZYR_DMM_LOG names a file that can be made with a path of at most
// 259 characters, and starts empty.
TEST(ZYRStdInitTest, DmmLogOpensOnlyWhenNamed) {
    zyrtest::TempDir dir;
    const std::string base = dir.path() + "/" + std::string(100, 'd') + "/";
    std::filesystem::create_directories(base);
    auto sized = [&](size_t n) { return base + std::string(n - base.size(), 'f'); };
    const std::pair<std::string, const char*> cases[] = {{"", ""},
                                                         {dir.path() + "/missing/dir/dmm.log", ""},
                                                         {sized(260), "old"},
                                                         {sized(259), "line\n"}};
    tZYRMemMgr any{};
    for (const auto& [named, expected] : cases) {
        std::ofstream(named) << "old";
        EnvGuard env("ZYR_DMM_LOG", named.empty() ? nullptr : named.c_str());
        ZYRStdInit_ZYRDMMEnv_set(&any);
        LogDMMInfo("line\n");
        ZYRStdInit_ZYRDMMEnv_set(nullptr);
        EXPECT_EQ(zyrtest::readFile(named), expected) << named;
    }
}

using ZYRStdInitDeathTest = ::testing::Test;

// Both exit routines write a line to standard output and, for an error, one to standard error,
// then abort. Death tests only see stderr, so a child copies its stdout there first.
TEST(ZYRStdInitDeathTest, ExitRoutinesPrintTheirLinesAndAbort) {
    EXPECT_STREQ(ZYRExceptionCodeName(0x80000001), "EXCEPTION_GUARD_PAGE");
    EXPECT_STREQ(ZYRExceptionCodeName(0xC00000FD), "EXCEPTION_STACK_OVERFLOW");
    EXPECT_DEATH(ZYRSEHExitProcess(0xC0000005, nullptr, 7),
                 "\n\n\t\\*\\*\\* ZYRSEHExitProcess \\(, 7, EXCEPTION_ACCESS_VIOLATION, "
                 "0xC0000005\\)\\*\\*\\*\n\n");
    EXPECT_DEATH(ZYRSEHExitProcess(0xC0000007, "f.cpp", 3),
                 "ZYRSEHExitProcess \\(f.cpp, 3, UNKNOWN, 0xC0000007\\)");
    EXPECT_DEATH(ZYRExitProcess(CZYRError(kZYRErrorBadParam, "bad", "src", 4), "f", 9),
                 "\n\n\t\\*\\*\\* ZYRExitProcess \\(6, bad, src, 4\\)\\*\\*\\*\n\n");
    const CZYRError none(kZYRErrorNoError, nullptr, nullptr, 0);
    EXPECT_EXIT(ZYRExitProcess(none, "f", 9), ::testing::KilledBySignal(SIGABRT), "^$");

    auto withStdoutOnStderr = [](auto exit) {
        ::dup2(2, 1);
        exit();
    };
    EXPECT_DEATH(withStdoutOnStderr([] { ZYRSEHExitProcess(0xC0000005, nullptr, 7); }),
                 "\n\n\t\\*\\*\\* ZYRSEHExitProcess \\(, 7\\)\\*\\*\\*\n\n");
    EXPECT_DEATH(withStdoutOnStderr([&] { ZYRExitProcess(none, nullptr, 12); }),
                 "\n\n\t\\*\\*\\* ZYRExitProcess \\(, 12\\)\\*\\*\\*\n\n");
}
