// The start-up option store: every key through the host's start-up order to its getter,
// the rules of the special keys, records, typed setters and the allocation front's options.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <map>
#include <set>
#include <string>
#include <vector>

#include "TestSupport.h"
#include "zyr/std/config/ZYRStartupOptions.h"
#include "zyr/std/config/internal/ZYRStartupOptionKeys.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/core/ZYRThread.h"
#include "zyr/std/core/ZYRVirtualMem.h"

using namespace ZYRStd;

namespace {

using Snapshot = std::map<std::string, std::string>;

// Every printable option as the getters give it.
Snapshot snapshot() {
    Snapshot values;
    for (const sZYRStartupOptionKey& row : kZYRStartupOptionKeys) {
        if (row.show)
            values[row.key] = row.show();
    }
    return values;
}

// The keys whose printed value changed from `before` to now.
std::set<std::string> changedSince(const Snapshot& before) {
    std::set<std::string> changed;
    for (const auto& [key, value] : snapshot()) {
        if (before.at(key) != value)
            changed.insert(key);
    }
    return changed;
}

struct Sample {
    const char* value;
    const char* shown;
};

// Values every key of a reading takes as they are (no key of the reading clamps them), in
// an order that ends on a value that leaves the other keys' rules alone.
std::vector<Sample> samplesFor(eZYRStartupReading reading) {
    switch (reading) {
    case eZYRStartupReading::kBool:
        return {{"TRUE", "true"},   {"yes", "false"}, {"7", "true"},
                {"true ", "false"}, {"True", "true"}, {"0", "false"}};
    case eZYRStartupReading::kHighLow:
        return {{"LOW", "false"}, {"lo", "true"}, {"low", "false"}, {"high", "true"}};
    case eZYRStartupReading::kInt:
        return {{"42", "42"}, {"  123abc", "123"}, {"2147483648", "2147483647"}, {"57", "57"}};
    case eZYRStartupReading::kUnsigned:
        return {{"42", "42"}, {"77", "77"}};
    case eZYRStartupReading::kInt64:
        return {{"12345678901", "12345678901"},
                {"99999999999999999999", "9223372036854775807"},
                {"-5", "0"},
                {"4096", "4096"}};
    case eZYRStartupReading::kFloat:
        return {{"2.5", "2.5"}, {"0.125", "0.125"}, {"75", "75"}};
    case eZYRStartupReading::kText:
        return {{"/opt/trap/libtrap.so", "/opt/trap/libtrap.so"}};
    default:
        return {}; // the words and special rules have tests of their own
    }
}

// Feeds one pair the way a host does and stores the records.
struct Host {
    CZYRStartupOptionFeeder feeder;
    void feed(const char* key, const char* value) {
        feeder.feed(key, value);
        feeder.store();
    }
};

// Runs `check` in a fresh process (the store is process-wide and never reset); a
// non-empty result is the failure, printed for the parent to show.
[[noreturn]] void checkInFreshProcess(std::string (*check)()) {
    const std::string failure = check();
    if (!failure.empty())
        std::fprintf(stderr, "%s\n", failure.c_str());
    std::exit(failure.empty() ? 0 : 1);
}

unsigned long long pageRoundUp(unsigned long long bytes) {
    const unsigned long long page = GetPageSize();
    return (bytes + page - 1) / page * page;
}

unsigned long long expectedDefaultRAM() {
    tZYRVirtualMemoryInfo info{};
    VirtualMemStatus(&info);
    return pageRoundUp(std::min(info.totalPhysical, info.totalVirtual) / 20);
}

} // namespace

TEST(ZYRStartupOptionsTest, KeyListIsSound) {
    std::set<std::string> keys;
    for (const sZYRStartupOptionKey& row : kZYRStartupOptionKeys) {
        EXPECT_TRUE(keys.insert(row.key).second) << row.key << " is listed twice";
        EXPECT_TRUE(ZYRIsStartupOptionKey(row.key));
    }
    EXPECT_EQ(keys.size(), 90u) << "23 record keys and 67 store keys";
    EXPECT_FALSE(ZYRIsStartupOptionKey("usenullgraphics")) << "keys are case-sensitive";
    EXPECT_FALSE(ZYRIsStartupOptionKey(""));
}

