// Error statuses, exceptions and the boundary between them; the error stack: per-thread
// order, unique reports, filters, and the out-of-memory notice.
#include <gtest/gtest.h>

#include <atomic>
#include <stdexcept>
#include <string>
#include <thread>
#include <tuple>

#include "TestSupport.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/CZYRErrorStk.h"
#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/core/ZYRThread.h"
#include "zyr/std/core/internal/ZYRErrorBoundary.h"

using namespace ZYRStd;
using namespace ZYRPublic;

namespace {

// An error's fields; a null text reads "(null)".
using Fields = std::tuple<int, std::string, std::string, int, bool>;
std::string text(const char* s) {
    return s ? s : "(null)";
}
Fields fields(const CZYRError& e) {
    return {e.getError(), text(e.getMessage()), text(e.getSrcFileName()), e.getSrcLineNumber(),
            e.getUnExpectedErr()};
}
Fields fields(const C_Error& e) {
    return {e.getError(), text(e.getMessage()), text(e.getSrcFileName()), e.getSrcLineNumber(),
            false};
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

// Everything on the stack, newest first per thread, except what the filter contains.
std::u16string fetch(std::u16string filter = u"") {
    CZYRErrorStk stack;
    return stack.getErrorMessage(filter) ? filter : u"<none>";
}

class CZYRErrorStkTest : public ::testing::Test {
protected:
    void SetUp() override { fetch(); }
    void TearDown() override { fetch(); }
};

void report(const char16_t* text, bool unique = false) {
    CZYRErrorStk stack;
    if (unique)
        stack.reportUniqueError(ZYRMakeErrorInfo(1, text));
    else
        stack.reportError(ZYRMakeErrorInfo(1, text));
}

int handlerCalls = 0;
void countingHandler() {
    ++handlerCalls;
}
void otherHandler() {}

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

TEST_F(CZYRErrorStkTest, OrderFilterUniquenessAndTheRawInterface) {
    report(u"a");
    report(u"b");
    EXPECT_EQ(fetch(), u"ba");
    EXPECT_EQ(fetch(), u"<none>") << "fetching empties the stack";
    report(u"c");
    report(u"ab");
    report(u"");
    EXPECT_EQ(fetch(u"xxabyy"), u"c") << "the filter skips messages it contains";
    report(u"same", true);
    report(u"same", true);
    std::thread([] { report(u"same", true); }).join();
    EXPECT_EQ(fetch(), u"samesame") << "unique per thread";

    uint32_t ids[2] = {};
    for (int i = 0; i < 2; ++i)
        std::thread([&ids, i] {
            ids[i] = ZYRGetCurrentThreadId();
            report(i == 0 ? u"1" : u"2");
        }).join();
    EXPECT_EQ(fetch(), ids[0] < ids[1] ? u"12" : u"21") << "threads in identifier order";

    // The raw interface leaves the length alone when nothing is found.
    C_Error err;
    I_ErrorStk* raw = createErrorStk(err);
    ASSERT_NE(raw, nullptr);
    char16_t buffer[1025] = u"";
    unsigned short length = 77;
    EXPECT_FALSE(raw->getErrorMessage(buffer, &length));
    EXPECT_EQ(length, 77);
    raw->reportError(3, u"xyz", 0);
    EXPECT_TRUE(raw->getErrorMessage(buffer, &length));
    EXPECT_EQ(length, 3);
    EXPECT_EQ(std::u16string(buffer), u"xyz");

    report(u"lost");
    TerminateErrorStk();
    EXPECT_EQ(fetch(), u"<none>") << "a new stack starts empty";
}

TEST_F(CZYRErrorStkTest, LongMessagesAndResultsAreCutAt1024) {
    report(std::u16string(2000, u'x').c_str());
    EXPECT_EQ(fetch().size(), 1024u);
    report(std::u16string(700, u'a').c_str());
    report(std::u16string(700, u'b').c_str());
    EXPECT_EQ(fetch(), std::u16string(700, u'b') + std::u16string(324, u'a'));
}

TEST_F(CZYRErrorStkTest, RefusedAllocationLeavesOneNotice) {
    TerminateErrorStk(); // the very first notice also builds the stack
    zyrtest::installFront(0);
    ZYRSetMemLimit(400ull << 20);
    const auto tooMuch = static_cast<unsigned int>((400ull << 20) - GetMemUsage() + 8);
    EXPECT_EQ(ZYRMalloc(tooMuch), nullptr);
    EXPECT_EQ(ZYRMalloc(tooMuch), nullptr);
    EXPECT_EQ(fetch(), u"Insufficient Memory.\n") << "one unique notice for repeated refusals";

    zyrtest::FailingHost host;
    host.failAll = true;
    tZYRMemMgr record = host.record();
    zyrtest::installFront(0, &record);
    EXPECT_EQ(ZYRMalloc(16), nullptr);
    EXPECT_EQ(fetch(), u"<none>") << "a failing host allocator is not reported";
    zyrtest::installFront(0);
}

TEST_F(CZYRErrorStkTest, OutOfMemoryNoticeFromAnyThreadIsSafeAgainstTerminate) {
    zyrtest::installFront(0);
    ZYRSetMemLimit(400ull << 20);
    // Usage at the limit, so that every small request is refused without a large block.
    DisableMemUsageCheck();
    void* filler = ZYRMalloc(static_cast<unsigned int>((400ull << 20) - GetMemUsage()));
    EnableMemUsageCheck();
    ASSERT_NE(filler, nullptr);
    std::atomic<bool> refusing{true};
    std::thread renderer([&] {
        for (int i = 0; i < 20000; ++i)
            EXPECT_EQ(ZYRMalloc(64), nullptr);
        refusing = false;
    });
    while (refusing)
        TerminateErrorStk();
    renderer.join();
    TerminateErrorStk();
    EXPECT_EQ(ZYRMalloc(64), nullptr);
    EXPECT_EQ(fetch(), u"Insufficient Memory.\n");
    ZYRFree(filler);
    zyrtest::installFront(0);
}
