// Memory reports: the address-space map, the usage snapshots, their counters and the
// surface step. The counters live for the process, so their first values are checked in
// fresh processes (death-test children re-run this program).
#include <gtest/gtest.h>

#include <cstdlib>
#include <cstring>
#include <functional>

#include "EngineFakes.h"
#include "zyr/std/trace/ZYRMemReports.h"

using namespace ZYRStd;
using zyrtest::FakeProgress;

namespace {

// A trace whose messages all reach the fake host, at configured level `all`.
struct HostTrace {
    FakeProgress* host = nullptr;
    CZYRTraceMsg trace;
    explicit HostTrace(uint32_t all) : trace(makeJob(all)) {}

private:
    C_SmartPtr<ZYRPublic::I_Job> makeJob(uint32_t all) {
        closeTraceLogPath();
        CZYRDict config;
        config.set(CZYRUniString("Path"), CZYRUniString("stdout"));
        config.set(CZYRUniString("All"), all);
        CZYRDict params;
        params.set(CZYRUniString("ZYRTraceMsg"), config);
        return zyrtest::makeJob(params, &host);
    }
};

std::string report(HostTrace& t, ReportMemoryUsageType type, const char* label = nullptr) {
    const size_t before = t.host->calls.size();
    ReportMemoryUsage(t.trace, type, label, ZYRPublic::kZYRTraceMsgLevel2);
    return t.host->calls.size() == before ? "<none>" : t.host->calls.back().text;
}

bool startsWith(const std::string& s, const std::string& prefix) {
    return s.compare(0, prefix.size(), prefix) == 0;
}

// Runs `check` in a fresh process; it prints what went wrong and returns false to fail.
void inFreshProcess(const std::function<bool()>& check) {
    EXPECT_EXIT(std::exit(check() ? 0 : 1), ::testing::ExitedWithCode(0), "");
}

bool expectPrefix(const std::string& got, const std::string& prefix) {
    if (startsWith(got, prefix))
        return true;
    std::fprintf(stderr, "expected \"%s...\", got \"%s\"\n", prefix.c_str(), got.c_str());
    return false;
}

} // namespace

TEST(ZYRMemReportsTest, CountersStartAtTheirFirstValues) {
    inFreshProcess([] {
        ::unsetenv("ZYR_MEMORY_SURFACE_COUNT_STEP");
        HostTrace t(2);
        return expectPrefix(report(t, kReportMemoryUsageAfterJob),
                            "After Job 0 Current Memory: ") &&
               expectPrefix(report(t, kReportMemoryUsageAfterJob, "end"), "end After Job 1 ") &&
               expectPrefix(report(t, kReportMemoryUsageAfterSurface),
                            "After interpreting Surface 1 Current Memory: ") &&
               expectPrefix(report(t, kReportMemoryUsageAfterSurface),
                            "After interpreting Surface 2 ") &&
               expectPrefix(report(t, kReportMemoryUsageAfterPlacedObject),
                            "After interpreting PlacedObject 1 ") &&
               expectPrefix(report(t, static_cast<ReportMemoryUsageType>(0)), "Current Memory: ");
    });
}

TEST(ZYRMemReportsTest, SurfaceStepReportsEveryNthSurface) {
    inFreshProcess([] {
        ::setenv("ZYR_MEMORY_SURFACE_COUNT_STEP", "10", 1);
        HostTrace t(2);
        for (int i = 1; i < 10; ++i)
            if (report(t, kReportMemoryUsageAfterSurface) != "<none>")
                return expectPrefix("surface " + std::to_string(i), "<none>");
        if (!expectPrefix(report(t, kReportMemoryUsageAfterSurface),
                          "After interpreting Surface 10 "))
            return false;
        // The step was read once: changing it later has no effect.
        ::setenv("ZYR_MEMORY_SURFACE_COUNT_STEP", "1", 1);
        return report(t, kReportMemoryUsageAfterSurface) == "<none>";
    });
}

