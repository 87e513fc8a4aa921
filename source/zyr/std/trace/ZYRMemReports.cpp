// Memory reports over /proc: the address-space map and the usage snapshots.
#include "zyr/std/trace/ZYRMemReports.h"

#include <dirent.h>

#include <algorithm>
#include <cinttypes>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <map>
#include <sstream>
#include <string>

#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/core/ZYRVirtualMem.h"
#include "zyr/std/memory/ZYRDMM.h"
#include "zyr/std/values/CZYRCommonUniStrings.h"

namespace ZYRStd {

namespace {

constexpr uint64_t kTopOfUserSpace = 0x00007FFFFFFFF000ull;
constexpr uint64_t kBigFreeBlock = 8388608;    // 8 MiB
constexpr uint64_t kMiddleFreeBlock = 4194304; // 4 MiB
constexpr int32_t kStatisticsLevel = 4;

// The report counters: plain globals, since reports come from one thread at a time.
unsigned int jobCount = 0;
unsigned int surfaceCount = 0;
unsigned int placedObjectCount = 0;

// ---- /proc readers -------------------------------------------------------------------------

// A "Name:   123 kB" field of /proc/self/status in bytes (0 when absent).
uint64_t statusBytes(const std::string& status, const char* name) {
    const std::string key = std::string("\n") + name + ":";
    const size_t at = ("\n" + status).find(key);
    if (at == std::string::npos)
        return 0;
    return std::strtoull(status.c_str() + at + key.size() - 1, nullptr, 10) * 1024;
}

std::string slurp(const char* path) {
    std::ifstream in(path);
    std::ostringstream text;
    text << in.rdbuf();
    return text.str();
}

struct ProcessFigures {
    uint64_t peakWorkingSet;
    uint64_t workingSet;
    uint64_t peakPagefile;
    uint64_t privateUsage; // RssAnon + VmSwap
    uint64_t pageFaults;
};

ProcessFigures processFigures() {
    const std::string status = slurp("/proc/self/status");
    ProcessFigures f{};
    f.peakWorkingSet = statusBytes(status, "VmHWM");
    f.workingSet = statusBytes(status, "VmRSS");
    f.peakPagefile = statusBytes(status, "VmPeak");
    f.privateUsage = statusBytes(status, "RssAnon") + statusBytes(status, "VmSwap");
    // Fields after the command name: state is the 3rd field, minflt the 10th, majflt the 12th.
    const std::string stat = slurp("/proc/self/stat");
    const size_t close = stat.rfind(')');
    if (close != std::string::npos) {
        std::istringstream fields(stat.substr(close + 1));
        std::string field;
        uint64_t minor = 0;
        uint64_t major = 0;
        for (int n = 3; n <= 12 && fields >> field; ++n) {
            if (n == 10)
                minor = std::strtoull(field.c_str(), nullptr, 10);
            if (n == 12)
                major = std::strtoull(field.c_str(), nullptr, 10);
        }
        f.pageFaults = minor + major;
    }
    return f;
}

uint64_t openDescriptors() {
    DIR* dir = ::opendir("/proc/self/fd");
    if (!dir)
        return 0;
    uint64_t count = 0;
    while (const dirent* entry = ::readdir(dir))
        if (entry->d_name[0] != '.')
            ++count;
    ::closedir(dir);
    return count > 0 ? count - 1 : 0; // not the listing's own descriptor
}

uint64_t ioField(const std::string& io, const char* name) {
    const std::string key = std::string(name) + ": ";
    const size_t at = io.find(key);
    return at == std::string::npos ? 0 : std::strtoull(io.c_str() + at + key.size(), nullptr, 10);
}

uint64_t meminfoBytes(const char* name) {
    return statusBytes(slurp("/proc/meminfo"), name);
}

// ---- the address-space walk ----------------------------------------------------------------

struct Mapping {
    uint64_t start;
    uint64_t end;
    char perms[5];
    std::string path;
};

bool isElfFile(const std::string& path, std::map<std::string, bool>& known) {
    const auto it = known.find(path);
    if (it != known.end())
        return it->second;
    char magic[4] = {};
    std::ifstream in(path, std::ios::binary);
    const bool elf = in.read(magic, 4) && std::memcmp(magic,
                                                      "\x7f"
                                                      "ELF",
                                                      4) == 0;
    known.emplace(path, elf);
    return elf;
}

const char* protectionName(const Mapping& m, bool fileBacked) {
    const bool r = m.perms[0] == 'r';
    const bool w = m.perms[1] == 'w';
    const bool x = m.perms[2] == 'x';
    const bool copyOnWrite = w && fileBacked && m.perms[3] == 'p';
    if (x) {
        if (copyOnWrite)
            return "EXECUTE_WRITECOPY";
        if (w)
            return "EXECUTE_READWRITE";
        return r ? "EXECUTE_READ" : "EXECUTE";
    }
    if (copyOnWrite)
        return "WRITECOPY";
    if (w)
        return "READWRITE";
    return r ? "READONLY" : "NOACCESS";
}

struct Totals {
    uint64_t commit = 0, image = 0, mapped = 0, priv = 0, reserved = 0;
    uint64_t largestFree = 0, big = 0, middle = 0, small = 0, units8MB = 0;
};

void regionLine(CZYRTraceMsg& trace, bool lines, uint64_t base, uint64_t size, const char* state,
                const char* type, const char* protect) {
    if (!lines)
        return;
    char text[160];
    std::snprintf(text, sizeof text, "0x%016" PRIX64 "\t%s\t%s\t%s\t%zu\t0x%016" PRIX64, base,
                  state, type, protect, static_cast<size_t>(size), base);
    trace.traceMsg(text);
}

void freeRegion(CZYRTraceMsg& trace, bool lines, Totals& t, uint64_t base, uint64_t size) {
    regionLine(trace, lines, base, size, "FREE", "", "");
    t.largestFree = std::max(t.largestFree, size);
    if (size >= kBigFreeBlock) {
        ++t.big;
        t.units8MB += size / kBigFreeBlock;
    } else if (size >= kMiddleFreeBlock) {
        ++t.middle;
    } else {
        ++t.small;
    }
}

void walkAddressSpace(CZYRTraceMsg& trace, bool lines, Totals& t) {
    std::ifstream maps("/proc/self/maps");
    std::map<std::string, bool> elfFiles;
    uint64_t next = 0;
    for (std::string line; std::getline(maps, line) && next < kTopOfUserSpace;) {
        Mapping m{};
        char path[4096] = "";
        if (std::sscanf(line.c_str(), "%" SCNx64 "-%" SCNx64 " %4s %*s %*s %*s %4095[^\n]",
                        &m.start, &m.end, m.perms, path) < 3)
            continue;
        m.path = path;
        m.end = std::min(m.end, kTopOfUserSpace);
        if (m.start >= m.end || m.start < next)
            continue;
        if (m.start > next)
            freeRegion(trace, lines, t, next, m.start - next);
        const uint64_t size = m.end - m.start;
        if (m.perms[0] == '-' && m.perms[1] == '-' && m.perms[2] == '-') {
            regionLine(trace, lines, m.start, size, "RESERVE", "", "");
            t.reserved += size;
        } else {
            const bool fileBacked = !m.path.empty() && m.path[0] == '/';
            const char* type = "PRIV";
            if (fileBacked && isElfFile(m.path, elfFiles)) {
                type = "IMAGE";
                t.image += size;
            } else if (fileBacked) {
                type = "MAPPED";
                t.mapped += size;
            } else {
                t.priv += size;
            }
            t.commit += size;
            regionLine(trace, lines, m.start, size, "COMMIT", type, protectionName(m, fileBacked));
        }
        next = m.end;
    }
    if (next < kTopOfUserSpace)
        freeRegion(trace, lines, t, next, kTopOfUserSpace - next);
}

CZYRUniString common(C_SmartPtr<I_UniString> (IZYRCommonUniStrings::*row)() const) {
    return CZYRUniString((GetCommonUniStrings()->*row)());
}

} // namespace

void DumpVMStatistics(CZYRTraceMsg& trace) {
    const CZYRUniString memory = common(&IZYRCommonUniStrings::str_Memory);
    const CZYRUniString performance = common(&IZYRCommonUniStrings::str_Performance);
    const int32_t level = trace.getTraceMsgLevel(memory, performance);
    if (level < kStatisticsLevel)
        return;
    trace.beginTraceMsg(memory, performance, ZYRPublic::kZYRTraceMsgLevel4,
                        "Virtual Memory Statistics");
    const bool lines = level > kStatisticsLevel;
    if (lines)
        trace.traceMsg("Address\tState\tType\tProtect\tSize\tBase");
    Totals t;
    walkAddressSpace(trace, lines, t);

    char text[256];
    std::snprintf(
        text, sizeof text, "Totals: Commit %zu (Image %zu Mapped %zu Private %zu) Reserved %zu",
        static_cast<size_t>(t.commit), static_cast<size_t>(t.image), static_cast<size_t>(t.mapped),
        static_cast<size_t>(t.priv), static_cast<size_t>(t.reserved));
    trace.traceMsg(text);
    std::snprintf(text, sizeof text,
                  "Free block: Largest: %zu #blks >=8MB: %zu >=4MB: %zu <4MB: %zu #8MB %zu",
                  static_cast<size_t>(t.largestFree), static_cast<size_t>(t.big),
                  static_cast<size_t>(t.middle), static_cast<size_t>(t.small),
                  static_cast<size_t>(t.units8MB));
    trace.traceMsg(text);
    const ProcessFigures f = processFigures();
    std::snprintf(text, sizeof text,
                  "Working Set: Peak %zu Current %zu Peak Pagefile %zu PageFault %u",
                  static_cast<size_t>(f.peakWorkingSet), static_cast<size_t>(f.workingSet),
                  static_cast<size_t>(f.peakPagefile), static_cast<unsigned int>(f.pageFaults));
    trace.traceMsg(text);
    trace.endTraceMsg();
}

void DumpMemoryUsageToCSVFile(const char*, bool) {}

void ReportMemoryUsage(CZYRTraceMsg& trace, ReportMemoryUsageType type, const char* label,
                       eZYRTraceMsgLevel level) {
    const CZYRUniString memory = common(&IZYRCommonUniStrings::str_Memory);
    const CZYRUniString general = common(&IZYRCommonUniStrings::str_General);
    if (level > 0 && trace.getTraceMsgLevel(memory, general) < level)
        return;

    std::ostringstream text;
    if (label)
        text << label << ' ';
    switch (type) {
    case kReportMemoryUsageAfterJob:
        text << "After Job " << jobCount << ' ';
        ++jobCount;
        break;
    case kReportMemoryUsageAfterSurface: {
        ++surfaceCount;
        static const int step = [] {
            const char* value = std::getenv("ZYR_MEMORY_SURFACE_COUNT_STEP");
            return value ? std::atoi(value) : 0;
        }();
        if (step >= 1 && surfaceCount % static_cast<unsigned int>(step) != 0)
            return;
        text << "After interpreting Surface " << surfaceCount << ' ';
        break;
    }
    case kReportMemoryUsageAfterPlacedObject:
        ++placedObjectCount;
        text << "After interpreting PlacedObject " << placedObjectCount << ' ';
        break;
    default:
        break;
    }
    text << "Current Memory: " << GetMemUsage() << " bytes"
         << " TUMA(All): " << DMM_GetCurrTUMAMem(eZYRMemoryClientAll, nullptr) << " bytes"
         << " TUMA(Interp): " << DMM_GetCurrTUMAMem(eZYRMemoryClientInterp, nullptr) << " bytes"
         << " JOV(All): " << DMM_GetCurrJOVMem(eZYRMemoryClientAll, nullptr) << " bytes"
         << " JOV(Interp): " << DMM_GetCurrJOVMem(eZYRMemoryClientInterp, nullptr) << " bytes";

    const CZYRUniString performance = common(&IZYRCommonUniStrings::str_Performance);
    if (trace.getTraceMsgLevel(memory, performance) > 3) {
        const ProcessFigures f = processFigures();
        tZYRVirtualMemoryInfo info{};
        VirtualMemStatus(&info);
        const std::string status = slurp("/proc/self/status");
        const uint64_t vmSize = statusBytes(status, "VmSize");
        const std::string io = slurp("/proc/self/io");
        text << '\n'
             << "Commit: " << f.privateUsage << " WorkingSet: " << f.workingSet
             << " PageFile: " << f.privateUsage << " PageFault: " << f.pageFaults << '\n'
             << "TotalVir " << info.totalVirtual << " AvailVir "
             << (info.totalVirtual > vmSize ? info.totalVirtual - vmSize : 0) << " AvailPhy "
             << meminfoBytes("MemAvailable") << '\n'
             << "HandleCount: " << openDescriptors() << " Read: " << ioField(io, "rchar")
             << " Write: " << ioField(io, "wchar") << " Other: " << 0;
        char name[64];
        const char* csv = name;
        if (type == kReportMemoryUsageAfterJob)
            std::snprintf(name, sizeof name, "ZYRMemoryJob%03u.csv", jobCount);
        else if (type == kReportMemoryUsageAfterSurface)
            std::snprintf(name, sizeof name, "ZYRMemorySurface%08u.csv", surfaceCount);
        else if (type == kReportMemoryUsageAfterPlacedObject)
            std::snprintf(name, sizeof name, "ZYRMemoryPlacedObj%08u.csv", placedObjectCount);
        else
            csv = nullptr;
        DumpMemoryUsageToCSVFile(csv, true);
    }
    text << '\n';
    trace.traceMsg(memory, general, level, text.str().c_str());
}

} // namespace ZYRStd
