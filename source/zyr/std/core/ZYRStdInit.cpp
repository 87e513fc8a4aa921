// Start-up hooks, the worker identifier, host procedures and the process-exit routines.
#include "zyr/std/core/ZYRStdInit.h"

#include <array>
#include <cstdio>
#include <cstdlib>
#include <iostream>

#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/ZYRVirtualMem.h"
#include "zyr/std/core/internal/ZYRDMMLog.h"
#include "zyr/std/core/internal/ZYRFlushRegistry.h"
#include "zyr/std/core/internal/ZYRMemInternal.h"

namespace ZYRStd {

namespace {

constexpr const char* kSource = "source/zyr/std/ZYRStdInit";
constexpr int kFileSysAlreadySetLine = 56;
constexpr int kNoFactoryLine = 35;

constinit unsigned int workerID = 1;
constinit tZYRFactoryProc factoryProc = nullptr;
constinit tZYRDefaultFileSysProc defaultFileSysProc = nullptr;
constinit tOEMFlushCB oemFlushCB{nullptr, nullptr};
constinit const void* debugStopTarget = nullptr;

struct ExceptionName {
    uint32_t code;
    const char* name;
};

constexpr std::array<ExceptionName, 22> kExceptionNames{{
    {0x80000001, "EXCEPTION_GUARD_PAGE"},
    {0x80000002, "EXCEPTION_DATATYPE_MISALIGNMENT"},
    {0x80000003, "EXCEPTION_BREAKPOINT"},
    {0x80000004, "EXCEPTION_SINGLE_STEP"},
    {0xC0000005, "EXCEPTION_ACCESS_VIOLATION"},
    {0xC0000006, "EXCEPTION_IN_PAGE_ERROR"},
    {0xC0000008, "EXCEPTION_INVALID_HANDLE"},
    {0xC000001D, "EXCEPTION_ILLEGAL_INSTRUCTION"},
    {0xC0000025, "EXCEPTION_NONCONTINUABLE_EXCEPTION"},
    {0xC0000026, "EXCEPTION_INVALID_DISPOSITION"},
    {0xC000008C, "EXCEPTION_ARRAY_BOUNDS_EXCEEDED"},
    {0xC000008D, "EXCEPTION_FLT_DENORMAL_OPERAND"},
    {0xC000008E, "EXCEPTION_FLT_DIVIDE_BY_ZERO"},
    {0xC000008F, "EXCEPTION_FLT_INEXACT_RESULT"},
    {0xC0000090, "EXCEPTION_FLT_INVALID_OPERATION"},
    {0xC0000091, "EXCEPTION_FLT_OVERFLOW"},
    {0xC0000092, "EXCEPTION_FLT_STACK_CHECK"},
    {0xC0000093, "EXCEPTION_FLT_UNDERFLOW"},
    {0xC0000094, "EXCEPTION_INT_DIVIDE_BY_ZERO"},
    {0xC0000095, "EXCEPTION_INT_OVERFLOW"},
    {0xC0000096, "EXCEPTION_PRIV_INSTRUCTION"},
    {0xC00000FD, "EXCEPTION_STACK_OVERFLOW"},
}};

const char* orEmpty(const char* text) {
    return text ? text : "";
}

} // namespace

void ZYRStdInit_ZYRMemMgrSet(tZYRMemMgr* mgr) {
    const char* level = std::getenv("ZYR_MEMORY_STAT");
    const int memStatLevel = level ? std::atoi(level) : 0;
    detail::hostMemMgr() = mgr ? *mgr : detail::crtMemMgr();
    detail::configureFront(memStatLevel);
    if (mgr) {
        tZYRVirtualMemoryInfo info{};
        VirtualMemStatus(&info);
        detail::setMemLimitRaw(info.totalVirtual);
        // A 32-bit process on a 64-bit system never runs here, so the large-address
        // reserve of 512 MiB never applies.
    }
}

tZYRMemMgr* ZYRStdInit_ZYRMemMgrGet() {
    return &detail::hostMemMgr();
}

void ZYRStdInit_ZYRMemMgrDumpMemList(ZYRPublic::tZYRTraceMsgCallback proc, void* data) {
    detail::dumpMemList(proc, data);
}

void ZYRStdInit_ZYRDMMEnv_set(tZYRMemMgr* mgr) {
    if (mgr)
        detail::dmmLogOpenFromEnvironment();
    else
        detail::dmmLogClose();
}

void ZYRStdInit_ZYRSetWorkerID(unsigned int id) {
    workerID = id;
}
void ZYRSetWorkerID(unsigned int id) {
    workerID = id;
}
unsigned int ZYRGetWorkerID() {
    return workerID;
}

void ZYRStdInit_InitializeFlushableMemoryClientRegistry() {
    auto& registry = detail::flushRegistry();
    detail::LockGuard lock(registry.mutex);
    detail::LockGuard listLock(registry.listMutex);
    if (registry.main.capacity() < 8)
        registry.main.reserve(8);
}

void ZYRStdInit_TerminateFlushableMemoryClientRegistry() {
    auto& registry = detail::flushRegistry();
    detail::LockGuard lock(registry.mutex);
    detail::LockGuard listLock(registry.listMutex);
    registry.main.clear();
}

void ZYRStdInit_OEMFlushCBSet(tOEMFlushCB* cb) {
    if (cb)
        oemFlushCB = *cb;
}

void ZYRStdInit_SetZYRFactoryProc(tZYRFactoryProc proc) {
    if (factoryProc && proc)
        throw CZYRError(ZYRPublic::kZYRErrorFatal, "Default filsSys already set", kSource,
                        kFileSysAlreadySetLine);
    factoryProc = proc;
}

void ZYRStdInit_SetDefaultFileSysProc(tZYRDefaultFileSysProc proc) {
    defaultFileSysProc = proc;
}

ZYRFactory::IZYRFactory* ZYRGetFactory() {
    if (!factoryProc)
        throw CZYRError(ZYRPublic::kZYRErrorFatal, "ZYRFactory Proc not set in ZYRStd", kSource,
                        kNoFactoryLine);
    return factoryProc();
}

tZYRDefaultFileSysProc ZYRGetDefaultFileSysProc() {
    return defaultFileSysProc;
}

const tOEMFlushCB& ZYRGetOEMFlushCB() {
    return oemFlushCB;
}

const char* ZYRExceptionCodeName(uint32_t code) {
    for (const auto& entry : kExceptionNames)
        if (entry.code == code)
            return entry.name;
    return "UNKNOWN";
}

void ZYRExitProcess(const CZYRError& err, const char* file, int line) {
    std::fprintf(stdout, "\n\n\t*** ZYRExitProcess (%s, %d)***\n\n", orEmpty(file), line);
    if (err.getError() != ZYRPublic::kZYRErrorNoError)
        std::fprintf(stderr, "\n\n\t*** ZYRExitProcess (%d, %s, %s, %d)***\n\n",
                     static_cast<int>(err.getError()), orEmpty(err.getMessage()),
                     orEmpty(err.getSrcFileName()), err.getSrcLineNumber());
    std::fflush(stdout);
    std::fflush(stderr);
    std::abort();
}

void ZYRSEHExitProcess(uint32_t code, const char* file, int line) {
    std::fprintf(stdout, "\n\n\t*** ZYRSEHExitProcess (%s, %d)***\n\n", orEmpty(file), line);
    std::fprintf(stderr, "\n\n\t*** ZYRSEHExitProcess (%s, %d, %s, 0x%X)***\n\n", orEmpty(file),
                 line, ZYRExceptionCodeName(code), code);
    std::fflush(stdout);
    std::fflush(stderr);
    std::abort();
}

void ZYRDebugStopAtThis(const void* p) {
    if (p == debugStopTarget)
        std::cout << "thisPtr = " << p << std::endl;
}

void ZYRSetDebugStopTarget(const void* p) {
    debugStopTarget = p;
}

} // namespace ZYRStd
