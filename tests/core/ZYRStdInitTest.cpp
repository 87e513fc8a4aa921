// Start-up hooks, host procedures and the process-exit routines.
#include <gtest/gtest.h>

#include <cstdlib>
#include <fstream>
#include <sstream>

#include "TestSupport.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/core/ZYRStdInit.h"

using namespace ZYRStd;

namespace {

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
    const unsigned long long limit = ZYRGetMemLimit();
    EXPECT_GT(limit, 0u) << "a host record sets the limit from the machine";
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

TEST(ZYRStdInitTest, FactoryProcedureIsSetOnce) {
    try {
        ZYRGetFactory();
        ADD_FAILURE() << "no factory yet";
    } catch (const CZYRError& e) {
        EXPECT_EQ(e.getError(), ZYRPublic::kZYRErrorFatal);
        EXPECT_STREQ(e.getMessage(), "ZYRFactory Proc not set in ZYRStd");
        EXPECT_STREQ(e.getSrcFileName(), "source/zyr/std/ZYRStdInit");
        EXPECT_EQ(e.getSrcLineNumber(), 35);
    }
    ZYRStdInit_SetZYRFactoryProc(factoryA);
    EXPECT_EQ(ZYRGetFactory(), kFakeFactory);
    try {
        ZYRStdInit_SetZYRFactoryProc(factoryB);
        ADD_FAILURE() << "a second procedure must be refused";
    } catch (const CZYRError& e) {
        EXPECT_STREQ(e.getMessage(), "Default filsSys already set");
        EXPECT_EQ(e.getSrcLineNumber(), 56);
    }
    EXPECT_EQ(ZYRGetFactory(), kFakeFactory) << "the first procedure stays";
    ZYRStdInit_SetZYRFactoryProc(nullptr);
    ZYRStdInit_SetZYRFactoryProc(factoryB);
    EXPECT_EQ(ZYRGetFactory(), nullptr);
    ZYRStdInit_SetZYRFactoryProc(nullptr);
}

TEST(ZYRStdInitTest, WorkerIdentifierStartsAtOne) {
    EXPECT_EQ(ZYRGetWorkerID(), 1u);
    ZYRStdInit_ZYRSetWorkerID(7);
    EXPECT_EQ(ZYRGetWorkerID(), 7u);
    ZYRSetWorkerID(1);
    EXPECT_EQ(ZYRGetWorkerID(), 1u);
}

TEST(ZYRStdInitTest, DmmLogOpensOnlyWhenNamed) {
    zyrtest::TempDir dir;
    const std::string path = dir.file("dmm.log");
    tZYRMemMgr any{};
    {
        EnvGuard env("ZYR_DMM_LOG", nullptr);
        ZYRStdInit_ZYRDMMEnv_set(&any);
        ZYRStdInit_ZYRDMMEnv_set(nullptr);
    }
    {
        EnvGuard env("ZYR_DMM_LOG", (dir.path() + "/missing/dir/dmm.log").c_str());
        ZYRStdInit_ZYRDMMEnv_set(&any); // cannot open: stays off, silently
        ZYRStdInit_ZYRDMMEnv_set(nullptr);
    }
    {
        std::ofstream(path) << "old contents";
        EnvGuard env("ZYR_DMM_LOG", path.c_str());
        ZYRStdInit_ZYRDMMEnv_set(&any);
        ZYRStdInit_ZYRDMMEnv_set(nullptr);
        std::ifstream in(path);
        std::stringstream text;
        text << in.rdbuf();
        EXPECT_EQ(text.str(), "") << "the log is truncated when opened";
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
