// The DMM log that "ZYR_DMM_LOG" switches on, and the per-client statistics it keeps.
#pragma once

#include <cstdint>

namespace ZYRStd::detail {

// Opens the file named by "ZYR_DMM_LOG" (truncating it); stays closed when unset or unopenable.
void dmmLogOpenFromEnvironment();
// Writes one peak line per client name in name order, empties the statistics, closes.
void dmmLogClose();
bool dmmLogIsOpen();
// printf-style text into the log, flushed; nothing when the log is closed.
void dmmLogPrintf(const char* format, ...) __attribute__((format(printf, 1, 2)));
void dmmLogVPrintf(const char* format, __builtin_va_list args);

// Per-name statistics, kept only while the log is open.
void dmmStatUpdate(const char* name, uint32_t bytes, bool add);
void dmmStatUpdateMax(const char* name, uint32_t bytes);
// The recorded peak of `name`, 0 when unknown (for tests and reports).
uint32_t dmmStatPeak(const char* name);

} // namespace ZYRStd::detail
