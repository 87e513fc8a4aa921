// The error stack: per-thread order, unique reports, filters, and the out-of-memory notice.
#include <gtest/gtest.h>

#include <atomic>
#include <thread>

#include "TestSupport.h"
#include "zyr/std/core/CZYRErrorStk.h"
#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/core/ZYRThread.h"

using namespace ZYRStd;

namespace {

class CZYRErrorStkTest : public ::testing::Test {
protected:
    void SetUp() override { drain(); }
    void TearDown() override { drain(); }

    static std::u16string fetch(std::u16string filter = u"") {
        CZYRErrorStk stack;
        return stack.getErrorMessage(filter) ? filter : u"<none>";
    }
    static void drain() { fetch(); }
};

void report(const char16_t* text, bool unique = false) {
    CZYRErrorStk stack;
    if (unique)
        stack.reportUniqueError(ZYRMakeErrorInfo(1, text));
    else
        stack.reportError(ZYRMakeErrorInfo(1, text));
}

} // namespace

TEST_F(CZYRErrorStkTest, NewestFirstAndFetchEmptiesEverything) {
    report(u"a");
    report(u"b");
    EXPECT_EQ(fetch(), u"ba");
    EXPECT_EQ(fetch(), u"<none>");

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
}

TEST_F(CZYRErrorStkTest, UniqueReportsAreUniquePerThread) {
    report(u"same", true);
    report(u"same", true);
    std::thread([] { report(u"same", true); }).join();
    EXPECT_EQ(fetch(), u"samesame");
}

TEST_F(CZYRErrorStkTest, FilterSkipsMessagesItContains) {
    report(u"c");
    report(u"ab");
    report(u"");
    EXPECT_EQ(fetch(u"xxabyy"), u"c");
}

TEST_F(CZYRErrorStkTest, ThreadsComeOutInIdentifierOrder) {
    uint32_t firstId = 0, secondId = 0;
    std::thread([&] {
        firstId = ZYRGetCurrentThreadId();
        report(u"1");
    }).join();
    std::thread([&] {
        secondId = ZYRGetCurrentThreadId();
        report(u"2");
    }).join();
    EXPECT_EQ(fetch(), firstId < secondId ? u"12" : u"21");
}

TEST_F(CZYRErrorStkTest, LongMessagesAndResultsAreCutAt1024) {
    const std::u16string longText(2000, u'x');
    report(longText.c_str());
    const std::u16string first = fetch();
    EXPECT_EQ(first.size(), 1024u);

    report(std::u16string(700, u'a').c_str());
    report(std::u16string(700, u'b').c_str());
    const std::u16string both = fetch();
    EXPECT_EQ(both, std::u16string(700, u'b') + std::u16string(324, u'a'));
}

TEST_F(CZYRErrorStkTest, StatusHoldingAnErrorGetsNoStack) {
    C_Error err;
    err.setError(ZYRPublic::kZYRErrorBadParam, "earlier", "f", 1);
    EXPECT_EQ(createErrorStk(err), nullptr);
    EXPECT_STREQ(err.getMessage(), "earlier");
}

TEST_F(CZYRErrorStkTest, TerminateDropsRecordsAndANewStackStartsEmpty) {
    report(u"lost");
    TerminateErrorStk();
    EXPECT_EQ(fetch(), u"<none>");
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
    ZYRStd::tZYRMemMgr record = host.record();
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
