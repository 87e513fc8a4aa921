// The start-up option store: defaults, key setters, typed setters, getters and records.
#include "zyr/std/config/ZYRStartupOptions.h"

#include <algorithm>
#include <bit>
#include <cstdio>
#include <cstring>
#include <limits>
#include <type_traits>

#include "zyr/std/config/ZYRConfigParser.h"
#include "zyr/std/config/internal/ZYRConfigValues.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/ZYRMem.h"
#include "zyr/std/core/ZYRThread.h"
#include "zyr/std/core/ZYRVirtualMem.h"

namespace ZYRStd {

namespace {

constexpr const char* kSource = "source/zyr/std/ZYRStartupOptions";
// Source line of the object-info error, as its clients have always seen it.
constexpr int kObjectInfoLine = 1273;

constexpr int32_t kMinCacheShades = 10;
constexpr unsigned int kMaxXPVDPCacheOverlapThreshold = 101;
constexpr unsigned int kXPVDPOptimizeFlatteningBit = 1;
constexpr float kMaxPurgePercentage = 100.0f;
// The RAM budget of a shared XObject cache when no budget was given.
constexpr unsigned long long kSharedCacheRAM = 1073741824;
// The default RAM budget is this fraction of the memory the process can use.
constexpr unsigned long long kDLCacheRAMDivisor = 20;
constexpr long long kDefaultMaxDisk = std::numeric_limits<long long>::max();
constexpr long long kDefaultMaxSurfacesOnQueue = 200;
constexpr unsigned int kObjectInfoEnabledBit = 0x80000000u;

// Written at start-up, before the engine's threads read it: no lock, by design.
struct OptionStore {
#define ZYR_STORE_KEY(setter, key, field, type, value, reading, rule, getter) type field = value;
#include "zyr/std/config/internal/ZYRStartupOptions.def"

    bool deferImageInterpolation = false;
    bool disableMatrixRounding = true;
    bool disablePatternGstateReset = false;
    bool useAbsoluteColorimetricForLabAlt = false;
    bool useFindScreenSetEx = false;
    bool useMainXP = false;
    bool useNewellMixing = false;
    bool analyticsActive = false;
    const char16_t* analyticsLogFolder = nullptr;
    unsigned int imageBufferSize = 0;
    unsigned int xpShadeMarkerOption = 0;
    int32_t maxXobjToInvestigate = 0;
    eZYRPlanarmapPrecisionOption limitPlanarmapPrecision{};
    long long maxDiskUsage = 0;
    long long maxSLInMemory = 0;
    long long maxSurfacesOnQueue = 0;
    double shadeQuadLimit = 0.0;
    unsigned int objectInfoOptions = 0;

    // Set for good by the first "XObjDLCacheMaxRAM".
    bool xObjDLCacheMaxRAMGiven = false;

