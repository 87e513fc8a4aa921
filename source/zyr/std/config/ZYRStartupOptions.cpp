// The start-up option store: defaults, key setters, typed setters, getters and records.
#include "zyr/std/config/ZYRStartupOptions.h"

#include <algorithm>
#include <bit>
#include <cstdio>
#include <cstring>
#include <limits>

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
    bool useNullGraphics = false;
    int32_t maxCacheShades = 100;
    bool rasterizeTilingPattern = true;
    bool tileSuperCell = true;
    int32_t optimizePortPipeLine = 0;
    bool renderAllInterpretedSurfaces = false;
    bool singleThreadProcess = false;
    int32_t surfaceOverlap = 3;
    unsigned int xpvdpCacheOverlapThreshold = 100;
    unsigned int xpvdpExperimentalOption = kXPVDPOptimizeFlatteningBit;
    bool adjustImageNearCopydot = false;
    bool disableAxialShadeOptimization = false;
    bool splitShadeWithAbruptColorChange = true;
    float splitShadeAbruptChangeThreshold = 30.0f;
    unsigned int clipsubPathStackSizeThreshold = 14;
    int32_t copyDotApproach = 1;
    bool enableBPCbyObjectType = false;
    bool enableExternalDLCachePurge = true;
    bool enableXObjDLCachePurge = false;
    bool enableXPVDPDLCachePurge = false;
    unsigned int grMemoryThreshold = 0;
    unsigned int grPMThreshold = 0;
    unsigned int grFLThreshold = 0;
    eZYRGROption grOption = kZYRGROptionAdaptive;
    int32_t useFasterOpaqueMarking = -1;
    bool convertComplexPatternToImage = true;
    bool dontCopyDevImage = true;
    bool usePathCache = true;
    bool useInPlaceComposition = true;
    bool grSAOCTilingPattern = false;
    bool grCacheOpaqueTilingPattern = true;
    bool disableOPInMarker = true;
    bool useFasterXPTilingPattern = true;
    bool useOldHOVReducer = true;
    int32_t maxGlyphCache = 67108864;
    int32_t maxGraphPathCache = 134217728;
    bool optimizeArtworkTree = true;
    unsigned int overscanImageMasksThreshold = 1;
    int32_t pdfGCPageInterval = 5000;
    int32_t pdfGCMemoryThreshold = 8388608;
    unsigned long long pdfGCInterpreterThreadMemoryThreshold = 0;
    unsigned long long pdfGCMainThreadMemoryThreshold = 0;
    float pathWidthAdjustment = 0.0f;
    float subPathSizeThreshold = 24.0f;
    bool adjustPathWidthInsideTilingPattern = false;
    bool discardEmptyPathAfterAdjustment = true;
    bool replaceSourceColorPrecision = true;
    float shiftImageMaskDeviceDelta = 0.1f;
    bool shipXPImageSlicesInOrder = false;
    float trapPixelOverlap = 1.0f;
    bool useNewTrapReducer = true;
    bool xObjDLCachePurgeChild = true;
    float xObjDLCachePurgePercentage = 0.0f;
    bool disableXPImageDLOptimization = false;
    bool emitIMG_META = true;
    eZYRAtomicRegionDirectCMYKOption atomicRegionDirectCMYKOption{1};
    bool threadPriority = false;
    bool useNullXPDevice = false;
    bool useNullXPImage = false;
    bool xpShadeCache = true;
    bool rasterizeAllTransparencyShades = false;

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
    return roundUpToPage(std::min(info.totalPhysical, info.totalVirtual) / kDLCacheRAMDivisor);
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

} // namespace

// ---- records -----------------------------------------------------------------------------------

void ZYRFillDefaultMTOptions(sMTOptions& options) {
    options = {-1, -1, 100000, true, false};
}

void ZYRParseMTOptions(sMTOptions* options, const char* key, const char* value) {
    if (!options || !usable(key, value))
        return;
    if (named(key, "NumMTRThreads"))
        options->numMTRThreads = detail::readInt32(value);
    else if (named(key, "NumMTBThreads"))
        options->numMTBThreads = detail::readInt32(value);
    else if (named(key, "MTRThreshold"))
        options->mtrThreshold = detail::readInt32(value);
    else if (named(key, "MTRFallbackPerBand"))
        options->mtrFallbackPerBand = TrueOrFalse(value);
    else if (named(key, "HasExternalCompositor"))
        options->hasExternalCompositor = TrueOrFalse(value);
}

