// The hardware classes over Linux's own descriptions of the machine.
#include "zyr/std/instrument/ZYRHardwareQuerySource.h"

#include <sys/utsname.h>

#include <algorithm>
#include <chrono>
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <set>
#include <sstream>
#include <thread>
#include <utility>

namespace ZYRStd {

namespace {

namespace fs = std::filesystem;

bool readText(const std::string& path, std::string& out) {
    std::ifstream in(path, std::ios::binary);
    if (!in)
        return false;
    out.assign(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
    return !in.bad();
}

std::string trim(std::string_view text) {
    const auto first = text.find_first_not_of(" \t\r\n");
    if (first == std::string_view::npos)
        return {};
    const auto last = text.find_last_not_of(" \t\r\n");
    return std::string(text.substr(first, last - first + 1));
}

// The first line of a small file, trimmed; empty when it cannot be read.
std::string readLine(const std::string& path) {
    std::string text;
    if (!readText(path, text))
        return {};
    return trim(text.substr(0, text.find('\n')));
}

unsigned long long toNumber(std::string_view text) {
    unsigned long long value = 0;
    for (char c : text) {
        if (c < '0' || c > '9')
            break;
        value = value * 10 + static_cast<unsigned>(c - '0');
    }
    return value;
}

// "1024K", "8M" as in cache/index*/size, in KB.
unsigned long long cacheSizeKB(std::string_view text) {
    const unsigned long long value = toNumber(text);
    const auto unit = text.find_first_not_of("0123456789");
    if (unit == std::string_view::npos)
        return value / 1024;
    switch (text[unit]) {
    case 'M':
        return value * 1024;
    case 'G':
        return value * 1024 * 1024;
    default:
        return value;
    }
}

// "key\t: value" lines of /proc/cpuinfo, one map per logical processor.
std::vector<std::map<std::string, std::string>> cpuinfoBlocks(const std::string& text) {
    std::vector<std::map<std::string, std::string>> blocks(1);
    std::istringstream in(text);
    std::string line;
    while (std::getline(in, line)) {
        const auto colon = line.find(':');
        if (trim(line).empty()) {
            if (!blocks.back().empty())
                blocks.emplace_back();
            continue;
        }
        if (colon == std::string::npos)
            continue;
        blocks.back()[trim(std::string_view(line).substr(0, colon))] =
            trim(std::string_view(line).substr(colon + 1));
    }
    if (blocks.back().empty())
        blocks.pop_back();
    return blocks;
}

std::string field(const std::map<std::string, std::string>& block, const std::string& key) {
    const auto it = block.find(key);
    return it == block.end() ? std::string() : it->second;
}

// "Key: value kB" lines of /proc/meminfo, in bytes.
bool meminfoBytes(const std::string& text, std::string_view key, unsigned long long& bytes) {
    std::istringstream in(text);
    std::string line;
    while (std::getline(in, line)) {
        const auto colon = line.find(':');
        if (colon == std::string::npos || std::string_view(line).substr(0, colon) != key)
            continue;
        const std::string value = trim(std::string_view(line).substr(colon + 1));
        bytes = toNumber(value) * (value.find("kB") != std::string::npos ? 1024 : 1);
        return true;
    }
    return false;
}

struct CpuTimes {
    std::string name; // "cpu", "cpu0", ...
    unsigned long long busy = 0;
    unsigned long long total = 0;
};

std::vector<CpuTimes> statSample(const std::string& text) {
    std::vector<CpuTimes> out;
    std::istringstream in(text);
    std::string line;
    while (std::getline(in, line)) {
        if (line.compare(0, 3, "cpu") != 0)
            continue;
        std::istringstream fields(line);
        CpuTimes times;
        fields >> times.name;
        unsigned long long value = 0;
        unsigned long long idle = 0;
        // user nice system idle iowait irq softirq steal; guest times are already in user.
        for (int i = 0; i < 8 && fields >> value; ++i) {
            times.total += value;
            if (i == 3 || i == 4)
                idle += value;
        }
        times.busy = times.total - idle;
        out.push_back(times);
    }
    return out;
}

std::string machineArchitecture(const std::string& archFile) {
    std::string arch = readLine(archFile);
    if (arch.empty()) {
        utsname names{};
        if (uname(&names) == 0)
            arch = names.machine;
    }
    return arch;
}

} // namespace

ZYRHardwareQuerySource::ZYRHardwareQuerySource(std::string root)
    : root_(std::move(root)),
      betweenSamples_([] { std::this_thread::sleep_for(std::chrono::milliseconds(100)); }) {
    while (root_.size() > 1 && root_.back() == '/')
        root_.pop_back();
}

void ZYRHardwareQuerySource::setBetweenSamples(std::function<void()> wait) {
    betweenSamples_ = std::move(wait);
}

std::string ZYRHardwareQuerySource::path(std::string_view relative) const {
    return (root_ == "/" ? std::string() : root_) + "/" + std::string(relative);
}

bool ZYRHardwareQuerySource::run(std::string_view query, std::vector<Row>& rows) const {
    rows.clear();
    constexpr std::string_view kPrefix = "SELECT * FROM ";
    if (query.substr(0, kPrefix.size()) != kPrefix)
        return false;
    const std::string_view name = query.substr(kPrefix.size());
    if (name == "Win32_Processor")
        return processors(rows);
    if (name == "Win32_OperatingSystem")
        return operatingSystem(rows);
    if (name == "Win32_PhysicalMemory")
        return physicalMemory(rows);
    if (name == "Win32_DiskDrive")
        return diskDrives(rows);
    if (name == "Win32_PerfFormattedData_PerfOS_Memory")
        return memoryPerformance(rows);
    if (name == "Win32_PerfFormattedData_PerfOS_Processor")
        return processorPerformance(rows);
    return false;
}

bool ZYRHardwareQuerySource::processors(std::vector<Row>& rows) const {
    std::string text;
    if (!readText(path("proc/cpuinfo"), text))
        return false;
    const auto blocks = cpuinfoBlocks(text);
    const std::string arch = machineArchitecture(path("proc/sys/kernel/arch"));

    // One row per physical package, in the order the packages first appear.
    std::vector<std::string> packages;
    std::map<std::string, std::vector<const std::map<std::string, std::string>*>> members;
    for (const auto& block : blocks) {
        const std::string id = field(block, "physical id");
        if (!members.count(id))
            packages.push_back(id);
        members[id].push_back(&block);
    }
    for (const std::string& id : packages) {
        const auto& cpus = members[id];
        const auto& first = *cpus.front();
        Row row;
        row["Caption"] = arch + " Family " + field(first, "cpu family") + " Model " +
                         field(first, "model") + " Stepping " + field(first, "stepping");
        row["Manufacturer"] = field(first, "vendor_id");
        row["Name"] = field(first, "model name");

        const std::string cpuDir =
            path("sys/devices/system/cpu/cpu" + field(first, "processor") + "/");
        const unsigned long long mhz = toNumber(field(first, "cpu MHz"));
        const std::string curKHz = readLine(cpuDir + "cpufreq/scaling_cur_freq");
        const std::string maxKHz = readLine(cpuDir + "cpufreq/cpuinfo_max_freq");
        row["CurrentClockSpeed"] = std::to_string(curKHz.empty() ? mhz : toNumber(curKHz) / 1000);
        row["MaxClockSpeed"] = std::to_string(maxKHz.empty() ? mhz : toNumber(maxKHz) / 1000);
        row["ExtClock"] = "0"; // Linux does not publish the bus clock
        row["L2CacheSpeed"] = "0";
        row["L3CacheSpeed"] = "0";

        const std::string cores = field(first, "cpu cores");
        row["NumberOfCores"] = cores.empty() ? std::to_string(cpus.size()) : cores;
        const std::string siblings = field(first, "siblings");
        row["NumberOfLogicalProcessors"] =
            siblings.empty() ? std::to_string(cpus.size()) : siblings;

        // A cache shared by several processors counts once per package.
        std::set<std::pair<std::string, std::string>> seen;
        unsigned long long cacheKB[4] = {};
        for (const auto* cpu : cpus) {
            const fs::path cacheDir =
                path("sys/devices/system/cpu/cpu" + field(*cpu, "processor") + "/cache");
            std::error_code ec;
            for (fs::directory_iterator it(cacheDir, ec), end; !ec && it != end; it.increment(ec)) {
                const std::string dir = it->path().string() + "/";
                if (it->path().filename().string().rfind("index", 0) != 0)
                    continue;
                const unsigned long long level = toNumber(readLine(dir + "level"));
                if (level < 2 || level > 3 || readLine(dir + "type") == "Instruction")
                    continue;
                std::string shared = readLine(dir + "shared_cpu_list");
                if (shared.empty())
                    shared = field(*cpu, "processor");
                if (!seen.insert({std::to_string(level), shared}).second)
                    continue;
                cacheKB[level] += cacheSizeKB(readLine(dir + "size"));
            }
        }
        row["L2CacheSize"] = std::to_string(cacheKB[2]);
        row["L3CacheSize"] = std::to_string(cacheKB[3]);
        rows.push_back(std::move(row));
    }
    return !rows.empty();
}

bool ZYRHardwareQuerySource::operatingSystem(std::vector<Row>& rows) const {
    std::string text;
    if (!readText(path("etc/os-release"), text) && !readText(path("usr/lib/os-release"), text))
        return false;
    std::string caption;
    std::istringstream in(text);
    std::string line;
    while (std::getline(in, line)) {
        if (line.rfind("PRETTY_NAME=", 0) != 0)
            continue;
        caption = trim(std::string_view(line).substr(12));
        if (caption.size() >= 2 && (caption.front() == '"' || caption.front() == '\'') &&
            caption.back() == caption.front())
            caption = caption.substr(1, caption.size() - 2);
    }
    Row row;
    row["Caption"] = caption;
    row["CSDVersion"] = readLine(path("proc/sys/kernel/osrelease"));
    row["CSName"] = readLine(path("proc/sys/kernel/hostname"));
    rows.push_back(std::move(row));
    return true;
}

bool ZYRHardwareQuerySource::physicalMemory(std::vector<Row>& rows) const {
    std::string dmi;
    if (readText(path("sys/firmware/dmi/tables/DMI"), dmi)) {
        const auto byte = [&](std::size_t at) { return static_cast<unsigned char>(dmi[at]); };
        const auto word = [&](std::size_t at) { return byte(at) | (byte(at + 1) << 8); };
        const auto dword = [&](std::size_t at) {
            return static_cast<std::uint32_t>(word(at)) |
                   (static_cast<std::uint32_t>(word(at + 2)) << 16);
        };
        std::size_t at = 0;
        while (at + 4 <= dmi.size()) {
            const unsigned type = byte(at);
            const std::size_t length = byte(at + 1);
            if (length < 4 || at + length > dmi.size())
                break;
            if (type == 17 && length >= 0x17) {
                const unsigned size = word(at + 0x0C);
                unsigned long long bytes = 0;
                if (size == 0x7FFF && length >= 0x20)
                    bytes = static_cast<unsigned long long>(dword(at + 0x1C) & 0x7FFFFFFF) << 20;
                else if (size != 0xFFFF)
                    bytes = (size & 0x8000) ? static_cast<unsigned long long>(size & 0x7FFF) << 10
                                            : static_cast<unsigned long long>(size) << 20;
                if (bytes != 0) { // an empty slot
                    Row row;
                    row["Capacity"] = std::to_string(bytes);
                    row["Speed"] = std::to_string(word(at + 0x15));
                    rows.push_back(std::move(row));
                }
            }
            if (type == 127)
                break;
            // The strings after the formatted part end with two zero bytes.
            std::size_t next = at + length;
            while (next + 1 < dmi.size() && (dmi[next] != 0 || dmi[next + 1] != 0))
                ++next;
            at = next + 2;
        }
        if (!rows.empty())
            return true;
    }
    std::string meminfo;
    unsigned long long total = 0;
    if (!readText(path("proc/meminfo"), meminfo) || !meminfoBytes(meminfo, "MemTotal", total))
        return false;
    Row row;
    row["Capacity"] = std::to_string(total);
    row["Speed"] = "0";
    rows.push_back(std::move(row));
    return true;
}

bool ZYRHardwareQuerySource::diskDrives(std::vector<Row>& rows) const {
    const fs::path blockDir = path("sys/block");
    std::error_code ec;
    std::vector<std::string> names;
    for (fs::directory_iterator it(blockDir, ec), end; !ec && it != end; it.increment(ec))
        names.push_back(it->path().filename().string());
    if (ec)
        return false;
    std::sort(names.begin(), names.end());
    for (const std::string& name : names) {
        if (name.rfind("loop", 0) == 0 || name.rfind("ram", 0) == 0 || name.rfind("zram", 0) == 0)
            continue;
        const std::string dir = path("sys/block/" + name) + "/";
        // Mapped and software-RAID devices have no device of their own.
        if (!fs::exists(dir + "device", ec))
            continue;
        const bool optical = name.rfind("sr", 0) == 0 || readLine(dir + "device/type") == "5";
        const bool removable = readLine(dir + "removable") == "1";
        Row row;
        row["MediaType"] = optical     ? "CD-ROM"
                           : removable ? "Removable Media"
                                       : "Fixed hard disk media";
        const std::string where = fs::weakly_canonical(dir, ec).string();
        row["InterfaceType"] = where.find("/usb") != std::string::npos ? "USB"
                               : name.rfind("nvme", 0) == 0            ? "NVMe"
                               : name.rfind("hd", 0) == 0              ? "IDE"
                               : name.rfind("mmcblk", 0) == 0          ? "SD"
                                                                       : "SCSI";
        row["Model"] = readLine(dir + "device/model");
        row["Size"] = std::to_string(toNumber(readLine(dir + "size")) * 512);
        rows.push_back(std::move(row));
    }
    return true;
}

bool ZYRHardwareQuerySource::memoryPerformance(std::vector<Row>& rows) const {
    std::string text;
    unsigned long long limit = 0;
    unsigned long long committed = 0;
    if (!readText(path("proc/meminfo"), text) || !meminfoBytes(text, "CommitLimit", limit) ||
        !meminfoBytes(text, "Committed_AS", committed))
        return false;
    Row row;
    row["CommitLimit"] = std::to_string(limit);
    row["CommittedBytes"] = std::to_string(committed);
    row["PercentCommittedBytesInUse"] = std::to_string(limit ? committed * 100 / limit : 0);
    rows.push_back(std::move(row));
    return true;
}

bool ZYRHardwareQuerySource::processorPerformance(std::vector<Row>& rows) const {
    std::string text;
    if (!readText(path("proc/stat"), text))
        return false;
    const std::vector<CpuTimes> before = statSample(text);
    if (betweenSamples_)
        betweenSamples_();
    if (!readText(path("proc/stat"), text))
        return false;
    const std::vector<CpuTimes> after = statSample(text);
    for (const CpuTimes& now : after) {
        const auto then = std::find_if(before.begin(), before.end(),
                                       [&](const CpuTimes& t) { return t.name == now.name; });
        unsigned long long percent = 0;
        if (then != before.end() && now.total > then->total && now.busy >= then->busy)
            percent = (now.busy - then->busy) * 100 / (now.total - then->total);
        Row row;
        row["Name"] = now.name == "cpu" ? "_Total" : now.name.substr(3);
        row["PercentProcessorTime"] = std::to_string(std::min(percent, 100ull));
        rows.push_back(std::move(row));
    }
    return !rows.empty();
}

} // namespace ZYRStd