TEST(ZYRMemReportsTest, UsageReportLevelsAndLayout) {
    {
        HostTrace quiet(1);
        EXPECT_EQ(report(quiet, static_cast<ReportMemoryUsageType>(9)), "<none>")
            << "configured level 1 stops level 2";
    }
    HostTrace brief(3);
    const std::string one = report(brief, static_cast<ReportMemoryUsageType>(9), "L");
    EXPECT_TRUE(startsWith(one, "L Current Memory: ")) << one;
    for (const char* part : {" bytes TUMA(All): ", " bytes TUMA(Interp): ", " bytes JOV(All): ",
                             " bytes JOV(Interp): "})
        EXPECT_NE(one.find(part), std::string::npos) << part;
    EXPECT_EQ(one.back(), '\n');
    EXPECT_EQ(one.find('\n'), one.size() - 1) << "no process figures below level 4";
    EXPECT_EQ(brief.host->calls.back().area, "Memory");
    EXPECT_EQ(brief.host->calls.back().category, "General");
    EXPECT_EQ(brief.host->calls.back().level, 2);

    HostTrace detailed(4);
    const std::string four = report(detailed, static_cast<ReportMemoryUsageType>(9));
    EXPECT_NE(four.find("\nCommit: "), std::string::npos) << four;
    EXPECT_NE(four.find(" WorkingSet: "), std::string::npos);
    EXPECT_NE(four.find("\nTotalVir "), std::string::npos);
    EXPECT_NE(four.find(" AvailPhy "), std::string::npos);
    EXPECT_NE(four.find("\nHandleCount: "), std::string::npos);
    EXPECT_NE(four.find(" Other: 0\n"), std::string::npos) << four;
}

TEST(ZYRMemReportsTest, AddressSpaceMap) {
    {
        HostTrace low(3);
        DumpVMStatistics(low.trace);
        EXPECT_TRUE(low.host->calls.empty());
    }
    HostTrace totals(4);
    DumpVMStatistics(totals.trace);
    ASSERT_EQ(totals.host->calls.size(), 5u);
    EXPECT_EQ(totals.host->calls[0].kind, "begin");
    EXPECT_EQ(totals.host->calls[0].text, "Virtual Memory Statistics");
    EXPECT_EQ(totals.host->calls[0].level, 4);
    EXPECT_TRUE(startsWith(totals.host->calls[1].text, "Totals: Commit "));
    EXPECT_TRUE(startsWith(totals.host->calls[2].text, "Free block: Largest: "));
    EXPECT_TRUE(startsWith(totals.host->calls[3].text, "Working Set: Peak "));
    EXPECT_EQ(totals.host->calls[4].kind, "end");

    HostTrace full(5);
    DumpVMStatistics(full.trace);
    const auto& calls = full.host->calls;
    ASSERT_GT(calls.size(), 6u);
    EXPECT_EQ(calls[1].text, "Address\tState\tType\tProtect\tSize\tBase");
    // Regions follow one another without gaps up to the top of user space.
    unsigned long long expected = 0;
    bool sawImage = false, sawFree = false, sawPrivate = false;
    size_t i = 2;
    for (; i < calls.size() && startsWith(calls[i].text, "0x"); ++i) {
        const std::string& line = calls[i].text;
        ASSERT_EQ(line.find('\n'), std::string::npos);
        ASSERT_EQ(line.size() > 18 && line[18] == '\t', true) << line;
        const unsigned long long base = std::strtoull(line.c_str() + 2, nullptr, 16);
        EXPECT_EQ(base, expected) << line;
        const size_t sizeAt = line.rfind('\t', line.rfind('\t') - 1) + 1;
        expected = base + std::strtoull(line.c_str() + sizeAt, nullptr, 10);
        EXPECT_EQ(line.substr(line.rfind('\t') + 1, 2), "0x");
        sawImage |= line.find("\tCOMMIT\tIMAGE\tEXECUTE_READ\t") != std::string::npos;
        sawFree |= line.find("\tFREE\t\t\t") != std::string::npos;
        sawPrivate |= line.find("\tCOMMIT\tPRIV\tREADWRITE\t") != std::string::npos;
    }
    EXPECT_EQ(expected, 0x00007FFFFFFFF000ull);
    EXPECT_TRUE(sawImage && sawFree && sawPrivate);
    ASSERT_EQ(calls.size(), i + 4);
    EXPECT_TRUE(startsWith(calls[i].text, "Totals: Commit "));
    unsigned long long largest = 0, big = 0, middle = 0, small = 0, units = 0;
    ASSERT_EQ(std::sscanf(calls[i + 1].text.c_str(),
                          "Free block: Largest: %llu #blks >=8MB: %llu >=4MB: %llu <4MB: %llu "
                          "#8MB %llu",
                          &largest, &big, &middle, &small, &units),
              5);
    EXPECT_GE(big, 1u);
    EXPECT_GE(units, largest / 8388608);
}