void ZYRSetMTOptions(const sMTOptions& options) {
    store.mt = options;
}
const sMTOptions& ZYRGetMTOptions() {
    return store.mt;
}

void ZYRFillDefaultDLCacheOptions(sDLCacheOptions& options, const CZYRUniString&) {
    options = {};
    options.maxRAM = defaultDLCacheRAM();
    options.maxDisk = kDefaultMaxDisk;
    options.vdpThroughFlattener = true;
    options.sharedCache = false;
    options.maxPatternCacheEntry = 50;
}

void ZYRParseDLCacheOptions(sDLCacheOptions* options, const char* key, const char* value) {
    if (!usable(key, value))
        return;
    if (named(key, "RasterizeTilingPattern")) {
        store.rasterizeTilingPattern = TrueOrFalse(value);
        return;
    }
    if (named(key, "TileSuperCell")) {
        store.tileSuperCell = TrueOrFalse(value);
        return;
    }
    if (named(key, "XObjDLCacheMaxRAM")) {
        store.xObjDLCacheMaxRAMGiven = true;
        if (!options)
            return;
        // A negative value, or none at all, gives the default budget.
        bool found = false;
        const long long bytes = detail::readInt64(value, &found);
        options->maxRAM = found && bytes >= 0
                              ? roundUpToPage(static_cast<unsigned long long>(bytes))
                              : defaultDLCacheRAM();
        return;
    }
    if (!options)
        return;
    if (named(key, "XObjDLCacheMaxDisk")) {
        bool found = false;
        const long long bytes = detail::readInt64(value, &found);
        options->maxDisk = found && bytes >= 0 ? bytes : kDefaultMaxDisk;
    } else if (named(key, "VDPThroughFlattener")) {
        options->vdpThroughFlattener = TrueOrFalse(value);
    } else if (named(key, "XObjDLSharedCache")) {
        options->sharedCache = TrueOrFalse(value);
        if (options->sharedCache && !store.xObjDLCacheMaxRAMGiven)
            options->maxRAM = kSharedCacheRAM;
    } else if (named(key, "MaxPatternCacheEntry")) {
        options->maxPatternCacheEntry = detail::readInt32(value);
    }
}

void ZYRSetDLCacheOptions(const sDLCacheOptions& options) {
    store.dlCache = options;
}
sDLCacheOptions& ZYRGetDLCacheOptions() {
    return store.dlCache;
}

void ZYRFillDefaultMarkerOptions(sMarkerOptions& options) {
    options = {0, 0, 1.5f, 1, 0.125f, 0.125f, 0.25f, 1, 1, true};
}

void ZYRParseMarkerOptions(sMarkerOptions* options, const char* key, const char* value) {
    if (!options || !usable(key, value))
        return;
    if (named(key, "ImageMarkerType"))
        options->imageMarkerType = detail::readInt32(value);
    else if (named(key, "ImageMarkerTiling"))
        options->imageMarkerTiling = detail::readInt32(value);
    else if (named(key, "ImageMarkerFactorSourceStep"))
        options->imageMarkerFactorSourceStep = detail::readFloat(value);
    else if (named(key, "ImageMarkerFactorTiling"))
        options->imageMarkerFactorTiling = detail::readInt32(value);
    else if (named(key, "MeshMarkerFactorD11"))
        options->meshMarkerFactorD11 = detail::readFloat(value);
    else if (named(key, "MeshMarkerFactorD18"))
        options->meshMarkerFactorD18 = detail::readFloat(value);
    else if (named(key, "MeshMarkerFactorD48"))
        options->meshMarkerFactorD48 = detail::readFloat(value);
    else if (named(key, "SSE2"))
        options->sse2 = detail::readInt32(value);
    else if (named(key, "UseNewImageMarker"))
        options->useNewImageMarker = detail::readInt32(value);
    else if (named(key, "OverScanIdntImageMaskMarking"))
        options->overScanIdntImageMaskMarking = TrueOrFalse(value);
}

