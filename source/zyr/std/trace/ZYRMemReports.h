/// \file
/// Memory reports written as trace messages: the process address space and usage snapshots
/// at job, surface and placed-object boundaries.
///
/// On Linux the reports read /proc. The address-space walk goes over /proc/self/maps up to
/// 0x00007FFFFFFFF000, the top of user space: holes are "FREE"; mappings without access
/// rights "RESERVE"; the others "COMMIT" with type "IMAGE" (a mapping of an ELF file),
/// "MAPPED" (another file) or "PRIV" (anonymous, heap, stack), and protections named as
/// Windows names them by their rwx letters (a private writable file mapping is "WRITECOPY").
/// Process figures: Peak = VmHWM, Current = VmRSS, Peak Pagefile = VmPeak, PageFault =
/// minor + major faults, Commit and PageFile = RssAnon + VmSwap, HandleCount = open
/// descriptors, Read/Write = rchar/wchar of /proc/self/io, Other = 0.
#pragma once

#include "ZYRStdExport.h"
#include "sZYRTraceMsg.h"
#include "zyr/std/trace/CZYRTraceMsg.h"

namespace ZYRStd {

/// Other values report without a boundary line.
enum ReportMemoryUsageType {
    kReportMemoryUsageAfterJob = 1,          ///< after a job
    kReportMemoryUsageAfterSurface = 2,      ///< after a surface
    kReportMemoryUsageAfterPlacedObject = 3, ///< after a placed object
};

/// Under "Memory"/"Performance" at level 4; the region lines need a level above 4.
ZYRSTD_API void DumpVMStatistics(CZYRTraceMsg& trace);
/// One message at `level` under "Memory"/"General". Every n-th surface only, when
/// "ZYR_MEMORY_SURFACE_COUNT_STEP" (read at the first surface report) is n >= 1.
ZYRSTD_API void ReportMemoryUsage(CZYRTraceMsg& trace, ReportMemoryUsageType type,
                                  const char* label, eZYRTraceMsgLevel level);
/// A hook without effect.
ZYRSTD_API void DumpMemoryUsageToCSVFile(const char* fileName, bool flag);

} // namespace ZYRStd
