/// \file
/// Start-up hooks the host calls, the worker identifier, and the process-exit routines.
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

/// The host's memory procedures; the library keeps its own copy of the record.
struct tZYRMemMgr {
    void* (*allocProc)(size_t size, void* clientData); ///< allocates `size` bytes, null on failure
    void* (*reallocProc)(void* block, size_t newSize,
                         void* clientData);          ///< resizes a block, null on failure
    void (*freeProc)(void* block, void* clientData); ///< frees a block
    void* clientData;                                ///< passed back to each procedure
};

/// The host's last resort when the flushable clients cannot give memory back.
struct tOEMFlushCB {
    /// Asked to free `bytesNeeded` bytes; true when it did. `reserved` is 0.
    bool (*flushProc)(unsigned int bytesNeeded, unsigned int reserved,
                      ZYRPublic::eFlushMemorySeverity severity, void* clientData);
    void* clientData; ///< passed back to flushProc
};

/// Returns the host's file-name factory (owned by the host).
using tZYRFactoryProc = ZYRFactory::IZYRFactory* (*)();
/// Returns the file system every CZYRFileSys call uses (owned by the side that installed it).
using tZYRDefaultFileSysProc = ZYRFileSys::IZYRFileSys* (*)();

/// Installs the host's memory procedures (null: the C runtime heap) and reads
/// "ZYR_MEMORY_STAT". Call once, before the first allocation and before other threads start.
ZYRSTD_API void ZYRStdInit_ZYRMemMgrSet(tZYRMemMgr* mgr);
/// The library's copy of the memory procedures, never null; borrowed.
ZYRSTD_API tZYRMemMgr* ZYRStdInit_ZYRMemMgrGet();
/// Writes the tracker's list of live blocks (the leak report) through `proc`, passing `data`.
ZYRSTD_API void ZYRStdInit_ZYRMemMgrDumpMemList(ZYRPublic::tZYRTraceMsgCallback proc, void* data);
/// Non-null: opens the DMM log when "ZYR_DMM_LOG" names a file; null: writes the peaks
/// and closes it. The record itself is not read.
ZYRSTD_API void ZYRStdInit_ZYRDMMEnv_set(tZYRMemMgr* mgr);
/// Sets the worker identifier (1 until set), used in trace and file names.
ZYRSTD_API void ZYRStdInit_ZYRSetWorkerID(unsigned int id);
/// Sets the worker identifier.
ZYRSTD_API void ZYRSetWorkerID(unsigned int id);
/// The worker identifier, 1 until set.
ZYRSTD_API unsigned int ZYRGetWorkerID();
/// Reserves room for 8 flushable clients; registers nothing. Call at start-up.
ZYRSTD_API void ZYRStdInit_InitializeFlushableMemoryClientRegistry();
/// Unregisters every flushable client (the thread-safe list keeps its own); the clients
/// are neither told nor deleted. Takes the registry mutex.
ZYRSTD_API void ZYRStdInit_TerminateFlushableMemoryClientRegistry();
/// Copies the host's flush callback, asked when the flushable clients cannot help.
ZYRSTD_API void ZYRStdInit_OEMFlushCBSet(tOEMFlushCB* cb);
/// Installs the procedure giving the host's file-name factory; null clears it. Throws
/// kZYRErrorFatal when one is already installed and `proc` is not null.
ZYRSTD_API void ZYRStdInit_SetZYRFactoryProc(tZYRFactoryProc proc);
/// Installs the procedure giving the default file system.
ZYRSTD_API void ZYRStdInit_SetDefaultFileSysProc(tZYRDefaultFileSysProc proc);

/// The host's factory (throws when none is installed) and default file-system procedure.
ZYRSTD_API ZYRFactory::IZYRFactory* ZYRGetFactory();
/// The installed default file-system procedure, or null.
ZYRSTD_API tZYRDefaultFileSysProc ZYRGetDefaultFileSysProc();
/// The installed host flush callback; both words null when none.
ZYRSTD_API const tOEMFlushCB& ZYRGetOEMFlushCB();

/// Prints where and, when `err` holds one, which error ended the process, then aborts.
[[noreturn]] ZYRSTD_API void ZYRExitProcess(const CZYRError& err, const char* file, int line);
/// Prints where and which structured-exception code ended the process, then aborts.
[[noreturn]] ZYRSTD_API void ZYRSEHExitProcess(uint32_t code, const char* file, int line);
/// Name printed for a structured-exception code, "UNKNOWN" for codes without one.
ZYRSTD_API const char* ZYRExceptionCodeName(uint32_t code);

/// A place for a breakpoint: prints `p` when it is the target set by ZYRSetDebugStopTarget.
ZYRSTD_API void ZYRDebugStopAtThis(const void* p);
/// Sets the pointer ZYRDebugStopAtThis stops at.
ZYRSTD_API void ZYRSetDebugStopTarget(const void* p);

} // namespace ZYRStd