void ZYRSetMarkerOptions(const sMarkerOptions& options) {
    store.marker = options;
}
sMarkerOptions& ZYRGetMarkerOptions() {
    return store.marker;
}

void ZYRFillDefaultSLDLOptions(sSLDLOptions& options) {
    options = {1, 1.5f, 2.0f};
}

void ZYRParseSLDLOptions(sSLDLOptions* options, const char* key, const char* value) {
    if (!options || !usable(key, value))
        return;
    if (named(key, "SLCompression"))
        options->slCompression = detail::readInt32(value);
    else if (named(key, "SLCompressionRatio"))
        options->slCompressionRatio = detail::readFloat(value);
    else if (named(key, "SL0CompressionRatio"))
        options->sl0CompressionRatio = detail::readFloat(value);
}

void ZYRSetSLDLOptions(const sSLDLOptions& options) {
    store.sldl = options;
}
sSLDLOptions& ZYRGetSLDLOptions() {
    return store.sldl;
}

// ---- key setters -------------------------------------------------------------------------------

void ZYRGraphicsOptions(const char* key, const char* value) {
    if (usable(key, value) && named(key, "UseNullGraphics"))
        store.useNullGraphics = TrueOrFalse(value);
}

void ZYRMaxCacheShadesOption(const char* key, const char* value) {
    if (usable(key, value) && named(key, "MaxCacheShades"))
        store.maxCacheShades = std::max(detail::readInt32(value), kMinCacheShades);
}

void ZYRParseOptimizePortPipeLineOption(const char* key, const char* value) {
    if (usable(key, value) && named(key, "OptimizePortPipeLine"))
        store.optimizePortPipeLine = detail::readInt32(value);
}

void ZYRParseRenderAllInterpretedSurfacesOption(const char* key, const char* value) {
    if (usable(key, value) && named(key, "RenderAllInterpretedSurfaces"))
        store.renderAllInterpretedSurfaces = TrueOrFalse(value);
}

void ZYRParseSingleThreadOptions(const char* key, const char* value) {
    if (usable(key, value) && named(key, "SingleThreadProcess"))
        store.singleThreadProcess = TrueOrFalse(value);
}

void ZYRParseSurfaceOverlapOptions(const char* key, const char* value) {
    if (usable(key, value) && named(key, "SurfaceOverLap")) {
        const int32_t overlap = detail::readInt32(value);
        store.surfaceOverlap = overlap == 0 ? 1 : overlap;
    }
}

void ZYRParseXPVDPCacheOverlapThreshold(const char* key, const char* value) {
    if (!usable(key, value))
        return;
    if (named(key, "XPVDPCacheOverlapThreshold")) {
        store.xpvdpCacheOverlapThreshold =
            std::min(readUnsigned(value), kMaxXPVDPCacheOverlapThreshold);
    } else if (named(key, "XPVDPOptimizeFlattening")) {
        if (TrueOrFalse(value))
            store.xpvdpExperimentalOption |= kXPVDPOptimizeFlatteningBit;
        else
            store.xpvdpExperimentalOption &= ~kXPVDPOptimizeFlatteningBit;
    }
}

void ZYRSetAdjustImageNearCopydot(const char* key, const char* value) {
    if (usable(key, value) && named(key, "AdjustImageNearCopydot"))
        store.adjustImageNearCopydot = TrueOrFalse(value);
}

void ZYRSetAxialShadeOptimizationOption(const char* key, const char* value) {
    if (!usable(key, value))
        return;
    if (named(key, "DisableAxialShadeOptimization"))
        store.disableAxialShadeOptimization = TrueOrFalse(value);
    else if (named(key, "SplitShadeWithAbruptColorChange"))
        store.splitShadeWithAbruptColorChange = TrueOrFalse(value);
    else if (named(key, "SplitShadeAbruptChangeThreshold"))
        store.splitShadeAbruptChangeThreshold = detail::readFloat(value);
}

void ZYRSetClipsubPathStackSizeParameters(const char* key, const char* value) {
    if (usable(key, value) && named(key, "ClipsubPathStackSizeThreshold"))
        store.clipsubPathStackSizeThreshold = readUnsigned(value);
}