// Each key, read by its rule, changes its own getter and nothing else.
TEST(ZYRStartupOptionsTest, EveryKeyReachesItsGetter) {
    Host host;
    host.feed("UseNew1pxImageMaskHandler", "true"); // lets "OverscanImageMasksThreshold" in
    host.feed("SingleThreadProcess", "false");      // lets "SurfaceOverLap" show through
    unsigned int checked = 0;
    for (const sZYRStartupOptionKey& row : kZYRStartupOptionKeys) {
        for (const Sample& sample : samplesFor(row.reading)) {
            const Snapshot before = snapshot();
            host.feed(row.key, sample.value);
            EXPECT_EQ(row.show(), sample.shown) << row.key << " " << sample.value;
            std::set<std::string> changed = changedSince(before);
            changed.erase(row.key);
            if (std::string(row.key) == "SingleThreadProcess")
                changed.erase("SurfaceOverLap"); // 1 while single-threaded, by design
            EXPECT_TRUE(changed.empty())
                << row.key << " " << sample.value << " also changed " << *changed.begin();
            ++checked;
        }
    }
    EXPECT_GT(checked, 250u);

    // Unknown and misspelt keys, and missing texts, change nothing.
    const Snapshot before = snapshot();
    for (const char* key : {"usenullgraphics", "UseNullGraphics ", "Unknown", ""})
        host.feed(key, "1");
    host.feed(nullptr, "1");
    host.feed("UseNullGraphics", nullptr);
    EXPECT_TRUE(changedSince(before).empty());
}

// Fed in order, each pair gives the printed value `shown` of the key `checked` (the fed key
// when not named); rules that join two keys show in the other key.
TEST(ZYRStartupOptionsTest, RulesOfSingleKeys) {
    Host host;
    const struct {
        const char* key;
        const char* value;
        const char* shown;
        const char* checked = nullptr;
    } steps[] = {
        {"MaxCacheShades", "3", "10"},
        {"MaxCacheShades", "11", "11"},
        {"SingleThreadProcess", "false", "false"},
        {"SurfaceOverLap", "0", "1"},
        {"SurfaceOverLap", "5", "5"},
        {"SingleThreadProcess", "true", "1", "SurfaceOverLap"},
        {"SurfaceOverLap", "7", "1"},
        {"SingleThreadProcess", "false", "7", "SurfaceOverLap"}, // the stored overlap comes back
        {"XPVDPCacheOverlapThreshold", "500", "101"},
        {"XPVDPCacheOverlapThreshold", "101", "101"},
        {"XPVDPCacheOverlapThreshold", "-1", "101"},
        {"XPVDPCacheOverlapThreshold", "100", "100"},
        {"XPVDPCacheOverlapThreshold", "0", "0"},
        {"XPVDPOptimizeFlattening", "false", "0"},
        {"XPVDPOptimizeFlattening", "true", "1"},
        {"CopyDotMethod", "AdjustMatrix", "2"},
        {"CopyDotMethod", "Unknown", "2"},
        {"CopyDotMethod", "0", "2"}, // the method is chosen by name only
        {"CopyDotMethod", "OldDefault", "0"},
        {"CopyDotMethod", "CheckArea", "1"},
        {"UseNew1pxImageMaskHandler", "false", nullptr},
        {"OverscanImageMasksThreshold", "5", "0"},
        {"UseNew1pxImageMaskHandler", "true", "1", "OverscanImageMasksThreshold"},
        {"OverscanImageMasksThreshold", "5", "5"},
        {"XObjDLCachePurgePercentage", "50", "50"},
        {"XObjDLCachePurgePercentage", "150", "50"},
        {"XObjDLCachePurgePercentage", "-1", "50"},
        {"XObjDLCachePurgePercentage", "0", "50"},
        {"XObjDLCachePurgePercentage", "100.5", "50"},
        {"XObjDLCachePurgePercentage", "nan", "50"},
        {"XObjDLCachePurgePercentage", "100", "100"},
        {"UseFasterOpaqueMarking", "true", "1"},
        {"UseFasterOpaqueMarking", "no", "0"},
        {"MaxGlyphCache", "-99999999999", "-2147483648"},
        {"PDFGCMainThreadMemoryThreshold", "-99999999999999999999", "0"},
        {"ImageMarkerFactorSourceStep", "1e300", "inf"}, // beyond the float range
        {"AtomicRegionDirectCMYKOption", "3", "3"},
    };
    for (const auto& step : steps) {
        host.feed(step.key, step.value);
        if (step.shown) {
            EXPECT_EQ(snapshot().at(step.checked ? step.checked : step.key), step.shown)
                << step.key << " " << step.value;
        }
    }

    // Out of range, not a word, a word in the wrong case: the option is unchanged.
    const std::pair<const char*, eZYRGROption> grOptions[] = {
        {"HOV", kZYRGROptionHOV},       {"Performance", kZYRGROptionPerformance},
        {"2", kZYRGROptionXPDevice},    {"7", kZYRGROptionXPDevice},
        {"abc", kZYRGROptionXPDevice},  {"hov", kZYRGROptionXPDevice},
        {"1x", kZYRGROptionXPDevice},   {"-1", kZYRGROptionXPDevice},
        {"0", kZYRGROptionAdaptive},    {"Consistency", kZYRGROptionXPDevice},
        {"Alternate", kZYRGROptionHOV}, {"Adaptive", kZYRGROptionAdaptive},
    };
    for (const auto& [value, option] : grOptions) {
        host.feed("GROption", value);
        EXPECT_EQ(ZYRGetGROption(), option) << value;
    }
    host.feed("AutomaticGlobalRasterizationOption", "XPDevice");
    EXPECT_EQ(ZYRGetGROption(), kZYRGROptionXPDevice);
    host.feed("AutomaticGlobalRasterizationOption", "1");
    EXPECT_EQ(ZYRGetGROption(), kZYRGROptionHOV);

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
    const unsigned long long page = GetPageSize();
    sDLCacheOptions options;
    std::memset(&options, 0x5A, sizeof options);
    ZYRFillDefaultDLCacheOptions(options, CZYRUniString());
    EXPECT_EQ(options.maxRAM, expectedDefaultRAM());
    EXPECT_EQ(options.maxRAM % page, 0u);
    for (const unsigned char byte : options.reserved)
        EXPECT_EQ(byte, 0);

    const struct {
        const char* value;
        unsigned long long ram;
    } budgets[] = {
        {"1000", page},     {"0", 0}, {"-5", expectedDefaultRAM()}, {"abc", expectedDefaultRAM()},
        {"  12288", 12288},
    };
    for (const auto& b : budgets) {
        ZYRParseDLCacheOptions(&options, "XObjDLCacheMaxRAM", b.value);
        EXPECT_EQ(options.maxRAM, b.ram) << b.value;
    }
    const std::string oddBytes = std::to_string(3 * page + 1);
    ZYRParseDLCacheOptions(&options, "XObjDLCacheMaxRAM", oddBytes.c_str());
    EXPECT_EQ(options.maxRAM, 4 * page);

    // Given a budget, a shared cache keeps it.
    ZYRParseDLCacheOptions(&options, "XObjDLCacheMaxRAM", "1000");
    ZYRParseDLCacheOptions(&options, "XObjDLSharedCache", "true");
    EXPECT_TRUE(options.sharedCache);
    EXPECT_EQ(options.maxRAM, page);

    const long long most = std::numeric_limits<long long>::max();
    for (const auto& [value, disk] : std::vector<std::pair<const char*, long long>>{
             {"-1", most}, {"123", 123}, {"99999999999999999999", most}, {"0", 0}}) {
        ZYRParseDLCacheOptions(&options, "XObjDLCacheMaxDisk", value);
        EXPECT_EQ(options.maxDisk, disk) << value;
    }

    // The record parser sets two store options, and a null record leaves the rest alone.
    ZYRParseDLCacheOptions(nullptr, "TileSuperCell", "false");
    EXPECT_FALSE(ZYRTileSuperCell());
    ZYRParseDLCacheOptions(nullptr, "TileSuperCell", "true");
    EXPECT_TRUE(ZYRTileSuperCell());
    ZYRParseDLCacheOptions(nullptr, "MaxPatternCacheEntry", "9");
    ZYRParseMTOptions(nullptr, "NumMTRThreads", "9");
    ZYRParseMarkerOptions(nullptr, "SSE2", "9");
    ZYRParseSLDLOptions(nullptr, "SLCompression", "9");

    ZYRSetDLCacheOptions(options);
    EXPECT_EQ(ZYRGetDLCacheOptions().maxDisk, 0);
    ZYRGetDLCacheOptions().maxDisk = 77; // the store copy is handed out by reference
    EXPECT_EQ(ZYRGetDLCacheOptions().maxDisk, 77);
}

