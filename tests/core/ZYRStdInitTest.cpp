// Start-up hooks, host procedures and the process-exit routines.
#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>

#include "TestSupport.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/core/ZYRStdInit.h"
#include "zyr/std/memory/ZYRDMM.h"

using namespace ZYRStd;

namespace {

// Sets (or, for null, removes) an environment variable for its lifetime.
class EnvGuard {
public:
    EnvGuard(const char* name, const char* value) : name_(name) {
        if (const char* old = std::getenv(name))
            saved_ = old, hadValue_ = true;
        if (value)
            ::setenv(name, value, 1);
        else
            ::unsetenv(name);
    }
    ~EnvGuard() {
        if (hadValue_)
            ::setenv(name_, saved_.c_str(), 1);
        else
            ::unsetenv(name_);
    }

private:
    const char* name_;
    std::string saved_;
    bool hadValue_ = false;
};

ZYRFactory::IZYRFactory* const kFakeFactory = reinterpret_cast<ZYRFactory::IZYRFactory*>(0x1000);
ZYRFactory::IZYRFactory* factoryA() {
    return kFakeFactory;
}
ZYRFactory::IZYRFactory* factoryB() {
    return nullptr;
}

// The factory procedure's error as "message @ line", or "" when there is none.
template <class Body> std::string thrown(Body body) {
    try {
        body();
    } catch (const CZYRError& e) {
        EXPECT_EQ(e.getError(), ZYRPublic::kZYRErrorFatal);
        EXPECT_STREQ(e.getSrcFileName(), "source/zyr/std/ZYRStdInit");
        return std::string(e.getMessage()) + " @ " + std::to_string(e.getSrcLineNumber());
    }
    return "";
}

} // namespace

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
    EXPECT_EQ(thrown([] { ZYRGetFactory(); }), "ZYRFactory Proc not set in ZYRStd @ 35");
    ZYRStdInit_SetZYRFactoryProc(factoryA);
    EXPECT_EQ(ZYRGetFactory(), kFakeFactory);
    EXPECT_EQ(thrown([] { ZYRStdInit_SetZYRFactoryProc(factoryB); }),
              "Default filsSys already set @ 56");
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
        std::stringstream text;
        text << std::ifstream(named).rdbuf();
        EXPECT_EQ(text.str(), expected) << named;
    }
}

TEST(ZYRStdInitTest, ExceptionCodeNames) {
    EXPECT_STREQ(ZYRExceptionCodeName(0xC0000005), "EXCEPTION_ACCESS_VIOLATION");
    EXPECT_STREQ(ZYRExceptionCodeName(0xC00000FD), "EXCEPTION_STACK_OVERFLOW");
    EXPECT_STREQ(ZYRExceptionCodeName(0x80000001), "EXCEPTION_GUARD_PAGE");
    EXPECT_STREQ(ZYRExceptionCodeName(0xC0000007), "UNKNOWN");
}

using ZYRStdInitDeathTest = ::testing::Test;

TEST(ZYRStdInitDeathTest, SEHExitPrintsBothLinesAndAborts) {
    EXPECT_DEATH({ ZYRSEHExitProcess(0xC0000005, nullptr, 7); },
                 "\n\n\t\\*\\*\\* ZYRSEHExitProcess \\(, 7, EXCEPTION_ACCESS_VIOLATION, "
                 "0xC0000005\\)\\*\\*\\*\n\n");
    EXPECT_DEATH(ZYRSEHExitProcess(0xC0000007, "f.cpp", 3),
                 "ZYRSEHExitProcess \\(f.cpp, 3, UNKNOWN, 0xC0000007\\)");
}

TEST(ZYRStdInitDeathTest, ExitProcessReportsTheError) {
    EXPECT_DEATH(ZYRExitProcess(CZYRError(ZYRPublic::kZYRErrorBadParam, "bad", "src", 4), "f", 9),
                 "\n\n\t\\*\\*\\* ZYRExitProcess \\(6, bad, src, 4\\)\\*\\*\\*\n\n");
    // Without an error only the standard-output line is written; stderr stays empty.
    EXPECT_EXIT(ZYRExitProcess(CZYRError(ZYRPublic::kZYRErrorNoError, nullptr, nullptr, 0), "f", 9),
                ::testing::KilledBySignal(SIGABRT), "^$");
}

TEST(ZYRStdInitDeathTest, StandardOutputLinesAreExact) {
    // Death tests only see stderr, so the child copies its stdout there first.
    auto exitWithStdoutOnStderr = [](auto exit) {
        ::dup2(2, 1);
        exit();
    };
    EXPECT_DEATH(exitWithStdoutOnStderr([] { ZYRSEHExitProcess(0xC0000005, nullptr, 7); }),
                 "\n\n\t\\*\\*\\* ZYRSEHExitProcess \\(, 7\\)\\*\\*\\*\n\n");
    EXPECT_DEATH(exitWithStdoutOnStderr([] {
                     ZYRExitProcess(CZYRError(ZYRPublic::kZYRErrorNoError, nullptr, nullptr, 0),
                                    nullptr, 12);
                 }),
                 "\n\n\t\\*\\*\\* ZYRExitProcess \\(, 12\\)\\*\\*\\*\n\n");
}
