// The DMM log file and its per-client statistics.
#include "zyr/std/core/internal/ZYRDMMLog.h"

#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <map>
#include <mutex>
#include <string>

#include "zyr/std/core/ZYRThreadSafety.h"
#include "zyr/std/core/internal/ZYRNoDestructor.h"

namespace ZYRStd::detail {

namespace {

constexpr size_t kPathBufferSize = 260;

struct ClientStat {
    uint32_t current = 0;
    uint32_t peak = 0;
    bool hasPeak = false; // a name that was only ever decremented has no peak to report
};

struct DMMLog {
    detail::Mutex mutex; // guards path, file and every write to the file
    char path[kPathBufferSize] ZYR_GUARDED_BY(mutex) = {};
    std::FILE* file ZYR_GUARDED_BY(mutex) = nullptr;

    detail::Mutex statMutex; // guards stats
    std::map<std::string, ClientStat>
        stats ZYR_GUARDED_BY(statMutex); // byte order: the close lines go in name order
};

DMMLog& dmmLog() {
    static NoDestructor<DMMLog> instance;
    return *instance;
}

} // namespace

void dmmLogOpenFromEnvironment() {
    DMMLog& log = dmmLog();
    detail::LockGuard lock(log.mutex);
    const char* path = std::getenv("ZYR_DMM_LOG");
    // A path longer than the buffer is refused rather than cut to some other file's name.
    if (!path || std::strlen(path) >= kPathBufferSize)
        return;
    if (log.file)
        std::fclose(log.file);
    std::strcpy(log.path, path);
    log.file = std::fopen(log.path, "w");
}

void dmmLogClose() {
    DMMLog& log = dmmLog();
    detail::LockGuard lock(log.mutex);
    if (!log.file)
        return;
    {
        detail::LockGuard statLock(log.statMutex);
        for (const auto& [name, stat] : log.stats) {
            if (!stat.hasPeak)
                continue;
            char line[1024];
            std::snprintf(line, sizeof line, "Client = %s Peak Memory Usage = %u \n", name.c_str(),
                          stat.peak);
            std::fprintf(log.file, "%s\n", line);
            std::fflush(log.file);
        }
        log.stats.clear();
    }
    std::fclose(log.file);
    log.file = nullptr;
}

bool dmmLogIsOpen() {
    DMMLog& log = dmmLog();
    detail::LockGuard lock(log.mutex);
    return log.file != nullptr;
}

void dmmLogVPrintf(const char* format, va_list args) {
    DMMLog& log = dmmLog();
    detail::LockGuard lock(log.mutex);
    if (!log.file)
        return;
    std::vfprintf(log.file, format, args);
    std::fflush(log.file);
}

void dmmLogPrintf(const char* format, ...) {
    va_list args;
    va_start(args, format);
    dmmLogVPrintf(format, args);
    va_end(args);
}

void dmmStatUpdate(const char* name, uint32_t bytes, bool add) {
    if (!dmmLogIsOpen())
        return;
    DMMLog& log = dmmLog();
    detail::LockGuard lock(log.statMutex);
    const std::string key = name ? name : "";
    const auto found = log.stats.find(key);
    if (found == log.stats.end()) {
        ClientStat& stat = log.stats[key];
        if (add) {
            stat.current = stat.peak = bytes;
            stat.hasPeak = true;
        } else
            stat.current -= bytes; // unsigned: an unknown name starts from 0
        return;
    }
    ClientStat& stat = found->second;
    if (add) {
        stat.current += bytes;
        stat.peak = std::max(stat.peak, stat.current);
        stat.hasPeak = true;
    } else {
        stat.current -= bytes;
    }
}

void dmmStatUpdateMax(const char* name, uint32_t bytes) {
    if (!dmmLogIsOpen())
        return;
    DMMLog& log = dmmLog();
    detail::LockGuard lock(log.statMutex);
    ClientStat& stat = log.stats[name ? name : ""];
    stat.peak = std::max(stat.peak, bytes);
    stat.hasPeak = true;
}

uint32_t dmmStatPeak(const char* name) {
    DMMLog& log = dmmLog();
    detail::LockGuard lock(log.statMutex);
    const auto found = log.stats.find(name ? name : "");
    return found == log.stats.end() ? 0 : found->second.peak;
}

} // namespace ZYRStd::detail