void ZYRSetCopyDotApproach(const char* key, const char* value) {
    if (!usable(key, value) || !named(key, "CopyDotMethod"))
        return;
    if (const NamedValue* method = findWord(kCopyDotWords, value))
        store.copyDotApproach = method->value;
}

void ZYRSetEnableBPCbyObjectType(const char* key, const char* value) {
    if (usable(key, value) && named(key, "EnableBPCbyObjectType"))
        store.enableBPCbyObjectType = TrueOrFalse(value);
}

void ZYRSetEnableExternalDLCachePurge(const char* key, const char* value) {
    if (usable(key, value) && named(key, "EnableExternalDLCachePurge"))
        store.enableExternalDLCachePurge = TrueOrFalse(value);
}

void ZYRSetEnableXObjDLCachePurge(const char* key, const char* value) {
    if (usable(key, value) && named(key, "EnableXObjDLCachePurge"))
        store.enableXObjDLCachePurge = TrueOrFalse(value);
}

void ZYRSetEnableXPVDPDLCachePurge(const char* key, const char* value) {
    if (usable(key, value) && named(key, "EnableXPVDPDLCachePurge"))
        store.enableXPVDPDLCachePurge = TrueOrFalse(value);
}

void ZYRSetGRParams(const char* key, const char* value) {
    if (!usable(key, value))
        return;
    if (named(key, "GRMemoryThreshold")) {
        store.grMemoryThreshold = readUnsigned(value);
    } else if (named(key, "GRPMThreshold")) {
        store.grPMThreshold = readUnsigned(value);
    } else if (named(key, "GRFLThreshold")) {
        store.grFLThreshold = readUnsigned(value);
    } else if (named(key, "GROption") || named(key, "AutomaticGlobalRasterizationOption")) {
        // A word that is neither a known name nor a number 0 to 2 changes nothing.
        if (const NamedValue* option = findWord(kGROptionWords, value)) {
            store.grOption = static_cast<eZYRGROption>(option->value);
        } else if (detail::isWholeNumber(value)) {
            const int32_t number = detail::readInt32(value);
            if (number >= kZYRGROptionAdaptive && number <= kZYRGROptionXPDevice)
                store.grOption = static_cast<eZYRGROption>(number);
        }
    } else if (named(key, "UseFasterOpaqueMarking")) {
        store.useFasterOpaqueMarking = TrueOrFalse(value) ? 1 : 0;
    } else if (named(key, "ConvertComplexPatternToImage")) {
        store.convertComplexPatternToImage = TrueOrFalse(value);
    } else if (named(key, "DontCopyDevImage")) {
        store.dontCopyDevImage = TrueOrFalse(value);
    } else if (named(key, "UsePathCache")) {
        store.usePathCache = TrueOrFalse(value);
    } else if (named(key, "UseInPlaceComposition")) {
        store.useInPlaceComposition = TrueOrFalse(value);
    } else if (named(key, "GRSAOCTilingPattern")) {
        store.grSAOCTilingPattern = TrueOrFalse(value);
    } else if (named(key, "GRCacheOpaqueTilingPattern")) {
        store.grCacheOpaqueTilingPattern = TrueOrFalse(value);
    } else if (named(key, "DisableOPInMarker")) {
        store.disableOPInMarker = TrueOrFalse(value);
    } else if (named(key, "UseFasterTransparencyTilingPattern")) {
        store.useFasterXPTilingPattern = TrueOrFalse(value);
    } else if (named(key, "UseOldHOVReducer")) {
        store.useOldHOVReducer = TrueOrFalse(value);
    }
}

void ZYRSetMaxGlyphCache(const char* key, const char* value) {
    if (!usable(key, value))
        return;
    if (named(key, "MaxGlyphCache"))
        store.maxGlyphCache = detail::readInt32(value);
    else if (named(key, "MaxGraphPathCache"))
        store.maxGraphPathCache = detail::readInt32(value);
}

void ZYRSetOptimizeArtworkTree(const char* key, const char* value) {
    if (usable(key, value) && named(key, "OptimizeArtworkTree"))
        store.optimizeArtworkTree = TrueOrFalse(value);
}

