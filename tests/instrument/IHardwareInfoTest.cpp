// Hardware information: the records' layouts, the five reports, and the Linux query source
// over a prepared /proc, /sys and /etc tree.
#include <gtest/gtest.h>

#include <cstddef>
#include <cstring>
#include <filesystem>
#include <memory>
#include <sstream>
#include <string>
#include <vector>

#include "TestSupport.h"
#include "zyr/std/instrument/IHardwareInfo.h"
#include "zyr/std/instrument/ZYRHardwareQuerySource.h"

using namespace ZYRStd;

namespace {

namespace fs = std::filesystem;

// The layouts the records share with hosts built against the original ones.
static_assert(sizeof(HardwareInfoRec) == 5920 && sizeof(PerformanceRec) == 2504);
static_assert(offsetof(HardwareInfoRec, processors) + 7 * sizeof(HardwareProcessorEntry) +
                  offsetof(HardwareProcessorEntry, numberOfLogicalProcessors) ==
              3156);
static_assert(offsetof(HardwareInfoRec, memory) + 15 * sizeof(HardwareMemoryEntry) == 4024);
static_assert(offsetof(PerformanceRec, coreProcessorUse) + 127 * 8 == 1024);

template <class T> std::unique_ptr<T> zeroed() {
    auto rec = std::make_unique<T>();
    std::memset(rec.get(), 0, sizeof(T));
    return rec;
}

template <std::size_t N> void setText(char16_t (&field)[N], const std::u16string& text) {
    std::memset(field, 0, sizeof field);
    std::memcpy(field, text.data(), std::min(text.size(), N) * sizeof(char16_t));
}

// A host's view of a small machine under a temporary directory.
class FakeTree {
public:
    void write(const std::string& relative, const std::string& bytes) const {
        const fs::path path = fs::path(dir_.path()) / relative;
        fs::create_directories(path.parent_path());
        zyrtest::writeFile(path.string(), bytes);
    }
    void remove(const std::string& relative) const {
        fs::remove_all(fs::path(dir_.path()) / relative);
    }
    const std::string& root() const { return dir_.path(); }

private:
    zyrtest::TempDir dir_;
};

std::string cpuinfoBlock(int processor, int package, int core) {
    return "processor\t: " + std::to_string(processor) +
           "\nvendor_id\t: GenuineIntel\ncpu family\t: 6\nmodel\t\t: 158\n"
           "model name\t: Intel(R) Xeon(R) CPU E3-1505M v6 @ 3.00GHz\nstepping\t: 9\n"
           "cpu MHz\t\t: 2999.998\ncache size\t: 8192 KB\nphysical id\t: " +
           std::to_string(package) + "\nsiblings\t: 2\ncore id\t\t: " + std::to_string(core) +
           "\ncpu cores\t: 2\nflags\t\t: fpu sse sse2\n\n";
}

void cache(const FakeTree& tree, int cpu, int index, int level, const std::string& type,
           const std::string& size, const std::string& shared) {
    const std::string dir = "sys/devices/system/cpu/cpu" + std::to_string(cpu) + "/cache/index" +
                            std::to_string(index) + "/";
    tree.write(dir + "level", std::to_string(level) + "\n");
    tree.write(dir + "type", type + "\n");
    tree.write(dir + "size", size + "\n");
    tree.write(dir + "shared_cpu_list", shared + "\n");
}

// SMBIOS memory-device entries (type 17) with the sizes given in the size word and, for
// 0x7FFF, the extended size.
std::string memoryDevice(unsigned sizeWord, unsigned speed, unsigned extendedMB = 0) {
    std::string entry(0x28, '\0');
    entry[0] = 17;
    entry[1] = 0x28;
    entry[0x0C] = static_cast<char>(sizeWord & 0xFF);
    entry[0x0D] = static_cast<char>(sizeWord >> 8);
    entry[0x15] = static_cast<char>(speed & 0xFF);
    entry[0x16] = static_cast<char>(speed >> 8);
    for (int i = 0; i < 4; ++i)
        entry[0x1C + i] = static_cast<char>((extendedMB >> (8 * i)) & 0xFF);
    entry[0x10] = 1; // the locator string
    return entry + std::string("DIMM A\0\0", 8);
}

std::string dmiTable() {
    std::string other(8, '\0'); // a type-4 entry without strings
    other[0] = 4;
    other[1] = 8;
    std::string end(4, '\0');
    end[0] = 127;
    end[1] = 4;
    return other + std::string("\0\0", 2) + memoryDevice(8192, 3200) +
           memoryDevice(0, 0) /* empty slot */ + memoryDevice(0x7FFF, 2666, 32768) +
           memoryDevice(0x8000 | 512, 0) + end + std::string("\0\0", 2);
}

void disk(const FakeTree& tree, const std::string& name, const std::string& model,
          unsigned long long sectors, bool removable = false, const std::string& type = "0") {
    const std::string dir = "sys/block/" + name + "/";
    tree.write(dir + "device/model", model + "\n");
    tree.write(dir + "device/type", type + "\n");
    tree.write(dir + "size", std::to_string(sectors) + "\n");
    tree.write(dir + "removable", removable ? "1\n" : "0\n");
}

void buildMachine(const FakeTree& tree) {
    tree.write("proc/cpuinfo", cpuinfoBlock(0, 0, 0) + cpuinfoBlock(1, 0, 1) +
                                   cpuinfoBlock(2, 1, 0) + cpuinfoBlock(3, 1, 1));
    tree.write("proc/sys/kernel/arch", "x86_64\n");
    tree.write("proc/sys/kernel/osrelease", "6.1.0-13-amd64\n");
    tree.write("proc/sys/kernel/hostname", "printhost\n");
    tree.write("sys/devices/system/cpu/cpu0/cpufreq/scaling_cur_freq", "1200000\n");
    tree.write("sys/devices/system/cpu/cpu0/cpufreq/cpuinfo_max_freq", "4000000\n");
    for (int cpu = 0; cpu < 4; ++cpu) {
        const int first = cpu & ~1;
        const std::string pair = std::to_string(first) + "-" + std::to_string(first + 1);
        cache(tree, cpu, 0, 1, "Data", "32K", std::to_string(cpu));
        cache(tree, cpu, 1, 1, "Instruction", "32K", std::to_string(cpu));
        cache(tree, cpu, 2, 2, "Unified", "256K", std::to_string(cpu));
        cache(tree, cpu, 3, 3, "Unified", "8M", pair);
    }
    tree.write("etc/os-release", "NAME=\"Debian GNU/Linux\"\nPRETTY_NAME=\"Debian GNU/Linux 12 "
                                 "(bookworm)\"\nVERSION_ID=\"12\"\n");
    tree.write("proc/meminfo", "MemTotal:       16303520 kB\nMemFree:         1000000 kB\n"
                               "CommitLimit:    12345678 kB\nCommitted_AS:    4115226 kB\n");
    tree.write("sys/firmware/dmi/tables/DMI", dmiTable());
    tree.write("proc/stat", "cpu  100 0 100 800 0 0 0 0 0 0\ncpu0 50 0 50 400 0 0 0 0 0 0\n"
                            "cpu1 50 0 50 400 0 0 0 0 0 0\nintr 1 2 3\n");
    disk(tree, "sda", "Samsung SSD 860", 1953525168);
    disk(tree, "sr0", "DVD-RAM UJ8E2", 2097151, true, "5");
    disk(tree, "sdb", "USB Stick", 60555264, true);
    disk(tree, "nvme0n1", "WDC PC SN730 SDBQNTY-512G-1001", 1000215216);
    tree.write("sys/block/loop0/size", "100\n");
    tree.write("sys/block/zram0/size", "100\n");
    tree.write("sys/block/dm-0/size", "100\n"); // mapped: no device of its own
}

// The five reports of the records, and the processor count the system report returns.
struct Reports {
    std::wstring memory, system, disks, memPerf, cpuPerf;
    int processors;
};

Reports printAll(IHardwareInfo& info, const HardwareInfoRec* rec, const PerformanceRec* perf) {
    std::wostringstream memory, system, disks, memPerf, cpuPerf;
    info.printMemoryInfo(rec, memory);
    const int processors = info.printProcessorAndOSInfo(rec, system);
    info.printDiskInfo(rec, disks);
    info.printMemoryPerformance(perf, memPerf);
    info.printCPUPerformance(perf, cpuPerf);
    return {memory.str(), system.str(), disks.str(), memPerf.str(), cpuPerf.str(), processors};
}

std::unique_ptr<IHardwareInfo> infoFor(const FakeTree& tree) {
    std::unique_ptr<IHardwareInfo> info(createHardwareInfo(tree.root().c_str()));
    EXPECT_NE(info, nullptr);
    return info;
}

TEST(IHardwareInfoTest, ZeroFilledRecordsPrintHeadersOnly) {
    const auto rec = zeroed<HardwareInfoRec>();
    const auto perf = zeroed<PerformanceRec>();
    std::unique_ptr<IHardwareInfo> info(createHardwareInfo());
    ASSERT_NE(info, nullptr);
    const Reports out = printAll(*info, rec.get(), perf.get());
    EXPECT_EQ(out.processors, 0);
    EXPECT_EQ(out.memory, L"");
    EXPECT_EQ(out.system, L"\tOperating System \n\t\tCaption: \n\t\tCSDVersion: \n");
    EXPECT_EQ(out.disks, L"");
    EXPECT_EQ(out.memPerf, L"\tMemory Performance\n\t\tMEM: 0 bytes of0 bytes = 0 % in use\n");
    EXPECT_EQ(out.cpuPerf, L"\tCPU Performance\n\t\tCPU: 0% busy\n");
}

TEST(IHardwareInfoTest, FilledRecordsPrintTheirExactTexts) {
    const auto rec = zeroed<HardwareInfoRec>();
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
    setText(cpu.caption, u"x86_64 Family 6 Model 158 Stepping 9");
    cpu.currentClockSpeed = 1200;
    cpu.extClock = 100;
    cpu.l2CacheSize = 512;
    cpu.l3CacheSize = 8192;
    setText(cpu.manufacturer, u"GenuineIntel");
    cpu.maxClockSpeed = 4000;
    setText(cpu.name, u"Xeon \u00e9 \U0001F600"); // a pair of surrogates reaches the stream whole
    cpu.numberOfCores = 4;
    cpu.numberOfLogicalProcessors = 8;

    auto perf = zeroed<PerformanceRec>();
    perf->totalProcessorUse = 37;
    perf->numberOfCores = 2;
    perf->coreProcessorUse[0] = 12;
    perf->coreProcessorUse[1] = 100;
    perf->commitLimit = 12641974272ull;
    perf->committedBytes = 4214091776ull;
    perf->percentCommittedBytesInUse = 33;

    std::unique_ptr<IHardwareInfo> info(createHardwareInfo());
    const Reports out = printAll(*info, rec.get(), perf.get());
    EXPECT_EQ(out.processors, 1);
    EXPECT_EQ(out.memory, L"\tMemory 1\n\t\tCapacity: 8192 MB\n\t\tSpeed: 3200 MHz\n"
                          L"\tMemory 2\n\t\tCapacity: 0 MB\n\t\tSpeed: 0 MHz\n");
    EXPECT_EQ(out.system, L"\tOperating System \n\t\tCaption: Debian 12\n\t\tCSDVersion: 6.1.0\n"
                          L"\tProcessor 1\n\t\tCaption: x86_64 Family 6 Model 158 Stepping 9\n"
                          L"\t\tCurrentClockSpeed: 1200 Mhz\n\t\tExtClock: 100 MHz\n"
                          L"\t\tL2CacheSize: 512 KB\n\t\tL3CacheSize: 8192 KB\n"
                          L"\t\tManufacturer: GenuineIntel\n\t\tMaxClockSpeed: 4000 MHz\n"
                          L"\t\tName: Xeon \u00e9 \U0001F600\n\t\tNumberOfCores: 4\n"
                          L"\t\tNumberOfLogicalProcessors: 8\n");
    EXPECT_EQ(out.disks, L"\tDisk 1\n\t\tInterfaceType: SCSI\n\t\tModel: Samsung SSD 860\n"
                         L"\t\tSize: 931 GB\n");
    EXPECT_EQ(out.memPerf, L"\tMemory Performance\n\t\tMEM: 4214091776 bytes of12641974272 "
                           L"bytes = 33 % in use\n");
    EXPECT_EQ(out.cpuPerf, L"\tCPU Performance\n\t\tCPU: 37% busy\n\t\tCore 1 : 12 % busy\n"
                           L"\t\tCore 2 : 100 % busy\n");
}

TEST(IHardwareInfoTest, NullRecordsAndOverlargeCounts) {
    std::unique_ptr<IHardwareInfo> info(createHardwareInfo());
    EXPECT_FALSE(info->getMemoryInfo(nullptr));
    EXPECT_FALSE(info->getProcessorAndOSInfo(nullptr));
    EXPECT_FALSE(info->getDiskInfo(nullptr));
    EXPECT_FALSE(info->getMemoryPerformance(nullptr));
    EXPECT_FALSE(info->getCPUPerformance(nullptr));
    const Reports none = printAll(*info, nullptr, nullptr);
    EXPECT_EQ(none.processors, 0);
    EXPECT_EQ(none.memory + none.system + none.disks + none.memPerf + none.cpuPerf, L"");

    // A record filled by someone else never makes the printing read past its entries.
    const auto rec = zeroed<HardwareInfoRec>();
    rec->numberOfMemoryModules = 1000;
    rec->numberOfProcessors = 1000;
    rec->numberOfDisks = 1000;
    auto perf = zeroed<PerformanceRec>();
    perf->numberOfCores = 100000;
    const Reports out = printAll(*info, rec.get(), perf.get());
    EXPECT_EQ(out.processors, 8);
    EXPECT_NE(out.memory.find(L"\tMemory 16\n"), std::wstring::npos);
    EXPECT_EQ(out.memory.find(L"\tMemory 17\n"), std::wstring::npos);
    EXPECT_EQ(out.disks.find(L"\tDisk 7\n"), std::wstring::npos);
    EXPECT_NE(out.cpuPerf.find(L"\t\tCore 128 : 0 % busy\n"), std::wstring::npos);
    EXPECT_EQ(out.cpuPerf.find(L"\t\tCore 129 "), std::wstring::npos);
}

TEST(IHardwareInfoTest, CreateReturnsNullWhenAllocationFails) {
    zyrtest::FailingHost host;
    host.failAll = true;
    ZYRStd::tZYRMemMgr record = host.record();
    zyrtest::installFront(0, &record);
    IHardwareInfo* info = createHardwareInfo();
    const unsigned int calls = host.calls;
    zyrtest::installFront(0);
    EXPECT_EQ(info, nullptr);
    EXPECT_GT(calls, 0u) << "the object was not allocated through the front";
    delete info;
}

TEST(IHardwareInfoTest, ProcessorsAndSystemFromTheTree) {
    FakeTree tree;
    buildMachine(tree);
    auto info = infoFor(tree);
    const auto rec = zeroed<HardwareInfoRec>();
    std::memset(rec.get(), 0xAB, sizeof *rec); // the query zero-fills the record first
    ASSERT_TRUE(info->getProcessorAndOSInfo(rec.get()));
    EXPECT_EQ(rec->reserved1[0], 0);
    EXPECT_EQ(rec->numberOfDisks, 0u);
    ASSERT_EQ(rec->numberOfProcessors, 2u); // one per package
    const HardwareProcessorEntry& first = rec->processors[0];
    EXPECT_EQ(std::u16string(first.caption), u"x86_64 Family 6 Model 158 Stepping 9");
    EXPECT_EQ(std::u16string(first.manufacturer), u"GenuineIntel");
    EXPECT_EQ(std::u16string(first.name), u"Intel(R) Xeon(R) CPU E3-1505M v6 @ 3.00GHz");
    EXPECT_EQ(first.currentClockSpeed, 1200u); // cpufreq when present
    EXPECT_EQ(first.maxClockSpeed, 4000u);
    EXPECT_EQ(first.l2CacheSize, 512u);  // two private 256K caches
    EXPECT_EQ(first.l3CacheSize, 8192u); // one shared 8M cache, counted once
    EXPECT_EQ(first.numberOfCores, 2u);
    EXPECT_EQ(first.numberOfLogicalProcessors, 2u);
    const HardwareProcessorEntry& second = rec->processors[1];
    EXPECT_EQ(second.currentClockSpeed, 2999u); // "cpu MHz" without cpufreq
    EXPECT_EQ(second.maxClockSpeed, 2999u);
    EXPECT_EQ(second.l3CacheSize, 8192u);
    EXPECT_EQ(std::u16string(rec->osCaption), u"Debian GNU/Linux 12 (bookworm)");
    EXPECT_EQ(std::u16string(rec->osServicePack), u"6.1.0-13-amd64");
    EXPECT_EQ(std::u16string(rec->computerName), u"printhost");

    std::wostringstream out;
    EXPECT_EQ(info->printProcessorAndOSInfo(rec.get(), out), 2);
    EXPECT_NE(out.str().find(L"\tProcessor 2\n\t\tCaption: x86_64 Family 6"), std::wstring::npos);
}

TEST(IHardwareInfoTest, LongAndNonAsciiTextIsCutToFit) {
    FakeTree tree;
    buildMachine(tree);
    const std::string longName(100, 'x');
    tree.write("proc/cpuinfo", "processor\t: 0\nvendor_id\t: Caf\xc3\xa9 \xf0\x9f\x98\x80 Chips "
                               "Incorporated\nmodel name\t: " +
                                   longName + "\n");
    auto info = infoFor(tree);
    const auto rec = zeroed<HardwareInfoRec>();
    ASSERT_TRUE(info->getProcessorAndOSInfo(rec.get()));
    ASSERT_EQ(rec->numberOfProcessors, 1u);
    // 59 units and the terminating zero; the next field is untouched.
    EXPECT_EQ(std::u16string(rec->processors[0].name), std::u16string(59, u'x'));
    EXPECT_EQ(rec->processors[0].numberOfCores, 1u);
    // "Café 😀 Chips Incorporated" is 26 units; the field holds 19.
    EXPECT_EQ(std::u16string(rec->processors[0].manufacturer), u"Caf\u00e9 \U0001F600 Chips Incor");
    // A surrogate pair that does not fit whole is left out whole.
    tree.write("proc/cpuinfo", "processor\t: 0\nvendor_id\t: 123456789012345678\xf0\x9f\x98\x80\n");
    ASSERT_TRUE(info->getProcessorAndOSInfo(rec.get()));
    EXPECT_EQ(std::u16string(rec->processors[0].manufacturer), u"123456789012345678");
}

TEST(IHardwareInfoTest, MemoryModulesFromSmbiosElseMemTotal) {
    FakeTree tree;
    buildMachine(tree);
    auto info = infoFor(tree);
    const auto rec = zeroed<HardwareInfoRec>();
    ASSERT_TRUE(info->getMemoryInfo(rec.get()));
    ASSERT_EQ(rec->numberOfMemoryModules, 3u); // the empty slot is no module
    EXPECT_EQ(rec->memory[0].capacity, 8589934592ull);
    EXPECT_EQ(rec->memory[0].speed, 3200u);
    EXPECT_EQ(rec->memory[1].capacity, 32768ull << 20); // the extended size
    EXPECT_EQ(rec->memory[1].speed, 2666u);
    EXPECT_EQ(rec->memory[2].capacity, 512ull << 10); // kilobyte granularity
    std::wostringstream out;
    info->printMemoryInfo(rec.get(), out);
    EXPECT_NE(out.str().find(L"\tMemory 1\n\t\tCapacity: 8192 MB\n\t\tSpeed: 3200 MHz\n"),
              std::wstring::npos);

    tree.remove("sys/firmware");
    ASSERT_TRUE(info->getMemoryInfo(rec.get()));
    ASSERT_EQ(rec->numberOfMemoryModules, 1u);
    EXPECT_EQ(rec->memory[0].capacity, 16303520ull * 1024);
    EXPECT_EQ(rec->memory[0].speed, 0u);

    // A cut-off table ends the walk without reading past it.
    tree.write("sys/firmware/dmi/tables/DMI", dmiTable().substr(0, 70));
    ASSERT_TRUE(info->getMemoryInfo(rec.get()));
    EXPECT_EQ(rec->numberOfMemoryModules, 1u);
    EXPECT_EQ(rec->memory[0].capacity, 8589934592ull);

    tree.remove("proc/meminfo");
    tree.remove("sys/firmware");
    EXPECT_FALSE(info->getMemoryInfo(rec.get()));
}

TEST(IHardwareInfoTest, OnlyHardDisksAreReported) {
    FakeTree tree;
    buildMachine(tree);
    auto info = infoFor(tree);
    const auto rec = zeroed<HardwareInfoRec>();
    ASSERT_TRUE(info->getDiskInfo(rec.get()));
    // loop, zram and the mapped device are no drives; the optical drive and the stick are
    // no hard disks.
    ASSERT_EQ(rec->numberOfDisks, 2u);
    EXPECT_EQ(std::u16string(rec->disks[0].interfaceType), u"NVMe");
    EXPECT_EQ(std::u16string(rec->disks[0].model), u"WDC PC SN730 SDBQNTY-512G-1001");
    EXPECT_EQ(rec->disks[0].size, 1000215216ull * 512);
    EXPECT_EQ(std::u16string(rec->disks[1].interfaceType), u"SCSI");
    EXPECT_EQ(std::u16string(rec->disks[1].model), u"Samsung SSD 860");
    EXPECT_EQ(rec->disks[1].size, 1953525168ull * 512);

    for (int i = 0; i < 8; ++i)
        disk(tree, "vd" + std::string(1, static_cast<char>('a' + i)), "Virtual disk", 2097152);
    ASSERT_TRUE(info->getDiskInfo(rec.get()));
    EXPECT_EQ(rec->numberOfDisks, 6u);
    std::wostringstream out;
    info->printDiskInfo(rec.get(), out);
    EXPECT_NE(out.str().find(L"\tDisk 6\n\t\tInterfaceType: SCSI\n\t\tModel: Virtual disk\n"
                             L"\t\tSize: 1 GB\n"),
              std::wstring::npos);
}

TEST(IHardwareInfoTest, PerformanceFromMeminfoAndTwoStatSamples) {
    FakeTree tree;
    buildMachine(tree);
    ZYRHardwareQuerySource source(tree.root());
    // Between the samples: cpu0 works 30 of 100 ticks, cpu1 90 of 100 (iowait counts idle).
    source.setBetweenSamples([&] {
        tree.write("proc/stat", "cpu  220 0 100 860 20 0 0 0 0 0\ncpu0 80 0 50 470 0 0 0 0 0 0\n"
                                "cpu1 140 0 50 390 20 0 0 0 0 0\n");
    });
    std::vector<ZYRHardwareQuerySource::Row> rows;
    ASSERT_TRUE(source.run("SELECT * FROM Win32_PerfFormattedData_PerfOS_Processor", rows));
    ASSERT_EQ(rows.size(), 3u);
    EXPECT_EQ(rows[0]["Name"], "_Total");
    EXPECT_EQ(rows[0]["PercentProcessorTime"], "60");
    EXPECT_EQ(rows[1]["Name"], "0");
    EXPECT_EQ(rows[1]["PercentProcessorTime"], "30");
    EXPECT_EQ(rows[2]["Name"], "1");
    EXPECT_EQ(rows[2]["PercentProcessorTime"], "90");

    ASSERT_TRUE(source.run("SELECT * FROM Win32_PerfFormattedData_PerfOS_Memory", rows));
    ASSERT_EQ(rows.size(), 1u);
    EXPECT_EQ(rows[0]["CommitLimit"], std::to_string(12345678ull * 1024));
    EXPECT_EQ(rows[0]["CommittedBytes"], std::to_string(4115226ull * 1024));
    EXPECT_EQ(rows[0]["PercentCommittedBytesInUse"], "33");

    EXPECT_FALSE(source.run("SELECT * FROM Win32_BIOS", rows));
    EXPECT_FALSE(source.run("SELECT Name FROM Win32_Processor", rows));

    // Through the interface, with an unchanged /proc/stat: no time passed, nothing busy.
    auto info = infoFor(tree);
    auto perf = zeroed<PerformanceRec>();
    ASSERT_TRUE(info->getCPUPerformance(perf.get()));
    EXPECT_EQ(perf->numberOfCores, 2u);
    EXPECT_EQ(perf->totalProcessorUse, 0u);
    ASSERT_TRUE(info->getMemoryPerformance(perf.get()));
    EXPECT_EQ(perf->numberOfCores, 0u); // the second query zero-filled the first one's data
    EXPECT_EQ(perf->commitLimit, 12345678ull * 1024);
    EXPECT_EQ(perf->percentCommittedBytesInUse, 33u);
}

TEST(IHardwareInfoTest, MissingFilesFailTheirQueries) {
    FakeTree tree;
    auto info = infoFor(tree);
    const auto rec = zeroed<HardwareInfoRec>();
    auto perf = zeroed<PerformanceRec>();
    EXPECT_FALSE(info->getProcessorAndOSInfo(rec.get()));
    EXPECT_FALSE(info->getDiskInfo(rec.get()));
    EXPECT_FALSE(info->getMemoryInfo(rec.get()));
    EXPECT_FALSE(info->getMemoryPerformance(perf.get()));
    EXPECT_FALSE(info->getCPUPerformance(perf.get()));
    // Processors without an operating-system description: false, the processors stay.
    tree.write("proc/cpuinfo", cpuinfoBlock(0, 0, 0));
    EXPECT_FALSE(info->getProcessorAndOSInfo(rec.get()));
    EXPECT_EQ(rec->numberOfProcessors, 1u);
}

TEST(IHardwareInfoTest, ThisMachineAnswersEveryQuery) {
    std::unique_ptr<IHardwareInfo> info(createHardwareInfo());
    const auto rec = zeroed<HardwareInfoRec>();
    auto perf = zeroed<PerformanceRec>();
    ASSERT_TRUE(info->getProcessorAndOSInfo(rec.get()));
    EXPECT_GE(rec->numberOfProcessors, 1u);
    ASSERT_TRUE(info->getMemoryInfo(rec.get()));
    EXPECT_GE(rec->numberOfMemoryModules, 1u);
    EXPECT_TRUE(info->getDiskInfo(rec.get()));
    ASSERT_TRUE(info->getMemoryPerformance(perf.get()));
    EXPECT_GT(perf->commitLimit, 0u);
    ASSERT_TRUE(info->getCPUPerformance(perf.get()));
    EXPECT_GE(perf->numberOfCores, 1u);
    EXPECT_LE(perf->totalProcessorUse, 100u);
    std::wostringstream out;
    info->printCPUPerformance(perf.get(), out);
    EXPECT_EQ(out.str().rfind(L"\tCPU Performance\n\t\tCPU: ", 0), 0u);
}

} // namespace
