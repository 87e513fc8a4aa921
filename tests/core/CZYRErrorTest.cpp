// Error statuses, exceptions and the boundary between them.
#include <gtest/gtest.h>

#include <stdexcept>

#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/internal/ZYRErrorBoundary.h"

using namespace ZYRStd;
using namespace ZYRPublic;

TEST(CZYRErrorTest, StatusRoundTripsThroughException) {
    C_Error status;
    EXPECT_NO_THROW(ZYRCheckNThrowError(status));

    status.setError(kZYRErrorBadParam, "m", "f", 7);
    try {
        ZYRCheckNThrowError(status);
        FAIL() << "a set status must throw";
    } catch (const CZYRError& e) {
        EXPECT_EQ(e.getError(), kZYRErrorBadParam);
        EXPECT_STREQ(e.getMessage(), "m");
        EXPECT_STREQ(e.getSrcFileName(), "f");
        EXPECT_EQ(e.getSrcLineNumber(), 7);
        EXPECT_FALSE(e.getUnExpectedErr());
    }
    EXPECT_TRUE(status.errorOccurred()) << "throwing leaves the status as it was";
    EXPECT_THROW(throwCZYRErrorIfErrorOccurred(status), CZYRError);
}

TEST(CZYRErrorTest, StatusStatesAndReset) {
    C_Error status;
    EXPECT_EQ(status.getError(), kZYRErrorNoError);
    EXPECT_EQ(status.getSrcLineNumber(), -1);

    status.setError(kZYRErrorBadParam, nullptr, nullptr, 3);
    EXPECT_TRUE(status.errorOccurred()) << "a type without texts still counts";

    C_Error copy(status);
    EXPECT_EQ(copy.getError(), kZYRErrorBadParam);
    EXPECT_EQ(copy.getSrcLineNumber(), 3);

    status.reset();
    EXPECT_FALSE(status.errorOccurred());
    EXPECT_EQ(status.getError(), kZYRErrorNoError);
    EXPECT_EQ(status.getMessage(), nullptr);
    EXPECT_EQ(status.getSrcFileName(), nullptr);
    EXPECT_EQ(status.getSrcLineNumber(), -1);
}

TEST(CZYRErrorTest, ExceptionClassesAreCaughtWhereCallersLook) {
    try {
        throwCZYRUnexpt();
    } catch (const CZYRError& e) {
        EXPECT_EQ(e.getError(), kZYRErrorUnknown);
        EXPECT_EQ(e.getMessage(), nullptr);
        EXPECT_EQ(e.getSrcFileName(), nullptr);
        EXPECT_EQ(e.getSrcLineNumber(), -1);
        EXPECT_TRUE(e.getUnExpectedErr());
    }

    try {
        throw CZYRBadAlloc("msg", "file", 9);
    } catch (const std::bad_alloc& e) {
        EXPECT_STREQ(e.what(), "bad allocation");
    }
    try {
        throw CZYRBadAlloc("msg", "file", 9);
    } catch (const CZYRError& e) {
        EXPECT_EQ(e.getError(), kZYRErrorOutOfMemory);
        EXPECT_STREQ(e.getMessage(), "msg");
    }

    try {
        throw ZYROutOfMemoryError("src", 92);
    } catch (const std::exception& e) {
        EXPECT_STREQ(e.what(), "bad allocation");
    }
    try {
        throw ZYROutOfMemoryError("src", 92);
    } catch (const CZYRError& e) {
        EXPECT_EQ(e.getError(), kZYRErrorOutOfMemory);
        EXPECT_STREQ(e.getMessage(), "Memory alloc failed");
        EXPECT_EQ(e.getSrcLineNumber(), 92);
    }
}

TEST(CZYRErrorTest, AssignmentCopiesEveryField) {
    CZYRError plain(kZYRErrorBadParam, "a", "b", 1);
    const CZYRError& self = plain;
    plain = self;
    EXPECT_EQ(plain.getError(), kZYRErrorBadParam);
    EXPECT_STREQ(plain.getMessage(), "a");

    plain = CZYRUnexpectError();
    EXPECT_TRUE(plain.getUnExpectedErr());
    EXPECT_EQ(plain.getError(), kZYRErrorUnknown);

    plain.setError(kZYRErrorFatal, "x", "y", 2);
    EXPECT_TRUE(plain.getUnExpectedErr()) << "setError leaves the unexpected flag alone";
}

TEST(CZYRErrorTest, MappingFunctionsAnswerUnknown) {
    EXPECT_EQ(ZYRErrorFromStdException(std::runtime_error("x")), kZYRErrorUnknown);
    for (unsigned int code : {0u, 1u, 42u, 0xFFFFFFFFu})
        EXPECT_EQ(ZYRErrorFromJTError(code), kZYRErrorUnknown);
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
    EXPECT_EQ(status.getError(), kZYRErrorKeyNotFound);
    EXPECT_STREQ(status.getMessage(), "Key not found");

    // An earlier error makes the next call a no-op that keeps the record.
    bool ran = false;
    EXPECT_EQ(ZYRErrorBoundary(status, -1, kOp, "src", 1,
                               [&] {
                                   ran = true;
                                   return 1;
                               }),
              -1);
    EXPECT_FALSE(ran);
    EXPECT_EQ(status.getError(), kZYRErrorKeyNotFound);

    status.reset();
    C_Error foreign;
    foreign.setError(kZYRErrorTypeCheck, "t", "u", 8);
    ZYRErrorBoundary(status, 0, kOp, "src", 1, [&]() -> int { throw foreign; });
    EXPECT_EQ(status.getError(), kZYRErrorTypeCheck);
    EXPECT_EQ(status.getSrcLineNumber(), 8);

    status.reset();
    ZYRErrorBoundary(status, 0, kOp, "src", 77, []() -> int { throw std::runtime_error("x"); });
    EXPECT_EQ(status.getError(), kZYRErrorUnknown);
    EXPECT_STREQ(status.getMessage(), kOp);
    EXPECT_STREQ(status.getSrcFileName(), "src");
    EXPECT_EQ(status.getSrcLineNumber(), 77);
}

namespace {
int handlerCalls = 0;
void countingHandler() {
    ++handlerCalls;
}
void otherHandler() {}
} // namespace

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

TEST(CZYRErrorTest, AssertionFailureCarriesItsSource) {
    try {
        throwAssertionFailed("source/zyr/std/CZYRHash", 12);
    } catch (const CZYRError& e) {
        EXPECT_EQ(e.getError(), kZYRErrorAssertionFailed);
        EXPECT_STREQ(e.getMessage(), "assertion failed");
        EXPECT_STREQ(e.getSrcFileName(), "source/zyr/std/CZYRHash");
        EXPECT_EQ(e.getSrcLineNumber(), 12);
    }
}