void ZYRSetOverscanImageMasksParameters(const char* key, const char* value) {
    if (!usable(key, value))
        return;
    if (named(key, "UseNew1pxImageMaskHandler")) {
        store.overscanImageMasksThreshold = TrueOrFalse(value) ? 1 : 0;
    } else if (named(key, "OverscanImageMasksThreshold")) {
        // A switched-off handler stays off.
        if (store.overscanImageMasksThreshold != 0)
            store.overscanImageMasksThreshold = readUnsigned(value);
    }
}

void ZYRSetPDFGCPageInterval(const char* key, const char* value) {
    if (!usable(key, value))
        return;
    if (named(key, "PDFGCPageInterval"))
        store.pdfGCPageInterval = detail::readInt32(value);
    else if (named(key, "PDFGCMemoryThreshold"))
        store.pdfGCMemoryThreshold = detail::readInt32(value);
    else if (named(key, "PDFGCInterpreterThreadMemoryThreshold"))
        store.pdfGCInterpreterThreadMemoryThreshold = notBelowZero(detail::readInt64(value));
    else if (named(key, "PDFGCMainThreadMemoryThreshold"))
        store.pdfGCMainThreadMemoryThreshold = notBelowZero(detail::readInt64(value));
}

void ZYRSetPathWidthAdjustment(const char* key, const char* value) {
    if (!usable(key, value))
        return;
    if (named(key, "PathWidthAdjustment"))
        store.pathWidthAdjustment = detail::readFloat(value);
    else if (named(key, "SubPathSizeThreshold"))
        store.subPathSizeThreshold = detail::readFloat(value);
    else if (named(key, "AdjustPathWidthInsideTilingPattern"))
        store.adjustPathWidthInsideTilingPattern = TrueOrFalse(value);
    else if (named(key, "DiscardEmptyPathAfterAdjustment"))
        store.discardEmptyPathAfterAdjustment = TrueOrFalse(value);
}

void ZYRSetReplaceSourceColorPrecision(const char* key, const char* value) {
    if (usable(key, value) && named(key, "ReplaceSourceColorPrecision"))
        store.replaceSourceColorPrecision = HighOrLow(value);
}

void ZYRSetShiftImageMaskDeviceDelta(const char* key, const char* value) {
    if (usable(key, value) && named(key, "ShiftImageMaskDeviceDelta"))
        store.shiftImageMaskDeviceDelta = detail::readFloat(value);
}

void ZYRSetShipXPImageSlicesInOrder(const char* key, const char* value) {
    if (usable(key, value) && named(key, "ShipXPImageSlicesInOrder"))
        store.shipXPImageSlicesInOrder = TrueOrFalse(value);
}

void ZYRSetTrapPixelOverlap(const char* key, const char* value) {
    if (!usable(key, value) || !named(key, "TrapPixelOverlap"))
        return;
    const float overlap = detail::readFloat(value);
    // Written so that a value that is not a number also falls back to 1.
    store.trapPixelOverlap = overlap > 0.0f ? overlap : 1.0f;
    std::printf("\n   TrapPixelOverlap set to %f\n\n", static_cast<double>(store.trapPixelOverlap));
}

void ZYRSetTrappingLibraryPath(const char* key, const char* value) {
    if (usable(key, value) && named(key, "TrappingLibraryPath"))
        trappingLibraryPath() = value;
}

void ZYRSetUseNewTrapReducer(const char* key, const char* value) {
    if (usable(key, value) && named(key, "UseNewTrapReducer"))
        store.useNewTrapReducer = TrueOrFalse(value);
}

void ZYRSetXObjDLCachePurgeChild(const char* key, const char* value) {
    if (usable(key, value) && named(key, "XObjDLCachePurgeChild"))
        store.xObjDLCachePurgeChild = TrueOrFalse(value);
}

void ZYRSetXObjDLCachePurgePercentage(const char* key, const char* value) {
    if (!usable(key, value) || !named(key, "XObjDLCachePurgePercentage"))
        return;
    const float percentage = detail::readFloat(value);
    if (percentage > 0.0f && percentage <= kMaxPurgePercentage)
        store.xObjDLCachePurgePercentage = percentage;
}