// The store copies and the once-only budget flag are process state: look at them fresh.
TEST(ZYRStartupOptionsTest, FreshProcessState) {
    EXPECT_EXIT(checkInFreshProcess([]() -> std::string {
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
                        return "a shared cache without a budget gets " +
                               std::to_string(options.maxRAM);
                    ZYRParseDLCacheOptions(&options, "XObjDLCacheMaxRAM", "-1");
                    sDLCacheOptions later;
                    ZYRFillDefaultDLCacheOptions(later, CZYRUniString());
                    ZYRParseDLCacheOptions(&later, "XObjDLSharedCache", "1");
                    if (later.maxRAM != expectedDefaultRAM())
                        return "the budget flag did not stay set";
                    return "";
                }),
                ::testing::ExitedWithCode(0), "");
    // The memory options reach the allocation front.
    EXPECT_EXIT(checkInFreshProcess([]() -> std::string {
                    ZYRParseMemoryOptions("MaxMemLimit", "100000000");
                    if (ZYRGetMemLimit() != 419430400 || ZYRGetMemReserve() != 314572800)
                        return "MaxMemLimit gave " + std::to_string(ZYRGetMemLimit());
                    ZYRParseMemoryOptions("MaxMemLimit", "500000000");
                    if (ZYRGetMemLimit() != 419430400)
                        return "a higher limit was taken";
                    ZYRParseMemoryOptions("TestAvailablePhysicalMemory", "false");
                    if (ZYRGetTestAvailablePhysicalMemory())
                        return "TestAvailablePhysicalMemory false did not arrive";
                    ZYRParseMemoryOptions("TestAvailablePhysicalMemory", "TRUE");
                    if (!ZYRGetTestAvailablePhysicalMemory())
                        return "TestAvailablePhysicalMemory true did not arrive";
                    ZYRParseMemoryOptions("BreakOnAllocationCount",
                                          "5"); // breaks only under a debugger
                    void* block = ZYRMalloc(64);
                    ZYRFree(block);
                    return "";
                }),
                ::testing::ExitedWithCode(0), "");
    EXPECT_EXIT(checkInFreshProcess([]() -> std::string {
                    ZYRParseMemoryOptions("MaxMemLimit", "-7");
                    return ZYRGetMemLimit() == 419430400 ? "" : "a negative limit is not 0";
                }),
                ::testing::ExitedWithCode(0), "");
}

