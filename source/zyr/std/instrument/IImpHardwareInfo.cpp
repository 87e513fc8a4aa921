// IHardwareInfo over the Linux query source: queries fill the caller's records, prints write
// them as indented lines.
#include "zyr/std/instrument/IHardwareInfo.h"

#include <algorithm>
#include <cstring>
#include <memory>
#include <new>
#include <ostream>
#include <string>
#include <vector>

#include "zyr/std/core/CZYRClientBase.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/instrument/ZYRHardwareQuerySource.h"

namespace ZYRStd {

IHardwareInfo::~IHardwareInfo() = default;

namespace {

using Row = ZYRHardwareQuerySource::Row;

std::string property(const Row& row, const char* name) {
    const auto it = row.find(name);
    return it == row.end() ? std::string() : it->second;
}

// Properties given as text are read as 64-bit decimal numbers.
unsigned long long number(const Row& row, const char* name) {
    const std::string text = property(row, name);
    unsigned long long value = 0;
    for (char c : text) {
        if (c < '0' || c > '9')
            break;
        value = value * 10 + static_cast<unsigned>(c - '0');
    }
    return value;
}

std::uint32_t number32(const Row& row, const char* name) {
    return static_cast<std::uint32_t>(number(row, name));
}

// UTF-8 into a field of N code units, cut to fit with a terminating zero and never between
// the halves of a surrogate pair.
template <std::size_t N> void copyText(char16_t (&field)[N], const std::string& utf8) {
    std::size_t out = 0;
    std::size_t i = 0;
    while (i < utf8.size()) {
        const unsigned char lead = static_cast<unsigned char>(utf8[i]);
        char32_t c = 0xFFFD;
        std::size_t length = 1;
        if (lead < 0x80) {
            c = lead;
        } else if ((lead >> 5) == 6 || (lead >> 4) == 14 || (lead >> 3) == 30) {
            length = (lead >> 5) == 6 ? 2 : (lead >> 4) == 14 ? 3 : 4;
            c = lead & (0x3F >> (length - 1));
            bool valid = i + length <= utf8.size();
            for (std::size_t k = 1; valid && k < length; ++k) {
                const unsigned char next = static_cast<unsigned char>(utf8[i + k]);
                valid = (next & 0xC0) == 0x80;
                c = (c << 6) | (next & 0x3F);
            }
            if (!valid || c > 0x10FFFF || (c >= 0xD800 && c <= 0xDFFF)) {
                c = 0xFFFD;
                length = 1;
            }
        }
        i += length;
        const std::size_t units = c >= 0x10000 ? 2 : 1;
        if (out + units > N - 1)
            break;
        if (units == 2) {
            field[out++] = static_cast<char16_t>(0xD800 + ((c - 0x10000) >> 10));
            field[out++] = static_cast<char16_t>(0xDC00 + ((c - 0x10000) & 0x3FF));
        } else {
            field[out++] = static_cast<char16_t>(c);
        }
    }
    field[out] = 0;
}

// A 16-bit text field for a wide stream: up to its first zero, surrogate pairs joined.
template <std::size_t N> std::wstring wide(const char16_t (&field)[N]) {
    std::wstring out;
    for (std::size_t i = 0; i < N && field[i] != 0; ++i) {
        const char16_t unit = field[i];
        if (unit >= 0xD800 && unit <= 0xDBFF && i + 1 < N && field[i + 1] >= 0xDC00 &&
            field[i + 1] <= 0xDFFF) {
            out +=
                static_cast<wchar_t>(0x10000 + ((unit - 0xD800) << 10) + (field[i + 1] - 0xDC00));
            ++i;
        } else {
            out += static_cast<wchar_t>(unit);
        }
    }
    return out;
}

// Its storage comes from the allocation front and counts against the memory limit.
class IImpHardwareInfo final : public IHardwareInfo, public CZYRClientBase {
public:
    explicit IImpHardwareInfo(const char* root) : source_(root ? root : "/") {}

    bool getMemoryInfo(HardwareInfoRec* rec) override {
        if (!rec)
            return false;
        std::memset(rec, 0, sizeof *rec);
        std::vector<Row> rows;
        if (!source_.run("SELECT * FROM Win32_PhysicalMemory", rows))
            return false;
        for (const Row& row : rows) {
            if (rec->numberOfMemoryModules >= kMaxHardwareMemoryModules)
                break;
            HardwareMemoryEntry& entry = rec->memory[rec->numberOfMemoryModules++];
            entry.capacity = number(row, "Capacity");
            entry.speed = number32(row, "Speed");
        }
        return true;
    }