    // The store copies of the records: zero until their setters are called.
    sMTOptions mt{};
    sDLCacheOptions dlCache{};
    sMarkerOptions marker{};
    sSLDLOptions sldl{};
};

constinit OptionStore store;

std::string& trappingLibraryPath() {
    static std::string path;
    return path;
}

bool named(const char* key, const char* name) {
    return std::strcmp(key, name) == 0;
}

// A setter given no key or value has nothing to act on.
bool usable(const char* key, const char* value) {
    return key && value;
}

unsigned int readUnsigned(const char* value) {
    return static_cast<unsigned int>(detail::readInt32(value));
}

unsigned long long notBelowZero(long long value) {
    return value > 0 ? static_cast<unsigned long long>(value) : 0;
}

unsigned long long roundUpToPage(unsigned long long bytes) {
    const unsigned long long page = GetPageSize();
    return (bytes + page - 1) / page * page;
}

unsigned long long defaultDLCacheRAM() {
    tZYRVirtualMemoryInfo info{};
    VirtualMemStatus(&info);
    return std::min(info.totalPhysical, info.totalVirtual) / kDLCacheRAMDivisor;
}

struct NamedValue {
    const char* word;
    int32_t value;
};

constexpr NamedValue kGROptionWords[] = {
    {"Adaptive", kZYRGROptionAdaptive},    {"HOV", kZYRGROptionHOV},
    {"Alternate", kZYRGROptionHOV},        {"XPDevice", kZYRGROptionXPDevice},
    {"Consistency", kZYRGROptionXPDevice}, {"Performance", kZYRGROptionPerformance},
};

constexpr NamedValue kCopyDotWords[] = {{"OldDefault", 0}, {"CheckArea", 1}, {"AdjustMatrix", 2}};

template <size_t N> const NamedValue* findWord(const NamedValue (&words)[N], const char* word) {
    for (const NamedValue& entry : words) {
        if (named(word, entry.word))
            return &entry;
    }
    return nullptr;
}

// ---- reading and storing a key's value --------------------------------------------------------

#define ZYR_READ_kBool(value) TrueOrFalse(value)
#define ZYR_READ_kHighLow(value) HighOrLow(value)
#define ZYR_READ_kInt(value) detail::readInt32(value)
#define ZYR_READ_kUnsigned(value) readUnsigned(value)
#define ZYR_READ_kInt64(value) notBelowZero(detail::readInt64(value))
#define ZYR_READ_kFloat(value) detail::readFloat(value)

// The rules of the keys that are not simply read and stored.
void rule_maxCacheShades(const char* value) {
    store.maxCacheShades = std::max(detail::readInt32(value), kMinCacheShades);
}

void rule_surfaceOverlap(const char* value) {
    const int32_t overlap = detail::readInt32(value);
    store.surfaceOverlap = overlap == 0 ? 1 : overlap;
}

void rule_xpvdpCacheOverlapThreshold(const char* value) {
    store.xpvdpCacheOverlapThreshold =
        std::min(readUnsigned(value), kMaxXPVDPCacheOverlapThreshold);
}

void rule_xpvdpExperimentalOption(const char* value) {
    if (TrueOrFalse(value))
        store.xpvdpExperimentalOption |= kXPVDPOptimizeFlatteningBit;
    else
        store.xpvdpExperimentalOption &= ~kXPVDPOptimizeFlatteningBit;
}

void rule_copyDotApproach(const char* value) {
    if (const NamedValue* method = findWord(kCopyDotWords, value))
        store.copyDotApproach = method->value;
}

// "GROption" and "AutomaticGlobalRasterizationOption": a word that is neither a known name
// nor a number 0 to 2 changes nothing.
void rule_grOption(const char* value) {
    if (const NamedValue* option = findWord(kGROptionWords, value)) {
        store.grOption = static_cast<eZYRGROption>(option->value);
    } else if (detail::isWholeNumber(value)) {
        const int32_t number = detail::readInt32(value);
        if (number >= kZYRGROptionAdaptive && number <= kZYRGROptionXPDevice)
            store.grOption = static_cast<eZYRGROption>(number);
    }
}

void rule_useFasterOpaqueMarking(const char* value) {
    store.useFasterOpaqueMarking = TrueOrFalse(value) ? 1 : 0;
}

void rule_useNew1pxHandler(const char* value) {
    store.overscanImageMasksThreshold = TrueOrFalse(value) ? 1 : 0;
}

void rule_overscanImageMasksThreshold(const char* value) {
    // A switched-off handler stays off.
    if (store.overscanImageMasksThreshold != 0)
        store.overscanImageMasksThreshold = readUnsigned(value);
}

void rule_trapPixelOverlap(const char* value) {
    const float overlap = detail::readFloat(value);
    // Written so that a value that is not a number also falls back to 1.
    store.trapPixelOverlap = overlap > 0.0f ? overlap : 1.0f;
    std::printf("\n   TrapPixelOverlap set to %f\n\n", static_cast<double>(store.trapPixelOverlap));
}

void rule_trappingLibraryPath(const char* value) {
    trappingLibraryPath() = value;
}

void rule_xObjDLCachePurgePercentage(const char* value) {
    const float percentage = detail::readFloat(value);
    if (percentage > 0.0f && percentage <= kMaxPurgePercentage)
        store.xObjDLCachePurgePercentage = percentage;
}

void rule_atomicRegionDirectCMYKOption(const char* value) {
    store.atomicRegionDirectCMYKOption =
        static_cast<eZYRAtomicRegionDirectCMYKOption>(detail::readInt32(value));
}

void rule_maxMemLimit(const char* value) {
    ZYRSetMemLimit(notBelowZero(detail::readInt64(value)));
}

void rule_testAvailablePhysicalMemory(const char* value) {
    ZYRSetTestAvailablePhysicalMemory(TrueOrFalse(value));
}

void rule_breakOnAllocationCount(const char* value) {
    ZYRSetBreakOnAllocationCount(static_cast<unsigned int>(detail::readInt32(value)));
}

void ruleRecord_maxRAM(sDLCacheOptions* options, const char* value) {
    // A negative value, or none at all, gives the default budget.
    bool found = false;
    const long long bytes = detail::readInt64(value, &found);
    // Only the key rounds to whole pages; the record's default stays as computed.
    options->maxRAM = roundUpToPage(found && bytes >= 0 ? static_cast<unsigned long long>(bytes)
                                                        : defaultDLCacheRAM());
}

void ruleRecord_maxDisk(sDLCacheOptions* options, const char* value) {
    bool found = false;
    const long long bytes = detail::readInt64(value, &found);
    options->maxDisk = found && bytes >= 0 ? bytes : kDefaultMaxDisk;
}

void ruleRecord_sharedCache(sDLCacheOptions* options, const char* value) {
    options->sharedCache = TrueOrFalse(value);
    if (options->sharedCache && !store.xObjDLCacheMaxRAMGiven)
        options->maxRAM = kSharedCacheRAM;
}

#define ZYR_APPLY_plain(field, reading, value) store.field = ZYR_READ_##reading(value)
#define ZYR_APPLY_setRule(field, reading, value) rule_##field(value)
#define ZYR_APPLY_bothRules(field, reading, value) rule_##field(value)
#define ZYR_APPLY_RECORD_plain(options, field, reading, value)                                     \
    options->field = ZYR_READ_##reading(value)
#define ZYR_APPLY_RECORD_ruled(options, field, reading, value) ruleRecord_##field(options, value)

enum class Setter {
#define ZYR_KEY_SETTER(setter) setter,
#include "zyr/std/config/internal/ZYRStartupOptions.def"
    ZYRParseDLCacheOptions,
};

// Applies the key if `setter` owns it; the branches of other setters compile away.
template <Setter setter> bool applyKey(const char* key, const char* value) {
#define ZYR_STORE_KEY(owner, name, field, type, initial, reading, rule, getter)                    \
    if constexpr (setter == Setter::owner) {                                                       \
        if (named(key, name)) {                                                                    \
            ZYR_APPLY_##rule(field, reading, value);                                               \
            return true;                                                                           \
        }                                                                                          \
    }
#define ZYR_OWN_KEY(owner, name, rule, reading, getter)                                            \
    if constexpr (setter == Setter::owner) {                                                       \
        if (named(key, name)) {                                                                    \
            rule_##rule(value);                                                                    \
            return true;                                                                           \
        }                                                                                          \
    }
#define ZYR_ACTION_KEY(owner, name, rule, reading) ZYR_OWN_KEY(owner, name, rule, reading, _)
#include "zyr/std/config/internal/ZYRStartupOptions.def"
    return false;
}

template <class Record> void fillRecord(Record& options) {
    options = {};
#define ZYR_RECORD_KEY(record, key, field, reading, rule, initial)                                 \
    if constexpr (std::is_same_v<Record, record>)                                                  \
        options.field = initial;
#include "zyr/std/config/internal/ZYRStartupOptions.def"
}

// Changes the field whose key matches and nothing for other keys.
template <class Record> void parseRecord(Record* options, const char* key, const char* value) {
    if (!options || !usable(key, value))
        return;
#define ZYR_RECORD_KEY(record, name, field, reading, rule, initial)                                \
    if constexpr (std::is_same_v<Record, record>) {                                                \
        if (named(key, name)) {                                                                    \
            ZYR_APPLY_RECORD_##rule(options, field, reading, value);                               \
            return;                                                                                \
        }                                                                                          \
    }
#include "zyr/std/config/internal/ZYRStartupOptions.def"
}

} // namespace

// ---- records -----------------------------------------------------------------------------------

void ZYRFillDefaultMTOptions(sMTOptions& options) {
    fillRecord(options);
}

void ZYRParseMTOptions(sMTOptions* options, const char* key, const char* value) {
    parseRecord(options, key, value);
}

void ZYRSetMTOptions(const sMTOptions& options) {
    store.mt = options;
}
const sMTOptions& ZYRGetMTOptions() {
    return store.mt;
}

void ZYRFillDefaultDLCacheOptions(sDLCacheOptions& options, const CZYRUniString&) {
    fillRecord(options);
}

void ZYRParseDLCacheOptions(sDLCacheOptions* options, const char* key, const char* value) {
    if (!usable(key, value) || applyKey<Setter::ZYRParseDLCacheOptions>(key, value))
        return;
    if (named(key, "XObjDLCacheMaxRAM"))
        store.xObjDLCacheMaxRAMGiven = true;
    parseRecord(options, key, value);
}

void ZYRSetDLCacheOptions(const sDLCacheOptions& options) {
    store.dlCache = options;
}
sDLCacheOptions& ZYRGetDLCacheOptions() {
    return store.dlCache;
}

void ZYRFillDefaultMarkerOptions(sMarkerOptions& options) {
    fillRecord(options);
}

void ZYRParseMarkerOptions(sMarkerOptions* options, const char* key, const char* value) {
    parseRecord(options, key, value);
}

void ZYRSetMarkerOptions(const sMarkerOptions& options) {
    store.marker = options;
}
sMarkerOptions& ZYRGetMarkerOptions() {
    return store.marker;
}

void ZYRFillDefaultSLDLOptions(sSLDLOptions& options) {
    fillRecord(options);
}

void ZYRParseSLDLOptions(sSLDLOptions* options, const char* key, const char* value) {
    parseRecord(options, key, value);
}

void ZYRSetSLDLOptions(const sSLDLOptions& options) {
    store.sldl = options;
}
sSLDLOptions& ZYRGetSLDLOptions() {
    return store.sldl;
}

// ---- key setters -------------------------------------------------------------------------------

#define ZYR_KEY_SETTER(setter)                                                                     \
    void setter(const char* key, const char* value) {                                              \
        if (usable(key, value))                                                                    \
            applyKey<Setter::setter>(key, value);                                                  \
    }
#include "zyr/std/config/internal/ZYRStartupOptions.def"

// ---- getters -----------------------------------------------------------------------------------

#define ZYR_GETTER_plain(type, getter, field)                                                      \
    type getter() {                                                                                \
        return store.field;                                                                        \
    }
#define ZYR_GETTER_setRule(type, getter, field) ZYR_GETTER_plain(type, getter, field)
#define ZYR_GETTER_bothRules(type, getter, field)
#define ZYR_STORE_KEY(setter, key, field, type, value, reading, rule, getter)                      \
    ZYR_GETTER_##rule(type, getter, field)
#include "zyr/std/config/internal/ZYRStartupOptions.def"

int32_t ZYRSurfaceOverlap() {
    return store.singleThreadProcess ? 1 : store.surfaceOverlap;
}
const std::string& ZYRGetTrappingLibraryPath() {
    return trappingLibraryPath();
}

// ---- typed setters -----------------------------------------------------------------------------

void ZYRSetDeferImageInterpolation(bool on) {
    store.deferImageInterpolation = on;
}
bool ZYRGetDeferImageInterpolation() {
    return store.deferImageInterpolation;
}
void ZYRSetDisableMatrixRoundingOption(bool on) {
    store.disableMatrixRounding = on;
}
bool ZYRGetDisableMatrixRoundingOption() {
    return store.disableMatrixRounding;
}
void ZYRSetDisablePatternGstateReset(bool on) {
    store.disablePatternGstateReset = on;
}
bool ZYRGetDisablePatternGstateReset() {
    return store.disablePatternGstateReset;
}
void ZYRSetUseAbsoluteColorimetricForLabAlt(bool on) {
    store.useAbsoluteColorimetricForLabAlt = on;
}
bool ZYRGetUseAbsoluteColorimetricForLabAlt() {
    return store.useAbsoluteColorimetricForLabAlt;
}
void ZYRSetUseFindScreenSetEx(bool on) {
    store.useFindScreenSetEx = on;
}
bool ZYRGetUseFindScreenSetEx() {
    return store.useFindScreenSetEx;
}
void ZYRSetUseMainXP(bool on) {
    store.useMainXP = on;
}
bool ZYRGetUseMainXP() {
    return store.useMainXP;
}
void ZYRSetUseNewellMixing(bool on) {
    store.useNewellMixing = on;
}
bool ZYRGetUseNewellMixing() {
    return store.useNewellMixing;
}
void ZYRSetAnalyticsActive(bool on) {
    store.analyticsActive = on;
}
bool ZYRIsAnalyticsActive() {
    return store.analyticsActive;
}
void ZYRSetAnalyticsLogFolder(const char16_t* folder) {
    store.analyticsLogFolder = folder;
}
const char16_t* ZYRGetAnalyticsLogFolder() {
    return store.analyticsLogFolder;
}
void ZYRSetImageBufferSize(unsigned int size) {
    store.imageBufferSize = size;
}
unsigned int ZYRGetImageBufferSize() {
    return store.imageBufferSize;
}
void ZYRSetXPShadeMarkerOption(unsigned int option) {
    store.xpShadeMarkerOption = option;
}
unsigned int ZYRGetXPShadeMarkerOption() {
    return store.xpShadeMarkerOption;
}
void ZYRSetMaxXobjToInvestigate(int32_t count) {
    store.maxXobjToInvestigate = count;
}
int32_t ZYRGetMaxXobjToInvestigate() {
    return store.maxXobjToInvestigate;
}
void ZYRSetLimitPlanarmapPrecision(eZYRPlanarmapPrecisionOption option) {
    store.limitPlanarmapPrecision = option;
}
eZYRPlanarmapPrecisionOption ZYRGetLimitPlanarmapPrecision() {
    return store.limitPlanarmapPrecision;
}
void ZYRSetMaxDiskUsage(long long bytes) {
    store.maxDiskUsage = bytes;
}
long long ZYRGetMaxDiskUsage() {
    return store.maxDiskUsage;
}
void ZYRSetMaxSLInMemory(long long count) {
    store.maxSLInMemory = count;
}
long long ZYRGetMaxSLInMemory() {
    return store.maxSLInMemory;
}
void ZYRSetMaxSurfacesOnQueue(long long count) {
    store.maxSurfacesOnQueue = count;
}
long long ZYRGetMaxSurfacesOnQueue() {
    return store.maxSurfacesOnQueue;
}
void ZYRSetShadeQuadLimit(double limit) {
    store.shadeQuadLimit = limit;
}
double ZYRGetShadeQuadLimit() {
    return store.shadeQuadLimit;
}

void ZYRSetObjectInfoOptions(unsigned int options) {
    if (!(options & kObjectInfoEnabledBit)) {
        store.objectInfoOptions = 0;
        return;
    }
    store.objectInfoOptions = options;
    if (std::popcount(options & ~kObjectInfoEnabledBit) > 1)
        throw CZYRError(ZYRPublic::kZYRErrorInitFailed,
                        "Multiple ObjectInfoExtensions cannot be enabled at once", kSource,
                        kObjectInfoLine);
}
unsigned int ZYRGetObjectInfoOptions() {
    return store.objectInfoOptions;
}

void ZYRSetDefaultMaxSurfacesOnQueue(long long& out) {
    out = kDefaultMaxSurfacesOnQueue;
}

} // namespace ZYRStd
