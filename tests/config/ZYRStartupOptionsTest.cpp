#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <cstring>

#include "TestSupport.h"
#include "zyr/std/config/ZYRStartupOptions.h"
#include "zyr/std/config/internal/ZYRStartupOptionKeys.h"
#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/core/ZYRVirtualMem.h"

using namespace ZYRStd;

namespace {

using Snapshot = std::map<std::string, std::string>;

Snapshot snapshot() {
    Snapshot values;
    for (const sZYRStartupOptionKey& row : kZYRStartupOptionKeys)
        if (row.show)
            values[row.key] = row.show();
    return values;
}

std::set<std::string> changedSince(const Snapshot& before) {
    std::set<std::string> changed;
    for (const auto& [key, value] : snapshot())
        if (before.at(key) != value)
            changed.insert(key);
    return changed;
}

const char* samplesFor(eZYRStartupReading reading) {
    using R = eZYRStartupReading;
    static const std::map<R, const char*> samples = {
        {R::kBool, "TRUE=true yes=false 7=true True=true true_=false 0=false"},
        {R::kHighLow, "LOW=false lo=true low=false high=true"},
        {R::kInt, "42=42 123abc=123 2147483648=2147483647 57=57"},
        {R::kUnsigned, "42=42 77=77"},
        {R::kInt64,
         "12345678901=12345678901 99999999999999999999=9223372036854775807 -5=0 4096=4096"},
        {R::kFloat, "2.5=2.5 0.125=0.125 75=75"},
        {R::kText, "/opt/trap/libtrap.so=/opt/trap/libtrap.so"}};
    const auto found = samples.find(reading);
    return found == samples.end() ? "" : found->second;
}

struct Host {
    CZYRStartupOptionFeeder feeder;
    void feed(const char* key, const char* value) {
        feeder.feed(key, value);
        feeder.store();
    }
};

void inFreshProcess(std::string (*check)()) {
    EXPECT_EXIT(
        {
            const std::string failure = check();
            std::fprintf(stderr, "%s\n", failure.c_str());
            std::exit(failure.empty() ? 0 : 1);
        },
        ::testing::ExitedWithCode(0), "");
}

// The record's default is not rounded; the key rounds it to whole pages.
unsigned long long expectedDefaultRAM() {
    tZYRVirtualMemoryInfo info{};
    VirtualMemStatus(&info);
    return std::min(info.totalPhysical, info.totalVirtual) / 20;
}

} // namespace

TEST(ZYRStartupOptionsTest, EveryKeyReachesItsGetter) {
    std::set<std::string> keys;
    for (const sZYRStartupOptionKey& row : kZYRStartupOptionKeys)
        EXPECT_TRUE(keys.insert(row.key).second && ZYRIsStartupOptionKey(row.key)) << row.key;
    EXPECT_EQ(keys.size(), 90u) << "23 record keys and 67 store keys";
    EXPECT_FALSE(ZYRIsStartupOptionKey("usenullgraphics") || ZYRIsStartupOptionKey(""));
    Host host;
    host.feed("UseNew1pxImageMaskHandler", "true"); // lets "OverscanImageMasksThreshold" in
    host.feed("SingleThreadProcess", "false");      // lets "SurfaceOverLap" show through
    unsigned int checked = 0;
    for (const sZYRStartupOptionKey& row : kZYRStartupOptionKeys) {
        std::istringstream samples(samplesFor(row.reading));
        for (std::string sample; samples >> sample; ++checked) {
            std::replace(sample.begin(), sample.end(), '_', ' ');
            const std::string value = sample.substr(0, sample.find('='));
            const Snapshot before = snapshot();
            host.feed(row.key, value.c_str());
            EXPECT_EQ(row.show(), sample.substr(sample.find('=') + 1)) << row.key << " " << value;
            std::set<std::string> changed = changedSince(before);
            changed.erase(row.key);
            if (std::string(row.key) == "SingleThreadProcess")
                changed.erase("SurfaceOverLap"); // 1 while single-threaded, by design
            EXPECT_TRUE(changed.empty())
                << row.key << " " << value << " also changed " << *changed.begin();
        }
    }
    EXPECT_GT(checked, 250u);

    const Snapshot before = snapshot();
    for (const char* key : {"usenullgraphics", "UseNullGraphics ", "Unknown", ""})
        host.feed(key, "1");
    host.feed(nullptr, "1");
    host.feed("UseNullGraphics", nullptr);
    EXPECT_TRUE(changedSince(before).empty());
}

