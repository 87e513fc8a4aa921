/// \file
/// A description of the machine and its current load, in fixed-size records of 16-bit text
/// and numbers, and its printing as indented text lines.
#pragma once

#include <cstddef>
#include <cstdint>
#include <iosfwd>

#include "ZYRStdExport.h"

namespace ZYRStd {

struct HardwareDiskEntry {
    char16_t interfaceType[8];
    char16_t model[36];
    std::uint64_t size; ///< bytes
};

struct HardwareProcessorEntry {
    char16_t caption[60];
    std::uint32_t currentClockSpeed; ///< MHz
    std::uint32_t extClock;
    std::uint32_t l2CacheSize; ///< KB
    std::uint32_t l2CacheSpeed;
    std::uint32_t l3CacheSize; ///< KB
    std::uint32_t l3CacheSpeed;
    char16_t manufacturer[20];
    std::uint32_t maxClockSpeed; ///< MHz
    char16_t name[60];
    std::uint32_t numberOfCores;
    std::uint32_t numberOfLogicalProcessors;
    std::uint32_t reserved[2];
};

struct HardwareMemoryEntry {
    std::uint64_t capacity; ///< bytes
    std::uint32_t speed;    ///< MHz
    std::uint32_t reserved;
};

constexpr unsigned int kMaxHardwareDisks = 6;
constexpr unsigned int kMaxHardwareProcessors = 8;
constexpr unsigned int kMaxHardwareMemoryModules = 16;
constexpr unsigned int kMaxPerformanceCores = 128;

/// 5920 bytes; every query that fills it zero-fills it first.
struct HardwareInfoRec {
    HardwareDiskEntry disks[kMaxHardwareDisks];
    HardwareProcessorEntry processors[kMaxHardwareProcessors];
    unsigned char reserved1[132];
    char16_t osCaption[60];
    char16_t osServicePack[30];
    char16_t computerName[40];
    unsigned char reserved2[224];
    HardwareMemoryEntry memory[kMaxHardwareMemoryModules];
    unsigned char reserved3[1856];
    std::uint32_t numberOfDisks;
    std::uint32_t numberOfProcessors;
    std::uint32_t reserved4;
    std::uint32_t numberOfMemoryModules;
    std::uint32_t reserved5[2];
};

/// 2504 bytes; every query that fills it zero-fills it first.
struct PerformanceRec {
    std::uint64_t totalProcessorUse; ///< percent
    std::uint64_t coreProcessorUse[kMaxPerformanceCores];
    unsigned char reserved1[1408];
    std::uint64_t commitLimit;    ///< bytes
    std::uint64_t committedBytes; ///< bytes
    std::uint32_t percentCommittedBytesInUse;
    unsigned char reserved2[36];
    std::uint32_t numberOfCores;
    std::uint32_t reserved3;
};

static_assert(sizeof(HardwareDiskEntry) == 96 && offsetof(HardwareDiskEntry, model) == 16 &&
              offsetof(HardwareDiskEntry, size) == 88);
static_assert(sizeof(HardwareProcessorEntry) == 324 &&
              offsetof(HardwareProcessorEntry, currentClockSpeed) == 120 &&
              offsetof(HardwareProcessorEntry, extClock) == 124 &&
              offsetof(HardwareProcessorEntry, l2CacheSize) == 128 &&
              offsetof(HardwareProcessorEntry, l2CacheSpeed) == 132 &&
              offsetof(HardwareProcessorEntry, l3CacheSize) == 136 &&
              offsetof(HardwareProcessorEntry, l3CacheSpeed) == 140 &&
              offsetof(HardwareProcessorEntry, manufacturer) == 144 &&
              offsetof(HardwareProcessorEntry, maxClockSpeed) == 184 &&
              offsetof(HardwareProcessorEntry, name) == 188 &&
              offsetof(HardwareProcessorEntry, numberOfCores) == 308 &&
              offsetof(HardwareProcessorEntry, numberOfLogicalProcessors) == 312);
static_assert(sizeof(HardwareMemoryEntry) == 16 && offsetof(HardwareMemoryEntry, speed) == 8);
static_assert(sizeof(HardwareInfoRec) == 5920 && offsetof(HardwareInfoRec, disks) == 0 &&
              offsetof(HardwareInfoRec, processors) == 576 &&
              offsetof(HardwareInfoRec, osCaption) == 3300 &&
              offsetof(HardwareInfoRec, osServicePack) == 3420 &&
              offsetof(HardwareInfoRec, computerName) == 3480 &&
              offsetof(HardwareInfoRec, memory) == 3784 &&
              offsetof(HardwareInfoRec, numberOfDisks) == 5896 &&
              offsetof(HardwareInfoRec, numberOfProcessors) == 5900 &&
              offsetof(HardwareInfoRec, numberOfMemoryModules) == 5908);
static_assert(sizeof(PerformanceRec) == 2504 && offsetof(PerformanceRec, coreProcessorUse) == 8 &&
              offsetof(PerformanceRec, commitLimit) == 2440 &&
              offsetof(PerformanceRec, committedBytes) == 2448 &&
              offsetof(PerformanceRec, percentCommittedBytesInUse) == 2456 &&
              offsetof(PerformanceRec, numberOfCores) == 2496);

/// Queries return false for a null record or a failed query; prints write nothing for a
/// null record. Reports take a stream of text, so they keep the platform's wide type.
class ZYRSTD_API IHardwareInfo {
public:
    virtual ~IHardwareInfo();
    [[nodiscard]] virtual bool getMemoryInfo(HardwareInfoRec* rec) = 0;
    [[nodiscard]] virtual bool getProcessorAndOSInfo(HardwareInfoRec* rec) = 0;
    [[nodiscard]] virtual bool getDiskInfo(HardwareInfoRec* rec) = 0;
    [[nodiscard]] virtual bool getMemoryPerformance(PerformanceRec* rec) = 0;
    [[nodiscard]] virtual bool getCPUPerformance(PerformanceRec* rec) = 0;
    virtual void printMemoryInfo(const HardwareInfoRec* rec, std::wostream& out) = 0;
    /// Returns the number of processors printed.
    virtual int printProcessorAndOSInfo(const HardwareInfoRec* rec, std::wostream& out) = 0;
    virtual void printDiskInfo(const HardwareInfoRec* rec, std::wostream& out) = 0;
    virtual void printMemoryPerformance(const PerformanceRec* rec, std::wostream& out) = 0;
    virtual void printCPUPerformance(const PerformanceRec* rec, std::wostream& out) = 0;
};

/// A new description of this machine (null when memory runs out); the caller deletes it.
[[nodiscard]] ZYRSTD_API IHardwareInfo* createHardwareInfo();
/// The same, reading /proc, /sys and /etc under `systemRoot` instead of "/" (a container's
/// view of its host, or a prepared tree).
[[nodiscard]] ZYRSTD_API IHardwareInfo* createHardwareInfo(const char* systemRoot);

} // namespace ZYRStd