    bool getProcessorAndOSInfo(HardwareInfoRec* rec) override {
        if (!rec)
            return false;
        std::memset(rec, 0, sizeof *rec);
        std::vector<Row> rows;
        if (!source_.run("SELECT * FROM Win32_Processor", rows))
            return false;
        for (const Row& row : rows) {
            if (rec->numberOfProcessors >= kMaxHardwareProcessors)
                break;
            HardwareProcessorEntry& cpu = rec->processors[rec->numberOfProcessors++];
            copyText(cpu.caption, property(row, "Caption"));
            cpu.currentClockSpeed = number32(row, "CurrentClockSpeed");
            cpu.extClock = number32(row, "ExtClock");
            cpu.l2CacheSize = number32(row, "L2CacheSize");
            cpu.l2CacheSpeed = number32(row, "L2CacheSpeed");
            cpu.l3CacheSize = number32(row, "L3CacheSize");
            cpu.l3CacheSpeed = number32(row, "L3CacheSpeed");
            copyText(cpu.manufacturer, property(row, "Manufacturer"));
            cpu.maxClockSpeed = number32(row, "MaxClockSpeed");
            copyText(cpu.name, property(row, "Name"));
            cpu.numberOfCores = number32(row, "NumberOfCores");
            cpu.numberOfLogicalProcessors = number32(row, "NumberOfLogicalProcessors");
        }
        if (!source_.run("SELECT * FROM Win32_OperatingSystem", rows))
            return false;
        if (!rows.empty()) {
            copyText(rec->osCaption, property(rows.front(), "Caption"));
            copyText(rec->osServicePack, property(rows.front(), "CSDVersion"));
            copyText(rec->computerName, property(rows.front(), "CSName"));
        }
        return true;
    }

    bool getDiskInfo(HardwareInfoRec* rec) override {
        if (!rec)
            return false;
        std::memset(rec, 0, sizeof *rec);
        std::vector<Row> rows;
        if (!source_.run("SELECT * FROM Win32_DiskDrive", rows))
            return false;
        for (const Row& row : rows) {
            if (rec->numberOfDisks >= kMaxHardwareDisks)
                break;
            if (property(row, "MediaType").substr(0, 24).find("hard disk") == std::string::npos)
                continue;
            HardwareDiskEntry& disk = rec->disks[rec->numberOfDisks++];
            copyText(disk.interfaceType, property(row, "InterfaceType"));
            copyText(disk.model, property(row, "Model"));
            disk.size = number(row, "Size");
        }
        return true;
    }

    bool getMemoryPerformance(PerformanceRec* rec) override {
        if (!rec)
            return false;
        std::memset(rec, 0, sizeof *rec);
        std::vector<Row> rows;
        if (!source_.run("SELECT * FROM Win32_PerfFormattedData_PerfOS_Memory", rows))
            return false;
        if (!rows.empty()) {
            rec->commitLimit = number(rows.front(), "CommitLimit");
            rec->committedBytes = number(rows.front(), "CommittedBytes");
            rec->percentCommittedBytesInUse = number32(rows.front(), "PercentCommittedBytesInUse");
        }
        return true;
    }

    bool getCPUPerformance(PerformanceRec* rec) override {
        if (!rec)
            return false;
        std::memset(rec, 0, sizeof *rec);
        std::vector<Row> rows;
        if (!source_.run("SELECT * FROM Win32_PerfFormattedData_PerfOS_Processor", rows))
            return false;
        for (const Row& row : rows) {
            const unsigned long long percent = number(row, "PercentProcessorTime");
            if (property(row, "Name") == "_Total")
                rec->totalProcessorUse = percent;
            else if (rec->numberOfCores < kMaxPerformanceCores)
                rec->coreProcessorUse[rec->numberOfCores++] = percent;
        }
        return true;
    }

