/// \file
/// A description of the machine and its current load, in fixed-size records of 16-bit text
/// and numbers, and its printing as indented text lines.
#pragma once

#include <cstddef>
#include <cstdint>
#include <iosfwd>

#include "ZYRStdExport.h"

namespace ZYRStd {

/// One disk drive, texts NUL-terminated UTF-16.
struct HardwareDiskEntry {
    char16_t interfaceType[8]; ///< the bus, e.g. "SCSI", "IDE", "USB"
    char16_t model[36];        ///< the drive's model
    std::uint64_t size;        ///< bytes
};

/// One processor package, texts NUL-terminated UTF-16.
struct HardwareProcessorEntry {
    char16_t caption[60];                    ///< short description
    std::uint32_t currentClockSpeed;         ///< MHz
    std::uint32_t extClock;                  ///< external clock, MHz
    std::uint32_t l2CacheSize;               ///< KB
    std::uint32_t l2CacheSpeed;              ///< MHz
    std::uint32_t l3CacheSize;               ///< KB
    std::uint32_t l3CacheSpeed;              ///< MHz
    char16_t manufacturer[20];               ///< vendor name
    std::uint32_t maxClockSpeed;             ///< MHz
    char16_t name[60];                       ///< model name
    std::uint32_t numberOfCores;             ///< physical cores
    std::uint32_t numberOfLogicalProcessors; ///< hardware threads
    std::uint32_t reserved[2];               ///< zero
};

/// One memory module.
struct HardwareMemoryEntry {
    std::uint64_t capacity; ///< bytes
    std::uint32_t speed;    ///< MHz
    std::uint32_t reserved; ///< zero
};

constexpr unsigned int kMaxHardwareDisks = 6;          ///< disks a HardwareInfoRec holds
constexpr unsigned int kMaxHardwareProcessors = 8;     ///< processors a HardwareInfoRec holds
constexpr unsigned int kMaxHardwareMemoryModules = 16; ///< memory modules a HardwareInfoRec holds
constexpr unsigned int kMaxPerformanceCores = 128;     ///< cores a PerformanceRec holds

/// 5920 bytes; every query that fills it zero-fills it first.
struct HardwareInfoRec {
    HardwareDiskEntry disks[kMaxHardwareDisks]; ///< the first numberOfDisks are filled
    HardwareProcessorEntry
        processors[kMaxHardwareProcessors]; ///< the first numberOfProcessors are filled
    unsigned char reserved1[132];           ///< zero
    char16_t osCaption[60];                 ///< operating system name
    char16_t osServicePack[30];             ///< operating system update level
    char16_t computerName[40];              ///< host name
    unsigned char reserved2[224];           ///< zero
    HardwareMemoryEntry
        memory[kMaxHardwareMemoryModules]; ///< the first numberOfMemoryModules are filled
    unsigned char reserved3[1856];         ///< zero
    std::uint32_t numberOfDisks;           ///< entries filled in disks
    std::uint32_t numberOfProcessors;      ///< entries filled in processors
    std::uint32_t reserved4;               ///< zero
    std::uint32_t numberOfMemoryModules;   ///< entries filled in memory
    std::uint32_t reserved5[2];            ///< zero
};

/// 2504 bytes; every query that fills it zero-fills it first.
struct PerformanceRec {
    std::uint64_t totalProcessorUse;                      ///< percent
    std::uint64_t coreProcessorUse[kMaxPerformanceCores]; ///< percent per core; the first
                                                          ///< numberOfCores are filled
    unsigned char reserved1[1408];                        ///< zero
    std::uint64_t commitLimit;                            ///< bytes
    std::uint64_t committedBytes;                         ///< bytes
    std::uint32_t percentCommittedBytesInUse; ///< committedBytes as a percentage of commitLimit
    unsigned char reserved2[36];              ///< zero
    std::uint32_t numberOfCores;              ///< entries filled in coreProcessorUse
    std::uint32_t reserved3;                  ///< zero
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
    /// Fills the memory modules of `rec`.
    [[nodiscard]] virtual bool getMemoryInfo(HardwareInfoRec* rec) = 0;
    /// Fills the processors and the operating-system texts of `rec`.
    [[nodiscard]] virtual bool getProcessorAndOSInfo(HardwareInfoRec* rec) = 0;
    /// Fills the disks of `rec`.
    [[nodiscard]] virtual bool getDiskInfo(HardwareInfoRec* rec) = 0;
    /// Fills the commit figures of `rec`.
    [[nodiscard]] virtual bool getMemoryPerformance(PerformanceRec* rec) = 0;
    /// Fills the processor use of `rec`.
    [[nodiscard]] virtual bool getCPUPerformance(PerformanceRec* rec) = 0;
    /// Writes the memory modules of `rec` as text to `out`.
    virtual void printMemoryInfo(const HardwareInfoRec* rec, std::wostream& out) = 0;
    /// Returns the number of processors printed.
    virtual int printProcessorAndOSInfo(const HardwareInfoRec* rec, std::wostream& out) = 0;
    /// Writes the disks of `rec` as text to `out`.
    virtual void printDiskInfo(const HardwareInfoRec* rec, std::wostream& out) = 0;
    /// Writes the commit figures of `rec` as text to `out`.
    virtual void printMemoryPerformance(const PerformanceRec* rec, std::wostream& out) = 0;
    /// Writes the processor use of `rec` as text to `out`.
    virtual void printCPUPerformance(const PerformanceRec* rec, std::wostream& out) = 0;
};

/// A new description of this machine (null when memory runs out); the caller deletes it.
[[nodiscard]] ZYRSTD_API IHardwareInfo* createHardwareInfo();
/// The same, reading /proc, /sys and /etc under `systemRoot` instead of "/" (a container's
/// view of its host, or a prepared tree).
[[nodiscard]] ZYRSTD_API IHardwareInfo* createHardwareInfo(const char* systemRoot);

} // namespace ZYRStd