TEST(ZYRStartupOptionsTest, TypedSetters) {
    const struct {
        void (*set)(bool);
        bool (*get)();
    } flags[] = {
        {ZYRSetDeferImageInterpolation, ZYRGetDeferImageInterpolation},
        {ZYRSetDisableMatrixRoundingOption, ZYRGetDisableMatrixRoundingOption},
        {ZYRSetDisablePatternGstateReset, ZYRGetDisablePatternGstateReset},
        {ZYRSetUseAbsoluteColorimetricForLabAlt, ZYRGetUseAbsoluteColorimetricForLabAlt},
        {ZYRSetUseFindScreenSetEx, ZYRGetUseFindScreenSetEx},
        {ZYRSetUseMainXP, ZYRGetUseMainXP},
        {ZYRSetUseNewellMixing, ZYRGetUseNewellMixing},
        {ZYRSetAnalyticsActive, ZYRIsAnalyticsActive},
    };
    for (const auto& flag : flags) {
        flag.set(true);
        EXPECT_TRUE(flag.get());
        flag.set(false);
        EXPECT_FALSE(flag.get());
    }
    // Each setter has its own variable.
    flags[0].set(true);
    for (size_t i = 1; i < std::size(flags); ++i)
        EXPECT_FALSE(flags[i].get()) << i;

    const char16_t folder[] = u"/var/log/analytics";
    ZYRSetAnalyticsLogFolder(folder);
    EXPECT_EQ(ZYRGetAnalyticsLogFolder(), folder) << "the pointer itself is kept";
    ZYRSetXPShadeMarkerOption(0xFFFFFFFFu);
    EXPECT_EQ(ZYRGetXPShadeMarkerOption(), 0xFFFFFFFFu);
    ZYRSetMaxXobjToInvestigate(-3);
    EXPECT_EQ(ZYRGetMaxXobjToInvestigate(), -3);
    ZYRSetMaxDiskUsage(1LL << 40);
    ZYRSetMaxSLInMemory(-1);
    ZYRSetMaxSurfacesOnQueue(1LL << 33);
    EXPECT_EQ(ZYRGetMaxDiskUsage(), 1LL << 40);
    EXPECT_EQ(ZYRGetMaxSLInMemory(), -1);
    EXPECT_EQ(ZYRGetMaxSurfacesOnQueue(), 1LL << 33);

    long long queue = 0;
    ZYRSetDefaultMaxSurfacesOnQueue(queue);
    EXPECT_EQ(queue, 200);
    EXPECT_EQ(ZYRGetMaxSurfacesOnQueue(), 1LL << 33) << "the store is not touched";

    ZYRSetObjectInfoOptions(0x00000003u);
    EXPECT_EQ(ZYRGetObjectInfoOptions(), 0u) << "without the top bit the option is off";
    ZYRSetObjectInfoOptions(0x80000004u);
    EXPECT_EQ(ZYRGetObjectInfoOptions(), 0x80000004u);
    ZYRSetObjectInfoOptions(0x80000000u);
    EXPECT_EQ(ZYRGetObjectInfoOptions(), 0x80000000u);
    try {
        ZYRSetObjectInfoOptions(0x80000003u);
        ADD_FAILURE() << "two extensions at once were accepted";
    } catch (const CZYRError& e) {
        EXPECT_EQ(e.getError(), ZYRPublic::kZYRErrorInitFailed);
        EXPECT_STREQ(e.getMessage(), "Multiple ObjectInfoExtensions cannot be enabled at once");
        EXPECT_STREQ(e.getSrcFileName(), "source/zyr/std/ZYRStartupOptions");
        EXPECT_EQ(e.getSrcLineNumber(), 1273);
    }
    EXPECT_EQ(ZYRGetObjectInfoOptions(), 0x80000003u) << "the value stays stored";
}