    void printMemoryInfo(const HardwareInfoRec* rec, std::wostream& out) override {
        if (!rec)
            return;
        const unsigned int count = std::min(rec->numberOfMemoryModules, kMaxHardwareMemoryModules);
        for (unsigned int i = 0; i < count; ++i) {
            const HardwareMemoryEntry& entry = rec->memory[i];
            out << L"\tMemory " << i + 1 << std::endl;
            out << L"\t\tCapacity: " << entry.capacity / 1024 / 1024 << L" MB" << std::endl;
            out << L"\t\tSpeed: " << entry.speed << L" MHz" << std::endl;
        }
    }

    int printProcessorAndOSInfo(const HardwareInfoRec* rec, std::wostream& out) override {
        if (!rec)
            return 0;
        out << L"\tOperating System \n";
        out << L"\t\tCaption: " << wide(rec->osCaption) << std::endl;
        out << L"\t\tCSDVersion: " << wide(rec->osServicePack) << std::endl;
        const unsigned int count = std::min(rec->numberOfProcessors, kMaxHardwareProcessors);
        for (unsigned int i = 0; i < count; ++i) {
            const HardwareProcessorEntry& cpu = rec->processors[i];
            out << L"\tProcessor " << i + 1 << std::endl;
            out << L"\t\tCaption: " << wide(cpu.caption) << std::endl;
            out << L"\t\tCurrentClockSpeed: " << cpu.currentClockSpeed << L" Mhz" << std::endl;
            out << L"\t\tExtClock: " << cpu.extClock << L" MHz" << std::endl;
            out << L"\t\tL2CacheSize: " << cpu.l2CacheSize << L" KB" << std::endl;
            out << L"\t\tL3CacheSize: " << cpu.l3CacheSize << L" KB" << std::endl;
            out << L"\t\tManufacturer: " << wide(cpu.manufacturer) << std::endl;
            out << L"\t\tMaxClockSpeed: " << cpu.maxClockSpeed << L" MHz" << std::endl;
            out << L"\t\tName: " << wide(cpu.name) << std::endl;
            out << L"\t\tNumberOfCores: " << cpu.numberOfCores << std::endl;
            out << L"\t\tNumberOfLogicalProcessors: " << cpu.numberOfLogicalProcessors << std::endl;
        }
        return static_cast<int>(count);
    }

    void printDiskInfo(const HardwareInfoRec* rec, std::wostream& out) override {
        if (!rec)
            return;
        const unsigned int count = std::min(rec->numberOfDisks, kMaxHardwareDisks);
        for (unsigned int i = 0; i < count; ++i) {
            const HardwareDiskEntry& disk = rec->disks[i];
            out << L"\tDisk " << i + 1 << std::endl;
            out << L"\t\tInterfaceType: " << wide(disk.interfaceType) << std::endl;
            out << L"\t\tModel: " << wide(disk.model) << std::endl;
            out << L"\t\tSize: " << disk.size / 1024 / 1024 / 1024 << L" GB" << std::endl;
        }
    }

    void printMemoryPerformance(const PerformanceRec* rec, std::wostream& out) override {
        if (!rec)
            return;
        out << L"\tMemory Performance" << std::endl;
        out << L"\t\tMEM: " << rec->committedBytes << L" bytes of" << rec->commitLimit
            << L" bytes = " << rec->percentCommittedBytesInUse << L" % in use" << std::endl;
    }

    void printCPUPerformance(const PerformanceRec* rec, std::wostream& out) override {
        if (!rec)
            return;
        out << L"\tCPU Performance" << std::endl;
        out << L"\t\tCPU: " << rec->totalProcessorUse << L"% busy" << std::endl;
        const unsigned int count = std::min(rec->numberOfCores, kMaxPerformanceCores);
        for (unsigned int i = 0; i < count; ++i)
            out << L"\t\tCore " << i + 1 << L" : " << rec->coreProcessorUse[i] << L" % busy"
                << std::endl;
    }

private:
    ZYRHardwareQuerySource source_;
};

} // namespace

IHardwareInfo* createHardwareInfo() {
    return createHardwareInfo("/");
}

IHardwareInfo* createHardwareInfo(const char* systemRoot) {
    try {
        return new IImpHardwareInfo(systemRoot);
    } catch (const CZYRError&) {
        return nullptr; // the front refused the object
    } catch (const std::bad_alloc&) {
        return nullptr; // the root's text could not be copied
    }
}

} // namespace ZYRStd
