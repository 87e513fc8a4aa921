// What the analytics manager tells the telemetry logger beyond the logger's interface.
#pragma once

namespace ZYRStd {

// Adds `count` records that were dropped before logging; the session's total is written
// into the session when it closes.
void noteDroppedAnalyticsRecords(unsigned long long count);

} // namespace ZYRStd
