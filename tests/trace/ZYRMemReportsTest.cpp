#include <gtest/gtest.h>

#include <cstdlib>
#include <cstring>
#include <sys/mman.h>

#include "EngineFakes.h"
#include "TestSupport.h"
#include "zyr/std/trace/ZYRMemReports.h"

using namespace ZYRStd;
using zyrtest::FakeProgress;

namespace {

struct HostTrace {
    FakeProgress* host = nullptr;
    CZYRTraceMsg trace;
    explicit HostTrace(uint32_t all) : trace(makeJob(all)) {}

    std::string report(ReportMemoryUsageType type, const char* label = nullptr) {
        const size_t before = host->calls.size();
        ReportMemoryUsage(trace, type, label, ZYRPublic::kZYRTraceMsgLevel2);
        return host->calls.size() == before ? "<none>" : host->lastText();
    }

private:
    C_SmartPtr<ZYRPublic::I_Job> makeJob(uint32_t all) {
        closeTraceLogPath();
        CZYRDict config, params;
        config.set(CZYRUniString("Path"), CZYRUniString("stdout"));
        config.set(CZYRUniString("All"), all);
        params.set(CZYRUniString("ZYRTraceMsg"), config);
        return zyrtest::makeJob(params, &host);
    }
};

using zyrtest::startsWith;

bool expectPrefix(const std::string& got, const std::string& prefix) {
    return startsWith(got, prefix) || std::fprintf(stderr, "expected \"%s...\", got \"%s\"\n",
                                                   prefix.c_str(), got.c_str()) < 0;
}

bool countersFromTheirFirstValues() {
    ::setenv("ZYR_MEMORY_SURFACE_COUNT_STEP", "2", 1);
    HostTrace t(2);
    const auto surface = kReportMemoryUsageAfterSurface;
    const bool ok =
        expectPrefix(t.report(kReportMemoryUsageAfterJob), "After Job 0 Current Memory: ") &&
        expectPrefix(t.report(kReportMemoryUsageAfterJob, "end"), "end After Job 1 ") &&
        expectPrefix(t.report(surface), "<none>") &&
        expectPrefix(t.report(surface), "After interpreting Surface 2 Current Memory: ") &&
        expectPrefix(t.report(kReportMemoryUsageAfterPlacedObject),
                     "After interpreting PlacedObject 1 ") &&
        expectPrefix(t.report(kReportMemoryUsageAfterPlacedObject),
                     "After interpreting PlacedObject 2 ") &&
        expectPrefix(t.report(static_cast<ReportMemoryUsageType>(0)), "Current Memory: ");
    ::setenv("ZYR_MEMORY_SURFACE_COUNT_STEP", "1", 1);
    return ok && expectPrefix(t.report(surface), "<none>") &&
           expectPrefix(t.report(surface), "After interpreting Surface 4 ");
}

} // namespace

TEST(ZYRMemReportsTest, CountersAndSurfaceStepInAFreshProcess) {
    EXPECT_EXIT(std::exit(countersFromTheirFirstValues() ? 0 : 1), ::testing::ExitedWithCode(0),
                "");
}

TEST(ZYRMemReportsTest, UsageReportLevelsAndLayout) {
    EXPECT_EQ(HostTrace(1).report(static_cast<ReportMemoryUsageType>(9)), "<none>")
        << "configured level 1 stops level 2";
    HostTrace brief(3);
    const std::string one = brief.report(static_cast<ReportMemoryUsageType>(9), "L");
    unsigned long long current = 0, tuma = 0, tumaInterp = 0, jov = 0, jovInterp = 0;
    EXPECT_EQ(std::sscanf(one.c_str(),
                          "L Current Memory: %llu bytes TUMA(All): %llu bytes TUMA(Interp): %llu "
                          "bytes JOV(All): %llu bytes JOV(Interp): %llu bytes\n",
                          &current, &tuma, &tumaInterp, &jov, &jovInterp),
              5)
        << one;
    EXPECT_TRUE(current > 0 && one.find('\n') == one.size() - 1 &&
                startsWith(brief.host->calls.back(), "whole Memory/General L2: L Current "))
        << "no process figures below level 4";

    HostTrace detailed(4);
    const std::string four = detailed.report(static_cast<ReportMemoryUsageType>(9));
    const size_t figures = four.find("\nCommit: ");
    ASSERT_NE(figures, std::string::npos) << four;
    unsigned long long commit = 0, set = 0, file = 0, faults = 0, total = 0, availVir = 0,
                       availPhy = 0, handles = 0, read = 0, written = 0;
    EXPECT_EQ(std::sscanf(four.c_str() + figures,
                          "\nCommit: %llu WorkingSet: %llu PageFile: %llu PageFault: %llu\n"
                          "TotalVir %llu AvailVir %llu AvailPhy %llu\n"
                          "HandleCount: %llu Read: %llu Write: %llu Other: 0\n",
                          &commit, &set, &file, &faults, &total, &availVir, &availPhy, &handles,
                          &read, &written),
              10)
        << four;
    EXPECT_TRUE(commit > 0 && commit == file && set > 0 && faults > 0) << four;
    EXPECT_TRUE(total > availVir && availPhy > 0 && handles >= 3 && read > 0) << four;
    EXPECT_EQ(four.substr(four.size() - 10), " Other: 0\n");
}