TEST(ZYRStartupOptionsTest, RulesOfSingleKeys) {
    constexpr const char* kSteps = R"(MaxCacheShades 3=10 10=10 11=11
        SingleThreadProcess false=false
        SurfaceOverLap 0=1 5=5
        SingleThreadProcess true=SurfaceOverLap:1
        SurfaceOverLap 7=1
        SingleThreadProcess false=SurfaceOverLap:7
        XPVDPCacheOverlapThreshold 500=101 101=101 -1=101 100=100 0=0
        XPVDPOptimizeFlattening false=0 true=1
        CopyDotMethod AdjustMatrix=2 Unknown=2 0=2 OldDefault=0 CheckArea=1
        UseNew1pxImageMaskHandler false
        OverscanImageMasksThreshold 5=0
        UseNew1pxImageMaskHandler true=OverscanImageMasksThreshold:1
        OverscanImageMasksThreshold 5=5
        XObjDLCachePurgePercentage 50=50 150=50 -1=50 0=50 100.5=50 nan=50 100=100
        UseFasterOpaqueMarking true=1 no=0
        MaxGlyphCache -99999999999=-2147483648
        PDFGCMainThreadMemoryThreshold -99999999999999999999=0
        PDFGCInterpreterThreadMemoryThreshold -9223372036854775808=0 +1=1
        ImageMarkerFactorSourceStep 1e300=inf -1e300=-inf
        AtomicRegionDirectCMYKOption 3=3
        GROption HOV=1 Performance=3 2=2 7=2 abc=2 hov=2 1x=2 -1=2 0=0 Consistency=2 Alternate=1
        GROption Adaptive=0
        AutomaticGlobalRasterizationOption XPDevice=GROption:2 +1=GROption:1)";
    Host host;
    std::istringstream lines(kSteps);
    unsigned int checked = 0;
    for (std::string key, rest; lines >> key && std::getline(lines, rest);) {
        std::istringstream values(rest);
        for (std::string step; values >> step;) {
            const size_t eq = step.find('='), colon = step.find(':');
            host.feed(key.c_str(), step.substr(0, eq).c_str());
            if (eq == std::string::npos)
                continue;
            const std::string other =
                colon == step.npos ? key : step.substr(eq + 1, colon - eq - 1);
            EXPECT_EQ(snapshot().at(other), step.substr(colon == step.npos ? eq + 1 : colon + 1))
                << key << " " << step;
            ++checked;
        }
    }
    EXPECT_EQ(checked, 54u);
    for (const auto& [value, stored] : std::vector<std::pair<const char*, float>>{
             {"-2", 1.0f}, {"0", 1.0f}, {"0.5", 0.5f}, {"nan", 1.0f}}) {
        ::testing::internal::CaptureStdout();
        host.feed("TrapPixelOverlap", value);
        EXPECT_EQ(::testing::internal::GetCapturedStdout(),
                  "\n   TrapPixelOverlap set to " + std::to_string(stored) + "\n\n")
            << value;
        EXPECT_EQ(ZYRGetTrapPixelOverlap(), stored) << value;
    }
}

TEST(ZYRStartupOptionsTest, DisplayListCacheRecord) {
    const unsigned long long page = GetPageSize(), unrounded = expectedDefaultRAM(),
                             defaultRAM = (unrounded + page - 1) / page * page;
    sDLCacheOptions options;
    std::memset(&options, 0x5A, sizeof options);
    ZYRFillDefaultDLCacheOptions(options, CZYRUniString());
    EXPECT_EQ(options.maxRAM, unrounded);
    for (const unsigned char byte : options.reserved)
        EXPECT_EQ(byte, 0);
    const long long most = std::numeric_limits<long long>::max();
    const struct {
        const char* key;
        std::string value;
        unsigned long long ram;
        long long disk;
    } steps[] = {
        {"XObjDLCacheMaxRAM", "1000", page, most},
        {"XObjDLCacheMaxRAM", "0", 0, most},
        {"XObjDLCacheMaxRAM", "-5", defaultRAM, most},
        {"XObjDLCacheMaxRAM", "abc", defaultRAM, most},
        {"XObjDLCacheMaxRAM", "  12288", 12288, most},
        {"XObjDLCacheMaxRAM", std::to_string(3 * page + 1), 4 * page, most},
        {"XObjDLCacheMaxRAM", std::to_string(page), page, most},
        {"XObjDLSharedCache", "true", page, most}, // given a budget, a shared cache keeps it
        {"XObjDLCacheMaxDisk", "123", page, 123},
        {"XObjDLCacheMaxDisk", "-1", page, most},
        {"XObjDLCacheMaxDisk", "0", page, 0},
        {"XObjDLCacheMaxDisk", "99999999999999999999", page, most},
        {"XObjDLCacheMaxDisk", "x", page, most},
    };
    for (const auto& step : steps) {
        ZYRParseDLCacheOptions(&options, step.key, step.value.c_str());
        EXPECT_TRUE(options.maxRAM == step.ram && options.maxDisk == step.disk)
            << step.key << " " << step.value << ": " << options.maxRAM << ", " << options.maxDisk;
    }
    EXPECT_TRUE(options.sharedCache);

    for (const bool on : {false, true}) {
        ZYRParseDLCacheOptions(nullptr, "TileSuperCell", on ? "true" : "false");
        ZYRParseDLCacheOptions(nullptr, "RasterizeTilingPattern", on ? "1" : "0");
        EXPECT_TRUE(ZYRTileSuperCell() == on && ZYRRasterizeTilingPattern() == on);
    }
    ZYRParseDLCacheOptions(nullptr, "MaxPatternCacheEntry", "9");
    ZYRParseMTOptions(nullptr, "NumMTRThreads", "9");
    ZYRParseMarkerOptions(nullptr, "SSE2", "9");
    ZYRParseSLDLOptions(nullptr, "SLCompression", "9");
    ZYRSetDLCacheOptions(options);
    EXPECT_EQ(ZYRGetDLCacheOptions().maxDisk, most);
}

