// The DMM log file and its peak statistics.
#include "zyr/std/ZYRDMMLog.h"

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <map>
#include <mutex>
#include <string>

#include "zyr/std/ZYRNoDestructor.h"

namespace ZYRStd::detail {

namespace {

constexpr size_t kPathBufferSize = 260;

struct DMMLog {
    std::mutex mutex; // guards every field below and every write to the file
    char path[kPathBufferSize] = {};
    std::FILE* file = nullptr;
    std::map<std::string, uint64_t> peaks; // ordered: the close lines go in name order
};

DMMLog& dmmLog() {
    static NoDestructor<DMMLog> instance;
    return *instance;
}

} // namespace

void dmmLogOpenFromEnvironment() {
    DMMLog& log = dmmLog();
    std::lock_guard lock(log.mutex);
    const char* path = std::getenv("ZYR_DMM_LOG");
    // A path that does not fit the buffer is refused rather than cut to another name.
    if (!path || std::strlen(path) >= kPathBufferSize)
        return;
    if (log.file)
        std::fclose(log.file);
    std::strcpy(log.path, path);
    log.file = std::fopen(log.path, "w");
}

void dmmLogClose() {
    DMMLog& log = dmmLog();
    std::lock_guard lock(log.mutex);
    if (!log.file)
        return;
    for (const auto& [name, peak] : log.peaks) {
        char line[512];
        std::snprintf(line, sizeof line, "Client = %s Peak Memory Usage = %u \n", name.c_str(),
                      static_cast<uint32_t>(peak));
        std::fprintf(log.file, "%s\n", line);
        std::fflush(log.file);
    }
    log.peaks.clear();
    std::fclose(log.file);
    log.file = nullptr;
}

bool dmmLogIsOpen() {
    DMMLog& log = dmmLog();
    std::lock_guard lock(log.mutex);
    return log.file != nullptr;
}

void dmmLogPrintf(const char* format, ...) {
    DMMLog& log = dmmLog();
    std::lock_guard lock(log.mutex);
    if (!log.file)
        return;
    va_list args;
    va_start(args, format);
    std::vfprintf(log.file, format, args);
    va_end(args);
    std::fflush(log.file);
}

void dmmLogNotePeak(const char* clientName, uint64_t bytes) {
    DMMLog& log = dmmLog();
    std::lock_guard lock(log.mutex);
    if (!log.file)
        return;
    uint64_t& peak = log.peaks[clientName ? clientName : ""];
    if (bytes > peak)
        peak = bytes;
}

} // namespace ZYRStd::detail
