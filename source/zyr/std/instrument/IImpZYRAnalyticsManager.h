/// \file
/// The analytics manager: the settings a host gives before start-up, and the singleton that
/// logs finalized analytics records on a worker thread of its own.
#pragma once

#include "C_SmartPtr.h"
#include "I_AnalyticsData.h"
#include "ZYRStdExport.h"

namespace ZYRStd {

using ZYRPublic::C_SmartPtr;
using ZYRPublic::I_AnalyticsData;

/// The analytics manager: a queue of finalized records that its own worker thread hands
/// to the telemetry session logger. Any thread may enqueue.
class ZYRSTD_API IZYRAnalyticsManager {
public:
    /// Queues `record` for logging; throws kZYRErrorInvalidFuncCall once termination began.
    virtual void enqueue(C_SmartPtr<I_AnalyticsData> record) = 0;
    virtual ~IZYRAnalyticsManager();
};

// The settings (ZYRSetAnalyticsActive, ZYRSetAnalyticsLogFolder) are start-up options.

/// Both always return true; a session that cannot start leaves analytics inactive.
ZYRSTD_API bool ZYRAnalyticsManagerInit();
/// Stops and joins the worker thread; records still queued are dropped.
ZYRSTD_API bool ZYRAnalyticsManagerTerm();
/// The running manager or null. The manager outlives ZYRAnalyticsManagerTerm, so a pointer
/// taken before it only meets the terminating error.
ZYRSTD_API IZYRAnalyticsManager* GetZYRAnalyticsManager();

/// Enqueues on the running manager; false when there is none. Throws what enqueue throws.
ZYRSTD_API bool ZYREnqueueAnalyticsRecord(C_SmartPtr<I_AnalyticsData> record);

} // namespace ZYRStd