TEST(ZYRStartupOptionsTest, FreshProcessState) {
    inFreshProcess([]() -> std::string {
        const sMTOptions& mt = ZYRGetMTOptions();
        const sDLCacheOptions& dl = ZYRGetDLCacheOptions();
        if (mt.numMTRThreads != 0 || mt.mtrThreshold != 0 || dl.maxRAM != 0 ||
            dl.maxPatternCacheEntry != 0 || ZYRGetMarkerOptions().sse2 != 0 ||
            ZYRGetSLDLOptions().slCompressionRatio != 0.0f)
            return "a store copy is not zero before its setter";
        sDLCacheOptions options;
        ZYRFillDefaultDLCacheOptions(options, CZYRUniString());
        ZYRParseDLCacheOptions(&options, "XObjDLSharedCache", "true");
        if (options.maxRAM != 1073741824)
            return "a shared cache without a budget gets " + std::to_string(options.maxRAM);
        ZYRParseDLCacheOptions(nullptr, "XObjDLCacheMaxRAM", "-1"); // sets the flag for good
        ZYRFillDefaultDLCacheOptions(options, CZYRUniString());
        ZYRParseDLCacheOptions(&options, "XObjDLSharedCache", "1");
        return options.maxRAM == expectedDefaultRAM() ? "" : "the budget flag did not stay set";
    });
    inFreshProcess([]() -> std::string {
        ZYRParseMemoryOptions("MaxMemLimit", "100000000");
        if (ZYRGetMemLimit() != 419430400 || ZYRGetMemReserve() != 314572800)
            return "MaxMemLimit gave " + std::to_string(ZYRGetMemLimit());
        ZYRParseMemoryOptions("MaxMemLimit", "500000000");
        if (ZYRGetMemLimit() != 419430400)
            return "a higher limit was taken";
        for (const bool on : {false, true}) {
            ZYRParseMemoryOptions("TestAvailablePhysicalMemory", on ? "TRUE" : "false");
            if (ZYRGetTestAvailablePhysicalMemory() != on)
                return "TestAvailablePhysicalMemory did not arrive";
        }
        ZYRParseMemoryOptions("BreakOnAllocationCount", "5"); // breaks only under a debugger
        ZYRFree(ZYRMalloc(64));
        return "";
    });
    inFreshProcess([]() -> std::string {
        ZYRParseMemoryOptions("MaxMemLimit", "-7");
        return ZYRGetMemLimit() == 419430400 ? "" : "a negative limit is not 0";
    });
}

TEST(ZYRStartupOptionsTest, TypedSettersWithRulesOfTheirOwn) {
    ZYRSetMaxSurfacesOnQueue(1LL << 33);
    long long queue = 0;
    ZYRSetDefaultMaxSurfacesOnQueue(queue);
    EXPECT_EQ(queue, 200);
    EXPECT_EQ(ZYRGetMaxSurfacesOnQueue(), 1LL << 33) << "the store is not touched";

    ZYRSetObjectInfoOptions(0x00000003u);
    EXPECT_EQ(ZYRGetObjectInfoOptions(), 0u) << "without the top bit the option is off";
    for (const unsigned int one : {0x80000000u, 0x80000004u, 0xC0000000u}) {
        ZYRSetObjectInfoOptions(one);
        EXPECT_EQ(ZYRGetObjectInfoOptions(), one);
    }
    EXPECT_EQ(zyrtest::thrown([] { ZYRSetObjectInfoOptions(0x80000003u); }),
              "4: Multiple ObjectInfoExtensions cannot be enabled at once "
              "(source/zyr/std/ZYRStartupOptions:1273)");
    EXPECT_EQ(ZYRGetObjectInfoOptions(), 0x80000003u) << "the value stays stored";
}