void ZYRSetXPImageDLOptimization(const char* key, const char* value) {
    if (!usable(key, value))
        return;
    if (named(key, "DisableXPImageDLOptimization"))
        store.disableXPImageDLOptimization = TrueOrFalse(value);
    else if (named(key, "EmitIMG_META"))
        store.emitIMG_META = TrueOrFalse(value);
    else if (named(key, "AtomicRegionDirectCMYKOption"))
        store.atomicRegionDirectCMYKOption =
            static_cast<eZYRAtomicRegionDirectCMYKOption>(detail::readInt32(value));
}

void ZYRThreadPriorityOptons(const char* key, const char* value) {
    if (usable(key, value) && named(key, "ThreadPriority"))
        store.threadPriority = TrueOrFalse(value);
}

void ZYRXPDeviceOptions(const char* key, const char* value) {
    if (usable(key, value) && named(key, "UseNullXPDevice"))
        store.useNullXPDevice = TrueOrFalse(value);
}

void ZYRXPImageOptions(const char* key, const char* value) {
    if (usable(key, value) && named(key, "UseNullXPImage"))
        store.useNullXPImage = TrueOrFalse(value);
}

void ZYRXPShadeCacheOptions(const char* key, const char* value) {
    if (!usable(key, value))
        return;
    if (named(key, "XPShadeCache"))
        store.xpShadeCache = TrueOrFalse(value);
    else if (named(key, "RasterizeAllTransparencyShades"))
        store.rasterizeAllTransparencyShades = TrueOrFalse(value);
}

void ZYRParseMemoryOptions(const char* key, const char* value) {
    if (!usable(key, value))
        return;
    if (named(key, "MaxMemLimit"))
        ZYRSetMemLimit(notBelowZero(detail::readInt64(value)));
    else if (named(key, "TestAvailablePhysicalMemory"))
        ZYRSetTestAvailablePhysicalMemory(TrueOrFalse(value));
    else if (named(key, "BreakOnAllocationCount"))
        ZYRSetBreakOnAllocationCount(static_cast<unsigned int>(detail::readInt32(value)));
}

// ---- getters -----------------------------------------------------------------------------------

