// Virtual memory over mmap, with the library's own region table, and memory status from
// /proc, rlimits and the cgroup.
#include "zyr/std/core/ZYRVirtualMem.h"

#include <sys/mman.h>
#include <sys/resource.h>
#include <unistd.h>

#include <algorithm>
#include <fstream>
#include <map>
#include <mutex>
#include <sstream>
#include <string>
#include <vector>

#include "zyr/std/core/IStackWalker.h"
#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/core/ZYRThreadSafety.h"
#include "zyr/std/core/internal/ZYRMemInternal.h"
#include "zyr/std/core/internal/ZYRNoDestructor.h"

namespace ZYRStd {

namespace {

constexpr uint64_t kPageFileCushion = 314572800;

struct Region {
    uint64_t size;               // reserved bytes, whole pages
    std::vector<bool> committed; // one flag a page
    uint64_t committedBytes;
};

struct RegionTable {
    detail::Mutex mutex; // guards regions
    std::map<const void*, Region> regions ZYR_GUARDED_BY(mutex);
};

RegionTable& regionTable() {
    static detail::NoDestructor<RegionTable> instance;
    return *instance;
}

uint64_t pageSize() {
    static const uint64_t size = static_cast<uint64_t>(::sysconf(_SC_PAGESIZE));
    return size;
}

uint64_t roundUpToPage(uint64_t n) {
    return (n + pageSize() - 1) / pageSize() * pageSize();
}

// Reads "Key: value kB" lines; returns bytes, or `fallback` when the key is missing.
uint64_t procField(const char* path, const std::string& key, uint64_t fallback) {
    std::ifstream in(path);
    std::string line;
    while (std::getline(in, line)) {
        if (line.rfind(key + ":", 0) != 0)
            continue;
        std::istringstream fields(line.substr(key.size() + 1));
        uint64_t value = 0;
        std::string unit;
        fields >> value >> unit;
        return unit == "kB" ? value * 1024 : value;
    }
    return fallback;
}

// A limit file's value: a byte count, or "max" (no limit); none for anything else.
uint64_t limitFileValue(const std::string& path) {
    std::ifstream in(path);
    std::string text;
    if (!(in >> text) || text.empty() || text == "max" ||
        text.find_first_not_of("0123456789") != std::string::npos)
        return UINT64_MAX;
    try {
        return std::stoull(text);
    } catch (...) {
        return UINT64_MAX;
    }
}

// The smallest value of `file` in the cgroup at `path` below `root` and in each of its
// ancestors: a parent's cap binds every group beneath it. With `usageFile`, the smallest
// room instead: each capped group's value less its usage.
uint64_t smallestAlongPath(const std::string& root, std::string path, const char* file,
                           const char* usageFile = nullptr) {
    uint64_t smallest = UINT64_MAX;
    for (;;) {
        while (!path.empty() && path.back() == '/')
            path.pop_back();
        uint64_t value = limitFileValue(root + path + "/" + file);
        if (usageFile && value != UINT64_MAX) {
            const uint64_t usage = limitFileValue(root + path + "/" + usageFile);
            if (usage != UINT64_MAX) // an unreadable usage leaves the cap itself
                value = usage < value ? value - usage : 0;
        }
        smallest = std::min(smallest, value);
        if (path.empty())
            return smallest;
        path.erase(path.rfind('/') == std::string::npos ? 0 : path.rfind('/'));
    }
}

// The cap (or with `room`, the cap less usage) of this process's own memory cgroup.
uint64_t cgroupMemory(const std::string& procSelfCgroup, const std::string& cgroupRoot, bool room) {
    const char* usage2 = room ? "memory.current" : nullptr;
    const char* usage1 = room ? "memory.usage_in_bytes" : nullptr;
    std::ifstream in(procSelfCgroup);
    if (!in)
        return smallestAlongPath(cgroupRoot, "", "memory.max", usage2);
    std::string line;
    std::string unifiedPath;
    bool unified = false;
    // Lines are "hierarchy:controllers:path"; version 2 has the one line "0::path".
    while (std::getline(in, line)) {
        const size_t first = line.find(':');
        const size_t second = first == std::string::npos ? first : line.find(':', first + 1);
        if (second == std::string::npos)
            continue;
        const std::string controllers = line.substr(first + 1, second - first - 1);
        const std::string path = line.substr(second + 1);
        if (line.compare(0, first, "0") == 0 && controllers.empty()) {
            unified = true;
            unifiedPath = path;
            continue;
        }
        std::istringstream names(controllers);
        for (std::string name; std::getline(names, name, ',');)
            if (name == "memory") // version 1 (also in a hybrid layout): its own hierarchy
                return smallestAlongPath(cgroupRoot + "/memory", path, "memory.limit_in_bytes",
                                         usage1);
    }
    if (unified)
        return smallestAlongPath(cgroupRoot, unifiedPath, "memory.max", usage2);
    return UINT64_MAX;
}

} // namespace

namespace detail {

uint64_t cgroupMemoryLimit(const std::string& procSelfCgroup, const std::string& cgroupRoot) {
    return cgroupMemory(procSelfCgroup, cgroupRoot, false);
}

uint64_t cgroupMemoryRoom(const std::string& procSelfCgroup, const std::string& cgroupRoot) {
    return cgroupMemory(procSelfCgroup, cgroupRoot, true);
}

} // namespace detail

void* VirtualMemAlloc(unsigned int size) {
    if (size == 0)
        return nullptr;
    // The whole pages are what the block holds and what is counted: they are tested and
    // reserved before the mapping is made, and given back if it fails.
    const uint64_t bytes = roundUpToPage(size);
    const bool plain = detail::memStatLevel() == 0;
    if (!(plain ? detail::plainLimitTest(bytes, 0, true) : detail::trackerReserve(bytes))) {
        detail::sendOutOfMemoryNotice();
        return nullptr;
    }
    const auto giveBack = [&] {
        plain ? detail::plainUsageSub(bytes) : detail::trackerUnreserve(bytes);
    };
    void* base = ::mmap(nullptr, bytes, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    if (base == MAP_FAILED) {
        giveBack();
        return nullptr;
    }
    try {
        RegionTable& table = regionTable();
        detail::LockGuard lock(table.mutex);
        table.regions[base] = Region{bytes, std::vector<bool>(bytes / pageSize(), true), bytes};
    } catch (...) {
        // Without its record the block could never be freed or counted: give it back.
        ::munmap(base, bytes);
        giveBack();
        return nullptr;
    }
    if (!plain) {
        detail::trackerRecordAlloc(base, bytes);
        detail::trackerAddVirtualBlock(base, detail::stackWalker().capture(10, 2, 32, size));
    }
    return base;
}

void VirtualMemFree(void* p) {
    if (!p)
        return;
    uint64_t reserved = 0;
    uint64_t committed = 0;
    {
        RegionTable& table = regionTable();
        detail::LockGuard lock(table.mutex);
        const auto found = table.regions.find(p);
        if (found == table.regions.end())
            return; // not ours: releasing it would corrupt the accounting
        reserved = found->second.size;
        committed = found->second.committedBytes;
        table.regions.erase(found);
    }
    if (detail::memStatLevel() == 0) {
        detail::plainUsageSub(committed);
    } else {
        const unsigned int id = detail::trackerEraseVirtualBlock(p);
        if (id != 0)
            detail::stackWalker().release(id, static_cast<unsigned int>(committed));
        detail::trackerRecordFree(p, committed);
    }
    ::munmap(p, reserved);
}

void VirtualMemDecommit(void* base, void* addr, unsigned int size) {
    if (!base || size == 0)
        return;
    RegionTable& table = regionTable();
    uint64_t before = 0;
    uint64_t after = 0;
    {
        detail::LockGuard lock(table.mutex);
        const auto found = table.regions.find(base);
        if (found == table.regions.end())
            return;
        Region& region = found->second;
        const auto start = static_cast<const unsigned char*>(base);
        const auto from = static_cast<const unsigned char*>(addr);
        if (from < start || from >= start + region.size)
            return;
        // Every page that holds a byte of the range is given back.
        const uint64_t offset = static_cast<uint64_t>(from - start);
        const uint64_t firstPage = offset / pageSize();
        const uint64_t endPage = std::min<uint64_t>((offset + size + pageSize() - 1) / pageSize(),
                                                    region.committed.size());
        before = region.committedBytes;
        for (uint64_t page = firstPage; page < endPage; ++page) {
            if (!region.committed[page])
                continue;
            region.committed[page] = false;
            region.committedBytes -= pageSize();
            ::madvise(const_cast<unsigned char*>(start) + page * pageSize(), pageSize(),
                      MADV_DONTNEED);
        }
        after = region.committedBytes;
    }
    if (before == after)
        return;
    if (detail::memStatLevel() == 0) {
        detail::plainUsageSub(before - after);
    } else {
        // The block is counted anew with what stays committed.
        detail::trackerRecordDecommit(before, after);
        const unsigned int id = detail::trackerVirtualBlockId(base);
        if (id != 0)
            detail::stackWalker().resize(id, static_cast<unsigned int>(before),
                                         static_cast<unsigned int>(after));
    }
}

unsigned int VirtualMemAllocUnitSize() {
    return std::max<unsigned int>(GetPageSize(), 65536);
}

unsigned int GetPageSize() {
    return static_cast<unsigned int>(pageSize());
}

void VirtualMemStatus(tZYRVirtualMemoryInfo* info) {
    if (!info)
        return;
    const uint64_t totalPhys = procField("/proc/meminfo", "MemTotal", 0);
    const uint64_t availPhys = procField("/proc/meminfo", "MemAvailable", totalPhys);
    const uint64_t swapTotal = procField("/proc/meminfo", "SwapTotal", 0);
    const uint64_t swapFree = procField("/proc/meminfo", "SwapFree", 0);
    rlimit addressSpace{};
    const bool addressSpaceCapped =
        ::getrlimit(RLIMIT_AS, &addressSpace) == 0 && addressSpace.rlim_cur != RLIM_INFINITY;
    uint64_t totalVirtual = totalPhys + swapTotal;
    if (addressSpaceCapped)
        totalVirtual = std::min<uint64_t>(totalVirtual, addressSpace.rlim_cur);
    totalVirtual =
        std::min(totalVirtual, detail::cgroupMemoryLimit("/proc/self/cgroup", "/sys/fs/cgroup"));
    // What the process can still get: physical memory, its cgroup's room, and only where an
    // address-space cap is set, that cap less the address space in use. Mapped address space
    // alone costs nothing: sanitizers and large PROT_NONE reservations map terabytes.
    uint64_t availVirtual =
        std::min(availPhys, detail::cgroupMemoryRoom("/proc/self/cgroup", "/sys/fs/cgroup"));
    if (addressSpaceCapped) {
        const uint64_t vmSize = procField("/proc/self/status", "VmSize", 0);
        availVirtual = std::min<uint64_t>(
            availVirtual, addressSpace.rlim_cur > vmSize ? addressSpace.rlim_cur - vmSize : 0);
    }
    const uint64_t availPageFile = availPhys + swapFree;

    info->totalPhysical = totalPhys;
    info->totalVirtual = totalVirtual;

    const uint64_t used =
        detail::memStatLevel() >= 1 ? detail::trackerCurrentBytes() : detail::plainUsage();
    const uint64_t limit = detail::memLimit();
    const uint64_t headroom = limit > used ? limit - used : 0;
    const uint64_t reachable = std::min(headroom, availVirtual);
    const uint64_t reserve = detail::memReserve();
    uint64_t available = reachable > reserve ? reachable - reserve : 0;
    const uint64_t pageFileCap =
        availPageFile > kPageFileCushion ? availPageFile - kPageFileCushion : 0;
    info->availableForAllocation = std::min(available, pageFileCap);

    if (!ZYRGetTestAvailablePhysicalMemory()) {
        info->availablePhysical = totalPhys;
    } else {
        // Private committed memory of the process: anonymous resident pages and swap.
        const uint64_t privateUsage = procField("/proc/self/status", "RssAnon", 0) +
                                      procField("/proc/self/status", "VmSwap", 0);
        info->availablePhysical =
            privateUsage > totalPhys ? 0 : std::min(availPhys, totalPhys - privateUsage);
    }
}

namespace detail {

uint64_t virtualRegionSize(const void* base) {
    RegionTable& table = regionTable();
    detail::LockGuard lock(table.mutex);
    const auto found = table.regions.find(base);
    return found == table.regions.end() ? 0 : found->second.committedBytes;
}

} // namespace detail
} // namespace ZYRStd
