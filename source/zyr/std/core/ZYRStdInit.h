// Start-up hooks the host calls, the worker identifier, and the process-exit routines.
#pragma once

#include <cstddef>
#include <cstdint>

#include "ZYRStdExport.h"
#include "eFlushMemorySeverity.h"
#include "sZYRTraceMsg.h"

namespace ZYRFactory {
class IZYRFactory;
}
namespace ZYRFileSys {
class IZYRFileSys;
}

namespace ZYRStd {

class CZYRError;

// The host's memory procedures; the library keeps its own copy of the record.
struct tZYRMemMgr {
    void* (*allocProc)(size_t size, void* clientData);
    void* (*reallocProc)(void* block, size_t newSize, void* clientData);
    void (*freeProc)(void* block, void* clientData);
    void* clientData;
};

// The host's last resort when the flushable clients cannot give memory back.
struct tOEMFlushCB {
    bool (*flushProc)(unsigned int bytesNeeded, unsigned int reserved,
                      ZYRPublic::eFlushMemorySeverity severity, void* clientData);
    void* clientData;
};

using tZYRFactoryProc = ZYRFactory::IZYRFactory* (*)();
using tZYRDefaultFileSysProc = ZYRFileSys::IZYRFileSys* (*)();

ZYRSTD_API void ZYRStdInit_ZYRMemMgrSet(tZYRMemMgr* mgr);
ZYRSTD_API tZYRMemMgr* ZYRStdInit_ZYRMemMgrGet();
ZYRSTD_API void ZYRStdInit_ZYRMemMgrDumpMemList(ZYRPublic::tZYRTraceMsgCallback proc, void* data);
ZYRSTD_API void ZYRStdInit_ZYRDMMEnv_set(tZYRMemMgr* mgr);
ZYRSTD_API void ZYRStdInit_ZYRSetWorkerID(unsigned int id);
ZYRSTD_API void ZYRSetWorkerID(unsigned int id);
ZYRSTD_API unsigned int ZYRGetWorkerID();
ZYRSTD_API void ZYRStdInit_InitializeFlushableMemoryClientRegistry();
ZYRSTD_API void ZYRStdInit_TerminateFlushableMemoryClientRegistry();
ZYRSTD_API void ZYRStdInit_OEMFlushCBSet(tOEMFlushCB* cb);
ZYRSTD_API void ZYRStdInit_SetZYRFactoryProc(tZYRFactoryProc proc);
ZYRSTD_API void ZYRStdInit_SetDefaultFileSysProc(tZYRDefaultFileSysProc proc);

// The host's factory (throws when none is installed) and default file-system procedure.
ZYRSTD_API ZYRFactory::IZYRFactory* ZYRGetFactory();
ZYRSTD_API tZYRDefaultFileSysProc ZYRGetDefaultFileSysProc();
ZYRSTD_API const tOEMFlushCB& ZYRGetOEMFlushCB();

[[noreturn]] ZYRSTD_API void ZYRExitProcess(const CZYRError& err, const char* file, int line);
[[noreturn]] ZYRSTD_API void ZYRSEHExitProcess(uint32_t code, const char* file, int line);
// Name printed for a structured-exception code, "UNKNOWN" for codes without one.
ZYRSTD_API const char* ZYRExceptionCodeName(uint32_t code);

ZYRSTD_API void ZYRDebugStopAtThis(const void* p);
ZYRSTD_API void ZYRSetDebugStopTarget(const void* p);

} // namespace ZYRStd
