// zyrstd hwinfo, run as a separate process over a prepared /proc, /sys and /etc tree.
#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <string>
#include <vector>

#include "TestSupport.h"

namespace {

namespace fs = std::filesystem;
using zyrtest::Outcome;

class ZyrstdHwinfoTest : public ::testing::Test {
protected:
    void SetUp() override {
        const char* path = std::getenv("ZYRSTD_TOOL");
        if (!path || !*path)
            GTEST_SKIP() << "ZYRSTD_TOOL does not name the zyrstd program";
        tool_ = path;
    }
    Outcome zyrstd(const std::vector<std::string>& args) {
        Outcome outcome = zyrtest::runProgram(tool_, args, dir_);
        if (outcome.exitCode == -1)
            ADD_FAILURE() << "cannot start " << tool_;
        return outcome;
    }
    std::string root() const { return dir_.file("root"); }
    void write(const std::string& relative, const std::string& bytes) const {
        const fs::path path = fs::path(root()) / relative;
        fs::create_directories(path.parent_path());
        zyrtest::writeFile(path.string(), bytes);
    }
    void buildMachine() const {
        write("proc/cpuinfo",
              "processor\t: 0\nvendor_id\t: GenuineIntel\ncpu family\t: 6\n"
              "model\t\t: 85\nmodel name\t: Intel(R) Xeon(R) Gold 6230 \xe2\x84\xa2\n"
              "stepping\t: 7\ncpu MHz\t\t: 2100.000\ncpu cores\t: 1\n"
              "siblings\t: 1\n\n");
        write("proc/sys/kernel/arch", "x86_64\n");
        write("proc/sys/kernel/osrelease", "6.1.0\n");
        write("proc/sys/kernel/hostname", "box\n");
        write("etc/os-release", "PRETTY_NAME='Debian 12'\n");
        write("proc/meminfo", "MemTotal:        8388608 kB\nCommitLimit:     1000000 kB\n"
                              "Committed_AS:     250000 kB\n");
        write("proc/stat", "cpu  1 1 1 1 0 0 0 0\ncpu0 1 1 1 1 0 0 0 0\n");
        write("sys/block/sda/device/model", "Disk One\n");
        write("sys/block/sda/removable", "0\n");
        write("sys/block/sda/size", "4194304\n");
        write("sys/block/sr0/device/type", "5\n");
        write("sys/block/sr0/removable", "1\n");
        write("sys/block/sr0/size", "2097151\n");
    }

    std::string tool_;
    zyrtest::TempDir dir_;
};

TEST_F(ZyrstdHwinfoTest, PrintsTheReportsAndTimingLinesInUtf8) {
    buildMachine();
    const Outcome result = zyrstd({"hwinfo", "--root", root()});
    EXPECT_EQ(result.exitCode, 0) << result.err;
    EXPECT_EQ(result.err, "");
    const std::string reports = "\tMemory 1\n\t\tCapacity: 8192 MB\n\t\tSpeed: 0 MHz\n"
                                "\tOperating System \n\t\tCaption: Debian 12\n"
                                "\t\tCSDVersion: 6.1.0\n"
                                "\tProcessor 1\n\t\tCaption: x86_64 Family 6 Model 85 Stepping 7\n"
                                "\t\tCurrentClockSpeed: 2100 Mhz\n\t\tExtClock: 0 MHz\n"
                                "\t\tL2CacheSize: 0 KB\n\t\tL3CacheSize: 0 KB\n"
                                "\t\tManufacturer: GenuineIntel\n\t\tMaxClockSpeed: 2100 MHz\n"
                                "\t\tName: Intel(R) Xeon(R) Gold 6230 \xe2\x84\xa2\n"
                                "\t\tNumberOfCores: 1\n\t\tNumberOfLogicalProcessors: 1\n"
                                "\tDisk 1\n\t\tInterfaceType: SCSI\n\t\tModel: Disk One\n"
                                "\t\tSize: 2 GB\n"
                                "\tMemory Performance\n"
                                "\t\tMEM: 256000000 bytes of1024000000 bytes = 25 % in use\n"
                                "\tCPU Performance\n\t\tCPU: 0% busy\n\t\tCore 1 : 0 % busy\n"
                                "\nTimer Accuracy -- ";
    EXPECT_EQ(result.out.substr(0, reports.size()), reports);
    EXPECT_NE(result.out.find("\nClocks Per Second -- "), std::string::npos);
    EXPECT_NE(result.out.find("\nMeasured Bus Speed (using SIMD 'movntps') -- "),
              std::string::npos);
    EXPECT_NE(result.out.find("\nMeasured Cache Memory Speed (using \"C\" loop) -- "),
              std::string::npos);
    EXPECT_EQ(result.out.back(), '\n');
}

TEST_F(ZyrstdHwinfoTest, UnreadableSourcesAreReportedAndTheRestPrinted) {
    write("proc/meminfo", "MemTotal:        1048576 kB\n");
    const Outcome result = zyrstd({"hwinfo", "--root", root()});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_NE(result.out.find("\tMemory 1\n\t\tCapacity: 1024 MB\n"), std::string::npos);
    EXPECT_NE(result.out.find("\nTimer Accuracy -- "), std::string::npos);
    EXPECT_NE(result.err.find("zyrstd: hwinfo: cannot read the processors and operating system\n"),
              std::string::npos)
        << result.err;
    EXPECT_NE(result.err.find("zyrstd: hwinfo: cannot read the memory performance\n"),
              std::string::npos);
    EXPECT_EQ(result.err.find("memory modules"), std::string::npos);
}

TEST_F(ZyrstdHwinfoTest, UsageErrorsAndHelp) {
    const Outcome bad = zyrstd({"hwinfo", "--bogus"});
    EXPECT_EQ(bad.exitCode, 2);
    EXPECT_EQ(bad.out, "");
    EXPECT_NE(bad.err.find("usage: zyrstd hwinfo [--root DIR]"), std::string::npos);
    EXPECT_EQ(zyrstd({"hwinfo", "--root"}).exitCode, 2);
    const Outcome help = zyrstd({"--help"});
    EXPECT_EQ(help.exitCode, 0);
    EXPECT_NE(help.out.find("\n  hwinfo [--root DIR]\n"), std::string::npos);
}

} // namespace
