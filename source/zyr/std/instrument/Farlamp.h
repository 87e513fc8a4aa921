/// \file
/// Farlamp, the telemetry session logger: one session per process in the telemetry library
/// libKelvrin.so, loaded at run time. Without a complete library every operation does nothing.
#pragma once

#include "C_SmartPtr.h"
#include "I_AnalyticsData.h"
#include "ZYRStdExport.h"
#include "eZYRErrorType.h"

struct Kelvrin; ///< a session of the telemetry library

namespace ZYRStd {

class CZYRDict;
using ZYRPublic::C_SmartPtr;
using ZYRPublic::eZYRErrorType;
using ZYRPublic::I_AnalyticsData;

/// Counted feature uses; 0 to 7 are logged as events by these names, 8 to 11 only counted.
enum eZYRAnalyticsEventType : int {
    kZYRAnalyticsEventCachePlacedObject = 0,
    kZYRAnalyticsEventEnableCutContourProcessing = 1,
    kZYRAnalyticsEventEnableLowResRasterization = 2,
    kZYRAnalyticsEventConvertTextToOutlines = 3,
    kZYRAnalyticsEventRasterizeRegionsHavingMultipleText = 4,
    kZYRAnalyticsEventGlobalRasterization = 5,
    kZYRAnalyticsEventTextAntiAliasing = 6,
    kZYRAnalyticsEventZYREnableMTR = 7,
    kZYRAnalyticsEventHasTrapping = 8,          ///< feeds the job's "HasTrapping"
    kZYRAnalyticsEventHasTransparency = 9,      ///< feeds the job's "HasTransparency"
    kZYRAnalyticsEventPlacedObjectCached = 10,  ///< event 0 is logged only when this counted
    kZYRAnalyticsEventCutContourProcessed = 11, ///< event 1 is logged only when this counted
    kZYRAnalyticsEventAll = 12,                 ///< LogEvent: log and reset every counter
};

/// What the telemetry logger compares to log a run of equal surfaces once.
struct sSurfaceInfo {
    double width = 0;               ///< in points
    double height = 0;              ///< in points
    unsigned int placedObjects = 0; ///< placed objects on the surface
    /// True when every field is equal.
    bool operator==(const sSurfaceInfo&) const = default;
};

/// The telemetry session logger: one session per process, writing analytics records
/// through the telemetry library when it can be loaded, else nothing. Its state is locked,
/// so any thread may call it.
class ZYRSTD_API Farlamp {
public:
    Farlamp() = delete;

    /// Opens the process's session: in `folder` when `active` (falling back to the default
    /// folder "./AnalyticsLogs" with a report on the error stack), else a session that
    /// records nothing. True when a session is open.
    static bool StartSession(bool active, const char16_t* folder);
    /// Closes the session and unloads the library; a later StartSession loads it afresh.
    static void CloseSession();
    /// Writes the record as the data group its "DataGroupName" names.
    static void LogDataObject(const C_SmartPtr<I_AnalyticsData>& record);
    /// Writes the dictionary's entries as one data group.
    static void LogDict(const CZYRDict& info);
    /// Writes an error event: its type, the area and the source file.
    static void LogZYRError(eZYRErrorType type, const char* area, const char* file);
    /// Counts one use of `type` (unless `peek`) and returns the count; kZYRAnalyticsEventAll
    /// logs the counted events and resets every counter.
    static unsigned int LogEvent(eZYRAnalyticsEventType type, bool peek);
    /// Writes one event of `type` now, without counting it.
    static void LogEventNow(eZYRAnalyticsEventType type);
    /// Ends the job: completion time, trapping and transparency, events, the last surfaces.
    static void FlushJob(double time);
    /// Called after each surface: a run of equal surfaces is logged once, with its count.
    static void LogSurfaceDataGroup();
    /// Records the surface being rendered, for LogSurfaceDataGroup.
    static void UpdateCurrentSurfaceInfo(double width, double height, unsigned int placedObjects);
    /// True while a session that records is open.
    static bool LoggingEnabled();

private:
    /// The session's state lives in Farlamp.cpp, in one record guarded by one lock; these
    /// helpers expect that lock held.
    static void Initialize(bool active);
    static void LoadLibraryFunction();
    static void UnloadLibraryFunction();
    static void LogSurfaceDataGroupHelper(sSurfaceInfo& info);
};

} // namespace ZYRStd
