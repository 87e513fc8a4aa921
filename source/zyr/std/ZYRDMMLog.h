// The DMM log that "ZYR_DMM_LOG" switches on, with the per-client peak table.
#pragma once

#include <cstdarg>
#include <cstdint>

namespace ZYRStd::detail {

// Opens the file named by "ZYR_DMM_LOG" (truncating it); stays closed when unset or unopenable.
void dmmLogOpenFromEnvironment();
// Writes the per-client peak lines, empties the peak table and closes the file.
void dmmLogClose();
bool dmmLogIsOpen();
// printf-style line into the log; nothing when the log is closed.
void dmmLogPrintf(const char* format, ...) __attribute__((format(printf, 1, 2)));
// Remembers `bytes` as the peak of `clientName` when higher than the peak so far.
void dmmLogNotePeak(const char* clientName, uint64_t bytes);

} // namespace ZYRStd::detail