TEST(ZYRMemReportsTest, AddressSpaceMap) {
    HostTrace low(3), totals(4), full(5);
    // An anonymous reservation names no file: it must still count as reserved.
    constexpr size_t kReservation = 64u << 20;
    void* reservation = ::mmap(nullptr, kReservation, PROT_NONE,
                               MAP_PRIVATE | MAP_ANONYMOUS | MAP_NORESERVE, -1, 0);
    ASSERT_NE(reservation, MAP_FAILED);
    for (HostTrace* t : {&low, &totals, &full})
        DumpVMStatistics(t->trace);
    ::munmap(reservation, kReservation);
    EXPECT_TRUE(low.host->calls.empty());
    ASSERT_EQ(totals.host->calls.size(), 5u);
    EXPECT_TRUE(totals.host->calls[0] == "begin Memory/Performance L4: Virtual Memory Statistics" &&
                startsWith(totals.host->calls[1], "text: Totals: Commit ") &&
                totals.host->calls[4] == "end");
    std::vector<std::string> calls; // the texts of the message's parts
    for (const std::string& call : full.host->calls)
        calls.push_back(call.substr(call.find(": ") + 2));
    ASSERT_GT(calls.size(), 6u);
    EXPECT_EQ(calls[1], "Address\tState\tType\tProtect\tSize\tBase");
    unsigned long long expected = 0, free = 0, committed = 0;
    std::string kinds;
    size_t i = 2;
    for (; i < calls.size() && startsWith(calls[i], "0x"); ++i) {
        const std::string& line = calls[i];
        ASSERT_TRUE(line.find('\n') == line.npos && line.size() > 18 && line[18] == '\t') << line;
        const unsigned long long base = std::strtoull(line.c_str() + 2, nullptr, 16);
        EXPECT_EQ(base, expected) << line;
        const size_t sizeAt = line.rfind('\t', line.rfind('\t') - 1) + 1;
        expected = base + std::strtoull(line.c_str() + sizeAt, nullptr, 10);
        EXPECT_EQ(std::strtoull(line.c_str() + line.rfind('\t') + 1, nullptr, 16), base) << line;
        const bool isFree = line.find("\tFREE\t\t\t") != std::string::npos;
        (isFree ? free : committed) += expected - base;
        kinds += isFree                                                      ? "F"
                 : line.find("\tCOMMIT\tIMAGE\tEXECUTE_READ\t") != line.npos ? "I"
                 : line.find("\tCOMMIT\tPRIV\tREADWRITE\t") != line.npos     ? "P"
                                                                             : "";
    }
    EXPECT_EQ(expected, 0x00007FFFFFFFF000ull);
    EXPECT_TRUE(kinds.find('F') != kinds.npos && kinds.find('I') != kinds.npos &&
                kinds.find('P') != kinds.npos);
    ASSERT_EQ(calls.size(), i + 4);
    unsigned long long commit = 0, image = 0, mapped = 0, priv = 0, reserved = 0;
    ASSERT_EQ(std::sscanf(calls[i].c_str(),
                          "Totals: Commit %llu (Image %llu Mapped %llu Private %llu) Reserved %llu",
                          &commit, &image, &mapped, &priv, &reserved),
              5);
    EXPECT_EQ(commit, image + mapped + priv);
    EXPECT_EQ(commit + reserved, committed) << "every region not free is committed or reserved";
    EXPECT_GE(reserved, kReservation);
    unsigned long long largest = 0, big = 0, middle = 0, small = 0, units = 0;
    ASSERT_EQ(std::sscanf(calls[i + 1].c_str(),
                          "Free block: Largest: %llu #blks >=8MB: %llu >=4MB: %llu <4MB: %llu "
                          "#8MB %llu",
                          &largest, &big, &middle, &small, &units),
              5);
    EXPECT_TRUE(big >= 1 && units >= largest / 8388608 && units * 8388608 <= free);
    unsigned long long peak = 0, current = 0, peakFile = 0, faults = 0;
    ASSERT_EQ(std::sscanf(calls[i + 2].c_str(),
                          "Working Set: Peak %llu Current %llu Peak Pagefile %llu PageFault %llu",
                          &peak, &current, &peakFile, &faults),
              4);
    EXPECT_TRUE(peak >= current && current > 0 && peakFile >= peak && faults > 0);
}