bool ZYRUseNullGraphics() {
    return store.useNullGraphics;
}
int32_t ZYRMaxCacheShades() {
    return store.maxCacheShades;
}
bool ZYRRasterizeTilingPattern() {
    return store.rasterizeTilingPattern;
}
bool ZYRTileSuperCell() {
    return store.tileSuperCell;
}
int32_t ZYRGetOptimizePortPipeLineOption() {
    return store.optimizePortPipeLine;
}
bool ZYRGetRenderAllInterpretedSurfacesOption() {
    return store.renderAllInterpretedSurfaces;
}
bool ZYRSingleThreadProcess() {
    return store.singleThreadProcess;
}
int32_t ZYRSurfaceOverlap() {
    return store.singleThreadProcess ? 1 : store.surfaceOverlap;
}
unsigned int ZYRGetXPVDPCacheOverlapThreshold() {
    return store.xpvdpCacheOverlapThreshold;
}
unsigned int ZYRGetXPVDPExperimentalOption() {
    return store.xpvdpExperimentalOption;
}
bool ZYRGetAdjustImageNearCopydot() {
    return store.adjustImageNearCopydot;
}
bool ZYRAxialShadeOptimizationDisabled() {
    return store.disableAxialShadeOptimization;
}
bool ZYRSplitShadeWithAbruptColorChange() {
    return store.splitShadeWithAbruptColorChange;
}
float ZYRSplitShadeAbruptChangeThreshold() {
    return store.splitShadeAbruptChangeThreshold;
}
unsigned int ZYRGetClipsubPathStackSizeThreshold() {
    return store.clipsubPathStackSizeThreshold;
}
int32_t ZYRGetCopyDotApproach() {
    return store.copyDotApproach;
}
bool ZYREnableBPCbyObjectType() {
    return store.enableBPCbyObjectType;
}
bool ZYREnableExternalDLCachePurge() {
    return store.enableExternalDLCachePurge;
}
bool ZYREnableXObjDLCachePurge() {
    return store.enableXObjDLCachePurge;
}
bool ZYREnableXPVDPDLCachePurge() {
    return store.enableXPVDPDLCachePurge;
}
unsigned int ZYRGetGRMemoryThreshold() {
    return store.grMemoryThreshold;
}
unsigned int ZYRGetGRPMThreshold() {
    return store.grPMThreshold;
}
unsigned int ZYRGetGRFLThreshold() {
    return store.grFLThreshold;
}
eZYRGROption ZYRGetGROption() {
    return store.grOption;
}
int32_t ZYRGetUseFasterOpaqueMarking() {
    return store.useFasterOpaqueMarking;
}
bool ZYRGetConvertComplexPatternToImage() {
    return store.convertComplexPatternToImage;
}
bool ZYRGetDontCopyDevImage() {
    return store.dontCopyDevImage;
}
bool ZYRGetUsePathCache() {
    return store.usePathCache;
}
bool ZYRGetUseInPlaceComposition() {
    return store.useInPlaceComposition;
}
bool ZYRGRSAOCTilingPattern() {
    return store.grSAOCTilingPattern;
}
bool ZYRGRCacheOpaqueTilingPattern() {
    return store.grCacheOpaqueTilingPattern;
}
bool ZYRIsDisableOPInMarker() {
    return store.disableOPInMarker;
}
bool ZYRGetUseFasterXPTilingPattern() {
    return store.useFasterXPTilingPattern;
}
bool ZYRGetUseOldHOVReducer() {
    return store.useOldHOVReducer;
}
int32_t ZYRGetMaxGlyphCache() {
    return store.maxGlyphCache;
}
int32_t ZYRGetMaxGraphPathCache() {
    return store.maxGraphPathCache;
}
bool ZYRGetOptimizeArtworkTree() {
    return store.optimizeArtworkTree;
}
unsigned int ZYRGetOverscanImageMasksThreshold() {
    return store.overscanImageMasksThreshold;
}
int32_t ZYRGetPDFGCPageInterval() {
    return store.pdfGCPageInterval;
}
int32_t ZYRGetPDFGCMemoryThreshold() {
    return store.pdfGCMemoryThreshold;
}
unsigned long long ZYRGetPDFGCInterpreterThreadMemoryThreshold() {
    return store.pdfGCInterpreterThreadMemoryThreshold;
}
unsigned long long ZYRGetPDFGCMainThreadMemoryThreshold() {
    return store.pdfGCMainThreadMemoryThreshold;
}
float ZYRGetPathWidthAdjustment() {
    return store.pathWidthAdjustment;
}
float ZYRGetSubPathSizeThreshold() {
    return store.subPathSizeThreshold;
}
bool ZYRAdjustPathWidthInsideTilingPattern() {
    return store.adjustPathWidthInsideTilingPattern;
}
bool ZYRDiscardEmptyPathAfterAdjustment() {
    return store.discardEmptyPathAfterAdjustment;
}
bool ZYRGetReplaceSourceColorPrecision() {
    return store.replaceSourceColorPrecision;
}
float ZYRGetShiftImageMaskDeviceDelta() {
    return store.shiftImageMaskDeviceDelta;
}
bool ZYRShipXPImageSlicesInOrder() {
    return store.shipXPImageSlicesInOrder;
}
float ZYRGetTrapPixelOverlap() {
    return store.trapPixelOverlap;
}
const std::string& ZYRGetTrappingLibraryPath() {
    return trappingLibraryPath();
}
bool ZYRUseNewTrapReducer() {
    return store.useNewTrapReducer;
}
bool ZYRXObjDLCachePurgeChild() {
    return store.xObjDLCachePurgeChild;
}
float ZYRXObjDLCachePurgePercentage() {
    return store.xObjDLCachePurgePercentage;
}
bool ZYRXPImageDLOptimizationDisabled() {
    return store.disableXPImageDLOptimization;
}
bool ZYREmitIMG_META() {
    return store.emitIMG_META;
}
eZYRAtomicRegionDirectCMYKOption ZYRAtomicRegionDirectCMYKOption() {
    return store.atomicRegionDirectCMYKOption;
}
bool ZYRThreadPriority() {
    return store.threadPriority;
}
bool ZYRUseNullXPDevice() {
    return store.useNullXPDevice;
}
bool ZYRUseNullXPImage() {
    return store.useNullXPImage;
}
bool ZYRXPShadeCache() {
    return store.xpShadeCache;
}
bool ZYRGetRasterizeAllTransparencyShades() {
    return store.rasterizeAllTransparencyShades;
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
