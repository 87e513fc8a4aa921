// Error statuses, exceptions and the boundary between them; and every allocation of a
// realistic workload failing in turn: nothing may crash, leak, leave the accounting off or post
// a notice, and each kind of caller reports its failure with the record hosts know it by.
#include <gtest/gtest.h>

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
