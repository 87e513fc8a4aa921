#include <gtest/gtest.h>

#include <cstring>
#include <filesystem>

#include "TestSupport.h"
#include "zyr/std/instrument/IHardwareInfo.h"
#include "zyr/std/instrument/ZYRHardwareQuerySource.h"

using namespace ZYRStd;

namespace {

namespace fs = std::filesystem;

template <std::size_t N> void setText(char16_t (&field)[N], const std::u16string& text) {
    std::memcpy(field, text.data(), std::min(text.size(), N) * sizeof(char16_t));
}

void put(const std::string& root, const std::string& relative, const std::string& bytes) {
    const fs::path path = fs::path(root) / relative;
    fs::create_directories(path.parent_path());
    zyrtest::writeFile(path.string(), bytes);
}

void disk(const std::string& root, const std::string& dir, const std::string& model,
          unsigned long long sectors, const char* removable = "0", const char* type = "0") {
    put(root, dir + "/device/model", model + "\n");
    put(root, dir + "/device/type", std::string(type) + "\n");
    put(root, dir + "/size", std::to_string(sectors) + "\n");
    put(root, dir + "/removable", std::string(removable) + "\n");
}

// A memory device of SMBIOS 2.7 (0x28 bytes), or of 2.1 (0x17 bytes, without the extended size).
std::string memoryDevice(unsigned sizeWord, unsigned speed, unsigned extendedMB = 0,
                         char length = 0x28) {
    std::string entry(length, '\0');
    entry[0] = 17;
    entry[1] = length;
    entry[0x10] = 1;
    for (const auto& [at, value] : {std::pair{0x0C, sizeWord}, {0x15, speed}, {0x1C, extendedMB}}) {
        if (at + 1 >= length)
            break;
        entry[at] = static_cast<char>(value & 0xFF);
        entry[at + 1] = static_cast<char>(value >> 8);
    }
    return entry + std::string("DIMM A\0\0", 8);
}

std::string dmiTable() {
    return std::string("\4\10\0\0\0\0\0\0\0\0\1\4\0\0\0\0", 16) + memoryDevice(8192, 3200) +
           memoryDevice(0, 0) + memoryDevice(0x7FFF, 2666, 32768) + memoryDevice(0x8000 | 512, 0) +
           memoryDevice(1024, 1600, 0, 0x17) + std::string("\177\4\0\0\0\0", 6);
}

void buildMachine(const std::string& root) {
    static const char* const kCacheFiles[] = {"level", "type", "size", "shared_cpu_list"};
    std::string cpuinfo;
    for (int cpu = 0; cpu < 4; ++cpu) {
        cpuinfo += "processor\t: " + std::to_string(cpu) +
                   "\nvendor_id\t: GenuineIntel\ncpu family\t: 6\nmodel\t\t: 158\nmodel name\t: "
                   "Intel(R) Xeon(R) CPU E3-1505M v6 @ 3.00GHz  \nstepping\t: 9\ncpu MHz\t\t: "
                   "2999.998\nphysical id\t: " +
                   std::to_string(cpu / 2) + "\nsiblings\t: 2\ncpu cores\t: 2\n\n";
        const std::string dir = "sys/devices/system/cpu/cpu" + std::to_string(cpu) + "/cache/index";
        const std::string own = std::to_string(cpu), pair = cpu < 2 ? "0-1" : "2-3";
        const std::string indexes[][4] = {{"1", "Data", "32K", own},
                                          {"1", "Instruction", "32K", own},
                                          {"2", "Unified", cpu < 2 ? "256K" : "262144", own},
                                          {"3", "Unified", "8M", pair}};
        for (int i = 0; i < 4; ++i)
            for (int f = 0; f < 4; ++f)
                put(root, dir + std::to_string(i) + "/" + kCacheFiles[f], indexes[i][f] + "\n");
    }
    put(root, "proc/cpuinfo", cpuinfo);
    for (const auto& [path, text] :
         {std::pair{"proc/sys/kernel/arch", "x86_64"},
          {"proc/sys/kernel/osrelease", "6.1.0-13-amd64"},
          {"proc/sys/kernel/hostname", "printhost"},
          {"sys/devices/system/cpu/cpu0/cpufreq/scaling_cur_freq", "1200000"},
          {"sys/devices/system/cpu/cpu0/cpufreq/cpuinfo_max_freq", "4000000"}})
        put(root, path, std::string(text) + "\n");
    put(root, "etc/os-release", "NAME=\"Debian\"\nPRETTY_NAME=\"Debian GNU/Linux 12\"\nID=x\n");
    put(root, "proc/meminfo",
        "MemTotal:       16303520 kB\nMemFree:         1000000 kB\n"
        "CommitLimit:    12345678 kB\nCommitted_AS:    4115226 kB\n");
    put(root, "sys/firmware/dmi/tables/DMI", dmiTable());
    put(root, "proc/stat",
        "cpu  100 0 100 800 0 0 0 0 0 0\ncpu0 50 0 50 400 0 0 0 0 0 0\n"
        "cpu1 50 0 50 400 0 0 0 0 0 0\nintr 1 2 3\n");
    for (const auto& [name, model, sectors] : {std::tuple{"sda", "Samsung SSD 860", 1953525168ull},
                                               {"nvme0n1", "WDC PC SN730", 1000215216ull},
                                               {"hda", "Old IDE", 2097152ull},
                                               {"mmcblk0", "SD card", 2097152ull}})
        disk(root, std::string("sys/block/") + name, model, sectors);
    disk(root, "sys/devices/pci0/usb2/sdc", "USB Disk", 4194304);
    fs::create_directory_symlink(root + "/sys/devices/pci0/usb2/sdc", root + "/sys/block/sdc");
    for (const char* name : {"loop0", "ram0", "zram0"})
        disk(root, std::string("sys/block/") + name, name, 100);
    disk(root, "sys/block/sr0", "DVD-RAM UJ8E2", 2097151, "1", "5");
    disk(root, "sys/block/sdb", "USB Stick", 60555264, "1");
    put(root, "sys/block/dm-0/size", "100\n"); // mapped: no device of its own
}

std::wstring printAll(IHardwareInfo& info, const HardwareInfoRec* rec, const PerformanceRec* perf) {
    std::wostringstream out;
    info.printMemoryInfo(rec, out);
    const int processors = info.printProcessorAndOSInfo(rec, out);
    info.printDiskInfo(rec, out);
    info.printMemoryPerformance(perf, out);
    info.printCPUPerformance(perf, out);
    return out.str() + L"|" + std::to_wstring(processors);
}

std::unique_ptr<IHardwareInfo> infoFor(const std::string& root = "/") {
    std::unique_ptr<IHardwareInfo> info(createHardwareInfo(root.c_str()));
    EXPECT_NE(info, nullptr);
    return info;
}

TEST(IHardwareInfoTest, ReportsPrintTheirExactTexts) {
    const auto info = infoFor();
    EXPECT_EQ(printAll(*info, nullptr, nullptr), L"|0");
    const auto rec = std::make_unique<HardwareInfoRec>();
    auto perf = std::make_unique<PerformanceRec>();
    EXPECT_EQ(printAll(*info, rec.get(), perf.get()),
              L"\tOperating System \n\t\tCaption: \n\t\tCSDVersion: \n\tMemory Performance\n"
              L"\t\tMEM: 0 bytes of0 bytes = 0 % in use\n\tCPU Performance\n\t\tCPU: 0% busy\n|0");

    rec->numberOfMemoryModules = 2;
    rec->memory[0] = {8589934592ull, 3200, 0};
    rec->memory[1] = {1048575ull, 0, 0}; // below 1 MB: truncated to 0
    rec->numberOfDisks = 1;
    setText(rec->disks[0].interfaceType, u"SCSI");
    setText(rec->disks[0].model, u"Samsung SSD 860");
    rec->disks[0].size = 1000204886016ull; // 931.5 GB
    setText(rec->osCaption, u"Debian 12");
    setText(rec->osServicePack, u"6.1.0");
    rec->numberOfProcessors = 1;
    HardwareProcessorEntry& cpu = rec->processors[0];
    cpu = {{}, 1200, 100, 512, 0, 8192, 0, {}, 4000, {}, 4, 8, {}};
    setText(cpu.caption, u"\U0001F600 Family 6");
    setText(cpu.manufacturer, u"GenuineIntel");
    setText(cpu.name, u"Xeon \u00e9 \U0001F600\U0010FFFF\U00010000");
    *perf = {37, {12, 100}, {}, 12641974272ull, 4214091776ull, 33, {}, 2, 0};
    EXPECT_EQ(printAll(*info, rec.get(), perf.get()),
              L"\tMemory 1\n\t\tCapacity: 8192 MB\n\t\tSpeed: 3200 MHz\n"
              L"\tMemory 2\n\t\tCapacity: 0 MB\n\t\tSpeed: 0 MHz\n"
              L"\tOperating System \n\t\tCaption: Debian 12\n\t\tCSDVersion: 6.1.0\n"
              L"\tProcessor 1\n\t\tCaption: \U0001F600 Family 6\n"
              L"\t\tCurrentClockSpeed: 1200 Mhz\n\t\tExtClock: 100 MHz\n"
              L"\t\tL2CacheSize: 512 KB\n\t\tL3CacheSize: 8192 KB\n"
              L"\t\tManufacturer: GenuineIntel\n\t\tMaxClockSpeed: 4000 MHz\n"
              L"\t\tName: Xeon \u00e9 \U0001F600\U0010FFFF\U00010000\n\t\tNumberOfCores: 4\n"
              L"\t\tNumberOfLogicalProcessors: 8\n"
              L"\tDisk 1\n\t\tInterfaceType: SCSI\n\t\tModel: Samsung SSD 860\n\t\tSize: 931 GB\n"
              L"\tMemory Performance\n"
              L"\t\tMEM: 4214091776 bytes of12641974272 bytes = 33 % in use\n"
              L"\tCPU Performance\n\t\tCPU: 37% busy\n\t\tCore 1 : 12 % busy\n"
              L"\t\tCore 2 : 100 % busy\n|1");

    rec->numberOfMemoryModules = rec->numberOfProcessors = rec->numberOfDisks = 1000;
    perf->numberOfCores = 100000;
    const std::wstring over = printAll(*info, rec.get(), perf.get());
    EXPECT_EQ(over.substr(over.size() - 2), L"|8");
    for (const wchar_t* last : {L"\tMemory 16\n", L"\tDisk 6\n", L"\t\tCore 128 : 0 % busy\n"})
        EXPECT_NE(over.find(last), std::wstring::npos) << last;
    for (const wchar_t* past : {L"\tMemory 17\n", L"\tDisk 7\n", L"\t\tCore 129 "})
        EXPECT_EQ(over.find(past), std::wstring::npos) << past;
}

TEST(IHardwareInfoTest, QueriesReadTheTree) {
    const zyrtest::TempDir root;
    buildMachine(root.path());
    const auto info = infoFor(root.path());
    const auto rec = std::make_unique<HardwareInfoRec>();
    std::memset(rec.get(), 0xAB, sizeof *rec); // every query zero-fills the record first
    ASSERT_TRUE(info->getProcessorAndOSInfo(rec.get()));
    EXPECT_TRUE(rec->reserved1[0] == 0 && rec->numberOfDisks == 0 &&
                std::u16string(rec->computerName) == u"printhost");
    std::wstring processor = L"\tProcessor 1\n\t\tCaption: x86_64 Family 6 Model 158 Stepping 9\n"
                             L"\t\tCurrentClockSpeed: 1200 Mhz\n\t\tExtClock: 0 MHz\n"
                             L"\t\tL2CacheSize: 512 KB\n\t\tL3CacheSize: 8192 KB\n"
                             L"\t\tManufacturer: GenuineIntel\n\t\tMaxClockSpeed: 4000 MHz\n"
                             L"\t\tName: Intel(R) Xeon(R) CPU E3-1505M v6 @ 3.00GHz\n"
                             L"\t\tNumberOfCores: 2\n\t\tNumberOfLogicalProcessors: 2\n";
    std::wstring second = processor;
    second.replace(second.find(L"1200"), 4, L"2999").replace(second.find(L"4000"), 4, L"2999");
    second[11] = L'2';
    std::wostringstream out;
    EXPECT_EQ(info->printProcessorAndOSInfo(rec.get(), out), 2);
    EXPECT_EQ(out.str(), L"\tOperating System \n\t\tCaption: Debian GNU/Linux 12\n"
                         L"\t\tCSDVersion: 6.1.0-13-amd64\n" +
                             processor + second);

    ASSERT_TRUE(info->getMemoryInfo(rec.get()));
    ASSERT_EQ(rec->numberOfMemoryModules, 4u);
    EXPECT_TRUE(rec->memory[0].capacity == 8192ull << 20 && rec->memory[0].speed == 3200 &&
                rec->memory[1].capacity == 32768ull << 20 && rec->memory[1].speed == 2666 &&
                rec->memory[2].capacity == 512ull << 10 && rec->memory[3].speed == 1600);

    ASSERT_TRUE(info->getDiskInfo(rec.get()));
    std::wostringstream disks;
    info->printDiskInfo(rec.get(), disks);
    const std::wstring five =
        L"\tDisk 1\n\t\tInterfaceType: IDE\n\t\tModel: Old IDE\n\t\tSize: 1 GB\n"
        L"\tDisk 2\n\t\tInterfaceType: SD\n\t\tModel: SD card\n\t\tSize: 1 GB\n"
        L"\tDisk 3\n\t\tInterfaceType: NVMe\n\t\tModel: WDC PC SN730\n"
        L"\t\tSize: 476 GB\n\tDisk 4\n\t\tInterfaceType: SCSI\n"
        L"\t\tModel: Samsung SSD 860\n\t\tSize: 931 GB\n"
        L"\tDisk 5\n\t\tInterfaceType: USB\n\t\tModel: USB Disk\n\t\tSize: 2 GB\n";
    EXPECT_EQ(disks.str(), five);
    EXPECT_EQ(rec->disks[2].size, 1000215216ull * 512);
    for (const char* name : {"vda", "vdb"})
        disk(root.path(), std::string("sys/block/") + name, "Virtual disk", 2097152);
    ASSERT_TRUE(info->getDiskInfo(rec.get()));
    EXPECT_TRUE(rec->numberOfDisks == 6 && std::u16string(rec->disks[5].model) == u"Virtual disk");
}

TEST(IHardwareInfoTest, FallbacksCutsAndFailures) {
    const zyrtest::TempDir root;
    buildMachine(root.path());
    const auto info = infoFor(root.path());
    const auto rec = std::make_unique<HardwareInfoRec>();
    const struct {
        std::string vendor;
        std::u16string manufacturer;
    } vendors[] = {
        {"Caf\xc3\xa9 \xf0\x9f\x98\x80 Chips Incorporated", u"Caf\u00e9 \U0001F600 Chips Incor"},
        {"123456789012345678\xf0\x9f\x98\x80", u"123456789012345678"},
        {"a\xff\xc3(\xe2\x82", u"a\uFFFD\uFFFD(\uFFFD\uFFFD"},
        {"\xed\x9f\xbf\xed\xa0\x80\xed\xbf\xbf\xee\x80\x80\xf4\x8f\xbf\xbf\xf4\x90\x80\x80",
         u"\uD7FF\uFFFD\uFFFD\uFFFD\uFFFD\uFFFD\uFFFD\uE000\U0010FFFF\uFFFD\uFFFD\uFFFD\uFFFD"}};
    for (const auto& v : vendors) {
        put(root.path(), "proc/cpuinfo",
            "processor\t: 0\nvendor_id\t: " + v.vendor +
                "\nmodel name\t: " + std::string(100, 'x') + "\n");
        ASSERT_TRUE(info->getProcessorAndOSInfo(rec.get()));
        EXPECT_EQ(std::u16string(rec->processors[0].manufacturer), v.manufacturer);
        EXPECT_TRUE(std::u16string(rec->processors[0].name) == std::u16string(59, u'x') &&
                    rec->processors[0].numberOfCores == 1u);
    }

    put(root.path(), "sys/firmware/dmi/tables/DMI", dmiTable().substr(0, 70));
    ASSERT_TRUE(info->getMemoryInfo(rec.get()));
    EXPECT_TRUE(rec->numberOfMemoryModules == 1 && rec->memory[0].capacity == 8192ull << 20);
    fs::remove_all(root.path() + "/sys/firmware");
    ASSERT_TRUE(info->getMemoryInfo(rec.get()));
    EXPECT_TRUE(rec->numberOfMemoryModules == 1 && rec->memory[0].capacity == 16303520ull * 1024 &&
                rec->memory[0].speed == 0);

    fs::remove_all(root.path() + "/etc");
    EXPECT_TRUE(!info->getProcessorAndOSInfo(rec.get()) && rec->numberOfProcessors == 1u);
    put(root.path(), "usr/lib/os-release", "PRETTY_NAME=Plain\n");
    ASSERT_TRUE(info->getProcessorAndOSInfo(rec.get()));
    EXPECT_EQ(std::u16string(rec->osCaption), u"Plain");

    const zyrtest::TempDir nothing;
    const auto none = infoFor(nothing.path());
    auto perf = std::make_unique<PerformanceRec>();
    EXPECT_FALSE(none->getProcessorAndOSInfo(rec.get()) || none->getDiskInfo(rec.get()) ||
                 none->getMemoryInfo(rec.get()) || none->getMemoryPerformance(perf.get()) ||
                 none->getCPUPerformance(perf.get()));
    EXPECT_FALSE(info->getMemoryInfo(nullptr) || info->getProcessorAndOSInfo(nullptr) ||
                 info->getDiskInfo(nullptr) || info->getMemoryPerformance(nullptr) ||
                 info->getCPUPerformance(nullptr));
    zyrtest::FailingHost host;
    host.failAll = true;
    ZYRStd::tZYRMemMgr record = host.record();
    zyrtest::installFront(0, &record);
    const std::unique_ptr<IHardwareInfo> failed(createHardwareInfo());
    zyrtest::installFront(0);
    EXPECT_TRUE(failed == nullptr && host.calls > 0);
}

TEST(IHardwareInfoTest, PerformanceFromMeminfoAndTwoStatSamples) {
    const zyrtest::TempDir root;
    buildMachine(root.path());
    ZYRHardwareQuerySource source(root.path() + "//");
    source.setBetweenSamples([&] {
        put(root.path(), "proc/stat",
            "cpu  220 0 100 860 20 0 0 0 0 0\n"
            "cpu0 80 0 50 470 0 0 0 0 0 0\ncpu1 140 0 50 390 20 0 0 0 0 0\n");
    });
    std::vector<ZYRHardwareQuerySource::Row> rows;
    const auto text = [&] {
        std::string out;
        for (const auto& row : rows)
            for (const auto& [key, value] : row)
                out += key + "=" + value + " ";
        return out;
    };
    ASSERT_TRUE(source.run("SELECT * FROM Win32_PerfFormattedData_PerfOS_Processor", rows));
    EXPECT_EQ(text(), "Name=_Total PercentProcessorTime=60 Name=0 PercentProcessorTime=30 "
                      "Name=1 PercentProcessorTime=90 ");
    ASSERT_TRUE(source.run("SELECT * FROM Win32_PerfFormattedData_PerfOS_Memory", rows));
    EXPECT_EQ(text(), "CommitLimit=12641974272 CommittedBytes=4213991424 "
                      "PercentCommittedBytesInUse=33 ");
    EXPECT_FALSE(source.run("SELECT * FROM Win32_BIOS", rows) ||
                 source.run("SELECT Name FROM Win32_Processor", rows) || !rows.empty());

    const auto info = infoFor(root.path());
    auto perf = std::make_unique<PerformanceRec>();
    std::memset(perf.get(), 0xAB, sizeof *perf);
    ASSERT_TRUE(info->getCPUPerformance(perf.get()));
    EXPECT_TRUE(perf->numberOfCores == 2 && perf->totalProcessorUse == 0 && perf->commitLimit == 0);
    ASSERT_TRUE(info->getMemoryPerformance(perf.get()));
    EXPECT_EQ(perf->numberOfCores, 0u) << "the second query zero-filled the first one's data";
    EXPECT_TRUE(perf->commitLimit == 12641974272ull && perf->committedBytes == 4213991424ull &&
                perf->percentCommittedBytesInUse == 33);
}

} // namespace
